// Vector forms on AVX2. This file alone is compiled for AVX2; nothing here runs unless the
// processor reports it. Byte shuffles write three-byte pixels exactly, with no scratch bytes.

#include "graphics/CoreVideoUtils/PixelKernelsSIMD.h"

#include <immintrin.h>

#include <array>
#include <cstring>
#include <type_traits>

namespace CoreVideoUtils
{
  namespace Kernels
  {
    namespace
    {
      // Shuffle masks that interleave three 16-byte channel vectors into 48 bytes: mask
      // [block][channel] picks, for each byte of output block, the byte of that channel or zero.
      struct VInterleaveMasks
      {
        alignas( 16 ) std::array< std::array< std::array< std::int8_t, 16 >, 3 >, 3 > Masks{};
        constexpr VInterleaveMasks()
        {
          for( int Block = 0; Block < 3; ++Block )
            for( int Channel = 0; Channel < 3; ++Channel )
              for( int t = 0; t < 16; ++t )
              {
                const int m = 16 * Block + t;
                Masks[Block][Channel][t] = static_cast< std::int8_t >( m % 3 == Channel ? m / 3 : -128 );
              }
        }
      };
      constexpr VInterleaveMasks s_Interleave;

      inline __m128i Mask( int Block, int Channel )
      {
        return _mm_load_si128( reinterpret_cast< const __m128i* >( s_Interleave.Masks[Block][Channel].data() ) );
      }

      // 16 pixels of 16-bit channel values (0 to 255) to 48 bytes.
      inline void StoreRGB16( __m256i R, __m256i G, __m256i B, std::uint8_t* o )
      {
        const __m128i R8 = _mm_packus_epi16( _mm256_castsi256_si128( R ), _mm256_extracti128_si256( R, 1 ) );
        const __m128i G8 = _mm_packus_epi16( _mm256_castsi256_si128( G ), _mm256_extracti128_si256( G, 1 ) );
        const __m128i B8 = _mm_packus_epi16( _mm256_castsi256_si128( B ), _mm256_extracti128_si256( B, 1 ) );
        for( int Block = 0; Block < 3; ++Block )
        {
          const __m128i Out = _mm_or_si128(
              _mm_or_si128( _mm_shuffle_epi8( R8, Mask( Block, 0 ) ), _mm_shuffle_epi8( G8, Mask( Block, 1 ) ) ),
              _mm_shuffle_epi8( B8, Mask( Block, 2 ) ) );
          _mm_storeu_si128( reinterpret_cast< __m128i* >( o + 16 * Block ), Out );
        }
      }

      inline __m256i Load16( const std::uint8_t* p )
      {
        return _mm256_cvtepu8_epi16( _mm_loadu_si128( reinterpret_cast< const __m128i* >( p ) ) );
      }

      inline __m256i BlendEvenOdd( __m256i A, __m256i B )
      {
        return _mm256_blend_epi16( B, A, 0x55 );
      }

      template < unsigned K >
      inline void Site( __m256i C, __m256i Cross, __m256i Diagonal, __m256i Vertical, __m256i Horizontal, __m256i& R,
                        __m256i& G, __m256i& B )
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

      template < unsigned KA, bool SWAP >
      std::uint32_t DemosaicInterior( const std::uint8_t* n, const std::uint8_t* c, const std::uint8_t* s,
                                      std::uint32_t i_Width, std::uint8_t* o )
      {
        std::uint32_t x = 1;
        for( ; x + 17 <= i_Width; x += 16 )
        {
          const __m256i N0 = Load16( n + x ), S0 = Load16( s + x );
          const __m256i Cm = Load16( c + x - 1 ), C0 = Load16( c + x ), Cp = Load16( c + x + 1 );
          const __m256i NS = _mm256_add_epi16( N0, S0 ), WE = _mm256_add_epi16( Cm, Cp );
          const __m256i Cross = _mm256_srli_epi16( _mm256_add_epi16( NS, WE ), 2 );
          const __m256i Diagonal =
              _mm256_srli_epi16( _mm256_add_epi16( _mm256_add_epi16( Load16( n + x - 1 ), Load16( n + x + 1 ) ),
                                                   _mm256_add_epi16( Load16( s + x - 1 ), Load16( s + x + 1 ) ) ),
                                 2 );
          const __m256i Vertical = _mm256_srli_epi16( NS, 1 ), Horizontal = _mm256_srli_epi16( WE, 1 );
          __m256i Ra, Ga, Ba, Rb, Gb, Bb;
          Site< KA >( C0, Cross, Diagonal, Vertical, Horizontal, Ra, Ga, Ba );
          Site< KA ^ 1u >( C0, Cross, Diagonal, Vertical, Horizontal, Rb, Gb, Bb );
          const __m256i R = BlendEvenOdd( Ra, Rb ), G = BlendEvenOdd( Ga, Gb ), B = BlendEvenOdd( Ba, Bb );
          if constexpr( SWAP )
            StoreRGB16( B, G, R, o + 3 * x );
          else
            StoreRGB16( R, G, B, o + 3 * x );
        }
        return x;
      }

