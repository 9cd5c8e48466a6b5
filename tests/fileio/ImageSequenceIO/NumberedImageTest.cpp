// Opening one numbered image opens the run of files it belongs to. The images here are only
// headers: the size is all the reader takes from them when it opens.

#include "fileio/ImageSequenceIO/ImageHeader.h"
#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/VideoReaders/CreateVideoReader.h"
#include "tests/fileio/ImageSequenceIO/SequenceTestSupport.h"

#include <gtest/gtest.h>

#include <set>

using namespace ImageSequenceTest;

namespace
{
  // A PNG signature and IHDR of a 40 x 30 image, big-endian as PNG stores it.
  VBytes PngHeader()
  {
    return { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A, 0, 0, 0, 13, 'I', 'H', 'D', 'R', 0,
             0,    0,   40,  0,   0,    0,    30,   8,    2, 0, 0, 0,  0,   0,   0,   0 };
  }

  struct VRunCase
  {
    const char* Label;
    std::vector< std::string > Files;
    const char* Opened;
    std::uint64_t FrameCount;
    const char* FirstFile;
    std::set< std::uint64_t > Stored;
    std::uint32_t PadWidth;
  };

  const VRunCase s_Runs[] = {
      { "MiddleOfPaddedRunWithGap",
        { "take_000100.png", "take_000101.png", "take_000102.png", "take_000104.png", "take_000105.png",
          "take_00099.png", "other_000050.png", "take_000106.jpg" },
        "take_000102.png",
        6,
        "take_000100.png",
        { 0, 1, 2, 4, 5 },
        6 },
      { "UnpaddedRun", { "n9.png", "n10.png", "n11.png", "n011.png" }, "n10.png", 3, "n9.png", { 0, 1, 2 }, 1 },
      { "NumberOutgrowsItsPad",
        { "r998.png", "r999.png", "r1000.png", "r01000.png" },
        "r999.png",
        3,
        "r998.png",
        { 0, 1, 2 },
        3 },
      { "DigitsNearestTheEnd",
        { "cam2_take7_0001.png", "cam2_take7_0003.png", "cam3_take7_0002.png" },
        "cam2_take7_0003.png",
        3,
        "cam2_take7_0001.png",
        { 0, 2 },
        4 },
      { "StartsAtZero", { "z0.png", "z1.png" }, "z1.png", 2, "z0.png", { 0, 1 }, 1 },
      { "NoDigitsOneFrame", { "still.png", "still2.png" }, "still.png", 1, "still.png", { 0 }, 8 },
  };

  class NumberedRun : public testing::TestWithParam< VRunCase >
  {
  };

  TEST_P( NumberedRun, OpensTheWholeRun )
  {
    const VRunCase& rCase = GetParam();
    VTempFolder Folder;
    for( const std::string& rFile : rCase.Files )
      WriteFile( Folder / rFile, PngHeader() );
    const auto pReader = CreateVideoReader( Folder / rCase.Opened );
    auto* pSequence = dynamic_cast< ImageSequenceIO::VImageSequenceReader* >( pReader.get() );
    ASSERT_TRUE( pSequence );
    ASSERT_TRUE( pSequence->Open( Folder / rCase.Opened ) );
    EXPECT_EQ( rCase.FrameCount, pSequence->GetFrameCount() );
    EXPECT_EQ( Folder / rCase.FirstFile, pSequence->ExpandFileName( 0 ) );
    EXPECT_EQ( rCase.PadWidth, pSequence->GetSequenceInfo().FrameIndexPadWidth );
    EXPECT_EQ( ZOL::VideoPayload_ImagePNG, pSequence->GetVideoPayload() );
    EXPECT_EQ( 40, pSequence->GetVideoFrameInfo().ImageWidth );
    EXPECT_EQ( 30, pSequence->GetVideoFrameInfo().ImageHeight );
    EXPECT_EQ( ZOL::PixelFormat_R8G8B8, pSequence->GetVideoFrameInfo().PixelFormat );
    EXPECT_DOUBLE_EQ( 30.0, pSequence->GetVideoTiming().GetFrameRate() );
    std::set< std::uint64_t > ByDisk, ByIndex;
    for( std::uint64_t i = 0; i < rCase.FrameCount; ++i )
    {
      if( pSequence->HasFrame( i ) )
        ByDisk.insert( i );
      if( pSequence->FindStoredFrameAtOrAfter( i ) == i )
        ByIndex.insert( i );
    }
    EXPECT_EQ( rCase.Stored, ByDisk );
    EXPECT_EQ( rCase.Stored, ByIndex );
    EXPECT_EQ( rCase.Stored.size(), pSequence->GetStoredFrameCount() );
  }

