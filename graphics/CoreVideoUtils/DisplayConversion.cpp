#include "graphics/CoreVideoUtils/DisplayConversion.h"

namespace CoreVideoUtils
{
  bool ConvertToDisplayRGB( const ZOL::IVideoFrameInfo& i_rVideoFrameInfo, const std::uint8_t* i_pSource,
                            std::uint64_t i_SourceSize, const ZOL::IVideoSettings& i_rVideoSettings,
                            std::vector< std::uint8_t >& o_rRGB )
  {
    const std::uint64_t Bytes =
        FrameSizeInBytes( i_rVideoFrameInfo.ImageWidth, i_rVideoFrameInfo.ImageHeight, ZOL::PixelFormat_R8G8B8 );
    // A source must hold its own frame, so it bounds the allocation: no format takes more than
    // 4 bytes a pixel, and none less than 3/4 of a byte.
    if( Bytes == 0 || i_SourceSize == 0 || Bytes / 4 > i_SourceSize )
      return false;
    o_rRGB.resize( Bytes );
    VPixelFormatConverter Converter;
    Converter.SetVideoSettings( i_rVideoSettings );
    return Converter.Convert( i_rVideoFrameInfo, i_pSource, i_SourceSize, ZOL::PixelFormat_R8G8B8, o_rRGB.data(),
                              o_rRGB.size() );
  }
} // namespace CoreVideoUtils
