#include "graphics/CoreVideoUtils/PixelKernels.h"

#include "graphics/CoreVideoUtils/PixelKernelsSIMD.h"

#include <algorithm>
#include <cstring>

namespace CoreVideoUtils
{
  namespace Kernels
  {
    namespace
    {
      inline std::uint8_t ClampByte( std::int32_t i_Value )
      {
        return static_cast< std::uint8_t >( i_Value < 0 ? 0 : ( i_Value > 255 ? 255 : i_Value ) );
      }

      // The five interpolations of one site; which ones a site uses depends on its kind.
      struct VNeighbourhood
      {
        int Centre, Cross, Diagonal, Vertical, Horizontal;
      };

      inline VNeighbourhood Interpolate( int N, int S, int W, int E, int NW, int NE, int SW, int SE, int C )
      {
        return { C, ( N + S + W + E ) >> 2, ( NW + NE + SW + SE ) >> 2, ( N + S ) >> 1, ( W + E ) >> 1 };
      }

      // R, G, B of a site of kind K: 0 red, 1 green on a red row, 3 green on a blue row, 2 blue.
      template < unsigned K > inline void Site( const VNeighbourhood& i_rN, int& o_rR, int& o_rG, int& o_rB )
      {
        if constexpr( K == 0 )
        {
          o_rR = i_rN.Centre, o_rG = i_rN.Cross, o_rB = i_rN.Diagonal;
        }
        else if constexpr( K == 1 )
        {
          o_rR = i_rN.Horizontal, o_rG = i_rN.Centre, o_rB = i_rN.Vertical;
        }
        else if constexpr( K == 3 )
        {
          o_rR = i_rN.Vertical, o_rG = i_rN.Centre, o_rB = i_rN.Horizontal;
        }
        else
        {
          o_rR = i_rN.Diagonal, o_rG = i_rN.Cross, o_rB = i_rN.Centre;
        }
      }

      template < unsigned K, bool SWAP >
      inline void InteriorPixel( const std::uint8_t* n, const std::uint8_t* c, const std::uint8_t* s, std::uint8_t* o )
      {
        const VNeighbourhood Values = Interpolate( n[0], s[0], c[-1], c[1], n[-1], n[1], s[-1], s[1], c[0] );
        int R, G, B;
        Site< K >( Values, R, G, B );
        o[SWAP ? 2 : 0] = static_cast< std::uint8_t >( R );
        o[1] = static_cast< std::uint8_t >( G );
        o[SWAP ? 0 : 2] = static_cast< std::uint8_t >( B );
      }

      // Pixels [i_Begin, i_End) of the interior, two at a time so that kinds are constants:
      // KB is the kind at i_Begin.
      template < unsigned KB, bool SWAP >
      void InteriorRun( const std::uint8_t* n, const std::uint8_t* c, const std::uint8_t* s, std::uint32_t i_Begin,
                        std::uint32_t i_End, std::uint8_t* o )
      {
        std::uint32_t x = i_Begin;
        for( ; x + 2 <= i_End; x += 2 )
        {
          InteriorPixel< KB, SWAP >( n + x, c + x, s + x, o + 3 * x );
          InteriorPixel< KB ^ 1u, SWAP >( n + x + 1, c + x + 1, s + x + 1, o + 3 * x + 3 );
        }
        if( x < i_End )
          InteriorPixel< KB, SWAP >( n + x, c + x, s + x, o + 3 * x );
      }

      using InteriorRunFunction = void ( * )( const std::uint8_t*, const std::uint8_t*, const std::uint8_t*,
                                              std::uint32_t, std::uint32_t, std::uint8_t* );
      constexpr InteriorRunFunction s_InteriorRuns[2][4] = {
          { InteriorRun< 0, false >, InteriorRun< 1, false >, InteriorRun< 2, false >, InteriorRun< 3, false > },
          { InteriorRun< 0, true >, InteriorRun< 1, true >, InteriorRun< 2, true >, InteriorRun< 3, true > } };

      // A pixel at the left or right edge, where neighbours outside the row read as 0.
      void EdgePixel( const std::uint8_t* n, const std::uint8_t* c, const std::uint8_t* s, std::uint32_t i_Width,
                      std::uint32_t x, unsigned i_Kind, bool i_bSwapRB, std::uint8_t* o )
      {
        auto At = [i_Width]( const std::uint8_t* i_pRow, std::int64_t i_X ) -> int
        { return i_X < 0 || i_X >= static_cast< std::int64_t >( i_Width ) ? 0 : i_pRow[i_X]; };
        const std::int64_t X = x;
        const VNeighbourhood Values =
            Interpolate( At( n, X ), At( s, X ), At( c, X - 1 ), At( c, X + 1 ), At( n, X - 1 ), At( n, X + 1 ),
                         At( s, X - 1 ), At( s, X + 1 ), At( c, X ) );
        int R, G, B;
        switch( i_Kind & 3u )
        {
        case 0:
          Site< 0 >( Values, R, G, B );
          break;
        case 1:
          Site< 1 >( Values, R, G, B );
          break;
        case 2:
          Site< 2 >( Values, R, G, B );
          break;
        default:
          Site< 3 >( Values, R, G, B );
          break;
        }
        o[i_bSwapRB ? 2 : 0] = static_cast< std::uint8_t >( R );
        o[1] = static_cast< std::uint8_t >( G );
        o[i_bSwapRB ? 0 : 2] = static_cast< std::uint8_t >( B );
      }

