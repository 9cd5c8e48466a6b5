// lumekvideotool and Matroska: make-sample writes a file the reader opens, and convert to .lvid
// keeps every pixel, every audio byte and the start timecode.

#include "fileio/LumekVideo/VReader.h"
#include "fileio/MkvIO/VMkvReader.h"
#include "tests/fileio/MkvIO/MkvTestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

using namespace MkvTest;

namespace
{
  int RunTool( const std::string& i_rArguments )
  {
    int ExitCode = -1;
    RunCommand( ShellQuote( LUMEK_TOOL_PATH ) + " " + i_rArguments + " 2>&1", &ExitCode );
    return ExitCode;
  }

  TEST( MkvTool, ConvertToLvidKeepsPixelsAudioAndTimecode )
  {
    const VFamilyCase Case{ ZOL::PixelFormat_U8Y8V8Y8, ZOL::AudioSampleFormat_Int16 };
    const VTempFolder Folder;
    const std::string Input = Folder / "convert.mkv", Output = Folder / "converted.lvid";
    ASSERT_TRUE( WriteFamilyFile( Input, Case ) );
    ASSERT_EQ( RunTool( "convert " + ShellQuote( Input ) + " " + ShellQuote( Output ) ), 0 );
    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Output ) );
    ASSERT_EQ( Reader.GetFrameCount(), static_cast< std::uint64_t >( Case.Frames ) );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, Case.Format );
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, s_Timing.FramePeriodInTicks );
    const ZOL::ITimecode Expected = s_StartTimecode, Got = Reader.GetTimecode();
    EXPECT_EQ( std::tie( Got.Standards, Got.Hours, Got.Minutes, Got.Seconds, Got.Frames ),
               std::tie( Expected.Standards, Expected.Hours, Expected.Minutes, Expected.Seconds, Expected.Frames ) );
    for( int Frame = 0; Frame < Case.Frames; ++Frame )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      ASSERT_TRUE( Reader.ReadFrameData( Frame, pVideo, Audio, true, true ) );
      EXPECT_EQ( Bytes( pVideo ), RawFrame( Case, Frame ) ) << Frame;
      ASSERT_EQ( Audio.size(), 1u ) << Frame;
      EXPECT_EQ( Bytes( Audio[0] ), AudioBlock( Case, Frame ) ) << Frame;
    }
  }

  TEST( MkvTool, MakeSampleWritesMatroska )
  {
    const VTempFolder Folder;
    const std::string Output = Folder / "sample.mkv";
    ASSERT_EQ( RunTool( "make-sample --width 32 --height 16 --frames 4 --fps 25 " + ShellQuote( Output ) ), 0 );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Output ) );
    EXPECT_EQ( Reader.GetFrameCount(), 4u );
    EXPECT_EQ( std::tie( Reader.GetVideoFrameInfo().PixelFormat, Reader.GetVideoFrameInfo().ImageWidth ),
               std::tuple( ZOL::PixelFormat_U8Y8V8Y8, 32 ) );
    EXPECT_DOUBLE_EQ( Reader.GetVideoTiming().GetFrameRate(), 25.0 );
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleFormat, ZOL::AudioSampleFormat_Int16 );
    // A Bayer sample has no Matroska form: refused, not silently changed.
    EXPECT_NE( RunTool( "make-sample --format BayerGB8 --frames 2 " + ShellQuote( Output ) ), 0 );
  }
} // namespace
