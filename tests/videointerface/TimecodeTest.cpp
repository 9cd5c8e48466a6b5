#include "videointerface/ITimecode.h"

#include "tests/support/TestNames.h"
#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

#include <random>

using namespace ZOL;

namespace
{
  ITimecode Label( std::uint32_t i_Standard, int i_H, int i_M, int i_S, int i_F, std::uint32_t i_Remainder = 0 )
  {
    ITimecode Timecode;
    Timecode.Standards = i_Standard;
    Timecode.Hours = static_cast< std::uint8_t >( i_H );
    Timecode.Minutes = static_cast< std::uint8_t >( i_M );
    Timecode.Seconds = static_cast< std::uint8_t >( i_S );
    Timecode.Frames = static_cast< std::uint8_t >( i_F );
    Timecode.TickRemainder = i_Remainder;
    return Timecode;
  }

  std::uint32_t FramesPerSecond( std::uint32_t i_Standard )
  {
    static const std::uint32_t s_Counted[] = { 24, 24, 25, 30, 30, 30 };
    return s_Counted[i_Standard];
  }

  // A second, independent way to count labels: step one frame at a time, as a timecode
  // generator does, skipping labels 0 and 1 at each minute but every tenth under drop frame.
  void Step( ITimecode& io_rLabel )
  {
    const std::uint32_t Counted = FramesPerSecond( io_rLabel.Standards );
    if( ++io_rLabel.Frames < Counted )
      return;
    io_rLabel.Frames = 0;
    if( ++io_rLabel.Seconds == 60 )
    {
      io_rLabel.Seconds = 0;
      if( ++io_rLabel.Minutes == 60 )
      {
        io_rLabel.Minutes = 0;
        if( ++io_rLabel.Hours == 24 )
        {
          io_rLabel.Hours = 0;
          ++io_rLabel.Days;
        }
      }
      if( io_rLabel.Standards == TimecodeStandard_29_97_DF && io_rLabel.Minutes % 10 != 0 )
        io_rLabel.Frames = 2;
    }
  }

  std::string Text( const ITimecode& i_rTimecode )
  {
    return i_rTimecode.ToText( 0, false, false );
  }
} // namespace

TEST( TimecodeTicks, MinusOneTickIsTheLastTickOfThePreviousDay )
{
  ITimecode Timecode = Label( TimecodeStandard_30, 0, 0, 0, 0 );
  ASSERT_TRUE( Timecode.SetFromTicks( -1 ) );
  EXPECT_EQ( -1, Timecode.Days );
  EXPECT_EQ( "23:59:59:29", Text( Timecode ) );
  EXPECT_EQ( 4499999u, Timecode.TickRemainder );
}

TEST( TimecodeTicks, DropFrameLabelAfterTheFirstMinute )
{
  ITimecode Timecode = Label( TimecodeStandard_29_97_DF, 0, 0, 0, 0 );
  ASSERT_TRUE( Timecode.SetFromTicks( 1800ll * 4504500 ) );
  EXPECT_EQ( "00:01:00;02", Text( Timecode ) );
}

TEST( TimecodeTicks, UnknownStandardChangesNothing )
{
  ITimecode Timecode;
  Timecode.Hours = 5;
  EXPECT_FALSE( Timecode.SetFromTicks( 123456789 ) );
  EXPECT_EQ( 5, Timecode.Hours );
  EXPECT_EQ( 0u, Timecode.GetTicksPerFrame() );
  EXPECT_EQ( 0u, Timecode.GetTicksPerDay() );
  Timecode.AddTicks( 4500000 );
  EXPECT_EQ( 5, Timecode.Hours );
  EXPECT_EQ( "", Timecode.ToText( 4, true, true ) );
}

class TimecodeStandardTest : public testing::TestWithParam< std::uint32_t >
{
};

