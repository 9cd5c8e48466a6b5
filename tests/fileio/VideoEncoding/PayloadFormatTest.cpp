// The pixel format announced for each payload and stored format, as a golden table.

#include "fileio/VideoEncoding/VideoFrameDecoder.h"

#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <sstream>

namespace
{
  using namespace ZOL;

  TEST( PixelFormatForPayloadFormat, GoldenTable )
  {
    // One line per payload; the columns are the stored formats 0 to 19, then 20 (no such format).
    // Forcing colour changes JPEG alone.
    std::ostringstream Text;
    for( const bool bForceColour : { false, true } )
    {
      Text << ( bForceColour ? "colour forced\n" : "colour as stored\n" );
      for( int Payload = 0; Payload <= 5; ++Payload )
      {
        Text << ToString( static_cast< EVideoPayload >( Payload ) ) << ":";
        for( int F = 0; F <= 20; ++F )
        {
          EPixelFormat Output = static_cast< EPixelFormat >( 99 );
          EXPECT_TRUE( VideoEncoding::PixelFormatForPayloadFormat(
              static_cast< EVideoPayload >( Payload ), static_cast< EPixelFormat >( F ), Output, bForceColour ) );
          Text << " " << static_cast< int >( Output );
        }
        Text << "\n";
      }
    }
    std::ifstream Golden( VIDEOENCODING_GOLDEN_FOLDER "/payload-pixel-formats.txt" );
    EXPECT_EQ( Text.str(), std::string( std::istreambuf_iterator< char >( Golden ), {} ) );

    // An unknown payload is logged and leaves the output as it was.
    LumekTest::VLogCapture Log( "VideoEncoding" );
    EPixelFormat Output = PixelFormat_B8G8R8;
    EXPECT_FALSE( VideoEncoding::PixelFormatForPayloadFormat( static_cast< EVideoPayload >( 6 ), PixelFormat_Luminance8,
                                                              Output, false ) );
    EXPECT_EQ( Output, PixelFormat_B8G8R8 );
    EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Unsupported video payload format 'Unspecified'." } );
  }
} // namespace
