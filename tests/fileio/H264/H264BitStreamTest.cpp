// The RBSP reader and writer: hand-computed codes, emulation prevention both ways, and the
// validity rules at the end of the data.

#include "fileio/H264Utils/H264BitStream.h"
#include "tests/fileio/H264/H264TestSupport.h"

#include <gtest/gtest.h>

#include <random>

namespace
{
  using namespace H264Utils;
  using LumekTest::VBytes;

  struct VEscapeCase
  {
    const char* Name;
    VBytes Stored;
    VBytes Clean;
    // What the writer makes of the clean bytes: it escapes only where the reader would drop.
    VBytes Written;
  };

  void PrintTo( const VEscapeCase& i_rCase, std::ostream* o_pStream )
  {
    *o_pStream << i_rCase.Name;
  }

  class EmulationPrevention : public ::testing::TestWithParam< VEscapeCase >
  {
  };

  TEST_P( EmulationPrevention, ReaderRemovesAndWriterRestores )
  {
    const VEscapeCase& rCase = GetParam();
    VInputBitStream Stream( rCase.Stored.data(), rCase.Stored.size() );
    EXPECT_EQ( VBytes( Stream.GetData(), Stream.GetData() + Stream.GetSize() ), rCase.Clean );
    VBytes Restored;
    InsertEmulationPrevention( rCase.Clean.data(), rCase.Clean.size(), Restored );
    EXPECT_EQ( Restored, rCase.Written );
    VInputBitStream Again( Restored.data(), Restored.size() );
    EXPECT_EQ( VBytes( Again.GetData(), Again.GetData() + Again.GetSize() ), rCase.Clean );
  }

  INSTANTIATE_TEST_SUITE_P(
      Bytes, EmulationPrevention,
      ::testing::Values(
          VEscapeCase{ "FollowedByFourIsNoEscape", { 0, 0, 3, 4 }, { 0, 0, 3, 4 }, { 0, 0, 3, 3, 4 } },
          VEscapeCase{ "FollowedByOneIsAnEscape", { 0, 0, 3, 1, 7 }, { 0, 0, 1, 7 }, { 0, 0, 3, 1, 7 } },
          VEscapeCase{ "EscapeAtTheEnd", { 0, 0, 3, 1 }, { 0, 0, 1 }, { 0, 0, 1 } },
          VEscapeCase{ "FinalTripletStays", { 7, 0, 0, 3 }, { 7, 0, 0, 3 }, { 7, 0, 0, 3 } },
          VEscapeCase{ "TwoEscapesInARow", { 0, 0, 3, 0, 0, 3, 2, 9 }, { 0, 0, 0, 0, 2, 9 }, { 0, 0, 0, 0, 3, 2, 9 } },
          VEscapeCase{ "EscapedThree", { 0, 0, 3, 3, 5 }, { 0, 0, 3, 5 }, { 0, 0, 3, 3, 5 } },
          VEscapeCase{ "NoZeroPair", { 0, 1, 3, 1 }, { 0, 1, 3, 1 }, { 0, 1, 3, 1 } } ),
      []( const ::testing::TestParamInfo< VEscapeCase >& i_rInfo ) { return i_rInfo.param.Name; } );

  TEST( BitStream, ExpGolombCodesAreTheStandardsOwn )
  {
    // ue 0 = 1, ue 3 = 00100, se -1 = 011, se 2 = 00100, 3 bits 101, stop bit: 10010001 10010010 11000000.
    VOutputBitStream Out;
    Out.WriteUE( 0 );
    Out.WriteUE( 3 );
    Out.WriteSE( -1 );
    Out.WriteSE( 2 );
    Out.WriteBits( 5, 3 );
    Out.WriteTrailingBits();
    EXPECT_EQ( Out.Emit(), ( VBytes{ 0x91, 0x92, 0xC0 } ) );

    const VBytes Bytes = { 0x91, 0x92, 0xC0 };
    VInputBitStream In( Bytes.data(), Bytes.size() );
    EXPECT_EQ( In.ReadUE(), 0u );
    EXPECT_EQ( In.ReadUE(), 3u );
    EXPECT_EQ( In.ReadSE(), -1 );
    EXPECT_EQ( In.ReadSE(), 2 );
    EXPECT_EQ( In.ReadBits( 3 ), 5u );
    EXPECT_FALSE( In.MoreRBSPData() );
    EXPECT_TRUE( In.ReadTrailingBits() );
  }

