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
    const std::pair< int, int > Sizes[] = { { 1, 1 },  { 3, 3 },  { 17, 3 },  { 18, 5 },  { 19, 2 },
                                            { 33, 7 }, { 35, 1 }, { 101, 9 }, { 255, 4 }, { 1921, 3 } };
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

  // Every 8-bit chroma and luma combination through the YUV kernel: the vector form's split of
  // the 16.16 constants must floor exactly as the full products do.
  TEST( VectorForms, YUVKernelAgreesOnEveryValue )
  {
    Bytes Source;
    for( int U = 0; U < 256; ++U )
      for( int V = 0; V < 256; ++V )
        for( int Y : { 0, 1, 16, 77, 128, 200, 235, 254, 255 } )
          Source.insert( Source.end(), { static_cast< std::uint8_t >( U ), static_cast< std::uint8_t >( Y ),
                                         static_cast< std::uint8_t >( V ), static_cast< std::uint8_t >( 255 - Y ) } );
    const std::uint64_t Pixels = Source.size() / 2;
    Bytes Scalar( 3 * Pixels ), Vector( 3 * Pixels );
    CoreVideoUtils::Kernels::YUV422ToRGB( Source.data(), false, Pixels, Scalar.data(), EInstructionSet::Scalar );
    for( EInstructionSet Set : { EInstructionSet::SSE2, EInstructionSet::AVX2 } )
      if( CoreVideoUtils::IsSupported( Set ) )
      {
        CoreVideoUtils::Kernels::YUV422ToRGB( Source.data(), false, Pixels, Vector.data(), Set );
        EXPECT_EQ( Vector, Scalar ) << CoreVideoUtils::ToString( Set );
      }
  }

  TEST( VectorForms, ColourCorrectionAgreesForManySettings )
  {
    const Bytes Pixels = RandomBytes( 3 * 1001, 8 );
    for( float Gamma : { 1.0f, 0.45f, 2.2f } )
      for( float Saturation : { 0.0f, 0.5f, 1.0f, 1.8f, 3.0f } )
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
