// The playback clock under a scripted time source: each tick is called by hand, nothing sleeps.

#include "tests/app/AppTestSupport.h"

#include "app/Playback/VPlayBackManager.h"
#include "app/VideoSource/VVideoSource.h"

#include <QCoreApplication>

#include <gtest/gtest.h>

#include <numeric>

using LumekVideoViewer::VPlayBackManager;

namespace
{
  // A recording of i_Count frames at i_FramesPerSecond (0: no rate).
  AppTest::VRecordingSpec Spec( std::uint64_t i_Count, double i_FramesPerSecond )
  {
    AppTest::VRecordingSpec Spec;
    Spec.Width = Spec.Height = 2;
    Spec.Frames = AppTest::FramesWithout( i_Count, {} );
    Spec.FramePeriodInTicks = i_FramesPerSecond > 0 ? AppTest::TicksAt( i_FramesPerSecond ) : 0;
    return Spec;
  }

  // Ticks as the timer gives them, from i_First to i_Last milliseconds.
  std::vector< double > Steady( double i_First, double i_Last )
  {
    std::vector< double > Ticks;
    for( double t = i_First; t <= i_Last; t += VPlayBackManager::TimerIntervalMilliseconds )
      Ticks.push_back( t );
    return Ticks;
  }

  std::vector< int > Range( int i_First, int i_Last )
  {
    std::vector< int > Frames( static_cast< std::size_t >( i_Last - i_First + 1 ) );
    std::iota( Frames.begin(), Frames.end(), i_First );
    return Frames;
  }
} // namespace

// From Start, the clock ticks at the given times (while playing, as the timer would); the frames
// announced, the ends and stops, and where it is left, worked out from the frame rate by hand.
TEST( PlayBackManager, ScriptedClocks )
{
  const struct
  {
    const char* Name;
    std::uint64_t Frames;
    double FramesPerSecond;
    bool bDropFrames, bLoop;
    std::vector< double > Ticks;
    std::vector< int > Shown;
    int Ends, Stops;
    bool bPlaying;
    std::uint64_t Current;
  } Rows[] = {
      // Exactly one half stays on the lower frame; a tick that changes nothing emits nothing.
      { "HalfAFrameStaysBelow", 10, 10, true, true, { 49.0, 50.0 }, {}, 0, 0, true, 0 },
      { "MoreThanHalfRoundsUp", 10, 10, true, true, { 50.5, 100.0 }, { 1 }, 0, 0, true, 1 },
      // The clock reaches the frame count, which announces the end one tick later.
      { "EveryFrameOnceThenStops", 50, 25, true, false, Steady( 5, 2100 ), Range( 1, 50 ), 1, 1, false, 0 },
      { "SingleFrameEndsAtTheNextTick", 1, 10, true, true, { 60.0 }, { 1 }, 0, 0, true, 1 },
      // Looping is the default: the end restarts at frame 0 without announcing it.
      { "SingleFrameLoops", 1, 10, true, true, { 60.0, 65.0 }, { 1 }, 1, 0, true, 0 },
      // A frame that took 100 ms at 100 fps: dropping jumps to the clock, otherwise one frame a
      // tick until the position meets the clock (at 160 ms the clock says 16).
      { "StallDropsFrames", 100, 100, true, true, { 100.0 }, { 10 }, 0, 0, true, 10 },
      { "StallShowsEveryFrame", 100, 100, false, true, Steady( 100, 160 ), Range( 1, 13 ), 0, 0, true, 13 },
      { "ZeroFrameRateStays", 10, 0, true, true, { 10000.0 }, {}, 0, 0, true, 0 },
  };
  for( const auto& rRow : Rows )
  {
    SCOPED_TRACE( rRow.Name );
    const AppTest::VTempRecording Recording( Spec( rRow.Frames, rRow.FramesPerSecond ) );
    LumekVideoViewer::VVideoSource Source;
    ASSERT_TRUE( Source.Open( Recording.Path ) );
    double Now = 0.0;
    VPlayBackManager Manager( &Source, [&Now] { return Now; } );
    std::vector< int > Shown;
    int Ends = 0, Stops = 0;
    QObject::connect( &Manager, &VPlayBackManager::FrameUpdated, [&]( int i_Frame ) { Shown.push_back( i_Frame ); } );
    QObject::connect( &Manager, &VPlayBackManager::Stopped, [&] { ++Stops; } );
    QObject::connect( &Manager, &VPlayBackManager::End, [&] { ++Ends; } );
    Manager.SetDropFrame( rRow.bDropFrames );
    if( !rRow.bLoop )
    {
      Manager.Loop( true ); // connected twice now, as at start-up
      Manager.Loop( false );
    }
    Manager.Start();
    for( double t : rRow.Ticks )
      if( Manager.IsPlaying() )
      {
        Now = t;
        Manager.PlayForward();
      }
    EXPECT_EQ( Shown, rRow.Shown );
    EXPECT_EQ( std::make_pair( Ends, Stops ), std::make_pair( rRow.Ends, rRow.Stops ) );
    EXPECT_EQ( Manager.IsPlaying(), rRow.bPlaying );
    EXPECT_EQ( Manager.GetCurrentFrame(), rRow.Current );
  }
}

int main( int argc, char** argv )
{
  QCoreApplication Application( argc, argv );
  testing::InitGoogleTest( &argc, argv );
  return RUN_ALL_TESTS();
}
