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

// Written past 4 GB through the class and read back through the system.
TEST( LargeFile, PositionsBeyondFourGigabytesOnASparseFile )
{
  const LumekTest::VTempFolder Folder;
  const std::string Path = Folder.File( "sparse.bin" );
  constexpr std::int64_t Size = 5ll << 30, Marker = ( 4ll << 30 ) + 12345;
  const int Descriptor = open( Path.c_str(), O_CREAT | O_RDWR | O_TRUNC, 0600 );
  ASSERT_GE( Descriptor, 0 );
  ASSERT_EQ( 0, ftruncate( Descriptor, Size ) ) << "file system without sparse files";
  ASSERT_EQ( 6, pwrite( Descriptor, "MARKER", 6, Marker ) );

  VLargeFile File;
  ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_ReadWrite ) );
  EXPECT_EQ( static_cast< std::uint64_t >( Size ), File.GetCachedSize() );
  EXPECT_EQ( "MARKER", ReadAt( File, Marker, 6 ) );
  std::uint64_t Value = 0;
  EXPECT_TRUE( File.GetPosition( Value ) );
  EXPECT_EQ( static_cast< std::uint64_t >( Marker + 6 ), Value );
  ASSERT_TRUE( File.Seek( Size - 3 ) && File.Write( "END", 3 ) && File.Flush() && ZOL::Skip( File, -3 ) );
  EXPECT_EQ( "END", ReadAt( File, Size - 3, 3 ) );
  EXPECT_TRUE( File.Close() );
  char End[3] = {};
  EXPECT_EQ( 3, pread( Descriptor, End, 3, Size - 3 ) );
  close( Descriptor );
  EXPECT_EQ( "END", std::string( End, 3 ) );
}

// A short read fails the stream, even when bytes remain, until a seek; a closed file fails
// everything; a second open keeps the first file.
TEST( LargeFile, AFailedReadStaysFailedUntilASeekAndAClosedFileFailsEverything )
{
  const LumekTest::VTempFolder Folder;
  const std::string Path = Folder.File( "ten.bin" ), Other = Folder.File( "other.bin" );
  WriteText( Path, "0123456789" );
  WriteText( Other, "other" );
  VLargeFile File;
  for( int Mode : { -1, 4 } )
    EXPECT_FALSE( File.Open( Path, Mode ) ) << "mode " << Mode;
  ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_Read ) );
  EXPECT_FALSE( File.Open( Other, UtilsIO::OpenMode_Read ) );
  char Buffer[16] = {};
  EXPECT_TRUE( File.Read( Buffer, 0 ) ) << "zero bytes on a good stream";
  ASSERT_TRUE( File.Seek( 8 ) );
  EXPECT_FALSE( File.Read( Buffer, 4 ) );
  EXPECT_FALSE( File.IsGood() );
  EXPECT_TRUE( File.IsAtEnd() );
  EXPECT_FALSE( File.Read( Buffer, 0 ) ) << "zero bytes on a failed stream";
  EXPECT_FALSE( File.Read( Buffer, 1 ) || File.Write( "x", 1 ) );
  EXPECT_EQ( "0123456789", ReadAt( File, 0, 10 ) );
  EXPECT_FALSE( File.Seek( -1 ) );
  EXPECT_TRUE( File.SeekToEnd() && File.IsGood() );

  // A file still being written grows: the size asks the file, the cached size stays as opened.
  ASSERT_TRUE( File.Seek( 1 ) );
  std::ofstream( Path, std::ios::binary | std::ios::app ) << "abc";
  std::uint64_t Value = 0;
  EXPECT_TRUE( File.GetSize( Value ) );
  EXPECT_EQ( 13u, Value );
  EXPECT_EQ( 10u, File.GetCachedSize() );
  EXPECT_TRUE( File.GetPosition( Value ) );
  EXPECT_EQ( 1u, Value ) << "GetSize leaves the position";

  EXPECT_TRUE( File.Close() );
  EXPECT_FALSE( File.Close() || File.IsOpen() );
  EXPECT_FALSE( File.Read( Buffer, 1 ) || File.Write( Buffer, 1 ) || File.GetSize( Value ) ||
                File.GetPosition( Value ) || File.Seek( 0 ) || File.SeekToEnd() || File.IsAtEnd() );
  EXPECT_FALSE( File.Open( Folder.File( "missing.bin" ), UtilsIO::OpenMode_Read ) );
  ASSERT_TRUE( File.Open( Other, UtilsIO::OpenMode_Create ) );
  EXPECT_EQ( 0u, File.GetCachedSize() ) << "creating empties the file";
}
