// The callback holder that the update check reports through: empty calls, replacing and clearing,
// and use from several threads at once.

#include "services/NotificationSystem/VCallback.h"

#include <gtest/gtest.h>

#include <atomic>
#include <string>
#include <thread>
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
  TEST( Callback, SetClearAndCallFromManyThreads )
  {
    NotificationSystem::VCallback< void( int ) > Counter;
    std::atomic< long > Sum{ 0 };
    std::atomic< bool > bStop{ false };
    std::thread Setter(
        [&]
        {
          for( ; !bStop; Counter.Clear() )
            Counter.Set( [&]( int i_Value ) { Sum += i_Value; } );
        } );
    std::vector< std::thread > Callers;
    for( int Index = 0; Index < 3; ++Index )
      Callers.emplace_back(
          [&]
          {
            for( int Call = 0; Call < 20000; ++Call )
              Counter( 1 );
          } );
    for( auto& rCaller : Callers )
      rCaller.join();
    bStop = true;
    Setter.join();
    EXPECT_LE( Sum.load(), 60000 );
  }
} // namespace
