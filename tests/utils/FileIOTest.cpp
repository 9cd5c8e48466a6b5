#include "utils/UtilsFileSystem/FileIO.h"
#include "utils/UtilsFileSystem/LongPath.h"

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
using LumekTest::ReadText;
using LumekTest::WriteText;

namespace
{
  TEST( FileErrors, AMissingFileAFolderAndAnUnreadableFileHaveTheirCodes )
  {
    {
      // Only an error without a code of its own is worth a line.
      const LumekTest::VLogCapture Log( "System" );
      EXPECT_EQ( ErrnoToResult( EEXIST ), ZOL::Result_AlreadyPresent );
      EXPECT_EQ( ErrnoToResult( EACCES ), ZOL::Result_NotPermitted );
      EXPECT_EQ( ErrnoToResult( ENOSPC ), ZOL::Result_FileIOFailure );
      EXPECT_EQ( Log.Messages, std::vector< std::string >{ "Std error code: " + std::to_string( ENOSPC ) } );
    }
    const LumekTest::VTempFolder Folder;
    VFileInputStream Input;
    EXPECT_EQ( OpenInputStream( Folder.File( "absent.lvid" ), Input ), ZOL::Result_FileNotFound );
    EXPECT_EQ( OpenInputStream( Folder.Path(), Input ), ZOL::Result_InvalidType );
    VFileOutputStream Output;
    EXPECT_EQ( OpenOutputStream( Folder.Path(), Output ), ZOL::Result_InvalidType );
    EXPECT_EQ( OpenOutputStream( Folder.File( "no/such/folder.lvid" ), Output ), ZOL::Result_FileNotFound );
    VFilePointer pFile;
    EXPECT_EQ( OpenInputFile( Folder.File( "absent.lvid" ), pFile ), ZOL::Result_FileNotFound );
    EXPECT_EQ( OpenOutputFile( Folder.Path(), pFile ), ZOL::Result_InvalidType );

    if( ::geteuid() == 0 )
      return; // file permissions do not apply to root
    const std::string Locked = Folder.File( "locked.lvid" );
    WriteText( Locked, "abc" );
    ASSERT_EQ( ::chmod( Locked.c_str(), 0 ), 0 );
    EXPECT_EQ( OpenInputStream( Locked, Input ), ZOL::Result_NotPermitted );
    EXPECT_EQ( OpenOutputFile( Locked, pFile ), ZOL::Result_NotPermitted );
  }

  TEST( FileStreams, WrittenBytesReadBack )
  {
    const LumekTest::VTempFolder Folder;
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
    std::uint64_t Position = 0;
    EXPECT_TRUE( Input.GetPosition( Position ) && Input.Read( &Byte, 0 ) );
    EXPECT_EQ( Position, Bytes.size() );
    EXPECT_FALSE( Input.Read( &Byte, 1 ) );
    EXPECT_TRUE( Input.IsAtEnd() );
    EXPECT_FALSE( Input.Read( &Byte, 0 ) ) << "a failed stream stays failed until a seek";
    ASSERT_TRUE( Input.Seek( 5 ) );
    ASSERT_TRUE( Input.Read( &Byte, 1 ) );
    EXPECT_EQ( Byte, Bytes[5] );
  }

