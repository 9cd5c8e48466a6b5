#include "tests/app/Window/TestRecordings.h"

#include "fileio/LumekVideo/VWriter.h"
#include "videointerface/AttributeRecords.h"

#include <cmath>
#include <cstdlib>
#include <vector>

namespace WindowTest
{
  int FrameLevel( int i_Frame )
  {
    return 40 + 20 * i_Frame;
  }

  int FrameForLevel( int i_Level )
  {
    if( i_Level < 30 )
      return -1;
    return static_cast< int >( std::lround( ( i_Level - 40 ) / 20.0 ) );
  }

  std::string WriteRecording( const std::string& i_rPath, const VRecordingSpec& i_rSpec )
  {
    ZOL::IVideoFrameInfo Video;
    Video.ImageWidth = i_rSpec.Width;
    Video.ImageHeight = i_rSpec.Height;
    Video.PixelFormat = i_rSpec.Format;
    Video.PixelAspectRatio = 1.0;

    ZOL::IAudioFrameInfo Audio;
    if( i_rSpec.bAudio )
      Audio = { ZOL::AudioSampleFormat_Int16, 48000, 2 };

    ZOL::IVideoAttributes Attributes;
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks =
        static_cast< std::uint32_t >( std::lround( Timing.TicksPerSecond / i_rSpec.FramesPerSecond ) );
    ZOL::WriteVideoTiming( Attributes, Timing );
    ZOL::WriteVideoSettings( Attributes, "", ZOL::IVideoSettings() );
    Attributes.Set( "Recording.Description", "window test recording" );
    if( i_rSpec.bLens )
    {
      CoreLumekTypes::VCameraHardware Camera;
      Camera.SerialNumber = "WT-1";
      Camera.SensorWidthInPixels = static_cast< std::uint32_t >( i_rSpec.Width );
      Camera.SensorHeightInPixels = static_cast< std::uint32_t >( i_rSpec.Height );
      ZOL::WriteCameraHardware( Attributes, Camera );
      CoreLumekTypes::VLensDistortionCalibration Lens;
      Lens.RadialModel = ZOL::RadialModel_Lumek2Parameter;
      Lens.RadialDistortionParameters = { -0.001, 0.0 };
      Lens.RadialDistortionCentre_X = i_rSpec.Width / 2.0;
      Lens.RadialDistortionCentre_Y = i_rSpec.Height / 2.0;
      ZOL::WriteLensDistortionCalibration( Attributes, "", Lens );
    }

    LumekVideo::VWriter Writer;
    if( !Writer.Create( i_rPath, Video, Audio, Attributes ) )
      return std::string();
    const std::uint64_t FrameSize = Writer.GetVideoFrameSize();
    // 1 / fps of silence-free stereo 16-bit: a ramp, so a write of it is never all zeros.
    const std::size_t AudioBytes = static_cast< std::size_t >( 48000 / i_rSpec.FramesPerSecond ) * 4;
    std::vector< std::uint8_t > Sound( AudioBytes );
    for( std::size_t i = 0; i < Sound.size(); ++i )
      Sound[i] = static_cast< std::uint8_t >( i );
    for( int Frame = 0; Frame < i_rSpec.Frames; ++Frame )
    {
      if( i_rSpec.Missing.count( Frame ) )
        continue;
      const std::vector< std::uint8_t > Pixels( FrameSize, static_cast< std::uint8_t >( FrameLevel( Frame ) ) );
      if( !Writer.AppendFrame( static_cast< std::uint64_t >( Frame ), Pixels.data(), Pixels.size(),
                               i_rSpec.bAudio ? Sound.data() : nullptr, i_rSpec.bAudio ? Sound.size() : 0 ) )
        return std::string();
    }
    if( !Writer.Close() )
      return std::string();
    return i_rPath;
  }
} // namespace WindowTest
