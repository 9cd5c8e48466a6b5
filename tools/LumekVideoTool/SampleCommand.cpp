#include "tools/LumekVideoTool/MkvSample.h"
#include "tools/LumekVideoTool/SampleScene.h"
#include "tools/LumekVideoTool/ToolCommon.h"

namespace po = boost::program_options;

namespace LumekVideoTool
{
  int RunMakeSample( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    VSampleOptions Sample;
    po::options_description Options;
    Options.add_options()( "output", po::value< std::string >()->required() )(
        "width", po::value< int >( &Sample.Width )->default_value( Sample.Width ) )(
        "height", po::value< int >( &Sample.Height )->default_value( Sample.Height ) )(
        "frames", po::value< int >( &Sample.Frames )->default_value( Sample.Frames ) )(
        "fps", po::value< double >( &Sample.FramesPerSecond )->default_value( Sample.FramesPerSecond ) )(
        "format", po::value< std::string >()->default_value( ZOL::ToString( Sample.Format ) ) )(
        "audio", po::value< bool >( &Sample.bAudio )->default_value( true )->implicit_value( true ) )(
        "no-audio", po::bool_switch() );
    po::positional_options_description Positional;
    Positional.add( "output", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "make-sample", o_rErr );
    if( !Variables )
      return Exit_Usage;
    if( ( *Variables )["no-audio"].as< bool >() )
      Sample.bAudio = false;
    const std::string FormatName = ( *Variables )["format"].as< std::string >();
    if( !ZOL::FromString( FormatName, Sample.Format ) || Sample.Format == ZOL::PixelFormat_Unspecified )
    {
      o_rErr << "lumekvideotool make-sample: unknown pixel format '" << FormatName << "'\n\n" << UsageText();
      return Exit_Usage;
    }
    if( Sample.Width <= 0 || Sample.Height <= 0 || Sample.Frames <= 0 || !( Sample.FramesPerSecond > 0.0 ) ||
        static_cast< std::int64_t >( Sample.Width ) * Sample.Height > 16384LL * 16384LL )
    {
      o_rErr << "lumekvideotool make-sample: width, height, frames and fps must be positive (at most 16384 x 16384)\n\n"
             << UsageText();
      return Exit_Usage;
    }

    std::string Error;
    const std::string Output = ( *Variables )["output"].as< std::string >();
    // Matroska holds no Bayer frames: its sample is YUV 4:2:2 unless a format was asked for.
    if( IsMkvPath( Output ) && ( *Variables )["format"].defaulted() )
      Sample.Format = ZOL::PixelFormat_U8Y8V8Y8;
    if( IsMkvPath( Output ) ? !WriteSampleMkv( Output, Sample, Error )
                            : !WriteSampleRecording( Output, Sample, Error ) )
    {
      o_rErr << "lumekvideotool make-sample: " << Error << std::endl;
      return Exit_CannotOpen;
    }
    return Exit_Success;
  }
} // namespace LumekVideoTool
