// The widget's pictures, read back under an X server: every pixel format against the processor's
// picture of the same frame or a demosaic computed here; then where the widget puts the picture:
// flips, images smaller than the sensor, lens distortion, scale modes and the mouse, and the
// plates drawn over the picture.

#include "graphics/CoreVideoUtils/ColourCorrector.h"
#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "graphics/VideoSurface/VGLWidget.h"
#include "graphics/VideoSurface/VVideoTexture.h"
#include "tests/graphics/CoreGraphics/DisplayTestMain.h"
#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"
#include "videointerface/PixelFormatDescriptor.h"

#include <QMouseEvent>
#include <QSignalSpy>
#include <QTest>

#include <random>
#include <string>

namespace
{
  using namespace SurfaceTest;
  using namespace ZOL;
  using LumekVideoViewer::Hardware;
  using LumekVideoViewer::Software;
  using LumekVideoViewer::VGLWidget;

  std::vector< std::uint8_t > Convert( const IVideoFrame& i_rFrame, EPixelFormat i_To )
  {
    const IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
    std::vector< std::uint8_t > Result( CoreVideoUtils::FrameSizeInBytes( rInfo.ImageWidth, rInfo.ImageHeight, i_To ) );
    EXPECT_TRUE( CoreVideoUtils::ConvertFrame( rInfo.ImageWidth, rInfo.ImageHeight, rInfo.PixelFormat,
                                               i_rFrame.Video->GetData(), i_rFrame.Video->GetSize(), i_To,
                                               Result.data(), Result.size() ) )
        << "format " << rInfo.PixelFormat << " to " << i_To;
    return Result;
  }

  // A frame of random bytes; i_Fill, when not negative, sets every byte to it instead.
  IVideoFrame RandomFrame( EPixelFormat i_Format, int i_Width, int i_Height, std::uint32_t i_Seed = 1, int i_Fill = -1 )
  {
    IVideoFrame Frame;
    Frame.VideoFrameInfo.ImageWidth = i_Width;
    Frame.VideoFrameInfo.ImageHeight = i_Height;
    Frame.VideoFrameInfo.PixelFormat = i_Format;
    Frame.VideoFrameInfo.PixelAspectRatio = 1.0;
    auto pBuffer = std::make_shared< IStandardBuffer >();
    pBuffer->Resize( GetVideoFrameSizeInBytes64( Frame.VideoFrameInfo ) );
    std::mt19937 Random( i_Seed );
    for( std::uint64_t i = 0; i < pBuffer->GetSize(); ++i )
      pBuffer->GetData()[i] = std::uint8_t( i_Fill >= 0 ? i_Fill : Random() >> 24 );
    Frame.Video = pBuffer;
    return Frame;
  }

  QImage ProcessorPicture( const IVideoFrame& i_rFrame )
  {
    // The four-byte target, the only one every format converts to.
    const std::vector< std::uint8_t > Bytes = Convert( i_rFrame, PixelFormat_R8G8B8u8 );
    const int W = i_rFrame.VideoFrameInfo.ImageWidth;
    return QImage( Bytes.data(), W, i_rFrame.VideoFrameInfo.ImageHeight, W * 4, QImage::Format_RGBX8888 )
        .convertToFormat( QImage::Format_RGB32 );
  }

