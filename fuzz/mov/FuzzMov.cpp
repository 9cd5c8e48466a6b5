// Feeds arbitrary bytes to the MOV reader as a file held in memory, then reads every frame the
// way the viewer does, decoding included, and dumps the atom tree as the tool does.

#include "fileio/MovIO/VMovReader.h"
#include "utils/MemoryStream.h"

#include <cstddef>
#include <cstdint>
#include <sstream>

namespace
{
  // A picture larger than this is real only in real files; in a fuzz input it would spend the
  // run's memory on a decode that cannot succeed.
  constexpr std::uint64_t MaxFrameSize = 64ull << 20;
  constexpr std::uint64_t MaxFrames = 64;
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  MovIO::VMovReader Reader;
  const auto pStream = std::make_shared< UtilsIO::VMemoryInputStream >( i_pData, i_Size );
  if( !Reader.Open( pStream ) )
    return 0;
  std::ostringstream Dump;
  static_cast< void >( Reader.DumpFileStructure( Dump ) );
  const bool bDecode = ZOL::GetVideoFrameSizeInBytes64( Reader.GetVideoFrameInfo() ) <= MaxFrameSize;
  for( std::uint64_t Frame = 0; Frame < Reader.GetFrameCount() && Frame < MaxFrames; ++Frame )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    static_cast< void >( Reader.ReadFrameData( Frame, pVideo, Audio, true, true ) );
    static_cast< void >( Reader.ReadFrameData( Frame, pVideo, Audio, false, true ) );
    if( bDecode )
    {
      ZOL::IVideoFrame Decoded;
      static_cast< void >( Reader.ReadFrame( Frame, Decoded, true, true ) );
    }
  }
  static_cast< void >( Reader.FindStoredFrameAtOrBefore( ~0ull ) );
  Reader.Close();
  return 0;
}
