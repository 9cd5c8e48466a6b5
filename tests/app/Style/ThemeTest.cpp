#include "services/DPIUtils.h"
#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/StyleSheetText.h"
#include "services/Theme/ThemeStart.h"

#include <QApplication>
#include <QQmlComponent>
#include <QQmlEngine>

#include <gtest/gtest.h>

#include <memory>

namespace
{
  struct VNamedText
  {
    const char* Name;
    const char* Text;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VNamedText& i_rValue )
  {
    return io_rStream << i_rValue.Name;
  }

  // The application's values as its users know them, written out by hand.
  const VNamedText s_FinalValues[] = {
      { "Window", "#303030" },
      { "WindowText", "#ffffff" },
      { "Base", "#303030" },
      { "AlternateBase", "#404040" },
      { "ToolTipBase", "#202020" },
      { "ToolTipText", "#ffffff" },
      { "Text", "#ffffff" },
      { "Button", "#4d4d4d" },
      { "ButtonText", "#ffffff" },
      { "BrightText", "#e76500" },
      { "Light", "#808080" },
      { "Midlight", "#707070" },
      { "Dark", "#404040" },
      { "Mid", "#606060" },
      { "Shadow", "#202020" },
      { "Highlight", "#c89810" },
      { "HighlightedText", "#ffffff" },
      { "Link", "#4c8bfc" },
      { "LinkVisited", "#4b78aa" },
      { "WindowTextDisabled", "#999999" },
      { "ButtonDisabled", "#3d3d3d" },
      { "ButtonTextDisabled", "#999999" },
      { "HighlightDisabled", "#2e78fc" },
      { "Bright", "#009fe3" },
      { "Contrast", "#e6007e" },
      { "FieldBorder", "#7d7d7d" },
      { "FieldBorderDisabled", "#5d5d5d" },
      { "ButtonBorder", "#2d2d2d" },
      { "ButtonBorderDisabled", "#202020" },
      { "ButtonHover", "#c89810" },
      { "StatusGood", "#33cc33" },
      { "StatusBad", "#cc3333" },
      { "StatusWarning", "#ffd400" },
      { "Margin", "10" },
      { "ItemHeight", "20" },
      { "ItemSpacing", "4" },
      { "ItemPadding", "4" },
      { "ButtonRadius", "5" },
      { "ButtonWidth", "80" },
      { "ButtonHeight", "24" },
      { "ToolHeight", "28" },
      { "ScrollBarWidth", "14" },
      { "DefaultFont", "Segoe UI" },
      { "PointSizeNormal", "9" },
      { "PointSizeHeader", "10" },
      { "InfoToolTipDelay", "500" },
      { "WarnToolTipDelay", "0" },
      { "Default1", "#2e78fc" },
      { "Default2", "#0055ff" },
      { "Default3", "#55aa00" },
      { "Default4", "#e4b90a" },
      { "Default5", "#58abd1" },
      { "Default6", "#d12e1f" },
  };

  // A style sheet reaches each value through its token; so does this test.
  class FinalValue : public testing::TestWithParam< VNamedText >
  {
  };

  TEST_P( FinalValue, TokenGivesTheApplicationsValue )
  {
    const auto& rStyling = *ZOL::ApplicationStyling();
    const QString Token = Theme::TokenOf( GetParam().Name );
    EXPECT_EQ( Theme::SubstituteTokens( Token, rStyling ).toStdString(), GetParam().Text );
  }

