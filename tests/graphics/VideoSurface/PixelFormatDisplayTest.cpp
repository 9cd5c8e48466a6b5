// Every pixel format drawn by the widget and read back, against the processor's picture of the
// same frame or a demosaic computed here.

#include "graphics/CoreVideoUtils/ColourCorrector.h"
#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "graphics/VideoSurface/VVideoTexture.h"
#include "tests/graphics/CoreGraphics/DisplayTestMain.h"
#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"

#include <string>

namespace
{
  using namespace SurfaceTest;
  using LumekVideoViewer::VGLWidget;

  constexpr int Margin = 4;

  enum EReference
  {
    // The processor converter's R8G8B8 picture.
    Reference_Processor,
    // The 5 by 5 demosaic computed in the test, on the frame widened to 8 bits if need be.
    Reference_Malvar,
  };

  struct VFormatCase
  {
    const char* Name;
    ZOL::EPixelFormat Format;
    int Width;
    int Height;
    EReference Reference;
    int Tolerance;
    const char* DecoderName;
  };

  // The picture the widget should show in Hardware mode.
  VRGBImage HardwareReference( const VFormatCase& i_rCase, const ZOL::IVideoFrame& i_rFrame )
  {
    if( i_rCase.Reference == Reference_Processor )
      return ProcessorPicture( i_rFrame );
    ZOL::IVideoFrameInfo Info = i_rFrame.VideoFrameInfo;
    if( Info.PixelFormat != ZOL::PixelFormat_BayerGB7 && Info.PixelFormat != ZOL::PixelFormat_BayerGB6 )
      return MalvarPicture( Info, i_rFrame.Video->GetData() );
    std::vector< std::uint8_t > Mosaic( std::size_t( Info.ImageWidth ) * Info.ImageHeight );
    EXPECT_TRUE( CoreVideoUtils::ConvertFrame( Info.ImageWidth, Info.ImageHeight, Info.PixelFormat,
                                               i_rFrame.Video->GetData(), i_rFrame.Video->GetSize(),
                                               ZOL::PixelFormat_BayerGB8, Mosaic.data(), Mosaic.size() ) );
    Info.PixelFormat = ZOL::PixelFormat_BayerGB8;
    return MalvarPicture( Info, Mosaic.data() );
  }

