#pragma once

#include "app/CommandLine/CommandLine.h"

namespace LumekVideoViewer
{
  // Builds the application and its one window, opens the file of the command line and runs the
  // event loop; the result is the process's exit code.
  int RunApplication( int& io_rArgumentCount, char** io_pArguments, const VCommandLine& i_rCommandLine );
} // namespace LumekVideoViewer
