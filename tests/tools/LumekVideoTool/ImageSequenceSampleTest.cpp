// make-sample to a .lumekimagesequence: the sequence reader opens what it writes with the asked
// size, rate and gaps, its pictures are the sample scene's, and convert carries them to .lvid
// with the timecode.

#include "ToolRunner.h"

#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/LumekVideo/VReader.h"
#include "tests/support/FfmpegFixtures.h"
#include "tests/support/TestNames.h"
#include "tools/LumekVideoTool/SampleScene.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <set>

using namespace LumekVideoToolTest;

namespace
{
  constexpr int Width = 40;
  constexpr int Height = 24;
  constexpr int Frames = 6;
  constexpr double Rate = 50.0;
  // Frames 3 and 4 of six are the two a sample leaves out.
  const std::set< std::uint64_t > StoredFrames = { 0, 1, 2, 5 };

  struct VSequenceCase
  {
    const char* Name;
    const char* FrameFormat;
    const char* FirstFile;
    ZOL::EVideoPayload Payload;
    // Mean absolute differences over all samples, from the scene and from ffmpeg's decode of
    // the same file. PNG is exact; JPEG loses most at the colour edges of so small a picture,
    // where its halved chroma cannot follow, and decoders differ in how they widen it again.
    double MaxSceneDifference;
    double MaxFfmpegDifference;
  };

  const VSequenceCase s_Cases[] = {
      { "Png", "png", "take_00000000.png", ZOL::VideoPayload_ImagePNG, 0.0, 0.0 },
      { "Jpeg", "jpeg", "take_00000000.jpg", ZOL::VideoPayload_ImageJPEG, 8.0, 2.5 },
  };

  std::vector< std::uint8_t > ScenePixels( std::uint64_t i_Frame )
  {
    LumekVideoTool::VRGBImage Image( Width, Height );
    LumekVideoTool::RenderSampleScene( static_cast< int >( i_Frame ), Rate, Image );
    return Image.Pixels;
  }

  double MeanDifference( const std::vector< std::uint8_t >& i_rA, const std::uint8_t* i_pB )
  {
    double Sum = 0.0;
    for( std::size_t i = 0; i < i_rA.size(); ++i )
      Sum += std::abs( int( i_rA[i] ) - int( i_pB[i] ) );
    return i_rA.empty() ? 0.0 : Sum / i_rA.size();
  }

  std::string MakeSequence( const VScratch& i_rScratch, const char* i_pFrameFormat )
  {
    const std::string Path = i_rScratch.Path( "take.lumekimagesequence" );
    const VRun Make =
        RunInProcess( { "make-sample", Path, "--width", std::to_string( Width ), "--height", std::to_string( Height ),
                        "--frames", std::to_string( Frames ), "--fps", "50", "--frame-format", i_pFrameFormat } );
    EXPECT_EQ( Make.ExitCode, 0 ) << Make.Err;
    return Path;
  }

  class SampleImageSequence : public ::testing::TestWithParam< VSequenceCase >
  {
  };

  TEST_P( SampleImageSequence, OpensWithTheSceneAtTheAskedSizeAndRate )
  {
    const VSequenceCase& rCase = GetParam();
    VScratch Scratch;
    const std::string Path = MakeSequence( Scratch, rCase.FrameFormat );

    ImageSequenceIO::VImageSequenceReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetFrameCount(), std::uint64_t( Frames ) );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageWidth, Width );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageHeight, Height );
    EXPECT_EQ( Reader.GetVideoPayload(), rCase.Payload );
    EXPECT_EQ( Reader.GetVideoTiming().TicksPerSecond, 135000000u );
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, 2700000u );
    EXPECT_EQ( Reader.GetTimecode().ToText( 0, true, false ), "10:00:00:00 [25 fps]" );
    EXPECT_EQ( Reader.ExpandFileName( 0 ), Scratch.Path( rCase.FirstFile ) );

    for( std::uint64_t Frame = 0; Frame < std::uint64_t( Frames ); ++Frame )
    {
      ASSERT_EQ( Reader.HasFrame( Frame ), StoredFrames.count( Frame ) != 0 ) << Frame;
      if( !Reader.HasFrame( Frame ) )
        continue;
      ZOL::IVideoFrame Decoded;
      ASSERT_TRUE( Reader.ReadFrame( Frame, Decoded, true, false ) ) << Frame;
      ASSERT_EQ( Decoded.VideoFrameInfo.PixelFormat, ZOL::PixelFormat_R8G8B8 );
      const std::vector< std::uint8_t > Scene = ScenePixels( Frame );
      ASSERT_GE( Decoded.Video->GetSize(), Scene.size() );
      EXPECT_LE( MeanDifference( Scene, Decoded.Video->GetData() ), rCase.MaxSceneDifference ) << "frame " << Frame;

      // A second decoder, not ours, reads the same file.
      if( LumekTest::HaveFfmpeg() )
      {
        const std::vector< std::uint8_t > Ffmpeg = LumekTest::FfmpegDecode( Reader.ExpandFileName( Frame ), "rgb24" );
        ASSERT_EQ( Ffmpeg.size(), Scene.size() );
        EXPECT_LE( MeanDifference( Ffmpeg, Decoded.Video->GetData() ), rCase.MaxFfmpegDifference ) << "frame " << Frame;
      }
    }
  }

  INSTANTIATE_TEST_SUITE_P( FrameFormats, SampleImageSequence, ::testing::ValuesIn( s_Cases ), LumekTest::VCaseName() );

  TEST( SampleImageSequenceConvert, LvidKeepsPixelsGapsAndTimecode )
  {
    VScratch Scratch;
    const std::string Sequence = MakeSequence( Scratch, "png" );
    const std::string Output = Scratch.Path( "take.lvid" );
    const VRun Convert = RunInProcess( { "convert", Sequence, Output } );
    ASSERT_EQ( Convert.ExitCode, 0 ) << Convert.Err;

    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Output ) );
    EXPECT_EQ( Reader.GetFrameCount(), std::uint64_t( Frames ) );
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks * std::uint64_t( 135000000 ),
               std::uint64_t( 2700000 ) * Reader.GetVideoTiming().TicksPerSecond );
    EXPECT_EQ( Reader.GetTimecode().ToText( 0, true, false ), "10:00:00:00 [25 fps]" );
    ASSERT_EQ( Reader.GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_R8G8B8 );
    for( std::uint64_t Frame = 0; Frame < std::uint64_t( Frames ); ++Frame )
    {
      ASSERT_EQ( Reader.HasFrame( Frame ), StoredFrames.count( Frame ) != 0 ) << Frame;
      if( !Reader.HasFrame( Frame ) )
        continue;
      ZOL::IVideoFrame Stored;
      ASSERT_TRUE( Reader.ReadFrame( Frame, Stored, true, false ) ) << Frame;
      const std::vector< std::uint8_t > Scene = ScenePixels( Frame );
      ASSERT_EQ( Stored.Video->GetSize(), Scene.size() );
      EXPECT_EQ( MeanDifference( Scene, Stored.Video->GetData() ), 0.0 ) << "frame " << Frame;
    }
  }

} // namespace
