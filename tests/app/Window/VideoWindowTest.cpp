// The real window with generated recordings: opening, playing, seeking and failing, full screen,
// scale modes, keys, stored settings and the Help menu; and the viewer started as a user starts it.

#include "tests/app/Window/WindowTestSupport.h"

#include "app/Controls/VEditSlider.h"
#include "app/Window/VLegalDialog.h"

#include <QDesktopServices>
#include <QDragEnterEvent>
#include <QDropEvent>
#include <QFile>
#include <QGroupBox>
#include <QLineEdit>
#include <QMenuBar>
#include <QMessageBox>
#include <QMimeData>
#include <QMouseEvent>
#include <QProcess>
#include <QQuickItem>
#include <QQuickWidget>
#include <QTextBrowser>
#include <QUrl>

using namespace WindowTest;

namespace
{
  using VideoWindow = WindowFixture;

  // Catches what the Help menu would open in a browser.
  class VUrlCatcher : public QObject
  {
    Q_OBJECT

  public:
    QList< QUrl > Urls;

  public slots:
    void Open( const QUrl& i_rUrl ) { Urls.append( i_rUrl ); }
  };

  void SendMouse( QWidget* i_pWidget, QEvent::Type i_Type, QPointF i_Point, Qt::MouseButton i_Button,
                  Qt::MouseButtons i_Buttons )
  {
    QMouseEvent Event( i_Type, i_Point, i_Button, i_Buttons, Qt::NoModifier );
    QApplication::sendEvent( i_pWidget, &Event );
  }

  void SendWheel( QWidget* i_pWidget, int i_Delta )
  {
    QWheelEvent Event( QPointF( 50, 50 ), QPointF( 50, 50 ), QPoint(), QPoint( 0, i_Delta ), Qt::NoButton,
                       Qt::NoModifier, Qt::NoScrollPhase, false );
    QApplication::sendEvent( i_pWidget, &Event );
  }
} // namespace

TEST_F( VideoWindow, OpenShowsTheFirstFrameAndDescribesTheFileAndCloseEmptiesIt )
{
  ExpectNoFileState();
  VRecordingSpec Spec;
  Spec.Frames = FramesWithout( 10, { 4, 5 } );
  ASSERT_TRUE( Open( Recording( "first take.lvid", Spec ) ) );

  // Nothing has ticked yet: this is the open's own frame.
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 0 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
  EXPECT_EQ( m_pWindow->windowTitle(), "first take.lvid - Lumek Video Viewer" );
  EXPECT_EQ( Label( "VideoLabel" ), "V: 16 x 8 / Luminance8 / 25.00Hz / 10 frames (2 missing) / 0.40s" );
  EXPECT_TRUE( Label( "TimecodeLabel" ).startsWith( "T: " ) ) << Label( "TimecodeLabel" ).toStdString();
  EXPECT_TRUE( Label( "DecoderLabel" ).contains( " @ " ) ) << Label( "DecoderLabel" ).toStdString();
  EXPECT_TRUE( Child< QLabel >( "AudioLabel" )->isHidden() );

  EXPECT_EQ( Timebar()->maximum(), 9 );
  // Taken from the bar's width at the open, before the labels settled the layout.
  EXPECT_NEAR( Timebar()->tickInterval(), Timebar()->width() / 10, 3 );
  EXPECT_EQ( SpinBox()->maximum(), 9 );

  // Playback starts by itself at every open.
  EXPECT_TRUE( Manager().IsPlaying() );
  EXPECT_EQ( PlayButton()->objectName(), "Pause" );
  EXPECT_EQ( PlayButton()->toolTip(), "Pause video" );
  EXPECT_EQ( Action( EAction::Play )->text(), "Pause" );
  EXPECT_FALSE( Action( EAction::NextFrame )->isEnabled() );
  EXPECT_FALSE( m_pWindow->GetVideoSettingsDialog()->GetRevertButton()->isEnabled() );

  QTableWidget* pTable = m_pWindow->GetPropertiesDialog()->GetTable();
  EXPECT_FALSE( pTable->findItems( "Recording.Description", Qt::MatchExactly ).isEmpty() );
  EXPECT_FALSE( pTable->item( 0, 1 )->flags() & Qt::ItemIsEditable );

  m_pWindow->CloseFile();
  ExpectNoFileState();
  EXPECT_EQ( pTable->columnCount(), 2 );
  EXPECT_EQ( pTable->horizontalHeaderItem( 0 )->text(), "Property" );
}

