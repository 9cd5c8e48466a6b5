// Motion JPEG at 1080p 4:2:2, the cameras' compressed format, decoded to each format the
// viewer asks for; beside it TurboJPEG called bare, with and without the SIMD "force" flags,
// to show what the reader adds and that the flags cost nothing. ffmpeg's figure for the same
// frames comes from the command in docs/performance.md.
//
// The frames are made by ffmpeg at start into LUMEK_BENCH_JPEG_DIR (default /tmp), once: a
// test picture with moving grain, so that the entropy decoding has a camera's work to do.

#include "fileio/JPEGIO/JPEGReader.h"
#include "tests/support/AllocationWatch.h"
#include "videointerface/BufferAllocators.h"

#include <benchmark/benchmark.h>
#include <turbojpeg.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace
{
  constexpr int FrameCount = 24;

  std::string FrameFolder()
  {
    const char* pFolder = std::getenv( "LUMEK_BENCH_JPEG_DIR" );
    return std::string( pFolder != nullptr ? pFolder : "/tmp" ) + "/lumek_mjpeg_1080p_422_grain";
  }

  std::string FramePath( int i_Index )
  {
    char Name[32];
    std::snprintf( Name, sizeof( Name ), "/%03d.jpg", i_Index + 1 );
    return FrameFolder() + Name;
  }

  const std::vector< std::vector< std::uint8_t > >& Frames()
  {
    static const std::vector< std::vector< std::uint8_t > > s_Frames = []
    {
      if( !std::ifstream( FramePath( FrameCount - 1 ) ) )
      {
        const std::string Command =
            "mkdir -p '" + FrameFolder() +
            "' && ffmpeg -y -v error -f lavfi -i testsrc2=s=1920x1080:r=25,noise=alls=12:allf=t -frames:v " +
            std::to_string( FrameCount ) + " -pix_fmt yuvj422p -q:v 3 '" + FrameFolder() + "/%03d.jpg'";
        if( std::system( Command.c_str() ) != 0 )
          std::fprintf( stderr, "ffmpeg could not make the frames\n" );
      }
      std::vector< std::vector< std::uint8_t > > Result;
      for( int i = 0; i < FrameCount; ++i )
      {
        std::ifstream File( FramePath( i ), std::ios::binary );
        Result.emplace_back( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
      }
      return Result;
    }();
    return s_Frames;
  }

  void Finish( benchmark::State& io_rState, std::uint64_t i_HeapCallsBefore, std::uint64_t i_Bytes )
  {
    // Read before the counters below, whose map takes from the heap itself.
    const auto HeapCalls = static_cast< double >( LumekTest::HeapCalls() - i_HeapCallsBefore );
    io_rState.counters["heap/iter"] = benchmark::Counter( HeapCalls, benchmark::Counter::kAvgIterations );
    io_rState.counters["frames/s"] =
        benchmark::Counter( static_cast< double >( io_rState.iterations() ), benchmark::Counter::kIsRate );
    io_rState.SetBytesProcessed( static_cast< std::int64_t >( i_Bytes ) );
  }

  void BM_ReadJPEG( benchmark::State& io_rState, ZOL::EPixelFormat i_Wish )
  {
    const auto& rFrames = Frames();
    const auto pAllocator = std::make_shared< ZOL::VFrameBufferAllocator >();
    const auto pTemporary = std::make_shared< ZOL::VFrameBufferAllocator >();
    // The viewer holds a frame while it reads the next; the warm-up fills the recyclers.
    std::shared_ptr< ZOL::IBuffer > pShown;
    std::shared_ptr< ZOL::IBuffer > pOutput;
    for( int i = 0; i < 4; ++i )
    {
      ZOL::IVideoFrameInfo Info;
      Info.PixelFormat = i_Wish;
      pShown = std::move( pOutput );
      if( !JPEGIO::ReadJPEG( rFrames[i].data(), rFrames[i].size(), pAllocator, pTemporary, Info, pOutput ) )
      {
        io_rState.SkipWithError( "decode failed" );
        return;
      }
    }
    std::uint64_t Bytes = 0;
    std::size_t Index = 0;
    const std::uint64_t HeapCallsBefore = LumekTest::HeapCalls();
    for( auto _ : io_rState )
    {
      const auto& rFrame = rFrames[Index++ % rFrames.size()];
      ZOL::IVideoFrameInfo Info;
      Info.PixelFormat = i_Wish;
      pShown = std::move( pOutput );
      if( !JPEGIO::ReadJPEG( rFrame.data(), rFrame.size(), pAllocator, pTemporary, Info, pOutput ) )
        io_rState.SkipWithError( "decode failed" );
      Bytes += pOutput ? pOutput->GetSize() : 0;
    }
    Finish( io_rState, HeapCallsBefore, Bytes );
  }

  // TurboJPEG alone, into buffers made once: the floor the reader stands on.
  void BM_BareTurboJPEG( benchmark::State& io_rState, int i_Flags, bool i_bPlanes )
  {
    const auto& rFrames = Frames();
    constexpr int Width = 1920;
    constexpr int Height = 1080;
    std::vector< unsigned char > Output( Width * Height * 3 );
    tjhandle Handle = tjInitDecompress();
    std::size_t Index = 0;
    const std::uint64_t HeapCallsBefore = LumekTest::HeapCalls();
    for( auto _ : io_rState )
    {
      const auto& rFrame = rFrames[Index++ % rFrames.size()];
      unsigned char* pData = const_cast< unsigned char* >( rFrame.data() );
      int Result = 0;
      if( i_bPlanes )
      {
        unsigned char* Planes[3] = { Output.data(), Output.data() + Width * Height,
                                     Output.data() + Width * Height * 3 / 2 };
        int Strides[3] = { Width, Width / 2, Width / 2 };
        Result = tjDecompressToYUVPlanes( Handle, pData, rFrame.size(), Planes, Width, Strides, Height, i_Flags );
      }
      else
        Result =
            tjDecompress2( Handle, pData, rFrame.size(), Output.data(), Width, Width * 3, Height, TJPF_RGB, i_Flags );
      if( Result != 0 )
        io_rState.SkipWithError( tjGetErrorStr2( Handle ) );
    }
    tjDestroy( Handle );
    Finish( io_rState, HeapCallsBefore, io_rState.iterations() * std::uint64_t( Width ) * Height * 2 );
  }

  constexpr int Fast = TJFLAG_FASTDCT | TJFLAG_NOREALLOC | TJFLAG_FASTUPSAMPLE;
} // namespace

BENCHMARK_CAPTURE( BM_ReadJPEG, U8Y8V8Y8, ZOL::PixelFormat_U8Y8V8Y8 )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_ReadJPEG, Y8U8Y8V8, ZOL::PixelFormat_Y8U8Y8V8 )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_ReadJPEG, R8G8B8, ZOL::PixelFormat_R8G8B8 )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_ReadJPEG, R8G8B8u8, ZOL::PixelFormat_R8G8B8u8 )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_ReadJPEG, B8G8R8u8, ZOL::PixelFormat_B8G8R8u8 )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_ReadJPEG, Luminance8, ZOL::PixelFormat_Luminance8 )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_BareTurboJPEG, PlanesReaderFlags, JPEGIO::ReadFlags, true )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_BareTurboJPEG, PlanesWithoutForceFlags, Fast, true )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_BareTurboJPEG, PlanesPlain, 0, true )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_BareTurboJPEG, RGBReaderFlags, JPEGIO::ReadFlags, false )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_BareTurboJPEG, RGBWithoutForceFlags, Fast, false )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_BareTurboJPEG, RGBPlain, 0, false )->Unit( benchmark::kMillisecond );

BENCHMARK_MAIN();