TEST_P( TimecodeStandardTest, TicksToLabelMatchesFrameByFrameCounting )
{
  // Covers a whole day and a little more, where the day wraps and Days counts up. Every frame is
  // compared over the first eleven minutes (a whole drop-frame cycle) and around the wrap; in
  // between, the frames either side of each second's carry, where a label goes wrong first.
  ITimecode Counted = Label( GetParam(), 0, 0, 0, 0 );
  const std::uint64_t Period = Counted.GetTicksPerFrame();
  const std::uint64_t FramesPerDay = Counted.GetTicksPerDay() / Period;
  const std::uint64_t Dense = 11 * 60 * 30;
  const std::uint32_t LastLabel = FramesPerSecond( GetParam() ) - 1;
  for( std::uint64_t Frame = 0; Frame < FramesPerDay + 40000; Step( Counted ), ++Frame )
  {
    if( Frame >= Dense && Frame + Dense < FramesPerDay && Counted.Frames > 2 && Counted.Frames != LastLabel )
      continue;
    ITimecode FromTicks = Label( GetParam(), 0, 0, 0, 0 );
    ASSERT_TRUE( FromTicks.SetFromTicks( static_cast< std::int64_t >( Frame * Period + Period / 2 ) ) );
    Counted.TickRemainder = static_cast< std::uint32_t >( Period / 2 );
    ASSERT_EQ( Counted, FromTicks ) << "frame " << Frame << ": " << Text( Counted ) << " against " << Text( FromTicks );
    ASSERT_TRUE( FromTicks.IsValid() );
  }
}

TEST_P( TimecodeStandardTest, AddTicksIsTheInverseOfSetFromTicks )
{
  std::mt19937_64 Random( 17 + GetParam() );
  const ITimecode Zero = Label( GetParam(), 0, 0, 0, 0 );
  const std::int64_t Day = static_cast< std::int64_t >( Zero.GetTicksPerDay() );
  std::uniform_int_distribution< std::int64_t > Ticks( -40 * Day, 40 * Day );
  for( int i = 0; i < 20000; ++i )
  {
    const std::int64_t T = Ticks( Random );
    const std::int64_t Step = Ticks( Random ) / 7;
    ITimecode Direct = Zero;
    Direct.UserBits = 0xCAFEF00D;
    ASSERT_TRUE( Direct.SetFromTicks( T + Step ) );
    ITimecode Moved = Zero;
    Moved.UserBits = 0xCAFEF00D;
    ASSERT_TRUE( Moved.SetFromTicks( T ) );
    Moved.AddTicks( Step );
    ASSERT_EQ( Direct, Moved ) << T << " + " << Step;
  }
}

TEST_P( TimecodeStandardTest, OneFramePeriodStepsToTheNextLabel )
{
  ITimecode Moved = Label( GetParam(), 23, 59, 59, FramesPerSecond( GetParam() ) - 1, 12 );
  Moved.Days = 4;
  Moved.UserBits = 0x01020304;
  ITimecode Counted = Moved;
  for( int i = 0; i < 5000; ++i )
  {
    Moved.AddTicks( static_cast< std::int64_t >( Moved.GetTicksPerFrame() ) );
    Step( Counted );
    ASSERT_EQ( Counted, Moved ) << i;
  }
  for( int i = 0; i < 5000; ++i )
    Moved.AddTicks( -static_cast< std::int64_t >( Moved.GetTicksPerFrame() ) );
  EXPECT_EQ( "23:59:59", Text( Moved ).substr( 0, 8 ) );
  EXPECT_EQ( 4, Moved.Days );
  EXPECT_EQ( 0x01020304u, Moved.UserBits );
}

std::string StandardName( const testing::TestParamInfo< std::uint32_t >& i_rInfo )
{
  static const char* const s_Names[] = { "Film24", "Film23_98", "Pal25", "True30", "Ntsc29_97", "DropFrame29_97" };
  return s_Names[i_rInfo.param];
}

INSTANTIATE_TEST_SUITE_P( Standards, TimecodeStandardTest, testing::Range( 0u, 6u ), StandardName );

