#include "graphics/VideoSurface/VVideoTexture.h"

#include "graphics/CoreGraphics/VRenderContext.h"
#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "graphics/VideoSurface/VPixelFormatRouting.h"
#include "graphics/VideoSurface/VSharedContext.h"
#include "services/Log.h"

#include <QOpenGLContext>
#include <QOpenGLFunctions>
#include <QOpenGLTexture>

namespace VideoGraphics
{
  VVideoTexture::VVideoTexture() = default;

  VVideoTexture::~VVideoTexture()
  {
    DestroyStorage();
  }

  void VVideoTexture::SetFrame( const ZOL::IVideoFrameInfo& i_rInfo, std::shared_ptr< ZOL::IBuffer > i_pBuffer )
  {
    m_Info = i_rInfo;
    m_pBuffer = std::move( i_pBuffer );
    m_UploadedFormat = 0;
  }

  QSize VVideoTexture::GetStorageSize() const
  {
    if( !m_pTexture || !m_pTexture->isStorageAllocated() )
      return QSize();
    return QSize( m_pTexture->width(), m_pTexture->height() );
  }

  bool VVideoTexture::HoldsWholeFrame() const
  {
    const std::uint64_t Needed = ZOL::GetVideoFrameSizeInBytes64( m_Info );
    return Needed != 0 && m_pBuffer->GetSize() >= Needed;
  }

  void VVideoTexture::Bind( int i_Unit, CoreGraphics::VRenderContext& i_rContext, std::uint32_t i_Format )
  {
    if( !HasFrame() )
      return;
    const std::uint32_t Format = i_Format != 0 ? i_Format : std::uint32_t( m_Info.PixelFormat );
    const VPixelFormatRoute* pRoute = FindPixelFormatRoute( Format );

    // The driver reads the frame's bytes without a bound of its own: a buffer shorter than its
    // description says must never reach it, nor make storage for a size it cannot fill.
    if( pRoute != nullptr && i_Format == 0 && !HoldsWholeFrame() )
    {
      if( m_UploadedFormat != Format )
        LUMEK_LOG( "CoreGraphics", ZOL::LogWarning, "Frame buffer of %d bytes is too small for %d x %d",
                   m_pBuffer->GetSize(), m_Info.ImageWidth, m_Info.ImageHeight );
      pRoute = nullptr;
    }

    bool bReallocated = false;
    QSize Size;
    if( pRoute != nullptr )
    {
      Size = TextureSize( *pRoute, m_Info.ImageWidth, m_Info.ImageHeight );
      bReallocated = EnsureStorage( Size, pRoute->InternalFormat );
      // Storage that could not be made for this frame still has the size of an earlier one.
      if( GetStorageSize() != Size || m_StorageFormat != pRoute->InternalFormat )
        pRoute = nullptr;
    }
    // A frame that doesn't go to the card shows nothing, not the texture of an earlier frame.
    i_rContext.BindTexture( i_Unit, pRoute != nullptr ? m_pTexture.get() : nullptr );

    if( Format == m_UploadedFormat && !bReallocated )
      return;
    m_UploadedFormat = Format;
    if( pRoute != nullptr )
      Upload( i_rContext, i_Format, Size, pRoute->InternalFormat, pRoute->UploadFormat() != pRoute->Format,
              pRoute->UploadFormat() );
  }

  bool VVideoTexture::EnsureStorage( const QSize& i_rSize, GLenum i_InternalFormat )
  {
    if( m_pTexture && m_pTexture->isStorageAllocated() && m_pTexture->width() == i_rSize.width() &&
        m_pTexture->height() == i_rSize.height() && m_StorageFormat == i_InternalFormat )
      return false;
    if( i_rSize.isEmpty() )
      return false;
    if( QOpenGLContext::currentContext() == nullptr )
      return false;
    GLint MaxSize = 0;
    QOpenGLContext::currentContext()->functions()->glGetIntegerv( GL_MAX_TEXTURE_SIZE, &MaxSize );
    if( i_rSize.width() > MaxSize || i_rSize.height() > MaxSize )
    {
      LUMEK_LOG( "CoreGraphics", ZOL::LogFailure, "Cannot allocate a texture of %d x %d", i_rSize.width(),
                 i_rSize.height() );
      return false;
    }

    VSharedContextScope Scope;
    if( !Scope.IsCurrent() )
      return false;
    if( m_pTexture )
      m_pTexture->destroy();
    else
      m_pTexture = std::make_shared< QOpenGLTexture >( QOpenGLTexture::Target2D );
    // Only level 0 is ever written; a mipmap chain would be storage nobody fills.
    m_pTexture->setAutoMipMapGenerationEnabled( false );
    m_pTexture->setMipLevels( 1 );
    m_pTexture->setSize( i_rSize.width(), i_rSize.height(), 1 );
    m_pTexture->setFormat( QOpenGLTexture::TextureFormat( i_InternalFormat ) );
    m_pTexture->create();
    m_pTexture->allocateStorage();
    m_StorageFormat = i_InternalFormat;
    ++m_StorageAllocations;
    if( !m_pTexture->isStorageAllocated() )
    {
      LUMEK_LOG( "CoreGraphics", ZOL::LogFailure, "Cannot allocate a texture of %d x %d", i_rSize.width(),
                 i_rSize.height() );
      m_pTexture->destroy();
    }
    return true;
  }

  void VVideoTexture::Upload( CoreGraphics::VRenderContext& i_rContext, std::uint32_t i_Format, const QSize& i_rSize,
                              GLenum i_InternalFormat, bool i_bConvert, ZOL::EPixelFormat i_UploadFormat )
  {
    const std::uint8_t* pPixels = m_pBuffer->GetData();
    if( i_Format != 0 )
      return;
    if( i_bConvert )
    {
      ZOL::IVideoFrameInfo Target = m_Info;
      Target.PixelFormat = i_UploadFormat;
      const std::uint64_t TargetSize = ZOL::GetVideoFrameSizeInBytes64( Target );
      m_Scratch.resize( std::size_t( TargetSize ) );
      if( !CoreVideoUtils::ConvertFrame( m_Info.ImageWidth, m_Info.ImageHeight, m_Info.PixelFormat, pPixels,
                                         m_pBuffer->GetSize(), i_UploadFormat, m_Scratch.data(), TargetSize ) )
        return;
      pPixels = m_Scratch.data();
    }
    if( i_rContext.UploadTexture( i_rSize, pPixels, i_InternalFormat ) )
      ++m_Uploads;
  }

  void VVideoTexture::DestroyStorage()
  {
    if( !m_pTexture )
      return;
    VSharedContextScope Scope;
    if( Scope.IsCurrent() )
      m_pTexture->destroy();
    m_pTexture.reset();
    m_StorageFormat = 0;
    m_UploadedFormat = 0;
  }
} // namespace VideoGraphics
