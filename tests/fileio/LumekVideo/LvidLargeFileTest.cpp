// Recordings beyond 4 GiB: every position in the file is 64 bits wide, in the writer, in the
// index and in the reader.

#include "fileio/LumekVideo/VReader.h"
#include "fileio/LumekVideo/VWriter.h"
#include "tests/fileio/LumekVideo/LvidTestSupport.h"

#include <boost/filesystem.hpp>

#include <gtest/gtest.h>

using namespace LumekVideoTest;

namespace
{
  constexpr std::uint64_t FourGiB = std::uint64_t( 1 ) << 32;

  TEST( LvidLargeFile, FramesBeyondFourGiBReadBack )
  {
    // Full-size frames, with a sparse gap in front of the second so that it and the index land
    // past 4 GiB without writing gigabytes.
    const ZOL::IVideoFrameInfo Video = MakeVideo( ZOL::PixelFormat_R8G8B8u8, 1920, 1080 );
    const ZOL::IAudioFrameInfo Audio = MakeAudio( ZOL::AudioSampleFormat_Int16, 2 );
    const std::size_t FrameSize = 1920 * 1080 * 4;
    const std::vector< VBytes > Frames = { PatternBytes( FrameSize, 1 ), PatternBytes( FrameSize, 2 ),
                                           PatternBytes( FrameSize, 3 ) };
    const std::vector< VBytes > Tones = { PatternBytes( 1920 * 4, 4 ), PatternBytes( 1920 * 4, 5 ),
                                          PatternBytes( 1920 * 4, 6 ) };
    const std::uint64_t Numbers[] = { 0, 100000, 3 };

    VTempDir Dir;
    const std::string Path = Dir.File( "large.lvid" );
    {
      LumekVideo::VWriter Writer;
      ASSERT_TRUE( Writer.Create( Path, Video, Audio, MakeFileAttributes() ) );
      ASSERT_TRUE( Writer.AppendFrame( Numbers[0], Frames[0].data(), FrameSize, Tones[0].data(), Tones[0].size() ) );
      ASSERT_TRUE( Writer.SkipBytes( FourGiB + 12345 - Writer.GetPosition() ) );
      ASSERT_TRUE( Writer.AppendFrame( Numbers[1], Frames[1].data(), FrameSize, Tones[1].data(), Tones[1].size() ) );
      ASSERT_TRUE( Writer.AppendFrame( Numbers[2], Frames[2].data(), FrameSize, Tones[2].data(), Tones[2].size() ) );
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
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers AudioBlocks;
      ASSERT_TRUE( Reader.ReadFrameData( Numbers[i], pVideo, AudioBlocks, true, true ) ) << "frame " << Numbers[i];
      ASSERT_EQ( pVideo->GetSize(), FrameSize );
      EXPECT_TRUE( std::equal( Frames[i].begin(), Frames[i].end(), pVideo->GetData() ) ) << "frame " << Numbers[i];
      ASSERT_EQ( AudioBlocks.size(), 1u );
      EXPECT_TRUE( std::equal( Tones[i].begin(), Tones[i].end(), AudioBlocks[0]->GetData() ) );
    }
  }
} // namespace