  INSTANTIATE_TEST_SUITE_P( Runs, NumberedRun, testing::ValuesIn( s_Runs ),
                            []( const testing::TestParamInfo< VRunCase >& i_rInfo ) { return i_rInfo.param.Label; } );

  TEST( NumberedRunDescriptor, ADescriptorBesideTheRunIsUsed )
  {
    VTempFolder Folder;
    for( const char* pFile : { "shot_0001.png", "shot_0002.png", "shot_0004.png" } )
      WriteFile( Folder / pFile, PngHeader() );
    ImageSequenceIO::VDescriptor Descriptor = MakeDescriptor( "shot_%FRAME_NUMBER%.png", 10, 8, 4 );
    ASSERT_TRUE( ImageSequenceIO::WriteDescriptor( Folder / "shot.lumekimagesequence", Descriptor ) );
    ImageSequenceIO::VImageSequenceReader Reader;
    ASSERT_TRUE( Reader.Open( Folder / "shot_0002.png" ) );
    EXPECT_EQ( Folder / "shot.lumekimagesequence", Reader.GetDescriptorPath() );
    EXPECT_EQ( 10u, Reader.GetFrameCount() );
    EXPECT_EQ( 48, Reader.GetVideoFrameInfo().ImageWidth );
    EXPECT_DOUBLE_EQ( 25.0, Reader.GetVideoTiming().GetFrameRate() );
    EXPECT_EQ( 3u, Reader.GetStoredFrameCount() );
  }

  TEST( NumberedRunDescriptor, ADescriptorOfOtherFilesIsNotTheRuns )
  {
    VTempFolder Folder;
    for( const char* pFile : { "shot_0001.png", "shot_0002.png" } )
      WriteFile( Folder / pFile, PngHeader() );
    ASSERT_TRUE( ImageSequenceIO::WriteDescriptor( Folder / "shot.lumekimagesequence",
                                                   MakeDescriptor( "shot_%FRAME%.jpg", 10 ) ) );
    ImageSequenceIO::VImageSequenceReader Reader;
    ASSERT_TRUE( Reader.Open( Folder / "shot_0002.png" ) );
    EXPECT_EQ( "", Reader.GetDescriptorPath() );
    EXPECT_EQ( 2u, Reader.GetFrameCount() );
    EXPECT_EQ( 40, Reader.GetVideoFrameInfo().ImageWidth );
  }

  TEST( NumberedRunNames, ImageExtensionsChooseTheSequenceReaderCaseAndAll )
  {
    for( const char* pName : { "a_1.jpg", "a_1.jpeg", "a_1.png", "a_1.tif", "a_1.tiff", "noDigits.png" } )
      EXPECT_TRUE( dynamic_cast< ImageSequenceIO::VImageSequenceReader* >( CreateVideoReader( pName ).get() ) )
          << pName;
    for( const char* pName : { "a_1.JPG", "a_1.Png", "a_1.gif", "a_1.bmp" } )
      EXPECT_FALSE( CreateVideoReader( pName ) ) << pName;
    // Every image name the factory accepts has a payload.
    for( const char* pExtension : { ".jpg", ".jpeg", ".png", ".tif", ".tiff" } )
      EXPECT_NE( ZOL::VideoPayload_None, ImageSequenceIO::PayloadForExtension( pExtension ) ) << pExtension;
  }

