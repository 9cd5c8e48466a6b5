// Feeds arbitrary bytes to the Matroska reader as a file held in memory, then reads every frame
// the way the viewer and the command-line tool do.

#include "fileio/MkvIO/VMkvReader.h"
#include "services/ILogCategorised.h"

#include <ebml/MemReadIOCallback.h>

#include <cstddef>
#include <cstdint>

namespace
{
  constexpr std::uint64_t MaxFrames = 64;
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  // Nothing on standard error, but every message is still formatted and delivered.
  static const int s_Sink = ( ZOL::GlobalLog().SetStandardErrorLevel( 0 ),
                              ZOL::GlobalLog().AddSink( []( const ZOL::ILogRecord& ) {}, ZOL::LogDetail ) );
  (void)s_Sink;
  MkvIO::VMkvReader Reader;
  if( !Reader.Open( std::make_unique< libebml::MemReadIOCallback >( i_pData, i_Size ) ) )
    return 0;
  Reader.GetVideoTiming().GetFrameRate();
  for( std::uint64_t Frame = 0; Frame < Reader.GetFrameCount() && Frame < MaxFrames; ++Frame )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    Reader.ReadFrameData( Frame, pVideo, Audio, true, true );
    Reader.ReadFrameData( Frame, pVideo, Audio, false, true );
    ZOL::IVideoFrame Decoded;
    Reader.ReadFrame( Frame, Decoded, true, true );
  }
  Reader.FindStoredFrameAtOrBefore( Reader.GetFrameCount() + 5 );
  Reader.Close();
  return 0;
}
