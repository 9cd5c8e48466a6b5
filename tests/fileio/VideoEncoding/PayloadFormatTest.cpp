// The pixel format announced for each payload and stored format, as a golden table.

#include "fileio/VideoEncoding/VideoFrameDecoder.h"

#include "tests/support/LogCapture.h"

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
    const std::string Others = "ImagePNG: 7 1 7 7 7 7 7 7 7 7 7 7 7 7 7 7 1 1 7 7 7\n"
                               "ImageTIFF: 7 1 7 7 7 7 7 7 7 7 7 7 7 7 7 7 1 1 7 7 7\n"
                               "VideoH264: 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11 11\n";
    const std::string Stored = "None: 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0 0\n"
                               "Uncompressed: 0 1 2 3 4 5 6 7 8 9 10 11 12 13 14 15 16 17 18 19 20\n";
    EXPECT_EQ( Table( false ), Stored + "ImageJPEG: 9 1 18 18 18 18 9 7 8 9 10 11 12 9 18 18 1 9 9 9 9\n" + Others );
    // Forcing colour changes JPEG alone.
    EXPECT_EQ( Table( true ), Stored + "ImageJPEG: 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9 9\n" + Others );
  }

  TEST( PixelFormatForPayloadFormat, UnknownPayloadLogsAndLeavesTheOutput )
  {
    LumekTest::VLogCapture Log( "VideoEncoding" );
    EPixelFormat Output = PixelFormat_B8G8R8;
    EXPECT_FALSE( VideoEncoding::PixelFormatForPayloadFormat( static_cast< EVideoPayload >( 6 ), PixelFormat_Luminance8,
                                                              Output, false ) );
    EXPECT_EQ( Output, PixelFormat_B8G8R8 );
    EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Unsupported video payload format 'Unspecified'." } );
  }
} // namespace
