// The pictures of the tool: the sample encoder writes the stored layouts by hand, checked here
// against the layout rules; thumbnails are what a file manager shows of a recording, the first
// frame that reads as the viewer shows it, fitted into the requested square.

#include "ToolRunner.h"

#include <gtest/gtest.h>

#include <QImage>

#include <cstdlib>

using namespace LumekVideoToolTest;
using LumekVideoTool::VRGBImage;

namespace
{
  VRGBImage Uniform( int i_Width, int i_Height, std::uint8_t R, std::uint8_t G, std::uint8_t B )
  {
    VRGBImage Image( i_Width, i_Height );
    for( std::size_t i = 0; i < Image.Pixels.size(); i += 3 )
    {
      Image.Pixels[i] = R;
      Image.Pixels[i + 1] = G;
      Image.Pixels[i + 2] = B;
    }
    return Image;
  }

  TEST( FrameEncoding, LayoutsWorkedOutByHand )
  {
    // Bayer sites follow their pattern.
    const VRGBImage Bayer = Uniform( 4, 2, 10, 20, 30 );
    EXPECT_EQ( LumekVideoTool::EncodeFrame( Bayer, ZOL::PixelFormat_BayerRG8 ),
               ( std::vector< std::uint8_t >{ 10, 20, 10, 20, 20, 30, 20, 30 } ) );
    EXPECT_EQ( LumekVideoTool::EncodeFrame( Bayer, ZOL::PixelFormat_BayerGB8 ),
               ( std::vector< std::uint8_t >{ 20, 30, 20, 30, 10, 20, 10, 20 } ) );
    EXPECT_EQ( LumekVideoTool::EncodeFrame( Bayer, ZOL::PixelFormat_BayerGR8 ),
               ( std::vector< std::uint8_t >{ 20, 10, 20, 10, 30, 20, 30, 20 } ) );
    EXPECT_EQ( LumekVideoTool::EncodeFrame( Bayer, ZOL::PixelFormat_BayerBG8 ),
               ( std::vector< std::uint8_t >{ 30, 20, 30, 20, 20, 10, 20, 10 } ) );

    // Packed samples are most significant bit first. The luma of white is 254: seven ones per
    // sample, no gaps.
    const auto Seven = LumekVideoTool::EncodeFrame( Uniform( 8, 1, 255, 255, 255 ), ZOL::PixelFormat_Luminance7 );
    EXPECT_EQ( Seven, std::vector< std::uint8_t >( 7, 0xFF ) );
    // One white sample among black: 000000 111111 000000 000000 -> 0000 0011 | 1111 0000 | 0000 0000.
    VRGBImage Image = Uniform( 4, 1, 0, 0, 0 );
    Image.Pixels[3] = Image.Pixels[4] = Image.Pixels[5] = 255; // second pixel
    const auto Six = LumekVideoTool::EncodeFrame( Image, ZOL::PixelFormat_Luminance6 );
    EXPECT_EQ( Six, ( std::vector< std::uint8_t >{ 0x03, 0xF0, 0x00 } ) );

    // Ten-bit YUV in groups, rows padded. Grey 128: Y = 127, U = V = 128, so the samples are
    // U 512, Y 508, V 512.
    const auto Frame = LumekVideoTool::EncodeFrame( Uniform( 50, 2, 128, 128, 128 ), ZOL::PixelFormat_U10Y10V10Y10 );
    ASSERT_EQ( Frame.size(), 2u * 2 * 128 ); // two groups of 48 pixels per row
    const std::uint32_t Word =
        Frame[0] | Frame[1] << 8 | Frame[2] << 16 | static_cast< std::uint32_t >( Frame[3] ) << 24;
    EXPECT_EQ( Word & 0x3FF, 512u );
    EXPECT_EQ( ( Word >> 10 ) & 0x3FF, 508u );
    EXPECT_EQ( ( Word >> 20 ) & 0x3FF, 512u );
    EXPECT_EQ( Word >> 30, 0u );
    // Pixels 50 to 95 of the first row are padding.
    EXPECT_EQ( Frame[255], 0 );
  }

  TEST( FrameEncoding, EveryFormatHasTheSizeRecordingsStore )
  {
    // The .lvid round trip holds the stored sizes to figures worked out by hand.
    for( std::uint32_t Format = 1; Format < ZOL::PixelFormatCount; ++Format )
    {
      ZOL::IVideoFrameInfo Info;
      Info.ImageWidth = 16;
      Info.ImageHeight = 4;
      Info.PixelFormat = static_cast< ZOL::EPixelFormat >( Format );
      EXPECT_EQ( LumekVideoTool::EncodeFrame( Uniform( 16, 4, 1, 2, 3 ), Info.PixelFormat ).size(),
                 ZOL::GetVideoFrameSizeInBytes( Info ) )
          << ZOL::ToString( Info.PixelFormat );
    }
  }

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
