#include "graphics/CoreVideoUtils/FormatRuns.h"

#include "graphics/CoreVideoUtils/PixelKernels.h"

#include <cstring>
#include <iterator>

namespace CoreVideoUtils
{
  namespace Runs
  {
    namespace
    {
      // The longest run a reader is given: a multiple of 48 (a padded 10-bit row) and of 8 (a
      // byte-aligned 7 or 6-bit group).
      constexpr std::uint32_t MaxRun = 4608;

      inline std::uint8_t ClampByte( std::int32_t i_Value )
      {
        return static_cast< std::uint8_t >( i_Value < 0 ? 0 : ( i_Value > 255 ? 255 : i_Value ) );
      }

      // Luminance8

      void LuminanceToLuminance( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        std::memcpy( o, s.pData + f, n );
      }

      void ReplicateLuminance( const std::uint8_t* p, std::uint32_t n, std::uint8_t* o )
      {
        for( std::uint32_t i = 0; i < n; ++i, o += 3 )
          o[0] = o[1] = o[2] = p[i];
      }

      void LuminanceToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        ReplicateLuminance( s.pData + f, n, o );
      }

      // Luminance7, Luminance6

      template < unsigned BITS >
      void PackedToLuminance( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        Kernels::UnpackSamples( s.pData, s.Size, BITS, f, n, o );
      }

      template < unsigned BITS >
      void PackedToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        std::uint8_t Luminance[MaxRun];
        Kernels::UnpackSamples( s.pData, s.Size, BITS, f, n, Luminance );
        ReplicateLuminance( Luminance, n, o );
      }

      // R5G6B5

      void R5G6B5ToLuminance( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o,
                              EInstructionSet i_Set )
      {
        Kernels::R5G6B5ToLuminance( s.pData + 2 * f, n, o, i_Set );
      }

