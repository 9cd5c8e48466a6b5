// The RBSP reader and writer, the stream forms and unit inspection, and libx264's parameter sets
// read and written back bit for bit: hand-computed codes and bytes, ffmpeg-made units, and the
// counts a stream gives refused before they size anything.

#include "fileio/H264Utils/H264BitStream.h"
#include "fileio/H264Utils/H264Utils.h"
#include "tests/fileio/H264/H264TestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <array>
#include <random>
#include <sstream>

namespace
{
  using namespace H264Utils;
  using namespace LumekTest;

  VBytes Clean( const VBytes& i_rStored )
  {
    VInputBitStream Stream( i_rStored.data(), i_rStored.size() );
    return VBytes( Stream.GetData(), Stream.GetData() + Stream.GetSize() );
  }

  TEST( BitStream, EmulationPreventionIsRemovedAndRestored )
  {
    struct VCase
    {
      const char* Name;
      VBytes Stored, Clean;
      // What the writer makes of the clean bytes: it escapes only where the reader would drop.
      VBytes Written;
    };
    const VCase Cases[] = {
        { "FollowedByFourIsNoEscape", { 0, 0, 3, 4 }, { 0, 0, 3, 4 }, { 0, 0, 3, 3, 4 } },
        { "FollowedByOneIsAnEscape", { 0, 0, 3, 1, 7 }, { 0, 0, 1, 7 }, { 0, 0, 3, 1, 7 } },
        { "EscapeAtTheEnd", { 0, 0, 3, 1 }, { 0, 0, 1 }, { 0, 0, 1 } },
        { "FinalTripletStays", { 7, 0, 0, 3 }, { 7, 0, 0, 3 }, { 7, 0, 0, 3 } },
        { "TwoEscapesInARow", { 0, 0, 3, 0, 0, 3, 2, 9 }, { 0, 0, 0, 0, 2, 9 }, { 0, 0, 0, 0, 3, 2, 9 } },
        { "EscapedThree", { 0, 0, 3, 3, 5 }, { 0, 0, 3, 5 }, { 0, 0, 3, 3, 5 } },
        { "NoZeroPair", { 0, 1, 3, 1 }, { 0, 1, 3, 1 }, { 0, 1, 3, 1 } },
    };
    for( const VCase& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      EXPECT_EQ( Clean( rCase.Stored ), rCase.Clean );
      VBytes Restored;
      InsertEmulationPrevention( rCase.Clean.data(), rCase.Clean.size(), Restored );
      EXPECT_EQ( Restored, rCase.Written );
      EXPECT_EQ( Clean( Restored ), rCase.Clean );
    }
  }

  TEST( BitStream, CodesAreTheStandardsOwnAndRandomSyntaxSurvivesTheRoundTrip )
  {
    // ue 0 = 1, ue 3 = 00100, se -1 = 011, se 2 = 00100, 3 bits 101, stop bit: 10010001 10010010 11000000.
    VOutputBitStream Known;
    Known.WriteUE( 0 );
    Known.WriteUE( 3 );
    Known.WriteSE( -1 );
    Known.WriteSE( 2 );
    Known.WriteBits( 5, 3 );
    Known.WriteTrailingBits();
    EXPECT_EQ( Known.Emit(), ( VBytes{ 0x91, 0x92, 0xC0 } ) );

    // Items of kind 0 (bits), 1 (ue) and 2 (se), mostly small, so that zero pairs and escapes
    // are frequent.
    std::mt19937 Random( 11 );
    std::vector< std::array< std::uint32_t, 3 > > Items; // kind, value, bit count
    VOutputBitStream Out;
    for( int i = 0; i < 3000; ++i )
    {
      const std::uint32_t Kind = Random() % 3, Bits = 1 + Random() % 32;
      std::uint32_t Value = Random() % 4 == 0 ? static_cast< std::uint32_t >( Random() ) : Random() % 4;
      if( Kind == 0 )
        Out.WriteBits( Value &= Bits == 32 ? 0xFFFFFFFFu : ( 1u << Bits ) - 1, Bits );
      else if( Kind == 1 )
        Out.WriteUE( Value = std::min< std::uint32_t >( Value, 0xFFFFFFFE ) );
      else
        Out.WriteSE( static_cast< std::int32_t >( Value ) );
      Items.push_back( { Kind, Value, Bits } );
    }
    Out.WriteTrailingBits();
    const VBytes Written = Out.Emit();
    VInputBitStream In( Written.data(), Written.size() );
    for( const auto& [Kind, Value, Bits] : Items )
      ASSERT_EQ( Kind == 0 ? In.ReadBits( Bits ) : Kind == 1 ? In.ReadUE() : std::uint32_t( In.ReadSE() ), Value );
    EXPECT_FALSE( In.MoreRBSPData() );
    EXPECT_TRUE( In.ReadTrailingBits() && In.IsValid() );
  }