      struct VYUVPair
      {
        std::int32_t R, G, B; // the chroma terms in 16.16, shared by both pixels of the pair
      };

      inline VYUVPair ChromaTerms8( int U, int V )
      {
        return { ( V - 128 ) * 91947, 8875008 - 22544 * U - 46792 * V, ( U - 128 ) * 115998 };
      }

      inline void YUVPixel( const VYUVPair& i_rTerms, int Y, std::uint8_t* o )
      {
        const std::int32_t Luma = Y * 65536;
        o[0] = ClampByte( ( i_rTerms.R + Luma ) >> 16 );
        o[1] = ClampByte( ( Luma + i_rTerms.G ) >> 16 );
        o[2] = ClampByte( ( i_rTerms.B + Luma ) >> 16 );
      }

      inline std::uint64_t LoadBigEndian64( const std::uint8_t* p )
      {
        std::uint64_t Value;
        std::memcpy( &Value, p, 8 );
        return __builtin_bswap64( Value );
      }

      // One sample of the stream; bytes past the end read as 0.
      inline std::uint8_t ReadSample( const std::uint8_t* p, std::uint64_t i_Size, unsigned i_Bits, std::uint64_t i )
      {
        const std::uint64_t Bit = i * i_Bits;
        const std::uint64_t Byte = Bit >> 3;
        const unsigned Window = ( static_cast< unsigned >( p[Byte] ) << 8 ) | ( Byte + 1 < i_Size ? p[Byte + 1] : 0u );
        const unsigned Shift = 16 - i_Bits - static_cast< unsigned >( Bit & 7 );
        const unsigned Mask = ( 1u << i_Bits ) - 1;
        return static_cast< std::uint8_t >( ( ( Window >> Shift ) & Mask ) << ( 8 - i_Bits ) );
      }

      inline void WriteSample( std::uint8_t* p, std::uint64_t i_Size, unsigned i_Bits, std::uint64_t i,
                               std::uint8_t i_Value )
      {
        const std::uint64_t Bit = i * i_Bits;
        const std::uint64_t Byte = Bit >> 3;
        const unsigned Shift = 16 - i_Bits - static_cast< unsigned >( Bit & 7 );
        const unsigned Mask = ( ( 1u << i_Bits ) - 1 ) << Shift;
        const unsigned Bits = ( static_cast< unsigned >( i_Value ) >> ( 8 - i_Bits ) ) << Shift;
        p[Byte] = static_cast< std::uint8_t >( ( p[Byte] & ~( Mask >> 8 ) ) | ( Bits >> 8 ) );
        if( ( Mask & 0xFFu ) != 0 && Byte + 1 < i_Size )
          p[Byte + 1] = static_cast< std::uint8_t >( ( p[Byte + 1] & ~Mask ) | ( Bits & 0xFFu ) );
      }

      template < unsigned BITS > void UnpackGroups( const std::uint8_t* p, std::uint64_t i_Groups, std::uint8_t* o )
      {
        constexpr unsigned Mask = ( 1u << BITS ) - 1;
        for( std::uint64_t g = 0; g < i_Groups; ++g, p += BITS, o += 8 )
        {
          const std::uint64_t Word = LoadBigEndian64( p );
          for( unsigned j = 0; j < 8; ++j )
            o[j] = static_cast< std::uint8_t >( ( ( Word >> ( 64 - BITS * ( j + 1 ) ) ) & Mask ) << ( 8 - BITS ) );
        }
      }

      template < unsigned BITS > void PackGroups( const std::uint8_t* i, std::uint64_t i_Groups, std::uint8_t* p )
      {
        for( std::uint64_t g = 0; g < i_Groups; ++g, i += 8, p += BITS )
        {
          std::uint64_t Word = 0;
          for( unsigned j = 0; j < 8; ++j )
            Word |= static_cast< std::uint64_t >( i[j] >> ( 8 - BITS ) ) << ( 64 - BITS * ( j + 1 ) );
          for( unsigned b = 0; b < BITS; ++b )
            p[b] = static_cast< std::uint8_t >( Word >> ( 56 - 8 * b ) );
        }
      }
    } // namespace

