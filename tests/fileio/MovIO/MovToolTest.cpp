// lumekvideotool on MOV files: "dump" prints the atom tree, and "convert" to .lvid keeps the
// pictures, the audio and the timecode that the MOV reader gives.

#include "tests/fileio/MovIO/ContainerTestSupport.h"

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
  const std::string Dump = ContainerTest::Tool( "dump " + LumekTest::ShellQuote( Path ) );
  EXPECT_NE( Dump.find( "\n moov\n  mvhd\n  trak\n   tkhd\n" ), std::string::npos ) << Dump;
  const std::string Panel = ContainerTest::Tool( "info " + LumekTest::ShellQuote( Path ) + " --compact --frame 0" );
  EXPECT_NE( Panel.find( "T: 01:02:03:04+00 [25 fps]" ), std::string::npos ) << Panel;
  // Timecode, audio format, size and rate as the panel shows them, and each frame's audio.
  ContainerTest::ExpectConvertedAlike( Path, 10,
                                       []( const std::string& i_rJson )
                                       {
                                         const auto Cut = [&]( const std::string& i_rKey )
                                         {
                                           const auto Start = i_rJson.find( i_rKey );
                                           return Start == std::string::npos
                                                      ? std::string()
                                                      : i_rJson.substr( Start, i_rJson.find( '}', Start ) - Start );
                                         };
                                         return Cut( "\"infoPanel\"" ) + Cut( "\"audioBlocks\"" );
                                       } );
}
