#include "tests/fileio/ImageSequenceIO/SequenceTestSupport.h"

#include <boost/filesystem.hpp>
#include <gtest/gtest.h>

#include <fstream>
#include <iterator>

namespace ImageSequenceTest
{
  namespace fs = boost::filesystem;

  VTempFolder::VTempFolder()
      : m_Path( ( fs::temp_directory_path() / fs::unique_path( "lumek-sequence-%%%%-%%%%-%%%%" ) ).string() )
  {
    fs::create_directories( m_Path );
  }

  VTempFolder::~VTempFolder()
  {
    boost::system::error_code Error;
    fs::remove_all( m_Path, Error );
  }

  void WriteFile( const std::string& i_rPath, const VBytes& i_rBytes )
  {
    std::ofstream File( i_rPath, std::ios::binary | std::ios::trunc );
    File.write( reinterpret_cast< const char* >( i_rBytes.data() ), static_cast< std::streamsize >( i_rBytes.size() ) );
    ASSERT_TRUE( File.good() ) << i_rPath;
  }

  void WriteFile( const std::string& i_rPath, const std::string& i_rText )
  {
    WriteFile( i_rPath, VBytes( i_rText.begin(), i_rText.end() ) );
  }

  VBytes ReadFile( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return VBytes( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
  }

  VBytes PngHeader()
  {
    // Big-endian, as PNG stores its numbers: width 40, height 30, 8 bits, colour type 2.
    return { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A, 0, 0, 0, 13, 'I', 'H', 'D', 'R', 0,
             0,    0,   40,  0,   0,    0,    30,   8,    2, 0, 0, 0,  0,   0,   0,   0 };
  }

  ImageSequenceIO::VDescriptor MakeDescriptor( const std::string& i_rPattern, std::uint32_t i_FrameCount,
                                               std::uint32_t i_IndexPad, std::uint32_t i_NumberPad )
  {
    ImageSequenceIO::VDescriptor Descriptor;
    Descriptor.FrameInfo.ImageWidth = 48;
    Descriptor.FrameInfo.ImageHeight = 32;
    Descriptor.FrameInfo.PixelFormat = ZOL::PixelFormat_R8G8B8;
    Descriptor.FrameInfo.PixelAspectRatio = 1.0;
    Descriptor.Timing.FramePeriodInTicks = Descriptor.Timing.TicksPerSecond / 25;
    Descriptor.Sequence.FileNamePattern = i_rPattern;
    Descriptor.Sequence.FrameCount = i_FrameCount;
    Descriptor.Sequence.FrameIndexPadWidth = i_IndexPad;
    Descriptor.Sequence.FrameNumberPadWidth = i_NumberPad;
    return Descriptor;
  }

  std::set< std::uint64_t > StoredFrames( const ImageSequenceIO::VImageSequenceReader& i_rReader,
                                          std::uint64_t i_Count )
  {
    std::set< std::uint64_t > Stored;
    for( std::uint64_t i = 0; i < i_Count; ++i )
    {
      EXPECT_EQ( i_rReader.HasFrame( i ), i_rReader.FindStoredFrameAtOrAfter( i ) == i ) << "frame " << i;
      if( i_rReader.HasFrame( i ) )
        Stored.insert( i );
    }
    EXPECT_EQ( Stored.size(), i_rReader.GetStoredFrameCount() );
    return Stored;
  }
} // namespace ImageSequenceTest
