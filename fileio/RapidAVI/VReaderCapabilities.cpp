#include "fileio/RapidAVI/VReaderCapabilities.h"

#include <algorithm>
#include <iterator>

namespace RapidAVI
{
  namespace
  {
    constexpr ZOL::EAudioSampleFormat s_SampleFormats[] = {
        ZOL::AudioSampleFormat_Int16, ZOL::AudioSampleFormat_Int24, ZOL::AudioSampleFormat_Int32,
        ZOL::AudioSampleFormat_Float32, ZOL::AudioSampleFormat_UInt8 };
    constexpr ZOL::EPixelFormat s_PixelFormats[] = {
        ZOL::PixelFormat_Luminance8, ZOL::PixelFormat_BayerRG8, ZOL::PixelFormat_BayerGB8,
        ZOL::PixelFormat_BayerGR8,   ZOL::PixelFormat_BayerBG8, ZOL::PixelFormat_B8G8R8,
        ZOL::PixelFormat_B8G8R8u8,   ZOL::PixelFormat_U8Y8V8Y8, ZOL::PixelFormat_Y8U8Y8V8 };
    constexpr ZOL::EVideoPayload s_VideoPayloads[] = { ZOL::VideoPayload_Uncompressed, ZOL::VideoPayload_ImageJPEG,
                                                       ZOL::VideoPayload_VideoH264 };

    template < typename T, std::size_t N > bool Contains( const T ( &i_rValues )[N], T i_Value )
    {
      return std::find( std::begin( i_rValues ), std::end( i_rValues ), i_Value ) != std::end( i_rValues );
    }
  } // namespace

  bool VReaderCapabilities::SupportsAudioSampleFormat( ZOL::EAudioSampleFormat i_Format ) const
  {
    return Contains( s_SampleFormats, i_Format );
  }

  bool VReaderCapabilities::SupportsAudioPayload( ZOL::EAudioPayload i_Payload ) const
  {
    return i_Payload == ZOL::AudioPayload_None || i_Payload == ZOL::AudioPayload_Uncompressed;
  }

  bool VReaderCapabilities::SupportsPixelFormat( ZOL::EPixelFormat i_Format ) const
  {
    return Contains( s_PixelFormats, i_Format );
  }

  bool VReaderCapabilities::SupportsVideoPayload( ZOL::EVideoPayload i_Payload ) const
  {
    return Contains( s_VideoPayloads, i_Payload );
  }
} // namespace RapidAVI
