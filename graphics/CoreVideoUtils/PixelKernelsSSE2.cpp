// Vector forms on SSE2, the baseline of every 64-bit x86 processor. Without a byte shuffle
// the three-byte pixels are written as overlapping 8-byte stores.

#include "graphics/CoreVideoUtils/PixelKernelsSIMD.h"

#include <emmintrin.h>

namespace CoreVideoUtils
{
  namespace Kernels
  {
    namespace
    {
      inline __m128i Load8( const std::uint8_t* p )
      {
        return _mm_unpacklo_epi8( _mm_loadl_epi64( reinterpret_cast< const __m128i* >( p ) ), _mm_setzero_si128() );
      }

      // Even 16-bit lanes from A, odd ones from B.
      inline __m128i BlendEvenOdd( __m128i A, __m128i B )
      {
        const __m128i Even = _mm_set1_epi32( 0x0000FFFF );
        return _mm_or_si128( _mm_and_si128( Even, A ), _mm_andnot_si128( Even, B ) );
      }

      // Writes 8 pixels of 16-bit channel values (0 to 255) as 24 bytes, plus 2 bytes of
      // scratch beyond them that the next pixel overwrites.
      inline void StoreRGB8( __m128i R, __m128i G, __m128i B, std::uint8_t* o )
      {
        const __m128i RG = _mm_or_si128( R, _mm_slli_epi16( G, 8 ) );
        const __m128i Low32 = _mm_set_epi32( 0, -1, 0, -1 );
        const __m128i High32 = _mm_set_epi32( -1, 0, -1, 0 );
        for( int Half = 0; Half < 2; ++Half )
        {
          const __m128i Pixels = Half == 0 ? _mm_unpacklo_epi16( RG, B ) : _mm_unpackhi_epi16( RG, B );
          // Two pixels a 64-bit lane, joined into 6 bytes.
          const __m128i Joined =
              _mm_or_si128( _mm_and_si128( Pixels, Low32 ), _mm_srli_epi64( _mm_and_si128( Pixels, High32 ), 8 ) );
          _mm_storel_epi64( reinterpret_cast< __m128i* >( o + 12 * Half ), Joined );
          _mm_storel_epi64( reinterpret_cast< __m128i* >( o + 12 * Half + 6 ), _mm_srli_si128( Joined, 8 ) );
        }
      }

      template < unsigned K >
      inline void Site( __m128i C, __m128i Cross, __m128i Diagonal, __m128i Vertical, __m128i Horizontal, __m128i& R,
                        __m128i& G, __m128i& B )
      {
        if constexpr( K == 0 )
          R = C, G = Cross, B = Diagonal;
        else if constexpr( K == 1 )
          R = Horizontal, G = C, B = Vertical;
        else if constexpr( K == 3 )
          R = Vertical, G = C, B = Horizontal;
        else
          R = Diagonal, G = Cross, B = C;
      }

      // KA is the kind of the even lanes: the kind at x = 1, as blocks start at odd x.
      template < unsigned KA, bool SWAP >
      std::uint32_t DemosaicInterior( const std::uint8_t* n, const std::uint8_t* c, const std::uint8_t* s,
                                      std::uint32_t i_Width, std::uint8_t* o )
      {
        std::uint32_t x = 1;
        for( ; x + 9 <= i_Width; x += 8 )
        {
          const __m128i N0 = Load8( n + x ), S0 = Load8( s + x );
          const __m128i Cm = Load8( c + x - 1 ), C0 = Load8( c + x ), Cp = Load8( c + x + 1 );
          const __m128i NS = _mm_add_epi16( N0, S0 ), WE = _mm_add_epi16( Cm, Cp );
          const __m128i Cross = _mm_srli_epi16( _mm_add_epi16( NS, WE ), 2 );
          const __m128i Diagonal =
              _mm_srli_epi16( _mm_add_epi16( _mm_add_epi16( Load8( n + x - 1 ), Load8( n + x + 1 ) ),
                                             _mm_add_epi16( Load8( s + x - 1 ), Load8( s + x + 1 ) ) ),
                              2 );
          const __m128i Vertical = _mm_srli_epi16( NS, 1 ), Horizontal = _mm_srli_epi16( WE, 1 );
          __m128i Ra, Ga, Ba, Rb, Gb, Bb;
          Site< KA >( C0, Cross, Diagonal, Vertical, Horizontal, Ra, Ga, Ba );
          Site< KA ^ 1u >( C0, Cross, Diagonal, Vertical, Horizontal, Rb, Gb, Bb );
          const __m128i R = BlendEvenOdd( Ra, Rb ), G = BlendEvenOdd( Ga, Gb ), B = BlendEvenOdd( Ba, Bb );
          if constexpr( SWAP )
            StoreRGB8( B, G, R, o + 3 * x );
          else
            StoreRGB8( R, G, B, o + 3 * x );
        }
        return x;
      }

      using InteriorFunction = std::uint32_t ( * )( const std::uint8_t*, const std::uint8_t*, const std::uint8_t*,
                                                    std::uint32_t, std::uint8_t* );
      constexpr InteriorFunction s_Interiors[2][4] = { { DemosaicInterior< 0, false >, DemosaicInterior< 1, false >,
                                                         DemosaicInterior< 2, false >, DemosaicInterior< 3, false > },
                                                       { DemosaicInterior< 0, true >, DemosaicInterior< 1, true >,
                                                         DemosaicInterior< 2, true >, DemosaicInterior< 3, true > } };

      inline __m128i DivideBy3( __m128i i_Sum ) // exact for sums up to 765
      {
        return _mm_srli_epi16( _mm_mulhi_epu16( i_Sum, _mm_set1_epi16( static_cast< short >( 43691 ) ) ), 1 );
      }
    } // namespace

