#include "app/Controls/VLabelSlider.h"

#include <QPainter>
#include <QStyleOptionSlider>
#include <QWheelEvent>

namespace LumekVideoViewer
{
  VLabelSlider::VLabelSlider( QWidget* i_pParent ) : QSlider( i_pParent )
  {
    setFocusPolicy( Qt::StrongFocus );
  }

  VLabelSlider::VLabelSlider( Qt::Orientation i_Orientation, QWidget* i_pParent ) : QSlider( i_Orientation, i_pParent )
  {
    setFocusPolicy( Qt::StrongFocus );
  }

  void VLabelSlider::setValue( int i_Value )
  {
    const bool bWasBlocked = blockSignals( true );
    QSlider::setValue( i_Value );
    blockSignals( bWasBlocked );
  }

  QRect VLabelSlider::SubControlRect( int i_SubControl ) const
  {
    QStyleOptionSlider Option;
    initStyleOption( &Option );
    Option.subControls = QStyle::SC_SliderGroove | QStyle::SC_SliderHandle;
    return style()->subControlRect( QStyle::CC_Slider, &Option, static_cast< QStyle::SubControl >( i_SubControl ),
                                    this );
  }

  QRect VLabelSlider::GrooveRect() const
  {
    return SubControlRect( QStyle::SC_SliderGroove );
  }

  QRect VLabelSlider::HandleRect() const
  {
    return SubControlRect( QStyle::SC_SliderHandle );
  }

  void VLabelSlider::paintEvent( QPaintEvent* )
  {
    const QRect Groove = GrooveRect();
    const QRect Handle = HandleRect();
    const int Top = contentsRect().top();
    const int Bottom = contentsRect().bottom();
    const int MinorTop = Groove.y() - 2;
    const int BaseLine = Groove.y() - 2 + Groove.height();
    const int HalfHandle = Handle.width() / 2;

    QPainter Painter( this );
    Painter.setPen( palette().color( QPalette::WindowText ) );
    Painter.drawLine( HalfHandle, BaseLine, Groove.width() - HalfHandle, BaseLine );
    Painter.fillRect( Handle, HandleColour() );

    m_FramesPerPixel =
        static_cast< double >( static_cast< float >( maximum() ) / static_cast< float >( Groove.width() ) );
    const VTickSteps Steps = ComputeTickSteps( m_FramesPerPixel );
    const QFontMetrics Metrics = Painter.fontMetrics();
    for( const VTick& rTick : LayoutTicks( maximum(), Groove.width(), Handle.width(), Steps ) )
    {
      if( !rTick.Major )
      {
        Painter.drawLine( QPointF( rTick.Position, MinorTop ), QPointF( rTick.Position, BaseLine ) );
        continue;
      }
      Painter.drawLine( QPointF( rTick.Position, Top + 5 ), QPointF( rTick.Position, BaseLine ) );
      const QString Label = tr( "%1" ).arg( rTick.Frame );
      const QRect TextRect = Metrics.tightBoundingRect( Label );
      const float X = rTick.Position - static_cast< float >( TextRect.width() ) / 2.0f;
      // A number that would run off the right edge is left out rather than cut.
      if( X + static_cast< float >( TextRect.width() ) < static_cast< float >( width() ) )
        Painter.drawText( QPointF( X, Bottom + 1 ), Label );
    }
  }

  void VLabelSlider::wheelEvent( QWheelEvent* i_pEvent )
  {
    i_pEvent->ignore();
  }
} // namespace LumekVideoViewer
