#include "utils/UtilsIO/VLargeFile.h"

#include "tests/utils/FileTestSupport.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

using LumekTest::WriteText;
using UtilsIO::VLargeFile;

namespace
{
  std::string ReadAt( VLargeFile& io_rFile, std::int64_t i_Position, std::size_t i_Size )
  {
    std::string Text( i_Size, '\0' );
    if( !io_rFile.Seek( i_Position ) || !io_rFile.Read( &Text[0], i_Size ) )
      return "<failed>";
    return Text;
  }
} // namespace

TEST( LargeFile, PositionsBeyondFourGigabytesOnASparseFile )
{
  const LumekTest::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "sparse.bin" );
  constexpr std::int64_t Size = 5ll << 30;
  constexpr std::int64_t Marker = ( 4ll << 30 ) + 12345;
  {
    const int Descriptor = open( Path.c_str(), O_CREAT | O_RDWR | O_TRUNC, 0600 );
    ASSERT_GE( Descriptor, 0 );
    ASSERT_EQ( 0, ftruncate( Descriptor, Size ) ) << "file system without sparse files";
    ASSERT_EQ( 6, pwrite( Descriptor, "MARKER", 6, Marker ) );
    close( Descriptor );
  }

  VLargeFile File;
  ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_ReadWrite ) );
  EXPECT_EQ( static_cast< std::uint64_t >( Size ), File.GetCachedSize() );
  std::uint64_t Value = 0;
  EXPECT_TRUE( File.GetSize( Value ) );
  EXPECT_EQ( static_cast< std::uint64_t >( Size ), Value );
  EXPECT_EQ( "MARKER", ReadAt( File, Marker, 6 ) );
  EXPECT_TRUE( File.GetPosition( Value ) );
  EXPECT_EQ( static_cast< std::uint64_t >( Marker + 6 ), Value );

  // Write past 4 GB through the class and read it back through the C library.
  ASSERT_TRUE( File.Seek( Size - 3 ) );
  ASSERT_TRUE( File.Write( "END", 3 ) );
  ASSERT_TRUE( File.Flush() );
  ASSERT_TRUE( ZOL::Skip( File, -3 ) );
  char End[3] = {};
  ASSERT_TRUE( File.Read( End, 3 ) );
  EXPECT_EQ( "END", std::string( End, 3 ) );
  EXPECT_TRUE( File.Close() );

  const int Descriptor = open( Path.c_str(), O_RDONLY );
  EXPECT_EQ( 3, pread( Descriptor, End, 3, Size - 3 ) );
  close( Descriptor );
  EXPECT_EQ( "END", std::string( End, 3 ) );
}

TEST( LargeFile, AFailedReadStaysFailedUntilASeek )
{
  const LumekTest::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "ten.bin" );
  WriteText( Path, "0123456789" );
  VLargeFile File;
  ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_Read ) );
  char Buffer[16] = {};
  EXPECT_TRUE( File.Read( Buffer, 0 ) ) << "zero bytes on a good stream";
  ASSERT_TRUE( File.Seek( 8 ) );
  EXPECT_FALSE( File.Read( Buffer, 4 ) );
  EXPECT_FALSE( File.IsGood() );
  EXPECT_TRUE( File.IsAtEnd() );
  EXPECT_FALSE( File.Read( Buffer, 0 ) ) << "zero bytes on a failed stream";
  ASSERT_TRUE( File.Seek( 8 ) );
  EXPECT_FALSE( File.Read( Buffer, 3 ) );
  EXPECT_FALSE( File.Read( Buffer, 1 ) ) << "a short read fails the stream even when bytes remain";
  EXPECT_FALSE( File.Write( "x", 1 ) );

  EXPECT_TRUE( File.Seek( 0 ) );
  EXPECT_TRUE( File.IsGood() );
  EXPECT_TRUE( File.Read( Buffer, 10 ) );
  EXPECT_EQ( "0123456789", std::string( Buffer, 10 ) );
  EXPECT_FALSE( File.Seek( -1 ) );
  EXPECT_FALSE( File.IsGood() );
  EXPECT_TRUE( File.SeekToEnd() );
  EXPECT_TRUE( File.IsGood() );
}

