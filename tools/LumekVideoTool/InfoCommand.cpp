#include "app/VideoSource/VideoSourceTexts.h"
#include "fileio/JPEGUtils/JPEGParser.h"
#include "tools/LumekVideoTool/Json.h"
#include "tools/LumekVideoTool/ToolCommon.h"
#include "utils/UtilsIO/VLargeFile.h"

#include <boost/algorithm/string/predicate.hpp>

namespace po = boost::program_options;

namespace LumekVideoTool
{
  namespace
  {
    QJsonObject Video( const LumekVideoViewer::VVideoSource& i_rSource )
    {
      const ZOL::IVideoFrameInfo& rInfo = i_rSource.GetVideoFrameInfo();
      return { { "payload", JsonText( ZOL::ToString( i_rSource.GetVideoPayload() ) ) },
               { "pixelFormat", JsonText( ZOL::ToString( rInfo.PixelFormat ) ) },
               { "width", rInfo.ImageWidth },
               { "height", rInfo.ImageHeight },
               { "frameRate", JsonNumber( i_rSource.GetFrameRate() ) },
               { "frameCount", JsonCount( i_rSource.GetFrameCount() ) },
               { "missingFrames", JsonCount( i_rSource.GetMissingFrameCount() ) },
               { "durationSeconds", JsonNumber( i_rSource.GetDurationInSeconds() ) },
               { "pixelAspectRatio", JsonNumber( rInfo.PixelAspectRatio ) },
               { "inverted", rInfo.IsInverted() } };
    }

    QJsonObject Audio( const LumekVideoViewer::VVideoSource& i_rSource )
    {
      const ZOL::IAudioFrameInfo& rInfo = i_rSource.GetAudioFrameInfo();
      return { { "payload", JsonText( ZOL::ToString( i_rSource.GetAudioPayload() ) ) },
               { "sampleFormat", JsonText( ZOL::ToString( rInfo.SampleFormat ) ) },
               { "sampleRate", rInfo.SampleRate },
               { "channels", rInfo.Channels } };
    }

    QJsonObject FrameReport( LumekVideoViewer::VVideoSource& io_rSource, std::uint64_t i_Index )
    {
      ZOL::IVideoFrame Frame;
      const bool bRead = io_rSource.GetFrame( i_Index, Frame );
      QJsonArray AudioBlocks;
      for( const auto& rpBlock : Frame.Audio )
        AudioBlocks.append( JsonCount( rpBlock ? rpBlock->GetSize() : 0 ) );
      return { { "index", JsonCount( i_Index ) },
               { "read", bRead },
               { "width", Frame.VideoFrameInfo.ImageWidth },
               { "height", Frame.VideoFrameInfo.ImageHeight },
               { "pixelFormat", JsonText( ZOL::ToString( Frame.VideoFrameInfo.PixelFormat ) ) },
               { "audioBlocks", AudioBlocks } };
    }
  } // namespace

  int RunInfo( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    po::options_description Options;
    Options.add_options()( "file", po::value< std::string >()->required() )(
        "frame", po::value< std::uint64_t >()->default_value( 0 ) );
    AddJsonLayoutOptions( Options );
    po::positional_options_description Positional;
    Positional.add( "file", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "info", o_rErr );
    if( !Variables )
      return Exit_Usage;
    const auto Layout = JsonLayoutFrom( *Variables, o_rErr );
    if( !Layout )
      return Exit_Usage;
    const std::string Path = ( *Variables )["file"].as< std::string >();
    const std::uint64_t Index = ( *Variables )["frame"].as< std::uint64_t >();

    LumekVideoViewer::VVideoSource Source;
    if( !OpenSource( Source, Path, o_rErr ) )
      return Exit_CannotOpen;

    QJsonObject Report;
    Report.insert( "file", JsonText( Path ) );
    const auto Container = ZOL::FindVideoContainer( Path );
    Report.insert( "container", JsonText( Container ? ZOL::ToString( *Container ) : "" ) );
    Report.insert( "video", Video( Source ) );
    Report.insert( "audio", Audio( Source ) );

    const LumekVideoViewer::VInfoPanelTexts Texts = LumekVideoViewer::ComposeInfoPanelTexts( Source, Index );
    Report.insert( "infoPanel", QJsonObject{ { "video", JsonText( Texts.Video ) },
                                             { "audio", JsonText( Texts.Audio ) },
                                             { "timecode", JsonText( Texts.Timecode ) } } );

    Report.insert( "frame", FrameReport( Source, Index ) );

    QJsonArray Properties;
    for( const auto& rRow : LumekVideoViewer::ComposePropertyRows( Source ) )
      Properties.append( QJsonArray{ JsonText( rRow.first ), JsonText( rRow.second ) } );
    Report.insert( "properties", Properties );
    WriteJson( o_rOut, Report, *Layout );
    return Exit_Success;
  }

  namespace
  {
    bool IsJPEGName( const std::string& i_rPath )
    {
      return boost::algorithm::iends_with( i_rPath, ".jpg" ) || boost::algorithm::iends_with( i_rPath, ".jpeg" );
    }

    // A single JPEG (a frame saved from a motion JPEG file, say): its marker segments. What was
    // found is shown even when the image is not whole, since that is when one looks.
    int DumpJPEGFile( const std::string& i_rPath, std::ostream& o_rOut, std::ostream& o_rErr )
    {
      UtilsIO::VLargeFile File;
      std::uint64_t Size = 0;
      if( !File.Open( i_rPath, UtilsIO::OpenMode_Read ) || !File.GetSize( Size ) )
      {
        o_rErr << "Cannot open " << i_rPath << std::endl;
        return Exit_CannotOpen;
      }
      std::vector< JPEGUtils::VJPEGSegment > Segments;
      const bool bWhole = JPEGUtils::ParseJPEG( File, Size, Segments );
      o_rOut << JPEGUtils::DumpJPEG( Segments, File );
      if( bWhole )
        return Exit_Success;
      o_rErr << "The JPEG is not whole: it is truncated or damaged." << std::endl;
      return Exit_FramesFailed;
    }
  } // namespace

  int RunDump( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    po::options_description Options;
    Options.add_options()( "file", po::value< std::string >()->required() );
    po::positional_options_description Positional;
    Positional.add( "file", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "dump", o_rErr );
    if( !Variables )
      return Exit_Usage;
    const std::string Path = ( *Variables )["file"].as< std::string >();
    if( IsJPEGName( Path ) )
      return DumpJPEGFile( Path, o_rOut, o_rErr );

    LumekVideoViewer::VVideoSource Source;
    if( !OpenSource( Source, Path, o_rErr ) )
      return Exit_CannotOpen;
    if( !Source.GetReader()->DumpFileStructure( o_rOut ) )
    {
      o_rErr << "This container has no structure to show." << std::endl;
      return Exit_CannotOpen;
    }
    return Exit_Success;
  }
} // namespace LumekVideoTool
