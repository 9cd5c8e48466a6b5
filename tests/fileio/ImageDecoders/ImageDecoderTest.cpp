// The still-image decoders: the JPEG segment parser's golden dumps, the JPEG reader in every
// wished format and PNG and TIFF through the frame decoder against ffmpeg's decode, a TIFF made
// by hand, malformed and cut streams refused with their own lines, and the run without MagickWand.

#include "fileio/ImageMagickWrapper/ImageReader.h"
#include "fileio/JPEGIO/JPEGReader.h"
#include "fileio/JPEGUtils/JPEGParser.h"
#include "fileio/PNGIO/PNGReader.h"
#include "fileio/TIFFIO/TIFFReader.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "tests/fileio/ImageDecoders/ImageTestSupport.h"
#include "tests/support/AllocationWatch.h"
#include "tests/support/FfmpegFixtures.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <map>

namespace
{
  using namespace ZOL;
  using namespace LumekTest;
  using JPEGUtils::VJPEGSegment;

  struct VParse
  {
    bool bResult = false;
    std::vector< VJPEGSegment > Segments;
    std::vector< std::string > Log;
  };

  VParse Parse( const VBytes& i_rBytes )
  {
    VParse Result;
    VLogCapture Log( "JPEGIO" );
    UtilsIO::VMemoryInputStream Stream( i_rBytes.data(), i_rBytes.size() );
    Result.bResult = JPEGUtils::ParseJPEG( Stream, i_rBytes.size(), Result.Segments );
    Result.Log = Log.Lines();
    return Result;
  }

  VBytes Join( std::initializer_list< VBytes > i_Parts )
  {
    VBytes Bytes;
    for( const auto& rPart : i_Parts )
      Bytes.insert( Bytes.end(), rPart.begin(), rPart.end() );
    return Bytes;
  }

  // A small image by hand: SOI at 0, APP0 at 2 (18 bytes), COM at 20 (9), APP14 at 29 (6), SOS
  // at 35 (10), entropy data with a stuffed byte at 47 and RST0 at 50, EOI at 53.
  const VBytes s_SOI = { 0xFF, 0xD8 };
  const VBytes s_APP0 = { 0xFF, 0xE0, 0x00, 0x10, 'J',  'F',  'I',  'F',  0x00,
                          0x01, 0x01, 0x00, 0x00, 0x01, 0x00, 0x01, 0x00, 0x00 };
  const VBytes s_COM = { 0xFF, 0xFE, 0x00, 0x07, 'H', 'i', ' ', '!', '!' };
  const VBytes s_APP14 = { 0xFF, 0xEE, 0x00, 0x04, 0x00, 0x00 };
  const VBytes s_DQT = { 0xFF, 0xDB, 0x00, 0x02 };
  const VBytes s_SOS = { 0xFF, 0xDA, 0x00, 0x08, 0x01, 0x01, 0x00, 0x00, 0x3F, 0x00 };
  const VBytes s_Scan = { 0x12, 0x34, 0xFF, 0x00, 0x56, 0xFF, 0xD0, 0x78 };
  const VBytes s_EOI = { 0xFF, 0xD9 };
  const VBytes s_HandMade = Join( { s_SOI, s_APP0, s_COM, s_APP14, s_SOS, s_Scan, s_EOI } );

  // The hand-made image, and ffmpeg's 4:2:2 encoding of a 16 x 16 test picture.
  TEST( JPEGParser, DumpsAsTheGoldenText )
  {
    for( const auto& [Bytes, pGolden] : { std::pair( s_HandMade, "hand_made.txt" ),
                                          std::pair( Seed( "jpeg/yuv422_16x16.jpg" ), "yuv422_16x16.txt" ) } )
    {
      const VParse Result = Parse( Bytes );
      EXPECT_TRUE( Result.bResult ) << pGolden;
      UtilsIO::VMemoryInputStream Stream( Bytes.data(), Bytes.size() );
      const VBytes Expected = ReadFileBytes( std::string( JPEG_GOLDEN_FOLDER ) + "/" + pGolden );
      EXPECT_EQ( JPEGUtils::DumpJPEG( Result.Segments, Stream ), std::string( Expected.begin(), Expected.end() ) );
    }
  }

