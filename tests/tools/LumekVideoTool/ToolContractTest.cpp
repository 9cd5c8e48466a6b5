// The tool's contract as scripts see it: the usage text, exit codes and their messages, the
// pictures, recordings and reports it writes. Reports moved from a writer of our own to Qt's JSON
// classes: every key and value must stay, and other parsers must still read them. A conversion
// that is interrupted or killed leaves an existing output as it was, and a recording still being
// written is reported with the program that writes it.

#include "ToolRunner.h"

#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "tools/LumekVideoTool/Json.h"
#include "tools/LumekVideoTool/SampleScene.h"
#include "tools/LumekVideoTool/ToolCommands.h"

#include <gtest/gtest.h>

#include <QJsonDocument>

#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <map>
#include <numeric>
#include <thread>
#include <tuple>

using namespace LumekVideoToolTest;
namespace fs = boost::filesystem;

namespace
{
  // The files of a folder by name, with their bytes.
  std::map< std::string, VBytes > FolderFiles( const std::string& i_rFolder )
  {
    std::map< std::string, VBytes > Files;
    for( const auto& rEntry : fs::directory_iterator( i_rFolder ) )
      Files[rEntry.path().filename().string()] = ReadFileBytes( rEntry.path().string() );
    return Files;
  }

  struct VExitCase
  {
    std::vector< std::string > Arguments;
    int ExitCode;
    std::string ErrStart; // the start of what goes to standard error
  };

  TEST( ToolUsage, HelpPrintsTheUsageText )
  {
    // The manual page is made from this text, so it is compared whole.
    const VBytes Golden = ReadFileBytes( LUMEK_TOOL_GOLDEN_FOLDER "/usage.txt" );
    const VRun Help = RunTool( { "--help" } );
    EXPECT_EQ( Help.ExitCode, 0 );
    EXPECT_EQ( Help.Out, std::string( Golden.begin(), Golden.end() ) );
    // Without a command, the same text goes to standard error, as a usage error.
    const VRun None = RunTool( {} );
    EXPECT_EQ( None.ExitCode, 2 );
    EXPECT_EQ( None.Err, Help.Out );
    EXPECT_EQ( RunInProcess( { "info", "--help" } ).Out, Help.Out );
  }

