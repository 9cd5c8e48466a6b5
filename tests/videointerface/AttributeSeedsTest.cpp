// The attribute fuzzer's seeds are the serial form of a few typical stores. They are kept as
// files beside the fuzzer, and this test holds them to the writer: a change of the binary form
// shows here as a changed golden file. Run with LUMEK_UPDATE_SEEDS=1 to write them afresh.

#include "tests/support/TestNames.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <fstream>
#include <iterator>

using namespace ZOL;

namespace
{
  IVideoAttributes RecordingStore()
  {
    IVideoAttributes Store;
    IVideoFrameInfo Frame;
    Frame.ImageWidth = 1280;
    Frame.ImageHeight = 1024;
    Frame.PixelFormat = PixelFormat_BayerGB8;
    Frame.TwiceOffsetX = 3;
    Frame.PixelAspectRatio = 1.0;
    WriteVideoFrameInfo( Store, Frame );
    WriteAudioFrameInfo( Store, "", { AudioSampleFormat_Int24, 48000, 2 } );
    WriteVideoTiming( Store, { 135000000, 1125000, 0 } );
    WriteVideoSettings( Store, "", { 1.0f, 2.2f } );
    ITimecode Timecode;
    Timecode.Standards = TimecodeStandard_29_97_DF;
    Timecode.Hours = 10;
    Timecode.Minutes = 1;
    Timecode.Frames = 2;
    Timecode.UserBits = 7;
    Timecode.SubFramePeriod = 1126125;
    WriteTimecode( Store, Timecode );
    CoreLumekTypes::VCameraHardware Camera;
    Camera.DeviceURN = "urn:lumek:cam:1";
    Camera.SerialNumber = "1";
    Camera.Type = "V5";
    Camera.DisplayType = "Vantage 5";
    Camera.SensorWidthInPixels = 2048;
    Camera.SensorHeightInPixels = 2048;
    WriteCameraHardware( Store, Camera );
    return Store;
  }

  IVideoAttributes HistoryStore()
  {
    IVideoAttributes Store;
    VConversionRecord Record;
    Record.Container = VideoContainer_MOV;
    Record.VideoPayload = VideoPayload_VideoH264;
    Record.PixelFormat = PixelFormat_PlanarY8U8V8;
    Record.LensDistortionCalibration.RadialModel = RadialModel_Lumek3Parameter;
    Record.LensDistortionCalibration.RadialDistortionParameters = { -0.1, 0.01, 0.0 };
    WriteConversionRecords( Store, { Record, VConversionRecord() } );
    CoreLumekTypes::VLensDistortionCalibration Lens;
    Lens.RadialModel = RadialModel_Lumek2Parameter;
    Lens.RadialDistortionParameters = { 0.2, -0.05 };
    Lens.RadialDistortionCentre_X = 640;
    Lens.RadialDistortionCentre_Y = 512;
    WriteLensDistortionCalibration( Store, "", Lens );
    return Store;
  }

  IVideoAttributes EveryTypeStore()
  {
    IVideoAttributes Store;
    Store.Set( "", false );
    Store.Set( "i8", std::int8_t( -1 ) );
    Store.Set( "i16", std::int16_t( -300 ) );
    Store.Set( "i32", std::int32_t( -70000 ) );
    Store.Set( "i64", std::int64_t( -5000000000 ) );
    Store.Set( "u8", std::uint8_t( 255 ) );
    Store.Set( "u16", std::uint16_t( 65535 ) );
    Store.Set( "u32", std::uint32_t( 4000000000u ) );
    Store.Set( "u64", std::uint64_t( 1 ) << 63 );
    Store.Set( "f32", 0.1f );
    Store.Set( "f64", -1e-10 );
    Store.Set( "str", std::string( "a\0b", 3 ) );
    return Store;
  }

  struct VSeedCase
  {
    const char* Name;
    IVideoAttributes ( *Make )();
  };

  std::vector< std::uint8_t > Serialise( const IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    EXPECT_TRUE( i_rStore.WriteTo( Stream ) );
    return Stream.GetData();
  }
} // namespace

class AttributeSeedTest : public testing::TestWithParam< VSeedCase >
{
};

TEST_P( AttributeSeedTest, SeedFileIsTheWritersOutput )
{
  const std::string Path = std::string( LUMEK_SOURCE_DIR ) + "/fuzz/seeds/attributes/" + GetParam().Name + ".bin";
  const std::vector< std::uint8_t > Expected = Serialise( GetParam().Make() );
  if( std::getenv( "LUMEK_UPDATE_SEEDS" ) != nullptr )
  {
    std::ofstream Out( Path, std::ios::binary );
    Out.write( reinterpret_cast< const char* >( Expected.data() ), static_cast< std::streamsize >( Expected.size() ) );
  }
  std::ifstream In( Path, std::ios::binary );
  ASSERT_TRUE( In ) << Path;
  const std::vector< std::uint8_t > Stored( ( std::istreambuf_iterator< char >( In ) ),
                                            std::istreambuf_iterator< char >() );
  EXPECT_EQ( Expected, Stored );

  UtilsIO::VMemoryInputStream Input( Stored.data(), Stored.size() );
  IVideoAttributes Read;
  ASSERT_TRUE( Read.ReadFrom( Input ) );
  EXPECT_TRUE( Read == GetParam().Make() );
}

INSTANTIATE_TEST_SUITE_P( Seeds, AttributeSeedTest,
                          testing::Values( VSeedCase{ "recording", &RecordingStore },
                                           VSeedCase{ "history", &HistoryStore },
                                           VSeedCase{ "everytype", &EveryTypeStore } ),
                          LumekTest::VCaseName() );
