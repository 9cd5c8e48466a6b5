#include "app/Window/VVideoWindow.h"

#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Controls/VProxyStyle.h"
#include "app/Playback/VPlayBackManager.h"
#include "app/Style/AppStyle.h"
#include "app/VideoSource/VideoSourceTexts.h"
#include "app/Window/VLegalDialog.h"
#include "app/Window/VPropertiesDialog.h"
#include "app/Window/VVideoSettingsDialog.h"
#include "services/DebugServices.h"
#include "versioncheck/VersionCheck/VApplicationVersionCheck.h"

#include <QAction>
#include <QAudioDeviceInfo>
#include <QAudioOutput>
#include <QCoreApplication>
#include <QDir>
#include <QDragEnterEvent>
#include <QDropEvent>
#include <QFileDialog>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLabel>
#include <QMenuBar>
#include <QMessageBox>
#include <QMimeData>
#include <QPushButton>
#include <QSettings>
#include <QStatusBar>
#include <QVBoxLayout>
#include <QWheelEvent>

#include <algorithm>
#include <climits>

namespace LumekVideoViewer
{
  namespace
  {
    QWidget* Spacer( QWidget* i_pParent )
    {
      return new QWidget( i_pParent );
    }

    QPushButton* TransportButton( const char* i_pName, const char* i_pToolTip, QWidget* i_pParent )
    {
      QPushButton* pButton = new QPushButton( i_pParent );
      pButton->setObjectName( i_pName );
      pButton->setToolTip( i_pToolTip );
      return pButton;
    }
  } // namespace

  VVideoWindow::VVideoWindow( bool i_bDeveloper, const std::string& i_rVersionServer,
                              const std::string& i_rSpoofVersion, QWidget* i_pParent )
      : QMainWindow( i_pParent ), m_bDeveloper( i_bDeveloper )
  {
    // The logo, the icon and the button pictures are resources of the style library.
    InitialiseStyleResources();
    const ZOL::IApplicationVersion* pApplicationVersion = DebugServices::ApplicationVersion();
    if( pApplicationVersion == nullptr )
      DebugServices::CallAssertFailHandler( "pApplicationVersion != nullptr", __FILE__, __LINE__ );

    m_pSettings = new QSettings( SettingsOrganisation, SettingsApplication, this );
    m_pUpdateCheck = std::make_unique< VersionCheck::VApplicationVersionCheck >( this, m_pSettings, pApplicationVersion,
                                                                                 i_rVersionServer, i_rSpoofVersion );
    m_VersionText = m_pUpdateCheck->GetVersionText();
    m_pUpdateCheck->CheckAtStartup();

    m_pPropertiesDialog = new VPropertiesDialog( this );
    m_pVideoSettingsDialog = new VVideoSettingsDialog( this );
    m_pVideoSettingsDialog->SetControlsEnabled( false );

    BuildLayout();
    m_pPlayBackManager = std::make_unique< VPlayBackManager >( &m_VideoSource );
    BuildActions();

    LoadSettings();
    BuildShortcuts();
    ConnectControls();
    ConnectActions();

    m_pQuickWidgetServices = std::make_shared< VQuickWidgetServices >( QCoreApplication::applicationDirPath() );
    UpdateControls();
  }

  VVideoWindow::~VVideoWindow()
  {
    SaveSettings();
    // The children outlive this class's members; nothing they emit may reach a slot from here on.
    m_pGLWidget->removeEventFilter( this );
    m_pPlayBackManager->disconnect();
    m_pPlayBackManager->Stop();
    m_pPlayBackManager.reset();
    for( QObject* pChild : findChildren< QObject* >() )
      pChild->disconnect( this );
  }