TEST( LargeFile, CachedSizeIsTheSizeAtOpen )
{
  const LumekTest::VTemporaryFolder Folder;
  const std::string Path = Folder.File( "growing.bin" );
  WriteText( Path, "abc" );
  VLargeFile File;
  ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_Read ) );
  ASSERT_TRUE( File.Seek( 1 ) );
  std::ofstream( Path, std::ios::binary | std::ios::app ) << "defgh";

  std::uint64_t Value = 0;
  EXPECT_TRUE( File.GetSize( Value ) );
  EXPECT_EQ( 8u, Value );
  EXPECT_EQ( 3u, File.GetCachedSize() );
  EXPECT_TRUE( File.GetPosition( Value ) );
  EXPECT_EQ( 1u, Value ) << "GetSize leaves the position";
}

TEST( LargeFile, OpenTwiceKeepsTheFirstFileAndAClosedFileFailsEverything )
{
  const LumekTest::VTemporaryFolder Folder;
  const std::string First = Folder.File( "first.bin" ), Second = Folder.File( "second.bin" );
  WriteText( First, "first" );
  WriteText( Second, "second" );
  VLargeFile File;
  ASSERT_TRUE( File.Open( First, UtilsIO::OpenMode_Read ) );
  EXPECT_FALSE( File.Open( Second, UtilsIO::OpenMode_Read ) );
  EXPECT_EQ( "first", ReadAt( File, 0, 5 ) );
  EXPECT_TRUE( File.Close() );
  EXPECT_FALSE( File.Close() );
  EXPECT_FALSE( File.IsOpen() );

  char Byte = 0;
  std::uint64_t Value = 0;
  EXPECT_FALSE( File.Read( &Byte, 1 ) );
  EXPECT_FALSE( File.Write( &Byte, 1 ) );
  EXPECT_FALSE( File.GetSize( Value ) );
  EXPECT_FALSE( File.GetPosition( Value ) );
  EXPECT_FALSE( File.Seek( 0 ) );
  EXPECT_FALSE( File.SeekToEnd() );
  EXPECT_FALSE( File.IsAtEnd() );
  EXPECT_FALSE( File.Open( Folder.File( "missing.bin" ), UtilsIO::OpenMode_Read ) );
  ASSERT_TRUE( File.Open( Second, UtilsIO::OpenMode_Read ) );
  EXPECT_EQ( "second", ReadAt( File, 0, 6 ) );
}

TEST( LargeFile, ModeDecidesAccess )
{
  const struct
  {
    int Mode;
    const char* Text;
    bool Opens;       // on an existing file
    bool Writes;      // a write there succeeds
    bool Truncates;   // the old content is gone
    bool CreatesFile; // opening a missing file creates it
  } Cases[] = { { 0, "rb", true, false, false, false }, { 1, "r+b", true, true, false, false },
                { 2, "w+b", true, true, true, true },   { 3, "wb", true, true, true, true },
                { 4, "", false, false, false, false },  { -1, "", false, false, false, false } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Mode );
    EXPECT_STREQ( rCase.Text, UtilsIO::OpenModeText( rCase.Mode ) );
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "mode.bin" );
    WriteText( Path, "old" );
    {
      VLargeFile File;
      ASSERT_EQ( rCase.Opens, File.Open( Path, rCase.Mode ) );
      if( rCase.Opens )
      {
        EXPECT_EQ( rCase.Truncates ? 0u : 3u, File.GetCachedSize() );
        EXPECT_EQ( rCase.Writes, File.Write( "new", 3 ) );
      }
    }
    VLargeFile Missing;
    EXPECT_EQ( rCase.CreatesFile, Missing.Open( Folder.File( "created.bin" ), rCase.Mode ) );
  }
}
