#pragma once

// H.264 through OpenH264: one access unit in Annex B form in, one packed 4:2:2 frame out,
// because the video surface has no planar program.

#include "fileio/VideoEncoding/IH264Decoder.h"

#include <memory>

class ISVCDecoder;

namespace H264IO
{
  class VH264Decoder : public ZOL::IH264Decoder
  {
  public:
    // Null when the library cannot make or initialise a decoder; the reason is logged.
    static std::shared_ptr< ZOL::IH264Decoder > Create( const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator );

    explicit VH264Decoder( std::shared_ptr< ZOL::IBufferAllocator > i_pAllocator );
    ~VH264Decoder() override;
    VH264Decoder( const VH264Decoder& ) = delete;
    VH264Decoder& operator=( const VH264Decoder& ) = delete;

    [[nodiscard]] bool Initialise();
    bool Decode( const ZOL::IBufferConst& i_rInput, ZOL::EPixelFormat i_PixelFormat,
                 std::shared_ptr< ZOL::IBuffer >& o_rOutput, ZOL::IVideoFrameInfo& io_VideoFrameInfo ) override;

  private:
    std::shared_ptr< ZOL::IBufferAllocator > m_pAllocator;
    ISVCDecoder* m_pDecoder = nullptr;
  };
} // namespace H264IO
