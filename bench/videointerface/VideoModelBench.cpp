// The video model's hot paths: the attribute store's binary form as a reader meets it at open,
// the frame description read with its history lookup, the status line's timecode, and buffers
// out of the recycling allocators at frame rate. Heap calls are counted per iteration, so the
// figures show both time and what each operation takes from the heap.

#include "tests/support/AllocationWatch.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/BufferAllocators.h"

#include <benchmark/benchmark.h>

#include <atomic>
#include <cstdlib>
#include <cstring>
#include <new>

namespace
{
  // Reports heap calls and bytes per iteration of the benchmark that owns it.
  class VHeapCounter
  {
  public:
    VHeapCounter() : m_Calls( LumekTest::HeapCalls() ), m_Bytes( LumekTest::HeapBytes() ) {}
    void Report( benchmark::State& io_rState ) const
    {
      const double Iterations = static_cast< double >( io_rState.iterations() );
      io_rState.counters["heap/iter"] = static_cast< double >( LumekTest::HeapCalls() - m_Calls ) / Iterations;
      io_rState.counters["heapB/iter"] = static_cast< double >( LumekTest::HeapBytes() - m_Bytes ) / Iterations;
    }

  private:
    std::uint64_t m_Calls;
    std::uint64_t m_Bytes;
  };

  // The attributes a capture writes into a .lvid header, with a conversion history of two steps.
  ZOL::IVideoAttributes RecordingAttributes()
  {
    using namespace ZOL;
    IVideoAttributes Store;
    IVideoFrameInfo Frame;
    Frame.ImageWidth = 1920;
    Frame.ImageHeight = 1080;
    Frame.PixelFormat = PixelFormat_BayerGB8;
    Frame.PixelAspectRatio = 1.0;
    WriteVideoFrameInfo( Store, Frame );
    WriteAudioFrameInfo( Store, "", { AudioSampleFormat_Int24, 48000, 2 } );
    WriteVideoTiming( Store, { 135000000, 1125000, 0 } );
    WriteVideoSettings( Store, "", IVideoSettings() );
    ITimecode Timecode;
    Timecode.Standards = TimecodeStandard_25;
    WriteTimecode( Store, Timecode );
    CoreLumekTypes::VCameraHardware Camera;
    Camera.DeviceURN = "urn:lumek:camera:00000042";
    Camera.DisplayType = "Vantage V16";
    WriteCameraHardware( Store, Camera );
    WriteConversionRecords( Store, { VConversionRecord(), VConversionRecord() } );
    return Store;
  }

  std::vector< std::uint8_t > SerialForm( const ZOL::IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    benchmark::DoNotOptimize( i_rStore.WriteTo( Stream ) );
    return Stream.GetData();
  }

  void BM_AttributesWriteTo( benchmark::State& io_rState )
  {
    const ZOL::IVideoAttributes Store = RecordingAttributes();
    UtilsIO::VMemoryStream Stream;
    benchmark::DoNotOptimize( Store.WriteTo( Stream ) );
    VHeapCounter Heap;
    for( auto _ : io_rState )
    {
      Stream.Seek( 0 );
      benchmark::DoNotOptimize( Store.WriteTo( Stream ) );
    }
    Heap.Report( io_rState );
    io_rState.counters["keys"] = static_cast< double >( Store.Size() );
    io_rState.SetBytesProcessed( io_rState.iterations() * static_cast< std::int64_t >( Stream.GetData().size() ) );
  }
  BENCHMARK( BM_AttributesWriteTo );

  void BM_AttributesReadFrom( benchmark::State& io_rState )
  {
    const std::vector< std::uint8_t > Bytes = SerialForm( RecordingAttributes() );
    VHeapCounter Heap;
    for( auto _ : io_rState )
    {
      UtilsIO::VMemoryInputStream Input( Bytes.data(), Bytes.size() );
      ZOL::IVideoAttributes Store;
      benchmark::DoNotOptimize( Store.ReadFrom( Input ) );
    }
    Heap.Report( io_rState );
    io_rState.SetBytesProcessed( io_rState.iterations() * static_cast< std::int64_t >( Bytes.size() ) );
  }
  BENCHMARK( BM_AttributesReadFrom );

  // A claimed string length of 4 GB in a stream of a few bytes, as a damaged file has it.
  void BM_AttributesReadFromHugeLength( benchmark::State& io_rState )
  {
    std::vector< std::uint8_t > Bytes = { 1, 0, 0, 0, 1, 0, 0, 0, 'k', 11, 0, 0, 0, 0xFF, 0xFF, 0xFF, 0xFF, 'x' };
    VHeapCounter Heap;
    for( auto _ : io_rState )
    {
      UtilsIO::VMemoryInputStream Input( Bytes.data(), Bytes.size() );
      ZOL::IVideoAttributes Store;
      benchmark::DoNotOptimize( Store.ReadFrom( Input ) );
    }
    Heap.Report( io_rState );
  }
  BENCHMARK( BM_AttributesReadFromHugeLength );

