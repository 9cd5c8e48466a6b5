#pragma once

// The fixed parts of an .lvid recording: the 48-byte header and the index entry. Reader and
// writer share these so that the two cannot drift apart.

#include "utils/Streams.h"

#include <cstdint>

namespace LumekVideo
{
  constexpr std::uint64_t HeaderSize = 48;
  constexpr char HeaderMagic[] = "###LumekVideoFile###";
  constexpr std::uint64_t HeaderMagicSize = 20;
  constexpr std::uint32_t HeaderSignature = 0xF355BDACu;
  constexpr std::uint32_t HeaderFormatVersion = 1;
  constexpr std::uint32_t HeaderRevision = 3;
  // Where the two fields that are only known at the end of a capture sit.
  constexpr std::uint64_t HeaderAlignmentOffset = 32;
  constexpr std::uint64_t HeaderIndexOffsetOffset = 40;
  // EntryCount, then FrameNumber and FrameOffset per entry.
  constexpr std::uint64_t IndexCountSize = 8;
  constexpr std::uint64_t IndexEntrySize = 16;
  constexpr std::uint64_t AudioByteCountSize = 4;
  constexpr std::uint64_t DefaultAlignment = 4096;

  struct VFileHeader
  {
    char Magic[HeaderMagicSize] = {};
    std::uint32_t Signature = HeaderSignature;
    std::uint32_t FormatVersion = HeaderFormatVersion;
    std::uint32_t Revision = HeaderRevision;
    std::uint64_t Alignment = 0;
    std::uint64_t IndexOffset = 0;

    // A header as a writer starts it: everything but Alignment and IndexOffset.
    static VFileHeader MakeNew();
    // Only the magic and the version decide whether a file is ours; signature and revision are
    // written but older captures are known to hold anything there.
    bool IsSupported() const;
  };

  // Exactly 48 bytes, little-endian.
  bool ReadFileHeader( ZOL::IInputStream& i_rStream, VFileHeader& o_rHeader );
  bool WriteFileHeader( ZOL::IOutputStream& i_rStream, const VFileHeader& i_rHeader );

  // The smallest multiple of i_Alignment at or above i_Position; false when that does not fit
  // in a signed 64-bit file position or the alignment is 0.
  bool AlignUp( std::uint64_t i_Position, std::uint64_t i_Alignment, std::uint64_t& o_rAligned );
} // namespace LumekVideo