      using InteriorFunction = std::uint32_t ( * )( const std::uint8_t*, const std::uint8_t*, const std::uint8_t*,
                                                    std::uint32_t, std::uint8_t* );
      constexpr InteriorFunction s_Interiors[2][4] = { { DemosaicInterior< 0, false >, DemosaicInterior< 1, false >,
                                                         DemosaicInterior< 2, false >, DemosaicInterior< 3, false > },
                                                       { DemosaicInterior< 0, true >, DemosaicInterior< 1, true >,
                                                         DemosaicInterior< 2, true >, DemosaicInterior< 3, true > } };

      // Shuffle of 16 bytes into eight 16-bit big-endian windows: window e holds bytes
      // (Bits * (e + First)) / 8 and the one after it, high byte first.
      inline __m256i WindowShuffle( unsigned i_Bits, int i_First )
      {
        alignas( 32 ) std::int8_t Bytes[32];
        for( int Lane = 0; Lane < 2; ++Lane )
          for( int e = 0; e < 8; ++e )
          {
            const int High = static_cast< int >( i_Bits ) * ( e + i_First ) / 8;
            Bytes[16 * Lane + 2 * e] = static_cast< std::int8_t >( High + 1 );
            Bytes[16 * Lane + 2 * e + 1] = static_cast< std::int8_t >( High );
          }
        return _mm256_load_si256( reinterpret_cast< const __m256i* >( Bytes ) );
      }

      // Multipliers that shift each window left by its sample's bit offset within the byte.
      inline __m256i WindowShift( unsigned i_Bits, int i_First )
      {
        alignas( 32 ) std::int16_t Factors[16];
        for( int Lane = 0; Lane < 2; ++Lane )
          for( int e = 0; e < 8; ++e )
            Factors[8 * Lane + e] =
                static_cast< std::int16_t >( 1 << ( ( static_cast< int >( i_Bits ) * ( e + i_First ) ) & 7 ) );
        return _mm256_load_si256( reinterpret_cast< const __m256i* >( Factors ) );
      }
    } // namespace

    namespace
    {
      // A 256-entry byte table with 16-entry shuffles: for bytes below 128, shuffle k looks up
      // x - 16k, which is a valid index for the 16 entries of row k and has its top bit set
      // (giving 0) for every row above x's own; the rows are stored as differences of
      // consecutive rows, so the XOR of the rows up to x's own is x's entry. Bytes from 128 up
      // take the same path on x - 128 with the upper rows, and a blend on the top bit picks.
      struct VShuffleTable
      {
        __m256i Rows[2][8];
        explicit VShuffleTable( const std::uint8_t* i_pTable )
        {
          for( int Half = 0; Half < 2; ++Half )
            for( int k = 0; k < 8; ++k )
            {
              alignas( 16 ) std::uint8_t Row[16];
              for( int l = 0; l < 16; ++l )
              {
                const int Index = 128 * Half + 16 * k + l;
                Row[l] = static_cast< std::uint8_t >( i_pTable[Index] ^ ( k > 0 ? i_pTable[Index - 16] : 0 ) );
              }
              Rows[Half][k] =
                  _mm256_broadcastsi128_si256( _mm_load_si128( reinterpret_cast< const __m128i* >( Row ) ) );
            }
        }