TEST_F( VideoWindow, AudioIsDescribedAndPlaysSilentlyWithoutADevice )
{
  VRecordingSpec Spec;
  Spec.bAudio = true;
  ASSERT_TRUE( Open( Recording( "sound.lvid", Spec ) ) );
  EXPECT_EQ( Label( "AudioLabel" ), "A: 2 channels / Int16 / 48000Hz" );
  EXPECT_FALSE( Child< QLabel >( "AudioLabel" )->isHidden() );
  // Every frame shown writes its block, to a device or to nowhere.
  EXPECT_TRUE( WaitFor( [this] { return Manager().GetCurrentFrame() >= 5; } ) );
  Pause();
  m_pWindow->ReloadCurrentFrame();

  // The next file without sound hides the label again.
  ASSERT_TRUE( Open( Recording( "quiet.lvid" ) ) );
  EXPECT_TRUE( Child< QLabel >( "AudioLabel" )->isHidden() );
}

TEST_F( VideoWindow, PlaybackLoopsAndWithoutLoopingStopsOnTheLastPicture )
{
  ASSERT_TRUE( Open( Recording( "loop.lvid" ) ) );
  int Highest = 0;
  EXPECT_TRUE( WaitFor(
      [&]
      {
        const int Frame = static_cast< int >( Manager().GetCurrentFrame() );
        Highest = std::max( Highest, Frame );
        return Highest >= 8 && Frame < 4;
      } ) );
  EXPECT_TRUE( Manager().IsPlaying() );

  Action( EAction::Looping )->setChecked( false );
  ASSERT_TRUE( WaitFor( [this] { return !Manager().IsPlaying(); } ) );
  EXPECT_EQ( Manager().GetCurrentFrame(), 0u );
  EXPECT_EQ( Timebar()->value(), 9 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 9 );
  EXPECT_EQ( PlayButton()->objectName(), "Play" );
  EXPECT_TRUE( Action( EAction::NextFrame )->isEnabled() );

  // A single frame: the clock runs past it, and the picture stays on it.
  VRecordingSpec Still;
  Still.Frames = { 0 };
  ASSERT_TRUE( Open( Recording( "still.lvid", Still ) ) );
  EXPECT_EQ( Timebar()->maximum(), 0 );
  EXPECT_EQ( SpinBox()->maximum(), 0 );
  ASSERT_TRUE( WaitFor( [this] { return !Manager().IsPlaying(); } ) );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
}

TEST_F( VideoWindow, StopSeekingStepsAndTheWheelMoveTheFrame )
{
  ASSERT_TRUE( Open( Recording( "seek.lvid" ) ) );
  Key( Qt::Key_Space );
  ASSERT_FALSE( Manager().IsPlaying() );
  EXPECT_EQ( Action( EAction::Play )->text(), "Play" );

  TypeFrame( 4 );
  EXPECT_EQ( Manager().GetCurrentFrame(), 4u );
  EXPECT_EQ( Timebar()->value(), 4 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 4 );
  Key( Qt::Key_Right );
  Key( Qt::Key_Right );
  EXPECT_EQ( Manager().GetCurrentFrame(), 6u );
  EXPECT_EQ( SpinBox()->value(), 6 );
  Key( Qt::Key_Left );
  EXPECT_EQ( Manager().GetCurrentFrame(), 5u );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 5 );
  SendWheel( m_pWindow.get(), 120 );
  EXPECT_EQ( Manager().GetCurrentFrame(), 6u );
  SendWheel( m_pWindow.get(), -120 );
  SendWheel( m_pWindow.get(), -120 );
  EXPECT_EQ( Manager().GetCurrentFrame(), 4u );

  // Stop goes back to frame 0, and play goes on from there.
  PlayButton()->click();
  EXPECT_TRUE( Manager().IsPlaying() );
  // Stepping while playing would fight the clock.
  EXPECT_FALSE( Action( EAction::PreviousFrame )->isEnabled() );
  Child< QPushButton >( "Stop" )->click();
  EXPECT_FALSE( Manager().IsPlaying() );
  EXPECT_EQ( Manager().GetCurrentFrame(), 0u );
  EXPECT_EQ( Timebar()->value(), 0 );
  EXPECT_EQ( SpinBox()->value(), 0 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
  PlayButton()->click();
  EXPECT_TRUE( WaitFor( [this] { return Manager().GetCurrentFrame() >= 1; } ) );
  EXPECT_LT( Manager().GetCurrentFrame(), 9u );
}

