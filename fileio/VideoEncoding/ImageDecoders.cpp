#include "fileio/VideoEncoding/ImageDecoders.h"

namespace VideoEncoding
{
  namespace
  {
    // The JPEG, PNG and TIFF readers join here as they are built.
    constexpr VImageDecoders s_ImageDecoders{ nullptr, nullptr, nullptr };
  } // namespace

  const VImageDecoders& ImageDecoders()
  {
    return s_ImageDecoders;
  }
} // namespace VideoEncoding
