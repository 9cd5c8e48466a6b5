// The viewer as a user starts it: it must come up with a good file and with a bad one, under the
// test's own X server, and neither crash nor block the test.

#include "tests/app/Window/TestRecordings.h"

#include <QProcess>
#include <QTemporaryDir>
#include <QTest>

#include <gtest/gtest.h>

namespace
{
  // Starts the viewer, lets it run for a while, and tells whether it was still alive then.
  bool RunsFor( const QStringList& i_rArguments, int i_Milliseconds, QString& o_rOutput )
  {
    QProcess Viewer;
    Viewer.setProcessChannelMode( QProcess::MergedChannels );
    Viewer.start( LUMEK_VIEWER_BINARY, i_rArguments );
    if( !Viewer.waitForStarted( 5000 ) )
      return false;
    QTest::qWait( i_Milliseconds );
    const bool bAlive = Viewer.state() == QProcess::Running;
    Viewer.kill();
    Viewer.waitForFinished( 5000 );
    o_rOutput = QString::fromLocal8Bit( Viewer.readAll() );
    return bAlive;
  }
} // namespace

TEST( ViewerProcess, StartsOnAGoodFileAndOnABadOne )
{
  QTemporaryDir Dir;
  ASSERT_TRUE( Dir.isValid() );
  const std::string Good = WindowTest::WriteRecording( Dir.filePath( "good.lvid" ).toStdString(), {} );
  ASSERT_FALSE( Good.empty() );
  const QString Bad = Dir.filePath( "bad.lvid" );
  {
    QFile File( Bad );
    ASSERT_TRUE( File.open( QIODevice::WriteOnly ) );
    File.write( "not a recording" );
  }

  QString Output;
  EXPECT_TRUE( RunsFor( { "--version-server=", QString::fromStdString( Good ) }, 2000, Output ) )
      << Output.toStdString();
  // The "Invalid file" dialog waits for a click that never comes: the process stays up, and the
  // kill ends it.
  EXPECT_TRUE( RunsFor( { "--version-server=", Bad }, 2000, Output ) ) << Output.toStdString();
}
