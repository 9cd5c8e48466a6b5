#include "tools/LumekVideoTool/SampleScene.h"

#include "fileio/LumekVideo/VWriter.h"
#include "videointerface/AttributeRecords.h"

#include <algorithm>
#include <cmath>

namespace LumekVideoTool
{
  namespace
  {
    constexpr double Pi = 3.14159265358979323846;

    double SmoothStep( double i_Edge0, double i_Edge1, double i_X )
    {
      const double t = std::min( 1.0, std::max( 0.0, ( i_X - i_Edge0 ) / ( i_Edge1 - i_Edge0 ) ) );
      return t * t * ( 3.0 - 2.0 * t );
    }

    std::uint8_t ToByte( double i_Value )
    {
      return static_cast< std::uint8_t >( std::lround( std::min( 1.0, std::max( 0.0, i_Value ) ) * 255.0 ) );
    }

    void Blend( std::uint8_t* io_pPixel, const double i_Colour[3], double i_Alpha )
    {
      for( int c = 0; c < 3; ++c )
        io_pPixel[c] = ToByte( io_pPixel[c] / 255.0 * ( 1.0 - i_Alpha ) + i_Colour[c] * i_Alpha );
    }

    // A soft-edged disc, touching only the pixels of its bounding box.
    void DrawDisc( VRGBImage& io_rImage, double i_X, double i_Y, double i_Radius, const double i_Colour[3] )
    {
      const int X0 = std::max( 0, static_cast< int >( i_X - i_Radius - 2 ) );
      const int X1 = std::min( io_rImage.Width - 1, static_cast< int >( i_X + i_Radius + 2 ) );
      const int Y0 = std::max( 0, static_cast< int >( i_Y - i_Radius - 2 ) );
      const int Y1 = std::min( io_rImage.Height - 1, static_cast< int >( i_Y + i_Radius + 2 ) );
      for( int y = Y0; y <= Y1; ++y )
        for( int x = X0; x <= X1; ++x )
        {
          const double Distance = std::hypot( x + 0.5 - i_X, y + 0.5 - i_Y );
          const double Alpha = 1.0 - SmoothStep( i_Radius - 1.5, i_Radius + 0.5, Distance );
          if( Alpha > 0.0 )
          {
            // A little shading so the discs read as spheres.
            const double Light = 0.75 + 0.25 * ( 1.0 - Distance / std::max( 1.0, i_Radius ) );
            const double Shaded[3] = { i_Colour[0] * Light, i_Colour[1] * Light, i_Colour[2] * Light };
            Blend( io_rImage.At( x, y ), Shaded, Alpha );
          }
        }
    }
  } // namespace

