// The decoder object, and the video source that reaches any frame by decoding forward from the
// key frame before it, against ffmpeg's own decode of the same libx264 streams.

#include "app/VideoSource/VVideoSource.h"
#include "fileio/H264IO/VH264Decoder.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "tests/fileio/H264/H264TestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <cstring>

namespace
{
  using namespace LumekTest;
  using LumekVideoViewer::VVideoSource;

  std::shared_ptr< ZOL::IH264Decoder > MakeDecoder()
  {
    return H264IO::VH264Decoder::Create( std::make_shared< ZOL::VFrameBufferAllocator >() );
  }

  bool Decode( ZOL::IH264Decoder& io_rDecoder, const VBytes& i_rUnit, ZOL::EPixelFormat i_Wish,
               std::shared_ptr< ZOL::IBuffer >& o_rOutput, ZOL::IVideoFrameInfo& o_rInfo )
  {
    return io_rDecoder.Decode( VBytesBuffer( i_rUnit ), i_Wish, o_rOutput, o_rInfo );
  }

  class H264Decoder : public ::testing::Test
  {
  protected:
    void SetUp() override
    {
      if( !HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
    }
  };

  TEST_F( H264Decoder, EveryFrameEqualsFfmpegs )
  {
    struct VCase
    {
      const char* Name;
      std::int32_t Width, Height;
      const char* Profile;
    };
    const VCase Cases[] = { { "Baseline64x48", 64, 48, "baseline" },
                            { "Baseline176x144", 176, 144, "baseline" },
                            // Not a whole number of macroblocks: the stream crops.
                            { "Baseline98x62", 98, 62, "baseline" },
                            { "MainCabac80x48", 80, 48, "main" } };
    for( const VCase& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      const VH264Stream Stream = MakeH264Stream( rCase.Width, rCase.Height, 12, 5, { "-profile:v", rCase.Profile } );
      const std::vector< VBytes > Expected = ExpectedUYVYFrames( Stream );
      ASSERT_EQ( Stream.AccessUnits.size(), 12u );
      ASSERT_EQ( Expected.size(), 12u );
      const auto pDecoder = MakeDecoder();
      ASSERT_TRUE( pDecoder );
      for( std::size_t i = 0; i < Stream.AccessUnits.size(); ++i )
      {
        std::shared_ptr< ZOL::IBuffer > pOutput;
        ZOL::IVideoFrameInfo Info;
        ASSERT_TRUE( Decode( *pDecoder, Stream.AccessUnits[i], ZOL::PixelFormat_U8Y8V8Y8, pOutput, Info ) ) << i;
        EXPECT_EQ( Info.ImageWidth, rCase.Width );
        EXPECT_EQ( Info.ImageHeight, rCase.Height );
        EXPECT_EQ( Info.PixelFormat, ZOL::PixelFormat_U8Y8V8Y8 );
        EXPECT_EQ( Bytes( *pOutput ), Expected[i] ) << "frame " << i;
      }
    }
  }

  TEST_F( H264Decoder, GivesTheOtherPackingWhenAskedAndU8Y8V8Y8Otherwise )
  {
    const VH264Stream Stream = MakeH264Stream( 64, 48, 12, 5 );
    const std::vector< VBytes > Expected = ExpectedUYVYFrames( Stream );
    ASSERT_GE( Expected.size(), 2u );
    const auto pDecoder = MakeDecoder();
    std::shared_ptr< ZOL::IBuffer > pOutput;
    ZOL::IVideoFrameInfo Info;
    ASSERT_TRUE( Decode( *pDecoder, Stream.AccessUnits[0], ZOL::PixelFormat_Y8U8Y8V8, pOutput, Info ) );
    EXPECT_EQ( Info.PixelFormat, ZOL::PixelFormat_Y8U8Y8V8 );
    VBytes Swapped = Expected[0];
    for( std::size_t i = 0; i + 1 < Swapped.size(); i += 2 )
      std::swap( Swapped[i], Swapped[i + 1] );
    EXPECT_EQ( Bytes( *pOutput ), Swapped );
    ASSERT_TRUE( Decode( *pDecoder, Stream.AccessUnits[1], ZOL::PixelFormat_R8G8B8, pOutput, Info ) );
    EXPECT_EQ( Info.PixelFormat, ZOL::PixelFormat_U8Y8V8Y8 );
    EXPECT_EQ( Bytes( *pOutput ), Expected[1] );

    // The frame decoder hands the decoded frame over in place of the payload.
    std::shared_ptr< ZOL::IBuffer > pBuffer;
    auto pAllocator = std::make_shared< ZOL::VFrameBufferAllocator >();
    pAllocator->Allocate( pBuffer, Stream.AccessUnits[0].size() );
    std::memcpy( pBuffer->GetData(), Stream.AccessUnits[0].data(), Stream.AccessUnits[0].size() );
    Info.PixelFormat = ZOL::PixelFormat_U8Y8V8Y8;
    ASSERT_TRUE( VideoEncoding::VideoFrameDecoder( ZOL::VideoPayload_VideoH264, Info, pBuffer, pAllocator, pAllocator,
                                                   MakeDecoder() ) );
    EXPECT_EQ( Bytes( *pBuffer ), Expected[0] );
  }

