#pragma once

// One call turns the stored bytes of a frame into pixels, whatever the payload: every reader
// and the video source go through VideoFrameDecoder.

#include "fileio/VideoEncoding/IH264Decoder.h"
#include "videointerface/IBuffer.h"
#include "videointerface/IVideoFrameInfo.h"
#include "videointerface/IVideoReader.h"

#include <cstdint>
#include <memory>

namespace VideoEncoding
{
  // Decodes io_rBuffer in place of itself: on entry it holds the stored frame, on success the
  // decoded one (the same buffer for Uncompressed, which is never copied). io_VideoFrameInfo
  // describes the result; decoders may change its format and size. i_rH264Decoder may be null
  // for all payloads but VideoH264.
  [[nodiscard]] bool VideoFrameDecoder( ZOL::EVideoPayload i_Payload, ZOL::IVideoFrameInfo& io_VideoFrameInfo,
                                        std::shared_ptr< ZOL::IBuffer >& io_rBuffer,
                                        const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                                        const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                                        const std::shared_ptr< ZOL::IH264Decoder >& i_rH264Decoder );

  // A reader's ReadFrame with decoding: its stored payload and audio, then the payload turned
  // into pixels. On failure the frame is left as it was.
  [[nodiscard]] bool ReadDecodedFrame( ZOL::IVideoReader& io_rReader, std::uint64_t i_FrameIndex,
                                       ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo, bool i_bReadAudio,
                                       const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                                       const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                                       const std::shared_ptr< ZOL::IH264Decoder >& i_rH264Decoder );

  // The pixel format that decoded frames of a payload will have, given the format stored in
  // the file. False, with a log line and o_rPixelFormat untouched, for an unknown payload.
  [[nodiscard]] bool PixelFormatForPayloadFormat( ZOL::EVideoPayload i_Payload, ZOL::EPixelFormat i_PixelFormat,
                                                  ZOL::EPixelFormat& o_rPixelFormat, bool i_bForceColour );

  // Bytes of a decoded frame of that description, truncated to 32 bits as the decoders take it.
  std::uint32_t FrameBufferSize( const ZOL::IVideoFrameInfo& i_rVideoFrameInfo );
} // namespace VideoEncoding
