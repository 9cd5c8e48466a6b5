#pragma once

// Runs lumekvideotool, as a program the way scripts do or in this process where only the
// command's answer matters, on recordings written here.

#include "fileio/LumekVideo/VWriter.h"
#include "tests/support/FfmpegFixtures.h"
#include "tests/support/Files.h"
#include "tests/support/LogCapture.h"
#include "tools/LumekVideoTool/FrameEncoding.h"
#include "tools/LumekVideoTool/ToolCommands.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <boost/filesystem.hpp>
#include <boost/property_tree/json_parser.hpp>
#include <boost/property_tree/ptree.hpp>
#include <gtest/gtest.h>

#include <fstream>
#include <optional>
#include <sstream>
#include <string>
#include <vector>

namespace LumekVideoToolTest
{
  using VBytes = std::vector< std::uint8_t >;

  using LumekTest::ReadFileBytes;
  using LumekTest::WriteFileBytes;

  // A folder of its own for each test, removed at the end.
  struct VScratch
  {
    VScratch() { boost::filesystem::create_directories( Folder ); }
    ~VScratch() { boost::filesystem::remove_all( Folder, Error ); }
    std::string Path( const std::string& i_rName ) const { return ( Folder / i_rName ).string(); }
    // The size of the largest temporary file a conversion left here, if it left any.
    std::optional< std::uint64_t > Partial() const
    {
      std::optional< std::uint64_t > Largest;
      boost::system::error_code Error;
      for( boost::filesystem::directory_iterator It( Folder, Error ), End; !Error && It != End; It.increment( Error ) )
        if( It->path().filename().string().find( ".partial" ) != std::string::npos )
          Largest = std::max( Largest.value_or( 0 ), boost::filesystem::file_size( It->path(), Error ) );
      return Largest;
    }

    const boost::filesystem::path Folder =
        boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "lvtool-test-%%%%%%%%" );
    boost::system::error_code Error;
  };

  struct VRun
  {
    int ExitCode = -1; // the shell gives 128 + the signal for a program killed by one
    std::string Out;
    std::string Err;
  };

  // Runs the real lumekvideotool program with the arguments, its standard output a pipe.
  inline VRun RunTool( const std::vector< std::string >& i_rArguments )
  {
    const VScratch Streams;
    std::string Command = LumekTest::ShellQuote( LUMEK_TOOL_PATH );
    for( const std::string& rArgument : i_rArguments )
      Command += " " + LumekTest::ShellQuote( rArgument );
    VRun Run;
    Run.Out = LumekTest::RunCommand( Command + " 2>" + LumekTest::ShellQuote( Streams.Path( "err" ) ) + " </dev/null",
                                     &Run.ExitCode );
    const VBytes Err = ReadFileBytes( Streams.Path( "err" ) );
    Run.Err.assign( Err.begin(), Err.end() );
    return Run;
  }
  // Runs the command in this process, with the log kept off standard error.
  inline VRun RunInProcess( const std::vector< std::string >& i_rArguments )
  {
    const LumekTest::VLogCapture Quiet;
    std::ostringstream Out, Err;
    const int ExitCode = LumekVideoTool::RunTool( i_rArguments, Out, Err );
    return { ExitCode, Out.str(), Err.str() };
  }

  // Parses JSON text with a parser other than the tool's; fails the test on bad JSON.
  inline boost::property_tree::ptree ParseJson( const std::string& i_rText )
  {
    boost::property_tree::ptree Tree;
    std::istringstream Stream( i_rText );
    try
    {
      boost::property_tree::read_json( Stream, Tree );
    }
    catch( const std::exception& rException )
    {
      ADD_FAILURE() << "not JSON: " << rException.what() << "\n" << i_rText;
    }
    return Tree;
  }

  struct VRecordingSpec
  {
    ZOL::EPixelFormat Format = ZOL::PixelFormat_R8G8B8;
    int Width = 6;
    int Height = 4;
    std::vector< std::uint64_t > Frames = { 0, 1, 2 };
    bool bAudio = false;
    bool bInverted = false; // rows stored bottom to top
    ZOL::IVideoSettings Settings = {};
  };

  // A recording whose frame n is PictureFor( n ), written with the .lvid writer, with 25 fps
  // timing, a timecode from 01:00:00:00 and a key of its own.
  inline LumekVideoTool::VRGBImage PictureFor( std::uint64_t i_Frame, int i_Width, int i_Height )
  {
    LumekVideoTool::VRGBImage Image( i_Width, i_Height );
    for( int y = 0; y < i_Height; ++y )
      for( int x = 0; x < i_Width; ++x )
      {
        std::uint8_t* p = Image.At( x, y );
        p[0] = static_cast< std::uint8_t >( 20 + 30 * x + 7 * i_Frame );
        p[1] = static_cast< std::uint8_t >( 40 + 25 * y + 3 * i_Frame );
        p[2] = static_cast< std::uint8_t >( 200 - 10 * x - 10 * y );
      }
    return Image;
  }

  inline std::string WriteRecording( const VScratch& i_rScratch, const std::string& i_rName,
                                     const VRecordingSpec& i_rSpec )
  {
    ZOL::IVideoFrameInfo Video;
    Video.ImageWidth = i_rSpec.Width;
    Video.ImageHeight = i_rSpec.Height;
    Video.PixelFormat = i_rSpec.Format;
    Video.PixelAspectRatio = 1.0;
    if( i_rSpec.bInverted )
      Video.Flags |= ZOL::IVideoFrameInfo::Flag_Inverted;
    ZOL::IAudioFrameInfo Audio;
    if( i_rSpec.bAudio )
      Audio = { ZOL::AudioSampleFormat_Int16, 48000, 2 };
    ZOL::IVideoAttributes Attributes;
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = Timing.TicksPerSecond / 25;
    ZOL::WriteVideoTiming( Attributes, Timing );
    ZOL::WriteVideoSettings( Attributes, "", i_rSpec.Settings );
    ZOL::ITimecode Timecode;
    Timecode.Standards = ZOL::TimecodeStandard_25;
    Timecode.Hours = 1;
    ZOL::WriteTimecode( Attributes, Timecode );
    Attributes.Set( "Test.Note", "written by the tool's tests" );
    // A camera and its lens, which a conversion must carry over.
    ZOL::WriteCameraHardware( Attributes, { "urn:lumek:cam:7", "7", "V5", "Vantage 5", 64, 48, 1.0 } );
    ZOL::WriteLensDistortionCalibration( Attributes, "", { ZOL::RadialModel_Lumek2Parameter, { 0.2, -0.05 }, 3, 2 } );

    const std::string Path = i_rScratch.Path( i_rName );
    LumekVideo::VWriter Writer;
    EXPECT_TRUE( Writer.Create( Path, Video, Audio, Attributes ) );
    for( std::uint64_t Frame : i_rSpec.Frames )
    {
      const auto Bytes =
          LumekVideoTool::EncodeFrame( PictureFor( Frame, i_rSpec.Width, i_rSpec.Height ), i_rSpec.Format );
      const VBytes Tone( i_rSpec.bAudio ? 1920 * 4 : 0, static_cast< std::uint8_t >( Frame ) );
      EXPECT_TRUE(
          Writer.AppendFrame( Frame, Bytes.data(), Bytes.size(), Tone.empty() ? nullptr : Tone.data(), Tone.size() ) );
    }
    EXPECT_TRUE( Writer.Close() );
    return Path;
  }

} // namespace LumekVideoToolTest