        __m256i LookUp( __m256i x ) const
        {
          __m256i Result[2];
          for( int Half = 0; Half < 2; ++Half )
          {
            __m256i Index = Half == 0 ? x : _mm256_xor_si256( x, _mm256_set1_epi8( -128 ) );
            __m256i Value = _mm256_shuffle_epi8( Rows[Half][0], Index );
            for( int k = 1; k < 8; ++k )
            {
              Index = _mm256_sub_epi8( Index, _mm256_set1_epi8( 16 ) );
              Value = _mm256_xor_si256( Value, _mm256_shuffle_epi8( Rows[Half][k], Index ) );
            }
            Result[Half] = Value;
          }
          return _mm256_blendv_epi8( Result[0], Result[1], x );
        }
      };

      // The table on the first three bytes of i_Count pixels of i_Step bytes.
      void LookUpBytes( std::uint8_t* io_pData, std::uint64_t i_Count, unsigned i_Step, const std::uint8_t* i_pTable )
      {
        const VShuffleTable Table( i_pTable );
        const std::uint64_t Bytes = i_Count * i_Step;
        const __m256i FourthBytes = _mm256_set1_epi32( static_cast< int >( 0xFF000000u ) );
        std::uint64_t b = 0;
        for( ; b + 32 <= Bytes; b += 32 )
        {
          const __m256i Input = _mm256_loadu_si256( reinterpret_cast< const __m256i* >( io_pData + b ) );
          __m256i Output = Table.LookUp( Input );
          if( i_Step == 4 )
            Output = _mm256_blendv_epi8( Output, Input, FourthBytes );
          _mm256_storeu_si256( reinterpret_cast< __m256i* >( io_pData + b ), Output );
        }
        for( ; b < Bytes; ++b )
          if( i_Step == 3 || b % 4 != 3 )
            io_pData[b] = i_pTable[io_pData[b]];
      }
    } // namespace

    std::uint32_t DemosaicRowInteriorAVX2( const std::uint8_t* i_pNorth, const std::uint8_t* i_pRow,
                                           const std::uint8_t* i_pSouth, std::uint32_t i_Width, unsigned i_StartKind,
                                           bool i_bSwapRB, std::uint8_t* o_pRGB )
    {
      return s_Interiors[i_bSwapRB ? 1 : 0][( i_StartKind ^ 1u ) & 3u]( i_pNorth, i_pRow, i_pSouth, i_Width, o_pRGB );
    }

    std::uint64_t YUV422ToRGBAVX2( const std::uint8_t* i_pSource, bool i_bLumaFirst, std::uint64_t i_PixelCount,
                                   std::uint8_t* o_pRGB )
    {
      const __m256i LowByte = _mm256_set1_epi16( 0x00FF );
      const __m256i Low16 = _mm256_set1_epi32( 0x0000FFFF );
      const __m256i GreenFactors = _mm256_set1_epi32( ( 18744 << 16 ) | ( -22544 & 0xFFFF ) );
      std::uint64_t i = 0;
      for( ; i + 16 <= i_PixelCount; i += 16 )
      {
        const __m256i Raw = _mm256_loadu_si256( reinterpret_cast< const __m256i* >( i_pSource + 2 * i ) );
        const __m256i Y = i_bLumaFirst ? _mm256_and_si256( Raw, LowByte ) : _mm256_srli_epi16( Raw, 8 );
        const __m256i Chroma = _mm256_sub_epi16(
            i_bLumaFirst ? _mm256_srli_epi16( Raw, 8 ) : _mm256_and_si256( Raw, LowByte ), _mm256_set1_epi16( 128 ) );
        const __m256i U = _mm256_or_si256( _mm256_and_si256( Chroma, Low16 ), _mm256_slli_epi32( Chroma, 16 ) );
        const __m256i V = _mm256_or_si256( _mm256_srli_epi32( Chroma, 16 ), _mm256_andnot_si256( Low16, Chroma ) );
        const __m256i R =
            _mm256_add_epi16( _mm256_add_epi16( Y, V ), _mm256_mulhi_epi16( V, _mm256_set1_epi16( 26411 ) ) );
        const __m256i B = _mm256_add_epi16( _mm256_add_epi16( Y, _mm256_add_epi16( U, U ) ),
                                            _mm256_mulhi_epi16( U, _mm256_set1_epi16( -15074 ) ) );
        const __m256i GreenPair = _mm256_srai_epi32( _mm256_madd_epi16( Chroma, GreenFactors ), 16 );
        const __m256i Green =
            _mm256_or_si256( _mm256_and_si256( GreenPair, Low16 ), _mm256_slli_epi32( GreenPair, 16 ) );
        const __m256i G = _mm256_add_epi16( _mm256_sub_epi16( Y, V ), Green );
        StoreRGB16( R, G, B, o_pRGB + 3 * i ); // the byte packing clamps to 0 to 255
      }
      return i;
    }