  INSTANTIATE_TEST_SUITE_P( Theme, FinalValue, testing::ValuesIn( s_FinalValues ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

  TEST( ThemeRecord, EveryNamedValueHasAnExpectation )
  {
    ASSERT_EQ( ZOL::IApplicationStyling::Fields().size(), std::size( s_FinalValues ) );
    for( size_t i = 0; i < std::size( s_FinalValues ); ++i )
      EXPECT_STREQ( ZOL::IApplicationStyling::Fields()[i].Name, s_FinalValues[i].Name ) << "record order at " << i;
  }

  TEST( ThemeRecord, StyleNameAndSheetPath )
  {
    const auto& rStyling = *ZOL::ApplicationStyling();
    EXPECT_EQ( rStyling.m_StyleName, "plastique" );
    EXPECT_EQ( rStyling.m_StyleSheetPath, ":com.Lumek.LumekVideoViewer.LumekVideoViewer.qss" );
  }

  TEST( ThemeRecord, EveryRequestSharesOneInstance )
  {
    EXPECT_EQ( ZOL::ApplicationStyling().get(), ZOL::ApplicationStyling().get() );
  }

  struct VScaleCase
  {
    const char* Label;
    float Ratio;
    const char* Name;
    int Expected;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VScaleCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

  class Scaling : public testing::TestWithParam< VScaleCase >
  {
  };

  TEST_P( Scaling, WholeNumbersTakeTheIntegerPart )
  {
    ZOL::IApplicationStyling Styling = ZOL::CreateApplicationStyling();
    Styling.Scale( GetParam().Ratio );
    EXPECT_EQ( Styling.Value( GetParam().Name ).toInt(), GetParam().Expected );
  }

  INSTANTIATE_TEST_SUITE_P( Theme, Scaling,
                            testing::Values( VScaleCase{ "MarginAtOneAndAHalf", 1.5f, "Margin", 15 },
                                             VScaleCase{ "RadiusDropsTheFraction", 1.25f, "ButtonRadius", 6 },
                                             VScaleCase{ "ScrollBarDropsTheHalf", 1.25f, "ScrollBarWidth", 17 },
                                             VScaleCase{ "ItemHeightTruncatesNotRounds", 1.33f, "ItemHeight", 26 },
                                             VScaleCase{ "PointSizeNormalKeepsItsSize", 2.0f, "PointSizeNormal", 9 },
                                             VScaleCase{ "PointSizeHeaderKeepsItsSize", 2.0f, "PointSizeHeader", 10 },
                                             VScaleCase{ "InfoToolTipDelayScalesToo", 1.5f, "InfoToolTipDelay", 750 },
                                             VScaleCase{ "WarnToolTipDelayStaysZero", 3.0f, "WarnToolTipDelay", 0 },
                                             VScaleCase{ "ShrinksBelowOne", 0.5f, "ButtonWidth", 40 } ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  TEST( Scaling, LeavesColoursAndTextAlone )
  {
    ZOL::IApplicationStyling Styling = ZOL::CreateApplicationStyling();
    Styling.Scale( 2.0f );
    EXPECT_EQ( Styling.m_Window, QColor( "#303030" ) );
    EXPECT_EQ( Styling.m_DefaultFont, "Segoe UI" );
  }

  struct VPaletteCase
  {
    QPalette::ColorGroup Group;
    QPalette::ColorRole Role;
    const char* Expected;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VPaletteCase& i_rCase )
  {
    return io_rStream << i_rCase.Group << "/" << i_rCase.Role;
  }

  class Palette : public testing::TestWithParam< VPaletteCase >
  {
  };

  TEST_P( Palette, RoleTakesItsColour )
  {
    const QPalette Made = ZOL::ApplicationStyling()->MakePalette();
    EXPECT_EQ( Made.color( GetParam().Group, GetParam().Role ).name().toStdString(), GetParam().Expected );
  }

  TEST_P( Palette, ApplicationRunsWithIt )
  {
    // Set before the QApplication was made, and still in force after it.
    EXPECT_EQ( QApplication::palette().color( GetParam().Group, GetParam().Role ).name().toStdString(),
               GetParam().Expected );
  }

  INSTANTIATE_TEST_SUITE_P( Theme, Palette,
                            testing::Values( VPaletteCase{ QPalette::Active, QPalette::Window, "#303030" },
                                             VPaletteCase{ QPalette::Active, QPalette::Highlight, "#c89810" },
                                             VPaletteCase{ QPalette::Inactive, QPalette::Highlight, "#c89810" },
                                             VPaletteCase{ QPalette::Inactive, QPalette::BrightText, "#e76500" },
                                             VPaletteCase{ QPalette::Active, QPalette::ToolTipBase, "#202020" },
                                             VPaletteCase{ QPalette::Active, QPalette::LinkVisited, "#4b78aa" },
                                             VPaletteCase{ QPalette::Disabled, QPalette::WindowText, "#999999" },
                                             VPaletteCase{ QPalette::Disabled, QPalette::Button, "#3d3d3d" },
                                             VPaletteCase{ QPalette::Disabled, QPalette::ButtonText, "#999999" },
                                             VPaletteCase{ QPalette::Disabled, QPalette::Highlight, "#2e78fc" },
                                             VPaletteCase{ QPalette::Disabled, QPalette::Text, "#ffffff" },
                                             VPaletteCase{ QPalette::Disabled, QPalette::Window, "#303030" } ),
                            []( const auto& i_rInfo ) { return "Case" + std::to_string( i_rInfo.index ); } );

  TEST( Palette, RolesWithoutAValueKeepTheDefault )
  {
    const QPalette Made = ZOL::ApplicationStyling()->MakePalette();
    EXPECT_EQ( Made.color( QPalette::Active, QPalette::PlaceholderText ),
               QPalette().color( QPalette::Active, QPalette::PlaceholderText ) );
  }

  struct VTextCase
  {
    const char* Label;
    const char* Input;
    const char* Expected;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VTextCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

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
          VTextCase{ "ColourAsItsName", "color: [window];", "color: #303030;" },
          VTextCase{ "NumberInDecimal", "min-height: [itemHeight]px;", "min-height: 20px;" },
          VTextCase{ "FontAsItsText", "font-family: \"[defaultFont]\";", "font-family: \"Segoe UI\";" },
          VTextCase{ "TokensAreCaseSensitive", "gridline-color: [Mid];", "gridline-color: [Mid];" },
          VTextCase{ "UnknownTokenStays", "color: [nothing];", "color: [nothing];" },
          VTextCase{ "AttributeSelectorUntouched", "QPushButton[flat=\"true\"] {", "QPushButton[flat=\"true\"] {" },
          VTextCase{ "AdjacentTokens", "[margin][itemSpacing]", "104" },
          VTextCase{ "ProductOfAToken", "width: [itemHeight] * 2;", "width: 40;" },
          VTextCase{ "NegatedDifference", "margin-top: -([itemHeight] - [itemPadding]) / 2;", "margin-top: -8;" },
          VTextCase{ "FractionKept", "width: 5 / 2;", "width: 2.5;" },
          VTextCase{ "ScriptFunctions", "width: Math.round([itemHeight] * 0.45);", "width: 9;" },
          VTextCase{ "PictureAddressLeftAlone", "image: url(:/com.Lumek.LumekVideoViewer.ButtonPlay.svg);",
                     "image: url(:/com.Lumek.LumekVideoViewer.ButtonPlay.svg);" },
          VTextCase{ "SyntaxErrorLeftAlone", "padding: 4 10 * 3;", "padding: 4 10 * 3;" },
          VTextCase{ "InfinityLeftAlone", "width: 1 / 0;", "width: 1 / 0;" },
          VTextCase{ "TextResultLeftAlone", "width: 'a' + 'b';", "width: 'a' + 'b';" },
          VTextCase{ "EveryLineOnItsOwn", "a: 1 + 1;\nb: [itemPadding] * 3;\n", "a: 2;\nb: 12;\n" },
          VTextCase{ "TrailingBlanksKept", "a: 1 + 1;   \n}", "a: 2;   \n}" },
          VTextCase{ "NotAtTheEndOfALine", "a: 1 + 1; }", "a: 1 + 1; }" },
          VTextCase{ "NoArithmeticNoChange", "border: 1px solid [buttonBorder];", "border: 1px solid #2d2d2d;" } ),
      []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  TEST( ThemeStart, StyleSheetIsScaledOnACopy )
  {
    DPIUtils::SetDPI( 192 );
    const QString Sheet = Theme::PrepareStyleSheet( *ZOL::ApplicationStyling() );
    DPIUtils::SetDPI( DPIUtils::DesignDPI );
    EXPECT_FALSE( Sheet.isEmpty() );
    EXPECT_EQ( ZOL::ApplicationStyling()->m_ItemHeight, 20 );
    EXPECT_EQ( ZOL::ApplicationStyling()->m_Margin, 10 );
  }

  TEST( ThemeStart, MissingSheetSetsNone )
  {
    ZOL::IApplicationStyling Styling = ZOL::CreateApplicationStyling();
    Styling.m_StyleSheetPath = QStringLiteral( ":/no/such/sheet.qss" );
    const QString Before = qApp->styleSheet();
    EXPECT_FALSE( Theme::ApplyPostApplicationTheme( Styling ) );
    EXPECT_EQ( qApp->styleSheet(), Before );
  }

  // The about and legal dialogs read the theme from QML under the record's names.
  TEST( ThemeQml, SingletonGivesTheValues )
  {
    QQmlEngine Engine;
    QQmlComponent Component( &Engine );
    Component.setData( "import QtQuick 2.0\n"
                       "import Lumek.Theme 1.0\n"
                       "Item {\n"
                       "  property color window: Theme.Window\n"
                       "  property color highlight: Theme.Highlight\n"
                       "  property int margin: Theme.Margin\n"
                       "  property int twice: Theme.ItemHeight * 2\n"
                       "  property string font: Theme.DefaultFont\n"
                       "}\n",
                       QUrl() );
    std::unique_ptr< QObject > pObject( Component.create() );
    ASSERT_TRUE( pObject ) << Component.errorString().toStdString();
    EXPECT_EQ( pObject->property( "window" ).value< QColor >(), QColor( "#303030" ) );
    EXPECT_EQ( pObject->property( "highlight" ).value< QColor >(), QColor( "#c89810" ) );
    EXPECT_EQ( pObject->property( "margin" ).toInt(), 10 );
    EXPECT_EQ( pObject->property( "twice" ).toInt(), 40 );
    EXPECT_EQ( pObject->property( "font" ).toString(), "Segoe UI" );
  }

  TEST( ThemeQml, QmlCannotRepaintTheApplication )
  {
    QQmlEngine Engine;
    QQmlComponent Component( &Engine );
    Component.setData( "import QtQuick 2.0\n"
                       "import Lumek.Theme 1.0\n"
                       "Item {\n"
                       "  property int margin: Theme.Margin\n"
                       "  Component.onCompleted: Theme.Margin = 99\n"
                       "  function read() { return Theme.Margin }\n"
                       "}\n",
                       QUrl() );
    std::unique_ptr< QObject > pObject( Component.create() );
    ASSERT_TRUE( pObject ) << Component.errorString().toStdString();
    QVariant Read;
    QMetaObject::invokeMethod( pObject.get(), "read", Q_RETURN_ARG( QVariant, Read ) );
    EXPECT_EQ( Read.toInt(), 10 );
  }
} // namespace
