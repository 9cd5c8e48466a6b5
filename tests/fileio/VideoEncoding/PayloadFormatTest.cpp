// The pixel format announced for each payload and stored format, as a golden table, and the
// frame sizes the decoders allocate.

#include "fileio/VideoEncoding/VideoFrameDecoder.h"

#include "services/Log.h"

#include <gtest/gtest.h>

#include <sstream>

namespace
{
  using namespace ZOL;

  // One line per payload; the columns are the stored formats 0 to 19, then 20 (no such format).
  std::string Table( bool i_bForceColour )
  {
    std::ostringstream Text;
    for( int Payload = 0; Payload <= 5; ++Payload )
    {
      Text << ToString( static_cast< EVideoPayload >( Payload ) ) << ":";
      for( int F = 0; F <= 20; ++F )
      {
        EPixelFormat Output = static_cast< EPixelFormat >( 99 );
        EXPECT_TRUE( VideoEncoding::PixelFormatForPayloadFormat(
            static_cast< EVideoPayload >( Payload ), static_cast< EPixelFormat >( F ), Output, i_bForceColour ) );
        Text << " " << static_cast< int >( Output );
      }
      Text << "\n";
    }
    return Text.str();
  }

  TEST( PixelFormatForPayloadFormat, GoldenTable )
  {
    EXPECT_EQ( Table( false ), "None: 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0\n"
                               "Uncompressed: 0 1 2 3 4 5 6 7 8 9 10 11 12 13 14 15 16 17 18 19 20\n"
                               "ImageJPEG: 9 1 18 18 18 18 9 7 8 9 10 11 12 9 18 18 1 9 9 9 9\n"
                               "ImagePNG: 7 1 7 7 7 7 7 7 7 7 7 7 7 7 7 7 1 1 7 7 7\n"
                               "ImageTIFF: 7 1 7 7 7 7 7 7 7 7 7 7 7 7 7 7 1 1 7 7 7\n"
                               "VideoH264: 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11\n" );
  }

  TEST( PixelFormatForPayloadFormat, ForcedColourOnlyChangesJPEG )
  {
    EXPECT_EQ( Table( true ), "None: 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0\n"
                              "Uncompressed: 0 1 2 3 4 5 6 7 8 9 10 11 12 13 14 15 16 17 18 19 20\n"
                              "ImageJPEG: 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9\n"
                              "ImagePNG: 7 1 7 7 7 7 7 7 7 7 7 7 7 7 7 7 1 1 7 7 7\n"
                              "ImageTIFF: 7 1 7 7 7 7 7 7 7 7 7 7 7 7 7 7 1 1 7 7 7\n"
                              "VideoH264: 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11\n" );
  }

  TEST( PixelFormatForPayloadFormat, UnknownPayloadLogsAndLeavesTheOutput )
  {
    std::vector< std::string > Lines;
    const int Handle = GlobalLog().AddSink(
        [&]( const ILogRecord& i_rRecord )
        {
          if( i_rRecord.Category == "VideoEncoding" )
            Lines.push_back( std::to_string( i_rRecord.Level ) + " " + i_rRecord.Message );
        },
        LogDetail );
    EPixelFormat Output = PixelFormat_B8G8R8;
    EXPECT_FALSE( VideoEncoding::PixelFormatForPayloadFormat( static_cast< EVideoPayload >( 6 ), PixelFormat_Luminance8,
                                                              Output, false ) );
    GlobalLog().RemoveSink( Handle );
    EXPECT_EQ( Output, PixelFormat_B8G8R8 );
    EXPECT_EQ( Lines, std::vector< std::string >{ "2 Unsupported video payload format 'Unspecified'." } );
  }

  struct VSize
  {
    std::int32_t Width, Height;
    EPixelFormat Format;
    std::uint32_t Bytes;
  };

  std::ostream& operator<<( std::ostream& o, const VSize& i_rSize )
  {
    return o << i_rSize.Width << "x" << i_rSize.Height << " " << ToString( i_rSize.Format );
  }

  class FrameBufferSizes : public ::testing::TestWithParam< VSize >
  {
  };

  TEST_P( FrameBufferSizes, FollowTheFormatsByteRule )
  {
    IVideoFrameInfo Info;
    Info.ImageWidth = GetParam().Width;
    Info.ImageHeight = GetParam().Height;
    Info.PixelFormat = GetParam().Format;
    EXPECT_EQ( VideoEncoding::FrameBufferSize( Info ), GetParam().Bytes );
  }

  INSTANTIATE_TEST_SUITE_P(
      Formats, FrameBufferSizes,
      ::testing::Values( VSize{ 1920, 1080, PixelFormat_U10Y10V10Y10, 40u * 1080 * 128 },
                         VSize{ 1921, 1080, PixelFormat_U10Y10V10Y10, 41u * 1080 * 128 },
                         VSize{ 3, 3, PixelFormat_BayerGB7, 8 },   // 63 bits
                         VSize{ 3, 3, PixelFormat_Luminance6, 7 }, // 54 bits
                         VSize{ 5, 1, PixelFormat_R5G6B5, 10 }, VSize{ 5, 1, PixelFormat_PlanarY8U8V8, 10 },
                         VSize{ 5, 1, PixelFormat_PlanarR8G8B8, 15 }, VSize{ 5, 1, PixelFormat_B8G8R8u8, 20 },
                         VSize{ 5, 1, PixelFormat_BayerBG8, 5 }, VSize{ 5, 1, PixelFormat_Unspecified, 0 },
                         // 2^34 bytes, truncated to 32 bits as the decoders take it
                         VSize{ 65536, 65536, PixelFormat_R8G8B8u8, 0 },
                         VSize{ 65536, 65537, PixelFormat_R8G8B8u8, 262144 } ) );
} // namespace
