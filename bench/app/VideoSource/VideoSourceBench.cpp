// Steady playback through VVideoSource: frames per second of read plus decode for raw 1080p
// Bayer with audio, and the resident size after 10,000 frames against the size after warm-up.

#include "app/VideoSource/VVideoSource.h"
#include "fileio/LumekVideo/VWriter.h"
#include "videointerface/AttributeRecords.h"

#include <benchmark/benchmark.h>
#include <boost/filesystem.hpp>

#include <fstream>
#include <string>

namespace
{
  double ResidentMiB()
  {
    std::ifstream Status( "/proc/self/statm" );
    long Pages = 0, Resident = 0;
    Status >> Pages >> Resident;
    return Resident * 4096.0 / ( 1024.0 * 1024.0 );
  }

  const std::string& Recording()
  {
    static const std::string s_Path = []
    {
      const std::string Path =
          ( boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "bench-%%%%%%.lvid" ) ).string();
      ZOL::IVideoFrameInfo Video;
      Video.ImageWidth = 1920;
      Video.ImageHeight = 1080;
      Video.PixelFormat = ZOL::PixelFormat_BayerGB8;
      Video.PixelAspectRatio = 1.0;
      const ZOL::IAudioFrameInfo Audio{ ZOL::AudioSampleFormat_Int16, 48000, 2 };
      ZOL::IVideoAttributes Attributes;
      ZOL::IVideoTiming Timing;
      Timing.FramePeriodInTicks = 135000000u / 100;
      ZOL::WriteVideoTiming( Attributes, Timing );
      LumekVideo::VWriter Writer;
      Writer.Create( Path, Video, Audio, Attributes );
      const std::vector< std::uint8_t > Pixels( 1920 * 1080, 100 );
      const std::vector< std::uint8_t > Samples( 480 * 4, 1 );
      for( std::uint64_t i = 0; i < 20; ++i )
        Writer.AppendFrame( i, Pixels.data(), Pixels.size(), Samples.data(), Samples.size() );
      Writer.Close();
      std::atexit( [] { boost::filesystem::remove( Recording() ); } );
      return Path;
    }();
    return s_Path;
  }

  void SteadyPlayback( benchmark::State& io_rState )
  {
    LumekVideoViewer::VVideoSource Source;
    if( !Source.Open( Recording() ) )
    {
      io_rState.SkipWithError( "cannot open the recording" );
      return;
    }
    ZOL::IVideoFrame Frame;
    for( std::uint64_t i = 0; i < 100; ++i )
      if( !Source.GetFrame( i % 20, Frame ) )
        io_rState.SkipWithError( "a frame of the recording did not read" );
    const double WarmResident = ResidentMiB();

    std::uint64_t Index = 0;
    for( auto _ : io_rState )
    {
      if( !Source.GetFrame( Index++ % 20, Frame ) )
        io_rState.SkipWithError( "a frame of the recording did not read" );
      benchmark::DoNotOptimize( Frame.Video->GetData() );
    }
    io_rState.SetItemsProcessed( io_rState.iterations() );
    io_rState.SetBytesProcessed( io_rState.iterations() * 1920 * 1080 );
    io_rState.counters["residentAfterWarmUpMiB"] = WarmResident;
    io_rState.counters["residentAtEndMiB"] = ResidentMiB();
  }
} // namespace

BENCHMARK( SteadyPlayback )->Iterations( 10000 )->Unit( benchmark::kMicrosecond );

BENCHMARK_MAIN();
