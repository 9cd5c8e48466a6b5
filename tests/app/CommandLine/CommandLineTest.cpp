#include "app/CommandLine/CommandLine.h"

#include <gtest/gtest.h>

#include <sys/wait.h>

#include <cstdio>
#include <sstream>
#include <vector>

using LumekVideoViewer::VCommandLine;

namespace
{
  const std::string DefaultServer = "https://versions.lumek.example/";

  int Parse( std::vector< std::string > i_Arguments, VCommandLine& o_rCommandLine, std::string& o_rErrors )
  {
    i_Arguments.insert( i_Arguments.begin(), "lumekvideoviewer" );
    std::vector< const char* > Pointers;
    for( const std::string& rArgument : i_Arguments )
      Pointers.push_back( rArgument.c_str() );
    std::ostringstream Errors;
    const int Result = LumekVideoViewer::ParseCommandLine( static_cast< int >( Pointers.size() ), Pointers.data(),
                                                           DefaultServer, o_rCommandLine, Errors );
    o_rErrors = Errors.str();
    return Result;
  }

  std::string ErrorText( const std::string& i_rReason )
  {
    return "Error parsing command line: " + i_rReason + "\nUse --help for more information.\n";
  }
} // namespace

TEST( CommandLine, GoodCommandLines )
{
  struct VRow
  {
    std::vector< std::string > Arguments;
    std::string Server, Spoof, Input;
  };
  const VRow Rows[] = {
      { {}, DefaultServer, "", "" },
      { { "--version-server", "http://127.0.0.1:9/", "--spoof-version=0.3.0.55914h", "clip.lvid" },
        "http://127.0.0.1:9/",
        "0.3.0.55914h",
        "clip.lvid" },
      { { "--input-file", "other.lvid" }, DefaultServer, "", "other.lvid" },
      { { "--version-server=" }, "", "", "" },
      // Accepted, but nothing can reach the developer mode.
      { { "--developer", "clip.lvid" }, DefaultServer, "", "clip.lvid" },
  };
  for( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( testing::PrintToString( rRow.Arguments ) );
    VCommandLine CommandLine;
    std::string Errors;
    EXPECT_EQ( Parse( rRow.Arguments, CommandLine, Errors ), 0 );
    EXPECT_EQ( Errors, "" );
    EXPECT_EQ( CommandLine.VersionServer, rRow.Server );
    EXPECT_EQ( CommandLine.SpoofVersion, rRow.Spoof );
    EXPECT_EQ( CommandLine.InputFile, rRow.Input );
    EXPECT_FALSE( CommandLine.bDeveloper );
  }
}

TEST( CommandLine, ErrorsGiveTwoLinesAndExitCode255 )
{
  const std::pair< std::vector< std::string >, std::string > Rows[] = {
      { { "--help" }, "unrecognised option '--help'" },
      { { "--bogus" }, "unrecognised option '--bogus'" },
      { { "a.lvid", "b.lvid" }, "option '--input-file' cannot be specified more than once" },
      { { "--version-server" }, "the required argument for option '--version-server' is missing" },
      { { "--version-server=a", "--version-server=b" },
        "option '--version-server' cannot be specified more than once" },
  };
  for( const auto& rRow : Rows )
  {
    SCOPED_TRACE( testing::PrintToString( rRow.first ) );
    VCommandLine CommandLine;
    std::string Errors;
    EXPECT_EQ( Parse( rRow.first, CommandLine, Errors ), 255 );
    EXPECT_EQ( Errors, ErrorText( rRow.second ) );
  }
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
