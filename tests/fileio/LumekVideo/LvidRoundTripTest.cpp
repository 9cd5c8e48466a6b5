// Writer to reader round trips, and the reader on recordings assembled by hand.

#include "fileio/LumekVideo/VReader.h"
#include "fileio/LumekVideo/VWriter.h"
#include "tests/fileio/LumekVideo/LvidTestSupport.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include "tests/support/TestNames.h"
#include "videointerface/BufferAllocators.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>

#include <string>
#include <tuple>

using namespace LumekVideoTest;

namespace
{
  struct VAudioCase
  {
    const char* Name;
    ZOL::EAudioSampleFormat Format;
    int Channels;
  };

  const VAudioCase s_AudioCases[] = {
      { "NoAudio", ZOL::AudioSampleFormat_Unspecified, 0 },   { "Int8Mono", ZOL::AudioSampleFormat_Int8, 1 },
      { "Int16Stereo", ZOL::AudioSampleFormat_Int16, 2 },     { "Int24Stereo", ZOL::AudioSampleFormat_Int24, 2 },
      { "Int32Mono", ZOL::AudioSampleFormat_Int32, 1 },       { "UInt16Quad", ZOL::AudioSampleFormat_UInt16, 4 },
      { "Float32Stereo", ZOL::AudioSampleFormat_Float32, 2 }, { "UInt8Stereo", ZOL::AudioSampleFormat_UInt8, 2 },
      { "UInt24Triple", ZOL::AudioSampleFormat_UInt24, 3 },   { "UInt32Mono", ZOL::AudioSampleFormat_UInt32, 1 },
  };

  // The bytes of one frame as the layouts define them, computed here from the rules rather than
  // taken from the function under test.
  std::uint64_t ExpectedFrameSize( ZOL::EPixelFormat i_Format, std::uint64_t W, std::uint64_t H )
  {
    switch( i_Format )
    {
    case ZOL::PixelFormat_R5G6B5:
    case ZOL::PixelFormat_U8Y8V8Y8:
    case ZOL::PixelFormat_Y8U8Y8V8:
    case ZOL::PixelFormat_PlanarY8U8V8:
      return W * H * 2;
    case ZOL::PixelFormat_R8G8B8:
    case ZOL::PixelFormat_B8G8R8:
    case ZOL::PixelFormat_PlanarR8G8B8:
      return W * H * 3;
    case ZOL::PixelFormat_R8G8B8u8:
    case ZOL::PixelFormat_B8G8R8u8:
      return W * H * 4;
    case ZOL::PixelFormat_U10Y10V10Y10:
      return ( W + 47 ) / 48 * H * 128;
    case ZOL::PixelFormat_BayerGB7:
    case ZOL::PixelFormat_Luminance7:
      return static_cast< std::uint64_t >( std::ceil( W * H * 0.875 ) );
    case ZOL::PixelFormat_BayerGB6:
    case ZOL::PixelFormat_Luminance6:
      return static_cast< std::uint64_t >( std::ceil( W * H * 0.75 ) );
    default:
      return W * H;
    }
  }

  struct VFrameContent
  {
    std::uint64_t FrameNumber;
    VBytes Video;
    VBytes Audio;
  };

  // Frames out of order and with gaps; one frame has no audio bytes at all.
  std::vector< VFrameContent > MakeFrames( std::uint64_t i_VideoSize, std::uint64_t i_GroupSize )
  {
    const std::uint64_t Numbers[] = { 2, 0, 3, 9 };
    const std::uint64_t Groups[] = { 3, 0, 1, 800 };
    std::vector< VFrameContent > Frames;
    for( std::size_t i = 0; i < 4; ++i )
      Frames.push_back(
          { Numbers[i], PatternBytes( i_VideoSize, 100 + i ), PatternBytes( Groups[i] * i_GroupSize, 200 + i ) } );
    return Frames;
  }

  void ExpectSameBytes( const ZOL::IBufferConst& i_rBuffer, const VBytes& i_rExpected, const std::string& i_rWhat )
  {
    ASSERT_EQ( i_rBuffer.GetSize(), i_rExpected.size() ) << i_rWhat;
    EXPECT_TRUE( std::equal( i_rExpected.begin(), i_rExpected.end(), i_rBuffer.GetData() ) ) << i_rWhat;
  }

