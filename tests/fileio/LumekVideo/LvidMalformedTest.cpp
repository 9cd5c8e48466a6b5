// Every way an .lvid recording can be broken gives a false result: never a crash, a hang or an
// allocation the file's size does not justify.

#include "fileio/LumekVideo/VReader.h"
#include "services/ILogCategorised.h"
#include "tests/fileio/LumekVideo/LvidTestSupport.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <limits>

using namespace LumekVideoTest;

namespace
{
  constexpr std::uint64_t Largest = std::numeric_limits< std::uint64_t >::max();
  const ZOL::IVideoFrameInfo s_Video = MakeVideo( ZOL::PixelFormat_Luminance8, 5, 3 );
  const ZOL::IAudioFrameInfo s_Audio = MakeAudio( ZOL::AudioSampleFormat_Int16, 2 );

  VRecordingPlan BasePlan()
  {
    VRecordingPlan Plan;
    Plan.DescriptionBlock = DescriptionBlock( s_Video, s_Audio );
    Plan.AttributeBlock = SerialiseStore( MakeFileAttributes() );
    Plan.Alignment = 16;
    for( std::uint32_t i = 0; i < 3; ++i )
      Plan.Records.push_back( { i, PatternBytes( 15, i ), PatternBytes( 4 * ( i + 1 ), 40 + i ), std::nullopt } );
    return Plan;
  }

  VBytes WithDescription( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio )
  {
    VRecordingPlan Plan = BasePlan();
    Plan.DescriptionBlock = DescriptionBlock( i_rVideo, i_rAudio );
    return Assemble( Plan ).Bytes;
  }

  VBytes WithoutDescriptionKey( const std::string& i_rKey )
  {
    VRecordingPlan Plan = BasePlan();
    ZOL::IVideoAttributes Store;
    ZOL::WriteVideoFrameInfo( Store, s_Video );
    ZOL::WriteAudioFrameInfo( Store, "", s_Audio );
    Store.Remove( i_rKey );
    Plan.DescriptionBlock = SerialiseStore( Store );
    return Assemble( Plan ).Bytes;
  }

  // A change to the base recording, with the record and index positions at hand.
  using VMutation = std::function< void( VBytes&, const VAssembled& ) >;

  std::size_t IndexEntry( const VAssembled& i_rFile, std::size_t i_Entry )
  {
    return static_cast< std::size_t >( i_rFile.IndexOffset + 8 + 16 * i_Entry );
  }

  struct VBrokenCase
  {
    const char* Name;
    std::function< VBytes() > Make;
    bool bOpens;
    // Whether ReadFrameData with video and audio succeeds for frames 0, 1 and 2.
    std::array< bool, 3 > Frames;
  };

  VBytes Mutated( const VMutation& i_rMutation )
  {
    const VAssembled File = Assemble( BasePlan() );
    VBytes Bytes = File.Bytes;
    i_rMutation( Bytes, File );
    return Bytes;
  }

  std::size_t BlocksEnd()
  {
    const VRecordingPlan Plan = BasePlan();
    return 48 + Plan.DescriptionBlock.size() + Plan.AttributeBlock.size();
  }

  constexpr std::array< bool, 3 > All{ true, true, true };
  constexpr std::array< bool, 3 > None{ false, false, false };
  constexpr std::array< bool, 3 > AllButMiddle{ true, false, true };

