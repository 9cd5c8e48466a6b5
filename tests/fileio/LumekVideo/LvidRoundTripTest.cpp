// Writer to reader round trips, and the reader on recordings assembled by hand.

#include "fileio/LumekVideo/VWriter.h"
#include "tests/fileio/LumekVideo/LvidTestSupport.h"
#include "videointerface/BufferAllocators.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <string>

using namespace LumekVideoTest;

namespace
{
  struct VFormatCase
  {
    ZOL::EPixelFormat Format;
    std::uint64_t FrameBytes; // of 7 x 3 pixels, worked out by hand from the layout's rules
    ZOL::EAudioSampleFormat Audio;
    int Channels;
    std::uint64_t GroupBytes;
  };

  // A format of each layout family with one sound layout each, every sound layout once. The odd
  // size puts no row or plane on a round number.
  const VFormatCase s_Formats[] = {
      { ZOL::PixelFormat_Luminance8, 21, ZOL::AudioSampleFormat_Unspecified, 0, 0 },
      { ZOL::PixelFormat_BayerGB8, 21, ZOL::AudioSampleFormat_Int8, 1, 1 },
      { ZOL::PixelFormat_R5G6B5, 42, ZOL::AudioSampleFormat_Int16, 2, 4 },
      { ZOL::PixelFormat_B8G8R8, 63, ZOL::AudioSampleFormat_Int24, 2, 6 },
      { ZOL::PixelFormat_R8G8B8u8, 84, ZOL::AudioSampleFormat_Int32, 1, 4 },
      { ZOL::PixelFormat_Y8U8Y8V8, 42, ZOL::AudioSampleFormat_UInt8, 2, 2 },
      // Rows of whole 48-pixel groups of 128 bytes.
      { ZOL::PixelFormat_U10Y10V10Y10, 3 * 128, ZOL::AudioSampleFormat_UInt16, 4, 8 },
      // Packed samples run on across rows; the last byte is partly padding.
      { ZOL::PixelFormat_BayerGB7, 19, ZOL::AudioSampleFormat_UInt24, 3, 9 },
      { ZOL::PixelFormat_Luminance6, 16, ZOL::AudioSampleFormat_UInt32, 1, 4 },
      { ZOL::PixelFormat_PlanarY8U8V8, 42, ZOL::AudioSampleFormat_Float32, 2, 8 },
  };

  // Frames out of order and with gaps; one frame has no sound at all.
  std::vector< VFrameContent > MakeFrames( std::uint64_t i_VideoSize, std::uint64_t i_GroupSize )
  {
    const std::uint64_t Numbers[] = { 2, 0, 3, 9 };
    const std::uint64_t Groups[] = { 3, 0, 1, 800 };
    std::vector< VFrameContent > Frames;
    for( std::uint32_t i = 0; i < 4; ++i )
      Frames.push_back(
          { Numbers[i], PatternBytes( i_VideoSize, 100 + i ), PatternBytes( Groups[i] * i_GroupSize, 200 + i ) } );
    return Frames;
  }

