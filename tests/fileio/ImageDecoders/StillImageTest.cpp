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

  std::shared_ptr< IBuffer > Payload( const std::vector< std::uint8_t >& i_rBytes )
  {
    std::shared_ptr< IBuffer > pBuffer;
    MakeFrameAllocator()->Allocate( pBuffer, i_rBytes.size() );
    if( !i_rBytes.empty() )
      std::memcpy( pBuffer->GetData(), i_rBytes.data(), i_rBytes.size() );
    return pBuffer;
  }

  // Through the one call the readers use, with the frame the container would declare.
  bool DecodeFrame( EVideoPayload i_Payload, const std::vector< std::uint8_t >& i_rBytes, IVideoFrameInfo& io_rInfo,
                    std::shared_ptr< IBuffer >& o_rFrame )
  {
    o_rFrame = Payload( i_rBytes );
    return VideoEncoding::VideoFrameDecoder( i_Payload, io_rInfo, o_rFrame, MakeFrameAllocator(), MakeFrameAllocator(),
                                             nullptr );
  }

  struct VStillCase
  {
    const char* Name;
    const char* Extension;
    EVideoPayload Payload;
    const char* StoredFormat; // ffmpeg's pixel format of the file
    EPixelFormat Delivered;   // Unspecified: refused
  };

  std::ostream& operator<<( std::ostream& o, const VStillCase& i_rCase )
  {
    return o << i_rCase.Name;
  }

  const VStillCase s_StillCases[] = {
      { "PNG_RGB", "png", VideoPayload_ImagePNG, "rgb24", PixelFormat_R8G8B8 },
      { "PNG_Grey", "png", VideoPayload_ImagePNG, "gray", PixelFormat_Luminance8 },
      { "PNG_Palette", "png", VideoPayload_ImagePNG, "pal8", PixelFormat_R8G8B8 },
      { "PNG_Alpha", "png", VideoPayload_ImagePNG, "rgba", PixelFormat_Unspecified },
      { "TIFF_RGB", "tiff", VideoPayload_ImageTIFF, "rgb24", PixelFormat_R8G8B8 },
      { "TIFF_Grey", "tiff", VideoPayload_ImageTIFF, "gray", PixelFormat_Luminance8 },
      { "TIFF_Palette", "tiff", VideoPayload_ImageTIFF, "pal8", PixelFormat_R8G8B8 },
      { "TIFF_Alpha", "tiff", VideoPayload_ImageTIFF, "rgba", PixelFormat_Unspecified },
  };

  std::string MakeStill( const VStillCase& i_rCase )
  {
    // Half-transparent, so that the alpha is really used.
    const std::string Filter =
        std::string( i_rCase.StoredFormat ) == "rgba" ? "format=rgba,colorchannelmixer=aa=0.5" : "null";
    return FfmpegFixture( std::string( "still_" ) + i_rCase.Name + "." + i_rCase.Extension,
                          { "-f", "lavfi", "-i",
                            "testsrc=s=" + std::to_string( Width ) + "x" + std::to_string( Height ), "-vf", Filter,
                            "-frames:v", "1", "-pix_fmt", i_rCase.StoredFormat } );
  }

  class StillImage : public ::testing::TestWithParam< VStillCase >
  {
  protected:
    void SetUp() override
    {
      if( !HaveFfmpeg() || !HaveLibrary() )
        GTEST_SKIP() << "needs ffmpeg and MagickWand";
    }
  };

  TEST_P( StillImage, DecodesExactlyOrIsRefused )
  {
    const VStillCase& rCase = GetParam();
    const std::string Path = MakeStill( rCase );
    ASSERT_FALSE( Path.empty() );
    const std::vector< std::uint8_t > Bytes = ReadWholeFile( Path );
    const char* pCategory = rCase.Payload == VideoPayload_ImagePNG ? "PNGIO" : "TIFFIO";
    VCategoryLog Log( pCategory );
    // The container declares the frame as its colour format; a grey image delivers less.
    IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_R8G8B8 );
    std::shared_ptr< IBuffer > pFrame;
    const bool bDecoded = DecodeFrame( rCase.Payload, Bytes, Info, pFrame );
    if( rCase.Delivered == PixelFormat_Unspecified )
    {
      EXPECT_FALSE( bDecoded );
      EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Unsupported format" } );
      return;
    }
    ASSERT_TRUE( bDecoded );
    EXPECT_TRUE( Log.Lines().empty() );
    EXPECT_EQ( Info.PixelFormat, rCase.Delivered );
    EXPECT_EQ( Info.ImageWidth, Width );
    EXPECT_EQ( Info.ImageHeight, Height );
    const std::vector< std::uint8_t > Want =
        FfmpegDecode( Path, rCase.Delivered == PixelFormat_Luminance8 ? "gray" : "rgb24" );
    ASSERT_TRUE( pFrame );
    ASSERT_GE( pFrame->GetSize(), Want.size() );
    EXPECT_EQ( 0, std::memcmp( pFrame->GetData(), Want.data(), Want.size() ) );
  }

  INSTANTIATE_TEST_SUITE_P( Files, StillImage, ::testing::ValuesIn( s_StillCases ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

  // A grey TIFF by hand, in either byte order: 8-bit samples, one uncompressed strip.
  std::vector< std::uint8_t > GreyTIFF( bool i_bBigEndian, const std::vector< std::uint8_t >& i_rPixels, int i_Width,
                                        int i_Height )
  {
    std::vector< std::uint8_t > Bytes;
    auto Put = [&]( std::uint32_t i_Value, int i_Size )
    {
      for( int i = 0; i < i_Size; ++i )
      {
        const int Shift = 8 * ( i_bBigEndian ? i_Size - 1 - i : i );
        Bytes.push_back( static_cast< std::uint8_t >( i_Value >> Shift ) );
      }
    };
    Bytes.push_back( i_bBigEndian ? 'M' : 'I' );
    Bytes.push_back( i_bBigEndian ? 'M' : 'I' );
    Put( 42, 2 );
    Put( 8, 4 );
    const std::uint32_t Entries = 8;
    const std::uint32_t PixelsAt = 8 + 2 + Entries * 12 + 4;
    const std::uint32_t Tags[Entries][2] = {
        { 256, std::uint32_t( i_Width ) },
        { 257, std::uint32_t( i_Height ) },
        { 258, 8 },
        { 259, 1 },
        { 262, 1 },
        { 273, PixelsAt },
        { 278, std::uint32_t( i_Height ) },
        { 279, std::uint32_t( i_rPixels.size() ) },
    };
    Put( Entries, 2 );
    for( const auto& rTag : Tags )
    {
      Put( rTag[0], 2 );
      Put( 4, 2 ); // LONG
      Put( 1, 4 );
      Put( rTag[1], 4 );
    }
    Put( 0, 4 );
    Bytes.insert( Bytes.end(), i_rPixels.begin(), i_rPixels.end() );
    return Bytes;
  }

  std::vector< std::uint8_t > Ramp( int i_Count )
  {
    std::vector< std::uint8_t > Pixels( i_Count );
    for( int i = 0; i < i_Count; ++i )
      Pixels[i] = static_cast< std::uint8_t >( i * 7 );
    return Pixels;
  }

  TEST( HandMadeTIFF, LittleEndianDecodesExactly )
  {
    if( !HaveLibrary() )
      GTEST_SKIP() << "needs MagickWand";
    const std::vector< std::uint8_t > Pixels = Ramp( Width * Height );
    IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
    std::shared_ptr< IBuffer > pFrame;
    ASSERT_TRUE( DecodeFrame( VideoPayload_ImageTIFF, GreyTIFF( false, Pixels, Width, Height ), Info, pFrame ) );
    EXPECT_EQ( Info.PixelFormat, PixelFormat_Luminance8 );
    EXPECT_EQ( std::vector< std::uint8_t >( pFrame->GetData(), pFrame->GetData() + pFrame->GetSize() ), Pixels );
  }

  TEST( HandMadeTIFF, BigEndianIsRefusedBeforeDecoding )
  {
    VCategoryLog Log( "VideoEncoding" );
    IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
    std::shared_ptr< IBuffer > pFrame;
    EXPECT_FALSE(
        DecodeFrame( VideoPayload_ImageTIFF, GreyTIFF( true, Ramp( Width * Height ), Width, Height ), Info, pFrame ) );
    EXPECT_EQ( Log.Lines(),
               std::vector< std::string >{ "2 TIFF frame does not start with the little-endian TIFF mark." } );
  }

  // The frame the container declares and the image disagree: nothing is written past the
  // caller's buffer, and the frame is refused.
  TEST( StillImageSize, ADisagreeingImageIsRefused )
  {
    if( !HaveLibrary() )
      GTEST_SKIP() << "needs MagickWand";
    const std::vector< std::uint8_t > Pixels = Ramp( Width * Height );
    const std::vector< std::uint8_t > TIFF = GreyTIFF( false, Pixels, Width, Height );
    {
      VCategoryLog Log( "TIFFIO" );
      IVideoFrameInfo Info = FrameInfo( Width - 1, Height, PixelFormat_Luminance8 );
      std::shared_ptr< IBuffer > pFrame;
      EXPECT_FALSE( DecodeFrame( VideoPayload_ImageTIFF, TIFF, Info, pFrame ) );
      EXPECT_TRUE( Log.Contains( "2 Image of 21 x 13 does not match the frame of 20 x 13." ) );
    }
    {
      // Undeclared size, a buffer one byte short, guarded beyond its end.
      VCategoryLog Log( "TIFFIO" );
      IVideoFrameInfo Info = FrameInfo( 0, 0, PixelFormat_Luminance8 );
      std::vector< std::uint8_t > Target( Pixels.size() + 16, 0xEE );
      EXPECT_FALSE( TIFFIO::ReadTIFF( TIFF.data(), TIFF.size(), Info, Target.data(), Pixels.size() - 1 ) );
      EXPECT_TRUE( Log.Contains( "does not fit a frame buffer of 272 bytes." ) );
      EXPECT_EQ( Target[Pixels.size() - 1], 0xEE );
    }
  }

  TEST( StillImageCoder, ATIFFIsNoPNG )
  {
    if( !HaveLibrary() )
      GTEST_SKIP() << "needs MagickWand";
    const std::vector< std::uint8_t > TIFF = GreyTIFF( false, Ramp( Width * Height ), Width, Height );
    VCategoryLog Log( "PNGIO" );
    IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
    std::vector< std::uint8_t > Target( Width * Height );
    EXPECT_FALSE( PNGIO::ReadPNG( TIFF.data(), TIFF.size(), Info, Target.data(), Target.size() ) );
    EXPECT_TRUE( Log.Contains( "2 ImageMagick exception: " ) );
  }

  TEST( StillImageMalformed, EveryCutIsRefused )
  {
    if( !HaveLibrary() )
      GTEST_SKIP() << "needs MagickWand";
    const std::vector< std::uint8_t > Whole = GreyTIFF( false, Ramp( Width * Height ), Width, Height );
    std::vector< std::uint8_t > Target( Width * Height );
    for( std::size_t Cut = 0; Cut < Whole.size(); Cut += 7 )
    {
      IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
      EXPECT_FALSE( TIFFIO::ReadTIFF( Whole.data(), Cut, Info, Target.data(), Target.size() ) ) << "cut at " << Cut;
    }
  }

  TEST( ImageMagickWrapper, AMissingLibraryIsLoggedAndEveryReadAnswersFalse )
  {
    VCategoryLog Log( "ImageMagickWrapper" );
    const ImageMagickWrapper::VImageMagickWrapper Missing( "libMagickWand-absent.so.6" );
    EXPECT_FALSE( Missing.IsAvailable() );
    EXPECT_TRUE( Log.Contains( "2 Could not load MagickWand DLL" ) );
    const std::vector< std::uint8_t > TIFF = GreyTIFF( false, Ramp( Width * Height ), Width, Height );
    IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
    std::vector< std::uint8_t > Target( Width * Height );
    EXPECT_FALSE( ImageMagickWrapper::ReadImage( Missing, ImageMagickWrapper::ImageTIFF, TIFF.data(), TIFF.size(), Info,
                                                 Target.data(), Target.size() ) );
  }

  // Run by CTest in a process of its own that names a library that does not exist.
  TEST( WithoutMagickWand, PNGAndTIFFAreMissingFramesAndJPEGStillDecodes )
  {
    if( !WithoutLibraryRequested() )
      GTEST_SKIP() << "runs with " << ImageMagickWrapper::LibraryNameVariable << " set";
    VCategoryLog Log( "ImageMagickWrapper" );
    const std::vector< std::uint8_t > TIFF = GreyTIFF( false, Ramp( Width * Height ), Width, Height );
    for( int i = 0; i < 2; ++i )
    {
      IVideoFrameInfo Info = FrameInfo( Width, Height, PixelFormat_Luminance8 );
      std::shared_ptr< IBuffer > pFrame;
      EXPECT_FALSE( DecodeFrame( VideoPayload_ImageTIFF, TIFF, Info, pFrame ) );
      const std::vector< std::uint8_t > PNG = { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A, 0, 0, 0, 13 };
      EXPECT_FALSE( DecodeFrame( VideoPayload_ImagePNG, PNG, Info, pFrame ) );
    }
    EXPECT_EQ( Log.Lines().size(), 2u ); // the failure and its detail, once
    IVideoFrameInfo Info = FrameInfo( 16, 16, PixelFormat_U8Y8V8Y8 );
    std::shared_ptr< IBuffer > pFrame;
    EXPECT_TRUE(
        DecodeFrame( VideoPayload_ImageJPEG, ReadWholeFile( SeedPath( "jpeg/yuv422_16x16.jpg" ) ), Info, pFrame ) );
  }
} // namespace
