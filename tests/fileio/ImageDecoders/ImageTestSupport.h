#pragma once

// What the still-image decoder tests share: frame allocators, files read whole, the committed
// seeds, the frame a container would declare, and the log's lines.

#include "tests/support/LogCapture.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/IVideoFrameInfo.h"

#include <algorithm>
#include <fstream>
#include <iterator>

namespace LumekTest
{
  using VBytes = std::vector< std::uint8_t >;

  inline std::shared_ptr< ZOL::IBufferAllocator > MakeFrameAllocator()
  {
    return std::make_shared< ZOL::VFrameBufferAllocator >();
  }

  inline VBytes ReadWholeFile( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return VBytes( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
  }

  // A file of the committed fuzz seeds, by its path below fuzz/seeds.
  inline VBytes Seed( const std::string& i_rName )
  {
    return ReadWholeFile( std::string( LUMEK_SEED_DIR ) + "/" + i_rName );
  }

  inline ZOL::IVideoFrameInfo FrameInfo( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    return Info;
  }

  // True when a line of the capture, as "LEVEL MESSAGE", holds i_rText.
  inline bool Logged( const VLogCapture& i_rLog, const std::string& i_rText )
  {
    const std::vector< std::string > Lines = i_rLog.Lines();
    return std::any_of( Lines.begin(), Lines.end(),
                        [&]( const std::string& i_rLine ) { return i_rLine.find( i_rText ) != std::string::npos; } );
  }
} // namespace LumekTest
