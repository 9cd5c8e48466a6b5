#include "videointerface/AttributeRecords.h"

#include "tests/videointerface/AttributeTestSupport.h"

#include <gtest/gtest.h>

using namespace ZOL;
using CoreLumekTypes::VCameraHardware;
using CoreLumekTypes::VLensDistortionCalibration;
using LumekTest::Frame;
using LumekTest::Lens;
using LumekTest::ThroughBytes;

namespace
{
  // The keys of a written 8x8 BayerRG8 frame.
  IVideoAttributes FrameKeys()
  {
    IVideoAttributes Store;
    EXPECT_TRUE( WriteVideoFrameInfo( Store, Frame( 8, 8, PixelFormat_BayerRG8 ) ) );
    return Store;
  }

  VConversionRecord RecordWithLens( std::vector< double > i_Parameters )
  {
    VConversionRecord Record;
    const ERadialModel Model = i_Parameters.size() == 3 ? RadialModel_Lumek3Parameter : RadialModel_Lumek2Parameter;
    Record.LensDistortionCalibration = Lens( Model, std::move( i_Parameters ) );
    return Record;
  }
} // namespace

// ---------------------------------------------------------------------------------------------
// Frame description.

TEST( FrameInfo, WriterAndReaderAgreeForEveryFormatAndTheOddestFields )
{
  std::vector< IVideoFrameInfo > Cases;
  for( std::uint32_t Format = 1; Format < PixelFormatCount; ++Format )
    Cases.push_back( Frame( 640, 480, static_cast< EPixelFormat >( Format ) ) );
  // Odd half-pixel offsets, an inverted interlaced frame, and the largest size.
  Cases.push_back( { 3, 65535, 2, 255, 1, 1, PixelFormat_BayerGB8, IVideoFrameInfo::Flag_Inverted, 0.9,
                     InterlacedFormat_InterlacedFrameOddOlder } );
  Cases.push_back( { 0, 0, 1, 1, 0x7FFFFFFF, 0x7FFFFFFF, PixelFormat_U10Y10V10Y10, 0, 1.0,
                     InterlacedFormat_InterlacedFrameUnspecifiedLineTiming } );
  for( const IVideoFrameInfo& rWritten : Cases )
  {
    SCOPED_TRACE( std::string( ToString( rWritten.PixelFormat ) ) + " " + std::to_string( rWritten.ImageWidth ) );
    IVideoAttributes Store;
    ASSERT_TRUE( WriteVideoFrameInfo( Store, rWritten ) );
    const IVideoAttributes Read = ThroughBytes( Store );
    IVideoFrameInfo Info = Frame( 9, 9, PixelFormat_R5G6B5 );
    Info.Flags = ~0u;
    EXPECT_TRUE( ReadVideoFrameInfo( Read, Read, Info ) );
    EXPECT_EQ( rWritten, Info );
  }
}

TEST( FrameInfo, NoVideoWritesOnlyPresentFalseAndUnusableDescriptionsNothing )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, IVideoFrameInfo() ) );
  EXPECT_EQ( 1u, Store.Size() );
  IVideoFrameInfo Info = Frame( 640, 480, PixelFormat_Luminance8 );
  Info.PixelAspectRatio = 2.0;
  EXPECT_TRUE( ReadVideoFrameInfo( Store, Store, Info ) );
  EXPECT_EQ( IVideoFrameInfo(), Info );
  EXPECT_EQ( 0.0, Info.PixelAspectRatio );

  for( const IVideoFrameInfo& rInfo :
       { Frame( 0, 480, PixelFormat_Luminance8 ), Frame( 640, -1, PixelFormat_Luminance8 ),
         Frame( 640, 480, PixelFormat_Unspecified ), Frame( 640, 480, static_cast< EPixelFormat >( 20 ) ) } )
  {
    IVideoAttributes Unwritten;
    EXPECT_FALSE( WriteVideoFrameInfo( Unwritten, rInfo ) );
    EXPECT_TRUE( Unwritten.Empty() );
  }
}

