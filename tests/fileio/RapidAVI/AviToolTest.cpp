// lumekvideotool's "convert" of an AVI file to .lvid keeps the pictures and the audio that the
// AVI reader gives; the chunk tree it dumps is the reader's (AviDump).

#include "tests/fileio/MovIO/ContainerTestSupport.h"

TEST( AviTool, ConvertToLvidKeepsPicturesAndAudio )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "ffmpeg is not installed";
  const std::string Path = LumekTest::FfmpegFixture(
      "avitool-uyvy.avi",
      ContainerTest::Words( "-f lavfi -i testsrc2=size=64x48:rate=25 -f lavfi -i sine=f=440:r=48000 "
                            "-frames:v 10 -c:v rawvideo -pix_fmt uyvy422 -c:a pcm_s16le -shortest" ) );
  ASSERT_FALSE( Path.empty() );
  // An AVI frame may hold its audio in several chunks where the recording holds one block: the
  // bytes of each frame are compared. ffmpeg writes audio ahead of the pictures, so the last
  // frames own none of it.
  std::uint64_t AllAudio = 0;
  ContainerTest::ExpectConvertedAlike( Path, 10,
                                       [&]( const std::string& i_rJson )
                                       {
                                         const std::string Key = "\"audioBlocks\":[";
                                         std::uint64_t Total = 0;
                                         std::istringstream Sizes( i_rJson.substr( i_rJson.find( Key ) + Key.size() ) );
                                         for( std::uint64_t Size = 0; Sizes >> Size; Sizes.ignore( 1 ) )
                                           Total += Size;
                                         AllAudio += Total;
                                         return std::to_string( Total );
                                       } );
  EXPECT_GT( AllAudio, 0u );
}
