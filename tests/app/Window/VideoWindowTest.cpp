// The real window under an X server, with generated recordings: opening, playing, seeking and
// failing, full screen, scale modes, keys, stored settings and the Help menu; and the viewer
// started as a user starts it. Each test gets a fresh window on an empty settings store.

#include "tests/app/AppTestSupport.h"

#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VEditSlider.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Playback/VPlayBackManager.h"
#include "app/Window/VLegalDialog.h"
#include "app/Window/VPropertiesDialog.h"
#include "app/Window/VVideoSettingsDialog.h"
#include "app/Window/VVideoWindow.h"

#include <QAction>
#include <QApplication>
#include <QDesktopServices>
#include <QDragEnterEvent>
#include <QDropEvent>
#include <QFile>
#include <QGroupBox>
#include <QLabel>
#include <QLineEdit>
#include <QMenuBar>
#include <QMessageBox>
#include <QMimeData>
#include <QMouseEvent>
#include <QProcess>
#include <QPushButton>
#include <QQuickItem>
#include <QQuickWidget>
#include <QSettings>
#include <QTableWidget>
#include <QTemporaryDir>
#include <QTest>
#include <QTextBrowser>
#include <QTimer>
#include <QUrl>

#include <gtest/gtest.h>

#include <functional>
#include <memory>

using namespace AppTest;
using namespace LumekVideoViewer;

namespace
{
  // Closes every modal dialog of type T that appears, with its done(), and keeps what it showed;
  // the dialog's own event loop would otherwise hold the test forever.
  template < typename T > class VDialogCloser
  {
  public:
    explicit VDialogCloser( std::function< void( T* ) > i_Inspect = {} ) : m_Inspect( std::move( i_Inspect ) )
    {
      QObject::connect( &m_Timer, &QTimer::timeout,
                        [this]
                        {
                          for( QWidget* pWidget : QApplication::topLevelWidgets() )
                            if( T* pDialog = qobject_cast< T* >( pWidget ); pDialog && pDialog->isVisible() )
                            {
                              ++m_Count;
                              if( m_Inspect )
                                m_Inspect( pDialog );
                              pDialog->done( 0 );
                            }
                        } );
      m_Timer.start( 20 );
    }
    int GetCount() const { return m_Count; }

  private:
    std::function< void( T* ) > m_Inspect;
    QTimer m_Timer;
    int m_Count = 0;
  };

  // Catches what the Help menu would open in a browser.
  class VUrlCatcher : public QObject
  {
    Q_OBJECT

  public:
    QList< QUrl > Urls;

  public slots:
    void Open( const QUrl& i_rUrl ) { Urls.append( i_rUrl ); }
  };

  void SendMouse( QWidget* i_pWidget, QEvent::Type i_Type, QPointF i_Point, Qt::MouseButtons i_Buttons )
  {
    const Qt::MouseButton Button = i_Type == QEvent::MouseMove ? Qt::NoButton : Qt::LeftButton;
    QMouseEvent Event( i_Type, i_Point, Button, i_Buttons, Qt::NoModifier );
    QApplication::sendEvent( i_pWidget, &Event );
  }

  void SendWheel( QWidget* i_pWidget, int i_Delta )
  {
    QWheelEvent Event( QPointF( 50, 50 ), QPointF( 50, 50 ), QPoint(), QPoint( 0, i_Delta ), Qt::NoButton,
                       Qt::NoModifier, Qt::NoScrollPhase, false );
    QApplication::sendEvent( i_pWidget, &Event );
  }

  class VideoWindow : public testing::Test
  {
  protected:
    void SetUp() override
    {
      ASSERT_TRUE( m_Dir.isValid() );
      QSettings( SettingsOrganisation, SettingsApplication ).clear();
      NewWindow();
    }

