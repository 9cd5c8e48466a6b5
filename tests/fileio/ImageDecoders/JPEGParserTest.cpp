// The segment parser and its dump against a JPEG assembled by hand, every offset known, and
// ffmpeg's encoding kept as a fuzz seed; malformed streams and every cut of a real one.

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

  VParse Parse( const VBytes& i_rBytes, std::uint64_t i_Skip = 0 )
  {
    VParse Result;
    VLogCapture Log( "JPEGIO" );
    UtilsIO::VMemoryInputStream Stream( i_rBytes.data(), i_rBytes.size() );
    EXPECT_TRUE( Stream.Seek( static_cast< std::int64_t >( i_Skip ) ) );
    Result.bResult = JPEGUtils::ParseJPEG( Stream, i_rBytes.size() - i_Skip, Result.Segments );
    Result.Log = Log.Lines();
    return Result;
  }

  std::string Dump( const VBytes& i_rBytes )
  {
    const VParse Result = Parse( i_rBytes );
    EXPECT_TRUE( Result.bResult );
    UtilsIO::VMemoryInputStream Stream( i_rBytes.data(), i_rBytes.size() );
    return JPEGUtils::DumpJPEG( Result.Segments, Stream );
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
  const std::vector< VJPEGSegment > s_HandMadeSegments = {
      { 0xD8, 0, 2 },   { 0xE0, 2, 18 }, { 0xFE, 20, 9 }, { 0xEE, 29, 6 },
      { 0xDA, 35, 10 }, { 0xD0, 50, 2 }, { 0xD9, 53, 2 },
  };

  TEST( JPEGParser, FindsEverySegmentWhereverTheImageStartsAndWhateverFollows )
  {
    const VParse Result = Parse( s_HandMade );
    EXPECT_TRUE( Result.bResult );
    EXPECT_EQ( Result.Segments, s_HandMadeSegments );
    EXPECT_TRUE( Result.Log.empty() );
    // Offsets count in the stream, not from the image's start.
    const VParse Later = Parse( Join( { { 1, 2, 3, 4, 5 }, s_HandMade } ), 5 );
    EXPECT_TRUE( Later.bResult );
    ASSERT_EQ( Later.Segments.size(), s_HandMadeSegments.size() );
    for( std::size_t i = 0; i < s_HandMadeSegments.size(); ++i )
      EXPECT_EQ( Later.Segments[i].Start, s_HandMadeSegments[i].Start + 5 );
    // Bytes after the image are skipped.
    for( const VBytes& rTail : { VBytes{ 0xAB }, VBytes{ 0xAB, 0xCD, 0 } } )
    {
      const VParse Tailed = Parse( Join( { s_HandMade, rTail } ) );
      EXPECT_TRUE( Tailed.bResult );
      EXPECT_EQ( Tailed.Segments, s_HandMadeSegments );
    }
  }

  TEST( JPEGParser, DumpsTheHandMadeAndAnFfmpegImage )
  {
    EXPECT_EQ( Dump( s_HandMade ), "Type\tStart\tEnd\tLength\tDescription\n"
                                   "SOI\t0\t2\t2\tStart of image\n"
                                   "APP0\t2\t20\t18\tApplication specific\n  FourCC: 'JFIF'\n"
                                   "COM\t20\t29\t9\tComment\n  Text: \"Hi !!\"\n"
                                   "APP14\t29\t35\t6\tAPP14\n"
                                   "SOS\t35\t45\t10\tStart of scan\n"
                                   "RST0\t50\t52\t2\tResync marker\n"
                                   "EOI\t53\t55\t2\tEnd of image\n" );
    // ffmpeg's 4:2:2 encoding of a 16 x 16 test picture.
    EXPECT_EQ( Dump( ReadWholeFile( SeedPath( "jpeg/yuv422_16x16.jpg" ) ) ),
               "Type\tStart\tEnd\tLength\tDescription\n"
               "SOI\t0\t2\t2\tStart of image\n"
               "APP0\t2\t20\t18\tApplication specific\n  FourCC: 'JFIF'\n"
               "DQT\t20\t89\t69\tDefine quantization table\n"
               "DHT\t89\t202\t113\tDefine Huffman table\n"
               "SOF0\t202\t221\t19\tStart of frame\n  Type: Nondifferential/Huffman/Baseline DCT\n"
               "SOS\t221\t235\t14\tStart of scan\n"
               "EOI\t435\t437\t2\tEnd of image\n" );
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
    const VBytes Whole = ReadWholeFile( SeedPath( "jpeg/yuv420_24x16.jpg" ) );
    ASSERT_GT( Whole.size(), 100u );
    for( std::size_t Cut = 0; Cut < Whole.size(); ++Cut )
    {
      const VParse Result = Parse( VBytes( Whole.begin(), Whole.begin() + static_cast< std::ptrdiff_t >( Cut ) ) );
      EXPECT_FALSE( Result.bResult ) << "cut at " << Cut;
      EXPECT_EQ( Result.Log.size(), 1u ) << "cut at " << Cut;
    }
    EXPECT_TRUE( Parse( Whole ).bResult );
  }
} // namespace
