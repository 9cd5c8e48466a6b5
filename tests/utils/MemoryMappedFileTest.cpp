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
      LumekTest::WriteBytes( m_Path, m_Bytes );
    }
    std::vector< std::uint8_t > Slice( std::uint64_t i_Offset, std::uint64_t i_Size ) const
    {
      const auto Begin = m_Bytes.begin() + static_cast< std::ptrdiff_t >( i_Offset );
      return std::vector< std::uint8_t >( Begin, Begin + static_cast< std::ptrdiff_t >( i_Size ) );
    }
    static bool ReadAt( VMemoryMappedInputStream& io_rStream, std::uint64_t i_Offset,
                        std::vector< std::uint8_t >& o_rBytes )
    {
      return io_rStream.Seek( static_cast< std::int64_t >( i_Offset ) ) &&
             io_rStream.Read( o_rBytes.data(), o_rBytes.size() );
    }

    const LumekTest::VTemporaryFolder m_Folder;
    const std::string m_Path = m_Folder.File( "mapped.bin" );
    std::vector< std::uint8_t > m_Bytes;
  };

  TEST_F( MappedFileTest, RangesReadInOrderWithOneSwapPerWindowTouched )
  {
    MakeFile( 5 * s_Page + 123 );
    // Where a read starts and how long it is, in the system's pages plus bytes, and how many
    // windows it must map when nothing is mapped yet.
    const struct
    {
      const char* Name;
      std::uint64_t OffsetInPages;
      std::int64_t OffsetAdjust;
      std::uint64_t SizeInPages;
      std::int64_t SizeAdjust;
      std::uint64_t Swaps;
    } Cases[] = { { "within one page", 1, 10, 0, 100, 1 },
                  { "two bytes across an end", 1, -1, 0, 2, 2 },
                  { "ends exactly at an end", 0, 10, 1, -10, 1 },
                  { "starts exactly at an end", 2, 0, 0, 7, 1 },
                  { "spans three pages", 0, 100, 2, 100, 3 },
                  { "the whole file", 0, 0, 5, 123, 6 },
                  { "to the end of the short last page", 5, -96, 0, 96 + 123, 2 } };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VMemoryMappedInputStream Stream( s_Page, 8 );
      ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
      const std::uint64_t Offset = rCase.OffsetInPages * s_Page + rCase.OffsetAdjust;
      std::vector< std::uint8_t > Read( rCase.SizeInPages * s_Page + rCase.SizeAdjust );
      ASSERT_TRUE( ReadAt( Stream, Offset, Read ) );
      EXPECT_EQ( Read, Slice( Offset, Read.size() ) );
      EXPECT_EQ( Stream.GetFile().GetSwapCount(), rCase.Swaps );
      std::uint64_t Position = 0;
      ASSERT_TRUE( Stream.GetPosition( Position ) );
      EXPECT_EQ( Position, Offset + Read.size() );
    }
  }

  TEST_F( MappedFileTest, ReadsTheLastByteOfAFileOfWholePages )
  {
    MakeFile( 3 * s_Page );
    VMemoryMappedInputStream Stream( s_Page, 2 );
    ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
    std::vector< std::uint8_t > Byte( 1 );
    ASSERT_TRUE( ReadAt( Stream, 3 * s_Page - 1, Byte ) );
    EXPECT_EQ( Byte[0], m_Bytes.back() );
    EXPECT_FALSE( Stream.IsAtEnd() );
    EXPECT_FALSE( Stream.Read( Byte.data(), 1 ) );
    EXPECT_TRUE( Stream.IsAtEnd() );
    ASSERT_TRUE( ReadAt( Stream, 0, Byte ) );
    EXPECT_FALSE( Stream.IsAtEnd() );
    EXPECT_EQ( Byte[0], m_Bytes.front() );
  }

  TEST_F( MappedFileTest, OneMorePageThanWindowsReadInTurnSwapsEveryTime )
  {
    constexpr std::size_t MaxPages = 3;
    constexpr int Rounds = 4;
    MakeFile( ( MaxPages + 1 ) * s_Page );
    VMemoryMappedInputStream Stream( s_Page, MaxPages );
    ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
    std::vector< std::uint8_t > Byte( 1 );
    for( int Round = 0; Round < Rounds; ++Round )
      for( std::uint64_t Page = 0; Page <= MaxPages; ++Page )
      {
        ASSERT_TRUE( ReadAt( Stream, Page * s_Page + 17, Byte ) );
        EXPECT_EQ( Byte[0], m_Bytes[Page * s_Page + 17] );
      }
    EXPECT_EQ( Stream.GetFile().GetSwapCount(), Rounds * ( MaxPages + 1 ) );

    // The same pages within the windows' reach never swap again once mapped.
    const std::uint64_t Before = Stream.GetFile().GetSwapCount();
    for( int Round = 0; Round < Rounds; ++Round )
      for( std::uint64_t Page = 0; Page < MaxPages; ++Page )
        ASSERT_TRUE( ReadAt( Stream, Page * s_Page, Byte ) );
    EXPECT_EQ( Stream.GetFile().GetSwapCount(), Before + MaxPages );
  }

  TEST_F( MappedFileTest, PagesAreWholeSystemPagesAndCloseLogsTheSwaps )
  {
    EXPECT_EQ( VMemoryMappedInputFile( 1, 1 ).GetPageSize(), s_Page );
    EXPECT_EQ( VMemoryMappedInputFile( s_Page + 1, 1 ).GetPageSize(), 2 * s_Page );
    EXPECT_EQ( VMemoryMappedInputFile( 4 * s_Page, 0 ).GetMaxPages(), 1u );

    MakeFile( 2 * s_Page + 1 );
    const LumekTest::VLogCapture Log( "System" );
    {
      VMemoryMappedInputStream Stream( s_Page, 1 );
      ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
      std::vector< std::uint8_t > All( m_Bytes.size() );
      ASSERT_TRUE( ReadAt( Stream, 0, All ) );
    }
    EXPECT_TRUE( Log.Has( "VMemoryMappedInputStream stats: 3 swaps, 3 pages in file." ) );
  }

  TEST_F( MappedFileTest, AFileTruncatedUnderTheStreamAnswersFalse )
  {
    MakeFile( 8 * s_Page );
    VMemoryMappedInputStream Stream( s_Page, 8 );
    ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
    // Every window mapped before the file shrinks: the lost pages are the ones that would fault.
    std::vector< std::uint8_t > Read( m_Bytes.size() );
    ASSERT_TRUE( ReadAt( Stream, 0, Read ) );
    ASSERT_EQ( ::truncate( m_Path.c_str(), static_cast< off_t >( 2 * s_Page ) ), 0 );

    Read.resize( s_Page );
    EXPECT_FALSE( ReadAt( Stream, 5 * s_Page, Read ) );
    std::vector< std::uint8_t > Across( 20 );
    EXPECT_FALSE( ReadAt( Stream, 2 * s_Page - 10, Across ) ) << "a range that only starts in what is left";
    ASSERT_TRUE( ReadAt( Stream, s_Page, Read ) );
    EXPECT_EQ( Read, Slice( s_Page, s_Page ) );
  }

  // Another program cutting and regrowing the file while it is read: a cut can land between the
  // size check and the copy, and must still only fail that read.
  TEST_F( MappedFileTest, AFileCutWhileBeingReadNeverTakesTheProcessDown )
  {
    MakeFile( 64 * s_Page );
    VMemoryMappedInputStream Stream( 4 * s_Page, 4 );
    ASSERT_EQ( Stream.Open( m_Path ), ZOL::Result_Ok );
    std::atomic< bool > bStop( false );
    std::thread Cutter(
        [&]
        {
          for( int i = 0; !bStop; ++i )
            static_cast< void >(
                ::truncate( m_Path.c_str(), static_cast< off_t >( ( i % 2 == 0 ? 8 : 64 ) * s_Page ) ) );
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
      EXPECT_EQ( rCase.bFallsBack, Log.Contains( "falling back" ) );
      if( Kind == "plain" )
      {
        EXPECT_TRUE( Log.Has( "Failed to open memory mapped input file stream " + rCase.Path + " (" +
                              ZOL::GetResultText( ZOL::Result_FileIOFailure ) +
                              "), falling back to a standard input file stream." ) );
        std::uint64_t Size = 1;
        ASSERT_TRUE( pStream->GetSize( Size ) );
        EXPECT_EQ( Size, 0u );
        std::uint8_t Byte = 0;
        EXPECT_FALSE( pStream->Read( &Byte, 1 ) );
      }
    }
  }

  // Random reads and seeks give the same answers and bytes from the mapped stream as from the
  // plain one: window choice, eviction and crossing are all exercised by small windows.
  TEST_F( MappedFileTest, RandomReadsAndSeeksAgreeWithThePlainStream )
  {
    for( unsigned Seed = 1; Seed <= 6; ++Seed )
    {
      SCOPED_TRACE( "seed " + std::to_string( Seed ) );
      std::mt19937 Random( Seed );
      const std::uint64_t FileSize = 6 * s_Page + Random() % s_Page;
      MakeFile( FileSize );
      VMemoryMappedInputStream Mapped( s_Page * ( 1 + Random() % 2 ), 1 + Random() % 3 );
      ASSERT_EQ( Mapped.Open( m_Path ), ZOL::Result_Ok );
      VFileInputStream Plain;
      ASSERT_EQ( OpenInputStream( m_Path, Plain ), ZOL::Result_Ok );

      for( int Step = 0; Step < 2000; ++Step )
      {
        SCOPED_TRACE( Step );
        if( Random() % 3 == 0 )
        {
          // Now and then past the end, where both must still agree.
          const std::int64_t Position = static_cast< std::int64_t >( Random() % ( FileSize + 64 ) );
          ASSERT_EQ( Mapped.Seek( Position ), Plain.Seek( Position ) );
          continue;
        }
        const std::uint64_t Size = Random() % 4 == 0 ? Random() % ( 3 * s_Page ) : Random() % 64;
        std::vector< std::uint8_t > FromMapped( Size, 0xAA ), FromPlain( Size, 0x55 );
        const bool bMapped = Mapped.Read( FromMapped.data(), Size );
        ASSERT_EQ( bMapped, Plain.Read( FromPlain.data(), Size ) );
        if( !bMapped )
        {
          // A short read leaves the two at different places; both start again from one.
          const std::int64_t Position = static_cast< std::int64_t >( Random() % FileSize );
          ASSERT_TRUE( Mapped.Seek( Position ) && Plain.Seek( Position ) );
          continue;
        }
        ASSERT_EQ( FromMapped, FromPlain );
        std::uint64_t MappedPosition = 0, PlainPosition = 0;
        ASSERT_TRUE( Mapped.GetPosition( MappedPosition ) && Plain.GetPosition( PlainPosition ) );
        ASSERT_EQ( MappedPosition, PlainPosition );
      }
    }
  }
} // namespace