  void VVideoWindow::BuildLayout()
  {
    QWidget* pCentral = new QWidget( this );
    m_pCentralLayout = new QVBoxLayout( pCentral );
    m_pCentralLayout->setContentsMargins( 0, 0, 0, 0 );
    m_pCentralLayout->setSpacing( 0 );

    // The window's own menu bar would stay in full screen; this one goes with the logo.
    QHBoxLayout* pTop = new QHBoxLayout;
    m_pMenuBar = new QMenuBar( pCentral );
    m_pMenuBar->setObjectName( "MenuBar" );
    // A desktop's global menu would neither sit next to the logo nor hide with it.
    m_pMenuBar->setNativeMenuBar( false );
    m_pLogo = new QLabel( pCentral );
    m_pLogo->setObjectName( "Logo" );
    m_pLogo->setPixmap( QPixmap( ":/com.Lumek.LumekVideoViewer.LumekLogo.svg" ) );
    pTop->addWidget( m_pMenuBar );
    pTop->addWidget( m_pLogo );
    m_pCentralLayout->addLayout( pTop );

    m_pGLWidget = new VGLWidget( pCentral );
    m_pGLWidget->setSizePolicy( QSizePolicy::MinimumExpanding, QSizePolicy::MinimumExpanding );
    m_pGLWidget->installEventFilter( this );
    m_pCentralLayout->addWidget( m_pGLWidget );

    m_pCentralLayout->addWidget( BuildInfoPanel() );
    m_pCentralLayout->addWidget( BuildControls() );
    m_pCentralLayout->setStretch( 1, 1000 );

    setCentralWidget( pCentral );
    statusBar()->hide();
    menuBar()->hide();
    setAcceptDrops( true );
    setWindowIcon( QIcon( ":/com.Lumek.LumekVideoViewer.AppIcon.svg" ) );
    setWindowTitle( WindowTitle( QString() ) );
  }

  QWidget* VVideoWindow::BuildInfoPanel()
  {
    m_pInfoPanel = new QWidget( this );
    m_pInfoPanel->setObjectName( "InfoPanel" );
    m_pTimecodeLabel = new QLabel( m_pInfoPanel );
    m_pTimecodeLabel->setObjectName( "TimecodeLabel" );
    m_pDecoderLabel = new QLabel( m_pInfoPanel );
    m_pDecoderLabel->setObjectName( "DecoderLabel" );
    m_pAudioLabel = new QLabel( m_pInfoPanel );
    m_pAudioLabel->setObjectName( "AudioLabel" );
    m_pAudioSpacer = Spacer( m_pInfoPanel );
    m_pVideoLabel = new QLabel( m_pInfoPanel );
    m_pVideoLabel->setObjectName( "VideoLabel" );

    QHBoxLayout* pLayout = new QHBoxLayout( m_pInfoPanel );
    pLayout->addWidget( m_pTimecodeLabel );
    pLayout->addWidget( Spacer( m_pInfoPanel ) );
    pLayout->addWidget( m_pDecoderLabel );
    pLayout->addWidget( Spacer( m_pInfoPanel ) );
    pLayout->addWidget( m_pAudioLabel );
    pLayout->addWidget( m_pAudioSpacer );
    pLayout->addWidget( m_pVideoLabel );
    return m_pInfoPanel;
  }

  QWidget* VVideoWindow::BuildControls()
  {
    m_pControls = new QGroupBox( this );
    m_pControls->setObjectName( "Controls" );

    m_pTimebar = new VLabelSlider( Qt::Horizontal, m_pControls );
    m_pTimebar->setObjectName( "Timebar" );
    // The proxy gets a style of its own: taking over the slider's would take the application's.
    VProxyStyle* pStyle = new VProxyStyle;
    pStyle->setParent( m_pTimebar );
    m_pTimebar->setStyle( pStyle );
    m_pTimebar->setTickPosition( QSlider::TicksBothSides );
    m_pTimebar->setTracking( false );
    m_pTimebar->setSingleStep( 1 );

    m_pFrameSpinBox = new VClickSpinBox( m_pControls );
    m_pFrameSpinBox->setToolTip( "Current frame index" );
    m_pFrameSpinBox->setMinimumWidth( 70 );

    m_pPlayButton = TransportButton( "Play", "Play video", m_pControls );
    m_pStopButton = TransportButton( "Stop", "Stop playing", m_pControls );
    m_pFullScreenButton = TransportButton( "FullScreen", "Toggle fullscreen mode", m_pControls );

    QHBoxLayout* pLayout = new QHBoxLayout( m_pControls );
    pLayout->addWidget( m_pTimebar );
    pLayout->addWidget( m_pFrameSpinBox );
    pLayout->addWidget( m_pPlayButton );
    pLayout->addWidget( m_pStopButton );
    pLayout->addWidget( m_pFullScreenButton );
    return m_pControls;
  }

