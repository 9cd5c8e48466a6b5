#include "fileio/TIFFIO/TIFFReader.h"

#include "fileio/ImageMagickWrapper/ImageReader.h"

namespace TIFFIO
{
  bool ReadTIFF( const std::uint8_t* i_pData, std::uint64_t i_Size, ZOL::IVideoFrameInfo& io_VideoFrameInfo,
                 std::uint8_t* o_pTarget, std::uint64_t i_TargetSize )
  {
    return ImageMagickWrapper::ReadImage( ImageMagickWrapper::SharedWrapper(), ImageMagickWrapper::ImageTIFF, i_pData,
                                          i_Size, io_VideoFrameInfo, o_pTarget, i_TargetSize );
  }
} // namespace TIFFIO
