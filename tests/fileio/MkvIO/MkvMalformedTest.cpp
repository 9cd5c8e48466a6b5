// The damaged and odd files a reader of the family meets: each is refused with its log line or
// read as far as it can be; cut and flipped files never crash or hang.

#include "fileio/MkvIO/VMkvReader.h"
#include "tests/fileio/MkvIO/MkvTestSupport.h"

#include <ebml/MemReadIOCallback.h>
#include <gtest/gtest.h>

using MkvTest::VFamilyCase;

namespace
{
  VFamilyCase SmallCase()
  {
    VFamilyCase Case;
    Case.Name = "Small";
    Case.Format = ZOL::PixelFormat_R8G8B8u8;
    Case.Audio = ZOL::AudioSampleFormat_Int16;
    Case.Width = 4;
    Case.Height = 2;
    Case.Frames = 3;
    return Case;
  }

  std::vector< std::uint8_t > Bytes( const std::shared_ptr< ZOL::IBuffer >& i_pBuffer )
  {
    if( !i_pBuffer )
      return {};
    const auto* pData = static_cast< const std::uint8_t* >( i_pBuffer->GetData() );
    return std::vector< std::uint8_t >( pData, pData + i_pBuffer->GetSize() );
  }

  MkvIO::VMkvBlock Block( std::uint16_t i_Track, std::vector< std::uint8_t > i_Bytes, bool i_bWithBlock = true )
  {
    MkvIO::VMkvBlock Result;
    Result.Track = i_Track;
    Result.Bytes = std::move( i_Bytes );
    Result.bWithBlock = i_bWithBlock;
    return Result;
  }

  // A file that must not open, and the line that says why.
  struct VRefusedCase
  {
    const char* Name;
    std::function< void( MkvIO::VMkvDescription& ) > Edit;
    const char* Message;
  };

  class MkvRefusedTest : public ::testing::TestWithParam< VRefusedCase >
  {
  };