  TEST( LvidRoundTrip, EveryPixelFormatAndSoundLayoutReadsBackBitForBit )
  {
    // Odd alignments and three-byte samples give records that almost never end on a boundary.
    const std::uint64_t Alignments[] = { 1, 2, 3, 7, 64, 4096, 65536 };
    const ZOL::IVideoAttributes Attributes = MakeFileAttributes();
    for( std::size_t Row = 0; Row < std::size( s_Formats ); ++Row )
    {
      const VFormatCase& rCase = s_Formats[Row];
      const std::uint64_t Alignment = Alignments[Row % std::size( Alignments )];
      SCOPED_TRACE( std::string( ZOL::ToString( rCase.Format ) ) + ", alignment " + std::to_string( Alignment ) );
      const ZOL::IVideoFrameInfo Video = MakeVideo( rCase.Format, 7, 3 );
      const ZOL::IAudioFrameInfo Audio = ZOL::IAudioFrameInfo{ rCase.Audio, 48000, rCase.Channels };
      const bool bHasAudio = rCase.Channels > 0;
      const std::vector< VFrameContent > Frames = MakeFrames( rCase.FrameBytes, rCase.GroupBytes );
      // The writer takes frames of its own idea of the size only.
      VMemoryRecording Recording( WriteToMemory( Video, Audio, Frames, Alignment ) );
      ASSERT_TRUE( Recording.bOpened );
      LumekVideo::VReader& Reader = Recording.Reader;
      EXPECT_EQ( Reader.GetVideoFrameInfo(), Video );
      EXPECT_EQ( Reader.GetAudioFrameInfo(), bHasAudio ? Audio : ZOL::IAudioFrameInfo() );
      EXPECT_EQ( Reader.GetAudioPayload(), bHasAudio ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None );
      EXPECT_TRUE( Reader.GetAttributes() == Attributes );
      EXPECT_EQ( Reader.GetVideoTiming().StartOffsetInTicks, -270000 );
      EXPECT_EQ( Reader.GetVideoSettings().Saturation, 1.25f );
      EXPECT_EQ( Reader.GetFileHeader().Alignment, Alignment );
      EXPECT_EQ( Reader.GetFrameCount(), 10u );
      EXPECT_EQ( Reader.GetStoredFrameCount(), 4u );
      for( const auto& rEntry : Reader.GetFrameIndex() )
        EXPECT_EQ( rEntry.second % Alignment, 0u ) << "frame " << rEntry.first;

      // Each frame twice, in another order than written: nothing may depend on where the
      // previous read left the stream.
      for( int Pass = 0; Pass < 2; ++Pass )
        for( auto it = Frames.rbegin(); it != Frames.rend(); ++it )
        {
          SCOPED_TRACE( "frame " + std::to_string( it->FrameNumber ) );
          // The caller's sound stays when the frame stores none.
          auto pSentinel = std::make_shared< ZOL::IStandardBuffer >();
          std::shared_ptr< ZOL::IBuffer > pVideo;
          ZOL::IAudioBuffers AudioBlocks{ pSentinel };
          ASSERT_TRUE( Reader.ReadFrameData( it->FrameNumber, pVideo, AudioBlocks, true, true ) );
          EXPECT_EQ( BytesOf( *pVideo ), it->Video );
          ASSERT_EQ( AudioBlocks.size(), 1u );
          if( !bHasAudio || it->Audio.empty() )
            EXPECT_EQ( AudioBlocks[0], pSentinel );
          else
            EXPECT_EQ( BytesOf( *AudioBlocks[0] ), it->Audio );
        }
    }
  }

  TEST( LvidRoundTrip, FramesBeyondFourGiBReadBackAndADroppedWriterFinishesTheFile )
  {
    // Every position in the file is 64 bits wide, in the writer, the index and the reader. A
    // sparse gap puts the later frames and the index past 4 GiB without writing gigabytes.
    constexpr std::uint64_t FourGiB = std::uint64_t( 1 ) << 32;
    const std::vector< VFrameContent > Frames = {
        { 0, PatternBytes( 15, 0 ), PatternBytes( 8, 1 ) },
        { 100000, PatternBytes( 15, 2 ), PatternBytes( 8, 3 ) },
        { 3, PatternBytes( 15, 4 ), {} }, // no sound in a recording with sound
    };
    VTempDir Dir;
    const std::string Path = Dir.File( "large.lvid" );
    {
      // Never closed: destruction finishes the recording.
      LumekVideo::VWriter Writer;
      ASSERT_TRUE( Writer.Create( Path, s_SmallVideo, s_Stereo16, MakeFileAttributes() ) );
      for( const VFrameContent& rFrame : Frames )
      {
        if( rFrame.FrameNumber == 100000 )
        {
          ASSERT_TRUE( Writer.SkipBytes( FourGiB + 12345 - Writer.GetPosition() ) );
        }
        ASSERT_TRUE( Writer.AppendFrame( rFrame.FrameNumber, rFrame.Video.data(), rFrame.Video.size(),
                                         rFrame.Audio.data(), rFrame.Audio.size() ) );
      }
    }
    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_GT( Reader.GetFileHeader().IndexOffset, FourGiB );
    EXPECT_EQ( Reader.GetFrameCount(), 100001u );
    EXPECT_GT( Reader.GetFrameIndex().at( 3 ), FourGiB );
    for( const VFrameContent& rFrame : Frames )
    {
      SCOPED_TRACE( "frame " + std::to_string( rFrame.FrameNumber ) );
      const auto Read = ReadBytes( Reader, rFrame.FrameNumber );
      ASSERT_TRUE( Read );
      EXPECT_EQ( Read->Video, rFrame.Video );
      EXPECT_EQ( Read->Audio, rFrame.Audio.empty() ? std::vector< VBytes >() : std::vector< VBytes >{ rFrame.Audio } );
    }
  }

