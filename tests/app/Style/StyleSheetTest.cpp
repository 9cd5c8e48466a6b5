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
#include <QHeaderView>
#include <QLabel>
#include <QLineEdit>
#include <QMainWindow>
#include <QMenu>
#include <QMenuBar>
#include <QPushButton>
#include <QRegularExpression>
#include <QScrollBar>
#include <QStandardItemModel>
#include <QTableView>
#include <QTextBrowser>
#include <QToolTip>

#include <gtest/gtest.h>

#include <set>

namespace
{
  QString PreparedSheet()
  {
    return LumekVideoViewer::PrepareStyleSheet( *ZOL::ApplicationStyling() );
  }

  // Collects what Qt says while it reads and applies a sheet.
  class VMessageCapture
  {
  public:
    VMessageCapture()
    {
      s_Messages.clear();
      s_Previous = qInstallMessageHandler( &Handler );
    }
    ~VMessageCapture() { qInstallMessageHandler( s_Previous ); }
    const QStringList& Messages() const { return s_Messages; }

  private:
    static void Handler( QtMsgType i_Type, const QMessageLogContext&, const QString& i_rMessage )
    {
      if( i_Type != QtDebugMsg && i_Type != QtInfoMsg )
        s_Messages << i_rMessage;
    }
    static inline QStringList s_Messages;
    static inline QtMessageHandler s_Previous = nullptr;
  };

  class StyleSheet : public testing::Test
  {
  protected:
    void TearDown() override
    {
      DPIUtils::SetDPI( DPIUtils::DesignDPI );
      qApp->setStyleSheet( QString() );
    }
  };

  TEST_F( StyleSheet, OnlyTheUnmatchedCapitalTokenIsLeft )
  {
    const QString Sheet = PreparedSheet();
    ASSERT_FALSE( Sheet.isEmpty() );
    static const QRegularExpression s_Token( QStringLiteral( R"(\[[A-Za-z][A-Za-z0-9]*\])" ) );
    std::set< QString > Left;
    for( auto Matches = s_Token.globalMatch( Sheet ); Matches.hasNext(); )
      Left.insert( Matches.next().captured( 0 ) );
    // "[Mid]" is matched by no value: the lower-case "[mid]" is the theme's.
    for( const QString& rToken : Left )
      EXPECT_EQ( rToken, "[Mid]" ) << "token left in the sheet";
  }

  TEST_F( StyleSheet, EveryExpressionIsWorkedOut )
  {
    const QString Sheet = PreparedSheet();
    static const QRegularExpression s_Arithmetic( QStringLiteral( R"(:(.+[+\-\/*]+.+);\s*$)" ),
                                                  QRegularExpression::MultilineOption );
    static const QRegularExpression s_Number( QStringLiteral( R"(^\s*-?[0-9.]+$)" ) );
    for( auto Matches = s_Arithmetic.globalMatch( Sheet ); Matches.hasNext(); )
    {
      const QString Value = Matches.next().captured( 1 );
      // What still looks like arithmetic is a picture's address or a plain negative number; anything
      // else is an expression the evaluation could not read, and Qt would not either.
      EXPECT_TRUE( Value.contains( "url(:/com.Lumek.LumekVideoViewer." ) || s_Number.match( Value ).hasMatch() )
          << Value.toStdString();
    }
  }

  // One of each widget the sheet styles, in the states it has rules for.
  struct VGallery
  {
    QMainWindow Window;
    QWidget* pCentral = new QWidget;

