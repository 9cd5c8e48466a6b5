// The main of the viewer's widget tests: a QApplication made the way the viewer makes it (the
// theme's first half has to run before it exists), and settings, caches and runtime files in
// folders of their own, so that a run by hand leaves the user's store alone. The window's tests
// also take the style sheet, as the viewer does at start-up.

#include "app/Style/AppStyle.h"
#include "services/DebugServices.h"
#include "services/IApplicationVersion.h"
#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/ThemeStart.h"

#include <QApplication>
#include <QDir>
#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <cstdlib>

int main( int argc, char** argv )
{
  testing::InitGoogleTest( &argc, argv );
  // Listing the cases happens at build time, where there may be no X server for an application.
  if( testing::GTEST_FLAG( list_tests ) )
    return RUN_ALL_TESTS();

  QTemporaryDir Scratch;
  if( !Scratch.isValid() )
    return 1;
  for( const char* pVariable : { "XDG_RUNTIME_DIR", "XDG_CONFIG_HOME", "XDG_CACHE_HOME" } )
  {
    const QString Folder = Scratch.filePath( pVariable );
    QDir().mkpath( Folder );
    QFile::setPermissions( Folder, QFileDevice::ReadOwner | QFileDevice::WriteOwner | QFileDevice::ExeOwner );
    setenv( pVariable, Folder.toLocal8Bit().constData(), 1 );
  }

  DebugServices::SetApplicationVersion( &LumekVideoViewer::ApplicationVersion() );
  QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts, true );
  const auto pStyling = ZOL::ApplicationStyling();
  Theme::ApplyPreApplicationTheme( *pStyling );
  QApplication Application( argc, argv );
  LumekVideoViewer::InitialiseStyleResources();
#ifdef LUMEK_TEST_STYLE_SHEET
  if( !LumekVideoViewer::ApplyStyleSheet( *pStyling ) )
    return 1;
#endif
  return RUN_ALL_TESTS();
}
