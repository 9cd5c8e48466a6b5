// The vector forms give the scalar rule's bytes: whole frames of random content, at sizes that
// leave every kind of remainder, compared byte for byte.

#include "ConversionTestSupport.h"
#include "graphics/CoreVideoUtils/PixelKernels.h"

#include <gtest/gtest.h>

namespace
{
  using namespace CoreVideoUtilsTest;
  using namespace ZOL;

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
        Bytes Scalar, Vector;
        ASSERT_TRUE( Convert( Source, W, H, From, To, Scalar, EInstructionSet::Scalar, Settings ) );
        for( const EInstructionSet Set : SupportedSets() )
        {
          ASSERT_TRUE( Convert( Source, W, H, From, To, Vector, Set, Settings ) );
          ASSERT_EQ( Vector, Scalar ) << CoreVideoUtils::ToString( Set ) << " " << ToString( From ) << " to "
                                      << ToString( To ) << " " << W << "x" << H;
        }
      }
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
