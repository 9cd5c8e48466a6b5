#pragma once

// The file stream that reads .lvid recordings and image sequence descriptors. All positions
// are 64-bit, so files beyond 4 GB work. A failed read or write makes the stream fail until
// the next Seek.

#include "utils/Streams.h"

#include <cstdio>
#include <string>

namespace UtilsIO
{
  enum EOpenMode : int
  {
    OpenMode_Read = 0,      // "rb"
    OpenMode_ReadWrite = 1, // "r+b"
    OpenMode_Create = 2,    // "w+b"
    OpenMode_Write = 3,     // "wb"
  };

  class VLargeFile : public ZOL::IStreamSeekable
  {
  public:
    VLargeFile() = default;
    VLargeFile( const VLargeFile& ) = delete;
    VLargeFile& operator=( const VLargeFile& ) = delete;
    ~VLargeFile() override;

    bool Open( const std::string& i_rPath, int i_Mode );
    bool Close();
    bool IsOpen() const { return m_pFile != nullptr; }
    std::uint64_t GetCachedSize() const { return m_CachedSize; }
    bool SeekToEnd();
    bool IsGood() const { return m_bGood; }

    bool Read( void* o_pBuffer, std::uint64_t i_Size ) override;
    bool IsAtEnd() override;
    bool Write( const void* i_pBuffer, std::uint64_t i_Size ) override;
    bool GetSize( std::uint64_t& o_rSize ) override;
    bool GetPosition( std::uint64_t& o_rPosition ) override;
    bool Seek( std::int64_t i_Position ) override;

    // Pushes buffered writes to the operating system.
    bool Flush();

  private:
    std::FILE* m_pFile = nullptr;
    std::uint64_t m_CachedSize = 0;
    bool m_bGood = true;
  };

  // The C library's mode text for an open mode; empty for an unknown one.
  const char* OpenModeText( int i_Mode );
} // namespace UtilsIO
