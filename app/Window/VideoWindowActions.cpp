// The menus, keys and stored settings of the video window.

#include "app/Window/VVideoWindow.h"

#include "app/Controls/VLabelSlider.h"
#include "app/Playback/VPlayBackManager.h"
#include "app/Window/VAboutDialog.h"
#include "app/Window/VLegalDialog.h"
#include "app/Window/VPropertiesDialog.h"
#include "app/Window/VVideoSettingsDialog.h"
#include "services/DebugServices.h"
#include "versioncheck/VersionCheck/VApplicationVersionCheck.h"

#include <QAction>
#include <QActionGroup>
#include <QBoxLayout>
#include <QDesktopServices>
#include <QGroupBox>
#include <QLabel>
#include <QMenu>
#include <QMenuBar>
#include <QSettings>
#include <QShortcut>

#include <map>

namespace LumekVideoViewer
{
  namespace
  {
    struct VScaleRow
    {
      EAction Action;
      EScaleMode Mode;
    };

    const VScaleRow s_ScaleRows[] = {
        { EAction::ScaleToWindow, ScaleToWindow },
        { EAction::ScaleFreely, ScaleFreely },
        { EAction::ScaleOneToOne, ScaleOneToOne },
        { EAction::ScaleWindowToVideo, ScaleWindowToVideo },
    };

    // The actions whose state is stored; a change of any of them writes the store at once.
    const EAction s_StoredActions[] = {
        EAction::Looping,          EAction::SkipFrames,    EAction::SoftwareDecoder,    EAction::HardwareDecoder,
        EAction::VideoInformation, EAction::Controls,      EAction::FullScreen,         EAction::ScaleToWindow,
        EAction::ScaleFreely,      EAction::ScaleOneToOne, EAction::ScaleWindowToVideo,
    };
  } // namespace

  void VVideoWindow::BuildActions()
  {
    std::map< EMenu, QMenu* > Menus;
    for( const VMenuRow& rRow : MenuRows() )
    {
      QMenu* pMenu = rRow.Menu == EMenu::Decoder ? new QMenu( rRow.Title, this ) : m_pMenuBar->addMenu( rRow.Title );
      pMenu->setToolTipsVisible( true );
      Menus[rRow.Menu] = pMenu;
    }

    m_pDecoderGroup = new QActionGroup( this );
    m_pScaleGroup = new QActionGroup( this );
    for( const VActionRow& rRow : ActionRows() )
    {
      QAction* pAction = new QAction( ActionText( rRow ), this );
      pAction->setObjectName( rRow.ObjectName );
      if( *rRow.Shortcut != '\0' )
        pAction->setShortcut( QKeySequence( rRow.Shortcut ) );
      if( *rRow.ToolTip != '\0' )
        pAction->setToolTip( rRow.ToolTip );
      if( rRow.Check != ECheck::NotCheckable )
      {
        pAction->setCheckable( true );
        pAction->setChecked( rRow.Check == ECheck::Checked );
      }
      QMenu* pMenu = Menus[rRow.Menu];
      if( rRow.bSeparatorBefore )
        pMenu->addSeparator();
      pMenu->addAction( pAction );
      // Shortcuts must work while the menu bar is hidden in full screen.
      if( rRow.Menu != EMenu::Help )
        addAction( pAction );
      m_Actions[static_cast< std::size_t >( rRow.Id )] = pAction;
      if( rRow.Id == EAction::SkipFrames )
        Menus[EMenu::Playback]->addMenu( Menus[EMenu::Decoder] );
    }

    m_pDecoderGroup->addAction( GetAction( EAction::HardwareDecoder ) );
    m_pDecoderGroup->addAction( GetAction( EAction::SoftwareDecoder ) );
    for( const VScaleRow& rRow : s_ScaleRows )
      m_pScaleGroup->addAction( GetAction( rRow.Action ) );
    GetAction( EAction::CorrectRadialDistortion )->setEnabled( false );
  }

  void VVideoWindow::BuildShortcuts()
  {
    QAction* pFullScreen = GetAction( EAction::FullScreen );
    connect( new QShortcut( QKeySequence( Qt::Key_F5 ), this ), &QShortcut::activated, pFullScreen,
             [pFullScreen] { pFullScreen->setChecked( true ); } );
    connect( new QShortcut( QKeySequence( Qt::Key_Escape ), this ), &QShortcut::activated, pFullScreen,
             [pFullScreen] { pFullScreen->setChecked( false ); } );
  }

