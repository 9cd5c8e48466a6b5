#pragma once

// Where the time bar puts its frame marks: round steps (1, 2, 5 times a power of ten) that leave a
// numbered mark every 50 to 125 pixels or so, whatever the length of the file.

#include <vector>

namespace LumekVideoViewer
{
  struct VTickSteps
  {
    // Frames between numbered marks, and between the short marks in between. Both at least 1.
    int Major = 1;
    int Minor = 1;
  };

  // The steps for a bar that shows i_FramesPerPixel frames in each pixel. Zero, negative or
  // non-finite densities give a step of 1.
  VTickSteps ComputeTickSteps( double i_FramesPerPixel );

  struct VTick
  {
    int Frame;
    // Horizontal centre of the mark in widget pixels.
    float Position;
    bool Major;
  };

  // The marks of frames 0 to i_Maximum along a groove of i_GrooveWidth pixels whose handle is
  // i_HandleWidth wide: frame 0 sits under the handle's centre at the left end, i_Maximum at the
  // right end. A maximum of 0 has the single mark of frame 0 at the left end.
  std::vector< VTick > LayoutTicks( int i_Maximum, int i_GrooveWidth, int i_HandleWidth, VTickSteps i_Steps );
} // namespace LumekVideoViewer
