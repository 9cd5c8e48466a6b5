#include "services/Log.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestNames.h"

#include <gtest/gtest.h>

#include <ostream>
#include <vector>

namespace
{
  // Prints itself and counts how often: the log must not format what nobody listens to.
  struct VCountingValue
  {
    int Value;
  };
  int s_Formatted = 0;
  std::ostream& operator<<( std::ostream& io_rStream, const VCountingValue& i_rValue )
  {
    ++s_Formatted;
    return io_rStream << "<" << i_rValue.Value << ">";
  }

} // namespace

class LogLevelTest : public testing::TestWithParam< int >
{
};

TEST_P( LogLevelTest, FormatsOnlyWhatTheLevelLetsThrough )
{
  const int Listening = GetParam();
  LumekTest::VLogCapture Capture( "", Listening );
  for( int Level = ZOL::LogFailure; Level <= ZOL::LogDetail; ++Level )
  {
    s_Formatted = 0;
    Capture.Records.clear();
    LUMEK_LOG( "LogTest", Level, "value %s", VCountingValue{ Level } );
    const bool bThrough = Level <= Listening;
    EXPECT_EQ( bThrough ? 1 : 0, s_Formatted ) << "level " << Level;
    ASSERT_EQ( bThrough ? 1u : 0u, Capture.Records.size() ) << "level " << Level;
    if( bThrough )
    {
      EXPECT_EQ( "value <" + std::to_string( Level ) + ">", Capture.Records[0].Message );
      EXPECT_EQ( Level, Capture.Records[0].Level );
    }
  }
}

INSTANTIATE_TEST_SUITE_P( Levels, LogLevelTest, testing::Values( 2, 3, 4, 6 ),
                          []( const testing::TestParamInfo< int >& i_rInfo )
                          { return "ListeningAt" + std::to_string( i_rInfo.param ); } );

TEST( Log, StandardErrorLineWithoutAnySink )
{
  const int StandardErrorLevel = ZOL::GlobalLog().GetStandardErrorLevel();
  ZOL::GlobalLog().SetStandardErrorLevel( ZOL::LogWarning );
  testing::internal::CaptureStderr();
  LUMEK_LOG( "LogTest", ZOL::LogWarning, "Bad atom size %d", 7 );
  LUMEK_LOG( "LogTest", ZOL::LogInfo, "not shown" );
  const std::string Text = testing::internal::GetCapturedStderr();
  ZOL::GlobalLog().SetStandardErrorLevel( StandardErrorLevel );
  EXPECT_EQ( "[LogTest:3] Bad atom size 7\n", Text );
}

TEST( Log, RecordCarriesCategorySourceAndLine )
{
  LumekTest::VLogCapture Capture( "", ZOL::LogDetail );
  const int Line = __LINE__ + 1;
  LUMEK_LOG( "MovIO", ZOL::LogWarning, "Bad atom size %d at %d", 7, 1024 );
  ASSERT_EQ( 1u, Capture.Records.size() );
  const ZOL::ILogRecord& rRecord = Capture.Records[0];
  EXPECT_EQ( "Bad atom size 7 at 1024", rRecord.Message );
  EXPECT_EQ( "MovIO", rRecord.Category );
  EXPECT_EQ( Line, rRecord.Line );
  EXPECT_NE( std::string::npos, rRecord.SourceFile.find( "LogTest.cpp" ) );
}

TEST( Log, ValuesPrintByTheirOwnType )
{
  LumekTest::VLogCapture Capture( "", ZOL::LogDetail );
  LUMEK_LOG( "LogTest", ZOL::LogInfo, "%s|%s|%d|%s", 42, 2.5, std::string( "text" ), std::uint64_t( 1 ) << 40 );
  ASSERT_EQ( 1u, Capture.Records.size() );
  EXPECT_EQ( "42|2.5|text|1099511627776", Capture.Records[0].Message );
}

struct VBadFormatCase
{
  const char* Name;
  const char* Format;
  int Level;
};

class LogBadFormatTest : public testing::TestWithParam< VBadFormatCase >
{
};

TEST_P( LogBadFormatTest, UnformattableMessageIsLoggedRawAsAFailure )
{
  LumekTest::VLogCapture Capture( "", ZOL::LogDetail );
  LUMEK_LOG( "LogTest", GetParam().Level, GetParam().Format, 1 );
  ASSERT_EQ( 1u, Capture.Records.size() );
  EXPECT_EQ( std::string( "Cannot Format Log Message \"" ) + GetParam().Format + "\"", Capture.Records[0].Message );
  EXPECT_EQ( ZOL::LogFailure, Capture.Records[0].Level );
  EXPECT_EQ( "LogTest", Capture.Records[0].Category );
}

INSTANTIATE_TEST_SUITE_P( Formats, LogBadFormatTest,
                          testing::Values( VBadFormatCase{ "TooFewArguments", "%d and %d", ZOL::LogInfo },
                                           VBadFormatCase{ "TooManyArguments", "no placeholder", ZOL::LogDetail },
                                           VBadFormatCase{ "BrokenDirective", "%1% then %", ZOL::LogWarning },
                                           VBadFormatCase{ "PercentSignsInRawText", "100%% %q %", ZOL::LogFailure } ),
                          LumekTest::VCaseName() );
