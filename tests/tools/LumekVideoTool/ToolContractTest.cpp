// The tool's contract as scripts see it: exit codes, JSON, picture bytes, conversions.

#include "ToolRunner.h"

#include <gtest/gtest.h>

#include <boost/algorithm/string/predicate.hpp>

#include <sys/wait.h>
#include <unistd.h>

#include <csignal>

using namespace LumekVideoToolTest;

namespace
{
  std::vector< std::uint8_t > PPMPixels( const std::string& i_rPath, int& o_rWidth, int& o_rHeight )
  {
    const std::vector< std::uint8_t > Bytes = ReadFileBytes( i_rPath );
    const std::string Text( Bytes.begin(), Bytes.end() );
    int MaxValue = 0, Consumed = 0;
    if( std::sscanf( Text.c_str(), "P6\n%d %d\n%d\n%n", &o_rWidth, &o_rHeight, &MaxValue, &Consumed ) != 3 ||
        MaxValue != 255 )
      return {};
    return std::vector< std::uint8_t >( Bytes.begin() + Consumed, Bytes.end() );
  }
} // namespace

TEST( ToolUsage, ExitCodesForUsage )
{
  EXPECT_EQ( RunTool( {} ).ExitCode, 2 );
  EXPECT_EQ( RunTool( { "nonsense" } ).ExitCode, 2 );
  EXPECT_EQ( RunTool( { "info" } ).ExitCode, 2 );
  EXPECT_EQ( RunTool( { "info", "a.lvid", "--frame", "x" } ).ExitCode, 2 );
  EXPECT_EQ( RunTool( { "make-sample", "x.lvid", "--format", "bayerGB8" } ).ExitCode, 2 );
  const VRun Help = RunTool( { "--help" } );
  EXPECT_EQ( Help.ExitCode, 0 );
  EXPECT_TRUE( boost::starts_with( Help.Out, "Usage: lumekvideotool COMMAND" ) );
}

TEST( ToolUsage, UnopenableFilesExitWithOne )
{
  VScratch Scratch;
  WriteFileBytes( Scratch.Path( "empty.lvid" ), {} );
  for( const std::string& rPath :
       { Scratch.Path( "absent.lvid" ), Scratch.Path( "empty.lvid" ), Scratch.Path( "clip.MOV" ) } )
  {
    const VRun Run = RunTool( { "info", rPath } );
    EXPECT_EQ( Run.ExitCode, 1 ) << rPath;
    EXPECT_TRUE( boost::starts_with( Run.Err, "The video file could not be opened." ) ) << Run.Err;
  }
}

TEST( ToolInfo, ReportsWhatTheViewerShows )
{
  VScratch Scratch;
  VRecordingSpec Spec;
  Spec.Format = ZOL::PixelFormat_BayerGB8;
  Spec.Width = 64;
  Spec.Height = 48;
  Spec.Frames = { 0, 1, 2, 5 };
  Spec.bAudio = true;
  const std::string Path = WriteRecording( Scratch, "bayer.lvid", Spec );

  const VRun Run = RunTool( { "info", Path, "--frame", "1" } );
  ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
  const auto Json = ParseJson( Run.Out );
  EXPECT_EQ( Json.get< std::string >( "container" ), "LVID" );
  EXPECT_EQ( Json.get< std::string >( "video.payload" ), "Uncompressed" );
  EXPECT_EQ( Json.get< std::string >( "video.pixelFormat" ), "BayerGB8" );
  EXPECT_EQ( Json.get< int >( "video.width" ), 64 );
  EXPECT_EQ( Json.get< int >( "video.frameCount" ), 6 );
  EXPECT_EQ( Json.get< int >( "video.missingFrames" ), 2 );
  EXPECT_DOUBLE_EQ( Json.get< double >( "video.frameRate" ), 25.0 );
  EXPECT_DOUBLE_EQ( Json.get< double >( "video.durationSeconds" ), 0.24 );
  EXPECT_EQ( Json.get< std::string >( "audio.sampleFormat" ), "Int16" );
  EXPECT_EQ( Json.get< int >( "audio.channels" ), 2 );

  EXPECT_EQ( Json.get< std::string >( "infoPanel.video" ),
             "V: 64 x 48 / BayerGB8 / 25.00Hz / 6 frames (2 missing) / 0.24s" );
  EXPECT_EQ( Json.get< std::string >( "infoPanel.audio" ), "A: 2 channels / Int16 / 48000Hz" );
  // 25 fps timecode from 01:00:00:00; frame 1 is one timecode frame later.
  EXPECT_EQ( Json.get< std::string >( "infoPanel.timecode" ), "T: 01:00:00:01+00 [25 fps]" );

  EXPECT_EQ( Json.get< int >( "frame.index" ), 1 );
  EXPECT_TRUE( Json.get< bool >( "frame.read" ) );
  EXPECT_EQ( Json.get< std::string >( "frame.pixelFormat" ), "BayerGB8" );
  ASSERT_EQ( Json.get_child( "frame.audioBlocks" ).size(), 1u );
  EXPECT_EQ( Json.get_child( "frame.audioBlocks" ).front().second.get_value< int >(), 1920 * 4 );

  // The properties hold the file's own keys and the records in attribute form, in key order.
  std::vector< std::string > Keys;
  for( const auto& rRow : Json.get_child( "properties" ) )
  {
    std::vector< std::string > Pair;
    for( const auto& rCell : rRow.second )
      Pair.push_back( rCell.second.get_value< std::string >() );
    ASSERT_EQ( Pair.size(), 2u );
    Keys.push_back( Pair[0] );
    if( Pair[0] == "Test.Note" )
    {
      EXPECT_EQ( Pair[1], "written by the tool's tests" );
    }
    if( Pair[0] == "VideoFrameInfo.PixelFormat" )
    {
      EXPECT_EQ( Pair[1], "BayerGB8" );
    }
  }
  EXPECT_TRUE( std::is_sorted( Keys.begin(), Keys.end() ) );
  for( const char* pKey : { "Test.Note", "VideoFrameInfo.ImageWidth", "AudioFrameInfo.SampleRate", "GammaCorrection",
                            "Timecode.Hours", "TicksPerSecond" } )
    EXPECT_NE( std::find( Keys.begin(), Keys.end(), pKey ), Keys.end() ) << pKey;
}

