// Length prefixes and start codes, unit inspection and the gather list, on libx264's units
// and on hand-made bytes.

#include "fileio/H264Utils/H264Utils.h"
#include "tests/fileio/H264/H264TestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <sstream>

namespace
{
  using namespace H264Utils;
  using LumekTest::VBytes;

  // 4-byte start codes before each unit, as the readers give them.
  VBytes AnnexB( const std::vector< VBytes >& i_rUnits )
  {
    VBytes Out;
    for( const VBytes& rUnit : i_rUnits )
    {
      Out.insert( Out.end(), { 0, 0, 0, 1 } );
      Out.insert( Out.end(), rUnit.begin(), rUnit.end() );
    }
    return Out;
  }

  VBytes LengthPrefixed( const std::vector< VBytes >& i_rUnits )
  {
    VBytes Out;
    for( const VBytes& rUnit : i_rUnits )
    {
      const std::uint32_t n = static_cast< std::uint32_t >( rUnit.size() );
      Out.insert( Out.end(),
                  { std::uint8_t( n >> 24 ), std::uint8_t( n >> 16 ), std::uint8_t( n >> 8 ), std::uint8_t( n ) } );
      Out.insert( Out.end(), rUnit.begin(), rUnit.end() );
    }
    return Out;
  }

  VBytes Bytes( const ZOL::IBufferConst& i_rBuffer )
  {
    return VBytes( i_rBuffer.GetData(), i_rBuffer.GetData() + i_rBuffer.GetSize() );
  }

  struct VStreamUtils : public ::testing::Test
  {
    std::shared_ptr< ZOL::VReaderBufferAllocator > pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
  };

  TEST_F( VStreamUtils, RealAccessUnitsConvertBothWays )
  {
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const LumekTest::VH264Stream Stream = LumekTest::MakeH264Stream( 64, 48, 12, 5 );
    ASSERT_FALSE( Stream.AccessUnits.empty() );
    for( const VBytes& rUnit : Stream.AccessUnits )
    {
      const std::vector< VBytes > Units = LumekTest::SplitNALUnits( rUnit );
      std::shared_ptr< ZOL::IBuffer > pPrefixed, pAnnexB;
      ASSERT_TRUE( AnnexBToLengthPrefixed( rUnit.data(), rUnit.size(), pPrefixed, *pAllocator ) );
      EXPECT_EQ( Bytes( *pPrefixed ), LengthPrefixed( Units ) );
      ASSERT_TRUE( LengthPrefixedToAnnexB( pPrefixed->GetData(), pPrefixed->GetSize(), pAnnexB, *pAllocator ) );
      EXPECT_EQ( Bytes( *pAnnexB ), AnnexB( Units ) );
    }
    // Key frames every 5: the IDR slice and the parameter sets are found in both forms.
    const VBytes& rKey = Stream.AccessUnits[5];
    const VBytes& rOther = Stream.AccessUnits[6];
    std::shared_ptr< ZOL::IBuffer > pKey, pOther;
    ASSERT_TRUE( AnnexBToLengthPrefixed( rKey.data(), rKey.size(), pKey, *pAllocator ) );
    ASSERT_TRUE( AnnexBToLengthPrefixed( rOther.data(), rOther.size(), pOther, *pAllocator ) );
    EXPECT_TRUE( ContainsNALUnit( *pKey, H264NALUnitType_CodedSliceIDR ) );
    EXPECT_TRUE( ContainsNALUnit( *pKey, H264NALUnitType_SPS ) );
    EXPECT_FALSE( ContainsNALUnit( *pOther, H264NALUnitType_CodedSliceIDR ) );
    EXPECT_TRUE( ContainsNALUnit( *pOther, H264NALUnitType_CodedSliceNonIDR ) );
    std::shared_ptr< ZOL::IBuffer > pKeyAnnexB;
    ASSERT_TRUE( LengthPrefixedToAnnexB( pKey->GetData(), pKey->GetSize(), pKeyAnnexB, *pAllocator ) );
    EXPECT_TRUE( ContainsNALUnit( *pKeyAnnexB, H264NALUnitType_CodedSliceIDR, EH264StreamForm::AnnexB ) );

    char SliceType = 0;
    EXPECT_TRUE( IsSingleSlice( *pKey, SliceType ) );
    EXPECT_EQ( SliceType, 'I' );
    EXPECT_TRUE( IsSingleSlice( *pOther, SliceType ) );
    EXPECT_EQ( SliceType, 'P' );
  }

