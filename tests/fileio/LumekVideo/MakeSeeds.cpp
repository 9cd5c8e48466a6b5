// Writes the small recordings the .lvid fuzz target starts from: lvid_make_seeds <folder>.
// Small alignments keep them to a few hundred bytes, so that mutations reach every part.

#include "tests/fileio/LumekVideo/LvidTestSupport.h"

#include <iostream>

using namespace LumekVideoTest;

int main( int argc, char** argv )
{
  if( argc != 2 )
  {
    std::cerr << "usage: lvid_make_seeds <folder>\n";
    return 2;
  }
  const struct
  {
    const char* Name;
    ZOL::IVideoFrameInfo Video;
    ZOL::IAudioFrameInfo Audio;
    std::uint64_t Alignment;
    std::vector< std::uint64_t > Frames;
    std::size_t AudioBytes;
  } Seeds[] = {
      // Frames out of order with a gap, no audio.
      { "gaps.lvid", MakeVideo( ZOL::PixelFormat_Luminance8, 4, 2 ), {}, 16, { 1, 0, 3 }, 0 },
      // Stereo 16-bit audio with a partial sample group, and a frame written twice.
      { "audio.lvid", MakeVideo( ZOL::PixelFormat_R8G8B8, 3, 1 ), s_Stereo16, 8, { 0, 1, 1 }, 10 },
      // A packed format whose size is not a whole number of pixels, with 24-bit audio.
      { "packed.lvid",
        MakeVideo( ZOL::PixelFormat_BayerGB7, 3, 3 ),
        { ZOL::AudioSampleFormat_Int24, 48000, 1 },
        4,
        { 2, 0 },
        6 },
  };
  for( const auto& rSeed : Seeds )
  {
    std::vector< VFrameContent > Frames;
    std::uint32_t Seed = 1;
    for( const std::uint64_t Frame : rSeed.Frames )
    {
      Frames.push_back( { Frame, PatternBytes( ZOL::GetVideoFrameSizeInBytes( rSeed.Video ), Seed ),
                          PatternBytes( rSeed.AudioBytes, Seed + 1 ) } );
      Seed += 2;
    }
    const VBytes Bytes = WriteToMemory( rSeed.Video, rSeed.Audio, Frames, rSeed.Alignment );
    if( Bytes.empty() || !WriteFileBytes( std::string( argv[1] ) + "/" + rSeed.Name, Bytes ) )
    {
      std::cerr << "cannot write " << rSeed.Name << "\n";
      return 1;
    }
  }
  return 0;
}
