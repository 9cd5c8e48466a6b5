#include "fileio/PNGIO/PNGReader.h"

#include "fileio/ImageMagickWrapper/ImageReader.h"

namespace PNGIO
{
  bool ReadPNG( const std::uint8_t* i_pData, std::uint64_t i_Size, ZOL::IVideoFrameInfo& io_VideoFrameInfo,
                std::uint8_t* o_pTarget, std::uint64_t i_TargetSize )
  {
    return ImageMagickWrapper::ReadImage( ImageMagickWrapper::SharedWrapper(), ImageMagickWrapper::ImagePNG, i_pData,
                                          i_Size, io_VideoFrameInfo, o_pTarget, i_TargetSize );
  }
} // namespace PNGIO
