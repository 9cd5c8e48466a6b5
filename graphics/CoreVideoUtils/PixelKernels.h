#pragma once

// The loops the conversions are made of. Each works on a run of pixels or one row, so that a
// conversion is a table of these and never branches on a format inside a pixel loop. The
// kernels with vector forms take the form to run; Scalar is the rule itself and the reference
// the vector forms are tested against.

#include "graphics/CoreVideoUtils/InstructionSet.h"
#include "videointerface/Enumerations.h"

#include <cstdint>

namespace CoreVideoUtils
{
  namespace Kernels
  {
    // Site kind of the first pixel of the first row: 0 red, 1 green on a red row, 2 blue,
    // 3 green on a blue row; -1 for formats that are not 8-bit Bayer.

    // Bilinear demosaic of one row into 3 bytes a pixel (R, G, B, or B, G, R with i_bSwapRB).
    // i_pNorth and i_pSouth are the rows above and below, all zero outside the image.
    // i_StartKind is the site kind of the row's first pixel.
    void DemosaicRow( const std::uint8_t* i_pNorth, const std::uint8_t* i_pRow, const std::uint8_t* i_pSouth,
                      std::uint32_t i_Width, unsigned i_StartKind, bool i_bSwapRB, std::uint8_t* o_pRGB,
                      EInstructionSet i_Set );

    // Packed 4:2:2 to R, G, B: each pixel is two bytes, chroma then luma (U8Y8V8Y8) or luma
    // then chroma (Y8U8Y8V8), with U on the even and V on the odd pixel of each pair. A last
    // pixel without a partner takes V as 128.
    void YUV422ToRGB( const std::uint8_t* i_pSource, bool i_bLumaFirst, std::uint64_t i_PixelCount,
                      std::uint8_t* o_pRGB, EInstructionSet i_Set );

    // Samples of i_Bits (6 or 7) bits, most significant bit first, to the top of bytes.
    // i_First is the index of the first sample in the stream; i_SourceSize bounds every read.
    void UnpackSamples( const std::uint8_t* i_pSource, std::uint64_t i_SourceSize, unsigned i_Bits,
                        std::uint64_t i_First, std::uint64_t i_Count, std::uint8_t* o_pBytes );
    // The reverse: the top i_Bits of each byte into the stream at sample i_First onwards; bits
    // of the stream outside these samples stay as they were.
    void PackSamples( const std::uint8_t* i_pBytes, unsigned i_Bits, std::uint64_t i_First, std::uint64_t i_Count,
                      std::uint8_t* io_pTarget, std::uint64_t i_TargetSize );

    // (R + G + B) / 3 from three planes, and the R5G6B5 luminance rule.
    void PlanarRGBToLuminance( const std::uint8_t* i_pR, const std::uint8_t* i_pG, const std::uint8_t* i_pB,
                               std::uint64_t i_Count, std::uint8_t* o_pLuminance, EInstructionSet i_Set );
    void R5G6B5ToLuminance( const std::uint8_t* i_pSource, std::uint64_t i_Count, std::uint8_t* o_pLuminance,
                            EInstructionSet i_Set );

    // Gamma table and saturation on the first three bytes of each pixel, i_Step bytes apart.
    // i_pTable is null when gamma is 1.0; i_SaturationDelta 0 means no saturation step.
    void CorrectColours( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_Step,
                         const std::uint8_t* i_pTable, float i_SaturationDelta, EInstructionSet i_Set );
  } // namespace Kernels
} // namespace CoreVideoUtils
