#include "videointerface/IVideoFrameInfo.h"

#include "videointerface/PixelFormatDescriptor.h"

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
    return PixelFormatFrameBytes( i_rInfo.PixelFormat, static_cast< std::uint64_t >( i_rInfo.ImageWidth ),
                                  static_cast< std::uint64_t >( i_rInfo.ImageHeight ) );
  }

  std::uint32_t GetVideoFrameSizeInBytes( const IVideoFrameInfo& i_rInfo )
  {
    return static_cast< std::uint32_t >( GetVideoFrameSizeInBytes64( i_rInfo ) );
  }
} // namespace ZOL
