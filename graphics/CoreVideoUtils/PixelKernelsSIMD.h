#pragma once

// Entry points of the vector forms. Each does the part of its job that suits whole vectors
// and returns how far it got; the scalar kernel finishes the rest.

#include <cstdint>

namespace CoreVideoUtils
{
  namespace Kernels
  {
    // Pixels 1 to the returned end (exclusive) of a row; may write up to 2 bytes past the end,
    // which the scalar rest overwrites.
    std::uint32_t DemosaicRowInteriorSSE2( const std::uint8_t* i_pNorth, const std::uint8_t* i_pRow,
                                           const std::uint8_t* i_pSouth, std::uint32_t i_Width, unsigned i_StartKind,
                                           bool i_bSwapRB, std::uint8_t* o_pRGB );
    std::uint32_t DemosaicRowInteriorAVX2( const std::uint8_t* i_pNorth, const std::uint8_t* i_pRow,
                                           const std::uint8_t* i_pSouth, std::uint32_t i_Width, unsigned i_StartKind,
                                           bool i_bSwapRB, std::uint8_t* o_pRGB );

    // Whole pairs from the start; never writes past the pixels it reports.
    std::uint64_t YUV422ToRGBSSE2( const std::uint8_t* i_pSource, bool i_bLumaFirst, std::uint64_t i_PixelCount,
                                   std::uint8_t* o_pRGB );
    std::uint64_t YUV422ToRGBAVX2( const std::uint8_t* i_pSource, bool i_bLumaFirst, std::uint64_t i_PixelCount,
                                   std::uint8_t* o_pRGB );

    std::uint64_t PlanarRGBToLuminanceSSE2( const std::uint8_t* i_pR, const std::uint8_t* i_pG,
                                            const std::uint8_t* i_pB, std::uint64_t i_Count, std::uint8_t* o_pL );
    std::uint64_t R5G6B5ToLuminanceSSE2( const std::uint8_t* i_pSource, std::uint64_t i_Count, std::uint8_t* o_pL );

    // Groups of 8 samples (7 or 6 bytes) from a byte-aligned stream; reads stay inside
    // i_SourceBytes. Returns the samples done.
    std::uint64_t UnpackSamplesAVX2( const std::uint8_t* i_pSource, std::uint64_t i_SourceBytes, unsigned i_Bits,
                                     std::uint64_t i_Count, std::uint8_t* o_pBytes );

    std::uint64_t CorrectColoursAVX2( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_Step,
                                      const std::uint8_t* i_pTable, float i_SaturationDelta );
    std::uint64_t CorrectColoursAVX512( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_Step,
                                        const std::uint8_t* i_pTable, float i_SaturationDelta );
  } // namespace Kernels
} // namespace CoreVideoUtils