  // Removing logs, and an absent file is no failure but a full folder is; copying and moving never
  // replace a file unless asked.
  TEST( FileOperations, RemoveCopyAndMove )
  {
    const LumekTest::VTempFolder Folder;
    const std::string A = Folder.File( "a" ), B = Folder.File( "b" ), C = Folder.File( "c" );
    WriteText( A, "a" );
    WriteText( B, "b" );
    EXPECT_EQ( CopyFile( A, B, true ), ZOL::Result_AlreadyPresent );
    EXPECT_EQ( MoveFile( A, B ), ZOL::Result_AlreadyPresent );
    EXPECT_EQ( ReadText( A ) + ReadText( B ), "ab" );
    EXPECT_EQ( CopyFile( A, B, false ), ZOL::Result_Ok );
    EXPECT_EQ( ReadText( B ), "a" );
    EXPECT_EQ( MoveFile( A, C ), ZOL::Result_Ok );
    EXPECT_EQ( ReadText( C ), "a" );
    EXPECT_EQ( MoveFile( A, C ), ZOL::Result_FileNotFound );

    const LumekTest::VLogCapture Log( "System" );
    EXPECT_EQ( RemoveFile( C ), ZOL::Result_Ok );
    EXPECT_FALSE( boost::filesystem::exists( C ) );
    EXPECT_TRUE( Log.Has( "Removed file '" + C + "'." ) );
    EXPECT_EQ( RemoveFile( C ), ZOL::Result_Ok );
    EXPECT_TRUE( Log.Has( "Nothing to remove: '" + C + "' did not exist." ) );
    const ZOL::ResultCode Result = RemoveFile( Folder.Path() );
    EXPECT_FALSE( ZOL::Succeeded( Result ) );
    EXPECT_TRUE( Log.Has( "Failed to remove file '" + Folder.Path() + "': " + ZOL::GetResultText( Result ) ) );
  }

  // Both replacements leave the new bytes under the old name, the old bytes in the backup, and
  // no replacement file behind; a missing replacement leaves the old name as it was.
  TEST( FileOperations, ReplaceKeepsTheOldFileAsTheBackup )
  {
    using VReplace = ZOL::ResultCode ( * )( const std::string&, const std::string&, const std::string* );
    for( VReplace Replace : { &ReplaceFile, &ReplaceFileAtomic } )
    {
      SCOPED_TRACE( Replace == &ReplaceFile ? "ReplaceFile" : "ReplaceFileAtomic" );
      const LumekTest::VTempFolder Folder;
      const std::string Old = Folder.File( "out.lvid" ), New = Folder.File( "out.lvid.partial" ),
                        Backup = Folder.File( "out.lvid.bak" );
      WriteText( Old, "old" );
      WriteText( New, "new" );
      WriteText( Backup, "stale" );
      ASSERT_EQ( Replace( Old, New, &Backup ), ZOL::Result_Ok );
      EXPECT_EQ( ReadText( Old ), "new" );
      EXPECT_EQ( ReadText( Backup ), "old" );
      EXPECT_FALSE( boost::filesystem::exists( New ) );

      const std::string Fresh = Folder.File( "fresh.lvid" ), FreshBackup = Folder.File( "fresh.bak" );
      WriteText( New, "n" );
      ASSERT_EQ( Replace( Fresh, New, &FreshBackup ), ZOL::Result_Ok );
      EXPECT_EQ( ReadText( Fresh ), "n" );
      EXPECT_FALSE( boost::filesystem::exists( FreshBackup ) ) << "a missing old file needs no backup";

      const LumekTest::VLogCapture Log( "System" );
      EXPECT_EQ( Replace( Old, New, nullptr ), ZOL::Result_FileNotFound );
      EXPECT_EQ( ReadText( Old ), "new" );
      EXPECT_TRUE( Log.Has( "Failed to replace file " + Old + " with file " + New + ": " +
                            ZOL::GetResultText( ZOL::Result_FileNotFound ) + "." ) );
    }
  }

  // A child program that holds a file open for as long as the test keeps it. posix_spawn returns
  // once the child runs the program, so the file is open by then.
  struct VHolder
  {
    VHolder( const std::string& i_rPath, int i_OpenFlags )
    {
      posix_spawn_file_actions_t Actions;
      posix_spawn_file_actions_init( &Actions );
      posix_spawn_file_actions_addopen( &Actions, 3, i_rPath.c_str(), i_OpenFlags, 0644 );
      char Program[] = "sleep", Time[] = "60";
      char* Arguments[] = { Program, Time, nullptr };
      if( ::posix_spawnp( &Process, "sleep", &Actions, nullptr, Arguments, environ ) != 0 )
        Process = 0;
      posix_spawn_file_actions_destroy( &Actions );
    }
    ~VHolder()
    {
      if( Process > 0 && ::kill( Process, SIGKILL ) == 0 )
        ::waitpid( Process, nullptr, 0 );
    }
    pid_t Process = 0;
  };

