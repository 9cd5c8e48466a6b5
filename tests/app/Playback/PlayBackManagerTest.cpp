// The playback clock under a scripted time source: each tick is called by hand, nothing sleeps.

#include "app/Playback/VPlayBackManager.h"
#include "app/VideoSource/VVideoSource.h"
#include "fileio/LumekVideo/VWriter.h"
#include "videointerface/AttributeRecords.h"

#include <boost/filesystem.hpp>

#include <QCoreApplication>

#include <gtest/gtest.h>

using LumekVideoViewer::VPlayBackManager;
using LumekVideoViewer::VVideoSource;

namespace
{
  // A recording of i_FrameCount tiny frames at i_FramesPerSecond, opened in a source.
  class VRecording
  {
  public:
    VRecording( std::uint64_t i_FrameCount, std::uint32_t i_FramePeriodInTicks )
        : m_Path(
              ( boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "playback-%%%%%%.lvid" ) )
                  .string() )
    {
      ZOL::IVideoFrameInfo Video;
      Video.ImageWidth = 2;
      Video.ImageHeight = 2;
      Video.PixelFormat = ZOL::PixelFormat_Luminance8;
      Video.PixelAspectRatio = 1.0;
      ZOL::IVideoAttributes Attributes;
      ZOL::IVideoTiming Timing;
      Timing.FramePeriodInTicks = i_FramePeriodInTicks;
      ZOL::WriteVideoTiming( Attributes, Timing );
      LumekVideo::VWriter Writer;
      EXPECT_TRUE( Writer.Create( m_Path, Video, ZOL::IAudioFrameInfo(), Attributes ) );
      const std::uint8_t Pixels[4] = {};
      for( std::uint64_t i = 0; i < i_FrameCount; ++i )
        EXPECT_TRUE( Writer.AppendFrame( i, Pixels, sizeof( Pixels ) ) );
      EXPECT_TRUE( Writer.Close() );
      EXPECT_TRUE( Source.Open( m_Path ) );
    }
    ~VRecording()
    {
      Source.Close();
      boost::filesystem::remove( m_Path );
    }

    VVideoSource Source;

  private:
    std::string m_Path;
  };

  constexpr std::uint32_t TicksAt( std::uint32_t i_FramesPerSecond )
  {
    return 135000000u / i_FramesPerSecond;
  }

  // A manager whose clock the test moves, with every signal recorded.
  struct VClockedManager
  {
    explicit VClockedManager( VVideoSource& i_rSource ) : Manager( &i_rSource, [this] { return Now; } )
    {
      QObject::connect( &Manager, &VPlayBackManager::FrameUpdated,
                        [this]( int i_Frame ) { Frames.push_back( i_Frame ); } );
      QObject::connect( &Manager, &VPlayBackManager::Stopped, [this] { ++StoppedCount; } );
      QObject::connect( &Manager, &VPlayBackManager::End, [this] { ++EndCount; } );
    }

    void TickAt( double i_Milliseconds )
    {
      Now = i_Milliseconds;
      Manager.PlayForward();
    }

    double Now = 0.0;
    VPlayBackManager Manager;
    std::vector< int > Frames;
    int StoppedCount = 0;
    int EndCount = 0;
  };
} // namespace

