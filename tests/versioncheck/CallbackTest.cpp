// The callback holder that the update check reports through: empty calls, replacing and clearing.

#include "services/NotificationSystem/VCallback.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace
{
  // A call with nothing set does nothing. The function runs on a copy taken at the call, so it may
  // clear the holder it was called through.
  TEST( Callback, SetReplaceAndClearEvenFromInside )
  {
    NotificationSystem::VCallback< void( const std::string& ) > Callback;
    Callback( "nobody listens" );
    std::vector< std::string > Heard;
    Callback.Set( [&]( const std::string& i_rText ) { Heard.push_back( "first " + i_rText ); } );
    Callback( "a" );
    Callback.Set(
        [&]( const std::string& i_rText )
        {
          Heard.push_back( "second " + i_rText );
          Callback.Clear();
        } );
    Callback( "b" );
    Callback( "c" );
    EXPECT_EQ( Heard, ( std::vector< std::string >{ "first a", "second b" } ) );
    EXPECT_FALSE( Callback.IsSet() );
  }
} // namespace
