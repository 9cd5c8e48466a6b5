#include "app/Controls/SliderTicks.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>

namespace
{
  using LumekVideoViewer::ComputeTickSteps;
  using LumekVideoViewer::LayoutTicks;
  using LumekVideoViewer::VTickSteps;

  struct VStepCase
  {
    const char* Label;
    double FramesPerPixel;
    int Major;
    int Minor;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VStepCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

  class TickSteps : public testing::TestWithParam< VStepCase >
  {
  };

  // Worked by hand from the 1-2-5 ladder: the step is the round number of frames that spans 50 to
  // 125 pixels.
  TEST_P( TickSteps, RoundStepForTheDensity )
  {
    const VTickSteps Steps = ComputeTickSteps( GetParam().FramesPerPixel );
    EXPECT_EQ( Steps.Major, GetParam().Major );
    EXPECT_EQ( Steps.Minor, GetParam().Minor );
  }

  INSTANTIATE_TEST_SUITE_P(
      Slider, TickSteps,
      testing::Values( VStepCase{ "EmptyFileHasStepOne", 0.0, 1, 1 }, VStepCase{ "NegativeHasStepOne", -3.0, 1, 1 },
                       VStepCase{ "NotANumberHasStepOne", std::numeric_limits< double >::quiet_NaN(), 1, 1 },
                       VStepCase{ "HundredPixelsPerFrame", 0.01, 1, 1 },
                       VStepCase{ "TwentyPixelsPerFrame", 0.05, 5, 1 }, VStepCase{ "FivePixelsPerFrame", 0.2, 20, 2 },
                       VStepCase{ "TwoPixelsPerFrame", 0.5, 50, 5 }, VStepCase{ "OneFramePerPixel", 1.0, 100, 10 },
                       VStepCase{ "TwoFramesPerPixel", 2.0, 200, 20 }, VStepCase{ "ThreeFramesPerPixel", 3.0, 200, 20 },
                       VStepCase{ "FourFramesPerPixel", 4.0, 500, 50 },
                       VStepCase{ "TenFramesPerPixel", 10.0, 1000, 100 }, VStepCase{ "LongFile", 123.4, 10000, 1000 },
                       VStepCase{ "BeyondAnyFileIsCapped", 1e12, std::numeric_limits< int >::max(),
                                  std::numeric_limits< int >::max() / 10 } ),
      []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  TEST( TickSteps, NumberedMarksStayReadableAtEveryDensity )
  {
    for( int k = -300; k <= 600; ++k )
    {
      const double FramesPerPixel = std::pow( 10.0, k / 100.0 );
      const VTickSteps Steps = ComputeTickSteps( FramesPerPixel );
      if( Steps.Major == 1 )
        continue;
      const double Pixels = Steps.Major / FramesPerPixel;
      EXPECT_GE( Pixels, 50.0 ) << FramesPerPixel;
      EXPECT_LE( Pixels, 125.0 ) << FramesPerPixel;
      // A round number: 1, 2 or 5 times a power of ten.
      int Mantissa = Steps.Major;
      while( Mantissa % 10 == 0 )
        Mantissa /= 10;
      EXPECT_TRUE( Mantissa == 1 || Mantissa == 2 || Mantissa == 5 ) << Steps.Major;
      EXPECT_EQ( Steps.Minor, Steps.Major > 10 ? Steps.Major / 10 : 1 );
    }
  }

  TEST( TickLayout, NoFileStateShowsZeroToHundred )
  {
    // 100 frames over 500 pixels: a number every 20 frames, a short mark every 2.
    const auto Ticks = LayoutTicks( 100, 500, 10, ComputeTickSteps( 100.0 / 500.0 ) );
    ASSERT_EQ( Ticks.size(), 51u );
    for( size_t i = 0; i < Ticks.size(); ++i )
    {
      const int Frame = static_cast< int >( i ) * 2;
      EXPECT_EQ( Ticks[i].Frame, Frame );
      EXPECT_EQ( Ticks[i].Major, Frame % 20 == 0 ) << Frame;
      // The handle's centre travels from 5 to 495.
      EXPECT_NEAR( Ticks[i].Position, 5.0 + Frame * 4.9, 1e-3 ) << Frame;
    }
    EXPECT_FLOAT_EQ( Ticks.front().Position, 5.0f );
    EXPECT_FLOAT_EQ( Ticks.back().Position, 495.0f );
  }

  TEST( TickLayout, SingleFrameFileHasOneMarkAtTheStart )
  {
    const auto Ticks = LayoutTicks( 0, 300, 11, ComputeTickSteps( 0.0 ) );
    ASSERT_EQ( Ticks.size(), 1u );
    EXPECT_EQ( Ticks[0].Frame, 0 );
    EXPECT_TRUE( Ticks[0].Major );
    EXPECT_TRUE( std::isfinite( Ticks[0].Position ) );
    EXPECT_FLOAT_EQ( Ticks[0].Position, 5.0f );
  }
} // namespace
