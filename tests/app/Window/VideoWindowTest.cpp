// The real window under an X server, with generated recordings: opening, playing, seeking and
// failing, full screen, scale modes, keys, stored settings and the Help menu. Each test gets a
// fresh window on an empty settings store.

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
#include <QDropEvent>
#include <QLabel>
#include <QLineEdit>
#include <QMessageBox>
#include <QMimeData>
#include <QPushButton>
#include <QQuickItem>
#include <QQuickWidget>
#include <QSettings>
#include <QTableWidget>
#include <QTemporaryDir>
#include <QTest>
#include <QTextBrowser>
#include <QTimer>

#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <memory>

using namespace AppTest;
using namespace LumekVideoViewer;

namespace
{
  // Closes every modal dialog that appears, with its done(), after showing it to Inspect; the
  // dialog's own event loop would otherwise hold the test forever.
  struct VDialogCloser
  {
    explicit VDialogCloser( std::function< void( QDialog* ) > i_Inspect )
    {
      QObject::connect( &Timer, &QTimer::timeout,
                        [this, i_Inspect]
                        {
                          if( auto* pDialog = qobject_cast< QDialog* >( QApplication::activeModalWidget() ) )
                          {
                            ++Count;
                            i_Inspect( pDialog );
                            pDialog->done( 0 );
                          }
                        } );
      Timer.start( 20 );
    }
    QTimer Timer;
    int Count = 0;
  };

  void SendMouse( QWidget* i_pWidget, QEvent::Type i_Type, QPointF i_Point, Qt::MouseButtons i_Buttons )
  {
    const Qt::MouseButton Button = i_Type == QEvent::MouseMove ? Qt::NoButton : Qt::LeftButton;
    QMouseEvent Event( i_Type, i_Point, Button, i_Buttons, Qt::NoModifier );
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

    std::string Recording( const QString& i_rName, const VRecordingSpec& i_rSpec = VRecordingSpec() )
    {
      return WriteRecording( m_Dir.filePath( i_rName ).toStdString(), i_rSpec );
    }
    bool Open( const std::string& i_rPath ) { return m_pWindow->OpenFile( QString::fromStdString( i_rPath ) ); }

    template < typename T = QWidget > T* Child( const char* i_pName ) const
    {
      return m_pWindow->findChild< T* >( i_pName );
    }
    QString Label( const char* i_pName ) const { return Child< QLabel >( i_pName )->text(); }
    bool Hidden( const char* i_pName ) const { return Child( i_pName )->isHidden(); }
    VPlayBackManager& Manager() const { return *m_pWindow->GetPlayBackManager(); }
    bool Playing() const { return Manager().IsPlaying(); }
    std::uint64_t Frame() const { return Manager().GetCurrentFrame(); }
    QAction* Action( EAction i_Action ) const { return m_pWindow->GetAction( i_Action ); }
    bool Checked( EAction i_Action ) const { return Action( i_Action )->isChecked(); }
    VLabelSlider* Timebar() const { return Child< VLabelSlider >( "Timebar" ); }
    QSpinBox* SpinBox() const { return m_pWindow->findChild< VClickSpinBox* >(); }
    QPushButton* PlayButton() const
    {
      QPushButton* pButton = Child< QPushButton >( "Play" );
      return pButton ? pButton : Child< QPushButton >( "Pause" );
    }
    bool IsFull() const { return m_pWindow->windowState().testFlag( Qt::WindowFullScreen ); }

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
      EXPECT_EQ( m_pWindow->windowTitle() + " | " + Label( "TimecodeLabel" ) + " | " + Label( "VideoLabel" ) +
                     Label( "DecoderLabel" ),
                 "Lumek Video Viewer | No file open | " );
      EXPECT_TRUE( Hidden( "AudioLabel" ) );
      EXPECT_EQ( std::make_pair( Timebar()->maximum(), Timebar()->value() ), std::make_pair( 100, 0 ) );
      EXPECT_FALSE( Timebar()->isEnabled() || SpinBox()->isEnabled() || PlayButton()->isEnabled() ||
                    Action( EAction::Play )->isEnabled() );
      EXPECT_FALSE( m_pWindow->GetVideoSettingsDialog()->GetRevertButton()->isEnabled() || Playing() );
      EXPECT_EQ( m_pWindow->GetPropertiesDialog()->GetTable()->rowCount(), 0 );
    }

    QTemporaryDir m_Dir;
    std::unique_ptr< VVideoWindow > m_pWindow;
  };
} // namespace