  TEST( ToolUsage, EachFailureHasItsExitCodeAndMessage )
  {
    const VScratch Scratch;
    const std::string Clip = WriteRecording( Scratch, "clip.lvid", {} );
    const std::string Empty = WriteRecording( Scratch, "empty.lvid", { ZOL::PixelFormat_R8G8B8, 6, 4, {} } );
    WriteFileBytes( Scratch.Path( "zero.lvid" ), VBytes() );
    const std::string Absent = Scratch.Path( "absent.lvid" );
    const std::string Unopenable = "The video file could not be opened.\n";
    const std::string Sample = "lumekvideotool make-sample: ";
    const std::string Overwrite = "lumekvideotool convert: the output would overwrite the input\n";
    const std::string Thumbnail = Scratch.Path( "t.png" );
    std::vector< VExitCase > Cases = {
        { { "nonsense" }, 2, "lumekvideotool: unknown command 'nonsense'\n" },
        { { "info" }, 2, "lumekvideotool info: " },
        { { "info", Clip, "--frame", "x" }, 2, "lumekvideotool info: " },
        { { "info", Clip, "--compact", "--pretty" }, 2, "lumekvideotool: choose one of --compact and --pretty\n" },
        { { "convert", Clip, Clip }, 2, Overwrite },
        { { "convert", Clip, Scratch.Path( "./clip.lvid" ) }, 2, Overwrite },
        { { "thumbnail", Clip }, 2, "lumekvideotool thumbnail: " },
        { { "thumbnail", Clip, Thumbnail, "--size", "0" }, 2, "lumekvideotool thumbnail: --size must be between 1" },
        { { "make-sample", Scratch.Path( "x.lvid" ), "--format", "bayerGB8" }, 2, Sample + "unknown pixel format" },
        { { "info", Absent }, 1, Unopenable },
        { { "info", Scratch.Path( "zero.lvid" ) }, 1, Unopenable },
        { { "frames", Scratch.Path( "zero.lvid" ), Scratch.Path( "out" ) }, 1, Unopenable },
        // Extensions compare exactly: no reader takes "MOV".
        { { "info", Scratch.Path( "clip.MOV" ) }, 1, Unopenable },
        { { "thumbnail", Absent, Thumbnail }, 1, Unopenable },
        { { "thumbnail", Clip, Scratch.Path( "no/t.png" ) }, 1, "Cannot write " },
        { { "thumbnail", Empty, Thumbnail }, 3, "No frame of " },
    };
    // Every command parses its own options: an unknown one is its usage error, not the tool's.
    for( const LumekVideoTool::VToolCommand& rCommand : LumekVideoTool::ToolCommands() )
      Cases.push_back(
          { { rCommand.Name, "--no-such-option" }, 2, "lumekvideotool " + std::string( rCommand.Name ) + ": " } );
    // Samples make-sample refuses to write, and must leave no file behind.
    const std::string Refused = Scratch.Path( "refused" );
    fs::create_directories( Refused );
    for( const std::vector< std::string >& Refusal :
         std::vector< std::vector< std::string > >{ { "/take.avi" }, // no writer
                                                    { "/take.LVID" },
                                                    { "/take" },
                                                    { "/take.lvid", "--frame-format", "png" },
                                                    { "/take.lumekimagesequence", "--frame-format", "gif" },
                                                    { "/take.lumekimagesequence", "--format", "BayerGB8" } } )
    {
      Cases.push_back( { { "make-sample", Refused + Refusal[0], "--frames", "2" }, 2, Sample } );
      Cases.back().Arguments.insert( Cases.back().Arguments.end(), Refusal.begin() + 1, Refusal.end() );
    }

    const VBytes ClipBytes = ReadFileBytes( Clip );
    for( const VExitCase& rCase : Cases )
    {
      std::string CommandLine;
      for( const std::string& rArgument : rCase.Arguments )
        CommandLine += rArgument + " ";
      SCOPED_TRACE( CommandLine );
      const VRun Run = RunInProcess( rCase.Arguments );
      EXPECT_EQ( Run.ExitCode, rCase.ExitCode );
      EXPECT_EQ( Run.Err.rfind( rCase.ErrStart, 0 ), 0u ) << Run.Err;
    }
    EXPECT_EQ( ReadFileBytes( Clip ), ClipBytes );
    EXPECT_TRUE( fs::is_empty( Refused ) );
    // The code reaches the shell as the program's exit status.
    EXPECT_EQ( RunTool( { "info", Absent } ).ExitCode, 1 );
  }

