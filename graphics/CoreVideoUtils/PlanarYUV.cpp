#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include "services/Log.h"

#include <emmintrin.h>

namespace CoreVideoUtils
{
  namespace
  {
    // 32 pixels a step: chroma bytes paired first (U V), then paired with luma, so that UYVY is
    // (UV, Y) interleaved byte by byte and YUYV (Y, UV). A video decoder's frame passes through
    // here once, so this is most of what decoding costs beyond the decoder itself.
    template < bool LUMA_FIRST >
    std::int32_t InterleaveRun( const std::uint8_t* i_pY, const std::uint8_t* i_pU, const std::uint8_t* i_pV,
                                std::uint8_t* o_pOutput, std::int32_t i_Width )
    {
      std::int32_t x = 0;
      for( ; x + 32 <= i_Width; x += 32 )
      {
        const __m128i U = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pU + x / 2 ) );
        const __m128i V = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pV + x / 2 ) );
        const __m128i Y0 = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pY + x ) );
        const __m128i Y1 = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pY + x + 16 ) );
        const __m128i UVLow = _mm_unpacklo_epi8( U, V );
        const __m128i UVHigh = _mm_unpackhi_epi8( U, V );
        __m128i* o = reinterpret_cast< __m128i* >( o_pOutput + 2 * x );
        if constexpr( LUMA_FIRST )
        {
          _mm_storeu_si128( o, _mm_unpacklo_epi8( Y0, UVLow ) );
          _mm_storeu_si128( o + 1, _mm_unpackhi_epi8( Y0, UVLow ) );
          _mm_storeu_si128( o + 2, _mm_unpacklo_epi8( Y1, UVHigh ) );
          _mm_storeu_si128( o + 3, _mm_unpackhi_epi8( Y1, UVHigh ) );
        }
        else
        {
          _mm_storeu_si128( o, _mm_unpacklo_epi8( UVLow, Y0 ) );
          _mm_storeu_si128( o + 1, _mm_unpackhi_epi8( UVLow, Y0 ) );
          _mm_storeu_si128( o + 2, _mm_unpacklo_epi8( UVHigh, Y1 ) );
          _mm_storeu_si128( o + 3, _mm_unpackhi_epi8( UVHigh, Y1 ) );
        }
      }
      return x;
    }
  } // namespace

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
      const std::int32_t Done =
          Y0 == 0 ? InterleaveRun< true >( pY, pU, pV, o, i_Width ) : InterleaveRun< false >( pY, pU, pV, o, i_Width );
      o += 2 * static_cast< std::ptrdiff_t >( Done );
      for( std::int32_t x = Done; x < i_Width; x += 2, o += 4 )
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
