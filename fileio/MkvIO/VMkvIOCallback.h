#pragma once

// libebml reads and writes through this: a plain file descriptor, so that large files and
// positions beyond 4 GB work the same everywhere.

#include <ebml/IOCallback.h>

#include <cstdint>
#include <string>

namespace MkvIO
{
  class VMkvIOCallback : public libebml::IOCallback
  {
  public:
    VMkvIOCallback() = default;
    ~VMkvIOCallback() override;
    VMkvIOCallback( const VMkvIOCallback& ) = delete;
    VMkvIOCallback& operator=( const VMkvIOCallback& ) = delete;

    // Opens for reading, or creates (truncating) for writing. False when the file cannot be opened.
    [[nodiscard]] bool Open( const std::string& i_rFileName, bool i_bWrite );
    bool IsOpen() const { return m_FileDescriptor >= 0; }

    // The byte count moved; short at the end of the file or on an error.
    std::uint32_t read( void* o_pBuffer, size_t i_Size ) override;
    void setFilePointer( std::int64_t i_Offset, libebml::seek_mode i_Mode = libebml::seek_beginning ) override;
    size_t write( const void* i_pBuffer, size_t i_Size ) override;
    std::uint64_t getFilePointer() override;
    void close() override;

    // False once any write fell short: the writer checks it before it calls a file complete.
    bool WritesGood() const { return m_bWritesGood; }

  private:
    int m_FileDescriptor = -1;
    bool m_bWritesGood = true;
  };
} // namespace MkvIO