  TEST( ToolConvert, KeepsFramesGapsAndProperties )
  {
    VScratch Scratch;
    for( ZOL::EPixelFormat Format : { ZOL::PixelFormat_BayerGB8, ZOL::PixelFormat_U8Y8V8Y8, ZOL::PixelFormat_BayerGB6,
                                      ZOL::PixelFormat_U10Y10V10Y10 } )
    {
      const std::string Name = ZOL::ToString( Format );
      SCOPED_TRACE( Name );
      VRecordingSpec Spec{ Format, 6, 4, { 0, 1, 4 }, true };
      Spec.Settings.GammaCorrection = 1.5f;
      const std::string Input = WriteRecording( Scratch, Name + ".lvid", Spec );
      const std::string Output = Scratch.Path( Name + "-converted.lvid" );
      const VRun Convert = RunInProcess( { "convert", Input, Output } );
      ASSERT_EQ( Convert.ExitCode, 0 ) << Convert.Err;
      EXPECT_FALSE( Scratch.Partial() );

      EXPECT_EQ( RunInProcess( { "frames", Input, Scratch.Path( Name + "-in" ) } ).ExitCode, 3 );
      EXPECT_EQ( RunInProcess( { "frames", Output, Scratch.Path( Name + "-out" ) } ).ExitCode, 3 );
      const auto Pictures = FolderFiles( Scratch.Path( Name + "-in" ) );
      EXPECT_EQ( Pictures.size(), 3u );
      EXPECT_TRUE( Pictures == FolderFiles( Scratch.Path( Name + "-out" ) ) );

      const auto In = ParseJson( RunInProcess( { "info", Input, "--frame", "4" } ).Out );
      const auto Out = ParseJson( RunInProcess( { "info", Output, "--frame", "4" } ).Out );
      for( const char* pPart : { "video", "audio", "infoPanel", "frame" } )
        EXPECT_EQ( In.get_child( pPart ), Out.get_child( pPart ) ) << pPart;
      // Every property of the input is kept, and the conversion is recorded.
      std::map< std::string, std::string > OutProperties;
      for( const auto& rRow : Out.get_child( "properties" ) )
        OutProperties[rRow.second.front().second.data()] = rRow.second.back().second.data();
      for( const auto& rRow : In.get_child( "properties" ) )
        EXPECT_EQ( OutProperties[rRow.second.front().second.data()], rRow.second.back().second.data() )
            << rRow.second.front().second.data();
      EXPECT_EQ( OutProperties["ConversionRecord.0.Container"], "LVID" );
      EXPECT_EQ( OutProperties["ConversionRecord.0.VideoFrameInfo.PixelFormat"], Name );
    }
  }