  void VVideoWindow::ConnectControls()
  {
    VPlayBackManager* pManager = m_pPlayBackManager.get();
    connect( m_pPlayButton, &QPushButton::clicked, this, &VVideoWindow::PlayPause );
    connect( m_pStopButton, &QPushButton::clicked, this, &VVideoWindow::Stop );
    connect( m_pFullScreenButton, &QPushButton::clicked, GetAction( EAction::FullScreen ), &QAction::toggle );

    connect( m_pTimebar, &QSlider::valueChanged, pManager, &VPlayBackManager::PlayFrame );
    connect( m_pTimebar, &QSlider::sliderMoved, pManager, &VPlayBackManager::PlayFrame );
    connect( pManager, &VPlayBackManager::Stopped, this, &VVideoWindow::UpdateControls );
    // The slider and the box set their values with signals blocked, so the clock's own frame does
    // not come back to it as a seek.
    connect( pManager, &VPlayBackManager::FrameUpdated, this, &VVideoWindow::UpdateControls );
    connect( pManager, &VPlayBackManager::FrameUpdated, m_pTimebar, &VLabelSlider::setValue );
    connect( pManager, &VPlayBackManager::FrameUpdated, m_pFrameSpinBox, &VClickSpinBox::setValue );
    connect( pManager, &VPlayBackManager::FrameUpdated, this, &VVideoWindow::PrepareFrame );
    connect( m_pFrameSpinBox, QOverload< int >::of( &QSpinBox::valueChanged ), pManager, &VPlayBackManager::PlayFrame );
    connect( m_pFrameSpinBox, QOverload< int >::of( &QSpinBox::valueChanged ), m_pTimebar, &VLabelSlider::setValue );
    connect( m_pTimebar, &QSlider::sliderMoved, m_pTimebar, [pTimebar = m_pTimebar]( int ) { pTimebar->repaint(); } );
    connect( m_pTimebar, &QSlider::valueChanged, m_pFrameSpinBox, &VClickSpinBox::setValue );
    connect( m_pVideoSettingsDialog, &VVideoSettingsDialog::VideoSettingsChanged, m_pGLWidget,
             &VGLWidget::SetVideoSettings );
  }

  int VVideoWindow::CurrentFrame() const
  {
    return static_cast< int >( m_pPlayBackManager->GetCurrentFrame() );
  }

  bool VVideoWindow::OpenFile( QString i_Path )
  {
    CloseFile();
    if( !m_VideoSource.Open( i_Path.toStdString() ) )
    {
      QMessageBox::critical( this, "Invalid file",
                             QString::fromStdString( ComposeOpenFailureText( i_Path.toStdString() ) ),
                             QMessageBox::Ok );
      m_pVideoSettingsDialog->SetControlsEnabled( false );
      UpdateControls();
      return false;
    }

    m_pTimebar->setValue( 0 );
    m_pFrameSpinBox->setValue( 0 );
    PrepareFrame( 0 );

    const std::uint64_t FrameCount = m_VideoSource.GetFrameCount();
    const int LastFrame =
        FrameCount == 0 ? 0 : static_cast< int >( std::min< std::uint64_t >( FrameCount - 1, INT_MAX ) );
    m_pTimebar->setMinimum( 0 );
    m_pTimebar->setMaximum( LastFrame );
    m_pTimebar->setTickInterval( TimebarTickInterval( m_pTimebar->width(), FrameCount ) );
    m_pFrameSpinBox->setMaximum( LastFrame );
    UpdateControls();

    CreateAudioOutput();

    const ZOL::IVideoSettings& rSettings = m_VideoSource.GetVideoSettings();
    m_pVideoSettingsDialog->SetFileVideoSettings( rSettings );
    m_pVideoSettingsDialog->SetVideoSettings( rSettings );
    m_pGLWidget->SetVideoSettings( rSettings );
    m_pVideoSettingsDialog->SetControlsEnabled(
        HasDisplaySettings( m_VideoSource.GetVideoPayload(), m_VideoSource.GetVideoFrameInfo().PixelFormat ) );

    m_pGLWidget->SetLensDistortionCalibration( m_VideoSource.GetCameraHardware(),
                                               m_VideoSource.GetLensDistortionCalibration() );
    UpdateLensAction();

    setWindowTitle( WindowTitle( i_Path ) );
    UpdateControls();
    m_pPlayBackManager->Start();
    UpdateControls();

    m_pPropertiesDialog->SetVideoSource( m_VideoSource );
    // Every open starts from the same view, whatever the last file was left at.
    GetAction( EAction::ScaleToWindow )->trigger();
    return true;
  }

