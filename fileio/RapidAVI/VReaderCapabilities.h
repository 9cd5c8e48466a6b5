#pragma once

#include "videointerface/IVideoReader.h"

namespace RapidAVI
{
  // What an AVI file can carry to this reader: the formats strf names, plus the Bayer formats a
  // QMDT chunk can describe.
  class VReaderCapabilities : public ZOL::IVideoReaderCapabilities
  {
  public:
    bool SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const override;
    bool SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const override;
    bool SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const override;
    bool SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const override;
  };
} // namespace RapidAVI