TEST( ToolInfo, MissingFrameIsReportedAsUnread )
{
  VScratch Scratch;
  VRecordingSpec Spec;
  Spec.Frames = { 0, 2 };
  const std::string Path = WriteRecording( Scratch, "gap.lvid", Spec );
  const VRun Run = RunTool( { "info", Path, "--frame", "1" } );
  ASSERT_EQ( Run.ExitCode, 0 );
  const auto Json = ParseJson( Run.Out );
  EXPECT_FALSE( Json.get< bool >( "frame.read" ) );
  EXPECT_EQ( Json.get< std::string >( "infoPanel.audio" ), "" );
}

TEST( ToolFrames, WritesExpectedPixels )
{
  VScratch Scratch;
  for( ZOL::EPixelFormat Format : { ZOL::PixelFormat_R8G8B8, ZOL::PixelFormat_B8G8R8u8, ZOL::PixelFormat_Luminance8 } )
  {
    VRecordingSpec Spec;
    Spec.Format = Format;
    Spec.Frames = { 0, 1, 3 };
    const std::string Name = ZOL::ToString( Format );
    const std::string Path = WriteRecording( Scratch, Name + ".lvid", Spec );
    const std::string OutDir = Scratch.Path( Name );

    const VRun Run = RunTool( { "frames", Path, OutDir } );
    // Frame 2 is missing: reported, skipped, exit 3; the others are written.
    EXPECT_EQ( Run.ExitCode, 3 ) << Name;
    EXPECT_NE( Run.Err.find( "Frame 2" ), std::string::npos ) << Run.Err;
    EXPECT_FALSE( boost::filesystem::exists( OutDir + "/frame_000002.ppm" ) );
    for( std::uint64_t Frame : Spec.Frames )
    {
      int Width = 0, Height = 0;
      const auto Pixels = PPMPixels( OutDir + ( Frame == 3   ? "/frame_000003.ppm"
                                                : Frame == 1 ? "/frame_000001.ppm"
                                                             : "/frame_000000.ppm" ),
                                     Width, Height );
      ASSERT_EQ( Width, Spec.Width );
      ASSERT_EQ( Height, Spec.Height );
      const LumekVideoTool::VRGBImage Picture = PictureFor( Frame, Spec.Width, Spec.Height );
      for( std::size_t i = 0; i < Pixels.size(); i += 3 )
      {
        const std::uint8_t* p = Picture.Pixels.data() + i;
        if( Format == ZOL::PixelFormat_Luminance8 )
        {
          const std::uint8_t Y = LumekVideoTool::Luma( p[0], p[1], p[2] );
          ASSERT_EQ( Pixels[i], Y );
          ASSERT_EQ( Pixels[i + 1], Y );
          ASSERT_EQ( Pixels[i + 2], Y );
        }
        else
        {
          ASSERT_EQ( Pixels[i], p[0] ) << Name << " byte " << i;
          ASSERT_EQ( Pixels[i + 1], p[1] );
          ASSERT_EQ( Pixels[i + 2], p[2] );
        }
      }
    }
  }
}

