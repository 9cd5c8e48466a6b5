// Which pairs of formats convert, what bad sizes do, and the conversions that are defined as
// compositions of others.

#include "ConversionTestSupport.h"
#include "tests/support/TestNames.h"

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

  // One row a source format: every target is tried from it, so that the converter and the table
  // of convertible pairs cannot disagree on any pair.
  class FormatPairs : public ::testing::TestWithParam< int >
  {
  };

  TEST_P( FormatPairs, ConvertExactlyTheDefinedPairs )
  {
    const EPixelFormat S = static_cast< EPixelFormat >( GetParam() );
    const int W = 50, H = 3; // more than one 10-bit group a row, and rows that do not end on a byte
    for( int Target = 1; Target < 20; ++Target )
    {
      const EPixelFormat T = static_cast< EPixelFormat >( Target );
      SCOPED_TRACE( std::string( "to " ) + ToString( T ) );
      const Bytes Source = RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, S ), S * 100 + T );
      Bytes Converted;
      EXPECT_EQ( Convert( Source, W, H, S, T, Converted ), IsConvertible( S, T ) );
    }
  }

  INSTANTIATE_TEST_SUITE_P( All, FormatPairs, ::testing::Range( 1, 20 ),
                            []( const ::testing::TestParamInfo< int >& i_rInfo )
                            { return std::string( ToString( static_cast< EPixelFormat >( i_rInfo.param ) ) ); } );

  struct VBadCall
  {
    const char* Name;
    std::int32_t Width, Height;
    EPixelFormat From, To;
    std::int64_t SourceAdjust, TargetAdjust; // bytes added to the exact frame sizes
  };

  std::ostream& operator<<( std::ostream& o, const VBadCall& i_rCall )
  {
    return o << i_rCall.Name;
  }

  class MalformedCalls : public ::testing::TestWithParam< VBadCall >
  {
  };

  TEST_P( MalformedCalls, FailWithoutTouchingTheTarget )
  {
    const VBadCall& rCall = GetParam();
    const std::uint64_t SourceBytes = CoreVideoUtils::FrameSizeInBytes( rCall.Width, rCall.Height, rCall.From );
    const std::uint64_t TargetBytes = CoreVideoUtils::FrameSizeInBytes( rCall.Width, rCall.Height, rCall.To );
    // Huge descriptions get small real buffers: the sizes passed are what the caller claims.
    const std::uint64_t SourceClaim = SourceBytes + rCall.SourceAdjust;
    const std::uint64_t TargetClaim = TargetBytes + rCall.TargetAdjust;
    Bytes Source = RandomBytes( std::min< std::uint64_t >( SourceClaim, 1 << 16 ) + 1, 5 );
    Bytes Target( std::min< std::uint64_t >( TargetClaim, 1 << 16 ) + 1, 0xCD );
    CoreVideoUtils::VPixelFormatConverter Converter;
    EXPECT_FALSE( Converter.Convert( Info( rCall.Width, rCall.Height, rCall.From ), Source.data(),
                                     std::min< std::uint64_t >( SourceClaim, Source.size() ), rCall.To, Target.data(),
                                     std::min< std::uint64_t >( TargetClaim, Target.size() ) ) );
    EXPECT_EQ( Target, Bytes( Target.size(), 0xCD ) );
  }

  const VBadCall s_BadCalls[] = {
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

  INSTANTIATE_TEST_SUITE_P( Sizes, MalformedCalls, ::testing::ValuesIn( s_BadCalls ), LumekTest::VCaseName() );

  TEST( Conversion, NullBuffersFail )
  {
    Bytes Frame( 12 );
    CoreVideoUtils::VPixelFormatConverter Converter;
    EXPECT_FALSE(
        Converter.Convert( Info( 2, 2, PixelFormat_R8G8B8 ), nullptr, 12, PixelFormat_B8G8R8, Frame.data(), 12 ) );
    EXPECT_FALSE(
        Converter.Convert( Info( 2, 2, PixelFormat_R8G8B8 ), Frame.data(), 12, PixelFormat_B8G8R8, nullptr, 12 ) );
  }

  TEST( Conversion, TenBitToRGBNeedsWholePairsAndSaysSo )
  {
    VLogCapture Log( "System" );
    const Bytes Source( CoreVideoUtils::FrameSizeInBytes( 3, 1, PixelFormat_U10Y10V10Y10 ), 0 );
    Bytes Target;
    EXPECT_FALSE( Convert( Source, 3, 1, PixelFormat_U10Y10V10Y10, PixelFormat_R8G8B8, Target ) );
    ASSERT_EQ( Log.Lines().size(), 1u );
    EXPECT_NE( Log.Lines()[0].find( "( ( i_Width * i_Height ) % 2 ) == 0" ), std::string::npos ) << Log.Lines()[0];
    // Odd rows with an even pixel count are fine: the last pixel's V lies in the row padding.
    EXPECT_TRUE( Convert( Bytes( CoreVideoUtils::FrameSizeInBytes( 3, 2, PixelFormat_U10Y10V10Y10 ), 0 ), 3, 2,
                          PixelFormat_U10Y10V10Y10, PixelFormat_R8G8B8, Target ) );
  }

  TEST( Conversion, PackedBayerEqualsUnpackingThenConverting )
  {
    const int W = 37, H = 7;
    for( EPixelFormat Packed : { PixelFormat_BayerGB7, PixelFormat_BayerGB6 } )
    {
      const Bytes Source = RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, Packed ), Packed );
      const Bytes Unpacked = MustConvert( Source, W, H, Packed, PixelFormat_BayerGB8 );
      ASSERT_FALSE( Unpacked.empty() );
      for( EPixelFormat Target : { PixelFormat_R8G8B8, PixelFormat_Luminance8, PixelFormat_PlanarY8U8V8 } )
        EXPECT_EQ( MustConvert( Source, W, H, Packed, Target ),
                   MustConvert( Unpacked, W, H, PixelFormat_BayerGB8, Target ) )
            << ToString( Packed ) << " to " << ToString( Target );
    }
  }

  // Targets reached by composition must equal the two steps done by hand.
  TEST( Conversion, CompositionsEqualTheirSteps )
  {
    const int W = 31, H = 5;
    struct VStep
    {
      EPixelFormat From, Via, To;
    };
    const VStep Steps[] = {
        { PixelFormat_BayerRG8, PixelFormat_R8G8B8, PixelFormat_U8Y8V8Y8 },
        { PixelFormat_BayerBG8, PixelFormat_R8G8B8, PixelFormat_R8G8B8u8 },
        { PixelFormat_BayerGR8, PixelFormat_R8G8B8, PixelFormat_PlanarR8G8B8 },
        { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8, PixelFormat_B8G8R8u8 },
        { PixelFormat_Luminance7, PixelFormat_Luminance8, PixelFormat_R8G8B8 },
        { PixelFormat_R5G6B5, PixelFormat_R8G8B8, PixelFormat_Y8U8Y8V8 },
        { PixelFormat_PlanarR8G8B8, PixelFormat_R8G8B8, PixelFormat_R5G6B5 },
        { PixelFormat_B8G8R8, PixelFormat_Luminance8, PixelFormat_Luminance6 },
    };
    for( const VStep& rStep : Steps )
    {
      const Bytes Source = RandomBytes( CoreVideoUtils::FrameSizeInBytes( W, H, rStep.From ), rStep.To );
      const Bytes Via = MustConvert( Source, W, H, rStep.From, rStep.Via );
      ASSERT_FALSE( Via.empty() );
      EXPECT_EQ( MustConvert( Source, W, H, rStep.From, rStep.To ), MustConvert( Via, W, H, rStep.Via, rStep.To ) )
          << ToString( rStep.From ) << " to " << ToString( rStep.To );
    }
  }

  TEST( Conversion, LensDistortionIsNotSupportedAndSaysSoAtWarningLevel )
  {
    VLogCapture Log( "CoreVideoUtils" );
    CoreVideoUtils::VPixelFormatConverter Converter;
    Converter.SetLensDistortionCorrectionEnabled( false );
    EXPECT_TRUE( Log.Lines().empty() );
    Converter.SetLensDistortionCorrectionEnabled( true );
    Converter.SetLensDistortionCalibration( CoreLumekTypes::VCameraHardware(),
                                            CoreLumekTypes::VLensDistortionCalibration() );
    const std::string Line = "3 Lens distortion correction not supported in software converter.";
    EXPECT_EQ( Log.Lines(), std::vector< std::string >( 2, Line ) );
  }

  TEST( Conversion, ConvertFrameEqualsAConverterWithDefaultSettings )
  {
    const Bytes Source = RandomBytes( 19 * 3, 3 );
    Bytes Target( 19 * 3 * 3 );
    ASSERT_TRUE( CoreVideoUtils::ConvertFrame( 19, 3, PixelFormat_BayerGR8, Source.data(), Source.size(),
                                               PixelFormat_R8G8B8, Target.data(), Target.size() ) );
    EXPECT_EQ( Target, MustConvert( Source, 19, 3, PixelFormat_BayerGR8, PixelFormat_R8G8B8 ) );
  }
} // namespace