  TEST( BitStream, BadEndsInvalidateAndSayWhatFailed )
  {
    const VBytes One = { 0xFF };
    VInputBitStream Short( One.data(), One.size() );
    EXPECT_EQ( Short.ReadBits( 9 ), 0u );
    EXPECT_FALSE( Short.IsValid() );
    EXPECT_EQ( Short.ReadBit(), 0u );
    // 32 leading zeros hold no 32-bit value.
    const VBytes Long = { 0, 0, 0, 0, 0x80, 0xFF, 0xFF, 0xFF, 0xFF };
    VInputBitStream Huge( Long.data(), Long.size() );
    EXPECT_EQ( Huge.ReadUE(), 0u );
    EXPECT_FALSE( Huge.IsValid() );

    VLogCapture Log( "H264Utils" );
    const VBytes Forbidden = { 0x85 }, NoStop = { 0x00 }, DirtyTail = { 0x81 };
    VNALHeader Header;
    EXPECT_FALSE( VInputBitStream( Forbidden.data(), 1 ).ReadNALHeader( Header ) );
    EXPECT_FALSE( VInputBitStream( NoStop.data(), 1 ).ReadTrailingBits() );
    EXPECT_FALSE( VInputBitStream( DirtyTail.data(), 1 ).ReadTrailingBits() );
    VOutputBitStream Out;
    Out.WriteBits( 1, 3 );
    EXPECT_EQ( Out.GetByteCount(), 1u );
    EXPECT_EQ( Log.Messages,
               ( std::vector< std::string >{ "Forbidden zero bit was not zero.", "Stop bit was not set.",
                                             "Trailing bits were not zero.",
                                             "Bit position of a buffer is not a whole number of bytes." } ) );
  }

  // The allocator hands itself to its buffers, so it lives in a shared pointer.
  const auto s_pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();

  std::shared_ptr< ZOL::IBuffer > Prefixed( const VBytes& i_rAnnexB )
  {
    std::shared_ptr< ZOL::IBuffer > pOut;
    EXPECT_TRUE( AnnexBToLengthPrefixed( i_rAnnexB.data(), i_rAnnexB.size(), pOut, *s_pAllocator ) );
    return pOut;
  }

  TEST( StreamUtils, FormsConvertBothWaysAndLengthsAreChecked )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const VH264Stream Stream = MakeH264Stream( 64, 48, 12, 5 );
    ASSERT_FALSE( Stream.AccessUnits.empty() );
    for( const VBytes& rUnit : Stream.AccessUnits )
    {
      const std::vector< VBytes > Units = SplitNALUnits( rUnit );
      const auto pPrefixed = Prefixed( rUnit );
      ASSERT_TRUE( pPrefixed );
      EXPECT_EQ( Bytes( *pPrefixed ), JoinNALUnits( Units, true ) );
      std::shared_ptr< ZOL::IBuffer > pAnnexB;
      ASSERT_TRUE( LengthPrefixedToAnnexB( pPrefixed->GetData(), pPrefixed->GetSize(), pAnnexB, *s_pAllocator ) );
      EXPECT_EQ( Bytes( *pAnnexB ), JoinNALUnits( Units, false ) );
    }
    // Key frames every 5: the IDR slice and the parameter sets are found in both forms.
    const auto pKey = Prefixed( Stream.AccessUnits[5] );
    const auto pOther = Prefixed( Stream.AccessUnits[6] );
    EXPECT_TRUE( ContainsNALUnit( *pKey, H264NALUnitType_CodedSliceIDR ) );
    EXPECT_TRUE( ContainsNALUnit( *pKey, H264NALUnitType_SPS ) );
    EXPECT_FALSE( ContainsNALUnit( *pOther, H264NALUnitType_CodedSliceIDR ) );
    EXPECT_TRUE( ContainsNALUnit( *pOther, H264NALUnitType_CodedSliceNonIDR ) );
    EXPECT_TRUE( ContainsNALUnit( VBytesBuffer( Stream.AccessUnits[5] ), H264NALUnitType_CodedSliceIDR,
                                  EH264StreamForm::AnnexB ) );
    char SliceType = 0;
    EXPECT_TRUE( IsSingleSlice( *pKey, SliceType ) && SliceType == 'I' );
    EXPECT_TRUE( IsSingleSlice( *pOther, SliceType ) && SliceType == 'P' );

