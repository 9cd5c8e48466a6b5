// The video source reaches any H.264 frame by decoding forward from the key frame before it.

#include "app/VideoSource/VVideoSource.h"
#include "tests/fileio/H264/H264TestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <cstring>

namespace
{
  using namespace LumekTest;
  using LumekVideoViewer::VVideoSource;

  // 80 frames, a key frame every 30: key frames at 0, 30 and 60.
  struct VRandomAccessFixture : public ::testing::Test
  {
    void SetUp() override
    {
      if( !HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
      Stream = MakeH264Stream( 96, 64, 80, 30 );
      Expected = ExpectedUYVYFrames( Stream );
      ASSERT_EQ( Stream.AccessUnits.size(), 80u );
      ASSERT_EQ( Expected.size(), 80u );
    }

    std::shared_ptr< VMemoryH264Reader > Open( VVideoSource& io_rSource,
                                               const std::vector< std::uint64_t >& i_rNumbers = {} )
    {
      auto pReader = std::make_shared< VMemoryH264Reader >( Stream, i_rNumbers );
      EXPECT_TRUE( io_rSource.Open( "memory.h264", pReader ) );
      return pReader;
    }

    ::testing::AssertionResult FrameIs( VVideoSource& io_rSource, std::uint64_t i_Index, std::size_t i_Expected )
    {
      ZOL::IVideoFrame Frame;
      if( !io_rSource.GetFrame( i_Index, Frame ) || !Frame.Video )
        return ::testing::AssertionFailure() << "frame " << i_Index << " did not decode";
      const VBytes& rExpected = Expected[i_Expected];
      if( Frame.Video->GetSize() != rExpected.size() ||
          std::memcmp( Frame.Video->GetData(), rExpected.data(), rExpected.size() ) != 0 )
        return ::testing::AssertionFailure() << "frame " << i_Index << " differs from ffmpeg's";
      return ::testing::AssertionSuccess();
    }

    VH264Stream Stream;
    std::vector< VBytes > Expected;
  };

  struct VJumpCase
  {
    const char* Name;
    std::vector< std::uint64_t > Frames;
  };

  void PrintTo( const VJumpCase& i_rCase, std::ostream* o_pStream )
  {
    *o_pStream << i_rCase.Name;
  }

  class H264RandomAccess : public VRandomAccessFixture, public ::testing::WithParamInterface< VJumpCase >
  {
  };

  TEST_P( H264RandomAccess, EachFrameEqualsFfmpegs )
  {
    VVideoSource Source;
    Open( Source );
    for( std::uint64_t Index : GetParam().Frames )
      EXPECT_TRUE( FrameIs( Source, Index, Index ) );
  }

  INSTANTIATE_TEST_SUITE_P( Jumps, H264RandomAccess,
                            ::testing::Values( VJumpCase{ "AloneInTheMiddle", { 45 } },
                                               VJumpCase{ "JustBeforeAKeyFrame", { 29 } },
                                               VJumpCase{ "OnAKeyFrame", { 30 } },
                                               VJumpCase{ "JustAfterAKeyFrame", { 31 } },
                                               VJumpCase{ "LastFrame", { 79 } },
                                               VJumpCase{ "Backwards", { 62, 61, 60, 59, 31, 30, 29, 1, 0 } },
                                               VJumpCase{ "ForwardWithinAGroup", { 3, 17, 18, 28 } },
                                               VJumpCase{ "AcrossGroups", { 5, 70, 33, 34, 35, 2 } } ),
                            []( const ::testing::TestParamInfo< VJumpCase >& i_rInfo ) { return i_rInfo.param.Name; } );

  TEST_F( VRandomAccessFixture, SequentialPlaybackReadsEachFrameOnce )
  {
    VVideoSource Source;
    const auto pReader = Open( Source );
    for( std::uint64_t i = 0; i < 40; ++i )
      ASSERT_TRUE( FrameIs( Source, i, i ) );
    // The first frame is read once more, to see that it is a key frame.
    EXPECT_EQ( pReader->Reads, 41u );
  }

  TEST_F( VRandomAccessFixture, GapsInTheIndexDoNotBreakTheSequence )
  {
    // The same stream stored under numbers with holes after 9 and 49: frames still follow
    // each other in decoding order, so nothing is decoded twice.
    std::vector< std::uint64_t > Numbers;
    for( std::uint64_t i = 0; i < 80; ++i )
      Numbers.push_back( i + ( i >= 10 ? 5 : 0 ) + ( i >= 50 ? 100 : 0 ) );
    VVideoSource Source;
    const auto pReader = Open( Source, Numbers );
    for( std::uint64_t i = 0; i < 80; ++i )
      ASSERT_TRUE( FrameIs( Source, Numbers[i], i ) );
    EXPECT_EQ( pReader->Reads, 81u );
    // A jump into the second hole's far side still finds the key frame before it.
    EXPECT_TRUE( FrameIs( Source, Numbers[55], 55 ) );
  }

  TEST_F( VRandomAccessFixture, AStreamCutInsideAGroupPlaysFromItsNextKeyFrame )
  {
    // The first ten frames are gone: 0 to 19 of the rest lack their references, 20 (the
    // original 30) is a key frame and everything from there matches.
    VH264Stream Tail = Stream;
    Tail.AccessUnits.erase( Tail.AccessUnits.begin(), Tail.AccessUnits.begin() + 10 );
    VVideoSource Source;
    ASSERT_TRUE( Source.Open( "memory.h264", std::make_shared< VMemoryH264Reader >( Tail ) ) );
    ZOL::IVideoFrame Frame;
    EXPECT_FALSE( Source.GetFrame( 5, Frame ) );
    EXPECT_TRUE( FrameIs( Source, 21, 31 ) );
    EXPECT_TRUE( FrameIs( Source, 20, 30 ) );
    for( std::uint64_t i = 21; i < 70; ++i )
      ASSERT_TRUE( FrameIs( Source, i, i + 10 ) );
  }

  TEST_F( VRandomAccessFixture, NoKeyFrameWithinReachIsAFalseAnswer )
  {
    // A key frame, then far more frames without one than a scrub will walk back over. The
    // copies are never decoded: the walk back finds nothing and stops.
    VH264Stream Long = Stream;
    Long.AccessUnits.resize( 1 );
    Long.AccessUnits.insert( Long.AccessUnits.end(), 1500, Stream.AccessUnits[1] );
    const auto pReader = std::make_shared< VMemoryH264Reader >( Long );
    VVideoSource Source;
    ASSERT_TRUE( Source.Open( "memory.h264", pReader ) );
    VLogCapture Log( "H264IO" );
    ZOL::IVideoFrame Frame;
    EXPECT_FALSE( Source.GetFrame( 1400, Frame ) );
    EXPECT_TRUE( Log.Contains( "No key frame within 1200 frames before frame 1400." ) );
    EXPECT_EQ( pReader->Reads, 1200u );
    EXPECT_TRUE( FrameIs( Source, 0, 0 ) );
    EXPECT_TRUE( FrameIs( Source, 1, 1 ) );
  }
} // namespace
