// The processor's conversions: tiny frames converted by hand (the YUV products with a calculator,
// checked against the floating-point constants to within one step), the vector forms against the
// scalar rule, the pairs that convert and what bad sizes do, compositions, 4:2:0 planes packed to
// 4:2:2, round trips that lose exactly the bits the narrower format cannot hold, and the colour
// corrector.

#include "graphics/CoreVideoUtils/DisplayConversion.h"
#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "graphics/CoreVideoUtils/PixelKernels.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <climits>
#include <cmath>
#include <cstdint>
#include <random>
#include <vector>

namespace
{
  using namespace ZOL;
  using CoreVideoUtils::EInstructionSet;
  using CoreVideoUtils::PlanarYUV420ToInterleaved;
  using CoreVideoUtils::VColourCorrector;
  using Bytes = std::vector< std::uint8_t >;

  Bytes RandomBytes( std::size_t i_Count, std::uint32_t i_Seed )
  {
    std::mt19937 Generator( i_Seed );
    Bytes Result( i_Count );
    for( auto& b : Result )
      b = static_cast< std::uint8_t >( Generator() );
    return Result;
  }

  // The instruction sets this processor runs, the scalar rule first.
  std::vector< EInstructionSet > SupportedSets()
  {
    std::vector< EInstructionSet > Sets;
    for( auto Set : { EInstructionSet::Scalar, EInstructionSet::SSE2, EInstructionSet::AVX2, EInstructionSet::AVX512 } )
      if( CoreVideoUtils::IsSupported( Set ) )
        Sets.push_back( Set );
    return Sets;
  }

  IVideoFrameInfo Info( std::int32_t i_Width, std::int32_t i_Height, EPixelFormat i_Format )
  {
    IVideoFrameInfo Result;
    Result.ImageWidth = i_Width;
    Result.ImageHeight = i_Height;
    Result.PixelFormat = i_Format;
    return Result;
  }

  // The frame converted by a fresh converter into a target that starts as 0xCD, or nothing when
  // the conversion fails.
  Bytes Converted( const Bytes& i_rSource, std::int32_t i_Width, std::int32_t i_Height, EPixelFormat i_From,
                   EPixelFormat i_To, EInstructionSet i_Set = CoreVideoUtils::BestInstructionSet(),
                   const IVideoSettings& i_rSettings = IVideoSettings() )
  {
    Bytes Target( CoreVideoUtils::FrameSizeInBytes( i_Width, i_Height, i_To ), 0xCD );
    CoreVideoUtils::VPixelFormatConverter Converter;
    Converter.SetInstructionSet( i_Set );
    Converter.SetVideoSettings( i_rSettings );
    return Converter.Convert( Info( i_Width, i_Height, i_From ), i_rSource.data(), i_rSource.size(), i_To,
                              Target.data(), Target.size() )
               ? Target
               : Bytes();
  }

  struct VHandCase
  {
    const char* Name;
    std::int32_t Width, Height;
    EPixelFormat From;
    Bytes Source;
    EPixelFormat To;
    Bytes Expected;
  };

  Bytes SwapRedBlue( Bytes i_RGB )
  {
    for( std::size_t i = 0; i + 2 < i_RGB.size(); i += 3 )
      std::swap( i_RGB[i], i_RGB[i + 2] );
    return i_RGB;
  }

  // 10 20 30 / 40 50 60 / 70 80 90, demosaiced with neighbours outside read as 0.
  const Bytes s_Mosaic = { 10, 20, 30, 40, 50, 60, 70, 80, 90 };
  const Bytes s_FromRG = { 10, 15, 12, 20, 20, 25, 30, 20, 12, 40, 40, 25, 50, 50,
                           50, 60, 60, 25, 70, 30, 12, 80, 80, 25, 90, 35, 12 };
  const Bytes s_FromGB = { 20, 10, 10, 25, 22, 20, 30, 30, 10, 40, 32, 25, 50, 50,
                           50, 60, 42, 25, 20, 70, 40, 25, 52, 80, 30, 90, 40 };

  // One 10-bit row of two pixels: U 360, Y 324, V 960, Y 580, padded to 48 pixels.
  // Little-endian words: 0x3C051168 = V << 20 | Y << 10 | U, then Y alone.
  const Bytes s_TenBitRow = []
  {
    Bytes Row = { 0x68, 0x11, 0x05, 0x3C, 0x44, 0x02 };
    Row.resize( 128 );
    return Row;
  }();

