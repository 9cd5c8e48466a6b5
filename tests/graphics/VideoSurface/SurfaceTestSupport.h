#pragma once

// Frames made by the test, a widget to show them in, and pictures to compare.

#include "graphics/VideoSurface/VGLWidget.h"
#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

#include <QImage>

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace SurfaceTest
{
  // An 8-bit RGB picture, rows top first.
  struct VRGBImage
  {
    int Width = 0;
    int Height = 0;
    std::vector< std::uint8_t > Bytes;

    VRGBImage() = default;
    VRGBImage( int i_Width, int i_Height )
        : Width( i_Width ), Height( i_Height ), Bytes( std::size_t( i_Width ) * i_Height * 3 )
    {
    }
    std::uint8_t* At( int i_X, int i_Y ) { return &Bytes[( std::size_t( i_Y ) * Width + i_X ) * 3]; }
    const std::uint8_t* At( int i_X, int i_Y ) const { return &Bytes[( std::size_t( i_Y ) * Width + i_X ) * 3]; }
  };

  ZOL::IVideoFrameInfo FrameInfo( ZOL::EPixelFormat i_Format, int i_Width, int i_Height );
  // A frame of random bytes, or of bytes from a function of the byte index.
  ZOL::IVideoFrame RandomFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height, std::uint32_t i_Seed = 1 );
  // A Bayer mosaic of a smooth colour picture, so that different demosaics agree closely.
  ZOL::IVideoFrame SmoothBayerFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height );

  // The processor's picture of a frame (the converter to R8G8B8).
  VRGBImage ProcessorPicture( const ZOL::IVideoFrame& i_rFrame );
  // The 5 by 5 demosaic of Malvar, He and Cutler on an 8-bit mosaic, edges clamped, followed by
  // gamma and saturation as the display applies them; computed here in double precision.
  VRGBImage MalvarPicture( const ZOL::IVideoFrameInfo& i_rInfo, const std::uint8_t* i_pMosaic, float i_Gamma = 1.0f,
                           float i_Saturation = 1.0f );

  // A shown widget of a fixed size; nullptr-free or the test fails.
  std::unique_ptr< LumekVideoViewer::VGLWidget > MakeWidget( int i_Width, int i_Height );
  // Paints the widget and reads its picture back, RGB only.
  QImage Grab( LumekVideoViewer::VGLWidget& io_rWidget );

  // Compares the part of the picture at i_Origin with the expected one, leaving i_Inset pixels
  // of the expected picture's border out. On a difference both pictures are saved as PNG files
  // named after the running test.
  ::testing::AssertionResult SamePicture( const QImage& i_rActual, const VRGBImage& i_rExpected, QPoint i_Origin,
                                          int i_Tolerance, int i_Inset = 1 );
  void SavePictures( const QImage& i_rActual, const VRGBImage& i_rExpected, QPoint i_Origin );

  int Difference( QRgb i_Colour, int i_R, int i_G, int i_B );
} // namespace SurfaceTest
