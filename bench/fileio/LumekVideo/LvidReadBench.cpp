// Reading one frame from a page-cached .lvid recording, next to a bare pread of the same bytes
// into a reused buffer: the difference is what the reader's path costs over the copy out of
// the page cache, which no reader can avoid.

#include "fileio/LumekVideo/VReader.h"
#include "fileio/LumekVideo/VWriter.h"

#include "tests/support/AllocationWatch.h"

#include <benchmark/benchmark.h>
#include <boost/filesystem.hpp>

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <map>
#include <new>
#include <vector>

namespace
{
  constexpr int FrameCount = 20;

  // One recording per pixel format, written once per run and removed at exit.
  class VBenchRecording
  {
  public:
    explicit VBenchRecording( ZOL::EPixelFormat i_Format )
    {
      m_Path =
          ( boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "lvid-bench-%%%%-%%%%.lvid" ) )
              .string();
      ZOL::IVideoFrameInfo Video;
      Video.ImageWidth = 1920;
      Video.ImageHeight = 1080;
      Video.PixelFormat = i_Format;
      Video.PixelAspectRatio = 1.0;
      LumekVideo::VWriter Writer;
      bOk = Writer.Create( m_Path, Video, ZOL::IAudioFrameInfo(), ZOL::IVideoAttributes() );
      FrameSize = Writer.GetVideoFrameSize();
      std::vector< std::uint8_t > Frame( FrameSize );
      for( int i = 0; i < FrameCount && bOk; ++i )
      {
        std::fill( Frame.begin(), Frame.end(), static_cast< std::uint8_t >( i ) );
        bOk = Writer.AppendFrame( i, Frame.data(), Frame.size() );
      }
      bOk = bOk && Writer.Close();
      LumekVideo::VReader Reader;
      bOk = bOk && Reader.Open( m_Path );
      if( bOk )
        for( const auto& rEntry : Reader.GetFrameIndex() )
          Offsets.push_back( rEntry.second );
      // Read everything once, so that the runs measure the page cache and not the disc.
      std::vector< std::uint8_t > Scratch( FrameSize );
      const int File = ::open( m_Path.c_str(), O_RDONLY );
      for( const std::uint64_t Offset : Offsets )
        bOk = bOk && ::pread( File, Scratch.data(), FrameSize, static_cast< off_t >( Offset ) ) ==
                         static_cast< ssize_t >( FrameSize );
      ::close( File );
    }
    ~VBenchRecording()
    {
      boost::system::error_code Error;
      boost::filesystem::remove( m_Path, Error );
    }
    const std::string& Path() const { return m_Path; }

    bool bOk = false;
    std::uint64_t FrameSize = 0;
    std::vector< std::uint64_t > Offsets;

