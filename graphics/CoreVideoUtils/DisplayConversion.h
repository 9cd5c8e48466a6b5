#pragma once

// The picture of a frame as R8G8B8 on the processor, with the display settings, for the
// command-line tool and the software path of the video surface.

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include <cstdint>
#include <vector>

namespace CoreVideoUtils
{
  // Converts any frame to R8G8B8 in o_rRGB (resized to width x height x 3). A frame of the
  // Bayer family takes saturation and gamma once, inside the converter; other formats are
  // shown as they are, and an R8G8B8 frame is copied untouched. The video surface's software
  // path corrects Bayer frames a second time with its own corrector on top of this.
  bool ConvertToDisplayRGB( const ZOL::IVideoFrameInfo& i_rVideoFrameInfo, const std::uint8_t* i_pSource,
                            std::uint64_t i_SourceSize, const ZOL::IVideoSettings& i_rVideoSettings,
                            std::vector< std::uint8_t >& o_rRGB );
} // namespace CoreVideoUtils
