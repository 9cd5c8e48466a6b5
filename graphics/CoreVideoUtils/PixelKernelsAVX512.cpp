// Colour correction on AVX-512 with byte permutes (VBMI): a 256-entry table is two permutes
// and a blend for 64 bytes, and three-byte pixels are taken apart and put back together with
// one permute each way. This file alone is compiled for it; nothing runs here unless the
// processor reports all three extensions.

#include "graphics/CoreVideoUtils/PixelKernelsSIMD.h"

#include <immintrin.h>

#include <array>

namespace CoreVideoUtils
{
  namespace Kernels
  {
    namespace
    {
      // Byte permutes for three-byte pixels, 64 at a time in three vectors. Spread[k] takes the
      // 16 pixels of group k from a pair of input vectors into 32-bit lanes; Join[v] builds
      // output vector v from a pair of corrected groups. Whole vectors in and out: a store that
      // the next load overlaps would stall on every block.
      struct VPermutes
      {
        alignas( 64 ) std::array< std::array< std::uint8_t, 64 >, 4 > Spread{};
        alignas( 64 ) std::array< std::array< std::uint8_t, 64 >, 3 > Join{};
        constexpr VPermutes()
        {
          constexpr unsigned SpreadOffset[4] = { 0, 48, 32, 80 }; // group k within its input pair
          for( unsigned k = 0; k < 4; ++k )
            for( unsigned Byte = 0; Byte < 64; ++Byte )
              Spread[k][Byte] =
                  static_cast< std::uint8_t >( Byte % 4 < 3 ? SpreadOffset[k] + 3 * ( Byte / 4 ) + Byte % 4 : 0 );
          for( unsigned v = 0; v < 3; ++v )
            for( unsigned Byte = 0; Byte < 64; ++Byte )
            {
              const unsigned Global = 64 * v + Byte, Group = Global / 48, Local = Global % 48;
              Join[v][Byte] =
                  static_cast< std::uint8_t >( 64 * ( Group - ( 64 * v ) / 48 ) + 4 * ( Local / 3 ) + Local % 3 );
            }
        }
      };
      constexpr VPermutes s_Permutes;
      constexpr __mmask64 FourthBytes = 0x8888888888888888ull;

      inline __m512i Lookup( __m512i i_Bytes, const __m512i* i_pTable )
      {
        const __m512i Low = _mm512_permutex2var_epi8( i_pTable[0], i_Bytes, i_pTable[1] );
        const __m512i High = _mm512_permutex2var_epi8( i_pTable[2], i_Bytes, i_pTable[3] );
        return _mm512_mask_blend_epi8( _mm512_movepi8_mask( i_Bytes ), Low, High );
      }
    } // namespace

