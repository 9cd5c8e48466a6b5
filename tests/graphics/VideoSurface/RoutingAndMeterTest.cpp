#include "graphics/VideoSurface/VFrameRateMeter.h"
#include "graphics/VideoSurface/VOverlayText.h"
#include "graphics/VideoSurface/VPixelFormatRouting.h"

#include <gtest/gtest.h>

#include <string>

namespace
{
  using namespace VideoGraphics;

  // What each format's pictures show is the display tests' to check; here, what they cannot see.
  TEST( PixelFormatRouting, PlanarHasNoRouteAndYUVPairsPixels )
  {
    for( std::uint32_t Format :
         { 0u, std::uint32_t( ZOL::PixelFormat_PlanarY8U8V8 ), std::uint32_t( ZOL::PixelFormat_PlanarR8G8B8 ), 1000u } )
      EXPECT_EQ( FindPixelFormatRoute( Format ), nullptr ) << Format;
    for( std::uint32_t Format = 1; Format <= 17; ++Format )
      EXPECT_NE( FindPixelFormatRoute( Format ), nullptr ) << Format;
    // An odd width loses its last pixel to the halving.
    EXPECT_EQ( TextureSize( *FindPixelFormatRoute( ZOL::PixelFormat_U8Y8V8Y8 ), 33, 7 ), QSize( 16, 7 ) );
    EXPECT_EQ( TextureSize( *FindPixelFormatRoute( ZOL::PixelFormat_BayerRG8 ), 33, 7 ), QSize( 33, 7 ) );
  }

  TEST( FrameRateMeter, AveragesOverTwoBucketsAndHoldsBetweenComputations )
  {
    std::int64_t Now = 0;
    LumekVideoViewer::VFrameRateMeter Meter( [&] { return Now; } );
    // 10 frames every 100 ms is 100 frames a second once both buckets are full.
    const struct
    {
      std::int64_t Time;
      int FramesBefore;
      double Expected;
    } Steps[] = {
        { 1000, 100, 100.0 }, // bucket 0..1000 closes; (0 + 100) / 1000 ms
        { 1200, 20, 100.0 },  // less than 401 ms since the last computation: held
        { 1500, 30, 100.0 },  // 0..1500: (100 + 50) / 1.5 s
        { 2000, 20, 70.0 },   // 1000..2000: (50 + 20) / 1.0 s, the buckets having moved on at 1500
    };
    for( const auto& rStep : Steps )
    {
      for( int i = 0; i < rStep.FramesBefore; ++i )
        Meter.CountFrame();
      Now = rStep.Time;
      EXPECT_DOUBLE_EQ( Meter.GetFrameRate(), rStep.Expected ) << "at " << rStep.Time;
    }
  }

  TEST( OverlayText, ZoomAsWholePercentAndFrameInFiveDigits )
  {
    EXPECT_EQ( LumekVideoViewer::ZoomText( 1.0f ), "100%" );
    EXPECT_EQ( LumekVideoViewer::ZoomText( 0.2f ), "20%" );
    EXPECT_EQ( LumekVideoViewer::ZoomText( 1.996f ), "200%" );
    EXPECT_EQ( LumekVideoViewer::MissingFrameText( 42 ), "Missing frame 00042" );
    EXPECT_EQ( LumekVideoViewer::MissingFrameText( 1234567 ), "Missing frame 1234567" );
  }
} // namespace
