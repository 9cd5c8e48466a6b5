#pragma once

#include "videointerface/IVideoReader.h"

namespace MovIO
{
  // What the sample description tables of the MOV reader can yield: raw RGB and YUV frames,
  // JPEG, PNG, TIFF and H.264, with integer PCM audio.
  class VReaderCapabilities : public ZOL::IVideoReaderCapabilities
  {
  public:
    bool SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const override;
    bool SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const override;
    bool SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const override;
    bool SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const override;
  };
} // namespace MovIO
