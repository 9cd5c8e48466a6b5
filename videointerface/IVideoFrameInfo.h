#pragma once

// The plain value records that every reader returns and decoders and the surface take.

#include "videointerface/Enumerations.h"

#include <cstdint>
#include <memory>
#include <vector>

namespace ZOL
{
  class IBuffer;

  struct IVideoFrameInfo
  {
    enum : std::uint32_t
    {
      Flag_Inverted = 1u << 0,
      Flag_HasConversionDistortion = 1u << 1,
    };

    std::uint16_t TwiceOffsetX = 0;
    std::uint16_t TwiceOffsetY = 0;
    std::uint8_t SensorPixelsPerImagePixelX = 1;
    std::uint8_t SensorPixelsPerImagePixelY = 1;
    std::int32_t ImageWidth = 0;
    std::int32_t ImageHeight = 0;
    EPixelFormat PixelFormat = PixelFormat_Unspecified;
    std::uint32_t Flags = 0;
    double PixelAspectRatio = 0.0;
    EInterlacedFormat InterlacedFormat = InterlacedFormat_Unspecified;

    bool IsInverted() const { return ( Flags & Flag_Inverted ) != 0; }
    bool HasConversionDistortion() const { return ( Flags & Flag_HasConversionDistortion ) != 0; }
    // A description read from a file is valid only with a size and a pixel format.
    bool IsValid() const { return ImageWidth > 0 && ImageHeight > 0 && PixelFormat != PixelFormat_Unspecified; }

    bool operator==( const IVideoFrameInfo& i_rOther ) const;
    bool operator!=( const IVideoFrameInfo& i_rOther ) const { return !( *this == i_rOther ); }
  };

  struct IAudioFrameInfo
  {
    EAudioSampleFormat SampleFormat = AudioSampleFormat_Unspecified;
    std::int32_t SampleRate = 0;
    std::int32_t Channels = 0;

    bool IsUsable() const { return SampleFormat != AudioSampleFormat_Unspecified && SampleRate > 0 && Channels > 0; }
    bool operator==( const IAudioFrameInfo& i_rOther ) const
    {
      return SampleFormat == i_rOther.SampleFormat && SampleRate == i_rOther.SampleRate &&
             Channels == i_rOther.Channels;
    }
    bool operator!=( const IAudioFrameInfo& i_rOther ) const { return !( *this == i_rOther ); }
  };

  // Bytes of one sample of one channel; 0 for Unspecified.
  std::uint32_t GetAudioSampleSizeInBytes( EAudioSampleFormat i_Format );
  // Bytes of one sample group: sample size times channels (0 when audio is not usable).
  std::uint64_t GetAudioSampleGroupSizeInBytes( const IAudioFrameInfo& i_rInfo );

  constexpr std::uint32_t DefaultTicksPerSecond = 135000000u;

  struct IVideoTiming
  {
    std::uint32_t TicksPerSecond = DefaultTicksPerSecond;
    std::uint32_t FramePeriodInTicks = 0;
    std::int64_t StartOffsetInTicks = 0;

    // Frames a second; 0.0 when the period is 0.
    double GetFrameRate() const
    {
      return FramePeriodInTicks == 0 ? 0.0 : static_cast< double >( TicksPerSecond ) / FramePeriodInTicks;
    }
    bool operator==( const IVideoTiming& i_rOther ) const
    {
      return TicksPerSecond == i_rOther.TicksPerSecond && FramePeriodInTicks == i_rOther.FramePeriodInTicks &&
             StartOffsetInTicks == i_rOther.StartOffsetInTicks;
    }
  };

  struct IVideoSettings
  {
    float Saturation = 1.0f;
    float GammaCorrection = 1.0f;

    bool operator==( const IVideoSettings& i_rOther ) const
    {
      return Saturation == i_rOther.Saturation && GammaCorrection == i_rOther.GammaCorrection;
    }
    bool operator!=( const IVideoSettings& i_rOther ) const { return !( *this == i_rOther ); }
  };

  // One frame on its way to the surface. Frames share their buffers; a buffer goes back to its
  // recycler when the last frame holding it is gone.
  struct IVideoFrame
  {
    std::shared_ptr< IBuffer > Video;
    IVideoFrameInfo VideoFrameInfo;
    std::vector< std::shared_ptr< IBuffer > > Audio;
    IAudioFrameInfo AudioFrameInfo;
  };

  // Bytes of an uncompressed frame of that description (32 bits, as the format defines it).
  std::uint32_t GetVideoFrameSizeInBytes( const IVideoFrameInfo& i_rInfo );
  // The same in 64 bits, for callers that must not be fooled by a huge size from a file.
  std::uint64_t GetVideoFrameSizeInBytes64( const IVideoFrameInfo& i_rInfo );
} // namespace ZOL
