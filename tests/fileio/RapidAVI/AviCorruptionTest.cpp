// Damaged files: cut short and with bytes flipped at many places. Every one must open or be
// refused, and every frame read or fail, without a crash, a hang or an unbounded allocation.

#include "AviTestSupport.h"

#include "tests/support/TestNames.h"

#include <gtest/gtest.h>
#include <sstream>

using namespace AviTest;

namespace
{
  void ReadEverything( const VBytes& i_rFile )
  {
    VOpenedAvi Avi = OpenAvi( i_rFile );
    std::ostringstream Dump;
    (void)Avi.pReader->DumpFileStructure( Dump );
    // A damaged count can promise many frames; a few past the start and the end show enough.
    const std::uint64_t Count = Avi.pReader->GetFrameCount();
    for( std::uint64_t i = 0; i < Count && i < 8; ++i )
    {
      ZOL::IVideoFrame Frame;
      (void)Avi.pReader->ReadFrame( i, Frame, true, true );
      (void)Avi.pReader->ReadFrame( Count - 1 - i, Frame, true, true );
    }
  }

  struct VCorruptionCase
  {
    const char* Name;
    VBytes ( *Make )();
  };

  class AviCorruption : public ::testing::TestWithParam< VCorruptionCase >
  {
  };
} // namespace

TEST_P( AviCorruption, CutsAndFlips )
{
  const VBytes File = GetParam().Make();
  if( File.empty() )
    GTEST_SKIP() << "no fixture";
  // Thousands of refusals each say why; only a crash or a hang would matter here.
  LumekTest::VLogCapture Quiet( "", 0 );
  // Cuts: every byte of the headers, then a spread over the rest.
  const std::size_t Step = std::max< std::size_t >( 1, File.size() / 300 );
  for( std::size_t Cut = 0; Cut < File.size(); Cut += Cut < 512 ? 1 : Step )
    ReadEverything( VBytes( File.begin(), File.begin() + static_cast< std::ptrdiff_t >( Cut ) ) );
  // Flips: each byte of the headers and indexes turned to a few values that matter.
  for( std::size_t At = 0; At < File.size(); At += At < 512 ? 1 : Step )
    for( std::uint8_t Value : { std::uint8_t( 0x00 ), std::uint8_t( 0xFF ), std::uint8_t( File[At] ^ 0x80 ) } )
    {
      VBytes Damaged = File;
      Damaged[At] = Value;
      ReadEverything( Damaged );
    }
}

INSTANTIATE_TEST_SUITE_P(
    Files, AviCorruption,
    ::testing::Values(
        VCorruptionCase{ "HandBuilt",
                         []
                         {
                           // Both index kinds, audio, an AVIX part and a pad byte.
                           VAviSpec Spec = GreySpec( 6 );
                           Spec.StandardIndexFrames = 4;
                           Spec.AudioFormat = WaveFormat( 1, 2, 48000, 16 );
                           Spec.AudioChunks.assign( 6, Frame( 7680, 0x55 ) );
                           Spec.ExtendedFrames = { Frame( 32, 50 ) };
                           Spec.ExtraMoviChunks = Chunk( "JUNK", VBytes( 3 ) );
                           return BuildAvi( Spec );
                         } },
        VCorruptionCase{ "FfmpegMjpegWithAudio",
                         []
                         {
                           return ReadFile( FfmpegAvi( "CorruptMjpeg.avi",
                                                       { "-f", "lavfi", "-i", "sine=sample_rate=8000", "-c:v", "mjpeg",
                                                         "-c:a", "pcm_s16le", "-shortest", "-frames:v", "3" } ) );
                         } },
        VCorruptionCase{
            "FfmpegH264",
            [] {
              return ReadFile( FfmpegAvi( "CorruptH264.avi", { "-c:v", "libx264", "-bf", "0", "-frames:v", "3" } ) );
            } } ),
    LumekTest::VCaseName() );
