#pragma once

// Whole files in and out, for the tests that build a file by hand, damage one, or compare one
// byte for byte with a golden copy.

#include <cstdint>
#include <fstream>
#include <iterator>
#include <string>
#include <string_view>
#include <vector>

namespace LumekTest
{
  // The whole file; empty when it cannot be read.
  inline std::vector< std::uint8_t > ReadFileBytes( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return { std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() };
  }

  // Replaces the file with these bytes; false when they could not all be written.
  inline bool WriteFileBytes( const std::string& i_rPath, std::string_view i_Bytes )
  {
    std::ofstream File( i_rPath, std::ios::binary | std::ios::trunc );
    File.write( i_Bytes.data(), static_cast< std::streamsize >( i_Bytes.size() ) );
    return File.good();
  }
  inline bool WriteFileBytes( const std::string& i_rPath, const std::vector< std::uint8_t >& i_rBytes )
  {
    return WriteFileBytes( i_rPath, { reinterpret_cast< const char* >( i_rBytes.data() ), i_rBytes.size() } );
  }
} // namespace LumekTest
