#include "tests/fileio/ImageDecoders/ImageTestSupport.h"

#include <fstream>
#include <iterator>

namespace LumekTest
{
  VBytes ReadWholeFile( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return VBytes( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
  }

  void WriteWholeFile( const std::string& i_rPath, const VBytes& i_rBytes )
  {
    std::ofstream File( i_rPath, std::ios::binary );
    File.write( reinterpret_cast< const char* >( i_rBytes.data() ), static_cast< std::streamsize >( i_rBytes.size() ) );
  }

  bool Logged( const VLogCapture& i_rLog, const std::string& i_rText )
  {
    for( const std::string& rLine : i_rLog.Lines() )
      if( rLine.find( i_rText ) != std::string::npos )
        return true;
    return false;
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
