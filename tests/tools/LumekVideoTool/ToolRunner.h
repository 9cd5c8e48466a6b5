#pragma once

#include "tools/LumekVideoTool/FrameEncoding.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <boost/filesystem.hpp>
#include <boost/property_tree/ptree.hpp>

#include <string>
#include <vector>

namespace LumekVideoToolTest
{
  struct VRun
  {
    int ExitCode = -1;
    bool bSignalled = false;
    std::string Out;
    std::string Err;
  };

  // Runs the real lumekvideotool binary with the arguments.
  VRun RunTool( const std::vector< std::string >& i_rArguments );

  // Parses JSON text; fails the test on bad JSON.
  boost::property_tree::ptree ParseJson( const std::string& i_rText );

  // A folder of its own for each test, removed at the end.
  class VScratch
  {
  public:
    VScratch();
    ~VScratch();
    std::string Path( const std::string& i_rName ) const { return ( m_Folder / i_rName ).string(); }

  private:
    boost::filesystem::path m_Folder;
  };

  struct VRecordingSpec
  {
    ZOL::EPixelFormat Format = ZOL::PixelFormat_R8G8B8;
    int Width = 6;
    int Height = 4;
    std::vector< std::uint64_t > Frames = { 0, 1, 2 };
    bool bAudio = false;
    bool bInverted = false; // rows stored bottom to top
    ZOL::IVideoSettings Settings;
  };

  // A recording whose frame n is PictureFor( n ), written with the .lvid writer.
  std::string WriteRecording( const VScratch& i_rScratch, const std::string& i_rName, const VRecordingSpec& i_rSpec );
  LumekVideoTool::VRGBImage PictureFor( std::uint64_t i_Frame, int i_Width, int i_Height );

  std::vector< std::uint8_t > ReadFileBytes( const std::string& i_rPath );
  void WriteFileBytes( const std::string& i_rPath, const std::vector< std::uint8_t >& i_rBytes );
} // namespace LumekVideoToolTest
