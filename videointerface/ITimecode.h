#pragma once

// The timecode of a frame: a timecode label plus a remainder in ticks of a 135 MHz clock below
// one timecode frame, since capture runs faster than timecode counts.

#include <cstdint>
#include <string>

namespace ZOL
{
  constexpr std::uint32_t TimecodeTicksPerSecond = 135000000u;

  enum ETimecodeStandard : std::uint32_t
  {
    TimecodeStandard_24 = 0,
    TimecodeStandard_23_98 = 1,
    TimecodeStandard_25 = 2,
    TimecodeStandard_30 = 3,
    TimecodeStandard_29_97 = 4,
    TimecodeStandard_29_97_DF = 5,
    TimecodeStandard_None = 0xFFFFFFFFu,
  };

  struct ITimecode
  {
    std::uint32_t Standards = TimecodeStandard_None;
    std::uint8_t Hours = 0;
    std::uint8_t Minutes = 0;
    std::uint8_t Seconds = 0;
    std::uint8_t Frames = 0;
    std::uint32_t UserBits = 0;
    std::int32_t Days = 0;
    std::uint32_t TickRemainder = 0;
    std::uint32_t SubFramePeriod = 0;

    bool IsValid() const;
    // The standard's frame period in ticks; 0 for an unknown standard.
    std::uint64_t GetTicksPerFrame() const;
    std::uint64_t GetTicksPerDay() const;
    [[nodiscard]] bool SetFromTicks( std::int64_t i_Ticks );
    void AddTicks( std::int64_t i_Ticks );
    // HH:MM:SS:FF with the style's suffix; empty for an invalid record.
    std::string ToText( int i_Style, bool i_bWithStandard, bool i_bSubFrameMark ) const;

    static std::string GetStandardText( std::uint32_t i_Standard, bool i_bLong );

    bool operator==( const ITimecode& i_rOther ) const;
    bool operator!=( const ITimecode& i_rOther ) const { return !( *this == i_rOther ); }
  };

  struct IVideoTiming;

  // The text of the timecode of one frame, from the first frame's timecode and the timing: the
  // standard is chosen again from the frame rate, and a rate that does not divide the timecode
  // clock exactly shows the start timecode for every frame.
  std::string GetFrameTimecodeText( const ITimecode& i_rStart, const IVideoTiming& i_rTiming,
                                    std::uint64_t i_FrameIndex );
} // namespace ZOL
