// Opening, playing, seeking and failing, on the real window with generated recordings.

#include "tests/app/Window/WindowTestSupport.h"

#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VEditSlider.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Window/VPropertiesDialog.h"
#include "app/Window/VVideoSettingsDialog.h"

#include <QAction>
#include <QDragEnterEvent>
#include <QDropEvent>
#include <QFile>
#include <QGroupBox>
#include <QLineEdit>
#include <QMessageBox>
#include <QMimeData>
#include <QPushButton>
#include <QTableWidget>
#include <QUrl>

using namespace LumekVideoViewer;
using namespace WindowTest;

namespace
{
  class VideoWindow : public WindowFixture
  {
  protected:
    VLabelSlider* Timebar() const { return Child< VLabelSlider >( "Timebar" ); }
    QSpinBox* SpinBox() const { return m_pWindow->findChild< VClickSpinBox* >(); }
    QPushButton* PlayButton() const
    {
      QPushButton* pButton = Child< QPushButton >( "Play" );
      return pButton ? pButton : Child< QPushButton >( "Pause" );
    }

    // As a user typing into the box: the plain QSpinBox::setValue tells the connected slots.
    void TypeFrame( int i_Frame ) { SpinBox()->QSpinBox::setValue( i_Frame ); }

    void ExpectNoFileState()
    {
      EXPECT_EQ( m_pWindow->windowTitle(), "Lumek Video Viewer" );
      EXPECT_EQ( Label( "TimecodeLabel" ), "No file open" );
      EXPECT_EQ( Label( "VideoLabel" ), "" );
      EXPECT_EQ( Label( "DecoderLabel" ), "" );
      EXPECT_FALSE( Timebar()->isEnabled() );
      EXPECT_EQ( Timebar()->maximum(), 100 );
      EXPECT_EQ( Timebar()->value(), 0 );
      EXPECT_FALSE( SpinBox()->isEnabled() );
      EXPECT_FALSE( PlayButton()->isEnabled() );
      EXPECT_FALSE( Action( EAction::Play )->isEnabled() );
      EXPECT_FALSE( m_pWindow->GetVideoSettingsDialog()->GetRevertButton()->isEnabled() );
      EXPECT_EQ( m_pWindow->GetPropertiesDialog()->GetTable()->rowCount(), 0 );
    }

