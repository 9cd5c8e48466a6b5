#pragma once

// One TIFF image from memory into a caller's buffer, through ImageMagick when it is installed.

#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>

namespace TIFFIO
{
  // False without a message when the image library is absent. Grey images give Luminance8,
  // palette and true-colour ones R8G8B8; the image must have the size the info declares and
  // fit i_TargetSize. Width, height and PixelFormat of the info are set on success.
  [[nodiscard]] bool ReadTIFF( const std::uint8_t* i_pData, std::uint64_t i_Size,
                               ZOL::IVideoFrameInfo& io_VideoFrameInfo, std::uint8_t* o_pTarget,
                               std::uint64_t i_TargetSize );
} // namespace TIFFIO
