#include "tools/LumekVideoTool/ImageSequenceSample.h"
#include "tools/LumekVideoTool/MkvSample.h"
#include "tools/LumekVideoTool/SampleScene.h"
#include "tools/LumekVideoTool/ToolCommon.h"

#include <algorithm>
#include <iterator>

namespace po = boost::program_options;

namespace LumekVideoTool
{
  namespace
  {
    using VSampleWriter = bool ( * )( const std::string& i_rPath, const VSampleOptions& i_rOptions,
                                      std::string& o_rError );

    struct VSampleContainer
    {
      // Compared exactly, case and all, as the readers compare the names they open.
      const char* Extension;
      // The pixel format when none is asked for: what the container's cameras record.
      ZOL::EPixelFormat DefaultFormat;
      // Frames stored as PNG or JPEG pictures: colour only, and --frame-format applies.
      bool bImageFrames;
      VSampleWriter Write;
    };

    // One row a container make-sample writes; the output's name picks the row.
    constexpr VSampleContainer s_SampleContainers[] = {
        { ".lvid", ZOL::PixelFormat_BayerGB8, false, &WriteSampleRecording },
        // Matroska holds no Bayer frames.
        { ".mkv", ZOL::PixelFormat_U8Y8V8Y8, false, &WriteSampleMkv },
        { ".lumekimagesequence", ZOL::PixelFormat_R8G8B8, true, &WriteSampleImageSequence },
    };

    const VSampleContainer* FindSampleContainer( const std::string& i_rPath )
    {
      for( const VSampleContainer& rRow : s_SampleContainers )
      {
        const std::string Extension = rRow.Extension;
        if( i_rPath.size() > Extension.size() &&
            i_rPath.compare( i_rPath.size() - Extension.size(), Extension.size(), Extension ) == 0 )
          return &rRow;
      }
      return nullptr;
    }

    std::string SampleExtensions()
    {
      std::string Text;
      for( const VSampleContainer& rRow : s_SampleContainers )
        Text += std::string( Text.empty() ? "" : ", " ) + rRow.Extension;
      return Text;
    }

    struct VFrameFormatName
    {
      const char* Name;
      ZOL::EVideoPayload Payload;
    };
    constexpr VFrameFormatName s_FrameFormats[] = { { "png", ZOL::VideoPayload_ImagePNG },
                                                    { "jpeg", ZOL::VideoPayload_ImageJPEG } };
  } // namespace

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
        "no-audio", po::bool_switch() )( "frame-format", po::value< std::string >() );
    po::positional_options_description Positional;
    Positional.add( "output", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "make-sample", o_rErr );
    if( !Variables )
      return Exit_Usage;
    if( ( *Variables )["no-audio"].as< bool >() )
      Sample.bAudio = false;
    const std::string Output = ( *Variables )["output"].as< std::string >();
    const VSampleContainer* pContainer = FindSampleContainer( Output );
    if( pContainer == nullptr )
    {
      o_rErr << "lumekvideotool make-sample: no writer for '" << Output << "': the name must end in "
             << SampleExtensions() << "\n\n"
             << UsageText();
      return Exit_Usage;
    }
    const bool bImages = pContainer->bImageFrames;
    if( Variables->count( "frame-format" ) != 0 )
    {
      const std::string Name = ( *Variables )["frame-format"].as< std::string >();
      const auto Found = std::find_if( std::begin( s_FrameFormats ), std::end( s_FrameFormats ),
                                       [&]( const VFrameFormatName& i_rRow ) { return Name == i_rRow.Name; } );
      if( !bImages || Found == std::end( s_FrameFormats ) )
      {
        o_rErr << "lumekvideotool make-sample: --frame-format is png or jpeg, for a .lumekimagesequence\n\n"
               << UsageText();
        return Exit_Usage;
      }
      Sample.ImagePayload = Found->Payload;
    }
    const std::string FormatName = ( *Variables )["format"].defaulted() ? ZOL::ToString( pContainer->DefaultFormat )
                                                                        : ( *Variables )["format"].as< std::string >();
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

    if( bImages && Sample.Format != pContainer->DefaultFormat )
    {
      o_rErr << "lumekvideotool make-sample: image sequence frames are " << ZOL::ToString( pContainer->DefaultFormat )
             << " pictures; choose PNG or JPEG with --frame-format\n\n"
             << UsageText();
      return Exit_Usage;
    }

    std::string Error;
    if( !pContainer->Write( Output, Sample, Error ) )
    {
      o_rErr << "lumekvideotool make-sample: " << Error << std::endl;
      return Exit_CannotOpen;
    }
    return Exit_Success;
  }
} // namespace LumekVideoTool
