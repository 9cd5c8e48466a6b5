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
    int Width;
    int Height;
    int ChromaShiftX; // 1 for 4:2:x
    int ChromaShiftY; // 1 for 4:2:0
  };

  const VSource s_Sources[] = {
      { "YUV420_64x48", "yuvj420p", 64, 48, 1, 1 }, { "YUV420_37x29", "yuvj420p", 37, 29, 1, 1 },
      { "YUV422_64x48", "yuvj422p", 64, 48, 1, 0 }, { "YUV422_38x30", "yuvj422p", 38, 30, 1, 0 },
      { "YUV422_35x17", "yuvj422p", 35, 17, 1, 0 }, { "YUV444_40x24", "yuvj444p", 40, 24, 0, 0 },
      { "Grey_48x32", "gray", 48, 32, 0, 0 },
  };

  // A grey JPEG of a smooth picture, which ffmpeg's encoder cannot make.
  std::string GreyJPEG( int i_Width, int i_Height )
  {
    std::vector< std::uint8_t > Pixels( static_cast< std::size_t >( i_Width ) * i_Height );
    for( int y = 0; y < i_Height; ++y )
      for( int x = 0; x < i_Width; ++x )
        Pixels[y * i_Width + x] = static_cast< std::uint8_t >( ( x * 5 + y * 3 + ( x * y ) % 17 ) & 0xFF );
    tjhandle Handle = tjInitCompress();
    unsigned char* pJPEG = nullptr;
    unsigned long Size = 0;
    const int Result =
        tjCompress2( Handle, Pixels.data(), i_Width, 0, i_Height, TJPF_GRAY, &pJPEG, &Size, TJSAMP_GRAY, 90, 0 );
    std::vector< std::uint8_t > Bytes;
    if( Result == 0 )
      Bytes.assign( pJPEG, pJPEG + Size );
    tjFree( pJPEG );
    tjDestroy( Handle );
    const std::string Path = ::testing::TempDir() + "grey_" + std::to_string( i_Width ) + "x" +
                             std::to_string( i_Height ) + "_" + std::to_string( getpid() ) + ".jpg";
    WriteWholeFile( Path, Bytes );
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
  std::vector< std::uint8_t > Expected( const VSource& i_rSource, const std::vector< std::uint8_t >& i_rPlanes,
                                        EPixelFormat i_Format )
  {
    const int W = i_rSource.Width;
    const int H = i_rSource.Height;
    const bool bGrey = std::string( i_rSource.PixelFormat ) == "gray";
    const int CW = ( W + ( 1 << i_rSource.ChromaShiftX ) - 1 ) >> i_rSource.ChromaShiftX;
    const int CH = ( H + ( 1 << i_rSource.ChromaShiftY ) - 1 ) >> i_rSource.ChromaShiftY;
    const std::uint8_t* pY = i_rPlanes.data();
    const std::uint8_t* pU = pY + W * H;
    const std::uint8_t* pV = pU + CW * CH;
    std::vector< std::uint8_t > Out;
    for( int y = 0; y < H; ++y )
      for( int x = 0; x < W; ++x )
      {
        const int Y = pY[y * W + x];
        const int C = ( y >> i_rSource.ChromaShiftY ) * CW + ( x >> i_rSource.ChromaShiftX );
        const double Cb = bGrey ? 0.0 : pU[C] - 128.0;
        const double Cr = bGrey ? 0.0 : pV[C] - 128.0;
        auto Clamp = []( double v ) { return static_cast< std::uint8_t >( std::clamp( std::lround( v ), 0L, 255L ) ); };
        const std::uint8_t R = Clamp( Y + 1.402 * Cr );
        const std::uint8_t G = Clamp( Y - 0.344136 * Cb - 0.714136 * Cr );
        const std::uint8_t B = Clamp( Y + 1.772 * Cb );
        switch( i_Format )
        {
        case PixelFormat_Luminance8:
          Out.push_back( static_cast< std::uint8_t >( Y ) );
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
            Out.insert( Out.end(), { pU[C], static_cast< std::uint8_t >( Y ), pV[C] } );
          else
            Out.push_back( static_cast< std::uint8_t >( Y ) );
          break;
        case PixelFormat_Y8U8Y8V8:
          Out.push_back( static_cast< std::uint8_t >( Y ) );
          Out.push_back( x % 2 == 0 ? pU[C] : pV[C] );
          break;
        default:
          ADD_FAILURE() << "no expectation for format " << i_Format;
          return Out;
        }
      }
    return Out;
  }

  struct VWish
  {
    const char* Name;
    EPixelFormat Wish;
    EPixelFormat Delivered;      // by any image
    EPixelFormat DeliveredBy422; // by a 4:2:2 image of even width
  };

  const VWish s_Wishes[] = {
      { "UYVY", PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8, PixelFormat_U8Y8V8Y8 },
      { "YUYV", PixelFormat_Y8U8Y8V8, PixelFormat_R8G8B8, PixelFormat_Y8U8Y8V8 },
      { "Luminance8", PixelFormat_Luminance8, PixelFormat_Luminance8, PixelFormat_Luminance8 },
      { "RGB", PixelFormat_R8G8B8, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
      { "BGR", PixelFormat_B8G8R8, PixelFormat_B8G8R8, PixelFormat_B8G8R8 },
      { "RGBX", PixelFormat_R8G8B8u8, PixelFormat_R8G8B8u8, PixelFormat_R8G8B8u8 },
      { "BGRX", PixelFormat_B8G8R8u8, PixelFormat_B8G8R8u8, PixelFormat_B8G8R8u8 },
      { "Luminance7", PixelFormat_Luminance7, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
      { "BayerRG8", PixelFormat_BayerRG8, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
      { "PlanarYUV", PixelFormat_PlanarY8U8V8, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
  };

  std::ostream& operator<<( std::ostream& o, const VSource& i_rSource )
  {
    return o << i_rSource.Name;
  }

  std::ostream& operator<<( std::ostream& o, const VWish& i_rWish )
  {
    return o << i_rWish.Name;
  }

  class JPEGDecode : public ::testing::TestWithParam< std::tuple< VSource, VWish > >
  {
  };

  // ffmpeg and TurboJPEG's fast integer IDCT differ by a few levels, a little more after the
  // colour equations amplify the chroma; a wrong plane, order or upsampling differs by far more.
  constexpr int MaxDifference = 10;
  constexpr double MaxMeanDifference = 1.5;

  TEST_P( JPEGDecode, MatchesFfmpegWithinTheFastTransform )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "no ffmpeg";
    const VSource& rSource = std::get< 0 >( GetParam() );
    const VWish& rWish = std::get< 1 >( GetParam() );
    const std::string Path = MakeJPEG( rSource );
    ASSERT_FALSE( Path.empty() );
    const std::vector< std::uint8_t > JPEG = ReadWholeFile( Path );
    ASSERT_FALSE( JPEG.empty() );

    IVideoFrameInfo Info = FrameInfo( 0, 0, rWish.Wish );
    std::shared_ptr< IBuffer > pOutput;
    ASSERT_TRUE(
        JPEGIO::ReadJPEG( JPEG.data(), JPEG.size(), MakeFrameAllocator(), MakeFrameAllocator(), Info, pOutput ) );
    const bool bPacked422 = std::string( rSource.PixelFormat ) == "yuvj422p" && rSource.Width % 2 == 0;
    EXPECT_EQ( Info.PixelFormat, bPacked422 ? rWish.DeliveredBy422 : rWish.Delivered );
    EXPECT_EQ( Info.ImageWidth, rSource.Width );
    EXPECT_EQ( Info.ImageHeight, rSource.Height );
    ASSERT_TRUE( pOutput );
    ASSERT_EQ( pOutput->GetSize(), GetVideoFrameSizeInBytes64( Info ) );

    const std::vector< std::uint8_t > Want =
        Expected( rSource, FfmpegDecode( Path, rSource.PixelFormat ), Info.PixelFormat );
    ASSERT_EQ( Want.size(), pOutput->GetSize() );
    int Largest = 0;
    std::uint64_t Sum = 0;
    for( std::size_t i = 0; i < Want.size(); ++i )
    {
      const int Difference = std::abs( int( Want[i] ) - int( pOutput->GetData()[i] ) );
      Largest = std::max( Largest, Difference );
      Sum += Difference;
    }
    RecordProperty( "LargestDifference", Largest );
    EXPECT_LE( Largest, MaxDifference );
    EXPECT_LE( double( Sum ) / Want.size(), MaxMeanDifference );
  }

  INSTANTIATE_TEST_SUITE_P( SourcesAndWishes, JPEGDecode,
                            ::testing::Combine( ::testing::ValuesIn( s_Sources ), ::testing::ValuesIn( s_Wishes ) ),
                            []( const auto& i_rInfo ) {
                              return std::string( std::get< 0 >( i_rInfo.param ).Name ) + "_to_" +
                                     std::get< 1 >( i_rInfo.param ).Name;
                            } );

  std::vector< std::uint8_t > SeedJPEG()
  {
    return ReadWholeFile( SeedPath( "jpeg/yuv422_16x16.jpg" ) );
  }

  bool Read( const std::vector< std::uint8_t >& i_rBytes, EPixelFormat i_Wish, std::shared_ptr< IBuffer >& o_rOutput )
  {
    IVideoFrameInfo Info = FrameInfo( 0, 0, i_Wish );
    return JPEGIO::ReadJPEG( i_rBytes.data(), i_rBytes.size(), MakeFrameAllocator(), MakeFrameAllocator(), Info,
                             o_rOutput );
  }

  // Every cut of a real file, for both decode paths: no frame, one of the reader's own lines,
  // and nothing left allocated for the caller.
  TEST( JPEGMalformed, EveryCutIsRefusedWithTheReadersMessage )
  {
    const std::vector< std::uint8_t > Whole = SeedJPEG();
    ASSERT_GT( Whole.size(), 100u );
    for( EPixelFormat Wish : { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8 } )
      for( std::size_t Cut = 0; Cut + 2 < Whole.size(); ++Cut )
      {
        const std::vector< std::uint8_t > Part( Whole.begin(), Whole.begin() + Cut );
        VCategoryLog Log( "JPEGIO" );
        std::shared_ptr< IBuffer > pOutput;
        EXPECT_FALSE( Read( Part, Wish, pOutput ) ) << "cut at " << Cut;
        EXPECT_FALSE( pOutput ) << "cut at " << Cut;
        ASSERT_EQ( Log.Lines().size(), 1u ) << "cut at " << Cut;
        EXPECT_TRUE( Log.Contains( "2 Couldn't decode JPEG header." ) || Log.Contains( "2 Failed to decompress." ) ||
                     Log.Contains( "2 Failed to decompress to YUV." ) )
            << Log.Lines()[0];
      }
  }

  TEST( JPEGMalformed, GarbageHasNoHeader )
  {
    std::vector< std::uint8_t > Garbage( 4096 );
    std::uint32_t State = 12345;
    for( std::uint8_t& rByte : Garbage )
      rByte = static_cast< std::uint8_t >( ( State = State * 1664525u + 1013904223u ) >> 24 );
    VCategoryLog Log( "JPEGIO" );
    std::shared_ptr< IBuffer > pOutput;
    EXPECT_FALSE( Read( Garbage, PixelFormat_R8G8B8, pOutput ) );
    EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Couldn't decode JPEG header." } );
  }

  // The frame header's size fields, rewritten in a real file.
  std::vector< std::uint8_t > WithSize( std::vector< std::uint8_t > i_Bytes, int i_Width, int i_Height )
  {
    for( std::size_t i = 0; i + 9 < i_Bytes.size(); ++i )
      if( i_Bytes[i] == 0xFF && i_Bytes[i + 1] == 0xC0 )
      {
        i_Bytes[i + 5] = static_cast< std::uint8_t >( i_Height >> 8 );
        i_Bytes[i + 6] = static_cast< std::uint8_t >( i_Height );
        i_Bytes[i + 7] = static_cast< std::uint8_t >( i_Width >> 8 );
        i_Bytes[i + 8] = static_cast< std::uint8_t >( i_Width );
        break;
      }
    return i_Bytes;
  }

  struct VHugeCase
  {
    const char* Name;
    int Width;
    int Height;
    EPixelFormat Wish;
  };

  std::ostream& operator<<( std::ostream& o, const VHugeCase& i_rCase )
  {
    return o << i_rCase.Name;
  }

  class JPEGHugeHeader : public ::testing::TestWithParam< VHugeCase >
  {
  };

  TEST_P( JPEGHugeHeader, IsRefusedBeforeAllocating )
  {
    const VHugeCase& rCase = GetParam();
    const std::vector< std::uint8_t > Bytes = WithSize( SeedJPEG(), rCase.Width, rCase.Height );
    VCategoryLog Log( "JPEGIO" );
    std::shared_ptr< IBuffer > pOutput;
    const VAllocationWatch Watch;
    EXPECT_FALSE( Read( Bytes, rCase.Wish, pOutput ) );
    EXPECT_LT( Watch.Largest(), 1u << 20 );
    EXPECT_TRUE( Log.Contains( "2 JPEG image of " + std::to_string( rCase.Width ) + " x " +
                               std::to_string( rCase.Height ) + " is too large to decode." ) );
  }

  INSTANTIATE_TEST_SUITE_P( Sizes, JPEGHugeHeader,
                            ::testing::Values( VHugeCase{ "WideAndTall", 60000, 60000, PixelFormat_R8G8B8 },
                                               VHugeCase{ "OneSideTooLong", 40000, 8, PixelFormat_Luminance8 },
                                               VHugeCase{ "TooManyBytes", 30000, 30000, PixelFormat_R8G8B8u8 },
                                               VHugeCase{ "TooManyBytesPacked", 32768, 32768, PixelFormat_U8Y8V8Y8 } ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

  TEST( JPEGAllocation, ANullAllocatorIsAFailedAllocation )
  {
    const std::vector< std::uint8_t > Bytes = SeedJPEG();
    for( EPixelFormat Wish : { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8 } )
    {
      VCategoryLog Log( "JPEGIO" );
      IVideoFrameInfo Info = FrameInfo( 0, 0, Wish );
      std::shared_ptr< IBuffer > pOutput;
      EXPECT_FALSE( JPEGIO::ReadJPEG( Bytes.data(), Bytes.size(), nullptr, MakeFrameAllocator(), Info, pOutput ) );
      EXPECT_TRUE( Log.Contains( "2 Output buffer allocation failed." ) );
    }
    VCategoryLog Log( "JPEGIO" );
    IVideoFrameInfo Info = FrameInfo( 0, 0, PixelFormat_U8Y8V8Y8 );
    std::shared_ptr< IBuffer > pOutput;
    EXPECT_FALSE( JPEGIO::ReadJPEG( Bytes.data(), Bytes.size(), MakeFrameAllocator(), nullptr, Info, pOutput ) );
    EXPECT_TRUE( Log.Contains( "2 Temporary buffer allocation failed." ) );
  }
} // namespace