// The open's own frame and the panel's texts; looping by default, then a walk by keys, the box,
// the wheel and the buttons. Frames 4 and 7 are missing: a gap shows the last frame before it,
// darkened while paused. Closing empties the window again.
TEST_F( VideoWindow, OpenPlayLoopPauseStepSeekStopAndClose )
{
  ExpectNoFileState();
  VRecordingSpec Spec;
  Spec.Frames = FramesWithout( 10, { 4, 7 } );
  ASSERT_TRUE( Open( Recording( "first take.lvid", Spec ) ) );
  // Nothing has ticked yet: this is the open's own frame.
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
  EXPECT_EQ( m_pWindow->windowTitle(), "first take.lvid - Lumek Video Viewer" );
  EXPECT_EQ( Label( "VideoLabel" ), "V: 16 x 8 / Luminance8 / 25.00Hz / 10 frames (2 missing) / 0.40s" );
  EXPECT_TRUE( Label( "TimecodeLabel" ).startsWith( "T: " ) ) << Label( "TimecodeLabel" ).toStdString();
  EXPECT_TRUE( Label( "DecoderLabel" ).contains( " @ " ) ) << Label( "DecoderLabel" ).toStdString();
  EXPECT_EQ( std::make_pair( Timebar()->maximum(), SpinBox()->maximum() ), std::make_pair( 9, 9 ) );
  // Taken from the bar's width at the open, before the labels settled the layout.
  EXPECT_NEAR( Timebar()->tickInterval(), Timebar()->width() / 10, 3 );
  QTableWidget* pTable = m_pWindow->GetPropertiesDialog()->GetTable();
  EXPECT_FALSE( pTable->findItems( "Recording.Description", Qt::MatchExactly ).isEmpty() );
  EXPECT_FALSE( pTable->item( 0, 1 )->flags() & Qt::ItemIsEditable );

  // Playback starts by itself at every open; stepping while playing would fight the clock.
  EXPECT_TRUE( Playing() );
  EXPECT_EQ( PlayButton()->objectName() + ", " + PlayButton()->toolTip(), "Pause, Pause video" );
  EXPECT_EQ( Action( EAction::Play )->text(), "Pause" );
  EXPECT_FALSE( Action( EAction::NextFrame )->isEnabled() || Action( EAction::PreviousFrame )->isEnabled() );
  std::uint64_t Highest = 0;
  EXPECT_TRUE( QTest::qWaitFor( [&] { return ( Highest = std::max( Highest, Frame() ) ) >= 8 && Frame() < 4; } ) );
  const QImage PauseButton = PlayButton()->grab().toImage();
  Key( Qt::Key_Space );
  ASSERT_FALSE( Playing() );
  EXPECT_EQ( Action( EAction::Play )->text(), "Play" );
  // The button's picture follows its new name.
  EXPECT_NE( PlayButton()->grab().toImage(), PauseButton );

  TypeFrame( 3 );
  EXPECT_EQ( std::make_pair( Frame(), Timebar()->value() ), std::make_pair( std::uint64_t( 3 ), 3 ) );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 3 );
  Key( Qt::Key_Right );
  Key( Qt::Key_Right );
  EXPECT_EQ( std::make_pair( Frame(), SpinBox()->value() ), std::make_pair( std::uint64_t( 5 ), 5 ) );
  Key( Qt::Key_Left );
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 3 );
  // The warning darkens the last good picture to half.
  EXPECT_NEAR( ShownLevel(), FrameLevel( 3 ) / 2, 6 );
  for( int Delta : { 120, 120, -120 } )
  {
    QWheelEvent Wheel( QPointF( 50, 50 ), QPointF( 50, 50 ), QPoint(), QPoint( 0, Delta ), Qt::NoButton, Qt::NoModifier,
                       Qt::NoScrollPhase, false );
    QApplication::sendEvent( m_pWindow.get(), &Wheel );
  }
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 5 );
  TypeFrame( 9 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 9 );

  // Stop goes back to frame 0, and play goes on from there.
  PlayButton()->click();
  EXPECT_EQ( PlayButton()->grab().toImage(), PauseButton );
  Child< QPushButton >( "Stop" )->click();
  EXPECT_FALSE( Playing() );
  EXPECT_EQ( std::make_pair( Timebar()->value(), SpinBox()->value() ), std::make_pair( 0, 0 ) );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
  PlayButton()->click();
  EXPECT_TRUE( QTest::qWaitFor( [this] { return Frame() >= 1; } ) );

  // Without looping, the end stops on the last picture and rewinds the clock.
  Action( EAction::Looping )->setChecked( false );
  ASSERT_TRUE( QTest::qWaitFor( [this] { return !Playing(); } ) );
  EXPECT_EQ( std::make_pair( Frame(), Timebar()->value() ), std::make_pair( std::uint64_t( 0 ), 9 ) );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 9 );
  EXPECT_EQ( PlayButton()->objectName(), "Play" );
  EXPECT_TRUE( Action( EAction::NextFrame )->isEnabled() );

  // A single frame: the clock runs past it, and the picture stays on it.
  VRecordingSpec Still;
  Still.Frames = { 0 };
  ASSERT_TRUE( Open( Recording( "still.lvid", Still ) ) );
  EXPECT_EQ( std::make_pair( Timebar()->maximum(), SpinBox()->maximum() ), std::make_pair( 0, 0 ) );
  ASSERT_TRUE( QTest::qWaitFor( [this] { return !Playing(); } ) );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );

  m_pWindow->CloseFile();
  ExpectNoFileState();
  EXPECT_EQ( pTable->horizontalHeaderItem( 0 )->text(), "Property" );
}

