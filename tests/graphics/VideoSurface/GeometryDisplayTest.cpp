// Where the widget puts the picture: flips, images smaller than the sensor, lens distortion,
// scale modes and the mouse, and the plates drawn over the picture.

#include "graphics/VideoSurface/VVideoTexture.h"
#include "tests/graphics/CoreGraphics/DisplayTestMain.h"
#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"

#include <QMouseEvent>
#include <QSignalSpy>

namespace
{
  using namespace SurfaceTest;
  using LumekVideoViewer::VGLWidget;

  constexpr int Margin = 4;

  class GeometryDisplayTest : public ::testing::Test
  {
  protected:
    void SetUp() override { LUMEK_REQUIRE_DISPLAY(); }
  };

  // The outline's colour, (0.78, 0.6, 0.06), wherever the line covers a pixel only partly and
  // is mixed with the grey picture or the black around it: red over green over blue.
  bool IsOutline( QRgb i_Colour )
  {
    return qRed( i_Colour ) > qGreen( i_Colour ) + 8 && qGreen( i_Colour ) > qBlue( i_Colour ) + 20;
  }

  // The bounding box of the outline's pixels.
  QRect OutlineBox( const QImage& i_rPicture )
  {
    QRect Box;
    for( int y = 0; y < i_rPicture.height(); ++y )
      for( int x = 0; x < i_rPicture.width(); ++x )
        if( IsOutline( i_rPicture.pixel( x, y ) ) )
          Box |= QRect( x, y, 1, 1 );
    return Box;
  }

