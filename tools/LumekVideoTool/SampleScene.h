#pragma once

#include "tools/LumekVideoTool/FrameEncoding.h"
#include "videointerface/ITimecode.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <string>
#include <vector>

namespace LumekVideoTool
{
  // Renders frame i_FrameIndex of the demonstration scene: a slowly drifting colour field, a grid,
  // discs of saturated colour on orbits, a sweeping bar and a strip of reference colours and grey
  // steps. Smooth content, so that it still looks right after demosaicing.
  void RenderSampleScene( int i_FrameIndex, double i_FramesPerSecond, VRGBImage& io_rImage );

  // Interleaved stereo 16-bit samples of a test tone (440 Hz left, 660 Hz right) for one frame;
  // the phase runs on across frames.
  std::vector< std::uint8_t > RenderSampleTone( int i_FrameIndex, double i_FramesPerSecond, int i_SampleRate );

  struct VSampleOptions
  {
    int Width = 1280;
    int Height = 720;
    int Frames = 300;
    double FramesPerSecond = 100.0;
    ZOL::EPixelFormat Format = ZOL::PixelFormat_BayerGB8;
    bool bAudio = true;
    // How the frames of an image sequence are stored: PNG or JPEG.
    ZOL::EVideoPayload ImagePayload = ZOL::VideoPayload_ImagePNG;
  };

  // The frame period of the rate in ticks of the default clock.
  ZOL::IVideoTiming SampleTiming( double i_FramesPerSecond );
  // The start timecode of every sample: 10:00:00:00 at 25 frames a second.
  ZOL::ITimecode SampleTimecode();
  // What a sample recording says about itself: timing, settings, the start timecode, camera
  // hardware, a lens calibration and a description.
  ZOL::IVideoAttributes SampleAttributes( const VSampleOptions& i_rOptions );
  // Whether frame i_Frame of i_Frames is one of the two in the middle that a sample leaves out,
  // as a capture that lost them would.
  bool IsSampleFrameLeftOut( int i_Frame, int i_Frames );

  // Writes a whole demonstration recording: timing, a start timecode, camera hardware, a lens
  // calibration, the tone, and two frames in the middle left out of the index so that missing
  // frames can be seen. False with a reason in o_rError.
  bool WriteSampleRecording( const std::string& i_rPath, const VSampleOptions& i_rOptions, std::string& o_rError );
} // namespace LumekVideoTool
