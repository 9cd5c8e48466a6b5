#include "fileio/MovIO/VReaderCapabilities.h"

namespace MovIO
{
  bool VReaderCapabilities::SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const
  {
    return i_Format == ZOL::AudioSampleFormat_Int16 || i_Format == ZOL::AudioSampleFormat_Int24 ||
           i_Format == ZOL::AudioSampleFormat_Int32 || i_Format == ZOL::AudioSampleFormat_UInt8;
  }

  bool VReaderCapabilities::SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const
  {
    return i_Payload == ZOL::AudioPayload_None || i_Payload == ZOL::AudioPayload_Uncompressed;
  }

  bool VReaderCapabilities::SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const
  {
    return i_Format >= ZOL::PixelFormat_R8G8B8 && i_Format <= ZOL::PixelFormat_U10Y10V10Y10;
  }

  bool VReaderCapabilities::SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const
  {
    return i_Payload == ZOL::VideoPayload_Uncompressed || i_Payload == ZOL::VideoPayload_ImageJPEG ||
           i_Payload == ZOL::VideoPayload_ImagePNG || i_Payload == ZOL::VideoPayload_ImageTIFF ||
           i_Payload == ZOL::VideoPayload_VideoH264;
  }
} // namespace MovIO
