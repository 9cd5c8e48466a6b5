// lumekvideotool on MOV files: "dump" prints the atom tree, and "convert" to .lvid keeps the
// pictures, the audio and the timecode that the MOV reader gives.

#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <boost/filesystem.hpp>

namespace
{
  std::string Tool( const std::string& i_rArguments, int& o_rExitCode )
  {
    return LumekTest::RunCommand( std::string( LUMEK_TOOL_PATH ) + " " + i_rArguments + " 2>&1", &o_rExitCode );
  }

  // The tool's own view of a file: the information panel and each frame's audio block sizes.
  std::string InfoOf( const std::string& i_rPath, std::uint64_t i_Frame )
  {
    int ExitCode = -1;
    const std::string Json = Tool(
        "info " + LumekTest::ShellQuote( i_rPath ) + " --compact --frame " + std::to_string( i_Frame ), ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << Json;
    const auto Cut = [&]( const std::string& i_rKey )
    {
      const auto Start = Json.find( i_rKey );
      return Start == std::string::npos ? std::string() : Json.substr( Start, Json.find( '}', Start ) - Start );
    };
    return Cut( "\"infoPanel\"" ) + Cut( "\"audioBlocks\"" );
  }
} // namespace

TEST( MovTool, DumpsTheAtomTreeAndConvertsToLvidKeepingPicturesAudioAndTimecode )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "ffmpeg is not installed";
  const std::string Path = LumekTest::FfmpegFixture(
      "movtool-2vuy.mov", { "-f", "lavfi", "-i", "testsrc2=size=64x48:rate=25", "-f", "lavfi", "-i",
                            "sine=f=440:r=48000", "-frames:v", "10", "-c:v", "rawvideo", "-pix_fmt", "uyvy422", "-c:a",
                            "pcm_s16le", "-shortest", "-timecode", "01:02:03:04" } );
  ASSERT_FALSE( Path.empty() );
  // The tool's dump command prints the reader's atom tree (its whole text is MovAtomTree's).
  int ExitCode = -1;
  const std::string Dump = Tool( "dump " + LumekTest::ShellQuote( Path ), ExitCode );
  EXPECT_EQ( ExitCode, 0 ) << Dump;
  EXPECT_NE( Dump.find( "\n moov\n  mvhd\n  trak\n   tkhd\n" ), std::string::npos ) << Dump;

  const boost::filesystem::path Folder =
      boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "movtool-%%%%%%%%" );
  boost::filesystem::create_directories( Folder );
  const std::string Output = ( Folder / "converted.lvid" ).string();
  const std::string Out =
      Tool( "convert " + LumekTest::ShellQuote( Path ) + " " + LumekTest::ShellQuote( Output ), ExitCode );
  ASSERT_EQ( ExitCode, 0 ) << Out;
  // Timecode, audio format, size and rate as the panel shows them, and each frame's audio.
  const std::string Panel = InfoOf( Path, 0 );
  EXPECT_NE( Panel.find( "T: 01:02:03:04+00 [25 fps]" ), std::string::npos ) << Panel;
  for( std::uint64_t f = 0; f < 10; ++f )
    EXPECT_EQ( InfoOf( Output, f ), InfoOf( Path, f ) ) << "frame " << f;
  // The pictures, as the tool draws them from each file.
  LumekTest::ExpectSameToolFrames( LUMEK_TOOL_PATH, Path, Output, 10 );
  boost::filesystem::remove_all( Folder );
}
