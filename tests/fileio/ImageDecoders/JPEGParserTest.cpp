#include "fileio/JPEGUtils/JPEGParser.h"

#include "tests/fileio/ImageDecoders/ImageTestSupport.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

namespace
{
  using namespace LumekTest;
  using JPEGUtils::VJPEGSegment;

  struct VParse
  {
    bool bResult = false;
    std::vector< VJPEGSegment > Segments;
    std::vector< std::string > Log;
  };

  VParse Parse( const std::vector< std::uint8_t >& i_rBytes, std::uint64_t i_Skip = 0 )
  {
    VParse Result;
    VCategoryLog Log( "JPEGIO" );
    UtilsIO::VMemoryInputStream Stream( i_rBytes.data(), i_rBytes.size() );
    EXPECT_TRUE( Stream.Seek( static_cast< std::int64_t >( i_Skip ) ) );
    Result.bResult = JPEGUtils::ParseJPEG( Stream, i_rBytes.size() - i_Skip, Result.Segments );
    Result.Log = Log.Lines();
    return Result;
  }

  std::vector< std::uint8_t > Join( std::initializer_list< std::vector< std::uint8_t > > i_Parts )
  {
    std::vector< std::uint8_t > Bytes;
    for( const auto& rPart : i_Parts )
      Bytes.insert( Bytes.end(), rPart.begin(), rPart.end() );
    return Bytes;
  }

  // A small image by hand, every offset known: SOI at 0, APP0 at 2 (18 bytes), COM at 20 (9),
  // APP14 at 29 (6), SOS at 35 (10), entropy data with a stuffed byte at 47 and RST0 at 49,
  // EOI at 53.
  const std::vector< std::uint8_t > s_SOI = { 0xFF, 0xD8 };
  const std::vector< std::uint8_t > s_APP0 = { 0xFF, 0xE0, 0x00, 0x10, 'J',  'F',  'I',  'F',  0x00,
                                               0x01, 0x01, 0x00, 0x00, 0x01, 0x00, 0x01, 0x00, 0x00 };
  const std::vector< std::uint8_t > s_COM = { 0xFF, 0xFE, 0x00, 0x07, 'H', 'i', ' ', '!', '!' };
  const std::vector< std::uint8_t > s_APP14 = { 0xFF, 0xEE, 0x00, 0x04, 0x00, 0x00 };
  const std::vector< std::uint8_t > s_SOS = { 0xFF, 0xDA, 0x00, 0x08, 0x01, 0x01, 0x00, 0x00, 0x3F, 0x00 };
  const std::vector< std::uint8_t > s_Scan = { 0x12, 0x34, 0xFF, 0x00, 0x56, 0xFF, 0xD0, 0x78 };
  const std::vector< std::uint8_t > s_EOI = { 0xFF, 0xD9 };

  std::vector< std::uint8_t > HandMade()
  {
    return Join( { s_SOI, s_APP0, s_COM, s_APP14, s_SOS, s_Scan, s_EOI } );
  }

  const std::vector< VJPEGSegment > s_HandMadeSegments = {
      { 0xD8, 0, 2 },   { 0xE0, 2, 18 }, { 0xFE, 20, 9 }, { 0xEE, 29, 6 },
      { 0xDA, 35, 10 }, { 0xD0, 50, 2 }, { 0xD9, 53, 2 },
  };

  TEST( JPEGParser, FindsEverySegmentOfAHandMadeImage )
  {
    const VParse Result = Parse( HandMade() );
    EXPECT_TRUE( Result.bResult );
    EXPECT_EQ( Result.Segments, s_HandMadeSegments );
    EXPECT_TRUE( Result.Log.empty() );
  }

  TEST( JPEGParser, CountsOffsetsInTheStream )
  {
    std::vector< std::uint8_t > Bytes = Join( { { 1, 2, 3, 4, 5 }, HandMade() } );
    const VParse Result = Parse( Bytes, 5 );
    EXPECT_TRUE( Result.bResult );
    ASSERT_EQ( Result.Segments.size(), s_HandMadeSegments.size() );
    for( std::size_t i = 0; i < s_HandMadeSegments.size(); ++i )
      EXPECT_EQ( Result.Segments[i].Start, s_HandMadeSegments[i].Start + 5 );
  }

  TEST( JPEGParser, DumpsTheHandMadeImage )
  {
    const std::vector< std::uint8_t > Bytes = HandMade();
    const VParse Result = Parse( Bytes );
    UtilsIO::VMemoryInputStream Stream( Bytes.data(), Bytes.size() );
    EXPECT_EQ( JPEGUtils::DumpJPEG( Result.Segments, Stream ),
               "Type\tStart\tEnd\tLength\tDescription\n"
               "SOI\t0\t2\t2\tStart of image\n"
               "APP0\t2\t20\t18\tApplication specific\n  FourCC: 'JFIF'\n"
               "COM\t20\t29\t9\tComment\n  Text: \"Hi !!\"\n"
               "APP14\t29\t35\t6\tAPP14\n"
               "SOS\t35\t45\t10\tStart of scan\n"
               "RST0\t50\t52\t2\tResync marker\n"
               "EOI\t53\t55\t2\tEnd of image\n" );
  }

