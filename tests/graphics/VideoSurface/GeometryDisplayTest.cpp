// Where the widget puts the picture: flips, images smaller than the sensor, lens distortion,
// scale modes and the mouse, and the plates drawn over the picture.

#include "graphics/VideoSurface/VVideoTexture.h"
#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"

#include <QMouseEvent>
#include <QSignalSpy>
#include <QTest>

namespace
{
  using namespace SurfaceTest;
  using LumekVideoViewer::VGLWidget;

  using GeometryDisplayTest = SurfaceDisplayTest;

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

  TEST_F( GeometryDisplayTest, InvertedFramesFlipTheLookupOnly )
  {
    ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 36, 20 );
    Frame.VideoFrameInfo.Flags |= ZOL::IVideoFrameInfo::Flag_Inverted;
    Show( Frame );
    // Stored bottom row first: row y of the picture is row H - 1 - y of the bytes.
    EXPECT_TRUE( Shows( QImage( Frame.Video->GetData(), 36, 20, 36, QImage::Format_Grayscale8 ).mirrored(), 0 ) );
  }

  // A white 48 by 32 image at (24, 32) on a 96 by 96 sensor, shown at 1:1. Straight, it keeps to
  // its place with its outline around it. Barrel distortion moves the picture's corners out, and
  // the outline becomes the distorted bounds.
  TEST_F( GeometryDisplayTest, LensCalibrationBendsThePictureAndTheOutline )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 48, 32, 1, 255 );
    ZOL::IVideoFrameInfo Geometry = Frame.VideoFrameInfo;
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
    const ZOL::IVideoFrame Plain = RandomFrame( ZOL::PixelFormat_Luminance8, 40, 24 );
    Show( Plain );
    m_pWidget->SetLensDistortionCalibration( Camera( 40, 24 ), Lens( { 1e-3, 0.0 }, 0, 0 ) );
    m_pWidget->SetLensDistortionCorrectionEnabled( true );
    m_pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    EXPECT_TRUE( Shows( ProcessorPicture( Plain ), 0 ) );
  }

  TEST_F( GeometryDisplayTest, MissingFrameDarkensThePictureUnderAPlate )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 160, 60, 1, 200 );
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
    rWidget.PrepareFrame( 43, ZOL::IVideoFrameInfo(), ZOL::IVideoFrame(), true );
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

  // 100 by 50 shown in a 200 by 100 widget fits at zoom 2: every image pixel becomes 2 by 2. A
  // right drag then zooms, shows the zoom plate while it lasts and leaves the view free.
  TEST_F( GeometryDisplayTest, FitsTheWindowUntilARightDragZooms )
  {
    const ZOL::IVideoFrame Frame = RandomFrame( ZOL::PixelFormat_Luminance8, 100, 50 );
    VGLWidget& rWidget = MakeWidget( 200, 100 );
    rWidget.PrepareFrame( 0, Frame.VideoFrameInfo, Frame, false );
    EXPECT_FLOAT_EQ( rWidget.GetView().GetZoom(), 2.0f );
    const QImage Fitted = Grab();
    int Wrong = 0;
    for( int y = 2; y < 2 * 49; ++y )
      for( int x = 2; x < 2 * 99; ++x )
        Wrong += qGray( Fitted.pixel( x, y ) ) != Frame.Video->GetData()[( y / 2 ) * 100 + x / 2];
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
      ZOL::EPixelFormat Format;
      int Width;
      unsigned Allocations;
    } Steps[] = {
        { ZOL::PixelFormat_BayerGB8, 41, 1 },
        { ZOL::PixelFormat_BayerRG8, 41, 1 }, // same size, same internal format
        { ZOL::PixelFormat_R8G8B8, 41, 2 },
        { ZOL::PixelFormat_Luminance8, 40, 3 },
    };
    for( unsigned Uploads = 1; Uploads <= 4; ++Uploads )
    {
      const auto& rStep = Steps[Uploads - 1];
      // The last frame is white, and must not show for the bad frames after it.
      const ZOL::IVideoFrame Frame = RandomFrame( rStep.Format, rStep.Width, 24, Uploads, Uploads == 4 ? 255 : -1 );
      rWidget.PrepareFrame( int( Uploads ), Frame.VideoFrameInfo, Frame, false );
      Grab();
      Grab();
      EXPECT_EQ( rTexture.GetStorageAllocationCount(), rStep.Allocations ) << Uploads;
      EXPECT_EQ( rTexture.GetUploadCount(), Uploads );
      EXPECT_EQ( rTexture.GetStorageSize(), QSize( rStep.Width, 24 ) );
    }
    EXPECT_EQ( qGray( Grab().pixel( 24, 16 ) ), 255 );

    ZOL::IVideoFrame Short = RandomFrame( ZOL::PixelFormat_R8G8B8, 40, 24 );
    std::static_pointer_cast< ZOL::IStandardBuffer >( Short.Video )->Resize( 40 * 24 * 3 - 1 );
    rWidget.PrepareFrame( 5, Short.VideoFrameInfo, Short, false );
    EXPECT_EQ( qGray( Grab().pixel( 24, 16 ) ), 0 );
    ZOL::IVideoFrame Huge = RandomFrame( ZOL::PixelFormat_Luminance8, 4, 4 );
    Huge.VideoFrameInfo.ImageWidth = 1 << 20;
    Huge.VideoFrameInfo.ImageHeight = 1 << 20;
    rWidget.PrepareFrame( 6, Huge.VideoFrameInfo, Huge, false );
    Grab();
    EXPECT_EQ( rTexture.GetUploadCount(), 4u );
    EXPECT_EQ( rTexture.GetStorageAllocationCount(), 3u );

    // Software mode allocates nothing for a frame its bytes can't fill.
    rWidget.SetDecoder( LumekVideoViewer::Software );
    for( const ZOL::IVideoFrame* pFrame : { &Short, &Huge } )
    {
      rWidget.PrepareFrame( 7, pFrame->VideoFrameInfo, *pFrame, false );
      EXPECT_EQ( qGray( Grab().pixel( 24, 16 ) ), 0 );
    }
    EXPECT_EQ( rTexture.GetUploadCount(), 4u );
    EXPECT_NE( rWidget.GetDecoderName().toStdString(), "Software Decoder" );
  }
} // namespace