      void R5G6B5ToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        const std::uint8_t* p = s.pData + 2 * f;
        for( std::uint32_t i = 0; i < n; ++i, p += 2, o += 3 )
        {
          const unsigned Value = p[0] | ( static_cast< unsigned >( p[1] ) << 8 );
          o[0] = static_cast< std::uint8_t >( p[1] & 0xF8u );
          o[1] = static_cast< std::uint8_t >( ( Value >> 3 ) & 0xFCu );
          o[2] = static_cast< std::uint8_t >( p[0] << 3 );
        }
      }

      // R8G8B8, B8G8R8, R8G8B8u8, B8G8R8u8

      template < unsigned STEP >
      void InterleavedToLuminance( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        const std::uint8_t* p = s.pData + STEP * f;
        for( std::uint32_t i = 0; i < n; ++i, p += STEP )
          o[i] = static_cast< std::uint8_t >( ( p[0] + p[1] + p[2] ) / 3 );
      }

      template < unsigned STEP, bool SWAP >
      void InterleavedToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        const std::uint8_t* p = s.pData + STEP * f;
        if constexpr( STEP == 3 && !SWAP )
        {
          std::memcpy( o, p, 3ull * n );
          return;
        }
        for( std::uint32_t i = 0; i < n; ++i, p += STEP, o += 3 )
        {
          o[0] = p[SWAP ? 2 : 0];
          o[1] = p[1];
          o[2] = p[SWAP ? 0 : 2];
        }
      }

      // U8Y8V8Y8, Y8U8Y8V8

      template < unsigned LUMA >
      void PackedYUVToLuminance( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        const std::uint8_t* p = s.pData + 2 * f + LUMA;
        for( std::uint32_t i = 0; i < n; ++i )
          o[i] = p[2 * i];
      }

      template < bool LUMA_FIRST >
      void PackedYUVToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet i_Set )
      {
        Kernels::YUV422ToRGB( s.pData + 2 * f, LUMA_FIRST, n, o, i_Set );
      }

      template < bool LUMA_FIRST >
      void PackedYUVToChroma( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        const std::uint8_t* p = s.pData + 2 * f;
        if constexpr( !LUMA_FIRST )
        {
          std::memcpy( o, p, 2ull * n );
          return;
        }
        for( std::uint32_t i = 0; i < n; ++i, p += 2, o += 2 )
          o[0] = p[1], o[1] = p[0];
      }

      // U10Y10V10Y10: samples of a run, widened to 16 bits. Samples past the row read as 0.

      void ReadTenBitSamples( const VFrame& s, std::uint64_t f, std::uint32_t i_Samples, std::uint16_t* o )
      {
        const std::uint64_t y = f / s.Width, x = f % s.Width;
        const std::uint64_t RowBytes = PackedTenBitRowBytes( s.Width );
        const std::uint64_t RowWords = RowBytes / 4;
        const std::uint8_t* pRow = s.pData + y * RowBytes;
        std::uint64_t Word = 2 * x / 3;
        for( std::uint32_t i = 0; i < i_Samples; i += 3, ++Word )
        {
          std::uint32_t Value = 0;
          if( Word < RowWords )
            std::memcpy( &Value, pRow + 4 * Word, 4 ); // little-endian, as the processor is
          o[i] = static_cast< std::uint16_t >( Value & 0x3FFu );
          o[i + 1] = static_cast< std::uint16_t >( ( Value >> 10 ) & 0x3FFu );
          o[i + 2] = static_cast< std::uint16_t >( ( Value >> 20 ) & 0x3FFu );
        }
      }

      void TenBitToLuminance( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        std::uint16_t Samples[2 * MaxRun + 3];
        ReadTenBitSamples( s, f, 2 * n, Samples );
        for( std::uint32_t i = 0; i < n; ++i )
          o[i] = static_cast< std::uint8_t >( Samples[2 * i + 1] >> 2 );
      }

      void TenBitToChroma( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        std::uint16_t Samples[2 * MaxRun + 3];
        ReadTenBitSamples( s, f, 2 * n, Samples );
        for( std::uint32_t i = 0; i < 2 * n; ++i )
          o[i] = static_cast< std::uint8_t >( Samples[i] >> 2 );
      }

      inline void TenBitPixel( std::int32_t i_R, std::int32_t i_G, std::int32_t i_B, int Y, std::uint8_t* o )
      {
        const std::int32_t Luma = Y * 16384;
        o[0] = ClampByte( ( i_R + Luma ) >> 16 );
        o[1] = ClampByte( ( Luma + i_G ) >> 16 );
        o[2] = ClampByte( ( i_B + Luma ) >> 16 );
      }

      void TenBitToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        std::uint16_t Samples[2 * MaxRun + 3];
        // A last odd pixel takes its V from the row's padding, which always exists then.
        ReadTenBitSamples( s, f, 2 * n + 1, Samples );
        for( std::uint32_t i = 0; i < n; i += 2, o += 6 )
        {
          const int U = Samples[2 * i], V = Samples[2 * i + 2];
          const std::int32_t R = ( V - 512 ) * 22986, G = 8875008 - 5636 * U - 11698 * V, B = ( U - 512 ) * 28999;
          TenBitPixel( R, G, B, Samples[2 * i + 1], o );
          if( i + 1 < n )
            TenBitPixel( R, G, B, Samples[2 * i + 3], o + 3 );
        }
      }

      // PlanarY8U8V8

      void PlanarYUVToChroma( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        const std::uint8_t* pY = s.pData;
        const std::uint8_t* pU = s.pData + PlanarUOffset( s.Pixels );
        const std::uint8_t* pV = s.pData + PlanarVOffset( s.Pixels );
        for( std::uint64_t i = f; i < f + n; ++i, o += 2 )
        {
          o[0] = ( i & 1 ) == 0 ? pU[i / 2] : pV[i / 2];
          o[1] = pY[i];
        }
      }

      void PlanarYUVToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet i_Set )
      {
        std::uint8_t Chroma[2 * MaxRun];
        PlanarYUVToChroma( s, f, n, Chroma, i_Set );
        Kernels::YUV422ToRGB( Chroma, false, n, o, i_Set );
      }

      // PlanarR8G8B8

      void PlanarRGBToLuminance( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o,
                                 EInstructionSet i_Set )
      {
        Kernels::PlanarRGBToLuminance( s.pData + f, s.pData + s.Pixels + f, s.pData + 2 * s.Pixels + f, n, o, i_Set );
      }

      void PlanarRGBToRGB( const VFrame& s, std::uint64_t f, std::uint32_t n, std::uint8_t* o, EInstructionSet )
      {
        const std::uint8_t* pR = s.pData + f;
        const std::uint8_t* pG = pR + s.Pixels;
        const std::uint8_t* pB = pG + s.Pixels;
        for( std::uint32_t i = 0; i < n; ++i, o += 3 )
          o[0] = pR[i], o[1] = pG[i], o[2] = pB[i];
      }

      // Writers

      template < unsigned BITS >
      void LuminanceToPacked( const std::uint8_t* r, std::uint64_t f, std::uint32_t n, const VFrame& t )
      {
        Kernels::PackSamples( r, BITS, f, n, t.pData, t.Size );
      }

      void RGBToR5G6B5( const std::uint8_t* r, std::uint64_t f, std::uint32_t n, const VFrame& t )
      {
        std::uint8_t* o = t.pData + 2 * f;
        for( std::uint32_t i = 0; i < n; ++i, r += 3, o += 2 )
        {
          const unsigned Value = ( ( r[0] & 0xF8u ) << 8 ) | ( ( r[1] & 0xFCu ) << 3 ) | ( r[2] >> 3 );
          o[0] = static_cast< std::uint8_t >( Value );
          o[1] = static_cast< std::uint8_t >( Value >> 8 );
        }
      }

      template < unsigned STEP, bool SWAP >
      void RGBToInterleaved( const std::uint8_t* r, std::uint64_t f, std::uint32_t n, const VFrame& t )
      {
        std::uint8_t* o = t.pData + STEP * f;
        for( std::uint32_t i = 0; i < n; ++i, r += 3, o += STEP )
        {
          o[0] = r[SWAP ? 2 : 0];
          o[1] = r[1];
          o[2] = r[SWAP ? 0 : 2];
          if constexpr( STEP == 4 )
            o[3] = 0xFF;
        }
      }

      void RGBToPlanarRGB( const std::uint8_t* r, std::uint64_t f, std::uint32_t n, const VFrame& t )
      {
        std::uint8_t* pR = t.pData + f;
        std::uint8_t* pG = pR + t.Pixels;
        std::uint8_t* pB = pG + t.Pixels;
        for( std::uint32_t i = 0; i < n; ++i, r += 3 )
          pR[i] = r[0], pG[i] = r[1], pB[i] = r[2];
      }

      void ChromaToYUYV( const std::uint8_t* r, std::uint64_t f, std::uint32_t n, const VFrame& t )
      {
        std::uint8_t* o = t.pData + 2 * f;
        for( std::uint32_t i = 0; i < n; ++i, r += 2, o += 2 )
          o[0] = r[1], o[1] = r[0];
      }

      void ChromaToTenBit( const std::uint8_t* r, std::uint64_t f, std::uint32_t n, const VFrame& t )
      {
        const std::uint64_t y = f / t.Width, x = f % t.Width;
        const std::uint64_t RowBytes = PackedTenBitRowBytes( t.Width );
        std::uint8_t* pRow = t.pData + y * RowBytes;
        const std::uint64_t FirstWord = 2 * x / 3;
        // The run that ends the row also writes the row's padding, as zeros.
        const std::uint64_t Words = x + n == t.Width ? RowBytes / 4 - FirstWord : ( 2ull * n + 2 ) / 3;
        const std::uint32_t Samples = 2 * n;
        std::uint32_t s = 0;
        for( std::uint64_t w = 0; w < Words; ++w )
        {
          std::uint32_t Value = 0;
          for( unsigned k = 0; k < 3; ++k, ++s )
            if( s < Samples )
              Value |= static_cast< std::uint32_t >( r[s] ) << ( 10 * k + 2 );
          std::memcpy( pRow + 4 * ( FirstWord + w ), &Value, 4 );
        }
      }

      void ChromaToPlanarYUV( const std::uint8_t* r, std::uint64_t f, std::uint32_t n, const VFrame& t )
      {
        std::uint8_t* pY = t.pData;
        std::uint8_t* pU = t.pData + PlanarUOffset( t.Pixels );
        std::uint8_t* pV = t.pData + PlanarVOffset( t.Pixels );
        for( std::uint64_t i = f; i < f + n; ++i, r += 2 )
        {
          if( ( i & 1 ) == 0 )
            pU[i / 2] = r[0];
          else
            pV[i / 2] = r[0];
          pY[i] = r[1];
        }
      }

      using namespace ZOL;

      // One row a format, keyed by it. Bayer formats have no runs: they go through the demosaic.
      struct VRunRow
      {
        EPixelFormat Format;
        VSourceRuns Source;
        VTargetRuns Target;
      };

      constexpr VRunRow s_Rows[] = {
          { PixelFormat_Unspecified, { nullptr, nullptr, nullptr }, { ERunForm::None, nullptr } },
          { PixelFormat_Luminance8,
            { LuminanceToLuminance, LuminanceToRGB, nullptr },
            { ERunForm::Luminance, nullptr } },
          { PixelFormat_BayerRG8, { nullptr, nullptr, nullptr }, { ERunForm::None, nullptr } },
          { PixelFormat_BayerGB8, { nullptr, nullptr, nullptr }, { ERunForm::None, nullptr } },
          { PixelFormat_BayerGR8, { nullptr, nullptr, nullptr }, { ERunForm::None, nullptr } },
          { PixelFormat_BayerBG8, { nullptr, nullptr, nullptr }, { ERunForm::None, nullptr } },
          { PixelFormat_R5G6B5, { R5G6B5ToLuminance, R5G6B5ToRGB, nullptr }, { ERunForm::RGB, RGBToR5G6B5 } },
          { PixelFormat_R8G8B8,
            { InterleavedToLuminance< 3 >, InterleavedToRGB< 3, false >, nullptr },
            { ERunForm::RGB, nullptr } },
          { PixelFormat_B8G8R8,
            { InterleavedToLuminance< 3 >, InterleavedToRGB< 3, true >, nullptr },
            { ERunForm::RGB, RGBToInterleaved< 3, true > } },
          { PixelFormat_R8G8B8u8,
            { InterleavedToLuminance< 4 >, InterleavedToRGB< 4, false >, nullptr },
            { ERunForm::RGB, RGBToInterleaved< 4, false > } },
          { PixelFormat_B8G8R8u8,
            { InterleavedToLuminance< 4 >, InterleavedToRGB< 4, true >, nullptr },
            { ERunForm::RGB, RGBToInterleaved< 4, true > } },
          { PixelFormat_U8Y8V8Y8,
            { PackedYUVToLuminance< 1 >, PackedYUVToRGB< false >, PackedYUVToChroma< false > },
            { ERunForm::Chroma, nullptr } },
          { PixelFormat_Y8U8Y8V8,
            { PackedYUVToLuminance< 0 >, PackedYUVToRGB< true >, PackedYUVToChroma< true > },
            { ERunForm::Chroma, ChromaToYUYV } },
          { PixelFormat_U10Y10V10Y10,
            { TenBitToLuminance, TenBitToRGB, TenBitToChroma },
            { ERunForm::Chroma, ChromaToTenBit } },
          { PixelFormat_BayerGB7, { nullptr, nullptr, nullptr }, { ERunForm::None, nullptr } },
          { PixelFormat_BayerGB6, { nullptr, nullptr, nullptr }, { ERunForm::None, nullptr } },
          { PixelFormat_Luminance7,
            { PackedToLuminance< 7 >, PackedToRGB< 7 >, nullptr },
            { ERunForm::Luminance, LuminanceToPacked< 7 > } },
          { PixelFormat_Luminance6,
            { PackedToLuminance< 6 >, PackedToRGB< 6 >, nullptr },
            { ERunForm::Luminance, LuminanceToPacked< 6 > } },
          { PixelFormat_PlanarY8U8V8,
            { nullptr, PlanarYUVToRGB, PlanarYUVToChroma },
            { ERunForm::Chroma, ChromaToPlanarYUV } },
          { PixelFormat_PlanarR8G8B8,
            { PlanarRGBToLuminance, PlanarRGBToRGB, nullptr },
            { ERunForm::RGB, RGBToPlanarRGB } },
      };

      // Rows stand at their format's number, so that the look-up is an index.
      constexpr bool HasOneRowEach()
      {
        if( std::size( s_Rows ) != PixelFormatCount )
          return false;
        for( std::uint32_t i = 0; i < PixelFormatCount; ++i )
          if( s_Rows[i].Format != i )
            return false;
        return true;
      }
      static_assert( HasOneRowEach(), "every pixel format needs exactly one run row, in the enumeration's order" );

      constexpr VSourceRuns s_NoSource{ nullptr, nullptr, nullptr };
      constexpr VTargetRuns s_NoTarget{ ERunForm::None, nullptr };
    } // namespace

    const VSourceRuns& SourceRuns( ZOL::EPixelFormat i_Format )
    {
      return i_Format < PixelFormatCount ? s_Rows[i_Format].Source : s_NoSource;
    }

    const VTargetRuns& TargetRuns( ZOL::EPixelFormat i_Format )
    {
      return i_Format < PixelFormatCount ? s_Rows[i_Format].Target : s_NoTarget;
    }

    void RGBToChroma( const std::uint8_t* i_pRGB, std::uint32_t i_Count, unsigned i_Parity, std::uint8_t* o_pRun )
    {
      for( std::uint32_t i = 0; i < i_Count; ++i, i_pRGB += 3, o_pRun += 2 )
      {
        const std::int32_t R = i_pRGB[0], G = i_pRGB[1], B = i_pRGB[2];
        o_pRun[1] = static_cast< std::uint8_t >( ( 19595 * R + 38469 * G + 7471 * B ) >> 16 );
        // U needs no clamp: its range is 16 to 239 for any bytes. V's is not.
        if( ( ( i + i_Parity ) & 1 ) == 0 )
          o_pRun[0] = static_cast< std::uint8_t >( ( 28573 * B - 9642 * R - 18930 * G + 0x800000 ) >> 16 );
        else
          o_pRun[0] = ClampByte( ( 40304 * R - 33750 * G - 6554 * B + 0x800000 ) >> 16 );
      }
    }
  } // namespace Runs
} // namespace CoreVideoUtils
