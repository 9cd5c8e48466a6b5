// Thumbnails are what a file manager shows of a recording: the first frame that reads, as the
// viewer shows it, fitted into the requested square.

#include "ToolRunner.h"

#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <QImage>

#include <boost/format.hpp>

#include <cstdlib>

using namespace LumekVideoToolTest;

namespace
{
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

  // Test names and failure messages show the case's name, not its bytes.
  void PrintTo( const VThumbnailCase& i_rCase, std::ostream* o_pOut )
  {
    *o_pOut << i_rCase.Name;
  }

  QImage LoadPNG( const std::string& i_rPath )
  {
    return QImage( QString::fromStdString( i_rPath ), "PNG" ).convertToFormat( QImage::Format_RGB888 );
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

  class ThumbnailOfFormat : public ::testing::TestWithParam< VThumbnailCase >
  {
  };
} // namespace

TEST_P( ThumbnailOfFormat, FitsTheSquareAndShowsTheFirstFrameThatReads )
{
  const VThumbnailCase& rCase = GetParam();
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
  const std::string Output = Scratch.Path( "thumb.png" );

  const VRun Run = RunTool( { "thumbnail", Input, Output, "--size", std::to_string( rCase.Size ) } );
  ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
  const QImage Thumbnail = LoadPNG( Output );
  ASSERT_FALSE( Thumbnail.isNull() );
  EXPECT_EQ( Thumbnail.width(), rCase.ExpectedWidth );
  EXPECT_EQ( Thumbnail.height(), rCase.ExpectedHeight );

  const std::uint64_t First = rCase.Frames.front();
  ASSERT_EQ( RunTool( { "frames", Input, Scratch.Path( "frames" ), "--first", std::to_string( First ), "--count", "1",
                        "--png" } )
                 .ExitCode,
             0 );
  const QImage Frame = LoadPNG( Scratch.Path( ( boost::format( "frames/frame_%06d.png" ) % First ).str() ) );
  ASSERT_FALSE( Frame.isNull() );
  const QImage Scaled = Frame.scaled( Thumbnail.size(), Qt::IgnoreAspectRatio, Qt::SmoothTransformation )
                            .convertToFormat( QImage::Format_RGB888 );
  EXPECT_LE( LargestDifference( Thumbnail, Scaled ), 2 );
  // Scaling moves no colour: the averages match the full picture's.
  for( int Channel = 0; Channel < 3; ++Channel )
    EXPECT_NEAR( MeanOf( Thumbnail, Channel ), MeanOf( Frame, Channel ), 4.0 ) << "channel " << Channel;

  // RGB is shown as stored, so the written picture itself is the expectation, upside down
  // where the rows were stored bottom to top.
  if( rCase.Format == ZOL::PixelFormat_R8G8B8 || rCase.Format == ZOL::PixelFormat_B8G8R8 )
  {
    const LumekVideoTool::VRGBImage Written = PictureFor( First, rCase.Width, rCase.Height );
    const QImage Upright =
        QImage( Written.Pixels.data(), Written.Width, Written.Height, Written.Width * 3, QImage::Format_RGB888 )
            .mirrored( false, rCase.bInverted )
            .scaled( Thumbnail.size(), Qt::IgnoreAspectRatio, Qt::SmoothTransformation )
            .convertToFormat( QImage::Format_RGB888 );
    EXPECT_LE( LargestDifference( Thumbnail, Upright ), 2 );
  }
}

INSTANTIATE_TEST_SUITE_P( Formats, ThumbnailOfFormat, ::testing::ValuesIn( s_Cases ),
                          []( const ::testing::TestParamInfo< VThumbnailCase >& i_rInfo )
                          { return std::string( i_rInfo.param.Name ); } );

TEST( Thumbnail, FailuresHaveTheirExitCodes )
{
  VScratch Scratch;
  VRecordingSpec Spec;
  const std::string Input = WriteRecording( Scratch, "clip.lvid", Spec );
  EXPECT_EQ( RunTool( { "thumbnail", Input } ).ExitCode, 2 );
  EXPECT_EQ( RunTool( { "thumbnail", Input, Scratch.Path( "t.png" ), "--size", "0" } ).ExitCode, 2 );
  EXPECT_EQ( RunTool( { "thumbnail", Scratch.Path( "absent.lvid" ), Scratch.Path( "t.png" ) } ).ExitCode, 1 );
  EXPECT_EQ( RunTool( { "thumbnail", Input, Scratch.Path( "no-folder/t.png" ) } ).ExitCode, 1 );

  // A recording with no frame at all has nothing to show.
  Spec.Frames = {};
  const std::string Empty = WriteRecording( Scratch, "empty.lvid", Spec );
  const VRun Run = RunTool( { "thumbnail", Empty, Scratch.Path( "t.png" ) } );
  EXPECT_EQ( Run.ExitCode, 3 ) << Run.Err;
  EXPECT_NE( Run.Err.find( "No frame of" ), std::string::npos ) << Run.Err;
}

namespace
{
  struct VContainerCase
  {
    const char* Name;
    const char* Extension;
    std::vector< std::string > Codec;
  };

