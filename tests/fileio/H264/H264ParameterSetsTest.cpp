// Parameter sets of libx264 in several configurations read and written back bit for bit, and
// the counts a stream gives refused before they size anything.

#include "fileio/H264Utils/H264Utils.h"
#include "tests/fileio/H264/H264TestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <sstream>

namespace
{
  using namespace H264Utils;
  using LumekTest::VBytes;

  struct VEncoderCase
  {
    const char* Name;
    std::vector< std::string > Arguments;
    std::uint32_t Profile;
  };

  struct VParameterSets
  {
    VBytes SPS, PPS;
    std::vector< VBytes > SEI;
  };

  VParameterSets FirstParameterSets( const LumekTest::VH264Stream& i_rStream )
  {
    VParameterSets Sets;
    for( const VBytes& rUnit : LumekTest::SplitNALUnits( i_rStream.AccessUnits.at( 0 ) ) )
    {
      const unsigned Type = rUnit[0] & 0x1F;
      if( Type == 7 )
        Sets.SPS = rUnit;
      else if( Type == 8 )
        Sets.PPS = rUnit;
      else if( Type == 6 )
        Sets.SEI.push_back( rUnit );
    }
    return Sets;
  }

  void PrintTo( const VEncoderCase& i_rCase, std::ostream* o_pStream )
  {
    *o_pStream << i_rCase.Name;
  }

  // The bits of a unit without emulation prevention. The writer leaves a zero third byte
  // unescaped where an encoder escapes it, so units are compared bit for bit at this level.
  VBytes RBSP( const VBytes& i_rUnit )
  {
    VInputBitStream Stream( i_rUnit.data(), i_rUnit.size() );
    return VBytes( Stream.GetData(), Stream.GetData() + Stream.GetSize() );
  }

  class ParameterSetsOfLibx264 : public ::testing::TestWithParam< VEncoderCase >
  {
  };

  TEST_P( ParameterSetsOfLibx264, ReadBackAndWriteTheSameBytes )
  {
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const LumekTest::VH264Stream Stream = LumekTest::MakeH264Stream( 98, 62, 3, 30, GetParam().Arguments );
    ASSERT_FALSE( Stream.AccessUnits.empty() );
    const VParameterSets Sets = FirstParameterSets( Stream );
    VH264SPS SPS;
    ASSERT_TRUE( ParseSPS( Sets.SPS.data(), Sets.SPS.size(), SPS ) );
    EXPECT_EQ( SPS.profile_idc, GetParam().Profile );
    EXPECT_EQ( SPS.GetWidth(), 98u );
    EXPECT_EQ( SPS.GetHeight(), 62u );
    VBytes Written;
    ASSERT_TRUE( WriteSPS( SPS, Written ) );
    EXPECT_EQ( RBSP( Written ), RBSP( Sets.SPS ) );
    VH264SPS Again;
    ASSERT_TRUE( ParseSPS( Written.data(), Written.size(), Again ) );

    VH264PPS PPS;
    ASSERT_TRUE( ParsePPS( Sets.PPS.data(), Sets.PPS.size(), PPS, &SPS ) );
    ASSERT_TRUE( WritePPS( PPS, Written, &SPS ) );
    EXPECT_EQ( RBSP( Written ), RBSP( Sets.PPS ) );

    // Every shorter unit is refused or read without harm, never read past its end.
    for( std::size_t Cut = 0; Cut < Sets.SPS.size(); ++Cut )
    {
      const VBytes Short( Sets.SPS.begin(), Sets.SPS.begin() + static_cast< std::ptrdiff_t >( Cut ) );
      VH264SPS Ignored;
      (void)ParseSPS( Short.data(), Short.size(), Ignored );
    }
  }

  INSTANTIATE_TEST_SUITE_P(
      Encoders, ParameterSetsOfLibx264,
      ::testing::Values( VEncoderCase{ "Baseline", { "-profile:v", "baseline" }, 66 },
                         VEncoderCase{
                             "HighWithScalingMatrix", { "-profile:v", "high", "-x264-params", "cqm=jvt" }, 100 },
                         VEncoderCase{ "MainWithHRDAndTiming",
                                       { "-profile:v", "main", "-b:v", "300k", "-maxrate", "300k", "-bufsize", "600k",
                                         "-x264-params", "nal-hrd=cbr:force-cfr=1:pic-struct=1" },
                                       77 },
                         VEncoderCase{ "HighWithColourDescription",
                                       { "-profile:v", "high", "-color_primaries", "bt709", "-color_trc", "bt709",
                                         "-colorspace", "bt709", "-x264-params", "sar=4/3" },
                                       100 } ),
      []( const ::testing::TestParamInfo< VEncoderCase >& i_rInfo ) { return i_rInfo.param.Name; } );

  TEST( ParameterSets, PictureTimingIsDescribedWithTheSPS )
  {
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const LumekTest::VH264Stream Stream =
        LumekTest::MakeH264Stream( 98, 62, 3, 30,
                                   { "-profile:v", "main", "-b:v", "300k", "-maxrate", "300k", "-bufsize", "600k",
                                     "-x264-params", "nal-hrd=cbr:force-cfr=1:pic-struct=1" } );
    ASSERT_FALSE( Stream.AccessUnits.empty() );
    const VParameterSets Sets = FirstParameterSets( Stream );
    VH264SPS SPS;
    ASSERT_TRUE( ParseSPS( Sets.SPS.data(), Sets.SPS.size(), SPS ) );
    ASSERT_TRUE( SPS.vui.nal_hrd_parameters_present_flag );
    ASSERT_TRUE( SPS.vui.pic_struct_present_flag );
    EXPECT_EQ( SPS.vui.num_units_in_tick, 1u );
    EXPECT_EQ( SPS.vui.time_scale, 50u );

    std::ostringstream Text;
    for( const VBytes& rSEI : Sets.SEI )
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

  // An SPS up to pic_order_cnt_type 1 and a cycle length the stream cannot hold.
  VBytes SPSWithCycleLength( std::uint32_t i_Length )
  {
    VOutputBitStream Out;
    Out.WriteNALHeader( { 3, 7 } );
    Out.WriteBits( 66, 8 );
    Out.WriteBits( 0, 8 );
    Out.WriteBits( 30, 8 );
    Out.WriteUE( 0 ); // seq_parameter_set_id
    Out.WriteUE( 0 ); // log2_max_frame_num_minus4
    Out.WriteUE( 1 ); // pic_order_cnt_type
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
    const VBytes Short = SPSWithCycleLength( 255 );
    EXPECT_FALSE( ParseSPS( Short.data(), Short.size(), SPS ) );
    const VBytes Huge = SPSWithCycleLength( 0x7FFFFFFF );
    EXPECT_FALSE( ParseSPS( Huge.data(), Huge.size(), SPS ) );
    EXPECT_TRUE( SPS.offset_for_ref_frame.empty() );

    // A slice group map that claims a billion map units in a dozen bytes.
    VOutputBitStream Out;
    Out.WriteNALHeader( { 3, 8 } );
    Out.WriteUE( 0 );
    Out.WriteUE( 0 );
    Out.WriteBit( 0 );
    Out.WriteBit( 0 );
    Out.WriteUE( 3 ); // num_slice_groups_minus1
    Out.WriteUE( 6 ); // slice_group_map_type
    Out.WriteUE( 1000000000 );
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
