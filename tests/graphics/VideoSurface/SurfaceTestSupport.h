#pragma once

// Frames made by the test, a widget to show them in, and pictures to compare.

#include "graphics/VideoSurface/VGLWidget.h"
#include "tests/graphics/CoreGraphics/DisplayTestMain.h"
#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

#include <QImage>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <memory>
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

  // A frame of random bytes; i_Fill, when not negative, sets every byte to it instead.
  ZOL::IVideoFrame RandomFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height, std::uint32_t i_Seed = 1,
                                int i_Fill = -1 );
  // The processor's picture of a frame.
  QImage ProcessorPicture( const ZOL::IVideoFrame& i_rFrame );
  // The 5 by 5 demosaic of Malvar, He and Cutler on a mosaic (widened to 8 bits first if packed),
  // edges clamped, followed by gamma and saturation as the display applies them; computed here in
  // double precision.
  QImage MalvarPicture( const ZOL::IVideoFrame& i_rFrame, float i_Gamma = 1.0f, float i_Saturation = 1.0f );

  // Compares the part of the picture at i_Origin with the expected one, leaving the expected
  // picture's outer pixels out. On a difference (or with LUMEK_SAVE_PICTURES set) both pictures
  // are saved as PNG files named after the running test.
  ::testing::AssertionResult SamePicture( const QImage& i_rActual, const QImage& i_rExpected, QPoint i_Origin,
                                          int i_Tolerance );

  // The display tests: a shown widget of a fixed size, skipped when there is no display.
  class SurfaceDisplayTest : public ::testing::Test
  {
  protected:
    static constexpr int Margin = 4; // room around a picture shown at 1:1, so that its border is seen

    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }

    LumekVideoViewer::VGLWidget& MakeWidget( int i_Width, int i_Height );
    // A widget Margin larger than the frame on each side, showing it at 1:1; a new one, or the
    // last one resized, as the viewer's widget is given frames of one format after another.
    void Show( const ZOL::IVideoFrame& i_rFrame, LumekVideoViewer::EDecoder i_Decoder = LumekVideoViewer::Hardware,
               bool i_bNewWidget = true );
    // Paints the widget and reads its picture back, RGB only.
    QImage Grab() { return m_pWidget->grabFramebuffer().convertToFormat( QImage::Format_RGB32 ); }
    ::testing::AssertionResult Shows( const QImage& i_rExpected, int i_Tolerance )
    {
      return SamePicture( Grab(), i_rExpected, QPoint( Margin, Margin ), i_Tolerance );
    }

    std::unique_ptr< LumekVideoViewer::VGLWidget > m_pWidget;
  };
} // namespace SurfaceTest
