#pragma once

// What the still-image decoder tests share: a capture of one log category, frame allocators,
// and files read whole.

#include "services/Log.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace LumekTest
{
  // Log lines of one category, as "LEVEL MESSAGE", while it lives.
  class VCategoryLog
  {
  public:
    explicit VCategoryLog( std::string i_Category );
    ~VCategoryLog();
    VCategoryLog( const VCategoryLog& ) = delete;
    VCategoryLog& operator=( const VCategoryLog& ) = delete;
    const std::vector< std::string >& Lines() const { return m_Lines; }
    // True when some line holds i_rText.
    bool Contains( const std::string& i_rText ) const;

  private:
    std::string m_Category;
    std::vector< std::string > m_Lines;
    int m_Handle = 0;
  };

  std::shared_ptr< ZOL::IBufferAllocator > MakeFrameAllocator();

  std::vector< std::uint8_t > ReadWholeFile( const std::string& i_rPath );
  void WriteWholeFile( const std::string& i_rPath, const std::vector< std::uint8_t >& i_rBytes );

  // A file of the committed fuzz seeds, by its path below fuzz/seeds.
  std::string SeedPath( const std::string& i_rName );

  ZOL::IVideoFrameInfo FrameInfo( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format );
} // namespace LumekTest
