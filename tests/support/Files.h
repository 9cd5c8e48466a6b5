#pragma once

// Whole files in and out, for the tests that build a file by hand, damage one, or compare one
// byte for byte with a golden copy.

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>
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

  // A folder of its own under the temporary folder, removed with everything in it.
  class VTempFolder
  {
  public:
    VTempFolder() { std::filesystem::create_directories( m_Path ); }
    ~VTempFolder() { std::filesystem::remove_all( m_Path, m_Error ); }
    VTempFolder( const VTempFolder& ) = delete;
    VTempFolder& operator=( const VTempFolder& ) = delete;
    std::string Path() const { return m_Path.string(); }
    std::string File( const std::string& i_rName ) const { return ( m_Path / i_rName ).string(); }
    std::string operator/( const std::string& i_rName ) const { return File( i_rName ); }

  private:
    std::error_code m_Error;
    const std::filesystem::path m_Path =
        std::filesystem::temp_directory_path() / ( "lumek-test-" + std::to_string( std::random_device()() ) );
  };
} // namespace LumekTest
