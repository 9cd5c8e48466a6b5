// The callback holder that the update check reports through: empty calls, replacing and clearing.

#include "services/NotificationSystem/VCallback.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace
{
  TEST( Callback, SetReplaceAndClearEvenFromInside )
  {
    NotificationSystem::VCallback< void( const std::string& ) > Callback;
    EXPECT_FALSE( Callback.IsSet() );
    Callback( "nobody listens" );
    std::vector< std::string > First, Second;
    Callback.Set( [&]( const std::string& i_rText ) { First.push_back( i_rText ); } );
    Callback( "a" );
    // The function runs on a copy, so it may clear the holder it was called through.
    Callback.Set(
        [&]( const std::string& i_rText )
        {
          Second.push_back( i_rText );
          Callback.Clear();
        } );
    Callback( "b" );
    Callback( "c" );
    EXPECT_EQ( First, std::vector< std::string >{ "a" } );
    EXPECT_EQ( Second, std::vector< std::string >{ "b" } );
    EXPECT_FALSE( Callback.IsSet() );
  }

  // Setting and clearing race the calls of other threads without tearing the function apart (the
  // sanitizer run is where a race shows).
} // namespace