struct VValidCase
{
  const char* Name;
  ITimecode Timecode;
  bool Valid;
};

class TimecodeValidTest : public testing::TestWithParam< VValidCase >
{
};

TEST_P( TimecodeValidTest, RangesAndDroppedLabels )
{
  EXPECT_EQ( GetParam().Valid, GetParam().Timecode.IsValid() );
}

INSTANTIATE_TEST_SUITE_P( Records, TimecodeValidTest,
                          testing::Values( VValidCase{ "DroppedLabelAtMinuteOne", Label( 5, 0, 1, 0, 0 ), false },
                                           VValidCase{ "DroppedLabelOneAtMinuteOne", Label( 5, 0, 1, 0, 1 ), false },
                                           VValidCase{ "FirstLabelAtMinuteOne", Label( 5, 0, 1, 0, 2 ), true },
                                           VValidCase{ "TenthMinuteKeepsLabelZero", Label( 5, 0, 10, 0, 0 ), true },
                                           VValidCase{ "NonDropKeepsLabelZero", Label( 4, 0, 1, 0, 0 ), true },
                                           VValidCase{ "Frame24AtFilm", Label( 0, 0, 0, 0, 24 ), false },
                                           VValidCase{ "Frame24AtPal", Label( 2, 0, 0, 0, 24 ), true },
                                           VValidCase{ "Hour24", Label( 3, 24, 0, 0, 0 ), false },
                                           VValidCase{ "Minute60", Label( 3, 0, 60, 0, 0 ), false },
                                           VValidCase{ "Second60", Label( 3, 0, 0, 60, 0 ), false },
                                           VValidCase{ "RemainderOfAWholeFrame", Label( 3, 0, 0, 0, 0, 4500000 ),
                                                       false },
                                           VValidCase{ "LastTick", Label( 1, 23, 59, 59, 23, 5630624 ), true },
                                           VValidCase{ "NoStandard", Label( 0xFFFFFFFFu, 0, 0, 0, 0 ), false },
                                           VValidCase{ "StandardSix", Label( 6, 0, 0, 0, 0 ), false } ),
                          LumekTest::VCaseName() );

struct VTextCase
{
  const char* Name;
  ITimecode Timecode;
  int Style;
  bool WithStandard;
  bool SubFrameMark;
  const char* Text;
};

class TimecodeTextTest : public testing::TestWithParam< VTextCase >
{
};

TEST_P( TimecodeTextTest, Golden )
{
  EXPECT_EQ( GetParam().Text,
             GetParam().Timecode.ToText( GetParam().Style, GetParam().WithStandard, GetParam().SubFrameMark ) );
}

ITimecode WithSubFrame( ITimecode i_Timecode, std::uint32_t i_SubFramePeriod )
{
  i_Timecode.SubFramePeriod = i_SubFramePeriod;
  return i_Timecode;
}