// A required key missing fails the read; without the Present key the record is left as it was.
TEST( FrameInfo, EachRequiredKeyMissingFailsTheRead )
{
  for( const char* pKey : { "Present", "ImageWidth", "ImageHeight", "PixelFormat", "Inverted", "PixelAspectRatio" } )
  {
    SCOPED_TRACE( pKey );
    IVideoAttributes Store = FrameKeys();
    ASSERT_TRUE( Store.Remove( std::string( "VideoFrameInfo." ) + pKey ) );
    IVideoFrameInfo Info = Frame( 2, 2, PixelFormat_R8G8B8 );
    EXPECT_FALSE( ReadVideoFrameInfo( Store, Store, Info ) );
    EXPECT_TRUE( pKey != std::string( "Present" ) || Info == Frame( 2, 2, PixelFormat_R8G8B8 ) );
  }
  IVideoAttributes Store = FrameKeys();
  Store.Set( "VideoFrameInfo.ImageWidth", 0x80000000u ); // beyond a signed 32-bit width
  IVideoFrameInfo Info;
  EXPECT_FALSE( ReadVideoFrameInfo( Store, Store, Info ) );
}

// The half-pixel offset wins over the older whole-pixel one; a key of the wrong type is absent.
TEST( FrameInfo, TwiceOffsetWinsOverTheWholeOffset )
{
  const struct
  {
    const char* Name;
    std::optional< std::uint32_t > ImageX;
    std::optional< std::uint16_t > TwiceOffsetX;
    std::uint16_t Expected;
  } Cases[] = { { "twice offset alone", std::nullopt, 3, 3 },
                { "whole offset is doubled", 3u, std::nullopt, 6 },
                { "both present, twice wins", 100u, 7, 7 },
                { "whole offset wraps into 16 bits", 0x8001u, std::nullopt, 2 },
                { "neither present", std::nullopt, std::nullopt, 0 } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Name );
    IVideoAttributes Store = FrameKeys();
    Store.Remove( "VideoFrameInfo.ImageX" );
    Store.Remove( "VideoFrameInfo.TwiceOffsetX" );
    if( rCase.ImageX )
      Store.Set( "VideoFrameInfo.ImageX", *rCase.ImageX );
    if( rCase.TwiceOffsetX )
      Store.Set( "VideoFrameInfo.TwiceOffsetX", *rCase.TwiceOffsetX );
    IVideoFrameInfo Info;
    EXPECT_EQ( rCase.ImageX || rCase.TwiceOffsetX, ReadVideoFrameInfo( Store, Store, Info ) );
    EXPECT_EQ( rCase.Expected, Info.TwiceOffsetX );
    Store.Set( "VideoFrameInfo.ImageX", std::int32_t( 3 ) );
    EXPECT_EQ( rCase.TwiceOffsetX.has_value(), ReadVideoFrameInfo( Store, Store, Info ) );
  }
}

TEST( FrameInfo, OptionalKeysTakeTheirDefaultsAndUnknownTextsKeepTheFormat )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo(
      Store, { 0, 0, 4, 1, 8, 8, PixelFormat_BayerRG8, 0, 1.0, InterlacedFormat_NotInterlaced } ) );
  Store.Remove( "VideoFrameInfo.SensorPixelsPerImagePixelX" );
  Store.Remove( "VideoFrameInfo.InterlacedFormat" );
  IVideoFrameInfo Info;
  Info.SensorPixelsPerImagePixelX = 9;
  Info.InterlacedFormat = InterlacedFormat_InterlacedFrameEvenOlder;
  ASSERT_TRUE( ReadVideoFrameInfo( Store, Store, Info ) );
  EXPECT_EQ( 1, Info.SensorPixelsPerImagePixelX );
  EXPECT_EQ( InterlacedFormat_Unspecified, Info.InterlacedFormat );

  Store.Set( "VideoFrameInfo.PixelFormat", "bayerGB8" );
  Store.Set( "VideoFrameInfo.InterlacedFormat", "Interlaced" );
  IVideoFrameInfo Fresh;
  EXPECT_FALSE( ReadVideoFrameInfo( Store, Store, Fresh ) );
  EXPECT_EQ( PixelFormat_Unspecified, Fresh.PixelFormat );
  EXPECT_EQ( 8, Fresh.ImageWidth );
  IVideoFrameInfo Reused = Frame( 2, 2, PixelFormat_Y8U8Y8V8 );
  Reused.InterlacedFormat = InterlacedFormat_NotInterlaced;
  EXPECT_TRUE( ReadVideoFrameInfo( Store, Store, Reused ) );
  EXPECT_EQ( PixelFormat_Y8U8Y8V8, Reused.PixelFormat );
  EXPECT_EQ( InterlacedFormat_Unspecified, Reused.InterlacedFormat );
}