  const VBrokenCase s_BrokenCases[] = {
      { "Empty", [] { return VBytes(); }, false, None },
      { "ShortHeader", [] { return Mutated( []( VBytes& b, const VAssembled& ) { b.resize( 47 ); } ); }, false, None },
      { "HeaderOnly", [] { return Mutated( []( VBytes& b, const VAssembled& ) { b.resize( 48 ); } ); }, false, None },
      { "BadMagicFirstByte", [] { return Mutated( []( VBytes& b, const VAssembled& ) { b[0] = '$'; } ); }, false,
        None },
      { "BadMagicLastByte", [] { return Mutated( []( VBytes& b, const VAssembled& ) { b[19] = 0; } ); }, false, None },
      { "FormatVersion2", [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU32( b, 24, 2 ); } ); }, false,
        None },
      { "FormatVersion0", [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU32( b, 24, 0 ); } ); }, false,
        None },
      { "AnySignatureAndRevision",
        []
        {
          return Mutated(
              []( VBytes& b, const VAssembled& )
              {
                PatchU32( b, 20, 0xDEADBEEF );
                PatchU32( b, 28, 0xFFFFFFFF );
              } );
        },
        true, All },
      { "DescriptionBlockCut", [] { return Mutated( []( VBytes& b, const VAssembled& ) { b.resize( 48 + 20 ); } ); },
        false, None },
      { "AttributeBlockCut",
        [] { return Mutated( []( VBytes& b, const VAssembled& ) { b.resize( BlocksEnd() - 1 ); } ); }, false, None },
      { "NoPixelFormat", [] { return WithoutDescriptionKey( "VideoFrameInfo.PixelFormat" ); }, false, None },
      { "NoImageHeight", [] { return WithoutDescriptionKey( "VideoFrameInfo.ImageHeight" ); }, false, None },
      { "NoAudioPresent", [] { return WithoutDescriptionKey( "AudioFrameInfo.Present" ); }, false, None },
      { "IndexOffsetAtEnd",
        [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU64( b, 40, b.size() ); } ); }, false, None },
      { "IndexOffsetSevenBeforeEnd",
        [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU64( b, 40, b.size() - 7 ); } ); }, false,
        None },
      { "IndexOffsetPastEnd",
        [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU64( b, 40, b.size() + 4096 ); } ); }, false,
        None },
      { "IndexOffsetNegative",
        [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU64( b, 40, Largest ); } ); }, false, None },
      { "EntryCountZero",
        [] { return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU64( b, f.IndexOffset, 0 ); } ); }, true,
        None },
      // The entries that are there stay readable, as after any short read of the index.
      { "EntryCountOneTooMany",
        [] { return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU64( b, f.IndexOffset, 4 ); } ); }, false,
        All },
      { "EntryCountHuge",
        [] { return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU64( b, f.IndexOffset, Largest / 2 ); } ); },
        false, All },
      { "IndexCut",
        [] { return Mutated( []( VBytes& b, const VAssembled& ) { b.resize( b.size() - 3 ); } ); },
        false,
        { true, true, false } },
      { "FrameNumberLargest",
        [] { return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU64( b, IndexEntry( f, 2 ), Largest ); } ); },
        false,
        { true, true, false } },
      { "FrameOffsetAtEnd",
        [] {
          return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU64( b, IndexEntry( f, 1 ) + 8, b.size() ); } );
        },
        true, AllButMiddle },
      { "FrameOffsetLastByte",
        [] {
          return Mutated( []( VBytes& b, const VAssembled& f )
                          { PatchU64( b, IndexEntry( f, 1 ) + 8, b.size() - 1 ); } );
        },
        true, AllButMiddle },
      { "FrameOffsetNegative",
        []
        { return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU64( b, IndexEntry( f, 1 ) + 8, Largest ); } ); },
        true, AllButMiddle },
      { "FrameOffsetLargestPositive",
        [] {
          return Mutated( []( VBytes& b, const VAssembled& f )
                          { PatchU64( b, IndexEntry( f, 1 ) + 8, Largest / 2 ); } );
        },
        true, AllButMiddle },
      { "ZeroAlignment", [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU64( b, 32, 0 ); } ); }, true,
        None },
      { "AlignmentHuge",
        [] { return Mutated( []( VBytes& b, const VAssembled& ) { PatchU64( b, 32, Largest / 2 + 2 ); } ); }, true,
        None },
      { "AudioByteCountHuge",
        [] { return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU32( b, f.RecordOffsets[1] + 16, ~0u ); } ); },
        true, AllButMiddle },
      { "AudioByteCountPastEnd",
        [] {
          return Mutated( []( VBytes& b, const VAssembled& f ) { PatchU32( b, f.RecordOffsets[1] + 16, b.size() ); } );
        },
        true, AllButMiddle },
      // A description whose frames could not fit in any file: nothing may be allocated for it.
      { "HugeFrameSize",
        [] { return WithDescription( MakeVideo( ZOL::PixelFormat_R8G8B8u8, 0x7FFFFFFF, 0x7FFFFFFF ), s_Audio ); }, true,
        None },
      { "FrameSizeJustBeyondTheFile",
        [] { return WithDescription( MakeVideo( ZOL::PixelFormat_Luminance8, 1000, 1000 ), s_Audio ); }, true, None },
  };

  void PrintTo( const VBrokenCase& i_rCase, std::ostream* o_pStream )
  {
    *o_pStream << i_rCase.Name;
  }

  class LvidBrokenFile : public testing::TestWithParam< VBrokenCase >
  {
  protected:
    void SetUp() override
    {
      // No failure of any kind may reach the log: in particular no allocation was attempted.
      m_Sink = ZOL::GlobalLog().AddSink(
          [this]( const ZOL::ILogRecord& i_rRecord ) { m_Lines.push_back( i_rRecord.Message ); }, ZOL::LogDetail );
    }
    void TearDown() override { ZOL::GlobalLog().RemoveSink( m_Sink ); }

    int m_Sink = 0;
    std::vector< std::string > m_Lines;
  };

  TEST_P( LvidBrokenFile, FailsWithFalse )
  {
    const VBrokenCase& rCase = GetParam();
    const VBytes Bytes = rCase.Make();
    LumekVideo::VReader Reader;
    EXPECT_EQ( Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( Bytes.data(), Bytes.size() ) ),
               rCase.bOpens );
    const VRecordingPlan Plan = BasePlan();
    for( std::uint64_t Frame = 0; Frame < 3; ++Frame )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      const bool bRead = Reader.ReadFrameData( Frame, pVideo, Audio, true, true );
      EXPECT_EQ( bRead, rCase.Frames[Frame] ) << "frame " << Frame;
      if( bRead )
      {
        ASSERT_TRUE( pVideo );
        EXPECT_EQ( VBytes( pVideo->GetData(), pVideo->GetData() + pVideo->GetSize() ), Plan.Records[Frame].Video );
      }
    }
    EXPECT_TRUE( m_Lines.empty() ) << m_Lines.front();
  }

  INSTANTIATE_TEST_SUITE_P( Cases, LvidBrokenFile, testing::ValuesIn( s_BrokenCases ),
                            []( const testing::TestParamInfo< VBrokenCase >& i_rInfo ) { return i_rInfo.param.Name; } );

  TEST( LvidReader, DescriptionWithoutVideoOpensWithEmptyFrames )
  {
    // "VideoFrameInfo.Present" false is a valid description of no video: such a recording
    // opens, and its frames are their audio alone.
    VRecordingPlan Plan = BasePlan();
    Plan.DescriptionBlock = DescriptionBlock( ZOL::IVideoFrameInfo(), s_Audio );
    for( VRecord& rRecord : Plan.Records )
      rRecord.Video.clear();
    const VBytes Bytes = Assemble( Plan ).Bytes;
    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( Bytes.data(), Bytes.size() ) ) );
    EXPECT_FALSE( Reader.GetVideoFrameInfo().IsValid() );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Reader.ReadFrameData( 2, pVideo, Audio, true, true ) );
    EXPECT_EQ( pVideo->GetSize(), 0u );
    EXPECT_EQ( VBytes( Audio.at( 0 )->GetData(), Audio.at( 0 )->GetData() + Audio.at( 0 )->GetSize() ),
               *Plan.Records[2].Audio );
  }

  TEST( LvidBrokenFile, ZeroAlignmentStillGivesVideoAlone )
  {
    // Without audio there is no alignment step, so the pixels of such a file can still be read.
    const VBytes Bytes = Mutated( []( VBytes& b, const VAssembled& ) { PatchU64( b, 32, 0 ); } );
    LumekVideo::VReader Reader;
    ASSERT_TRUE( Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( Bytes.data(), Bytes.size() ) ) );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    EXPECT_TRUE( Reader.ReadFrameData( 1, pVideo, Audio, true, false ) );
    EXPECT_FALSE( Reader.ReadFrameData( 1, pVideo, Audio, false, true ) );
  }

  // Reads everything a damaged file offers; what matters is that it returns.
  void ReadEverything( const VBytes& i_rBytes, bool& o_rOpened )
  {
    LumekVideo::VReader Reader;
    o_rOpened = Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( i_rBytes.data(), i_rBytes.size() ) );
    for( std::uint64_t Frame = 0; Frame < 8; ++Frame )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      Reader.ReadFrameData( Frame, pVideo, Audio, true, true );
      Reader.ReadFrameData( Frame, pVideo, Audio, false, true );
      Reader.ReadFrameData( Frame, pVideo, Audio, true, false );
    }
  }

  TEST( LvidDamageSweep, EveryCutFailsToOpen )
  {
    // The index is the last thing in a recording, so every shorter file lacks part of it.
    const VBytes Whole = Assemble( BasePlan() ).Bytes;
    for( std::size_t Length = 0; Length < Whole.size(); ++Length )
    {
      bool bOpened = true;
      ReadEverything( VBytes( Whole.begin(), Whole.begin() + Length ), bOpened );
      EXPECT_FALSE( bOpened ) << "cut at " << Length;
    }
  }

  TEST( LvidDamageSweep, EveryFlippedByteReturns )
  {
    const VAssembled File = Assemble( BasePlan() );
    for( std::size_t Position = 0; Position < File.Bytes.size(); ++Position )
      for( std::uint8_t Mask : { 0x01, 0x80, 0xFF } )
      {
        VBytes Bytes = File.Bytes;
        Bytes[Position] ^= Mask;
        bool bOpened = false;
        ReadEverything( Bytes, bOpened );
        // Opening never reads the records: damage there shows only when a frame is read.
        const bool bInRecords = Position >= File.RecordOffsets.front() && Position < File.IndexOffset;
        if( bInRecords )
        {
          EXPECT_TRUE( bOpened ) << "flip at " << Position;
        }
      }
  }
} // namespace

