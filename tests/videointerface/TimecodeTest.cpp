#include "videointerface/ITimecode.h"

#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

using namespace ZOL;

namespace
{
  ITimecode Label( std::uint32_t i_Standard, int i_H, int i_M, int i_S, int i_F, std::uint32_t i_Remainder = 0,
                   std::uint32_t i_SubFramePeriod = 0 )
  {
    return { i_Standard, std::uint8_t( i_H ), std::uint8_t( i_M ), std::uint8_t( i_S ), std::uint8_t( i_F ), 0,
             0,          i_Remainder,         i_SubFramePeriod };
  }
} // namespace

// Labels at the carries, where counting goes wrong first, by hand: drop frame skips labels 0 and 1
// at every minute but each tenth, and a day wraps into Days either way. Moved back by the same
// ticks, every label counts back to the start: AddTicks turns labels into ticks again.
TEST( TimecodeTicks, LabelsAtTheCarriesAndBackAgain )
{
  constexpr std::uint32_t DF = TimecodeStandard_29_97_DF;
  const struct
  {
    std::uint32_t Standard;
    std::int64_t Frame;
    const char* Text;
    std::int32_t Days;
  } Cases[] = { { DF, 1799, "00:00:59;29", 0 },
                { DF, 1800, "00:01:00;02", 0 },
                { DF, 17981, "00:09:59;29", 0 },
                { DF, 17982, "00:10:00;00", 0 },
                { DF, 19782, "00:11:00;02", 0 },
                { DF, 2589407, "23:59:59;29", 0 },
                { DF, 2589408 * 3 + 1800, "00:01:00;02", 3 },
                { DF, -1, "23:59:59;29", -1 },
                { TimecodeStandard_30, -1, "23:59:59:29", -1 },
                { TimecodeStandard_25, 25 * 86400 * 2 + 26, "00:00:01:01", 2 } };
  EXPECT_EQ( 2589408ull * 4504500, Label( DF, 0, 0, 0, 0 ).GetTicksPerDay() ) << "drop frame skips 2592 labels a day";
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( std::to_string( rCase.Standard ) + ", frame " + std::to_string( rCase.Frame ) );
    ITimecode Timecode = Label( rCase.Standard, 0, 0, 0, 0 );
    const std::int64_t Ticks = rCase.Frame * static_cast< std::int64_t >( Timecode.GetTicksPerFrame() ) + 7;
    ASSERT_TRUE( Timecode.SetFromTicks( Ticks ) );
    EXPECT_EQ( rCase.Text, Timecode.ToText( 0, false, false ) );
    EXPECT_EQ( rCase.Days, Timecode.Days );
    EXPECT_EQ( 7u, Timecode.TickRemainder );
    Timecode.AddTicks( -Ticks );
    EXPECT_EQ( Label( rCase.Standard, 0, 0, 0, 0 ), Timecode );
  }

  ITimecode Unknown;
  Unknown.Hours = 5;
  EXPECT_FALSE( Unknown.SetFromTicks( 123456789 ) );
  EXPECT_EQ( 0u, Unknown.GetTicksPerFrame() + Unknown.GetTicksPerDay() );
  Unknown.AddTicks( 4500000 );
  EXPECT_EQ( 5, Unknown.Hours );
  EXPECT_EQ( "", Unknown.ToText( 4, true, true ) );
}

