// The playback clock under a scripted time source: each tick is called by hand, nothing sleeps.

#include "tests/app/AppTestSupport.h"

#include "app/Playback/VPlayBackManager.h"
#include "app/VideoSource/VVideoSource.h"

#include <QCoreApplication>

#include <gtest/gtest.h>

using LumekVideoViewer::VPlayBackManager;

namespace
{
  AppTest::VRecordingSpec Frames( std::uint64_t i_Count, std::uint32_t i_FramePeriodInTicks )
  {
    AppTest::VRecordingSpec Spec;
    Spec.Width = Spec.Height = 2;
    Spec.Frames = AppTest::FramesWithout( i_Count, {} );
    Spec.FramePeriodInTicks = i_FramePeriodInTicks;
    return Spec;
  }

  // A recording of i_Count frames at i_FramesPerSecond, and a manager whose clock the test moves,
  // with every signal recorded.
  struct VClock
  {
    VClock( std::uint64_t i_Count, double i_FramesPerSecond )
        : Recording( Frames( i_Count, i_FramesPerSecond > 0 ? AppTest::TicksAt( i_FramesPerSecond ) : 0 ) ),
          Manager( &Source, [this] { return Now; } )
    {
      EXPECT_TRUE( Source.Open( Recording.Path ) );
      QObject::connect( &Manager, &VPlayBackManager::FrameUpdated,
                        [this]( int i_Frame ) { Shown.push_back( i_Frame ); } );
      QObject::connect( &Manager, &VPlayBackManager::Stopped, [this] { ++Stopped; } );
      QObject::connect( &Manager, &VPlayBackManager::End, [this] { ++Ends; } );
    }

    void TickAt( double i_Milliseconds )
    {
      Now = i_Milliseconds;
      Manager.PlayForward();
    }

    AppTest::VTempRecording Recording;
    LumekVideoViewer::VVideoSource Source;
    double Now = 0.0;
    VPlayBackManager Manager;
    std::vector< int > Shown;
    int Stopped = 0;
    int Ends = 0;
  };

  std::vector< int > Range( int i_First, int i_Last )
  {
    std::vector< int > Frames;
    for( int i = i_First; i <= i_Last; ++i )
      Frames.push_back( i );
    return Frames;
  }
} // namespace

TEST( PlayBackManager, RoundsHalfAFrameAheadOfTheClock )
{
  VClock Clock( 10, 10 );
  Clock.Manager.Start();
  Clock.TickAt( 49.0 );
  Clock.TickAt( 50.0 ); // exactly one half stays on the lower frame
  EXPECT_TRUE( Clock.Shown.empty() );
  Clock.TickAt( 50.5 );
  Clock.TickAt( 100.0 ); // still frame 1: a tick that changes nothing emits nothing
  EXPECT_EQ( Clock.Shown, std::vector< int >{ 1 } );
}

TEST( PlayBackManager, EveryFrameOnceAtSteadyTicksAndLoopingOffStops )
{
  VClock Clock( 50, 25 );
  Clock.Manager.Loop( true ); // connected twice now, as at start-up
  Clock.Manager.Loop( false );
  Clock.Manager.Start();
  for( double t = 5.0; t <= 2100.0 && Clock.Stopped == 0; t += 5.0 )
    Clock.TickAt( t );
  EXPECT_EQ( Clock.Shown, Range( 1, 50 ) ); // the clock reaches the frame count, which announces the end
  EXPECT_EQ( Clock.Ends, 1 );
  EXPECT_EQ( Clock.Stopped, 1 );
  EXPECT_FALSE( Clock.Manager.IsPlaying() );
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
}

TEST( PlayBackManager, SingleFrameFileEndsAtTheNextTickAndLoops )
{
  VClock Clock( 1, 10 );
  Clock.Manager.Start();
  Clock.TickAt( 60.0 );
  EXPECT_EQ( Clock.Ends, 0 );
  Clock.TickAt( 65.0 );
  EXPECT_EQ( Clock.Ends, 1 );
  // Looping is the default: the end restarts at frame 0 without announcing it.
  EXPECT_TRUE( Clock.Manager.IsPlaying() );
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
  EXPECT_EQ( Clock.Shown, std::vector< int >{ 1 } );
  EXPECT_EQ( Clock.Stopped, 0 );
}

// A frame that took 100 ms at 100 fps: dropping jumps to the clock, otherwise one frame a tick
// until the position meets the clock (at 160 ms the clock says 16).
TEST( PlayBackManager, AStallIsSkippedOnlyWhenDroppingFrames )
{
  VClock Dropping( 100, 100 );
  Dropping.Manager.Start();
  Dropping.TickAt( 100.0 );
  EXPECT_EQ( Dropping.Shown, std::vector< int >{ 10 } );

  VClock Every( 100, 100 );
  Every.Manager.SetDropFrame( false );
  Every.Manager.Start();
  for( int i = 0; i <= 12; ++i )
    Every.TickAt( 100.0 + i * 5.0 );
  EXPECT_EQ( Every.Shown, Range( 1, 13 ) );
}

TEST( PlayBackManager, PlayFrameMovesTheAnchorButNotTheTime )
{
  VClock Clock( 100, 10 );
  Clock.Manager.Start();
  Clock.Manager.PlayFrame( 0 ); // the current frame: nothing announced
  EXPECT_TRUE( Clock.Shown.empty() );
  Clock.TickAt( 200.0 );
  Clock.Manager.PlayFrame( 40 );
  // The elapsed 200 ms still count from the old start: the next tick lands 2 frames on.
  Clock.TickAt( 200.0 );
  EXPECT_EQ( Clock.Shown, ( std::vector< int >{ 2, 40, 42 } ) );
}

TEST( PlayBackManager, PauseAndStartContinueFromTheCurrentFrame )
{
  VClock Clock( 100, 10 );
  Clock.Manager.Start();
  Clock.TickAt( 300.0 );
  Clock.Manager.Pause();
  EXPECT_FALSE( Clock.Manager.IsPlaying() );
  Clock.Now = 5000.0;
  Clock.Manager.Start();
  Clock.TickAt( 5100.0 );
  EXPECT_EQ( Clock.Shown, ( std::vector< int >{ 3, 4 } ) );
}

TEST( PlayBackManager, StopAnnouncesOnceAndResetIsSilent )
{
  VClock Clock( 100, 10 );
  int FrameSeenByStopped = -1;
  QObject::connect( &Clock.Manager, &VPlayBackManager::Stopped,
                    [&] { FrameSeenByStopped = static_cast< int >( Clock.Manager.GetCurrentFrame() ); } );
  Clock.Manager.Start();
  Clock.TickAt( 500.0 );
  Clock.Manager.Stop();
  EXPECT_EQ( Clock.Stopped, 1 );
  EXPECT_EQ( FrameSeenByStopped, 5 ); // listeners see the old position
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
  Clock.Manager.PlayFrame( 7 );
  Clock.Manager.Reset();
  EXPECT_EQ( Clock.Stopped, 1 );
  EXPECT_EQ( Clock.Manager.GetCurrentFrame(), 0u );
}

TEST( PlayBackManager, ZeroFrameRateStaysOnItsFrame )
{
  VClock Clock( 10, 0 );
  Clock.Manager.Start();
  Clock.TickAt( 10000.0 );
  EXPECT_TRUE( Clock.Shown.empty() );
}

int main( int argc, char** argv )
{
  QCoreApplication Application( argc, argv );
  testing::InitGoogleTest( &argc, argv );
  return RUN_ALL_TESTS();
}
