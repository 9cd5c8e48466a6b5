// What the widget decides without a display: where the image lies, the view's zoom and centre,
// the lens records it takes, the routes of the pixel formats, the frame rate and the plates' texts.

#include "graphics/VideoSurface/VFrameRateMeter.h"
#include "graphics/VideoSurface/VOverlayText.h"
#include "graphics/VideoSurface/VPixelFormatRouting.h"
#include "graphics/VideoSurface/VViewGeometry.h"
#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"

#include <gtest/gtest.h>

namespace
{
  using namespace LumekVideoViewer;
  using namespace VideoGraphics;
  using SurfaceTest::Camera;
  using SurfaceTest::Lens;
  using SurfaceTest::NearRect;

  ZOL::IVideoFrameInfo Geometry( int i_Width, int i_Height, int i_TwiceOffsetX = 0, int i_TwiceOffsetY = 0,
                                 int i_SensorFactor = 1 )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.TwiceOffsetX = std::uint16_t( i_TwiceOffsetX );
    Info.TwiceOffsetY = std::uint16_t( i_TwiceOffsetY );
    Info.SensorPixelsPerImagePixelX = Info.SensorPixelsPerImagePixelY = std::uint8_t( i_SensorFactor );
    Info.PixelFormat = ZOL::PixelFormat_Luminance8;
    return Info;
  }

  // Where the image lies on the sensor: the texture coordinates must run from 0 to 1 exactly
  // over the image rectangle, whatever the offsets and sensor factors.
  TEST( ViewGeometry, TextureSpansTheImageRectangle )
  {
    const struct
    {
      const char* Name;
      ZOL::IVideoFrameInfo Geometry;
      QRectF Rectangle;
      QSize Sensor;
    } Cases[] = {
        { "FillsTheSensor", Geometry( 64, 48 ), QRectF( 0, 0, 64, 48 ), QSize( 64, 48 ) },
        // An odd twice-offset states a half pixel.
        { "HalfPixel", Geometry( 20, 10, 3, 0 ), QRectF( 1.5, 0, 20, 10 ), QSize( 23, 10 ) },
        // Binned by two: each image pixel covers two sensor pixels.
        { "Binned", Geometry( 16, 8, 9, 9, 2 ), QRectF( 4, 4, 32, 16 ), QSize( 41, 25 ) },
    };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      const QRectF Rect = ImageRectangle( rCase.Geometry );
      EXPECT_EQ( Rect, rCase.Rectangle );
      const QSize Sensor = PaintSensorSize( VLensData(), rCase.Geometry );
      EXPECT_EQ( Sensor, rCase.Sensor );
      const QVector4D ScaleOffset = VideoScaleAndOffset( rCase.Geometry, Sensor );
      auto U = [&]( double i_X ) { return ( i_X / Sensor.width() + ScaleOffset.z() ) * ScaleOffset.x(); };
      auto V = [&]( double i_Y ) { return ( i_Y / Sensor.height() + ScaleOffset.w() ) * ScaleOffset.y(); };
      EXPECT_TRUE( NearRect(
          QRectF( QPointF( U( Rect.left() ), V( Rect.top() ) ), QPointF( U( Rect.right() ), V( Rect.bottom() ) ) ),
          QRectF( 0, 0, 1, 1 ), 1e-6 ) );
    }
  }

  TEST( LensData, TakesCentreAndParametersInSensorPixelsOrNothing )
  {
    const VLensData Two = LensDataFrom( Camera( 640, 480 ), Lens( { 1.5e-7, -2.5e-13 }, 321.5, 239.25 ) );
    EXPECT_EQ( Two.Centre, QVector2D( 321.5f, 239.25f ) );
    EXPECT_EQ( Two.Parameters, QVector3D( 1.5e-7f, -2.5e-13f, 0.0f ) );
    EXPECT_EQ( Two.SensorSize, QSize( 640, 480 ) );
    EXPECT_EQ(
        LensDataFrom( Camera( 64, 48 ), Lens( { 1, 2, 3 }, 32, 24, ZOL::RadialModel_Lumek3Parameter ) ).Parameters,
        QVector3D( 1, 2, 3 ) );

    // A default record, or parameters that do not fit the model, give no lens.
    const std::pair< CoreLumekTypes::VCameraHardware, CoreLumekTypes::VLensDistortionCalibration > NoLens[] = {
        { CoreLumekTypes::VCameraHardware(), Lens( { 1e-7, 2e-13 }, 320, 240 ) },
        { Camera( 640, 480 ), CoreLumekTypes::VLensDistortionCalibration() },
        { Camera( 640, 480 ), Lens( { 1, 2, 3 }, 320, 240 ) },
        { Camera( 640, 480 ), Lens( { 1, 2 }, 320, 240, ZOL::RadialModel_Lumek3Parameter ) },
        { Camera( 640, 480 ), Lens( {}, 320, 240, ZOL::RadialModel_Lumek0Parameter ) },
    };
    for( const auto& [Hardware, Calibration] : NoLens )
    {
      const VLensData Data = LensDataFrom( Hardware, Calibration );
      EXPECT_TRUE( Data.Centre.isNull() && Data.Parameters.isNull() && Data.SensorSize == QSize( 0, 0 ) )
          << "model " << Calibration.RadialModel << ", " << Calibration.RadialDistortionParameters.size()
          << " parameters, sensor " << Hardware.SensorWidthInPixels;
    }
  }

  TEST( VideoView, ScaleModesFollowTheImageOrStay )
  {
    const ZOL::IVideoFrameInfo Pixels = Geometry( 200, 100 );
    VVideoView View;
    // A pixel record that describes no frame leaves the view alone.
    ZOL::IVideoFrameInfo NoFormat = Pixels;
    NoFormat.PixelFormat = ZOL::PixelFormat_Unspecified;
    View.Update( NoFormat, Pixels, VLensData(), QSize( 400, 400 ) );
    EXPECT_FLOAT_EQ( View.GetZoom(), 1.0f );
    EXPECT_TRUE( View.GetImageRectangle().isNull() );

    View.Update( Pixels, Pixels, VLensData(), QSize( 400, 400 ) );
    EXPECT_FLOAT_EQ( View.GetZoom(), 2.0f );
    View.SetScaleMode( ScaleOneToOne );
    View.Update( Pixels, Pixels, VLensData(), QSize( 100, 400 ) );
    EXPECT_FLOAT_EQ( View.GetFittedZoom(), 0.5f );
    EXPECT_FLOAT_EQ( View.GetZoom(), 1.0f );
    View.SetScaleMode( ScaleToWindow );
    EXPECT_FLOAT_EQ( View.GetZoom(), 0.5f );
    EXPECT_EQ( View.GetViewCentre(), QVector2D( 0.5f, 0.5f ) );

    // Scale window to video asks for the image's size.
    const ZOL::IVideoFrameInfo Big = Geometry( 1920, 1080 );
    View.Update( Big, Big, VLensData(), QSize( 400, 400 ) );
    EXPECT_EQ( View.MinimumSizeHint(), QSize( 900, 505 ) );
    View.SetScaleMode( ScaleWindowToVideo );
    EXPECT_EQ( View.MinimumSizeHint(), QSize( 1920, 1080 ) );
    EXPECT_FLOAT_EQ( View.GetZoom(), 1.0f );
  }

  TEST( VideoView, CorrectionCentresOnTheDistortedBounds )
  {
    VVideoView View;
    VLensData Lens = LensDataFrom( Camera( 400, 200 ), SurfaceTest::Lens( { 1e-5, 0 }, 300, 100 ) );
    Lens.CorrectionEnabled = true;
    const ZOL::IVideoFrameInfo Pixels = Geometry( 200, 100 ), Geo = Geometry( 200, 100, 200, 100 );
    View.Update( Pixels, Geo, Lens, QSize( 400, 400 ) );
    const QRectF Expected = DistortedBounds( ImageRectangle( Geo ), Lens.Centre, Lens.Parameters );
    EXPECT_EQ( View.GetImageRectangle(), Expected );
    EXPECT_EQ( View.GetViewCentre(), QVector2D( Expected.center().x() / 400.0, Expected.center().y() / 200.0 ) );

    // Correction without a calibrated sensor has nothing to correct and keeps the plain rectangle.
    VLensData NoSensor;
    NoSensor.CorrectionEnabled = true;
    View.Update( Pixels, Geo, NoSensor, QSize( 400, 400 ) );
    EXPECT_EQ( View.GetImageRectangle(), ImageRectangle( Geo ) );
    EXPECT_EQ( View.GetViewCentre(), QVector2D( 0.5f, 0.5f ) );
  }

  // A drag from (100, 100) in a 200 by 100 widget, starting at zoom 1 and centre (0.5, 0.5).
  TEST( Mouse, DragChangesZoomOrCentreAndFreesTheView )
  {
    const struct
    {
      const char* Name;
      Qt::MouseButtons Buttons;
      QPoint To;
      float Zoom;
      QVector2D Centre;
      bool ZoomDrag;
    } Cases[] = {
        // Dragging down a whole widget height and more stops the zoom at a fifth.
        { "RightFarDownStopsAtOneFifth", Qt::RightButton, QPoint( 100, 190 ), 0.2f, { 0.5f, 0.5f }, true },
        // A widget width of dragging moves the view by the whole sensor, whatever the zoom.
        { "MiddlePans", Qt::MiddleButton, QPoint( 150, 100 ), 1.0f, { 0.25f, 0.5f }, false },
        // The zoom step has already taken the position, so the pan finds nothing to move.
        { "RightAndMiddleOnlyZoom", Qt::RightButton | Qt::MiddleButton, QPoint( 100, 50 ), 1.5f, { 0.5f, 0.5f }, true },
        { "LeftAndRightOnlyPan", Qt::LeftButton | Qt::RightButton, QPoint( 50, 75 ), 1.0f, { 0.75f, 0.75f }, false },
        { "NoButtonChangesNothing", Qt::NoButton, QPoint( 50, 50 ), 1.0f, { 0.5f, 0.5f }, false },
    };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VVideoView View;
      View.SetScaleMode( ScaleOneToOne );
      View.MousePress( QPoint( 100, 100 ), rCase.Buttons );
      EXPECT_EQ( View.IsZoomDragging(), rCase.ZoomDrag );
      EXPECT_EQ( View.MouseMove( rCase.To, rCase.Buttons, QSize( 200, 100 ) ), rCase.Buttons != Qt::NoButton );
      EXPECT_EQ( View.GetScaleMode(), rCase.Buttons != Qt::NoButton ? ScaleFreely : ScaleOneToOne );
      EXPECT_NEAR( View.GetZoom(), rCase.Zoom, 1e-6 );
      EXPECT_LT( ( View.GetViewCentre() - rCase.Centre ).length(), 1e-6 )
          << View.GetViewCentre().x() << ", " << View.GetViewCentre().y();
      View.MouseRelease( rCase.To, Qt::NoButton );
      EXPECT_FALSE( View.IsZoomDragging() );
    }
  }

  // What each format's pictures show is the display tests' to check; here, what they cannot see.
  TEST( PixelFormatRouting, PlanarHasNoRouteAndYUVPairsPixels )
  {
    for( std::uint32_t Format :
         { 0u, std::uint32_t( ZOL::PixelFormat_PlanarY8U8V8 ), std::uint32_t( ZOL::PixelFormat_PlanarR8G8B8 ), 1000u } )
      EXPECT_EQ( FindPixelFormatRoute( Format ), nullptr ) << Format;
    for( std::uint32_t Format = 1; Format <= 17; ++Format )
      EXPECT_NE( FindPixelFormatRoute( Format ), nullptr ) << Format;
    // An odd width loses its last pixel to the halving.
    EXPECT_EQ( TextureSize( *FindPixelFormatRoute( ZOL::PixelFormat_U8Y8V8Y8 ), 33, 7 ), QSize( 16, 7 ) );
    EXPECT_EQ( TextureSize( *FindPixelFormatRoute( ZOL::PixelFormat_BayerRG8 ), 33, 7 ), QSize( 33, 7 ) );
  }

  TEST( FrameRateMeter, AveragesOverTwoBucketsAndHoldsBetweenComputations )
  {
    std::int64_t Now = 0;
    VFrameRateMeter Meter( [&] { return Now; } );
    // 10 frames every 100 ms is 100 frames a second once both buckets are full.
    const struct
    {
      std::int64_t Time;
      int FramesBefore;
      double Expected;
    } Steps[] = {
        { 1000, 100, 100.0 }, // bucket 0..1000 closes; (0 + 100) / 1000 ms
        { 1200, 20, 100.0 },  // less than 401 ms since the last computation: held
        { 1500, 30, 100.0 },  // 0..1500: (100 + 50) / 1.5 s
        { 2000, 20, 70.0 },   // 1000..2000: (50 + 20) / 1.0 s, the buckets having moved on at 1500
    };
    for( const auto& rStep : Steps )
    {
      for( int i = 0; i < rStep.FramesBefore; ++i )
        Meter.CountFrame();
      Now = rStep.Time;
      EXPECT_DOUBLE_EQ( Meter.GetFrameRate(), rStep.Expected ) << "at " << rStep.Time;
    }
  }

  TEST( OverlayText, ZoomAsWholePercentAndFrameInFiveDigits )
  {
    EXPECT_EQ( ZoomText( 1.0f ), "100%" );
    EXPECT_EQ( ZoomText( 0.2f ), "20%" );
    EXPECT_EQ( ZoomText( 1.996f ), "200%" );
    EXPECT_EQ( MissingFrameText( 42 ), "Missing frame 00042" );
    EXPECT_EQ( MissingFrameText( 1234567 ), "Missing frame 1234567" );
  }
} // namespace
