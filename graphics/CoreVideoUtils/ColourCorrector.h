#pragma once

// Gamma and saturation on bytes, the software path's version of the Bayer shader's last two
// steps.

#include "graphics/CoreVideoUtils/InstructionSet.h"
#include "videointerface/IVideoFrameInfo.h"

#include <array>
#include <cstdint>

namespace CoreVideoUtils
{
  class VColourCorrector
  {
  public:
    VColourCorrector();

    // Takes saturation and gamma; the gamma table is rebuilt only for a new gamma other than 1.0.
    void Set( const ZOL::IVideoSettings& i_rVideoSettings );
    // Corrects a frame of R8G8B8, B8G8R8, R8G8B8u8 or B8G8R8u8 in place; false for other formats.
    // The buffer must hold width x height pixels of the format.
    bool Apply( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format, std::uint8_t* io_pData ) const;
    // The same over a run of pixels, 3 or 4 bytes apart; used row by row inside conversions.
    void ApplyToRun( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_PixelStep,
                     EInstructionSet i_Set ) const;

    // Nothing to do: gamma 1.0 and no saturation change.
    bool IsIdentity() const { return m_Gamma == 1.0f && m_SaturationDelta == 0.0f; }
    float GetGamma() const { return m_Gamma; }
    float GetSaturationDelta() const { return m_SaturationDelta; }
    const std::array< std::uint8_t, 256 >& GetTable() const { return m_Table; }

  private:
    float m_Gamma = 1.0f;
    float m_SaturationDelta = 0.0f;
    std::array< std::uint8_t, 256 > m_Table;
  };
} // namespace CoreVideoUtils
