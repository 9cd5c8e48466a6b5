#include "app/CommandLine/CommandLine.h"

#include <gtest/gtest.h>

#include <sys/wait.h>

#include <cstdio>
#include <sstream>
#include <vector>

namespace
{
  std::string ErrorText( const std::string& i_rReason )
  {
    return "Error parsing command line: " + i_rReason + "\nUse --help for more information.\n";
  }

  // The exit code, then the server, the spoofed version and the file, or the error's two lines.
  std::string Outcome( std::vector< std::string > i_Arguments )
  {
    i_Arguments.insert( i_Arguments.begin(), "lumekvideoviewer" );
    std::vector< const char* > Pointers;
    for( const std::string& rArgument : i_Arguments )
      Pointers.push_back( rArgument.c_str() );
    LumekVideoViewer::VCommandLine Parsed;
    std::ostringstream Errors;
    const int Result = LumekVideoViewer::ParseCommandLine( static_cast< int >( Pointers.size() ), Pointers.data(),
                                                           "https://versions.lumek.example/", Parsed, Errors );
    if( Result != 0 || !Errors.str().empty() )
      return std::to_string( Result ) + " " + Errors.str();
    return "0 " + Parsed.VersionServer + " | " + Parsed.SpoofVersion + " | " + Parsed.InputFile +
           ( Parsed.bDeveloper ? " | developer" : "" );
  }
} // namespace

TEST( CommandLine, GoodAndBadCommandLines )
{
  const std::pair< std::vector< std::string >, std::string > Rows[] = {
      { {}, "0 https://versions.lumek.example/ |  | " },
      { { "--version-server", "http://127.0.0.1:9/", "--spoof-version=0.3.0.55914h", "clip.lvid" },
        "0 http://127.0.0.1:9/ | 0.3.0.55914h | clip.lvid" },
      { { "--input-file", "other.lvid" }, "0 https://versions.lumek.example/ |  | other.lvid" },
      { { "--version-server=" }, "0  |  | " },
      // Accepted, but nothing can reach the developer mode.
      { { "--developer", "clip.lvid" }, "0 https://versions.lumek.example/ |  | clip.lvid" },
      // There is no --help: asking for it is an error like any unknown option.
      { { "--help" }, "255 " + ErrorText( "unrecognised option '--help'" ) },
      { { "a.lvid", "b.lvid" }, "255 " + ErrorText( "option '--input-file' cannot be specified more than once" ) },
      { { "--version-server" },
        "255 " + ErrorText( "the required argument for option '--version-server' is missing" ) },
      { { "--version-server=a", "--version-server=b" },
        "255 " + ErrorText( "option '--version-server' cannot be specified more than once" ) } };
  for( const auto& [Arguments, Expected] : Rows )
    EXPECT_EQ( Outcome( Arguments ), Expected ) << testing::PrintToString( Arguments );
}

TEST( CommandLine, TheProgramItselfAnswersOnStandardError )
{
  // The real binary: exit code and the exact two lines, with nothing started.
  const std::string Command = std::string( LUMEK_VIEWER_PATH ) + " --help 2>&1 >/dev/null";
  FILE* pPipe = popen( Command.c_str(), "r" );
  ASSERT_NE( pPipe, nullptr );
  std::string Text;
  char Buffer[256];
  while( std::fgets( Buffer, sizeof( Buffer ), pPipe ) )
    Text += Buffer;
  const int Status = pclose( pPipe );
  ASSERT_TRUE( WIFEXITED( Status ) );
  EXPECT_EQ( WEXITSTATUS( Status ), 255 );
  EXPECT_EQ( Text, ErrorText( "unrecognised option '--help'" ) );
}
