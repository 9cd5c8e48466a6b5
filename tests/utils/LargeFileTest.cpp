#include "tests/support/TestNames.h"
#include "utils/UtilsIO/VLargeFile.h"
#include "videointerface/IVideoAttributes.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
#include <string>
#include <unistd.h>

using UtilsIO::VLargeFile;

namespace
{
  // A folder of its own for each test, removed afterwards.
  class VScratch
  {
  public:
    VScratch()
    {
      std::string Template = testing::TempDir() + "lumek-largefile-XXXXXX";
      if( mkdtemp( &Template[0] ) != nullptr )
        m_Folder = Template;
    }
    ~VScratch()
    {
      for( const std::string& rPath : m_Files )
        std::remove( rPath.c_str() );
      if( !m_Folder.empty() )
        rmdir( m_Folder.c_str() );
    }
    std::string File( const std::string& i_rName )
    {
      m_Files.push_back( m_Folder + "/" + i_rName );
      return m_Files.back();
    }
    bool Ok() const { return !m_Folder.empty(); }

  private:
    std::string m_Folder;
    std::vector< std::string > m_Files;
  };

  void WriteFile( const std::string& i_rPath, const std::string& i_rContent )
  {
    std::FILE* pFile = std::fopen( i_rPath.c_str(), "wb" );
    ASSERT_NE( nullptr, pFile );
    std::fwrite( i_rContent.data(), 1, i_rContent.size(), pFile );
    std::fclose( pFile );
  }

  std::string ReadAt( VLargeFile& io_rFile, std::int64_t i_Position, std::size_t i_Size )
  {
    std::string Text( i_Size, '\0' );
    if( !io_rFile.Seek( i_Position ) || !io_rFile.Read( &Text[0], i_Size ) )
      return "<failed>";
    return Text;
  }
} // namespace

class LargeFileTest : public testing::Test
{
protected:
  void SetUp() override { ASSERT_TRUE( m_Scratch.Ok() ); }
  VScratch m_Scratch;
};

TEST_F( LargeFileTest, PositionsBeyondFourGigabytesOnASparseFile )
{
  const std::string Path = m_Scratch.File( "sparse.bin" );
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
  std::uint64_t Reported = 0;
  EXPECT_TRUE( File.GetSize( Reported ) );
  EXPECT_EQ( static_cast< std::uint64_t >( Size ), Reported );
  EXPECT_EQ( "MARKER", ReadAt( File, Marker, 6 ) );
  std::uint64_t Position = 0;
  EXPECT_TRUE( File.GetPosition( Position ) );
  EXPECT_EQ( static_cast< std::uint64_t >( Marker + 6 ), Position );

  // Write past 4 GB through the class and read it back through the C library.
  ASSERT_TRUE( File.Seek( Size - 3 ) );
  ASSERT_TRUE( File.Write( "END", 3 ) );
  ASSERT_TRUE( File.Flush() );
  ASSERT_TRUE( ZOL::Skip( File, -3 ) );
  char End[3] = {};
  ASSERT_TRUE( File.Read( End, 3 ) );
  EXPECT_EQ( std::string( "END" ), std::string( End, 3 ) );
  EXPECT_TRUE( File.Close() );

  const int Descriptor = open( Path.c_str(), O_RDONLY );
  char Check[3] = {};
  EXPECT_EQ( 3, pread( Descriptor, Check, 3, Size - 3 ) );
  close( Descriptor );
  EXPECT_EQ( std::string( "END" ), std::string( Check, 3 ) );
}

TEST_F( LargeFileTest, AFailedReadStaysFailedUntilASeek )
{
  const std::string Path = m_Scratch.File( "ten.bin" );
  WriteFile( Path, "0123456789" );
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

TEST_F( LargeFileTest, CachedSizeIsTheSizeAtOpen )
{
  const std::string Path = m_Scratch.File( "growing.bin" );
  WriteFile( Path, "abc" );
  VLargeFile File;
  ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_Read ) );
  ASSERT_TRUE( File.Seek( 1 ) );

  std::FILE* pWriter = std::fopen( Path.c_str(), "ab" );
  ASSERT_NE( nullptr, pWriter );
  std::fputs( "defgh", pWriter );
  std::fclose( pWriter );

  std::uint64_t Size = 0;
  EXPECT_TRUE( File.GetSize( Size ) );
  EXPECT_EQ( 8u, Size );
  EXPECT_EQ( 3u, File.GetCachedSize() );
  std::uint64_t Position = 0;
  EXPECT_TRUE( File.GetPosition( Position ) );
  EXPECT_EQ( 1u, Position ) << "GetSize leaves the position";
}