namespace
{
  // Fails the n-th seek from the moment it is told to.
  class VSeekFailingStream : public UtilsIO::VMemoryInputStream
  {
  public:
    using UtilsIO::VMemoryInputStream::VMemoryInputStream;
    bool Seek( std::int64_t i_Position ) override
    {
      return ++m_Seeks != m_FailingSeek && UtilsIO::VMemoryInputStream::Seek( i_Position );
    }
    void FailSeek( int i_Number )
    {
      m_Seeks = 0;
      m_FailingSeek = i_Number;
    }

  private:
    int m_Seeks = 0;
    int m_FailingSeek = 0;
  };

  // Audio alone skips the video by a seek; reading on after a failed one would take the video's
  // bytes for the audio's count and samples.
  TEST( LvidReader, AudioAloneFailsWhenTheSeekPastTheVideoFails )
  {
    // The video itself starts like an audio block, so that reading on from the wrong place
    // would seem to work.
    VRecordingPlan Plan = BasePlan();
    Plan.Records[0].Video = { 4, 0, 0, 0, 0xA1, 0xA2, 0xA3, 0xA4, 9, 9, 9, 9, 9, 9, 9 };
    const VBytes Bytes = Assemble( Plan ).Bytes;
    for( const bool bFail : { false, true } )
    {
      auto pStream = std::make_shared< VSeekFailingStream >( Bytes.data(), Bytes.size() );
      LumekVideo::VReader Reader;
      ASSERT_TRUE( Reader.Open( pStream ) );
      // The first seek goes to the frame, the second past its video.
      pStream->FailSeek( bFail ? 2 : 0 );
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      const bool bRead = Reader.ReadFrameData( 0, pVideo, Audio, false, true );
      EXPECT_EQ( bRead, !bFail );
      if( bRead )
      {
        ASSERT_EQ( Audio.size(), 1u );
        EXPECT_EQ( VBytes( Audio[0]->GetData(), Audio[0]->GetData() + Audio[0]->GetSize() ), *Plan.Records[0].Audio );
      }
    }
  }
} // namespace
