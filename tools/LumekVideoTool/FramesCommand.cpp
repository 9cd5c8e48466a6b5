#include "graphics/CoreVideoUtils/DisplayConversion.h"
#include "tools/LumekVideoTool/Json.h"
#include "tools/LumekVideoTool/ToolCommon.h"

#include <boost/filesystem.hpp>
#include <boost/format.hpp>

#include <QImage>

#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <climits>
#include <cstdio>
#include <ctime>
#include <fstream>

namespace po = boost::program_options;

namespace LumekVideoTool
{
  // The converter colour-corrects a Bayer frame once, inside the conversion.
  bool ToDisplayRGB( const ZOL::IVideoSettings& i_rSettings, const ZOL::IVideoFrame& i_rFrame,
                     std::vector< std::uint8_t >& o_rRGB )
  {
    const ZOL::IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
    if( !i_rFrame.Video || !CoreVideoUtils::ConvertToDisplayRGB( rInfo, i_rFrame.Video->GetData(),
                                                                 i_rFrame.Video->GetSize(), i_rSettings, o_rRGB ) )
      return false;
    const std::uint64_t Row = static_cast< std::uint64_t >( rInfo.ImageWidth ) * 3;
    if( rInfo.IsInverted() )
      for( std::int32_t y = 0; y < rInfo.ImageHeight / 2; ++y )
        std::swap_ranges( o_rRGB.begin() + y * Row, o_rRGB.begin() + ( y + 1 ) * Row,
                          o_rRGB.begin() + ( rInfo.ImageHeight - 1 - y ) * Row );
    return true;
  }

  namespace
  {
    bool WritePicture( const std::string& i_rPath, int i_Width, int i_Height, const std::vector< std::uint8_t >& i_rRGB,
                       bool i_bPNG )
    {
      if( i_bPNG )
      {
        const QImage Image( i_rRGB.data(), i_Width, i_Height, i_Width * 3, QImage::Format_RGB888 );
        return Image.save( QString::fromStdString( i_rPath ), "PNG" );
      }
      std::ofstream File( i_rPath, std::ios::binary );
      File << "P6\n" << i_Width << " " << i_Height << "\n255\n";
      File.write( reinterpret_cast< const char* >( i_rRGB.data() ), static_cast< std::streamsize >( i_rRGB.size() ) );
      return static_cast< bool >( File );
    }

    double PeakResidentMiB()
    {
      rusage Usage{};
      getrusage( RUSAGE_SELF, &Usage );
      return Usage.ru_maxrss / 1024.0; // kilobytes on Linux
    }
  } // namespace

  int RunFrames( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    po::options_description Options;
    Options.add_options()( "file", po::value< std::string >()->required() )(
        "outdir", po::value< std::string >()->required() )( "first", po::value< std::uint64_t >()->default_value( 0 ) )(
        "count", po::value< std::uint64_t >() )( "png", po::bool_switch() );
    po::positional_options_description Positional;
    Positional.add( "file", 1 ).add( "outdir", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "frames", o_rErr );
    if( !Variables )
      return Exit_Usage;
    const std::string Path = ( *Variables )["file"].as< std::string >();
    const std::string OutDir = ( *Variables )["outdir"].as< std::string >();
    const std::uint64_t First = ( *Variables )["first"].as< std::uint64_t >();
    const bool bPNG = ( *Variables )["png"].as< bool >();

    LumekVideoViewer::VVideoSource Source;
    if( !OpenSource( Source, Path, o_rErr ) )
      return Exit_CannotOpen;
    const std::uint64_t FrameCount = Source.GetFrameCount();
    const std::uint64_t Count = Variables->count( "count" ) ? ( *Variables )["count"].as< std::uint64_t >()
                                                            : ( First < FrameCount ? FrameCount - First : 0 );

    boost::system::error_code Error;
    boost::filesystem::create_directories( OutDir, Error );
    if( !boost::filesystem::is_directory( OutDir ) )
    {
      o_rErr << "Cannot create the folder " << OutDir << std::endl;
      return Exit_Usage;
    }

    std::vector< std::uint8_t > RGB;
    bool bAllWritten = true;
    const std::uint64_t End = Count > UINT64_MAX - First ? UINT64_MAX : First + Count;
    for( std::uint64_t Index = First; Index < End; )
    {
      // Gaps are reported as one range: a damaged index may name a frame in the billions.
      const auto Next = Source.FindFrameAtOrAfter( Index );
      const std::uint64_t Stop = Next ? std::min( *Next, End ) : End;
      if( Stop > Index )
      {
        const char* pWhat = Index >= FrameCount ? "past the end" : "missing";
        if( Stop - Index == 1 )
          o_rErr << "Frame " << Index << " is " << pWhat << "." << std::endl;
        else
          o_rErr << "Frames " << Index << " to " << Stop - 1 << " are " << pWhat << "." << std::endl;
        bAllWritten = false;
        Index = Stop;
        continue;
      }
      ZOL::IVideoFrame Frame;
      if( !Source.GetFrame( Index, Frame ) || !ToDisplayRGB( Source.GetVideoSettings(), Frame, RGB ) )
      {
        o_rErr << "Frame " << Index << " could not be read or decoded." << std::endl;
        bAllWritten = false;
        ++Index;
        continue;
      }
      const std::string Name =
          ( boost::format( "%s/frame_%06d.%s" ) % OutDir % Index % ( bPNG ? "png" : "ppm" ) ).str();
      if( !WritePicture( Name, Frame.VideoFrameInfo.ImageWidth, Frame.VideoFrameInfo.ImageHeight, RGB, bPNG ) )
      {
        o_rErr << "Cannot write " << Name << std::endl;
        bAllWritten = false;
      }
      ++Index;
    }
    return bAllWritten ? Exit_Success : Exit_FramesFailed;
  }