    void DemosaicRow( const std::uint8_t* i_pNorth, const std::uint8_t* i_pRow, const std::uint8_t* i_pSouth,
                      std::uint32_t i_Width, unsigned i_StartKind, bool i_bSwapRB, std::uint8_t* o_pRGB,
                      EInstructionSet i_Set )
    {
      if( i_Width == 0 )
        return;
      const unsigned K0 = i_StartKind & 3u;
      EdgePixel( i_pNorth, i_pRow, i_pSouth, i_Width, 0, K0, i_bSwapRB, o_pRGB );
      if( i_Width == 1 )
        return;
      std::uint32_t x = 1;
#if defined( __x86_64__ )
      if( i_Set >= EInstructionSet::AVX2 )
        x = DemosaicRowInteriorAVX2( i_pNorth, i_pRow, i_pSouth, i_Width, K0, i_bSwapRB, o_pRGB );
      else if( i_Set == EInstructionSet::SSE2 )
        x = DemosaicRowInteriorSSE2( i_pNorth, i_pRow, i_pSouth, i_Width, K0, i_bSwapRB, o_pRGB );
#endif
      const unsigned KindAtX = K0 ^ ( x & 1u );
      s_InteriorRuns[i_bSwapRB ? 1 : 0][KindAtX]( i_pNorth, i_pRow, i_pSouth, x, i_Width - 1, o_pRGB );
      EdgePixel( i_pNorth, i_pRow, i_pSouth, i_Width, i_Width - 1, K0 ^ ( ( i_Width - 1 ) & 1u ), i_bSwapRB,
                 o_pRGB + 3 * static_cast< std::uint64_t >( i_Width - 1 ) );
    }

    void YUV422ToRGB( const std::uint8_t* i_pSource, bool i_bLumaFirst, std::uint64_t i_PixelCount,
                      std::uint8_t* o_pRGB, EInstructionSet i_Set )
    {
      std::uint64_t Done = 0;
#if defined( __x86_64__ )
      if( i_Set >= EInstructionSet::AVX2 )
        Done = YUV422ToRGBAVX2( i_pSource, i_bLumaFirst, i_PixelCount, o_pRGB );
      else if( i_Set == EInstructionSet::SSE2 )
        Done = YUV422ToRGBSSE2( i_pSource, i_bLumaFirst, i_PixelCount, o_pRGB );
#endif
      const unsigned YOffset = i_bLumaFirst ? 0 : 1;
      const unsigned COffset = 1 - YOffset;
      const std::uint8_t* p = i_pSource + 2 * Done;
      std::uint8_t* o = o_pRGB + 3 * Done;
      std::uint64_t i = Done;
      for( ; i + 2 <= i_PixelCount; i += 2, p += 4, o += 6 )
      {
        const VYUVPair Terms = ChromaTerms8( p[COffset], p[2 + COffset] );
        YUVPixel( Terms, p[YOffset], o );
        YUVPixel( Terms, p[2 + YOffset], o + 3 );
      }
      if( i < i_PixelCount )
        YUVPixel( ChromaTerms8( p[COffset], 128 ), p[YOffset], o );
    }

    void UnpackSamples( const std::uint8_t* i_pSource, std::uint64_t i_SourceSize, unsigned i_Bits,
                        std::uint64_t i_First, std::uint64_t i_Count, std::uint8_t* o_pBytes )
    {
      std::uint64_t i = 0;
      // Single samples up to a group boundary, where the stream is byte-aligned again.
      for( ; i < i_Count && ( ( i_First + i ) & 7 ) != 0; ++i )
        o_pBytes[i] = ReadSample( i_pSource, i_SourceSize, i_Bits, i_First + i );
      const std::uint64_t StartByte = ( ( i_First + i ) * i_Bits ) >> 3;
      // Groups are read as 8-byte words, so a group needs a byte beyond its own: keep clear of the end.
      std::uint64_t Groups = ( i_Count - i ) / 8;
      const std::uint64_t Available = i_SourceSize > StartByte ? i_SourceSize - StartByte : 0;
      if( Available < 8 )
        Groups = 0;
      else
        Groups = std::min< std::uint64_t >( Groups, ( Available - 8 ) / i_Bits + 1 );
      std::uint64_t Done = 0;
#if defined( __x86_64__ )
      if( BestInstructionSet() >= EInstructionSet::AVX2 )
        Done = UnpackSamplesAVX2( i_pSource + StartByte, Available, i_Bits, Groups * 8, o_pBytes + i ) / 8;
#endif
      if( i_Bits == 7 )
        UnpackGroups< 7 >( i_pSource + StartByte + Done * 7, Groups - Done, o_pBytes + i + Done * 8 );
      else
        UnpackGroups< 6 >( i_pSource + StartByte + Done * 6, Groups - Done, o_pBytes + i + Done * 8 );
      i += Groups * 8;
      for( ; i < i_Count; ++i )
        o_pBytes[i] = ReadSample( i_pSource, i_SourceSize, i_Bits, i_First + i );
    }

