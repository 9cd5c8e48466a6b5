// Feeds arbitrary bytes to the image sequence reader as a descriptor held in memory, for a
// folder that does not exist, then turns indices into names and names back into indices the
// way opening and playing do. The same bytes go through the image size readers.

#include "fileio/ImageSequenceIO/ImageHeader.h"
#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "utils/MemoryStream.h"

#include <cstddef>
#include <cstdint>

namespace
{
  constexpr const char* Folder = "/nonexistent-lumek-fuzz-folder";
  constexpr std::uint64_t Indices[] = { 0, 1, 2, 99, 123456789, ~std::uint64_t( 0 ) - 1 };
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  for( const ZOL::EVideoPayload Payload :
       { ZOL::VideoPayload_ImageJPEG, ZOL::VideoPayload_ImagePNG, ZOL::VideoPayload_ImageTIFF } )
    ImageSequenceIO::ReadImageSize( Payload, i_pData, i_Size );

  UtilsIO::VMemoryInputStream Stream( i_pData, i_Size );
  ImageSequenceIO::VImageSequenceReader Reader;
  if( !Reader.Open( Folder, Stream ) )
    return 0;
  const ImageSequenceIO::VSequenceInfo& rSequence = Reader.GetSequenceInfo();
  const ImageSequenceIO::VFileNameExpander Expander( rSequence.FileNamePattern, rSequence.FrameIndexPadWidth,
                                                     rSequence.FrameNumberPadWidth, Reader.GetTimecode(),
                                                     Reader.GetVideoTiming() );
  for( const std::uint64_t Index : Indices )
  {
    const std::string Name = Expander.Expand( Index );
    Expander.FindIndex( Name, ~std::uint64_t( 0 ) );
    ImageSequenceIO::SplitNumberedName( Name );
    ImageSequenceIO::DescriptorCandidates( Folder, Name );
    Reader.HasFrame( Index );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    Reader.ReadFrameData( Index, pVideo, Audio, true, true );
  }
  Reader.GetStoredFrameCount();
  Reader.FindStoredFrameAtOrBefore( ~std::uint64_t( 0 ) );
  Reader.FindStoredFrameAtOrAfter( 0 );
  return 0;
}
