#include "videointerface/PixelFormatDescriptor.h"

#include <iterator>

namespace ZOL
{
  namespace
  {
    using F = EPixelFamily;
    using P = EPixelPacking;
    using B = EBayerPhase;

    // clang-format off
    constexpr VPixelFormatDescriptor s_Rows[] = {
    //  format                      family        bits packing         phase      bytes shader format               JPEG output
      { PixelFormat_Unspecified,    F::None,      0,   P::None,        B::None,   0,    PixelFormat_Unspecified,    PixelFormat_R8G8B8u8 },
      { PixelFormat_Luminance8,     F::Luminance, 8,   P::Interleaved, B::None,   1,    PixelFormat_Luminance8,     PixelFormat_Luminance8 },
      { PixelFormat_BayerRG8,       F::Bayer,     8,   P::Interleaved, B::RG,     1,    PixelFormat_BayerRG8,       PixelFormat_PlanarY8U8V8 },
      { PixelFormat_BayerGB8,       F::Bayer,     8,   P::Interleaved, B::GB,     1,    PixelFormat_BayerGB8,       PixelFormat_PlanarY8U8V8 },
      { PixelFormat_BayerGR8,       F::Bayer,     8,   P::Interleaved, B::GR,     1,    PixelFormat_BayerGR8,       PixelFormat_PlanarY8U8V8 },
      { PixelFormat_BayerBG8,       F::Bayer,     8,   P::Interleaved, B::BG,     1,    PixelFormat_BayerBG8,       PixelFormat_PlanarY8U8V8 },
      { PixelFormat_R5G6B5,         F::RGB,       6,   P::Packed565,   B::None,   2,    PixelFormat_R5G6B5,         PixelFormat_R8G8B8u8 },
      { PixelFormat_R8G8B8,         F::RGB,       8,   P::Interleaved, B::None,   3,    PixelFormat_R8G8B8,         PixelFormat_R8G8B8 },
      { PixelFormat_B8G8R8,         F::RGB,       8,   P::Interleaved, B::None,   3,    PixelFormat_B8G8R8,         PixelFormat_B8G8R8 },
      { PixelFormat_R8G8B8u8,       F::RGB,       8,   P::Interleaved, B::None,   4,    PixelFormat_R8G8B8u8,       PixelFormat_R8G8B8u8 },
      { PixelFormat_B8G8R8u8,       F::RGB,       8,   P::Interleaved, B::None,   4,    PixelFormat_B8G8R8u8,       PixelFormat_B8G8R8u8 },
      { PixelFormat_U8Y8V8Y8,       F::YUV,       8,   P::Interleaved, B::None,   2,    PixelFormat_U8Y8V8Y8,       PixelFormat_U8Y8V8Y8 },
      { PixelFormat_Y8U8Y8V8,       F::YUV,       8,   P::Interleaved, B::None,   2,    PixelFormat_Y8U8Y8V8,       PixelFormat_Y8U8Y8V8 },
      { PixelFormat_U10Y10V10Y10,   F::YUV,       10,  P::TenBitGroups,B::None,   0,    PixelFormat_U8Y8V8Y8,       PixelFormat_R8G8B8u8 },
      { PixelFormat_BayerGB7,       F::Bayer,     7,   P::PackedBits,  B::GB,     0,    PixelFormat_BayerGB8,       PixelFormat_PlanarY8U8V8 },
      { PixelFormat_BayerGB6,       F::Bayer,     6,   P::PackedBits,  B::GB,     0,    PixelFormat_BayerGB8,       PixelFormat_PlanarY8U8V8 },
      { PixelFormat_Luminance7,     F::Luminance, 7,   P::PackedBits,  B::None,   0,    PixelFormat_Luminance8,     PixelFormat_Luminance8 },
      { PixelFormat_Luminance6,     F::Luminance, 6,   P::PackedBits,  B::None,   0,    PixelFormat_Luminance8,     PixelFormat_R8G8B8u8 },
      { PixelFormat_PlanarY8U8V8,   F::YUV,       8,   P::Planar,      B::None,   2,    PixelFormat_Unspecified,    PixelFormat_R8G8B8u8 },
      { PixelFormat_PlanarR8G8B8,   F::RGB,       8,   P::Planar,      B::None,   3,    PixelFormat_Unspecified,    PixelFormat_R8G8B8u8 },
    };
    // clang-format on

    constexpr bool HasOneRowEach()
    {
      if( std::size( s_Rows ) != PixelFormatCount )
        return false;
      // Rows stand at their format's number, so the look-up is an index and a forgotten or doubled
      // row shows here.
      for( std::uint32_t i = 0; i < PixelFormatCount; ++i )
        if( s_Rows[i].Format != i )
          return false;
      return true;
    }
    static_assert( HasOneRowEach(), "every pixel format needs exactly one descriptor row, in the enumeration's order" );

#define LUMEK_PIXEL_FORMAT_LISTED( NAME, VALUE )                                                                       \
  static_assert( VALUE < std::size( s_Rows ) && s_Rows[VALUE].Format == PixelFormat_##NAME,                            \
                 "pixel format " #NAME " has no descriptor row" );
    LUMEK_PIXEL_FORMATS( LUMEK_PIXEL_FORMAT_LISTED )
#undef LUMEK_PIXEL_FORMAT_LISTED
  } // namespace

  const VPixelFormatDescriptor& DescribePixelFormat( EPixelFormat i_Format )
  {
    return i_Format < PixelFormatCount ? s_Rows[i_Format] : s_Rows[PixelFormat_Unspecified];
  }

  int BayerStartKind( EPixelFormat i_Format )
  {
    const EBayerPhase Phase = DescribePixelFormat( i_Format ).Phase;
    return Phase == EBayerPhase::None ? -1 : static_cast< int >( Phase );
  }

  bool FirstRedOffset( EPixelFormat i_Format, int& o_rX, int& o_rY )
  {
    const int Kind = BayerStartKind( i_Format );
    if( Kind < 0 )
      return false;
    // Red is kind 0: a start of kind 1 puts it one column on, kind 3 one row down, kind 2 both.
    o_rX = ( Kind == 1 || Kind == 2 ) ? 1 : 0;
    o_rY = ( Kind == 2 || Kind == 3 ) ? 1 : 0;
    return true;
  }

  bool IsInterleavedRGB( EPixelFormat i_Format )
  {
    const VPixelFormatDescriptor& rRow = DescribePixelFormat( i_Format );
    return rRow.Family == EPixelFamily::RGB && rRow.Packing == EPixelPacking::Interleaved;
  }

  std::uint64_t PixelFormatFrameBytes( EPixelFormat i_Format, std::uint64_t i_Width, std::uint64_t i_Height )
  {
    const VPixelFormatDescriptor& rRow = DescribePixelFormat( i_Format );
    const std::uint64_t Pixels = i_Width * i_Height;
    switch( rRow.Packing )
    {
    case EPixelPacking::Interleaved:
    case EPixelPacking::Planar:
    case EPixelPacking::Packed565:
      return Pixels * rRow.BytesPerPixel;
    case EPixelPacking::PackedBits:
      return ( Pixels * rRow.BitsPerSample + 7 ) / 8;
    case EPixelPacking::TenBitGroups:
      return ( ( i_Width + 47 ) / 48 ) * i_Height * 128;
    case EPixelPacking::None:
      break;
    }
    return 0;
  }
} // namespace ZOL