  // The 5 by 5 demosaic of Malvar, He and Cutler on a mosaic (widened to 8 bits first if packed),
  // edges clamped, followed by gamma and saturation as the display applies them; computed here in
  // double precision.
  QImage MalvarPicture( const IVideoFrame& i_rFrame, float i_Gamma = 1.0f, float i_Saturation = 1.0f )
  {
    const int W = i_rFrame.VideoFrameInfo.ImageWidth, H = i_rFrame.VideoFrameInfo.ImageHeight;
    const EPixelFormat Format = i_rFrame.VideoFrameInfo.PixelFormat;
    const std::uint8_t* pData = i_rFrame.Video->GetData();
    const std::vector< std::uint8_t > Mosaic = Format == PixelFormat_BayerGB7 || Format == PixelFormat_BayerGB6
                                                   ? Convert( i_rFrame, PixelFormat_BayerGB8 )
                                                   : std::vector< std::uint8_t >( pData, pData + W * H );
    // The colours of the mosaic's 2 by 2 tile, row by row; BayerGB8 for its packed forms too.
    const char* pTile = Format == PixelFormat_BayerRG8   ? "RGGB"
                        : Format == PixelFormat_BayerGR8 ? "GRBG"
                        : Format == PixelFormat_BayerBG8 ? "BGGR"
                                                         : "GBRG";
    auto P = [&]( int x, int y ) { return Mosaic[std::clamp( y, 0, H - 1 ) * W + std::clamp( x, 0, W - 1 )] / 255.0; };
    auto Channel = []( char i_Colour ) { return i_Colour == 'R' ? 0 : i_Colour == 'G' ? 1 : 2; };
    QImage Picture( W, H, QImage::Format_RGB32 );
    for( int y = 0; y < H; ++y )
      for( int x = 0; x < W; ++x )
      {
        const double C = P( x, y );
        const double Diagonal = P( x - 1, y - 1 ) + P( x + 1, y - 1 ) + P( x - 1, y + 1 ) + P( x + 1, y + 1 );
        const double Horizontal = P( x - 1, y ) + P( x + 1, y ), Vertical = P( x, y - 1 ) + P( x, y + 1 );
        const double FarHorizontal = P( x - 2, y ) + P( x + 2, y ), FarVertical = P( x, y - 2 ) + P( x, y + 2 );
        const double Far = FarHorizontal + FarVertical;
        // The site's own colour, and the other colour of its row.
        const char Site = pTile[( y & 1 ) * 2 + ( x & 1 )];
        const char Beside = pTile[( y & 1 ) * 2 + ( ~x & 1 )];
        double Colour[3];
        Colour[Channel( Site )] = C;
        if( Site == 'G' ) // each chroma from the neighbours in its row, or in its column
        {
          Colour[Channel( Beside )] = ( 5 * C + 4 * Horizontal - FarHorizontal + 0.5 * FarVertical - Diagonal ) / 8;
          Colour[2 - Channel( Beside )] = ( 5 * C + 4 * Vertical - FarVertical + 0.5 * FarHorizontal - Diagonal ) / 8;
        }
        else // green, and the other chroma across the corners
        {
          Colour[1] = ( 4 * C + 2 * ( Horizontal + Vertical ) - Far ) / 8;
          Colour[2 - Channel( Site )] = ( 6 * C + 2 * Diagonal - 1.5 * Far ) / 8;
        }
        double Grey = 0;
        for( double& rValue : Colour )
        {
          rValue = std::copysign( std::pow( std::abs( rValue ), 1.0 / i_Gamma ), rValue );
          Grey += std::max( rValue, 0.0 ) / 3;
        }
        const double Amount = std::min( 1.0 - i_Saturation, 1.0 );
        auto Shown = [&]( int i ) {
          return int( std::lround( std::clamp( ( Colour[i] + ( Grey - Colour[i] ) * Amount ) * 255.0, 0.0, 255.0 ) ) );
        };
        Picture.setPixel( x, y, qRgb( Shown( 0 ), Shown( 1 ), Shown( 2 ) ) );
      }
    return Picture;
  }