TEST_F( VideoWindow, AMissingFrameShowsTheEarlierOneAndWarnsWhenPaused )
{
  VRecordingSpec Spec;
  Spec.Frames = FramesWithout( 10, { 3, 4 } );
  ASSERT_TRUE( Open( Recording( "gaps.lvid", Spec ) ) );
  Pause();
  TypeFrame( 4 );
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 2 );
  // The warning darkens the last good picture to half.
  EXPECT_NEAR( ShownLevel(), FrameLevel( 2 ) / 2, 6 );
  TypeFrame( 5 );
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 5 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 5 );
}

// Whatever cannot be opened ends in the "Invalid file" dialog and no file; whatever survives of a
// cut recording plays without a fault.
TEST_F( VideoWindow, BadFilesGetTheInvalidFileDialogAndLeaveNoFile )
{
  const QString Good = QString::fromStdString( Recording( "good.lvid" ) );
  QFile Source( Good );
  ASSERT_TRUE( Source.open( QIODevice::ReadOnly ) );
  const QByteArray Bytes = Source.readAll();
  auto WriteFile = [this]( const QString& i_rName, const QByteArray& i_rBytes )
  {
    QFile File( m_Dir.filePath( i_rName ) );
    EXPECT_TRUE( File.open( QIODevice::WriteOnly ) );
    File.write( i_rBytes );
    return File.fileName();
  };
  ASSERT_TRUE( m_pWindow->OpenFile( Good ) );

  QString Title, Text;
  VDialogCloser< QMessageBox > Closer(
      [&]( QMessageBox* i_pBox )
      {
        Title = i_pBox->windowTitle();
        Text = i_pBox->text();
        EXPECT_EQ( i_pBox->standardButtons(), QMessageBox::Ok );
      } );
  EXPECT_FALSE( m_pWindow->OpenFile( WriteFile( "bad.lvid", QByteArray( 5000, '\x5a' ) ) ) );
  EXPECT_EQ( Closer.GetCount(), 1 );
  EXPECT_EQ( Title, "Invalid file" );
  EXPECT_EQ( Text, "The video file could not be opened." );
  ExpectNoFileState();
  EXPECT_FALSE( Manager().IsPlaying() );

  // A name no reader takes, and a file that is not there, end the same way.
  EXPECT_FALSE( m_pWindow->OpenFile( m_Dir.filePath( "notes.txt" ) ) );
  EXPECT_FALSE( m_pWindow->OpenFile( m_Dir.filePath( "absent.lvid" ) ) );
  EXPECT_EQ( Closer.GetCount(), 3 );
  ExpectNoFileState();

  for( int Cut : { 0, 16, 100, Bytes.size() / 3, Bytes.size() / 2, Bytes.size() - 8 } )
  {
    SCOPED_TRACE( Cut );
    if( m_pWindow->OpenFile( WriteFile( QString( "cut%1.lvid" ).arg( Cut ), Bytes.left( Cut ) ) ) )
    {
      QTest::qWait( 100 );
      m_pWindow->Stop();
    }
    else
      ExpectNoFileState();
  }
}

