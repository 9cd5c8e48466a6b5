// PNG and TIFF frames through the one call the readers use, against ffmpeg's decode of files
// it made and a TIFF assembled by hand; the refusals, and the run without MagickWand.

#include "fileio/ImageMagickWrapper/ImageReader.h"
#include "fileio/PNGIO/PNGReader.h"
#include "fileio/TIFFIO/TIFFReader.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"

#include "tests/fileio/ImageDecoders/ImageTestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>

namespace
{
  using namespace ZOL;
  using namespace LumekTest;

  constexpr int Width = 21;
  constexpr int Height = 13;

  bool WithoutLibraryRequested()
  {
    return std::getenv( ImageMagickWrapper::LibraryNameVariable ) != nullptr;
  }

  // The reader tests need the library; the suite passes without it, with these skipped.
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

  // A grey ramp, and a little-endian TIFF of it by hand: 8-bit samples, one uncompressed strip.
  VBytes Ramp()
  {
    VBytes Pixels( Width * Height );
    for( std::size_t i = 0; i < Pixels.size(); ++i )
      Pixels[i] = static_cast< std::uint8_t >( i * 7 );
    return Pixels;
  }

  VBytes GreyTIFF()
  {
    const VBytes Pixels = Ramp();
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

  class StillImage : public ::testing::Test
  {
  protected:
    void SetUp() override
    {
      if( !HaveLibrary() )
        GTEST_SKIP() << "needs MagickWand";
    }
  };

  TEST_F( StillImage, DecodesFfmpegsFilesExactlyOrRefusesThem )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "needs ffmpeg";
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
      const bool bDecoded = DecodeFrame( Payload, ReadWholeFile( Path ), Info, pFrame );
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
  TEST_F( StillImage, HandMadeTIFFDecodesExactlyAndEveryCutOrDisagreementIsRefused )
  {
    const VBytes TIFF = GreyTIFF();
    IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
    std::shared_ptr< IBuffer > pFrame;
    ASSERT_TRUE( DecodeFrame( VideoPayload_ImageTIFF, TIFF, Info, pFrame ) );
    EXPECT_EQ( Info.PixelFormat, PixelFormat_Luminance8 );
    EXPECT_EQ( Bytes( pFrame ), Ramp() );

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
