#include "fileio/ImageSequenceIO/VReaderCapabilities.h"

namespace ImageSequenceIO
{
  bool VReaderCapabilities::SupportsAudioSampleFormat( ZOL::EAudioSampleFormat ) const
  {
    return false;
  }

  bool VReaderCapabilities::SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const
  {
    return i_Payload == ZOL::AudioPayload_None;
  }

  bool VReaderCapabilities::SupportsPixelFormat( ZOL::EPixelFormat ) const
  {
    return false;
  }

  bool VReaderCapabilities::SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const
  {
    return i_Payload == ZOL::VideoPayload_ImageJPEG || i_Payload == ZOL::VideoPayload_ImagePNG ||
           i_Payload == ZOL::VideoPayload_ImageTIFF;
  }
} // namespace ImageSequenceIO