    void NewWindow()
    {
      m_pWindow.reset();
      // No version server: the start-up check fails at once and silently.
      m_pWindow = std::make_unique< VVideoWindow >( false, "", "", nullptr );
      m_pWindow->resize( 900, 700 );
      m_pWindow->show();
      QApplication::setActiveWindow( m_pWindow.get() );
      ASSERT_TRUE( QTest::qWaitForWindowExposed( m_pWindow.get() ) );
    }

    std::string Recording( const std::string& i_rName, const VRecordingSpec& i_rSpec = VRecordingSpec() )
    {
      return WriteRecording( m_Dir.filePath( QString::fromStdString( i_rName ) ).toStdString(), i_rSpec );
    }
    bool Open( const std::string& i_rPath ) { return m_pWindow->OpenFile( QString::fromStdString( i_rPath ) ); }

    QString Label( const char* i_pName ) const
    {
      QLabel* pLabel = Child< QLabel >( i_pName );
      return pLabel ? pLabel->text() : QString( "<no label %1>" ).arg( i_pName );
    }
    template < typename T > T* Child( const char* i_pName ) const { return m_pWindow->findChild< T* >( i_pName ); }
    bool Hidden( const char* i_pName ) const { return Child< QWidget >( i_pName )->isHidden(); }
    VPlayBackManager& Manager() const { return *m_pWindow->GetPlayBackManager(); }
    std::uint64_t Frame() const { return Manager().GetCurrentFrame(); }
    QAction* Action( EAction i_Action ) const { return m_pWindow->GetAction( i_Action ); }
    VLabelSlider* Timebar() const { return Child< VLabelSlider >( "Timebar" ); }
    QSpinBox* SpinBox() const { return m_pWindow->findChild< VClickSpinBox* >(); }
    QPushButton* PlayButton() const
    {
      QPushButton* pButton = Child< QPushButton >( "Play" );
      return pButton ? pButton : Child< QPushButton >( "Pause" );
    }
    bool IsFull() const { return m_pWindow->windowState().testFlag( Qt::WindowFullScreen ); }

    void Pause()
    {
      if( Manager().IsPlaying() )
        m_pWindow->PlayPause();
    }
    // As a user typing into the box: the plain QSpinBox::setValue tells the connected slots.
    void TypeFrame( int i_Frame ) { SpinBox()->QSpinBox::setValue( i_Frame ); }
    // A shortcut reaches only the active window.
    void Key( int i_Key )
    {
      QApplication::setActiveWindow( m_pWindow.get() );
      QTest::keyClick( m_pWindow.get(), static_cast< Qt::Key >( i_Key ) );
    }

    // The grey level the surface shows at a point inside the picture, off the centre where the
    // missing frame plate sits and off the outline at the edges.
    int ShownLevel() const
    {
      const QImage Image = m_pWindow->GetGLWidget()->grabFramebuffer();
      return qGray( Image.pixel( Image.width() / 4, Image.height() / 2 ) );
    }

    void ExpectNoFileState() const
    {
      EXPECT_EQ( m_pWindow->windowTitle(), "Lumek Video Viewer" );
      EXPECT_EQ( Label( "TimecodeLabel" ), "No file open" );
      EXPECT_EQ( Label( "VideoLabel" ) + Label( "DecoderLabel" ), "" );
      EXPECT_FALSE( Timebar()->isEnabled() );
      EXPECT_EQ( Timebar()->maximum(), 100 );
      EXPECT_EQ( Timebar()->value(), 0 );
      EXPECT_FALSE( SpinBox()->isEnabled() || PlayButton()->isEnabled() || Action( EAction::Play )->isEnabled() );
      EXPECT_FALSE( m_pWindow->GetVideoSettingsDialog()->GetRevertButton()->isEnabled() );
      EXPECT_EQ( m_pWindow->GetPropertiesDialog()->GetTable()->rowCount(), 0 );
    }

