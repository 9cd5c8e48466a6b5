// Audio in hand-built files: which wave formats are understood, and which chunks each frame owns.

#include "AviTestSupport.h"

#include <gtest/gtest.h>

using namespace AviTest;

namespace
{
  struct VWaveCase
  {
    const char* Name;
    VBytes Format;
    ZOL::EAudioSampleFormat SampleFormat;
    std::string LogLine;
    // Bytes of one sample group: a chunk of 1920 of them lasts one frame.
    std::size_t GroupBytes = 2;
  };

  class AviWaveFormat : public ::testing::TestWithParam< VWaveCase >
  {
  };

  // 48 kHz, 25 frames a second: one frame is 1920 sample groups.
  VAviSpec AudioSpec( int i_Frames, const VBytes& i_rFormat, const std::vector< std::size_t >& i_rChunkBytes )
  {
    VAviSpec Spec = GreySpec( i_Frames );
    Spec.AudioFormat = i_rFormat;
    for( std::size_t i = 0; i < i_rChunkBytes.size(); ++i )
      Spec.AudioChunks.push_back( Frame( i_rChunkBytes[i], static_cast< std::uint8_t >( 0x80 + i ) ) );
    return Spec;
  }

  std::vector< std::size_t > AudioSizes( const RapidAVI::VRapidAVIReader& i_rReader, std::uint64_t i_Frame )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    std::vector< std::size_t > Sizes;
    if( !const_cast< RapidAVI::VRapidAVIReader& >( i_rReader ).ReadFrameData( i_Frame, pVideo, Audio, true, true ) )
      return { 999999 };
    for( const auto& pBlock : Audio )
      Sizes.push_back( static_cast< std::size_t >( pBlock->GetSize() ) );
    return Sizes;
  }
} // namespace

