#include "services/Log.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <ostream>

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

// What no sink listens to is never formatted; what is, formats each value by its own type whatever
// the directive says, and the record says where it was written.
TEST( Log, FormatsOnlyWhatTheLevelLetsThroughEachValueByItsOwnType )
{
  LumekTest::VLogCapture Capture( "", ZOL::LogInfo );
  LUMEK_LOG( "MovIO", ZOL::LogInfoDetail, "%s", VCountingValue{ 1 } );
  EXPECT_EQ( 0, s_Formatted );
  const int Line = __LINE__ + 1;
  LUMEK_LOG( "MovIO", ZOL::LogInfo, "%s|%s|%s|%d|%s", VCountingValue{ 2 }, 42, 2.5, std::string( "text" ),
             std::uint64_t( 1 ) << 40 );
  EXPECT_EQ( 1, s_Formatted );
  ASSERT_EQ( 1u, Capture.Records.size() );
  const ZOL::ILogRecord& rRecord = Capture.Records[0];
  EXPECT_EQ( "<2>|42|2.5|text|1099511627776", rRecord.Message );
  EXPECT_EQ( ZOL::LogInfo, rRecord.Level );
  EXPECT_EQ( "MovIO", rRecord.Category );
  EXPECT_EQ( Line, rRecord.Line );
  EXPECT_NE( std::string::npos, rRecord.SourceFile.find( "LogTest.cpp" ) );
}

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

// Too few arguments, too many, a broken directive, percent signs in the raw text: whatever the
// level asked for, the raw text goes out as a failure.
TEST( Log, UnformattableMessageIsLoggedRawAsAFailure )
{
  const char* const Formats[] = { "%d and %d", "no placeholder", "%1% then %", "100%% %q %" };
  for( int Level = ZOL::LogFailure; Level < ZOL::LogFailure + 4; ++Level )
  {
    const char* pFormat = Formats[Level - ZOL::LogFailure];
    SCOPED_TRACE( pFormat );
    LumekTest::VLogCapture Capture( "", ZOL::LogDetail );
    LUMEK_LOG( "LogTest", Level, pFormat, 1 );
    ASSERT_EQ( 1u, Capture.Records.size() );
    EXPECT_EQ( std::string( "Cannot Format Log Message \"" ) + pFormat + "\"", Capture.Records[0].Message );
    EXPECT_EQ( ZOL::LogFailure, Capture.Records[0].Level );
  }
}
