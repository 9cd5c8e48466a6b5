// Thumbnails are what a file manager shows of a recording: the first frame that reads, as the
// viewer shows it, fitted into the requested square.

#include "ToolRunner.h"

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

  // The largest difference of any channel of any pixel, after scaling the second picture to the
  // first's size.
  int LargestDifference( const QImage& i_rA, const QImage& i_rB )
  {
    const QImage B = i_rB.scaled( i_rA.size(), Qt::IgnoreAspectRatio, Qt::SmoothTransformation )
                         .convertToFormat( QImage::Format_RGB888 );
    int Largest = 0;
    for( int y = 0; y < i_rA.height(); ++y )
      for( int x = 0; x < i_rA.width() * 3; ++x )
        Largest = std::max( Largest, std::abs( int( i_rA.constScanLine( y )[x] ) - int( B.constScanLine( y )[x] ) ) );
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
      const std::string First = std::to_string( rCase.Frames.front() );
      ASSERT_EQ(
          RunInProcess( { "thumbnail", Input, Scratch.Path( "thumb.png" ), "--size", std::to_string( rCase.Size ) } )
              .ExitCode,
          0 );
      ASSERT_EQ(
          RunInProcess( { "frames", Input, Scratch.Path( "" ), "--first", First, "--count", "1", "--png" } ).ExitCode,
          0 );
      const QImage Thumbnail = LoadPNG( Scratch.Path( "thumb.png" ) );
      const QImage Frame = LoadPNG( Scratch.Path( "frame_00000" + First + ".png" ) );
      ASSERT_FALSE( Thumbnail.isNull() || Frame.isNull() );
      EXPECT_EQ( Thumbnail.size(), QSize( rCase.ExpectedWidth, rCase.ExpectedHeight ) );
      // The viewer's picture of the frame, scaled; scaling moves no colour.
      EXPECT_LE( LargestDifference( Thumbnail, Frame ), 2 );
      for( int Channel = 0; Channel < 3; ++Channel )
        EXPECT_NEAR( MeanOf( Thumbnail, Channel ), MeanOf( Frame, Channel ), 4.0 ) << "channel " << Channel;

      // RGB is shown as stored, so the written picture itself is the expectation, upside down
      // where the rows were stored bottom to top.
      if( rCase.Format == ZOL::PixelFormat_R8G8B8 || rCase.Format == ZOL::PixelFormat_B8G8R8 )
      {
        const LumekVideoTool::VRGBImage Written = PictureFor( rCase.Frames.front(), rCase.Width, rCase.Height );
        EXPECT_LE( LargestDifference( Thumbnail, QImage( Written.Pixels.data(), Written.Width, Written.Height,
                                                         Written.Width * 3, QImage::Format_RGB888 )
                                                     .mirrored( false, rCase.bInverted ) ),
                   2 );
      }
    }
  }
} // namespace
