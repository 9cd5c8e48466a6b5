#include "graphics/VideoSurface/VViewGeometry.h"

#include <algorithm>

namespace LumekVideoViewer
{
  namespace
  {
    bool IsDefaultCamera( const CoreLumekTypes::VCameraHardware& i_rCamera )
    {
      return i_rCamera.DeviceURN.empty() && i_rCamera.SerialNumber.empty() && i_rCamera.Type.empty() &&
             i_rCamera.DisplayType.empty() && i_rCamera.SensorWidthInPixels == 0 &&
             i_rCamera.SensorHeightInPixels == 0 && i_rCamera.PixelAspectRatio == 1.0;
    }

    bool IsDefaultCalibration( const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration )
    {
      return i_rCalibration.RadialModel == ZOL::RadialModel_Lumek2Parameter &&
             i_rCalibration.RadialDistortionParameters == std::vector< double >{ 0.0, 0.0 } &&
             i_rCalibration.RadialDistortionCentre_X == 0.0 && i_rCalibration.RadialDistortionCentre_Y == 0.0;
    }
  } // namespace

  VLensData LensDataFrom( const CoreLumekTypes::VCameraHardware& i_rCamera,
                          const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration )
  {
    VLensData Lens;
    if( IsDefaultCamera( i_rCamera ) || IsDefaultCalibration( i_rCalibration ) )
      return Lens;

    const std::vector< double >& rK = i_rCalibration.RadialDistortionParameters;
    if( i_rCalibration.RadialModel == ZOL::RadialModel_Lumek2Parameter && rK.size() == 2 )
      Lens.Parameters = QVector3D( float( rK[0] ), float( rK[1] ), 0.0f );
    else if( i_rCalibration.RadialModel == ZOL::RadialModel_Lumek3Parameter && rK.size() == 3 )
      Lens.Parameters = QVector3D( float( rK[0] ), float( rK[1] ), float( rK[2] ) );
    else
      return Lens;

    // The calibration is in sensor pixels and so are the shaders: no normalisation here.
    Lens.Centre =
        QVector2D( float( i_rCalibration.RadialDistortionCentre_X ), float( i_rCalibration.RadialDistortionCentre_Y ) );
    Lens.SensorSize = QSize( int( i_rCamera.SensorWidthInPixels ), int( i_rCamera.SensorHeightInPixels ) );
    return Lens;
  }

  QRectF ImageRectangle( const ZOL::IVideoFrameInfo& i_rGeometry )
  {
    // The twice-offsets can state half pixels; everything before the halving is integral.
    const int X = int( i_rGeometry.TwiceOffsetX ) - int( i_rGeometry.SensorPixelsPerImagePixelX ) + 1;
    const int Y = int( i_rGeometry.TwiceOffsetY ) - int( i_rGeometry.SensorPixelsPerImagePixelY ) + 1;
    return QRectF( X * 0.5, Y * 0.5, double( i_rGeometry.ImageWidth ) * i_rGeometry.SensorPixelsPerImagePixelX,
                   double( i_rGeometry.ImageHeight ) * i_rGeometry.SensorPixelsPerImagePixelY );
  }

  QPointF DistortPoint( const QPointF& i_rPoint, const QVector2D& i_rCentre, const QVector3D& i_rParameters )
  {
    const double Dx = i_rPoint.x() - double( i_rCentre.x() );
    const double Dy = i_rPoint.y() - double( i_rCentre.y() );
    const double S = Dx * Dx + Dy * Dy;
    const double Scale = 1.0 + S * ( double( i_rParameters.x() ) +
                                     S * ( double( i_rParameters.y() ) + S * double( i_rParameters.z() ) ) );
    return QPointF( double( i_rCentre.x() ) + Dx * Scale, double( i_rCentre.y() ) + Dy * Scale );
  }

  QRectF DistortedBounds( const QRectF& i_rRectangle, const QVector2D& i_rCentre, const QVector3D& i_rParameters )
  {
    const QPointF Corners[] = { i_rRectangle.topLeft(), i_rRectangle.topRight(), i_rRectangle.bottomRight(),
                                i_rRectangle.bottomLeft() };
    // The step is an eleventh while only ten points are taken: the last two elevenths of each
    // side stay unsampled. Each point counts as a rectangle of size (-1, -1), which the union
    // normalises, so every point spreads the bounds by a pixel up and to the left.
    const float Step = 1.0f / 11.0f;
    const QRectF Empty;
    QRectF Bounds;
    for( int Side = 0; Side < 4; ++Side )
    {
      const QPointF& rA = Corners[Side];
      const QPointF& rB = Corners[( Side + 1 ) % 4];
      for( int i = 0; i < 10; ++i )
      {
        const float Factor = float( i ) * Step;
        const QPointF Point = DistortPoint( rA + ( rB - rA ) * double( Factor ), i_rCentre, i_rParameters );
        const QRectF PointRectangle( Point, QSizeF( QSize() ) );
        Bounds = ( Bounds == Empty ) ? PointRectangle : Bounds.united( PointRectangle );
      }
    }
    return Bounds;
  }

  QSize PaintSensorSize( const VLensData& i_rLens, const ZOL::IVideoFrameInfo& i_rGeometry )
  {
    if( i_rLens.SensorSize.width() != 0 && i_rLens.SensorSize.height() != 0 )
      return i_rLens.SensorSize;
    // The offset enters doubled: the image is taken to lie in the middle of a sensor with an
    // equal margin on either side.
    return QSize( int( i_rGeometry.SensorPixelsPerImagePixelX ) * i_rGeometry.ImageWidth + i_rGeometry.TwiceOffsetX,
                  int( i_rGeometry.SensorPixelsPerImagePixelY ) * i_rGeometry.ImageHeight + i_rGeometry.TwiceOffsetY );
  }

