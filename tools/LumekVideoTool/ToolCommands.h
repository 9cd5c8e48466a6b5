#pragma once

// The commands of lumekvideotool. Each takes the arguments after its name and returns the
// process's exit code.

#include <ostream>
#include <string>
#include <vector>

namespace LumekVideoTool
{
  enum EExitCode : int
  {
    Exit_Success = 0,
    Exit_CannotOpen = 1,
    Exit_Usage = 2,
    Exit_FramesFailed = 3,
  };

  using VArguments = std::vector< std::string >;

  int RunInfo( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );
  int RunFrames( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );
  int RunDump( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );
  int RunConvert( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );
  int RunBench( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );
  int RunMakeSample( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );

  // Dispatches on the command name; "--help" prints the usage.
  int RunTool( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );

  const char* UsageText();
} // namespace LumekVideoTool
