// Writer to reader round trips, the reader on recordings assembled by hand, and every way a
// recording can be broken giving a false result: never a crash, a hang or an allocation the
// file's size does not justify.

#include "fileio/LumekVideo/VWriter.h"
#include "tests/fileio/LumekVideo/LvidTestSupport.h"
#include "tests/support/LogCapture.h"
#include "videointerface/BufferAllocators.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <limits>
#include <string>
#include <tuple>

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
    VTempFolder Dir;
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

  TEST( LvidWriter, RefusesWhatItCannotRecordAndFailsCloseOnAFullDisc )
  {
    VTempFolder Dir;
    const std::string Path = Dir.File( "kept.lvid" );
    ASSERT_TRUE( WriteFileBytes( Path, VBytes{ 1, 2, 3 } ) );
    LumekVideo::VWriter Writer;
    // Neither call may touch the file that is there.
    EXPECT_FALSE( Writer.Create( Path, ZOL::IVideoFrameInfo(), ZOL::IAudioFrameInfo(), {} ) );
    EXPECT_FALSE( Writer.Create( Path, s_SmallVideo, ZOL::IAudioFrameInfo(), {}, 0 ) );
    EXPECT_EQ( ReadFileBytes( Path ), ( VBytes{ 1, 2, 3 } ) );
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
    // Small writes sit in the stream's buffer and only fail when it is flushed: a writer that
    // did not ask at the end would report a recording that is not there.
    if( boost::filesystem::exists( "/dev/full" ) )
    {
      ASSERT_TRUE( Writer.Create( "/dev/full", s_SmallVideo, ZOL::IAudioFrameInfo(), {}, 16 ) );
      Writer.AppendFrame( 0, Frame.data(), Frame.size() );
      EXPECT_FALSE( Writer.Close() );
    }

    LumekVideo::VReader Reader;
    EXPECT_FALSE( Reader.Open( Dir.File( "missing.lvid" ) ) );
    EXPECT_FALSE( Reader.Open( Dir.Path() ) );
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetFrameCount(), 1u );
  }

  constexpr std::uint64_t Largest = std::numeric_limits< std::uint64_t >::max();

  // A change to the small recording, with its record and index positions at hand.
  using VMutation = std::function< void( VBytes&, const VAssembled& ) >;

  std::size_t Entry( const VAssembled& i_rFile, std::size_t i_Entry )
  {
    return static_cast< std::size_t >( i_rFile.IndexOffset + 8 + 16 * i_Entry );
  }

  // The recording with another frame description, or with one key left out of it.
  VMutation Described( const ZOL::IVideoFrameInfo& i_rVideo, const std::string& i_rWithoutKey = "" )
  {
    return [=]( VBytes& b, const VAssembled& )
    {
      VRecordingPlan Plan = SmallPlan();
      Plan.DescriptionBlock = DescriptionBlock( i_rVideo, s_Stereo16, i_rWithoutKey );
      b = Assemble( Plan ).Bytes;
    };
  }

  using VFrames = std::array< bool, 3 >;
  constexpr VFrames All{ true, true, true }, None{ false, false, false }, AllButMiddle{ true, false, true };
  constexpr VFrames FirstTwo{ true, true, false };

  struct VBrokenCase
  {
    const char* Name;
    VMutation Break;
    bool bOpens;
    VFrames Frames; // whether frames 0, 1 and 2 read, video and sound
  };

  // Short names for the two arguments of every row: the bytes, and where things are in them.
  using B = VBytes;
  using F = const VAssembled;
  const VBrokenCase s_BrokenCases[] = {
      { "BadMagicLastByte", []( B& b, F& ) { b[19] = 0; }, false, None },
      { "FormatVersion2", []( B& b, F& ) { Patch( b, 24, 2, 4 ); }, false, None },
      { "AnySignatureAndRevision",
        []( B& b, F& )
        {
          Patch( b, 20, 0xDEADBEEF, 4 );
          Patch( b, 28, 0xFFFFFFFF, 4 );
        },
        true, All },
      { "NoPixelFormat", Described( s_SmallVideo, "VideoFrameInfo.PixelFormat" ), false, None },
      { "NoImageHeight", Described( s_SmallVideo, "VideoFrameInfo.ImageHeight" ), false, None },
      { "NoAudioPresent", Described( s_SmallVideo, "AudioFrameInfo.Present" ), false, None },
      { "IndexOffsetAtEnd", []( B& b, F& ) { Patch( b, 40, b.size() ); }, false, None },
      { "IndexOffsetSevenBeforeEnd", []( B& b, F& ) { Patch( b, 40, b.size() - 7 ); }, false, None },
      { "IndexOffsetNegative", []( B& b, F& ) { Patch( b, 40, Largest ); }, false, None },
      { "EntryCountZero", []( B& b, F& f ) { Patch( b, f.IndexOffset, 0 ); }, true, None },
      // The entries that are there stay readable, as after any short read of the index.
      { "EntryCountOneTooMany", []( B& b, F& f ) { Patch( b, f.IndexOffset, 4 ); }, false, All },
      { "EntryCountHuge", []( B& b, F& f ) { Patch( b, f.IndexOffset, Largest / 2 ); }, false, All },
      { "IndexCut", []( B& b, F& ) { b.resize( b.size() - 3 ); }, false, FirstTwo },
      { "FrameNumberLargest", []( B& b, F& f ) { Patch( b, Entry( f, 2 ), Largest ); }, false, FirstTwo },
      { "FrameOffsetAtEnd", []( B& b, F& f ) { Patch( b, Entry( f, 1 ) + 8, b.size() ); }, true, AllButMiddle },
      { "FrameOffsetLastByte", []( B& b, F& f ) { Patch( b, Entry( f, 1 ) + 8, b.size() - 1 ); }, true, AllButMiddle },
      { "FrameOffsetNegative", []( B& b, F& f ) { Patch( b, Entry( f, 1 ) + 8, Largest ); }, true, AllButMiddle },
      { "ZeroAlignment", []( B& b, F& ) { Patch( b, 32, 0 ); }, true, None },
      { "AlignmentHuge", []( B& b, F& ) { Patch( b, 32, Largest / 2 + 2 ); }, true, None },
      { "AudioByteCountHuge", []( B& b, F& f ) { Patch( b, f.RecordOffsets[1] + 16, ~0u, 4 ); }, true, AllButMiddle },
      { "AudioByteCountPastEnd", []( B& b, F& f ) { Patch( b, f.RecordOffsets[1] + 16, b.size(), 4 ); }, true,
        AllButMiddle },
      // A description whose frames could not fit in any file: nothing may be allocated for it.
      { "HugeFrameSize", Described( MakeVideo( ZOL::PixelFormat_R8G8B8u8, 0x7FFFFFFF, 0x7FFFFFFF ) ), true, None },
      { "FrameSizeJustBeyondTheFile", Described( MakeVideo( ZOL::PixelFormat_Luminance8, 1000, 1000 ) ), true, None },
  };

  TEST( LvidBrokenFile, FailsWithFalse )
  {
    const VRecordingPlan Plan = SmallPlan();
    const VAssembled File = Assemble( Plan );
    for( const VBrokenCase& rCase : s_BrokenCases )
    {
      SCOPED_TRACE( rCase.Name );
      // No failure of any kind may reach the log: in particular no allocation was attempted.
      LumekTest::VLogCapture Log;
      VBytes Bytes = File.Bytes;
      rCase.Break( Bytes, File );
      VMemoryRecording Recording( Bytes );
      EXPECT_EQ( Recording.bOpened, rCase.bOpens );
      for( std::uint64_t Frame = 0; Frame < 3; ++Frame )
      {
        const auto Read = ReadBytes( Recording.Reader, Frame );
        EXPECT_EQ( Read.has_value(), rCase.Frames[Frame] ) << "frame " << Frame;
        if( Read )
        {
          EXPECT_EQ( Read->Video, Plan.Records[Frame].Video ) << "frame " << Frame;
        }
      }
      EXPECT_TRUE( Log.Messages.empty() ) << Log.Messages.front();
    }
  }

  // Reads everything a damaged file offers; what matters is that it returns.
  bool OpenAndReadEverything( const VBytes& i_rBytes )
  {
    VMemoryRecording Recording( i_rBytes );
    for( std::uint64_t Frame = 0; Frame < 8; ++Frame )
      for( const auto& [bVideo, bAudio] :
           { std::pair( true, true ), std::pair( false, true ), std::pair( true, false ) } )
        ReadBytes( Recording.Reader, Frame, bVideo, bAudio );
    return Recording.bOpened;
  }

  TEST( LvidDamageSweep, EveryCutAndEveryFlippedByteReturns )
  {
    const VAssembled File = Assemble( SmallPlan() );
    // The index is the last thing in a recording, so every shorter file lacks part of it. None of
    // them may reach the log: in particular no allocation was attempted.
    LumekTest::VLogCapture Log;
    for( std::size_t Length = 0; Length < File.Bytes.size(); ++Length )
      EXPECT_FALSE( OpenAndReadEverything( VBytes( File.Bytes.begin(), File.Bytes.begin() + Length ) ) )
          << "cut at " << Length;
    EXPECT_TRUE( Log.Messages.empty() ) << Log.Messages.front();
    for( std::size_t Position = 0; Position < File.Bytes.size(); ++Position )
      for( std::uint8_t Mask : { 0x01, 0x80, 0xFF } )
      {
        VBytes Bytes = File.Bytes;
        Bytes[Position] ^= Mask;
        // Opening never reads the records: damage there shows only when a frame is read.
        const bool bInRecords = Position >= File.RecordOffsets.front() && Position < File.IndexOffset;
        EXPECT_TRUE( OpenAndReadEverything( Bytes ) || !bInRecords ) << "flip at " << Position;
      }
  }

  // Fails the n-th seek after the count is reset, none while FailingSeek is 0.
  struct VSeekFailingStream : UtilsIO::VMemoryInputStream
  {
    using UtilsIO::VMemoryInputStream::VMemoryInputStream;
    bool Seek( std::int64_t i_Position ) override
    {
      return ++Seeks != FailingSeek && UtilsIO::VMemoryInputStream::Seek( i_Position );
    }
    int Seeks = 0, FailingSeek = 0;
  };

  // Sound alone skips the video by a seek; reading on after a failed one would take the video's
  // bytes for the sound's count and samples. Every other failed seek fails the read as well.
  TEST( LvidReader, AudioAloneFailsWhenTheSeekPastTheVideoFails )
  {
    // The video itself starts like a sound block, so that reading on from the wrong place
    // would seem to work.
    VRecordingPlan Plan = SmallPlan();
    Plan.Records[0].Video = { 4, 0, 0, 0, 0xA1, 0xA2, 0xA3, 0xA4, 9, 9, 9, 9, 9, 9, 9 };
    const VBytes Bytes = Assemble( Plan ).Bytes;
    // The first seek goes to the frame; the second past its video, or to the boundary after it.
    const std::tuple< bool, int, bool > Cases[] = {
        { false, 0, true }, { false, 1, false }, { false, 2, false }, { true, 2, false } };
    for( const auto& [bVideo, FailingSeek, bReads] : Cases )
    {
      SCOPED_TRACE( ( bVideo ? "video and sound, seek " : "sound alone, seek " ) + std::to_string( FailingSeek ) );
      auto pStream = std::make_shared< VSeekFailingStream >( Bytes.data(), Bytes.size() );
      LumekVideo::VReader Reader;
      ASSERT_TRUE( Reader.Open( pStream ) );
      pStream->Seeks = 0;
      pStream->FailingSeek = FailingSeek;
      const auto Read = ReadBytes( Reader, 0, bVideo, true );
      EXPECT_EQ( Read.has_value(), bReads );
      if( Read )
      {
        EXPECT_EQ( Read->Audio, std::vector< VBytes >{ *Plan.Records[0].Audio } );
      }
    }
  }
} // namespace
