#pragma once

#include <cstddef>
#include <cstdint>

namespace RapidAVI
{
  // The DHT segment, marker included, that completes AVI1 motion JPEG frames: the typical
  // tables of ITU-T T.81 Annex K.3.
  const std::uint8_t* TypicalHuffmanTableSegment( std::size_t& o_rSize );
} // namespace RapidAVI