    QTemporaryDir m_Dir;
    std::unique_ptr< VVideoWindow > m_pWindow;
  };
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
  EXPECT_TRUE( Hidden( "AudioLabel" ) );

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
  EXPECT_FALSE( Hidden( "AudioLabel" ) );
  // Every frame shown writes its block, to a device or to nowhere.
  EXPECT_TRUE( QTest::qWaitFor( [this] { return Frame() >= 5; } ) );
  Pause();
  m_pWindow->ReloadCurrentFrame();

  // The next file without sound hides the label again.
  ASSERT_TRUE( Open( Recording( "quiet.lvid" ) ) );
  EXPECT_TRUE( Hidden( "AudioLabel" ) );
}

TEST_F( VideoWindow, PlaybackLoopsAndWithoutLoopingStopsOnTheLastPicture )
{
  ASSERT_TRUE( Open( Recording( "loop.lvid" ) ) );
  std::uint64_t Highest = 0;
  EXPECT_TRUE( QTest::qWaitFor(
      [&]
      {
        Highest = std::max( Highest, Frame() );
        return Highest >= 8 && Frame() < 4;
      } ) );
  EXPECT_TRUE( Manager().IsPlaying() );

  Action( EAction::Looping )->setChecked( false );
  ASSERT_TRUE( QTest::qWaitFor( [this] { return !Manager().IsPlaying(); } ) );
  EXPECT_EQ( Frame(), 0u );
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
  ASSERT_TRUE( QTest::qWaitFor( [this] { return !Manager().IsPlaying(); } ) );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
}

// Frames 7 and 8 are missing: a gap shows the last frame before it, darkened while paused.
TEST_F( VideoWindow, SeekingStepsStopAndGapsMoveTheFrame )
{
  VRecordingSpec Spec;
  Spec.Frames = FramesWithout( 10, { 7, 8 } );
  ASSERT_TRUE( Open( Recording( "seek.lvid", Spec ) ) );
  const QImage PauseButton = PlayButton()->grab().toImage();
  Key( Qt::Key_Space );
  ASSERT_FALSE( Manager().IsPlaying() );
  EXPECT_EQ( Action( EAction::Play )->text(), "Play" );
  // The button's picture follows its new name.
  EXPECT_NE( PlayButton()->grab().toImage(), PauseButton );

  TypeFrame( 4 );
  EXPECT_EQ( Frame(), 4u );
  EXPECT_EQ( Timebar()->value(), 4 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 4 );
  Key( Qt::Key_Right );
  Key( Qt::Key_Right );
  EXPECT_EQ( Frame(), 6u );
  EXPECT_EQ( SpinBox()->value(), 6 );
  Key( Qt::Key_Left );
  EXPECT_EQ( Frame(), 5u );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 5 );
  SendWheel( m_pWindow.get(), 120 );
  EXPECT_EQ( Frame(), 6u );
  SendWheel( m_pWindow.get(), -120 );
  SendWheel( m_pWindow.get(), -120 );
  EXPECT_EQ( Frame(), 4u );

  TypeFrame( 8 );
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 6 );
  // The warning darkens the last good picture to half.
  EXPECT_NEAR( ShownLevel(), FrameLevel( 6 ) / 2, 6 );
  TypeFrame( 9 );
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 9 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 9 );

  // Stop goes back to frame 0, and play goes on from there.
  PlayButton()->click();
  EXPECT_TRUE( Manager().IsPlaying() );
  EXPECT_EQ( PlayButton()->grab().toImage(), PauseButton );
  // Stepping while playing would fight the clock.
  EXPECT_FALSE( Action( EAction::PreviousFrame )->isEnabled() );
  Child< QPushButton >( "Stop" )->click();
  EXPECT_FALSE( Manager().IsPlaying() );
  EXPECT_EQ( Frame(), 0u );
  EXPECT_EQ( Timebar()->value(), 0 );
  EXPECT_EQ( SpinBox()->value(), 0 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
  PlayButton()->click();
  EXPECT_TRUE( QTest::qWaitFor( [this] { return Frame() >= 1; } ) );
  EXPECT_LT( Frame(), 9u );
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

  QString Shown;
  VDialogCloser< QMessageBox > Closer(
      [&]( QMessageBox* i_pBox )
      {
        Shown = i_pBox->windowTitle() + ": " + i_pBox->text();
        EXPECT_EQ( i_pBox->standardButtons(), QMessageBox::Ok );
      } );
  EXPECT_FALSE( m_pWindow->OpenFile( WriteFile( "bad.lvid", QByteArray( 5000, '\x5a' ) ) ) );
  EXPECT_EQ( Closer.GetCount(), 1 );
  EXPECT_EQ( Shown, "Invalid file: The video file could not be opened." );
  ExpectNoFileState();
  EXPECT_FALSE( Manager().IsPlaying() );

  // A name no reader takes, and a file that is not there, end the same way.
  EXPECT_FALSE( m_pWindow->OpenFile( m_Dir.filePath( "notes.txt" ) ) );
  EXPECT_FALSE( m_pWindow->OpenFile( m_Dir.filePath( "absent.lvid" ) ) );
  EXPECT_EQ( Closer.GetCount(), 3 );
  ExpectNoFileState();

  // Cut in the header, in the first frames, and just before the end.
  for( int Cut : { 16, 100, Bytes.size() / 2, Bytes.size() - 8 } )
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
  EXPECT_FALSE( pLens->isEnabled() || pLens->isChecked() );

  VRecordingSpec Spec;
  Spec.bLens = Spec.bCamera = true;
  const std::string Lens = Recording( "lens.lvid", Spec );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_TRUE( pLens->isEnabled() && pLens->isChecked() );

  pLens->setChecked( false );
  ASSERT_TRUE( Open( Recording( "plain2.lvid" ) ) );
  EXPECT_FALSE( m_pWindow->GetLensCorrectionWanted() );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_FALSE( pLens->isChecked() );
}

