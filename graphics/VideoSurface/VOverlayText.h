#pragma once

// The plates the surface paints over the picture.

#include <QRect>
#include <QString>

#include <string>

class QPainter;

namespace LumekVideoViewer
{
  // "150%": the zoom as a whole percentage.
  std::string ZoomText( float i_Zoom );
  // "Missing frame 00042".
  std::string MissingFrameText( int i_FrameIndex );
  // A dark plate 7 pixels wider than the text on each side, with the text in white.
  void DrawPlate( QPainter& io_rPainter, const QRect& i_rTextRect, const QString& i_rText );
} // namespace LumekVideoViewer
