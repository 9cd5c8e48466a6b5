// Every pixel format drawn by the widget and read back, against the processor's picture of the
// same frame or a demosaic computed here.

#include "graphics/CoreVideoUtils/ColourCorrector.h"
#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"

#include <string>

namespace
{
  using namespace SurfaceTest;
  using LumekVideoViewer::Hardware;
  using LumekVideoViewer::Software;

  using PixelFormatDisplayTest = SurfaceDisplayTest;

  // The frames go to one widget in turn, so that its texture meets every change of width, height
  // and format.
  TEST_F( PixelFormatDisplayTest, HardwareMatchesTheReferencePictureOfEveryFormat )
  {
    const char* const Grey = "Raw Grayscale Decoder";
    const char* const Bayer = "Hardware Bayer Demosaic";
    const char* const RGB = "Hardware RGB Decoder";
    const char* const YUV = "Hardware YUV Decoder";
    const struct
    {
      ZOL::EPixelFormat Format;
      int Width, Height;
      // Bayer frames are held to the demosaic computed here, the others to the processor's picture.
      int Tolerance;
      const char* DecoderName;
    } Cases[] = {
        // Widths of 37 and 33 make rows whose length is not a multiple of four bytes.
        { ZOL::PixelFormat_Luminance8, 37, 21, 0, Grey },
        { ZOL::PixelFormat_Luminance8, 641, 5, 0, Grey },
        { ZOL::PixelFormat_Luminance7, 37, 21, 0, Grey },
        { ZOL::PixelFormat_Luminance6, 40, 24, 0, Grey },
        { ZOL::PixelFormat_BayerRG8, 40, 24, 2, Bayer },
        { ZOL::PixelFormat_BayerGB8, 40, 24, 2, Bayer },
        { ZOL::PixelFormat_BayerGR8, 37, 21, 2, Bayer },
        { ZOL::PixelFormat_BayerBG8, 40, 24, 2, Bayer },
        { ZOL::PixelFormat_BayerGB7, 37, 24, 2, Bayer },
        { ZOL::PixelFormat_BayerGB6, 37, 21, 2, Bayer },
        // The card widens 5 and 6 bits by repeating the top bits, the processor by zeros.
        { ZOL::PixelFormat_R5G6B5, 37, 21, 7, RGB },
        { ZOL::PixelFormat_R8G8B8, 37, 21, 0, RGB },
        { ZOL::PixelFormat_B8G8R8, 33, 24, 0, RGB },
        { ZOL::PixelFormat_R8G8B8u8, 37, 24, 0, RGB },
        { ZOL::PixelFormat_B8G8R8u8, 40, 24, 0, RGB },
        // Shader arithmetic in floats against 16.16 fixed point, U and V centred on 0.5 against 128.
        { ZOL::PixelFormat_U8Y8V8Y8, 40, 24, 3, YUV },
        { ZOL::PixelFormat_Y8U8Y8V8, 38, 21, 3, YUV },
        { ZOL::PixelFormat_U10Y10V10Y10, 40, 24, 4, YUV },
    };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( std::string( ZOL::ToString( rCase.Format ) ) + " " + std::to_string( rCase.Width ) + "x" +
                    std::to_string( rCase.Height ) );
      const ZOL::IVideoFrame Frame = RandomFrame( rCase.Format, rCase.Width, rCase.Height );
      Show( Frame, Hardware, false );
      EXPECT_EQ( m_pWidget->GetDecoderName().toStdString(), rCase.DecoderName );
      EXPECT_TRUE(
          Shows( rCase.DecoderName == Bayer ? MalvarPicture( Frame ) : ProcessorPicture( Frame ), rCase.Tolerance ) );
    }
  }

  // The planar formats never go to the card as they are: nothing in Hardware mode, the
  // processor's picture in Software mode.
  TEST_F( PixelFormatDisplayTest, PlanarShowsNothingInHardwareAndThePictureInSoftware )
  {
    QImage Black( 40, 24, QImage::Format_RGB32 );
    Black.fill( Qt::black );
    for( ZOL::EPixelFormat Format : { ZOL::PixelFormat_PlanarY8U8V8, ZOL::PixelFormat_PlanarR8G8B8 } )
    {
      SCOPED_TRACE( ZOL::ToString( Format ) );
      const ZOL::IVideoFrame Frame = RandomFrame( Format, 40, 24 );
      // An earlier frame's texture doesn't show through either.
      Show( RandomFrame( ZOL::PixelFormat_BayerGB8, 40, 24 ) );
      Grab();
      m_pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
      EXPECT_EQ( m_pWidget->GetDecoderName().toStdString(), "Hardware Bayer Demosaic" ) << "unchanged";
      EXPECT_TRUE( Shows( Black, 0 ) );

      m_pWidget->SetDecoder( Software );
      m_pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
      EXPECT_EQ( m_pWidget->GetDecoderName().toStdString(), "Software Decoder" );
      EXPECT_TRUE( Shows( ProcessorPicture( Frame ), 0 ) );
    }
  }

  TEST_F( PixelFormatDisplayTest, GammaAndSaturationApplyToBayerFramesOnly )
  {
    ZOL::IVideoSettings Settings;
    for( const auto& [Gamma, Saturation] : { std::make_pair( 2.2f, 0.4f ), std::make_pair( 0.7f, 1.6f ) } )
    {
      SCOPED_TRACE( "gamma " + std::to_string( Gamma ) + ", saturation " + std::to_string( Saturation ) );
      Settings.GammaCorrection = Gamma;
      Settings.Saturation = Saturation;

      // The shader applies them after the demosaic, from the next paint.
      const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_BayerGB8, 40, 24 );
      Show( Frame );
      m_pWidget->SetVideoSettings( Settings );
      EXPECT_TRUE( Shows( MalvarPicture( Frame, Gamma, Saturation ), 2 ) );

      // The software picture takes them at the next frame, and Bayer frames get them twice: once
      // inside the converter and once more from the widget's own corrector.
      const ZOL::IVideoFrame Other = RandomFrame( ZOL::PixelFormat_BayerRG8, 40, 24 );
      Show( Other, Software );
      const QImage Plain = ProcessorPicture( Other );
      EXPECT_TRUE( Shows( Plain, 0 ) );
      m_pWidget->SetVideoSettings( Settings );
      EXPECT_TRUE( Shows( Plain, 0 ) ) << "before the next frame";
      m_pWidget->PrepareFrame( 1, Other.VideoFrameInfo, Other, false );
      QImage Twice = Plain.convertToFormat( QImage::Format_RGB888 );
      CoreVideoUtils::VColourCorrector Corrector;
      Corrector.Set( Settings );
      for( int Time = 0; Time < 2; ++Time )
        for( int y = 0; y < Twice.height(); ++y )
          Corrector.Apply( Twice.width(), 1, ZOL::PixelFormat_R8G8B8, Twice.scanLine( y ) );
      EXPECT_TRUE( Shows( Twice, 0 ) );
    }

    // Other formats are left as they are, by the shaders and by the software path.
    for( ZOL::EPixelFormat Format :
         { ZOL::PixelFormat_Luminance8, ZOL::PixelFormat_R8G8B8, ZOL::PixelFormat_Y8U8Y8V8 } )
      for( LumekVideoViewer::EDecoder Decoder : { Hardware, Software } )
      {
        SCOPED_TRACE( std::string( ZOL::ToString( Format ) ) + ( Decoder == Software ? " in software" : "" ) );
        const ZOL::IVideoFrame Frame = RandomFrame( Format, 40, 24 );
        Show( Frame, Decoder );
        m_pWidget->SetVideoSettings( Settings );
        m_pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
        EXPECT_TRUE( Shows( ProcessorPicture( Frame ), Decoder == Software ? 0 : 3 ) );
      }
  }
} // namespace
