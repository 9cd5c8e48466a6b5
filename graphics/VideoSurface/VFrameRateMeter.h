#pragma once

#include <cstdint>
#include <functional>

namespace LumekVideoViewer
{
  // The rate at which frames arrive, over two buckets of about 400 ms, so that the value moves
  // smoothly and is recomputed at most every 401 ms however often it is asked for.
  class VFrameRateMeter
  {
  public:
    // Milliseconds of any monotonic clock.
    using VClock = std::function< std::int64_t() >;

    VFrameRateMeter();
    explicit VFrameRateMeter( VClock i_Clock );

    void CountFrame() { ++m_CurrentCount; }
    // Frames a second.
    double GetFrameRate();

  private:
    VClock m_Clock;
    std::int64_t m_CurrentCount = 0;
    std::int64_t m_PreviousCount = 0;
    std::int64_t m_CurrentStart = 0;
    std::int64_t m_PreviousStart = 0;
    std::int64_t m_LastQuery = 0;
    double m_LastValue = 0.0;
  };
} // namespace LumekVideoViewer
