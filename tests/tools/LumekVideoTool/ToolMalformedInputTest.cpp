// Damaged recordings through the whole tool: never a crash, only the exit codes scripts expect.

#include "ToolRunner.h"

#include <gtest/gtest.h>

#include <random>

using namespace LumekVideoToolTest;

namespace
{
  std::string RecordingWithEverything( const VScratch& i_rScratch )
  {
    VRecordingSpec Spec;
    Spec.Format = ZOL::PixelFormat_BayerGB8;
    Spec.Width = 10;
    Spec.Height = 6;
    Spec.Frames = { 0, 1, 3 };
    Spec.bAudio = true;
    return WriteRecording( i_rScratch, "good.lvid", Spec );
  }
} // namespace

TEST( ToolMalformedInput, EveryCutFailsToOpen )
{
  VScratch Scratch;
  const std::vector< std::uint8_t > Good = ReadFileBytes( RecordingWithEverything( Scratch ) );
  ASSERT_GT( Good.size(), 100u );
  const std::string Path = Scratch.Path( "cut.lvid" );
  // Every cut point in the header and attribute blocks, then a spread over the rest.
  std::vector< std::size_t > Cuts;
  for( std::size_t Cut = 0; Cut < std::min< std::size_t >( Good.size(), 400 ); Cut += 7 )
    Cuts.push_back( Cut );
  for( std::size_t Cut = 400; Cut < Good.size(); Cut += Good.size() / 40 + 1 )
    Cuts.push_back( Cut );
  Cuts.push_back( Good.size() - 1 );
  for( std::size_t Cut : Cuts )
  {
    WriteFileBytes( Path, std::vector< std::uint8_t >( Good.begin(), Good.begin() + Cut ) );
    const VRun Run = RunTool( { "frames", Path, Scratch.Path( "out" ) } );
    EXPECT_FALSE( Run.bSignalled ) << "cut at " << Cut;
    // The index is written last, so any cut damages it.
    EXPECT_EQ( Run.ExitCode, 1 ) << "cut at " << Cut << ": " << Run.Err;
  }
}

TEST( ToolMalformedInput, FlippedBytesNeverCrash )
{
  VScratch Scratch;
  const std::vector< std::uint8_t > Good = ReadFileBytes( RecordingWithEverything( Scratch ) );
  const std::string Path = Scratch.Path( "flipped.lvid" );
  std::mt19937 Random( 1234 );
  for( int Trial = 0; Trial < 150; ++Trial )
  {
    std::vector< std::uint8_t > Bytes = Good;
    const int Flips = 1 + Trial % 4;
    for( int i = 0; i < Flips; ++i )
    {
      // Most flips land in the structure (header, attributes, index), where they matter.
      const std::size_t Position = ( Trial % 3 == 0 )   ? Random() % Bytes.size()
                                   : ( Trial % 3 == 1 ) ? Random() % std::min< std::size_t >( Bytes.size(), 600 )
                                                        : Bytes.size() - 1 - Random() % 64;
      Bytes[Position] ^= static_cast< std::uint8_t >( 1u << ( Random() % 8 ) );
    }
    WriteFileBytes( Path, Bytes );
    for( const char* pCommand : { "frames", "info" } )
    {
      const VRun Run = std::string( pCommand ) == "frames" ? RunTool( { pCommand, Path, Scratch.Path( "out" ) } )
                                                           : RunTool( { pCommand, Path } );
      EXPECT_FALSE( Run.bSignalled ) << pCommand << " trial " << Trial << ": " << Run.Err;
      EXPECT_TRUE( Run.ExitCode == 0 || Run.ExitCode == 1 || Run.ExitCode == 3 )
          << pCommand << " trial " << Trial << " exit " << Run.ExitCode;
      if( std::string( pCommand ) == "info" && Run.ExitCode == 0 )
      {
        ParseJson( Run.Out );
      }
    }
  }
}

TEST( ToolMalformedInput, AHugeFrameNumberIsAGapNotAHang )
{
  VScratch Scratch;
  VRecordingSpec Spec;
  Spec.Frames = { 0, 1, std::uint64_t( 1 ) << 42 };
  const std::string Path = WriteRecording( Scratch, "huge.lvid", Spec );
  const VRun Frames = RunTool( { "frames", Path, Scratch.Path( "out" ) } );
  EXPECT_EQ( Frames.ExitCode, 3 );
  EXPECT_NE( Frames.Err.find( "Frames 2 to 4398046511103 are missing." ), std::string::npos ) << Frames.Err;
  EXPECT_TRUE( boost::filesystem::exists( Scratch.Path( "out/frame_4398046511104.ppm" ) ) );
  EXPECT_EQ( RunTool( { "info", Path } ).ExitCode, 0 );
  EXPECT_EQ( RunTool( { "bench", Path } ).ExitCode, 0 );
  EXPECT_EQ( RunTool( { "convert", Path, Scratch.Path( "copy.lvid" ) } ).ExitCode, 0 );
}