INSTANTIATE_TEST_SUITE_P(
    Styles, TimecodeTextTest,
    testing::Values(
        VTextCase{ "Plain", Label( 3, 1, 2, 3, 4 ), 0, false, false, "01:02:03:04" },
        VTextCase{ "DropFrameSeparator", Label( 5, 0, 10, 0, 0 ), 0, false, false, "00:10:00;00" },
        VTextCase{ "WithStandard", Label( 1, 23, 59, 59, 23 ), 0, true, false, "23:59:59:23 [23.98 fps]" },
        VTextCase{ "MarkInFirstHalf", Label( 3, 0, 0, 0, 1, 2249999 ), 0, false, true, "00:00:00.01" },
        VTextCase{ "NoMarkFromHalfWay", Label( 3, 0, 0, 0, 1, 2250000 ), 0, false, true, "00:00:00:01" },
        VTextCase{ "DropFrameMark", Label( 5, 0, 0, 0, 1, 0 ), 0, false, true, "00:00:00,01" },
        VTextCase{ "SubFrameNumber", WithSubFrame( Label( 3, 0, 0, 0, 1, 3375000 ), 1125000 ), 1, false, false,
                   "00:00:00:01 (3)" },
        VTextCase{ "SubFrameNeedsWholeMultiple", WithSubFrame( Label( 3, 0, 0, 0, 1, 3375000 ), 1000001 ), 1, false,
                   false, "00:00:00:01" },
        VTextCase{ "SubFrameUnknown", Label( 3, 0, 0, 0, 1, 3375000 ), 1, false, false, "00:00:00:01" },
        VTextCase{ "WideSubFramePadsTheOpeningText", WithSubFrame( Label( 3, 0, 0, 0, 1, 45000 ), 4500 ), 1, false,
                   false, "00:00:00:010 (10)" },
        VTextCase{ "TwoDigitSubFrameNoPadding", WithSubFrame( Label( 3, 0, 0, 0, 1, 450000 ), 45000 ), 1, false, false,
                   "00:00:00:01 (10)" },
        VTextCase{ "Fraction", Label( 2, 0, 0, 0, 0, 1350000 ), 2, false, false, "00:00:00:00+0.25" },
        VTextCase{ "Remainder", Label( 2, 0, 0, 0, 0, 1350000 ), 3, false, false, "00:00:00:00r1350000" },
        VTextCase{ "PercentPadded", Label( 3, 0, 0, 0, 0, 45000 ), 4, true, false, "00:00:00:00+01 [30 fps]" },
        VTextCase{ "PercentTruncated", Label( 3, 0, 0, 0, 0, 4499999 ), 4, false, false, "00:00:00:00+99" },
        VTextCase{ "SubFrameAndRest", WithSubFrame( Label( 3, 0, 0, 0, 0, 1125007 ), 1125000 ), 5, false, false,
                   "00:00:00:00 (1)r7" },
        VTextCase{ "SubFrameWithoutRest", WithSubFrame( Label( 3, 0, 0, 0, 0, 2250000 ), 1125000 ), 5, false, false,
                   "00:00:00:00 (2)" },
        VTextCase{ "UnknownStyle", Label( 3, 0, 0, 0, 0, 2250000 ), 9, true, false, "00:00:00:00 [30 fps]" },
        VTextCase{ "InvalidIsEmpty", Label( 5, 0, 1, 0, 0 ), 4, true, false, "" } ),
    LumekTest::VCaseName() );

TEST( TimecodeText, StandardTexts )
{
  EXPECT_EQ( "29.97 fps DF", ITimecode::GetStandardText( 5, false ) );
  EXPECT_EQ( "25 fps timecode (Sometimes referred to as 'PAL')", ITimecode::GetStandardText( 2, true ) );
  EXPECT_EQ( "", ITimecode::GetStandardText( 6, false ) );
  EXPECT_EQ( "", ITimecode::GetStandardText( 0xFFFFFFFFu, true ) );
}

// ---------------------------------------------------------------------------------------------
// The status line's timecode of one frame.

struct VFrameTextCase
{
  const char* Name;
  ITimecode Start;
  IVideoTiming Timing;
  std::uint64_t Frame;
  const char* Text;
};

class FrameTimecodeTest : public testing::TestWithParam< VFrameTextCase >
{
};

TEST_P( FrameTimecodeTest, Golden )
{
  EXPECT_EQ( GetParam().Text, GetFrameTimecodeText( GetParam().Start, GetParam().Timing, GetParam().Frame ) );
}

ITimecode WithDays( ITimecode i_Timecode, std::int32_t i_Days )
{
  i_Timecode.Days = i_Days;
  return i_Timecode;
}

