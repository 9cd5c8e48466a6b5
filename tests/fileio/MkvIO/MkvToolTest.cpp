// lumekvideotool and Matroska: make-sample writes a file the reader opens, and convert to .lvid
// keeps every pixel, every audio byte and the start timecode.

#include "fileio/LumekVideo/VReader.h"
#include "fileio/MkvIO/VMkvReader.h"
#include "tests/fileio/MkvIO/MkvTestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

namespace
{
  std::vector< std::uint8_t > Bytes( const std::shared_ptr< ZOL::IBuffer >& i_pBuffer )
  {
    if( !i_pBuffer )
      return {};
    const auto* pData = static_cast< const std::uint8_t* >( i_pBuffer->GetData() );
    return std::vector< std::uint8_t >( pData, pData + i_pBuffer->GetSize() );
  }

  int RunTool( const std::string& i_rArguments )
  {
    int ExitCode = -1;
    LumekTest::RunCommand( LumekTest::ShellQuote( LUMEK_TOOL_PATH ) + " " + i_rArguments + " 2>&1", &ExitCode );
    return ExitCode;
  }

  TEST( MkvTool, ConvertToLvidKeepsPixelsAudioAndTimecode )
  {
    MkvTest::VFamilyCase Case;
    Case.Name = "Convert";
    Case.Format = ZOL::PixelFormat_U8Y8V8Y8;
    Case.Audio = ZOL::AudioSampleFormat_Int16;
    const std::string Input = MkvTest::TempPath( "convert.mkv" );
    const std::string Output = MkvTest::TempPath( "converted.lvid" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Input, Case, {} ) );
    ASSERT_EQ( RunTool( "convert " + LumekTest::ShellQuote( Input ) + " " + LumekTest::ShellQuote( Output ) ), 0 );

    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Output ) );
    ASSERT_EQ( Reader.GetFrameCount(), static_cast< std::uint64_t >( Case.Frames ) );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, Case.Format );
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, MkvTest::Timing( Case ).FramePeriodInTicks );
    const ZOL::ITimecode Expected = MkvTest::StartTimecode();
    EXPECT_EQ( Reader.GetTimecode().Standards, Expected.Standards );
    EXPECT_EQ( Reader.GetTimecode().Hours, Expected.Hours );
    EXPECT_EQ( Reader.GetTimecode().Minutes, Expected.Minutes );
    EXPECT_EQ( Reader.GetTimecode().Seconds, Expected.Seconds );
    EXPECT_EQ( Reader.GetTimecode().Frames, Expected.Frames );
    for( int Frame = 0; Frame < Case.Frames; ++Frame )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      ASSERT_TRUE( Reader.ReadFrameData( Frame, pVideo, Audio, true, true ) );
      EXPECT_EQ( Bytes( pVideo ), MkvTest::RawFrame( Case, Frame ) ) << Frame;
      ASSERT_EQ( Audio.size(), 1u ) << Frame;
      EXPECT_EQ( Bytes( Audio[0] ), MkvTest::AudioBlock( Case, Frame ) ) << Frame;
    }
    std::remove( Input.c_str() );
    std::remove( Output.c_str() );
  }

  TEST( MkvTool, MakeSampleWritesMatroska )
  {
    const std::string Output = MkvTest::TempPath( "sample.mkv" );
    ASSERT_EQ( RunTool( "make-sample --width 32 --height 16 --frames 4 --fps 25 " + LumekTest::ShellQuote( Output ) ),
               0 );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Output ) );
    EXPECT_EQ( Reader.GetFrameCount(), 4u );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_U8Y8V8Y8 );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageWidth, 32 );
    EXPECT_DOUBLE_EQ( Reader.GetVideoTiming().GetFrameRate(), 25.0 );
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleFormat, ZOL::AudioSampleFormat_Int16 );
    // A Bayer sample has no Matroska form: refused, not silently changed.
    EXPECT_NE( RunTool( "make-sample --format BayerGB8 --frames 2 " + LumekTest::ShellQuote( Output ) ), 0 );
    std::remove( Output.c_str() );
  }
} // namespace
