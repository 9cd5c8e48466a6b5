// The tool's use of the file functions: a conversion that is interrupted or killed leaves an
// existing output as it was, and a recording still being written is reported with the program
// that writes it.

#include "ToolRunner.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <numeric>
#include <thread>

namespace
{
  using namespace LumekVideoToolTest;
  namespace fs = boost::filesystem;

  TEST( ConvertReplace, AStoppedConversionLeavesTheExistingOutputUntouched )
  {
    const VScratch Scratch;
    const std::string Output = Scratch.Path( "out.lvid" );
    ASSERT_EQ( RunTool( { "convert", WriteRecording( Scratch, "small.lvid", {} ), Output } ).ExitCode, 0 );
    const VBytes Before = ReadFileBytes( Output );
    ASSERT_FALSE( Before.empty() );
    // Large enough that the conversion is still writing when the test looks.
    VRecordingSpec Large;
    Large.Width = 1280;
    Large.Height = 720;
    Large.Frames.resize( 60 );
    std::iota( Large.Frames.begin(), Large.Frames.end(), 0 );
    const std::string LargeInput = WriteRecording( Scratch, "large.lvid", Large );

    // A user's Ctrl+C lets the tool remove its temporary file; a kill leaves it behind. Either
    // way the output is replaced by a whole recording or not at all.
    for( const int Signal : { SIGINT, SIGKILL } )
    {
      SCOPED_TRACE( Signal == SIGINT ? "interrupted" : "killed" );
      const pid_t Child = fork();
      ASSERT_GE( Child, 0 );
      if( Child == 0 )
      {
        std::freopen( "/dev/null", "w", stderr );
        execl( LUMEK_TOOL_PATH, LUMEK_TOOL_PATH, "convert", LargeInput.c_str(), Output.c_str(),
               static_cast< char* >( nullptr ) );
        _exit( 127 );
      }
      const auto Deadline = std::chrono::steady_clock::now() + std::chrono::seconds( 60 );
      while( Scratch.Partial().value_or( 0 ) < ( 8u << 20 ) && std::chrono::steady_clock::now() < Deadline )
        std::this_thread::sleep_for( std::chrono::milliseconds( 1 ) );
      const bool bRunning = waitpid( Child, nullptr, WNOHANG ) == 0;
      kill( Child, Signal );
      waitpid( Child, nullptr, 0 );
      ASSERT_TRUE( bRunning ) << "the conversion ended before it could be stopped";
      EXPECT_EQ( Scratch.Partial().has_value(), Signal == SIGKILL );
      EXPECT_EQ( ReadFileBytes( Output ), Before );
      EXPECT_EQ( RunInProcess( { "info", Output } ).ExitCode, 0 );
    }
  }

  TEST( ConvertReplace, ARecordingStillBeingWrittenNamesItsWriter )
  {
    const VScratch Scratch;
    const std::string Path = Scratch.Path( "capturing.lvid" );
    // A capture that has its header but not yet its index, held open for writing by this test.
    const VBytes Whole = ReadFileBytes( WriteRecording( Scratch, "whole.lvid", {} ) );
    WriteFileBytes( Path, VBytes( Whole.begin(), Whole.begin() + Whole.size() / 2 ) );
    const int Held = open( Path.c_str(), O_WRONLY | O_APPEND | O_CLOEXEC );
    ASSERT_GE( Held, 0 );
    const VRun Run = RunTool( { "info", Path } );
    EXPECT_EQ( Run.ExitCode, 1 );
    EXPECT_EQ( Run.Err.rfind( "The video file could not be opened. It is still being written by ", 0 ), 0u ) << Run.Err;
    EXPECT_NE( Run.Err.find( " (process " + std::to_string( getpid() ) + ")." ), std::string::npos ) << Run.Err;
    close( Held );
    const VRun After = RunTool( { "info", Path } );
    EXPECT_EQ( After.Err.find( "still being written" ), std::string::npos ) << After.Err;
  }
} // namespace
