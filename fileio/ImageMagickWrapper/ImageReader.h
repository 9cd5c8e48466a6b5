#pragma once

// One PNG or TIFF image from memory into a caller's buffer, through MagickWand. PNGIO and
// TIFFIO are this with their own coder and log category.

#include "fileio/ImageMagickWrapper/VImageMagickWrapper.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>

namespace ImageMagickWrapper
{
  struct VImageKind
  {
    // Forces the coder: the bytes are read as this format or not at all, whatever else
    // their first bytes might make the library try.
    const char* pCoderPrefix;
    // Category of the reader's log lines.
    const char* pLogCategory;
  };

  constexpr VImageKind ImagePNG{ "png:", "PNGIO" };
  constexpr VImageKind ImageTIFF{ "tiff:", "TIFFIO" };

  // Grey images give Luminance8, palette and true-colour ones R8G8B8; anything else (alpha,
  // CMYK, bilevel) is refused. The image must have the size io_VideoFrameInfo declares, when it
  // declares one, and must fit i_TargetSize; width, height and PixelFormat are set on success.
  [[nodiscard]] bool ReadImage( const VImageMagickWrapper& i_rWrapper, const VImageKind& i_rKind,
                                const std::uint8_t* i_pData, std::uint64_t i_Size,
                                ZOL::IVideoFrameInfo& io_VideoFrameInfo, std::uint8_t* o_pTarget,
                                std::uint64_t i_TargetSize );
} // namespace ImageMagickWrapper