  TEST( ToolMakeSample, WritesImageSequencesOfTheScene )
  {
    // Mean differences from the scene over all samples: PNG is exact; JPEG loses most at the
    // colour edges of so small a picture, where its halved chroma cannot follow.
    const std::tuple< const char*, ZOL::EVideoPayload, double > Formats[] = {
        { "png", ZOL::VideoPayload_ImagePNG, 0.0 }, { "jpeg", ZOL::VideoPayload_ImageJPEG, 8.0 } };
    for( const auto& [pFormat, Payload, MaxDifference] : Formats )
    {
      SCOPED_TRACE( pFormat );
      VScratch Scratch;
      const std::string Path = Scratch.Path( "take.lumekimagesequence" );
      const VRun Make = RunInProcess( { "make-sample", Path, "--width", "40", "--height", "24", "--frames", "6",
                                        "--fps", "50", "--frame-format", pFormat } );
      ASSERT_EQ( Make.ExitCode, 0 ) << Make.Err;
      ImageSequenceIO::VImageSequenceReader Reader;
      ASSERT_TRUE( Reader.Open( Path ) );
      EXPECT_EQ( Reader.GetFrameCount(), 6u );
      EXPECT_EQ( Reader.GetVideoFrameInfo().ImageWidth, 40 );
      EXPECT_EQ( Reader.GetVideoFrameInfo().ImageHeight, 24 );
      EXPECT_EQ( Reader.GetVideoPayload(), Payload );
      EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, 135000000u / 50 );
      EXPECT_EQ( Reader.GetTimecode().ToText( 0, true, false ), "10:00:00:00 [25 fps]" );
      EXPECT_EQ( Reader.ExpandFileName( 0 ),
                 Scratch.Path( pFormat == std::string( "png" ) ? "take_00000000.png" : "take_00000000.jpg" ) );
      // Frames 3 and 4 of six are the two a sample leaves out.
      for( std::uint64_t Frame = 0; Frame < 6; ++Frame )
      {
        ASSERT_EQ( Reader.HasFrame( Frame ), Frame != 3 && Frame != 4 ) << Frame;
        ZOL::IVideoFrame Decoded;
        if( !Reader.HasFrame( Frame ) )
          continue;
        ASSERT_TRUE( Reader.ReadFrame( Frame, Decoded, true, false ) ) << Frame;
        LumekVideoTool::VRGBImage Scene( 40, 24 );
        LumekVideoTool::RenderSampleScene( static_cast< int >( Frame ), 50.0, Scene );
        ASSERT_EQ( Decoded.Video->GetSize(), Scene.Pixels.size() );
        double Sum = 0.0;
        for( std::size_t i = 0; i < Scene.Pixels.size(); ++i )
          Sum += std::abs( int( Scene.Pixels[i] ) - int( Decoded.Video->GetData()[i] ) );
        EXPECT_LE( Sum / Scene.Pixels.size(), MaxDifference ) << "frame " << Frame;
      }
    }
  }

  // A gap is reported as one range however long it is, as a damaged index may name a frame in
  // the billions; a frame that does not read is reported; the others are written all the same.
  TEST( ToolFrames, GapsAndUnreadableFramesAreReportedAndTheRestWritten )
  {
    VScratch Scratch;
    const std::string Path = WriteRecording( Scratch, "huge.lvid",
                                             { ZOL::PixelFormat_R8G8B8, 6, 4, { 0, 1, 3, std::uint64_t( 1 ) << 42 } } );
    const VRun Frames = RunInProcess( { "frames", Path, Scratch.Path( "out" ) } );
    EXPECT_EQ( Frames.ExitCode, 3 );
    EXPECT_NE( Frames.Err.find( "Frame 2 is missing.\nFrames 4 to 4398046511103 are missing." ), std::string::npos )
        << Frames.Err;
    EXPECT_EQ( FolderFiles( Scratch.Path( "out" ) ).size(), 4u );
    // A binary PPM of the picture written, as it is stored.
    const std::string Header = "P6\n6 4\n255\n";
    VBytes Expected( Header.begin(), Header.end() );
    const VBytes Pixels = PictureFor( 3, 6, 4 ).Pixels;
    Expected.insert( Expected.end(), Pixels.begin(), Pixels.end() );
    EXPECT_EQ( ReadFileBytes( Scratch.Path( "out/frame_000003.ppm" ) ), Expected );
    const auto Json = ParseJson( RunInProcess( { "info", Path, "--frame", "2" } ).Out );
    // The viewer's count of missing frames stops at the largest 32-bit number.
    EXPECT_EQ( Json.get< std::uint64_t >( "video.missingFrames" ), 2147483647u );
    EXPECT_FALSE( Json.get< bool >( "frame.read" ) );
    EXPECT_EQ( RunInProcess( { "bench", Path } ).ExitCode, 0 );
    EXPECT_EQ( RunInProcess( { "convert", Path, Scratch.Path( "copy.lvid" ) } ).ExitCode, 0 );

    // Frame 1's index entry (after the count, the second of 16 bytes) sent to the end of the file.
    VBytes Bytes = ReadFileBytes( Path );
    std::uint64_t Offset = 0;
    for( int i = 7; i >= 0; --i )
      Offset = Offset << 8 | Bytes[40 + i];
    for( int i = 0; i < 8; ++i )
      Bytes[Offset + 8 + 16 + 8 + i] = static_cast< std::uint8_t >( std::uint64_t( Bytes.size() ) >> ( 8 * i ) );
    WriteFileBytes( Path, Bytes );
    const VRun Damaged = RunInProcess( { "frames", Path, Scratch.Path( "damaged" ) } );
    EXPECT_EQ( Damaged.ExitCode, 3 );
    EXPECT_NE( Damaged.Err.find( "Frame 1 could not be read or decoded." ), std::string::npos ) << Damaged.Err;
    EXPECT_EQ( FolderFiles( Scratch.Path( "damaged" ) ).size(), 3u );
  }

  QJsonObject ParseObject( const std::string& i_rText )
  {
    QJsonParseError Error{};
    const QJsonDocument Document = QJsonDocument::fromJson( QByteArray::fromStdString( i_rText ), &Error );
    EXPECT_EQ( Error.error, QJsonParseError::NoError ) << i_rText;
    return Document.object();
  }

  std::size_t LineCount( const std::string& i_rText )
  {
    return std::count( i_rText.begin(), i_rText.end(), '\n' );
  }

  TEST( JsonReport, InfoAndBenchKeepEveryKeyOfTheEarlierWriterInEveryLayout )
  {
    const VScratch Scratch;
    const std::string Path = Scratch.Path( "a.lvid" );
    const VRun Make = RunInProcess(
        { "make-sample", Path, "--width", "16", "--height", "8", "--frames", "3", "--format", "BayerGB8" } );
    ASSERT_EQ( Make.ExitCode, 0 ) << Make.Err;
    // The golden file is the earlier writer's compact report of this very sample.
    const VBytes Golden = ReadFileBytes( LUMEK_TOOL_GOLDEN_FOLDER "/info-sample-BayerGB8-16x8-frame1.json" );
    QJsonObject Expected = ParseObject( std::string( Golden.begin(), Golden.end() ) );
    ASSERT_FALSE( Expected.isEmpty() );
    Expected["file"] = QString::fromStdString( Path );
    // A pipe gets the compact form by itself.
    for( const char* pLayout : { "", "--compact", "--pretty" } )
    {
      SCOPED_TRACE( pLayout );
      std::vector< std::string > Arguments = { "info", Path, "--frame", "1", pLayout };
      if( !*pLayout )
        Arguments.pop_back();
      const VRun Run = RunTool( Arguments );
      ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
      EXPECT_EQ( ParseObject( Run.Out ), Expected ) << Run.Out;
      if( std::string( pLayout ) == "--pretty" )
        EXPECT_EQ( Run.Out.rfind( "{\n    \"", 0 ), 0u ) << Run.Out;
      else
        EXPECT_EQ( LineCount( Run.Out ), 1u );
      // What a script would do with the report: read it with a parser that is not Qt's.
      EXPECT_EQ( ParseJson( Run.Out ).get< std::string >( "infoPanel.video" ),
                 "V: 16 x 8 / BayerGB8 / 100.00Hz / 3 frames (0 missing) / 0.03s" );
    }

    const VRun Bench = RunTool( { "bench", Path, "--software" } );
    ASSERT_EQ( Bench.ExitCode, 0 ) << Bench.Err;
    EXPECT_EQ( LineCount( Bench.Out ), 1u );
    const auto Report = ParseJson( Bench.Out );
    // Later figures may join these; the earlier writer's must stay.
    EXPECT_EQ( Report.get< int >( "frames" ), 3 );
    EXPECT_GT( Report.get< double >( "fps" ), 0.0 );
    EXPECT_GT( Report.get< double >( "peakRssMiB" ), 0.0 );
    EXPECT_GE( Report.get< double >( "seconds" ), 0.0 );
    EXPECT_NEAR( Report.get< double >( "msPerFrame" ) * Report.get< double >( "fps" ), 1000.0, 1e-6 );

    // The sample's options, the default one being the golden report's.
    const VRun Asked = RunTool( { "make-sample", Path, "--width", "96", "--height", "54", "--frames", "10", "--fps",
                                  "50", "--format", "U8Y8V8Y8", "--no-audio" } );
    ASSERT_EQ( Asked.ExitCode, 0 ) << Asked.Err;
    const auto Json = ParseJson( RunInProcess( { "info", Path } ).Out );
    EXPECT_EQ( Json.get< std::string >( "infoPanel.video" ),
               "V: 96 x 54 / U8Y8V8Y8 / 50.00Hz / 10 frames (2 missing) / 0.20s" );
    EXPECT_EQ( Json.get< std::string >( "audio.payload" ), "None" );
  }

  TEST( JsonText, TextsFromADamagedFileStayValid )
  {
    std::ostringstream Out;
    LumekVideoTool::WriteJson( Out,
                               QJsonObject{ { "a\"b", LumekVideoTool::JsonText( "line\n\x01\xff\xc3\xa9" ) },
                                            { "n", QJsonArray{ LumekVideoTool::JsonCount( ( 1ull << 53 ) - 1 ),
                                                               LumekVideoTool::JsonNumber( 2.5 ),
                                                               LumekVideoTool::JsonNumber( 1.0 / 0.0 ) } } },
                               LumekVideoTool::EJsonLayout::Compact );
    EXPECT_EQ( Out.str(), "{\"a\\\"b\":\"line\\n\\u0001\xef\xbf\xbd\xc3\xa9\",\"n\":[9007199254740991,2.5,null]}\n" );
  }

  TEST( ConvertReplace, AStoppedConversionLeavesTheExistingOutputUntouched )
  {
    const VScratch Scratch;
    const std::string Output = Scratch.Path( "out.lvid" );
    ASSERT_EQ( RunTool( { "convert", WriteRecording( Scratch, "small.lvid", {} ), Output } ).ExitCode, 0 );
    const VBytes Before = ReadFileBytes( Output );
    ASSERT_FALSE( Before.empty() );
    // Large enough that the conversion is still writing when the test looks.
    VRecordingSpec Large{ ZOL::PixelFormat_R8G8B8, 1280, 720, std::vector< std::uint64_t >( 60 ) };
    std::iota( Large.Frames.begin(), Large.Frames.end(), 0 );
    const std::string LargeInput = WriteRecording( Scratch, "large.lvid", Large );

    // A user's Ctrl+C lets the tool remove its temporary file; a kill leaves it behind. Either
    // way the output is replaced by a whole recording or not at all.
    for( const int Signal : { SIGINT, SIGKILL } )
    {
      SCOPED_TRACE( Signal == SIGINT ? "interrupted" : "killed" );
      const pid_t Child = fork();
      ASSERT_GE( Child, 0 );
      if( Child == 0 )
      {
        std::freopen( "/dev/null", "w", stderr );
        execl( LUMEK_TOOL_PATH, LUMEK_TOOL_PATH, "convert", LargeInput.c_str(), Output.c_str(),
               static_cast< char* >( nullptr ) );
        _exit( 127 );
      }
      const auto Deadline = std::chrono::steady_clock::now() + std::chrono::seconds( 60 );
      while( Scratch.Partial().value_or( 0 ) < ( 8u << 20 ) && std::chrono::steady_clock::now() < Deadline )
        std::this_thread::sleep_for( std::chrono::milliseconds( 1 ) );
      const bool bRunning = waitpid( Child, nullptr, WNOHANG ) == 0;
      kill( Child, Signal );
      waitpid( Child, nullptr, 0 );
      ASSERT_TRUE( bRunning ) << "the conversion ended before it could be stopped";
      EXPECT_EQ( Scratch.Partial().has_value(), Signal == SIGKILL );
      EXPECT_EQ( ReadFileBytes( Output ), Before );
      EXPECT_EQ( RunInProcess( { "info", Output } ).ExitCode, 0 );
    }
  }

  TEST( ConvertReplace, ARecordingStillBeingWrittenNamesItsWriter )
  {
    const VScratch Scratch;
    const std::string Path = Scratch.Path( "capturing.lvid" );
    // A capture that has its header but not yet its index, held open for writing by this test.
    const VBytes Whole = ReadFileBytes( WriteRecording( Scratch, "whole.lvid", {} ) );
    WriteFileBytes( Path, VBytes( Whole.begin(), Whole.begin() + Whole.size() / 2 ) );
    const int Held = open( Path.c_str(), O_WRONLY | O_APPEND | O_CLOEXEC );
    ASSERT_GE( Held, 0 );
    const VRun Run = RunTool( { "info", Path } );
    EXPECT_EQ( Run.ExitCode, 1 );
    EXPECT_EQ( Run.Err.rfind( "The video file could not be opened. It is still being written by ", 0 ), 0u ) << Run.Err;
    EXPECT_NE( Run.Err.find( " (process " + std::to_string( getpid() ) + ")." ), std::string::npos ) << Run.Err;
    close( Held );
    const VRun After = RunTool( { "info", Path } );
    EXPECT_EQ( After.Err.find( "still being written" ), std::string::npos ) << After.Err;
  }
} // namespace
