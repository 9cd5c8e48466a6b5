#include "services/DPIUtils.h"
#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/StyleSheetText.h"
#include "services/Theme/ThemeStart.h"
#include "tests/support/TestNames.h"

#include <QApplication>
#include <QQmlComponent>
#include <QQmlEngine>

#include <gtest/gtest.h>

#include <memory>

namespace
{
  // Every value of the application's theme in record order, as its token writes it: golden text.
  const char* const s_FinalValues =
      "Window=#303030 WindowText=#ffffff Base=#303030 AlternateBase=#404040 ToolTipBase=#202020 ToolTipText=#ffffff "
      "Text=#ffffff Button=#4d4d4d ButtonText=#ffffff BrightText=#e76500 Light=#808080 Midlight=#707070 Dark=#404040 "
      "Mid=#606060 Shadow=#202020 Highlight=#c89810 HighlightedText=#ffffff Link=#4c8bfc LinkVisited=#4b78aa "
      "WindowTextDisabled=#999999 ButtonDisabled=#3d3d3d ButtonTextDisabled=#999999 HighlightDisabled=#2e78fc "
      "Bright=#009fe3 Contrast=#e6007e FieldBorder=#7d7d7d FieldBorderDisabled=#5d5d5d ButtonBorder=#2d2d2d "
      "ButtonBorderDisabled=#202020 ButtonHover=#c89810 StatusGood=#33cc33 StatusBad=#cc3333 StatusWarning=#ffd400 "
      "Margin=10 ItemHeight=20 ItemSpacing=4 ItemPadding=4 ButtonRadius=5 ButtonWidth=80 ButtonHeight=24 ToolHeight=28 "
      "ScrollBarWidth=14 DefaultFont=Segoe_UI PointSizeNormal=9 PointSizeHeader=10 InfoToolTipDelay=500 "
      "WarnToolTipDelay=0 Default1=#2e78fc Default2=#0055ff Default3=#55aa00 Default4=#e4b90a Default5=#58abd1 "
      "Default6=#d12e1f";

  TEST( ThemeRecord, EveryTokenGivesTheApplicationsValue )
  {
    QString Text;
    for( const auto& rField : ZOL::IApplicationStyling::Fields() )
      Text += QString( "%1=%2 " ).arg( rField.Name, Theme::TokenOf( rField.Name ) );
    const QString Values = Theme::SubstituteTokens( Text, *ZOL::ApplicationStyling() );
    EXPECT_EQ( Values.trimmed().replace( "Segoe UI", "Segoe_UI" ).toStdString(), s_FinalValues );
    EXPECT_EQ( ZOL::ApplicationStyling()->m_StyleName, "plastique" );
    EXPECT_EQ( ZOL::ApplicationStyling()->m_StyleSheetPath, ":com.Lumek.LumekVideoViewer.LumekVideoViewer.qss" );
    EXPECT_EQ( ZOL::ApplicationStyling().get(), ZOL::ApplicationStyling().get() );
  }

  struct VScaleCase
  {
    const char* Label;
    float Ratio;
    const char* Name;
    int Expected;
  };

  class Scaling : public testing::TestWithParam< VScaleCase >
  {
  };

  TEST_P( Scaling, WholeNumbersTakeTheIntegerPart )
  {
    ZOL::IApplicationStyling Styling = ZOL::CreateApplicationStyling();
    Styling.Scale( GetParam().Ratio );
    EXPECT_EQ( Styling.Value( GetParam().Name ).toInt(), GetParam().Expected );
    EXPECT_EQ( Styling.m_Window, QColor( "#303030" ) );
  }

