// The .lvid reader over the three streams a recording can be read through: the C library file it
// opens by default, the plain file stream and the memory-mapped stream. Once with the recording
// in the page cache, as when a file is played a second time, and once with its pages dropped
// before every frame, as when a recording larger than memory is played through.

#include "fileio/LumekVideo/VReader.h"
#include "fileio/LumekVideo/VWriter.h"
#include "utils/UtilsFileSystem/FileIO.h"
#include "utils/UtilsFileSystem/MemoryMappedFile.h"
#include "utils/UtilsIO/VLargeFile.h"

#include <benchmark/benchmark.h>
#include <boost/filesystem.hpp>

#include <fcntl.h>
#include <unistd.h>

#include <functional>
#include <memory>
#include <vector>

namespace
{
  // 1920 x 1080 RGB: 6 MB a frame, 240 MB in all, more than the mapped stream's 128 MB of windows,
  // so that the windows keep moving as they would through a long recording.
  constexpr int FrameCount = 40;

  class VRecording
  {
  public:
    VRecording()
    {
      m_Path = ( boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "mapped-bench-%%%%.lvid" ) )
                   .string();
      ZOL::IVideoFrameInfo Video;
      Video.ImageWidth = 1920;
      Video.ImageHeight = 1080;
      Video.PixelFormat = ZOL::PixelFormat_R8G8B8;
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
    }
    ~VRecording()
    {
      boost::system::error_code Error;
      boost::filesystem::remove( m_Path, Error );
    }
    const std::string& Path() const { return m_Path; }

    // Drops the recording's pages from the page cache; pages that a mapping still holds stay.
    void DropCache() const
    {
      const int File = ::open( m_Path.c_str(), O_RDONLY );
      if( File < 0 )
        return;
      static_cast< void >( ::fdatasync( File ) );
      static_cast< void >( ::posix_fadvise( File, 0, 0, POSIX_FADV_DONTNEED ) );
      ::close( File );
    }

    bool bOk = false;
    std::uint64_t FrameSize = 0;

  private:
    std::string m_Path;
  };

  const VRecording& Recording()
  {
    static VRecording s_Recording;
    return s_Recording;
  }

  using VOpen = std::function< std::shared_ptr< ZOL::IInputStreamSeekable >( const std::string& ) >;

  std::shared_ptr< ZOL::IInputStreamSeekable > OpenLargeFile( const std::string& i_rPath )
  {
    auto pFile = std::make_shared< UtilsIO::VLargeFile >();
    return pFile->Open( i_rPath, UtilsIO::OpenMode_Read ) ? pFile : nullptr;
  }

  std::shared_ptr< ZOL::IInputStreamSeekable > OpenPlainStream( const std::string& i_rPath )
  {
    auto pStream = std::make_shared< UtilsFileSystem::VFileInputStreamVirtual >();
    return ZOL::Succeeded( UtilsFileSystem::OpenInputStream( i_rPath, pStream->Get() ) ) ? pStream : nullptr;
  }

  std::shared_ptr< ZOL::IInputStreamSeekable > OpenMappedStream( const std::string& i_rPath )
  {
    auto pStream = std::make_shared< UtilsFileSystem::VMemoryMappedInputStreamVirtual >();
    return ZOL::Succeeded( pStream->Get().Open( i_rPath ) ) ? pStream : nullptr;
  }

  void BM_LvidFrames( benchmark::State& io_rState, VOpen i_Open, bool i_bCold )
  {
    const VRecording& rRecording = Recording();
    LumekVideo::VReader Reader;
    const auto pStream = rRecording.bOk ? i_Open( rRecording.Path() ) : nullptr;
    if( !pStream || !Reader.Open( pStream ) )
    {
      io_rState.SkipWithError( "cannot open the recording" );
      return;
    }
    std::uint64_t Frame = 0;
    for( auto _ : io_rState )
    {
      if( i_bCold )
      {
        io_rState.PauseTiming();
        rRecording.DropCache();
        io_rState.ResumeTiming();
      }
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      if( !Reader.ReadFrameData( Frame, pVideo, Audio, true, false ) )
      {
        io_rState.SkipWithError( "read failed" );
        break;
      }
      benchmark::DoNotOptimize( pVideo->GetData() );
      Frame = ( Frame + 1 ) % FrameCount;
    }
    io_rState.SetBytesProcessed( static_cast< std::int64_t >( io_rState.iterations() * rRecording.FrameSize ) );
    io_rState.counters["frames/s"] =
        benchmark::Counter( static_cast< double >( io_rState.iterations() ), benchmark::Counter::kIsRate );
  }
} // namespace

BENCHMARK_CAPTURE( BM_LvidFrames, Cached_LargeFile, VOpen( &OpenLargeFile ), false )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_LvidFrames, Cached_PlainStream, VOpen( &OpenPlainStream ), false )
    ->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_LvidFrames, Cached_MappedStream, VOpen( &OpenMappedStream ), false )
    ->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_LvidFrames, Cold_LargeFile, VOpen( &OpenLargeFile ), true )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_LvidFrames, Cold_PlainStream, VOpen( &OpenPlainStream ), true )->Unit( benchmark::kMillisecond );
BENCHMARK_CAPTURE( BM_LvidFrames, Cold_MappedStream, VOpen( &OpenMappedStream ), true )
    ->Unit( benchmark::kMillisecond );

BENCHMARK_MAIN();