TEST_F( VideoWindow, DroppingOpensTheFirstLocalFileOnly )
{
  const QUrl First = QUrl::fromLocalFile( QString::fromStdString( Recording( "dropped.lvid" ) ) );
  const QUrl Second = QUrl::fromLocalFile( QString::fromStdString( Recording( "second.lvid" ) ) );
  const std::pair< QList< QUrl >, const char* > Drops[] = {
      { { First }, "dropped.lvid" },
      { { Second, First }, "second.lvid" },
      { { QUrl( "https://example.com/clip.lvid" ), First }, "second.lvid" } };
  for( const auto& [Urls, Shown] : Drops )
  {
    SCOPED_TRACE( Shown );
    QMimeData Data;
    Data.setUrls( Urls );
    QDragEnterEvent Enter( QPoint( 10, 10 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
    QApplication::sendEvent( m_pWindow.get(), &Enter );
    EXPECT_TRUE( Enter.isAccepted() );
    QDropEvent Drop( QPointF( 10, 10 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
    QApplication::sendEvent( m_pWindow.get(), &Drop );
    EXPECT_EQ( m_pWindow->windowTitle(), QString( Shown ) + " - Lumek Video Viewer" );
  }
  EXPECT_TRUE( Manager().IsPlaying() );
}

TEST_F( VideoWindow, DisplaySettingsChangeABayerPictureLive )
{
  VRecordingSpec Spec;
  Spec.Format = ZOL::PixelFormat_BayerGB8;
  ASSERT_TRUE( Open( Recording( "bayer.lvid", Spec ) ) );
  Pause();
  VVideoSettingsDialog* pDialog = m_pWindow->GetVideoSettingsDialog();
  EXPECT_TRUE( pDialog->GetRevertButton()->isEnabled() );
  Action( EAction::DisplaySettings )->trigger();
  EXPECT_TRUE( pDialog->isVisible() );

  const int Before = ShownLevel();
  QLineEdit* pGamma = pDialog->GetGammaEditor()->GetLineEdit();
  pGamma->setText( "0.4" );
  emit pGamma->editingFinished();
  EXPECT_FLOAT_EQ( pDialog->GetVideoSettings().GammaCorrection, 0.4f );
  // No new frame was read: the surface alone redraws the held picture.
  const int After = ShownLevel();
  EXPECT_GT( std::abs( After - Before ), 10 ) << Before << " " << After;

  pDialog->GetRevertButton()->click();
  EXPECT_FLOAT_EQ( pDialog->GetVideoSettings().GammaCorrection, 1.0f );
  EXPECT_NEAR( ShownLevel(), Before, 2 );
  pDialog->hide();
}

TEST_F( VideoWindow, LensCorrectionFollowsTheFileAndKeepsTheWish )
{
  QAction* pLens = Action( EAction::CorrectRadialDistortion );
  ASSERT_TRUE( Open( Recording( "plain.lvid" ) ) );
  EXPECT_FALSE( pLens->isEnabled() );
  EXPECT_FALSE( pLens->isChecked() );

  VRecordingSpec Spec;
  Spec.bLens = Spec.bCamera = true;
  const std::string Lens = Recording( "lens.lvid", Spec );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_TRUE( pLens->isEnabled() );
  EXPECT_TRUE( pLens->isChecked() );

  pLens->setChecked( false );
  ASSERT_TRUE( Open( Recording( "plain2.lvid" ) ) );
  EXPECT_FALSE( m_pWindow->GetLensCorrectionWanted() );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_FALSE( pLens->isChecked() );
}

// A first start shows "Full Screen" checked while the window is normal: the first F only
// unchecks it, and the second goes to full screen.
TEST_F( VideoWindow, FullScreenKeysAndTheStoredMismatch )
{
  QAction* pFull = Action( EAction::FullScreen );
  EXPECT_TRUE( pFull->isChecked() );
  EXPECT_FALSE( IsFull() );
  Key( Qt::Key_F );
  EXPECT_FALSE( pFull->isChecked() );
  EXPECT_FALSE( IsFull() );

  // The menu bar is the window's own, in the central layout; QMainWindow keeps a hidden one.
  Key( Qt::Key_F );
  EXPECT_TRUE( IsFull() );
  EXPECT_TRUE( Child< QMenuBar >( "MenuBar" )->isHidden() );
  EXPECT_TRUE( Child< QWidget >( "Logo" )->isHidden() );
  EXPECT_FALSE( Child< QGroupBox >( "Controls" )->isHidden() );
  Key( Qt::Key_Escape );
  EXPECT_FALSE( IsFull() );
  EXPECT_FALSE( Child< QMenuBar >( "MenuBar" )->isHidden() );
  EXPECT_FALSE( Child< QWidget >( "Logo" )->isHidden() );
  Key( Qt::Key_Escape );
  EXPECT_FALSE( pFull->isChecked() );

  Key( Qt::Key_F5 );
  EXPECT_TRUE( IsFull() );
  Key( Qt::Key_F5 );
  EXPECT_TRUE( pFull->isChecked() );
  EXPECT_TRUE( IsFull() );

  // A double click on the picture toggles the same action, and so does the button.
  for( bool bFull : { false, true } )
  {
    SendMouse( m_pWindow->GetGLWidget(), QEvent::MouseButtonDblClick, { 20, 20 }, Qt::LeftButton, Qt::LeftButton );
    EXPECT_EQ( IsFull(), bFull );
  }
  Child< QWidget >( "FullScreen" )->setEnabled( true );
  QTest::mouseClick( Child< QWidget >( "FullScreen" ), Qt::LeftButton );
  EXPECT_FALSE( IsFull() );
}

// In full screen the menu bar is hidden; the window's own copies of the actions keep every key.
TEST_F( VideoWindow, KeysWorkWithTheMenuBarHidden )
{
  ASSERT_TRUE( Open( Recording( "keys.lvid" ) ) );
  Key( Qt::Key_F );
  Key( Qt::Key_F );
  ASSERT_TRUE( Child< QMenuBar >( "MenuBar" )->isHidden() );

  Key( Qt::Key_L );
  EXPECT_FALSE( Action( EAction::Looping )->isChecked() );
  Key( Qt::Key_S );
  EXPECT_FALSE( Manager().GetDropFrame() );
  Key( Qt::Key_C );
  EXPECT_TRUE( Child< QWidget >( "Controls" )->isHidden() );
  Key( Qt::Key_I );
  EXPECT_TRUE( Child< QWidget >( "InfoPanel" )->isHidden() );
  Key( Qt::Key_Space );
  EXPECT_FALSE( Manager().IsPlaying() );
  Key( Qt::Key_Right );
  EXPECT_EQ( Manager().GetCurrentFrame(), 1u );
  Key( Qt::Key_P );
  EXPECT_TRUE( m_pWindow->GetPropertiesDialog()->isVisible() );
  m_pWindow->GetPropertiesDialog()->hide();
  Key( Qt::Key_C );
  Key( Qt::Key_I );
  EXPECT_FALSE( Child< QWidget >( "Controls" )->isHidden() );
  EXPECT_FALSE( Child< QWidget >( "InfoPanel" )->isHidden() );
}

TEST_F( VideoWindow, ScaleModesFollowTheMenuAndFullScreenLeavesTheFixedSize )
{
  VRecordingSpec Spec;
  Spec.Width = 320;
  Spec.Height = 200;
  Spec.Frames = { 0, 1, 2 };
  ASSERT_TRUE( Open( Recording( "scale.lvid", Spec ) ) );
  VGLWidget* pSurface = m_pWindow->GetGLWidget();
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleToWindow );
  const std::pair< EAction, EScaleMode > Modes[] = { { EAction::ScaleFreely, ScaleFreely },
                                                     { EAction::ScaleOneToOne, ScaleOneToOne },
                                                     { EAction::ScaleToWindow, ScaleToWindow } };
  for( const auto& [Menu, Mode] : Modes )
  {
    Action( Menu )->trigger();
    EXPECT_EQ( pSurface->GetScaleMode(), Mode );
    EXPECT_TRUE( Action( Menu )->isChecked() );
    EXPECT_NE( m_pWindow->minimumSize(), m_pWindow->maximumSize() );
  }

  // Dragging the picture frees the scale, and the menu follows.
  SendMouse( pSurface, QEvent::MouseButtonPress, { 100, 100 }, Qt::LeftButton, Qt::LeftButton );
  SendMouse( pSurface, QEvent::MouseMove, { 140, 110 }, Qt::NoButton, Qt::LeftButton );
  SendMouse( pSurface, QEvent::MouseButtonRelease, { 140, 110 }, Qt::LeftButton, Qt::NoButton );
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleFreely );
  EXPECT_TRUE( Action( EAction::ScaleFreely )->isChecked() );
  EXPECT_FALSE( Action( EAction::ScaleToWindow )->isChecked() );

  // Leaving the fixed size adds the maximise button; the close and minimise buttons must stay.
  for( Qt::WindowType Hint : { Qt::WindowMaximizeButtonHint, Qt::WindowCloseButtonHint, Qt::WindowMinimizeButtonHint } )
    EXPECT_TRUE( m_pWindow->windowFlags().testFlag( Hint ) ) << Hint;

  Action( EAction::ScaleWindowToVideo )->trigger();
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleWindowToVideo );
  EXPECT_EQ( m_pWindow->minimumSize(), m_pWindow->maximumSize() );
  Key( Qt::Key_F ); // unchecks the stored state
  Key( Qt::Key_F );
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleOneToOne );
  EXPECT_TRUE( Action( EAction::ScaleOneToOne )->isChecked() );
  EXPECT_NE( m_pWindow->minimumSize(), m_pWindow->maximumSize() );
  Key( Qt::Key_Escape );

  // A new file starts from the window's fit again.
  ASSERT_TRUE( Open( Recording( "scale2.lvid", Spec ) ) );
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleToWindow );
  EXPECT_TRUE( Action( EAction::ScaleToWindow )->isChecked() );
}