  TEST_F( H264Decoder, UnitsWithoutAPictureGiveNoFrameAndSaySo )
  {
    const VH264Stream Stream = MakeH264Stream( 64, 48, 12, 5 );
    VBytes ParameterSets = JoinNALUnits( UnitsOfType( Stream.AccessUnits.at( 0 ), 7 ), false );
    const VBytes PPS = JoinNALUnits( UnitsOfType( Stream.AccessUnits[0], 8 ), false );
    ParameterSets.insert( ParameterSets.end(), PPS.begin(), PPS.end() );
    const VBytes Garbage = { 0, 0, 0, 1, 0x65, 0xFF, 0x13, 0x00, 0x42, 0x99, 0, 0, 1, 0x41, 0x9A };
    std::shared_ptr< ZOL::IBuffer > pOutput;
    ZOL::IVideoFrameInfo Info;
    {
      VLogCapture Log( "H264IO" );
      EXPECT_FALSE( Decode( *MakeDecoder(), ParameterSets, ZOL::PixelFormat_U8Y8V8Y8, pOutput, Info ) );
      EXPECT_FALSE( pOutput );
      EXPECT_TRUE( Log.Contains( "Could not decode frame. Buffer status was 0, not 1." ) );
    }
    VLogCapture Log( "H264IO" );
    EXPECT_FALSE( Decode( *MakeDecoder(), Garbage, ZOL::PixelFormat_U8Y8V8Y8, pOutput, Info ) );
    EXPECT_FALSE( pOutput );
    EXPECT_FALSE( Log.Messages.empty() );
  }

  TEST_F( H264Decoder, OddSizedStreamNeverGivesAnOddFrame )
  {
    // Only monochrome pictures crop to an odd size. OpenH264 2.3 crops them in 4:2:0 units and
    // gives 32 x 16; a library that reported 33 x 17 would see each frame refused with the
    // even-size line instead. Either way no frame of odd size comes out.
    const VH264Stream Stream = MakeH264Stream( 33, 17, 4, 2, { "-profile:v", "high" }, "gray" );
    ASSERT_EQ( Stream.AccessUnits.size(), 4u );
    const auto pDecoder = MakeDecoder();
    VLogCapture Log( "H264IO" );
    for( const VBytes& rUnit : Stream.AccessUnits )
    {
      std::shared_ptr< ZOL::IBuffer > pOutput;
      ZOL::IVideoFrameInfo Info;
      if( !Decode( *pDecoder, rUnit, ZOL::PixelFormat_U8Y8V8Y8, pOutput, Info ) )
      {
        EXPECT_TRUE( Log.Contains( "Decoder produced a frame of dimensions 33 x 17. Only frames with even width and "
                                   "height are supported." ) );
        continue;
      }
      EXPECT_EQ( Info.ImageWidth % 2, 0 );
      EXPECT_EQ( Info.ImageHeight % 2, 0 );
      ASSERT_TRUE( pOutput );
      EXPECT_EQ( pOutput->GetSize(), std::uint64_t( Info.ImageWidth ) * Info.ImageHeight * 2 );
    }
  }

  // 80 frames, a key frame every 30: key frames at 0, 30 and 60.
  class H264RandomAccess : public H264Decoder
  {
  protected:
    void SetUp() override
    {
      H264Decoder::SetUp();
      if( IsSkipped() )
        return;
      Stream = MakeH264Stream( 96, 64, 80, 30 );
      Expected = ExpectedUYVYFrames( Stream );
      ASSERT_EQ( Stream.AccessUnits.size(), 80u );
      ASSERT_EQ( Expected.size(), 80u );
    }

    std::shared_ptr< VMemoryH264Reader > Open( VVideoSource& io_rSource, const VH264Stream& i_rStream,
                                               const std::vector< std::uint64_t >& i_rNumbers = {} )
    {
      auto pReader = std::make_shared< VMemoryH264Reader >( i_rStream, i_rNumbers );
      EXPECT_TRUE( io_rSource.Open( "memory.h264", pReader ) );
      return pReader;
    }

