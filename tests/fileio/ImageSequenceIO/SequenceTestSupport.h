#pragma once

// Folders of image files for the sequence tests: made in a fresh temporary folder, with
// descriptors written by the project's own writer.

#include "fileio/ImageSequenceIO/SequenceDescriptor.h"
#include "fileio/ImageSequenceIO/VImageSequenceReader.h"

#include <cstdint>
#include <set>
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

  // A PNG signature and IHDR of a 40 x 30 RGB image: all a reader takes from an image to open.
  VBytes PngHeader();

  // A descriptor of a 48 x 32 sequence at 25 frames a second with this pattern and count.
  ImageSequenceIO::VDescriptor MakeDescriptor( const std::string& i_rPattern, std::uint32_t i_FrameCount,
                                               std::uint32_t i_IndexPad = 8, std::uint32_t i_NumberPad = 8 );

  // The frames below i_Count that the reader says are on disk, asserting that its index says
  // the same of each.
  std::set< std::uint64_t > StoredFrames( const ImageSequenceIO::VImageSequenceReader& i_rReader,
                                          std::uint64_t i_Count );
} // namespace ImageSequenceTest