// A first start shows "Full Screen" checked while the window is normal: the first F only
// unchecks it, and the second goes to full screen. There the menu bar is hidden, and the window's
// own copies of the actions keep every key.
TEST_F( VideoWindow, FullScreenKeepsEveryKeyAndTheStoredMismatch )
{
  ASSERT_TRUE( Open( Recording( "keys.lvid" ) ) );
  QAction* pFull = Action( EAction::FullScreen );
  EXPECT_TRUE( pFull->isChecked() );
  EXPECT_FALSE( IsFull() );
  Key( Qt::Key_F );
  EXPECT_FALSE( pFull->isChecked() || IsFull() );

  // The menu bar is the window's own, in the central layout; QMainWindow keeps a hidden one.
  Key( Qt::Key_F );
  EXPECT_TRUE( IsFull() );
  EXPECT_TRUE( Hidden( "MenuBar" ) && Hidden( "Logo" ) );
  EXPECT_FALSE( Hidden( "Controls" ) );
  Key( Qt::Key_L );
  EXPECT_FALSE( Action( EAction::Looping )->isChecked() );
  Key( Qt::Key_S );
  EXPECT_FALSE( Manager().GetDropFrame() );
  Key( Qt::Key_C );
  Key( Qt::Key_I );
  EXPECT_TRUE( Hidden( "Controls" ) && Hidden( "InfoPanel" ) );
  Key( Qt::Key_Space );
  EXPECT_FALSE( Manager().IsPlaying() );
  TypeFrame( 0 );
  Key( Qt::Key_Right );
  EXPECT_EQ( Frame(), 1u );
  Key( Qt::Key_P );
  EXPECT_TRUE( m_pWindow->GetPropertiesDialog()->isVisible() );
  m_pWindow->GetPropertiesDialog()->hide();
  Key( Qt::Key_C );
  Key( Qt::Key_I );
  EXPECT_FALSE( Hidden( "Controls" ) || Hidden( "InfoPanel" ) );

  Key( Qt::Key_Escape );
  EXPECT_FALSE( IsFull() );
  EXPECT_FALSE( Hidden( "MenuBar" ) || Hidden( "Logo" ) );
  Key( Qt::Key_Escape );
  EXPECT_FALSE( pFull->isChecked() );

  Key( Qt::Key_F5 );
  EXPECT_TRUE( IsFull() );
  Key( Qt::Key_F5 );
  EXPECT_TRUE( pFull->isChecked() && IsFull() );

  // A double click on the picture toggles the same action, and so does the button.
  for( bool bFull : { false, true } )
  {
    SendMouse( m_pWindow->GetGLWidget(), QEvent::MouseButtonDblClick, { 20, 20 }, Qt::LeftButton );
    EXPECT_EQ( IsFull(), bFull );
  }
  QTest::mouseClick( Child< QWidget >( "FullScreen" ), Qt::LeftButton );
  EXPECT_FALSE( IsFull() );
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
  auto ExpectMode = [&]( EAction i_Menu, EScaleMode i_Mode )
  {
    EXPECT_EQ( pSurface->GetScaleMode(), i_Mode );
    EXPECT_TRUE( Action( i_Menu )->isChecked() );
    // Only the window's fit to the video fixes the size.
    EXPECT_EQ( m_pWindow->minimumSize() == m_pWindow->maximumSize(), i_Mode == ScaleWindowToVideo );
  };
  const std::pair< EAction, EScaleMode > Modes[] = { { EAction::ScaleFreely, ScaleFreely },
                                                     { EAction::ScaleOneToOne, ScaleOneToOne },
                                                     { EAction::ScaleToWindow, ScaleToWindow } };
  for( const auto& [Menu, Mode] : Modes )
  {
    Action( Menu )->trigger();
    ExpectMode( Menu, Mode );
  }

  // Dragging the picture frees the scale, and the menu follows.
  SendMouse( pSurface, QEvent::MouseButtonPress, { 100, 100 }, Qt::LeftButton );
  SendMouse( pSurface, QEvent::MouseMove, { 140, 110 }, Qt::LeftButton );
  SendMouse( pSurface, QEvent::MouseButtonRelease, { 140, 110 }, Qt::NoButton );
  ExpectMode( EAction::ScaleFreely, ScaleFreely );
  EXPECT_FALSE( Action( EAction::ScaleToWindow )->isChecked() );

  // Leaving the fixed size adds the maximise button; the close and minimise buttons must stay.
  for( Qt::WindowType Hint : { Qt::WindowMaximizeButtonHint, Qt::WindowCloseButtonHint, Qt::WindowMinimizeButtonHint } )
    EXPECT_TRUE( m_pWindow->windowFlags().testFlag( Hint ) ) << Hint;

  Action( EAction::ScaleWindowToVideo )->trigger();
  ExpectMode( EAction::ScaleWindowToVideo, ScaleWindowToVideo );
  Key( Qt::Key_F ); // unchecks the stored state
  Key( Qt::Key_F );
  ExpectMode( EAction::ScaleOneToOne, ScaleOneToOne );
  Key( Qt::Key_Escape );

  // A new file starts from the window's fit again.
  ASSERT_TRUE( Open( Recording( "scale2.lvid", Spec ) ) );
  ExpectMode( EAction::ScaleToWindow, ScaleToWindow );
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
  EXPECT_TRUE( Hidden( "Controls" ) );
  EXPECT_FALSE( Hidden( "InfoPanel" ) );
  EXPECT_FALSE( Action( EAction::FullScreen )->isChecked() );

  // Without looping the end stops playback: the second window really loaded the value.
  ASSERT_TRUE( Open( Recording( "restart.lvid" ) ) );
  EXPECT_TRUE( m_pWindow->GetGLWidget()->GetDecoderName().contains( "Software" ) );
  EXPECT_TRUE( QTest::qWaitFor( [this] { return !Manager().IsPlaying(); } ) );

  // A stored full screen is a checked action on a normal window.
  Key( Qt::Key_F );
  ASSERT_TRUE( Action( EAction::FullScreen )->isChecked() );
  NewWindow();
  EXPECT_TRUE( Action( EAction::FullScreen )->isChecked() );
  EXPECT_FALSE( IsFull() );
}

