#pragma once

// Small recordings for the viewer's tests, written by the test itself. Frame n is one flat grey
// level, so that the frame on screen or in a buffer tells which one was read; with sound, each
// frame carries a block of a length of its own (a frame's worth at 48 kHz plus n % 8 stereo
// 16-bit samples), so that a block read for the wrong frame shows.

#include "fileio/LumekVideo/VWriter.h"
#include "videointerface/AttributeRecords.h"

#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <string>
#include <vector>

namespace AppTest
{
  inline std::uint32_t TicksAt( double i_FramesPerSecond )
  {
    return static_cast< std::uint32_t >( std::lround( ZOL::IVideoTiming().TicksPerSecond / i_FramesPerSecond ) );
  }

  // Far enough apart to survive filtering and the colour path.
  inline int FrameLevel( std::uint64_t i_Frame )
  {
    return static_cast< int >( 40 + 20 * i_Frame );
  }

  // The frame whose level is nearest to i_Level; -1 for black.
  inline int FrameForLevel( int i_Level )
  {
    return i_Level < 30 ? -1 : static_cast< int >( std::lround( ( i_Level - 40 ) / 20.0 ) );
  }

  // Frames 0 to i_Count - 1 but the missing ones.
  inline std::vector< std::uint64_t > FramesWithout( std::uint64_t i_Count, std::vector< std::uint64_t > i_Missing )
  {
    std::vector< std::uint64_t > Frames;
    for( std::uint64_t i = 0; i < i_Count; ++i )
      if( std::find( i_Missing.begin(), i_Missing.end(), i ) == i_Missing.end() )
        Frames.push_back( i );
    return Frames;
  }

  struct VRecordingSpec
  {
    int Width = 16;
    int Height = 8;
    ZOL::EPixelFormat Format = ZOL::PixelFormat_Luminance8;
    std::vector< std::uint64_t > Frames = FramesWithout( 10, {} ); // the indices stored
    std::uint32_t FramePeriodInTicks = TicksAt( 25 );
    bool bAudio = false;
    bool bLens = false;   // a lens calibration record
    bool bCamera = false; // a camera record with the sensor's size, which the lens needs
    ZOL::IVideoAttributes Attributes;
  };

  // Writes the recording; empty on failure.
  inline std::string WriteRecording( const std::string& i_rPath, VRecordingSpec i_Spec )
  {
    ZOL::IVideoFrameInfo Video;
    Video.ImageWidth = i_Spec.Width;
    Video.ImageHeight = i_Spec.Height;
    Video.PixelFormat = i_Spec.Format;
    Video.PixelAspectRatio = 1.0;
    const ZOL::IAudioFrameInfo Audio =
        i_Spec.bAudio ? ZOL::IAudioFrameInfo{ ZOL::AudioSampleFormat_Int16, 48000, 2 } : ZOL::IAudioFrameInfo();
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = i_Spec.FramePeriodInTicks;
    ZOL::WriteVideoTiming( i_Spec.Attributes, Timing );
    ZOL::WriteVideoSettings( i_Spec.Attributes, "", ZOL::IVideoSettings() );
    i_Spec.Attributes.Set( "Recording.Description", "viewer test recording" );
    if( i_Spec.bCamera )
    {
      CoreLumekTypes::VCameraHardware Camera;
      Camera.SensorWidthInPixels = static_cast< std::uint32_t >( i_Spec.Width );
      Camera.SensorHeightInPixels = static_cast< std::uint32_t >( i_Spec.Height );
      ZOL::WriteCameraHardware( i_Spec.Attributes, Camera );
    }
    if( i_Spec.bLens )
    {
      CoreLumekTypes::VLensDistortionCalibration Lens;
      Lens.RadialModel = ZOL::RadialModel_Lumek2Parameter;
      Lens.RadialDistortionParameters = { -0.001, 0.0 };
      Lens.RadialDistortionCentre_X = i_Spec.Width / 2.0;
      Lens.RadialDistortionCentre_Y = i_Spec.Height / 2.0;
      ZOL::WriteLensDistortionCalibration( i_Spec.Attributes, "", Lens );
    }

    LumekVideo::VWriter Writer;
    if( !Writer.Create( i_rPath, Video, Audio, i_Spec.Attributes ) )
      return std::string();
    const std::size_t SamplesPerFrame = 48000ull * i_Spec.FramePeriodInTicks / Timing.TicksPerSecond;
    for( std::uint64_t Frame : i_Spec.Frames )
    {
      const std::vector< std::uint8_t > Pixels( Writer.GetVideoFrameSize(),
                                                static_cast< std::uint8_t >( FrameLevel( Frame ) ) );
      // A ramp, so that a block is never all zeros.
      std::vector< std::uint8_t > Sound( i_Spec.bAudio ? ( SamplesPerFrame + Frame % 8 ) * 4 : 0 );
      for( std::size_t i = 0; i < Sound.size(); ++i )
        Sound[i] = static_cast< std::uint8_t >( i );
      if( !Writer.AppendFrame( Frame, Pixels.data(), Pixels.size(), Sound.empty() ? nullptr : Sound.data(),
                               Sound.size() ) )
        return std::string();
    }
    return Writer.Close() ? i_rPath : std::string();
  }

  // A recording in the temporary folder, removed with the object.
  struct VTempRecording
  {
    // A recording not written fails to open.
    explicit VTempRecording( const VRecordingSpec& i_rSpec = {} ) { (void)WriteRecording( Path, i_rSpec ); }
    ~VTempRecording() { std::filesystem::remove( Path ); }
    VTempRecording( const VTempRecording& ) = delete;

    static inline int s_Count = 0;
    const std::string Path =
        ( std::filesystem::temp_directory_path() /
          ( "apptest-" + std::to_string( getpid() ) + "-" + std::to_string( ++s_Count ) + ".lvid" ) )
            .string();
  };
} // namespace AppTest
