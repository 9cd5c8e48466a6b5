#include "videointerface/Enumerations.h"
#include "videointerface/IVideoFrameInfo.h"
#include "videointerface/IVideoReader.h"

#include "tests/support/TestNames.h"

#include <gtest/gtest.h>

#include <cctype>
#include <set>

using namespace ZOL;

namespace
{
  struct VTableCase
  {
    const char* Name;
    const IEnumTable& ( *Table )();
    const char* TableName;
    std::size_t Rows;
  };
} // namespace

class EnumTableTest : public testing::TestWithParam< VTableCase >
{
};

TEST_P( EnumTableTest, NamesAndValuesConvertBothWaysAndAreUnique )
{
  const IEnumTable& rTable = GetParam().Table();
  EXPECT_STREQ( GetParam().TableName, rTable.Name );
  ASSERT_EQ( GetParam().Rows, rTable.RowCount );
  std::set< std::uint32_t > Values;
  std::set< std::string > Names;
  for( std::size_t i = 0; i < rTable.RowCount; ++i )
  {
    const IEnumRow& rRow = rTable.Rows[i];
    EXPECT_TRUE( Values.insert( rRow.Value ).second ) << rRow.Name;
    EXPECT_TRUE( Names.insert( rRow.Name ).second ) << rRow.Name;
    EXPECT_EQ( rRow.Value, rTable.FromName( rRow.Name ) );
    EXPECT_STREQ( rRow.Name, rTable.ToName( rRow.Value, "fallback" ) );
    EXPECT_EQ( std::string( rRow.Name ), rTable.ToNameOptional( rRow.Value ) );
    EXPECT_STREQ( rRow.Description, rTable.ToDescription( rRow.Value ) );
  }
}

TEST_P( EnumTableTest, NamesCompareExactly )
{
  const IEnumTable& rTable = GetParam().Table();
  for( std::size_t i = 0; i < rTable.RowCount; ++i )
  {
    const std::string Name = rTable.Rows[i].Name;
    std::string Lower = Name;
    for( char& rChar : Lower )
      rChar = static_cast< char >( std::tolower( static_cast< unsigned char >( rChar ) ) );
    if( Lower != Name )
    {
      EXPECT_FALSE( rTable.FromName( Lower ) ) << Lower;
    }
    EXPECT_FALSE( rTable.FromName( Name + " " ) ) << Name;
    EXPECT_FALSE( rTable.FromName( Name.substr( 0, Name.size() - 1 ) ) ) << Name;
    EXPECT_FALSE( rTable.FromName( std::string_view( Name.c_str(), Name.size() + 1 ) ) ) << Name; // with its zero
  }
  EXPECT_FALSE( rTable.FromName( "" ) );
}

TEST_P( EnumTableTest, ValuesOutsideTheTableGiveTheFallback )
{
  const IEnumTable& rTable = GetParam().Table();
  for( std::uint32_t Value : { 20u, 1000u, 0xFFFFFFFFu } )
  {
    EXPECT_STREQ( "Unspecified", rTable.ToName( Value, UnspecifiedText ) );
    EXPECT_FALSE( rTable.ToNameOptional( Value ) );
    EXPECT_STREQ( "", rTable.ToDescription( Value ) );
  }
}

INSTANTIATE_TEST_SUITE_P(
    Tables, EnumTableTest,
    testing::Values( VTableCase{ "PixelFormat", &PixelFormatTable, "PixelFormat.Enum", 20 },
                     VTableCase{ "VideoPayload", &VideoPayloadTable, "VideoPayload.Enum", 6 },
                     VTableCase{ "AudioPayload", &AudioPayloadTable, "AudioPayload.Enum", 3 },
                     VTableCase{ "AudioSampleFormat", &AudioSampleFormatTable, "AudioSampleFormat.Enum", 10 },
                     VTableCase{ "InterlacedFormat", &InterlacedFormatTable, "InterlacedFormat.Enum", 5 },
                     VTableCase{ "VideoContainer", &VideoContainerTable, "VideoContainer.Enum", 6 },
                     VTableCase{ "RadialModel", &RadialModelTable, "LensDistortionCalibration.ERadialModel", 4 } ),
    LumekTest::VCaseName() );

