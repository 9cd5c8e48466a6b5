#pragma once

#include <QObject>
#include <QTimer>

#include <cstdint>
#include <functional>

namespace LumekVideoViewer
{
  class VVideoSource;

  // The clock of the application: a 5 ms timer and a monotonic time source turned into the number
  // of the frame that is due. The target comes from the wall clock, never from the previous frame,
  // so a slow frame is skipped over (with drop frames on) instead of slowing playback down.
  class VPlayBackManager : public QObject
  {
    Q_OBJECT

  public:
    // Milliseconds of a monotonic clock.
    using TimeSource = std::function< double() >;

    static constexpr int TimerIntervalMilliseconds = 5;

    VPlayBackManager( VVideoSource* i_pSource, QObject* i_pParent = nullptr );
    // For tests: time comes from i_TimeSource instead of the steady clock.
    VPlayBackManager( VVideoSource* i_pSource, TimeSource i_TimeSource, QObject* i_pParent = nullptr );

    std::uint64_t GetCurrentFrame() const { return m_CurrentFrame; }
    bool GetDropFrame() const { return m_bDropFrames; }

    static double MonotonicMilliseconds();

  signals:
    void Stopped();
    void FrameUpdated( int i_FrameIndex );
    void End();

  public slots:
    void Start();
    void Pause();
    void Stop();
    void Reset();
    void Restart();
    void PlayForward();
    void PlayFrame( int i_Index );
    void Loop( bool i_bState );
    void SetDropFrame( bool i_State );
    bool IsPlaying();

  private:
    VVideoSource* m_pSource;
    std::uint64_t m_CurrentFrame = 0;
    std::uint64_t m_AnchorFrame = 0;
    double m_StartTime = 0.0;
    double m_Now = 0.0;
    bool m_bDropFrames = true;
    QTimer* m_pTimer;
    TimeSource m_TimeSource;
  };
} // namespace LumekVideoViewer
