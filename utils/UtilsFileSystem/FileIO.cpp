#include "utils/UtilsFileSystem/FileIO.h"

#include "services/Log.h"

#include <boost/algorithm/string/join.hpp>
#include <boost/filesystem.hpp>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>

namespace fs = boost::filesystem;

// Linux takes every path as given: the long form of a path only matters where names are limited.

namespace UtilsFileSystem
{
  namespace
  {
    constexpr const char* s_Category = "System";
    constexpr std::size_t s_FullBufferSize = 0x800000;

    ZOL::ResultCode BoostToResult( const boost::system::error_code& i_rError )
    {
      // On this system the system category's values are the errno values.
      return ErrnoToResult( i_rError.value() );
    }

    std::string JoinNames( const std::vector< std::string >& i_rNames )
    {
      return boost::algorithm::join( i_rNames, "', '" );
    }

    // A sharing violation arrives as a permission error; only then is it worth asking who holds
    // the file.
    void LogLockers( const std::string& i_rPath, ZOL::ResultCode i_Result, const char* i_pFormat )
    {
      std::vector< std::string > Names;
      if( i_Result == ZOL::Result_NotPermitted && GetLockingProcesses( i_rPath, Names ) && !Names.empty() )
        LUMEK_LOG( s_Category, ZOL::LogFailure, i_pFormat, i_rPath, JoinNames( Names ) );
    }

    ZOL::ResultCode OpenFile( const std::string& i_rPath, const char* i_pMode, VFilePointer& o_rpFile )
    {
      o_rpFile.reset( std::fopen( i_rPath.c_str(), i_pMode ) );
      if( o_rpFile == nullptr )
        return ErrnoToResult( errno );
      // A folder opens for reading here, and only the first read would fail.
      struct stat Status;
      if( ::fstat( ::fileno( o_rpFile.get() ), &Status ) == 0 && S_ISDIR( Status.st_mode ) )
      {
        o_rpFile.reset();
        return ErrnoToResult( EISDIR );
      }
      return ZOL::Result_Ok;
    }

    ZOL::ResultCode OpenFullyBufferedFile( const std::string& i_rPath, const char* i_pMode, const char* i_pLockedFormat,
                                           VFilePointer& o_rpFile )
    {
      const ZOL::ResultCode Result = OpenFile( i_rPath, i_pMode, o_rpFile );
      if( !ZOL::Succeeded( Result ) )
      {
        LogLockers( i_rPath, Result, i_pLockedFormat );
        return Result;
      }
      if( std::setvbuf( o_rpFile.get(), nullptr, _IOFBF, s_FullBufferSize ) != 0 )
        LUMEK_LOG( s_Category, ZOL::LogWarning, "Failed to enable full buffering for file stream %1%.", i_rPath );
      return ZOL::Result_Ok;
    }

    bool SeekFile( std::FILE* i_pFile, std::int64_t i_Position )
    {
      return i_pFile != nullptr && i_Position >= 0 &&
             fseeko( i_pFile, static_cast< off_t >( i_Position ), SEEK_SET ) == 0;
    }

    bool TellFile( std::FILE* i_pFile, std::uint64_t& o_rPosition )
    {
      if( i_pFile == nullptr )
        return false;
      const off_t Position = ftello( i_pFile );
      if( Position < 0 )
        return false;
      o_rPosition = static_cast< std::uint64_t >( Position );
      return true;
    }

    bool SizeOfFile( std::FILE* i_pFile, std::uint64_t& o_rSize )
    {
      // fstat would miss what is still in the write buffer.
      std::uint64_t Position = 0;
      if( !TellFile( i_pFile, Position ) || fseeko( i_pFile, 0, SEEK_END ) != 0 || !TellFile( i_pFile, o_rSize ) )
        return false;
      return SeekFile( i_pFile, static_cast< std::int64_t >( Position ) );
    }

