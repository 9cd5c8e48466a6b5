#pragma once

// Runs lumekvideotool, as a program the way scripts do or in this process where only the
// command's answer matters, on recordings written here.

#include "tools/LumekVideoTool/FrameEncoding.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <boost/filesystem.hpp>
#include <boost/property_tree/ptree.hpp>

#include <optional>
#include <string>
#include <vector>

namespace LumekVideoToolTest
{
  using VBytes = std::vector< std::uint8_t >;

  struct VRun
  {
    int ExitCode = -1; // the shell gives 128 + the signal for a program killed by one
    std::string Out;
    std::string Err;
  };

  // Runs the real lumekvideotool program with the arguments, its standard output a pipe.
  VRun RunTool( const std::vector< std::string >& i_rArguments );
  // Runs the command in this process, with the log kept off standard error.
  VRun RunInProcess( const std::vector< std::string >& i_rArguments );

  // Parses JSON text with a parser other than the tool's; fails the test on bad JSON.
  boost::property_tree::ptree ParseJson( const std::string& i_rText );

  // A folder of its own for each test, removed at the end.
  struct VScratch
  {
    VScratch() { boost::filesystem::create_directories( Folder ); }
    ~VScratch() { boost::filesystem::remove_all( Folder, Error ); }
    std::string Path( const std::string& i_rName ) const { return ( Folder / i_rName ).string(); }
    // The size of the largest temporary file a conversion left here, if it left any.
    std::optional< std::uint64_t > Partial() const;

    const boost::filesystem::path Folder =
        boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "lvtool-test-%%%%%%%%" );
    boost::system::error_code Error;
  };

  struct VRecordingSpec
  {
    ZOL::EPixelFormat Format = ZOL::PixelFormat_R8G8B8;
    int Width = 6;
    int Height = 4;
    std::vector< std::uint64_t > Frames = { 0, 1, 2 };
    bool bAudio = false;
    bool bInverted = false; // rows stored bottom to top
    ZOL::IVideoSettings Settings = {};
  };

  // A recording whose frame n is PictureFor( n ), written with the .lvid writer, with 25 fps
  // timing, a timecode from 01:00:00:00 and a key of its own.
  std::string WriteRecording( const VScratch& i_rScratch, const std::string& i_rName, const VRecordingSpec& i_rSpec );
  LumekVideoTool::VRGBImage PictureFor( std::uint64_t i_Frame, int i_Width, int i_Height );

  VBytes ReadFileBytes( const std::string& i_rPath );
  void WriteFileBytes( const std::string& i_rPath, const VBytes& i_rBytes );
} // namespace LumekVideoToolTest