  void RenderSampleScene( int i_FrameIndex, double i_FramesPerSecond, VRGBImage& io_rImage )
  {
    const int W = io_rImage.Width, H = io_rImage.Height;
    if( W <= 0 || H <= 0 )
      return;
    const double t = i_FramesPerSecond > 0.0 ? i_FrameIndex / i_FramesPerSecond : 0.0;

    // The colour field is separable, so each pixel costs a few multiplications: a palette along x
    // that drifts with time, shaded along y.
    std::vector< double > Column( static_cast< std::size_t >( W ) * 3 );
    for( int x = 0; x < W; ++x )
    {
      const double u = static_cast< double >( x ) / W;
      for( int c = 0; c < 3; ++c )
        Column[x * 3 + c] = 0.5 + 0.5 * std::cos( 2.0 * Pi * ( 0.08 * t + 0.7 * u + c / 3.0 ) );
    }
    const double GridStep = std::max( 8.0, H / 12.0 );
    for( int y = 0; y < H; ++y )
    {
      const double v = static_cast< double >( y ) / H;
      const double Shade = 0.18 + 0.42 * ( 1.0 - v ) * ( 1.0 - v );
      const bool bGridRow = std::fmod( y, GridStep ) < 1.0;
      for( int x = 0; x < W; ++x )
      {
        std::uint8_t* p = io_rImage.At( x, y );
        const bool bGrid = bGridRow || std::fmod( x, GridStep ) < 1.0;
        const double Lift = bGrid ? 0.10 : 0.0;
        for( int c = 0; c < 3; ++c )
          p[c] = ToByte( Column[x * 3 + c] * Shade + Lift );
      }
    }

    // A bar sweeping across, soft at its edges: motion that shows dropped or repeated frames.
    const double BarCentre = std::fmod( t * 0.25, 1.0 ) * ( W + W * 0.1 ) - W * 0.05;
    const double BarHalf = std::max( 2.0, W * 0.012 );
    const double White[3] = { 0.95, 0.95, 0.92 };
    for( int x = std::max( 0, static_cast< int >( BarCentre - BarHalf - 2 ) );
         x <= std::min( W - 1, static_cast< int >( BarCentre + BarHalf + 2 ) ); ++x )
    {
      const double Alpha =
          0.55 * ( 1.0 - SmoothStep( BarHalf - 1.5, BarHalf + 0.5, std::fabs( x + 0.5 - BarCentre ) ) );
      if( Alpha > 0.0 )
        for( int y = 0; y < H * 4 / 5; ++y )
          Blend( io_rImage.At( x, y ), White, Alpha );
    }

    // Discs of saturated colour on orbits of different speeds.
    static const double s_Colours[5][3] = {
        { 0.95, 0.25, 0.20 }, { 0.20, 0.85, 0.35 }, { 0.25, 0.45, 0.95 }, { 0.98, 0.80, 0.15 }, { 0.85, 0.30, 0.90 } };
    const double Radius = std::max( 3.0, std::min( W, H ) * 0.07 );
    for( int i = 0; i < 5; ++i )
    {
      const double Phase = t * ( 0.35 + 0.12 * i ) * 2.0 * Pi + i * 1.3;
      const double X = W * ( 0.5 + ( 0.30 + 0.03 * i ) * std::cos( Phase ) );
      const double Y = H * ( 0.42 + ( 0.22 - 0.02 * i ) * std::sin( Phase * ( i % 2 ? 1.0 : -1.0 ) ) );
      DrawDisc( io_rImage, X, Y, Radius * ( 1.0 - 0.08 * i ), s_Colours[i] );
    }

    // Reference strip: primaries and secondaries, then grey steps.
    static const std::uint8_t s_Patches[12][3] = {
        { 255, 0, 0 }, { 0, 255, 0 },  { 0, 0, 255 },     { 0, 255, 255 },   { 255, 0, 255 },   { 255, 255, 0 },
        { 0, 0, 0 },   { 51, 51, 51 }, { 102, 102, 102 }, { 153, 153, 153 }, { 204, 204, 204 }, { 255, 255, 255 } };
    const int StripTop = H * 17 / 20, StripBottom = H * 19 / 20;
    for( int y = StripTop; y < StripBottom; ++y )
      for( int x = 0; x < W; ++x )
      {
        const int Patch = std::min( 11, x * 12 / W );
        std::uint8_t* p = io_rImage.At( x, y );
        for( int c = 0; c < 3; ++c )
          p[c] = s_Patches[Patch][c];
      }
  }

  std::vector< std::uint8_t > RenderSampleTone( int i_FrameIndex, double i_FramesPerSecond, int i_SampleRate )
  {
    std::vector< std::uint8_t > Bytes;
    if( i_FramesPerSecond <= 0.0 || i_SampleRate <= 0 )
      return Bytes;
    // Frames share the samples out so that no sample is lost to rounding.
    const auto First = static_cast< std::int64_t >( std::floor( i_FrameIndex * i_SampleRate / i_FramesPerSecond ) );
    const auto Next =
        static_cast< std::int64_t >( std::floor( ( i_FrameIndex + 1 ) * i_SampleRate / i_FramesPerSecond ) );
    Bytes.reserve( static_cast< std::size_t >( Next - First ) * 4 );
    for( std::int64_t n = First; n < Next; ++n )
    {
      const double Time = static_cast< double >( n ) / i_SampleRate;
      const double Samples[2] = { 0.25 * std::sin( 2.0 * Pi * 440.0 * Time ),
                                  0.25 * std::sin( 2.0 * Pi * 660.0 * Time ) };
      for( double Sample : Samples )
      {
        const auto Value = static_cast< std::int16_t >( std::lround( Sample * 32767.0 ) );
        Bytes.push_back( static_cast< std::uint8_t >( Value & 0xFF ) );
        Bytes.push_back( static_cast< std::uint8_t >( ( Value >> 8 ) & 0xFF ) );
      }
    }
    return Bytes;
  }

