#pragma once

// The sensor and lens records and the rectangle comparison of the widget's tests with and
// without a display.

#include "graphics/VideoSurface/VViewGeometry.h"
#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <vector>

namespace SurfaceTest
{
  inline CoreLumekTypes::VCameraHardware Camera( int i_Width, int i_Height )
  {
    CoreLumekTypes::VCameraHardware Hardware;
    Hardware.DeviceURN = "urn:test:camera";
    Hardware.SensorWidthInPixels = std::uint32_t( i_Width );
    Hardware.SensorHeightInPixels = std::uint32_t( i_Height );
    return Hardware;
  }

  inline CoreLumekTypes::VLensDistortionCalibration Lens( std::vector< double > i_K, double i_X, double i_Y,
                                                          ZOL::ERadialModel i_Model = ZOL::RadialModel_Lumek2Parameter )
  {
    CoreLumekTypes::VLensDistortionCalibration Calibration;
    Calibration.RadialModel = i_Model;
    Calibration.RadialDistortionParameters = std::move( i_K );
    Calibration.RadialDistortionCentre_X = i_X;
    Calibration.RadialDistortionCentre_Y = i_Y;
    return Calibration;
  }

  // The sides of a rectangle within i_Tolerance of the expected ones.
  inline ::testing::AssertionResult NearRect( const QRectF& i_rActual, const QRectF& i_rExpected, double i_Tolerance )
  {
    const QRectF& A = i_rActual;
    const QRectF& E = i_rExpected;
    const double Off = std::max( { std::abs( A.left() - E.left() ), std::abs( A.top() - E.top() ),
                                   std::abs( A.right() - E.right() ), std::abs( A.bottom() - E.bottom() ) } );
    if( Off <= i_Tolerance )
      return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << "sides " << A.left() << ", " << A.top() << ", " << A.right() << ", "
                                         << A.bottom() << " off by up to " << Off;
  }

} // namespace SurfaceTest
