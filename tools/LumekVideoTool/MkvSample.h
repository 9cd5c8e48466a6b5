#pragma once

#include "tools/LumekVideoTool/SampleScene.h"

#include <string>

namespace LumekVideoTool
{
  // Writes the demonstration recording as a Matroska file of the family: raw frames of a format
  // Matroska holds here (R8G8B8u8, U8Y8V8Y8, Y8U8Y8V8, Luminance8), the tone as 16-bit PCM, and
  // timing, timecode and settings as Lumek tags. False with a reason in o_rError.
  bool WriteSampleMkv( const std::string& i_rPath, const VSampleOptions& i_rOptions, std::string& o_rError );

  // Whether the output's name asks for a Matroska file.
  bool IsMkvPath( const std::string& i_rPath );
} // namespace LumekVideoTool
