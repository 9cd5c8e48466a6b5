#pragma once

// Files and log lines for the file layer's tests.

#include "tests/support/Files.h"
#include "tests/support/LogCapture.h"

#include <boost/filesystem.hpp>

#include <fstream>

namespace LumekTest
{
  // Bytes that differ at every position within a page, so a byte read from the wrong offset shows.
  inline std::vector< std::uint8_t > PatternBytes( std::uint64_t i_Size )
  {
    std::vector< std::uint8_t > Bytes( i_Size );
    for( std::uint64_t i = 0; i < i_Size; ++i )
      Bytes[i] = static_cast< std::uint8_t >( ( i * 131 + ( i >> 12 ) * 7 ) & 0xFF );
    return Bytes;
  }

  inline void WriteText( const std::string& i_rPath, const std::string& i_rText )
  {
    std::ofstream( i_rPath, std::ios::binary | std::ios::trunc ) << i_rText;
  }

  inline std::string ReadText( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return std::string( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
  }
} // namespace LumekTest
