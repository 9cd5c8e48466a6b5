#include "tests/fileio/ImageDecoders/ImageTestSupport.h"

#include <algorithm>
#include <fstream>
#include <iterator>

namespace LumekTest
{
  VCategoryLog::VCategoryLog( std::string i_Category ) : m_Category( std::move( i_Category ) )
  {
    m_Handle = ZOL::GlobalLog().AddSink(
        [this]( const ZOL::ILogRecord& i_rRecord )
        {
          if( i_rRecord.Category == m_Category )
            m_Lines.push_back( std::to_string( i_rRecord.Level ) + " " + i_rRecord.Message );
        },
        ZOL::LogDetail );
  }

  VCategoryLog::~VCategoryLog()
  {
    ZOL::GlobalLog().RemoveSink( m_Handle );
  }

  bool VCategoryLog::Contains( const std::string& i_rText ) const
  {
    return std::any_of( m_Lines.begin(), m_Lines.end(),
                        [&]( const std::string& i_rLine ) { return i_rLine.find( i_rText ) != std::string::npos; } );
  }

  std::shared_ptr< ZOL::IBufferAllocator > MakeFrameAllocator()
  {
    return std::make_shared< ZOL::VFrameBufferAllocator >();
  }

  std::vector< std::uint8_t > ReadWholeFile( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return std::vector< std::uint8_t >( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
  }

  void WriteWholeFile( const std::string& i_rPath, const std::vector< std::uint8_t >& i_rBytes )
  {
    std::ofstream File( i_rPath, std::ios::binary );
    File.write( reinterpret_cast< const char* >( i_rBytes.data() ), static_cast< std::streamsize >( i_rBytes.size() ) );
  }

  std::string SeedPath( const std::string& i_rName )
  {
    return std::string( LUMEK_SEED_DIR ) + "/" + i_rName;
  }

  ZOL::IVideoFrameInfo FrameInfo( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    return Info;
  }
} // namespace LumekTest