  // Other programs' holders are named, the writer alone as a writer, this process never; more than
  // ten holders give no names at all.
  TEST( LockingProcesses, NamesEveryHolderAndOnlyTheWriterAsWriterNeverThisProcess )
  {
    const LumekTest::VTempFolder Folder;
    const std::string Path = Folder.File( "recording.lvid" );
    WriteText( Path, "abc" );
    std::vector< std::unique_ptr< VHolder > > Holders;
    Holders.push_back( std::make_unique< VHolder >( Path, O_WRONLY | O_APPEND ) );
    Holders.push_back( std::make_unique< VHolder >( Path, O_RDONLY ) );
    ASSERT_TRUE( Holders[0]->Process > 0 && Holders[1]->Process > 0 );
    VFileInputStream Own;
    ASSERT_EQ( OpenInputStream( Path, Own ), ZOL::Result_Ok );

    std::vector< std::string > Names, Writers;
    ASSERT_TRUE( GetLockingProcesses( Path, Names ) );
    ASSERT_EQ( Names.size(), 2u );
    EXPECT_EQ( boost::filesystem::path( Names[0] ).filename(), "sleep" ) << Names[0];
    ASSERT_TRUE( GetWritingProcesses( Path, Writers ) );
    EXPECT_EQ( Writers,
               std::vector< std::string >{ Names[0] + " (process " + std::to_string( Holders[0]->Process ) + ")" } );

    for( int i = 0; i < 9; ++i )
      Holders.push_back( std::make_unique< VHolder >( Path, O_RDONLY ) );
    Names.clear();
    EXPECT_FALSE( GetLockingProcesses( Path, Names ) );
    EXPECT_TRUE( Names.empty() );
    Holders.pop_back();
    ASSERT_TRUE( GetLockingProcesses( Path, Names ) );
    EXPECT_EQ( Names.size(), 10u );

    Holders.clear();
    Names.clear();
    ASSERT_TRUE( GetLockingProcesses( Path, Names ) );
    EXPECT_TRUE( Names.empty() );
    EXPECT_FALSE( GetLockingProcesses( Folder.File( "absent" ), Names ) );
  }

  TEST( LongPath, NarrowAndWideFormsAgreeAndASecondConversionChangesNothing )
  {
    const struct
    {
      const char* Path;
      const char* Long;
    } Cases[] = { { "C:\\data\\clip.lvid", "\\\\?\\C:\\data\\clip.lvid" },
                  { "d:/data/clip.lvid", "\\\\?\\d:\\data\\clip.lvid" },
                  { "C:clip.lvid", "C:clip.lvid" }, // relative to the drive's current folder
                  { "C:", "C:" },
                  { "1:\\clip", "1:\\clip" }, // not a drive letter
                  { "\\\\host\\share\\x", "\\\\?\\UNC\\host\\share\\x" },
                  { "//host/share/x", "\\\\?\\UNC\\host\\share\\x" },
                  { "\\\\?\\C:\\x", "\\\\?\\C:\\x" },
                  { "\\\\?\\UNC\\host\\x", "\\\\?\\UNC\\host\\x" },
                  { "\\\\", "\\\\?\\UNC\\" },
                  { "data/clip.lvid", "data\\clip.lvid" },
                  { "/data/clip.lvid", "\\data\\clip.lvid" }, // a POSIX absolute path is not absolute there
                  { "", "" } };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Path );
      const std::string Path = rCase.Path, Long = rCase.Long;
      EXPECT_EQ( Long, MakeLongPath( Path ) );
      EXPECT_EQ( std::wstring( Long.begin(), Long.end() ), MakeLongPath( std::wstring( Path.begin(), Path.end() ) ) );
      EXPECT_EQ( Long, MakeLongPath( MakeLongPath( Path ) ) );
    }
  }
} // namespace
