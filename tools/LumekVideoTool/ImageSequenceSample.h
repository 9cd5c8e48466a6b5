#pragma once

#include "tools/LumekVideoTool/SampleScene.h"

#include <string>

namespace LumekVideoTool
{
  // Writes the demonstration recording as a .lumekimagesequence descriptor and one PNG or JPEG
  // file a frame beside it, named by the descriptor's pattern ("take_%FRAME%.png" for
  // take.lumekimagesequence). The frames are colour pictures; the sequence has no audio. The two
  // frames a sample leaves out have no file. False with a reason in o_rError.
  bool WriteSampleImageSequence( const std::string& i_rPath, const VSampleOptions& i_rOptions, std::string& o_rError );
} // namespace LumekVideoTool
