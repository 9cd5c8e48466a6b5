#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Controls/VProxyStyle.h"
#include "app/Style/AppStyle.h"
#include "services/DPIUtils.h"
#include "services/Theme/IApplicationStyling.h"

#include <QApplication>
#include <QCheckBox>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QMainWindow>
#include <QMenu>
#include <QMenuBar>
#include <QPushButton>
#include <QRegularExpression>
#include <QStandardItemModel>
#include <QTableView>
#include <QToolTip>

#include <gtest/gtest.h>

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

  TEST_F( StyleSheet, NoTokenOrExpressionIsLeft )
  {
    const QString Sheet = LumekVideoViewer::PrepareStyleSheet( *ZOL::ApplicationStyling() );
    ASSERT_FALSE( Sheet.isEmpty() );
    // "[Mid]" is matched by no value: the lower-case "[mid]" is the theme's.
    static const QRegularExpression s_Token( QStringLiteral( R"(\[[A-Za-z][A-Za-z0-9]*\])" ) );
    for( auto Matches = s_Token.globalMatch( Sheet ); Matches.hasNext(); )
      EXPECT_EQ( Matches.next().captured( 0 ), "[Mid]" );
    // What still looks like arithmetic is a picture's address or a plain number; anything else is
    // an expression the evaluation could not read, and Qt would not either.
    static const QRegularExpression s_Arithmetic( QStringLiteral( R"(:(.+[+\-\/*]+.+);\s*$)" ),
                                                  QRegularExpression::MultilineOption );
    static const QRegularExpression s_Number( QStringLiteral( R"(^\s*-?[0-9.]+$)" ) );
    for( auto Matches = s_Arithmetic.globalMatch( Sheet ); Matches.hasNext(); )
    {
      const QString Value = Matches.next().captured( 1 );
      EXPECT_TRUE( Value.contains( "url(:/com.Lumek.LumekVideoViewer." ) || s_Number.match( Value ).hasMatch() )
          << Value.toStdString();
    }
  }

  // Collects what Qt says while it reads and applies the sheet.
  QStringList s_Messages;
  void Collect( QtMsgType i_Type, const QMessageLogContext&, const QString& i_rMessage )
  {
    if( i_Type != QtDebugMsg && i_Type != QtInfoMsg )
      s_Messages << i_rMessage;
  }

  QPushButton* NamedButton( const char* i_pName, bool i_bEnabled = true )
  {
    auto* pButton = new QPushButton;
    pButton->setObjectName( i_pName );
    pButton->setEnabled( i_bEnabled );
    return pButton;
  }

  // One of each widget the sheet styles, in the states it has rules for, shown and painted with
  // its menus and a tool tip, so every rule is parsed and every picture read.
  TEST_F( StyleSheet, QtAppliesItWithoutComplaint )
  {
    s_Messages.clear();
    const QtMessageHandler Previous = qInstallMessageHandler( &Collect );
    ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );

    QMainWindow Window;
    auto* pCentral = new QWidget;
    auto* pLayout = new QVBoxLayout( pCentral );
    auto* pMenuBar = new QMenuBar;
    QMenu* pMenu = pMenuBar->addMenu( "&Playback " );
    QAction* pLoop = pMenu->addAction( "&Looping" );
    pLoop->setCheckable( true );
    pLoop->setChecked( true );
    auto* pGroup = new QActionGroup( pMenu );
    QMenu* pDecoder = pMenu->addMenu( "Decoder" );
    for( const char* pText : { "Hardware (GPU)", "Software (CPU)" } )
      pGroup->addAction( pDecoder->addAction( pText ) )->setCheckable( true );
    pGroup->actions().first()->setChecked( true );
    pMenu->addSeparator();
    pMenu->addAction( "Stop" )->setEnabled( false );
    pLayout->addWidget( pMenuBar );
    auto* pLogo = new QLabel;
    pLogo->setObjectName( "Logo" );
    pLogo->setPixmap( QPixmap( ":/com.Lumek.LumekVideoViewer.LumekLogo.svg" ) );
    pLayout->addWidget( pLogo );

    auto* pTable = new QTableView;
    auto* pModel = new QStandardItemModel( 40, 2, pTable );
    pModel->setHorizontalHeaderLabels( { "Name", "Value" } );
    pTable->setModel( pModel );
    pTable->setSortingEnabled( true );
    pTable->setAlternatingRowColors( true );
    pLayout->addWidget( pTable, 1 );

    auto* pInfo = new QWidget;
    pInfo->setObjectName( "InfoPanel" );
    auto* pInfoLayout = new QHBoxLayout( pInfo );
    pInfoLayout->addWidget( new QLabel( "No file open" ) );
    auto* pCheck = new QCheckBox( "Checked" );
    pCheck->setChecked( true );
    pInfoLayout->addWidget( pCheck );
    auto* pPartial = new QCheckBox( "Partial" );
    pPartial->setTristate( true );
    pPartial->setCheckState( Qt::PartiallyChecked );
    pPartial->setEnabled( false );
    pInfoLayout->addWidget( pPartial );
    pInfoLayout->addWidget( new QLineEdit( "1.23" ) );
    pLayout->addWidget( pInfo );

    auto* pControls = new QGroupBox;
    pControls->setObjectName( "Controls" );
    auto* pControlsLayout = new QHBoxLayout( pControls );
    auto* pSlider = new LumekVideoViewer::VLabelSlider( Qt::Horizontal );
    auto* pProxy = new LumekVideoViewer::VProxyStyle( pSlider->style() );
    pProxy->setParent( pSlider );
    pSlider->setStyle( pProxy );
    pControlsLayout->addWidget( pSlider, 1 );
    pControlsLayout->addWidget( new LumekVideoViewer::VClickSpinBox );
    for( auto* pButton : { NamedButton( "Play" ), NamedButton( "Stop" ), NamedButton( "FullScreen" ),
                           NamedButton( "Pause", false ), NamedButton( "Close" ) } )
      pControlsLayout->addWidget( pButton );
    pLayout->addWidget( pControls );
    Window.setCentralWidget( pCentral );
    Window.resize( 800, 600 );

    Window.show();
    QApplication::processEvents();
    (void)Window.grab();
    for( QMenu* pPopup : { pMenu, pDecoder } )
    {
      pPopup->popup( QPoint( 0, 0 ) );
      QApplication::processEvents();
      (void)pPopup->grab();
      pPopup->hide();
    }
    QToolTip::showText( QPoint( 10, 10 ), "Play video", &Window );
    QApplication::processEvents();
    QToolTip::hideText();

    qInstallMessageHandler( Previous );
    EXPECT_TRUE( s_Messages.isEmpty() ) << s_Messages.join( "\n" ).toStdString();
  }

  struct VDensityCase
  {
    int DPI;
    int ButtonSide;
    int SliderHeight;
  };

  class Density : public StyleSheet, public testing::WithParamInterface< VDensityCase >
  {
  };

  TEST_P( Density, TransportButtonsAndTimeBarGrow )
  {
    DPIUtils::SetDPI( GetParam().DPI );
    ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );
    QWidget Host;
    auto* pLayout = new QHBoxLayout( &Host );
    auto* pPlay = NamedButton( "Play" );
    pLayout->addWidget( pPlay );
    auto* pSlider = new LumekVideoViewer::VLabelSlider( Qt::Horizontal );
    pLayout->addWidget( pSlider );
    Host.resize( 600, 300 );
    Host.show();
    QApplication::processEvents();
    EXPECT_EQ( pPlay->size(), QSize( GetParam().ButtonSide, GetParam().ButtonSide ) );
    EXPECT_GE( pSlider->minimumSizeHint().height(), GetParam().SliderHeight );
  }

  INSTANTIATE_TEST_SUITE_P( StyleSheet, Density,
                            testing::Values( VDensityCase{ 96, 40, 20 }, VDensityCase{ 144, 60, 30 },
                                             VDensityCase{ 192, 80, 40 } ),
                            []( const auto& i_rInfo ) { return std::to_string( i_rInfo.param.DPI ) + "dpi"; } );

  // The window swaps the play button's picture by renaming it and giving it a style sheet of its
  // own, which makes Qt apply the application's rules again.
  TEST_F( StyleSheet, RenamingThePlayButtonSwapsItsPicture )
  {
    ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );
    std::unique_ptr< QPushButton > pButton( NamedButton( "Play" ) ), pPause( NamedButton( "Pause" ) );
    pButton->show();
    pPause->show();
    QApplication::processEvents();
    const QImage Paused = pPause->grab().toImage();
    ASSERT_NE( pButton->grab().toImage(), Paused );

    pButton->setObjectName( "Pause" );
    pButton->setStyleSheet( "/**/" );
    QApplication::processEvents();
    EXPECT_EQ( pButton->grab().toImage(), Paused );
  }
} // namespace
