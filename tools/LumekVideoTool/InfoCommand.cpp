#include "app/VideoSource/VideoSourceTexts.h"
#include "tools/LumekVideoTool/Json.h"
#include "tools/LumekVideoTool/ToolCommon.h"

namespace po = boost::program_options;

namespace LumekVideoTool
{
  namespace
  {
    void WriteVideo( VJsonWriter& io_rJson, const LumekVideoViewer::VVideoSource& i_rSource )
    {
      const ZOL::IVideoFrameInfo& rInfo = i_rSource.GetVideoFrameInfo();
      io_rJson.Key( "video" ).BeginObject();
      io_rJson.Key( "payload" ).Value( ZOL::ToString( i_rSource.GetVideoPayload() ) );
      io_rJson.Key( "pixelFormat" ).Value( ZOL::ToString( rInfo.PixelFormat ) );
      io_rJson.Key( "width" ).Value( rInfo.ImageWidth );
      io_rJson.Key( "height" ).Value( rInfo.ImageHeight );
      io_rJson.Key( "frameRate" ).Value( i_rSource.GetFrameRate() );
      io_rJson.Key( "frameCount" ).Value( i_rSource.GetFrameCount() );
      io_rJson.Key( "missingFrames" ).Value( i_rSource.GetMissingFrameCount() );
      io_rJson.Key( "durationSeconds" ).Value( i_rSource.GetDurationInSeconds() );
      io_rJson.Key( "pixelAspectRatio" ).Value( rInfo.PixelAspectRatio );
      io_rJson.Key( "inverted" ).Value( rInfo.IsInverted() );
      io_rJson.EndObject();
    }

    void WriteAudio( VJsonWriter& io_rJson, const LumekVideoViewer::VVideoSource& i_rSource )
    {
      const ZOL::IAudioFrameInfo& rInfo = i_rSource.GetAudioFrameInfo();
      io_rJson.Key( "audio" ).BeginObject();
      io_rJson.Key( "payload" ).Value( ZOL::ToString( i_rSource.GetAudioPayload() ) );
      io_rJson.Key( "sampleFormat" ).Value( ZOL::ToString( rInfo.SampleFormat ) );
      io_rJson.Key( "sampleRate" ).Value( rInfo.SampleRate );
      io_rJson.Key( "channels" ).Value( rInfo.Channels );
      io_rJson.EndObject();
    }

    void WriteFrame( VJsonWriter& io_rJson, LumekVideoViewer::VVideoSource& io_rSource, std::uint64_t i_Index )
    {
      ZOL::IVideoFrame Frame;
      const bool bRead = io_rSource.GetFrame( i_Index, Frame );
      io_rJson.Key( "frame" ).BeginObject();
      io_rJson.Key( "index" ).Value( i_Index );
      io_rJson.Key( "read" ).Value( bRead );
      io_rJson.Key( "width" ).Value( Frame.VideoFrameInfo.ImageWidth );
      io_rJson.Key( "height" ).Value( Frame.VideoFrameInfo.ImageHeight );
      io_rJson.Key( "pixelFormat" ).Value( ZOL::ToString( Frame.VideoFrameInfo.PixelFormat ) );
      io_rJson.Key( "audioBlocks" ).BeginArray();
      for( const auto& rpBlock : Frame.Audio )
        io_rJson.Value( static_cast< std::uint64_t >( rpBlock ? rpBlock->GetSize() : 0 ) );
      io_rJson.EndArray();
      io_rJson.EndObject();
    }
  } // namespace

  int RunInfo( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    po::options_description Options;
    Options.add_options()( "file", po::value< std::string >()->required() )(
        "frame", po::value< std::uint64_t >()->default_value( 0 ) );
    po::positional_options_description Positional;
    Positional.add( "file", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "info", o_rErr );
    if( !Variables )
      return Exit_Usage;
    const std::string Path = ( *Variables )["file"].as< std::string >();
    const std::uint64_t Index = ( *Variables )["frame"].as< std::uint64_t >();

    LumekVideoViewer::VVideoSource Source;
    if( !OpenSource( Source, Path, o_rErr ) )
      return Exit_CannotOpen;

    VJsonWriter Json;
    Json.BeginObject();
    Json.Key( "file" ).Value( Path );
    const auto Container = ZOL::FindVideoContainer( Path );
    Json.Key( "container" ).Value( Container ? ZOL::ToString( *Container ) : "" );
    WriteVideo( Json, Source );
    WriteAudio( Json, Source );

    const LumekVideoViewer::VInfoPanelTexts Texts = LumekVideoViewer::ComposeInfoPanelTexts( Source, Index );
    Json.Key( "infoPanel" ).BeginObject();
    Json.Key( "video" ).Value( Texts.Video );
    Json.Key( "audio" ).Value( Texts.Audio );
    Json.Key( "timecode" ).Value( Texts.Timecode );
    Json.EndObject();

    WriteFrame( Json, Source, Index );

    Json.Key( "properties" ).BeginArray();
    for( const auto& rRow : LumekVideoViewer::ComposePropertyRows( Source ) )
      Json.BeginArray().Value( rRow.first ).Value( rRow.second ).EndArray();
    Json.EndArray();
    Json.EndObject();
    o_rOut << Json.GetText() << std::endl;
    return Exit_Success;
  }

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
