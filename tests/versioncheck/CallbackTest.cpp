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
  TEST( Callback, EmptyCallDoesNothing )
  {
    NotificationSystem::VCallback< void( const std::string& ) > Callback;
    EXPECT_FALSE( Callback.IsSet() );
    Callback( "nobody listens" );
  }

  TEST( Callback, SetReplaceAndClear )
  {
    NotificationSystem::VCallback< void( const std::vector< std::string >& ) > Callback;
    std::vector< std::string > First, Second;
    Callback.Set( [&]( const std::vector< std::string >& i_rList ) { First = i_rList; } );
    Callback( { "a", "b" } );
    Callback.Set( [&]( const std::vector< std::string >& i_rList ) { Second = i_rList; } );
    Callback( { "c" } );
    Callback.Clear();
    Callback( { "d" } );
    EXPECT_EQ( First, ( std::vector< std::string >{ "a", "b" } ) );
    EXPECT_EQ( Second, ( std::vector< std::string >{ "c" } ) );
    EXPECT_FALSE( Callback.IsSet() );
  }

  TEST( Callback, FunctionMayClearItself )
  {
    NotificationSystem::VCallback< void( bool ) > Callback;
    int Calls = 0;
    Callback.Set(
        [&]( bool )
        {
          ++Calls;
          Callback.Clear();
        } );
    Callback( true );
    Callback( true );
    EXPECT_EQ( Calls, 1 );
  }

  TEST( Callback, SetClearAndCallFromManyThreads )
  {
    NotificationSystem::VCallback< void( int ) > Callback;
    std::atomic< long > Sum{ 0 };
    std::atomic< bool > bStop{ false };
    std::thread Setter(
        [&]
        {
          while( !bStop )
          {
            Callback.Set( [&]( int i_Value ) { Sum += i_Value; } );
            Callback.Clear();
          }
        } );
    std::vector< std::thread > Callers;
    for( int Index = 0; Index < 3; ++Index )
      Callers.emplace_back(
          [&]
          {
            for( int Call = 0; Call < 20000; ++Call )
              Callback( 1 );
          } );
    for( auto& rCaller : Callers )
      rCaller.join();
    bStop = true;
    Setter.join();
    EXPECT_LE( Sum.load(), 60000 );
  }
} // namespace
