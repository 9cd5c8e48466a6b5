// Runs the update check's widget tests inside a QApplication, with settings, cache and runtime
// folders of their own so that a run by hand never touches the user's.

#include <gtest/gtest.h>

#include <QApplication>
#include <QDir>
#include <QFile>
#include <QNetworkProxy>
#include <QTemporaryDir>

int main( int i_ArgumentCount, char** i_pArguments )
{
  testing::InitGoogleTest( &i_ArgumentCount, i_pArguments );
  // Listing the tests happens at build time, where there may be no display.
  if( testing::GTEST_FLAG( list_tests ) )
    return RUN_ALL_TESTS();

  QTemporaryDir Scratch;
  if( !Scratch.isValid() )
    return 1;
  for( const char* pName : { "config", "cache", "runtime" } )
    QDir( Scratch.path() ).mkdir( pName );
  QFile::setPermissions( Scratch.filePath( "runtime" ),
                         QFileDevice::ReadOwner | QFileDevice::WriteOwner | QFileDevice::ExeOwner );
  qputenv( "XDG_CONFIG_HOME", Scratch.filePath( "config" ).toLocal8Bit() );
  qputenv( "XDG_CACHE_HOME", Scratch.filePath( "cache" ).toLocal8Bit() );
  if( qEnvironmentVariableIsEmpty( "XDG_RUNTIME_DIR" ) )
    qputenv( "XDG_RUNTIME_DIR", Scratch.filePath( "runtime" ).toLocal8Bit() );

  QApplication Application( i_ArgumentCount, i_pArguments );
  // The tests' server is on this machine; a proxy from the environment must not stand between.
  QNetworkProxy::setApplicationProxy( QNetworkProxy::NoProxy );
  return RUN_ALL_TESTS();
}