// The conversion distortion flag is decided by the outer store's history, never by the frame
// keys' own store; a recording with a lens of its own was corrected already.
TEST( FrameInfo, ConversionDistortionFlagFollowsTheHistory )
{
  const struct
  {
    const char* Name;
    std::vector< VConversionRecord > History;
    bool bOwnLens, bGapBeforeTheLens, Flag;
  } Cases[] = {
      { "no history", {}, false, false, false },
      { "history with a lens", { RecordWithLens( { 0.0, -0.2 } ) }, false, false, true },
      { "history with a zero lens", { RecordWithLens( { 0.0, 0.0 } ) }, false, false, false },
      { "lens in the later record",
        { RecordWithLens( { 0, 0 } ), RecordWithLens( { 0, 0, 1e-9 } ) },
        false,
        false,
        true },
      { "recording has its own lens", { RecordWithLens( { 0.1, 0.2 } ) }, true, false, false },
      { "lens only behind a gap", { RecordWithLens( { 0, 0 } ), RecordWithLens( { 0.5, 0 } ) }, false, true, false } };
  const IVideoAttributes Keys = FrameKeys();
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Name );
    IVideoAttributes Outer;
    WriteConversionRecords( Outer, rCase.History );
    if( rCase.bOwnLens )
      Outer.Set( "LensDistortionCalibration.RadialModel", 0 ); // any type counts
    for( const char* pKey : { "Container", "AudioPayload", "VideoPayload" } )
      if( rCase.bGapBeforeTheLens )
        Outer.Remove( std::string( "ConversionRecord.0." ) + pKey );
    IVideoFrameInfo Info;
    Info.Flags = rCase.Flag ? 0u : static_cast< std::uint32_t >( IVideoFrameInfo::Flag_HasConversionDistortion );
    ASSERT_TRUE( ReadVideoFrameInfo( Keys, ThroughBytes( Outer ), Info ) );
    EXPECT_EQ( rCase.Flag, Info.HasConversionDistortion() );
  }
  IVideoFrameInfo Single;
  ASSERT_TRUE( ReadVideoFrameInfo( Keys, Keys, Single ) );
  EXPECT_FALSE( Single.HasConversionDistortion() );
}

// ---------------------------------------------------------------------------------------------
// Audio, timing, settings, timecode.

TEST( AudioFrameInfo, WriterAndReaderAgreeUnderAnyPrefix )
{
  const IAudioFrameInfo Cases[] = { {}, // no audio
                                    { AudioSampleFormat_Float32, 48000, 2 },
                                    { AudioSampleFormat_UInt8, 8000, 1 },
                                    { AudioSampleFormat_Int24, 192000, 64 },
                                    { AudioSampleFormat_Int16, 44100, 0 } };
  for( const std::string Prefix : { "", "ConversionRecord.3." } )
    for( const IAudioFrameInfo& rWritten : Cases )
    {
      SCOPED_TRACE( Prefix + ToString( rWritten.SampleFormat ) + " " + std::to_string( rWritten.Channels ) );
      IVideoAttributes Store;
      ASSERT_TRUE( WriteAudioFrameInfo( Store, Prefix, rWritten ) );
      const IVideoAttributes Read = ThroughBytes( Store );
      IAudioFrameInfo Info{ AudioSampleFormat_Int8, 1, 1 };
      // No audio is a usable answer; zero channels is not.
      EXPECT_EQ( rWritten.Channels != 0 || rWritten == IAudioFrameInfo(), ReadAudioFrameInfo( Read, Prefix, Info ) );
      EXPECT_EQ( rWritten, Info );
      for( const auto& rEntry : Read.GetMap() )
        EXPECT_EQ( 0u, rEntry.first.rfind( Prefix + "AudioFrameInfo.", 0 ) ) << rEntry.first;
    }
}

