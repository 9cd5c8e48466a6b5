#include "tests/graphics/CoreGraphics/DisplayTestMain.h"

#include <memory>

int main( int argc, char** argv )
{
  ::testing::InitGoogleTest( &argc, argv );
  std::unique_ptr< QApplication > pApplication;
  if( qEnvironmentVariableIsSet( "DISPLAY" ) && !::testing::GTEST_FLAG( list_tests ) )
  {
    // Texture storage lives in a hidden context that shares with every widget; sharing has to
    // be asked for before the application exists, as the viewer itself does.
    QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts );
    pApplication = std::make_unique< QApplication >( argc, argv );
  }
  return RUN_ALL_TESTS();
}
