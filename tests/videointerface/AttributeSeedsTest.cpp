// The attribute fuzzer's seeds are the serial form of a few typical stores. They are kept as
// files beside the fuzzer, and this test holds them to the writer: a change of the binary form
// shows here as a changed golden file. Run with LUMEK_UPDATE_SEEDS=1 to write them afresh.

#include "tests/videointerface/AttributeTestSupport.h"

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
    IVideoFrameInfo Frame = LumekTest::Frame( 1280, 1024, PixelFormat_BayerGB8 );
    Frame.TwiceOffsetX = 3;
    WriteVideoFrameInfo( Store, Frame );
    WriteAudioFrameInfo( Store, "", { AudioSampleFormat_Int24, 48000, 2 } );
    WriteVideoTiming( Store, { 135000000, 1125000, 0 } );
    WriteVideoSettings( Store, "", { 1.0f, 2.2f } );
    WriteTimecode( Store, { TimecodeStandard_29_97_DF, 10, 1, 0, 2, 7, 0, 0, 1126125 } );
    WriteCameraHardware( Store, { "urn:lumek:cam:1", "1", "V5", "Vantage 5", 2048, 2048, 1.0 } );
    return Store;
  }

  IVideoAttributes HistoryStore()
  {
    IVideoAttributes Store;
    VConversionRecord Record;
    Record.Container = VideoContainer_MOV;
    Record.VideoPayload = VideoPayload_VideoH264;
    Record.PixelFormat = PixelFormat_PlanarY8U8V8;
    Record.LensDistortionCalibration = LumekTest::Lens( RadialModel_Lumek3Parameter, { -0.1, 0.01, 0.0 } );
    WriteConversionRecords( Store, { Record, VConversionRecord() } );
    WriteLensDistortionCalibration( Store, "",
                                    LumekTest::Lens( RadialModel_Lumek2Parameter, { 0.2, -0.05 }, 640, 512 ) );
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
} // namespace

TEST( AttributeSeeds, EachSeedFileIsTheWritersOutput )
{
  const std::pair< const char*, IVideoAttributes > Seeds[] = {
      { "recording", RecordingStore() }, { "history", HistoryStore() }, { "everytype", EveryTypeStore() } };
  for( const auto& [pName, Store] : Seeds )
  {
    const std::string Path = std::string( LUMEK_SOURCE_DIR ) + "/fuzz/seeds/attributes/" + pName + ".bin";
    SCOPED_TRACE( Path );
    const std::vector< std::uint8_t > Expected = LumekTest::Serialise( Store );
    if( std::getenv( "LUMEK_UPDATE_SEEDS" ) != nullptr )
      std::ofstream( Path, std::ios::binary ) << std::string( Expected.begin(), Expected.end() );
    std::ifstream In( Path, std::ios::binary );
    ASSERT_TRUE( In );
    const std::vector< std::uint8_t > Stored( ( std::istreambuf_iterator< char >( In ) ),
                                              std::istreambuf_iterator< char >() );
    EXPECT_EQ( Expected, Stored );
    UtilsIO::VMemoryInputStream Input( Stored.data(), Stored.size() );
    IVideoAttributes Read;
    ASSERT_TRUE( Read.ReadFrom( Input ) );
    EXPECT_TRUE( Read == Store );
  }
}