  INSTANTIATE_TEST_SUITE_P( Theme, Scaling,
                            testing::Values( VScaleCase{ "MarginAtOneAndAHalf", 1.5f, "Margin", 15 },
                                             VScaleCase{ "RadiusDropsTheFraction", 1.25f, "ButtonRadius", 6 },
                                             VScaleCase{ "TruncatesNotRounds", 1.33f, "ItemHeight", 26 },
                                             VScaleCase{ "PointSizesKeepTheirSize", 2.0f, "PointSizeNormal", 9 },
                                             VScaleCase{ "ToolTipDelayScalesToo", 1.5f, "InfoToolTipDelay", 750 } ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  struct VPaletteCase
  {
    const char* Name;
    QPalette::ColorGroup Group;
    QPalette::ColorRole Role;
    const char* Expected;
  };

  class Palette : public testing::TestWithParam< VPaletteCase >
  {
  };

  TEST_P( Palette, RoleTakesItsColourBeforeAndAfterTheApplication )
  {
    const auto& rCase = GetParam();
    EXPECT_EQ( ZOL::ApplicationStyling()->MakePalette().color( rCase.Group, rCase.Role ).name(), rCase.Expected );
    // Set before the QApplication was made, and still in force after it.
    EXPECT_EQ( QApplication::palette().color( rCase.Group, rCase.Role ).name(), rCase.Expected );
  }

  INSTANTIATE_TEST_SUITE_P(
      Theme, Palette,
      testing::Values( VPaletteCase{ "ActiveWindow", QPalette::Active, QPalette::Window, "#303030" },
                       VPaletteCase{ "InactiveHighlight", QPalette::Inactive, QPalette::Highlight, "#c89810" },
                       VPaletteCase{ "InactiveBrightText", QPalette::Inactive, QPalette::BrightText, "#e76500" },
                       VPaletteCase{ "DisabledWindowText", QPalette::Disabled, QPalette::WindowText, "#999999" },
                       VPaletteCase{ "DisabledButton", QPalette::Disabled, QPalette::Button, "#3d3d3d" },
                       VPaletteCase{ "DisabledHighlight", QPalette::Disabled, QPalette::Highlight, "#2e78fc" },
                       VPaletteCase{ "DisabledText", QPalette::Disabled, QPalette::Text, "#ffffff" } ),
      LumekTest::VCaseName() );

  TEST( Palette, RolesWithoutAValueKeepTheDefault )
  {
    EXPECT_EQ( ZOL::ApplicationStyling()->MakePalette().color( QPalette::Active, QPalette::PlaceholderText ),
               QPalette().color( QPalette::Active, QPalette::PlaceholderText ) );
  }

  struct VTextCase
  {
    const char* Label;
    const char* Input;
    const char* Expected;
  };

  class Substitution : public testing::TestWithParam< VTextCase >
  {
  };

  TEST_P( Substitution, GivesTheSheetQtReads )
  {
    const QString Result = ZOL::ApplicationStyling()->Substitute( QString::fromUtf8( GetParam().Input ) );
    EXPECT_EQ( Result.toStdString(), GetParam().Expected );
  }

  INSTANTIATE_TEST_SUITE_P(
      Theme, Substitution,
      testing::Values(
          VTextCase{ "FontAsItsText", "font-family: \"[defaultFont]\";", "font-family: \"Segoe UI\";" },
          VTextCase{ "TokensAreCaseSensitive", "gridline-color: [Mid]; color: [mid]",
                     "gridline-color: [Mid]; color: #606060" },
          VTextCase{ "UnknownAndSelectorsStay", "[nothing] QPushButton[flat=\"true\"]",
                     "[nothing] QPushButton[flat=\"true\"]" },
          VTextCase{ "AdjacentTokens", "[margin][itemSpacing]px", "104px" },
          VTextCase{ "NegatedDifference", "margin-top: -([itemHeight] - [itemPadding]) / 2;", "margin-top: -8;" },
          VTextCase{ "FractionKept", "width: 5 / 2;", "width: 2.5;" },
          VTextCase{ "ScriptFunctions", "width: Math.round([itemHeight] * 0.45);", "width: 9;" },
          VTextCase{ "PictureAddressLeftAlone", "image: url(:/a/b.svg);", "image: url(:/a/b.svg);" },
          VTextCase{ "SyntaxErrorLeftAlone", "padding: 4 10 * 3;", "padding: 4 10 * 3;" },
          VTextCase{ "InfinityAndTextLeftAlone", "a: 1 / 0;\nb: 'a' + 'b';", "a: 1 / 0;\nb: 'a' + 'b';" },
          VTextCase{ "EveryLineOnItsOwnBlanksKept", "a: 1 + 1;  \nb: [itemPadding] * 3;\n", "a: 2;  \nb: 12;\n" },
          VTextCase{ "OnlyAtTheEndOfALine", "a: 1 + 1; }", "a: 1 + 1; }" } ),
      []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  TEST( ThemeStart, StyleSheetIsScaledOnACopy )
  {
    DPIUtils::SetDPI( 192 );
    const QString Sheet = Theme::PrepareStyleSheet( *ZOL::ApplicationStyling() );
    DPIUtils::SetDPI( DPIUtils::DesignDPI );
    EXPECT_FALSE( Sheet.isEmpty() );
    EXPECT_EQ( ZOL::ApplicationStyling()->m_ItemHeight, 20 );
  }

  TEST( ThemeStart, MissingSheetSetsNone )
  {
    ZOL::IApplicationStyling Styling = ZOL::CreateApplicationStyling();
    Styling.m_StyleSheetPath = QStringLiteral( ":/no/such/sheet.qss" );
    const QString Before = qApp->styleSheet();
    EXPECT_FALSE( Theme::ApplyPostApplicationTheme( Styling ) );
    EXPECT_EQ( qApp->styleSheet(), Before );
  }

  // The about and legal dialogs read the theme from QML under the record's names, and cannot change it.
  TEST( ThemeQml, SingletonGivesTheValuesReadOnly )
  {
    QQmlEngine Engine;
    QQmlComponent Component( &Engine );
    Component.setData( "import QtQuick 2.0\nimport Lumek.Theme 1.0\n"
                       "Item {\n"
                       "  property color window: Theme.Window\n"
                       "  property int twice: Theme.ItemHeight * 2\n"
                       "  property string font: Theme.DefaultFont\n"
                       "  Component.onCompleted: Theme.Margin = 99\n"
                       "  function margin() { return Theme.Margin }\n"
                       "}\n",
                       QUrl() );
    std::unique_ptr< QObject > pObject( Component.create() );
    ASSERT_TRUE( pObject ) << Component.errorString().toStdString();
    EXPECT_EQ( pObject->property( "window" ).value< QColor >(), QColor( "#303030" ) );
    EXPECT_EQ( pObject->property( "twice" ).toInt(), 40 );
    EXPECT_EQ( pObject->property( "font" ).toString(), "Segoe UI" );
    QVariant Margin;
    QMetaObject::invokeMethod( pObject.get(), "margin", Q_RETURN_ARG( QVariant, Margin ) );
    EXPECT_EQ( Margin.toInt(), 10 );
  }
} // namespace