    std::uint32_t DemosaicRowInteriorSSE2( const std::uint8_t* i_pNorth, const std::uint8_t* i_pRow,
                                           const std::uint8_t* i_pSouth, std::uint32_t i_Width, unsigned i_StartKind,
                                           bool i_bSwapRB, std::uint8_t* o_pRGB )
    {
      return s_Interiors[i_bSwapRB ? 1 : 0][( i_StartKind ^ 1u ) & 3u]( i_pNorth, i_pRow, i_pSouth, i_Width, o_pRGB );
    }

    std::uint64_t YUV422ToRGBSSE2( const std::uint8_t* i_pSource, bool i_bLumaFirst, std::uint64_t i_PixelCount,
                                   std::uint8_t* o_pRGB )
    {
      const __m128i LowByte = _mm_set1_epi16( 0x00FF );
      const __m128i Low16 = _mm_set1_epi32( 0x0000FFFF );
      const __m128i GreenFactors = _mm_set1_epi32( ( 18744 << 16 ) | ( -22544 & 0xFFFF ) );
      const __m128i Zero = _mm_setzero_si128(), Max = _mm_set1_epi16( 255 );
      std::uint64_t i = 0;
      // Stop one pixel short: the store writes 2 bytes into the pixel after the block.
      for( ; i + 9 <= i_PixelCount; i += 8 )
      {
        const __m128i Raw = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pSource + 2 * i ) );
        const __m128i Y = i_bLumaFirst ? _mm_and_si128( Raw, LowByte ) : _mm_srli_epi16( Raw, 8 );
        const __m128i Chroma = _mm_sub_epi16( i_bLumaFirst ? _mm_srli_epi16( Raw, 8 ) : _mm_and_si128( Raw, LowByte ),
                                              _mm_set1_epi16( 128 ) );
        const __m128i U = _mm_or_si128( _mm_and_si128( Chroma, Low16 ), _mm_slli_epi32( Chroma, 16 ) );
        const __m128i V = _mm_or_si128( _mm_srli_epi32( Chroma, 16 ), _mm_andnot_si128( Low16, Chroma ) );
        // The 16.16 constants split into a whole part and a 16-bit fraction, so that the
        // high half of a 16-bit product is the floor of the full product's shift.
        const __m128i R = _mm_add_epi16( _mm_add_epi16( Y, V ), _mm_mulhi_epi16( V, _mm_set1_epi16( 26411 ) ) );
        const __m128i B =
            _mm_add_epi16( _mm_add_epi16( Y, _mm_add_epi16( U, U ) ), _mm_mulhi_epi16( U, _mm_set1_epi16( -15074 ) ) );
        const __m128i GreenPair = _mm_srai_epi32( _mm_madd_epi16( Chroma, GreenFactors ), 16 );
        const __m128i Green = _mm_or_si128( _mm_and_si128( GreenPair, Low16 ), _mm_slli_epi32( GreenPair, 16 ) );
        const __m128i G = _mm_add_epi16( _mm_sub_epi16( Y, V ), Green );
        StoreRGB8( _mm_min_epi16( _mm_max_epi16( R, Zero ), Max ), _mm_min_epi16( _mm_max_epi16( G, Zero ), Max ),
                   _mm_min_epi16( _mm_max_epi16( B, Zero ), Max ), o_pRGB + 3 * i );
      }
      return i;
    }

    std::uint64_t PlanarRGBToLuminanceSSE2( const std::uint8_t* i_pR, const std::uint8_t* i_pG,
                                            const std::uint8_t* i_pB, std::uint64_t i_Count, std::uint8_t* o_pL )
    {
      const __m128i Zero = _mm_setzero_si128();
      std::uint64_t i = 0;
      for( ; i + 16 <= i_Count; i += 16 )
      {
        const __m128i R = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pR + i ) );
        const __m128i G = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pG + i ) );
        const __m128i B = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pB + i ) );
        const __m128i Low = _mm_add_epi16( _mm_add_epi16( _mm_unpacklo_epi8( R, Zero ), _mm_unpacklo_epi8( G, Zero ) ),
                                           _mm_unpacklo_epi8( B, Zero ) );
        const __m128i High = _mm_add_epi16( _mm_add_epi16( _mm_unpackhi_epi8( R, Zero ), _mm_unpackhi_epi8( G, Zero ) ),
                                            _mm_unpackhi_epi8( B, Zero ) );
        _mm_storeu_si128( reinterpret_cast< __m128i* >( o_pL + i ),
                          _mm_packus_epi16( DivideBy3( Low ), DivideBy3( High ) ) );
      }
      return i;
    }

    std::uint64_t R5G6B5ToLuminanceSSE2( const std::uint8_t* i_pSource, std::uint64_t i_Count, std::uint8_t* o_pL )
    {
      std::uint64_t i = 0;
      for( ; i + 8 <= i_Count; i += 8 )
      {
        const __m128i Value = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pSource + 2 * i ) );
        const __m128i Red = _mm_srli_epi16( Value, 11 );
        const __m128i Green = _mm_and_si128( _mm_srli_epi16( Value, 5 ), _mm_set1_epi16( 63 ) );
        const __m128i Blue = _mm_and_si128( Value, _mm_set1_epi16( 31 ) );
        const __m128i RedBlue = _mm_add_epi16( Red, Blue );
        const __m128i Sum = _mm_slli_epi16( _mm_add_epi16( Green, _mm_add_epi16( RedBlue, RedBlue ) ), 2 );
        _mm_storel_epi64( reinterpret_cast< __m128i* >( o_pL + i ), _mm_packus_epi16( DivideBy3( Sum ), Sum ) );
      }
      return i;
    }
  } // namespace Kernels
} // namespace CoreVideoUtils
