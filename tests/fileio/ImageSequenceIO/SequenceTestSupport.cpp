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

  void CopyFile( const std::string& i_rFrom, const std::string& i_rTo )
  {
    WriteFile( i_rTo, ReadFile( i_rFrom ) );
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

  VQuietLog::VQuietLog() : m_Level( ZOL::GlobalLog().GetStandardErrorLevel() )
  {
    ZOL::GlobalLog().SetStandardErrorLevel( 1 );
  }

  VQuietLog::~VQuietLog()
  {
    ZOL::GlobalLog().SetStandardErrorLevel( m_Level );
  }

  VLogCapture::VLogCapture( std::string i_Category ) : m_Category( std::move( i_Category ) )
  {
    m_Handle = ZOL::GlobalLog().AddSink(
        [this]( const ZOL::ILogRecord& i_rRecord )
        {
          if( i_rRecord.Category == m_Category )
            m_Records.push_back( i_rRecord );
        },
        6 );
  }

  VLogCapture::~VLogCapture()
  {
    ZOL::GlobalLog().RemoveSink( m_Handle );
  }
} // namespace ImageSequenceTest