    std::uint64_t UnpackSamplesAVX2( const std::uint8_t* i_pSource, std::uint64_t i_SourceBytes, unsigned i_Bits,
                                     std::uint64_t i_Count, std::uint8_t* o_pBytes )
    {
      if( i_Bits != 7 && i_Bits != 6 )
        return 0;
      // 32 samples a step: 16 in each 128-bit lane, the second lane loaded 2 x i_Bits bytes on.
      const std::uint64_t StepBytes = 4 * i_Bits;
      const std::uint64_t LaneBytes = 2 * i_Bits;
      const __m256i ShuffleLow = WindowShuffle( i_Bits, 0 ), ShuffleHigh = WindowShuffle( i_Bits, 8 );
      const __m256i ShiftLow = WindowShift( i_Bits, 0 ), ShiftHigh = WindowShift( i_Bits, 8 );
      const __m256i SampleMask = _mm256_set1_epi16( static_cast< short >( ( 0xFF << ( 8 - i_Bits ) ) & 0xFF ) );
      std::uint64_t i = 0, Byte = 0;
      for( ; i + 32 <= i_Count && Byte + LaneBytes + 16 <= i_SourceBytes; i += 32, Byte += StepBytes )
      {
        const __m256i Raw = _mm256_loadu2_m128i( reinterpret_cast< const __m128i* >( i_pSource + Byte + LaneBytes ),
                                                 reinterpret_cast< const __m128i* >( i_pSource + Byte ) );
        const __m256i Low = _mm256_and_si256(
            _mm256_srli_epi16( _mm256_mullo_epi16( _mm256_shuffle_epi8( Raw, ShuffleLow ), ShiftLow ), 8 ),
            SampleMask );
        const __m256i High = _mm256_and_si256(
            _mm256_srli_epi16( _mm256_mullo_epi16( _mm256_shuffle_epi8( Raw, ShuffleHigh ), ShiftHigh ), 8 ),
            SampleMask );
        _mm256_storeu_si256( reinterpret_cast< __m256i* >( o_pBytes + i ), _mm256_packus_epi16( Low, High ) );
      }
      return i;
    }

