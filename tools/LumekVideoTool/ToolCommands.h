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
  int RunThumbnail( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );

  using VCommandEntry = int ( * )( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );

  // One row per command: the dispatch and the usage text are both made from it, so a new command
  // is one row and its entry function.
  struct VToolCommand
  {
    const char* Name;
    // The arguments after the name; "\n" continues them on a line of their own.
    const char* Arguments;
    // What the command does; "\n" starts another line.
    const char* Description;
    VCommandEntry Run;
  };

  const std::vector< VToolCommand >& ToolCommands();

  // The command's row, or nullptr.
  const VToolCommand* FindToolCommand( const std::string& i_rName );

  // Dispatches on the command name; "--help" prints the usage.
  int RunTool( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr );

  const std::string& UsageText();
} // namespace LumekVideoTool
