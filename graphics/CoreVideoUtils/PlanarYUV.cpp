#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include "services/Log.h"

namespace CoreVideoUtils
{
  bool PlanarYUV420ToInterleaved( const std::uint8_t* i_pY, const std::uint8_t* i_pU, const std::uint8_t* i_pV,
                                  std::uint8_t* o_pOutput, ZOL::EPixelFormat i_Format, std::int32_t i_Width,
                                  std::int32_t i_Height, std::int32_t i_StrideY, std::int32_t i_StrideUV )
  {
    if( i_Width % 2 != 0 || i_Height % 2 != 0 )
    {
      LUMEK_LOG( "CoreVideoUtils", ZOL::LogFailure,
                 "Cannot convert image with dimensions %d x %d. Both width and height must be even numbers.", i_Width,
                 i_Height );
      return false;
    }
    if( i_Width < 0 || i_Height < 0 || !i_pY || !i_pU || !i_pV || !o_pOutput )
      return false;
    // Byte positions of chroma and luma within a 4-byte pair of pixels.
    unsigned U, Y0, V, Y1;
    if( i_Format == ZOL::PixelFormat_U8Y8V8Y8 )
      U = 0, Y0 = 1, V = 2, Y1 = 3;
    else if( i_Format == ZOL::PixelFormat_Y8U8Y8V8 )
      Y0 = 0, U = 1, Y1 = 2, V = 3;
    else
      return false;
    const std::ptrdiff_t StrideY = i_StrideY, StrideUV = i_StrideUV;
    std::uint8_t* o = o_pOutput;
    for( std::int32_t y = 0; y < i_Height; ++y )
    {
      const std::uint8_t* pY = i_pY + y * StrideY;
      // Each chroma row serves two rows.
      const std::uint8_t* pU = i_pU + ( y / 2 ) * StrideUV;
      const std::uint8_t* pV = i_pV + ( y / 2 ) * StrideUV;
      for( std::int32_t x = 0; x < i_Width; x += 2, o += 4 )
      {
        o[U] = pU[x / 2];
        o[Y0] = pY[x];
        o[V] = pV[x / 2];
        o[Y1] = pY[x + 1];
      }
    }
    return true;
  }
} // namespace CoreVideoUtils
