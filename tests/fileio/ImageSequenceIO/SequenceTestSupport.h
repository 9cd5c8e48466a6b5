#pragma once

// Folders of image files for the sequence tests: made in a fresh temporary folder, with
// descriptors written by the project's own writer.

#include "fileio/ImageSequenceIO/SequenceDescriptor.h"
#include "services/ILogCategorised.h"

#include <cstdint>
#include <string>
#include <vector>

namespace ImageSequenceTest
{
  using VBytes = std::vector< std::uint8_t >;

  // A temporary folder that goes with everything in it.
  class VTempFolder
  {
  public:
    VTempFolder();
    ~VTempFolder();
    VTempFolder( const VTempFolder& ) = delete;
    VTempFolder& operator=( const VTempFolder& ) = delete;

    const std::string& Path() const { return m_Path; }
    std::string operator/( const std::string& i_rName ) const { return m_Path + "/" + i_rName; }

  private:
    std::string m_Path;
  };

  void WriteFile( const std::string& i_rPath, const VBytes& i_rBytes );
  void WriteFile( const std::string& i_rPath, const std::string& i_rText );
  VBytes ReadFile( const std::string& i_rPath );
  void CopyFile( const std::string& i_rFrom, const std::string& i_rTo );

  // A descriptor of a 48 x 32 sequence at 25 frames a second with this pattern and count.
  ImageSequenceIO::VDescriptor MakeDescriptor( const std::string& i_rPattern, std::uint32_t i_FrameCount,
                                               std::uint32_t i_IndexPad = 8, std::uint32_t i_NumberPad = 8 );

  // Keeps the expected failure lines of a damage test off standard error while it lives.
  class VQuietLog
  {
  public:
    VQuietLog();
    ~VQuietLog();
    VQuietLog( const VQuietLog& ) = delete;
    VQuietLog& operator=( const VQuietLog& ) = delete;

  private:
    int m_Level;
  };

  // Every message of one category while it lives.
  class VLogCapture
  {
  public:
    explicit VLogCapture( std::string i_Category );
    ~VLogCapture();
    VLogCapture( const VLogCapture& ) = delete;
    VLogCapture& operator=( const VLogCapture& ) = delete;
    const std::vector< ZOL::ILogRecord >& Records() const { return m_Records; }

  private:
    std::string m_Category;
    int m_Handle;
    std::vector< ZOL::ILogRecord > m_Records;
  };
} // namespace ImageSequenceTest
