#include "utils/UtilsFileSystem/FileIO.h"

#include "tests/support/TestNames.h"
#include "tests/utils/FileTestSupport.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <signal.h>
#include <spawn.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>

extern char** environ;

using namespace UtilsFileSystem;

namespace
{
  struct VErrorCase
  {
    const char* Name;
    int Errno;
    ZOL::ResultCode Expected;
  };

  class ToResultTest : public testing::TestWithParam< VErrorCase >
  {
  };

  TEST_P( ToResultTest, MapsTheGenericCondition )
  {
    const LumekTest::VSystemLogCapture Log;
    EXPECT_EQ( ErrnoToResult( GetParam().Errno ), GetParam().Expected );
    // Only an error without a code of its own is worth a line.
    const bool bLogged = Log.Has( "Std error code: " + std::to_string( GetParam().Errno ) );
    EXPECT_EQ( bLogged, GetParam().Expected == ZOL::Result_FileIOFailure );
  }

  INSTANTIATE_TEST_SUITE_P( Errors, ToResultTest,
                            testing::Values( VErrorCase{ "FileExists", EEXIST, ZOL::Result_AlreadyPresent },
                                             VErrorCase{ "InvalidArgument", EINVAL, ZOL::Result_InvalidArgument },
                                             VErrorCase{ "NoSuchFile", ENOENT, ZOL::Result_FileNotFound },
                                             VErrorCase{ "IsADirectory", EISDIR, ZOL::Result_InvalidType },
                                             VErrorCase{ "NotADirectory", ENOTDIR, ZOL::Result_InvalidType },
                                             VErrorCase{ "NotSupported", ENOTSUP, ZOL::Result_NotSupported },
                                             VErrorCase{ "NotPermitted", EPERM, ZOL::Result_NotPermitted },
                                             VErrorCase{ "PermissionDenied", EACCES, ZOL::Result_NotPermitted },
                                             VErrorCase{ "InputOutput", EIO, ZOL::Result_FileIOFailure },
                                             VErrorCase{ "NoSpace", ENOSPC, ZOL::Result_FileIOFailure } ),
                            LumekTest::VCaseName() );

  TEST( OpenStreams, AMissingFileAndAFolderHaveTheirCodes )
  {
    const LumekTest::VTemporaryFolder Folder;
    VFileInputStream Input;
    EXPECT_EQ( OpenInputStream( Folder.File( "absent.lvid" ), Input ), ZOL::Result_FileNotFound );
    EXPECT_EQ( OpenInputStream( Folder.Path(), Input ), ZOL::Result_InvalidType );
    EXPECT_FALSE( Input.IsOpen() );
    VFileOutputStream Output;
    EXPECT_EQ( OpenOutputStream( Folder.Path(), Output ), ZOL::Result_InvalidType );
    EXPECT_EQ( OpenOutputStream( Folder.File( "no/such/folder.lvid" ), Output ), ZOL::Result_FileNotFound );
    VFilePointer pFile;
    EXPECT_EQ( OpenInputFile( Folder.File( "absent.lvid" ), pFile ), ZOL::Result_FileNotFound );
    EXPECT_EQ( OpenOutputFile( Folder.Path(), pFile ), ZOL::Result_InvalidType );
  }

