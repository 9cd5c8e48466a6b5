#pragma once

// An H.264 decoder as the frame decoder sees it: one access unit in start-code form in, one
// packed 4:2:2 frame out. One instance serves one file and keeps its reference frames between
// calls, so the caller feeds it from a key frame.

#include "videointerface/IBuffer.h"
#include "videointerface/IVideoFrameInfo.h"

#include <memory>

namespace ZOL
{
  class IH264Decoder
  {
  public:
    // i_PixelFormat is the wished output (U8Y8V8Y8 or Y8U8Y8V8); the decoder sets format,
    // width and height of the info to what it gives, and hands the frame to o_rOutput.
    [[nodiscard]] virtual bool Decode( const IBufferConst& i_rInput, EPixelFormat i_PixelFormat,
                                       std::shared_ptr< IBuffer >& o_rOutput, IVideoFrameInfo& io_VideoFrameInfo ) = 0;
    virtual ~IH264Decoder() = default;
  };
} // namespace ZOL
