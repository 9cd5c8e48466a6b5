#include "ConversionTestSupport.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

namespace
{
  using namespace CoreVideoUtilsTest;
  using namespace ZOL;
  using CoreVideoUtils::PlanarYUV420ToInterleaved;

  // A 4 x 2 picture in planes with strides wider than the rows; the padding (0xEE) must never
  // show. Y 1..8, U 11 12, V 21 22: both rows share the one chroma row.
  const Bytes s_Y = { 1, 2, 3, 4, 0xEE, 0xEE, 5, 6, 7, 8, 0xEE, 0xEE };
  const Bytes s_U = { 11, 12, 0xEE };
  const Bytes s_V = { 21, 22, 0xEE };

  TEST( PlanarYUV420ToInterleaved, PacksEachLayoutWithSharedChromaRows )
  {
    Bytes Output( 16, 0 );
    ASSERT_TRUE( PlanarYUV420ToInterleaved( s_Y.data(), s_U.data(), s_V.data(), Output.data(), PixelFormat_U8Y8V8Y8, 4,
                                            2, 6, 3 ) );
    EXPECT_EQ( Output, ( Bytes{ 11, 1, 21, 2, 12, 3, 22, 4, 11, 5, 21, 6, 12, 7, 22, 8 } ) );
    ASSERT_TRUE( PlanarYUV420ToInterleaved( s_Y.data(), s_U.data(), s_V.data(), Output.data(), PixelFormat_Y8U8Y8V8, 4,
                                            2, 6, 3 ) );
    EXPECT_EQ( Output, ( Bytes{ 1, 11, 2, 21, 3, 12, 4, 22, 5, 11, 6, 21, 7, 12, 8, 22 } ) );
  }

  // Odd sizes fail with their log line, other formats silently; the output stays untouched.
  TEST( PlanarYUV420ToInterleaved, OddSizesAndOtherFormatsFail )
  {
    LumekTest::VLogCapture Log( "CoreVideoUtils" );
    Bytes Output( 32, 0xCD );
    EXPECT_FALSE( PlanarYUV420ToInterleaved( s_Y.data(), s_U.data(), s_V.data(), Output.data(), PixelFormat_U8Y8V8Y8, 3,
                                             2, 6, 3 ) );
    EXPECT_FALSE( PlanarYUV420ToInterleaved( s_Y.data(), s_U.data(), s_V.data(), Output.data(), PixelFormat_Y8U8Y8V8, 4,
                                             1, 6, 3 ) );
    EXPECT_EQ( Log.Lines(),
               ( std::vector< std::string >{
                   "2 Cannot convert image with dimensions 3 x 2. Both width and height must be even numbers.",
                   "2 Cannot convert image with dimensions 4 x 1. Both width and height must be even numbers." } ) );
    for( EPixelFormat F : { PixelFormat_R8G8B8, PixelFormat_PlanarY8U8V8, PixelFormat_U10Y10V10Y10 } )
      EXPECT_FALSE( PlanarYUV420ToInterleaved( s_Y.data(), s_U.data(), s_V.data(), Output.data(), F, 4, 2, 6, 3 ) );
    EXPECT_EQ( Log.Lines().size(), 2u );
    EXPECT_EQ( Output, Bytes( 32, 0xCD ) );
  }

  // Wide rows go 32 pixels at a time with a tail: every byte must still be where the pair rule
  // puts it, in both layouts, with padded strides.
  TEST( PlanarYUV420ToInterleaved, WideRowsFollowThePairRule )
  {
    const std::int32_t Width = 102, Height = 4, StrideY = 110, StrideUV = 60;
    Bytes Y( StrideY * Height ), U( StrideUV * Height / 2 ), V( StrideUV * Height / 2 );
    for( std::size_t i = 0; i < Y.size(); ++i )
      Y[i] = static_cast< std::uint8_t >( i * 7 + 1 );
    for( std::size_t i = 0; i < U.size(); ++i )
      U[i] = static_cast< std::uint8_t >( i * 11 + 3 ), V[i] = static_cast< std::uint8_t >( i * 13 + 5 );
    for( const EPixelFormat F : { PixelFormat_U8Y8V8Y8, PixelFormat_Y8U8Y8V8 } )
    {
      Bytes Output( Width * Height * 2 );
      ASSERT_TRUE( PlanarYUV420ToInterleaved( Y.data(), U.data(), V.data(), Output.data(), F, Width, Height, StrideY,
                                              StrideUV ) );
      const bool bLumaFirst = F == PixelFormat_Y8U8Y8V8;
      for( std::int32_t y = 0; y < Height; ++y )
        for( std::int32_t x = 0; x < Width; ++x )
        {
          const std::uint8_t* p = Output.data() + ( y * Width + x ) * 2;
          ASSERT_EQ( p[bLumaFirst ? 0 : 1], Y[y * StrideY + x] ) << "x " << x << " y " << y;
          ASSERT_EQ( p[bLumaFirst ? 1 : 0], ( x % 2 == 0 ? U : V )[( y / 2 ) * StrideUV + x / 2] )
              << "x " << x << " y " << y;
        }
    }
  }
} // namespace
