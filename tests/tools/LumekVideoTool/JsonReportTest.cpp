// The reports moved from a writer of our own to Qt's JSON classes: every key and value must
// stay, in both layouts, and other parsers must still read them.

#include "ToolRunner.h"

#include "tests/support/FfmpegFixtures.h"
#include "tools/LumekVideoTool/Json.h"

#include <gtest/gtest.h>

#include <QJsonDocument>

#include <algorithm>
#include <sstream>

using namespace LumekVideoToolTest;

namespace
{
  QJsonObject ParseObject( const std::string& i_rText )
  {
    QJsonParseError Error{};
    const QJsonDocument Document = QJsonDocument::fromJson( QByteArray::fromStdString( i_rText ), &Error );
    EXPECT_EQ( Error.error, QJsonParseError::NoError ) << i_rText;
    return Document.object();
  }

  std::size_t LineCount( const std::string& i_rText )
  {
    return std::count( i_rText.begin(), i_rText.end(), '\n' );
  }

  class JsonReport : public testing::Test
  {
  protected:
    void SetUp() override
    {
      const VRun Run = RunInProcess(
          { "make-sample", m_Path, "--width", "16", "--height", "8", "--frames", "3", "--format", "BayerGB8" } );
      ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
    }
    VScratch m_Scratch;
    const std::string m_Path = m_Scratch.Path( "a.lvid" );
  };

  TEST_F( JsonReport, InfoKeepsEveryKeyAndValueOfTheEarlierWriter )
  {
    // The golden file is the earlier writer's compact report of this very sample.
    const VBytes Golden = ReadFileBytes( LUMEK_TOOL_GOLDEN_FOLDER "/info-sample-BayerGB8-16x8-frame1.json" );
    QJsonObject Expected = ParseObject( std::string( Golden.begin(), Golden.end() ) );
    ASSERT_FALSE( Expected.isEmpty() );
    Expected["file"] = QString::fromStdString( m_Path );
    for( const char* pLayout : { "--compact", "--pretty" } )
    {
      const VRun Run = RunTool( { "info", m_Path, "--frame", "1", pLayout } );
      ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
      EXPECT_EQ( ParseObject( Run.Out ), Expected ) << pLayout << "\n" << Run.Out;
    }
  }

  TEST_F( JsonReport, BenchKeepsItsKeys )
  {
    const VRun Run = RunTool( { "bench", m_Path, "--software" } );
    ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
    const auto Report = ParseJson( Run.Out );
    // Later figures may join these; the earlier writer's must stay.
    EXPECT_EQ( Report.get< int >( "frames" ), 3 );
    EXPECT_GT( Report.get< double >( "fps" ), 0.0 );
    EXPECT_GT( Report.get< double >( "peakRssMiB" ), 0.0 );
    EXPECT_GE( Report.get< double >( "seconds" ), 0.0 );
    EXPECT_NEAR( Report.get< double >( "msPerFrame" ) * Report.get< double >( "fps" ), 1000.0, 1e-6 );
  }

  TEST_F( JsonReport, CompactForAPipeIndentedOnRequest )
  {
    for( const char* pCommand : { "info", "bench" } )
    {
      SCOPED_TRACE( pCommand );
      // RunTool sends standard output to a file, which gets the compact form by itself.
      const VRun Automatic = RunTool( { pCommand, m_Path } );
      const VRun Compact = RunInProcess( { pCommand, m_Path, "--compact" } );
      const VRun Pretty = RunInProcess( { pCommand, m_Path, "--pretty" } );
      EXPECT_EQ( LineCount( Automatic.Out ), 1u );
      EXPECT_EQ( LineCount( Compact.Out ), 1u );
      EXPECT_GT( LineCount( Pretty.Out ), 5u );
      EXPECT_EQ( Pretty.Out.rfind( "{\n    \"", 0 ), 0u ) << Pretty.Out;
      // What a script would do with the report: read it with a parser that is not Qt's. The
      // bench's figures differ from run to run; the info's are the same in both layouts.
      const auto CompactTree = ParseJson( Compact.Out ), PrettyTree = ParseJson( Pretty.Out );
      if( std::string( pCommand ) == "info" )
      {
        EXPECT_EQ( CompactTree, PrettyTree );
      }
    }
  }

  TEST_F( JsonReport, IndentedAtATerminal )
  {
    int ExitCode = -1;
    LumekTest::RunCommand( "python3 -c pass 2>/dev/null", &ExitCode );
    if( ExitCode != 0 )
      GTEST_SKIP() << "python3 is needed for a pseudo-terminal";
    // pty.spawn copies the child's terminal output to our standard output.
    const std::string Out =
        LumekTest::RunCommand( "python3 -c 'import pty, sys; pty.spawn(sys.argv[1:])' " +
                               LumekTest::ShellQuote( LUMEK_TOOL_PATH ) + " info " + LumekTest::ShellQuote( m_Path ) );
    EXPECT_GT( LineCount( Out ), 5u ) << Out;
    EXPECT_NE( Out.find( "    \"container\": \"LVID\"" ), std::string::npos ) << Out;
  }

  TEST( JsonText, TextsFromADamagedFileStayValid )
  {
    std::ostringstream Out;
    LumekVideoTool::WriteJson( Out,
                               QJsonObject{ { "a\"b", LumekVideoTool::JsonText( "line\n\x01\xff\xc3\xa9" ) },
                                            { "n", QJsonArray{ LumekVideoTool::JsonCount( ( 1ull << 53 ) - 1 ),
                                                               LumekVideoTool::JsonNumber( 2.5 ),
                                                               LumekVideoTool::JsonNumber( 1.0 / 0.0 ) } } },
                               LumekVideoTool::EJsonLayout::Compact );
    EXPECT_EQ( Out.str(), "{\"a\\\"b\":\"line\\n\\u0001\xef\xbf\xbd\xc3\xa9\",\"n\":[9007199254740991,2.5,null]}\n" );
  }
} // namespace
