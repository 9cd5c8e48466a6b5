#pragma once

#include "videointerface/IVideoReader.h"

namespace LumekVideo
{
  // Frames of an .lvid recording are always raw, in any pixel format, with raw audio of any
  // sample format or none.
  class VReaderCapabilities : public ZOL::IVideoReaderCapabilities
  {
  public:
    bool SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const override;
    bool SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const override;
    bool SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const override;
    bool SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const override;
  };
} // namespace LumekVideo
