#pragma once

// The track records of the MOV reader and the checks that apply to every track.

#include <cstdint>
#include <vector>

namespace MovIO
{
  // Every time in this reader is counted at this rate: it is a whole multiple of the time
  // scales that video files use (600, 1000, 24000, 30000, 90000, ...).
  constexpr std::uint32_t MovTicksPerSecond = 1080000000u;
  constexpr std::uint32_t NoIndex = 0xFFFFFFFFu;

  struct VMovChunk
  {
    std::uint64_t Offset = 0;
    std::uint32_t FirstSample = 0;
    std::uint32_t EndSample = 0;
    std::uint32_t SampleCount = 0;
  };

  struct VMovFrame
  {
    std::uint32_t Size = 0;
    std::uint64_t Offset = 0;
    std::uint32_t AudioFirstSample = NoIndex;
    std::uint32_t AudioSampleCount = 0;
    std::uint32_t AudioChunk = NoIndex;
  };

  struct VMovTrack
  {
    explicit VMovTrack( const char* i_pName ) : Name( i_pName ) {}

    const char* const Name;
    std::uint32_t TrackId = 0;
    std::uint32_t FileDuration = 0;
    std::uint32_t Timescale = 0;
    std::uint32_t Duration = 0;
    std::uint32_t SampleDuration = 0;
    std::uint32_t SampleCount = 0;
    std::vector< VMovChunk > Chunks;

    void Reset();
  };

  // False for a track without samples or chunks; timing mismatches are only logged.
  [[nodiscard]] bool CheckTrack( const VMovTrack& i_rTrack, std::uint32_t i_FileTimescale );

  // The duration of one sample in 1080 MHz ticks. A time scale that does not divide the clock
  // is logged each time, and the period is truncated. 0 for a time scale of 0.
  std::uint64_t GetTrackPeriod( const VMovTrack& i_rTrack );
} // namespace MovIO
