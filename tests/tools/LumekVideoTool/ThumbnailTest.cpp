// Thumbnails are what a file manager shows of a recording: the first frame that reads, as the
// viewer shows it, fitted into the requested square.

#include "ToolRunner.h"

#include "tests/support/FfmpegFixtures.h"
#include "tests/support/TestNames.h"

#include <gtest/gtest.h>

#include <QImage>

#include <cstdlib>

using namespace LumekVideoToolTest;

namespace
{
  QImage LoadPNG( const std::string& i_rPath )
  {
    return QImage( QString::fromStdString( i_rPath ), "PNG" ).convertToFormat( QImage::Format_RGB888 );
  }

  QImage ScaledTo( const QImage& i_rImage, const QSize& i_rSize )
  {
    return i_rImage.scaled( i_rSize, Qt::IgnoreAspectRatio, Qt::SmoothTransformation )
        .convertToFormat( QImage::Format_RGB888 );
  }

  // The largest difference of any channel of any pixel.
  int LargestDifference( const QImage& i_rA, const QImage& i_rB )
  {
    int Largest = 0;
    for( int y = 0; y < i_rA.height(); ++y )
      for( int x = 0; x < i_rA.width() * 3; ++x )
        Largest =
            std::max( Largest, std::abs( int( i_rA.constScanLine( y )[x] ) - int( i_rB.constScanLine( y )[x] ) ) );
    return Largest;
  }

  double MeanOf( const QImage& i_rImage, int i_Channel )
  {
    double Sum = 0.0;
    for( int y = 0; y < i_rImage.height(); ++y )
      for( int x = 0; x < i_rImage.width(); ++x )
        Sum += i_rImage.constScanLine( y )[x * 3 + i_Channel];
    return Sum / ( double( i_rImage.width() ) * i_rImage.height() );
  }

  // The thumbnail of the input at this size, and the frames command's picture of its first
  // frame, scaled alike: the thumbnail shows what the viewer does.
  QImage ThumbnailLikeItsFrame( const VScratch& i_rScratch, const std::string& i_rInput, int i_Size,
                                std::uint64_t i_First, QImage& o_rFrame )
  {
    const VRun Run =
        RunInProcess( { "thumbnail", i_rInput, i_rScratch.Path( "thumb.png" ), "--size", std::to_string( i_Size ) } );
    EXPECT_EQ( Run.ExitCode, 0 ) << Run.Err;
    const std::string Frames = i_rScratch.Path( "frames" + std::to_string( i_First ) );
    EXPECT_EQ(
        RunInProcess( { "frames", i_rInput, Frames, "--first", std::to_string( i_First ), "--count", "1", "--png" } )
            .ExitCode,
        0 );
    const QImage Thumbnail = LoadPNG( i_rScratch.Path( "thumb.png" ) );
    o_rFrame =
        LoadPNG( Frames + "/" +
                 QString::asprintf( "frame_%06llu.png", static_cast< unsigned long long >( i_First ) ).toStdString() );
    EXPECT_FALSE( Thumbnail.isNull() || o_rFrame.isNull() );
    EXPECT_LE( LargestDifference( Thumbnail, ScaledTo( o_rFrame, Thumbnail.size() ) ), 2 );
    return Thumbnail;
  }

  struct VThumbnailCase
  {
    const char* Name;
    ZOL::EPixelFormat Format;
    int Width;
    int Height;
    std::vector< std::uint64_t > Frames;
    bool bInverted;
    int Size;
    int ExpectedWidth; // by hand: the longer side becomes Size, never more than the picture
    int ExpectedHeight;
  };

  const VThumbnailCase s_Cases[] = {
      { "BayerGB8", ZOL::PixelFormat_BayerGB8, 48, 32, { 0, 1 }, false, 24, 24, 16 },
      { "YUV422", ZOL::PixelFormat_U8Y8V8Y8, 48, 32, { 0, 1 }, false, 32, 32, 21 },
      { "Luminance8", ZOL::PixelFormat_Luminance8, 40, 40, { 0 }, false, 10, 10, 10 },
      { "RGBNotEnlarged", ZOL::PixelFormat_R8G8B8, 48, 32, { 0, 1 }, false, 128, 48, 32 },
      { "BGRInverted", ZOL::PixelFormat_B8G8R8, 30, 40, { 0, 1 }, true, 20, 15, 20 },
      { "StartingWithMissingFrames", ZOL::PixelFormat_R8G8B8, 48, 32, { 3, 4, 5 }, false, 16, 16, 11 },
  };