  TEST( OpenStreams, AnUnreadableFileIsNotPermitted )
  {
    if( ::geteuid() == 0 )
      GTEST_SKIP() << "file permissions do not apply to root";
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "locked.lvid" );
    LumekTest::WriteBytes( Path, { 1, 2, 3 } );
    ASSERT_EQ( ::chmod( Path.c_str(), 0 ), 0 );
    VFileInputStream Input;
    EXPECT_EQ( OpenInputStream( Path, Input ), ZOL::Result_NotPermitted );
    VFilePointer pFile;
    EXPECT_EQ( OpenOutputFile( Path, pFile ), ZOL::Result_NotPermitted );
  }

  TEST( OpenStreams, WrittenBytesReadBack )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "round.bin" );
    const auto Bytes = LumekTest::PatternBytes( 10000 );
    {
      VFileOutputStream Output;
      ASSERT_EQ( OpenOutputStream( Path, Output ), ZOL::Result_Ok );
      ASSERT_TRUE( Output.Write( Bytes.data(), Bytes.size() ) );
      std::uint64_t Size = 0;
      ASSERT_TRUE( Output.GetSize( Size ) );
      EXPECT_EQ( Size, Bytes.size() ) << "the size counts what is still buffered";
      ASSERT_TRUE( Output.Close() );
    }
    VFileInputStream Input;
    ASSERT_EQ( OpenInputStream( Path, Input ), ZOL::Result_Ok );
    std::vector< std::uint8_t > Read( Bytes.size() );
    ASSERT_TRUE( Input.Read( Read.data(), Read.size() ) );
    EXPECT_EQ( Read, Bytes );
    std::uint8_t Byte = 0;
    EXPECT_FALSE( Input.Read( &Byte, 1 ) );
    EXPECT_TRUE( Input.IsAtEnd() );
    EXPECT_FALSE( Input.Read( &Byte, 0 ) ) << "a failed stream stays failed until a seek";
    ASSERT_TRUE( Input.Seek( 5 ) );
    ASSERT_TRUE( Input.Read( &Byte, 1 ) );
    EXPECT_EQ( Byte, Bytes[5] );
  }

  TEST( RemoveFile, RemovesAndLogsAndAnAbsentFileIsNoFailure )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "gone.lvid" );
    LumekTest::WriteBytes( Path, { 1 } );
    const LumekTest::VSystemLogCapture Log;
    EXPECT_EQ( RemoveFile( Path ), ZOL::Result_Ok );
    EXPECT_FALSE( boost::filesystem::exists( Path ) );
    EXPECT_TRUE( Log.Has( "Removed file '" + Path + "'." ) );
    EXPECT_EQ( RemoveFile( Path ), ZOL::Result_Ok );
    EXPECT_TRUE( Log.Has( "Nothing to remove: '" + Path + "' did not exist." ) );
  }

  TEST( RemoveFile, AFolderWithContentIsAFailureWithItsText )
  {
    const LumekTest::VTemporaryFolder Folder;
    LumekTest::WriteBytes( Folder.File( "inside" ), { 1 } );
    const LumekTest::VSystemLogCapture Log;
    const ZOL::ResultCode Result = RemoveFile( Folder.Path() );
    EXPECT_FALSE( ZOL::Succeeded( Result ) );
    EXPECT_TRUE( Log.Has( "Failed to remove file '" + Folder.Path() + "': " + ZOL::GetResultText( Result ) ) );
  }

  // Both replacements leave the new bytes under the old name, the old bytes in the backup, and
  // no replacement file behind.
  using VReplace = ZOL::ResultCode ( * )( const std::string&, const std::string&, const std::string* );

  struct VReplaceCase
  {
    const char* Name;
    VReplace Replace;
  };

  class ReplaceTest : public testing::TestWithParam< VReplaceCase >
  {
  };

  TEST_P( ReplaceTest, KeepsTheOldFileAsTheBackup )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Old = Folder.File( "out.lvid" ), New = Folder.File( "out.lvid.partial" ),
                      Backup = Folder.File( "out.lvid.bak" );
    LumekTest::WriteBytes( Old, { 'o', 'l', 'd' } );
    LumekTest::WriteBytes( New, { 'n', 'e', 'w' } );
    LumekTest::WriteBytes( Backup, { 's', 't', 'a', 'l', 'e' } );
    ASSERT_EQ( GetParam().Replace( Old, New, &Backup ), ZOL::Result_Ok );
    EXPECT_EQ( LumekTest::ReadText( Old ), "new" );
    EXPECT_EQ( LumekTest::ReadText( Backup ), "old" );
    EXPECT_FALSE( boost::filesystem::exists( New ) );
  }

  TEST_P( ReplaceTest, AMissingOldFileNeedsNoBackup )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Old = Folder.File( "out.lvid" ), New = Folder.File( "new" ), Backup = Folder.File( "bak" );
    LumekTest::WriteBytes( New, { 'n' } );
    ASSERT_EQ( GetParam().Replace( Old, New, &Backup ), ZOL::Result_Ok );
    EXPECT_EQ( LumekTest::ReadText( Old ), "n" );
    EXPECT_FALSE( boost::filesystem::exists( Backup ) );
  }

  TEST_P( ReplaceTest, AMissingReplacementLeavesTheOldNameAndLogs )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Old = Folder.File( "out.lvid" ), New = Folder.File( "absent" );
    LumekTest::WriteBytes( Old, { 'o' } );
    const LumekTest::VSystemLogCapture Log;
    EXPECT_EQ( GetParam().Replace( Old, New, nullptr ), ZOL::Result_FileNotFound );
    EXPECT_EQ( LumekTest::ReadText( Old ), "o" );
    EXPECT_TRUE( Log.Has( "Failed to replace file " + Old + " with file " + New + ": " +
                          ZOL::GetResultText( ZOL::Result_FileNotFound ) + "." ) );
  }

  INSTANTIATE_TEST_SUITE_P( Both, ReplaceTest,
                            testing::Values( VReplaceCase{ "Renames", &ReplaceFile },
                                             VReplaceCase{ "Atomic", &ReplaceFileAtomic } ),
                            LumekTest::VCaseName() );

  TEST( CopyAndMove, NeverReplaceUnlessAsked )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string A = Folder.File( "a" ), B = Folder.File( "b" ), C = Folder.File( "c" );
    LumekTest::WriteBytes( A, { 'a' } );
    LumekTest::WriteBytes( B, { 'b' } );
    EXPECT_EQ( CopyFile( A, B, true ), ZOL::Result_AlreadyPresent );
    EXPECT_EQ( LumekTest::ReadText( B ), "b" );
    EXPECT_EQ( MoveFile( A, B ), ZOL::Result_AlreadyPresent );
    EXPECT_EQ( LumekTest::ReadText( A ), "a" );
    EXPECT_EQ( LumekTest::ReadText( B ), "b" );
    EXPECT_EQ( CopyFile( A, B, false ), ZOL::Result_Ok );
    EXPECT_EQ( LumekTest::ReadText( B ), "a" );
    EXPECT_EQ( MoveFile( A, C ), ZOL::Result_Ok );
    EXPECT_FALSE( boost::filesystem::exists( A ) );
    EXPECT_EQ( LumekTest::ReadText( C ), "a" );
    EXPECT_EQ( MoveFile( A, C ), ZOL::Result_FileNotFound );
  }

  // A child program that holds a file open, for as long as the test keeps it.
  class VHolder
  {
  public:
    VHolder( const std::string& i_rPath, int i_OpenFlags )
    {
      posix_spawn_file_actions_t Actions;
      posix_spawn_file_actions_init( &Actions );
      posix_spawn_file_actions_addopen( &Actions, 3, i_rPath.c_str(), i_OpenFlags, 0644 );
      char Program[] = "sleep";
      char Time[] = "60";
      char* Arguments[] = { Program, Time, nullptr };
      // posix_spawn returns once the child runs the program, so the file is open by then.
      bOk = ::posix_spawnp( &m_Process, "sleep", &Actions, nullptr, Arguments, environ ) == 0;
      posix_spawn_file_actions_destroy( &Actions );
    }
    ~VHolder() { Stop(); }
    void Stop()
    {
      if( m_Process <= 0 )
        return;
      ::kill( m_Process, SIGKILL );
      ::waitpid( m_Process, nullptr, 0 );
      m_Process = 0;
    }
    pid_t Process() const { return m_Process; }
    bool bOk = false;

  private:
    pid_t m_Process = 0;
  };

  TEST( LockingProcesses, NamesTheChildHoldingTheFileAndNothingOnceItExited )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "recording.lvid" );
    LumekTest::WriteBytes( Path, { 1, 2, 3 } );
    VHolder Writer( Path, O_WRONLY | O_APPEND );
    ASSERT_TRUE( Writer.bOk );

    std::vector< std::string > Names;
    ASSERT_TRUE( GetLockingProcesses( Path, Names ) );
    ASSERT_EQ( Names.size(), 1u );
    EXPECT_EQ( boost::filesystem::path( Names[0] ).filename(), "sleep" ) << Names[0];
    std::vector< std::string > Writers;
    ASSERT_TRUE( GetWritingProcesses( Path, Writers ) );
    EXPECT_EQ( Writers,
               std::vector< std::string >{ Names[0] + " (process " + std::to_string( Writer.Process() ) + ")" } );

    // This process holding it too changes nothing: it is never named.
    VFileInputStream Own;
    ASSERT_EQ( OpenInputStream( Path, Own ), ZOL::Result_Ok );
    Writer.Stop();
    Names.clear();
    ASSERT_TRUE( GetLockingProcesses( Path, Names ) );
    EXPECT_TRUE( Names.empty() );
  }

  TEST( LockingProcesses, AReaderIsNamedButIsNoWriter )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "recording.lvid" );
    LumekTest::WriteBytes( Path, { 1 } );
    VHolder Reader( Path, O_RDONLY );
    ASSERT_TRUE( Reader.bOk );
    std::vector< std::string > Names, Writers;
    ASSERT_TRUE( GetLockingProcesses( Path, Names ) );
    EXPECT_EQ( Names.size(), 1u );
    ASSERT_TRUE( GetWritingProcesses( Path, Writers ) );
    EXPECT_TRUE( Writers.empty() );
  }

  TEST( LockingProcesses, MoreThanTenHoldersGiveNoNames )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "popular.lvid" );
    LumekTest::WriteBytes( Path, { 1 } );
    std::vector< std::unique_ptr< VHolder > > Holders;
    for( int i = 0; i < 11; ++i )
    {
      Holders.push_back( std::make_unique< VHolder >( Path, O_RDONLY ) );
      ASSERT_TRUE( Holders.back()->bOk );
    }
    std::vector< std::string > Names;
    EXPECT_FALSE( GetLockingProcesses( Path, Names ) );
    EXPECT_TRUE( Names.empty() );
    Holders.pop_back();
    ASSERT_TRUE( GetLockingProcesses( Path, Names ) );
    EXPECT_EQ( Names.size(), 10u );
  }

  TEST( LockingProcesses, AMissingFileCannotBeAsked )
  {
    const LumekTest::VTemporaryFolder Folder;
    std::vector< std::string > Names;
    EXPECT_FALSE( GetLockingProcesses( Folder.File( "absent" ), Names ) );
  }
} // namespace
