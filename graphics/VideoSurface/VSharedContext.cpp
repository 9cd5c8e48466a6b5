#include "graphics/VideoSurface/VSharedContext.h"

#include "services/Log.h"

#include <QOffscreenSurface>
#include <QOpenGLContext>

namespace VideoGraphics
{
  namespace
  {
    struct VHiddenContext
    {
      QOpenGLContext* pContext = nullptr;
      QOffscreenSurface* pSurface = nullptr;
    };

    // Made once for the process and never destroyed: it has to outlive every widget, and Qt's
    // platform layer is gone by the time static destructors would run.
    VHiddenContext& HiddenContext()
    {
      static VHiddenContext s_Hidden = []
      {
        VHiddenContext Hidden;
        QOpenGLContext* pShare = QOpenGLContext::globalShareContext();
        if( pShare == nullptr )
        {
          LUMEK_LOG( "CoreGraphics", ZOL::LogWarning,
                     "No global share context: texture storage is made in the widget's own context" );
          return Hidden;
        }
        auto* pSurface = new QOffscreenSurface;
        pSurface->setFormat( pShare->format() );
        pSurface->create();
        auto* pContext = new QOpenGLContext;
        pContext->setShareContext( pShare );
        pContext->setFormat( pShare->format() );
        if( !pContext->create() )
        {
          LUMEK_LOG( "CoreGraphics", ZOL::LogFailure, "Cannot create the shared OpenGL context" );
          delete pContext;
          delete pSurface;
          return Hidden;
        }
        Hidden.pContext = pContext;
        Hidden.pSurface = pSurface;
        return Hidden;
      }();
      return s_Hidden;
    }
  } // namespace

  VSharedContextScope::VSharedContextScope()
  {
    m_pPrevious = QOpenGLContext::currentContext();
    m_pPreviousSurface = m_pPrevious ? m_pPrevious->surface() : nullptr;
    VHiddenContext& rHidden = HiddenContext();
    if( rHidden.pContext != nullptr && rHidden.pContext->makeCurrent( rHidden.pSurface ) )
    {
      m_bSwitched = true;
      m_bCurrent = true;
      return;
    }
    // Without the hidden context, the current one has to do.
    m_bCurrent = m_pPrevious != nullptr;
  }

  VSharedContextScope::~VSharedContextScope()
  {
    if( !m_bSwitched )
      return;
    if( m_pPrevious != nullptr && m_pPreviousSurface != nullptr )
      m_pPrevious->makeCurrent( m_pPreviousSurface );
    else
      HiddenContext().pContext->doneCurrent();
  }
} // namespace VideoGraphics