    // Junk before the first start code is no unit; a 3-byte code is as good as a 4-byte one.
    const VBytes Input = { 0xAA, 0, 0, 1, 0x09, 0xF0, 0, 0, 0, 1, 0x67, 0x42, 0, 0, 1, 0x68 };
    EXPECT_EQ( Bytes( *Prefixed( Input ) ), JoinNALUnits( { { 0x09, 0xF0 }, { 0x67, 0x42 }, { 0x68 } }, true ) );

    // Lengths that do not walk exactly to the end are refused, at every cut.
    std::shared_ptr< ZOL::IBuffer > pOut;
    EXPECT_TRUE( LengthPrefixedToAnnexB( nullptr, 0, pOut, *s_pAllocator ) && pOut && pOut->GetSize() == 0 );
    const VBytes Sample = JoinNALUnits( { { 0x65, 1, 2, 3 }, { 0x41, 9 } }, true );
    for( std::size_t Cut = 1; Cut < Sample.size(); ++Cut )
      EXPECT_EQ( LengthPrefixedToAnnexB( Sample.data(), Cut, pOut, *s_pAllocator ), Cut == 8 ) << "cut " << Cut;
    VBytes Lying = Sample;
    Lying[0] = 0xFF; // a length of four gigabytes
    EXPECT_FALSE( LengthPrefixedToAnnexB( Lying.data(), Lying.size(), pOut, *s_pAllocator ) );
    EXPECT_FALSE( ContainsNALUnit( VBytesBuffer( Lying ), H264NALUnitType_CodedSliceNonIDR ) );
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