  TEST( BitStream, RandomSyntaxSurvivesTheRoundTrip )
  {
    std::mt19937 Random( 11 );
    struct VItem
    {
      int Kind;
      std::uint32_t Value;
      unsigned Bits;
    };
    std::vector< VItem > Items;
    VOutputBitStream Out;
    for( int i = 0; i < 5000; ++i )
    {
      // Mostly zeros and small values, so that zero pairs and escapes are frequent.
      const int Kind = static_cast< int >( Random() % 3 );
      const unsigned Bits = 1 + Random() % 32;
      std::uint32_t Value = Random() % 4 == 0 ? static_cast< std::uint32_t >( Random() ) : Random() % 4;
      if( Kind == 0 )
        Value &= Bits == 32 ? 0xFFFFFFFFu : ( 1u << Bits ) - 1;
      if( Kind == 1 )
        Value = std::min< std::uint32_t >( Value, 0xFFFFFFFE );
      Items.push_back( { Kind, Value, Bits } );
      if( Kind == 0 )
        Out.WriteBits( Value, Bits );
      else if( Kind == 1 )
        Out.WriteUE( Value );
      else
        Out.WriteSE( static_cast< std::int32_t >( Value ) );
    }
    Out.WriteTrailingBits();
    const VBytes Bytes = Out.Emit();
    VInputBitStream In( Bytes.data(), Bytes.size() );
    for( std::size_t i = 0; i < Items.size(); ++i )
    {
      const VItem& r = Items[i];
      const std::uint32_t Read = r.Kind == 0   ? In.ReadBits( r.Bits )
                                 : r.Kind == 1 ? In.ReadUE()
                                               : static_cast< std::uint32_t >( In.ReadSE() );
      ASSERT_EQ( Read, r.Value ) << "item " << i;
    }
    EXPECT_TRUE( In.ReadTrailingBits() );
    EXPECT_TRUE( In.IsValid() );
  }

  TEST( BitStream, ReadingPastTheEndInvalidatesAndGivesZero )
  {
    const VBytes Bytes = { 0xFF };
    VInputBitStream In( Bytes.data(), Bytes.size() );
    EXPECT_EQ( In.ReadBits( 9 ), 0u );
    EXPECT_FALSE( In.IsValid() );
    EXPECT_EQ( In.ReadBit(), 0u );

    // 32 leading zeros hold no 32-bit value.
    const VBytes Long = { 0, 0, 0, 0, 0x80, 0xFF, 0xFF, 0xFF, 0xFF };
    VInputBitStream Huge( Long.data(), Long.size() );
    EXPECT_EQ( Huge.ReadUE(), 0u );
    EXPECT_FALSE( Huge.IsValid() );
  }

  TEST( BitStream, HeaderAndTrailingChecksSayWhatFailed )
  {
    LumekTest::VLogCapture Log( "H264Utils" );
    const VBytes Forbidden = { 0x85 };
    VInputBitStream A( Forbidden.data(), Forbidden.size() );
    VNALHeader Header;
    EXPECT_FALSE( A.ReadNALHeader( Header ) );
    const VBytes NoStop = { 0x00 };
    VInputBitStream B( NoStop.data(), NoStop.size() );
    EXPECT_FALSE( B.ReadTrailingBits() );
    const VBytes DirtyTail = { 0x81 };
    VInputBitStream C( DirtyTail.data(), DirtyTail.size() );
    EXPECT_FALSE( C.ReadTrailingBits() );
    VOutputBitStream Out;
    Out.WriteBits( 1, 3 );
    EXPECT_EQ( Out.GetByteCount(), 1u );
    EXPECT_EQ( Log.Lines(),
               ( std::vector< std::string >{ "Forbidden zero bit was not zero.", "Stop bit was not set.",
                                             "Trailing bits were not zero.",
                                             "Bit position of a buffer is not a whole number of bytes." } ) );
  }
} // namespace
