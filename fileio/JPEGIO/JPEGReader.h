#pragma once

// One JPEG image into a frame buffer. The wished pixel format goes in through the info and
// what was delivered comes out the same way, with the image's size.

#include "videointerface/IBuffer.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>

namespace JPEGIO
{
  // No frame the viewer shows comes near these; a header that claims a longer side, or a frame
  // of MaxImageBytes or more, is not believed, so that a few damaged bytes cannot ask for
  // gigabytes.
  constexpr std::int32_t MaxImageSide = 32768;
  constexpr std::uint64_t MaxImageBytes = std::uint64_t( 1 ) << 31;

  // TurboJPEG flags of every call: speed before precision (fast DCT, fast upsampling), and the
  // caller's buffer is never reallocated. The SIMD "force" bits only choose among instruction
  // sets on 32-bit x86; elsewhere the library ignores them and keeps its best SIMD path.
  constexpr int ReadFlags = 3512;

  // Decodes i_Size bytes into a buffer from i_rAllocator; the 4:2:2 path also takes an
  // intermediate from i_rTemporaryAllocator. io_VideoFrameInfo.PixelFormat is the wish on
  // entry; on success it, ImageWidth and ImageHeight describe o_rOutput.
  [[nodiscard]] bool ReadJPEG( const std::uint8_t* i_pData, std::uint64_t i_Size,
                               const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                               const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                               ZOL::IVideoFrameInfo& io_VideoFrameInfo, std::shared_ptr< ZOL::IBuffer >& o_rOutput );
} // namespace JPEGIO
