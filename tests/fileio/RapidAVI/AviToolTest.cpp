// lumekvideotool's "convert" of an AVI file to .lvid keeps the pictures and the audio that the
// AVI reader gives; the chunk tree it dumps is the reader's (AviDump).

#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <boost/filesystem.hpp>

namespace
{
  std::string Tool( const std::string& i_rArguments, int& o_rExitCode )
  {
    return LumekTest::RunCommand( std::string( LUMEK_TOOL_PATH ) + " " + i_rArguments + " 2>&1", &o_rExitCode );
  }

  // The audio bytes of one frame as the tool reports them; an AVI frame may hold its audio in
  // several chunks where the recording holds one block.
  std::uint64_t AudioBytesOf( const std::string& i_rPath, std::uint64_t i_Frame )
  {
    int ExitCode = -1;
    const std::string Json = Tool(
        "info " + LumekTest::ShellQuote( i_rPath ) + " --compact --frame " + std::to_string( i_Frame ), ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << Json;
    const std::string Key = "\"audioBlocks\":[";
    std::size_t Position = Json.find( Key );
    std::uint64_t Total = 0;
    for( Position += Key.size(); Position < Json.size() && Json[Position] != ']'; )
    {
      std::size_t Used = 0;
      Total += std::stoull( Json.substr( Position ), &Used );
      Position += Used + ( Json[Position + Used] == ',' ? 1 : 0 );
    }
    return Total;
  }
} // namespace

TEST( AviTool, ConvertToLvidKeepsPicturesAndAudio )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "ffmpeg is not installed";
  const std::string Path =
      LumekTest::FfmpegFixture( "avitool-uyvy.avi", { "-f", "lavfi", "-i", "testsrc2=size=64x48:rate=25", "-f", "lavfi",
                                                      "-i", "sine=f=440:r=48000", "-frames:v", "10", "-c:v", "rawvideo",
                                                      "-pix_fmt", "uyvy422", "-c:a", "pcm_s16le", "-shortest" } );
  ASSERT_FALSE( Path.empty() );
  int ExitCode = -1;
  const boost::filesystem::path Folder =
      boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "avitool-%%%%%%%%" );
  boost::filesystem::create_directories( Folder );
  const std::string Output = ( Folder / "converted.lvid" ).string();
  const std::string Out =
      Tool( "convert " + LumekTest::ShellQuote( Path ) + " " + LumekTest::ShellQuote( Output ), ExitCode );
  ASSERT_EQ( ExitCode, 0 ) << Out;
  // ffmpeg writes audio ahead of the pictures, so the last frames own none of it.
  std::uint64_t AllAudio = 0;
  for( std::uint64_t f = 0; f < 10; ++f )
  {
    const std::uint64_t Audio = AudioBytesOf( Path, f );
    AllAudio += Audio;
    EXPECT_EQ( AudioBytesOf( Output, f ), Audio ) << "frame " << f;
  }
  EXPECT_GT( AllAudio, 0u );
  // The pictures, as the tool draws them from each file.
  LumekTest::ExpectSameToolFrames( LUMEK_TOOL_PATH, Path, Output, 10 );
  boost::filesystem::remove_all( Folder );
}