  TEST( Thumbnail, FitsTheSquareAndShowsTheFirstFrameThatReads )
  {
    for( const VThumbnailCase& rCase : s_Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VScratch Scratch;
      VRecordingSpec Spec;
      Spec.Format = rCase.Format;
      Spec.Width = rCase.Width;
      Spec.Height = rCase.Height;
      Spec.Frames = rCase.Frames;
      Spec.bInverted = rCase.bInverted;
      Spec.Settings.GammaCorrection = 1.4f;
      Spec.Settings.Saturation = 0.7f;
      const std::string Input = WriteRecording( Scratch, "clip.lvid", Spec );
      QImage Frame;
      const QImage Thumbnail = ThumbnailLikeItsFrame( Scratch, Input, rCase.Size, rCase.Frames.front(), Frame );
      EXPECT_EQ( Thumbnail.size(), QSize( rCase.ExpectedWidth, rCase.ExpectedHeight ) );
      // Scaling moves no colour: the averages match the full picture's.
      for( int Channel = 0; Channel < 3; ++Channel )
        EXPECT_NEAR( MeanOf( Thumbnail, Channel ), MeanOf( Frame, Channel ), 4.0 ) << "channel " << Channel;

      // RGB is shown as stored, so the written picture itself is the expectation, upside down
      // where the rows were stored bottom to top.
      if( rCase.Format == ZOL::PixelFormat_R8G8B8 || rCase.Format == ZOL::PixelFormat_B8G8R8 )
      {
        const LumekVideoTool::VRGBImage Written = PictureFor( rCase.Frames.front(), rCase.Width, rCase.Height );
        const QImage Upright =
            QImage( Written.Pixels.data(), Written.Width, Written.Height, Written.Width * 3, QImage::Format_RGB888 )
                .mirrored( false, rCase.bInverted );
        EXPECT_LE( LargestDifference( Thumbnail, ScaledTo( Upright, Thumbnail.size() ) ), 2 );
      }
    }
  }

  struct VContainerCase
  {
    const char* Name;
    const char* Extension;
    std::vector< std::string > Codec;
  };

  class ThumbnailOfContainer : public ::testing::TestWithParam< VContainerCase >
  {
  };

  TEST_P( ThumbnailOfContainer, MatchesTheFramesCommandAndFfmpeg )
  {
    const VContainerCase& rCase = GetParam();
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg makes these recordings";
    std::vector< std::string > Arguments = { "-f", "lavfi", "-i", "testsrc2=size=64x48:rate=25", "-frames:v", "2" };
    Arguments.insert( Arguments.end(), rCase.Codec.begin(), rCase.Codec.end() );
    const std::string Input =
        LumekTest::FfmpegFixture( std::string( "thumbnail-" ) + rCase.Name + "." + rCase.Extension, Arguments );
    ASSERT_FALSE( Input.empty() );
    VScratch Scratch;
    QImage Frame;
    const QImage Thumbnail = ThumbnailLikeItsFrame( Scratch, Input, 32, 0, Frame );
    ASSERT_EQ( Thumbnail.size(), QSize( 32, 24 ) );

    // ffmpeg's own decode of the first frame, scaled the same way: the right frame with the right
    // channels. The viewer takes YUV samples as full range where ffmpeg expands video range, which
    // moves the averages by up to about 7.
    std::vector< std::uint8_t > Decoded = LumekTest::FfmpegDecode( Input, "rgb24" );
    ASSERT_GE( Decoded.size(), 64u * 48 * 3 );
    const QImage Reference =
        ScaledTo( QImage( Decoded.data(), 64, 48, 64 * 3, QImage::Format_RGB888 ), Thumbnail.size() );
    for( int Channel = 0; Channel < 3; ++Channel )
      EXPECT_NEAR( MeanOf( Thumbnail, Channel ), MeanOf( Reference, Channel ), 10.0 ) << "channel " << Channel;
  }

  INSTANTIATE_TEST_SUITE_P(
      Containers, ThumbnailOfContainer,
      ::testing::Values(
          VContainerCase{ "MovRgb", "mov", { "-c:v", "rawvideo", "-pix_fmt", "rgb24" } },
          VContainerCase{ "MovUyvy", "mov", { "-c:v", "rawvideo", "-pix_fmt", "uyvy422" } },
          VContainerCase{ "MovJpeg", "mov", { "-c:v", "mjpeg", "-pix_fmt", "yuvj422p" } },
          VContainerCase{ "Mp4H264", "mp4", { "-c:v", "libx264", "-profile:v", "baseline", "-pix_fmt", "yuv420p" } } ),
      LumekTest::VCaseName() );
} // namespace