  void PrintTo( const VContainerCase& i_rCase, std::ostream* o_pOut )
  {
    *o_pOut << i_rCase.Name;
  }

  class ThumbnailOfContainer : public ::testing::TestWithParam< VContainerCase >
  {
  };
} // namespace

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
  const VRun Run = RunTool( { "thumbnail", Input, Scratch.Path( "thumb.png" ), "--size", "32" } );
  ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
  const QImage Thumbnail = LoadPNG( Scratch.Path( "thumb.png" ) );
  ASSERT_EQ( Thumbnail.size(), QSize( 32, 24 ) );

  ASSERT_EQ( RunTool( { "frames", Input, Scratch.Path( "frames" ), "--count", "1", "--png" } ).ExitCode, 0 );
  const QImage Frame = LoadPNG( Scratch.Path( "frames/frame_000000.png" ) );
  EXPECT_LE(
      LargestDifference( Thumbnail, Frame.scaled( Thumbnail.size(), Qt::IgnoreAspectRatio, Qt::SmoothTransformation )
                                        .convertToFormat( QImage::Format_RGB888 ) ),
      2 );

  // ffmpeg's own decode of the first frame, scaled the same way: the right frame with the right
  // channels. The viewer takes YUV samples as full range where ffmpeg expands video range, which
  // moves the averages by up to about 7.
  std::vector< std::uint8_t > Decoded = LumekTest::FfmpegDecode( Input, "rgb24" );
  ASSERT_GE( Decoded.size(), 64u * 48 * 3 );
  const QImage Reference = QImage( Decoded.data(), 64, 48, 64 * 3, QImage::Format_RGB888 )
                               .scaled( Thumbnail.size(), Qt::IgnoreAspectRatio, Qt::SmoothTransformation )
                               .convertToFormat( QImage::Format_RGB888 );
  for( int Channel = 0; Channel < 3; ++Channel )
    EXPECT_NEAR( MeanOf( Thumbnail, Channel ), MeanOf( Reference, Channel ), 10.0 ) << "channel " << Channel;
}

INSTANTIATE_TEST_SUITE_P(
    Containers, ThumbnailOfContainer,
    ::testing::Values( VContainerCase{ "MovRgb", "mov", { "-c:v", "rawvideo", "-pix_fmt", "rgb24" } },
                       VContainerCase{ "MovUyvy", "mov", { "-c:v", "rawvideo", "-pix_fmt", "uyvy422" } },
                       VContainerCase{ "MovJpeg", "mov", { "-c:v", "mjpeg", "-pix_fmt", "yuvj422p" } },
                       VContainerCase{
                           "Mp4H264", "mp4", { "-c:v", "libx264", "-profile:v", "baseline", "-pix_fmt", "yuv420p" } } ),
    []( const ::testing::TestParamInfo< VContainerCase >& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );
