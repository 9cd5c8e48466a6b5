#include "app/CommandLine/CommandLine.h"
#include "tests/support/TestNames.h"

#include <gtest/gtest.h>

#include <sys/wait.h>

#include <cstdio>
#include <sstream>

using LumekVideoViewer::ParseCommandLine;
using LumekVideoViewer::VCommandLine;

namespace
{
  const std::string DefaultServer = "https://versions.lumek.example/";

  struct VParse
  {
    int Result;
    VCommandLine CommandLine;
    std::string Errors;
  };

  VParse Parse( std::vector< std::string > i_Arguments )
  {
    i_Arguments.insert( i_Arguments.begin(), "lumekvideoviewer" );
    std::vector< const char* > Pointers;
    for( const std::string& rArgument : i_Arguments )
      Pointers.push_back( rArgument.c_str() );
    VParse Result;
    std::ostringstream Errors;
    Result.Result = ParseCommandLine( static_cast< int >( Pointers.size() ), Pointers.data(), DefaultServer,
                                      Result.CommandLine, Errors );
    Result.Errors = Errors.str();
    return Result;
  }

  std::string ErrorText( const std::string& i_rReason )
  {
    return "Error parsing command line: " + i_rReason + "\nUse --help for more information.\n";
  }
} // namespace

TEST( CommandLine, DefaultsAndValues )
{
  const VParse Empty = Parse( {} );
  EXPECT_EQ( Empty.Result, 0 );
  EXPECT_EQ( Empty.CommandLine.VersionServer, DefaultServer );
  EXPECT_EQ( Empty.CommandLine.SpoofVersion, "" );
  EXPECT_EQ( Empty.CommandLine.InputFile, "" );

  const VParse Full =
      Parse( { "--version-server", "http://127.0.0.1:9/", "--spoof-version=0.3.0.55914h", "clip.lvid" } );
  EXPECT_EQ( Full.Result, 0 );
  EXPECT_EQ( Full.CommandLine.VersionServer, "http://127.0.0.1:9/" );
  EXPECT_EQ( Full.CommandLine.SpoofVersion, "0.3.0.55914h" );
  EXPECT_EQ( Full.CommandLine.InputFile, "clip.lvid" );
  EXPECT_EQ( Parse( { "--input-file", "other.lvid" } ).CommandLine.InputFile, "other.lvid" );
}

TEST( CommandLine, DeveloperIsAcceptedButNeverReachable )
{
  const VParse Developer = Parse( { "--developer", "clip.lvid" } );
  EXPECT_EQ( Developer.Result, 0 );
  EXPECT_FALSE( Developer.CommandLine.bDeveloper );
  EXPECT_EQ( Developer.CommandLine.InputFile, "clip.lvid" );
}

TEST( CommandLine, EmptyServerIsAccepted )
{
  const VParse Parsed = Parse( { "--version-server=" } );
  EXPECT_EQ( Parsed.Result, 0 );
  EXPECT_EQ( Parsed.CommandLine.VersionServer, "" );
}

struct VBadCommandLine
{
  const char* Name;
  std::vector< std::string > Arguments;
  std::string Reason;
};

class CommandLineErrors : public testing::TestWithParam< VBadCommandLine >
{
};

TEST_P( CommandLineErrors, TwoLinesAndExitCode255 )
{
  const VParse Parsed = Parse( GetParam().Arguments );
  EXPECT_EQ( Parsed.Result, 255 );
  EXPECT_EQ( Parsed.Errors, ErrorText( GetParam().Reason ) );
}

INSTANTIATE_TEST_SUITE_P(
    Cases, CommandLineErrors,
    testing::Values( VBadCommandLine{ "HelpIsNotAnOption", { "--help" }, "unrecognised option '--help'" },
                     VBadCommandLine{ "UnknownOption", { "--bogus" }, "unrecognised option '--bogus'" },
                     VBadCommandLine{ "TwoFiles",
                                      { "a.lvid", "b.lvid" },
                                      "option '--input-file' cannot be specified more than once" },
                     VBadCommandLine{ "ServerWithoutAddress",
                                      { "--version-server" },
                                      "the required argument for option '--version-server' is missing" },
                     VBadCommandLine{ "TwoServers",
                                      { "--version-server=a", "--version-server=b" },
                                      "option '--version-server' cannot be specified more than once" } ),
    LumekTest::VCaseName() );

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
