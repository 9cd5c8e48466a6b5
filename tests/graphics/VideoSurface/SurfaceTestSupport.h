#pragma once

// Frames made by the test, a widget to show them in, and pictures to compare.

#include "graphics/VideoSurface/VGLWidget.h"
#include "tests/graphics/CoreGraphics/DisplayTestMain.h"
#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

#include <QImage>
#include <QMarginsF>

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
    const QMarginsF D( i_rActual.left() - i_rExpected.left(), i_rActual.top() - i_rExpected.top(),
                       i_rActual.right() - i_rExpected.right(), i_rActual.bottom() - i_rExpected.bottom() );
    if( std::max( { std::abs( D.left() ), std::abs( D.top() ), std::abs( D.right() ), std::abs( D.bottom() ) } ) <=
        i_Tolerance )
      return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << "sides off by (" << D.left() << ", " << D.top() << ", " << D.right() << ", "
                                         << D.bottom() << ")";
  }

  // A frame of random bytes; i_Fill, when not negative, sets every byte to it instead.
  ZOL::IVideoFrame RandomFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height, std::uint32_t i_Seed = 1,
                                int i_Fill = -1 );
  // An 8-bit Bayer mosaic of a smooth colour picture, so that different demosaics agree closely.
  ZOL::IVideoFrame SmoothBayerFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height );

  // The processor's picture of a frame (the converter to R8G8B8, or to R8G8B8u8 for planar YUV,
  // which converts to the four-byte formats only).
  QImage ProcessorPicture( const ZOL::IVideoFrame& i_rFrame );
  // The 5 by 5 demosaic of Malvar, He and Cutler on a mosaic (widened to 8 bits first if packed),
  // edges clamped, followed by gamma and saturation as the display applies them; computed here in
  // double precision.
  QImage MalvarPicture( const ZOL::IVideoFrame& i_rFrame, float i_Gamma = 1.0f, float i_Saturation = 1.0f );

  // Compares the part of the picture at i_Origin with the expected one, leaving i_Inset pixels
  // of the expected picture's border out. On a difference (or with LUMEK_SAVE_PICTURES set) both
  // pictures are saved as PNG files named after the running test.
  ::testing::AssertionResult SamePicture( const QImage& i_rActual, const QImage& i_rExpected, QPoint i_Origin,
                                          int i_Tolerance, int i_Inset = 1 );

  // The display tests: a shown widget of a fixed size, skipped when there is no display.
  class SurfaceDisplayTest : public ::testing::Test
  {
  protected:
    // Room around a picture shown at 1:1, so that its border is seen.
    static constexpr int Margin = 4;

    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }

    LumekVideoViewer::VGLWidget& MakeWidget( int i_Width, int i_Height );
    // A widget Margin larger than the frame on each side, showing it at 1:1; a new one, or the
    // last one resized, as the viewer's widget is given frames of one format after another.
    void Show( const ZOL::IVideoFrame& i_rFrame, LumekVideoViewer::EDecoder i_Decoder = LumekVideoViewer::Hardware,
               bool i_bNewWidget = true );
    // Paints the widget and reads its picture back, RGB only.
    QImage Grab() { return m_pWidget->grabFramebuffer().convertToFormat( QImage::Format_RGB32 ); }
    // The widget's picture at 1:1 against the expected one.
    ::testing::AssertionResult Shows( const QImage& i_rExpected, int i_Tolerance, int i_Inset = 1 )
    {
      return SamePicture( Grab(), i_rExpected, QPoint( Margin, Margin ), i_Tolerance, i_Inset );
    }

    std::unique_ptr< LumekVideoViewer::VGLWidget > m_pWidget;
  };
} // namespace SurfaceTest
