#include "app/Playback/VPlayBackManager.h"

#include "app/VideoSource/VVideoSource.h"

#include <chrono>
#include <cmath>

namespace LumekVideoViewer
{
  VPlayBackManager::VPlayBackManager( VVideoSource* i_pSource, QObject* i_pParent )
      : VPlayBackManager( i_pSource, &VPlayBackManager::MonotonicMilliseconds, i_pParent )
  {
  }

  VPlayBackManager::VPlayBackManager( VVideoSource* i_pSource, TimeSource i_TimeSource, QObject* i_pParent )
      : QObject( i_pParent ), m_pSource( i_pSource ), m_pTimer( new QTimer( this ) ),
        m_TimeSource( std::move( i_TimeSource ) )
  {
    connect( m_pTimer, &QTimer::timeout, this, &VPlayBackManager::PlayForward );
    connect( this, &VPlayBackManager::End, this, &VPlayBackManager::Restart );
  }

  double VPlayBackManager::MonotonicMilliseconds()
  {
    using namespace std::chrono;
    return duration< double, std::milli >( steady_clock::now().time_since_epoch() ).count();
  }

  void VPlayBackManager::Start()
  {
    m_pTimer->start( TimerIntervalMilliseconds );
    m_StartTime = m_TimeSource();
  }

  void VPlayBackManager::Pause()
  {
    m_pTimer->stop();
    m_AnchorFrame = m_CurrentFrame;
  }

  void VPlayBackManager::Stop()
  {
    m_pTimer->stop();
    // Listeners see the old position: the picture stays on the last frame shown.
    emit Stopped();
    m_CurrentFrame = 0;
    m_AnchorFrame = 0;
  }

  void VPlayBackManager::Reset()
  {
    m_CurrentFrame = 0;
    m_AnchorFrame = 0;
  }

  void VPlayBackManager::Restart()
  {
    m_CurrentFrame = 0;
    m_AnchorFrame = 0;
    m_pTimer->start( TimerIntervalMilliseconds );
    m_StartTime = m_TimeSource();
  }

  void VPlayBackManager::PlayForward()
  {
    m_Now = m_TimeSource();
    const double FrameRate = m_pSource->GetFrameRate();
    double Target = static_cast< double >( m_AnchorFrame ) + FrameRate * ( m_Now - m_StartTime ) * 0.001;

    // Rounds half a frame ahead of the clock; exactly one half stays on the lower frame.
    double Whole = 0.0;
    const double Fraction = std::modf( Target, &Whole );
    Target = Fraction > 0.5 ? Whole + 1.0 : Whole;

    // Tested before a new frame is taken: the end shows one tick after the count is reached.
    if( m_CurrentFrame >= m_pSource->GetFrameCount() )
    {
      emit End();
      return;
    }

    if( !m_bDropFrames )
    {
      const double Limit = static_cast< double >( m_CurrentFrame ) + 1.0;
      if( Target >= Limit )
        Target = Limit;
    }

    const auto Frame = static_cast< std::int32_t >( Target );
    if( static_cast< std::uint64_t >( static_cast< std::int64_t >( Frame ) ) != m_CurrentFrame )
    {
      m_CurrentFrame = static_cast< std::uint64_t >( static_cast< std::int64_t >( Frame ) );
      emit FrameUpdated( Frame );
    }
  }

  void VPlayBackManager::PlayFrame( int i_Index )
  {
    const auto Index = static_cast< std::uint64_t >( static_cast< std::int64_t >( i_Index ) );
    if( Index != m_CurrentFrame )
    {
      m_CurrentFrame = Index;
      emit FrameUpdated( i_Index );
    }
    m_AnchorFrame = m_CurrentFrame;
  }

  void VPlayBackManager::Loop( bool i_bState )
  {
    if( i_bState )
    {
      disconnect( this, &VPlayBackManager::End, this, &VPlayBackManager::Stop );
      connect( this, &VPlayBackManager::End, this, &VPlayBackManager::Restart );
    }
    else
    {
      disconnect( this, &VPlayBackManager::End, this, &VPlayBackManager::Restart );
      connect( this, &VPlayBackManager::End, this, &VPlayBackManager::Stop );
    }
  }

  void VPlayBackManager::SetDropFrame( bool i_State )
  {
    m_bDropFrames = i_State;
  }

  bool VPlayBackManager::IsPlaying()
  {
    return m_pTimer->isActive();
  }
} // namespace LumekVideoViewer