    void Drop( const QList< QUrl >& i_rUrls )
    {
      QMimeData Data;
      Data.setUrls( i_rUrls );
      QDragEnterEvent Enter( QPoint( 10, 10 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
      QApplication::sendEvent( m_pWindow.get(), &Enter );
      EXPECT_TRUE( Enter.isAccepted() );
      QDropEvent Drop( QPointF( 10, 10 ), Qt::CopyAction, &Data, Qt::LeftButton, Qt::NoModifier );
      QApplication::sendEvent( m_pWindow.get(), &Drop );
    }
  };
} // namespace

TEST_F( VideoWindow, StartsWithNoFile )
{
  ExpectNoFileState();
}

TEST_F( VideoWindow, OpenShowsTheFirstFrameAndDescribesTheFile )
{
  VRecordingSpec Spec;
  Spec.Missing = { 4, 5 };
  const std::string Path = Recording( "first take.lvid", Spec );
  ASSERT_FALSE( Path.empty() );
  ASSERT_TRUE( Open( Path ) );

  // Nothing has ticked yet: this is the open's own frame.
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 0 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
  EXPECT_EQ( m_pWindow->windowTitle(), "first take.lvid - Lumek Video Viewer" );
  EXPECT_EQ( Label( "VideoLabel" ), "V: 16 x 8 / Luminance8 / 25.00Hz / 10 frames (2 missing) / 0.40s" );
  EXPECT_TRUE( Label( "TimecodeLabel" ).startsWith( "T: " ) ) << Label( "TimecodeLabel" ).toStdString();
  EXPECT_TRUE( Label( "DecoderLabel" ).contains( " @ " ) ) << Label( "DecoderLabel" ).toStdString();
  EXPECT_TRUE( Child< QLabel >( "AudioLabel" )->isHidden() );

  EXPECT_EQ( Timebar()->minimum(), 0 );
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
  EXPECT_TRUE( m_pWindow->GetVideoSettingsDialog()->isHidden() );
  EXPECT_FALSE( m_pWindow->GetVideoSettingsDialog()->GetRevertButton()->isEnabled() );

  QTableWidget* pTable = m_pWindow->GetPropertiesDialog()->GetTable();
  EXPECT_GT( pTable->rowCount(), 0 );
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
  const bool bWrapped = WaitFor(
      [&]
      {
        const int Frame = static_cast< int >( Manager().GetCurrentFrame() );
        Highest = std::max( Highest, Frame );
        return Highest >= 8 && Frame < 4;
      } );
  EXPECT_TRUE( bWrapped );
  EXPECT_TRUE( Manager().IsPlaying() );

  Action( EAction::Looping )->setChecked( false );
  ASSERT_TRUE( WaitFor( [this] { return !Manager().IsPlaying(); } ) );
  EXPECT_EQ( Manager().GetCurrentFrame(), 0u );
  EXPECT_EQ( Timebar()->value(), 9 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 9 );
  EXPECT_EQ( PlayButton()->objectName(), "Play" );
  EXPECT_TRUE( Action( EAction::NextFrame )->isEnabled() );
}

TEST_F( VideoWindow, ASingleFrameRecordingPlaysToItsEnd )
{
  VRecordingSpec Spec;
  Spec.Frames = 1;
  ASSERT_TRUE( Open( Recording( "still.lvid", Spec ) ) );
  EXPECT_EQ( Timebar()->maximum(), 0 );
  EXPECT_NEAR( Timebar()->tickInterval(), Timebar()->width(), 3 );
  EXPECT_EQ( SpinBox()->maximum(), 0 );

  // The clock runs past the only frame; the picture stays on it.
  Action( EAction::Looping )->setChecked( false );
  ASSERT_TRUE( WaitFor( [this] { return !Manager().IsPlaying(); } ) );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 0 );
}

TEST_F( VideoWindow, StopShowsFrameZeroAndPlayGoesOnFromThere )
{
  ASSERT_TRUE( Open( Recording( "stop.lvid" ) ) );
  Pause();
  TypeFrame( 6 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 6 );

  PlayButton()->click();
  EXPECT_TRUE( Manager().IsPlaying() );
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

TEST_F( VideoWindow, SeekingStepsAndTheWheelMoveTheFrame )
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

  QWheelEvent Up( QPointF( 50, 50 ), QPointF( 50, 50 ), QPoint(), QPoint( 0, 120 ), Qt::NoButton, Qt::NoModifier,
                  Qt::NoScrollPhase, false );
  QApplication::sendEvent( m_pWindow.get(), &Up );
  EXPECT_EQ( Manager().GetCurrentFrame(), 6u );
  QWheelEvent Down( QPointF( 50, 50 ), QPointF( 50, 50 ), QPoint(), QPoint( 0, -120 ), Qt::NoButton, Qt::NoModifier,
                    Qt::NoScrollPhase, false );
  QApplication::sendEvent( m_pWindow.get(), &Down );
  QApplication::sendEvent( m_pWindow.get(), &Down );
  EXPECT_EQ( Manager().GetCurrentFrame(), 4u );

  // Stepping while playing would fight the clock.
  Key( Qt::Key_Space );
  EXPECT_FALSE( Action( EAction::PreviousFrame )->isEnabled() );
}

TEST_F( VideoWindow, AMissingFrameShowsTheEarlierOneAndWarnsWhenPaused )
{
  VRecordingSpec Spec;
  Spec.Missing = { 3, 4 };
  ASSERT_TRUE( Open( Recording( "gaps.lvid", Spec ) ) );
  Pause();

  TypeFrame( 4 );
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 2 );
  // The warning darkens the last good picture to half.
  const int Expected = FrameLevel( 2 ) / 2;
  EXPECT_NEAR( ShownLevel(), Expected, 6 );

