#include "graphics/CoreVideoUtils/ColourCorrector.h"

#include "graphics/CoreVideoUtils/PixelKernels.h"

#include <cmath>

namespace CoreVideoUtils
{
  VColourCorrector::VColourCorrector()
  {
    for( unsigned i = 0; i < 256; ++i )
      m_Table[i] = static_cast< std::uint8_t >( i );
  }

  void VColourCorrector::Set( const ZOL::IVideoSettings& i_rVideoSettings )
  {
    m_SaturationDelta = i_rVideoSettings.Saturation - 1.0f;
    const float Gamma = i_rVideoSettings.GammaCorrection;
    if( Gamma != m_Gamma && Gamma != 1.0f )
    {
      const float Exponent = 1.0f / Gamma;
      for( unsigned i = 0; i < 256; ++i )
      {
        const float Scaled = std::pow( static_cast< float >( i ) * 0.00390625f, Exponent ) * 256.0f;
        // A NaN from a nonsensical gamma gives 0 rather than an undefined conversion.
        m_Table[i] = Scaled > 255.0f ? 255 : ( Scaled >= 0.0f ? static_cast< std::uint8_t >( Scaled ) : 0 );
      }
    }
    m_Gamma = Gamma;
  }

  bool VColourCorrector::Apply( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format,
                                std::uint8_t* io_pData ) const
  {
    if( i_Format < ZOL::PixelFormat_R8G8B8 || i_Format > ZOL::PixelFormat_B8G8R8u8 )
      return false;
    if( IsIdentity() )
      return true;
    if( i_Width <= 0 || i_Height <= 0 || io_pData == nullptr )
      return false;
    const unsigned Step = i_Format >= ZOL::PixelFormat_R8G8B8u8 ? 4 : 3;
    ApplyToRun( io_pData, static_cast< std::uint64_t >( i_Width ) * static_cast< std::uint64_t >( i_Height ), Step,
                BestInstructionSet() );
    return true;
  }

  void VColourCorrector::ApplyToRun( std::uint8_t* io_pData, std::uint64_t i_PixelCount, unsigned i_PixelStep,
                                     EInstructionSet i_Set ) const
  {
    if( IsIdentity() )
      return;
    Kernels::CorrectColours( io_pData, i_PixelCount, i_PixelStep, m_Gamma != 1.0f ? m_Table.data() : nullptr,
                             m_SaturationDelta, i_Set );
  }
} // namespace CoreVideoUtils