    // Pushes a file's bytes to the disc before a rename makes it visible under the final name:
    // otherwise a crash right after the rename can leave the name on an empty file.
    int SyncFile( const std::string& i_rPath )
    {
      const int File = ::open( i_rPath.c_str(), O_RDONLY | O_CLOEXEC );
      if( File < 0 )
        return errno;
      const int Error = ::fsync( File ) == 0 ? 0 : errno;
      ::close( File );
      return Error;
    }

    // Makes the rename itself durable; a failure here leaves the files correct, so it is ignored.
    void SyncFolderOf( const std::string& i_rPath )
    {
      fs::path Folder = fs::path( i_rPath ).parent_path();
      if( Folder.empty() )
        Folder = ".";
      const int File = ::open( Folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC );
      if( File < 0 )
        return;
      static_cast< void >( ::fsync( File ) );
      ::close( File );
    }

    // A hard link keeps the old file's bytes under the backup name, and the old name stays in
    // place until the rename. A file system without hard links gets a copy.
    ZOL::ResultCode LinkBackup( const std::string& i_rReplaced, const std::string& i_rBackup )
    {
      if( ::unlink( i_rBackup.c_str() ) != 0 && errno != ENOENT )
        return ErrnoToResult( errno );
      if( ::link( i_rReplaced.c_str(), i_rBackup.c_str() ) == 0 )
        return ZOL::Result_Ok;
      const int Error = errno;
      if( Error == ENOENT )
        return ZOL::Result_Ok; // nothing to back up
      if( Error == EPERM || Error == EOPNOTSUPP || Error == EXDEV || Error == EMLINK )
        return CopyFile( i_rReplaced, i_rBackup, true );
      return ErrnoToResult( Error );
    }
  } // namespace

  void VFileCloser::operator()( std::FILE* i_pFile ) const
  {
    std::fclose( i_pFile );
  }

  bool VFileInputStream::Read( void* o_pBuffer, std::uint64_t i_Size )
  {
    if( !m_bGood || m_pFile == nullptr )
      return false;
    if( i_Size == 0 )
      return true;
    m_bGood = std::fread( o_pBuffer, 1, static_cast< std::size_t >( i_Size ), m_pFile.get() ) == i_Size;
    return m_bGood;
  }

  bool VFileInputStream::IsAtEnd()
  {
    return m_pFile != nullptr && std::feof( m_pFile.get() ) != 0;
  }

  bool VFileInputStream::GetSize( std::uint64_t& o_rSize )
  {
    return SizeOfFile( m_pFile.get(), o_rSize );
  }

  bool VFileInputStream::GetPosition( std::uint64_t& o_rPosition )
  {
    return TellFile( m_pFile.get(), o_rPosition );
  }

  bool VFileInputStream::Seek( std::int64_t i_Position )
  {
    m_bGood = SeekFile( m_pFile.get(), i_Position );
    return m_bGood;
  }

  bool VFileOutputStream::Close()
  {
    if( m_pFile == nullptr )
      return false;
    const bool bFlushed = std::fclose( m_pFile.release() ) == 0;
    const bool bGood = m_bGood;
    m_bGood = true;
    return bFlushed && bGood;
  }

  bool VFileOutputStream::Write( const void* i_pBuffer, std::uint64_t i_Size )
  {
    if( !m_bGood || m_pFile == nullptr )
      return false;
    if( i_Size == 0 )
      return true;
    m_bGood = std::fwrite( i_pBuffer, 1, static_cast< std::size_t >( i_Size ), m_pFile.get() ) == i_Size;
    return m_bGood;
  }

  bool VFileOutputStream::Flush()
  {
    return m_pFile != nullptr && std::fflush( m_pFile.get() ) == 0;
  }

  bool VFileOutputStream::GetSize( std::uint64_t& o_rSize )
  {
    return SizeOfFile( m_pFile.get(), o_rSize );
  }

  bool VFileOutputStream::GetPosition( std::uint64_t& o_rPosition )
  {
    return TellFile( m_pFile.get(), o_rPosition );
  }

