// The theme's values, the style sheet made from them, and the pictures the sheet shows.

#include "tests/app/QtMessages.h"

#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Style/AppStyle.h"
#include "services/DPIUtils.h"
#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/StyleSheetText.h"
#include "services/Theme/ThemeStart.h"

#include <QApplication>
#include <QCheckBox>
#include <QFile>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLineEdit>
#include <QMenuBar>
#include <QPushButton>
#include <QTableView>
#include <QToolTip>

#include <gtest/gtest.h>

#include <memory>
#include <tuple>

namespace
{
  class StyleSheet : public testing::Test
  {
  protected:
    void TearDown() override
    {
      DPIUtils::SetDPI( DPIUtils::DesignDPI );
      qApp->setStyleSheet( QString() );
    }
  };

  QPushButton* NamedButton( const char* i_pName, bool i_bEnabled = true )
  {
    auto* pButton = new QPushButton;
    pButton->setObjectName( i_pName );
    pButton->setEnabled( i_bEnabled );
    return pButton;
  }
} // namespace

// Every value of the application's theme in record order, as its token writes it: golden text.
TEST( Theme, EveryTokenAndPaletteRoleGivesTheApplicationsValue )
{
  QString Text;
  for( const auto& rField : ZOL::IApplicationStyling::Fields() )
    Text += QString( "%1=%2\n" ).arg( rField.Name, Theme::TokenOf( rField.Name ) );
  QFile Golden( LUMEK_STYLE_GOLDEN_FOLDER "/theme-values.txt" );
  ASSERT_TRUE( Golden.open( QIODevice::ReadOnly | QIODevice::Text ) );
  EXPECT_EQ( Theme::SubstituteTokens( Text, *ZOL::ApplicationStyling() ).toStdString(),
             Golden.readAll().toStdString() );

  // The palette's roles: set before the QApplication was made, and still in force after it.
  const std::tuple< QPalette::ColorGroup, QPalette::ColorRole, const char* > Rows[] = {
      { QPalette::Active, QPalette::Window, "#303030" },
      { QPalette::Inactive, QPalette::Highlight, "#c89810" },
      { QPalette::Disabled, QPalette::WindowText, "#999999" },
      { QPalette::Disabled, QPalette::Button, "#3d3d3d" },
      { QPalette::Disabled, QPalette::Text, "#ffffff" } };
  const QPalette Palette = ZOL::ApplicationStyling()->MakePalette();
  for( const auto& [Group, Role, Expected] : Rows )
  {
    SCOPED_TRACE( testing::Message() << Group << " " << Role );
    EXPECT_EQ( Palette.color( Group, Role ).name(), Expected );
    EXPECT_EQ( QApplication::palette().color( Group, Role ).name(), Expected );
  }
  // A role without a value keeps the default.
  EXPECT_EQ( Palette.color( QPalette::Active, QPalette::PlaceholderText ),
             QPalette().color( QPalette::Active, QPalette::PlaceholderText ) );
}

TEST( Theme, SubstitutionGivesTheSheetQtReads )
{
  const std::pair< const char*, const char* > Rows[] = {
      { "font-family: \"[defaultFont]\";", "font-family: \"Segoe UI\";" },
      // Tokens are case-sensitive; unknown tokens and selectors stay.
      { "gridline-color: [Mid]; color: [mid]", "gridline-color: [Mid]; color: #606060" },
      { "[nothing] QPushButton[flat=\"true\"]", "[nothing] QPushButton[flat=\"true\"]" },
      { "[margin][itemSpacing]px", "104px" },
      { "margin-top: -([itemHeight] - [itemPadding]) / 2;", "margin-top: -8;" },
      { "width: Math.round([itemHeight] * 0.45);", "width: 9;" },
      // What is not arithmetic is left alone: addresses, syntax errors, infinity, text.
      { "image: url(:/a/b.svg);", "image: url(:/a/b.svg);" },
      { "padding: 4 10 * 3;", "padding: 4 10 * 3;" },
      { "a: 1 / 0;\nb: 'a' + 'b';", "a: 1 / 0;\nb: 'a' + 'b';" },
      // Every line on its own, blanks kept, and only at the end of a line.
      { "a: 1 + 1;  \nb: [itemPadding] * 3;\n", "a: 2;  \nb: 12;\n" },
      { "a: 1 + 1; }", "a: 1 + 1; }" } };
  for( const auto& [Input, Expected] : Rows )
    EXPECT_EQ( ZOL::ApplicationStyling()->Substitute( QString::fromUtf8( Input ) ).toStdString(), Expected );
}

