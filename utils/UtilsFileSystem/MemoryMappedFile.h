#pragma once

// Reading a very large file through a fixed number of mapped windows: no copy through a stream
// buffer on the read path, and no need for address space for the whole file. The file is
// expected to stay as it was while it is open; if another program shrinks it, reads of the lost
// part fail instead of taking the process down.

#include "utils/ResultCodes.h"
#include "utils/UtilsFileSystem/InputStreamAdapter.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace UtilsFileSystem
{
  class VMemoryMappedFileBase
  {
  public:
    explicit VMemoryMappedFileBase( bool i_bReadWrite = false );
    virtual ~VMemoryMappedFileBase();
    VMemoryMappedFileBase( const VMemoryMappedFileBase& ) = delete;
    VMemoryMappedFileBase& operator=( const VMemoryMappedFileBase& ) = delete;

    bool IsOpen() const { return m_File >= 0; }
    // The size when the file was opened: what the windows are laid out over.
    std::uint64_t GetFileSize() const { return m_FileSize; }

  protected:
    // FileNotFound for an absent file, FileIOFailure for any other failure, an empty file among
    // them, since nothing of it can be mapped.
    ZOL::ResultCode OpenFile( const std::string& i_rPath );
    void CloseFile();
    // The size the file has now, which another program may have changed.
    bool GetCurrentSize( std::uint64_t& o_rSize ) const;

    int m_File = -1;
    bool m_bReadWrite;
    std::uint64_t m_FileSize = 0;
  };

  class VMemoryMappedInputFile : public VMemoryMappedFileBase
  {
  public:
    // i_PageSize is rounded up to a multiple of the system's page size, which mapping offsets
    // must be; i_MaxPages is at least 1.
    VMemoryMappedInputFile( std::uint64_t i_PageSize, std::size_t i_MaxPages );
    ~VMemoryMappedInputFile() override;

    ZOL::ResultCode Open( const std::string& i_rPath );
    // Unmaps every window and logs how often windows were mapped.
    void Close();

    // Copies i_Size bytes from i_Offset; false, with nothing promised about o_pBuffer, when the
    // range is not in the file as it was opened or as it is now.
    [[nodiscard]] bool Read( std::uint64_t i_Offset, void* o_pBuffer, std::uint64_t i_Size );

    std::uint64_t GetPageSize() const { return m_PageSize; }
    std::size_t GetMaxPages() const { return m_MaxPages; }
    std::uint64_t GetSwapCount() const { return m_SwapCount; }

  private:
    struct VWindow
    {
      std::uint64_t Begin = 0;
      std::uint64_t End = 0;
      const std::uint8_t* pData = nullptr;
      std::size_t Length = 0;
    };

    // The window that holds i_Offset, moved to the front of the list; null if it cannot be mapped.
    const VWindow* MakeAvailable( std::uint64_t i_Offset );
    void UnmapAll();

    std::vector< VWindow > m_Windows; // most recently used first
    std::uint64_t m_PageSize;
    std::size_t m_MaxPages;
    std::uint64_t m_SwapCount = 0;
  };

  class VMemoryMappedInputStream
  {
  public:
    // 16 MiB windows, 8 of them: a few frames of a large recording at a time.
    static constexpr std::uint64_t DefaultPageSize = 16u << 20;
    static constexpr std::size_t DefaultMaxPages = 8;

    explicit VMemoryMappedInputStream( std::uint64_t i_PageSize = DefaultPageSize,
                                       std::size_t i_MaxPages = DefaultMaxPages );

    ZOL::ResultCode Open( const std::string& i_rPath );
    void Close();
    bool IsOpen() const { return m_File.IsOpen(); }
    const VMemoryMappedInputFile& GetFile() const { return m_File; }

    // Fails for a range past the end, which sets the end flag; the position then stays.
    [[nodiscard]] bool Read( void* o_pBuffer, std::uint64_t i_Size );
    bool IsAtEnd() { return m_bAtEnd; }
    [[nodiscard]] bool GetSize( std::uint64_t& o_rSize );
    [[nodiscard]] bool GetPosition( std::uint64_t& o_rPosition );
    // Only sets the position; one within the file clears the end flag.
    [[nodiscard]] bool Seek( std::int64_t i_Position );

  private:
    VMemoryMappedInputFile m_File;
    std::uint64_t m_Position = 0;
    bool m_bAtEnd = false;
  };

  using VMemoryMappedInputStreamVirtual = ZOL::IInputStreamSeekableOwningAdapter< VMemoryMappedInputStream >;

  // A mapped stream, or the plain file stream when the file cannot be mapped (an empty file, a
  // pipe, a file system without mapping). An absent file is FileNotFound with no second try.
  ZOL::ResultCode OpenMemoryMappedInputStream( const std::string& i_rPath,
                                               std::shared_ptr< ZOL::IInputStreamSeekable >& o_rpStream );
} // namespace UtilsFileSystem
