// lumekvideotool on MOV files: "dump" prints the atom tree, and "convert" to .lvid keeps the
// pictures, the audio and the timecode that the MOV reader gives. The conversion's code is the
// same for every container; the AVI reader's own view is checked by RapidAVITests.

#include "tests/fileio/MovIO/ContainerTestSupport.h"

#include <cstdio>

namespace
{
  // The tool's output, which must end with exit code 0.
  std::string Tool( const std::string& i_rArguments )
  {
    int ExitCode = -1;
    const std::string Out = LumekTest::RunCommand( LUMEK_TOOL_PATH " " + i_rArguments + " 2>&1", &ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << Out;
    return Out;
  }

  // The tool's report on one frame: its information panel and the frame's audio blocks.
  std::string PanelAndAudio( const std::string& i_rPath, int i_Frame )
  {
    const std::string Json =
        Tool( "info " + LumekTest::ShellQuote( i_rPath ) + " --compact --frame " + std::to_string( i_Frame ) );
    std::string Parts;
    for( const char* pKey : { "\"infoPanel\"", "\"audioBlocks\"" } )
    {
      const auto Start = Json.find( pKey );
      Parts += Start == std::string::npos ? "" : Json.substr( Start, Json.find( '}', Start ) - Start );
    }
    return Parts;
  }
} // namespace

TEST( MovTool, DumpsTheAtomTreeAndConvertsToLvidKeepingPicturesAudioAndTimecode )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "ffmpeg is not installed";
  const std::string Path = LumekTest::FfmpegFixture(
      "movtool-2vuy.mov",
      ContainerTest::Words( "-f lavfi -i testsrc2=size=64x48:rate=25 -f lavfi -i sine=f=440:r=48000 -frames:v 10 "
                            "-c:v rawvideo -pix_fmt uyvy422 -c:a pcm_s16le -shortest -timecode 01:02:03:04" ) );
  ASSERT_FALSE( Path.empty() );
  // The tool's dump command prints the reader's atom tree (its whole text is MovAtomTree's).
  const std::string Dump = Tool( "dump " + LumekTest::ShellQuote( Path ) );
  EXPECT_NE( Dump.find( "\n moov\n  mvhd\n  trak\n   tkhd\n" ), std::string::npos ) << Dump;
  EXPECT_NE( PanelAndAudio( Path, 0 ).find( "T: 01:02:03:04+00 [25 fps]" ), std::string::npos );

  // Timecode, audio format, size and rate as the panel shows them, and each frame's audio; the
  // pictures as the tool draws them from each file.
  const std::string Output = Path + ".lvid";
  std::remove( Output.c_str() );
  Tool( "convert " + LumekTest::ShellQuote( Path ) + " " + LumekTest::ShellQuote( Output ) );
  for( int f = 0; f < 10; ++f )
    EXPECT_EQ( PanelAndAudio( Output, f ), PanelAndAudio( Path, f ) ) << "frame " << f;
  LumekTest::ExpectSameToolFrames( LUMEK_TOOL_PATH, Path, Output, 10 );
}
