#include "tools/LumekVideoTool/FrameEncoding.h"

#include "videointerface/IVideoFrameInfo.h"
#include "videointerface/PixelFormatDescriptor.h"

#include <algorithm>

namespace LumekVideoTool
{
  namespace
  {
    std::uint8_t Clamp( int i_Value )
    {
      return static_cast< std::uint8_t >( std::min( 255, std::max( 0, i_Value ) ) );
    }

    int ChromaU( int R, int G, int B )
    {
      return ( 28573 * B - 9642 * R - 18930 * G + 0x800000 ) >> 16;
    }
    int ChromaV( int R, int G, int B )
    {
      return ( 40304 * R - 33750 * G - 6554 * B + 0x800000 ) >> 16;
    }

    // Samples of i_Bits bits, most significant bit first, with no gaps between samples or rows.
    std::vector< std::uint8_t > PackSamples( const std::vector< std::uint8_t >& i_rSamples, int i_Bits,
                                             std::size_t i_Size )
    {
      std::vector< std::uint8_t > Packed( i_Size, 0 );
      std::uint64_t BitPosition = 0;
      for( std::uint8_t Sample : i_rSamples )
      {
        const unsigned Value = Sample >> ( 8 - i_Bits );
        for( int Bit = i_Bits - 1; Bit >= 0; --Bit, ++BitPosition )
          if( ( Value >> Bit ) & 1u )
            Packed[BitPosition / 8] |= static_cast< std::uint8_t >( 0x80u >> ( BitPosition % 8 ) );
      }
      return Packed;
    }

    std::vector< std::uint8_t > Mosaic( const VRGBImage& i_rImage, ZOL::EPixelFormat i_Format )
    {
      std::vector< std::uint8_t > Sites( static_cast< std::size_t >( i_rImage.Width ) * i_rImage.Height );
      for( int y = 0; y < i_rImage.Height; ++y )
        for( int x = 0; x < i_rImage.Width; ++x )
          Sites[static_cast< std::size_t >( y ) * i_rImage.Width + x] =
              i_rImage.At( x, y )[BayerChannelAt( i_Format, x, y )];
      return Sites;
    }

    std::vector< std::uint8_t > Lumas( const VRGBImage& i_rImage )
    {
      std::vector< std::uint8_t > Values( static_cast< std::size_t >( i_rImage.Width ) * i_rImage.Height );
      for( int y = 0; y < i_rImage.Height; ++y )
        for( int x = 0; x < i_rImage.Width; ++x )
        {
          const std::uint8_t* p = i_rImage.At( x, y );
          Values[static_cast< std::size_t >( y ) * i_rImage.Width + x] = Luma( p[0], p[1], p[2] );
        }
      return Values;
    }

    // Y, U, V of each pixel, with the chroma of a pair averaged over its two pixels.
    struct VYUV
    {
      std::vector< int > Y, U, V; // U and V: one per pair
    };

    VYUV ToYUV422( const VRGBImage& i_rImage )
    {
      VYUV Result;
      const std::size_t Pixels = static_cast< std::size_t >( i_rImage.Width ) * i_rImage.Height;
      Result.Y.resize( Pixels );
      Result.U.resize( Pixels / 2 );
      Result.V.resize( Pixels / 2 );
      for( int y = 0; y < i_rImage.Height; ++y )
        for( int x = 0; x < i_rImage.Width; x += 2 )
        {
          const std::uint8_t* p0 = i_rImage.At( x, y );
          const std::uint8_t* p1 = i_rImage.At( x + 1, y );
          const std::size_t i = static_cast< std::size_t >( y ) * i_rImage.Width + x;
          Result.Y[i] = Luma( p0[0], p0[1], p0[2] );
          Result.Y[i + 1] = Luma( p1[0], p1[1], p1[2] );
          const int R = ( p0[0] + p1[0] + 1 ) / 2, G = ( p0[1] + p1[1] + 1 ) / 2, B = ( p0[2] + p1[2] + 1 ) / 2;
          Result.U[i / 2] = Clamp( ChromaU( R, G, B ) );
          Result.V[i / 2] = Clamp( ChromaV( R, G, B ) );
        }
      return Result;
    }