  // clang-format off
  const VHandCase s_HandCases[] = {
      { "Luminance8_to_R8G8B8", 2, 1, PixelFormat_Luminance8, { 10, 200 }, PixelFormat_R8G8B8,
        { 10, 10, 10, 200, 200, 200 } },
      { "Luminance8_to_PlanarR8G8B8", 2, 1, PixelFormat_Luminance8, { 7, 9 }, PixelFormat_PlanarR8G8B8,
        { 7, 9, 7, 9, 7, 9 } },
      { "BayerRG8_to_R8G8B8", 3, 3, PixelFormat_BayerRG8, s_Mosaic, PixelFormat_R8G8B8, s_FromRG },
      { "BayerBG8_to_R8G8B8", 3, 3, PixelFormat_BayerBG8, s_Mosaic, PixelFormat_R8G8B8, SwapRedBlue( s_FromRG ) },
      { "BayerGB8_to_R8G8B8", 3, 3, PixelFormat_BayerGB8, s_Mosaic, PixelFormat_R8G8B8, s_FromGB },
      { "BayerGR8_to_R8G8B8", 3, 3, PixelFormat_BayerGR8, s_Mosaic, PixelFormat_R8G8B8, SwapRedBlue( s_FromGB ) },
      { "BayerRG8_to_B8G8R8", 3, 3, PixelFormat_BayerRG8, s_Mosaic, PixelFormat_B8G8R8, SwapRedBlue( s_FromRG ) },
      // (10 + 5 + 0) / 3, (20 + 20 + 0) / 3, (30 + 5 + 0) / 3: one row, so nothing above or below.
      { "BayerRG8_to_Luminance8", 3, 1, PixelFormat_BayerRG8, { 10, 20, 30 }, PixelFormat_Luminance8, { 5, 13, 11 } },
      { "BayerGB6_to_BayerGB8", 4, 1, PixelFormat_BayerGB6, { 0x04, 0x20, 0xC4 }, PixelFormat_BayerGB8,
        { 4, 8, 12, 16 } },
      // 21 bits of samples; the last 3 bits keep the target's 0xCD.
      { "BayerGB8_to_BayerGB7", 3, 1, PixelFormat_BayerGB8, { 0xFF, 0x01, 0xAB }, PixelFormat_BayerGB7,
        { 0xFE, 0x02, 0xAD } },
      { "R5G6B5_to_R8G8B8", 2, 1, PixelFormat_R5G6B5, { 0x1F, 0xF8, 0xE0, 0x07 }, PixelFormat_R8G8B8,
        { 248, 0, 248, 0, 252, 0 } },
      // Magenta: green 0, blue 31, red 31: (0 + 62 + 62) x 4 / 3 = 165; green alone: 63 x 4 / 3 = 84.
      { "R5G6B5_to_Luminance8", 2, 1, PixelFormat_R5G6B5, { 0x1F, 0xF8, 0xE0, 0x07 }, PixelFormat_Luminance8,
        { 165, 84 } },
      { "R8G8B8_to_R5G6B5", 2, 1, PixelFormat_R8G8B8, { 255, 255, 255, 0x12, 0x34, 0x56 }, PixelFormat_R5G6B5,
        { 0xFF, 0xFF, 0xAA, 0x11 } },
      { "R8G8B8_to_Luminance8", 1, 1, PixelFormat_R8G8B8, { 10, 20, 31 }, PixelFormat_Luminance8, { 20 } },
      { "B8G8R8_to_R8G8B8", 1, 1, PixelFormat_B8G8R8, { 3, 2, 1 }, PixelFormat_R8G8B8, { 1, 2, 3 } },
      { "R8G8B8u8_to_R8G8B8", 1, 1, PixelFormat_R8G8B8u8, { 1, 2, 3, 99 }, PixelFormat_R8G8B8, { 1, 2, 3 } },
      { "B8G8R8u8_to_R8G8B8", 1, 1, PixelFormat_B8G8R8u8, { 3, 2, 1, 99 }, PixelFormat_R8G8B8, { 1, 2, 3 } },
      // Red then green: U from the red pixel, V from the green one, no averaging.
      { "R8G8B8_to_U8Y8V8Y8", 2, 1, PixelFormat_R8G8B8, { 255, 0, 0, 0, 255, 0 }, PixelFormat_U8Y8V8Y8,
        { 90, 76, 0, 149 } },
      { "R8G8B8_to_Y8U8Y8V8", 2, 1, PixelFormat_R8G8B8, { 0, 0, 255, 255, 255, 255 }, PixelFormat_Y8U8Y8V8,
        { 29, 239, 254, 128 } },
      { "R8G8B8_to_PlanarY8U8V8", 2, 1, PixelFormat_R8G8B8, { 255, 0, 0, 0, 255, 0 }, PixelFormat_PlanarY8U8V8,
        { 76, 149, 90, 0 } },
      { "U8Y8V8Y8_to_R8G8B8", 4, 1, PixelFormat_U8Y8V8Y8, { 90, 81, 240, 145, 54, 145, 34, 210 }, PixelFormat_R8G8B8,
        { 238, 14, 13, 255, 78, 77, 13, 237, 14, 78, 255, 79 } },
      { "Y8U8Y8V8_to_R8G8B8", 2, 1, PixelFormat_Y8U8Y8V8, { 81, 90, 145, 240 }, PixelFormat_R8G8B8,
        { 238, 14, 13, 255, 78, 77 } },
      { "U8Y8V8Y8_greys_to_R8G8B8", 2, 1, PixelFormat_U8Y8V8Y8, { 128, 16, 128, 235 }, PixelFormat_R8G8B8,
        { 16, 16, 16, 235, 235, 235 } },
      { "U8Y8V8Y8_to_Luminance8", 2, 1, PixelFormat_U8Y8V8Y8, { 90, 81, 240, 145 }, PixelFormat_Luminance8,
        { 81, 145 } },
      { "U8Y8V8Y8_to_U10Y10V10Y10", 2, 1, PixelFormat_U8Y8V8Y8, { 90, 81, 240, 145 }, PixelFormat_U10Y10V10Y10,
        s_TenBitRow },
      { "U10Y10V10Y10_to_R8G8B8", 2, 1, PixelFormat_U10Y10V10Y10, s_TenBitRow, PixelFormat_R8G8B8,
        { 238, 14, 13, 255, 78, 77 } },
      { "U10Y10V10Y10_to_Luminance8", 2, 1, PixelFormat_U10Y10V10Y10, s_TenBitRow, PixelFormat_Luminance8,
        { 81, 145 } },
      { "Luminance7_to_Luminance8", 8, 1, PixelFormat_Luminance7, { 0x02, 0x08, 0x18, 0x40, 0xA1, 0x83, 0x88 },
        PixelFormat_Luminance8, { 2, 4, 6, 8, 10, 12, 14, 16 } },
      { "Luminance6_to_R8G8B8", 4, 1, PixelFormat_Luminance6, { 0x04, 0x20, 0xC4 }, PixelFormat_R8G8B8,
        { 4, 4, 4, 8, 8, 8, 12, 12, 12, 16, 16, 16 } },
      { "PlanarY8U8V8_to_R8G8B8u8", 2, 1, PixelFormat_PlanarY8U8V8, { 81, 145, 90, 240 }, PixelFormat_R8G8B8u8,
        { 238, 14, 13, 255, 255, 78, 77, 255 } },
      { "PlanarR8G8B8_to_R8G8B8", 2, 1, PixelFormat_PlanarR8G8B8, { 1, 2, 3, 4, 5, 6 }, PixelFormat_R8G8B8,
        { 1, 3, 5, 2, 4, 6 } },
      { "PlanarR8G8B8_to_Luminance8", 2, 1, PixelFormat_PlanarR8G8B8, { 10, 255, 20, 255, 31, 254 },
        PixelFormat_Luminance8, { 20, 254 } },
  };
  // clang-format on

