#include "ConversionTestSupport.h"
#include "graphics/CoreVideoUtils/DisplayConversion.h"

#include <gtest/gtest.h>

#include <cmath>

namespace
{
  using namespace CoreVideoUtilsTest;
  using namespace ZOL;
  using CoreVideoUtils::VColourCorrector;

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