TEST_P( AviWaveFormat, SampleFormat )
{
  const VWaveCase& rCase = GetParam();
  VLogCapture Log;
  const std::size_t ChunkBytes = 1920 * rCase.GroupBytes;
  VOpenedAvi Avi = OpenAvi( BuildAvi( AudioSpec( 2, rCase.Format, { ChunkBytes, ChunkBytes } ) ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetAudioFrameInfo().SampleFormat, rCase.SampleFormat );
  const bool bAudio = rCase.SampleFormat != ZOL::AudioSampleFormat_Unspecified;
  EXPECT_EQ( Avi.pReader->GetAudioPayload(), bAudio ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None );
  if( !rCase.LogLine.empty() )
  {
    EXPECT_TRUE( Log.Contains( rCase.LogLine ) );
  }
  // Unusable audio leaves every frame readable, without sound.
  for( std::uint64_t i = 0; i < 2; ++i )
    EXPECT_EQ( AudioSizes( *Avi.pReader, i ),
               bAudio ? std::vector< std::size_t >{ ChunkBytes } : std::vector< std::size_t >{} );
}

INSTANTIATE_TEST_SUITE_P(
    Cases, AviWaveFormat,
    ::testing::Values(
        VWaveCase{ "PcmU8", WaveFormat( 1, 2, 48000, 8 ), ZOL::AudioSampleFormat_UInt8, "", 2 },
        VWaveCase{ "PcmS16", WaveFormat( 1, 1, 48000, 16 ), ZOL::AudioSampleFormat_Int16, "" },
        VWaveCase{ "ExtensibleS24", ExtensibleWaveFormat( false, 2, 48000, 24 ), ZOL::AudioSampleFormat_Int24, "", 6 },
        VWaveCase{ "ExtensibleS32", ExtensibleWaveFormat( false, 1, 48000, 32 ), ZOL::AudioSampleFormat_Int32, "", 4 },
        VWaveCase{ "ExtensibleFloat", ExtensibleWaveFormat( true, 1, 48000, 32 ), ZOL::AudioSampleFormat_Float32, "",
                   4 },
        VWaveCase{ "ExtensibleFloat64", ExtensibleWaveFormat( true, 1, 48000, 64 ), ZOL::AudioSampleFormat_Unspecified,
                   "Unsupported audio bits per sample in AVI file." },
        VWaveCase{ "PcmS12", WaveFormat( 1, 1, 48000, 12 ), ZOL::AudioSampleFormat_Unspecified,
                   "Unsupported audio bits per sample in AVI file." },
        VWaveCase{ "Mp3Tag", WaveFormat( 0x55, 2, 48000, 16 ), ZOL::AudioSampleFormat_Unspecified,
                   "Unsupported audio payload in AVI file." },
        VWaveCase{ "PlainFloatTag", WaveFormat( 3, 1, 48000, 32 ), ZOL::AudioSampleFormat_Unspecified,
                   "Unsupported audio payload in AVI file." } ),
    []( const ::testing::TestParamInfo< VWaveCase >& rInfo ) { return rInfo.param.Name; } );

TEST( AviAudio, ZeroSampleRatePlaysWithoutAudio )
{
  VOpenedAvi Avi = OpenAvi( BuildAvi( AudioSpec( 2, WaveFormat( 1, 1, 0, 16 ), { 3840, 3840 } ) ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_TRUE( Avi.pReader->GetAudioChunkOfFrame().empty() );
  EXPECT_EQ( AudioSizes( *Avi.pReader, 1 ), std::vector< std::size_t >{} );
}

TEST( AviAudio, AudioShorterThanVideoLeavesLateFramesSilent )
{
  VOpenedAvi Avi = OpenAvi( BuildAvi( AudioSpec( 5, WaveFormat( 1, 1, 48000, 16 ), { 3840, 3840 } ) ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetAudioChunkOfFrame(), ( std::vector< std::uint64_t >{ 0, 1 } ) );
  EXPECT_EQ( AudioSizes( *Avi.pReader, 1 ), std::vector< std::size_t >{ 3840 } );
  for( std::uint64_t i = 2; i < 5; ++i )
    EXPECT_EQ( AudioSizes( *Avi.pReader, i ), std::vector< std::size_t >{} ) << i;
}

TEST( AviAudio, ChunksBelongToFramesByPlayTime )
{
  // Half-frame chunks, two a frame; then a chunk of two frames, after which each chunk starts
  // a frame one frame early, and the last frame is left without audio.
  VOpenedAvi Avi = OpenAvi(
      BuildAvi( AudioSpec( 6, WaveFormat( 1, 1, 48000, 16 ), { 1920, 1920, 1920, 1920, 7680, 3840, 3840 } ) ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetAudioChunkOfFrame(), ( std::vector< std::uint64_t >{ 0, 2, 4, 5, 6 } ) );
  EXPECT_EQ( AudioSizes( *Avi.pReader, 0 ), ( std::vector< std::size_t >{ 1920, 1920 } ) );
  EXPECT_EQ( AudioSizes( *Avi.pReader, 2 ), std::vector< std::size_t >{ 7680 } );
  EXPECT_EQ( AudioSizes( *Avi.pReader, 4 ), std::vector< std::size_t >{ 3840 } );
  EXPECT_EQ( AudioSizes( *Avi.pReader, 5 ), std::vector< std::size_t >{} );
}

TEST( AviAudio, AudioOutsideTheFileFailsTheFrameOnlyWithAudio )
{
  VAviSpec Spec = AudioSpec( 2, WaveFormat( 1, 1, 48000, 16 ), { 3840, 3840 } );
  VBytes File = BuildAvi( Spec );
  // The second audio entry of idx1 (the fourth entry) gets a size beyond the file.
  const std::string Id = "idx1";
  const auto Found = std::search( File.begin(), File.end(), Id.begin(), Id.end() );
  ASSERT_NE( Found, File.end() );
  const std::size_t SizeAt = static_cast< std::size_t >( Found - File.begin() ) + 8 + 3 * 16 + 12;
  File[SizeAt + 3] = 0x40;
  VOpenedAvi Avi = OpenAvi( File );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( AudioSizes( *Avi.pReader, 1 ), std::vector< std::size_t >{ 999999 } );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 1 ), Frame( 32, 2 ) );
}