  void VVideoWindow::PrepareFrame( int i_FrameIndex )
  {
    const std::uint64_t FrameCount = m_VideoSource.IsOpen() ? m_VideoSource.GetFrameCount() : 0;
    const VFrameChoice Choice = ChooseFrame(
        i_FrameIndex, FrameCount, m_pPlayBackManager->IsPlaying(),
        [this]( std::uint64_t i_Index, ZOL::IVideoFrame& o_rFrame )
        { return m_VideoSource.GetFrame( i_Index, o_rFrame ); },
        [this]( std::uint64_t i_Index ) { return m_VideoSource.FindFrameAtOrBefore( i_Index ); } );
    m_ShownFrameIndex = Choice.ShownIndex;
    const ZOL::IVideoFrameInfo Geometry =
        SurfaceGeometry( m_VideoSource.GetVideoFrameInfo(), m_VideoSource.GetCameraHardware() );
    m_pGLWidget->PrepareFrame( i_FrameIndex, Geometry, Choice.Frame, Choice.bMissingWarning );
    WriteAudio( Choice.Frame );
  }

  void VVideoWindow::OpenFileDialog()
  {
    const QString Path =
        QFileDialog::getOpenFileName( this, "Open File", QDir::currentPath(),
                                      "Lumek Video Files (*.lvid *.lumekimagesequence);;Video Files (*.lvid *.mov "
                                      "*.mp4 *.avi);;Image Sequences (*.lumekimagesequence *.jpg *.jpeg *.png *.tif "
                                      "*.tiff);;All Files (*.*)" );
    if( !Path.isNull() )
      OpenFile( Path );
  }

  void VVideoWindow::CloseFile()
  {
    m_pPlayBackManager->Stop();
    m_pPlayBackManager->Reset();
    m_VideoSource.Close();
    setWindowTitle( WindowTitle( QString() ) );
    m_pPropertiesDialog->Clear();
    UpdateControls();
    m_pVideoSettingsDialog->SetControlsEnabled( false );
  }

  void VVideoWindow::PlayPause()
  {
    if( m_pPlayBackManager->IsPlaying() )
      m_pPlayBackManager->Pause();
    else
      m_pPlayBackManager->Start();
    PrepareFrame( CurrentFrame() );
    UpdateControls();
  }

  void VVideoWindow::Stop()
  {
    m_pPlayBackManager->Stop();
    m_pPlayBackManager->Reset();
    m_pTimebar->setValue( 0 );
    m_pFrameSpinBox->setValue( 0 );
    PrepareFrame( 0 );
    UpdateControls();
  }

  void VVideoWindow::ReloadCurrentFrame()
  {
    PrepareFrame( CurrentFrame() );
  }

  void VVideoWindow::SetPlayButtonName( const QString& i_rName )
  {
    if( m_pPlayButton->objectName() == i_rName )
      return;
    m_pPlayButton->setObjectName( i_rName );
    // The button's picture hangs on its name in the application's style sheet; a style sheet of its
    // own, even an empty one, makes Qt apply those rules again.
    m_pPlayButton->setStyleSheet( "/**/" );
  }

  void VVideoWindow::UpdateControls()
  {
    const bool bOpen = m_VideoSource.GetVideoPayload() != ZOL::VideoPayload_None;
    const bool bPlaying = bOpen && m_pPlayBackManager->IsPlaying();
    const std::uint64_t Frame = bOpen ? m_pPlayBackManager->GetCurrentFrame() : 0;

    const VInfoPanelTexts Texts = ComposeInfoPanelTexts( m_VideoSource, Frame );
    m_pTimecodeLabel->setText( QString::fromStdString( Texts.Timecode ) );
    m_pVideoLabel->setText( QString::fromStdString( Texts.Video ) );
    m_pAudioLabel->setText( QString::fromStdString( Texts.Audio ) );
    const double FramesPerSecond = bPlaying ? m_pGLWidget->GetFrameRate() : 0.0;
    m_pDecoderLabel->setText( bOpen ? QString::fromStdString( ComposeDecoderText(
                                          m_pGLWidget->GetDecoderName().toStdString(), FramesPerSecond ) )
                                    : QString() );

    const bool bAudio = m_VideoSource.GetAudioPayload() != ZOL::AudioPayload_None;
    m_pAudioLabel->setVisible( bAudio );
    m_pAudioSpacer->setVisible( bAudio );

    for( QWidget* pWidget : { static_cast< QWidget* >( m_pPlayButton ), static_cast< QWidget* >( m_pStopButton ),
                              static_cast< QWidget* >( m_pTimebar ), static_cast< QWidget* >( m_pFrameSpinBox ) } )
      pWidget->setEnabled( bOpen );
    GetAction( EAction::Play )->setEnabled( bOpen );
    GetAction( EAction::Stop )->setEnabled( bOpen );
    GetAction( EAction::PreviousFrame )->setEnabled( bOpen && !bPlaying );
    GetAction( EAction::NextFrame )->setEnabled( bOpen && !bPlaying );

    GetAction( EAction::Play )->setText( bPlaying ? "Pause" : "Play" );
    m_pPlayButton->setToolTip( bPlaying ? "Pause video" : "Play video" );
    SetPlayButtonName( bPlaying ? "Pause" : "Play" );

    if( !bOpen )
    {
      m_pGLWidget->Clear();
      {
        const QSignalBlocker Blocker( m_pTimebar );
        m_pTimebar->setValue( 0 );
        m_pTimebar->setMaximum( 100 );
      }
      m_pFrameSpinBox->setValue( 0 );
    }
  }

