// The JPEG marker parser and its dump, and the JPEG reader with every wished format, on any
// bytes. The input is the image itself, so that plain JPEG files seed it; the wish comes from
// the sum of its bytes, which every mutation changes.

#include "fileio/JPEGIO/JPEGReader.h"
#include "fileio/JPEGUtils/JPEGParser.h"
#include "utils/MemoryStream.h"
#include "videointerface/BufferAllocators.h"

#include <turbojpeg.h>

#include <cstdint>

namespace
{
  // Images the reader would accept can still be large; beyond this many pixels the fuzzer
  // would spend its time clearing buffers rather than finding faults.
  constexpr std::uint64_t MaxFuzzPixels = 4u << 20;

  bool SmallEnough( const std::uint8_t* i_pData, std::size_t i_Size )
  {
    tjhandle Handle = tjInitDecompress();
    int Width = 0;
    int Height = 0;
    int Subsampling = 0;
    const bool bHeader = Handle != nullptr && tjDecompressHeader2( Handle, const_cast< unsigned char* >( i_pData ),
                                                                   i_Size, &Width, &Height, &Subsampling ) == 0;
    if( Handle != nullptr )
      tjDestroy( Handle );
    return !bHeader || static_cast< std::uint64_t >( Width ) * static_cast< std::uint64_t >( Height ) <= MaxFuzzPixels;
  }
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const std::uint8_t* pImage = i_pData;
  const std::size_t ImageSize = i_Size;
  unsigned Sum = 0;
  for( std::size_t i = 0; i < i_Size; ++i )
    Sum += i_pData[i];

  UtilsIO::VMemoryInputStream Stream( pImage, ImageSize );
  std::vector< JPEGUtils::VJPEGSegment > Segments;
  const bool bWhole = JPEGUtils::ParseJPEG( Stream, ImageSize, Segments );
  const std::string Table = JPEGUtils::DumpJPEG( Segments, Stream );
  if( bWhole && Table.empty() )
    __builtin_trap();

  if( !SmallEnough( pImage, ImageSize ) )
    return 0;
  static const auto s_pAllocator = std::make_shared< ZOL::VFrameBufferAllocator >();
  ZOL::IVideoFrameInfo Info;
  Info.PixelFormat = static_cast< ZOL::EPixelFormat >( Sum % 21 );
  std::shared_ptr< ZOL::IBuffer > pOutput;
  if( JPEGIO::ReadJPEG( pImage, ImageSize, s_pAllocator, s_pAllocator, Info, pOutput ) &&
      ( !pOutput || pOutput->GetSize() != ZOL::GetVideoFrameSizeInBytes64( Info ) ) )
    __builtin_trap();
  return 0;
}