  TEST( NumberedRunNames, AnImageWithoutAReadableSizeDoesNotOpen )
  {
    VTempFolder Folder;
    WriteFile( Folder / "bad_01.png", std::string( "not a png" ) );
    ImageSequenceIO::VImageSequenceReader Reader;
    EXPECT_FALSE( Reader.Open( Folder / "bad_01.png" ) );
    EXPECT_FALSE( Reader.Open( Folder / "absent_01.png" ) );
    EXPECT_FALSE( Reader.Open( "/no/such/folder/x_01.png" ) );
  }

  struct VHeaderCase
  {
    const char* Label;
    ZOL::EVideoPayload Payload;
    VBytes Bytes;
    std::int32_t Width;
    std::int32_t Height;
  };

  class ImageHeaderSize : public testing::TestWithParam< VHeaderCase >
  {
  };

  TEST_P( ImageHeaderSize, ReadsTheStatedSize )
  {
    const VHeaderCase& rCase = GetParam();
    const auto Size = ImageSequenceIO::ReadImageSize( rCase.Payload, rCase.Bytes.data(), rCase.Bytes.size() );
    ASSERT_EQ( rCase.Width != 0, Size.has_value() );
    if( Size )
    {
      EXPECT_EQ( rCase.Width, Size->Width );
      EXPECT_EQ( rCase.Height, Size->Height );
    }
    // Every cut of the header short of the size fails and reads nothing beyond its end.
    for( std::size_t Cut = 0; Cut < rCase.Bytes.size(); ++Cut )
    {
      const VBytes Part( rCase.Bytes.begin(), rCase.Bytes.begin() + static_cast< std::ptrdiff_t >( Cut ) );
      ImageSequenceIO::ReadImageSize( rCase.Payload, Part.data(), Part.size() );
    }
  }

  INSTANTIATE_TEST_SUITE_P(
      Headers, ImageHeaderSize,
      testing::Values( VHeaderCase{ "Png", ZOL::VideoPayload_ImagePNG, PngHeader(), 40, 30 },
                       // SOI, an APP0 of 4 bytes, fill bytes, then SOF2 (progressive) of 0x123 x 0x45.
                       VHeaderCase{ "JpegAfterApp0AndFill",
                                    ZOL::VideoPayload_ImageJPEG,
                                    { 0xFF, 0xD8, 0xFF, 0xE0, 0,    4,    1,    2, 0xFF, 0xFF, 0xC2,
                                      0,    11,   8,    0,    0x45, 0x01, 0x23, 1, 1,    0x11, 0 },
                                    0x123,
                                    0x45 },
                       VHeaderCase{ "JpegScanBeforeFrameHeader",
                                    ZOL::VideoPayload_ImageJPEG,
                                    { 0xFF, 0xD8, 0xFF, 0xDA, 0, 2, 0xFF, 0xC0, 0, 11, 8, 0, 1, 0, 1, 1, 1, 0x11, 0 },
                                    0,
                                    0 },
                       // Little-endian: width as SHORT 640, length as LONG 480.
                       VHeaderCase{ "TiffLittleEndian",
                                    ZOL::VideoPayload_ImageTIFF,
                                    { 'I', 'I',  0x2A, 0, 8, 0,    0,    0, 2, 0, 0x00, 0x01, 3, 0,    1,    0, 0,
                                      0,   0x80, 0x02, 0, 0, 0x01, 0x01, 4, 0, 1, 0,    0,    0, 0xE0, 0x01, 0, 0 },
                                    640,
                                    480 },
                       VHeaderCase{ "TiffBigEndian",
                                    ZOL::VideoPayload_ImageTIFF,
                                    { 'M', 'M',  0,    0x2A, 0, 0,    0,    8, 0, 2, 0x01, 0x00, 0, 3, 0, 0, 0,
                                      1,   0x00, 0x07, 0,    0, 0x01, 0x01, 0, 4, 0, 0,    0,    1, 0, 0, 0, 0x05 },
                                    7,
                                    5 },
                       VHeaderCase{ "TiffDirectoryBeyondEnd",
                                    ZOL::VideoPayload_ImageTIFF,
                                    { 'I', 'I', 0x2A, 0, 0xFF, 0xFF, 0xFF, 0xFF },
                                    0,
                                    0 } ),
      []( const testing::TestParamInfo< VHeaderCase >& i_rInfo ) { return i_rInfo.param.Label; } );
} // namespace