TEST_F( VideoWindow, SettingsSurviveARestart )
{
  Action( EAction::Looping )->setChecked( false );
  Action( EAction::SoftwareDecoder )->setChecked( true );
  Action( EAction::Controls )->setChecked( false );
  Key( Qt::Key_F ); // the stored "checked" becomes unchecked
  NewWindow();

  EXPECT_FALSE( Action( EAction::Looping )->isChecked() );
  EXPECT_TRUE( Action( EAction::SkipFrames )->isChecked() );
  EXPECT_TRUE( Action( EAction::SoftwareDecoder )->isChecked() );
  EXPECT_FALSE( Action( EAction::HardwareDecoder )->isChecked() );
  EXPECT_FALSE( Action( EAction::Controls )->isChecked() );
  EXPECT_TRUE( Child< QWidget >( "Controls" )->isHidden() );
  EXPECT_FALSE( Child< QWidget >( "InfoPanel" )->isHidden() );
  EXPECT_FALSE( Action( EAction::FullScreen )->isChecked() );

  // Without looping the end stops playback: the second window really loaded the value.
  ASSERT_TRUE( Open( Recording( "restart.lvid" ) ) );
  EXPECT_TRUE( m_pWindow->GetGLWidget()->GetDecoderName().contains( "Software" ) );
  EXPECT_TRUE( WaitFor( [this] { return !Manager().IsPlaying(); } ) );

  // A stored full screen is a checked action on a normal window.
  Key( Qt::Key_F );
  ASSERT_TRUE( Action( EAction::FullScreen )->isChecked() );
  NewWindow();
  EXPECT_TRUE( Action( EAction::FullScreen )->isChecked() );
  EXPECT_FALSE( IsFull() );
}