TEST_F( LargeFileTest, AttributeStoreThroughAFile )
{
  const std::string Path = m_Scratch.File( "store.bin" );
  ZOL::IVideoAttributes Store;
  Store.Set( "VideoFrameInfo.PixelFormat", "BayerGB8" );
  Store.Set( "TicksPerSecond", 135000000u );
  {
    VLargeFile File;
    ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_Create ) );
    ASSERT_TRUE( Store.WriteTo( File ) );
    // A second store whose only key claims 4 GB of a file that holds 3 bytes more.
    ASSERT_TRUE( ZOL::WriteLE( File, 1u ) && ZOL::WriteLE( File, 0xFFFFFFF0u ) && File.Write( "abc", 3 ) );
  }
  VLargeFile File;
  ASSERT_TRUE( File.Open( Path, UtilsIO::OpenMode_Read ) );
  ZOL::IVideoAttributes Read;
  ASSERT_TRUE( Read.ReadFrom( File ) );
  EXPECT_TRUE( Read == Store );
  EXPECT_FALSE( Read.ReadFrom( File ) );
  EXPECT_FALSE( File.IsGood() ) << "the lie fails the stream as a short read would";
  EXPECT_TRUE( File.IsAtEnd() );
}

TEST_F( LargeFileTest, OpenTwiceKeepsTheFirstFile )
{
  const std::string First = m_Scratch.File( "first.bin" );
  const std::string Second = m_Scratch.File( "second.bin" );
  WriteFile( First, "first" );
  WriteFile( Second, "second" );
  VLargeFile File;
  ASSERT_TRUE( File.Open( First, UtilsIO::OpenMode_Read ) );
  EXPECT_FALSE( File.Open( Second, UtilsIO::OpenMode_Read ) );
  EXPECT_EQ( "first", ReadAt( File, 0, 5 ) );
  EXPECT_TRUE( File.Close() );
  EXPECT_FALSE( File.Close() );
  EXPECT_FALSE( File.IsOpen() );
  ASSERT_TRUE( File.Open( Second, UtilsIO::OpenMode_Read ) );
  EXPECT_EQ( "second", ReadAt( File, 0, 6 ) );
}

TEST_F( LargeFileTest, ClosedFileFailsEverything )
{
  VLargeFile File;
  char Byte = 0;
  std::uint64_t Value = 0;
  EXPECT_FALSE( File.Read( &Byte, 1 ) );
  EXPECT_FALSE( File.Write( &Byte, 1 ) );
  EXPECT_FALSE( File.GetSize( Value ) );
  EXPECT_FALSE( File.GetPosition( Value ) );
  EXPECT_FALSE( File.Seek( 0 ) );
  EXPECT_FALSE( File.SeekToEnd() );
  EXPECT_FALSE( File.IsAtEnd() );
  EXPECT_FALSE( File.Open( m_Scratch.File( "missing.bin" ), UtilsIO::OpenMode_Read ) );
}

struct VModeCase
{
  const char* Name;
  int Mode;
  const char* Text;
  bool Opens;       // on an existing file
  bool Writes;      // a write there succeeds
  bool Truncates;   // the old content is gone
  bool CreatesFile; // opening a missing file creates it
};

class LargeFileModeTest : public testing::TestWithParam< VModeCase >
{
protected:
  VScratch m_Scratch;
};

TEST_P( LargeFileModeTest, ModeDecidesAccess )
{
  EXPECT_STREQ( GetParam().Text, UtilsIO::OpenModeText( GetParam().Mode ) );
  const std::string Path = m_Scratch.File( "mode.bin" );
  WriteFile( Path, "old" );
  {
    VLargeFile File;
    ASSERT_EQ( GetParam().Opens, File.Open( Path, GetParam().Mode ) );
    if( GetParam().Opens )
    {
      EXPECT_EQ( GetParam().Truncates ? 0u : 3u, File.GetCachedSize() );
      EXPECT_EQ( GetParam().Writes, File.Write( "new", 3 ) );
    }
  }
  VLargeFile Missing;
  EXPECT_EQ( GetParam().CreatesFile, Missing.Open( m_Scratch.File( "created.bin" ), GetParam().Mode ) );
}

INSTANTIATE_TEST_SUITE_P( Modes, LargeFileModeTest,
                          testing::Values( VModeCase{ "Read", 0, "rb", true, false, false, false },
                                           VModeCase{ "ReadWrite", 1, "r+b", true, true, false, false },
                                           VModeCase{ "Create", 2, "w+b", true, true, true, true },
                                           VModeCase{ "Write", 3, "wb", true, true, true, true },
                                           VModeCase{ "Unknown", 4, "", false, false, false, false },
                                           VModeCase{ "Negative", -1, "", false, false, false, false } ),
                          LumekTest::VCaseName() );
