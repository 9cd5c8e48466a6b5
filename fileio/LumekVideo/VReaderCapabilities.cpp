#include "fileio/LumekVideo/VReaderCapabilities.h"

namespace LumekVideo
{
  bool VReaderCapabilities::SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const
  {
    return i_Format <= ZOL::AudioSampleFormat_UInt32;
  }

  bool VReaderCapabilities::SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const
  {
    return i_Payload == ZOL::AudioPayload_None || i_Payload == ZOL::AudioPayload_Uncompressed;
  }

  bool VReaderCapabilities::SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const
  {
    return i_Format < ZOL::PixelFormatCount;
  }

  bool VReaderCapabilities::SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const
  {
    return i_Payload == ZOL::VideoPayload_Uncompressed;
  }
} // namespace LumekVideo
