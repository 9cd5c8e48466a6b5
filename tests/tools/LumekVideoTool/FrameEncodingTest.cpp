// The sample encoder writes the stored layouts by hand; check them against the layout rules.

#include "tools/LumekVideoTool/FrameEncoding.h"
#include "tools/LumekVideoTool/SampleScene.h"
#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

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
} // namespace

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
  const std::uint32_t Word = Frame[0] | Frame[1] << 8 | Frame[2] << 16 | static_cast< std::uint32_t >( Frame[3] ) << 24;
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

TEST( SampleScene, ToneRunsOnAcrossFrames )
{
  // 48000 samples a second at 30 fps is 1600 a frame; at 7 fps frames share them out unevenly.
  EXPECT_EQ( LumekVideoTool::RenderSampleTone( 0, 30.0, 48000 ).size(), 1600u * 4 );
  std::size_t Total = 0;
  for( int Frame = 0; Frame < 7; ++Frame )
    Total += LumekVideoTool::RenderSampleTone( Frame, 7.0, 48000 ).size();
  EXPECT_EQ( Total, 48000u * 4 );
}