TEST( TimecodeText, GoldenAndNoneOutOfRange )
{
  const struct
  {
    ITimecode Timecode;
    int Style;
    bool bWithStandard, bSubFrameMark;
    const char* Text;
  } Cases[] = { { Label( 3, 1, 2, 3, 4 ), 0, false, false, "01:02:03:04" },
                { Label( 5, 0, 10, 0, 0 ), 0, false, false, "00:10:00;00" },
                { Label( 1, 23, 59, 59, 23 ), 0, true, false, "23:59:59:23 [23.98 fps]" },
                { Label( 3, 0, 0, 0, 1, 2249999 ), 0, false, true, "00:00:00.01" }, // a mark in the first half
                { Label( 3, 0, 0, 0, 1, 2250000 ), 0, false, true, "00:00:00:01" }, // none from half way
                { Label( 5, 0, 0, 0, 1, 0 ), 0, false, true, "00:00:00,01" },
                { Label( 3, 0, 0, 0, 1, 3375000, 1125000 ), 1, false, false, "00:00:00:01 (3)" },
                { Label( 3, 0, 0, 0, 1, 3375000, 1000001 ), 1, false, false, "00:00:00:01" },  // not a whole multiple
                { Label( 3, 0, 0, 0, 1, 3375000 ), 1, false, false, "00:00:00:01" },           // sub-frame unknown
                { Label( 3, 0, 0, 0, 1, 45000, 4500 ), 1, false, false, "00:00:00:010 (10)" }, // wide pads the opening
                { Label( 2, 0, 0, 0, 0, 1350000 ), 2, false, false, "00:00:00:00+0.25" },
                { Label( 2, 0, 0, 0, 0, 1350000 ), 3, false, false, "00:00:00:00r1350000" },
                { Label( 3, 0, 0, 0, 0, 45000 ), 4, true, false, "00:00:00:00+01 [30 fps]" },
                { Label( 3, 0, 0, 0, 0, 4499999 ), 4, false, false, "00:00:00:00+99" }, // truncated
                { Label( 3, 0, 0, 0, 0, 1125007, 1125000 ), 5, false, false, "00:00:00:00 (1)r7" },
                { Label( 3, 0, 0, 0, 0, 2250000, 1125000 ), 5, false, false, "00:00:00:00 (2)" },
                { Label( 3, 0, 0, 0, 0, 2250000 ), 9, true, false, "00:00:00:00 [30 fps]" }, // unknown style
                { Label( 1, 23, 59, 59, 23, 5630624 ), 0, false, false, "23:59:59:23" },     // the last tick
                { Label( 4, 0, 1, 0, 0 ), 0, false, false, "00:01:00:00" },                  // not drop frame
                // Labels out of range have no text: a dropped label, frame 24 at film, hour 24, minute
                // 60, second 60, a remainder of a whole frame, standard 6.
                { Label( 5, 0, 1, 0, 0 ), 4, true, false, "" },
                { Label( 0, 0, 0, 0, 24 ), 0, false, false, "" },
                { Label( 3, 24, 0, 0, 0 ), 0, false, false, "" },
                { Label( 3, 0, 60, 0, 0 ), 0, false, false, "" },
                { Label( 3, 0, 0, 60, 0 ), 0, false, false, "" },
                { Label( 3, 0, 0, 0, 0, 4500000 ), 0, false, false, "" },
                { Label( 6, 0, 0, 0, 0 ), 0, false, false, "" } };
  for( const auto& rCase : Cases )
    EXPECT_EQ( rCase.Text, rCase.Timecode.ToText( rCase.Style, rCase.bWithStandard, rCase.bSubFrameMark ) )
        << rCase.Text;
  EXPECT_EQ( "29.97 fps DF", ITimecode::GetStandardText( 5, false ) );
  EXPECT_EQ( "25 fps timecode (Sometimes referred to as 'PAL')", ITimecode::GetStandardText( 2, true ) );
  EXPECT_EQ( "", ITimecode::GetStandardText( 6, false ) );
  EXPECT_EQ( "", ITimecode::GetStandardText( 0xFFFFFFFFu, true ) );
}

// The status line's timecode of one frame.
TEST( FrameTimecode, Golden )
{
  ITimecode HugeDays = Label( 3, 23, 59, 59, 29 );
  HugeDays.Days = 0x7FFFFFFF;
  const std::uint64_t Last = 0xFFFFFFFFFFFFFFFFull;
  const struct
  {
    const char* Name;
    ITimecode Start;
    IVideoTiming Timing;
    std::uint64_t Frame;
    const char* Text;
  } Cases[] = {
      { "rate 120 counts as thirty", Label( 2, 1, 0, 0, 0 ), { 135000000, 1125000, 0 }, 1, "01:00:00:00+25 [30 fps]" },
      { "rate 25", Label( 3, 0, 0, 0, 0 ), { 25, 1, 0 }, 26, "00:00:01:01+00 [25 fps]" },
      { "rate 23.98", Label( 3, 0, 0, 0, 0 ), { 135000000, 5630625, 0 }, 25, "00:00:01:01+00 [23.98 fps]" },
      { "rate 59.94", Label( 3, 0, 0, 0, 0 ), { 135000000, 2252250, 0 }, 3, "00:00:00:01+50 [29.97 fps]" },
      { "drop frame shows non-drop", Label( 5, 0, 0, 59, 29 ), { 30000, 1001, 0 }, 1, "00:01:00:00+00 [29.97 fps]" },
      { "rate 7 has no timecode per frame", Label( 2, 0, 0, 0, 3 ), { 7, 1, 0 }, 1000, "00:00:00:03+00 [25 fps]" },
      { "odd rate keeps the standard", Label( 5, 0, 10, 0, 0 ), { 7, 1, 0 }, 5, "00:10:00;00+00 [29.97 fps DF]" },
      { "no rate shows the start", Label( 4, 0, 0, 0, 3 ), { 0, 1, 0 }, 5, "00:00:00:03+00 [29.97 fps]" },
      { "zero period: thirty, standing", Label( 2, 0, 0, 0, 3 ), { 25, 0, 0 }, 5, "00:00:00:03+00 [30 fps]" },
      { "no timecode starts at zero", Label( 0xFFFFFFFFu, 0, 0, 0, 0 ), { 30, 1, 0 }, 31, "00:00:01:01+00 [30 fps]" },
      { "a period beyond a day wraps", Label( 3, 0, 0, 0, 0 ), { 1, 0xFFFFFFFFu, 0 }, Last, "10:03:45:00+00 [30 fps]" },
      { "huge days do not overflow", HugeDays, { 30, 1, 0 }, Last, "09:02:00:14+00 [30 fps]" } };
  for( const auto& rCase : Cases )
    EXPECT_EQ( rCase.Text, GetFrameTimecodeText( rCase.Start, rCase.Timing, rCase.Frame ) ) << rCase.Name;
}