TEST( Enumerations, SampleFormatNumbersAreOutOfStepWithTheRows )
{
  // Files store "Float32" and "UInt8"; the numbers in memory are 6 and 7. A table written in row
  // order would swap the two formats without any other symptom.
  EAudioSampleFormat Format = AudioSampleFormat_Unspecified;
  ASSERT_TRUE( FromString( "Float32", Format ) );
  EXPECT_EQ( 6u, Format );
  ASSERT_TRUE( FromString( "UInt8", Format ) );
  EXPECT_EQ( 7u, Format );
  EXPECT_STREQ( "UInt16", ToString( static_cast< EAudioSampleFormat >( 5 ) ) );
  EXPECT_STREQ( "UInt32", ToString( static_cast< EAudioSampleFormat >( 9 ) ) );
  EXPECT_STREQ( "UInt8", AudioSampleFormatTable().Rows[5].Name );
}

TEST( Enumerations, FailedLookupLeavesTheValue )
{
  EPixelFormat Format = PixelFormat_Unspecified;
  EXPECT_FALSE( FromString( "bayerGB8", Format ) );
  EXPECT_EQ( PixelFormat_Unspecified, Format );
  EVideoContainer Container = VideoContainer_LVID;
  EXPECT_FALSE( FromString( "lvid", Container ) );
  EXPECT_EQ( VideoContainer_LVID, Container );
  EXPECT_TRUE( FromString( "MKV", Container ) );
  EXPECT_EQ( VideoContainer_MKV, Container );
}

TEST( Enumerations, TypedLookupsFallBackOutsideTheTable )
{
  EXPECT_STREQ( "Unspecified", ToString( static_cast< EPixelFormat >( 20 ) ) );
  EXPECT_FALSE( ToStringOptional( static_cast< EPixelFormat >( 20 ) ) );
  EXPECT_EQ( std::string( "Unspecified" ), ToStringOptional( PixelFormat_Unspecified ) );
  EXPECT_STREQ( "?", ToString( static_cast< EVideoPayload >( 6 ), "?" ) );
  EXPECT_STREQ( "", ContainerExtension( static_cast< EVideoContainer >( 6 ) ) );
  EXPECT_EQ( -1, RadialModelParameterCount( RadialModel_BadRadialModel ) );
}

struct VResultCase
{
  const char* Name;
  ResultCode Code;
  const char* Text;
};

class ResultTextTest : public testing::TestWithParam< VResultCase >
{
};

TEST_P( ResultTextTest, Message )
{
  EXPECT_EQ( GetParam().Text, GetResultText( GetParam().Code ) );
}

INSTANTIATE_TEST_SUITE_P(
    Codes, ResultTextTest,
    testing::Values( VResultCase{ "Ok", 0x0, "Ok: The function succeeded" },
                     VResultCase{ "OkButModified", 0x4,
                                  "OkButModified: The function succeeded but one or more values or parameters were "
                                  "modified" },
                     VResultCase{ "FiveIsNotACode", 0x5, "Unknown result code" },
                     VResultCase{ "Failed", 0x80000000u, "Failed: The function failed" },
                     VResultCase{ "FileNotFound", 0x8000002Au,
                                  "FileNotFound: The file does not exist or is unreadable" },
                     VResultCase{ "PastFileNotFound", 0x8000002Bu, "Unknown result code" },
                     VResultCase{ "RPCNotConnected", 0x80010003u,
                                  "RPCNotConnected: The connection to the remote function or callback is not open" },
                     VResultCase{ "IpAddressChanged", 0x40003u, "IP address has changed" },
                     VResultCase{ "BundleAlreadyInstalled", 0x80040007u, "Bundle already installed" },
                     VResultCase{ "TopBitAlone", 0x7FFFFFFFu, "Unknown result code" } ),
    LumekTest::VCaseName() );

// ---------------------------------------------------------------------------------------------
// What the enumerations drive: frame sizes and the container chosen by a file name.

struct VFrameSizeCase
{
  const char* Name;
  EPixelFormat Format;
  std::int32_t Width;
  std::int32_t Height;
  std::uint64_t Bytes;
};

