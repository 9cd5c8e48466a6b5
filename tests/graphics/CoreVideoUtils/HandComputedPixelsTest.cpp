// Tiny frames whose converted pixels were worked out by hand (or, for the YUV products, with a
// calculator and checked against the floating-point constants to within one step), and the
// vector forms held to the scalar rule's bytes on whole frames of random content.

#include "ConversionTestSupport.h"

#include <gtest/gtest.h>

namespace
{
  using namespace CoreVideoUtilsTest;
  using namespace ZOL;

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
  Bytes TenBitRow()
  {
    Bytes Row = { 0x68, 0x11, 0x05, 0x3C, 0x44, 0x02 };
    Row.resize( 128 );
    return Row;
  }

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
        TenBitRow() },
      { "U10Y10V10Y10_to_R8G8B8", 2, 1, PixelFormat_U10Y10V10Y10, TenBitRow(), PixelFormat_R8G8B8,
        { 238, 14, 13, 255, 78, 77 } },
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
    ZOL::IVideoSettings Settings;
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

} // namespace
