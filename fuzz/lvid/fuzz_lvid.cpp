// Feeds arbitrary bytes to the .lvid reader as a recording held in memory, then reads frames
// the way the viewer and the command-line tool do.

#include "fileio/LumekVideo/VReader.h"
#include "utils/MemoryStream.h"

#include <cstddef>
#include <cstdint>

namespace
{
  // Frames larger than this are real only in real files; in a fuzz input they would just spend
  // the run's memory.
  constexpr std::uint64_t MaxFrameSize = 64ull << 20;
  constexpr int MaxFrames = 64;
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  LumekVideo::VReader Reader;
  // A failed Open can leave index entries behind; they must be as safe to read as any, so its
  // answer is not looked at, nor are the reads': only that they come back.
  static_cast< void >( Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( i_pData, i_Size ) ) );
  if( ZOL::GetVideoFrameSizeInBytes64( Reader.GetVideoFrameInfo() ) > MaxFrameSize )
    return 0;

  Reader.GetFrameCount();
  int Frames = 0;
  for( const auto& rEntry : Reader.GetFrameIndex() )
  {
    if( ++Frames > MaxFrames )
      break;
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    static_cast< void >( Reader.ReadFrameData( rEntry.first, pVideo, Audio, true, true ) );
    static_cast< void >( Reader.ReadFrameData( rEntry.first, pVideo, Audio, false, true ) );
    static_cast< void >( Reader.ReadFrameData( rEntry.first, pVideo, Audio, true, false ) );
    ZOL::IVideoFrame Frame;
    static_cast< void >( Reader.ReadFrame( rEntry.first, Frame, true, true ) );
  }
  for( std::uint64_t Frame = 0; Frame < 4; ++Frame )
    Reader.HasFrame( Frame );
  Reader.Close();
  return 0;
}
