#pragma once

// What the program knows about a pixel format, one row a format: its family, how its samples
// are laid out, its Bayer phase, what the shaders take and what a JPEG of it decodes to. Every
// rule about formats (is it Bayer, the bytes of a frame, the demosaic's start, the red offset,
// whether display settings apply) is read from the row, never from the enumeration's order.

#include "videointerface/Enumerations.h"

#include <cstdint>

namespace ZOL
{
  enum class EPixelFamily : std::uint8_t
  {
    None,
    Luminance,
    Bayer,
    RGB,
    YUV,
  };

  enum class EPixelPacking : std::uint8_t
  {
    None,
    // Whole bytes a pixel, components side by side (4:2:2 pairs count two bytes a pixel).
    Interleaved,
    // Whole bytes a pixel, one plane a component.
    Planar,
    // 5, 6 and 5 bits in a little-endian 16-bit word.
    Packed565,
    // Samples of BitsPerSample bits packed across byte boundaries, the first in the high bits.
    PackedBits,
    // 48 pixels of 10-bit 4:2:2 in 128 bytes; each row padded to whole groups.
    TenBitGroups,
  };

  // The colours of the top-left site and its right neighbour. The values are the demosaic's start
  // kinds: the kind of a site is the start kind with bit 0 flipped on odd columns and both bits on
  // odd rows.
  enum class EBayerPhase : std::uint8_t
  {
    RG = 0,
    GR = 1,
    BG = 2,
    GB = 3,
    None = 4,
  };

  struct VPixelFormatDescriptor
  {
    EPixelFormat Format;
    EPixelFamily Family;
    std::uint8_t BitsPerSample;
    EPixelPacking Packing;
    EBayerPhase Phase;
    // Bytes a pixel takes (averaged over a pixel pair for 4:2:2); 0 where samples are bit packed.
    std::uint8_t BytesPerPixel;
    // The form the bytes reach the graphics card in: the format itself when the shaders take it as
    // it is, its 8-bit relative when it is unpacked first, Unspecified when it is never uploaded.
    EPixelFormat ShaderFormat;
    // What the JPEG decoder gives for a frame stored in this format.
    EPixelFormat JPEGOutput;
  };

  // The row of a format; a number outside the enumeration gets the Unspecified row.
  const VPixelFormatDescriptor& DescribePixelFormat( EPixelFormat i_Format );

  inline bool IsBayerFormat( EPixelFormat i_Format )
  {
    return DescribePixelFormat( i_Format ).Family == EPixelFamily::Bayer;
  }

  // The demosaic's start kind (0 to 3), or -1 for formats that are not Bayer.
  int BayerStartKind( EPixelFormat i_Format );

  // The offset that brings a red site to an even column and row; false for formats that are not Bayer.
  bool FirstRedOffset( EPixelFormat i_Format, int& o_rX, int& o_rY );

  // Interleaved 8-bit RGB with or without a fourth byte: the targets a Bayer frame is colour
  // corrected in.
  bool IsInterleavedRGB( EPixelFormat i_Format );

  // Bytes of a frame of that size; 0 for Unspecified, numbers outside the enumeration and empty sizes.
  std::uint64_t PixelFormatFrameBytes( EPixelFormat i_Format, std::uint64_t i_Width, std::uint64_t i_Height );
} // namespace ZOL