// The documentation of this release, its version, the legal page with the theme, and an answer to
// the user's update check even with no server to ask (the error dialog).
TEST_F( VideoWindow, TheHelpMenuAnswersEveryEntry )
{
  VUrlCatcher Catcher;
  QDesktopServices::setUrlHandler( "https", &Catcher, "Open" );
  Action( EAction::ViewHelp )->trigger();
  QDesktopServices::unsetUrlHandler( "https" );
  ASSERT_EQ( Catcher.Urls.size(), 1 );
  EXPECT_EQ( Catcher.Urls.front().path(), "/display/LVV110/" );

  {
    QString VersionLine, UpdateText;
    VDialogCloser< QDialog > Closer(
        [&]( QDialog* i_pDialog )
        {
          if( QLabel* pLabel = i_pDialog->findChild< QLabel* >( "VersionLine" ) )
            VersionLine = pLabel->text();
          if( QTextBrowser* pBrowser = i_pDialog->findChild< QTextBrowser* >() )
            UpdateText = pBrowser->toPlainText();
        } );
    Action( EAction::About )->trigger();
    EXPECT_EQ( Closer.GetCount(), 1 );
    EXPECT_EQ( VersionLine, "Lumek Video Viewer 1.10.0.137509h  x64" );
    Action( EAction::CheckForUpdates )->trigger();
    EXPECT_TRUE( WaitFor( [&] { return Closer.GetCount() == 2; } ) );
    EXPECT_TRUE( UpdateText.contains( "Unable to contact version check server." ) ) << UpdateText.toStdString();
  }

  QString Title, Errors;
  QQuickWidget::Status Status = QQuickWidget::Null;
  VDialogCloser< VLegalDialog > LegalCloser(
      [&]( VLegalDialog* i_pDialog )
      {
        QQuickWidget* pPage = i_pDialog->GetQuickWidget();
        Status = pPage->status();
        for( const QQmlError& rError : pPage->errors() )
          Errors += rError.toString() + "\n";
        if( QQuickItem* pRoot = pPage->rootObject() )
          if( QObject* pTitle = pRoot->findChild< QObject* >( "ComponentTitle" ) )
            Title = pTitle->property( "text" ).toString();
      } );
  Action( EAction::Licenses )->trigger();
  EXPECT_EQ( LegalCloser.GetCount(), 1 );
  EXPECT_EQ( Status, QQuickWidget::Ready ) << Errors.toStdString();
  EXPECT_TRUE( Title.startsWith( "Qt 5" ) ) << Title.toStdString();
}