    // Groups of 16 bytes: four little-endian words of three 10-bit samples, U Y V Y U Y ..., rows
    // padded to a multiple of 48 pixels.
    std::vector< std::uint8_t > EncodeU10Y10V10Y10( const VRGBImage& i_rImage, std::size_t i_Size )
    {
      std::vector< std::uint8_t > Frame( i_Size, 0 );
      const VYUV YUV = ToYUV422( i_rImage );
      const std::size_t RowBytes = static_cast< std::size_t >( ( i_rImage.Width + 47 ) / 48 ) * 128;
      for( int y = 0; y < i_rImage.Height; ++y )
      {
        std::vector< unsigned > Samples;
        Samples.reserve( static_cast< std::size_t >( i_rImage.Width ) * 2 );
        for( int x = 0; x < i_rImage.Width; x += 2 )
        {
          const std::size_t i = static_cast< std::size_t >( y ) * i_rImage.Width + x;
          Samples.push_back( static_cast< unsigned >( YUV.U[i / 2] ) << 2 );
          Samples.push_back( static_cast< unsigned >( YUV.Y[i] ) << 2 );
          Samples.push_back( static_cast< unsigned >( YUV.V[i / 2] ) << 2 );
          Samples.push_back( static_cast< unsigned >( YUV.Y[i + 1] ) << 2 );
        }
        std::uint8_t* pRow = Frame.data() + RowBytes * y;
        for( std::size_t s = 0; s < Samples.size(); ++s )
        {
          const std::size_t Word = s / 3;
          const unsigned Shift = static_cast< unsigned >( s % 3 ) * 10;
          std::uint32_t Value = 0;
          for( int b = 0; b < 4; ++b )
            Value |= static_cast< std::uint32_t >( pRow[Word * 4 + b] ) << ( 8 * b );
          Value |= ( Samples[s] & 0x3FFu ) << Shift;
          for( int b = 0; b < 4; ++b )
            pRow[Word * 4 + b] = static_cast< std::uint8_t >( Value >> ( 8 * b ) );
        }
      }
      return Frame;
    }
  } // namespace

  std::uint8_t Luma( int i_R, int i_G, int i_B )
  {
    return Clamp( ( 19595 * i_R + 38469 * i_G + 7471 * i_B ) >> 16 );
  }

  int BayerChannelAt( ZOL::EPixelFormat i_Format, int i_X, int i_Y )
  {
    // Site kinds: 0 red, 1 green on a red row, 3 green on a blue row, 2 blue.
    const int Start = std::max( ZOL::BayerStartKind( i_Format ), 0 );
    const int Kind = ( Start ^ ( ( i_Y & 1 ) ? 3 : 0 ) ) ^ ( i_X & 1 );
    static const int s_Channel[4] = { 0, 1, 2, 1 };
    return s_Channel[Kind];
  }

  std::vector< std::uint8_t > EncodeFrame( const VRGBImage& i_rImage, ZOL::EPixelFormat i_Format )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_rImage.Width;
    Info.ImageHeight = i_rImage.Height;
    Info.PixelFormat = i_Format;
    const std::size_t Size = static_cast< std::size_t >( ZOL::GetVideoFrameSizeInBytes64( Info ) );
    const std::size_t Pixels = static_cast< std::size_t >( i_rImage.Width ) * i_rImage.Height;
    std::vector< std::uint8_t > Frame;
    if( Size == 0 )
      return Frame;

