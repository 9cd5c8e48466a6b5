#include "fileio/VideoEncoding/ImageDecoders.h"

#include "fileio/JPEGIO/JPEGReader.h"
#include "fileio/PNGIO/PNGReader.h"
#include "fileio/TIFFIO/TIFFReader.h"

namespace VideoEncoding
{
  namespace
  {
    // The JPEG reader takes the wished format in the info it fills.
    bool DecodeJPEG( const std::uint8_t* i_pData, std::uint64_t i_Size, ZOL::EPixelFormat i_PixelFormat,
                     const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                     const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                     ZOL::IVideoFrameInfo& io_VideoFrameInfo, std::shared_ptr< ZOL::IBuffer >& o_rOutput )
    {
      io_VideoFrameInfo.PixelFormat = i_PixelFormat;
      return JPEGIO::ReadJPEG( i_pData, i_Size, i_rAllocator, i_rTemporaryAllocator, io_VideoFrameInfo, o_rOutput );
    }

    constexpr VImageDecoders s_ImageDecoders{ DecodeJPEG, PNGIO::ReadPNG, TIFFIO::ReadTIFF };
  } // namespace

  const VImageDecoders& ImageDecoders()
  {
    return s_ImageDecoders;
  }
} // namespace VideoEncoding