  TEST( ParameterSets, LibX264sReadBackAndWriteTheSameBits )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    // The encoder's arguments, the profile they give, and whether the SPS has HRD and picture
    // timing, with which the SEI is described.
    const std::tuple< const char*, std::uint32_t, bool > Encoders[] = {
        { "-profile:v high -x264-params cqm=jvt", 100, false },
        { "-profile:v main -b:v 300k -maxrate 300k -bufsize 600k -x264-params nal-hrd=cbr:force-cfr=1:pic-struct=1", 77,
          true },
        { "-profile:v high -color_primaries bt709 -color_trc bt709 -colorspace bt709 -x264-params sar=4/3", 100,
          false },
    };
    for( const auto& [pArguments, Profile, bTiming] : Encoders )
    {
      SCOPED_TRACE( pArguments );
      const VH264Stream Stream = MakeH264Stream( 98, 62, 3, 30, pArguments );
      ASSERT_FALSE( Stream.AccessUnits.empty() );
      const VBytes SPSUnit = SplitNALUnits( Stream.AccessUnits[0], 7 ).at( 0 );
      const VBytes PPSUnit = SplitNALUnits( Stream.AccessUnits[0], 8 ).at( 0 );
      VH264SPS SPS;
      ASSERT_TRUE( ParseSPS( SPSUnit.data(), SPSUnit.size(), SPS ) );
      EXPECT_EQ( std::tuple( SPS.profile_idc, SPS.GetWidth(), SPS.GetHeight() ), std::tuple( Profile, 98u, 62u ) );
      // Compared without emulation prevention: the writer leaves a zero third byte unescaped
      // where an encoder escapes it.
      VBytes Written;
      ASSERT_TRUE( WriteSPS( SPS, Written ) );
      EXPECT_EQ( Clean( Written ), Clean( SPSUnit ) );
      VH264SPS Again;
      ASSERT_TRUE( ParseSPS( Written.data(), Written.size(), Again ) );
      VH264PPS PPS;
      ASSERT_TRUE( ParsePPS( PPSUnit.data(), PPSUnit.size(), PPS, &SPS ) );
      ASSERT_TRUE( WritePPS( PPS, Written, &SPS ) );
      EXPECT_EQ( Clean( Written ), Clean( PPSUnit ) );
      // Every shorter unit is refused or read without harm, never read past its end.
      for( std::size_t Cut = 0; Cut < SPSUnit.size(); ++Cut )
        (void)ParseSPS( VBytes( SPSUnit.begin(), SPSUnit.begin() + Cut ).data(), Cut, Again );
      if( !bTiming )
        continue;
      ASSERT_TRUE( SPS.vui.nal_hrd_parameters_present_flag && SPS.vui.pic_struct_present_flag );
      EXPECT_EQ( std::tuple( SPS.vui.num_units_in_tick, SPS.vui.time_scale ), std::tuple( 1u, 50u ) );
      std::ostringstream Text;
      for( const VBytes& rSEI : SplitNALUnits( Stream.AccessUnits[0], 6 ) )
        DescribeNALUnit( rSEI.data(), rSEI.size(), Text, 0, SPS );
      // The first picture is removed and output at once; libx264 writes no clock timestamps.
      EXPECT_NE( Text.str().find( "  Type: PicTiming Size: " ), std::string::npos ) << Text.str();
      EXPECT_NE( Text.str().find( "    CPBRemovalDelay: 0\n"
                                  "    DPBOutputDelay: 0\n"
                                  "    Timecode[0]: 00:00:00:00 (0)\n"
                                  "    Timecode[1]: 00:00:00:00 (0)\n"
                                  "    Timecode[2]: 00:00:00:00 (0)\n" ),
                 std::string::npos )
          << Text.str();
    }
  }

  // An SPS up to pic_order_cnt_type 1 and a cycle length the stream cannot hold.
  VBytes SPSWithCycleLength( std::uint32_t i_Length )
  {
    VOutputBitStream Out;
    Out.WriteNALHeader( { 3, 7 } );
    for( std::uint32_t Byte : { 66, 0, 30 } ) // profile, constraints, level
      Out.WriteBits( Byte, 8 );
    for( std::uint32_t Code : { 0, 0, 1 } ) // id, log2_max_frame_num_minus4, pic_order_cnt_type
      Out.WriteUE( Code );
    Out.WriteBit( 0 );
    Out.WriteSE( 0 );
    Out.WriteSE( 0 );
    Out.WriteUE( i_Length );
    Out.WriteTrailingBits();
    return Out.Emit();
  }

  TEST( ParameterSets, CountsBeyondTheStandardOrTheDataAreRefused )
  {
    VH264SPS SPS;
    // 255 is allowed by the standard but this unit stops long before 255 offsets.
    for( std::uint32_t Length : { 255u, 0x7FFFFFFFu } )
    {
      const VBytes Unit = SPSWithCycleLength( Length );
      EXPECT_FALSE( ParseSPS( Unit.data(), Unit.size(), SPS ) ) << Length;
    }
    EXPECT_TRUE( SPS.offset_for_ref_frame.empty() );

    // A slice group map that claims a billion map units in a dozen bytes.
    VOutputBitStream Out;
    Out.WriteNALHeader( { 3, 8 } );
    for( std::uint32_t Code : { 0, 0 } ) // pic_parameter_set_id, seq_parameter_set_id
      Out.WriteUE( Code );
    Out.WriteBits( 0, 2 ); // entropy_coding_mode_flag, bottom_field_pic_order_in_frame_present_flag
    for( std::uint32_t Code : { 3, 6, 1000000000 } ) // num_slice_groups_minus1, map type 6, map units
      Out.WriteUE( Code );
    Out.WriteTrailingBits();
    const VBytes PPSBytes = Out.Emit();
    VH264PPS PPS;
    EXPECT_FALSE( ParsePPS( PPSBytes.data(), PPSBytes.size(), PPS ) );

    // The writer refuses a record whose lists disagree with its counts.
    VH264SPS Record;
    Record.pic_order_cnt_type = 1;
    Record.num_ref_frames_in_pic_order_cnt_cycle = 2;
    VBytes Written;
    EXPECT_FALSE( WriteSPS( Record, Written ) );
    Record.offset_for_ref_frame = { 4, -4 };
    ASSERT_TRUE( WriteSPS( Record, Written ) );
    ASSERT_TRUE( ParseSPS( Written.data(), Written.size(), SPS ) );
    EXPECT_EQ( SPS.offset_for_ref_frame, ( std::vector< std::int32_t >{ 4, -4 } ) );
  }
} // namespace
