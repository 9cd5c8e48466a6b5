// Writes the small recordings the .lvid fuzz target starts from: lvid_make_seeds <folder>.
// Small alignments keep them to a few hundred bytes, so that mutations reach every part.

#include "fileio/LumekVideo/VWriter.h"
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
    std::uint64_t AudioBytes;
  };

  bool WriteSeed( const std::string& i_rFolder, const VSeed& i_rSeed )
  {
    const std::string Path = i_rFolder + "/" + i_rSeed.Name;
    LumekVideo::VWriter Writer;
    if( !Writer.Create( Path, i_rSeed.Video, i_rSeed.Audio, MakeFileAttributes(), i_rSeed.Alignment ) )
      return false;
    std::uint32_t Seed = 1;
    for( const std::uint64_t Frame : i_rSeed.Frames )
    {
      const VBytes Video = PatternBytes( Writer.GetVideoFrameSize(), Seed++ );
      const VBytes Audio = PatternBytes( i_rSeed.AudioBytes, Seed++ );
      if( !Writer.AppendFrame( Frame, Video.data(), Video.size(), Audio.empty() ? nullptr : Audio.data(),
                               Audio.size() ) )
        return false;
    }
    return Writer.Close();
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
      { "audio.lvid",
        MakeVideo( ZOL::PixelFormat_R8G8B8, 3, 1 ),
        MakeAudio( ZOL::AudioSampleFormat_Int16, 2 ),
        8,
        { 0, 1, 1 },
        10 },
      // A packed format whose size is not a whole number of pixels, with 24-bit audio.
      { "packed.lvid",
        MakeVideo( ZOL::PixelFormat_BayerGB7, 3, 3 ),
        MakeAudio( ZOL::AudioSampleFormat_Int24, 1 ),
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
