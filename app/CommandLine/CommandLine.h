#pragma once

#include <ostream>
#include <string>

namespace LumekVideoViewer
{
  // What the viewer's command line says.
  struct VCommandLine
  {
    bool bDeveloper = false;
    std::string VersionServer;
    std::string SpoofVersion;
    std::string InputFile;
  };

  constexpr int CommandLineErrorExitCode = 255;

  // Parses the viewer's four options into o_rCommandLine. Returns 0, or 255 after writing the two
  // lines of the error to io_rErrors; there is no --help, so asking for it takes the error path.
  int ParseCommandLine( int i_ArgumentCount, const char* const* i_pArguments, const std::string& i_rDefaultServer,
                        VCommandLine& o_rCommandLine, std::ostream& io_rErrors );
} // namespace LumekVideoViewer
