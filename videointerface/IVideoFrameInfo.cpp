#include "videointerface/IVideoFrameInfo.h"

namespace ZOL
{
  bool IVideoFrameInfo::operator==( const IVideoFrameInfo& i_rOther ) const
  {
    return TwiceOffsetX == i_rOther.TwiceOffsetX && TwiceOffsetY == i_rOther.TwiceOffsetY &&
           SensorPixelsPerImagePixelX == i_rOther.SensorPixelsPerImagePixelX &&
           SensorPixelsPerImagePixelY == i_rOther.SensorPixelsPerImagePixelY && ImageWidth == i_rOther.ImageWidth &&
           ImageHeight == i_rOther.ImageHeight && PixelFormat == i_rOther.PixelFormat && Flags == i_rOther.Flags &&
           PixelAspectRatio == i_rOther.PixelAspectRatio && InterlacedFormat == i_rOther.InterlacedFormat;
  }

  std::uint32_t GetAudioSampleSizeInBytes( EAudioSampleFormat i_Format )
  {
    switch( i_Format )
    {
    case AudioSampleFormat_Int8:
    case AudioSampleFormat_UInt8:
      return 1;
    case AudioSampleFormat_Int16:
    case AudioSampleFormat_UInt16:
      return 2;
    case AudioSampleFormat_Int24:
    case AudioSampleFormat_UInt24:
      return 3;
    case AudioSampleFormat_Int32:
    case AudioSampleFormat_UInt32:
    case AudioSampleFormat_Float32:
      return 4;
    default:
      return 0;
    }
  }

  std::uint64_t GetAudioSampleGroupSizeInBytes( const IAudioFrameInfo& i_rInfo )
  {
    if( !i_rInfo.IsUsable() )
      return 0;
    return static_cast< std::uint64_t >( GetAudioSampleSizeInBytes( i_rInfo.SampleFormat ) ) *
           static_cast< std::uint64_t >( i_rInfo.Channels );
  }

  std::uint64_t GetVideoFrameSizeInBytes64( const IVideoFrameInfo& i_rInfo )
  {
    if( i_rInfo.ImageWidth <= 0 || i_rInfo.ImageHeight <= 0 )
      return 0;
    const std::uint64_t W = static_cast< std::uint64_t >( i_rInfo.ImageWidth );
    const std::uint64_t H = static_cast< std::uint64_t >( i_rInfo.ImageHeight );
    const std::uint64_t Pixels = W * H;
    switch( i_rInfo.PixelFormat )
    {
    case PixelFormat_Luminance8:
    case PixelFormat_BayerRG8:
    case PixelFormat_BayerGB8:
    case PixelFormat_BayerGR8:
    case PixelFormat_BayerBG8:
      return Pixels;
    case PixelFormat_R5G6B5:
    case PixelFormat_U8Y8V8Y8:
    case PixelFormat_Y8U8Y8V8:
    case PixelFormat_PlanarY8U8V8:
      return Pixels * 2;
    case PixelFormat_R8G8B8:
    case PixelFormat_B8G8R8:
    case PixelFormat_PlanarR8G8B8:
      return Pixels * 3;
    case PixelFormat_R8G8B8u8:
    case PixelFormat_B8G8R8u8:
      return Pixels * 4;
    case PixelFormat_U10Y10V10Y10:
      return ( ( W + 47 ) / 48 ) * H * 128;
    case PixelFormat_BayerGB7:
    case PixelFormat_Luminance7:
      return ( Pixels * 7 + 7 ) / 8; // ceiling of 0.875 a pixel
    case PixelFormat_BayerGB6:
    case PixelFormat_Luminance6:
      return ( Pixels * 6 + 7 ) / 8; // ceiling of 0.75 a pixel
    default:
      return 0;
    }
  }

  std::uint32_t GetVideoFrameSizeInBytes( const IVideoFrameInfo& i_rInfo )
  {
    return static_cast< std::uint32_t >( GetVideoFrameSizeInBytes64( i_rInfo ) );
  }
} // namespace ZOL