// UInt8 is 7 and Float32 is 6: a table written in row order would swap them silently.
TEST( AudioFrameInfo, EachSampleFormatNameMapsToItsOwnNumberUnknownOnesKeepTheField )
{
  for( std::uint32_t Value = 1; Value <= 9; ++Value )
  {
    IVideoAttributes Store;
    const IAudioFrameInfo Written{ static_cast< EAudioSampleFormat >( Value ), 48000, 2 };
    ASSERT_TRUE( WriteAudioFrameInfo( Store, "", Written ) );
    IAudioFrameInfo Read;
    EXPECT_TRUE( ReadAudioFrameInfo( Store, "", Read ) );
    EXPECT_EQ( Written, Read );
  }
  IVideoAttributes Store;
  WriteAudioFrameInfo( Store, "", { AudioSampleFormat_Float32, 48000, 2 } );
  std::string Text;
  Store.Get( "AudioFrameInfo.SampleFormat", Text );
  EXPECT_EQ( "Float32", Text );

  Store.Set( "AudioFrameInfo.SampleFormat", "float32" );
  IAudioFrameInfo Info{ AudioSampleFormat_Int32, 0, 0 };
  EXPECT_TRUE( ReadAudioFrameInfo( Store, "", Info ) );
  EXPECT_EQ( AudioSampleFormat_Int32, Info.SampleFormat );
  for( const char* pKey : { "SampleFormat", "SampleRate", "Channels" } )
  {
    IVideoAttributes Missing = Store;
    Missing.Remove( std::string( "AudioFrameInfo." ) + pKey );
    EXPECT_FALSE( ReadAudioFrameInfo( Missing, "", Info ) ) << pKey;
  }
  IAudioFrameInfo Kept{ AudioSampleFormat_Int8, 5, 5 };
  EXPECT_FALSE( ReadAudioFrameInfo( IVideoAttributes(), "", Kept ) );
  EXPECT_EQ( ( IAudioFrameInfo{ AudioSampleFormat_Int8, 5, 5 } ), Kept );
}

TEST( VideoTimingAndSettings, RatesAreNeededTheRestIsOptional )
{
  const IVideoTiming Written{ 1080000000u, 9000000u, -123456789012345 };
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoTiming( Store, Written ) );
  IVideoTiming Read;
  EXPECT_TRUE( ReadVideoTiming( ThroughBytes( Store ), Read ) );
  EXPECT_TRUE( Written == Read );
  Store.Remove( "StartOffsetInTicks" );
  EXPECT_TRUE( ReadVideoTiming( Store, Read ) );
  EXPECT_EQ( 0, Read.StartOffsetInTicks );
  for( const char* pKey : { "TicksPerSecond", "FramePeriodInTicks" } )
  {
    IVideoAttributes Missing = Store;
    Missing.Remove( pKey );
    IVideoTiming Default;
    EXPECT_FALSE( ReadVideoTiming( Missing, Default ) ) << pKey;
    EXPECT_TRUE( Default == IVideoTiming() ) << pKey;
  }

  ASSERT_TRUE( WriteVideoSettings( Store, "P.", { 0.25f, 2.2f } ) );
  IVideoSettings Settings;
  EXPECT_TRUE( ReadVideoSettings( ThroughBytes( Store ), "P.", Settings ) );
  EXPECT_EQ( ( IVideoSettings{ 0.25f, 2.2f } ), Settings );
  Store.Remove( "P.Saturation" );
  IVideoSettings Partial;
  EXPECT_FALSE( ReadVideoSettings( Store, "P.", Partial ) );
  EXPECT_EQ( ( IVideoSettings{ 1.0f, 2.2f } ), Partial );
}