TEST( ToolFrames, RangeAndPNG )
{
  VScratch Scratch;
  VRecordingSpec Spec;
  Spec.Frames = { 0, 1, 2, 3 };
  const std::string Path = WriteRecording( Scratch, "rgb.lvid", Spec );
  const VRun Run = RunTool( { "frames", Path, Scratch.Path( "png" ), "--first", "1", "--count", "2", "--png" } );
  EXPECT_EQ( Run.ExitCode, 0 ) << Run.Err;
  EXPECT_FALSE( boost::filesystem::exists( Scratch.Path( "png/frame_000000.png" ) ) );
  EXPECT_TRUE( boost::filesystem::exists( Scratch.Path( "png/frame_000001.png" ) ) );
  EXPECT_TRUE( boost::filesystem::exists( Scratch.Path( "png/frame_000002.png" ) ) );
  EXPECT_FALSE( boost::filesystem::exists( Scratch.Path( "png/frame_000003.png" ) ) );
  const auto Bytes = ReadFileBytes( Scratch.Path( "png/frame_000001.png" ) );
  ASSERT_GE( Bytes.size(), 8u );
  EXPECT_EQ( Bytes[1], 'P' );
  EXPECT_EQ( Bytes[2], 'N' );
}

TEST( ToolConvert, RoundTripKeepsFramesAndAttributes )
{
  VScratch Scratch;
  for( ZOL::EPixelFormat Format : { ZOL::PixelFormat_BayerGB8, ZOL::PixelFormat_U8Y8V8Y8, ZOL::PixelFormat_BayerGB6,
                                    ZOL::PixelFormat_U10Y10V10Y10 } )
  {
    VRecordingSpec Spec;
    Spec.Format = Format;
    Spec.Frames = { 0, 1, 4 };
    Spec.bAudio = true;
    Spec.Settings.GammaCorrection = 1.5f;
    const std::string Name = ZOL::ToString( Format );
    const std::string Input = WriteRecording( Scratch, Name + ".lvid", Spec );
    const std::string Output = Scratch.Path( Name + "-converted.lvid" );

    const VRun Convert = RunTool( { "convert", Input, Output } );
    ASSERT_EQ( Convert.ExitCode, 0 ) << Convert.Err;
    for( const auto& rEntry : boost::filesystem::directory_iterator( Scratch.Path( "" ) ) )
      EXPECT_EQ( rEntry.path().string().find( ".partial" ), std::string::npos ) << "left behind: " << rEntry.path();

    const VRun A = RunTool( { "frames", Input, Scratch.Path( Name + "-in" ) } );
    const VRun B = RunTool( { "frames", Output, Scratch.Path( Name + "-out" ) } );
    EXPECT_EQ( A.ExitCode, 3 );
    EXPECT_EQ( B.ExitCode, 3 );
    for( const char* pFrame : { "/frame_000000.ppm", "/frame_000001.ppm", "/frame_000004.ppm" } )
      EXPECT_EQ( ReadFileBytes( Scratch.Path( Name + "-in" ) + pFrame ),
                 ReadFileBytes( Scratch.Path( Name + "-out" ) + pFrame ) )
          << Name << pFrame;

    const auto In = ParseJson( RunTool( { "info", Input, "--frame", "4" } ).Out );
    const auto Out = ParseJson( RunTool( { "info", Output, "--frame", "4" } ).Out );
    EXPECT_EQ( In.get_child( "video" ), Out.get_child( "video" ) );
    EXPECT_EQ( In.get_child( "audio" ), Out.get_child( "audio" ) );
    EXPECT_EQ( In.get_child( "infoPanel" ), Out.get_child( "infoPanel" ) );
    EXPECT_EQ( In.get_child( "frame" ), Out.get_child( "frame" ) );
    // Every property of the input is kept, and the conversion is recorded.
    std::map< std::string, std::string > OutProperties;
    for( const auto& rRow : Out.get_child( "properties" ) )
      OutProperties[rRow.second.front().second.get_value< std::string >()] =
          rRow.second.back().second.get_value< std::string >();
    for( const auto& rRow : In.get_child( "properties" ) )
    {
      const std::string Key = rRow.second.front().second.get_value< std::string >();
      EXPECT_EQ( OutProperties[Key], rRow.second.back().second.get_value< std::string >() ) << Key;
    }
    EXPECT_EQ( OutProperties["ConversionRecord.0.Container"], "LVID" );
    EXPECT_EQ( OutProperties["ConversionRecord.0.VideoFrameInfo.PixelFormat"], Name );
  }
}

TEST( ToolConvert, RefusesToOverwriteItsInput )
{
  VScratch Scratch;
  const std::string Input = WriteRecording( Scratch, "same.lvid", VRecordingSpec() );
  const auto Before = ReadFileBytes( Input );
  EXPECT_EQ( RunTool( { "convert", Input, Input } ).ExitCode, 2 );
  EXPECT_EQ( RunTool( { "convert", Input, Scratch.Path( "./same.lvid" ) } ).ExitCode, 2 );
  EXPECT_EQ( ReadFileBytes( Input ), Before );
}