  TypeFrame( 5 );
  EXPECT_EQ( m_pWindow->GetShownFrameIndex(), 5 );
  EXPECT_EQ( FrameForLevel( ShownLevel() ), 5 );
}

TEST_F( VideoWindow, ABadFileGetsTheInvalidFileDialogAndLeavesNoFile )
{
  ASSERT_TRUE( Open( Recording( "good.lvid" ) ) );

  const QString Bad = m_Dir.filePath( "bad.lvid" );
  {
    QFile File( Bad );
    ASSERT_TRUE( File.open( QIODevice::WriteOnly ) );
    File.write( QByteArray( 5000, '\x5a' ) );
  }
  QString Title, Text;
  VDialogCloser< QMessageBox > Closer(
      [&]( QMessageBox* i_pBox )
      {
        Title = i_pBox->windowTitle();
        Text = i_pBox->text();
        EXPECT_EQ( i_pBox->standardButtons(), QMessageBox::Ok );
      } );
  EXPECT_FALSE( m_pWindow->OpenFile( Bad ) );
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
}

TEST_F( VideoWindow, TruncatedRecordingsNeverCrashTheWindow )
{
  const std::string Good = Recording( "whole.lvid" );
  QFile Source( QString::fromStdString( Good ) );
  ASSERT_TRUE( Source.open( QIODevice::ReadOnly ) );
  const QByteArray Bytes = Source.readAll();
  VDialogCloser< QMessageBox > Closer;
  for( int Cut : { 0, 16, 100, Bytes.size() / 3, Bytes.size() / 2, Bytes.size() - 8 } )
  {
    SCOPED_TRACE( Cut );
    const QString Path = m_Dir.filePath( QString( "cut%1.lvid" ).arg( Cut ) );
    QFile File( Path );
    ASSERT_TRUE( File.open( QIODevice::WriteOnly ) );
    File.write( Bytes.left( Cut ) );
    File.close();
    if( m_pWindow->OpenFile( Path ) )
    {
      // Whatever survived must play through without a fault.
      QTest::qWait( 100 );
      m_pWindow->Stop();
    }
    else
      ExpectNoFileState();
  }
}

TEST_F( VideoWindow, DroppingOpensTheFirstLocalFileOnly )
{
  const QString First = QString::fromStdString( Recording( "dropped.lvid" ) );
  const QString Second = QString::fromStdString( Recording( "second.lvid" ) );
  Drop( { QUrl::fromLocalFile( First ) } );
  EXPECT_EQ( m_pWindow->windowTitle(), "dropped.lvid - Lumek Video Viewer" );

  Drop( { QUrl::fromLocalFile( Second ), QUrl::fromLocalFile( First ) } );
  EXPECT_EQ( m_pWindow->windowTitle(), "second.lvid - Lumek Video Viewer" );

  Drop( { QUrl( "https://example.com/clip.lvid" ), QUrl::fromLocalFile( First ) } );
  EXPECT_EQ( m_pWindow->windowTitle(), "second.lvid - Lumek Video Viewer" );
  EXPECT_TRUE( Manager().IsPlaying() );
}

TEST_F( VideoWindow, DisplaySettingsChangeABayerPictureLive )
{
  ASSERT_TRUE( Open( Recording( "grey.lvid" ) ) );
  EXPECT_FALSE( m_pWindow->GetVideoSettingsDialog()->GetRevertButton()->isEnabled() );

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
  Spec.bLens = true;
  const std::string Lens = Recording( "lens.lvid", Spec );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_TRUE( pLens->isEnabled() );
  EXPECT_TRUE( pLens->isChecked() );

  pLens->setChecked( false );
  EXPECT_FALSE( m_pWindow->GetLensCorrectionWanted() );
  ASSERT_TRUE( Open( Recording( "plain2.lvid" ) ) );
  EXPECT_FALSE( m_pWindow->GetLensCorrectionWanted() );
  ASSERT_TRUE( Open( Lens ) );
  EXPECT_FALSE( pLens->isChecked() );
}
