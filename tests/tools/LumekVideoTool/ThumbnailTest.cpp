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

  struct VThumbnailCase
  {
    const char* Name;
    VRecordingSpec Spec; // format, width, height, frames, sound, rows stored bottom to top
    int Size;
    QSize Expected; // by hand: the longer side becomes Size, never more than the picture
  };

  const VThumbnailCase s_Cases[] = {
      { "BayerGB8", { ZOL::PixelFormat_BayerGB8, 48, 32, { 0, 1 } }, 24, { 24, 16 } },
      { "YUV422", { ZOL::PixelFormat_U8Y8V8Y8, 48, 32, { 0, 1 } }, 32, { 32, 21 } },
      { "Luminance8", { ZOL::PixelFormat_Luminance8, 40, 40, { 0 } }, 10, { 10, 10 } },
      { "RGBNotEnlarged", { ZOL::PixelFormat_R8G8B8, 48, 32, { 0, 1 } }, 128, { 48, 32 } },
      { "BGRInverted", { ZOL::PixelFormat_B8G8R8, 30, 40, { 0, 1 }, false, true }, 20, { 15, 20 } },
      { "StartingWithMissingFrames", { ZOL::PixelFormat_R8G8B8, 48, 32, { 3, 4, 5 } }, 16, { 16, 11 } },
  };

  TEST( Thumbnail, FitsTheSquareAndShowsTheFirstFrameThatReads )
  {
    for( const VThumbnailCase& rCase : s_Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VScratch Scratch;
      VRecordingSpec Spec = rCase.Spec;
      Spec.Settings.GammaCorrection = 1.4f;
      Spec.Settings.Saturation = 0.7f;
      const std::string Input = WriteRecording( Scratch, "clip.lvid", Spec );
      const std::string First = std::to_string( Spec.Frames.front() );
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
      EXPECT_EQ( Thumbnail.size(), rCase.Expected );
      // The viewer's picture of the frame, scaled; scaling moves no colour.
      EXPECT_LE( LargestDifference( Thumbnail, Frame ), 2 );

      // RGB is shown as stored, so the written picture itself is the expectation, upside down
      // where the rows were stored bottom to top.
      if( Spec.Format == ZOL::PixelFormat_R8G8B8 || Spec.Format == ZOL::PixelFormat_B8G8R8 )
      {
        const LumekVideoTool::VRGBImage Written = PictureFor( Spec.Frames.front(), Spec.Width, Spec.Height );
        EXPECT_LE( LargestDifference( Thumbnail, QImage( Written.Pixels.data(), Written.Width, Written.Height,
                                                         Written.Width * 3, QImage::Format_RGB888 )
                                                     .mirrored( false, Spec.bInverted ) ),
                   2 );
      }
    }
  }
} // namespace
