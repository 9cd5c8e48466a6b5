#pragma once

#include "app/VideoSource/VVideoSource.h"
#include "tools/LumekVideoTool/ToolCommands.h"

#include <boost/program_options.hpp>

#include <optional>
#include <string>
#include <vector>

namespace LumekVideoTool
{
  // Opens the file; on failure writes "The video file could not be opened." (naming the program
  // still writing it, if one is) and the reasons the readers logged to o_rErr.
  bool OpenSource( LumekVideoViewer::VVideoSource& io_rSource, const std::string& i_rPath, std::ostream& o_rErr );

  // A decoded frame as the viewer shows it: upright R8G8B8 with the file's display settings.
  bool ToDisplayRGB( const ZOL::IVideoSettings& i_rSettings, const ZOL::IVideoFrame& i_rFrame,
                     std::vector< std::uint8_t >& o_rRGB );

  // Parses a command's arguments; on a usage error writes it and the usage text to o_rErr and
  // gives nothing.
  std::optional< boost::program_options::variables_map >
  ParseArguments( const VArguments& i_rArguments, const boost::program_options::options_description& i_rOptions,
                  const boost::program_options::positional_options_description& i_rPositional, const char* i_pCommand,
                  std::ostream& o_rErr );
} // namespace LumekVideoTool
