#pragma once

// Streams over bytes in memory: what tests, fuzz targets and nested stores read from.

#include "utils/Streams.h"

#include <cstdint>
#include <vector>

namespace UtilsIO
{
  // Reads a caller's bytes; it does not copy them.
  class VMemoryInputStream : public ZOL::IInputStreamSeekable
  {
  public:
    VMemoryInputStream( const void* i_pData, std::uint64_t i_Size );

    bool Read( void* o_pBuffer, std::uint64_t i_Size ) override;
    bool IsAtEnd() override { return m_bAtEnd; }
    bool GetSize( std::uint64_t& o_rSize ) override;
    bool GetPosition( std::uint64_t& o_rPosition ) override;
    bool Seek( std::int64_t i_Position ) override;

  private:
    const std::uint8_t* m_pData;
    std::uint64_t m_Size;
    std::uint64_t m_Position = 0;
    bool m_bAtEnd = false;
  };

  // A growable byte vector that can be written and read back through one position.
  class VMemoryStream : public ZOL::IStreamSeekable
  {
  public:
    bool Read( void* o_pBuffer, std::uint64_t i_Size ) override;
    bool IsAtEnd() override { return m_bAtEnd; }
    bool Write( const void* i_pBuffer, std::uint64_t i_Size ) override;
    bool GetSize( std::uint64_t& o_rSize ) override;
    bool GetPosition( std::uint64_t& o_rPosition ) override;
    bool Seek( std::int64_t i_Position ) override;

    const std::vector< std::uint8_t >& GetData() const { return m_Data; }
    std::vector< std::uint8_t >& GetData() { return m_Data; }

  private:
    std::vector< std::uint8_t > m_Data;
    std::uint64_t m_Position = 0;
    bool m_bAtEnd = false;
  };
} // namespace UtilsIO
