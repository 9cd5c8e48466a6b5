#pragma once

// Where the image lies on the sensor and how the sensor lies in the widget. Plain arithmetic,
// kept apart from the widget so that it can be checked without a display.

#include "graphics/VideoSurface/VideoSurfaceTypes.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/IVideoFrameInfo.h"

#include <QPoint>
#include <QRectF>
#include <QSize>
#include <QVector2D>
#include <QVector3D>
#include <QVector4D>

namespace LumekVideoViewer
{
  // The lens model as the shaders take it: centre in sensor pixels, k1 to k3 for distances in
  // sensor pixels. All zero without a calibration.
  struct VLensData
  {
    QVector2D Centre;
    QVector3D Parameters;
    QSize SensorSize{ 0, 0 };
    bool CorrectionEnabled = false;
  };

  // The lens data of a camera and its calibration; both default records, or a model whose
  // parameter count doesn't fit it, give no lens. The correction flag is left false.
  VLensData LensDataFrom( const CoreLumekTypes::VCameraHardware& i_rCamera,
                          const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration );

  // The image on the sensor, in sensor pixels, from the offsets and sensor factors of a frame
  // description.
  QRectF ImageRectangle( const ZOL::IVideoFrameInfo& i_rGeometry );

  // The radial polynomial of the lens, in double precision as the outline needs it.
  QPointF DistortPoint( const QPointF& i_rPoint, const QVector2D& i_rCentre, const QVector3D& i_rParameters );

  // Bounds of a rectangle's outline after distortion, sampled at ten points a side.
  QRectF DistortedBounds( const QRectF& i_rRectangle, const QVector2D& i_rCentre, const QVector3D& i_rParameters );

  // The sensor the picture is drawn on: the calibration's when it has one, otherwise one with
  // equal margins on either side of the image.
  QSize PaintSensorSize( const VLensData& i_rLens, const ZOL::IVideoFrameInfo& i_rGeometry );

  // xy: scale, zw: offset, from sensor-normalised coordinates to texture coordinates.
  QVector4D VideoScaleAndOffset( const ZOL::IVideoFrameInfo& i_rGeometry, const QSize& i_rSensorSize );

  // The state of the view: zoom, centre and scale mode, and how the mouse changes them.
  class VVideoView
  {
  public:
    // Recomputes the image rectangle and the fitted zoom, and follows them in the modes that
    // follow the image. Does nothing until the pixel record describes a frame.
    void Update( const ZOL::IVideoFrameInfo& i_rPixelRecord, const ZOL::IVideoFrameInfo& i_rGeometry,
                 const VLensData& i_rLens, const QSize& i_rWidgetSize );
    void SetScaleMode( EScaleMode i_ScaleMode );

    void MousePress( const QPoint& i_rPosition, Qt::MouseButtons i_Buttons );
    void MouseRelease( const QPoint& i_rPosition, Qt::MouseButtons i_Buttons );
    // True when the move took the view into ScaleFreely, which the widget announces.
    bool MouseMove( const QPoint& i_rPosition, Qt::MouseButtons i_Buttons, const QSize& i_rWidgetSize );

    QSize MinimumSizeHint() const;

    EScaleMode GetScaleMode() const { return m_ScaleMode; }
    float GetZoom() const { return m_Zoom; }
    float GetFittedZoom() const { return m_FittedZoom; }
    const QVector2D& GetViewCentre() const { return m_ViewCentre; }
    const QRectF& GetImageRectangle() const { return m_ImageRectangle; }
    bool IsZoomDragging() const { return m_bZoomDrag; }

  private:
    float m_Zoom = 1.0f;
    float m_FittedZoom = 1.0f;
    QVector2D m_ViewCentre{ 0.5f, 0.5f };
    QRectF m_ImageRectangle;
    QPoint m_LastMousePosition;
    bool m_bZoomDrag = false;
    EScaleMode m_ScaleMode = ScaleToWindow;
  };
} // namespace LumekVideoViewer
