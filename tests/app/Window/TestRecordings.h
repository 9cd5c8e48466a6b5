#pragma once

// Small recordings made for the window's tests: each frame is one flat grey level, so the frame
// on screen can be told from the surface's pixels alone.

#include "videointerface/Enumerations.h"

#include <set>
#include <string>

namespace WindowTest
{
  struct VRecordingSpec
  {
    int Width = 16;
    int Height = 8;
    int Frames = 10;
    double FramesPerSecond = 25.0;
    ZOL::EPixelFormat Format = ZOL::PixelFormat_Luminance8;
    std::set< int > Missing;
    bool bAudio = false;
    bool bLens = false;
  };

  // The grey level of frame i: far enough apart to survive filtering and the colour path.
  int FrameLevel( int i_Frame );
  // The frame whose level is nearest to i_Level; -1 for black.
  int FrameForLevel( int i_Level );

  // Writes the recording; empty on failure.
  std::string WriteRecording( const std::string& i_rPath, const VRecordingSpec& i_rSpec );
} // namespace WindowTest