  TEST( HandComputedPixels, EveryInstructionSetGivesTheHandComputedBytes )
  {
    for( const VHandCase& rCase : s_HandCases )
      for( const EInstructionSet Set : SupportedSets() )
        EXPECT_EQ( Converted( rCase.Source, rCase.Width, rCase.Height, rCase.From, rCase.To, Set ), rCase.Expected )
            << rCase.Name << " " << CoreVideoUtils::ToString( Set );
  }

  TEST( VectorForms, EqualTheScalarRule )
  {
    const std::pair< EPixelFormat, EPixelFormat > Pairs[] = {
        { PixelFormat_BayerRG8, PixelFormat_R8G8B8 },       { PixelFormat_BayerGB8, PixelFormat_R8G8B8 },
        { PixelFormat_BayerGR8, PixelFormat_B8G8R8 },       { PixelFormat_BayerBG8, PixelFormat_R8G8B8u8 },
        { PixelFormat_BayerGB7, PixelFormat_B8G8R8u8 },     { PixelFormat_BayerGB6, PixelFormat_Luminance8 },
        { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8 },       { PixelFormat_Y8U8Y8V8, PixelFormat_R8G8B8 },
        { PixelFormat_PlanarY8U8V8, PixelFormat_R8G8B8u8 }, { PixelFormat_PlanarR8G8B8, PixelFormat_Luminance8 },
        { PixelFormat_R5G6B5, PixelFormat_Luminance8 },
    };
    // Sizes that leave every kind of remainder of the vector widths.
    const std::pair< int, int > Sizes[] = { { 1, 1 }, { 19, 2 }, { 101, 9 }, { 1921, 3 } };
    // Gamma and saturation on, so that Bayer targets also run the colour correction's vector form.
    IVideoSettings Settings;
    Settings.GammaCorrection = 1.7f;
    Settings.Saturation = 0.6f;
    for( const auto& [From, To] : Pairs )
      for( const auto& [W, H] : Sizes )
      {
        const Bytes Source = RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, From ), W * 31 + H );
        const Bytes Scalar = Converted( Source, W, H, From, To, EInstructionSet::Scalar, Settings );
        ASSERT_FALSE( Scalar.empty() );
        for( const EInstructionSet Set : SupportedSets() )
          ASSERT_EQ( Converted( Source, W, H, From, To, Set, Settings ), Scalar )
              << CoreVideoUtils::ToString( Set ) << " " << ToString( From ) << " to " << ToString( To ) << " " << W
              << "x" << H;
      }
  }

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
    Converter.SetLensDistortionCalibration( {}, {} );
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

  // The packed forms' second method: samples read and written one bit at a time. Runs start on a
  // byte and inside one; a lone sample ends before the first whole group of eight.
  TEST( PackedSamples, UnpackAndPackMatchTheBitByBitRule )
  {
    auto BitAt = []( const Bytes& i_rStream, std::uint64_t i ) { return ( i_rStream[i / 8] >> ( 7 - i % 8 ) ) & 1u; };
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

  TEST( ColourCorrector, GivesTheHandComputedBytesToTheRGBFamilyOnly )
  {
    const struct
    {
      const char* Name;
      float Saturation, Gamma;
      EPixelFormat Format;
      Bytes Before, After;
    } Cases[] = {
        // The mean of 30, 60, 90 is 60; saturation 0 is all grey, 2 doubles the distance from grey.
        { "SaturationZeroIsGrey", 0.0f, 1.0f, PixelFormat_R8G8B8, { 30, 60, 90 }, { 60, 60, 60 } },
        { "SaturationHalf", 0.5f, 1.0f, PixelFormat_R8G8B8, { 30, 60, 90 }, { 45, 60, 75 } },
        { "SaturationTwoClampsAtZero", 2.0f, 1.0f, PixelFormat_B8G8R8, { 30, 60, 90 }, { 0, 60, 120 } },
        { "SaturationTwoClampsAt255", 2.0f, 1.0f, PixelFormat_R8G8B8, { 250, 100, 100 }, { 255, 50, 50 } },
        { "SaturationBelowZeroStopsAtGrey", -3.0f, 1.0f, PixelFormat_R8G8B8, { 30, 60, 90 }, { 60, 60, 60 } },
        // Gamma first, then saturation: 64, 128, 255 square to 16, 64, 254; their mean is 111.33.
        { "GammaBeforeSaturation", 0.0f, 0.5f, PixelFormat_R8G8B8, { 64, 128, 255 }, { 111, 111, 111 } },
        { "FourthByteUntouched", 0.0f, 0.5f, PixelFormat_R8G8B8u8, { 64, 128, 255, 7 }, { 111, 111, 111, 7 } },
        { "GammaAloneOnFourBytePixels", 1.0f, 0.5f, PixelFormat_B8G8R8u8, { 16, 32, 255, 9 }, { 1, 4, 254, 9 } },
        // Back to gamma 1 the table is kept but not applied.
        { "Identity", 1.0f, 1.0f, PixelFormat_R8G8B8, { 64, 128, 255 }, { 64, 128, 255 } },
    };
    VColourCorrector Corrector;
    for( const auto& rCase : Cases )
    {
      Corrector.Set( { rCase.Saturation, rCase.Gamma } );
      Bytes Data = rCase.Before;
      const unsigned Step = rCase.Format >= PixelFormat_R8G8B8u8 ? 4 : 3;
      ASSERT_TRUE( Corrector.Apply( static_cast< std::int32_t >( Data.size() / Step ), 1, rCase.Format, Data.data() ) );
      EXPECT_EQ( Data, rCase.After ) << rCase.Name;
    }
    EXPECT_TRUE( Corrector.IsIdentity() );

    // Gamma 2 is a square root: entry i is 16 sqrt(i), which is never within float error of a
    // whole number unless it is one.
    Corrector.Set( { 0.0f, 2.0f } );
    for( int i = 0; i < 256; ++i )
      ASSERT_EQ( Corrector.GetTable()[i], std::min( 255, static_cast< int >( std::floor( 16.0 * std::sqrt( i ) ) ) ) )
          << i;
    Bytes Data( 8, 40 );
    for( int F = 0; F < 22; ++F )
      EXPECT_EQ( Corrector.Apply( 2, 1, static_cast< EPixelFormat >( F ), Data.data() ), F >= 7 && F <= 10 ) << F;
  }

  // After a conversion from the Bayer family into R8G8B8 to B8G8R8u8 the corrector runs once;
  // other targets and other sources are left as converted. The display conversion does the same.
  TEST( ColourCorrector, ConversionsCorrectBayerFramesIntoRGBTargetsOnly )
  {
    const int W = 21, H = 5;
    const IVideoSettings Display = { 0.4f, 1.8f };
    VColourCorrector Corrector;
    Corrector.Set( Display );
    const struct
    {
      EPixelFormat From, To;
      bool bCorrected;
    } Cases[] = {
        { PixelFormat_BayerRG8, PixelFormat_B8G8R8u8, true },    { PixelFormat_BayerGB7, PixelFormat_R8G8B8u8, true },
        { PixelFormat_BayerBG8, PixelFormat_Luminance8, false }, { PixelFormat_BayerGB8, PixelFormat_BayerGB6, false },
        { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8, false },
    };
    for( const auto& rCase : Cases )
    {
      const Bytes Source = RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, rCase.From ), rCase.To );
      Bytes Plain = Converted( Source, W, H, rCase.From, rCase.To );
      const Bytes Displayed =
          Converted( Source, W, H, rCase.From, rCase.To, CoreVideoUtils::BestInstructionSet(), Display );
      ASSERT_FALSE( Plain.empty() || Displayed.empty() );
      ASSERT_TRUE( !rCase.bCorrected || Corrector.Apply( W, H, rCase.To, Plain.data() ) );
      EXPECT_EQ( Displayed, Plain ) << ToString( rCase.From ) << " to " << ToString( rCase.To );
      if( rCase.To != PixelFormat_R8G8B8u8 )
        continue;
      std::vector< std::uint8_t > Shown;
      ASSERT_TRUE( CoreVideoUtils::ConvertToDisplayRGB( Info( W, H, rCase.From ), Source.data(), Source.size(), Display,
                                                        Shown ) );
      EXPECT_EQ( Shown, Converted( Displayed, W, H, PixelFormat_R8G8B8u8, PixelFormat_R8G8B8 ) );
    }
    // The display conversion passes RGB untouched, and refuses a frame its source can't hold.
    const Bytes RGB = RandomBytes( W * H * 3, 2 );
    std::vector< std::uint8_t > Shown;
    ASSERT_TRUE( CoreVideoUtils::ConvertToDisplayRGB( Info( W, H, PixelFormat_R8G8B8 ), RGB.data(), RGB.size(), Display,
                                                      Shown ) );
    EXPECT_EQ( Shown, RGB );
    EXPECT_FALSE( CoreVideoUtils::ConvertToDisplayRGB( Info( 100000, 100000, PixelFormat_R8G8B8 ), RGB.data(),
                                                       RGB.size(), Display, Shown ) );
  }

  TEST( VectorForms, ColourCorrectionAgreesForManySettings )
  {
    const Bytes Pixels = RandomBytes( 3 * 1001, 8 );
    for( float Gamma : { 1.0f, 2.2f } )
      for( float Saturation : { 0.0f, 1.0f, 1.8f } )
        for( unsigned Step : { 3u, 4u } )
        {
          CoreVideoUtils::VColourCorrector Corrector;
          Corrector.Set( { Saturation, Gamma } );
          const std::uint64_t Count = Pixels.size() / Step;
          Bytes Scalar = Pixels;
          Corrector.ApplyToRun( Scalar.data(), Count, Step, EInstructionSet::Scalar );
          for( const EInstructionSet Set : SupportedSets() )
          {
            Bytes Vector = Pixels;
            Corrector.ApplyToRun( Vector.data(), Count, Step, Set );
            ASSERT_EQ( Vector, Scalar ) << CoreVideoUtils::ToString( Set ) << " gamma " << Gamma << " saturation "
                                        << Saturation << " step " << Step;
          }
        }
  }
} // namespace