  TEST_F( GeometryDisplayTest, InvertedFramesFlipTheLookupOnly )
  {
    ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 36, 20 );
    Frame.VideoFrameInfo.Flags |= ZOL::IVideoFrameInfo::Flag_Inverted;
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 36 + 2 * Margin, 20 + 2 * Margin );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );

    // Stored bottom row first: row y of the picture is row H - 1 - y of the bytes.
    VRGBImage Expected( 36, 20 );
    for( int y = 0; y < 20; ++y )
      for( int x = 0; x < 36; ++x )
        for( int c = 0; c < 3; ++c )
          Expected.At( x, y )[c] = Frame.Video->GetData()[( 19 - y ) * 36 + x];
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), Expected, QPoint( Margin, Margin ), 0 ) );
  }

  CoreLumekTypes::VCameraHardware Camera( int i_Width, int i_Height )
  {
    CoreLumekTypes::VCameraHardware Hardware;
    Hardware.DeviceURN = "urn:test:camera";
    Hardware.SensorWidthInPixels = std::uint32_t( i_Width );
    Hardware.SensorHeightInPixels = std::uint32_t( i_Height );
    return Hardware;
  }

  CoreLumekTypes::VLensDistortionCalibration Lens( double i_K1, double i_X, double i_Y )
  {
    CoreLumekTypes::VLensDistortionCalibration Calibration;
    Calibration.RadialDistortionParameters = { i_K1, 0.0 };
    Calibration.RadialDistortionCentre_X = i_X;
    Calibration.RadialDistortionCentre_Y = i_Y;
    return Calibration;
  }

  // A 20 by 10 image at (30, 5) on a 64 by 48 sensor: it is drawn at its place and nothing of
  // it reaches the rest of the sensor. A lens with no parameters moves nothing.
  TEST_F( GeometryDisplayTest, ImageSmallerThanTheSensorKeepsToItsPlace )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 20, 10 );
    ZOL::IVideoFrameInfo Geometry = Frame.VideoFrameInfo;
    Geometry.TwiceOffsetX = 60;
    Geometry.TwiceOffsetY = 10;

    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 64 + 2 * Margin, 48 + 2 * Margin );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->SetLensDistortionCalibration( Camera( 64, 48 ), Lens( 0.0, 32, 24 ) );
    pWidget->SetLensDistortionCorrectionEnabled( true );
    pWidget->PrepareFrame( 0, Geometry, Frame, false );
    // The view in 1:1 stays centred on the sensor.
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );

    const QImage Picture = Grab( *pWidget );
    VRGBImage Expected( 64, 48 );
    const VRGBImage Image = ProcessorPicture( Frame );
    for( int y = 0; y < 10; ++y )
      for( int x = 0; x < 20; ++x )
        std::copy( Image.At( x, y ), Image.At( x, y ) + 3, Expected.At( x + 30, y + 5 ) );
    // Inside the image, and the black sensor around it apart from the outline's rows and columns.
    VRGBImage Inside( 18, 8 );
    for( int y = 0; y < 8; ++y )
      for( int x = 0; x < 18; ++x )
        std::copy( Image.At( x + 1, y + 1 ), Image.At( x + 1, y + 1 ) + 3, Inside.At( x, y ) );
    EXPECT_TRUE( SamePicture( Picture, Inside, QPoint( Margin + 31, Margin + 6 ), 0, 0 ) );
    int Stray = 0;
    for( int y = 0; y < 48; ++y )
      for( int x = 0; x < 64; ++x )
      {
        const bool bNearImage = x >= 28 && x <= 51 && y >= 3 && y <= 16;
        if( !bNearImage && qGray( Picture.pixel( Margin + x, Margin + y ) ) != 0 )
          ++Stray;
      }
    EXPECT_EQ( Stray, 0 );
    if( Stray != 0 )
      SavePictures( Picture, Expected, QPoint( Margin, Margin ) );

    // With correction on, the outline is the distorted bounds, which even without distortion
    // reach a pixel further up and to the left.
    const QRectF Bounds =
        LumekVideoViewer::DistortedBounds( QRectF( 30, 5, 20, 10 ), QVector2D( 32, 24 ), QVector3D() );
    const QRect Box = OutlineBox( Picture ).translated( -Margin, -Margin );
    EXPECT_NEAR( Box.left(), Bounds.left(), 1.0 );
    EXPECT_NEAR( Box.top(), Bounds.top(), 1.0 );
    EXPECT_NEAR( Box.right(), Bounds.right(), 1.0 );
    EXPECT_NEAR( Box.bottom(), Bounds.bottom(), 1.0 );
  }

  // Barrel distortion moves the picture's corners out, and the outline becomes the distorted
  // bounds; with correction off both stay where the image is.
  TEST_F( GeometryDisplayTest, LensCalibrationBendsThePictureAndTheOutline )
  {
    const int W = 48, H = 32, Size = 96;
    ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, W, H );
    std::fill( Frame.Video->GetData(), Frame.Video->GetData() + W * H, 255 );
    ZOL::IVideoFrameInfo Geometry = Frame.VideoFrameInfo;
    Geometry.TwiceOffsetX = 48;
    Geometry.TwiceOffsetY = 64;
    const double K1 = 2e-4;

    std::unique_ptr< VGLWidget > pWidget = MakeWidget( Size, Size );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->SetLensDistortionCalibration( Camera( Size, Size ), Lens( K1, 48, 48 ) );
    pWidget->PrepareFrame( 0, Geometry, Frame, false );
    const QRect Straight = OutlineBox( Grab( *pWidget ) );
    EXPECT_NEAR( Straight.left(), 24, 1 );
    EXPECT_NEAR( Straight.top(), 32, 1 );
    EXPECT_NEAR( Straight.right(), 72, 1 );

    pWidget->SetLensDistortionCorrectionEnabled( true );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    const QImage Bent = Grab( *pWidget );
    if( qEnvironmentVariableIsSet( "LUMEK_SAVE_PICTURES" ) )
      Bent.save( "GeometryDisplayTest_LensCalibration_actual.png" );
    const QRectF Bounds = LumekVideoViewer::DistortedBounds( QRectF( 24, 32, W, H ), QVector2D( 48, 48 ),
                                                             QVector3D( float( K1 ), 0, 0 ) );
    const QRect Box = OutlineBox( Bent );
    EXPECT_NEAR( Box.left(), Bounds.left(), 1.5 );
    EXPECT_NEAR( Box.top(), Bounds.top(), 1.5 );
    EXPECT_LT( Box.left(), Straight.left() - 4 );

    // The top-left corner (24, 32) lies 24 and 16 pixels from the centre: it moves by a factor
    // 1 + k1 (24^2 + 16^2) to about (19.0, 28.7). The middle of the top edge moves less.
    const QPointF Corner =
        LumekVideoViewer::DistortPoint( QPointF( 24, 32 ), QVector2D( 48, 48 ), QVector3D( float( K1 ), 0, 0 ) );
    EXPECT_GT( qGray( Bent.pixel( int( Corner.x() ) + 2, int( Corner.y() ) + 2 ) ), 200 );
    EXPECT_EQ( qGray( Bent.pixel( 21, 34 ) ) > 200, true ) << "outside the straight image, inside the bent one";
    EXPECT_EQ( qGray( Bent.pixel( 48, 29 ) ), 0 ) << "above the middle of the top edge";
  }

  // A distortion centre of exactly (0, 0) switches the shader's distortion off, whatever the
  // parameters say.
  TEST_F( GeometryDisplayTest, DistortionCentreAtTheOriginMovesNothing )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 40, 24 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 40 + 2 * Margin, 24 + 2 * Margin );
    CoreLumekTypes::VLensDistortionCalibration Calibration = Lens( 1e-3, 0, 0 );
    pWidget->SetLensDistortionCalibration( Camera( 40, 24 ), Calibration );
    pWidget->SetLensDistortionCorrectionEnabled( true );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    EXPECT_TRUE( SamePicture( Grab( *pWidget ), ProcessorPicture( Frame ), QPoint( Margin, Margin ), 0 ) );
  }

  TEST_F( GeometryDisplayTest, MissingFrameDarkensThePictureUnderAPlate )
  {
    ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 160, 60 );
    std::fill( Frame.Video->GetData(), Frame.Video->GetData() + 160 * 60, 200 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 160, 60 );
    pWidget->PrepareFrame( 41, Frame.VideoFrameInfo, Frame, false );
    EXPECT_EQ( qGray( Grab( *pWidget ).pixel( 5, 5 ) ), 200 );

    // The window passes the last good frame again with the warning.
    pWidget->PrepareFrame( 42, Frame.VideoFrameInfo, Frame, true );
    const QImage Picture = Grab( *pWidget );
    EXPECT_NEAR( qGray( Picture.pixel( 5, 5 ) ), 100, 2 ) << "half of the picture shows through";
    EXPECT_EQ( Picture.pixel( 80, 30 ) & 0xffffff, 0xffffffu & qRgb( 64, 64, 64 ) ) << "the plate in the middle";
    int White = 0;
    for( int x = 0; x < 160; ++x )
      White += qGray( Picture.pixel( x, 30 ) ) > 200 ? 1 : 0;
    EXPECT_GT( White, 4 ) << "the text on the plate";

    // A frame without a description draws no picture; the warning is still painted.
    pWidget->PrepareFrame( 43, ZOL::IVideoFrameInfo(), ZOL::IVideoFrame(), true );
    const QImage Empty = Grab( *pWidget );
    EXPECT_EQ( qGray( Empty.pixel( 5, 5 ) ), 0 );
    EXPECT_EQ( Empty.pixel( 80, 30 ) & 0xffffff, 0xffffffu & qRgb( 64, 64, 64 ) );
  }

  // 20 by 10 shown in a 40 by 40 widget fits at zoom 2: every image pixel becomes 2 by 2.
  TEST_F( GeometryDisplayTest, ScaleToWindowFitsAndOneToOneDoesNot )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 20, 10 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 40, 40 );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    EXPECT_FLOAT_EQ( pWidget->GetView().GetZoom(), 2.0f );
    QImage Picture = Grab( *pWidget );
    const std::uint8_t* pBytes = Frame.Video->GetData();
    int Wrong = 0;
    for( int y = 1; y < 9; ++y )
      for( int x = 1; x < 19; ++x )
        for( int d = 0; d < 4; ++d )
          Wrong += qGray( Picture.pixel( 2 * x + ( d & 1 ), 10 + 2 * y + ( d >> 1 ) ) ) != pBytes[y * 20 + x];
    EXPECT_EQ( Wrong, 0 );

    pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    Picture = Grab( *pWidget );
    EXPECT_EQ( qGray( Picture.pixel( 20, 20 ) ), pBytes[5 * 20 + 10] );
    EXPECT_EQ( qGray( Picture.pixel( 5, 20 ) ), 0 ) << "left of the image at 1:1";
  }

  void SendMouse( VGLWidget& io_rWidget, QEvent::Type i_Type, QPoint i_Position, Qt::MouseButton i_Button,
                  Qt::MouseButtons i_Buttons )
  {
    QMouseEvent Event( i_Type, i_Position, io_rWidget.mapToGlobal( i_Position ), i_Button, i_Buttons, Qt::NoModifier );
    QApplication::sendEvent( &io_rWidget, &Event );
  }

  TEST_F( GeometryDisplayTest, RightDragZoomsShowsThePlateAndFreesTheView )
  {
    ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 100, 50 );
    std::fill( Frame.Video->GetData(), Frame.Video->GetData() + 100 * 50, 0 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 200, 100 );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    QSignalSpy Spy( pWidget.get(), &VGLWidget::ScaleModeChanged );

    SendMouse( *pWidget, QEvent::MouseButtonPress, QPoint( 100, 80 ), Qt::RightButton, Qt::RightButton );
    // Ten pixels down in a widget a hundred high zooms out by a tenth.
    SendMouse( *pWidget, QEvent::MouseMove, QPoint( 100, 90 ), Qt::NoButton, Qt::RightButton );
    ASSERT_EQ( Spy.count(), 1 );
    EXPECT_EQ( Spy.at( 0 ).at( 0 ).value< LumekVideoViewer::EScaleMode >(), LumekVideoViewer::ScaleFreely );
    EXPECT_EQ( pWidget->GetScaleMode(), LumekVideoViewer::ScaleFreely );
    EXPECT_FLOAT_EQ( pWidget->GetView().GetZoom(), 2.0f * 0.9f );

    // The plate sits 20 pixels in from the top right corner.
    QImage Picture = Grab( *pWidget );
    EXPECT_EQ( Picture.pixel( 200 - 20 - 2, 20 - 5 ) & 0xffffff, 0xffffffu & qRgb( 64, 64, 64 ) );

    SendMouse( *pWidget, QEvent::MouseButtonRelease, QPoint( 100, 90 ), Qt::RightButton, Qt::NoButton );
    Picture = Grab( *pWidget );
    EXPECT_EQ( qGray( Picture.pixel( 200 - 20 - 2, 20 - 5 ) ), 0 ) << "no plate after the drag";

    // A new frame no longer refits the view.
    pWidget->PrepareFrame( 1, Frame.VideoFrameInfo, Frame, false );
    EXPECT_FLOAT_EQ( pWidget->GetView().GetZoom(), 2.0f * 0.9f );
  }

  TEST_F( GeometryDisplayTest, StorageStaysWhileSizeAndFormatStayAndRepaintsDoNotUpload )
  {
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 48, 32 );
    const VideoGraphics::VVideoTexture& rTexture = pWidget->GetVideoTexture();
    const ZOL::IVideoFrame First = RandomFrame( ZOL::PixelFormat_BayerGB8, 40, 24, 1 );
    pWidget->PrepareFrame( 0, First.VideoFrameInfo, First, false );
    Grab( *pWidget );
    Grab( *pWidget );
    EXPECT_EQ( rTexture.GetStorageAllocationCount(), 1u );
    EXPECT_EQ( rTexture.GetUploadCount(), 1u );

    const ZOL::IVideoFrame Second = RandomFrame( ZOL::PixelFormat_BayerRG8, 40, 24, 2 );
    pWidget->PrepareFrame( 1, Second.VideoFrameInfo, Second, false );
    Grab( *pWidget );
    EXPECT_EQ( rTexture.GetStorageAllocationCount(), 1u ) << "same size, same internal format";
    EXPECT_EQ( rTexture.GetUploadCount(), 2u );

    const ZOL::IVideoFrame Wider = RandomFrame( ZOL::PixelFormat_BayerRG8, 41, 24, 3 );
    pWidget->PrepareFrame( 2, Wider.VideoFrameInfo, Wider, false );
    Grab( *pWidget );
    EXPECT_EQ( rTexture.GetStorageAllocationCount(), 2u );
    EXPECT_EQ( rTexture.GetStorageSize(), QSize( 41, 24 ) );

    const ZOL::IVideoFrame Colour = RandomFrame( ZOL::PixelFormat_R8G8B8, 41, 24, 4 );
    pWidget->PrepareFrame( 3, Colour.VideoFrameInfo, Colour, false );
    Grab( *pWidget );
    EXPECT_EQ( rTexture.GetStorageAllocationCount(), 3u );
    EXPECT_EQ( rTexture.GetUploadCount(), 4u );
  }

  TEST_F( GeometryDisplayTest, ClearLeavesTheSurfaceBlack )
  {
    ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 40, 24 );
    std::fill( Frame.Video->GetData(), Frame.Video->GetData() + 40 * 24, 180 );
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 40, 24 );
    pWidget->PrepareFrame( 0, Frame.VideoFrameInfo, Frame, true );
    EXPECT_GT( qGray( Grab( *pWidget ).pixel( 20, 2 ) ), 50 );
    pWidget->Clear();
    EXPECT_FALSE( pWidget->GetPixelRecord().IsValid() );
    EXPECT_EQ( qGray( Grab( *pWidget ).pixel( 20, 2 ) ), 0 );
  }

  // Frames whose buffers don't hold what their description says are not drawn, and nothing
  // breaks.
  TEST_F( GeometryDisplayTest, ShortBuffersAndHugeSizesAreNotUploaded )
  {
    std::unique_ptr< VGLWidget > pWidget = MakeWidget( 48, 32 );
    // An earlier frame's picture must not show for them either.
    ZOL::IVideoFrame Earlier = RandomFrame( ZOL::PixelFormat_Luminance8, 40, 24 );
    std::fill( Earlier.Video->GetData(), Earlier.Video->GetData() + 40 * 24, 255 );
    pWidget->PrepareFrame( 0, Earlier.VideoFrameInfo, Earlier, false );
    EXPECT_EQ( qGray( Grab( *pWidget ).pixel( 24, 16 ) ), 255 );
    ZOL::IVideoFrame Short = RandomFrame( ZOL::PixelFormat_R8G8B8, 40, 24 );
    std::static_pointer_cast< ZOL::IStandardBuffer >( Short.Video )->Resize( 40 * 24 * 3 - 1 );
    pWidget->PrepareFrame( 0, Short.VideoFrameInfo, Short, false );
    EXPECT_EQ( qGray( Grab( *pWidget ).pixel( 24, 16 ) ), 0 );
    EXPECT_EQ( pWidget->GetVideoTexture().GetUploadCount(), 1u );

    ZOL::IVideoFrame Huge = RandomFrame( ZOL::PixelFormat_Luminance8, 4, 4 );
    Huge.VideoFrameInfo.ImageWidth = 1 << 20;
    Huge.VideoFrameInfo.ImageHeight = 1 << 20;
    pWidget->PrepareFrame( 1, Huge.VideoFrameInfo, Huge, false );
    Grab( *pWidget );
    EXPECT_EQ( pWidget->GetVideoTexture().GetUploadCount(), 1u );
    EXPECT_EQ( pWidget->GetVideoTexture().GetStorageAllocationCount(), 1u );

    // Software mode allocates nothing for a frame its bytes can't fill.
    pWidget->SetDecoder( LumekVideoViewer::Software );
    for( const ZOL::IVideoFrame* pFrame : { &Short, &Huge } )
    {
      pWidget->PrepareFrame( 2, pFrame->VideoFrameInfo, *pFrame, false );
      EXPECT_EQ( qGray( Grab( *pWidget ).pixel( 24, 16 ) ), 0 );
    }
    EXPECT_EQ( pWidget->GetVideoTexture().GetUploadCount(), 1u );
    EXPECT_NE( pWidget->GetDecoderName().toStdString(), "Software Decoder" );
  }
} // namespace
