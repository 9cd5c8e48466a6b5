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
        const Bytes Via = Converted( Source, W, H, rTrip.From, rTrip.Via );
        ASSERT_FALSE( Via.empty() );
        Bytes Expected = Source;
        for( std::size_t i = 0; i < Expected.size(); ++i )
          Expected[i] &= rTrip.Mask[i % rTrip.Step];
        EXPECT_EQ( Converted( Via, W, H, rTrip.Via, rTrip.From ), Expected );
      }
  }

  // Bit i of a stream, most significant first.
  unsigned BitAt( const Bytes& i_rStream, std::uint64_t i )
  {
    return ( i_rStream[i / 8] >> ( 7 - i % 8 ) ) & 1u;
  }

  // The packed forms' second method: samples read and written one bit at a time. Runs start and
  // end inside a byte, and one is too short for a whole group of the stream's 8-byte reads.
  TEST( PackedSamples, UnpackAndPackMatchTheBitByBitRule )
  {
    for( unsigned Bits : { 6u, 7u } )
      for( const auto& [First, Count] : { std::make_pair( 0, 8 ), std::make_pair( 5, 1001 ), std::make_pair( 13, 9 ) } )
      {
        SCOPED_TRACE( std::to_string( Bits ) + " bits, first " + std::to_string( First ) + ", count " +
                      std::to_string( Count ) );
        const Bytes Stream = RandomBytes( ( ( First + Count ) * Bits + 7 ) / 8, Bits * 1000 + First + Count );
        const Bytes Values = RandomBytes( Count, 99 );
        Bytes Unpacked( Count ), Packed = Stream, WantUnpacked( Count, 0 ), WantPacked = Stream;
        for( std::uint64_t b = 0; b < std::uint64_t( Count ) * Bits; ++b )
        {
          const std::uint64_t At = First * Bits + b;
          const unsigned Shift = 7 - b % Bits, Mask = 0x80u >> At % 8;
          WantUnpacked[b / Bits] |= BitAt( Stream, At ) << Shift;
          WantPacked[At / 8] = ( WantPacked[At / 8] & ~Mask ) | ( ( Values[b / Bits] >> Shift ) & 1u ? Mask : 0 );
        }
        CoreVideoUtils::Kernels::UnpackSamples( Stream.data(), Stream.size(), Bits, First, Count, Unpacked.data() );
        CoreVideoUtils::Kernels::PackSamples( Values.data(), Bits, First, Count, Packed.data(), Packed.size() );
        EXPECT_EQ( Unpacked, WantUnpacked );
        EXPECT_EQ( Packed, WantPacked ) << "only the run's bits change";
      }
  }
} // namespace