TEST( Theme, ScalingTruncatesAndAMissingSheetSetsNone )
{
  // Whole numbers are truncated, not rounded; point sizes keep their size; colours stay.
  ZOL::IApplicationStyling Scaled125 = ZOL::CreateApplicationStyling();
  Scaled125.Scale( 1.25f );
  for( const auto& [Name, Expected] : { std::pair( "Margin", 12 ), { "ButtonRadius", 6 }, { "PointSizeNormal", 9 } } )
    EXPECT_EQ( Scaled125.Value( Name ).toInt(), Expected ) << Name;
  EXPECT_EQ( Scaled125.m_Window, QColor( "#303030" ) );

  ZOL::IApplicationStyling Styling = ZOL::CreateApplicationStyling();
  Styling.m_StyleSheetPath = QStringLiteral( ":/no/such/sheet.qss" );
  const QString Before = qApp->styleSheet();
  EXPECT_FALSE( Theme::ApplyPostApplicationTheme( Styling ) );
  EXPECT_EQ( qApp->styleSheet(), Before );
}

// The sheet on the widgets it has rules for, in their states, shown and painted with a menu
// and a tool tip at three densities: Qt parses every rule without complaint, and the transport
// buttons and the time bar grow with the density.
TEST_F( StyleSheet, QtAppliesItWithoutComplaintAtEveryDensity )
{
  const std::tuple< int, int, int > Rows[] = { { 96, 40, 20 }, { 144, 60, 30 }, { 192, 80, 40 } };
  for( const auto& [DPI, ButtonSide, SliderHeight] : Rows )
  {
    SCOPED_TRACE( DPI );
    const AppTest::VQtMessages Messages;
    DPIUtils::SetDPI( DPI );
    ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );
    QWidget Window;
    auto* pMenuBar = new QMenuBar;
    QMenu* pMenu = pMenuBar->addMenu( "&Playback" );
    pMenu->addAction( "&Looping" )->setCheckable( true );
    pMenu->addAction( "Stop" )->setEnabled( false );
    auto* pSlider = new LumekVideoViewer::VLabelSlider( Qt::Horizontal );
    auto* pPlay = NamedButton( "Play" );
    // The controls' own rules reach their children.
    auto* pControls = new QGroupBox;
    pControls->setObjectName( "Controls" );
    auto* pControlsLayout = new QHBoxLayout( pControls );
    for( QWidget* pChild : std::initializer_list< QWidget* >{ pSlider, new LumekVideoViewer::VClickSpinBox, pPlay,
                                                              NamedButton( "Stop" ), NamedButton( "Pause", false ) } )
      pControlsLayout->addWidget( pChild );
    auto* pLayout = new QVBoxLayout( &Window );
    for( QWidget* pChild : std::initializer_list< QWidget* >{ pMenuBar, new QTableView, new QCheckBox( "Loop" ),
                                                              new QLineEdit( "1.23" ), pControls } )
      pLayout->addWidget( pChild );
    Window.resize( 800, 600 );
    Window.show();
    QApplication::processEvents();
    (void)Window.grab();
    pMenu->popup( QPoint( 0, 0 ) );
    QApplication::processEvents();
    (void)pMenu->grab();
    QToolTip::showText( QPoint( 10, 10 ), "Play video", &Window );
    QApplication::processEvents();
    QToolTip::hideText();
    EXPECT_EQ( Messages.Text(), "" );
    EXPECT_EQ( pPlay->size(), QSize( ButtonSide, ButtonSide ) );
    EXPECT_GE( pSlider->minimumSizeHint().height(), SliderHeight );
    // The sheet was scaled on a copy of the theme.
    EXPECT_EQ( ZOL::ApplicationStyling()->m_ItemHeight, 20 );
  }
}
