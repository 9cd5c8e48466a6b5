// Which pairs of formats convert, what bad sizes do, the conversions that are defined as
// compositions of others, 4:2:0 planes packed to 4:2:2, and the conversions that have an inverse:
// going there and back loses exactly the bits the narrower format cannot hold, and nothing else.

#include "ConversionTestSupport.h"
#include "graphics/CoreVideoUtils/PixelKernels.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <climits>

namespace
{
  using namespace CoreVideoUtilsTest;
  using namespace ZOL;
  using CoreVideoUtils::PlanarYUV420ToInterleaved;

  // Pairs with no conversion, and calls whose sizes or pointers don't hold a frame.
  TEST( Conversion, MalformedCallsFailWithoutTouchingTheTarget )
  {
    const struct
    {
      const char* Name;
      std::int32_t Width, Height;
      EPixelFormat From, To;
      std::int64_t SourceAdjust, TargetAdjust; // bytes added to the exact frame sizes
    } Calls[] = {
        { "TargetOneByteShort", 16, 16, PixelFormat_BayerGB8, PixelFormat_R8G8B8, 0, -1 },
        { "SourceOneByteShort", 16, 16, PixelFormat_BayerGB8, PixelFormat_R8G8B8, -1, 0 },
        { "PackedSourceOneByteShort", 9, 3, PixelFormat_BayerGB7, PixelFormat_R8G8B8, -1, 0 },
        { "TenBitRowPaddingMissing", 50, 2, PixelFormat_U10Y10V10Y10, PixelFormat_U8Y8V8Y8, -128, 0 },
        { "SameFormatTargetShort", 4, 4, PixelFormat_R8G8B8, PixelFormat_R8G8B8, 0, -1 },
        { "ZeroWidth", 0, 4, PixelFormat_R8G8B8, PixelFormat_Luminance8, 16, 16 },
        { "NegativeHeight", 4, -4, PixelFormat_R8G8B8, PixelFormat_Luminance8, 64, 64 },
        { "UnspecifiedSource", 4, 4, PixelFormat_Unspecified, PixelFormat_R8G8B8, 64, 0 },
        { "UnknownTarget", 4, 4, PixelFormat_R8G8B8, static_cast< EPixelFormat >( 77 ), 0, 64 },
        { "HugeFrameSmallBuffers", INT_MAX, INT_MAX, PixelFormat_BayerGB8, PixelFormat_R8G8B8, -1, -1 },
        { "HugeWidthOneRow", INT_MAX, 1, PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8, -( 1ll << 31 ), 0 },
        // Bayer sources demosaic to Luminance8, the 8-bit RGB family and the planar forms, and
        // unpack or pack only between BayerGB8 and its packed forms; planar YUV goes only to the
        // four-byte RGB formats and the 10-bit one; nothing else becomes Bayer.
        { "BayerToR5G6B5", 8, 2, PixelFormat_BayerRG8, PixelFormat_R5G6B5, 0, 0 },
        { "BayerToOtherPhase", 8, 2, PixelFormat_BayerRG8, PixelFormat_BayerGB7, 0, 0 },
        { "PackedToPacked", 8, 2, PixelFormat_BayerGB7, PixelFormat_BayerGB6, 0, 0 },
        { "PlanarYUVToR8G8B8", 8, 2, PixelFormat_PlanarY8U8V8, PixelFormat_R8G8B8, 0, 0 },
        { "RGBToBayer", 8, 2, PixelFormat_R8G8B8, PixelFormat_BayerGB8, 0, 0 },
    };
    CoreVideoUtils::VPixelFormatConverter Converter;
    for( const auto& rCall : Calls )
    {
      // Huge descriptions get small real buffers: the sizes passed are what the caller claims.
      const std::uint64_t SourceClaim =
          CoreVideoUtils::FrameSizeInBytes( rCall.Width, rCall.Height, rCall.From ) + rCall.SourceAdjust;
      const std::uint64_t TargetClaim =
          CoreVideoUtils::FrameSizeInBytes( rCall.Width, rCall.Height, rCall.To ) + rCall.TargetAdjust;
      Bytes Source = RandomBytes( std::min< std::uint64_t >( SourceClaim, 1 << 16 ) + 1, 5 );
      Bytes Target( std::min< std::uint64_t >( TargetClaim, 1 << 16 ) + 1, 0xCD );
      EXPECT_FALSE( Converter.Convert( Info( rCall.Width, rCall.Height, rCall.From ), Source.data(),
                                       std::min< std::uint64_t >( SourceClaim, Source.size() ), rCall.To, Target.data(),
                                       std::min< std::uint64_t >( TargetClaim, Target.size() ) ) )
          << rCall.Name;
      EXPECT_EQ( Target, Bytes( Target.size(), 0xCD ) ) << rCall.Name;
    }

    Bytes Frame( 12 );
    EXPECT_FALSE(
        Converter.Convert( Info( 2, 2, PixelFormat_R8G8B8 ), nullptr, 12, PixelFormat_B8G8R8, Frame.data(), 12 ) );
    EXPECT_FALSE(
        Converter.Convert( Info( 2, 2, PixelFormat_R8G8B8 ), Frame.data(), 12, PixelFormat_B8G8R8, nullptr, 12 ) );
  }

