// The decoder object, and the video source that reaches any frame by decoding forward from the
// key frame before it, against ffmpeg's own decode of the same libx264 streams.

#include "app/VideoSource/VVideoSource.h"
#include "fileio/H264IO/VH264Decoder.h"
#include "tests/fileio/H264/H264TestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

namespace
{
  using namespace LumekTest;
  using LumekVideoViewer::VVideoSource;

  // One decode of one access unit by a decoder made for it, or by the one given.
  struct VDecode
  {
    VDecode( const VBytes& i_rUnit, ZOL::EPixelFormat i_Wish, ZOL::IH264Decoder* i_pDecoder = nullptr )
    {
      const auto pOwn = H264IO::VH264Decoder::Create( std::make_shared< ZOL::VFrameBufferAllocator >() );
      bDecoded = ( i_pDecoder ? *i_pDecoder : *pOwn ).Decode( VBytesBuffer( i_rUnit ), i_Wish, pOutput, Info );
    }
    bool bDecoded;
    std::shared_ptr< ZOL::IBuffer > pOutput;
    ZOL::IVideoFrameInfo Info;
  };

  class H264Decoder : public ::testing::Test
  {
  protected:
    void SetUp() override
    {
      if( !HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
    }
  };

  TEST_F( H264Decoder, EveryFrameEqualsFfmpegsInTheWishedPacking )
  {
    // 98 x 62 is not a whole number of macroblocks: the stream crops.
    for( const auto& [Width, Height, pProfile] : { std::tuple( 98, 62, "baseline" ), std::tuple( 80, 48, "main" ) } )
    {
      SCOPED_TRACE( pProfile );
      const VH264Stream Stream = MakeH264Stream( Width, Height, 12, 5, std::string( "-profile:v " ) + pProfile );
      const std::vector< VBytes > Expected = ExpectedUYVYFrames( Stream );
      ASSERT_EQ( Stream.AccessUnits.size(), 12u );
      ASSERT_EQ( Expected.size(), 12u );
      const auto pDecoder = H264IO::VH264Decoder::Create( std::make_shared< ZOL::VFrameBufferAllocator >() );
      for( std::size_t i = 0; i < Stream.AccessUnits.size(); ++i )
      {
        const VDecode Frame( Stream.AccessUnits[i], ZOL::PixelFormat_U8Y8V8Y8, pDecoder.get() );
        ASSERT_TRUE( Frame.bDecoded ) << i;
        EXPECT_EQ( std::tie( Frame.Info.ImageWidth, Frame.Info.ImageHeight, Frame.Info.PixelFormat ),
                   std::tuple( Width, Height, ZOL::PixelFormat_U8Y8V8Y8 ) );
        EXPECT_EQ( Bytes( *Frame.pOutput ), Expected[i] ) << "frame " << i;
      }
      // The other packing when asked for, U8Y8V8Y8 for any other wish.
      VBytes Swapped = Expected[0];
      for( std::size_t i = 0; i + 1 < Swapped.size(); i += 2 )
        std::swap( Swapped[i], Swapped[i + 1] );
      const VDecode Other( Stream.AccessUnits[0], ZOL::PixelFormat_Y8U8Y8V8 );
      ASSERT_TRUE( Other.bDecoded );
      EXPECT_EQ( Other.Info.PixelFormat, ZOL::PixelFormat_Y8U8Y8V8 );
      EXPECT_EQ( Bytes( *Other.pOutput ), Swapped );
      const VDecode Any( Stream.AccessUnits[0], ZOL::PixelFormat_R8G8B8 );
      ASSERT_TRUE( Any.bDecoded );
      EXPECT_EQ( Any.Info.PixelFormat, ZOL::PixelFormat_U8Y8V8Y8 );
      EXPECT_EQ( Bytes( *Any.pOutput ), Expected[0] );
    }
  }

  TEST_F( H264Decoder, UnitsWithoutAPictureGiveNoFrameAndSaySo )
  {
    const VH264Stream Stream = MakeH264Stream( 64, 48, 12, 5 );
    std::vector< VBytes > Sets = SplitNALUnits( Stream.AccessUnits.at( 0 ), 7 );
    Sets.push_back( SplitNALUnits( Stream.AccessUnits[0], 8 ).at( 0 ) );
    VLogCapture Log( "H264IO" );
    const VDecode ParameterSets( JoinNALUnits( Sets, false ), ZOL::PixelFormat_U8Y8V8Y8 );
    EXPECT_FALSE( ParameterSets.bDecoded || ParameterSets.pOutput );
    EXPECT_TRUE( Log.Has( "Could not decode frame. Buffer status was 0, not 1." ) );
    const std::size_t LinesBefore = Log.Messages.size();
    const VDecode Garbage( { 0, 0, 0, 1, 0x65, 0xFF, 0x13, 0x00, 0x42, 0x99, 0, 0, 1, 0x41, 0x9A },
                           ZOL::PixelFormat_U8Y8V8Y8 );
    EXPECT_FALSE( Garbage.bDecoded || Garbage.pOutput );
    EXPECT_GT( Log.Messages.size(), LinesBefore );
  }