  // Compares the part of the picture at i_Origin with the expected one, leaving the expected
  // picture's outer pixels out. On a difference (or with LUMEK_SAVE_PICTURES set) both pictures
  // are saved as PNG files named after the running test.
  ::testing::AssertionResult SamePicture( const QImage& i_rActual, const QImage& i_rExpected, QPoint i_Origin,
                                          int i_Tolerance )
  {
    int Worst = 0, Differing = 0;
    for( int y = 1; y < i_rExpected.height() - 1; ++y )
      for( int x = 1; x < i_rExpected.width() - 1; ++x )
      {
        if( !i_rActual.rect().contains( i_Origin + QPoint( x, y ) ) )
          return ::testing::AssertionFailure() << "picture too small for " << x << ", " << y;
        const QRgb Want = i_rExpected.pixel( x, y ), Got = i_rActual.pixel( i_Origin + QPoint( x, y ) );
        const int D = std::max( { std::abs( qRed( Got ) - qRed( Want ) ), std::abs( qGreen( Got ) - qGreen( Want ) ),
                                  std::abs( qBlue( Got ) - qBlue( Want ) ) } );
        Differing += D > i_Tolerance ? 1 : 0;
        Worst = std::max( Worst, D );
      }
    if( Differing != 0 || qEnvironmentVariableIsSet( "LUMEK_SAVE_PICTURES" ) )
    {
      const ::testing::TestInfo* pInfo = ::testing::UnitTest::GetInstance()->current_test_info();
      const QString Name = QString( "%1_%2" ).arg( pInfo->test_suite_name(), pInfo->name() ).replace( '/', '_' );
      i_rActual.save( Name + "_actual.png" );
      i_rExpected.save( Name + "_expected.png" );
    }
    if( Differing == 0 )
      return ::testing::AssertionSuccess() << "largest difference " << Worst;
    return ::testing::AssertionFailure() << Differing << " pixels differ by more than " << i_Tolerance << ", by up to "
                                         << Worst << "; see the saved pictures";
  }

  // The display tests: a shown widget of a fixed size, skipped when there is no display.
  class SurfaceDisplayTest : public ::testing::Test
  {
  protected:
    static constexpr int Margin = 4; // room around a picture shown at 1:1, so that its border is seen

    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }

    VGLWidget& MakeWidget( int i_Width, int i_Height )
    {
      m_pWidget = std::make_unique< VGLWidget >();
      m_pWidget->setFixedSize( i_Width, i_Height );
      m_pWidget->show();
      EXPECT_TRUE( QTest::qWaitForWindowExposed( m_pWidget.get() ) );
      return *m_pWidget;
    }
    // A widget Margin larger than the frame on each side, showing it at 1:1; a new one, or the
    // last one resized, as the viewer's widget is given frames of one format after another.
    void Show( const IVideoFrame& i_rFrame, LumekVideoViewer::EDecoder i_Decoder = Hardware, bool i_bNewWidget = true )
    {
      const IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
      const QSize Size( rInfo.ImageWidth + 2 * Margin, rInfo.ImageHeight + 2 * Margin );
      const bool bReuse = !i_bNewWidget && m_pWidget;
      if( bReuse )
        m_pWidget->setFixedSize( Size );
      else
        MakeWidget( Size.width(), Size.height() );
      m_pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
      // A new widget starts in Hardware mode, as the viewer's does.
      if( bReuse || i_Decoder != Hardware )
        m_pWidget->SetDecoder( i_Decoder );
      m_pWidget->PrepareFrame( 0, rInfo, i_rFrame, false );
    }
    QImage Grab() { return m_pWidget->grabFramebuffer().convertToFormat( QImage::Format_RGB32 ); }
    ::testing::AssertionResult Shows( const QImage& i_rExpected, int i_Tolerance )
    {
      return SamePicture( Grab(), i_rExpected, QPoint( Margin, Margin ), i_Tolerance );
    }