  TEST( Conversion, TenBitToRGBNeedsWholePairsAndSaysSo )
  {
    LumekTest::VLogCapture Log( "System" );
    EXPECT_TRUE( Converted( Bytes( CoreVideoUtils::FrameSizeInBytes( 3, 1, PixelFormat_U10Y10V10Y10 ), 0 ), 3, 1,
                            PixelFormat_U10Y10V10Y10, PixelFormat_R8G8B8 )
                     .empty() );
    ASSERT_EQ( Log.Messages.size(), 1u );
    EXPECT_NE( Log.Messages[0].find( "( ( i_Width * i_Height ) % 2 ) == 0" ), std::string::npos ) << Log.Messages[0];
    // Odd rows with an even pixel count are fine: the last pixel's V lies in the row padding.
    EXPECT_FALSE( Converted( Bytes( CoreVideoUtils::FrameSizeInBytes( 3, 2, PixelFormat_U10Y10V10Y10 ), 0 ), 3, 2,
                             PixelFormat_U10Y10V10Y10, PixelFormat_R8G8B8 )
                      .empty() );
  }

  // Targets reached by composition, packed Bayer among them, must equal the two steps done by hand.
  TEST( Conversion, CompositionsEqualTheirSteps )
  {
    const int W = 37, H = 7;
    const struct
    {
      EPixelFormat From, Via, To;
    } Steps[] = {
        { PixelFormat_BayerRG8, PixelFormat_R8G8B8, PixelFormat_U8Y8V8Y8 },
        { PixelFormat_BayerGR8, PixelFormat_R8G8B8, PixelFormat_PlanarR8G8B8 },
        { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8, PixelFormat_B8G8R8u8 },
        { PixelFormat_Luminance7, PixelFormat_Luminance8, PixelFormat_R8G8B8 },
        { PixelFormat_R5G6B5, PixelFormat_R8G8B8, PixelFormat_Y8U8Y8V8 },
        { PixelFormat_B8G8R8, PixelFormat_Luminance8, PixelFormat_Luminance6 },
        { PixelFormat_BayerGB7, PixelFormat_BayerGB8, PixelFormat_R8G8B8 },
        { PixelFormat_BayerGB6, PixelFormat_BayerGB8, PixelFormat_Luminance8 },
        { PixelFormat_BayerGB6, PixelFormat_BayerGB8, PixelFormat_PlanarY8U8V8 },
    };
    for( const auto& rStep : Steps )
    {
      const Bytes Source = RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, rStep.From ), rStep.To );
      const Bytes Via = Converted( Source, W, H, rStep.From, rStep.Via );
      ASSERT_FALSE( Via.empty() );
      EXPECT_EQ( Converted( Source, W, H, rStep.From, rStep.To ), Converted( Via, W, H, rStep.Via, rStep.To ) )
          << ToString( rStep.From ) << " to " << ToString( rStep.To );
    }

    // The one-call form is a converter with default settings.
    const Bytes Source = RandomBytes( 19 * 3, 3 );
    Bytes Target( 19 * 3 * 3 );
    ASSERT_TRUE( CoreVideoUtils::ConvertFrame( 19, 3, PixelFormat_BayerGR8, Source.data(), Source.size(),
                                               PixelFormat_R8G8B8, Target.data(), Target.size() ) );
    EXPECT_EQ( Target, Converted( Source, 19, 3, PixelFormat_BayerGR8, PixelFormat_R8G8B8 ) );
  }

  TEST( Conversion, LensDistortionIsNotSupportedAndSaysSoAtWarningLevel )
  {
    LumekTest::VLogCapture Log( "CoreVideoUtils" );
    CoreVideoUtils::VPixelFormatConverter Converter;
    Converter.SetLensDistortionCorrectionEnabled( false );
    EXPECT_TRUE( Log.Lines().empty() );
    Converter.SetLensDistortionCorrectionEnabled( true );
    Converter.SetLensDistortionCalibration( CoreLumekTypes::VCameraHardware(),
                                            CoreLumekTypes::VLensDistortionCalibration() );
    EXPECT_EQ( Log.Lines(),
               std::vector< std::string >( 2, "3 Lens distortion correction not supported in software converter." ) );
  }

  // Odd sizes fail with their log line, other formats silently; the output stays untouched.
  TEST( PlanarYUV420ToInterleaved, OddSizesAndOtherFormatsFail )
  {
    LumekTest::VLogCapture Log( "CoreVideoUtils" );
    const Bytes Y( 12, 1 ), U( 3, 2 ), V( 3, 3 );
    Bytes Output( 32, 0xCD );
    auto Pack = [&]( EPixelFormat i_Format, std::int32_t i_Width, std::int32_t i_Height ) {
      return PlanarYUV420ToInterleaved( Y.data(), U.data(), V.data(), Output.data(), i_Format, i_Width, i_Height, 6,
                                        3 );
    };
    EXPECT_FALSE( Pack( PixelFormat_U8Y8V8Y8, 3, 2 ) );
    EXPECT_FALSE( Pack( PixelFormat_Y8U8Y8V8, 4, 1 ) );
    EXPECT_EQ( Log.Lines(),
               ( std::vector< std::string >{
                   "2 Cannot convert image with dimensions 3 x 2. Both width and height must be even numbers.",
                   "2 Cannot convert image with dimensions 4 x 1. Both width and height must be even numbers." } ) );
    for( EPixelFormat F : { PixelFormat_R8G8B8, PixelFormat_PlanarY8U8V8, PixelFormat_U10Y10V10Y10 } )
      EXPECT_FALSE( Pack( F, 4, 2 ) );
    EXPECT_EQ( Log.Lines().size(), 2u );
    EXPECT_EQ( Output, Bytes( 32, 0xCD ) );
  }

  // Wide rows go 32 pixels at a time with a tail: every byte must still be where the pair rule
  // puts it, in both layouts, with padded strides.
  TEST( PlanarYUV420ToInterleaved, WideRowsFollowThePairRule )
  {
    const std::int32_t Width = 102, Height = 4, StrideY = 110, StrideUV = 60;
    const Bytes Y = RandomBytes( StrideY * Height, 1 ), U = RandomBytes( StrideUV * Height / 2, 2 ),
                V = RandomBytes( StrideUV * Height / 2, 3 );
    for( const EPixelFormat F : { PixelFormat_U8Y8V8Y8, PixelFormat_Y8U8Y8V8 } )
    {
      Bytes Output( Width * Height * 2 ), Expected( Width * Height * 2 );
      ASSERT_TRUE( PlanarYUV420ToInterleaved( Y.data(), U.data(), V.data(), Output.data(), F, Width, Height, StrideY,
                                              StrideUV ) );
      const int Luma = F == PixelFormat_Y8U8Y8V8 ? 0 : 1;
      for( std::int32_t y = 0; y < Height; ++y )
        for( std::int32_t x = 0; x < Width; ++x )
        {
          Expected[( y * Width + x ) * 2 + Luma] = Y[y * StrideY + x];
          Expected[( y * Width + x ) * 2 + 1 - Luma] = ( x % 2 == 0 ? U : V )[( y / 2 ) * StrideUV + x / 2];
        }
      EXPECT_EQ( Output, Expected ) << ToString( F );
    }
  }

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

  // The packed forms' second method: samples read and written one bit at a time. Runs start on a
  // byte and inside one; a lone sample ends before the first whole group of eight.
  TEST( PackedSamples, UnpackAndPackMatchTheBitByBitRule )
  {
    for( unsigned Bits : { 6u, 7u } )
      for( const auto& [First, Count] : { std::make_pair( 0, 33 ), std::make_pair( 5, 1 ), std::make_pair( 5, 1001 ) } )
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
