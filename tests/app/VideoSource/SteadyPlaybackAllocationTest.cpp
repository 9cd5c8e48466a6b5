// Playback reads and drops frames dozens of times a second: after warm-up the path from file to
// decoded frame must not go back to the heap. Every allocation of this test binary is counted.

#include "RecordingFixture.h"

#include "app/VideoSource/VVideoSource.h"

#include <atomic>
#include <cstdlib>
#include <new>

namespace
{
  std::atomic< bool > g_bCounting{ false };
  std::atomic< std::uint64_t > g_Allocations{ 0 };
  std::atomic< std::uint64_t > g_LargestAllocation{ 0 };

  void* CountedAllocate( std::size_t i_Size )
  {
    if( g_bCounting.load( std::memory_order_relaxed ) )
    {
      ++g_Allocations;
      std::uint64_t Largest = g_LargestAllocation.load();
      while( i_Size > Largest && !g_LargestAllocation.compare_exchange_weak( Largest, i_Size ) )
      {
      }
    }
    if( void* p = std::malloc( i_Size ? i_Size : 1 ) )
      return p;
    throw std::bad_alloc();
  }
}

void* operator new( std::size_t i_Size ) { return CountedAllocate( i_Size ); }
void* operator new[]( std::size_t i_Size ) { return CountedAllocate( i_Size ); }
void operator delete( void* p ) noexcept { std::free( p ); }
void operator delete[]( void* p ) noexcept { std::free( p ); }
void operator delete( void* p, std::size_t ) noexcept { std::free( p ); }
void operator delete[]( void* p, std::size_t ) noexcept { std::free( p ); }

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

  g_Allocations = 0;
  g_LargestAllocation = 0;
  g_bCounting = true;
  const int Frames = 400;
  for( int i = 0; i < Frames; ++i )
    Source.GetFrame( static_cast< std::uint64_t >( i % 40 ), Frame );
  g_bCounting = false;

  // Frame buffers are recycled: nothing the size of a frame, or of its audio, is allocated.
  EXPECT_LT( g_LargestAllocation.load(), 256u ) << "largest allocation during playback";
  EXPECT_EQ( g_Allocations.load(), 0u ) << "allocations over " << Frames << " frames";
}
