#pragma once

// The still-image decoders the frame decoder dispatches to. Each payload has one row; a row
// whose decoder is not built into this program is empty, and its frames decode to false.

#include "videointerface/IBuffer.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>

namespace VideoEncoding
{
  // JPEG allocates its own output (and an intermediate from the temporary allocator).
  using JPEGDecodeFunction = bool ( * )( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                         ZOL::EPixelFormat i_PixelFormat,
                                         const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                                         const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                                         ZOL::IVideoFrameInfo& io_VideoFrameInfo,
                                         std::shared_ptr< ZOL::IBuffer >& o_rOutput );
  // PNG and TIFF decode into a destination of the frame's size.
  using ImageDecodeFunction = bool ( * )( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                          ZOL::IVideoFrameInfo& io_VideoFrameInfo, std::uint8_t* o_pDestination,
                                          std::uint64_t i_DestinationSize );

  struct VImageDecoders
  {
    JPEGDecodeFunction JPEG;
    ImageDecodeFunction PNG;
    ImageDecodeFunction TIFF;
  };

  const VImageDecoders& ImageDecoders();
} // namespace VideoEncoding