  // The writer lays a recording out exactly as the format describes it, byte for byte.
  TEST( LvidWriter, WritesTheLayoutByteForByte )
  {
    VRecordingPlan Plan = SmallPlan();
    std::vector< VFrameContent > Frames;
    for( VRecord& rRecord : Plan.Records )
    {
      rRecord.FrameNumber = Frames.size() == 1 ? 0 : 2; // frame 2 written twice
      Frames.push_back( { rRecord.FrameNumber, rRecord.Video, *rRecord.Audio } );
    }
    EXPECT_EQ( WriteToMemory( s_SmallVideo, s_Stereo16, Frames, 16 ), Assemble( Plan ).Bytes );
  }

  TEST( LvidReader, LaterDuplicateIndexEntryWinsAndSoundIsCutToWholeGroups )
  {
    // Entries (5, a), (0, b), (5, c): frame 5 is record c. Ten bytes of 16-bit stereo are two
    // whole groups and half of one: eight are read. Three bytes are not one group: an empty block.
    VRecordingPlan Plan = SmallPlan();
    Plan.Records[1].Audio = PatternBytes( 3, 9 );
    Plan.Records[2].Audio = PatternBytes( 10, 9 );
    const VAssembled File = Assemble( Plan, { { 5, 0 }, { 0, 1 }, { 5, 2 } } );
    VMemoryRecording Recording( File.Bytes );
    ASSERT_TRUE( Recording.bOpened );
    LumekVideo::VReader& Reader = Recording.Reader;
    EXPECT_EQ( Reader.GetFrameCount(), 6u );
    EXPECT_TRUE( Reader.HasFrame( 0 ) );
    EXPECT_FALSE( Reader.HasFrame( 3 ) );
    EXPECT_EQ( Reader.GetFrameIndex().at( 5 ), File.RecordOffsets[2] );
    // The gaps answered from the index alone, as the viewer's fallback to an earlier frame asks.
    EXPECT_EQ( Reader.GetStoredFrameCount(), 2u );
    EXPECT_EQ( Reader.FindStoredFrameAtOrBefore( 4 ), std::optional< std::uint64_t >( 0 ) );
    EXPECT_EQ( Reader.FindStoredFrameAtOrAfter( 1 ), std::optional< std::uint64_t >( 5 ) );
    EXPECT_EQ( Reader.FindStoredFrameAtOrAfter( 6 ), std::nullopt );
    const auto Five = ReadBytes( Reader, 5 ), Zero = ReadBytes( Reader, 0 );
    ASSERT_TRUE( Five && Zero );
    EXPECT_EQ( Five->Video, Plan.Records[2].Video );
    EXPECT_EQ( Five->Audio.at( 0 ), VBytes( Plan.Records[2].Audio->begin(), Plan.Records[2].Audio->begin() + 8 ) );
    EXPECT_EQ( Zero->Audio.at( 0 ), VBytes() );
  }

