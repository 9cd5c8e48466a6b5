#pragma once

// Pixel format conversion on the processor: the software path's picture, the widening of the
// packed 6, 7 and 10-bit formats before upload, and the one-shot ConvertFrame.

#include "graphics/CoreVideoUtils/ColourCorrector.h"
#include "graphics/CoreVideoUtils/IPixelFormatConverter.h"
#include "graphics/CoreVideoUtils/InstructionSet.h"
#include "videointerface/IBuffer.h"

#include <cstdint>
#include <memory>

namespace CoreVideoUtils
{
  class VPixelFormatConverter : public ZOL::IPixelFormatConverter
  {
  public:
    // i_pAllocator gives the intermediate frames of two-step conversions; a converter without
    // one makes its own. i_pColourCorrector may be shared with the caller; null makes one.
    explicit VPixelFormatConverter( std::shared_ptr< ZOL::IBufferAllocator > i_pAllocator = nullptr,
                                    std::shared_ptr< VColourCorrector > i_pColourCorrector = nullptr );

    [[nodiscard]] bool Convert( const ZOL::IVideoFrameInfo& i_rVideoFrameInfo, const std::uint8_t* i_pSource,
                                std::uint64_t i_SourceSize, ZOL::EPixelFormat i_TargetFormat, std::uint8_t* o_pTarget,
                                std::uint64_t i_TargetSize ) override;
    void SetVideoSettings( const ZOL::IVideoSettings& i_rVideoSettings ) override;
    void SetLensDistortionCalibration( const CoreLumekTypes::VCameraHardware& i_rCameraHardware,
                                       const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration ) override;
    void SetLensDistortionCorrectionEnabled( bool i_bEnabled ) override;

    // The vector form the hot loops use; tests and benchmarks pin it, the default is the best
    // the processor has.
    void SetInstructionSet( EInstructionSet i_Set ) { m_InstructionSet = i_Set; }
    const VColourCorrector& GetColourCorrector() const { return *m_pColourCorrector; }

  private:
    bool ConvertBayer( std::uint32_t i_Width, std::uint32_t i_Height, ZOL::EPixelFormat i_SourceFormat,
                       const std::uint8_t* i_pSource, std::uint64_t i_SourceSize, ZOL::EPixelFormat i_TargetFormat,
                       std::uint8_t* o_pTarget, std::uint64_t i_TargetSize );
    bool Demosaic( std::uint32_t i_Width, std::uint32_t i_Height, unsigned i_StartKind, const std::uint8_t* i_pSource,
                   ZOL::EPixelFormat i_TargetFormat, std::uint8_t* o_pTarget, std::uint64_t i_TargetSize );
    bool ConvertRuns( std::uint32_t i_Width, std::uint32_t i_Height, ZOL::EPixelFormat i_SourceFormat,
                      const std::uint8_t* i_pSource, std::uint64_t i_SourceSize, ZOL::EPixelFormat i_TargetFormat,
                      std::uint8_t* o_pTarget, std::uint64_t i_TargetSize );
    std::shared_ptr< ZOL::IBuffer > Allocate( std::uint64_t i_Size );

    std::shared_ptr< VColourCorrector > m_pColourCorrector;
    std::shared_ptr< ZOL::IBufferAllocator > m_pAllocator;
    EInstructionSet m_InstructionSet;
  };

  // One conversion with a converter of its own: default settings, offsets zero.
  [[nodiscard]] bool ConvertFrame( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_SourceFormat,
                                   const std::uint8_t* i_pSource, std::uint64_t i_SourceSize,
                                   ZOL::EPixelFormat i_TargetFormat, std::uint8_t* o_pTarget,
                                   std::uint64_t i_TargetSize );

  // 4:2:0 planes, as a video decoder gives them, to packed 4:2:2 (U8Y8V8Y8 or Y8U8Y8V8): each
  // chroma row serves two rows, without interpolation. Width and height must be even. The
  // output holds width x height x 2 bytes.
  [[nodiscard]] bool PlanarYUV420ToInterleaved( const std::uint8_t* i_pY, const std::uint8_t* i_pU,
                                                const std::uint8_t* i_pV, std::uint8_t* o_pOutput,
                                                ZOL::EPixelFormat i_Format, std::int32_t i_Width, std::int32_t i_Height,
                                                std::int32_t i_StrideY, std::int32_t i_StrideUV );

  // Bytes of a frame of a format, in 64 bits; 0 for an unknown format or an empty size.
  std::uint64_t FrameSizeInBytes( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format );
} // namespace CoreVideoUtils
