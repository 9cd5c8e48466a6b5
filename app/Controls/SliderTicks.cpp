#include "app/Controls/SliderTicks.h"

#include <cmath>
#include <limits>

namespace LumekVideoViewer
{
  namespace
  {
    // NaN and minus infinity compare false against everything, so every limit is written as
    // "keep it if at or above the bound", which lets the bound win for them.
    double AtLeast( double i_Value, double i_Bound )
    {
      return i_Value >= i_Bound ? i_Value : i_Bound;
    }

    constexpr double s_LowestExponent = -10.0;
  } // namespace

  VTickSteps ComputeTickSteps( double i_FramesPerPixel )
  {
    // Aim for a numbered mark about every 5 pixels times 10 to 25: try steps of 1, 2 and 5 times a
    // power of ten and keep the one whose exponent rounds out highest.
    const double x = i_FramesPerPixel * 5.0;
    const double a = std::floor( std::log10( x ) );
    const double b = std::floor( std::log10( x * 0.5 ) );
    const double c = std::floor( std::log10( x * 0.2 ) );
    const double LimitedA = AtLeast( a, s_LowestExponent );
    const double LimitedB = AtLeast( b, LimitedA );
    const double Exponent = AtLeast( c, LimitedB ) + 1.0;

    double Multiplier = 0.0;
    if( c >= LimitedB )
      Multiplier = 10.0;
    else if( b >= LimitedA )
      Multiplier = 5.0;
    else if( a >= s_LowestExponent )
      Multiplier = 2.0;

    const double Major = AtLeast( Multiplier * std::pow( 10.0, Exponent ), 1.0 );
    constexpr double s_MaxStep = static_cast< double >( std::numeric_limits< int >::max() );

    VTickSteps Steps;
    Steps.Major = Major >= s_MaxStep ? std::numeric_limits< int >::max() : static_cast< int >( Major );
    Steps.Minor = Steps.Major > 10 ? static_cast< int >( Steps.Major * 0.1 ) : 1;
    return Steps;
  }

  std::vector< VTick > LayoutTicks( int i_Maximum, int i_GrooveWidth, int i_HandleWidth, VTickSteps i_Steps )
  {
    std::vector< VTick > Ticks;
    if( i_Steps.Major < 1 || i_Steps.Minor < 1 )
      return Ticks;
    const float HalfHandle = static_cast< float >( i_HandleWidth / 2 );
    const float Travel = static_cast< float >( i_GrooveWidth - i_HandleWidth );
    // Every frame is visited, so a long file costs two modulo tests per frame and nothing more.
    for( long long i = 0; i <= i_Maximum; ++i )
    {
      const bool Major = i % i_Steps.Major == 0;
      if( !Major && i % i_Steps.Minor != 0 )
        continue;
      // With a maximum of 0 the division would give NaN for frame 0; it belongs at the left end.
      const float Position = i_Maximum == 0
                                 ? HalfHandle
                                 : static_cast< float >( i ) * Travel / static_cast< float >( i_Maximum ) + HalfHandle;
      Ticks.push_back( { static_cast< int >( i ), Position, Major } );
    }
    return Ticks;
  }
} // namespace LumekVideoViewer
