#pragma once

// Display tests create a QApplication only when there is an X server to talk to; without one
// every display test skips instead of failing.

#include <QApplication>
#include <gtest/gtest.h>

#define LUMEK_REQUIRE_DISPLAY()                                                                                        \
  do                                                                                                                   \
  {                                                                                                                    \
    if( qobject_cast< QApplication* >( QCoreApplication::instance() ) == nullptr )                                     \
      GTEST_SKIP() << "no display";                                                                                    \
  } while( false )
