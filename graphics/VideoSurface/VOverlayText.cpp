#include "graphics/VideoSurface/VOverlayText.h"

#include <boost/format.hpp>

#include <QPainter>

namespace LumekVideoViewer
{
  std::string ZoomText( float i_Zoom )
  {
    return ( boost::format( "%.0f%%" ) % ( i_Zoom * 100.0f ) ).str();
  }

  std::string MissingFrameText( int i_FrameIndex )
  {
    return ( boost::format( "Missing frame %05d" ) % i_FrameIndex ).str();
  }

  void DrawPlate( QPainter& io_rPainter, const QRect& i_rTextRect, const QString& i_rText )
  {
    const QRect Plate = i_rTextRect.adjusted( -7, -7, 7, 7 );
    io_rPainter.setPen( QColor( 48, 48, 48, 255 ) );
    io_rPainter.setBrush( QColor( 64, 64, 64, 255 ) );
    io_rPainter.drawRect( Plate );
    io_rPainter.setPen( QColor( 255, 255, 255, 255 ) );
    io_rPainter.drawText( i_rTextRect, Qt::AlignLeft | Qt::AlignVCenter, i_rText );
  }
} // namespace LumekVideoViewer
