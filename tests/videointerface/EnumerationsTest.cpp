#include "videointerface/Enumerations.h"
#include "videointerface/IVideoFrameInfo.h"
#include "videointerface/IVideoReader.h"

#include "tests/videointerface/AttributeTestSupport.h"

#include <gtest/gtest.h>

using namespace ZOL;

// Every table looked up by name and by value (a name or value twice shows as a row finding another):
// names compare byte for byte (a lower-case name is refused where the frame and container names are
// read), and a value in no row gives the fallback.
TEST( Enumerations, EveryTableLooksUpBothWaysExactlyAndFallsBackOutsideItsRows )
{
  for( const IEnumTable* pTable :
       { &PixelFormatTable(), &VideoPayloadTable(), &AudioPayloadTable(), &AudioSampleFormatTable(),
         &InterlacedFormatTable(), &VideoContainerTable(), &RadialModelTable() } )
  {
    const IEnumTable& rTable = *pTable;
    SCOPED_TRACE( rTable.Name );
    for( std::size_t i = 0; i < rTable.RowCount; ++i )
    {
      const IEnumRow& rRow = rTable.Rows[i];
      const std::string Name = rRow.Name;
      EXPECT_EQ( rRow.Value, rTable.FromName( Name ) );
      EXPECT_STREQ( rRow.Name, rTable.ToName( rRow.Value, "fallback" ) );
      EXPECT_STREQ( rRow.Description, rTable.ToDescription( rRow.Value ) );
      EXPECT_FALSE( rTable.FromName( Name + " " ) ) << Name;
      EXPECT_FALSE( rTable.FromName( Name.substr( 0, Name.size() - 1 ) ) ) << Name;
      EXPECT_FALSE( rTable.FromName( std::string_view( Name.c_str(), Name.size() + 1 ) ) ) << Name; // with its zero
    }
    EXPECT_FALSE( rTable.FromName( "" ) );
    EXPECT_STREQ( "Unspecified", rTable.ToName( 1000, UnspecifiedText ) );
    EXPECT_FALSE( rTable.ToNameOptional( 0xFFFFFFFFu ) );
    EXPECT_STREQ( "", rTable.ToDescription( 20 ) );
  }
}

// Files store "Float32" and "UInt8"; the numbers in memory are 6 and 7, out of step with the rows.
// A table written in row order would swap the two formats without any other symptom.
TEST( Enumerations, SampleFormatsKeepTheirNumbersAndAContainerOutsideTheTableHasNoExtension )
{
  EXPECT_STREQ( "Float32", ToString( static_cast< EAudioSampleFormat >( 6 ) ) );
  EXPECT_STREQ( "UInt8", ToString( static_cast< EAudioSampleFormat >( 7 ) ) );
  EXPECT_STREQ( "UInt8", AudioSampleFormatTable().Rows[5].Name );
  EXPECT_STREQ( "", ContainerExtension( static_cast< EVideoContainer >( 6 ) ) );
}

TEST( Enumerations, ResultTexts )
{
  const std::pair< ResultCode, const char* > Cases[] = {
      { 0x0, "Ok: The function succeeded" },
      { 0x5, "Unknown result code" },
      { 0x8000002Au, "FileNotFound: The file does not exist or is unreadable" },
      { 0x80010003u, "RPCNotConnected: The connection to the remote function or callback is not open" },
      { 0x40003u, "IP address has changed" },
      { 0x80040007u, "Bundle already installed" },
      { 0x7FFFFFFFu, "Unknown result code" } };
  for( const auto& [Code, pText] : Cases )
    EXPECT_EQ( pText, GetResultText( Code ) ) << std::hex << Code;
}

TEST( Enumerations, BytesOfAnUncompressedFrame )
{
  const struct
  {
    EPixelFormat Format;
    std::int32_t Width, Height;
    std::uint64_t Bytes;
  } Cases[] = { { PixelFormat_U8Y8V8Y8, 1920, 1080, 4147200 },
                { PixelFormat_PlanarR8G8B8, 3, 5, 45 },
                { PixelFormat_B8G8R8u8, 7, 3, 84 },
                { PixelFormat_U10Y10V10Y10, 1920, 1080, 5529600 },
                { PixelFormat_U10Y10V10Y10, 1921, 1080, 41 * 1080 * 128 }, // a partial block counts whole
                { PixelFormat_BayerGB7, 3, 3, 8 },                         // rounds up
                { PixelFormat_Luminance6, 4, 2, 6 },
                { static_cast< EPixelFormat >( 20 ), 100, 100, 0 },
                { PixelFormat_Luminance8, -2, 100, 0 },
                { PixelFormat_R8G8B8u8, 65536, 65536, 1ull << 34 } }; // beyond 32 bits
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( std::string( ToString( rCase.Format ) ) + " " + std::to_string( rCase.Width ) );
    const IVideoFrameInfo Info = LumekTest::Frame( rCase.Width, rCase.Height, rCase.Format );
    EXPECT_EQ( rCase.Bytes, GetVideoFrameSizeInBytes64( Info ) );
    EXPECT_EQ( static_cast< std::uint32_t >( rCase.Bytes ), GetVideoFrameSizeInBytes( Info ) );
  }
}

TEST( Enumerations, TheFileNameAloneChoosesTheContainer )
{
  const std::pair< const char*, std::optional< EVideoContainer > > Cases[] = {
      { "/data/clip.mov", VideoContainer_MOV },
      { "a.b/clip.avi", VideoContainer_AVI },
      { "seq.lumekimagesequence", VideoContainer_IMAGES },
      { "clip.MOV", std::nullopt }, // upper case is not recognised
      { "/data/frames", VideoContainer_IMAGES },
      { "/data/img_%FRAME%.png", VideoContainer_IMAGES },
      { "img_%FRAME_NUMBER%.jpg", VideoContainer_IMAGES },
      { "clip.mka", std::nullopt },
      { "clip.lvid.bak", std::nullopt } }; // the last extension counts
  for( const auto& [pPath, Container] : Cases )
    EXPECT_EQ( Container, FindVideoContainer( pPath ) ) << pPath;
}