  bool VFileOutputStream::Seek( std::int64_t i_Position )
  {
    m_bGood = SeekFile( m_pFile.get(), i_Position );
    return m_bGood;
  }

  ZOL::ResultCode ToResult( const std::error_code& i_rError )
  {
    struct VErrorRow
    {
      std::errc Condition;
      ZOL::ResultCode Result;
    };
    static constexpr VErrorRow s_Rows[] = {
        { std::errc::file_exists, ZOL::Result_AlreadyPresent },
        { std::errc::invalid_argument, ZOL::Result_InvalidArgument },
        { std::errc::no_such_file_or_directory, ZOL::Result_FileNotFound },
        { std::errc::is_a_directory, ZOL::Result_InvalidType },
        { std::errc::not_a_directory, ZOL::Result_InvalidType },
        { std::errc::not_supported, ZOL::Result_NotSupported },
        { std::errc::operation_not_permitted, ZOL::Result_NotPermitted },
        { std::errc::permission_denied, ZOL::Result_NotPermitted },
    };
    for( const VErrorRow& rRow : s_Rows )
      if( i_rError == rRow.Condition )
        return rRow.Result;
    LUMEK_LOG( s_Category, ZOL::LogFailure, "Std error code: %1%", i_rError.value() );
    return ZOL::Result_FileIOFailure;
  }

  ZOL::ResultCode ErrnoToResult( int i_Errno )
  {
    return ToResult( std::error_code( i_Errno, std::generic_category() ) );
  }

  ZOL::ResultCode OpenInputStream( const std::string& i_rPath, VFileInputStream& o_rStream )
  {
    o_rStream.m_bGood = true;
    const ZOL::ResultCode Result = OpenFile( i_rPath, "rb", o_rStream.m_pFile );
    if( !ZOL::Succeeded( Result ) )
      LogLockers( i_rPath, Result, "Failed to open input file stream %1% locked by processes '%2%'." );
    return Result;
  }

  ZOL::ResultCode OpenOutputStream( const std::string& i_rPath, VFileOutputStream& o_rStream )
  {
    o_rStream.m_bGood = true;
    const ZOL::ResultCode Result = OpenFile( i_rPath, "wb", o_rStream.m_pFile );
    if( !ZOL::Succeeded( Result ) )
      LogLockers( i_rPath, Result, "Failed to open output file stream %1% locked by processes '%2%'." );
    return Result;
  }

  ZOL::ResultCode OpenInputFile( const std::string& i_rPath, VFilePointer& o_rpFile )
  {
    return OpenFullyBufferedFile( i_rPath, "rb", "Failed to open input file %1% locked by processes '%2%'.", o_rpFile );
  }

  ZOL::ResultCode OpenOutputFile( const std::string& i_rPath, VFilePointer& o_rpFile )
  {
    return OpenFullyBufferedFile( i_rPath, "wb", "Failed to open output file %1% locked by processes '%2%'.",
                                  o_rpFile );
  }

  ZOL::ResultCode RemoveFile( const std::string& i_rPath )
  {
    boost::system::error_code Error;
    const bool bRemoved = fs::remove( i_rPath, Error );
    if( !Error )
    {
      if( bRemoved )
        LUMEK_LOG( s_Category, ZOL::LogInfo, "Removed file '%1%'.", i_rPath );
      else
        LUMEK_LOG( s_Category, ZOL::LogInfo, "Nothing to remove: '%1%' did not exist.", i_rPath );
      return ZOL::Result_Ok;
    }
    const ZOL::ResultCode Result = BoostToResult( Error );
    std::vector< std::string > Names;
    if( GetLockingProcesses( i_rPath, Names ) && !Names.empty() )
      LUMEK_LOG( s_Category, ZOL::LogFailure, "Failed to remove file '%1%': file is locked by processes '%2%'.",
                 i_rPath, JoinNames( Names ) );
    else
      LUMEK_LOG( s_Category, ZOL::LogFailure, "Failed to remove file '%1%': %2%", i_rPath,
                 ZOL::GetResultText( Result ) );
    return Result;
  }