  void VVideoWindow::CreateAudioOutput()
  {
    if( m_pAudioOutput )
    {
      m_pAudioOutput->stop();
      m_pAudioOutput->reset();
      m_pAudioOutput.reset();
      m_pAudioDevice = nullptr;
    }
    const ZOL::IAudioFrameInfo& rInfo = m_VideoSource.GetAudioFrameInfo();
    if( rInfo.Channels == 0 )
      return;
    const QAudioFormat Format = AudioOutputFormat( rInfo, QAudioDeviceInfo::defaultOutputDevice().preferredFormat() );
    m_pAudioOutput = std::make_unique< QAudioOutput >( Format );
    // Without a sound device this is null, and every write is skipped.
    m_pAudioDevice = m_pAudioOutput->start();
  }

  void VVideoWindow::WriteAudio( const ZOL::IVideoFrame& i_rFrame )
  {
    if( !m_pAudioOutput || m_pAudioDevice == nullptr )
      return;
    const ZOL::IBuffer* pBlock = AudioBlockToWrite( i_rFrame );
    if( pBlock == nullptr )
      return;
    const char* pData = reinterpret_cast< const char* >( pBlock->GetData() );
    const qint64 Size = static_cast< qint64 >( pBlock->GetSize() );
    // Push-mode devices of most back ends are sequential: there the block simply joins the queue,
    // and asking them to seek would only fill the log with warnings.
    if( m_pAudioDevice->isSequential() )
    {
      m_pAudioDevice->write( pData, Size );
      return;
    }
    const qint64 Position = m_pAudioDevice->pos();
    m_pAudioDevice->seek( m_pAudioDevice->size() );
    m_pAudioDevice->write( pData, Size );
    m_pAudioDevice->seek( Position );
  }

  void VVideoWindow::dragEnterEvent( QDragEnterEvent* i_pEvent )
  {
    if( i_pEvent->mimeData()->hasUrls() )
      i_pEvent->acceptProposedAction();
  }

  void VVideoWindow::dropEvent( QDropEvent* i_pEvent )
  {
    const QList< QUrl > Urls = i_pEvent->mimeData()->urls();
    if( Urls.isEmpty() )
      return;
    const QString Path = Urls.front().toLocalFile();
    if( Path.isEmpty() )
      return;
    OpenFile( Path );
    activateWindow();
  }

  void VVideoWindow::wheelEvent( QWheelEvent* i_pEvent )
  {
    const int Delta = i_pEvent->angleDelta().y();
    if( Delta > 0 )
      m_pTimebar->triggerAction( QAbstractSlider::SliderSingleStepAdd );
    else if( Delta < 0 )
      m_pTimebar->triggerAction( QAbstractSlider::SliderSingleStepSub );
  }

  bool VVideoWindow::eventFilter( QObject* i_pWatched, QEvent* i_pEvent )
  {
    if( i_pWatched == m_pGLWidget && i_pEvent->type() == QEvent::MouseButtonDblClick )
      GetAction( EAction::FullScreen )->toggle();
    return QMainWindow::eventFilter( i_pWatched, i_pEvent );
  }
} // namespace LumekVideoViewer