  TEST_F( VStreamUtils, ThreeByteStartCodesAndLeadingBytes )
  {
    // Junk before the first start code is no unit; a 3-byte code is as good as a 4-byte one.
    const VBytes Input = { 0xAA, 0, 0, 1, 0x09, 0xF0, 0, 0, 0, 1, 0x67, 0x42, 0, 0, 1, 0x68 };
    std::shared_ptr< ZOL::IBuffer > pPrefixed;
    ASSERT_TRUE( AnnexBToLengthPrefixed( Input.data(), Input.size(), pPrefixed, *pAllocator ) );
    EXPECT_EQ( Bytes( *pPrefixed ), LengthPrefixed( { { 0x09, 0xF0 }, { 0x67, 0x42 }, { 0x68 } } ) );
  }

  TEST_F( VStreamUtils, LengthPrefixesThatDoNotWalkToTheEndAreRefused )
  {
    std::shared_ptr< ZOL::IBuffer > pOut;
    EXPECT_TRUE( LengthPrefixedToAnnexB( nullptr, 0, pOut, *pAllocator ) );
    ASSERT_TRUE( pOut );
    EXPECT_EQ( pOut->GetSize(), 0u );

    const VBytes Sample = LengthPrefixed( { { 0x65, 1, 2, 3 }, { 0x41, 9 } } );
    for( std::size_t Cut = 1; Cut < Sample.size(); ++Cut )
    {
      const bool bBoundary = Cut == 8;
      EXPECT_EQ( LengthPrefixedToAnnexB( Sample.data(), Cut, pOut, *pAllocator ), bBoundary ) << "cut " << Cut;
    }
    VBytes Lying = Sample;
    Lying[0] = 0xFF; // a length of four gigabytes
    EXPECT_FALSE( LengthPrefixedToAnnexB( Lying.data(), Lying.size(), pOut, *pAllocator ) );
    EXPECT_FALSE( ContainsNALUnit( LumekTest::VBytesBuffer( Lying ), H264NALUnitType_CodedSliceNonIDR ) );
  }

  TEST_F( VStreamUtils, JoinBuffersCopiesOnlyWhenThereIsMoreThanOne )
  {
    std::shared_ptr< ZOL::IBuffer > pPart;
    pAllocator->Allocate( pPart, 3 );
    VBufferList List = { pPart };
    EXPECT_EQ( JoinBuffers( List, *pAllocator ).get(), pPart.get() );
    EXPECT_TRUE( List.empty() );

    pPart->GetData()[0] = 0x65;
    pPart->GetData()[1] = 0x88;
    pPart->GetData()[2] = 0x80;
    List = { StartCodeBuffer(), pPart, StartCodeBuffer(), pPart };
    const auto pJoined = JoinBuffers( List, *pAllocator );
    EXPECT_EQ( Bytes( *pJoined ), ( VBytes{ 0, 0, 0, 1, 0x65, 0x88, 0x80, 0, 0, 0, 1, 0x65, 0x88, 0x80 } ) );
    EXPECT_TRUE( List.empty() );
  }

  TEST( DescribeNALUnit, NamesEachKindOfUnit )
  {
    std::ostringstream Text;
    const VBytes Slice = { 0x41, 0x9A }; // non-IDR, first_mb 0, slice_type 5 (P)
    DescribeNALUnit( Slice.data(), Slice.size(), Text, 2, std::nullopt );
    // SEI with one pic_timing message of one byte and one unregistered message of one byte.
    const VBytes SEI = { 0x06, 0x01, 0x01, 0x10, 0x05, 0x01, 0x77, 0x80 };
    DescribeNALUnit( SEI.data(), SEI.size(), Text, 0, std::nullopt );
    const VBytes Garbage = { 0x88 };
    DescribeNALUnit( Garbage.data(), Garbage.size(), Text, 0, std::nullopt );
    EXPECT_EQ( Text.str(), "  CodedSliceNonIDR:\n"
                           "    Type: PSlice5\n"
                           "SEI:\n"
                           "  Type: PicTiming Size: 1\n"
                           "    Can't parse SEI Picture Timing without SPS.\n"
                           "  Type: UserDataUnregistered Size: 1\n"
                           "Unspecified:\n" );
  }
} // namespace