    switch( i_Format )
    {
    case ZOL::PixelFormat_Luminance8:
      return Lumas( i_rImage );
    case ZOL::PixelFormat_BayerRG8:
    case ZOL::PixelFormat_BayerGB8:
    case ZOL::PixelFormat_BayerGR8:
    case ZOL::PixelFormat_BayerBG8:
      return Mosaic( i_rImage, i_Format );
    case ZOL::PixelFormat_BayerGB7:
      return PackSamples( Mosaic( i_rImage, i_Format ), 7, Size );
    case ZOL::PixelFormat_BayerGB6:
      return PackSamples( Mosaic( i_rImage, i_Format ), 6, Size );
    case ZOL::PixelFormat_Luminance7:
      return PackSamples( Lumas( i_rImage ), 7, Size );
    case ZOL::PixelFormat_Luminance6:
      return PackSamples( Lumas( i_rImage ), 6, Size );
    case ZOL::PixelFormat_R5G6B5:
      Frame.resize( Size );
      for( std::size_t i = 0; i < Pixels; ++i )
      {
        const std::uint8_t* p = i_rImage.Pixels.data() + i * 3;
        const unsigned Value = ( ( p[0] >> 3 ) << 11 ) | ( ( p[1] >> 2 ) << 5 ) | ( p[2] >> 3 );
        Frame[i * 2] = static_cast< std::uint8_t >( Value & 0xFF );
        Frame[i * 2 + 1] = static_cast< std::uint8_t >( Value >> 8 );
      }
      return Frame;
    case ZOL::PixelFormat_R8G8B8:
      return i_rImage.Pixels;
    case ZOL::PixelFormat_B8G8R8:
    case ZOL::PixelFormat_R8G8B8u8:
    case ZOL::PixelFormat_B8G8R8u8:
    {
      const bool bBGR = i_Format != ZOL::PixelFormat_R8G8B8u8;
      const std::size_t Step = i_Format == ZOL::PixelFormat_B8G8R8 ? 3 : 4;
      Frame.assign( Size, 255 );
      for( std::size_t i = 0; i < Pixels; ++i )
      {
        const std::uint8_t* p = i_rImage.Pixels.data() + i * 3;
        std::uint8_t* q = Frame.data() + i * Step;
        q[0] = bBGR ? p[2] : p[0];
        q[1] = p[1];
        q[2] = bBGR ? p[0] : p[2];
      }
      return Frame;
    }
    case ZOL::PixelFormat_U8Y8V8Y8:
    case ZOL::PixelFormat_Y8U8Y8V8:
    case ZOL::PixelFormat_PlanarY8U8V8:
    {
      if( i_rImage.Width % 2 != 0 )
        return Frame;
      const VYUV YUV = ToYUV422( i_rImage );
      Frame.resize( Size );
      for( std::size_t i = 0; i < Pixels; i += 2 )
      {
        const auto Y0 = static_cast< std::uint8_t >( YUV.Y[i] ), Y1 = static_cast< std::uint8_t >( YUV.Y[i + 1] );
        const auto U = static_cast< std::uint8_t >( YUV.U[i / 2] ), V = static_cast< std::uint8_t >( YUV.V[i / 2] );
        if( i_Format == ZOL::PixelFormat_PlanarY8U8V8 )
        {
          Frame[i] = Y0;
          Frame[i + 1] = Y1;
          Frame[Pixels + i / 2] = U;
          Frame[Pixels + Pixels / 2 + i / 2] = V;
          continue;
        }
        std::uint8_t* q = Frame.data() + i * 2;
        const bool bUFirst = i_Format == ZOL::PixelFormat_U8Y8V8Y8;
        q[0] = bUFirst ? U : Y0;
        q[1] = bUFirst ? Y0 : U;
        q[2] = bUFirst ? V : Y1;
        q[3] = bUFirst ? Y1 : V;
      }
      return Frame;
    }
    case ZOL::PixelFormat_U10Y10V10Y10:
      if( i_rImage.Width % 2 != 0 )
        return Frame;
      return EncodeU10Y10V10Y10( i_rImage, Size );
    case ZOL::PixelFormat_PlanarR8G8B8:
      Frame.resize( Size );
      for( std::size_t i = 0; i < Pixels; ++i )
        for( std::size_t c = 0; c < 3; ++c )
          Frame[c * Pixels + i] = i_rImage.Pixels[i * 3 + c];
      return Frame;
    default:
      return Frame;
    }
  }
} // namespace LumekVideoTool