  ZOL::IVideoTiming SampleTiming( double i_FramesPerSecond )
  {
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks =
        static_cast< std::uint32_t >( std::lround( Timing.TicksPerSecond / i_FramesPerSecond ) );
    return Timing;
  }

  ZOL::ITimecode SampleTimecode()
  {
    ZOL::ITimecode Timecode;
    Timecode.Standards = ZOL::TimecodeStandard_25;
    Timecode.Hours = 10;
    return Timecode;
  }

  bool IsSampleFrameLeftOut( int i_Frame, int i_Frames )
  {
    const int FirstMissing = i_Frames >= 4 ? i_Frames / 2 : -10;
    return i_Frame == FirstMissing || i_Frame == FirstMissing + 1;
  }

  ZOL::IVideoAttributes SampleAttributes( const VSampleOptions& i_rOptions )
  {
    ZOL::IVideoAttributes Attributes;
    ZOL::WriteVideoTiming( Attributes, SampleTiming( i_rOptions.FramesPerSecond ) );
    ZOL::WriteVideoSettings( Attributes, "", ZOL::IVideoSettings() );

    ZOL::WriteTimecode( Attributes, SampleTimecode() );

    CoreLumekTypes::VCameraHardware Camera;
    Camera.DeviceURN = "urn:lumek:camera:demo-0001";
    Camera.SerialNumber = "LV-DEMO-0001";
    Camera.Type = "Demo";
    Camera.DisplayType = "Lumek Demo Camera";
    Camera.SensorWidthInPixels = static_cast< std::uint32_t >( i_rOptions.Width );
    Camera.SensorHeightInPixels = static_cast< std::uint32_t >( i_rOptions.Height );
    ZOL::WriteCameraHardware( Attributes, Camera );

    // A mild barrel distortion about the sensor's centre: a few pixels at the corners.
    CoreLumekTypes::VLensDistortionCalibration Lens;
    Lens.RadialModel = ZOL::RadialModel_Lumek3Parameter;
    const double HalfDiagonalSquared =
        ( i_rOptions.Width * i_rOptions.Width + i_rOptions.Height * i_rOptions.Height ) / 4.0;
    Lens.RadialDistortionParameters = { -0.02 / HalfDiagonalSquared, 0.0, 0.0 };
    Lens.RadialDistortionCentre_X = i_rOptions.Width / 2.0;
    Lens.RadialDistortionCentre_Y = i_rOptions.Height / 2.0;
    ZOL::WriteLensDistortionCalibration( Attributes, "", Lens );
    Attributes.Set( "Recording.Description", "LumekVideoViewer demonstration recording" );
    return Attributes;
  }

  bool WriteSampleRecording( const std::string& i_rPath, const VSampleOptions& i_rOptions, std::string& o_rError )
  {
    if( i_rOptions.Width <= 0 || i_rOptions.Height <= 0 || i_rOptions.Frames <= 0 ||
        !( i_rOptions.FramesPerSecond > 0.0 ) )
    {
      o_rError = "width, height, frames and fps must be positive";
      return false;
    }

    ZOL::IVideoFrameInfo Video;
    Video.ImageWidth = i_rOptions.Width;
    Video.ImageHeight = i_rOptions.Height;
    Video.PixelFormat = i_rOptions.Format;
    Video.PixelAspectRatio = 1.0;
    Video.InterlacedFormat = ZOL::InterlacedFormat_NotInterlaced;

    ZOL::IAudioFrameInfo Audio;
    if( i_rOptions.bAudio )
    {
      Audio.SampleFormat = ZOL::AudioSampleFormat_Int16;
      Audio.SampleRate = 48000;
      Audio.Channels = 2;
    }

    const ZOL::IVideoAttributes Attributes = SampleAttributes( i_rOptions );

    LumekVideo::VWriter Writer;
    if( !Writer.Create( i_rPath, Video, Audio, Attributes ) )
    {
      o_rError = "cannot create " + i_rPath;
      return false;
    }

    VRGBImage Image( i_rOptions.Width, i_rOptions.Height );
    for( int Frame = 0; Frame < i_rOptions.Frames; ++Frame )
    {
      if( IsSampleFrameLeftOut( Frame, i_rOptions.Frames ) )
        continue;
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
      if( !Writer.AppendFrame( static_cast< std::uint64_t >( Frame ), Bytes.data(), Bytes.size(),
                               Tone.empty() ? nullptr : Tone.data(), Tone.size() ) )
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