  void BM_ReadVideoFrameInfo( benchmark::State& io_rState )
  {
    const ZOL::IVideoAttributes Store = RecordingAttributes();
    VHeapCounter Heap;
    for( auto _ : io_rState )
    {
      ZOL::IVideoFrameInfo Info;
      benchmark::DoNotOptimize( ZOL::ReadVideoFrameInfo( Store, Store, Info ) );
    }
    Heap.Report( io_rState );
  }
  BENCHMARK( BM_ReadVideoFrameInfo );

  void BM_FrameTimecodeText( benchmark::State& io_rState )
  {
    ZOL::ITimecode Start;
    Start.Standards = ZOL::TimecodeStandard_25;
    Start.Hours = 10;
    const ZOL::IVideoTiming Timing{ 135000000, 1125000, 0 };
    std::uint64_t Frame = 0;
    VHeapCounter Heap;
    for( auto _ : io_rState )
      benchmark::DoNotOptimize( ZOL::GetFrameTimecodeText( Start, Timing, Frame++ ) );
    Heap.Report( io_rState );
  }
  BENCHMARK( BM_FrameTimecodeText );

  // One frame buffer a loop, dropped before the next, as the viewer does at playback.
  template < typename Allocator > void BM_AllocateFrame( benchmark::State& io_rState )
  {
    const std::uint64_t Size = static_cast< std::uint64_t >( io_rState.range( 0 ) );
    auto pAllocator = std::make_shared< Allocator >();
    std::shared_ptr< ZOL::IBuffer > pBuffer;
    pAllocator->Allocate( pBuffer, Size );
    pBuffer.reset();
    VHeapCounter Heap;
    for( auto _ : io_rState )
    {
      pAllocator->Allocate( pBuffer, Size );
      benchmark::DoNotOptimize( pBuffer->GetData() );
      pBuffer.reset();
    }
    Heap.Report( io_rState );
  }
  BENCHMARK_TEMPLATE( BM_AllocateFrame, ZOL::VReaderBufferAllocator )->Arg( 4096 )->Arg( 2073600 );
  BENCHMARK_TEMPLATE( BM_AllocateFrame, ZOL::VFrameBufferAllocator )->Arg( 4096 )->Arg( 2073600 );

  // What the recycler saves: a fresh zeroed vector for every frame.
  void BM_FreshVectorFrame( benchmark::State& io_rState )
  {
    const std::size_t Size = static_cast< std::size_t >( io_rState.range( 0 ) );
    VHeapCounter Heap;
    for( auto _ : io_rState )
    {
      auto pBuffer = std::make_shared< std::vector< std::uint8_t > >( Size );
      benchmark::DoNotOptimize( pBuffer->data() );
    }
    Heap.Report( io_rState );
  }
  BENCHMARK( BM_FreshVectorFrame )->Arg( 4096 )->Arg( 2073600 );

  // Buffers made on one thread and dropped on another, as frames go from reading to drawing:
  // every thread of the benchmark allocates a frame and hands it to the next one to drop.
  std::shared_ptr< ZOL::VFrameBufferAllocator > s_pShared = std::make_shared< ZOL::VFrameBufferAllocator >();
  std::shared_ptr< ZOL::IBuffer > s_Handoff[8];
  std::mutex s_HandoffMutex[8];

  void BM_AllocateAcrossThreads( benchmark::State& io_rState )
  {
    const int Me = io_rState.thread_index();
    const int Next = ( Me + 1 ) % io_rState.threads();
    for( auto _ : io_rState )
    {
      std::shared_ptr< ZOL::IBuffer > pBuffer;
      s_pShared->Allocate( pBuffer, 65536 );
      std::shared_ptr< ZOL::IBuffer > pDrop;
      {
        std::lock_guard< std::mutex > Lock( s_HandoffMutex[Next] );
        pDrop = std::exchange( s_Handoff[Next], std::move( pBuffer ) );
      }
      pDrop.reset();
    }
    std::lock_guard< std::mutex > Lock( s_HandoffMutex[Me] );
    s_Handoff[Me].reset();
  }
  BENCHMARK( BM_AllocateAcrossThreads )->Threads( 1 )->Threads( 2 )->UseRealTime();
} // namespace

BENCHMARK_MAIN();