    std::unique_ptr< VGLWidget > m_pWidget;
  };

  using PixelFormatDisplayTest = SurfaceDisplayTest;
  using GeometryDisplayTest = SurfaceDisplayTest;

  // The frames go to one widget in turn, so that its texture meets every change of width, height
  // and format.
  TEST_F( PixelFormatDisplayTest, HardwareMatchesTheReferencePictureOfEveryFormat )
  {
    const struct
    {
      EPixelFormat Format;
      int Width, Height;
      // Bayer frames are held to the demosaic computed here, the others to the processor's picture.
      int Tolerance;
      const char* DecoderName;
    } Cases[] = {
        // Widths of 37 and 33 make rows whose length is not a multiple of four bytes.
        { PixelFormat_Luminance8, 37, 21, 0, "Raw Grayscale Decoder" },
        { PixelFormat_Luminance8, 641, 5, 0, "Raw Grayscale Decoder" },
        { PixelFormat_Luminance7, 37, 21, 0, "Raw Grayscale Decoder" },
        { PixelFormat_Luminance6, 40, 24, 0, "Raw Grayscale Decoder" },
        { PixelFormat_BayerRG8, 40, 24, 2, "Hardware Bayer Demosaic" },
        { PixelFormat_BayerGB8, 40, 24, 2, "Hardware Bayer Demosaic" },
        { PixelFormat_BayerGR8, 37, 21, 2, "Hardware Bayer Demosaic" },
        { PixelFormat_BayerBG8, 40, 24, 2, "Hardware Bayer Demosaic" },
        { PixelFormat_BayerGB7, 37, 24, 2, "Hardware Bayer Demosaic" },
        { PixelFormat_BayerGB6, 37, 21, 2, "Hardware Bayer Demosaic" },
        // The card widens 5 and 6 bits by repeating the top bits, the processor by zeros.
        { PixelFormat_R5G6B5, 37, 21, 7, "Hardware RGB Decoder" },
        { PixelFormat_R8G8B8, 37, 21, 0, "Hardware RGB Decoder" },
        { PixelFormat_B8G8R8, 33, 24, 0, "Hardware RGB Decoder" },
        { PixelFormat_R8G8B8u8, 37, 24, 0, "Hardware RGB Decoder" },
        { PixelFormat_B8G8R8u8, 40, 24, 0, "Hardware RGB Decoder" },
        // Shader arithmetic in floats against 16.16 fixed point, U and V centred on 0.5 against 128.
        { PixelFormat_U8Y8V8Y8, 40, 24, 3, "Hardware YUV Decoder" },
        { PixelFormat_Y8U8Y8V8, 38, 21, 3, "Hardware YUV Decoder" },
        { PixelFormat_U10Y10V10Y10, 40, 24, 4, "Hardware YUV Decoder" },
    };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( std::string( ToString( rCase.Format ) ) + " " + std::to_string( rCase.Width ) + "x" +
                    std::to_string( rCase.Height ) );
      const IVideoFrame Frame = RandomFrame( rCase.Format, rCase.Width, rCase.Height );
      Show( Frame, Hardware, false );
      EXPECT_EQ( m_pWidget->GetDecoderName().toStdString(), rCase.DecoderName );
      EXPECT_TRUE( Shows( IsBayerFormat( rCase.Format ) ? MalvarPicture( Frame ) : ProcessorPicture( Frame ),
                          rCase.Tolerance ) );
    }
  }

  // The planar formats never go to the card as they are: nothing in Hardware mode, the
  // processor's picture in Software mode.
  TEST_F( PixelFormatDisplayTest, PlanarShowsNothingInHardwareAndThePictureInSoftware )
  {
    QImage Black( 40, 24, QImage::Format_RGB32 );
    Black.fill( Qt::black );
    for( EPixelFormat Format : { PixelFormat_PlanarY8U8V8, PixelFormat_PlanarR8G8B8 } )
    {
      SCOPED_TRACE( ToString( Format ) );
      const IVideoFrame Frame = RandomFrame( Format, 40, 24 );
      // An earlier frame's texture doesn't show through either.
      Show( RandomFrame( PixelFormat_BayerGB8, 40, 24 ) );
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
    IVideoSettings Settings;
    for( const auto& [Gamma, Saturation] : { std::make_pair( 2.2f, 0.4f ), std::make_pair( 0.7f, 1.6f ) } )
    {
      SCOPED_TRACE( "gamma " + std::to_string( Gamma ) + ", saturation " + std::to_string( Saturation ) );
      Settings.GammaCorrection = Gamma;
      Settings.Saturation = Saturation;

      // The shader applies them after the demosaic, from the next paint.
      const IVideoFrame Frame = RandomFrame( PixelFormat_BayerGB8, 40, 24 );
      Show( Frame );
      m_pWidget->SetVideoSettings( Settings );
      EXPECT_TRUE( Shows( MalvarPicture( Frame, Gamma, Saturation ), 2 ) );

      // The software picture takes them at the next frame, and Bayer frames get them twice: once
      // inside the converter and once more from the widget's own corrector.
      const IVideoFrame Other = RandomFrame( PixelFormat_BayerRG8, 40, 24 );
      Show( Other, Software );
      const QImage Plain = ProcessorPicture( Other );
      EXPECT_TRUE( Shows( Plain, 0 ) );
      m_pWidget->SetVideoSettings( Settings );
      EXPECT_TRUE( Shows( Plain, 0 ) ) << "before the next frame";
      m_pWidget->PrepareFrame( 1, Other.VideoFrameInfo, Other, false );
      QImage Twice = Plain.convertToFormat( QImage::Format_RGB888 );
      CoreVideoUtils::VColourCorrector Corrector;
      Corrector.Set( Settings );
      for( int Time = 0; Time < 2; ++Time ) // rows of 120 bytes, so the lines lie end to end
        Corrector.Apply( Twice.width(), Twice.height(), PixelFormat_R8G8B8, Twice.bits() );
      EXPECT_TRUE( Shows( Twice, 0 ) );
    }

    // Other formats are left as they are, by the shaders and by the software path.
    for( EPixelFormat Format : { PixelFormat_Luminance8, PixelFormat_R8G8B8, PixelFormat_Y8U8Y8V8 } )
      for( LumekVideoViewer::EDecoder Decoder : { Hardware, Software } )
      {
        SCOPED_TRACE( std::string( ToString( Format ) ) + ( Decoder == Software ? " in software" : "" ) );
        const IVideoFrame Frame = RandomFrame( Format, 40, 24 );
        Show( Frame, Decoder );
        m_pWidget->SetVideoSettings( Settings );
        m_pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
        EXPECT_TRUE( Shows( ProcessorPicture( Frame ), Decoder == Software ? 0 : 3 ) );
      }
  }

  const QRgb Plate = qRgb( 64, 64, 64 );

  // The bounding box of the outline's pixels, from the first to the last. The outline's colour is
  // (0.78, 0.6, 0.06): wherever the line covers a pixel only partly, mixed with the grey picture
  // or the black around it, red stays over green over blue.
  QRectF OutlineBox( const QImage& i_rPicture )
  {
    QRect Box;
    for( int y = 0; y < i_rPicture.height(); ++y )
      for( int x = 0; x < i_rPicture.width(); ++x )
      {
        const QRgb C = i_rPicture.pixel( x, y );
        if( qRed( C ) > qGreen( C ) + 8 && qGreen( C ) > qBlue( C ) + 20 )
          Box |= QRect( x, y, 1, 1 );
      }
    return QRectF( Box.topLeft(), Box.bottomRight() );
  }

  // A white 48 by 32 image at (24, 32) on a 96 by 96 sensor, shown at 1:1. Straight, it keeps to
  // its place with its outline around it. Barrel distortion moves the picture's corners out, and
  // the outline becomes the distorted bounds.
  TEST_F( GeometryDisplayTest, LensCalibrationBendsThePictureAndTheOutline )
  {
    const IVideoFrame Frame = RandomFrame( PixelFormat_Luminance8, 48, 32, 1, 255 );
    IVideoFrameInfo Geometry = Frame.VideoFrameInfo;
    Geometry.TwiceOffsetX = 48;
    Geometry.TwiceOffsetY = 64;
    const QRectF Image( 24, 32, 48, 32 );
    const QVector3D Parameters( 2e-4f, 0, 0 );
    VGLWidget& rWidget = MakeWidget( 96, 96 );
    rWidget.SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    rWidget.SetLensDistortionCalibration( Camera( 96, 96 ), Lens( { Parameters.x(), 0.0 }, 48, 48 ) );
    rWidget.PrepareFrame( 0, Geometry, Frame, false );
    const QImage Picture = Grab();
    EXPECT_TRUE( SamePicture( Picture, ProcessorPicture( Frame ), QPoint( 24, 32 ), 0 ) );
    int Stray = 0; // the black sensor, apart from the outline's rows and columns
    for( int y = 0; y < 96; ++y )
      for( int x = 0; x < 96; ++x )
        Stray += !QRect( 22, 30, 52, 36 ).contains( x, y ) && qGray( Picture.pixel( x, y ) ) != 0 ? 1 : 0;
    EXPECT_EQ( Stray, 0 );
    const QRectF Straight = OutlineBox( Picture );
    EXPECT_TRUE( NearRect( Straight, Image, 1.0 ) );

    rWidget.SetLensDistortionCorrectionEnabled( true );
    rWidget.SetScaleMode( LumekVideoViewer::ScaleOneToOne ); // centred on the sensor again
    const QImage Bent = Grab();
    const QRectF Box = OutlineBox( Bent );
    const QRectF Bounds = LumekVideoViewer::DistortedBounds( Image, QVector2D( 48, 48 ), Parameters );
    EXPECT_NEAR( Box.left(), Bounds.left(), 1.5 );
    EXPECT_NEAR( Box.top(), Bounds.top(), 1.5 );
    EXPECT_LT( Box.left(), Straight.left() - 4 );
    // The top-left corner (24, 32) lies 24 and 16 pixels from the centre: it moves by a factor
    // 1 + k1 (24^2 + 16^2) to about (19.0, 28.7). The middle of the top edge moves less.
    EXPECT_GT( qGray( Bent.pixel( 21, 30 ) ), 200 ) << "outside the straight image, inside the bent one";
    EXPECT_EQ( qGray( Bent.pixel( 48, 29 ) ), 0 ) << "above the middle of the top edge";

    // A lens with no parameters moves nothing, though the outline, as distorted bounds, reaches a
    // pixel further up and to the left.
    rWidget.SetLensDistortionCalibration( Camera( 96, 96 ), Lens( { 0.0, 0.0 }, 48, 48 ) );
    rWidget.PrepareFrame( 1, Geometry, Frame, false );
    const QImage Unbent = Grab();
    EXPECT_TRUE( SamePicture( Unbent, ProcessorPicture( Frame ), QPoint( 24, 32 ), 0 ) );
    EXPECT_TRUE( NearRect( OutlineBox( Unbent ), Image.adjusted( -1, -1, 0, 0 ), 1.0 ) );

    // A distortion centre of exactly (0, 0) switches the shader's distortion off, whatever the
    // parameters say.
    const IVideoFrame Plain = RandomFrame( PixelFormat_Luminance8, 40, 24 );
    Show( Plain );
    m_pWidget->SetLensDistortionCalibration( Camera( 40, 24 ), Lens( { 1e-3, 0.0 }, 0, 0 ) );
    m_pWidget->SetLensDistortionCorrectionEnabled( true );
    m_pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    EXPECT_TRUE( Shows( ProcessorPicture( Plain ), 0 ) );
  }

  TEST_F( GeometryDisplayTest, MissingFrameDarkensThePictureUnderAPlate )
  {
    const IVideoFrame Frame = RandomFrame( PixelFormat_Luminance8, 160, 60, 1, 200 );
    VGLWidget& rWidget = MakeWidget( 160, 60 );
    rWidget.PrepareFrame( 41, Frame.VideoFrameInfo, Frame, false );
    EXPECT_EQ( qGray( Grab().pixel( 5, 5 ) ), 200 );

    // The window passes the last good frame again with the warning.
    rWidget.PrepareFrame( 42, Frame.VideoFrameInfo, Frame, true );
    const QImage Picture = Grab();
    EXPECT_NEAR( qGray( Picture.pixel( 5, 5 ) ), 100, 2 ) << "half of the picture shows through";
    EXPECT_EQ( Picture.pixel( 80, 30 ) & 0xffffff, Plate & 0xffffff ) << "the plate in the middle";
    int White = 0;
    for( int x = 0; x < 160; ++x )
      White += qGray( Picture.pixel( x, 30 ) ) > 200 ? 1 : 0;
    EXPECT_GT( White, 4 ) << "the text on the plate";

    // A frame without a description draws no picture; the warning is still painted.
    rWidget.PrepareFrame( 43, IVideoFrameInfo(), IVideoFrame(), true );
    const QImage Empty = Grab();
    EXPECT_EQ( qGray( Empty.pixel( 5, 5 ) ), 0 );
    EXPECT_EQ( Empty.pixel( 80, 30 ) & 0xffffff, Plate & 0xffffff );

    // Clearing leaves the surface black and forgets the frame.
    rWidget.PrepareFrame( 44, Frame.VideoFrameInfo, Frame, false );
    EXPECT_EQ( qGray( Grab().pixel( 80, 2 ) ), 200 );
    rWidget.Clear();
    EXPECT_FALSE( rWidget.GetPixelRecord().IsValid() );
    EXPECT_EQ( qGray( Grab().pixel( 80, 2 ) ), 0 );
  }

  // 100 by 50 shown in a 200 by 100 widget fits at zoom 2: every image pixel becomes 2 by 2, and
  // a frame stored bottom row first is flipped. A right drag then zooms, shows the zoom plate
  // while it lasts and leaves the view free.
  TEST_F( GeometryDisplayTest, FitsTheWindowUntilARightDragZooms )
  {
    IVideoFrame Frame = RandomFrame( PixelFormat_Luminance8, 100, 50 );
    Frame.VideoFrameInfo.Flags |= IVideoFrameInfo::Flag_Inverted;
    VGLWidget& rWidget = MakeWidget( 200, 100 );
    rWidget.PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    EXPECT_FLOAT_EQ( rWidget.GetView().GetZoom(), 2.0f );
    const QImage Fitted = Grab();
    int Wrong = 0;
    for( int y = 2; y < 2 * 49; ++y )
      for( int x = 2; x < 2 * 99; ++x )
        Wrong += qGray( Fitted.pixel( x, y ) ) != Frame.Video->GetData()[( 49 - y / 2 ) * 100 + x / 2];
    EXPECT_EQ( Wrong, 0 );

    QSignalSpy Spy( &rWidget, &VGLWidget::ScaleModeChanged );
    QTest::mousePress( &rWidget, Qt::RightButton, Qt::NoModifier, QPoint( 100, 80 ) );
    // Ten pixels down in a widget a hundred high zooms out by a tenth.
    QMouseEvent Move( QEvent::MouseMove, QPoint( 100, 90 ), Qt::NoButton, Qt::RightButton, Qt::NoModifier );
    QApplication::sendEvent( &rWidget, &Move );
    ASSERT_EQ( Spy.count(), 1 );
    EXPECT_EQ( Spy.at( 0 ).at( 0 ).value< LumekVideoViewer::EScaleMode >(), LumekVideoViewer::ScaleFreely );
    EXPECT_EQ( rWidget.GetScaleMode(), LumekVideoViewer::ScaleFreely );
    EXPECT_FLOAT_EQ( rWidget.GetView().GetZoom(), 2.0f * 0.9f );
    // The plate sits 20 pixels in from the top right corner.
    EXPECT_EQ( Grab().pixel( 200 - 20 - 2, 20 - 5 ) & 0xffffff, Plate & 0xffffff );

    QTest::mouseRelease( &rWidget, Qt::RightButton, Qt::NoModifier, QPoint( 100, 90 ) );
    EXPECT_NE( Grab().pixel( 200 - 20 - 2, 20 - 5 ) & 0xffffff, Plate & 0xffffff ) << "no plate after the drag";
    // A new frame no longer refits the view.
    rWidget.PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
    EXPECT_FLOAT_EQ( rWidget.GetView().GetZoom(), 2.0f * 0.9f );
  }

  // The texture's storage stays while size and internal format stay, repaints upload nothing,
  // and frames whose buffers don't hold what their description says are not drawn.
  TEST_F( GeometryDisplayTest, UploadsWhatFitsAndKeepsStorageWhileItCan )
  {
    VGLWidget& rWidget = MakeWidget( 48, 32 );
    const VideoGraphics::VVideoTexture& rTexture = rWidget.GetVideoTexture();
    const struct
    {
      EPixelFormat Format;
      int Width;
      unsigned Allocations;
    } Steps[] = {
        { PixelFormat_BayerGB8, 41, 1 },
        { PixelFormat_BayerRG8, 41, 1 }, // same size, same internal format
        { PixelFormat_R8G8B8, 41, 2 },
        { PixelFormat_Luminance8, 40, 3 },
    };
    for( unsigned Uploads = 1; Uploads <= 4; ++Uploads )
    {
      const auto& rStep = Steps[Uploads - 1];
      // The last frame is white, and must not show for the bad frames after it.
      const IVideoFrame Frame = RandomFrame( rStep.Format, rStep.Width, 24, Uploads, Uploads == 4 ? 255 : -1 );
      rWidget.PrepareFrame( int( Uploads ), Frame.VideoFrameInfo, Frame, false );
      Grab();
      Grab();
      EXPECT_EQ( rTexture.GetStorageAllocationCount(), rStep.Allocations ) << Uploads;
      EXPECT_EQ( rTexture.GetUploadCount(), Uploads );
      EXPECT_EQ( rTexture.GetStorageSize(), QSize( rStep.Width, 24 ) );
    }
    EXPECT_EQ( qGray( Grab().pixel( 24, 16 ) ), 255 );

    IVideoFrame Short = RandomFrame( PixelFormat_R8G8B8, 40, 24 );
    std::static_pointer_cast< IStandardBuffer >( Short.Video )->Resize( 40 * 24 * 3 - 1 );
    rWidget.PrepareFrame( 5, Short.VideoFrameInfo, Short, false );
    EXPECT_EQ( qGray( Grab().pixel( 24, 16 ) ), 0 );
    IVideoFrame Huge = RandomFrame( PixelFormat_Luminance8, 4, 4 );
    Huge.VideoFrameInfo.ImageWidth = 1 << 20;
    Huge.VideoFrameInfo.ImageHeight = 1 << 20;
    rWidget.PrepareFrame( 6, Huge.VideoFrameInfo, Huge, false );
    Grab();
    EXPECT_EQ( rTexture.GetUploadCount(), 4u );
    EXPECT_EQ( rTexture.GetStorageAllocationCount(), 3u );

    // Software mode allocates nothing for a frame its bytes can't fill.
    rWidget.SetDecoder( LumekVideoViewer::Software );
    for( const IVideoFrame* pFrame : { &Short, &Huge } )
    {
      rWidget.PrepareFrame( 7, pFrame->VideoFrameInfo, *pFrame, false );
      EXPECT_EQ( qGray( Grab().pixel( 24, 16 ) ), 0 );
    }
    EXPECT_EQ( rTexture.GetUploadCount(), 4u );
    EXPECT_NE( rWidget.GetDecoderName().toStdString(), "Software Decoder" );
  }
} // namespace