  QVector4D VideoScaleAndOffset( const ZOL::IVideoFrameInfo& i_rGeometry, const QSize& i_rSensorSize )
  {
    const float SensorWidth = float( i_rSensorSize.width() );
    const float SensorHeight = float( i_rSensorSize.height() );
    const float X = float( int( i_rGeometry.TwiceOffsetX ) - int( i_rGeometry.SensorPixelsPerImagePixelX ) + 1 );
    const float Y = float( int( i_rGeometry.TwiceOffsetY ) - int( i_rGeometry.SensorPixelsPerImagePixelY ) + 1 );
    return QVector4D( SensorWidth / float( int( i_rGeometry.SensorPixelsPerImagePixelX ) * i_rGeometry.ImageWidth ),
                      SensorHeight / float( int( i_rGeometry.SensorPixelsPerImagePixelY ) * i_rGeometry.ImageHeight ),
                      -0.5f * X / SensorWidth, -0.5f * Y / SensorHeight );
  }

  void VVideoView::Update( const ZOL::IVideoFrameInfo& i_rPixelRecord, const ZOL::IVideoFrameInfo& i_rGeometry,
                           const VLensData& i_rLens, const QSize& i_rWidgetSize )
  {
    if( i_rPixelRecord.ImageWidth <= 0 || i_rPixelRecord.ImageHeight <= 0 ||
        i_rPixelRecord.PixelFormat == ZOL::PixelFormat_Unspecified )
      return;

    m_ImageRectangle = ImageRectangle( i_rGeometry );
    QVector2D Centre( 0.5f, 0.5f );
    // Without a calibrated sensor there is nothing to correct, and the centre could not be
    // normalised.
    if( i_rLens.CorrectionEnabled && i_rLens.SensorSize.width() > 0 && i_rLens.SensorSize.height() > 0 )
    {
      m_ImageRectangle = DistortedBounds( m_ImageRectangle, i_rLens.Centre, i_rLens.Parameters );
      const QPointF Middle = m_ImageRectangle.center();
      Centre = QVector2D( float( Middle.x() / i_rLens.SensorSize.width() ),
                          float( Middle.y() / i_rLens.SensorSize.height() ) );
    }

    if( m_ImageRectangle.width() > 0.0 && m_ImageRectangle.height() > 0.0 )
      m_FittedZoom = std::min( float( i_rWidgetSize.width() / m_ImageRectangle.width() ),
                               float( i_rWidgetSize.height() / m_ImageRectangle.height() ) );

    if( m_ScaleMode == ScaleToWindow )
    {
      m_Zoom = m_FittedZoom;
      m_ViewCentre = Centre;
    }
    else if( m_ScaleMode == ScaleWindowToVideo )
      m_ViewCentre = Centre;
  }

  void VVideoView::SetScaleMode( EScaleMode i_ScaleMode )
  {
    m_ScaleMode = i_ScaleMode;
    switch( i_ScaleMode )
    {
    case ScaleToWindow:
      m_ViewCentre = QVector2D( 0.5f, 0.5f );
      m_Zoom = m_FittedZoom;
      break;
    case ScaleOneToOne:
    case ScaleWindowToVideo:
      m_ViewCentre = QVector2D( 0.5f, 0.5f );
      m_Zoom = 1.0f;
      break;
    case ScaleFreely:
      break;
    }
  }

  void VVideoView::MousePress( const QPoint& i_rPosition, Qt::MouseButtons i_Buttons )
  {
    m_LastMousePosition = i_rPosition;
    m_bZoomDrag = ( i_Buttons & Qt::RightButton ) && !( i_Buttons & Qt::LeftButton );
  }

  void VVideoView::MouseRelease( const QPoint& i_rPosition, Qt::MouseButtons )
  {
    m_LastMousePosition = i_rPosition;
    m_bZoomDrag = false;
  }

  bool VVideoView::MouseMove( const QPoint& i_rPosition, Qt::MouseButtons i_Buttons, const QSize& i_rWidgetSize )
  {
    const bool bLeft = i_Buttons & Qt::LeftButton;
    const bool bRight = i_Buttons & Qt::RightButton;
    const bool bMiddle = i_Buttons & Qt::MiddleButton;
    const float Width = float( std::max( i_rWidgetSize.width(), 1 ) );
    const float Height = float( std::max( i_rWidgetSize.height(), 1 ) );

    if( bRight && !bLeft )
    {
      const float Factor = 1.0f + float( m_LastMousePosition.y() - i_rPosition.y() ) / Height;
      m_Zoom = std::min( std::max( m_Zoom * Factor, 0.2f ), 2.0f );
      m_LastMousePosition = i_rPosition;
    }
    // The pan is relative to the widget, not to the zoom: a widget width of dragging moves the
    // view by the whole sensor at any zoom.
    if( bLeft || bMiddle )
    {
      m_ViewCentre += QVector2D( float( m_LastMousePosition.x() - i_rPosition.x() ) / Width,
                                 float( m_LastMousePosition.y() - i_rPosition.y() ) / Height );
      m_LastMousePosition = i_rPosition;
    }
    if( bLeft || bRight || bMiddle )
    {
      m_ScaleMode = ScaleFreely;
      return true;
    }
    return false;
  }

  QSize VVideoView::MinimumSizeHint() const
  {
    if( m_ScaleMode != ScaleWindowToVideo )
      return QSize( 900, 505 );
    return QSize( std::max( 900, int( m_ImageRectangle.width() + 0.5 ) ),
                  std::max( 505, int( m_ImageRectangle.height() + 0.5 ) ) );
  }
} // namespace LumekVideoViewer
