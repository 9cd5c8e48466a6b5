// Real image sequences made by ffmpeg, described by the project's own descriptor writer, read
// and decoded by the reader, and compared with ffmpeg's decode of the same files.

#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/VideoReaders/CreateVideoReader.h"
#include "tests/fileio/ImageSequenceIO/SequenceTestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <cstdlib>

using namespace ImageSequenceTest;

namespace
{
  struct VImageCase
  {
    const char* Label;
    const char* Extension;
    const char* FfmpegPixelFormat;
    // JPEG decoders may round and upsample chroma their own way; lossless files match exactly.
    int MaxDifference;
    double MaxMeanDifference;
    // Grey images stay grey; everything else decodes to colour.
    ZOL::EPixelFormat Decoded = ZOL::PixelFormat_R8G8B8;
    const char* FfmpegDecodeFormat = "rgb24";
  };

  const VImageCase s_Images[] = {
      { "Jpeg420", ".jpg", "yuvj420p", 48, 2.0 },
      { "Jpeg422", ".jpeg", "yuvj422p", 48, 2.0 },
      { "PngRgb", ".png", "rgb24", 0, 0.0 },
      { "PngGrey", ".png", "gray", 0, 0.0, ZOL::PixelFormat_Luminance8, "gray" },
      { "Tiff", ".tif", "rgb24", 0, 0.0 },
  };

  constexpr std::uint32_t FrameCount = 4;
  // Frame 1 is left out: a missing frame.
  constexpr std::uint64_t StoredFrames[] = { 0, 2, 3 };

  class SequenceImages : public testing::TestWithParam< VImageCase >
  {
  protected:
    void SetUp() override
    {
      if( !LumekTest::HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
      const VImageCase& rCase = GetParam();
      for( const std::uint64_t Frame : StoredFrames )
      {
        const std::string Fixture = LumekTest::FfmpegFixture(
            std::string( "sequence-" ) + rCase.Label + "-" + std::to_string( Frame ) + rCase.Extension,
            { "-f", "lavfi", "-i", "testsrc2=size=48x32:rate=25:duration=1", "-vf",
              "trim=start_frame=" + std::to_string( Frame ), "-frames:v", "1", "-pix_fmt", rCase.FfmpegPixelFormat } );
        ASSERT_FALSE( Fixture.empty() );
        CopyFile( Fixture, FileName( Frame ) );
      }
      m_Pattern = std::string( "take_%FRAME%" ) + rCase.Extension;
      ImageSequenceIO::VDescriptor Descriptor = MakeDescriptor( m_Pattern, FrameCount, 4 );
      Descriptor.Timecode.Standards = ZOL::TimecodeStandard_25;
      Descriptor.Timecode.Hours = 10;
      ASSERT_TRUE( ImageSequenceIO::WriteDescriptor( m_Folder / "take_.lumekimagesequence", Descriptor ) );
    }

    std::string FileName( std::uint64_t i_Frame ) const
    {
      return m_Folder / ( "take_000" + std::to_string( i_Frame ) + GetParam().Extension );
    }

    void ExpectPixelsOfFfmpeg( ZOL::IVideoReader& io_rReader )
    {
      const VImageCase& rCase = GetParam();
      for( const std::uint64_t Frame : StoredFrames )
      {
        ZOL::IVideoFrame Decoded;
        ASSERT_TRUE( io_rReader.ReadFrame( Frame, Decoded, true, true ) ) << Frame;
        ASSERT_EQ( rCase.Decoded, Decoded.VideoFrameInfo.PixelFormat );
        ASSERT_EQ( 48, Decoded.VideoFrameInfo.ImageWidth );
        ASSERT_EQ( 32, Decoded.VideoFrameInfo.ImageHeight );
        const std::vector< std::uint8_t > Expected =
            LumekTest::FfmpegDecode( FileName( Frame ), rCase.FfmpegDecodeFormat );
        // The frame's buffer is sized for colour before the image says it is grey: the pixels
        // are at its start.
        ASSERT_FALSE( Expected.empty() );
        ASSERT_LE( Expected.size(), Decoded.Video->GetSize() );
        int MaxDifference = 0;
        double Sum = 0.0;
        for( std::size_t i = 0; i < Expected.size(); ++i )
        {
          const int Difference = std::abs( int( Expected[i] ) - int( Decoded.Video->GetData()[i] ) );
          MaxDifference = std::max( MaxDifference, Difference );
          Sum += Difference;
        }
        EXPECT_LE( MaxDifference, rCase.MaxDifference ) << "frame " << Frame;
        EXPECT_LE( Sum / static_cast< double >( Expected.size() ), rCase.MaxMeanDifference ) << "frame " << Frame;
      }
      ZOL::IVideoFrame Missing;
      EXPECT_FALSE( io_rReader.ReadFrame( 1, Missing, true, false ) );
    }

    VTempFolder m_Folder;
    std::string m_Pattern;
  };

  TEST_P( SequenceImages, ThroughThePatternDecodesAsFfmpegDoes )
  {
    const auto pReader = CreateVideoReader( m_Folder / m_Pattern );
    ASSERT_TRUE( pReader && pReader->Open( m_Folder / m_Pattern ) );
    EXPECT_EQ( FrameCount, pReader->GetFrameCount() );
    EXPECT_EQ( 10, pReader->GetTimecode().Hours );
    EXPECT_DOUBLE_EQ( 25.0, pReader->GetVideoTiming().GetFrameRate() );
    ExpectPixelsOfFfmpeg( *pReader );
  }

  TEST_P( SequenceImages, ThroughAMiddleImageFindsTheDescriptor )
  {
    const std::string Middle = FileName( 2 );
    const auto pReader = CreateVideoReader( Middle );
    ASSERT_TRUE( pReader && pReader->Open( Middle ) );
    auto& rSequence = dynamic_cast< ImageSequenceIO::VImageSequenceReader& >( *pReader );
    EXPECT_EQ( m_Folder / "take_.lumekimagesequence", rSequence.GetDescriptorPath() );
    EXPECT_EQ( FrameCount, rSequence.GetFrameCount() );
    EXPECT_EQ( 3u, rSequence.GetStoredFrameCount() );
    ExpectPixelsOfFfmpeg( rSequence );
  }

  TEST_P( SequenceImages, WithoutADescriptorTheRunStillPlays )
  {
    std::remove( ( m_Folder / "take_.lumekimagesequence" ).c_str() );
    const auto pReader = CreateVideoReader( FileName( 3 ) );
    ASSERT_TRUE( pReader && pReader->Open( FileName( 3 ) ) );
    EXPECT_EQ( FrameCount, pReader->GetFrameCount() );
    ExpectPixelsOfFfmpeg( *pReader );
  }

  INSTANTIATE_TEST_SUITE_P( Formats, SequenceImages, testing::ValuesIn( s_Images ),
                            []( const testing::TestParamInfo< VImageCase >& i_rInfo ) { return i_rInfo.param.Label; } );
} // namespace
