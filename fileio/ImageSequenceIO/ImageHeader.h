#pragma once

// The pixel size an image file states in its header, for sequences that have no descriptor to
// say it. Only the few bytes that hold the size are read.

#include "videointerface/Enumerations.h"

#include <cstdint>
#include <cstdio>
#include <functional>
#include <memory>
#include <optional>
#include <string>

namespace ImageSequenceIO
{
  using VFileHandle = std::unique_ptr< std::FILE, int ( * )( std::FILE* ) >;
  // An image file opened for binary reading, shared with other readers, under its long name
  // where the system limits the plain one; empty when it cannot be opened.
  VFileHandle OpenImageFile( const std::string& i_rPath );

  struct VImageSize
  {
    std::int32_t Width = 0;
    std::int32_t Height = 0;
  };

  // Reads i_Size bytes at i_Offset into o_pDestination; false when they are not all there.
  using VReadAt = std::function< bool( std::uint64_t i_Offset, void* o_pDestination, std::size_t i_Size ) >;

  // The size a JPEG (its first frame header), PNG (IHDR) or TIFF (first directory) states.
  std::optional< VImageSize > ReadImageSize( ZOL::EVideoPayload i_Payload, const VReadAt& i_rReadAt );
  std::optional< VImageSize > ReadImageSize( ZOL::EVideoPayload i_Payload, const std::uint8_t* i_pData,
                                             std::uint64_t i_Size );
  std::optional< VImageSize > ReadImageFileSize( ZOL::EVideoPayload i_Payload, const std::string& i_rPath );
} // namespace ImageSequenceIO