  // 80 frames, a key frame every 30: key frames at 0, 30 and 60. The video source reaches any
  // frame by decoding forward from the key frame before it.
  TEST_F( H264Decoder, TheVideoSourceGivesFfmpegsFramesWhereverItGoes )
  {
    const VH264Stream Stream = MakeH264Stream( 96, 64, 80, 30 );
    const std::vector< VBytes > Expected = ExpectedUYVYFrames( Stream );
    ASSERT_EQ( Stream.AccessUnits.size(), 80u );
    ASSERT_EQ( Expected.size(), 80u );
    std::unique_ptr< VVideoSource > pSource;
    auto Open = [&]( const VH264Stream& i_rStream, const std::vector< std::uint64_t >& i_rNumbers = {} )
    {
      auto pReader = std::make_shared< VMemoryH264Reader >( i_rStream, i_rNumbers );
      pSource = std::make_unique< VVideoSource >();
      EXPECT_TRUE( pSource->Open( "memory.h264", pReader ) );
      return pReader;
    };
    auto FrameIs = [&]( std::uint64_t i_Index, std::size_t i_Expected )
    {
      ZOL::IVideoFrame Frame;
      if( !pSource->GetFrame( i_Index, Frame ) || !Frame.Video )
        return ::testing::AssertionFailure() << "frame " << i_Index << " did not decode";
      if( Bytes( *Frame.Video ) != Expected[i_Expected] )
        return ::testing::AssertionFailure() << "frame " << i_Index << " differs from ffmpeg's";
      return ::testing::AssertionSuccess();
    };

    // Alone mid-group, around a key frame and at the end; backwards; forward within a group;
    // across groups.
    for( const char* pJump :
         { "45", "29", "30", "31", "79", "62 61 60 59 31 30 29 1 0", "3 17 18 28", "5 70 33 34 35 2" } )
    {
      Open( Stream );
      std::istringstream Jump( pJump );
      for( std::uint64_t Index = 0; Jump >> Index; )
        EXPECT_TRUE( FrameIs( Index, Index ) ) << "jumping " << pJump;
    }

    // Stored under numbers with holes after 9 and 49, frames still follow each other in
    // decoding order, so nothing is decoded twice. The first frame is read once more, to see
    // that it is a key frame.
    std::vector< std::uint64_t > Holes;
    for( std::uint64_t i = 0; i < 80; ++i )
      Holes.push_back( i + ( i >= 10 ? 5 : 0 ) + ( i >= 50 ? 100 : 0 ) );
    for( const std::vector< std::uint64_t >& rNumbers : { std::vector< std::uint64_t >(), Holes } )
    {
      const auto pReader = Open( Stream, rNumbers );
      for( std::uint64_t i = 0; i < 80; ++i )
        ASSERT_TRUE( FrameIs( rNumbers.empty() ? i : rNumbers[i], i ) );
      EXPECT_EQ( pReader->Reads, 81u );
    }
    // A jump into the second hole's far side still finds the key frame before it.
    Open( Stream, Holes );
    EXPECT_TRUE( FrameIs( Holes[55], 55 ) );

    // The first ten frames are gone: 0 to 19 of the rest lack their references, 20 (the
    // original 30) is a key frame and everything from there matches.
    VH264Stream Cut = Stream;
    Cut.AccessUnits.erase( Cut.AccessUnits.begin(), Cut.AccessUnits.begin() + 10 );
    Open( Cut );
    ZOL::IVideoFrame Frame;
    EXPECT_FALSE( pSource->GetFrame( 5, Frame ) );
    EXPECT_TRUE( FrameIs( 21, 31 ) );
    EXPECT_TRUE( FrameIs( 20, 30 ) );
    for( std::uint64_t i = 21; i < 70; ++i )
      ASSERT_TRUE( FrameIs( i, i + 10 ) );

    // A key frame, then far more frames without one than a scrub walks back over: the walk
    // stops without decoding the copies.
    Cut.AccessUnits.assign( 1, Stream.AccessUnits[0] );
    Cut.AccessUnits.insert( Cut.AccessUnits.end(), 1500, Stream.AccessUnits[1] );
    const auto pReader = Open( Cut );
    VLogCapture Log( "H264IO" );
    EXPECT_FALSE( pSource->GetFrame( 1400, Frame ) );
    EXPECT_TRUE( Log.Has( "No key frame within 1200 frames before frame 1400." ) );
    EXPECT_EQ( pReader->Reads, 1200u );
    EXPECT_TRUE( FrameIs( 0, 0 ) );
    EXPECT_TRUE( FrameIs( 1, 1 ) );
  }
} // namespace
