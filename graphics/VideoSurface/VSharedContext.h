#pragma once

class QOpenGLContext;
class QSurface;

namespace VideoGraphics
{
  // Makes the hidden context, which shares with every widget's context, current for its
  // lifetime and restores whatever was current before. Texture storage is allocated and freed
  // there, so that it doesn't depend on which widget's context happens to be alive.
  class VSharedContextScope
  {
  public:
    VSharedContextScope();
    ~VSharedContextScope();
    VSharedContextScope( const VSharedContextScope& ) = delete;
    VSharedContextScope& operator=( const VSharedContextScope& ) = delete;

    // False when no context could be made current; the caller then leaves the storage alone.
    bool IsCurrent() const { return m_bCurrent; }

  private:
    QOpenGLContext* m_pPrevious = nullptr;
    QSurface* m_pPreviousSurface = nullptr;
    bool m_bSwitched = false;
    bool m_bCurrent = false;
  };
} // namespace VideoGraphics