class FrameSizeTest : public testing::TestWithParam< VFrameSizeCase >
{
};

TEST_P( FrameSizeTest, BytesOfAnUncompressedFrame )
{
  IVideoFrameInfo Info;
  Info.PixelFormat = GetParam().Format;
  Info.ImageWidth = GetParam().Width;
  Info.ImageHeight = GetParam().Height;
  EXPECT_EQ( GetParam().Bytes, GetVideoFrameSizeInBytes64( Info ) );
  EXPECT_EQ( static_cast< std::uint32_t >( GetParam().Bytes ), GetVideoFrameSizeInBytes( Info ) );
}

INSTANTIATE_TEST_SUITE_P(
    Formats, FrameSizeTest,
    testing::Values( VFrameSizeCase{ "Bayer", PixelFormat_BayerBG8, 1920, 1080, 2073600 },
                     VFrameSizeCase{ "Packed422", PixelFormat_U8Y8V8Y8, 1920, 1080, 4147200 },
                     VFrameSizeCase{ "Planar444", PixelFormat_PlanarR8G8B8, 3, 5, 45 },
                     VFrameSizeCase{ "RGBA", PixelFormat_B8G8R8u8, 7, 3, 84 },
                     VFrameSizeCase{ "TenBitWholeBlocks", PixelFormat_U10Y10V10Y10, 1920, 1080, 5529600 },
                     VFrameSizeCase{ "TenBitPartialBlock", PixelFormat_U10Y10V10Y10, 1921, 1080, 41 * 1080 * 128 },
                     VFrameSizeCase{ "SevenBitRoundsUp", PixelFormat_BayerGB7, 3, 3, 8 },
                     VFrameSizeCase{ "SixBitExact", PixelFormat_Luminance6, 4, 2, 6 },
                     VFrameSizeCase{ "SixBitRoundsUp", PixelFormat_Luminance6, 1, 1, 1 },
                     VFrameSizeCase{ "Unspecified", PixelFormat_Unspecified, 100, 100, 0 },
                     VFrameSizeCase{ "UnknownFormat", static_cast< EPixelFormat >( 20 ), 100, 100, 0 },
                     VFrameSizeCase{ "NegativeWidth", PixelFormat_Luminance8, -2, 100, 0 },
                     VFrameSizeCase{ "Beyond32Bits", PixelFormat_R8G8B8u8, 65536, 65536, 1ull << 34 } ),
    LumekTest::VCaseName() );

struct VContainerCase
{
  const char* Name;
  const char* Path;
  std::optional< EVideoContainer > Container;
};

class ContainerByNameTest : public testing::TestWithParam< VContainerCase >
{
};

TEST_P( ContainerByNameTest, NameAloneDecides )
{
  EXPECT_EQ( GetParam().Container, FindVideoContainer( GetParam().Path ) );
}

INSTANTIATE_TEST_SUITE_P(
    Names, ContainerByNameTest,
    testing::Values( VContainerCase{ "Mov", "/data/clip.mov", VideoContainer_MOV },
                     VContainerCase{ "Mp4", "clip.mp4", VideoContainer_MP4 },
                     VContainerCase{ "Avi", "a.b/clip.avi", VideoContainer_AVI },
                     VContainerCase{ "Lvid", "take 3.lvid", VideoContainer_LVID },
                     VContainerCase{ "Mkv", "clip.mkv", VideoContainer_MKV },
                     VContainerCase{ "Descriptor", "seq.lumekimagesequence", VideoContainer_IMAGES },
                     VContainerCase{ "UpperCaseIsNotRecognised", "clip.MOV", std::nullopt },
                     VContainerCase{ "NoExtension", "/data/frames", VideoContainer_IMAGES },
                     VContainerCase{ "FramePlaceholder", "/data/img_%FRAME%.png", VideoContainer_IMAGES },
                     VContainerCase{ "FrameNumberPlaceholder", "img_%FRAME_NUMBER%.jpg", VideoContainer_IMAGES },
                     VContainerCase{ "OtherExtension", "clip.mka", std::nullopt },
                     VContainerCase{ "LastExtensionCounts", "clip.lvid.bak", std::nullopt } ),
    LumekTest::VCaseName() );
