// The reports moved from a writer of our own to Qt's JSON classes: every key and value must
// stay, in both layouts, and scripts must still parse them.

#include "ToolRunner.h"

#include "tests/support/FfmpegFixtures.h"
#include "tools/LumekVideoTool/Json.h"

#include <gtest/gtest.h>

#include <QJsonDocument>

#include <boost/algorithm/string/predicate.hpp>

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
    EXPECT_TRUE( Document.isObject() ) << i_rText;
    return Document.object();
  }

  bool HavePython()
  {
    int ExitCode = -1;
    LumekTest::RunCommand( "python3 -c pass 2>/dev/null", &ExitCode );
    return ExitCode == 0;
  }

  // What a script would do with the report.
  void ExpectJsonToolAccepts( const VScratch& i_rScratch, const std::string& i_rText, const std::string& i_rName )
  {
    const std::string Path = i_rScratch.Path( i_rName );
    WriteFileBytes( Path, std::vector< std::uint8_t >( i_rText.begin(), i_rText.end() ) );
    int ExitCode = -1;
    LumekTest::RunCommand( "python3 -m json.tool " + LumekTest::ShellQuote( Path ) + " >/dev/null", &ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << i_rName << ":\n" << i_rText;
  }

  std::size_t LineCount( const std::string& i_rText )
  {
    return std::count( i_rText.begin(), i_rText.end(), '\n' );
  }

  std::string WriteSample( const VScratch& i_rScratch )
  {
    const std::string Path = i_rScratch.Path( "a.lvid" );
    const VRun Run =
        RunTool( { "make-sample", Path, "--width", "16", "--height", "8", "--frames", "3", "--format", "BayerGB8" } );
    EXPECT_EQ( Run.ExitCode, 0 ) << Run.Err;
    return Path;
  }
} // namespace

TEST( JsonReport, InfoKeepsEveryKeyAndValueOfTheEarlierWriter )
{
  // The golden file is the earlier writer's compact report of this very sample.
  const std::vector< std::uint8_t > Golden =
      ReadFileBytes( LUMEK_TOOL_GOLDEN_FOLDER "/info-sample-BayerGB8-16x8-frame1.json" );
  ASSERT_FALSE( Golden.empty() );
  QJsonObject Expected = ParseObject( std::string( Golden.begin(), Golden.end() ) );

  VScratch Scratch;
  const std::string Path = WriteSample( Scratch );
  Expected["file"] = QString::fromStdString( Path );
  for( const char* pLayout : { "--compact", "--pretty" } )
  {
    const VRun Run = RunTool( { "info", Path, "--frame", "1", pLayout } );
    ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
    EXPECT_EQ( ParseObject( Run.Out ), Expected ) << pLayout << "\n" << Run.Out;
  }
}

TEST( JsonReport, BenchKeepsItsKeys )
{
  VScratch Scratch;
  const std::string Path = WriteSample( Scratch );
  const VRun Run = RunTool( { "bench", Path, "--compact" } );
  ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
  const QJsonObject Report = ParseObject( Run.Out );
  // Later figures may join these; the earlier writer's must stay.
  for( const char* pKey : { "fps", "frames", "msPerFrame", "peakRssMiB", "seconds" } )
    EXPECT_TRUE( Report[pKey].isDouble() ) << pKey << "\n" << Run.Out;
  EXPECT_EQ( Report["frames"].toInt(), 3 );
  EXPECT_NEAR( Report["msPerFrame"].toDouble() * Report["fps"].toDouble(), 1000.0, 1e-6 );
}

TEST( JsonReport, CompactForAPipeIndentedOnRequest )
{
  VScratch Scratch;
  const std::string Path = WriteSample( Scratch );
  for( const char* pCommand : { "info", "bench" } )
  {
    // RunTool sends standard output to a file, which gets the compact form by itself.
    const VRun Automatic = RunTool( { pCommand, Path } );
    const VRun Compact = RunTool( { pCommand, Path, "--compact" } );
    const VRun Pretty = RunTool( { pCommand, Path, "--pretty" } );
    EXPECT_EQ( LineCount( Automatic.Out ), 1u ) << pCommand;
    EXPECT_EQ( LineCount( Compact.Out ), 1u ) << pCommand;
    EXPECT_GT( LineCount( Pretty.Out ), 5u ) << pCommand;
    EXPECT_TRUE( boost::starts_with( Pretty.Out, "{\n    \"" ) ) << Pretty.Out;
    if( !HavePython() )
      continue;
    ExpectJsonToolAccepts( Scratch, Compact.Out, std::string( pCommand ) + "-compact.json" );
    ExpectJsonToolAccepts( Scratch, Pretty.Out, std::string( pCommand ) + "-pretty.json" );
  }
  EXPECT_EQ( RunTool( { "info", Path, "--compact", "--pretty" } ).ExitCode, 2 );
}

TEST( JsonReport, IndentedAtATerminal )
{
  if( !HavePython() )
    GTEST_SKIP() << "python3 is needed for a pseudo-terminal";
  VScratch Scratch;
  const std::string Path = WriteSample( Scratch );
  // pty.spawn copies the child's terminal output to our standard output.
  const std::string Out =
      LumekTest::RunCommand( "python3 -c 'import pty, sys; pty.spawn(sys.argv[1:])' " +
                             LumekTest::ShellQuote( LUMEK_TOOL_PATH ) + " info " + LumekTest::ShellQuote( Path ) );
  EXPECT_GT( LineCount( Out ), 5u ) << Out;
  EXPECT_NE( Out.find( "    \"container\": \"LVID\"" ), std::string::npos ) << Out;
}

TEST( JsonReport, TextsFromADamagedFileStayValid )
{
  std::ostringstream Out;
  LumekVideoTool::WriteJson(
      Out,
      QJsonObject{ { "a\"b", LumekVideoTool::JsonText( "line\n\x01\xff\xc3\xa9" ) },
                   { "n", QJsonArray{ LumekVideoTool::JsonCount( ( 1ull << 53 ) - 1 ),
                                      LumekVideoTool::JsonNumber( 2.5 ), LumekVideoTool::JsonNumber( 1.0 / 0.0 ) } } },
      LumekVideoTool::EJsonLayout::Compact );
  EXPECT_EQ( Out.str(), "{\"a\\\"b\":\"line\\n\\u0001\xef\xbf\xbd\xc3\xa9\",\"n\":[9007199254740991,2.5,null]}\n" );
}