  int RunBench( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    po::options_description Options;
    Options.add_options()( "file", po::value< std::string >()->required() )( "frames", po::value< std::uint64_t >() )(
        "software", po::bool_switch() );
    AddJsonLayoutOptions( Options );
    po::positional_options_description Positional;
    Positional.add( "file", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "bench", o_rErr );
    if( !Variables )
      return Exit_Usage;
    const auto Layout = JsonLayoutFrom( *Variables, o_rErr );
    if( !Layout )
      return Exit_Usage;
    const std::string Path = ( *Variables )["file"].as< std::string >();
    const bool bSoftware = ( *Variables )["software"].as< bool >();

    LumekVideoViewer::VVideoSource Source;
    if( !OpenSource( Source, Path, o_rErr ) )
      return Exit_CannotOpen;
    const std::uint64_t Frames =
        Variables->count( "frames" ) ? ( *Variables )["frames"].as< std::uint64_t >() : Source.GetFrameCount();

    std::vector< std::uint8_t > RGB;
    std::uint64_t Failed = 0, Read = 0;
    const auto Start = std::chrono::steady_clock::now();
    // Processor time too: it compares with "ffmpeg -benchmark" whatever else runs on the machine.
    const std::clock_t ProcessorStart = std::clock();
    // A frame missing from the index is not a decoding failure: playback shows the one before.
    for( auto Index = Source.FindFrameAtOrAfter( 0 ); Index && *Index < Frames;
         Index = Source.FindFrameAtOrAfter( *Index + 1 ) )
    {
      // Frames are taken and dropped as playback takes and drops them, so buffers recycle.
      ZOL::IVideoFrame Frame;
      ++Read;
      if( !Source.GetFrame( *Index, Frame ) || ( bSoftware && !ToDisplayRGB( Source.GetVideoSettings(), Frame, RGB ) ) )
        ++Failed;
    }
    const double Seconds = std::chrono::duration< double >( std::chrono::steady_clock::now() - Start ).count();
    const double ProcessorSeconds = static_cast< double >( std::clock() - ProcessorStart ) / CLOCKS_PER_SEC;

    WriteJson( o_rOut,
               QJsonObject{ { "frames", JsonCount( Read ) },
                            { "seconds", JsonNumber( Seconds ) },
                            { "fps", JsonNumber( Seconds > 0.0 ? Read / Seconds : 0.0 ) },
                            { "msPerFrame", JsonNumber( Read > 0 ? Seconds * 1000.0 / Read : 0.0 ) },
                            { "payload", ZOL::ToString( Source.GetVideoPayload() ) },
                            { "processorSeconds", JsonNumber( ProcessorSeconds ) },
                            { "peakRssMiB", JsonNumber( PeakResidentMiB() ) } },
               *Layout );
    if( Failed != 0 )
      o_rErr << Failed << " frames could not be read or decoded." << std::endl;
    return Failed == 0 ? Exit_Success : Exit_FramesFailed;
  }
} // namespace LumekVideoTool
