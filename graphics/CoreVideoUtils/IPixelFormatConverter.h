#pragma once

// The processor's counterpart of the video shaders: converts a frame between any two pixel
// formats. One concrete class stands behind it, CoreVideoUtils::VPixelFormatConverter.

#include "videointerface/AttributeRecords.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>

namespace ZOL
{
  class IPixelFormatConverter
  {
  public:
    // Width, height and source format come from the info. False, with nothing written, when
    // either buffer is smaller than a frame of its format or the pair is not convertible.
    virtual bool Convert( const IVideoFrameInfo& i_rVideoFrameInfo, const std::uint8_t* i_pSource,
                          std::uint64_t i_SourceSize, EPixelFormat i_TargetFormat, std::uint8_t* o_pTarget,
                          std::uint64_t i_TargetSize ) = 0;
    // Saturation and gamma for frames of the Bayer family.
    virtual void SetVideoSettings( const IVideoSettings& i_rVideoSettings ) = 0;
    virtual void SetLensDistortionCalibration( const CoreLumekTypes::VCameraHardware& i_rCameraHardware,
                                               const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration ) = 0;
    virtual void SetLensDistortionCorrectionEnabled( bool i_bEnabled ) = 0;
    virtual ~IPixelFormatConverter() = default;
  };
} // namespace ZOL
