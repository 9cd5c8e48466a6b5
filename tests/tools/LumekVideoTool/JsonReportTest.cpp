// The reports moved from a writer of our own to Qt's JSON classes: every key and value must
// stay, in both layouts, and other parsers must still read them.

#include "ToolRunner.h"

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

  TEST( JsonReport, InfoAndBenchKeepEveryKeyOfTheEarlierWriterInEveryLayout )
  {
    const VScratch Scratch;
    const std::string Path = Scratch.Path( "a.lvid" );
    const VRun Make = RunInProcess(
        { "make-sample", Path, "--width", "16", "--height", "8", "--frames", "3", "--format", "BayerGB8" } );
    ASSERT_EQ( Make.ExitCode, 0 ) << Make.Err;
    // The golden file is the earlier writer's compact report of this very sample.
    const VBytes Golden = ReadFileBytes( LUMEK_TOOL_GOLDEN_FOLDER "/info-sample-BayerGB8-16x8-frame1.json" );
    QJsonObject Expected = ParseObject( std::string( Golden.begin(), Golden.end() ) );
    ASSERT_FALSE( Expected.isEmpty() );
    Expected["file"] = QString::fromStdString( Path );
    // A pipe gets the compact form by itself.
    for( const char* pLayout : { "", "--compact", "--pretty" } )
    {
      SCOPED_TRACE( pLayout );
      std::vector< std::string > Arguments = { "info", Path, "--frame", "1", pLayout };
      if( !*pLayout )
        Arguments.pop_back();
      const VRun Run = RunTool( Arguments );
      ASSERT_EQ( Run.ExitCode, 0 ) << Run.Err;
      EXPECT_EQ( ParseObject( Run.Out ), Expected ) << Run.Out;
      if( std::string( pLayout ) == "--pretty" )
        EXPECT_EQ( Run.Out.rfind( "{\n    \"", 0 ), 0u ) << Run.Out;
      else
        EXPECT_EQ( LineCount( Run.Out ), 1u );
      // What a script would do with the report: read it with a parser that is not Qt's.
      EXPECT_EQ( ParseJson( Run.Out ).get< std::string >( "infoPanel.video" ),
                 "V: 16 x 8 / BayerGB8 / 100.00Hz / 3 frames (0 missing) / 0.03s" );
    }

    const VRun Bench = RunTool( { "bench", Path, "--software" } );
    ASSERT_EQ( Bench.ExitCode, 0 ) << Bench.Err;
    EXPECT_EQ( LineCount( Bench.Out ), 1u );
    const auto Report = ParseJson( Bench.Out );
    // Later figures may join these; the earlier writer's must stay.
    EXPECT_EQ( Report.get< int >( "frames" ), 3 );
    EXPECT_GT( Report.get< double >( "fps" ), 0.0 );
    EXPECT_GT( Report.get< double >( "peakRssMiB" ), 0.0 );
    EXPECT_GE( Report.get< double >( "seconds" ), 0.0 );
    EXPECT_NEAR( Report.get< double >( "msPerFrame" ) * Report.get< double >( "fps" ), 1000.0, 1e-6 );
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
