// Which pairs of formats convert, what bad sizes do, and the conversions that are defined as
// compositions of others.

#include "ConversionTestSupport.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <climits>

namespace
{
  using namespace CoreVideoUtilsTest;
  using namespace ZOL;

  bool IsBayer( EPixelFormat F )
  {
    return ( F >= 2 && F <= 5 ) || F == 14 || F == 15;
  }

  // The pairs that answer true, from the rules: Bayer sources demosaic to 1, 7 to 12, 18 and
  // 19 and unpack or pack only between BayerGB8 and its packed forms; planar YUV goes only to
  // 9, 10 and 13; every other source reaches every non-Bayer target.
  bool IsConvertible( EPixelFormat S, EPixelFormat T )
  {
    if( S == T )
      return true;
    if( IsBayer( S ) )
    {
      if( IsBayer( T ) )
        return ( T == 3 && ( S == 14 || S == 15 ) ) || ( S == 3 && ( T == 14 || T == 15 ) );
      return T == 1 || ( T >= 7 && T <= 12 ) || T == 18 || T == 19;
    }
    if( S == PixelFormat_PlanarY8U8V8 )
      return T == 9 || T == 10 || T == 13;
    return !IsBayer( T );
  }

  // Every source to every target, so that the converter and the rules cannot disagree on any pair.
  TEST( Conversion, ConvertsExactlyTheDefinedPairs )
  {
    const int W = 50, H = 3; // more than one 10-bit group a row, and rows that do not end on a byte
    for( int Source = 1; Source < 20; ++Source )
      for( int Target = 1; Target < 20; ++Target )
      {
        const EPixelFormat S = static_cast< EPixelFormat >( Source ), T = static_cast< EPixelFormat >( Target );
        Bytes Converted;
        EXPECT_EQ(
            Convert( RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, S ), S * 100 + T ), W, H, S, T, Converted ),
            IsConvertible( S, T ) )
            << ToString( S ) << " to " << ToString( T );
      }
  }

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
    Bytes Target;
    EXPECT_FALSE( Convert( Bytes( CoreVideoUtils::FrameSizeInBytes( 3, 1, PixelFormat_U10Y10V10Y10 ), 0 ), 3, 1,
                           PixelFormat_U10Y10V10Y10, PixelFormat_R8G8B8, Target ) );
    ASSERT_EQ( Log.Messages.size(), 1u );
    EXPECT_NE( Log.Messages[0].find( "( ( i_Width * i_Height ) % 2 ) == 0" ), std::string::npos ) << Log.Messages[0];
    // Odd rows with an even pixel count are fine: the last pixel's V lies in the row padding.
    EXPECT_TRUE( Convert( Bytes( CoreVideoUtils::FrameSizeInBytes( 3, 2, PixelFormat_U10Y10V10Y10 ), 0 ), 3, 2,
                          PixelFormat_U10Y10V10Y10, PixelFormat_R8G8B8, Target ) );
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
      const Bytes Via = MustConvert( Source, W, H, rStep.From, rStep.Via );
      ASSERT_FALSE( Via.empty() );
      EXPECT_EQ( MustConvert( Source, W, H, rStep.From, rStep.To ), MustConvert( Via, W, H, rStep.Via, rStep.To ) )
          << ToString( rStep.From ) << " to " << ToString( rStep.To );
    }

    // The one-call form is a converter with default settings.
    const Bytes Source = RandomBytes( 19 * 3, 3 );
    Bytes Target( 19 * 3 * 3 );
    ASSERT_TRUE( CoreVideoUtils::ConvertFrame( 19, 3, PixelFormat_BayerGR8, Source.data(), Source.size(),
                                               PixelFormat_R8G8B8, Target.data(), Target.size() ) );
    EXPECT_EQ( Target, MustConvert( Source, 19, 3, PixelFormat_BayerGR8, PixelFormat_R8G8B8 ) );
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
} // namespace
