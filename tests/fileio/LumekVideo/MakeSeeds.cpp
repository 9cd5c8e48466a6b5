// Writes the small recordings the .lvid fuzz target starts from: lvid_make_seeds <folder>.
// Small alignments keep them to a few hundred bytes, so that mutations reach every part.

#include "tests/fileio/LumekVideo/LvidTestSupport.h"

#include <iostream>

using namespace LumekVideoTest;

namespace
{
  struct VSeed
  {
    const char* Name;
    ZOL::IVideoFrameInfo Video;
    ZOL::IAudioFrameInfo Audio;
    std::uint64_t Alignment;
    std::vector< std::uint64_t > Frames;
    std::size_t AudioBytes;
  };

  bool WriteSeed( const std::string& i_rFolder, const VSeed& i_rSeed )
  {
    std::vector< VFrameContent > Frames;
    std::uint32_t Seed = 1;
    for( const std::uint64_t Frame : i_rSeed.Frames )
    {
      Frames.push_back( { Frame, PatternBytes( ZOL::GetVideoFrameSizeInBytes( i_rSeed.Video ), Seed ),
                          PatternBytes( i_rSeed.AudioBytes, Seed + 1 ) } );
      Seed += 2;
    }
    const VBytes Bytes = WriteToMemory( i_rSeed.Video, i_rSeed.Audio, Frames, i_rSeed.Alignment );
    return !Bytes.empty() && WriteFile( i_rFolder + "/" + i_rSeed.Name, Bytes );
  }
} // namespace

int main( int argc, char** argv )
{
  if( argc != 2 )
  {
    std::cerr << "usage: lvid_make_seeds <folder>\n";
    return 2;
  }
  const VSeed Seeds[] = {
      // Frames out of order with a gap, no audio.
      { "gaps.lvid", MakeVideo( ZOL::PixelFormat_Luminance8, 4, 2 ), ZOL::IAudioFrameInfo(), 16, { 1, 0, 3 }, 0 },
      // Stereo 16-bit audio with a partial sample group, and a frame written twice.
      { "audio.lvid", MakeVideo( ZOL::PixelFormat_R8G8B8, 3, 1 ), s_Stereo16, 8, { 0, 1, 1 }, 10 },
      // A packed format whose size is not a whole number of pixels, with 24-bit audio.
      { "packed.lvid",
        MakeVideo( ZOL::PixelFormat_BayerGB7, 3, 3 ),
        ZOL::IAudioFrameInfo{ ZOL::AudioSampleFormat_Int24, 48000, 1 },
        4,
        { 2, 0 },
        6 },
  };
  for( const VSeed& rSeed : Seeds )
    if( !WriteSeed( argv[1], rSeed ) )
    {
      std::cerr << "cannot write " << rSeed.Name << "\n";
      return 1;
    }
  return 0;
}
