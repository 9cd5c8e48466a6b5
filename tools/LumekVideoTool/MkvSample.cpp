#include "tools/LumekVideoTool/MkvSample.h"

#include "fileio/MkvIO/MkvCodecs.h"
#include "fileio/MkvIO/VMkvWriter.h"

#include <cmath>

namespace LumekVideoTool
{
  bool IsMkvPath( const std::string& i_rPath )
  {
    static const std::string s_Extension = ".mkv";
    return i_rPath.size() > s_Extension.size() &&
           i_rPath.compare( i_rPath.size() - s_Extension.size(), s_Extension.size(), s_Extension ) == 0;
  }

  bool WriteSampleMkv( const std::string& i_rPath, const VSampleOptions& i_rOptions, std::string& o_rError )
  {
    if( MkvIO::FourCCForPixelFormat( i_rOptions.Format ).empty() )
    {
      o_rError = std::string( "pixel format " ) + ZOL::ToString( i_rOptions.Format ) +
                 " cannot be stored in Matroska (R8G8B8u8, U8Y8V8Y8, Y8U8Y8V8 or Luminance8)";
      return false;
    }
    ZOL::IVideoFrameInfo Video;
    Video.ImageWidth = i_rOptions.Width;
    Video.ImageHeight = i_rOptions.Height;
    Video.PixelFormat = i_rOptions.Format;
    Video.PixelAspectRatio = 1.0;
    ZOL::IAudioFrameInfo Audio;
    if( i_rOptions.bAudio )
    {
      Audio.SampleFormat = ZOL::AudioSampleFormat_Int16;
      Audio.SampleRate = 48000;
      Audio.Channels = 2;
    }
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks =
        static_cast< std::uint32_t >( std::lround( Timing.TicksPerSecond / i_rOptions.FramesPerSecond ) );
    ZOL::ITimecode Timecode;
    Timecode.Standards = ZOL::TimecodeStandard_25;
    Timecode.Hours = 10;

    MkvIO::VMkvDescription Description;
    if( !MkvIO::DescribeForMatroska( Video, false, Audio, Timing, Timecode, ZOL::IVideoSettings(), Description ) )
    {
      o_rError = "cannot describe the sample as Matroska tracks";
      return false;
    }
    Description.FramesPerSecond = i_rOptions.FramesPerSecond;
    MkvIO::VMkvWriter Writer;
    if( !Writer.Create( i_rPath, Description ) )
    {
      o_rError = "cannot create " + i_rPath;
      return false;
    }
    VRGBImage Image( i_rOptions.Width, i_rOptions.Height );
    for( int Frame = 0; Frame < i_rOptions.Frames; ++Frame )
    {
      RenderSampleScene( Frame, i_rOptions.FramesPerSecond, Image );
      const std::vector< std::uint8_t > Bytes = EncodeFrame( Image, i_rOptions.Format );
      if( Bytes.empty() )
      {
        o_rError =
            std::string( "cannot encode frames of format " ) + ZOL::ToString( i_rOptions.Format ) + " at this width";
        return false;
      }
      std::vector< std::uint8_t > Tone;
      if( i_rOptions.bAudio )
        Tone = RenderSampleTone( Frame, i_rOptions.FramesPerSecond, Audio.SampleRate );
      if( !Writer.WriteFrame( Bytes, Tone ) )
      {
        o_rError = "cannot write frame " + std::to_string( Frame );
        return false;
      }
    }
    if( !Writer.Close() )
    {
      o_rError = "cannot finish " + i_rPath;
      return false;
    }
    return true;
  }
} // namespace LumekVideoTool