INSTANTIATE_TEST_SUITE_P(
    Rates, FrameTimecodeTest,
    testing::Values(
        VFrameTextCase{
            "Rate120CountsAsThirty", Label( 2, 1, 0, 0, 0 ), { 135000000, 1125000, 0 }, 1, "01:00:00:00+25 [30 fps]" },
        VFrameTextCase{
            "Rate120FifthFrame", Label( 3, 1, 0, 0, 0 ), { 135000000, 1125000, 0 }, 5, "01:00:00:01+25 [30 fps]" },
        VFrameTextCase{ "Rate25", Label( 3, 0, 0, 0, 0 ), { 25, 1, 0 }, 26, "00:00:01:01+00 [25 fps]" },
        VFrameTextCase{ "Rate24", Label( 3, 0, 0, 0, 0 ), { 24, 1, 0 }, 24, "00:00:01:00+00 [24 fps]" },
        VFrameTextCase{
            "Rate23_98", Label( 3, 0, 0, 0, 0 ), { 135000000, 5630625, 0 }, 25, "00:00:01:01+00 [23.98 fps]" },
        VFrameTextCase{
            "Rate59_94", Label( 3, 0, 0, 0, 0 ), { 135000000, 2252250, 0 }, 3, "00:00:00:01+50 [29.97 fps]" },
        VFrameTextCase{ "DropFrameFileShowsNonDrop",
                        Label( 5, 0, 0, 59, 29 ),
                        { 30000, 1001, 0 },
                        1,
                        "00:01:00:00+00 [29.97 fps]" },
        VFrameTextCase{
            "Rate7HasNoPerFrameTimecode", Label( 2, 0, 0, 0, 3 ), { 7, 1, 0 }, 1000, "00:00:00:03+00 [25 fps]" },
        VFrameTextCase{
            "OddRateKeepsTheFilesStandard", Label( 5, 0, 10, 0, 0 ), { 7, 1, 0 }, 5, "00:10:00;00+00 [29.97 fps DF]" },
        VFrameTextCase{ "NoRateShowsTheStart", Label( 4, 0, 0, 0, 3 ), { 0, 1, 0 }, 5, "00:00:00:03+00 [29.97 fps]" },
        VFrameTextCase{
            "ZeroPeriodCountsAsThirtyAndStands", Label( 2, 0, 0, 0, 3 ), { 25, 0, 0 }, 5, "00:00:00:03+00 [30 fps]" },
        VFrameTextCase{
            "NoTimecodeStartsAtZero", Label( 0xFFFFFFFFu, 0, 0, 0, 0 ), { 30, 1, 0 }, 31, "00:00:01:01+00 [30 fps]" },
        VFrameTextCase{ "PeriodBeyondADayWraps",
                        Label( 3, 0, 0, 0, 0 ),
                        { 1, 0xFFFFFFFFu, 0 },
                        0xFFFFFFFFFFFFFFFFull,
                        "10:03:45:00+00 [30 fps]" },
        VFrameTextCase{ "HugeDaysDoNotOverflow",
                        WithDays( Label( 3, 23, 59, 59, 29 ), 0x7FFFFFFF ),
                        { 30, 1, 0 },
                        0xFFFFFFFFFFFFFFFFull,
                        "09:02:00:14+00 [30 fps]" } ),
    LumekTest::VCaseName() );

TEST( FrameTimecode, LargeIndicesStayConsistentWithStepping )
{
  // Frame N's text is the start moved N periods; check against repeated one-period steps far
  // from zero, where a 64-bit product would have overflowed.
  const IVideoTiming Timing{ 120, 1, 0 };
  ITimecode Start = Label( 3, 10, 0, 0, 0 );
  const std::uint64_t Base = 1ull << 40;
  ITimecode Stepped = Start;
  Stepped.SubFramePeriod = 1125000;
  Stepped.AddTicks( static_cast< std::int64_t >( Base ) * 1125000 );
  for( std::uint64_t i = 0; i < 500; ++i )
  {
    EXPECT_EQ( Stepped.ToText( 4, true, false ), GetFrameTimecodeText( Start, Timing, Base + i ) ) << i;
    Stepped.AddTicks( 1125000 );
  }
}
