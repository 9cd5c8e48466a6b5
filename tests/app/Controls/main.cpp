#include <QApplication>

#include <gtest/gtest.h>

// Widgets need a QApplication for the whole run; listing the tests must work without a display.
int main( int argc, char** argv )
{
  testing::InitGoogleTest( &argc, argv );
  if( testing::GTEST_FLAG( list_tests ) )
    return RUN_ALL_TESTS();
  QApplication Application( argc, argv );
  return RUN_ALL_TESTS();
}