  class HardwareFormatTest : public ::testing::TestWithParam< VFormatCase >
  {
  protected:
    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }
  };

  TEST_P( HardwareFormatTest, MatchesTheReferencePicture )
  {
    const VFormatCase& rCase = GetParam();
    const ZOL::IVideoFrame Frame = RandomFrame( rCase.Format, rCase.Width, rCase.Height );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( rCase.Width + 2 * Margin, rCase.Height + 2 * Margin );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    EXPECT_EQ( pWidget->GetDecoderName().toStdString(), rCase.DecoderName );

    const QImage Picture = Grab( *pWidget );
    EXPECT_TRUE( SamePicture( Picture, HardwareReference( rCase, Frame ), QPoint( Margin, Margin ), rCase.Tolerance ) );
  }

  const char* const Grey = "Raw Grayscale Decoder";
  const char* const Bayer = "Hardware Bayer Demosaic";
  const char* const RGB = "Hardware RGB Decoder";
  const char* const YUV = "Hardware YUV Decoder";

  // Widths of 37 and 33 make rows whose length is not a multiple of four bytes.
  const VFormatCase FormatCases[] = {
      { "Luminance8", ZOL::PixelFormat_Luminance8, 40, 24, Reference_Processor, 0, Grey },
      { "Luminance8_OddWidth", ZOL::PixelFormat_Luminance8, 37, 21, Reference_Processor, 0, Grey },
      { "Luminance8_Width641", ZOL::PixelFormat_Luminance8, 641, 5, Reference_Processor, 0, Grey },
      { "BayerRG8", ZOL::PixelFormat_BayerRG8, 40, 24, Reference_Malvar, 2, Bayer },
      { "BayerGB8", ZOL::PixelFormat_BayerGB8, 40, 24, Reference_Malvar, 2, Bayer },
      { "BayerGR8", ZOL::PixelFormat_BayerGR8, 40, 24, Reference_Malvar, 2, Bayer },
      { "BayerBG8", ZOL::PixelFormat_BayerBG8, 40, 24, Reference_Malvar, 2, Bayer },
      { "BayerBG8_OddWidth", ZOL::PixelFormat_BayerBG8, 37, 21, Reference_Malvar, 2, Bayer },
      // The card widens 5 and 6 bits by repeating the top bits, the processor by zeros.
      { "R5G6B5", ZOL::PixelFormat_R5G6B5, 40, 24, Reference_Processor, 7, RGB },
      { "R5G6B5_OddWidth", ZOL::PixelFormat_R5G6B5, 37, 21, Reference_Processor, 7, RGB },
      { "R8G8B8", ZOL::PixelFormat_R8G8B8, 40, 24, Reference_Processor, 0, RGB },
      { "R8G8B8_OddWidth", ZOL::PixelFormat_R8G8B8, 37, 21, Reference_Processor, 0, RGB },
      { "B8G8R8", ZOL::PixelFormat_B8G8R8, 33, 24, Reference_Processor, 0, RGB },
      { "R8G8B8u8", ZOL::PixelFormat_R8G8B8u8, 37, 24, Reference_Processor, 0, RGB },
      { "B8G8R8u8", ZOL::PixelFormat_B8G8R8u8, 40, 24, Reference_Processor, 0, RGB },
      // Shader arithmetic in floats against 16.16 fixed point, U and V centred on 0.5 against 128.
      { "U8Y8V8Y8", ZOL::PixelFormat_U8Y8V8Y8, 40, 24, Reference_Processor, 3, YUV },
      { "Y8U8Y8V8", ZOL::PixelFormat_Y8U8Y8V8, 38, 21, Reference_Processor, 3, YUV },
      { "U10Y10V10Y10", ZOL::PixelFormat_U10Y10V10Y10, 40, 24, Reference_Processor, 4, YUV },
      { "BayerGB7", ZOL::PixelFormat_BayerGB7, 37, 24, Reference_Malvar, 2, Bayer },
      { "BayerGB6", ZOL::PixelFormat_BayerGB6, 40, 21, Reference_Malvar, 2, Bayer },
      { "Luminance7", ZOL::PixelFormat_Luminance7, 37, 21, Reference_Processor, 0, Grey },
      { "Luminance6", ZOL::PixelFormat_Luminance6, 40, 24, Reference_Processor, 0, Grey },
  };

  INSTANTIATE_TEST_SUITE_P( Formats, HardwareFormatTest, ::testing::ValuesIn( FormatCases ),
                            []( const ::testing::TestParamInfo< VFormatCase >& i_rInfo )
                            { return i_rInfo.param.Name; } );

  class SurfaceDisplayTest : public ::testing::Test
  {
  protected:
    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }
  };

  // The shader's 5 by 5 filter and the processor's bilinear one agree on smooth content, away
  // from the border that the processor darkens.
  TEST_F( SurfaceDisplayTest, BayerAgreesWithTheProcessorOnSmoothContent )
  {
    for( ZOL::EPixelFormat Format : { ZOL::PixelFormat_BayerRG8, ZOL::PixelFormat_BayerGB8, ZOL::PixelFormat_BayerGR8,
                                      ZOL::PixelFormat_BayerBG8 } )
    {
      SCOPED_TRACE( ZOL::ToString( Format ) );
      const ZOL::IVideoFrame Frame = SmoothBayerFrame( Format, 48, 32 );
      std::unique_ptr< VGLWidget > pWidget = MakeWidget( 48 + 2 * Margin, 32 + 2 * Margin );
      pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
      pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
      EXPECT_TRUE( SamePicture( Grab( *pWidget ), ProcessorPicture( Frame ), QPoint( Margin, Margin ), 4, 2 ) );
    }
  }

  struct VPlanarCase
  {
    const char* Name;
    ZOL::EPixelFormat Format;
  };

  // Planar YUV converts to the four-byte RGB formats only, so its picture goes through R8G8B8u8.
  VRGBImage PlanarPicture( const ZOL::IVideoFrame& i_rFrame )
  {
    if( i_rFrame.VideoFrameInfo.PixelFormat != ZOL::PixelFormat_PlanarY8U8V8 )
      return ProcessorPicture( i_rFrame );
    const int W = i_rFrame.VideoFrameInfo.ImageWidth, H = i_rFrame.VideoFrameInfo.ImageHeight;
    std::vector< std::uint8_t > RGBA( std::size_t( W ) * H * 4 );
    EXPECT_TRUE( CoreVideoUtils::ConvertFrame( W, H, ZOL::PixelFormat_PlanarY8U8V8, i_rFrame.Video->GetData(),
                                               i_rFrame.Video->GetSize(), ZOL::PixelFormat_R8G8B8u8, RGBA.data(),
                                               RGBA.size() ) );
    VRGBImage Picture( W, H );
    for( std::size_t i = 0; i < std::size_t( W ) * H; ++i )
      std::copy( &RGBA[i * 4], &RGBA[i * 4] + 3, &Picture.Bytes[i * 3] );
    return Picture;
  }

  class PlanarFormatTest : public ::testing::TestWithParam< VPlanarCase >
  {
  protected:
    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }
  };

  // The planar formats never go to the card as they are: nothing in Hardware mode, the
  // processor's picture in Software mode.
  TEST_P( PlanarFormatTest, ShowsNothingInHardwareAndThePictureInSoftware )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( GetParam().Format, 40, 24 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 40 + 2 * Margin, 24 + 2 * Margin );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    // An earlier frame's texture doesn't show through either.
    const ZOL::IVideoFrame Earlier = RandomFrame( ZOL::PixelFormat_BayerGB8, 40, 24 );
    pWidget->PrepareFrame( 0, Earlier.VideoFrameInfo, Earlier, false );
    Grab( *pWidget );
    pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
    EXPECT_EQ( pWidget->GetDecoderName().toStdString(), "Hardware Bayer Demosaic" ) << "unchanged";
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), VRGBImage( 40, 24 ), QPoint( Margin, Margin ), 0 ) );

    pWidget->SetDecoder( LumekVideoViewer::Software );
    pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
    EXPECT_EQ( pWidget->GetDecoderName().toStdString(), "Software Decoder" );
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), PlanarPicture( Frame ), QPoint( Margin, Margin ), 0 ) );
  }

  INSTANTIATE_TEST_SUITE_P( Planar, PlanarFormatTest,
                            ::testing::Values( VPlanarCase{ "PlanarY8U8V8", ZOL::PixelFormat_PlanarY8U8V8 },
                                               VPlanarCase{ "PlanarR8G8B8", ZOL::PixelFormat_PlanarR8G8B8 } ),
                            []( const ::testing::TestParamInfo< VPlanarCase >& i_rInfo )
                            { return i_rInfo.param.Name; } );

  struct VSettingsCase
  {
    const char* Name;
    float Gamma;
    float Saturation;
  };

  class BayerSettingsTest : public ::testing::TestWithParam< VSettingsCase >
  {
  protected:
    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }
  };

  // Gamma and saturation in the shader follow the demosaic; the next paint shows them.
  TEST_P( BayerSettingsTest, HardwareAppliesThemOnTheNextPaint )
  {
    const VSettingsCase& rCase = GetParam();
    const ZOL::IVideoFrame Frame = SmoothBayerFrame( ZOL::PixelFormat_BayerGB8, 40, 24 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 40 + 2 * Margin, 24 + 2 * Margin );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    ZOL::IVideoSettings Settings;
    Settings.GammaCorrection = rCase.Gamma;
    Settings.Saturation = rCase.Saturation;
    pWidget->SetVideoSettings( Settings );
    const VRGBImage Expected =
        MalvarPicture( Frame.VideoFrameInfo, Frame.Video->GetData(), rCase.Gamma, rCase.Saturation );
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), Expected, QPoint( Margin, Margin ), 2 ) );
  }

  // The software picture takes the settings at the next frame, and Bayer frames get them twice:
  // once inside the converter and once more from the widget's own corrector.
  TEST_P( BayerSettingsTest, SoftwareAppliesThemTwiceFromTheNextFrame )
  {
    const VSettingsCase& rCase = GetParam();
    const ZOL::IVideoFrame Frame = SmoothBayerFrame( ZOL::PixelFormat_BayerRG8, 40, 24 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 40 + 2 * Margin, 24 + 2 * Margin );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->SetDecoder( LumekVideoViewer::Software );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    const VRGBImage Plain = ProcessorPicture( Frame );
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), Plain, QPoint( Margin, Margin ), 0 ) );

    ZOL::IVideoSettings Settings;
    Settings.GammaCorrection = rCase.Gamma;
    Settings.Saturation = rCase.Saturation;
    pWidget->SetVideoSettings( Settings );
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), Plain, QPoint( Margin, Margin ), 0 ) ) << "before the next frame";

    pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
    VRGBImage Twice = Plain;
    CoreVideoUtils::VColourCorrector Corrector;
    Corrector.Set( Settings );
    Corrector.Apply( Twice.Width, Twice.Height, ZOL::PixelFormat_R8G8B8, Twice.Bytes.data() );
    Corrector.Apply( Twice.Width, Twice.Height, ZOL::PixelFormat_R8G8B8, Twice.Bytes.data() );
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), Twice, QPoint( Margin, Margin ), 0 ) );
  }

  INSTANTIATE_TEST_SUITE_P(
      Settings, BayerSettingsTest,
      ::testing::Values( VSettingsCase{ "Gamma2_2", 2.2f, 1.0f }, VSettingsCase{ "Desaturated", 1.0f, 0.4f },
                         VSettingsCase{ "Saturated", 1.0f, 1.6f }, VSettingsCase{ "Both", 0.7f, 1.3f } ),
      []( const ::testing::TestParamInfo< VSettingsCase >& i_rInfo ) { return i_rInfo.param.Name; } );

  // Gamma and saturation belong to the Bayer program alone.
  TEST_F( SurfaceDisplayTest, SettingsLeaveOtherFormatsAlone )
  {
    ZOL::IVideoSettings Settings;
    Settings.GammaCorrection = 2.2f;
    Settings.Saturation = 0.3f;
    for( ZOL::EPixelFormat Format :
         { ZOL::PixelFormat_Luminance8, ZOL::PixelFormat_R8G8B8, ZOL::PixelFormat_Y8U8Y8V8 } )
    {
      SCOPED_TRACE( ZOL::ToString( Format ) );
      const ZOL::IVideoFrame Frame = RandomFrame( Format, 40, 24 );
      std::unique_ptr< VGLWidget > pWidget = MakeWidget( 40 + 2 * Margin, 24 + 2 * Margin );
      pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
      pWidget->SetVideoSettings( Settings );
      pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
      EXPECT_TRUE( SamePicture( Grab( *pWidget ), ProcessorPicture( Frame ), QPoint( Margin, Margin ), 3 ) );
    }
  }

  TEST_F( SurfaceDisplayTest, SoftwarePassesRGBFramesAsTheyAre )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_R8G8B8, 37, 21 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 37 + 2 * Margin, 21 + 2 * Margin );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->SetDecoder( LumekVideoViewer::Software );
    ZOL::IVideoSettings Settings;
    Settings.GammaCorrection = 2.0f;
    pWidget->SetVideoSettings( Settings );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    EXPECT_EQ( pWidget->GetDecoderName().toStdString(), "Software Decoder" );
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), ProcessorPicture( Frame ), QPoint( Margin, Margin ), 0 ) );
  }
} // namespace
