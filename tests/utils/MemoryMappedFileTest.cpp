#include "utils/UtilsFileSystem/MemoryMappedFile.h"
#include "utils/UtilsFileSystem/FileIO.h"

#include "tests/utils/FileTestSupport.h"

#include <gtest/gtest.h>

#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <random>
#include <thread>

using namespace UtilsFileSystem;

namespace
{
  const std::uint64_t s_Page = static_cast< std::uint64_t >( ::sysconf( _SC_PAGESIZE ) );

  // One file of pattern bytes in a folder of its own.
  class MappedFileTest : public testing::Test
  {
  protected:
    void MakeFile( std::uint64_t i_Size )
    {
      m_Bytes = LumekTest::PatternBytes( i_Size );
      LumekTest::WriteText( m_Path, std::string( m_Bytes.begin(), m_Bytes.end() ) );
    }
    static bool ReadAt( VMemoryMappedInputStream& io_rStream, std::uint64_t i_Offset,
                        std::vector< std::uint8_t >& o_rBytes )
    {
      return io_rStream.Seek( static_cast< std::int64_t >( i_Offset ) ) &&
             io_rStream.Read( o_rBytes.data(), o_rBytes.size() );
    }

    const LumekTest::VTempFolder m_Folder;
    const std::string m_Path = m_Folder.File( "mapped.bin" );
    std::vector< std::uint8_t > m_Bytes;
  };

