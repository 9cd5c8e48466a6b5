#pragma once

#include <QMetaType>

namespace LumekVideoViewer
{
  // How the view follows the image. The values are passed through signals and stored by the
  // window, so they are fixed.
  enum EScaleMode : int
  {
    // Zoom follows the fitted zoom and the view centre follows the image.
    ScaleToWindow = 0,
    // Zoom is set to 1.0 once and the view centred.
    ScaleOneToOne = 1,
    // Zoom and view centre stay where the mouse left them.
    ScaleFreely = 2,
    // As ScaleOneToOne, and the size hints become the image size.
    ScaleWindowToVideo = 3,
  };

  enum EDecoder : int
  {
    // Raw formats go to the card as they are and the shaders convert them.
    Hardware = 0,
    // Every frame is converted to R8G8B8 on the processor first.
    Software = 1,
  };
} // namespace LumekVideoViewer

Q_DECLARE_METATYPE( LumekVideoViewer::EScaleMode )
Q_DECLARE_METATYPE( LumekVideoViewer::EDecoder )