  TEST_P( MkvRefusedTest, DoesNotOpen )
  {
    const std::string Path = MkvTest::TempPath( std::string( GetParam().Name ) + ".mkv" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Path, SmallCase(), {}, GetParam().Edit ) );
    MkvTest::VLogCapture Log;
    MkvIO::VMkvReader Reader;
    EXPECT_FALSE( Reader.Open( Path ) );
    EXPECT_TRUE( Log.Contains( GetParam().Message ) ) << ( Log.Messages().empty() ? "" : Log.Messages().back() );
    // Refused means closed and empty.
    EXPECT_EQ( Reader.GetFrameCount(), 0u );
    EXPECT_EQ( Reader.GetVideoPayload(), ZOL::VideoPayload_None );
    std::remove( Path.c_str() );
  }

  INSTANTIATE_TEST_SUITE_P(
      Broken, MkvRefusedTest,
      ::testing::Values(
          VRefusedCase{ "UnknownSizeSegment", []( MkvIO::VMkvDescription& io_rD ) { io_rD.bUnknownSegmentSize = true; },
                        "KaxSegment missing or not a finite size." },
          VRefusedCase{ "DisplayWidthDiffers", []( MkvIO::VMkvDescription& io_rD ) { io_rD.Video.DisplayWidth = 8; },
                        "Invalid image width." },
          VRefusedCase{ "DisplayHeightDiffers", []( MkvIO::VMkvDescription& io_rD ) { io_rD.Video.DisplayHeight = 1; },
                        "Invalid image height." },
          VRefusedCase{ "UnknownFourCC", []( MkvIO::VMkvDescription& io_rD ) { io_rD.Video.FourCC = "ABCD"; },
                        "Unknown video FourCC code 'ABCD' found." },
          VRefusedCase{ "UnknownVfwFourCC",
                        []( MkvIO::VMkvDescription& io_rD )
                        {
                          io_rD.Video.CodecID = "V_MS/VFW/FOURCC";
                          io_rD.Video.FourCC = "H264";
                        },
                        "Unknown video FourCC code 'H264' found." },
          VRefusedCase{ "UnknownCodec",
                        []( MkvIO::VMkvDescription& io_rD ) { io_rD.Video.CodecID = "V_MPEG4/ISO/AVC"; },
                        "Unknown video codec 'V_MPEG4/ISO/AVC' found." } ),
      []( const ::testing::TestParamInfo< VRefusedCase >& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

  // A file that opens although a Cluster is odd: what frame 1 reads as.
  struct VOddClusterCase
  {
    const char* Name;
    std::vector< MkvIO::VMkvBlock > Blocks; // frame 1's Cluster; the others are ordinary
    std::vector< std::uint8_t > Video;      // what frame 1 reads as
    std::vector< std::vector< std::uint8_t > > Audio;
    const char* Message; // a line the read logs, or ""
  };

  class MkvOddClusterTest : public ::testing::TestWithParam< VOddClusterCase >
  {
  };

  TEST_P( MkvOddClusterTest, ReadsWhatIsThere )
  {
    const VFamilyCase Case = SmallCase();
    const std::string Path = MkvTest::TempPath( std::string( GetParam().Name ) + ".mkv" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Path, Case, {}, {},
                                           [&]( int i_Frame )
                                           {
                                             if( i_Frame == 1 )
                                               return GetParam().Blocks;
                                             return std::vector< MkvIO::VMkvBlock >{
                                                 Block( 1, MkvTest::RawFrame( Case, i_Frame ) ),
                                                 Block( 2, MkvTest::AudioBlock( Case, i_Frame ) ) };
                                           } ) );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    ASSERT_EQ( Reader.GetFrameCount(), 3u );
    MkvTest::VLogCapture Log;
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Reader.ReadFrameData( 1, pVideo, Audio, true, true ) );
    EXPECT_EQ( Bytes( pVideo ), GetParam().Video );
    ASSERT_EQ( Audio.size(), GetParam().Audio.size() );
    for( std::size_t i = 0; i < Audio.size(); ++i )
      EXPECT_EQ( Bytes( Audio[i] ), GetParam().Audio[i] );
    if( *GetParam().Message )
    {
      EXPECT_TRUE( Log.Contains( GetParam().Message ) );
    }
    // The frames around it are untouched.
    ASSERT_TRUE( Reader.ReadFrameData( 2, pVideo, Audio, true, false ) );
    EXPECT_EQ( Bytes( pVideo ), MkvTest::RawFrame( Case, 2 ) );
    std::remove( Path.c_str() );
  }

  const std::vector< std::uint8_t > s_Video = MkvTest::RawFrame( SmallCase(), 1 );
  const std::vector< std::uint8_t > s_AudioA( 8, 0x11 );
  const std::vector< std::uint8_t > s_AudioB( 12, 0x22 );

  INSTANTIATE_TEST_SUITE_P(
      Clusters, MkvOddClusterTest,
      ::testing::Values( VOddClusterCase{ "ThirdTrackBlock",
                                          { Block( 3, { 1, 2, 3 } ), Block( 1, s_Video ), Block( 2, s_AudioA ) },
                                          s_Video,
                                          { s_AudioA },
                                          "Track '3' found, but only tracks numbered '1' or '2' are allowed." },
                         VOddClusterCase{ "NoVideoBlock", { Block( 2, s_AudioA ) }, {}, { s_AudioA }, "" },
                         VOddClusterCase{ "BlockGroupWithoutBlock",
                                          { Block( 1, {}, false ), Block( 1, s_Video ), Block( 2, s_AudioA ) },
                                          s_Video,
                                          { s_AudioA },
                                          "" },
                         VOddClusterCase{ "TwoAudioBlocks",
                                          { Block( 1, s_Video ), Block( 2, s_AudioA ), Block( 2, s_AudioB ) },
                                          s_Video,
                                          { s_AudioB },
                                          "" },
                         VOddClusterCase{ "EmptyCluster", {}, {}, {}, "" } ),
      []( const ::testing::TestParamInfo< VOddClusterCase >& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

  // Tags change the records through SetValueFromString; the period comes from Duration only
  // when nothing set the timing.
  struct VTagCase
  {
    const char* Name;
    std::vector< std::pair< std::string, std::string > > Tags;
    double FrameRate;
    double PixelAspectRatio;
  };

  class MkvTagTest : public ::testing::TestWithParam< VTagCase >
  {
  };

  TEST_P( MkvTagTest, TagsDecideTheRecords )
  {
    VFamilyCase Case = SmallCase();
    Case.Frames = 10;
    Case.FramesPerSecond = 50.0;
    const std::string Path = MkvTest::TempPath( std::string( GetParam().Name ) + ".mkv" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Path, Case, {},
                                           [&]( MkvIO::VMkvDescription& io_rD ) { io_rD.Tags = GetParam().Tags; } ) );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_DOUBLE_EQ( Reader.GetVideoTiming().GetFrameRate(), GetParam().FrameRate );
    EXPECT_DOUBLE_EQ( Reader.GetVideoFrameInfo().PixelAspectRatio, GetParam().PixelAspectRatio );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_R8G8B8u8 );
    std::string Unknown;
    EXPECT_FALSE( Reader.GetInternalAttributes().GetValueAsString( "Unknown", Unknown ) );
    std::remove( Path.c_str() );
  }

  INSTANTIATE_TEST_SUITE_P(
      Tags, MkvTagTest,
      ::testing::Values(
          // 10 frames over a Duration of 200 ms: 50 frames a second, 2700000 ticks.
          VTagCase{ "NoTagsRateFromDuration", {}, 50.0, 1.0 },
          VTagCase{ "TimingTagsWin",
                    { { "Lumek.External.TicksPerSecond", "25" }, { "Lumek.External.FramePeriodInTicks", "1" } },
                    25.0,
                    1.0 },
          VTagCase{ "UnknownKeyIgnored", { { "Lumek.Internal.Unknown", "7" } }, 50.0, 1.0 },
          VTagCase{ "AspectRatioTag", { { "Lumek.Internal.VideoFrameInfo.PixelAspectRatio", "2.5" } }, 50.0, 2.5 },
          VTagCase{
              "UnparsableKeepsValue", { { "Lumek.Internal.VideoFrameInfo.PixelAspectRatio", "wide" } }, 50.0, 1.0 },
          VTagCase{ "OtherPrefixIgnored", { { "Other.TicksPerSecond", "25" } }, 50.0, 1.0 } ),
      []( const ::testing::TestParamInfo< VTagCase >& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

  TEST( MkvReader, UnsupportedAudioDepthLeavesTheAudioOut )
  {
    const std::string Path = MkvTest::TempPath( "depth8.mkv" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Path, SmallCase(), {},
                                           []( MkvIO::VMkvDescription& io_rD )
                                           {
                                             io_rD.Audio.BitDepth = 8;
                                             io_rD.Tags.clear();
                                           } ) );
    MkvTest::VLogCapture Log;
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetAudioPayload(), ZOL::AudioPayload_None );
    EXPECT_TRUE( Log.Contains( "Unsupported sample format 8" ) );
    std::remove( Path.c_str() );
  }

  TEST( MkvReader, MissingFileAndNonMatroska )
  {
    MkvTest::VLogCapture Log;
    MkvIO::VMkvReader Reader;
    EXPECT_FALSE( Reader.Open( MkvTest::TempPath( "absent.mkv" ) ) );
    EXPECT_TRUE( Log.Contains( "File could not be opened." ) );
    const std::string Path = MkvTest::TempPath( "text.mkv" );
    ASSERT_TRUE( MkvTest::WriteWholeFile( Path, std::vector< std::uint8_t >( 300, 'x' ) ) );
    EXPECT_FALSE( Reader.Open( Path ) );
    EXPECT_TRUE( Log.Contains( "EbmlHead missing." ) );
    std::remove( Path.c_str() );
  }

  // Cuts at every point and flips at many: no crash, no hang, and whatever opens reads.

  class MkvCorruptionTest : public ::testing::TestWithParam< bool >
  {
  };

  void OpenAndReadAll( const std::vector< std::uint8_t >& i_rBytes )
  {
    MkvIO::VMkvReader Reader;
    if( !Reader.Open( std::make_unique< libebml::MemReadIOCallback >( i_rBytes.data(), i_rBytes.size() ) ) )
      return;
    for( std::uint64_t Frame = 0; Frame < Reader.GetFrameCount() && Frame < 16; ++Frame )
    {
      ZOL::IVideoFrame Decoded;
      (void)Reader.ReadFrame( Frame, Decoded, true, true );
    }
  }

  TEST_P( MkvCorruptionTest, SurvivesDamage )
  {
    const bool bFlip = GetParam();
    VFamilyCase Case = SmallCase();
    const std::string Source = MkvTest::TempPath( "source.mkv" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Source, Case, {} ) );
    const std::vector< std::uint8_t > Original = MkvTest::ReadWholeFile( Source );
    ASSERT_GT( Original.size(), 100u );
    for( std::size_t Position = 0; Position < Original.size(); ++Position )
    {
      std::vector< std::uint8_t > Bytes = Original;
      if( bFlip )
        Bytes[Position] ^= static_cast< std::uint8_t >( 0x80 >> ( Position % 8 ) | ( Position % 3 == 0 ? 0xFF : 0 ) );
      else
        Bytes.resize( Position );
      OpenAndReadAll( Bytes );
    }
    std::remove( Source.c_str() );
  }

  INSTANTIATE_TEST_SUITE_P( Damage, MkvCorruptionTest, ::testing::Values( false, true ),
                            []( const ::testing::TestParamInfo< bool >& i_rInfo )
                            { return std::string( i_rInfo.param ? "Flips" : "Cuts" ); } );
} // namespace