TEST( ToolBench, ReportsSpeed )
{
  VScratch Scratch;
  VRecordingSpec Spec;
  Spec.Format = ZOL::PixelFormat_BayerGB8;
  Spec.Frames = { 0, 1, 2, 3 };
  const std::string Path = WriteRecording( Scratch, "bench.lvid", Spec );
  const VRun Run = RunTool( { "bench", Path, "--software" } );
  ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
  const auto Json = ParseJson( Run.Out );
  EXPECT_EQ( Json.get< int >( "frames" ), 4 );
  EXPECT_GT( Json.get< double >( "fps" ), 0.0 );
  EXPECT_GT( Json.get< double >( "peakRssMiB" ), 0.0 );
}

TEST( ToolMakeSample, WritesAPlayableRecording )
{
  VScratch Scratch;
  const std::string Path = Scratch.Path( "sample.lvid" );
  const VRun Make =
      RunTool( { "make-sample", Path, "--width", "96", "--height", "54", "--frames", "10", "--fps", "50" } );
  ASSERT_EQ( Make.ExitCode, 0 ) << Make.Err;
  const auto Json = ParseJson( RunTool( { "info", Path } ).Out );
  EXPECT_EQ( Json.get< std::string >( "infoPanel.video" ),
             "V: 96 x 54 / BayerGB8 / 50.00Hz / 10 frames (2 missing) / 0.20s" );
  EXPECT_EQ( Json.get< std::string >( "infoPanel.audio" ), "A: 2 channels / Int16 / 48000Hz" );
  EXPECT_TRUE( boost::starts_with( Json.get< std::string >( "infoPanel.timecode" ), "T: 10:00:00:00" ) );
  // 960 stereo 16-bit samples a frame at 50 fps.
  EXPECT_EQ( Json.get_child( "frame.audioBlocks" ).front().second.get_value< int >(), 960 * 4 );

  const VRun NoAudio = RunTool( { "make-sample", Scratch.Path( "quiet.lvid" ), "--width", "32", "--height", "16",
                                  "--frames", "2", "--format", "U8Y8V8Y8", "--no-audio" } );
  ASSERT_EQ( NoAudio.ExitCode, 0 ) << NoAudio.Err;
  const auto Quiet = ParseJson( RunTool( { "info", Scratch.Path( "quiet.lvid" ) } ).Out );
  EXPECT_EQ( Quiet.get< std::string >( "audio.payload" ), "None" );
  EXPECT_EQ( Quiet.get< std::string >( "video.pixelFormat" ), "U8Y8V8Y8" );
}

TEST( ToolConvert, AnInterruptedConversionLeavesNoHalfFile )
{
  VScratch Scratch;
  VRecordingSpec Spec;
  Spec.Width = 1280;
  Spec.Height = 720;
  Spec.Frames.clear();
  for( std::uint64_t Frame = 0; Frame < 80; ++Frame )
    Spec.Frames.push_back( Frame );
  const std::string Input = WriteRecording( Scratch, "long.lvid", Spec );
  const std::string Output = Scratch.Path( "converted.lvid" );

  // Interrupt the conversion once its temporary file exists, as a user's Ctrl+C would.
  const pid_t Child = fork();
  ASSERT_GE( Child, 0 );
  if( Child == 0 )
  {
    std::freopen( "/dev/null", "w", stderr );
    execl( LUMEK_TOOL_PATH, LUMEK_TOOL_PATH, "convert", Input.c_str(), Output.c_str(),
           static_cast< char* >( nullptr ) );
    _exit( 127 );
  }
  const auto HasPartial = [&]
  {
    for( const auto& rEntry : boost::filesystem::directory_iterator( Scratch.Path( "" ) ) )
      if( rEntry.path().string().find( ".partial" ) != std::string::npos )
        return true;
    return false;
  };
  bool bSawPartial = false;
  for( int Poll = 0; Poll < 20000 && !bSawPartial; ++Poll )
  {
    bSawPartial = HasPartial();
    if( !bSawPartial )
      usleep( 100 );
  }
  kill( Child, SIGINT );
  int Status = 0;
  waitpid( Child, &Status, 0 );

  EXPECT_FALSE( HasPartial() );
  if( bSawPartial && WIFSIGNALED( Status ) )
  {
    EXPECT_FALSE( boost::filesystem::exists( Output ) );
  }
  else if( boost::filesystem::exists( Output ) )
  {
    // The conversion won the race and finished whole.
    EXPECT_EQ( RunTool( { "info", Output } ).ExitCode, 0 );
  }
}
