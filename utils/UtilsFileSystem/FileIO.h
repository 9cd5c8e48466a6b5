#pragma once

// Free functions around files: opening streams, removing and replacing files. Their mark is how
// they fail: every failure is a result code and a line in the "System" log, and where another
// process holds the file, the log names it so that the user knows what to close.

#include "utils/ResultCodes.h"
#include "utils/UtilsFileSystem/InputStreamAdapter.h"

#include <cstdio>
#include <memory>
#include <string>
#include <system_error>
#include <vector>

namespace UtilsFileSystem
{
  // A C file handle that closes itself.
  struct VFileCloser
  {
    void operator()( std::FILE* i_pFile ) const;
  };
  using VFilePointer = std::unique_ptr< std::FILE, VFileCloser >;

  // A buffered input stream over a C file handle. A failed read makes later reads fail at once
  // until a Seek, as with every stream of the system.
  class VFileInputStream
  {
  public:
    bool IsOpen() const { return m_pFile != nullptr; }
    void Close() { m_pFile.reset(); }

    [[nodiscard]] bool Read( void* o_pBuffer, std::uint64_t i_Size );
    bool IsAtEnd();
    [[nodiscard]] bool GetSize( std::uint64_t& o_rSize );
    [[nodiscard]] bool GetPosition( std::uint64_t& o_rPosition );
    [[nodiscard]] bool Seek( std::int64_t i_Position );

  private:
    friend ZOL::ResultCode OpenInputStream( const std::string& i_rPath, VFileInputStream& o_rStream );
    VFilePointer m_pFile;
    bool m_bGood = true;
  };

  class VFileOutputStream
  {
  public:
    bool IsOpen() const { return m_pFile != nullptr; }
    // False when buffered bytes could not be written out.
    [[nodiscard]] bool Close();

    [[nodiscard]] bool Write( const void* i_pBuffer, std::uint64_t i_Size );
    [[nodiscard]] bool Flush();
    [[nodiscard]] bool GetSize( std::uint64_t& o_rSize );
    [[nodiscard]] bool GetPosition( std::uint64_t& o_rPosition );
    [[nodiscard]] bool Seek( std::int64_t i_Position );

  private:
    friend ZOL::ResultCode OpenOutputStream( const std::string& i_rPath, VFileOutputStream& o_rStream );
    VFilePointer m_pFile;
    bool m_bGood = true;
  };

  using VFileInputStreamVirtual = ZOL::IInputStreamSeekableOwningAdapter< VFileInputStream >;

  // The result code of a system error; an error with no code of its own becomes FileIOFailure and
  // is logged.
  ZOL::ResultCode ToResult( const std::error_code& i_rError );
  // The same for the errno value of a failed C library or system call.
  ZOL::ResultCode ErrnoToResult( int i_Errno );

  // The executable paths of the processes that have the file open, the program's own process left
  // out. False when the holders cannot be listed, or when there are more than 10 of them, with no
  // names then.
  [[nodiscard]] bool GetLockingProcesses( const std::string& i_rPath, std::vector< std::string >& o_rNames );

  // The same for the processes that hold the file open for writing, each as "PATH (process ID)":
  // a recording that another program is still writing.
  [[nodiscard]] bool GetWritingProcesses( const std::string& i_rPath, std::vector< std::string >& o_rNames );

  ZOL::ResultCode OpenInputStream( const std::string& i_rPath, VFileInputStream& o_rStream );
  ZOL::ResultCode OpenOutputStream( const std::string& i_rPath, VFileOutputStream& o_rStream );

  // Plain C files with a buffer of 8 MiB, for large sequential reads and writes.
  ZOL::ResultCode OpenInputFile( const std::string& i_rPath, VFilePointer& o_rpFile );
  ZOL::ResultCode OpenOutputFile( const std::string& i_rPath, VFilePointer& o_rpFile );

  // Removing a file that is not there succeeds.
  ZOL::ResultCode RemoveFile( const std::string& i_rPath );

  // Renames the old file to i_pBackup if one is given, then the replacement onto the old name.
  // Between the two steps the old name does not exist.
  ZOL::ResultCode ReplaceFile( const std::string& i_rReplaced, const std::string& i_rReplacement,
                               const std::string* i_pBackup = nullptr );

  // The old name always holds either the old file or the whole new one: the backup is a hard link
  // made before, the replacement is flushed to the disc and then renamed over the old name in one
  // step. Both files must be on one file system.
  ZOL::ResultCode ReplaceFileAtomic( const std::string& i_rReplaced, const std::string& i_rReplacement,
                                     const std::string* i_pBackup = nullptr );

  ZOL::ResultCode CopyFile( const std::string& i_rFrom, const std::string& i_rTo, bool i_bFailIfExists );

  // Never replaces an existing file; moves across file systems by copying.
  ZOL::ResultCode MoveFile( const std::string& i_rFrom, const std::string& i_rTo );
} // namespace UtilsFileSystem
