// The window's tests need a QApplication made the way the viewer makes it, and settings, caches
// and runtime files in folders of their own so that a run by hand leaves the user's store alone.

#include "app/Style/AppStyle.h"
#include "services/DebugServices.h"
#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/ThemeStart.h"

#include <QApplication>
#include <QDir>
#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>

int main( int argc, char** argv )
{
  testing::InitGoogleTest( &argc, argv );
  // Listing the cases happens at build time, where there may be no X server for an application.
  if( testing::GTEST_FLAG( list_tests ) )
    return RUN_ALL_TESTS();

  QTemporaryDir Scratch;
  if( !Scratch.isValid() )
    return 1;
  const QString Runtime = Scratch.filePath( "runtime" );
  QDir().mkpath( Runtime );
  QFile::setPermissions( Runtime, QFileDevice::ReadOwner | QFileDevice::WriteOwner | QFileDevice::ExeOwner );
  QDir().mkpath( Scratch.filePath( "config" ) );
  QDir().mkpath( Scratch.filePath( "cache" ) );
  setenv( "XDG_RUNTIME_DIR", Runtime.toLocal8Bit().constData(), 1 );
  setenv( "XDG_CONFIG_HOME", Scratch.filePath( "config" ).toLocal8Bit().constData(), 1 );
  setenv( "XDG_CACHE_HOME", Scratch.filePath( "cache" ).toLocal8Bit().constData(), 1 );

  DebugServices::SetApplicationVersion( &LumekVideoViewer::ApplicationVersion() );
  QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts, true );
  const std::shared_ptr< ZOL::IApplicationStyling > pStyling = ZOL::ApplicationStyling();
  Theme::ApplyPreApplicationTheme( *pStyling );
  QApplication Application( argc, argv );
  LumekVideoViewer::ApplyStyleSheet( *pStyling );

  return RUN_ALL_TESTS();
}