  TEST( JPEGParser, MalformedStreamsAreRefusedWithTheirLine )
  {
    const std::string TooFew = "Not enough segments.  Data may be truncated or corrupt.";
    const std::string Unclean = "Did not end cleanly.  Data may be truncated or corrupt.";
    const std::tuple< const char*, VBytes, std::string > Cases[] = {
        { "Empty", {}, TooFew },
        { "ThreeSegments", Join( { s_SOI, s_APP14, s_EOI } ), TooFew },
        { "NoSOI", Join( { s_APP0, s_DQT, s_SOS, s_Scan, s_EOI } ), "Missing SOI marker." },
        { "NoEOI", Join( { s_SOI, s_APP0, s_DQT, s_SOS, s_Scan } ), "Missing EOI marker." },
        { "DataBeforeTheScan", Join( { s_SOI, s_APP0, { 0x12 }, s_SOS, s_Scan, s_EOI } ),
          "Unrecognised data found in buffer at 0x14" },
        { "StuffedByteBeforeTheScan", Join( { s_SOI, { 0xFF, 0x00 }, s_SOS, s_Scan, s_EOI } ),
          "0xff00 found outside of image scan." },
        { "SegmentPastTheEnd", Join( { s_SOI, s_APP0, s_DQT, { 0xFF, 0xE1, 0x40, 0x00, 1, 2 } } ), Unclean },
        { "MarkerCutInHalf", Join( { s_SOI, s_APP0, s_DQT, s_SOS, s_Scan, { 0xFF } } ), Unclean },
    };
    for( const auto& [pName, rBytes, rMessage] : Cases )
    {
      const VParse Result = Parse( rBytes );
      EXPECT_FALSE( Result.bResult ) << pName;
      EXPECT_EQ( Result.Log, std::vector< std::string >{ "2 " + rMessage } ) << pName;
    }

    // Every cut of a real image fails, with one line, and never reads past the cut.
    const VBytes Whole = Seed( "jpeg/yuv420_24x16.jpg" );
    ASSERT_GT( Whole.size(), 100u );
    for( std::size_t Cut = 0; Cut < Whole.size(); ++Cut )
    {
      const VParse Result = Parse( Damaged( Whole, Cut, 0 ) );
      EXPECT_FALSE( Result.bResult ) << "cut at " << Cut;
      EXPECT_EQ( Result.Log.size(), 1u ) << "cut at " << Cut;
    }
    EXPECT_TRUE( Parse( Whole ).bResult );
  }

  // A JPEG of ffmpeg's test picture in its stored planes ("yuvj420p", "yuvj422p"). testsrc2 is
  // smoother but of even sizes only; odd sizes come from testsrc.
  std::string MakeJPEG( const char* i_pPlanes, int i_Width, int i_Height )
  {
    const std::string Size = std::to_string( i_Width ) + "x" + std::to_string( i_Height );
    const bool bOdd = i_Width % 2 != 0 || i_Height % 2 != 0;
    return FfmpegFixture( std::string( "still_" ) + i_pPlanes + Size + ".jpg",
                          { "-f", "lavfi", "-i", std::string( bOdd ? "testsrc" : "testsrc2" ) + "=s=" + Size,
                            "-frames:v", "1", "-pix_fmt", i_pPlanes, "-q:v", "3" } );
  }

