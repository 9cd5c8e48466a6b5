#include "app/CommandLine/CommandLine.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

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

// The real binary: exit code and the exact two lines on standard error, with nothing started.
TEST( CommandLine, TheProgramItselfAnswersOnStandardError )
{
  int ExitCode = 0;
  EXPECT_EQ( LumekTest::RunCommand( LUMEK_VIEWER_PATH " --help 2>&1 >/dev/null", &ExitCode ),
             ErrorText( "unrecognised option '--help'" ) );
  EXPECT_EQ( ExitCode, 255 );
}