  void VVideoWindow::ConnectActions()
  {
    VPlayBackManager* pManager = m_pPlayBackManager.get();
    connect( GetAction( EAction::Open ), &QAction::triggered, this, &VVideoWindow::OpenFileDialog );
    connect( GetAction( EAction::Close ), &QAction::triggered, this, &VVideoWindow::CloseFile );
    connect( GetAction( EAction::Exit ), &QAction::triggered, this, &QWidget::close );
    connect( GetAction( EAction::Looping ), &QAction::toggled, pManager, &VPlayBackManager::Loop );
    connect( GetAction( EAction::SkipFrames ), &QAction::toggled, pManager, &VPlayBackManager::SetDropFrame );
    connect( GetAction( EAction::HardwareDecoder ), &QAction::toggled, this, &VVideoWindow::SetDecoder );
    connect( GetAction( EAction::SoftwareDecoder ), &QAction::toggled, this, &VVideoWindow::SetDecoder );
    connect( GetAction( EAction::Play ), &QAction::triggered, this, &VVideoWindow::PlayPause );
    connect( GetAction( EAction::Stop ), &QAction::triggered, this, &VVideoWindow::Stop );
    connect( GetAction( EAction::PreviousFrame ), &QAction::triggered, this,
             [this] { m_pTimebar->triggerAction( QAbstractSlider::SliderSingleStepSub ); } );
    connect( GetAction( EAction::NextFrame ), &QAction::triggered, this,
             [this] { m_pTimebar->triggerAction( QAbstractSlider::SliderSingleStepAdd ); } );
    for( const VScaleRow& rRow : s_ScaleRows )
    {
      const EScaleMode Mode = rRow.Mode;
      connect( GetAction( rRow.Action ), &QAction::triggered, this, [this, Mode] { SetScaleMode( Mode ); } );
    }
    connect( GetAction( EAction::CorrectRadialDistortion ), &QAction::toggled, this,
             [this]( bool i_bChecked )
             {
               m_pGLWidget->SetLensDistortionCorrectionEnabled( i_bChecked );
               // Without lens data the action is off by necessity, not by the user's choice.
               if( m_VideoSource.HasLensDistortion() )
                 m_bLensCorrectionWanted = i_bChecked;
             } );
    connect( GetAction( EAction::VideoInformation ), &QAction::toggled, this,
             [this]( bool i_bVisible ) { SetPanelVisible( m_pInfoPanel, i_bVisible ); } );
    connect( GetAction( EAction::Controls ), &QAction::toggled, this,
             [this]( bool i_bVisible ) { SetPanelVisible( m_pControls, i_bVisible ); } );
    connect( GetAction( EAction::Properties ), &QAction::triggered, m_pPropertiesDialog, &QWidget::show );
    connect( GetAction( EAction::DisplaySettings ), &QAction::triggered, m_pVideoSettingsDialog, &QWidget::show );
    connect( GetAction( EAction::FullScreen ), &QAction::toggled, this, &VVideoWindow::SetFullScreen );
    connect( GetAction( EAction::ViewHelp ), &QAction::triggered, this, &VVideoWindow::ViewLatestHelp );
    connect( GetAction( EAction::Licenses ), &QAction::triggered, this, &VVideoWindow::ShowLicenses );
    connect( GetAction( EAction::CheckForUpdates ), &QAction::triggered, this, &VVideoWindow::CheckForUpdates );
    connect( GetAction( EAction::About ), &QAction::triggered, this, &VVideoWindow::ShowAbout );

    connect(
        m_pGLWidget, &VGLWidget::ScaleModeChanged, this,
        [this]( EScaleMode i_Mode )
        {
          for( const VScaleRow& rRow : s_ScaleRows )
            GetAction( rRow.Action )->setChecked( rRow.Mode == i_Mode );
          SaveSettings();
        },
        Qt::DirectConnection );
    for( EAction Action : s_StoredActions )
      connect( GetAction( Action ), &QAction::changed, this, &VVideoWindow::SaveSettings );
  }

  void VVideoWindow::SetDecoder()
  {
    m_pGLWidget->SetDecoder( GetAction( EAction::SoftwareDecoder )->isChecked() ? Software : Hardware );
    PrepareFrame( CurrentFrame() );
  }

  void VVideoWindow::SetFullScreen( bool i_bFullScreen )
  {
    if( i_bFullScreen )
    {
      // A window fixed to the video's size cannot fill the screen.
      if( m_pGLWidget->GetScaleMode() == ScaleWindowToVideo )
        GetAction( EAction::ScaleOneToOne )->trigger();
      showFullScreen();
      m_pLogo->hide();
      m_pMenuBar->hide();
    }
    else
    {
      showNormal();
      m_pLogo->show();
      m_pMenuBar->show();
    }
  }