    void PackSamples( const std::uint8_t* i_pBytes, unsigned i_Bits, std::uint64_t i_First, std::uint64_t i_Count,
                      std::uint8_t* io_pTarget, std::uint64_t i_TargetSize )
    {
      std::uint64_t i = 0;
      for( ; i < i_Count && ( ( i_First + i ) & 7 ) != 0; ++i )
        WriteSample( io_pTarget, i_TargetSize, i_Bits, i_First + i, i_pBytes[i] );
      const std::uint64_t Groups = ( i_Count - i ) / 8;
      std::uint8_t* p = io_pTarget + ( ( ( i_First + i ) * i_Bits ) >> 3 );
      if( i_Bits == 7 )
        PackGroups< 7 >( i_pBytes + i, Groups, p );
      else
        PackGroups< 6 >( i_pBytes + i, Groups, p );
      i += Groups * 8;
      for( ; i < i_Count; ++i )
        WriteSample( io_pTarget, i_TargetSize, i_Bits, i_First + i, i_pBytes[i] );
    }

    void PlanarRGBToLuminance( const std::uint8_t* i_pR, const std::uint8_t* i_pG, const std::uint8_t* i_pB,
                               std::uint64_t i_Count, std::uint8_t* o_pLuminance, EInstructionSet i_Set )
    {
      std::uint64_t i = 0;
#if defined( __x86_64__ )
      if( i_Set != EInstructionSet::Scalar )
        i = PlanarRGBToLuminanceSSE2( i_pR, i_pG, i_pB, i_Count, o_pLuminance );
#endif
      for( ; i < i_Count; ++i )
        o_pLuminance[i] = static_cast< std::uint8_t >( ( i_pR[i] + i_pG[i] + i_pB[i] ) / 3 );
    }

    void R5G6B5ToLuminance( const std::uint8_t* i_pSource, std::uint64_t i_Count, std::uint8_t* o_pLuminance,
                            EInstructionSet i_Set )
    {
      std::uint64_t i = 0;
#if defined( __x86_64__ )
      if( i_Set != EInstructionSet::Scalar )
        i = R5G6B5ToLuminanceSSE2( i_pSource, i_Count, o_pLuminance );
#endif
      for( ; i < i_Count; ++i )
      {
        const unsigned Value = i_pSource[2 * i] | ( static_cast< unsigned >( i_pSource[2 * i + 1] ) << 8 );
        const unsigned Red = Value >> 11, Green = ( Value >> 5 ) & 63u, Blue = Value & 31u;
        o_pLuminance[i] = static_cast< std::uint8_t >( ( Green + 2 * Blue + 2 * Red ) * 4 / 3 );
      }
    }

    void CorrectColours( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_Step,
                         const std::uint8_t* i_pTable, float i_SaturationDelta, EInstructionSet i_Set )
    {
      if( i_pTable == nullptr && i_SaturationDelta == 0.0f )
        return;
      std::uint64_t i = 0;
#if defined( __x86_64__ )
      if( i_Set == EInstructionSet::AVX512 )
        i = CorrectColoursAVX512( io_pData, i_PixelCount, i_Step, i_pTable, i_SaturationDelta );
      else if( i_Set == EInstructionSet::AVX2 )
        i = CorrectColoursAVX2( io_pData, i_PixelCount, i_Step, i_pTable, i_SaturationDelta );
#endif
      std::uint8_t* p = io_pData + i * i_Step;
      if( i_SaturationDelta == 0.0f )
      {
        for( ; i < i_PixelCount; ++i, p += i_Step )
          p[0] = i_pTable[p[0]], p[1] = i_pTable[p[1]], p[2] = i_pTable[p[2]];
        return;
      }
      const float Amount = std::min( -i_SaturationDelta, 1.0f );
      const float Keep = 1.0f - Amount;
      for( ; i < i_PixelCount; ++i, p += i_Step )
      {
        if( i_pTable != nullptr )
          p[0] = i_pTable[p[0]], p[1] = i_pTable[p[1]], p[2] = i_pTable[p[2]];
        const float Mean = static_cast< float >( p[0] + p[1] + p[2] ) * 0.33333334f;
        const float Grey = Amount * Mean;
        for( unsigned c = 0; c < 3; ++c )
        {
          float Value = Keep * static_cast< float >( p[c] ) + Grey;
          // Written so that a NaN from absurd settings lands on 0, as the vector form's max does.
          Value = Value > 0.0f ? Value : 0.0f;
          Value = Value < 255.0f ? Value : 255.0f;
          p[c] = static_cast< std::uint8_t >( Value );
        }
      }
    }
  } // namespace Kernels
} // namespace CoreVideoUtils
