// The tool's use of the file functions: a conversion that is interrupted or killed leaves an
// existing output as it was, and a recording still being written is reported with the program
// that writes it.

#include "ToolRunner.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <chrono>
#include <numeric>
#include <thread>

extern char** environ;

namespace
{
  using namespace LumekVideoToolTest;
  namespace fs = boost::filesystem;

  // A child started with posix_spawn, with standard output and error sent nowhere and, if
  // asked, a file held open for writing; killed and reaped when it goes out of scope.
  class VChild
  {
  public:
    VChild( std::vector< std::string > i_Arguments, const std::string& i_rHeldFile = "" )
    {
      posix_spawn_file_actions_t Actions;
      posix_spawn_file_actions_init( &Actions );
      posix_spawn_file_actions_addopen( &Actions, STDOUT_FILENO, "/dev/null", O_WRONLY, 0 );
      posix_spawn_file_actions_addopen( &Actions, STDERR_FILENO, "/dev/null", O_WRONLY, 0 );
      if( !i_rHeldFile.empty() )
        posix_spawn_file_actions_addopen( &Actions, 3, i_rHeldFile.c_str(), O_WRONLY | O_APPEND, 0 );
      std::vector< char* > Arguments;
      for( std::string& rArgument : i_Arguments )
        Arguments.push_back( &rArgument[0] );
      Arguments.push_back( nullptr );
      bOk = ::posix_spawnp( &m_Process, Arguments[0], &Actions, nullptr, Arguments.data(), environ ) == 0;
      posix_spawn_file_actions_destroy( &Actions );
    }
    ~VChild() { Stop( SIGKILL ); }
    // Sends the signal and waits for the end; false if the child had already ended by itself.
    bool Stop( int i_Signal )
    {
      const bool bRunning = m_Process > 0 && ::waitpid( m_Process, nullptr, WNOHANG ) == 0;
      if( bRunning )
      {
        ::kill( m_Process, i_Signal );
        ::waitpid( m_Process, nullptr, 0 );
      }
      m_Process = 0;
      return bRunning;
    }
    pid_t Process() const { return m_Process; }
    bool bOk = false;

  private:
    pid_t m_Process = 0;
  };

  std::uint64_t LargestPartialSize( const std::string& i_rFolder )
  {
    std::uint64_t Largest = 0;
    boost::system::error_code Error;
    for( fs::directory_iterator It( i_rFolder, Error ), End; !Error && It != End; It.increment( Error ) )
      if( It->path().filename().string().find( ".partial-" ) != std::string::npos )
        Largest = std::max< std::uint64_t >( Largest, fs::file_size( It->path(), Error ) );
    return Largest;
  }

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

    // A user's Ctrl+C lets the tool remove its temporary file; a kill leaves it behind, but
    // the output is replaced only by a whole recording either way.
    for( const int Signal : { SIGINT, SIGKILL } )
    {
      SCOPED_TRACE( Signal == SIGINT ? "interrupted" : "killed" );
      VChild Convert( { LUMEK_TOOL_PATH, "convert", LargeInput, Output } );
      ASSERT_TRUE( Convert.bOk );
      const auto Deadline = std::chrono::steady_clock::now() + std::chrono::seconds( 60 );
      while( LargestPartialSize( Scratch.Path( "" ) ) < ( 8u << 20 ) && std::chrono::steady_clock::now() < Deadline )
        std::this_thread::sleep_for( std::chrono::milliseconds( 1 ) );
      ASSERT_TRUE( Convert.Stop( Signal ) ) << "the conversion ended before it could be stopped";
      EXPECT_EQ( Scratch.HasPartial(), Signal == SIGKILL );
      EXPECT_EQ( ReadFileBytes( Output ), Before );
      const VRun Info = RunTool( { "info", Output } );
      EXPECT_EQ( Info.ExitCode, 0 ) << Info.Err;
    }
  }

  TEST( ConvertReplace, ARecordingStillBeingWrittenNamesItsWriter )
  {
    const VScratch Scratch;
    const std::string Path = Scratch.Path( "capturing.lvid" );
    // A capture that has its header but not yet its index.
    const VBytes Whole = ReadFileBytes( WriteRecording( Scratch, "whole.lvid", {} ) );
    WriteFileBytes( Path, VBytes( Whole.begin(), Whole.begin() + Whole.size() / 2 ) );

    VChild Writer( { "sleep", "60" }, Path );
    ASSERT_TRUE( Writer.bOk );
    const VRun Run = RunTool( { "info", Path } );
    EXPECT_EQ( Run.ExitCode, 1 );
    EXPECT_EQ( Run.Err.rfind( "The video file could not be opened. It is still being written by ", 0 ), 0u ) << Run.Err;
    EXPECT_NE( Run.Err.find( "sleep (process " + std::to_string( Writer.Process() ) + ")." ), std::string::npos )
        << Run.Err;
    Writer.Stop( SIGKILL );
    const VRun After = RunTool( { "info", Path } );
    EXPECT_EQ( After.Err.find( "still being written" ), std::string::npos ) << After.Err;
  }
} // namespace