    VGallery()
    {
      auto* pLayout = new QVBoxLayout( pCentral );
      auto* pTop = new QHBoxLayout;
      auto* pMenuBar = new QMenuBar;
      QMenu* pMenu = pMenuBar->addMenu( "&Playback " );
      QAction* pLoop = pMenu->addAction( "&Looping" );
      pLoop->setCheckable( true );
      pLoop->setChecked( true );
      QMenu* pDecoder = pMenu->addMenu( "Decoder" );
      auto* pGroup = new QActionGroup( pDecoder );
      for( const char* pText : { "Hardware (GPU)", "Software (CPU)" } )
      {
        QAction* pAction = pDecoder->addAction( pText );
        pAction->setCheckable( true );
        pGroup->addAction( pAction );
      }
      pGroup->actions().first()->setChecked( true );
      pMenu->addSeparator();
      pMenu->addAction( "Stop" )->setEnabled( false );
      pTop->addWidget( pMenuBar );
      auto* pLogo = new QLabel;
      pLogo->setObjectName( "Logo" );
      pLogo->setPixmap( QPixmap( ":/com.Lumek.LumekVideoViewer.LumekLogo.svg" ) );
      pTop->addWidget( pLogo );
      pLayout->addLayout( pTop );

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
      pSlider->setObjectName( "Timebar" );
      auto* pProxy = new LumekVideoViewer::VProxyStyle( pSlider->style() );
      pProxy->setParent( pSlider );
      pSlider->setStyle( pProxy );
      pSlider->setTickPosition( QSlider::TicksBothSides );
      pControlsLayout->addWidget( pSlider, 1 );
      auto* pSpin = new LumekVideoViewer::VClickSpinBox;
      pSpin->setMinimumWidth( 70 );
      pControlsLayout->addWidget( pSpin );
      for( const char* pName : { "Play", "Stop", "FullScreen" } )
      {
        auto* pButton = new QPushButton;
        pButton->setObjectName( pName );
        pControlsLayout->addWidget( pButton );
      }
      auto* pDisabled = new QPushButton;
      pDisabled->setObjectName( "Pause" );
      pDisabled->setEnabled( false );
      pControlsLayout->addWidget( pDisabled );
      pControlsLayout->addWidget( new QPushButton( "Close" ) );
      pLayout->addWidget( pControls );
      pLayout->addWidget( new QTextBrowser );

      Window.setCentralWidget( pCentral );
      Window.resize( 800, 600 );
    }

    // Shows and paints everything, popups included, so every rule is parsed and every picture read.
    void Exercise()
    {
      Window.show();
      QApplication::processEvents();
      (void)Window.grab();
      for( QMenu* pMenu : Window.findChildren< QMenu* >() )
      {
        pMenu->popup( QPoint( 0, 0 ) );
        QApplication::processEvents();
        (void)pMenu->grab();
        pMenu->hide();
      }
      QToolTip::showText( QPoint( 10, 10 ), "Play video", &Window );
      QApplication::processEvents();
      QToolTip::hideText();
    }
  };

  TEST_F( StyleSheet, QtAppliesItWithoutComplaint )
  {
    VMessageCapture Capture;
    ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );
    VGallery Gallery;
    Gallery.Exercise();
    EXPECT_TRUE( Capture.Messages().isEmpty() ) << Capture.Messages().join( "\n" ).toStdString();
  }

  struct VDensityCase
  {
    int DPI;
    int ButtonSide;
    int SliderHeight;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VDensityCase& i_rCase )
  {
    return io_rStream << i_rCase.DPI << "dpi";
  }

  class Density : public StyleSheet, public testing::WithParamInterface< VDensityCase >
  {
  };

  TEST_P( Density, TransportButtonsAndTimeBarGrow )
  {
    DPIUtils::SetDPI( GetParam().DPI );
    ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );
    QWidget Host;
    auto* pLayout = new QHBoxLayout( &Host );
    auto* pPlay = new QPushButton;
    pPlay->setObjectName( "Play" );
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
    QPushButton Button;
    Button.setObjectName( "Play" );
    QPushButton Pause;
    Pause.setObjectName( "Pause" );
    Button.show();
    Pause.show();
    QApplication::processEvents();
    const QImage Playing = Button.grab().toImage();
    const QImage Paused = Pause.grab().toImage();
    ASSERT_NE( Playing, Paused );

    Button.setObjectName( "Pause" );
    Button.setStyleSheet( "/**/" );
    QApplication::processEvents();
    EXPECT_EQ( Button.grab().toImage(), Paused );
  }
} // namespace