  // ffmpeg's 4:2:2 encoding of a 16 x 16 test picture, kept as a fuzz seed.
  TEST( JPEGParser, DumpsAnFfmpegImage )
  {
    const std::vector< std::uint8_t > Bytes = ReadWholeFile( SeedPath( "jpeg/yuv422_16x16.jpg" ) );
    const VParse Result = Parse( Bytes );
    EXPECT_TRUE( Result.bResult );
    UtilsIO::VMemoryInputStream Stream( Bytes.data(), Bytes.size() );
    EXPECT_EQ( JPEGUtils::DumpJPEG( Result.Segments, Stream ),
               "Type\tStart\tEnd\tLength\tDescription\n"
               "SOI\t0\t2\t2\tStart of image\n"
               "APP0\t2\t20\t18\tApplication specific\n  FourCC: 'JFIF'\n"
               "DQT\t20\t89\t69\tDefine quantization table\n"
               "DHT\t89\t202\t113\tDefine Huffman table\n"
               "SOF0\t202\t221\t19\tStart of frame\n  Type: Nondifferential/Huffman/Baseline DCT\n"
               "SOS\t221\t235\t14\tStart of scan\n"
               "EOI\t435\t437\t2\tEnd of image\n" );
  }

  struct VMalformed
  {
    const char* Name;
    std::vector< std::uint8_t > Bytes;
    const char* Message;
  };

  std::ostream& operator<<( std::ostream& o, const VMalformed& i_rCase )
  {
    return o << i_rCase.Name;
  }

  class JPEGParserMalformed : public ::testing::TestWithParam< VMalformed >
  {
  };

  TEST_P( JPEGParserMalformed, IsRefusedWithItsMessage )
  {
    const VParse Result = Parse( GetParam().Bytes );
    EXPECT_FALSE( Result.bResult );
    EXPECT_EQ( Result.Log, std::vector< std::string >{ std::string( "2 " ) + GetParam().Message } );
  }

  const std::vector< std::uint8_t > s_DQT = { 0xFF, 0xDB, 0x00, 0x02 };

  INSTANTIATE_TEST_SUITE_P(
      Streams, JPEGParserMalformed,
      ::testing::Values( VMalformed{ "Empty", {}, "Not enough segments.  Data may be truncated or corrupt." },
                         VMalformed{ "ThreeSegments", Join( { s_SOI, s_APP14, s_EOI } ),
                                     "Not enough segments.  Data may be truncated or corrupt." },
                         VMalformed{ "NoSOI", Join( { s_APP0, s_DQT, s_SOS, s_Scan, s_EOI } ), "Missing SOI marker." },
                         VMalformed{ "NoEOI", Join( { s_SOI, s_APP0, s_DQT, s_SOS, s_Scan } ), "Missing EOI marker." },
                         VMalformed{ "DataBeforeTheScan", Join( { s_SOI, s_APP0, { 0x12 }, s_SOS, s_Scan, s_EOI } ),
                                     "Unrecognised data found in buffer at 0x14" },
                         VMalformed{ "StuffedByteBeforeTheScan",
                                     Join( { s_SOI, { 0xFF, 0x00 }, s_SOS, s_Scan, s_EOI } ),
                                     "0xff00 found outside of image scan." },
                         VMalformed{ "SegmentPastTheEnd",
                                     Join( { s_SOI, s_APP0, s_DQT, { 0xFF, 0xE1, 0x40, 0x00, 1, 2 } } ),
                                     "Did not end cleanly.  Data may be truncated or corrupt." },
                         VMalformed{ "MarkerCutInHalf", Join( { s_SOI, s_APP0, s_DQT, s_SOS, s_Scan, { 0xFF } } ),
                                     "Did not end cleanly.  Data may be truncated or corrupt." } ),
      []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

  TEST( JPEGParser, SkipsBytesAfterTheImage )
  {
    for( std::vector< std::uint8_t > Tail : std::vector< std::vector< std::uint8_t > >{ { 0xAB }, { 0xAB, 0xCD, 0 } } )
    {
      const VParse Result = Parse( Join( { HandMade(), Tail } ) );
      EXPECT_TRUE( Result.bResult );
      EXPECT_EQ( Result.Segments, s_HandMadeSegments );
    }
  }

  // Every cut of a real image fails, with one line, and never reads past the cut.
  TEST( JPEGParser, RefusesEveryCut )
  {
    const std::vector< std::uint8_t > Whole = ReadWholeFile( SeedPath( "jpeg/yuv420_24x16.jpg" ) );
    ASSERT_GT( Whole.size(), 100u );
    for( std::size_t Cut = 0; Cut < Whole.size(); ++Cut )
    {
      const std::vector< std::uint8_t > Part( Whole.begin(), Whole.begin() + Cut );
      const VParse Result = Parse( Part );
      EXPECT_FALSE( Result.bResult ) << "cut at " << Cut;
      EXPECT_EQ( Result.Log.size(), 1u ) << "cut at " << Cut;
    }
    EXPECT_TRUE( Parse( Whole ).bResult );
  }
} // namespace
