// Writer to reader round trips, and the reader on recordings assembled by hand.

#include "fileio/LumekVideo/VWriter.h"
#include "tests/fileio/LumekVideo/LvidTestSupport.h"
#include "utils/MemoryStream.h"
#include "videointerface/BufferAllocators.h"

#include <boost/filesystem/operations.hpp>
#include <gtest/gtest.h>

#include <algorithm>
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

  // Each pixel format with one sound layout, the layouts taken in turn: every format and every
  // layout goes through a file without writing every pairing. The odd size puts no row or
  // plane on a round number.
  const VFormatCase s_Formats[] = {
      { ZOL::PixelFormat_Luminance8, 21, ZOL::AudioSampleFormat_Unspecified, 0, 0 },
      { ZOL::PixelFormat_BayerRG8, 21, ZOL::AudioSampleFormat_Int8, 1, 1 },
      { ZOL::PixelFormat_BayerGB8, 21, ZOL::AudioSampleFormat_Int16, 2, 4 },
      { ZOL::PixelFormat_BayerGR8, 21, ZOL::AudioSampleFormat_Int24, 2, 6 },
      { ZOL::PixelFormat_BayerBG8, 21, ZOL::AudioSampleFormat_Int32, 1, 4 },
      { ZOL::PixelFormat_R5G6B5, 42, ZOL::AudioSampleFormat_UInt16, 4, 8 },
      { ZOL::PixelFormat_R8G8B8, 63, ZOL::AudioSampleFormat_Float32, 2, 8 },
      { ZOL::PixelFormat_B8G8R8, 63, ZOL::AudioSampleFormat_UInt8, 2, 2 },
      { ZOL::PixelFormat_R8G8B8u8, 84, ZOL::AudioSampleFormat_UInt24, 3, 9 },
      { ZOL::PixelFormat_B8G8R8u8, 84, ZOL::AudioSampleFormat_UInt32, 1, 4 },
      { ZOL::PixelFormat_U8Y8V8Y8, 42, ZOL::AudioSampleFormat_Unspecified, 0, 0 },
      { ZOL::PixelFormat_Y8U8Y8V8, 42, ZOL::AudioSampleFormat_Int8, 1, 1 },
      // Rows of whole 48-pixel groups of 128 bytes.
      { ZOL::PixelFormat_U10Y10V10Y10, 3 * 128, ZOL::AudioSampleFormat_Int16, 2, 4 },
      // Packed samples run on across rows; the last byte is partly padding.
      { ZOL::PixelFormat_BayerGB7, 19, ZOL::AudioSampleFormat_Int24, 2, 6 },
      { ZOL::PixelFormat_BayerGB6, 16, ZOL::AudioSampleFormat_Int32, 1, 4 },
      { ZOL::PixelFormat_Luminance7, 19, ZOL::AudioSampleFormat_UInt16, 4, 8 },
      { ZOL::PixelFormat_Luminance6, 16, ZOL::AudioSampleFormat_Float32, 2, 8 },
      { ZOL::PixelFormat_PlanarY8U8V8, 42, ZOL::AudioSampleFormat_UInt8, 2, 2 },
      { ZOL::PixelFormat_PlanarR8G8B8, 63, ZOL::AudioSampleFormat_UInt24, 3, 9 },
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
    const ZOL::IVideoAttributes Attributes = MakeFileAttributes();
    for( const VFormatCase& rCase : s_Formats )
    {
      SCOPED_TRACE( ZOL::ToString( rCase.Format ) );
      const ZOL::IVideoFrameInfo Video = MakeVideo( rCase.Format, 7, 3 );
      const ZOL::IAudioFrameInfo Audio = MakeAudio( rCase.Audio, rCase.Channels );
      const bool bHasAudio = rCase.Channels > 0;
      const std::vector< VFrameContent > Frames = MakeFrames( rCase.FrameBytes, rCase.GroupBytes );
      // The writer takes frames of its own idea of the size only.
      VMemoryRecording Recording( WriteToMemory( Video, Audio, Frames ) );
      ASSERT_TRUE( Recording.bOpened );
      LumekVideo::VReader& Reader = Recording.Reader;
      EXPECT_EQ( Reader.GetVideoFrameInfo(), Video );
      EXPECT_EQ( Reader.GetAudioFrameInfo(), bHasAudio ? Audio : ZOL::IAudioFrameInfo() );
      EXPECT_EQ( Reader.GetAudioPayload(), bHasAudio ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None );
      EXPECT_TRUE( Reader.GetAttributes() == Attributes );
      EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, 1350000u );
      EXPECT_EQ( Reader.GetVideoTiming().StartOffsetInTicks, -270000 );
      EXPECT_EQ( Reader.GetVideoSettings().Saturation, 1.25f );
      EXPECT_EQ( Reader.GetFileHeader().Alignment, 4096u );
      EXPECT_EQ( Reader.GetFrameCount(), 10u );
      std::uint64_t Stored = 0;
      for( std::uint64_t i = 0; i < Reader.GetFrameCount(); ++i )
        Stored += Reader.HasFrame( i ) ? 1 : 0;
      EXPECT_EQ( Stored, 4u );

      for( const VFrameContent& rFrame : Frames )
      {
        SCOPED_TRACE( "frame " + std::to_string( rFrame.FrameNumber ) );
        // The caller's sound stays when the frame stores none.
        auto pSentinel = std::make_shared< ZOL::IStandardBuffer >();
        std::shared_ptr< ZOL::IBuffer > pVideo;
        ZOL::IAudioBuffers AudioBlocks{ pSentinel };
        ASSERT_TRUE( Reader.ReadFrameData( rFrame.FrameNumber, pVideo, AudioBlocks, true, true ) );
        EXPECT_EQ( BytesOf( *pVideo ), rFrame.Video );
        ASSERT_EQ( AudioBlocks.size(), 1u );
        if( !bHasAudio || rFrame.Audio.empty() )
          EXPECT_EQ( AudioBlocks[0], pSentinel );
        else
          EXPECT_EQ( BytesOf( *AudioBlocks[0] ), rFrame.Audio );
      }
    }
  }

  TEST( LvidRoundTrip, RecordsStartOnTheBoundariesOfAnyAlignment )
  {
    // Three-byte samples in three channels give records that almost never end on a boundary.
    const std::vector< VFrameContent > Frames = MakeFrames( 45, 9 );
    for( const std::uint64_t Alignment : { 1, 2, 3, 7, 64, 4096, 65536 } )
    {
      SCOPED_TRACE( "alignment " + std::to_string( Alignment ) );
      VMemoryRecording Recording( WriteToMemory( MakeVideo( ZOL::PixelFormat_R8G8B8, 5, 3 ),
                                                 MakeAudio( ZOL::AudioSampleFormat_Int24, 3 ), Frames, Alignment ) );
      ASSERT_TRUE( Recording.bOpened );
      EXPECT_EQ( Recording.Reader.GetFileHeader().Alignment, Alignment );
      for( const auto& rEntry : Recording.Reader.GetFrameIndex() )
        EXPECT_EQ( rEntry.second % Alignment, 0u ) << "frame " << rEntry.first;
      // Reading in another order than writing, and each frame twice, checks that nothing depends
      // on where the previous read left the stream.
      for( int Pass = 0; Pass < 2; ++Pass )
        for( auto it = Frames.rbegin(); it != Frames.rend(); ++it )
        {
          const auto Read = ReadBytes( Recording.Reader, it->FrameNumber );
          ASSERT_TRUE( Read );
          EXPECT_EQ( Read->Video, it->Video );
          if( !it->Audio.empty() )
          {
            EXPECT_EQ( Read->Audio.at( 0 ), it->Audio );
          }
        }
    }
  }

  TEST( LvidRoundTrip, FramesBeyondFourGiBReadBack )
  {
    // Every position in the file is 64 bits wide, in the writer, the index and the reader. A
    // sparse gap puts the second frame and the index past 4 GiB without writing gigabytes.
    constexpr std::uint64_t FourGiB = std::uint64_t( 1 ) << 32;
    constexpr std::size_t FrameSize = 1920 * 1080 * 4;
    const std::uint64_t Numbers[] = { 0, 100000, 3 };
    std::vector< VBytes > Frames, Tones;
    for( std::uint32_t i = 0; i < 3; ++i )
    {
      Frames.push_back( PatternBytes( FrameSize, 1 + i ) );
      Tones.push_back( PatternBytes( 1920 * 4, 4 + i ) );
    }
    VTempDir Dir;
    const std::string Path = Dir.File( "large.lvid" );
    {
      LumekVideo::VWriter Writer;
      ASSERT_TRUE(
          Writer.Create( Path, MakeVideo( ZOL::PixelFormat_R8G8B8u8, 1920, 1080 ), s_Stereo16, MakeFileAttributes() ) );
      for( std::size_t i = 0; i < 3; ++i )
      {
        if( i == 1 )
        {
          ASSERT_TRUE( Writer.SkipBytes( FourGiB + 12345 - Writer.GetPosition() ) );
        }
        ASSERT_TRUE( Writer.AppendFrame( Numbers[i], Frames[i].data(), FrameSize, Tones[i].data(), Tones[i].size() ) );
      }
      ASSERT_TRUE( Writer.Close() );
    }
    ASSERT_GT( boost::filesystem::file_size( Path ), FourGiB + 2 * FrameSize );

    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_GT( Reader.GetFileHeader().IndexOffset, FourGiB );
    EXPECT_EQ( Reader.GetFrameCount(), 100001u );
    EXPECT_GT( Reader.GetFrameIndex().at( 100000 ), FourGiB );
    EXPECT_GT( Reader.GetFrameIndex().at( 3 ), FourGiB );
    for( std::size_t i = 0; i < 3; ++i )
    {
      const auto Read = ReadBytes( Reader, Numbers[i] );
      ASSERT_TRUE( Read ) << "frame " << Numbers[i];
      EXPECT_TRUE( Read->Video == Frames[i] ) << "frame " << Numbers[i];
      ASSERT_EQ( Read->Audio.size(), 1u );
      EXPECT_TRUE( Read->Audio[0] == Tones[i] ) << "frame " << Numbers[i];
    }
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
    EXPECT_EQ( WriteToMemory( s_SmallVideo, s_Stereo16, Frames, 16 ), Assemble( Plan ).Bytes );
  }

  TEST( LvidReader, LaterDuplicateIndexEntryWins )
  {
    // Entries (5, a), (0, b), (5, c): frame 5 is record c.
    const VAssembled File = Assemble( SmallPlan(), { { 5, 0 }, { 0, 1 }, { 5, 2 } } );
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
    const auto Read = ReadBytes( Recording.Reader, 5 );
    ASSERT_TRUE( Read );
    EXPECT_EQ( Read->Video, SmallPlan().Records[2].Video );
  }

  TEST( LvidReader, AudioIsCutToWholeSampleGroups )
  {
    // Ten bytes of 16-bit stereo are two whole groups and half of one: eight bytes are read, and
    // the next record is still found from where reading stopped. Three bytes are not one whole
    // group: an empty block.
    VRecordingPlan Plan = SmallPlan();
    Plan.Records[0].Audio = PatternBytes( 10, 9 );
    Plan.Records[1].Audio = PatternBytes( 3, 9 );
    VMemoryRecording Recording( Assemble( Plan ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    const VBytes Expected[] = {
        VBytes( Plan.Records[0].Audio->begin(), Plan.Records[0].Audio->begin() + 8 ), {}, *Plan.Records[2].Audio };
    for( std::uint64_t Frame = 0; Frame < 3; ++Frame )
    {
      const auto Read = ReadBytes( Recording.Reader, Frame );
      ASSERT_TRUE( Read ) << "frame " << Frame;
      EXPECT_EQ( Read->Audio.at( 0 ), Expected[Frame] ) << "frame " << Frame;
    }
  }

  TEST( LvidReader, OnlyTheRequestedHalvesChange )
  {
    const VRecordingPlan Plan = SmallPlan();
    VMemoryRecording Recording( Assemble( Plan ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    for( const bool bVideo : { true, false } )
      for( const bool bAudio : { true, false } )
      {
        SCOPED_TRACE( std::string( bVideo ? "video" : "no video" ) + ( bAudio ? ", sound" : ", no sound" ) );
        // What is not asked for keeps what the caller had in it.
        auto pKept = std::make_shared< ZOL::IStandardBuffer >();
        std::shared_ptr< ZOL::IBuffer > pVideo = pKept;
        ZOL::IAudioBuffers Audio{ pKept, pKept };
        ASSERT_TRUE( Recording.Reader.ReadFrameData( 2, pVideo, Audio, bVideo, bAudio ) );
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
    Plan.Records.push_back( { 0, PatternBytes( 8, 3 ), std::nullopt } );
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
    const auto Read = ReadBytes( Recording.Reader, 0 );
    ASSERT_TRUE( Read );
    EXPECT_EQ( Read->Video, Plan.Records[0].Video );
    EXPECT_TRUE( Read->Audio.empty() );
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
    EXPECT_FALSE( ReadBytes( Recording.Reader, 0 ) );
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
    EXPECT_FALSE( Writer.AppendFrame( 0, Frame.data(), 15, Frame.data(), 4 ) ); // sound without sound
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
    const auto Read = ReadBytes( Reader, 3 );
    ASSERT_TRUE( Read );
    EXPECT_EQ( Read->Video, Frame );
    EXPECT_TRUE( Read->Audio.empty() );
  }
} // namespace