TEST( PlayBackManager, RoundsHalfAFrameAheadOfTheClock )
{
  VRecording Recording( 10, TicksAt( 10 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Start();
  Clock.TickAt( 49.0 );
  EXPECT_TRUE( Clock.Frames.empty() );
  Clock.TickAt( 50.0 ); // exactly one half stays on the lower frame
  EXPECT_TRUE( Clock.Frames.empty() );
  Clock.TickAt( 50.5 );
  EXPECT_EQ( Clock.Frames, std::vector< int >{ 1 } );
  Clock.TickAt( 100.0 ); // still frame 1: a tick that changes nothing emits nothing
  EXPECT_EQ( Clock.Frames, std::vector< int >{ 1 } );
}

TEST( PlayBackManager, EveryFrameOnceAtSteadyTicks )
{
  VRecording Recording( 50, TicksAt( 25 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Loop( false );
  Clock.Manager.Start();
  for( double t = 5.0; t <= 2100.0 && Clock.StoppedCount == 0; t += 5.0 )
    Clock.TickAt( t );
  std::vector< int > Expected;
  for( int i = 1; i <= 50; ++i )
    Expected.push_back( i ); // the clock reaches the frame count, which announces the end
  EXPECT_EQ( Clock.Frames, Expected );
  EXPECT_EQ( Clock.EndCount, 1 );
  EXPECT_EQ( Clock.StoppedCount, 1 );
  EXPECT_FALSE( Clock.Manager.IsPlaying() );
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
}

TEST( PlayBackManager, SingleFrameFileEndsAtTheNextTick )
{
  VRecording Recording( 1, TicksAt( 10 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Start();
  Clock.TickAt( 60.0 );
  EXPECT_EQ( Clock.Frames, std::vector< int >{ 1 } );
  EXPECT_EQ( Clock.EndCount, 0 );
  Clock.TickAt( 65.0 );
  EXPECT_EQ( Clock.EndCount, 1 );
  // Looping is the default: the end restarts at frame 0 without announcing it.
  EXPECT_TRUE( Clock.Manager.IsPlaying() );
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
  EXPECT_EQ( Clock.Frames, std::vector< int >{ 1 } );
  EXPECT_EQ( Clock.StoppedCount, 0 );
}

TEST( PlayBackManager, DroppingFramesJumpsAfterAStall )
{
  VRecording Recording( 100, TicksAt( 100 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Start();
  Clock.TickAt( 100.0 ); // a frame that took 100 ms at 100 fps
  EXPECT_EQ( Clock.Frames, std::vector< int >{ 10 } );
}

TEST( PlayBackManager, WithoutDroppingEveryFrameIsShownAfterAStall )
{
  VRecording Recording( 100, TicksAt( 100 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.SetDropFrame( false );
  EXPECT_FALSE( Clock.Manager.GetDropFrame() );
  Clock.Manager.Start();
  Clock.TickAt( 100.0 );
  for( int i = 1; i <= 12; ++i )
    Clock.TickAt( 100.0 + i * 5.0 );
  // One frame a tick until the position meets the clock (at 160 ms the clock says 16).
  std::vector< int > Expected;
  for( int i = 1; i <= 13; ++i )
    Expected.push_back( i );
  EXPECT_EQ( Clock.Frames, Expected );
}

TEST( PlayBackManager, PlayFrameMovesTheAnchorButNotTheTime )
{
  VRecording Recording( 100, TicksAt( 10 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Start();
  Clock.Manager.PlayFrame( 0 ); // the current frame: nothing announced
  EXPECT_TRUE( Clock.Frames.empty() );
  Clock.TickAt( 200.0 );
  EXPECT_EQ( Clock.Frames, std::vector< int >{ 2 } );
  Clock.Manager.PlayFrame( 40 );
  EXPECT_EQ( Clock.Frames, ( std::vector< int >{ 2, 40 } ) );
  // The elapsed 200 ms still count from the old start: the next tick lands 2 frames on.
  Clock.TickAt( 200.0 );
  EXPECT_EQ( Clock.Frames, ( std::vector< int >{ 2, 40, 42 } ) );
}

TEST( PlayBackManager, PauseAndStartContinueFromTheCurrentFrame )
{
  VRecording Recording( 100, TicksAt( 10 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Start();
  Clock.TickAt( 300.0 );
  Clock.Manager.Pause();
  EXPECT_FALSE( Clock.Manager.IsPlaying() );
  Clock.Now = 5000.0;
  Clock.Manager.Start();
  Clock.TickAt( 5100.0 );
  EXPECT_EQ( Clock.Frames, ( std::vector< int >{ 3, 4 } ) );
}

TEST( PlayBackManager, StopAnnouncesOnceAndResetIsSilent )
{
  VRecording Recording( 100, TicksAt( 10 ) );
  VClockedManager Clock( Recording.Source );
  int FrameSeenByStopped = -1;
  QObject::connect( &Clock.Manager, &VPlayBackManager::Stopped,
                    [&] { FrameSeenByStopped = static_cast< int >( Clock.Manager.GetCurrentFrame() ); } );
  Clock.Manager.Start();
  Clock.TickAt( 500.0 );
  Clock.Manager.Stop();
  EXPECT_EQ( Clock.StoppedCount, 1 );
  EXPECT_EQ( FrameSeenByStopped, 5 ); // listeners see the old position
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
  Clock.Manager.PlayFrame( 7 );
  Clock.Manager.Reset();
  EXPECT_EQ( Clock.StoppedCount, 1 );
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
}

TEST( PlayBackManager, ZeroFrameRateStaysOnItsFrame )
{
  VRecording Recording( 10, 0 );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Start();
  Clock.TickAt( 10000.0 );
  EXPECT_TRUE( Clock.Frames.empty() );
}

TEST( PlayBackManager, LoopingOffAfterOnStopsAtTheEnd )
{
  VRecording Recording( 2, TicksAt( 10 ) );
  VClockedManager Clock( Recording.Source );
  Clock.Manager.Loop( true ); // connected twice now, as at start-up
  Clock.Manager.Loop( false );
  Clock.Manager.Start();
  Clock.TickAt( 200.0 );
  Clock.TickAt( 205.0 );
  EXPECT_EQ( Clock.EndCount, 1 );
  EXPECT_EQ( Clock.StoppedCount, 1 );
  EXPECT_FALSE( Clock.Manager.IsPlaying() );
}

int main( int argc, char** argv )
{
  QCoreApplication Application( argc, argv );
  testing::InitGoogleTest( &argc, argv );
  return RUN_ALL_TESTS();
}