  ZOL::ResultCode ReplaceFile( const std::string& i_rReplaced, const std::string& i_rReplacement,
                               const std::string* i_pBackup )
  {
    const std::string& Replaced = i_rReplaced;
    if( i_pBackup != nullptr && std::rename( Replaced.c_str(), i_pBackup->c_str() ) != 0 && errno != ENOENT )
    {
      const ZOL::ResultCode Result = ErrnoToResult( errno );
      LUMEK_LOG( s_Category, ZOL::LogFailure, "Failed to create backup file %1% while replacing file: %2%.", *i_pBackup,
                 ZOL::GetResultText( Result ) );
      return Result;
    }
    if( std::rename( i_rReplacement.c_str(), Replaced.c_str() ) != 0 )
    {
      const ZOL::ResultCode Result = ErrnoToResult( errno );
      LUMEK_LOG( s_Category, ZOL::LogFailure, "Failed to replace file %1% with file %2%: %3%.", i_rReplaced,
                 i_rReplacement, ZOL::GetResultText( Result ) );
      return Result;
    }
    return ZOL::Result_Ok;
  }

  ZOL::ResultCode ReplaceFileAtomic( const std::string& i_rReplaced, const std::string& i_rReplacement,
                                     const std::string* i_pBackup )
  {
    const std::string& Replaced = i_rReplaced;
    const std::string& Replacement = i_rReplacement;
    if( i_pBackup != nullptr )
    {
      const ZOL::ResultCode Result = LinkBackup( Replaced, *i_pBackup );
      if( !ZOL::Succeeded( Result ) )
      {
        LUMEK_LOG( s_Category, ZOL::LogFailure, "Failed to create backup file %1% while replacing file: %2%.",
                   *i_pBackup, ZOL::GetResultText( Result ) );
        return Result;
      }
    }
    int Error = SyncFile( Replacement );
    if( Error == 0 && std::rename( Replacement.c_str(), Replaced.c_str() ) != 0 )
      Error = errno;
    if( Error != 0 )
    {
      const ZOL::ResultCode Result = ErrnoToResult( Error );
      LUMEK_LOG( s_Category, ZOL::LogFailure, "Failed to replace file %1% with file %2%: %3%.", i_rReplaced,
                 i_rReplacement, ZOL::GetResultText( Result ) );
      return Result;
    }
    SyncFolderOf( Replaced );
    return ZOL::Result_Ok;
  }

  ZOL::ResultCode CopyFile( const std::string& i_rFrom, const std::string& i_rTo, bool i_bFailIfExists )
  {
    boost::system::error_code Error;
    fs::copy_file( i_rFrom, i_rTo, i_bFailIfExists ? fs::copy_options::none : fs::copy_options::overwrite_existing,
                   Error );
    return Error ? BoostToResult( Error ) : ZOL::Result_Ok;
  }

  ZOL::ResultCode MoveFile( const std::string& i_rFrom, const std::string& i_rTo )
  {
    const std::string& From = i_rFrom;
    const std::string& To = i_rTo;
    if( ::renameat2( AT_FDCWD, From.c_str(), AT_FDCWD, To.c_str(), RENAME_NOREPLACE ) == 0 )
      return ZOL::Result_Ok;
    // A file system that cannot refuse to replace in the rename itself gets a hard link, which can.
    if( errno == EINVAL && ::link( From.c_str(), To.c_str() ) == 0 )
      return ::unlink( From.c_str() ) == 0 ? ZOL::Result_Ok : ErrnoToResult( errno );
    if( errno != EXDEV )
      return ErrnoToResult( errno );
    const ZOL::ResultCode Result = CopyFile( i_rFrom, i_rTo, true );
    if( !ZOL::Succeeded( Result ) )
      return Result;
    return ::unlink( From.c_str() ) == 0 ? ZOL::Result_Ok : ErrnoToResult( errno );
  }
} // namespace UtilsFileSystem
