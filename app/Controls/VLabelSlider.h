#pragma once

#include "app/Controls/SliderTicks.h"

#include <QSlider>

namespace LumekVideoViewer
{
  // The time bar: a slider that draws its own base line, handle and frame numbers. Give it a
  // VProxyStyle so that a click on the bar jumps there.
  class VLabelSlider : public QSlider
  {
    Q_OBJECT

  public:
    explicit VLabelSlider( QWidget* i_pParent = nullptr );
    VLabelSlider( Qt::Orientation i_Orientation, QWidget* i_pParent = nullptr );

    // Frames shown in one pixel of the groove at the last paint.
    double GetFramesPerPixel() const { return m_FramesPerPixel; }

    // The groove and handle rectangles the style gives this slider, as the paint uses them.
    QRect GrooveRect() const;
    QRect HandleRect() const;

    // The fill of the handle: the theme's gold, see-through so the marks under it show.
    static QColor HandleColour() { return QColor( 200, 152, 16, 150 ); }

  public slots:
    // Moves the handle without emitting anything, so that the playback clock moving the bar does
    // not come back to it as a user's request.
    void setValue( int i_Value );

  protected:
    void paintEvent( QPaintEvent* i_pEvent ) override;
    // The wheel steps frames in the window, not here.
    void wheelEvent( QWheelEvent* i_pEvent ) override;

  private:
    QRect SubControlRect( int i_SubControl ) const;

    double m_FramesPerPixel = 0.0;
  };
} // namespace LumekVideoViewer
