#pragma once

#include "videointerface/IBuffer.h"
#include "videointerface/IVideoFrameInfo.h"

#include <QSize>
#include <qopengl.h>

#include <cstdint>
#include <memory>
#include <vector>

class QOpenGLTexture;

namespace CoreGraphics
{
  class VRenderContext;
}

namespace VideoGraphics
{
  // The texture of the one frame a surface shows. It holds the frame and uploads it lazily, at
  // the first bind after SetFrame, so that repainting an unchanged frame costs no upload.
  // Storage is kept while the size and internal format stay the same.
  class VVideoTexture
  {
  public:
    VVideoTexture();
    ~VVideoTexture();
    VVideoTexture( const VVideoTexture& ) = delete;
    VVideoTexture& operator=( const VVideoTexture& ) = delete;

    bool HasFrame() const { return m_pBuffer != nullptr; }
    // Holds the frame and forgets what is on the card; the previous frame's buffer goes back to
    // its recycler here.
    void SetFrame( const ZOL::IVideoFrameInfo& i_rInfo, std::shared_ptr< ZOL::IBuffer > i_pBuffer );
    // Binds the texture to the unit in the current context, uploading the held frame first if
    // it isn't on the card yet. i_Format 0 takes the frame's own format.
    void Bind( int i_Unit, CoreGraphics::VRenderContext& i_rContext, std::uint32_t i_Format = 0 );
    // Frees the texture in the hidden shared context.
    void DestroyStorage();

    // For tests and measurements: how often storage was allocated and frames uploaded.
    std::uint64_t GetStorageAllocationCount() const { return m_StorageAllocations; }
    std::uint64_t GetUploadCount() const { return m_Uploads; }
    // 0 while the held frame isn't on the card.
    std::uint32_t GetUploadedFormat() const { return m_UploadedFormat; }
    QSize GetStorageSize() const;

  private:
    bool HoldsWholeFrame() const;
    // True when storage was (re)allocated.
    bool EnsureStorage( const QSize& i_rSize, GLenum i_InternalFormat );
    void Upload( CoreGraphics::VRenderContext& i_rContext, std::uint32_t i_Format, const QSize& i_rSize,
                 GLenum i_InternalFormat, bool i_bConvert, ZOL::EPixelFormat i_UploadFormat );

    std::shared_ptr< QOpenGLTexture > m_pTexture;
    GLenum m_StorageFormat = 0;
    std::uint32_t m_UploadedFormat = 0;
    ZOL::IVideoFrameInfo m_Info;
    std::shared_ptr< ZOL::IBuffer > m_pBuffer;
    std::vector< std::uint8_t > m_Scratch;
    std::uint64_t m_StorageAllocations = 0;
    std::uint64_t m_Uploads = 0;
  };
} // namespace VideoGraphics