  // A seek may go past the end; only the read there fails, and a seek back makes the stream good.
  // Two windows over three pages: a page read again moves to the front, so the window evicted is
  // the one read least recently (first in, first out would swap again for the third read of page 2).
  TEST_F( MappedFileTest, TheLastByteOfWholePagesReadsAndTheLeastRecentWindowGoes )
  {
    EXPECT_EQ( VMemoryMappedInputFile( 1, 1 ).GetPageSize(), s_Page );
    EXPECT_EQ( VMemoryMappedInputFile( s_Page + 1, 1 ).GetPageSize(), 2 * s_Page );
    EXPECT_EQ( VMemoryMappedInputFile( 4 * s_Page, 0 ).GetMaxPages(), 1u );
    MakeFile( 3 * s_Page );
    const LumekTest::VLogCapture Log( "System" );
    VMemoryMappedInputStream Stream( s_Page, 2 );
    ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
    std::vector< std::uint8_t > Byte( 1 ), Across( 2 );
    ASSERT_TRUE( ReadAt( Stream, 3 * s_Page - 1, Byte ) );
    EXPECT_EQ( Byte[0], m_Bytes.back() );
    EXPECT_FALSE( Stream.IsAtEnd() );
    EXPECT_TRUE( Stream.Read( Byte.data(), 0 ) );
    EXPECT_FALSE( Stream.Read( Byte.data(), 1 ) );
    EXPECT_TRUE( Stream.IsAtEnd() );
    EXPECT_FALSE( ReadAt( Stream, 3 * s_Page + 5, Byte ) );
    std::uint64_t Position = 0, Size = 0;
    EXPECT_TRUE( Stream.GetPosition( Position ) && Stream.GetSize( Size ) );
    EXPECT_EQ( std::make_pair( 3 * s_Page + 5, 3 * s_Page ), std::make_pair( Position, Size ) );

    const std::uint64_t Pages[] = { 0, 2, 1, 2, 0 }, Swaps[] = { 2, 2, 3, 3, 4 };
    for( std::size_t i = 0; i < 5; ++i )
    {
      ASSERT_TRUE( ReadAt( Stream, Pages[i] * s_Page + 17, Byte ) );
      EXPECT_EQ( Byte[0], m_Bytes[Pages[i] * s_Page + 17] );
      EXPECT_EQ( Stream.GetFile().GetSwapCount(), Swaps[i] ) << "read " << i << " of page " << Pages[i];
    }
    // Two bytes across the end of a window need both windows; the least recent goes again.
    ASSERT_TRUE( ReadAt( Stream, s_Page - 1, Across ) );
    EXPECT_EQ( Across, std::vector< std::uint8_t >( &m_Bytes[s_Page - 1], &m_Bytes[s_Page + 1] ) );
    Stream.Close();
    EXPECT_TRUE( Log.Contains( "VMemoryMappedInputStream stats: 5 swaps, " ) );
    ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok ) << "open again, and closed on the way out";
  }

  // Another program cutting and regrowing the file while it is read: a cut can land between the
  // size check and the copy, and must still only fail that read.
  TEST_F( MappedFileTest, AFileCutWhileBeingReadNeverTakesTheProcessDown )
  {
    MakeFile( 64 * s_Page );
    VMemoryMappedInputStream Stream( 4 * s_Page, 4 );
    ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
    std::atomic< bool > bStop( false );
    const auto CutTo = [&]( std::uint64_t i_Pages )
    { return ::truncate( m_Path.c_str(), static_cast< off_t >( i_Pages * s_Page ) ) == 0; };
    std::thread Cutter(
        [&]
        {
          for( int i = 0; !bStop; ++i )
            static_cast< void >( CutTo( i % 2 == 0 ? 8 : 64 ) );
        } );
    std::mt19937 Random( 7 );
    std::vector< std::uint8_t > Read( 16 * s_Page );
    int Failed = 0;
    for( int i = 0; i < 20000; ++i )
    {
      const std::uint64_t Offset = Random() % ( 48 * s_Page );
      const std::uint64_t Size = 1 + Random() % ( 16 * s_Page );
      ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( Offset ) ) );
      if( !Stream.Read( Read.data(), Size ) )
        ++Failed;
      else if( Offset + Size <= 8 * s_Page )
      {
        ASSERT_TRUE( std::equal( Read.begin(), Read.begin() + static_cast< std::ptrdiff_t >( Size ),
                                 m_Bytes.begin() + static_cast< std::ptrdiff_t >( Offset ) ) );
      }
    }
    bStop = true;
    Cutter.join();
    EXPECT_GT( Failed, 0 );
  }

  // A file that cannot be mapped (an empty one) falls back to the plain stream with a log line; a
  // missing file is an error without a fallback, and a folder fails in the fallback too.
  TEST_F( MappedFileTest, OpenGivesTheMappedStreamOrFallsBackToThePlainOne )
  {
    const std::string Empty = m_Folder.File( "empty.bin" );
    LumekTest::WriteText( Empty, "" );
    MakeFile( 100 );
    const struct
    {
      std::string Path;
      ZOL::ResultCode Result;
      const char* Stream; // "mapped", "plain" or nothing
      bool bFallsBack;
    } Cases[] = { { m_Path, ZOL::Result_Ok, "mapped", false },
                  { Empty, ZOL::Result_Ok, "plain", true },
                  { m_Folder.File( "absent.bin" ), ZOL::Result_FileNotFound, "", false },
                  { m_Folder.Path(), ZOL::Result_InvalidType, "", true } };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Path );
      const LumekTest::VLogCapture Log( "System" );
      std::shared_ptr< ZOL::IInputStreamSeekable > pStream;
      EXPECT_EQ( OpenMemoryMappedInputStream( rCase.Path, pStream ), rCase.Result );
      const std::string Kind = dynamic_cast< VMemoryMappedInputStreamVirtual* >( pStream.get() ) ? "mapped"
                               : dynamic_cast< VFileInputStreamVirtual* >( pStream.get() )       ? "plain"
                                                                                                 : "";
      EXPECT_EQ( rCase.Stream, Kind );
      EXPECT_EQ( rCase.bFallsBack, Log.Has( "Failed to open memory mapped input file stream " + rCase.Path + " (" +
                                            ZOL::GetResultText( ZOL::Result_FileIOFailure ) +
                                            "), falling back to a standard input file stream." ) );
      std::uint64_t Size = 1;
      std::uint8_t Byte = 0;
      EXPECT_TRUE( Kind != "plain" ||
                   ( pStream->GetSize( Size ) && Size == 0 && !pStream->Read( &Byte, 1 ) && pStream->IsAtEnd() ) );
    }
  }
} // namespace
