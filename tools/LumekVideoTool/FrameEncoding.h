#pragma once

// Encodes a picture of 8-bit R, G, B into the stored layout of any pixel format. The sample
// recordings and the tests write their frames with it; it is written from the layouts alone,
// independently of the converter that reads them back.

#include "videointerface/Enumerations.h"

#include <cstdint>
#include <vector>

namespace LumekVideoTool
{
  struct VRGBImage
  {
    int Width = 0;
    int Height = 0;
    std::vector< std::uint8_t > Pixels; // R, G, B per pixel, rows top to bottom

    VRGBImage() = default;
    VRGBImage( int i_Width, int i_Height )
        : Width( i_Width ), Height( i_Height ), Pixels( static_cast< std::size_t >( i_Width ) * i_Height * 3 )
    {
    }
    const std::uint8_t* At( int i_X, int i_Y ) const
    {
      return Pixels.data() + ( static_cast< std::size_t >( i_Y ) * Width + i_X ) * 3;
    }
    std::uint8_t* At( int i_X, int i_Y )
    {
      return Pixels.data() + ( static_cast< std::size_t >( i_Y ) * Width + i_X ) * 3;
    }
  };

  // The frame bytes of the image in the format; empty for format 0 or an odd width where the
  // format pairs pixels (the YUV 4:2:2 forms).
  std::vector< std::uint8_t > EncodeFrame( const VRGBImage& i_rImage, ZOL::EPixelFormat i_Format );

  // The colour a Bayer site of the format records at (x, y): 0 red, 1 green, 2 blue.
  int BayerChannelAt( ZOL::EPixelFormat i_Format, int i_X, int i_Y );

  // Luma of the system's RGB to YUV rule.
  std::uint8_t Luma( int i_R, int i_G, int i_B );
} // namespace LumekVideoTool
