#pragma once

// What the still-image decoder tests share: frame allocators, files read whole, the committed
// seeds, and the frame a container would declare.

#include "tests/support/LogCapture.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace LumekTest
{
  using VBytes = std::vector< std::uint8_t >;

  inline std::shared_ptr< ZOL::IBufferAllocator > MakeFrameAllocator()
  {
    return std::make_shared< ZOL::VFrameBufferAllocator >();
  }

  VBytes ReadWholeFile( const std::string& i_rPath );
  void WriteWholeFile( const std::string& i_rPath, const VBytes& i_rBytes );

  // A file of the committed fuzz seeds, by its path below fuzz/seeds.
  inline std::string SeedPath( const std::string& i_rName )
  {
    return std::string( LUMEK_SEED_DIR ) + "/" + i_rName;
  }

  // True when a line of the capture, as "LEVEL MESSAGE", holds i_rText.
  bool Logged( const VLogCapture& i_rLog, const std::string& i_rText );

  ZOL::IVideoFrameInfo FrameInfo( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format );
} // namespace LumekTest
