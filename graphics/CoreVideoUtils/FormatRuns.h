#pragma once

// Every non-Bayer conversion is a reader and a writer of runs of pixels in one of three
// canonical forms: luminance (1 byte a pixel), R, G, B (3 bytes) or chroma and luma (2 bytes,
// U on even and V on odd pixels, as in U8Y8V8Y8). A source format has a reader into each
// form it can give; a target format names the form it is written from and its writer. So the
// matrix of pairs is two tables, and a format is one row in each.

#include "graphics/CoreVideoUtils/InstructionSet.h"
#include "videointerface/Enumerations.h"

#include <cstdint>

namespace CoreVideoUtils
{
  namespace Runs
  {
    struct VFrame
    {
      std::uint8_t* pData;
      std::uint64_t Size;
      std::uint32_t Width;
      std::uint32_t Height;
      std::uint64_t Pixels;
    };

    enum class ERunForm
    {
      None,
      Luminance,
      RGB,
      Chroma,
    };

    // Pixels [i_First, i_First + i_Count) of the frame, counted row after row. For
    // U10Y10V10Y10 a run never crosses a row and starts at a multiple of 48 pixels.
    using ReadRun = void ( * )( const VFrame& i_rSource, std::uint64_t i_First, std::uint32_t i_Count,
                                std::uint8_t* o_pRun, EInstructionSet i_Set );
    using WriteRun = void ( * )( const std::uint8_t* i_pRun, std::uint64_t i_First, std::uint32_t i_Count,
                                 const VFrame& io_rTarget );

    struct VSourceRuns
    {
      ReadRun ToLuminance;
      ReadRun ToRGB;
      ReadRun ToChroma; // only the YUV formats give chroma directly
    };

    struct VTargetRuns
    {
      ERunForm Form;
      WriteRun Write; // null: the run form is the target's own layout, read straight into it
    };

    const VSourceRuns& SourceRuns( ZOL::EPixelFormat i_Format );
    const VTargetRuns& TargetRuns( ZOL::EPixelFormat i_Format );

    // R, G, B to chroma and luma; i_Parity is 1 when the first pixel is an odd one (takes V).
    void RGBToChroma( const std::uint8_t* i_pRGB, std::uint32_t i_Count, unsigned i_Parity, std::uint8_t* o_pRun );

    // Planar Y8U8V8 of n pixels: Y n bytes, then U on the even pixels, then V on the odd ones.
    inline std::uint64_t PlanarUOffset( std::uint64_t i_Pixels )
    {
      return i_Pixels;
    }
    inline std::uint64_t PlanarVOffset( std::uint64_t i_Pixels )
    {
      return i_Pixels + ( i_Pixels + 1 ) / 2;
    }
    // Bytes of one row of U10Y10V10Y10: groups of 16 bytes for 6 pixels, rows padded to 48 pixels.
    inline std::uint64_t PackedTenBitRowBytes( std::uint32_t i_Width )
    {
      return ( ( i_Width + 47ull ) / 48 ) * 128;
    }
  } // namespace Runs
} // namespace CoreVideoUtils