    ::testing::AssertionResult FrameIs( VVideoSource& io_rSource, std::uint64_t i_Index, std::size_t i_Expected )
    {
      ZOL::IVideoFrame Frame;
      if( !io_rSource.GetFrame( i_Index, Frame ) || !Frame.Video )
        return ::testing::AssertionFailure() << "frame " << i_Index << " did not decode";
      if( Bytes( *Frame.Video ) != Expected[i_Expected] )
        return ::testing::AssertionFailure() << "frame " << i_Index << " differs from ffmpeg's";
      return ::testing::AssertionSuccess();
    }

    VH264Stream Stream;
    std::vector< VBytes > Expected;
  };

  TEST_F( H264RandomAccess, JumpsGiveFfmpegsFrames )
  {
    const std::vector< std::vector< std::uint64_t > > Jumps = {
        { 45 },
        { 29 },
        { 30 },
        { 31 },
        { 79 },                               // alone: mid-group, around a key frame, the last
        { 62, 61, 60, 59, 31, 30, 29, 1, 0 }, // backwards
        { 3, 17, 18, 28 },                    // forward within a group
        { 5, 70, 33, 34, 35, 2 },             // across groups
    };
    for( const std::vector< std::uint64_t >& rJump : Jumps )
    {
      VVideoSource Source;
      Open( Source, Stream );
      for( std::uint64_t Index : rJump )
        EXPECT_TRUE( FrameIs( Source, Index, Index ) ) << "jumping " << ::testing::PrintToString( rJump );
    }
  }

  TEST_F( H264RandomAccess, PlaybackReadsEachFrameOnceAcrossGapsInTheIndex )
  {
    // Stored under numbers with holes after 9 and 49, frames still follow each other in
    // decoding order, so nothing is decoded twice. The first frame is read once more, to see
    // that it is a key frame.
    std::vector< std::uint64_t > Holes;
    for( std::uint64_t i = 0; i < 80; ++i )
      Holes.push_back( i + ( i >= 10 ? 5 : 0 ) + ( i >= 50 ? 100 : 0 ) );
    for( const std::vector< std::uint64_t >& rNumbers : { std::vector< std::uint64_t >(), Holes } )
    {
      VVideoSource Source;
      const auto pReader = Open( Source, Stream, rNumbers );
      for( std::uint64_t i = 0; i < 80; ++i )
        ASSERT_TRUE( FrameIs( Source, rNumbers.empty() ? i : rNumbers[i], i ) );
      EXPECT_EQ( pReader->Reads, 81u );
    }
    // A jump into the second hole's far side still finds the key frame before it.
    VVideoSource Source;
    Open( Source, Stream, Holes );
    EXPECT_TRUE( FrameIs( Source, Holes[55], 55 ) );
  }

  TEST_F( H264RandomAccess, AStreamCutInsideAGroupPlaysFromItsNextKeyFrame )
  {
    // The first ten frames are gone: 0 to 19 of the rest lack their references, 20 (the
    // original 30) is a key frame and everything from there matches.
    VH264Stream Tail = Stream;
    Tail.AccessUnits.erase( Tail.AccessUnits.begin(), Tail.AccessUnits.begin() + 10 );
    VVideoSource Source;
    Open( Source, Tail );
    ZOL::IVideoFrame Frame;
    EXPECT_FALSE( Source.GetFrame( 5, Frame ) );
    EXPECT_TRUE( FrameIs( Source, 21, 31 ) );
    EXPECT_TRUE( FrameIs( Source, 20, 30 ) );
    for( std::uint64_t i = 21; i < 70; ++i )
      ASSERT_TRUE( FrameIs( Source, i, i + 10 ) );
  }

  TEST_F( H264RandomAccess, NoKeyFrameWithinReachIsAFalseAnswer )
  {
    // A key frame, then far more frames without one than a scrub will walk back over. The
    // copies are never decoded: the walk back finds nothing and stops.
    VH264Stream Long = Stream;
    Long.AccessUnits.resize( 1 );
    Long.AccessUnits.insert( Long.AccessUnits.end(), 1500, Stream.AccessUnits[1] );
    VVideoSource Source;
    const auto pReader = Open( Source, Long );
    VLogCapture Log( "H264IO" );
    ZOL::IVideoFrame Frame;
    EXPECT_FALSE( Source.GetFrame( 1400, Frame ) );
    EXPECT_TRUE( Log.Contains( "No key frame within 1200 frames before frame 1400." ) );
    EXPECT_EQ( pReader->Reads, 1200u );
    EXPECT_TRUE( FrameIs( Source, 0, 0 ) );
    EXPECT_TRUE( FrameIs( Source, 1, 1 ) );
  }
} // namespace
