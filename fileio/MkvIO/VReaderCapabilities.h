#pragma once

#include "videointerface/IVideoReader.h"

namespace MkvIO
{
  // Matroska files of the family hold raw frames of four FourCCs or MJPEG, with PCM audio or none.
  class VReaderCapabilities : public ZOL::IVideoReaderCapabilities
  {
  public:
    bool SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const override;
    bool SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const override;
    bool SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const override;
    bool SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const override;
  };
} // namespace MkvIO
