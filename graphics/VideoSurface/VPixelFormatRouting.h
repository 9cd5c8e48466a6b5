#pragma once

// Which program draws a pixel format, how its texture is shaped and what reaches the card.
// One row a format; formats without a row are never uploaded.

#include "videointerface/Enumerations.h"
#include "videointerface/PixelFormatDescriptor.h"

#include <QSize>
#include <qopengl.h>

#include <cstdint>

namespace VideoGraphics
{
  enum EVideoProgram : int
  {
    Program_VideoRaw = 0,
    Program_VideoBayer = 1,
    Program_VideoLuminance = 2,
    Program_VideoYUV = 3,
  };
  constexpr int VideoProgramCount = 4;

  // The fragment stage of a video program ("VideoRaw", ...).
  const char* VideoProgramStage( int i_Program );

  struct VPixelFormatRoute
  {
    ZOL::EPixelFormat Format;
    EVideoProgram Program;
    // What the decoder name becomes in Hardware mode.
    const char* Label;
    GLenum InternalFormat;
    // 2 where a texel holds two pixels.
    int WidthDivisor;
    // The byte order differs from the one the program reads naturally.
    bool Swizzle;

    // The format the bytes are converted to before upload; the format itself when they go as they are.
    ZOL::EPixelFormat UploadFormat() const { return ZOL::DescribePixelFormat( Format ).ShaderFormat; }
  };

  // The row of a format, or nullptr for the formats that never go to the card as they are.
  const VPixelFormatRoute* FindPixelFormatRoute( std::uint32_t i_Format );

  // Texture size of a frame of that route: the width halved, rounded down, where texels pair pixels.
  QSize TextureSize( const VPixelFormatRoute& i_rRoute, int i_Width, int i_Height );
} // namespace VideoGraphics
