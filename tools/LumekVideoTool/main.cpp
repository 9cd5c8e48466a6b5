#include "services/DebugServices.h"
#include "tools/LumekVideoTool/ToolCommands.h"

#include <iostream>

int main( int argc, char** argv )
{
  DebugServices::SetApplicationVersion( &LumekVideoViewer::ApplicationVersion() );
  std::ios::sync_with_stdio( false );
  const LumekVideoTool::VArguments Arguments( argv + 1, argv + argc );
  const int Result = LumekVideoTool::RunTool( Arguments, std::cout, std::cerr );
  std::cout.flush();
  return Result;
}
