// Every way an .lvid recording can be broken gives a false result: never a crash, a hang or an
// allocation the file's size does not justify.

#include "tests/fileio/LumekVideo/LvidTestSupport.h"
#include "tests/support/LogCapture.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <limits>
#include <tuple>

using namespace LumekVideoTest;

namespace
{
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

  std::size_t BlocksEnd()
  {
    const VRecordingPlan Plan = SmallPlan();
    return 48 + Plan.DescriptionBlock.size() + Plan.AttributeBlock.size();
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
      { "Empty", []( B& b, F& ) { b.clear(); }, false, None },
      { "ShortHeader", []( B& b, F& ) { b.resize( 47 ); }, false, None },
      { "HeaderOnly", []( B& b, F& ) { b.resize( 48 ); }, false, None },
      { "BadMagicLastByte", []( B& b, F& ) { b[19] = 0; }, false, None },
      { "FormatVersion2", []( B& b, F& ) { Patch( b, 24, 2, 4 ); }, false, None },
      { "AnySignatureAndRevision",
        []( B& b, F& )
        {
          Patch( b, 20, 0xDEADBEEF, 4 );
          Patch( b, 28, 0xFFFFFFFF, 4 );
        },
        true, All },
      { "DescriptionBlockCut", []( B& b, F& ) { b.resize( 48 + 20 ); }, false, None },
      { "AttributeBlockCut", []( B& b, F& ) { b.resize( BlocksEnd() - 1 ); }, false, None },
      { "NoPixelFormat", Described( s_SmallVideo, "VideoFrameInfo.PixelFormat" ), false, None },
      { "NoImageHeight", Described( s_SmallVideo, "VideoFrameInfo.ImageHeight" ), false, None },
      { "NoAudioPresent", Described( s_SmallVideo, "AudioFrameInfo.Present" ), false, None },
      { "IndexOffsetAtEnd", []( B& b, F& ) { Patch( b, 40, b.size() ); }, false, None },
      { "IndexOffsetSevenBeforeEnd", []( B& b, F& ) { Patch( b, 40, b.size() - 7 ); }, false, None },
      { "IndexOffsetPastEnd", []( B& b, F& ) { Patch( b, 40, b.size() + 4096 ); }, false, None },
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
      { "FrameOffsetLargestPositive", []( B& b, F& f ) { Patch( b, Entry( f, 1 ) + 8, Largest / 2 ); }, true,
        AllButMiddle },
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

  TEST( LvidReader, DescriptionWithoutVideoOpensWithEmptyFrames )
  {
    // "VideoFrameInfo.Present" false is a valid description of no video: such a recording
    // opens, and its frames are their sound alone.
    VRecordingPlan Plan = SmallPlan();
    Plan.DescriptionBlock = DescriptionBlock( ZOL::IVideoFrameInfo(), s_Stereo16 );
    for( VRecord& rRecord : Plan.Records )
      rRecord.Video.clear();
    VMemoryRecording Recording( Assemble( Plan ).Bytes );
    ASSERT_TRUE( Recording.bOpened );
    EXPECT_FALSE( Recording.Reader.GetVideoFrameInfo().IsValid() );
    const auto Read = ReadBytes( Recording.Reader, 2 );
    ASSERT_TRUE( Read );
    EXPECT_TRUE( Read->Video.empty() );
    EXPECT_EQ( Read->Audio.at( 0 ), *Plan.Records[2].Audio );
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
    // The index is the last thing in a recording, so every shorter file lacks part of it.
    for( std::size_t Length = 0; Length < File.Bytes.size(); ++Length )
      EXPECT_FALSE( OpenAndReadEverything( VBytes( File.Bytes.begin(), File.Bytes.begin() + Length ) ) )
          << "cut at " << Length;
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