TEST( LegalComponents, EveryLicenceTextIsThereWithItsCopyright )
{
  const QStringList Expected = { "Qt 5",          "Boost",    "libebml",     "libmatroska",
                                 "libjpeg-turbo", "OpenH264", "ImageMagick", "RapidXml" };
  QStringList Names;
  for( const VLegalComponent& rComponent : LegalComponents() )
  {
    SCOPED_TRACE( rComponent.Name.toStdString() );
    Names.append( rComponent.Name );
    const QString Text = LicenceText( rComponent );
    EXPECT_GT( Text.size(), 800 );
    EXPECT_TRUE( Text.contains( rComponent.Copyright ) );
    // Every one of these licences disclaims warranty; a text without it is cut short.
    EXPECT_TRUE( Text.contains( "warrant", Qt::CaseInsensitive ) );
  }
  EXPECT_EQ( Names, Expected );
}

// The viewer must come up with a good file and with a bad one, under the test's own X server, and
// neither crash nor block the test. The "Invalid file" dialog waits for a click that never comes:
// that process stays up too, and the kill ends it.
TEST( ViewerProcess, StartsOnAGoodFileAndOnABadOne )
{
  QTemporaryDir Dir;
  ASSERT_TRUE( Dir.isValid() );
  const QString Good = QString::fromStdString( WriteRecording( Dir.filePath( "good.lvid" ).toStdString(), {} ) );
  ASSERT_FALSE( Good.isEmpty() );
  QFile Bad( Dir.filePath( "bad.lvid" ) );
  ASSERT_TRUE( Bad.open( QIODevice::WriteOnly ) );
  Bad.write( "not a recording" );
  Bad.close();

  QProcess Viewers[2];
  const QString Files[2] = { Good, Bad.fileName() };
  for( int i = 0; i < 2; ++i )
  {
    Viewers[i].setProcessChannelMode( QProcess::MergedChannels );
    Viewers[i].start( LUMEK_VIEWER_BINARY, { "--version-server=", Files[i] } );
    ASSERT_TRUE( Viewers[i].waitForStarted( 5000 ) );
  }
  QTest::qWait( 2000 );
  for( int i = 0; i < 2; ++i )
  {
    const bool bAlive = Viewers[i].state() == QProcess::Running;
    Viewers[i].kill();
    Viewers[i].waitForFinished( 5000 );
    EXPECT_TRUE( bAlive ) << Files[i].toStdString() << "\n" << Viewers[i].readAll().toStdString();
  }
}

#include "VideoWindowTest.moc"
