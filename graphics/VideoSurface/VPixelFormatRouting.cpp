#include "graphics/VideoSurface/VPixelFormatRouting.h"

#ifndef GL_RGB565
#define GL_RGB565 0x8D62
#endif

namespace VideoGraphics
{
  namespace
  {
    using namespace ZOL;

    const char* const Grey = "Raw Grayscale Decoder";
    const char* const Bayer = "Hardware Bayer Demosaic";
    const char* const RGB = "Hardware RGB Decoder";
    const char* const YUV = "Hardware YUV Decoder";

    const VPixelFormatRoute Routes[] = {
        { PixelFormat_Luminance8, Program_VideoLuminance, Grey, GL_R8, 1, false },
        { PixelFormat_BayerRG8, Program_VideoBayer, Bayer, GL_R8, 1, false },
        { PixelFormat_BayerGB8, Program_VideoBayer, Bayer, GL_R8, 1, false },
        { PixelFormat_BayerGR8, Program_VideoBayer, Bayer, GL_R8, 1, false },
        { PixelFormat_BayerBG8, Program_VideoBayer, Bayer, GL_R8, 1, false },
        { PixelFormat_R5G6B5, Program_VideoRaw, RGB, GL_RGB565, 1, false },
        { PixelFormat_R8G8B8, Program_VideoRaw, RGB, GL_RGB8, 1, false },
        { PixelFormat_B8G8R8, Program_VideoRaw, RGB, GL_RGB8, 1, true },
        { PixelFormat_R8G8B8u8, Program_VideoRaw, RGB, GL_RGBA8, 1, false },
        { PixelFormat_B8G8R8u8, Program_VideoRaw, RGB, GL_RGBA8, 1, true },
        { PixelFormat_U8Y8V8Y8, Program_VideoYUV, YUV, GL_RGBA8, 2, true },
        { PixelFormat_Y8U8Y8V8, Program_VideoYUV, YUV, GL_RGBA8, 2, false },
        { PixelFormat_U10Y10V10Y10, Program_VideoYUV, YUV, GL_RGBA8, 2, true },
        { PixelFormat_BayerGB7, Program_VideoBayer, Bayer, GL_R8, 1, false },
        { PixelFormat_BayerGB6, Program_VideoBayer, Bayer, GL_R8, 1, false },
        { PixelFormat_Luminance7, Program_VideoLuminance, Grey, GL_R8, 1, false },
        { PixelFormat_Luminance6, Program_VideoLuminance, Grey, GL_R8, 1, false },
    };
  } // namespace

  const char* VideoProgramStage( int i_Program )
  {
    static const char* const Stages[VideoProgramCount] = { "VideoRaw", "VideoBayer", "VideoLuminance", "VideoYUV" };
    return ( i_Program >= 0 && i_Program < VideoProgramCount ) ? Stages[i_Program] : nullptr;
  }

  const VPixelFormatRoute* FindPixelFormatRoute( std::uint32_t i_Format )
  {
    for( const VPixelFormatRoute& rRoute : Routes )
      if( rRoute.Format == i_Format )
        return &rRoute;
    return nullptr;
  }

  QSize TextureSize( const VPixelFormatRoute& i_rRoute, int i_Width, int i_Height )
  {
    return QSize( i_Width / i_rRoute.WidthDivisor, i_Height );
  }
} // namespace VideoGraphics
