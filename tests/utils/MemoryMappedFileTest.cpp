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

  std::vector< std::uint8_t > Slice( const std::vector< std::uint8_t >& i_rBytes, std::uint64_t i_Offset,
                                     std::uint64_t i_Size )
  {
    return std::vector< std::uint8_t >( i_rBytes.begin() + static_cast< std::ptrdiff_t >( i_Offset ),
                                        i_rBytes.begin() + static_cast< std::ptrdiff_t >( i_Offset + i_Size ) );
  }

  // A read of a range, in pages of the system's size: where it starts, how long it is, and how many
  // windows it must map when nothing is mapped yet.
  struct VRangeCase
  {
    const char* Name;
    std::uint64_t OffsetInPages;
    std::int64_t OffsetAdjust;
    std::uint64_t SizeInPages;
    std::int64_t SizeAdjust;
    std::uint64_t Swaps;
  };

  class MappedRangeTest : public testing::TestWithParam< VRangeCase >
  {
  };

  TEST_P( MappedRangeTest, ReturnsTheBytesInOrderWithOneSwapPerWindowTouched )
  {
    const VRangeCase& rCase = GetParam();
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "ranges.bin" );
    const auto Bytes = LumekTest::PatternBytes( 5 * s_Page + 123 );
    LumekTest::WriteBytes( Path, Bytes );

    VMemoryMappedInputStream Stream( s_Page, 8 );
    ASSERT_EQ( Stream.Open( Path ), ZOL::Result_Ok );
    const std::uint64_t Offset = rCase.OffsetInPages * s_Page + rCase.OffsetAdjust;
    const std::uint64_t Size = rCase.SizeInPages * s_Page + rCase.SizeAdjust;
    std::vector< std::uint8_t > Read( Size );
    ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( Offset ) ) );
    ASSERT_TRUE( Stream.Read( Read.data(), Size ) );
    EXPECT_EQ( Read, Slice( Bytes, Offset, Size ) );
    EXPECT_EQ( Stream.GetFile().GetSwapCount(), rCase.Swaps );
    std::uint64_t Position = 0;
    ASSERT_TRUE( Stream.GetPosition( Position ) );
    EXPECT_EQ( Position, Offset + Size );
  }

  INSTANTIATE_TEST_SUITE_P( PageEnds, MappedRangeTest,
                            testing::Values( VRangeCase{ "WithinOnePage", 1, 10, 0, 100, 1 },
                                             VRangeCase{ "TwoBytesAcrossAnEnd", 1, -1, 0, 2, 2 },
                                             VRangeCase{ "EndsExactlyAtAnEnd", 0, 10, 1, -10, 1 },
                                             VRangeCase{ "StartsExactlyAtAnEnd", 2, 0, 0, 7, 1 },
                                             VRangeCase{ "SpansThreePages", 0, 100, 2, 100, 3 },
                                             VRangeCase{ "TheWholeFile", 0, 0, 5, 123, 6 },
                                             VRangeCase{ "ToTheEndOfTheShortLastPage", 5, -96, 0, 96 + 123, 2 } ),
                            []( const testing::TestParamInfo< VRangeCase >& i_rInfo )
                            { return std::string( i_rInfo.param.Name ); } );

  TEST( MappedStream, ReadsTheLastByteOfAFileOfWholePages )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "whole.bin" );
    const auto Bytes = LumekTest::PatternBytes( 3 * s_Page );
    LumekTest::WriteBytes( Path, Bytes );

    VMemoryMappedInputStream Stream( s_Page, 2 );
    ASSERT_EQ( Stream.Open( Path ), ZOL::Result_Ok );
    std::uint8_t Last = 0;
    ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( 3 * s_Page - 1 ) ) );
    ASSERT_TRUE( Stream.Read( &Last, 1 ) );
    EXPECT_EQ( Last, Bytes.back() );
    EXPECT_FALSE( Stream.IsAtEnd() );
    EXPECT_FALSE( Stream.Read( &Last, 1 ) );
    EXPECT_TRUE( Stream.IsAtEnd() );
    ASSERT_TRUE( Stream.Seek( 0 ) );
    EXPECT_FALSE( Stream.IsAtEnd() );
    ASSERT_TRUE( Stream.Read( &Last, 1 ) );
    EXPECT_EQ( Last, Bytes.front() );
  }

  TEST( MappedStream, OneMorePageThanWindowsReadInTurnSwapsEveryTime )
  {
    constexpr std::size_t MaxPages = 3;
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "turns.bin" );
    const auto Bytes = LumekTest::PatternBytes( ( MaxPages + 1 ) * s_Page );
    LumekTest::WriteBytes( Path, Bytes );

    VMemoryMappedInputStream Stream( s_Page, MaxPages );
    ASSERT_EQ( Stream.Open( Path ), ZOL::Result_Ok );
    constexpr int Rounds = 4;
    for( int Round = 0; Round < Rounds; ++Round )
      for( std::uint64_t Page = 0; Page <= MaxPages; ++Page )
      {
        const std::uint64_t Offset = Page * s_Page + 17;
        std::uint8_t Byte = 0;
        ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( Offset ) ) );
        ASSERT_TRUE( Stream.Read( &Byte, 1 ) );
        EXPECT_EQ( Byte, Bytes[Offset] );
      }
    EXPECT_EQ( Stream.GetFile().GetSwapCount(), Rounds * ( MaxPages + 1 ) );

    // The same pages within the windows' reach never swap again once mapped.
    const std::uint64_t Before = Stream.GetFile().GetSwapCount();
    for( int Round = 0; Round < Rounds; ++Round )
      for( std::uint64_t Page = 0; Page < MaxPages; ++Page )
      {
        std::uint8_t Byte = 0;
        ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( Page * s_Page ) ) );
        ASSERT_TRUE( Stream.Read( &Byte, 1 ) );
      }
    EXPECT_EQ( Stream.GetFile().GetSwapCount(), Before + MaxPages );
  }

  TEST( MappedStream, PageSizeIsAMultipleOfTheSystemPage )
  {
    EXPECT_EQ( VMemoryMappedInputFile( 1, 1 ).GetPageSize(), s_Page );
    EXPECT_EQ( VMemoryMappedInputFile( s_Page + 1, 1 ).GetPageSize(), 2 * s_Page );
    EXPECT_EQ( VMemoryMappedInputFile( 4 * s_Page, 0 ).GetMaxPages(), 1u );
  }

  TEST( MappedStream, CloseLogsTheSwapsAndPages )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "stats.bin" );
    LumekTest::WriteBytes( Path, LumekTest::PatternBytes( 2 * s_Page + 1 ) );
    const LumekTest::VSystemLogCapture Log;
    {
      VMemoryMappedInputStream Stream( s_Page, 1 );
      ASSERT_EQ( Stream.Open( Path ), ZOL::Result_Ok );
      std::vector< std::uint8_t > All( 2 * s_Page + 1 );
      ASSERT_TRUE( Stream.Read( All.data(), All.size() ) );
    }
    EXPECT_TRUE( Log.Has( "VMemoryMappedInputStream stats: 3 swaps, 3 pages in file." ) );
  }

  TEST( MappedStream, AFileTruncatedUnderTheStreamAnswersFalse )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "shrinking.bin" );
    const auto Bytes = LumekTest::PatternBytes( 8 * s_Page );
    LumekTest::WriteBytes( Path, Bytes );

    VMemoryMappedInputStream Stream( s_Page, 8 );
    ASSERT_EQ( Stream.Open( Path ), ZOL::Result_Ok );
    // Every window mapped before the file shrinks: the lost pages are the ones that would fault.
    std::vector< std::uint8_t > All( Bytes.size() );
    ASSERT_TRUE( Stream.Read( All.data(), All.size() ) );
    ASSERT_EQ( ::truncate( Path.c_str(), static_cast< off_t >( 2 * s_Page ) ), 0 );

    std::vector< std::uint8_t > Read( s_Page );
    ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( 5 * s_Page ) ) );
    EXPECT_FALSE( Stream.Read( Read.data(), Read.size() ) );
    ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( 2 * s_Page - 10 ) ) );
    EXPECT_FALSE( Stream.Read( Read.data(), 20 ) ) << "a range that only starts in what is left";
    ASSERT_TRUE( Stream.Seek( static_cast< std::int64_t >( s_Page ) ) );
    ASSERT_TRUE( Stream.Read( Read.data(), Read.size() ) );
    EXPECT_EQ( Read, Slice( Bytes, s_Page, s_Page ) );
  }

  // Another program cutting and regrowing the file while it is read: a cut can land between the
  // size check and the copy, and must still only fail that read.
  TEST( MappedStream, AFileCutWhileBeingReadNeverTakesTheProcessDown )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "cut.bin" );
    const auto Bytes = LumekTest::PatternBytes( 64 * s_Page );
    LumekTest::WriteBytes( Path, Bytes );
    VMemoryMappedInputStream Stream( 4 * s_Page, 4 );
    ASSERT_EQ( Stream.Open( Path ), ZOL::Result_Ok );

    std::atomic< bool > bStop( false );
    std::thread Cutter(
        [&]
        {
          for( int i = 0; !bStop; ++i )
            static_cast< void >( ::truncate( Path.c_str(), static_cast< off_t >( ( i % 2 == 0 ? 8 : 64 ) * s_Page ) ) );
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
      {
        ++Failed;
        continue;
      }
      if( Offset + Size <= 8 * s_Page )
      {
        ASSERT_TRUE( std::equal( Read.begin(), Read.begin() + static_cast< std::ptrdiff_t >( Size ),
                                 Bytes.begin() + static_cast< std::ptrdiff_t >( Offset ) ) );
      }
    }
    bStop = true;
    Cutter.join();
    EXPECT_GT( Failed, 0 );
  }

  TEST( OpenMemoryMappedInputStream, AnEmptyFileFallsBackToThePlainStream )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "empty.bin" );
    LumekTest::WriteBytes( Path, {} );
    const LumekTest::VSystemLogCapture Log;
    std::shared_ptr< ZOL::IInputStreamSeekable > pStream;
    ASSERT_EQ( OpenMemoryMappedInputStream( Path, pStream ), ZOL::Result_Ok );
    ASSERT_TRUE( pStream );
    EXPECT_NE( dynamic_cast< VFileInputStreamVirtual* >( pStream.get() ), nullptr );
    std::uint64_t Size = 1;
    ASSERT_TRUE( pStream->GetSize( Size ) );
    EXPECT_EQ( Size, 0u );
    std::uint8_t Byte = 0;
    EXPECT_FALSE( pStream->Read( &Byte, 1 ) );
    EXPECT_TRUE( Log.Has( "Failed to open memory mapped input file stream " + Path + " (" +
                          ZOL::GetResultText( ZOL::Result_FileIOFailure ) +
                          "), falling back to a standard input file stream." ) );
  }

  TEST( OpenMemoryMappedInputStream, AMissingFileIsFileNotFoundWithoutFallback )
  {
    const LumekTest::VTemporaryFolder Folder;
    const LumekTest::VSystemLogCapture Log;
    std::shared_ptr< ZOL::IInputStreamSeekable > pStream;
    EXPECT_EQ( OpenMemoryMappedInputStream( Folder.File( "absent.bin" ), pStream ), ZOL::Result_FileNotFound );
    EXPECT_FALSE( pStream );
    for( const std::string& rMessage : Log.Messages )
      EXPECT_EQ( rMessage.find( "falling back" ), std::string::npos ) << rMessage;
  }

  TEST( OpenMemoryMappedInputStream, AFolderFallsBackAndIsTheWrongType )
  {
    const LumekTest::VTemporaryFolder Folder;
    const LumekTest::VSystemLogCapture Log;
    std::shared_ptr< ZOL::IInputStreamSeekable > pStream;
    EXPECT_EQ( OpenMemoryMappedInputStream( Folder.Path(), pStream ), ZOL::Result_InvalidType );
    EXPECT_FALSE( pStream );
  }

  TEST( OpenMemoryMappedInputStream, GivesTheMappedStreamForAnOrdinaryFile )
  {
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "plain.bin" );
    LumekTest::WriteBytes( Path, LumekTest::PatternBytes( 100 ) );
    std::shared_ptr< ZOL::IInputStreamSeekable > pStream;
    ASSERT_EQ( OpenMemoryMappedInputStream( Path, pStream ), ZOL::Result_Ok );
    EXPECT_NE( dynamic_cast< VMemoryMappedInputStreamVirtual* >( pStream.get() ), nullptr );
  }

  // Random reads and seeks give the same answers and bytes from the mapped stream as from the
  // plain one: window choice, eviction and crossing are all exercised by small windows.
  class MappedAgainstPlainTest : public testing::TestWithParam< unsigned >
  {
  };

  TEST_P( MappedAgainstPlainTest, RandomReadsAndSeeksAgree )
  {
    std::mt19937 Random( GetParam() );
    const LumekTest::VTemporaryFolder Folder;
    const std::string Path = Folder.File( "random.bin" );
    const std::uint64_t FileSize = 6 * s_Page + Random() % s_Page;
    LumekTest::WriteBytes( Path, LumekTest::PatternBytes( FileSize ) );

    VMemoryMappedInputStream Mapped( s_Page * ( 1 + Random() % 2 ), 1 + Random() % 3 );
    ASSERT_EQ( Mapped.Open( Path ), ZOL::Result_Ok );
    VFileInputStream Plain;
    ASSERT_EQ( OpenInputStream( Path, Plain ), ZOL::Result_Ok );

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
      const bool bPlain = Plain.Read( FromPlain.data(), Size );
      ASSERT_EQ( bMapped, bPlain );
      if( !bMapped )
      {
        // A short read leaves the two at different places; both start again from one.
        const std::int64_t Position = static_cast< std::int64_t >( Random() % FileSize );
        ASSERT_TRUE( Mapped.Seek( Position ) );
        ASSERT_TRUE( Plain.Seek( Position ) );
        continue;
      }
      ASSERT_EQ( FromMapped, FromPlain );
      std::uint64_t MappedPosition = 0, PlainPosition = 0;
      ASSERT_TRUE( Mapped.GetPosition( MappedPosition ) );
      ASSERT_TRUE( Plain.GetPosition( PlainPosition ) );
      ASSERT_EQ( MappedPosition, PlainPosition );
    }
  }

  INSTANTIATE_TEST_SUITE_P( Seeds, MappedAgainstPlainTest, testing::Values( 1u, 2u, 3u, 4u, 5u, 6u ),
                            []( const testing::TestParamInfo< unsigned >& i_rInfo )
                            { return "Seed" + std::to_string( i_rInfo.param ); } );
} // namespace