    std::uint64_t CorrectColoursAVX512( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_Step,
                                        const std::uint8_t* i_pTable, float i_SaturationDelta )
    {
      if( i_Step != 3 && i_Step != 4 )
        return 0;
      __m512i Table[4] = {};
      if( i_pTable != nullptr )
        for( int t = 0; t < 4; ++t )
          Table[t] = _mm512_loadu_si512( i_pTable + 64 * t );

      if( i_SaturationDelta == 0.0f )
      {
        if( i_pTable == nullptr )
          return 0;
        // The table alone works on bytes: 64 pixels of 3 bytes are three whole vectors.
        const std::uint64_t Pixels = i_Step == 3 ? i_PixelCount / 64 * 64 : i_PixelCount / 16 * 16;
        for( std::uint64_t Byte = 0; Byte < Pixels * i_Step; Byte += 64 )
        {
          const __m512i Input = _mm512_loadu_si512( io_pData + Byte );
          __m512i Output = Lookup( Input, Table );
          if( i_Step == 4 )
            Output = _mm512_mask_blend_epi8( FourthBytes, Output, Input );
          _mm512_storeu_si512( io_pData + Byte, Output );
        }
        return Pixels;
      }

      const __m512i Byte = _mm512_set1_epi32( 0xFF );
      const float AmountValue = -i_SaturationDelta < 1.0f ? -i_SaturationDelta : 1.0f;
      const __m512 Amount = _mm512_set1_ps( AmountValue ), Keep = _mm512_set1_ps( 1.0f - AmountValue );
      const __m512 Third = _mm512_set1_ps( 0.33333334f ), Zero = _mm512_setzero_ps(), Max = _mm512_set1_ps( 255.0f );
      auto Correct = [&]( __m512i i_Value, __m512 i_Grey )
      {
        const __m512 Value = _mm512_add_ps( _mm512_mul_ps( Keep, _mm512_cvtepi32_ps( i_Value ) ), i_Grey );
        return _mm512_cvttps_epi32( _mm512_min_ps( _mm512_max_ps( Value, Zero ), Max ) );
      };
      // 16 pixels in 32-bit lanes, corrected in place of the first three bytes.
      auto Saturate = [&]( __m512i i_Pixels )
      {
        const __m512i R = _mm512_and_si512( i_Pixels, Byte );
        const __m512i G = _mm512_and_si512( _mm512_srli_epi32( i_Pixels, 8 ), Byte );
        const __m512i B = _mm512_and_si512( _mm512_srli_epi32( i_Pixels, 16 ), Byte );
        const __m512 Mean =
            _mm512_mul_ps( _mm512_cvtepi32_ps( _mm512_add_epi32( _mm512_add_epi32( R, G ), B ) ), Third );
        const __m512 Grey = _mm512_mul_ps( Amount, Mean );
        return _mm512_or_si512( _mm512_or_si512( Correct( R, Grey ), _mm512_slli_epi32( Correct( G, Grey ), 8 ) ),
                                _mm512_slli_epi32( Correct( B, Grey ), 16 ) );
      };
      auto Load = [&]( const std::uint8_t* p )
      {
        const __m512i Input = _mm512_loadu_si512( p );
        return i_pTable != nullptr ? Lookup( Input, Table ) : Input;
      };

      if( i_Step == 4 )
      {
        const std::uint64_t Blocks = i_PixelCount / 16;
        for( std::uint64_t Block = 0; Block < Blocks; ++Block )
        {
          std::uint8_t* p = io_pData + Block * 64;
          const __m512i Input = _mm512_loadu_si512( p );
          const __m512i Corrected = Saturate( i_pTable != nullptr ? Lookup( Input, Table ) : Input );
          _mm512_storeu_si512( p, _mm512_mask_blend_epi8( FourthBytes, Corrected, Input ) );
        }
        return Blocks * 16;
      }
      __m512i Spread[4], Join[3];
      for( int k = 0; k < 4; ++k )
        Spread[k] = _mm512_load_si512( s_Permutes.Spread[k].data() );
      for( int v = 0; v < 3; ++v )
        Join[v] = _mm512_load_si512( s_Permutes.Join[v].data() );
      const std::uint64_t Blocks = i_PixelCount / 64;
      for( std::uint64_t Block = 0; Block < Blocks; ++Block )
      {
        std::uint8_t* p = io_pData + Block * 192;
        const __m512i A = Load( p ), B = Load( p + 64 ), C = Load( p + 128 );
        const __m512i G0 = Saturate( _mm512_permutex2var_epi8( A, Spread[0], B ) );
        const __m512i G1 = Saturate( _mm512_permutex2var_epi8( A, Spread[1], B ) );
        const __m512i G2 = Saturate( _mm512_permutex2var_epi8( B, Spread[2], C ) );
        const __m512i G3 = Saturate( _mm512_permutex2var_epi8( B, Spread[3], C ) );
        _mm512_storeu_si512( p, _mm512_permutex2var_epi8( G0, Join[0], G1 ) );
        _mm512_storeu_si512( p + 64, _mm512_permutex2var_epi8( G1, Join[1], G2 ) );
        _mm512_storeu_si512( p + 128, _mm512_permutex2var_epi8( G2, Join[2], G3 ) );
      }
      return Blocks * 64;
    }
  } // namespace Kernels
} // namespace CoreVideoUtils
