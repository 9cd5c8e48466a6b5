// The command table is the tool's one list of commands: what the usage text shows is what the
// dispatch runs.

#include "tools/LumekVideoTool/ToolCommands.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <set>
#include <sstream>

TEST( ToolCommandTable, EveryRowIsShownAndDispatched )
{
  const std::string& rUsage = LumekVideoTool::UsageText();
  std::set< std::string > Names;
  for( const LumekVideoTool::VToolCommand& rCommand : LumekVideoTool::ToolCommands() )
  {
    EXPECT_TRUE( Names.insert( rCommand.Name ).second ) << "two rows named " << rCommand.Name;
    EXPECT_EQ( LumekVideoTool::FindToolCommand( rCommand.Name ), &rCommand );
    const std::string Arguments = rCommand.Arguments;
    const std::string Synopsis =
        std::string( "\n  " ) + rCommand.Name + " " + Arguments.substr( 0, Arguments.find( '\n' ) );
    EXPECT_NE( rUsage.find( Synopsis ), std::string::npos ) << Synopsis << "\n" << rUsage;

    // The row's entry parses its own options: an unknown one is its usage error, not the tool's.
    std::ostringstream Out, Err;
    EXPECT_EQ( LumekVideoTool::RunTool( { rCommand.Name, "--no-such-option" }, Out, Err ), LumekVideoTool::Exit_Usage );
    EXPECT_EQ( Err.str().rfind( std::string( "lumekvideotool " ) + rCommand.Name + ": ", 0 ), 0u ) << Err.str();
  }
  EXPECT_EQ( LumekVideoTool::FindToolCommand( "no-such-command" ), nullptr );
}

TEST( ToolCommandTable, DescriptionsLineUpInOneColumn )
{
  std::istringstream Usage( LumekVideoTool::UsageText() );
  int Described = 0;
  for( std::string Line; std::getline( Usage, Line ); )
  {
    // A description line: indented past the synopsis, or following it after two spaces or more.
    const std::size_t Column = 32;
    if( Line.size() <= Column || Line.compare( 0, 2, "  " ) != 0 )
      continue;
    if( Line[Column - 1] == ' ' && Line[Column] != ' ' )
      ++Described;
  }
  std::size_t Expected = 0;
  for( const LumekVideoTool::VToolCommand& rCommand : LumekVideoTool::ToolCommands() )
    Expected +=
        1 + std::count( rCommand.Description, rCommand.Description + std::strlen( rCommand.Description ), '\n' );
  EXPECT_EQ( Described, int( Expected ) ) << LumekVideoTool::UsageText();
}
