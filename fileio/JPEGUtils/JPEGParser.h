#pragma once

// The marker segments of a JPEG, found without decoding it. A reader asks whether a stored
// frame is a whole image before handing it to the decoder; the tool prints the table.

#include "utils/Streams.h"

#include <cstdint>
#include <string>
#include <vector>

namespace JPEGUtils
{
  struct VJPEGSegment
  {
    // The code behind 0xFF.
    std::uint8_t Marker = 0;
    // Where the marker's 0xFF lies in the stream.
    std::uint64_t Start = 0;
    // Bytes of the segment, its two marker bytes included.
    std::uint64_t Length = 0;

    bool operator==( const VJPEGSegment& i_rOther ) const
    {
      return Marker == i_rOther.Marker && Start == i_rOther.Start && Length == i_rOther.Length;
    }
  };

  // Walks i_Length bytes from the stream's current position. True when they are exactly a
  // sequence of segments that starts with SOI, ends with EOI and has at least four of them;
  // o_rSegments holds what was found either way. Entropy-coded data is skipped byte by byte.
  [[nodiscard]] bool ParseJPEG( ZOL::IInputStreamSeekable& io_rStream, std::uint64_t i_Length,
                                std::vector< VJPEGSegment >& o_rSegments );

  // The segments as a tab-separated table with a header line. The stream is the one they were
  // parsed from: an APP0 shows its first four bytes and a comment its text.
  std::string DumpJPEG( const std::vector< VJPEGSegment >& i_rSegments, ZOL::IInputStreamSeekable& io_rStream );

  // The name a marker goes by ("SOF0", "APP13", "RST5").
  std::string JPEGMarkerName( std::uint8_t i_Marker );
} // namespace JPEGUtils