  void VVideoWindow::SetPanelVisible( QWidget* i_pPanel, bool i_bVisible )
  {
    i_pPanel->setVisible( i_bVisible );
    // The layout recomputes its size hints only through a scale mode change.
    SetScaleMode( m_pGLWidget->GetScaleMode() );
  }

  void VVideoWindow::SetScaleMode( EScaleMode i_ScaleMode )
  {
    m_pGLWidget->SetScaleMode( i_ScaleMode );
    m_pGLWidget->updateGeometry();
    updateGeometry();
    if( i_ScaleMode == ScaleWindowToVideo )
    {
      m_pCentralLayout->setSizeConstraint( QLayout::SetFixedSize );
      setSizePolicy( QSizePolicy::Fixed, QSizePolicy::Fixed );
      setFixedSize( m_pCentralLayout->sizeHint() );
    }
    else
    {
      m_pCentralLayout->setSizeConstraint( QLayout::SetMinAndMaxSize );
      setSizePolicy( QSizePolicy::MinimumExpanding, QSizePolicy::MinimumExpanding );
      setMinimumSize( m_pCentralLayout->minimumSize() );
      setMaximumSize( m_pCentralLayout->maximumSize() );
      setWindowFlags( windowFlags() | Qt::CustomizeWindowHint | Qt::WindowMaximizeButtonHint );
      show();
    }
    SaveSettings();
  }

  void VVideoWindow::UpdateLensAction()
  {
    QAction* pAction = GetAction( EAction::CorrectRadialDistortion );
    const bool bHasLens = m_VideoSource.HasLensDistortion();
    pAction->setEnabled( bHasLens );
    pAction->setChecked( bHasLens && m_bLensCorrectionWanted );
  }

  void VVideoWindow::LoadSettings()
  {
    const VViewerSettings Settings = ReadViewerSettings( *m_pSettings );

    GetAction( EAction::Looping )->setChecked( Settings.Looping );
    m_pPlayBackManager->Loop( Settings.Looping );
    GetAction( EAction::SkipFrames )->setChecked( Settings.SkipFrames );
    m_pPlayBackManager->SetDropFrame( Settings.SkipFrames );
    GetAction( EAction::SoftwareDecoder )->setChecked( Settings.SoftwareDecoder );
    m_pGLWidget->SetDecoder( Settings.SoftwareDecoder ? Software : Hardware );
    PrepareFrame( CurrentFrame() );
    // Only the check state: the window stays normal, and the first "F" merely unchecks it.
    GetAction( EAction::FullScreen )->setChecked( Settings.FullScreen );
    GetAction( EAction::Controls )->setChecked( Settings.ControlsVisible );
    m_pControls->setVisible( Settings.ControlsVisible );
    SetScaleMode( m_pGLWidget->GetScaleMode() );
    GetAction( EAction::VideoInformation )->setChecked( Settings.VideoInfoVisible );
    m_pInfoPanel->setVisible( Settings.VideoInfoVisible );
    SetScaleMode( m_pGLWidget->GetScaleMode() );
    m_bLensCorrectionWanted = Settings.CorrectLensDistortion;
    UpdateLensAction();
  }

  void VVideoWindow::SaveSettings()
  {
    VViewerSettings Settings;
    Settings.Looping = GetAction( EAction::Looping )->isChecked();
    Settings.SkipFrames = GetAction( EAction::SkipFrames )->isChecked();
    Settings.SoftwareDecoder = GetAction( EAction::SoftwareDecoder )->isChecked();
    Settings.FullScreen = GetAction( EAction::FullScreen )->isChecked();
    Settings.ControlsVisible = GetAction( EAction::Controls )->isChecked();
    Settings.VideoInfoVisible = GetAction( EAction::VideoInformation )->isChecked();
    Settings.CorrectLensDistortion = m_bLensCorrectionWanted;
    WriteViewerSettings( *m_pSettings, Settings );
  }

  void VVideoWindow::ViewLatestHelp()
  {
    if( const ZOL::IApplicationVersion* pVersion = DebugServices::ApplicationVersion() )
      QDesktopServices::openUrl( HelpUrl( *pVersion ) );
  }

  void VVideoWindow::CheckForUpdates()
  {
    if( DebugServices::ApplicationVersion() == nullptr )
      DebugServices::CallAssertFailHandler( "pApplicationVersion != nullptr", __FILE__, __LINE__ );
    m_pUpdateCheck->CheckOnRequest();
  }

  void VVideoWindow::ShowAbout()
  {
    VAboutDialog Dialog( m_bDeveloper, this );
    Dialog.exec();
  }

  void VVideoWindow::ShowLicenses()
  {
    VLegalDialog Dialog( m_pQuickWidgetServices, this );
    Dialog.exec();
  }
} // namespace LumekVideoViewer
