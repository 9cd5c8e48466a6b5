// Playback reads and drops frames dozens of times a second: after warm-up the path from file to
// decoded frame must not go back to the heap.

#include "RecordingFixture.h"

#include "app/VideoSource/VVideoSource.h"

#include "tests/support/AllocationWatch.h"

TEST( SteadyPlayback, NoFrameSizedAllocationAfterWarmUp )
{
  VSourceRecording Recording;
  Recording.Video.ImageWidth = 640;
  Recording.Video.ImageHeight = 480;
  Recording.Audio = { ZOL::AudioSampleFormat_Int16, 48000, 2 };
  Recording.Frames.clear();
  for( std::uint64_t i = 0; i < 40; ++i )
    Recording.Frames.push_back( i );
  LumekVideoViewer::VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write() ) );

  // The window keeps one frame record and replaces its contents frame by frame.
  ZOL::IVideoFrame Frame;
  for( int Pass = 0; Pass < 2; ++Pass )
    for( std::uint64_t i = 0; i < 40; ++i )
      ASSERT_TRUE( Source.GetFrame( i, Frame ) );

  const int Frames = 400;
  LumekTest::VAllocationWatch Watch;
  int Read = 0;
  for( int i = 0; i < Frames; ++i )
    Read += Source.GetFrame( static_cast< std::uint64_t >( i % 40 ), Frame ) ? 1 : 0;
  EXPECT_EQ( Read, Frames );

  // Frame buffers and their control blocks are recycled: playback takes nothing from the heap.
  EXPECT_EQ( Watch.Calls(), 0u ) << "allocations over " << Frames << " frames, the largest " << Watch.Largest();
}