  // ffmpeg's planes turned into the delivered format by the JFIF equations, with chroma
  // repeated rather than interpolated, as the fast upsampling of the reader does. Each format
  // lays out a pixel (a pair for the packed YUV formats, whose second luma is 'y') by its
  // letters; '#' is the unused byte, written opaque.
  VBytes Expected( const VBytes& i_rPlanes, int W, int H, bool i_b420, EPixelFormat i_Format )
  {
    const std::map< EPixelFormat, std::string > Layouts = {
        { PixelFormat_Luminance8, "Y" },  { PixelFormat_R8G8B8, "RGB" },    { PixelFormat_B8G8R8, "BGR" },
        { PixelFormat_R8G8B8u8, "RGB#" }, { PixelFormat_B8G8R8u8, "BGR#" }, { PixelFormat_U8Y8V8Y8, "UYVy" },
        { PixelFormat_Y8U8Y8V8, "YUyV" } };
    const std::string Layout = Layouts.at( i_Format );
    const int Step = Layout.find( 'y' ) == std::string::npos ? 1 : 2, ShiftY = i_b420 ? 1 : 0;
    const int CW = ( W + 1 ) / 2, CH = ( H + ShiftY ) >> ShiftY;
    const std::uint8_t* pY = i_rPlanes.data();
    const std::uint8_t* pU = pY + W * H;
    const std::uint8_t* pV = pU + CW * CH;
    auto Clamp = []( double v ) { return static_cast< std::uint8_t >( std::clamp( std::lround( v ), 0L, 255L ) ); };
    VBytes Out;
    for( int y = 0; y < H; ++y )
      for( int x = 0; x < W; x += Step )
      {
        const std::uint8_t Y = pY[y * W + x];
        const int C = ( y >> ShiftY ) * CW + x / 2;
        const double Cb = pU[C] - 128.0, Cr = pV[C] - 128.0;
        for( const char Letter : Layout )
          Out.push_back( Letter == 'Y'   ? Y
                         : Letter == 'y' ? pY[y * W + x + 1]
                         : Letter == 'U' ? pU[C]
                         : Letter == 'V' ? pV[C]
                         : Letter == 'R' ? Clamp( Y + 1.402 * Cr )
                         : Letter == 'G' ? Clamp( Y - 0.344136 * Cb - 0.714136 * Cr )
                         : Letter == 'B' ? Clamp( Y + 1.772 * Cb )
                                         : 255 );
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
    // An odd size, where the last chroma sample serves one pixel, and an even-width 4:2:2 image,
    // which the packed formats take without a colour conversion. TurboJPEG alone tells the
    // other chroma layouts apart.
    const std::tuple< const char*, int, int > Sources[] = {
        { "yuvj420p", 37, 29 }, { "yuvj422p", 38, 30 }, { "yuvj422p", 35, 17 } };
    // The wish, what any image delivers for it, and what a 4:2:2 image of even width delivers.
    const EPixelFormat Wishes[][3] = {
        { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8, PixelFormat_U8Y8V8Y8 },
        { PixelFormat_Y8U8Y8V8, PixelFormat_R8G8B8, PixelFormat_Y8U8Y8V8 },
        { PixelFormat_Luminance8, PixelFormat_Luminance8, PixelFormat_Luminance8 },
        { PixelFormat_R8G8B8, PixelFormat_R8G8B8, PixelFormat_R8G8B8 },
        { PixelFormat_B8G8R8, PixelFormat_B8G8R8, PixelFormat_B8G8R8 },
        { PixelFormat_R8G8B8u8, PixelFormat_R8G8B8u8, PixelFormat_R8G8B8u8 },
        { PixelFormat_B8G8R8u8, PixelFormat_B8G8R8u8, PixelFormat_B8G8R8u8 },
        { PixelFormat_Luminance7, PixelFormat_R8G8B8, PixelFormat_R8G8B8 }, // no output of its own
    };
    for( const auto& [pPlanes, Width, Height] : Sources )
    {
      const std::string Path = MakeJPEG( pPlanes, Width, Height );
      const VBytes JPEG = ReadFileBytes( Path );
      ASSERT_FALSE( JPEG.empty() ) << Path;
      const VBytes Planes = FfmpegDecode( Path, pPlanes );
      const bool b420 = std::string( pPlanes ) == "yuvj420p", bPacked422 = !b420 && Width % 2 == 0;
      for( const auto& rWish : Wishes )
      {
        SCOPED_TRACE( Path + " to format " + std::to_string( rWish[0] ) );
        IVideoFrameInfo Info;
        std::shared_ptr< IBuffer > pOutput;
        ASSERT_TRUE( Read( JPEG, rWish[0], pOutput, &Info ) );
        EXPECT_EQ( std::tie( Info.PixelFormat, Info.ImageWidth, Info.ImageHeight ),
                   std::tie( rWish[bPacked422 ? 2 : 1], Width, Height ) );
        ASSERT_TRUE( pOutput );
        const VBytes Want = Expected( Planes, Width, Height, b420, Info.PixelFormat );
        ASSERT_EQ( Want.size(), pOutput->GetSize() );
        ASSERT_EQ( pOutput->GetSize(), GetVideoFrameSizeInBytes64( Info ) );
        EXPECT_TRUE( Near( Want, *pOutput, 10, 1.5 ) );
      }
    }
  }

  // Every cut of a real file, for both decode paths: no frame, one of the reader's own lines,
  // and nothing left allocated for the caller. Noise has no header at all.
  TEST( JPEGMalformed, EveryCutAndNoiseAreRefusedWithTheReadersLine )
  {
    const VBytes Whole = Seed( "jpeg/yuv422_16x16.jpg" );
    ASSERT_GT( Whole.size(), 100u );
    for( EPixelFormat Wish : { PixelFormat_U8Y8V8Y8, PixelFormat_R8G8B8 } )
      for( std::size_t Cut = 0; Cut + 2 < Whole.size(); ++Cut )
      {
        VLogCapture Log( "JPEGIO" );
        std::shared_ptr< IBuffer > pOutput;
        EXPECT_FALSE( Read( Damaged( Whole, Cut, 0 ), Wish, pOutput ) ) << "cut at " << Cut;
        EXPECT_FALSE( pOutput ) << "cut at " << Cut;
        EXPECT_TRUE( Log.Lines() == std::vector< std::string >{ "2 Couldn't decode JPEG header." } ||
                     Log.Lines() == std::vector< std::string >{ "2 Failed to decompress." } ||
                     Log.Lines() == std::vector< std::string >{ "2 Failed to decompress to YUV." } )
            << ::testing::PrintToString( Log.Lines() );
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
      VBytes Bytes = Seed( "jpeg/yuv422_16x16.jpg" );
      const auto SOF0 = std::search( Bytes.begin(), Bytes.end(), SOF0Marker.begin(), SOF0Marker.end() );
      ASSERT_LT( SOF0 + 9, Bytes.end() );
      for( int i = 0; i < 4; ++i ) // height, then width, big-endian
        SOF0[5 + i] = static_cast< std::uint8_t >( ( i < 2 ? Height : Width ) >> ( i % 2 ? 0 : 8 ) );
      VLogCapture Log( "JPEGIO" );
      std::shared_ptr< IBuffer > pOutput;
      const VAllocationWatch Watch;
      EXPECT_FALSE( Read( Bytes, Wish, pOutput ) );
      EXPECT_LT( Watch.Largest(), 1u << 20 );
      EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 JPEG image of " + std::to_string( Width ) + " x " +
                                                          std::to_string( Height ) + " is too large to decode." } );
    }
  }

  // A caller whose allocator gives nothing, for the frame or for the planes of the packed path.
  TEST( JPEGMalformed, AllocatorsThatGiveNothingAreRefusedWithTheirLine )
  {
    const VBytes JPEG = Seed( "jpeg/yuv422_16x16.jpg" );
    for( const bool bFrame : { true, false } )
    {
      VLogCapture Log( "JPEGIO" );
      IVideoFrameInfo Info = FrameInfo( 0, 0, PixelFormat_U8Y8V8Y8 );
      std::shared_ptr< IBuffer > pOutput;
      EXPECT_FALSE( JPEGIO::ReadJPEG( JPEG.data(), JPEG.size(), bFrame ? nullptr : MakeFrameAllocator(), nullptr, Info,
                                      pOutput ) );
      EXPECT_FALSE( pOutput );
      EXPECT_EQ( Log.Messages, std::vector< std::string >{ bFrame ? "Output buffer allocation failed."
                                                                  : "Temporary buffer allocation failed." } );
    }
  }

  constexpr int Width = 21;
  constexpr int Height = 13;

  // The reader tests need the library; the suite passes without it, with these skipped.
  bool WithoutLibraryRequested()
  {
    return std::getenv( ImageMagickWrapper::LibraryNameVariable ) != nullptr;
  }

  bool HaveLibrary()
  {
    return !WithoutLibraryRequested() && ImageMagickWrapper::SharedWrapper().IsAvailable();
  }

  // Through the one call the readers use, with the frame the container would declare.
  bool DecodeFrame( EVideoPayload i_Payload, const VBytes& i_rBytes, IVideoFrameInfo& io_rInfo,
                    std::shared_ptr< IBuffer >& o_rFrame )
  {
    MakeFrameAllocator()->Allocate( o_rFrame, i_rBytes.size() );
    std::copy( i_rBytes.begin(), i_rBytes.end(), o_rFrame->GetData() );
    return VideoEncoding::VideoFrameDecoder( i_Payload, io_rInfo, o_rFrame, MakeFrameAllocator(), MakeFrameAllocator(),
                                             nullptr );
  }

  // A little-endian TIFF of a grey ramp by hand: 8-bit samples, one uncompressed strip at the end.
  VBytes GreyTIFF()
  {
    VBytes Pixels( Width * Height );
    for( std::size_t i = 0; i < Pixels.size(); ++i )
      Pixels[i] = static_cast< std::uint8_t >( i * 7 );
    VBytes Bytes( 2, 'I' );
    auto Put = [&]( std::uint32_t i_Value, int i_Size )
    {
      for( int i = 0; i < i_Size; ++i )
        Bytes.push_back( static_cast< std::uint8_t >( i_Value >> 8 * i ) );
    };
    Put( 42, 2 );
    Put( 8, 4 );
    const std::uint32_t Tags[][2] = { { 256, Width },  { 257, Height },
                                      { 258, 8 },      { 259, 1 },
                                      { 262, 1 },      { 273, 8 + 2 + 8 * 12 + 4 },
                                      { 278, Height }, { 279, std::uint32_t( Pixels.size() ) } };
    Put( 8, 2 );
    for( const auto& rTag : Tags )
    {
      Put( rTag[0], 2 );
      Put( 4, 2 ); // LONG
      Put( 1, 4 );
      Put( rTag[1], 4 );
    }
    Put( 0, 4 );
    Bytes.insert( Bytes.end(), Pixels.begin(), Pixels.end() );
    return Bytes;
  }

  TEST( StillImage, DecodesFfmpegsFilesExactlyOrRefusesThem )
  {
    if( !HaveLibrary() || !HaveFfmpeg() )
      GTEST_SKIP() << "needs MagickWand and ffmpeg";
    // Both payloads go through the one wrapper, whose ways with each sample layout the PNG rows
    // walk; the TIFF row shows that the payload reaches it.
    const std::tuple< const char*, EVideoPayload, const char*, EPixelFormat > Cases[] = {
        { "png", VideoPayload_ImagePNG, "rgb24", PixelFormat_R8G8B8 },
        { "png", VideoPayload_ImagePNG, "gray", PixelFormat_Luminance8 },
        { "png", VideoPayload_ImagePNG, "pal8", PixelFormat_R8G8B8 },
        { "png", VideoPayload_ImagePNG, "rgba", PixelFormat_Unspecified }, // refused
        { "tiff", VideoPayload_ImageTIFF, "rgb24", PixelFormat_R8G8B8 },
    };
    for( const auto& [pExtension, Payload, pStored, Delivered] : Cases )
    {
      SCOPED_TRACE( std::string( pStored ) + "." + pExtension );
      // Half-transparent, so that the alpha is really used.
      const std::string Filter = std::string( pStored ) == "rgba" ? "format=rgba,colorchannelmixer=aa=0.5" : "null";
      const std::string Path = FfmpegFixture(
          std::string( "still_" ) + pStored + "." + pExtension,
          { "-f", "lavfi", "-i", "testsrc=s=21x13", "-vf", Filter, "-frames:v", "1", "-pix_fmt", pStored } );
      ASSERT_FALSE( Path.empty() );
      VLogCapture Log( Payload == VideoPayload_ImagePNG ? "PNGIO" : "TIFFIO" );
      // The container declares the frame as its colour format; a grey image delivers less.
      IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_R8G8B8 );
      std::shared_ptr< IBuffer > pFrame;
      const bool bDecoded = DecodeFrame( Payload, ReadFileBytes( Path ), Info, pFrame );
      if( Delivered == PixelFormat_Unspecified )
      {
        EXPECT_FALSE( bDecoded );
        EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Unsupported format" } );
        continue;
      }
      ASSERT_TRUE( bDecoded );
      EXPECT_TRUE( Log.Lines().empty() );
      EXPECT_EQ( std::tie( Info.PixelFormat, Info.ImageWidth, Info.ImageHeight ),
                 std::tie( Delivered, Width, Height ) );
      const VBytes Want = FfmpegDecode( Path, Delivered == PixelFormat_Luminance8 ? "gray" : "rgb24" );
      ASSERT_GE( pFrame->GetSize(), Want.size() );
      EXPECT_EQ( 0, std::memcmp( pFrame->GetData(), Want.data(), Want.size() ) );
    }
  }

  // The frame the container declares and the image disagree: nothing is written past the
  // caller's buffer, and the frame is refused.
  TEST( StillImage, HandMadeTIFFDecodesExactlyAndEveryCutOrDisagreementIsRefused )
  {
    if( !HaveLibrary() )
      GTEST_SKIP() << "needs MagickWand";
    const VBytes TIFF = GreyTIFF();
    IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
    std::shared_ptr< IBuffer > pFrame;
    ASSERT_TRUE( DecodeFrame( VideoPayload_ImageTIFF, TIFF, Info, pFrame ) );
    EXPECT_EQ( Info.PixelFormat, PixelFormat_Luminance8 );
    EXPECT_EQ( Bytes( pFrame ), VBytes( TIFF.end() - Width * Height, TIFF.end() ) );

    VBytes Target( Width * Height );
    const VLogCapture Quiet( "TIFFIO" );
    for( std::size_t Cut = 0; Cut < TIFF.size(); Cut += 7 )
    {
      Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
      EXPECT_FALSE( TIFFIO::ReadTIFF( TIFF.data(), Cut, Info, Target.data(), Target.size() ) ) << "cut at " << Cut;
    }
    // Nor is a TIFF a PNG.
    VLogCapture Log( "PNGIO" );
    EXPECT_FALSE( PNGIO::ReadPNG( TIFF.data(), TIFF.size(), Info, Target.data(), Target.size() ) );
    EXPECT_TRUE( Log.Contains( "ImageMagick exception: " ) );

    VLogCapture TIFFLog( "TIFFIO" );
    Info = FrameInfo( Width - 1, Height, PixelFormat_Luminance8 );
    EXPECT_FALSE( DecodeFrame( VideoPayload_ImageTIFF, TIFF, Info, pFrame ) );
    EXPECT_TRUE( TIFFLog.Has( "Image of 21 x 13 does not match the frame of 20 x 13." ) );
    // Undeclared size, a buffer one byte short, guarded beyond its end.
    Info = FrameInfo( 0, 0, PixelFormat_Luminance8 );
    Target.assign( Width * Height + 16, 0xEE );
    EXPECT_FALSE( TIFFIO::ReadTIFF( TIFF.data(), TIFF.size(), Info, Target.data(), Width * Height - 1 ) );
    EXPECT_TRUE( TIFFLog.Contains( "does not fit a frame buffer of 272 bytes." ) );
    EXPECT_EQ( Target[Width * Height - 1], 0xEE );
  }

  // Run by CTest in a process of its own that names a library that does not exist.
  TEST( WithoutMagickWand, PNGAndTIFFAreMissingFramesAndJPEGStillDecodes )
  {
    if( !WithoutLibraryRequested() )
      GTEST_SKIP() << "runs with " << ImageMagickWrapper::LibraryNameVariable << " set";
    // A library that cannot be loaded is logged once, and every read answers false.
    VLogCapture Log( "ImageMagickWrapper" );
    const VBytes PNG = { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A, 0, 0, 0, 13 };
    for( int i = 0; i < 2; ++i )
    {
      IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
      std::shared_ptr< IBuffer > pFrame;
      EXPECT_FALSE( DecodeFrame( VideoPayload_ImageTIFF, GreyTIFF(), Info, pFrame ) );
      EXPECT_FALSE( DecodeFrame( VideoPayload_ImagePNG, PNG, Info, pFrame ) );
    }
    ASSERT_EQ( Log.Lines().size(), 2u ); // the failure and its detail, once
    EXPECT_EQ( Log.Lines()[0].rfind( "2 Could not load MagickWand DLL", 0 ), 0u ) << Log.Lines()[0];
    IVideoFrameInfo Info = FrameInfo( 16, 16, PixelFormat_U8Y8V8Y8 );
    std::shared_ptr< IBuffer > pFrame;
    EXPECT_TRUE( DecodeFrame( VideoPayload_ImageJPEG, Seed( "jpeg/yuv422_16x16.jpg" ), Info, pFrame ) );
  }
} // namespace