    std::uint64_t CorrectColoursAVX2( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_Step,
                                      const std::uint8_t* i_pTable, float i_SaturationDelta )
    {
      if( i_Step != 3 && i_Step != 4 )
        return 0;
      // Blocks of 8 pixels are read as two 16-byte halves of 4 pixels; with 3-byte pixels the
      // second half reads 4 bytes beyond the block, so the last block must leave them.
      std::uint64_t Blocks = i_PixelCount / 8;
      if( i_Step == 3 && Blocks > 0 && Blocks * 8 * 3 + 4 > i_PixelCount * 3 )
        --Blocks;
      const std::uint64_t Count = i_SaturationDelta == 0.0f ? i_PixelCount : Blocks * 8;
      // The gamma table first, over all the pixels this form takes on.
      if( i_pTable != nullptr )
        LookUpBytes( io_pData, Count, i_Step, i_pTable );
      if( i_SaturationDelta == 0.0f )
        return Count;

      const float AmountValue = -i_SaturationDelta < 1.0f ? -i_SaturationDelta : 1.0f;
      const __m256 Amount = _mm256_set1_ps( AmountValue ), Keep = _mm256_set1_ps( 1.0f - AmountValue );
      const __m256 Third = _mm256_set1_ps( 0.33333334f ), Zero = _mm256_setzero_ps(), Max = _mm256_set1_ps( 255.0f );
      const __m256i Byte = _mm256_set1_epi32( 0xFF );
      const __m256i Spread3 = _mm256_setr_epi8( 0, 1, 2, -128, 3, 4, 5, -128, 6, 7, 8, -128, 9, 10, 11, -128, 0, 1, 2,
                                                -128, 3, 4, 5, -128, 6, 7, 8, -128, 9, 10, 11, -128 );
      auto Correct = [&]( __m256i i_Value, __m256 i_Grey )
      {
        const __m256 Value = _mm256_add_ps( _mm256_mul_ps( Keep, _mm256_cvtepi32_ps( i_Value ) ), i_Grey );
        return _mm256_cvttps_epi32( _mm256_min_ps( _mm256_max_ps( Value, Zero ), Max ) );
      };
      // One loop a pixel size, so that the step is a constant inside it.
      auto Run = [&]( auto i_Step )
      {
        constexpr unsigned STEP = decltype( i_Step )::value;
        // Three bytes of each 32-bit lane to the bottom of its half, then the halves together:
        // 24 bytes written by two stores.
        const __m256i Pack3 = _mm256_setr_epi8( 0, 1, 2, 4, 5, 6, 8, 9, 10, 12, 13, 14, -128, -128, -128, -128, 0, 1, 2,
                                                4, 5, 6, 8, 9, 10, 12, 13, 14, -128, -128, -128, -128 );
        const __m256i Join3 = _mm256_setr_epi32( 0, 1, 2, 4, 5, 6, 7, 7 );
        const __m256i Fourth = _mm256_set1_epi32( static_cast< int >( 0xFF000000u ) );
        for( std::uint64_t Block = 0; Block < Blocks; ++Block )
        {
          std::uint8_t* p = io_pData + Block * 8 * STEP;
          __m256i Pixels;
          if constexpr( STEP == 4 )
            Pixels = _mm256_loadu_si256( reinterpret_cast< const __m256i* >( p ) );
          else
            Pixels = _mm256_shuffle_epi8( _mm256_loadu2_m128i( reinterpret_cast< const __m128i* >( p + 12 ),
                                                               reinterpret_cast< const __m128i* >( p ) ),
                                          Spread3 );
          const __m256i R = _mm256_and_si256( Pixels, Byte );
          const __m256i G = _mm256_and_si256( _mm256_srli_epi32( Pixels, 8 ), Byte );
          const __m256i B = _mm256_and_si256( _mm256_srli_epi32( Pixels, 16 ), Byte );
          const __m256 Mean =
              _mm256_mul_ps( _mm256_cvtepi32_ps( _mm256_add_epi32( _mm256_add_epi32( R, G ), B ) ), Third );
          const __m256 Grey = _mm256_mul_ps( Amount, Mean );
          const __m256i Out =
              _mm256_or_si256( _mm256_or_si256( Correct( R, Grey ), _mm256_slli_epi32( Correct( G, Grey ), 8 ) ),
                               _mm256_slli_epi32( Correct( B, Grey ), 16 ) );
          if constexpr( STEP == 4 )
            _mm256_storeu_si256( reinterpret_cast< __m256i* >( p ),
                                 _mm256_or_si256( Out, _mm256_and_si256( Pixels, Fourth ) ) );
          else
          {
            const __m256i Packed = _mm256_permutevar8x32_epi32( _mm256_shuffle_epi8( Out, Pack3 ), Join3 );
            _mm_storeu_si128( reinterpret_cast< __m128i* >( p ), _mm256_castsi256_si128( Packed ) );
            _mm_storel_epi64( reinterpret_cast< __m128i* >( p + 16 ), _mm256_extracti128_si256( Packed, 1 ) );
          }
        }
      };
      if( i_Step == 3 )
        Run( std::integral_constant< unsigned, 3 >() );
      else
        Run( std::integral_constant< unsigned, 4 >() );
      return Count;
    }
  } // namespace Kernels
} // namespace CoreVideoUtils
