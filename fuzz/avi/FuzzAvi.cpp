// Feeds arbitrary bytes to the AVI reader as a file held in memory, then dumps the tree and
// reads frames with their audio the way the viewer and the command-line tool do.

#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "utils/MemoryStream.h"

#include <cstddef>
#include <cstdint>
#include <sstream>

namespace
{
  // Enough to reach both ends of a damaged index without spending the run on one input.
  constexpr std::uint64_t MaxFrames = 16;
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  RapidAVI::VRapidAVIReader Reader;
  if( !Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( i_pData, i_Size ) ) )
    return 0;
  std::ostringstream Dump;
  (void)Reader.DumpFileStructure( Dump );
  const std::uint64_t Count = Reader.GetFrameCount();
  for( std::uint64_t i = 0; i < Count && i < MaxFrames; ++i )
  {
    const std::uint64_t Frame = i % 2 == 0 ? i / 2 : Count - 1 - i / 2;
    ZOL::IVideoFrame Decoded;
    (void)Reader.ReadFrame( Frame, Decoded, true, true );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    (void)Reader.ReadFrameData( Frame, pVideo, Audio, false, true );
    (void)Reader.FindStoredFrameAtOrBefore( Frame );
  }
  Reader.Close();
  return 0;
}
