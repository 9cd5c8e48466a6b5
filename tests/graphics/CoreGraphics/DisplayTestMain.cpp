#include "tests/graphics/CoreGraphics/DisplayTestMain.h"

#include <xcb/xcb.h>

#include <chrono>
#include <memory>
#include <thread>

namespace
{
  // Xvfb regenerates itself whenever its last client leaves, and a connection that arrives during
  // that moment is refused, which Qt answers by aborting. A connection of our own, made with a
  // few retries and held for the whole run, gets past the reset and keeps the server from
  // resetting under this process.
  xcb_connection_t* ConnectToDisplay()
  {
    for( int Attempt = 0; Attempt < 50; ++Attempt )
    {
      xcb_connection_t* pConnection = xcb_connect( nullptr, nullptr );
      if( xcb_connection_has_error( pConnection ) == 0 )
        return pConnection;
      xcb_disconnect( pConnection );
      std::this_thread::sleep_for( std::chrono::milliseconds( 100 ) );
    }
    return nullptr;
  }
} // namespace

int main( int argc, char** argv )
{
  ::testing::InitGoogleTest( &argc, argv );
  std::unique_ptr< QApplication > pApplication;
  xcb_connection_t* pConnection = nullptr;
  if( qEnvironmentVariableIsSet( "DISPLAY" ) && !::testing::GTEST_FLAG( list_tests ) )
  {
    pConnection = ConnectToDisplay();
    // Texture storage lives in a hidden context that shares with every widget; sharing has to
    // be asked for before the application exists, as the viewer itself does.
    QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts );
    pApplication = std::make_unique< QApplication >( argc, argv );
  }
  const int Result = RUN_ALL_TESTS();
  pApplication.reset();
  if( pConnection != nullptr )
    xcb_disconnect( pConnection );
  return Result;
}