// The documentation of this release, its version, an answer to the user's update check even with
// no server to ask (the error dialog), and the legal page with the theme and every licence.
TEST_F( VideoWindow, TheHelpMenuAnswersEveryEntry )
{
  VUrlCatcher Catcher;
  QDesktopServices::setUrlHandler( "https", &Catcher, "Open" );
  Action( EAction::ViewHelp )->trigger();
  QDesktopServices::unsetUrlHandler( "https" );
  ASSERT_EQ( Catcher.Urls.size(), 1 );
  EXPECT_EQ( Catcher.Urls.front().path(), "/display/LVV110/" );

  QString VersionLine, UpdateText, Title, Errors;
  QQuickWidget::Status Status = QQuickWidget::Null;
  VDialogCloser< QDialog > Closer(
      [&]( QDialog* i_pDialog )
      {
        if( QLabel* pLabel = i_pDialog->findChild< QLabel* >( "VersionLine" ) )
          VersionLine = pLabel->text();
        if( QTextBrowser* pBrowser = i_pDialog->findChild< QTextBrowser* >() )
          UpdateText = pBrowser->toPlainText();
        if( auto* pLegal = qobject_cast< VLegalDialog* >( i_pDialog ) )
        {
          QQuickWidget* pPage = pLegal->GetQuickWidget();
          Status = pPage->status();
          for( const QQmlError& rError : pPage->errors() )
            Errors += rError.toString() + "\n";
          if( QObject* pTitle =
                  pPage->rootObject() ? pPage->rootObject()->findChild< QObject* >( "ComponentTitle" ) : nullptr )
            Title = pTitle->property( "text" ).toString();
        }
      } );
  Action( EAction::About )->trigger();
  EXPECT_EQ( Closer.GetCount(), 1 );
  EXPECT_EQ( VersionLine, "Lumek Video Viewer 1.10.0.137509h  x64" );
  Action( EAction::CheckForUpdates )->trigger();
  EXPECT_TRUE( QTest::qWaitFor( [&] { return Closer.GetCount() == 2; } ) );
  EXPECT_TRUE( UpdateText.contains( "Unable to contact version check server." ) ) << UpdateText.toStdString();
  Action( EAction::Licenses )->trigger();
  EXPECT_EQ( Closer.GetCount(), 3 );
  EXPECT_EQ( Status, QQuickWidget::Ready ) << Errors.toStdString();
  EXPECT_TRUE( Title.startsWith( "Qt 5" ) ) << Title.toStdString();

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
  EXPECT_EQ( Names.join( ", " ), "Qt 5, Boost, libebml, libmatroska, libjpeg-turbo, OpenH264, ImageMagick, RapidXml" );
}

// The viewer must come up with a good file and with a bad one, under the test's own X server, and
// neither crash nor block the test. The "Invalid file" dialog waits for a click that never comes:
// that process stays up too, and the kill ends it.
TEST( ViewerProcess, StartsOnAGoodFileAndOnABadOne )
{
  QTemporaryDir Dir;
  ASSERT_TRUE( Dir.isValid() );
  const QString Files[2] = { QString::fromStdString( WriteRecording( Dir.filePath( "good.lvid" ).toStdString(), {} ) ),
                             Dir.filePath( "bad.lvid" ) };
  QFile Bad( Files[1] );
  ASSERT_TRUE( !Files[0].isEmpty() && Bad.open( QIODevice::WriteOnly ) );
  Bad.write( "not a recording" );
  Bad.close();

  QProcess Viewers[2];
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
