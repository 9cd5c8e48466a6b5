#pragma once

// Files made by ffmpeg for the tests, and ffmpeg's and ffprobe's own view of them. A fixture is
// made once per build folder and shared by every test process (CTest runs each case in a
// process of its own), so a suite of hundreds of cases pays for each file once.

#include <cstdint>
#include <string>
#include <vector>

namespace LumekTest
{
  bool HaveFfmpeg();

  // Runs "ffmpeg -y -v error ARGUMENTS OUTPUT" unless a file of that name and those arguments
  // was made before, and returns OUTPUT's path. The name's extension chooses the container.
  // Empty, with a test failure that shows ffmpeg's words, when ffmpeg failed.
  std::string FfmpegFixture( const std::string& i_rName, const std::vector< std::string >& i_rArguments );

  // Every frame of the file as ffmpeg decodes it, in one raw pixel format ("uyvy422", "rgb24").
  // The extra arguments go before "-i".
  std::vector< std::uint8_t > FfmpegDecode( const std::string& i_rPath, const std::string& i_rPixelFormat,
                                            const std::vector< std::string >& i_rExtraInputArguments = {} );

  // ffprobe's standard output for "ffprobe -v error ARGUMENTS FILE".
  std::string Ffprobe( const std::string& i_rPath, const std::vector< std::string >& i_rArguments );

  // Runs a command line through the shell and returns its standard output.
  std::string RunCommand( const std::string& i_rCommandLine, int* o_pExitCode = nullptr );

  // Runs "TOOL frames" on both files and checks that they give the same pictures, byte for byte,
  // and that there are i_Count of them.
  void ExpectSameToolFrames( const std::string& i_rTool, const std::string& i_rFirst, const std::string& i_rSecond,
                             int i_Count );

  // A word quoted for the shell.
  std::string ShellQuote( const std::string& i_rWord );
} // namespace LumekTest