  TEST( LvidReader, OnlyTheRequestedHalvesChange )
  {
    const VRecordingPlan Plan = SmallPlan();
    VMemoryRecording Recording( Assemble( Plan ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    // Each buffer out comes from the caller's allocator and holds it.
    auto pVideoAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
    auto pAudioAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
    EXPECT_TRUE( Recording.Reader.SetBufferAllocators( pVideoAllocator, pAudioAllocator, nullptr ) );
    for( const bool bVideo : { true, false } )
      for( const bool bAudio : { true, false } )
      {
        SCOPED_TRACE( std::string( bVideo ? "video" : "no video" ) + ( bAudio ? ", sound" : ", no sound" ) );
        // What is not asked for keeps what the caller had in it.
        auto pKept = std::make_shared< ZOL::IStandardBuffer >();
        std::shared_ptr< ZOL::IBuffer > pVideo = pKept;
        ZOL::IAudioBuffers Audio{ pKept, pKept };
        const long VideoUses = pVideoAllocator.use_count(), AudioUses = pAudioAllocator.use_count();
        ASSERT_TRUE( Recording.Reader.ReadFrameData( 2, pVideo, Audio, bVideo, bAudio ) );
        EXPECT_EQ( pVideoAllocator.use_count(), VideoUses + ( bVideo ? 1 : 0 ) );
        EXPECT_EQ( pAudioAllocator.use_count(), AudioUses + ( bAudio ? 1 : 0 ) );
        if( bVideo )
          EXPECT_EQ( BytesOf( *pVideo ), Plan.Records[2].Video );
        else
          EXPECT_EQ( pVideo, pKept );
        if( bAudio )
        {
          ASSERT_EQ( Audio.size(), 1u );
          EXPECT_EQ( BytesOf( *Audio[0] ), *Plan.Records[2].Audio );
        }
        else
          EXPECT_EQ( Audio, ( ZOL::IAudioBuffers{ pKept, pKept } ) );
        // ReadFrame changes the description along with the half it reads, and only that.
        const ZOL::IVideoFrameInfo Other = MakeVideo( ZOL::PixelFormat_R8G8B8, 9, 9 );
        ZOL::IVideoFrame Frame;
        Frame.Video = pKept;
        Frame.VideoFrameInfo = Other;
        ASSERT_TRUE( Recording.Reader.ReadFrame( 2, Frame, bVideo, bAudio ) );
        EXPECT_EQ( Frame.VideoFrameInfo, bVideo ? s_SmallVideo : Other );
        EXPECT_EQ( Frame.Video == pKept, !bVideo );
        EXPECT_EQ( Frame.AudioFrameInfo, bAudio ? s_Stereo16 : ZOL::IAudioFrameInfo() );
        // A frame that is not there fails, whatever is asked for.
        EXPECT_FALSE( Recording.Reader.ReadFrameData( 7, pVideo, Audio, bVideo, bAudio ) );
      }
    // Closing lets the file go but keeps its attributes.
    Recording.Reader.Close();
    EXPECT_EQ( Recording.Reader.GetFrameCount(), 0u );
    EXPECT_TRUE( Recording.Reader.GetAttributes() == MakeFileAttributes() );
    EXPECT_FALSE( ReadBytes( Recording.Reader, 0 ) );
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
    EXPECT_FALSE( Writer.AppendFrame( 0, Frame.data(), 15, Frame.data(), 4 ) ); // sound without sound
    EXPECT_FALSE( Writer.AppendFrame( ~std::uint64_t( 0 ), Frame.data(), 15 ) );
    // Refused calls leave the recording usable.
    EXPECT_TRUE( Writer.AppendFrame( 0, Frame.data(), 15 ) );
    EXPECT_TRUE( Writer.Close() );
    EXPECT_FALSE( Writer.Close() );
    EXPECT_FALSE( Writer.AppendFrame( 1, Frame.data(), 15 ) );

    LumekVideo::VReader Reader;
    EXPECT_FALSE( Reader.Open( Dir.File( "missing.lvid" ) ) );
    EXPECT_FALSE( Reader.Open( Dir.Path.string() ) );
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetFrameCount(), 1u );
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
} // namespace