  private:
    std::string m_Path;
  };

  const VBenchRecording& Recording( ZOL::EPixelFormat i_Format )
  {
    static std::map< ZOL::EPixelFormat, std::unique_ptr< VBenchRecording > > s_Recordings;
    auto& rpRecording = s_Recordings[i_Format];
    if( !rpRecording )
      rpRecording = std::make_unique< VBenchRecording >( i_Format );
    return *rpRecording;
  }

  void ReportFrames( benchmark::State& io_rState, std::uint64_t i_FrameSize )
  {
    io_rState.SetItemsProcessed( io_rState.iterations() );
    io_rState.SetBytesProcessed( static_cast< std::int64_t >( io_rState.iterations() * i_FrameSize ) );
    io_rState.counters["frames/s"] =
        benchmark::Counter( static_cast< double >( io_rState.iterations() ), benchmark::Counter::kIsRate );
  }

  // As the viewer reads: both halves asked for, the buffer dropped before the next frame so
  // that it goes back to the recycler.
  void BM_LvidReadFrameData( benchmark::State& io_rState, ZOL::EPixelFormat i_Format )
  {
    const VBenchRecording& rRecording = Recording( i_Format );
    LumekVideo::VReader Reader;
    if( !rRecording.bOk || !Reader.Open( rRecording.Path() ) )
    {
      io_rState.SkipWithError( "cannot make the recording" );
      return;
    }
    std::uint64_t Frame = 0;
    // One read before counting: the recycler fills its cache on first use.
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      Reader.ReadFrameData( 0, pVideo, Audio, true, true );
    }
    const std::uint64_t HeapCallsBefore = LumekTest::HeapCalls();
    for( auto _ : io_rState )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      if( !Reader.ReadFrameData( Frame, pVideo, Audio, true, true ) )
      {
        io_rState.SkipWithError( "read failed" );
        break;
      }
      benchmark::DoNotOptimize( pVideo->GetData() );
      Frame = ( Frame + 1 ) % FrameCount;
    }
    io_rState.counters["heap/iter"] = benchmark::Counter(
        static_cast< double >( LumekTest::HeapCalls() - HeapCallsBefore ), benchmark::Counter::kAvgIterations );
    ReportFrames( io_rState, rRecording.FrameSize );
  }

  void BM_BarePread( benchmark::State& io_rState, ZOL::EPixelFormat i_Format )
  {
    const VBenchRecording& rRecording = Recording( i_Format );
    const int File = ::open( rRecording.Path().c_str(), O_RDONLY );
    if( !rRecording.bOk || File < 0 )
    {
      io_rState.SkipWithError( "cannot make the recording" );
      return;
    }
    std::vector< std::uint8_t > Buffer( rRecording.FrameSize );
    std::size_t Frame = 0;
    for( auto _ : io_rState )
    {
      const ssize_t Read =
          ::pread( File, Buffer.data(), Buffer.size(), static_cast< off_t >( rRecording.Offsets[Frame] ) );
      if( Read != static_cast< ssize_t >( Buffer.size() ) )
      {
        io_rState.SkipWithError( "read failed" );
        break;
      }
      benchmark::DoNotOptimize( Buffer.data() );
      Frame = ( Frame + 1 ) % rRecording.Offsets.size();
    }
    ::close( File );
    ReportFrames( io_rState, rRecording.FrameSize );
  }
} // namespace

namespace
{
  // Opening reads the whole index into memory: a long capture at a high rate is the case to watch.
  void BM_LvidOpenLongIndex( benchmark::State& io_rState )
  {
    const std::uint64_t Entries = static_cast< std::uint64_t >( io_rState.range( 0 ) );
    const std::string Path =
        ( boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "lvid-bench-%%%%-%%%%.lvid" ) )
            .string();
    ZOL::IVideoFrameInfo Video;
    Video.ImageWidth = 4;
    Video.ImageHeight = 4;
    Video.PixelFormat = ZOL::PixelFormat_Luminance8;
    Video.PixelAspectRatio = 1.0;
    {
      LumekVideo::VWriter Writer;
      const std::vector< std::uint8_t > Frame( 16 );
      bool bOk = Writer.Create( Path, Video, ZOL::IAudioFrameInfo(), ZOL::IVideoAttributes(), 16 );
      for( std::uint64_t i = 0; i < Entries && bOk; ++i )
        bOk = Writer.AppendFrame( i, Frame.data(), Frame.size() );
      if( !bOk || !Writer.Close() )
      {
        io_rState.SkipWithError( "cannot make the recording" );
        return;
      }
    }
    for( auto _ : io_rState )
    {
      LumekVideo::VReader Reader;
      if( !Reader.Open( Path ) )
      {
        io_rState.SkipWithError( "open failed" );
        break;
      }
      benchmark::DoNotOptimize( Reader.GetFrameCount() );
    }
    io_rState.SetItemsProcessed( static_cast< std::int64_t >( io_rState.iterations() * Entries ) );
    boost::system::error_code Error;
    boost::filesystem::remove( Path, Error );
  }
} // namespace

BENCHMARK( BM_LvidOpenLongIndex )->Arg( 1000 )->Arg( 100000 )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_BarePread, BayerGB8, ZOL::PixelFormat_BayerGB8 )->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( BM_LvidReadFrameData, BayerGB8, ZOL::PixelFormat_BayerGB8 )->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( BM_BarePread, R8G8B8, ZOL::PixelFormat_R8G8B8 )->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( BM_LvidReadFrameData, R8G8B8, ZOL::PixelFormat_R8G8B8 )->Unit( benchmark::kMicrosecond );

BENCHMARK_MAIN();
