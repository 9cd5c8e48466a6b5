#pragma once

#include "videointerface/IVideoReader.h"

namespace ImageSequenceIO
{
  // A sequence has no audio; its frames are whole image files, decoded on reading, so no raw
  // pixel format is stored.
  class VReaderCapabilities : public ZOL::IVideoReaderCapabilities
  {
  public:
    bool SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const override;
    bool SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const override;
    bool SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const override;
    bool SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const override;
  };
} // namespace ImageSequenceIO
