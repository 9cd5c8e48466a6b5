// The JPEG reader against ffmpeg's decode of the same files, in every format a caller may wish
// for; every cut, lying sizes and failed allocations refused with the reader's own lines.

#include "fileio/JPEGIO/JPEGReader.h"

#include "tests/fileio/ImageDecoders/ImageTestSupport.h"
#include "tests/support/AllocationWatch.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>
#include <turbojpeg.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace
{
  using namespace ZOL;
  using namespace LumekTest;

  // A JPEG and ffmpeg's own decode of it, in its stored planes.
  struct VSource
  {
    const char* Name;
    const char* PixelFormat; // ffmpeg's name of the stored planes; "gray" for a grey JPEG
    int Width, Height;
    int ChromaShiftX; // 1 for 4:2:x
    int ChromaShiftY; // 1 for 4:2:0
  };

  // A grey JPEG of a smooth picture, which ffmpeg's encoder cannot make.
  std::string GreyJPEG( int i_Width, int i_Height )
  {
    VBytes Pixels( static_cast< std::size_t >( i_Width ) * i_Height );
    for( int y = 0; y < i_Height; ++y )
      for( int x = 0; x < i_Width; ++x )
        Pixels[y * i_Width + x] = static_cast< std::uint8_t >( ( x * 5 + y * 3 + ( x * y ) % 17 ) & 0xFF );
    tjhandle Handle = tjInitCompress();
    unsigned char* pJPEG = nullptr;
    unsigned long Size = 0;
    const int Result =
        tjCompress2( Handle, Pixels.data(), i_Width, 0, i_Height, TJPF_GRAY, &pJPEG, &Size, TJSAMP_GRAY, 90, 0 );
    const std::string Path = ::testing::TempDir() + "grey_" + std::to_string( i_Width ) + "x" +
                             std::to_string( i_Height ) + "_" + std::to_string( getpid() ) + ".jpg";
    WriteWholeFile( Path, Result == 0 ? VBytes( pJPEG, pJPEG + Size ) : VBytes() );
    tjFree( pJPEG );
    tjDestroy( Handle );
    return Path;
  }

  std::string MakeJPEG( const VSource& i_rSource )
  {
    if( std::string( i_rSource.PixelFormat ) == "gray" )
      return GreyJPEG( i_rSource.Width, i_rSource.Height );
    // testsrc2 is smoother but of even sizes only; odd sizes come from testsrc.
    const bool bOdd = i_rSource.Width % 2 != 0 || i_rSource.Height % 2 != 0;
    const std::string Source = std::string( bOdd ? "testsrc" : "testsrc2" ) +
                               "=s=" + std::to_string( i_rSource.Width ) + "x" + std::to_string( i_rSource.Height );
    return FfmpegFixture(
        std::string( "still_" ) + i_rSource.Name + ".jpg",
        { "-f", "lavfi", "-i", Source, "-frames:v", "1", "-pix_fmt", i_rSource.PixelFormat, "-q:v", "3" } );
  }

  // ffmpeg's planes turned into the delivered format by the JFIF equations, with chroma
  // repeated rather than interpolated, as the fast upsampling of the reader does.
  VBytes Expected( const VSource& i_rSource, const VBytes& i_rPlanes, EPixelFormat i_Format )
  {
    const int W = i_rSource.Width, H = i_rSource.Height;
    const bool bGrey = std::string( i_rSource.PixelFormat ) == "gray";
    const int CW = ( W + ( 1 << i_rSource.ChromaShiftX ) - 1 ) >> i_rSource.ChromaShiftX;
    const int CH = ( H + ( 1 << i_rSource.ChromaShiftY ) - 1 ) >> i_rSource.ChromaShiftY;
    const std::uint8_t* pY = i_rPlanes.data();
    const std::uint8_t* pU = pY + W * H;
    const std::uint8_t* pV = pU + CW * CH;
    auto Clamp = []( double v ) { return static_cast< std::uint8_t >( std::clamp( std::lround( v ), 0L, 255L ) ); };
    VBytes Out;
    for( int y = 0; y < H; ++y )
      for( int x = 0; x < W; ++x )
      {
        const std::uint8_t Y = pY[y * W + x];
        const int C = ( y >> i_rSource.ChromaShiftY ) * CW + ( x >> i_rSource.ChromaShiftX );
        const double Cb = bGrey ? 0.0 : pU[C] - 128.0;
        const double Cr = bGrey ? 0.0 : pV[C] - 128.0;
        const std::uint8_t R = Clamp( Y + 1.402 * Cr );
        const std::uint8_t G = Clamp( Y - 0.344136 * Cb - 0.714136 * Cr );
        const std::uint8_t B = Clamp( Y + 1.772 * Cb );
        switch( i_Format )
        {
        case PixelFormat_Luminance8:
          Out.push_back( Y );
          break;
        case PixelFormat_R8G8B8:
          Out.insert( Out.end(), { R, G, B } );
          break;
        case PixelFormat_B8G8R8:
          Out.insert( Out.end(), { B, G, R } );
          break;
        case PixelFormat_R8G8B8u8:
          Out.insert( Out.end(), { R, G, B, 255 } ); // the unused byte is written opaque
          break;
        case PixelFormat_B8G8R8u8:
          Out.insert( Out.end(), { B, G, R, 255 } );
          break;
        case PixelFormat_U8Y8V8Y8:
          if( x % 2 == 0 )
            Out.insert( Out.end(), { pU[C], Y, pV[C] } );
          else
            Out.push_back( Y );
          break;
        case PixelFormat_Y8U8Y8V8:
          Out.insert( Out.end(), { Y, x % 2 == 0 ? pU[C] : pV[C] } );
          break;
        default:
          ADD_FAILURE() << "no expectation for format " << i_Format;
          return Out;
        }
      }
    return Out;
  }

  bool Read( const VBytes& i_rBytes, EPixelFormat i_Wish, std::shared_ptr< IBuffer >& o_rOutput,
             IVideoFrameInfo* o_pInfo = nullptr )
  {
    IVideoFrameInfo Info = FrameInfo( 0, 0, i_Wish );
    const bool bRead = JPEGIO::ReadJPEG( i_rBytes.data(), i_rBytes.size(), MakeFrameAllocator(), MakeFrameAllocator(),
                                         Info, o_rOutput );
    if( o_pInfo )
      *o_pInfo = Info;
    return bRead;
  }

  // ffmpeg and TurboJPEG's fast integer IDCT differ by a few levels, a little more after the
  // colour equations amplify the chroma; a wrong plane, order or upsampling differs by far more.
  TEST( JPEGDecode, EveryWishMatchesFfmpegWithinTheFastTransform )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "no ffmpeg";
    const VSource Sources[] = {
        { "YUV420_64x48", "yuvj420p", 64, 48, 1, 1 }, { "YUV420_37x29", "yuvj420p", 37, 29, 1, 1 },
        { "YUV422_64x48", "yuvj422p", 64, 48, 1, 0 }, { "YUV422_38x30", "yuvj422p", 38, 30, 1, 0 },
        { "YUV422_35x17", "yuvj422p", 35, 17, 1, 0 }, { "YUV444_40x24", "yuvj444p", 40, 24, 0, 0 },
        { "Grey_48x32", "gray", 48, 32, 0, 0 },
    };
    // The wish, what any image delivers for it, and what a 4:2:2 image of even width delivers.
    const EPixelFormat Wishes[][3] = {
        { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8, PixelFormat_U8Y8V8Y8 },
        { PixelFormat_Y8U8Y8V8, PixelFormat_R8G8B8, PixelFormat_Y8U8Y8V8 },
        { PixelFormat_Luminance8, PixelFormat_Luminance8, PixelFormat_Luminance8 },
        { PixelFormat_R8G8B8, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
        { PixelFormat_B8G8R8, PixelFormat_B8G8R8, PixelFormat_B8G8R8 },
        { PixelFormat_R8G8B8u8, PixelFormat_R8G8B8u8, PixelFormat_R8G8B8u8 },
        { PixelFormat_B8G8R8u8, PixelFormat_B8G8R8u8, PixelFormat_B8G8R8u8 },
        { PixelFormat_Luminance7, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
        { PixelFormat_BayerRG8, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
        { PixelFormat_PlanarY8U8V8, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
    };
    for( const VSource& rSource : Sources )
    {
      const std::string Path = MakeJPEG( rSource );
      const VBytes JPEG = ReadWholeFile( Path );
      ASSERT_FALSE( JPEG.empty() ) << rSource.Name;
      const VBytes Planes = FfmpegDecode( Path, rSource.PixelFormat );
      const bool bPacked422 = std::string( rSource.PixelFormat ) == "yuvj422p" && rSource.Width % 2 == 0;
      for( const auto& rWish : Wishes )
      {
        SCOPED_TRACE( std::string( rSource.Name ) + " to format " + std::to_string( rWish[0] ) );
        IVideoFrameInfo Info;
        std::shared_ptr< IBuffer > pOutput;
        ASSERT_TRUE( Read( JPEG, rWish[0], pOutput, &Info ) );
        EXPECT_EQ( Info.PixelFormat, rWish[bPacked422 ? 2 : 1] );
        EXPECT_EQ( Info.ImageWidth, rSource.Width );
        EXPECT_EQ( Info.ImageHeight, rSource.Height );
        ASSERT_TRUE( pOutput );
        const VBytes Want = Expected( rSource, Planes, Info.PixelFormat );
        ASSERT_EQ( Want.size(), pOutput->GetSize() );
        ASSERT_EQ( pOutput->GetSize(), GetVideoFrameSizeInBytes64( Info ) );
        int Largest = 0;
        std::uint64_t Sum = 0;
        for( std::size_t i = 0; i < Want.size(); ++i )
        {
          const int Difference = std::abs( int( Want[i] ) - int( pOutput->GetData()[i] ) );
          Largest = std::max( Largest, Difference );
          Sum += Difference;
        }
        EXPECT_LE( Largest, 10 );
        EXPECT_LE( double( Sum ) / Want.size(), 1.5 );
      }
    }
  }

  // Every cut of a real file, for both decode paths: no frame, one of the reader's own lines,
  // and nothing left allocated for the caller. Noise has no header at all.
  TEST( JPEGMalformed, EveryCutAndNoiseAreRefusedWithTheReadersLine )
  {
    const VBytes Whole = ReadWholeFile( SeedPath( "jpeg/yuv422_16x16.jpg" ) );
    ASSERT_GT( Whole.size(), 100u );
    for( EPixelFormat Wish : { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8 } )
      for( std::size_t Cut = 0; Cut + 2 < Whole.size(); ++Cut )
      {
        VLogCapture Log( "JPEGIO" );
        std::shared_ptr< IBuffer > pOutput;
        EXPECT_FALSE( Read( VBytes( Whole.begin(), Whole.begin() + Cut ), Wish, pOutput ) ) << "cut at " << Cut;
        EXPECT_FALSE( pOutput ) << "cut at " << Cut;
        ASSERT_EQ( Log.Lines().size(), 1u ) << "cut at " << Cut;
        const std::string Line = Log.Lines()[0];
        EXPECT_TRUE( Line == "2 Couldn't decode JPEG header." || Line == "2 Failed to decompress." ||
                     Line == "2 Failed to decompress to YUV." )
            << Line;
      }
    VBytes Noise( 4096 );
    std::uint32_t State = 12345;
    for( std::uint8_t& rByte : Noise )
      rByte = static_cast< std::uint8_t >( ( State = State * 1664525u + 1013904223u ) >> 24 );
    VLogCapture Log( "JPEGIO" );
    std::shared_ptr< IBuffer > pOutput;
    EXPECT_FALSE( Read( Noise, PixelFormat_R8G8B8, pOutput ) );
    EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Couldn't decode JPEG header." } );
  }

  // The frame header's size fields, rewritten in a real file, are refused before a frame of
  // that size is allocated.
  TEST( JPEGMalformed, HugeHeadersAreRefusedBeforeAllocating )
  {
    const VBytes SOF0Marker = { 0xFF, 0xC0 };
    const std::tuple< int, int, EPixelFormat > Cases[] = {
        { 60000, 60000, PixelFormat_R8G8B8 },   // wide and tall
        { 40000, 8, PixelFormat_Luminance8 },   // one side too long
        { 30000, 30000, PixelFormat_R8G8B8u8 }, // too many bytes
        { 32768, 32768, PixelFormat_U8Y8V8Y8 }, // too many bytes, packed
    };
    for( const auto& [Width, Height, Wish] : Cases )
    {
      VBytes Bytes = ReadWholeFile( SeedPath( "jpeg/yuv422_16x16.jpg" ) );
      const auto SOF0 = std::search( Bytes.begin(), Bytes.end(), SOF0Marker.begin(), SOF0Marker.end() );
      ASSERT_LT( SOF0 + 9, Bytes.end() );
      SOF0[5] = static_cast< std::uint8_t >( Height >> 8 );
      SOF0[6] = static_cast< std::uint8_t >( Height );
      SOF0[7] = static_cast< std::uint8_t >( Width >> 8 );
      SOF0[8] = static_cast< std::uint8_t >( Width );
      VLogCapture Log( "JPEGIO" );
      std::shared_ptr< IBuffer > pOutput;
      const VAllocationWatch Watch;
      EXPECT_FALSE( Read( Bytes, Wish, pOutput ) );
      EXPECT_LT( Watch.Largest(), 1u << 20 );
      EXPECT_TRUE( Logged( Log, "2 JPEG image of " + std::to_string( Width ) + " x " + std::to_string( Height ) +
                                    " is too large to decode." ) );
    }
  }

  TEST( JPEGAllocation, ANullAllocatorIsAFailedAllocation )
  {
    const VBytes Bytes = ReadWholeFile( SeedPath( "jpeg/yuv422_16x16.jpg" ) );
    // The output allocator on both paths, and the packed path's temporary buffer.
    const std::tuple< EPixelFormat, bool, const char* > Cases[] = {
        { PixelFormat_U8Y8V8Y8, true, "Output buffer allocation failed." },
        { PixelFormat_R8G8B8, true, "Output buffer allocation failed." },
        { PixelFormat_U8Y8V8Y8, false, "Temporary buffer allocation failed." },
    };
    for( const auto& [Wish, bOutputMissing, pMessage] : Cases )
    {
      VLogCapture Log( "JPEGIO" );
      IVideoFrameInfo Info = FrameInfo( 0, 0, Wish );
      std::shared_ptr< IBuffer > pOutput;
      EXPECT_FALSE( JPEGIO::ReadJPEG( Bytes.data(), Bytes.size(), bOutputMissing ? nullptr : MakeFrameAllocator(),
                                      bOutputMissing ? MakeFrameAllocator() : nullptr, Info, pOutput ) );
      EXPECT_TRUE( Logged( Log, std::string( "2 " ) + pMessage ) ) << pMessage;
    }
  }
} // namespace
