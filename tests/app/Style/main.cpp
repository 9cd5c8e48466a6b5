#include "app/Style/AppStyle.h"
#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/ThemeStart.h"

#include <QApplication>

#include <gtest/gtest.h>

// The theme's first half has to run before the QApplication exists, as it does at start-up, so
// these tests bring their own main.
int main( int argc, char** argv )
{
  testing::InitGoogleTest( &argc, argv );
  if( testing::GTEST_FLAG( list_tests ) )
    return RUN_ALL_TESTS();

  const auto pStyling = ZOL::ApplicationStyling();
  Theme::ApplyPreApplicationTheme( *pStyling );
  QApplication Application( argc, argv );
  LumekVideoViewer::InitialiseStyleResources();
  return RUN_ALL_TESTS();
}