// Whatever cannot be opened ends in the "Invalid file" dialog and no file. A drop opens the first
// local file only.
TEST_F( VideoWindow, BadFilesGetTheInvalidFileDialogAndDropsOpenTheFirstLocalFile )
{
  const std::string Good = Recording( "good.lvid" );
  const QString Bad = m_Dir.filePath( "bad.lvid" );
  std::ofstream( Bad.toStdString() ) << std::string( 5000, 'Z' );
  ASSERT_TRUE( Open( Good ) );

  QString Shown;
  VDialogCloser Closer(
      [&]( QDialog* i_pDialog )
      { Shown = i_pDialog->windowTitle() + ": " + qobject_cast< QMessageBox* >( i_pDialog )->text(); } );
  EXPECT_FALSE( m_pWindow->OpenFile( Bad ) );
  EXPECT_EQ( Closer.Count, 1 );
  EXPECT_EQ( Shown, "Invalid file: The video file could not be opened." );
  ExpectNoFileState();
  // A name no reader takes, and a file that is not there, end the same way.
  EXPECT_FALSE( m_pWindow->OpenFile( m_Dir.filePath( "notes.txt" ) ) );
  EXPECT_FALSE( m_pWindow->OpenFile( m_Dir.filePath( "absent.lvid" ) ) );
  EXPECT_EQ( Closer.Count, 3 );
  ExpectNoFileState();

  const QUrl First = QUrl::fromLocalFile( QString::fromStdString( Good ) );
  const QUrl Second = QUrl::fromLocalFile( QString::fromStdString( Recording( "second.lvid" ) ) );
  const std::pair< QList< QUrl >, const char* > Drops[] = {
      { { First }, "good.lvid" },
      { { Second, First }, "second.lvid" },
      { { QUrl( "https://example.com/clip.lvid" ), First }, "second.lvid" } };
  for( const auto& [Urls, Title] : Drops )
  {
    QMimeData Data;
    Data.setUrls( Urls );
    QDragEnterEvent Enter( QPoint( 10, 10 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
    QApplication::sendEvent( m_pWindow.get(), &Enter );
    EXPECT_TRUE( Enter.isAccepted() );
    QDropEvent Drop( QPointF( 10, 10 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
    QApplication::sendEvent( m_pWindow.get(), &Drop );
    EXPECT_EQ( m_pWindow->windowTitle(), QString( Title ) + " - Lumek Video Viewer" );
  }
  EXPECT_TRUE( Playing() );
}

// The gamma of a Bayer picture changes what is shown at once; sound is described and plays with
// or without a device; the lens correction is offered by the file and keeps the user's wish.
TEST_F( VideoWindow, DisplaySettingsSoundAndLensCorrectionFollowTheFile )
{
  VRecordingSpec Spec;
  Spec.Format = ZOL::PixelFormat_BayerGB8;
  ASSERT_TRUE( Open( Recording( "bayer.lvid", Spec ) ) );
  m_pWindow->PlayPause();
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
  EXPECT_GT( std::abs( ShownLevel() - Before ), 10 );
  pDialog->GetRevertButton()->click();
  EXPECT_FLOAT_EQ( pDialog->GetVideoSettings().GammaCorrection, 1.0f );
  EXPECT_NEAR( ShownLevel(), Before, 2 );
  pDialog->hide();

  VRecordingSpec Sound;
  Sound.bAudio = true;
  ASSERT_TRUE( Open( Recording( "sound.lvid", Sound ) ) );
  EXPECT_EQ( Label( "AudioLabel" ), "A: 2 channels / Int16 / 48000Hz" );
  EXPECT_FALSE( Hidden( "AudioLabel" ) );
  // Every frame shown writes its block, to a device or to nowhere.
  EXPECT_TRUE( QTest::qWaitFor( [this] { return Frame() >= 5; } ) );
  m_pWindow->ReloadCurrentFrame();
  QAction* pLens = Action( EAction::CorrectRadialDistortion );
  EXPECT_FALSE( pLens->isEnabled() || pLens->isChecked() );

  VRecordingSpec LensSpec;
  LensSpec.bLens = LensSpec.bCamera = true;
  const std::string Lens = Recording( "lens.lvid", LensSpec );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_TRUE( Hidden( "AudioLabel" ) );
  EXPECT_TRUE( pLens->isEnabled() && pLens->isChecked() );
  pLens->setChecked( false );
  ASSERT_TRUE( Open( Recording( "plain.lvid" ) ) );
  EXPECT_FALSE( m_pWindow->GetLensCorrectionWanted() );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_FALSE( pLens->isChecked() );
}

// A first start shows "Full Screen" checked while the window is normal: the first F only
// unchecks it, and the second goes to full screen, where the window's own copies of the actions
// keep every key with the menu bar hidden. The scale follows the menu, a drag and full screen.
TEST_F( VideoWindow, FullScreenScaleModesKeysAndARestart )
{
  VRecordingSpec Spec;
  Spec.Width = 320;
  Spec.Height = 200;
  ASSERT_TRUE( Open( Recording( "scale.lvid", Spec ) ) );
  VGLWidget* pSurface = m_pWindow->GetGLWidget();
  auto ExpectMode = [&]( EAction i_Menu, EScaleMode i_Mode )
  {
    EXPECT_EQ( pSurface->GetScaleMode(), i_Mode );
    EXPECT_TRUE( Checked( i_Menu ) );
    // Only the window's fit to the video fixes the size.
    EXPECT_EQ( m_pWindow->minimumSize() == m_pWindow->maximumSize(), i_Mode == ScaleWindowToVideo );
  };
  ExpectMode( EAction::ScaleToWindow, ScaleToWindow );
  for( const auto& [Menu, Mode] : { std::pair( EAction::ScaleFreely, ScaleFreely ),
                                    { EAction::ScaleOneToOne, ScaleOneToOne },
                                    { EAction::ScaleToWindow, ScaleToWindow } } )
  {
    Action( Menu )->trigger();
    ExpectMode( Menu, Mode );
  }
  // Dragging the picture frees the scale, and the menu follows; the maximise button comes back
  // with the close and minimise buttons.
  SendMouse( pSurface, QEvent::MouseButtonPress, { 100, 100 }, Qt::LeftButton );
  SendMouse( pSurface, QEvent::MouseMove, { 140, 110 }, Qt::LeftButton );
  SendMouse( pSurface, QEvent::MouseButtonRelease, { 140, 110 }, Qt::NoButton );
  ExpectMode( EAction::ScaleFreely, ScaleFreely );
  for( Qt::WindowType Hint : { Qt::WindowMaximizeButtonHint, Qt::WindowCloseButtonHint, Qt::WindowMinimizeButtonHint } )
    EXPECT_TRUE( m_pWindow->windowFlags().testFlag( Hint ) ) << Hint;

  Action( EAction::ScaleWindowToVideo )->trigger();
  ExpectMode( EAction::ScaleWindowToVideo, ScaleWindowToVideo );
  EXPECT_TRUE( Checked( EAction::FullScreen ) );
  Key( Qt::Key_F );
  EXPECT_FALSE( Checked( EAction::FullScreen ) || IsFull() );
  Key( Qt::Key_F );
  EXPECT_TRUE( IsFull() );
  ExpectMode( EAction::ScaleOneToOne, ScaleOneToOne );
  // The menu bar is the window's own, in the central layout; QMainWindow keeps a hidden one.
  EXPECT_TRUE( Hidden( "MenuBar" ) && Hidden( "Logo" ) );
  for( int Toggle : { Qt::Key_L, Qt::Key_S, Qt::Key_C, Qt::Key_I, Qt::Key_Space, Qt::Key_P } )
    Key( Toggle );
  EXPECT_FALSE( Checked( EAction::Looping ) || Manager().GetDropFrame() || Playing() );
  EXPECT_TRUE( Hidden( "Controls" ) && Hidden( "InfoPanel" ) );
  EXPECT_TRUE( m_pWindow->GetPropertiesDialog()->isVisible() );
  m_pWindow->GetPropertiesDialog()->hide();
  TypeFrame( 0 );
  Key( Qt::Key_Right );
  EXPECT_EQ( Frame(), 1u );
  Key( Qt::Key_C );
  Key( Qt::Key_I );
  EXPECT_FALSE( Hidden( "Controls" ) || Hidden( "InfoPanel" ) );

  Key( Qt::Key_Escape );
  EXPECT_FALSE( IsFull() || Hidden( "MenuBar" ) || Hidden( "Logo" ) );
  Key( Qt::Key_F5 );
  EXPECT_TRUE( IsFull() );
  // A double click on the picture toggles the same action, and so does the button.
  SendMouse( pSurface, QEvent::MouseButtonDblClick, { 20, 20 }, Qt::LeftButton );
  EXPECT_FALSE( IsFull() );
  QTest::mouseClick( Child( "FullScreen" ), Qt::LeftButton );
  EXPECT_TRUE( IsFull() && Checked( EAction::FullScreen ) );

  // A new file starts from the window's fit again.
  ASSERT_TRUE( Open( Recording( "scale2.lvid", Spec ) ) );
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleToWindow );

  // What the keys left survives a restart, and a stored full screen is a checked action on a
  // normal window. Without looping the end stops playback: the new window really read the value.
  Action( EAction::SoftwareDecoder )->setChecked( true );
  Action( EAction::Controls )->setChecked( false );
  NewWindow();
  EXPECT_FALSE( Checked( EAction::Looping ) || Checked( EAction::SkipFrames ) || Checked( EAction::Controls ) ||
                Checked( EAction::HardwareDecoder ) || IsFull() );
  EXPECT_TRUE( Checked( EAction::SoftwareDecoder ) && Checked( EAction::FullScreen ) );
  EXPECT_TRUE( Hidden( "Controls" ) );
  EXPECT_FALSE( Hidden( "InfoPanel" ) );
  ASSERT_TRUE( Open( Recording( "restart.lvid" ) ) );
  EXPECT_TRUE( m_pWindow->GetGLWidget()->GetDecoderName().contains( "Software" ) );
  EXPECT_TRUE( QTest::qWaitFor( [this] { return !Playing(); } ) );
}

// This release's version, an answer to the user's update check even with no server to ask (the
// error dialog), and the legal page with the theme and every licence.
TEST_F( VideoWindow, TheHelpMenuAnswersEveryEntry )
{
  QString VersionLine, UpdateText, Title;
  QQuickWidget::Status Status = QQuickWidget::Null;
  VDialogCloser Closer(
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
          if( QObject* pTitle = pPage->rootObject()->findChild< QObject* >( "ComponentTitle" ) )
            Title = pTitle->property( "text" ).toString();
        }
      } );
  Action( EAction::About )->trigger();
  EXPECT_EQ( VersionLine, "Lumek Video Viewer 1.10.0.137509h  x64" );
  Action( EAction::CheckForUpdates )->trigger();
  EXPECT_TRUE( QTest::qWaitFor( [&] { return Closer.Count == 2; } ) );
  EXPECT_TRUE( UpdateText.contains( "Unable to contact version check server." ) ) << UpdateText.toStdString();
  Action( EAction::Licenses )->trigger();
  EXPECT_EQ( Closer.Count, 3 );
  EXPECT_EQ( Status, QQuickWidget::Ready );
  EXPECT_TRUE( Title.startsWith( "Qt 5" ) ) << Title.toStdString();

  // Every one of these licences names its holder and disclaims warranty; a text without it is cut.
  QStringList Names;
  for( const VLegalComponent& rComponent : LegalComponents() )
  {
    const QString Text = LicenceText( rComponent );
    EXPECT_TRUE( Text.size() > 800 && Text.contains( rComponent.Copyright ) &&
                 Text.contains( "warrant", Qt::CaseInsensitive ) )
        << rComponent.Name.toStdString();
    Names.append( rComponent.Name );
  }
  EXPECT_EQ( Names.join( ", " ), "Qt 5, Boost, libebml, libmatroska, libjpeg-turbo, OpenH264, ImageMagick, RapidXml" );
}
