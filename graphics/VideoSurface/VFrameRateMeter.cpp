#include "graphics/VideoSurface/VFrameRateMeter.h"

#include <chrono>

namespace LumekVideoViewer
{
  namespace
  {
    std::int64_t SteadyMilliseconds()
    {
      return std::chrono::duration_cast< std::chrono::milliseconds >(
                 std::chrono::steady_clock::now().time_since_epoch() )
          .count();
    }
  } // namespace

  VFrameRateMeter::VFrameRateMeter() : m_Clock( &SteadyMilliseconds ) {}

  VFrameRateMeter::VFrameRateMeter( VClock i_Clock ) : m_Clock( std::move( i_Clock ) ) {}

  double VFrameRateMeter::GetFrameRate()
  {
    const std::int64_t Now = m_Clock();
    if( Now - m_LastQuery < 401 )
      return m_LastValue;

    const std::int64_t Span = Now - m_PreviousStart;
    m_LastValue = Span > 0 ? double( m_PreviousCount + m_CurrentCount ) * 1000.0 / double( Span ) : 0.0;
    if( Now - m_CurrentStart > 400 )
    {
      m_PreviousCount = m_CurrentCount;
      m_CurrentCount = 0;
      m_PreviousStart = m_CurrentStart;
      m_CurrentStart = Now;
    }
    m_LastQuery = Now;
    return m_LastValue;
  }
} // namespace LumekVideoViewer
