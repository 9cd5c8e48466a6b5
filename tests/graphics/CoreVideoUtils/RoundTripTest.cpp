// Conversions that have an inverse: going there and back loses exactly the bits the narrower
// format cannot hold, and nothing else.

#include "ConversionTestSupport.h"
#include "graphics/CoreVideoUtils/PixelKernels.h"

#include <gtest/gtest.h>

namespace
{
  using namespace CoreVideoUtilsTest;
  using namespace ZOL;

  TEST( RoundTrips, LoseOnlyTheNarrowFormatsBits )
  {
    const struct
    {
      EPixelFormat From, Via;
      std::uint8_t Mask[3]; // the bits of each byte of a pixel of From that survive
      unsigned Step;
    } Trips[] = {
        { PixelFormat_R8G8B8, PixelFormat_B8G8R8, { 0xFF, 0xFF, 0xFF }, 3 },
        { PixelFormat_R8G8B8, PixelFormat_R8G8B8u8, { 0xFF, 0xFF, 0xFF }, 3 },
        { PixelFormat_R8G8B8, PixelFormat_B8G8R8u8, { 0xFF, 0xFF, 0xFF }, 3 },
        { PixelFormat_R8G8B8, PixelFormat_PlanarR8G8B8, { 0xFF, 0xFF, 0xFF }, 3 },
        { PixelFormat_R8G8B8, PixelFormat_R5G6B5, { 0xF8, 0xFC, 0xF8 }, 3 },
        { PixelFormat_U8Y8V8Y8, PixelFormat_Y8U8Y8V8, { 0xFF }, 1 },
        { PixelFormat_U8Y8V8Y8, PixelFormat_U10Y10V10Y10, { 0xFF }, 1 },
        { PixelFormat_Y8U8Y8V8, PixelFormat_U10Y10V10Y10, { 0xFF }, 1 },
        { PixelFormat_Luminance8, PixelFormat_Luminance7, { 0xFE }, 1 },
        { PixelFormat_Luminance8, PixelFormat_Luminance6, { 0xFC }, 1 },
        { PixelFormat_BayerGB8, PixelFormat_BayerGB7, { 0xFE }, 1 },
        { PixelFormat_BayerGB8, PixelFormat_BayerGB6, { 0xFC }, 1 },
    };
    for( const auto& rTrip : Trips )
      // Widths around the 48-pixel rows of the 10-bit format and an odd run longer than the
      // converter's 4608-pixel runs.
      for( const auto& [W, H] : { std::make_pair( 47, 2 ), std::make_pair( 48, 3 ), std::make_pair( 4610, 2 ) } )
      {
        SCOPED_TRACE( std::string( ToString( rTrip.From ) ) + " via " + ToString( rTrip.Via ) + " " +
                      std::to_string( W ) + "x" + std::to_string( H ) );
        const Bytes Source = RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, rTrip.From ), W * 7 + H );
        const Bytes Via = MustConvert( Source, W, H, rTrip.From, rTrip.Via );
        ASSERT_FALSE( Via.empty() );
        Bytes Expected = Source;
        for( std::size_t i = 0; i < Expected.size(); ++i )
          Expected[i] &= rTrip.Mask[i % rTrip.Step];
        EXPECT_EQ( MustConvert( Via, W, H, rTrip.Via, rTrip.From ), Expected );
      }
  }

  // Samples read one bit at a time, most significant first: the second method for the packed forms.
  std::uint8_t SampleByBits( const Bytes& i_rStream, unsigned i_Bits, std::uint64_t i_Index )
  {
    unsigned Value = 0;
    for( unsigned b = 0; b < i_Bits; ++b )
    {
      const std::uint64_t Bit = i_Index * i_Bits + b;
      Value = ( Value << 1 ) | ( ( i_rStream[Bit / 8] >> ( 7 - Bit % 8 ) ) & 1u );
    }
    return static_cast< std::uint8_t >( Value << ( 8 - i_Bits ) );
  }

  void CheckPackedRun( unsigned Bits, int First, int Count )
  {
    const std::uint64_t StreamBytes = ( ( First + Count ) * Bits + 7 ) / 8;
    const Bytes Stream = RandomBytes( StreamBytes, Bits * 1000 + First + Count );
    Bytes Unpacked( Count );
    CoreVideoUtils::Kernels::UnpackSamples( Stream.data(), Stream.size(), Bits, First, Count, Unpacked.data() );
    for( int i = 0; i < Count; ++i )
      ASSERT_EQ( Unpacked[i], SampleByBits( Stream, Bits, First + i ) ) << "sample " << i;

    // Packing new values over the same samples changes those bits only.
    const Bytes Values = RandomBytes( Count, 99 );
    Bytes Packed = Stream;
    CoreVideoUtils::Kernels::PackSamples( Values.data(), Bits, First, Count, Packed.data(), Packed.size() );
    for( std::uint64_t Bit = 0; Bit < StreamBytes * 8; ++Bit )
      if( Bit < First * Bits || Bit >= ( First + Count ) * Bits )
      {
        ASSERT_EQ( ( Packed[Bit / 8] >> ( 7 - Bit % 8 ) ) & 1, ( Stream[Bit / 8] >> ( 7 - Bit % 8 ) ) & 1 )
            << "bit " << Bit;
      }
    for( int i = 0; i < Count; ++i )
      ASSERT_EQ( SampleByBits( Packed, Bits, First + i ), Values[i] & ( 0xFF << ( 8 - Bits ) ) ) << "sample " << i;
  }

  // Any start and length, including ones that begin and end inside a byte.
  TEST( PackedSamples, UnpackMatchesBitByBitAndPackLeavesOtherBitsAlone )
  {
    for( unsigned Bits : { 6u, 7u } )
      for( int First : { 0, 5, 13 } )
        for( int Count : { 1, 8, 9, 33, 1001 } )
        {
          SCOPED_TRACE( std::to_string( Bits ) + " bits, first " + std::to_string( First ) + ", count " +
                        std::to_string( Count ) );
          CheckPackedRun( Bits, First, Count );
        }
  }
} // namespace