// The keys are read in this order; the first one missing stops the read and leaves it and every
// later field as they were.
TEST( Timecode, RoundTripAndTheFirstMissingKeyStopsTheRead )
{
  const ITimecode Written{ TimecodeStandard_29_97_DF, 23, 59, 58, 29, 0xDEADBEEF, -3, 4504499, 1126125 };
  IVideoAttributes Store;
  ASSERT_TRUE( WriteTimecode( Store, Written ) );
  ITimecode Read;
  EXPECT_TRUE( ReadTimecode( ThroughBytes( Store ), Read ) );
  EXPECT_EQ( Written, Read );

  auto Fields = []( const ITimecode& i )
  {
    return std::vector< std::int64_t >{ i.Standards, i.Hours, i.Minutes,       i.Seconds,       i.Frames,
                                        i.UserBits,  i.Days,  i.TickRemainder, i.SubFramePeriod };
  };
  const ITimecode Sentinel{ 100, 100, 100, 100, 100, 100, 100, 100, 100 };
  const char* const Keys[] = { "Standards", "Hours", "Minutes",       "Seconds",       "Frames",
                               "UserBits",  "Days",  "TickRemainder", "SubFramePeriod" };
  for( std::size_t Missing = 0; Missing < 9; ++Missing )
  {
    SCOPED_TRACE( Keys[Missing] );
    IVideoAttributes Partial = Store;
    ASSERT_TRUE( Partial.Remove( std::string( "Timecode." ) + Keys[Missing] ) );
    Read = Sentinel;
    EXPECT_FALSE( ReadTimecode( Partial, Read ) );
    for( std::size_t i = 0; i < 9; ++i )
      EXPECT_EQ( Fields( i < Missing ? Written : Sentinel )[i], Fields( Read )[i] ) << Keys[i];
  }
}

// ---------------------------------------------------------------------------------------------
// Lens, camera and conversion records.

TEST( LensDistortion, WriterAndReaderAgree )
{
  const struct
  {
    const char* Name;
    VLensDistortionCalibration Lens;
    bool Writes;
    VLensDistortionCalibration Expected;
  } Cases[] = { { "two parameters", Lens( RadialModel_Lumek2Parameter, { -0.2, 0.05 }, 960.5, 540.25 ), true,
                  Lens( RadialModel_Lumek2Parameter, { -0.2, 0.05 }, 960.5, 540.25 ) },
                { "three parameters", Lens( RadialModel_Lumek3Parameter, { 1, 2, 3 }, -1, 0 ), true,
                  Lens( RadialModel_Lumek3Parameter, { 1, 2, 3 }, -1, 0 ) },
                { "zero parameters: the write fails but reads", Lens( RadialModel_Lumek0Parameter, { 4, 5 }, 1, 2 ),
                  false, Lens( RadialModel_Lumek0Parameter, {}, 1, 2 ) },
                { "bad model reads without parameters", Lens( RadialModel_BadRadialModel, {}, 3, 4 ), false,
                  Lens( RadialModel_BadRadialModel, {}, 3, 4 ) } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Name );
    IVideoAttributes Store;
    EXPECT_EQ( rCase.Writes, WriteLensDistortionCalibration( Store, "Q.", rCase.Lens ) );
    VLensDistortionCalibration Read;
    Read.RadialDistortionParameters = { 7, 7, 7, 7 };
    EXPECT_TRUE( ReadLensDistortionCalibration( ThroughBytes( Store ), "Q.", Read ) );
    EXPECT_EQ( rCase.Expected, Read );
  }
}

TEST( LensDistortion, ModelTextAndCentreAreRequired )
{
  IVideoAttributes Store;
  WriteLensDistortionCalibration( Store, "", Lens( RadialModel_Lumek2Parameter, { 1, 2 }, 3, 4 ) );
  for( const char* pKey :
       { "RadialModel", "RadialDistortionCentre_X", "RadialDistortionCentre_Y", "RadialDistortionParameters_1" } )
  {
    IVideoAttributes Missing = Store;
    Missing.Remove( std::string( "LensDistortionCalibration." ) + pKey );
    VLensDistortionCalibration Read;
    EXPECT_FALSE( ReadLensDistortionCalibration( Missing, "", Read ) ) << pKey;
  }
  Store.Set( "LensDistortionCalibration.RadialModel", "Lumek4Parameter" );
  VLensDistortionCalibration Read;
  EXPECT_FALSE( ReadLensDistortionCalibration( Store, "", Read ) );
  EXPECT_EQ( VLensDistortionCalibration(), Read );
}

