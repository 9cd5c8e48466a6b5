#include "fileio/MkvIO/VReaderCapabilities.h"

namespace MkvIO
{
  bool VReaderCapabilities::SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const
  {
    return i_Format == ZOL::AudioSampleFormat_Int16 || i_Format == ZOL::AudioSampleFormat_Int24 ||
           i_Format == ZOL::AudioSampleFormat_Int32 || i_Format == ZOL::AudioSampleFormat_Float32;
  }

  bool VReaderCapabilities::SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const
  {
    return i_Payload == ZOL::AudioPayload_None || i_Payload == ZOL::AudioPayload_Uncompressed;
  }

  bool VReaderCapabilities::SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const
  {
    return i_Format == ZOL::PixelFormat_Luminance8 || i_Format == ZOL::PixelFormat_BayerGB8 ||
           i_Format == ZOL::PixelFormat_R8G8B8u8 || i_Format == ZOL::PixelFormat_U8Y8V8Y8 ||
           i_Format == ZOL::PixelFormat_Y8U8Y8V8;
  }

  bool VReaderCapabilities::SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const
  {
    return i_Payload == ZOL::VideoPayload_Uncompressed || i_Payload == ZOL::VideoPayload_ImageJPEG;
  }
} // namespace MkvIO