  // Each pixel format with one audio layout, the layouts taken in turn: every format and every
  // layout goes through the file, without writing every pairing of the two.
  class LvidRoundTrip : public testing::TestWithParam< int >
  {
  };

  const VAudioCase& AudioCaseOf( int i_Format )
  {
    return s_AudioCases[static_cast< std::size_t >( i_Format - 1 ) % std::size( s_AudioCases )];
  }

  TEST_P( LvidRoundTrip, EveryFrameReadsBackBitForBit )
  {
    const auto Format = static_cast< ZOL::EPixelFormat >( GetParam() );
    const VAudioCase& rAudioCase = AudioCaseOf( GetParam() );
    // Odd sizes, so that no row or plane happens to fall on a round number.
    const ZOL::IVideoFrameInfo Video = MakeVideo( Format, 7, 3 );
    const ZOL::IAudioFrameInfo Audio = MakeAudio( rAudioCase.Format, rAudioCase.Channels );
    const bool bHasAudio = Audio.IsUsable();
    const std::uint64_t FrameSize = ExpectedFrameSize( Format, 7, 3 );
    const std::uint64_t GroupSize =
        bHasAudio ? ZOL::GetAudioSampleSizeInBytes( Audio.SampleFormat ) * Audio.Channels : 0;
    const ZOL::IVideoAttributes Attributes = MakeFileAttributes();
    const std::vector< VFrameContent > Frames = MakeFrames( FrameSize, GroupSize );

    VTempDir Dir;
    const std::string Path = Dir.File( "roundtrip.lvid" );
    {
      LumekVideo::VWriter Writer;
      ASSERT_TRUE( Writer.Create( Path, Video, Audio, Attributes ) );
      EXPECT_EQ( Writer.GetVideoFrameSize(), FrameSize );
      for( const VFrameContent& rFrame : Frames )
        ASSERT_TRUE( Writer.AppendFrame( rFrame.FrameNumber, rFrame.Video.data(), rFrame.Video.size(),
                                         rFrame.Audio.empty() ? nullptr : rFrame.Audio.data(), rFrame.Audio.size() ) );
      ASSERT_TRUE( Writer.Close() );
    }

    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetVideoFrameInfo(), Video );
    EXPECT_EQ( Reader.GetAudioFrameInfo(), bHasAudio ? Audio : ZOL::IAudioFrameInfo() );
    EXPECT_EQ( Reader.GetAudioPayload(), bHasAudio ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None );
    EXPECT_EQ( Reader.GetVideoPayload(), ZOL::VideoPayload_Uncompressed );
    EXPECT_TRUE( Reader.GetAttributes() == Attributes );
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, 1350000u );
    EXPECT_EQ( Reader.GetVideoTiming().StartOffsetInTicks, -270000 );
    EXPECT_EQ( Reader.GetVideoSettings().Saturation, 1.25f );
    EXPECT_EQ( Reader.GetFileHeader().Alignment, 4096u );
    EXPECT_EQ( Reader.GetFrameCount(), 10u );

    for( const VFrameContent& rFrame : Frames )
    {
      const std::string What = "frame " + std::to_string( rFrame.FrameNumber );
      ASSERT_TRUE( Reader.HasFrame( rFrame.FrameNumber ) ) << What;
      // The caller's audio stays when the frame stores none.
      auto pSentinel = std::make_shared< ZOL::IStandardBuffer >();
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers AudioBlocks{ pSentinel };
      ASSERT_TRUE( Reader.ReadFrameData( rFrame.FrameNumber, pVideo, AudioBlocks, true, true ) ) << What;
      ASSERT_TRUE( pVideo ) << What;
      ExpectSameBytes( *pVideo, rFrame.Video, What );
      ASSERT_EQ( AudioBlocks.size(), 1u ) << What;
      if( !bHasAudio || rFrame.Audio.empty() )
        EXPECT_EQ( AudioBlocks[0], pSentinel ) << What;
      else
        ExpectSameBytes( *AudioBlocks[0], rFrame.Audio, What );
    }
    std::uint64_t Missing = 0;
    for( std::uint64_t i = 0; i < Reader.GetFrameCount(); ++i )
      Missing += Reader.HasFrame( i ) ? 0 : 1;
    EXPECT_EQ( Missing, 6u );
  }

  INSTANTIATE_TEST_SUITE_P( AllFormats, LvidRoundTrip, testing::Range( 1, 20 ),
                            []( const testing::TestParamInfo< int >& i_rInfo )
                            {
                              return std::string( ZOL::ToString( static_cast< ZOL::EPixelFormat >( i_rInfo.param ) ) ) +
                                     "_" + AudioCaseOf( i_rInfo.param ).Name;
                            } );

  // Reads a recording held in memory.
  struct VMemoryRecording
  {
    explicit VMemoryRecording( VBytes i_Bytes ) : Bytes( std::move( i_Bytes ) )
    {
      bOpened = Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( Bytes.data(), Bytes.size() ) );
    }
    VBytes Bytes;
    LumekVideo::VReader Reader;
    bool bOpened = false;
  };

  VBytes WriteToMemory( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio,
                        const std::vector< VFrameContent >& i_rFrames, std::uint64_t i_Alignment )
  {
    auto pStream = std::make_shared< UtilsIO::VMemoryStream >();
    LumekVideo::VWriter Writer;
    EXPECT_TRUE( Writer.Create( pStream, i_rVideo, i_rAudio, MakeFileAttributes(), i_Alignment ) );
    for( const VFrameContent& rFrame : i_rFrames )
      EXPECT_TRUE( Writer.AppendFrame( rFrame.FrameNumber, rFrame.Video.data(), rFrame.Video.size(),
                                       rFrame.Audio.data(), rFrame.Audio.size() ) );
    EXPECT_TRUE( Writer.Close() );
    return pStream->GetData();
  }

  class LvidAlignment : public testing::TestWithParam< std::uint64_t >
  {
  };

  // Three-byte samples in three channels give records that almost never end on a boundary.
  TEST_P( LvidAlignment, RecordsStartOnBoundariesAndReadBack )
  {
    const std::uint64_t Alignment = GetParam();
    const ZOL::IVideoFrameInfo Video = MakeVideo( ZOL::PixelFormat_R8G8B8, 5, 3 );
    const ZOL::IAudioFrameInfo Audio = MakeAudio( ZOL::AudioSampleFormat_Int24, 3 );
    const std::vector< VFrameContent > Frames = MakeFrames( 45, 9 );
    VMemoryRecording Recording( WriteToMemory( Video, Audio, Frames, Alignment ) );
    ASSERT_TRUE( Recording.bOpened );
    EXPECT_EQ( Recording.Reader.GetFileHeader().Alignment, Alignment );
    for( const auto& rEntry : Recording.Reader.GetFrameIndex() )
      EXPECT_EQ( rEntry.second % Alignment, 0u ) << "frame " << rEntry.first;
    // Reading in another order than writing, and each frame twice, checks that nothing depends
    // on where the previous read left the stream.
    for( int Pass = 0; Pass < 2; ++Pass )
      for( auto it = Frames.rbegin(); it != Frames.rend(); ++it )
      {
        std::shared_ptr< ZOL::IBuffer > pVideo;
        ZOL::IAudioBuffers AudioBlocks;
        ASSERT_TRUE( Recording.Reader.ReadFrameData( it->FrameNumber, pVideo, AudioBlocks, true, true ) );
        ExpectSameBytes( *pVideo, it->Video, "video" );
        if( !it->Audio.empty() )
          ExpectSameBytes( *AudioBlocks.at( 0 ), it->Audio, "audio" );
      }
  }

  INSTANTIATE_TEST_SUITE_P( Sizes, LvidAlignment, testing::Values( 1, 2, 3, 7, 64, 4096, 65536 ),
                            []( const testing::TestParamInfo< std::uint64_t >& i_rInfo )
                            { return "Alignment" + std::to_string( i_rInfo.param ); } );

  const ZOL::IVideoFrameInfo s_SmallVideo = MakeVideo( ZOL::PixelFormat_Luminance8, 5, 3 );
  const ZOL::IAudioFrameInfo s_Stereo16 = MakeAudio( ZOL::AudioSampleFormat_Int16, 2 );

  VRecordingPlan SmallPlan()
  {
    VRecordingPlan Plan;
    Plan.DescriptionBlock = DescriptionBlock( s_SmallVideo, s_Stereo16 );
    Plan.AttributeBlock = SerialiseStore( MakeFileAttributes() );
    Plan.Alignment = 16;
    for( std::uint32_t i = 0; i < 3; ++i )
      Plan.Records.push_back( { i, PatternBytes( 15, i ), PatternBytes( 8 * ( i + 1 ), 50 + i ), std::nullopt } );
    return Plan;
  }

  // The writer lays a recording out exactly as the format describes it, byte for byte.
  TEST( LvidWriter, WritesTheLayoutByteForByte )
  {
    VRecordingPlan Plan = SmallPlan();
    Plan.Records[0].FrameNumber = 2;
    Plan.Records[1].FrameNumber = 0;
    Plan.Records[2].FrameNumber = 2;
    std::vector< VFrameContent > Frames;
    for( const VRecord& rRecord : Plan.Records )
      Frames.push_back( { rRecord.FrameNumber, rRecord.Video, *rRecord.Audio } );
    const VBytes Written = WriteToMemory( s_SmallVideo, s_Stereo16, Frames, 16 );
    const VAssembled Expected = Assemble( Plan );
    EXPECT_EQ( Written, Expected.Bytes );
  }

  TEST( LvidReader, LaterDuplicateIndexEntryWins )
  {
    // Entries (5, a), (0, b), (5, c): frame 5 is record c.
    const VAssembled File = AssembleWithIndex( SmallPlan(), { { 5, 0 }, { 0, 1 }, { 5, 2 } } );
    VMemoryRecording Recording( File.Bytes );
    ASSERT_TRUE( Recording.bOpened );
    EXPECT_EQ( Recording.Reader.GetFrameCount(), 6u );
    EXPECT_TRUE( Recording.Reader.HasFrame( 0 ) );
    EXPECT_FALSE( Recording.Reader.HasFrame( 3 ) );
    EXPECT_EQ( Recording.Reader.GetFrameIndex().at( 5 ), File.RecordOffsets[2] );
    // The gaps answered from the index alone, as the viewer's fallback to an earlier frame asks.
    EXPECT_EQ( Recording.Reader.GetStoredFrameCount(), 2u );
    EXPECT_EQ( Recording.Reader.FindStoredFrameAtOrBefore( 4 ), std::optional< std::uint64_t >( 0 ) );
    EXPECT_EQ( Recording.Reader.FindStoredFrameAtOrAfter( 1 ), std::optional< std::uint64_t >( 5 ) );
    EXPECT_EQ( Recording.Reader.FindStoredFrameAtOrAfter( 6 ), std::nullopt );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Recording.Reader.ReadFrameData( 5, pVideo, Audio, true, true ) );
    ExpectSameBytes( *pVideo, SmallPlan().Records[2].Video, "frame 5" );
  }

  TEST( LvidReader, AudioIsCutToWholeSampleGroups )
  {
    // Ten bytes of 16-bit stereo are two whole groups and half of one: eight bytes are read, and
    // the next record is still found from where reading stopped.
    VRecordingPlan Plan = SmallPlan();
    Plan.Records[0].Audio = PatternBytes( 10, 9 );
    Plan.Records[1].Audio = PatternBytes( 3, 9 );
    const VAssembled File = Assemble( Plan );
    VMemoryRecording Recording( File.Bytes );
    ASSERT_TRUE( Recording.bOpened );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Recording.Reader.ReadFrameData( 0, pVideo, Audio, true, true ) );
    ExpectSameBytes( *Audio.at( 0 ), VBytes( Plan.Records[0].Audio->begin(), Plan.Records[0].Audio->begin() + 8 ),
                     "frame 0" );
    // Three bytes are not one whole group: an empty block.
    ASSERT_TRUE( Recording.Reader.ReadFrameData( 1, pVideo, Audio, true, true ) );
    EXPECT_EQ( Audio.at( 0 )->GetSize(), 0u );
    ASSERT_TRUE( Recording.Reader.ReadFrameData( 2, pVideo, Audio, true, true ) );
    ExpectSameBytes( *Audio.at( 0 ), *Plan.Records[2].Audio, "frame 2" );
  }

  struct VHalvesCase
  {
    const char* Name;
    bool bReadVideo;
    bool bReadAudio;
  };

  void PrintTo( const VHalvesCase& i_rCase, std::ostream* o_pStream )
  {
    *o_pStream << i_rCase.Name;
  }

  class LvidRequestedHalves : public testing::TestWithParam< VHalvesCase >
  {
  };

  // Only the halves asked for change; the others keep what the caller had in them.
  TEST_P( LvidRequestedHalves, OnlyTheRequestedHalvesChange )
  {
    const VHalvesCase& rCase = GetParam();
    const VRecordingPlan Plan = SmallPlan();
    VMemoryRecording Recording( Assemble( Plan ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    auto pKept = std::make_shared< ZOL::IStandardBuffer >();
    std::shared_ptr< ZOL::IBuffer > pVideo = pKept;
    ZOL::IAudioBuffers Audio{ pKept, pKept };
    ASSERT_TRUE( Recording.Reader.ReadFrameData( 2, pVideo, Audio, rCase.bReadVideo, rCase.bReadAudio ) );
    if( rCase.bReadVideo )
      ExpectSameBytes( *pVideo, Plan.Records[2].Video, "video" );
    else
      EXPECT_EQ( pVideo, pKept );
    if( rCase.bReadAudio )
    {
      ASSERT_EQ( Audio.size(), 1u );
      ExpectSameBytes( *Audio[0], *Plan.Records[2].Audio, "audio" );
    }
    else
      EXPECT_EQ( Audio, ( ZOL::IAudioBuffers{ pKept, pKept } ) );
    // A frame that is not there changes nothing, whatever is asked for.
    EXPECT_FALSE( Recording.Reader.ReadFrameData( 7, pVideo, Audio, rCase.bReadVideo, rCase.bReadAudio ) );
  }

  INSTANTIATE_TEST_SUITE_P( Requests, LvidRequestedHalves,
                            testing::Values( VHalvesCase{ "Both", true, true }, VHalvesCase{ "VideoOnly", true, false },
                                             VHalvesCase{ "AudioOnly", false, true },
                                             VHalvesCase{ "Neither", false, false } ),
                            LumekTest::VCaseName() );

  TEST( LvidReader, ReadFrameWithoutVideoKeepsTheRecordsVideo )
  {
    VMemoryRecording Recording( Assemble( SmallPlan() ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    ZOL::IVideoFrame Frame;
    auto pOldVideo = std::make_shared< ZOL::IStandardBuffer >();
    Frame.Video = pOldVideo;
    Frame.VideoFrameInfo = MakeVideo( ZOL::PixelFormat_R8G8B8, 9, 9 );
    ASSERT_TRUE( Recording.Reader.ReadFrame( 1, Frame, false, true ) );
    EXPECT_EQ( Frame.Video, pOldVideo );
    EXPECT_EQ( Frame.VideoFrameInfo, MakeVideo( ZOL::PixelFormat_R8G8B8, 9, 9 ) );
    EXPECT_EQ( Frame.AudioFrameInfo, s_Stereo16 );
    ExpectSameBytes( *Frame.Audio.at( 0 ), *SmallPlan().Records[1].Audio, "frame 1 audio" );

    ASSERT_TRUE( Recording.Reader.ReadFrame( 1, Frame, true, false ) );
    EXPECT_EQ( Frame.VideoFrameInfo, s_SmallVideo );
    ExpectSameBytes( *Frame.Video, SmallPlan().Records[1].Video, "frame 1 video" );
  }

  // The description written with the raw key forms, not with the record writers: the older
  // whole-pixel offset, an inverted image and settings of its own.
  TEST( LvidReader, ReadsADescriptionWrittenKeyByKey )
  {
    VByteWriter Description;
    const auto Key = [&]( const std::string& i_rKey, std::uint32_t i_Tag ) -> VByteWriter&
    { return Description.U32( static_cast< std::uint32_t >( i_rKey.size() ) ).Text( i_rKey ).U32( i_Tag ); };
    Description.U32( 9 );
    Key( "VideoFrameInfo.Present", 0 ).U8( 1 );
    Key( "VideoFrameInfo.ImageX", 7 ).U32( 3 );
    Key( "VideoFrameInfo.TwiceOffsetY", 6 ).U16( 5 );
    Key( "VideoFrameInfo.ImageWidth", 7 ).U32( 4 );
    Key( "VideoFrameInfo.ImageHeight", 7 ).U32( 2 );
    Key( "VideoFrameInfo.PixelFormat", 11 ).U32( 8 ).Text( "BayerGB8" );
    Key( "VideoFrameInfo.Inverted", 0 ).U8( 1 );
    Key( "VideoFrameInfo.PixelAspectRatio", 10 ).F64( 1.5 );
    Key( "AudioFrameInfo.Present", 0 ).U8( 0 );
    VByteWriter Attributes;
    Attributes.U32( 3 );
    Attributes.U32( 14 ).Text( "TicksPerSecond" ).U32( 7 ).U32( 90000 );
    Attributes.U32( 18 ).Text( "FramePeriodInTicks" ).U32( 7 ).U32( 3000 );
    Attributes.U32( 10 ).Text( "Saturation" ).U32( 9 ).U32( 0x40000000u ); // 2.0f

    VRecordingPlan Plan;
    Plan.DescriptionBlock = Description.Bytes;
    Plan.AttributeBlock = Attributes.Bytes;
    Plan.Alignment = 8;
    Plan.Records.push_back( { 0, PatternBytes( 8, 3 ), std::nullopt, std::nullopt } );
    VMemoryRecording Recording( Assemble( Plan ).Bytes );
    ASSERT_TRUE( Recording.bOpened );

    const ZOL::IVideoFrameInfo& rInfo = Recording.Reader.GetVideoFrameInfo();
    EXPECT_EQ( rInfo.TwiceOffsetX, 6 );
    EXPECT_EQ( rInfo.TwiceOffsetY, 5 );
    EXPECT_EQ( rInfo.ImageWidth, 4 );
    EXPECT_EQ( rInfo.ImageHeight, 2 );
    EXPECT_EQ( rInfo.PixelFormat, ZOL::PixelFormat_BayerGB8 );
    EXPECT_TRUE( rInfo.IsInverted() );
    EXPECT_EQ( rInfo.PixelAspectRatio, 1.5 );
    EXPECT_EQ( Recording.Reader.GetAudioPayload(), ZOL::AudioPayload_None );
    EXPECT_EQ( Recording.Reader.GetVideoTiming().GetFrameRate(), 30.0 );
    EXPECT_EQ( Recording.Reader.GetVideoSettings().Saturation, 2.0f );
    EXPECT_EQ( Recording.Reader.GetVideoSettings().GammaCorrection, 1.0f );
    EXPECT_EQ( Recording.Reader.GetTimecode().Standards, ZOL::TimecodeStandard_None );
    EXPECT_EQ( Recording.Reader.GetAttributes().Size(), 3u );

    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Recording.Reader.ReadFrameData( 0, pVideo, Audio, true, true ) );
    ExpectSameBytes( *pVideo, Plan.Records[0].Video, "frame 0" );
    EXPECT_TRUE( Audio.empty() );
  }

  TEST( LvidReader, CloseLetsGoButKeepsTheAttributes )
  {
    VMemoryRecording Recording( Assemble( SmallPlan() ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    Recording.Reader.Close();
    EXPECT_EQ( Recording.Reader.GetFrameCount(), 0u );
    EXPECT_EQ( Recording.Reader.GetVideoFrameInfo(), ZOL::IVideoFrameInfo() );
    EXPECT_EQ( Recording.Reader.GetAudioFrameInfo(), ZOL::IAudioFrameInfo() );
    EXPECT_TRUE( Recording.Reader.GetAttributes() == MakeFileAttributes() );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    EXPECT_FALSE( Recording.Reader.ReadFrameData( 0, pVideo, Audio, true, true ) );
    // Opening again starts over.
    EXPECT_TRUE( Recording.Reader.Open(
        std::make_shared< UtilsIO::VMemoryInputStream >( Recording.Bytes.data(), Recording.Bytes.size() ) ) );
    EXPECT_EQ( Recording.Reader.GetFrameCount(), 3u );
  }

  TEST( LvidReader, BuffersComeFromTheCallersAllocators )
  {
    VMemoryRecording Recording( Assemble( SmallPlan() ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    auto pVideoAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
    auto pAudioAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
    EXPECT_TRUE( Recording.Reader.SetBufferAllocators( pVideoAllocator, pAudioAllocator, nullptr ) );
    const long VideoUses = pVideoAllocator.use_count();
    const long AudioUses = pAudioAllocator.use_count();
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Recording.Reader.ReadFrameData( 0, pVideo, Audio, true, true ) );
    // Each buffer out holds its allocator.
    EXPECT_EQ( pVideoAllocator.use_count(), VideoUses + 1 );
    EXPECT_EQ( pAudioAllocator.use_count(), AudioUses + 1 );
  }

  TEST( LvidWriter, RefusesWhatItCannotRecord )
  {
    VTempDir Dir;
    const std::string Path = Dir.File( "kept.lvid" );
    ASSERT_TRUE( WriteFile( Path, VBytes{ 1, 2, 3 } ) );
    LumekVideo::VWriter Writer;
    // Neither call may touch the file that is there.
    EXPECT_FALSE( Writer.Create( Path, ZOL::IVideoFrameInfo(), ZOL::IAudioFrameInfo(), {} ) );
    EXPECT_FALSE( Writer.Create( Path, s_SmallVideo, ZOL::IAudioFrameInfo(), {}, 0 ) );
    EXPECT_EQ( ReadFile( Path ), ( VBytes{ 1, 2, 3 } ) );
    EXPECT_FALSE( Writer.Create( Dir.File( "no/such/folder.lvid" ), s_SmallVideo, ZOL::IAudioFrameInfo(), {} ) );

    ASSERT_TRUE( Writer.Create( Path, s_SmallVideo, ZOL::IAudioFrameInfo(), {} ) );
    EXPECT_FALSE( Writer.Create( Path, s_SmallVideo, ZOL::IAudioFrameInfo(), {} ) );
    const VBytes Frame = PatternBytes( 15, 0 );
    EXPECT_FALSE( Writer.AppendFrame( 0, Frame.data(), 14 ) );
    EXPECT_FALSE( Writer.AppendFrame( 0, nullptr, 15 ) );
    EXPECT_FALSE( Writer.AppendFrame( 0, Frame.data(), 15, Frame.data(), 4 ) ); // audio without audio
    EXPECT_FALSE( Writer.AppendFrame( ~std::uint64_t( 0 ), Frame.data(), 15 ) );
    // Refused calls leave the recording usable.
    EXPECT_TRUE( Writer.AppendFrame( 0, Frame.data(), 15 ) );
    EXPECT_TRUE( Writer.Close() );
    EXPECT_FALSE( Writer.Close() );
    EXPECT_FALSE( Writer.AppendFrame( 1, Frame.data(), 15 ) );

    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetFrameCount(), 1u );
  }

  TEST( LvidReader, OpensOnlyFilesThatAreThere )
  {
    VTempDir Dir;
    LumekVideo::VReader Reader;
    EXPECT_FALSE( Reader.Open( Dir.File( "missing.lvid" ) ) );
    EXPECT_FALSE( Reader.Open( Dir.Path() ) );
    ASSERT_TRUE( WriteFile( Dir.File( "empty.lvid" ), {} ) );
    EXPECT_FALSE( Reader.Open( Dir.File( "empty.lvid" ) ) );
    EXPECT_EQ( Reader.GetFrameCount(), 0u );
  }

  TEST( LvidWriter, FullDiscMakesCloseFail )
  {
    // Small writes sit in the stream's buffer and only fail when it is flushed: a writer that
    // did not ask at the end would report a recording that is not there.
    if( !boost::filesystem::exists( "/dev/full" ) )
      GTEST_SKIP() << "no /dev/full here";
    LumekVideo::VWriter Writer;
    ASSERT_TRUE( Writer.Create( "/dev/full", s_SmallVideo, ZOL::IAudioFrameInfo(), {}, 16 ) );
    const VBytes Frame = PatternBytes( 15, 0 );
    Writer.AppendFrame( 0, Frame.data(), Frame.size() );
    EXPECT_FALSE( Writer.Close() );
  }

  TEST( LvidWriter, DestructionFinishesTheRecording )
  {
    VTempDir Dir;
    const std::string Path = Dir.File( "dropped.lvid" );
    const VBytes Frame = PatternBytes( 15, 0 );
    {
      LumekVideo::VWriter Writer;
      ASSERT_TRUE( Writer.Create( Path, s_SmallVideo, s_Stereo16, MakeFileAttributes() ) );
      ASSERT_TRUE( Writer.AppendFrame( 3, Frame.data(), Frame.size() ) );
    }
    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetFrameCount(), 4u );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Reader.ReadFrameData( 3, pVideo, Audio, true, true ) );
    ExpectSameBytes( *pVideo, Frame, "frame 3" );
    EXPECT_TRUE( Audio.empty() );
  }
} // namespace
