// lumekvideotool on MOV files: "dump" prints the atom tree, and "convert" to .lvid keeps the
// pictures, the audio and the timecode that the MOV reader gives.

#include "MovTestSupport.h"

#include "tests/support/FfmpegFixtures.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <gtest/gtest.h>

#include <boost/filesystem.hpp>

namespace
{
  std::string Tool( const std::string& i_rArguments, int& o_rExitCode )
  {
    return LumekTest::RunCommand( std::string( LUMEK_TOOL_PATH ) + " " + i_rArguments + " 2>&1", &o_rExitCode );
  }

  std::string RawMovWithAudioAndTimecode()
  {
    return LumekTest::FfmpegFixture( "movtool-2vuy.mov",
                                     { "-f", "lavfi", "-i", "testsrc2=size=64x48:rate=25", "-f", "lavfi", "-i",
                                       "sine=f=440:r=48000", "-frames:v", "10", "-c:v", "rawvideo", "-pix_fmt",
                                       "uyvy422", "-c:a", "pcm_s16le", "-shortest", "-timecode", "01:02:03:04" } );
  }

  class MovToolTest : public ::testing::Test
  {
  protected:
    void SetUp() override
    {
      if( !LumekTest::HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
    }
  };

  TEST_F( MovToolTest, DumpPrintsTheAtomTree )
  {
    const std::string Path = RawMovWithAudioAndTimecode();
    ASSERT_FALSE( Path.empty() );
    int ExitCode = -1;
    const std::string Out = Tool( "dump " + LumekTest::ShellQuote( Path ), ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << Out;
    for( const char* pLine :
         { "\n moov\n  mvhd\n  trak\n   tkhd\n", "\n      tmcd\n       tcmi\n", "\n      stsd\n", "\n mdat\n" } )
      EXPECT_NE( Out.find( pLine ), std::string::npos ) << pLine << " in\n" << Out;
  }

  // The tool's own view of a file: the information panel and each frame's audio block sizes.
  std::string InfoOf( const std::string& i_rPath, std::uint64_t i_Frame )
  {
    int ExitCode = -1;
    const std::string Json = Tool(
        "info " + LumekTest::ShellQuote( i_rPath ) + " --compact --frame " + std::to_string( i_Frame ), ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << Json;
    const auto Cut = []( const std::string& i_rText, const std::string& i_rKey )
    {
      const auto Start = i_rText.find( i_rKey );
      return Start == std::string::npos ? std::string() : i_rText.substr( Start, i_rText.find( '}', Start ) - Start );
    };
    return Cut( Json, "\"infoPanel\"" ) + Cut( Json, "\"audioBlocks\"" );
  }

  TEST_F( MovToolTest, ConvertToLvidKeepsPicturesAudioAndTimecode )
  {
    const std::string Path = RawMovWithAudioAndTimecode();
    ASSERT_FALSE( Path.empty() );
    const boost::filesystem::path Folder =
        boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "movtool-%%%%%%%%" );
    boost::filesystem::create_directories( Folder );
    const std::string Output = ( Folder / "converted.lvid" ).string();
    int ExitCode = -1;
    std::string Out =
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

  // A MOV that carries the attribute stores of a recording in its QMDT atom shows what a .lvid
  // with those stores shows: pixel format, rate, display settings and the attributes' rows.
  TEST( MovToolQmdt, BayerMovShowsLikeARecording )
  {
    ZOL::IVideoAttributes FrameStore;
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = 16;
    Info.ImageHeight = 8;
    Info.PixelFormat = ZOL::PixelFormat_BayerGB8;
    ASSERT_TRUE( ZOL::WriteVideoFrameInfo( FrameStore, Info ) );
    ZOL::IVideoAttributes Attributes;
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = 1350000;
    ASSERT_TRUE( ZOL::WriteVideoTiming( Attributes, Timing ) );
    ZOL::IVideoSettings Settings;
    Settings.Saturation = 1.5f;
    Settings.GammaCorrection = 0.75f;
    ASSERT_TRUE( ZOL::WriteVideoSettings( Attributes, "", Settings ) );
    CoreLumekTypes::VLensDistortionCalibration Lens;
    Lens.RadialDistortionParameters = { 0.125, -0.5 };
    ASSERT_TRUE( ZOL::WriteLensDistortionCalibration( Attributes, "", Lens ) );
    UtilsIO::VMemoryStream Stores;
    ASSERT_TRUE( FrameStore.WriteTo( Stores ) && Attributes.WriteTo( Stores ) );
    MovTest::VMovSpec Spec;
    Spec.BytesPerPixelTimes2 = 2;
    Spec.Qmdt = Stores.GetData();
    const std::string Path = MovTest::WriteTempFile( "bayer.mov", MovTest::WriteMov( Spec ) );

    int ExitCode = -1;
    const std::string Json = Tool( "info " + LumekTest::ShellQuote( Path ) + " --compact", ExitCode );
    ASSERT_EQ( ExitCode, 0 ) << Json;
    for( const char* pText : { "\"video\":\"V: 16 x 8 / BayerGB8 / 100.00Hz / 6 frames (0 missing) / 0.06s\"",
                               "[\"Saturation\",\"1.5\"]", "[\"GammaCorrection\",\"0.75\"]",
                               "[\"LensDistortionCalibration.RadialDistortionParameters_0\",\"0.125\"]" } )
      EXPECT_NE( Json.find( pText ), std::string::npos ) << pText << " in\n" << Json;
    boost::filesystem::remove( Path );
  }
} // namespace