// The required keys are read in this order and the first absent one stops the chain; the serial
// number is not required and is read anyway.
TEST( CameraHardware, RoundTripAndTheFirstAbsentKeyStopsTheChain )
{
  const VCameraHardware Camera{ "urn:lumek:camera:0042", "SN-12", "Vantage", "Vantage V16", 4096, 3072, 1.25 };
  IVideoAttributes Store;
  ASSERT_TRUE( WriteCameraHardware( Store, Camera ) );
  VCameraHardware Read;
  EXPECT_TRUE( ReadCameraHardware( ThroughBytes( Store ), Read ) );
  EXPECT_EQ( Camera, Read );

  const char* const Chain[] = { "DeviceURN",           "DisplayType", "PixelAspectRatio", "SensorHeightInPixels",
                                "SensorWidthInPixels", "Type",        "SerialNumber" };
  for( int Missing = 0; Missing < 7; ++Missing )
  {
    SCOPED_TRACE( Chain[Missing] );
    IVideoAttributes Partial = Store;
    Partial.Remove( std::string( "CameraHardware." ) + Chain[Missing] );
    Read = { "old", "old", "old", "old", 9, 9, 9.0 };
    EXPECT_EQ( Missing == 6, ReadCameraHardware( Partial, Read ) );
    EXPECT_EQ( Missing == 6 ? "old" : Camera.SerialNumber, Read.SerialNumber );
    const bool bRead[] = { Read.DeviceURN == Camera.DeviceURN,
                           Read.DisplayType == Camera.DisplayType,
                           Read.PixelAspectRatio == Camera.PixelAspectRatio,
                           Read.SensorHeightInPixels == Camera.SensorHeightInPixels,
                           Read.SensorWidthInPixels == Camera.SensorWidthInPixels,
                           Read.Type == Camera.Type };
    for( int i = 0; i < 6; ++i )
      EXPECT_EQ( i < Missing, bRead[i] ) << Chain[i];
  }
}

TEST( ConversionRecords, RoundTripInOrderAndAGapEndsTheList )
{
  std::vector< VConversionRecord > Records(
      11, { VideoContainer_IMAGES, {}, {}, AudioPayload_None, VideoPayload_ImageTIFF, PixelFormat_Unspecified, {} } );
  Records[0] = { VideoContainer_AVI,
                 { 0.5f, 1.8f },
                 { AudioSampleFormat_UInt8, 22050, 1 },
                 AudioPayload_Uncompressed,
                 VideoPayload_VideoH264,
                 PixelFormat_PlanarY8U8V8,
                 Lens( RadialModel_Lumek3Parameter, { 0.1, 0.2, 0.3 }, 5, 6 ) };
  IVideoAttributes Store;
  ASSERT_TRUE( WriteConversionRecords( Store, Records ) );
  std::string Container;
  EXPECT_TRUE( Store.Get( "ConversionRecord.10.Container", Container ) );
  EXPECT_EQ( "IMAGES", Container );

  std::vector< VConversionRecord > Read( 1 );
  ReadConversionRecords( ThroughBytes( Store ), Read );
  ASSERT_EQ( Records.size(), Read.size() );
  // Written again, what was read gives the same keys: no field lost, moved or changed.
  IVideoAttributes Again;
  ASSERT_TRUE( WriteConversionRecords( Again, Read ) );
  EXPECT_TRUE( Again == Store );

  // A record without its pixel format ends the list; an unknown container text keeps the default.
  Store.Remove( "ConversionRecord.1.VideoFrameInfo.PixelFormat" );
  Store.Set( "ConversionRecord.0.Container", "avi" );
  ReadConversionRecords( Store, Read );
  ASSERT_EQ( 1u, Read.size() );
  EXPECT_EQ( VideoContainer_LVID, Read[0].Container );
}
