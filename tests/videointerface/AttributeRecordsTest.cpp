#include "videointerface/AttributeRecords.h"

#include "tests/support/TestNames.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

using namespace ZOL;
using CoreLumekTypes::VCameraHardware;
using CoreLumekTypes::VLensDistortionCalibration;

namespace
{
  // Writes, serialises, reads the bytes back: what a record goes through between a writer and
  // a reader in two different programs.
  IVideoAttributes ThroughBytes( const IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    EXPECT_TRUE( i_rStore.WriteTo( Stream ) );
    UtilsIO::VMemoryInputStream Input( Stream.GetData().data(), Stream.GetData().size() );
    IVideoAttributes Read;
    EXPECT_TRUE( Read.ReadFrom( Input ) );
    return Read;
  }

  IVideoFrameInfo Frame( std::int32_t i_Width, std::int32_t i_Height, EPixelFormat i_Format )
  {
    IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    Info.PixelAspectRatio = 1.0;
    return Info;
  }
} // namespace

// ---------------------------------------------------------------------------------------------
// Frame description.

struct VFrameCase
{
  std::string Name;
  IVideoFrameInfo Info;
};

class FrameInfoRoundTripTest : public testing::TestWithParam< VFrameCase >
{
};

TEST_P( FrameInfoRoundTripTest, WriterAndReaderAgree )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, GetParam().Info ) );
  const IVideoAttributes Read = ThroughBytes( Store );
  IVideoFrameInfo Info = Frame( 9, 9, PixelFormat_R5G6B5 );
  Info.Flags = ~0u;
  EXPECT_TRUE( ReadVideoFrameInfo( Read, Read, Info ) );
  EXPECT_EQ( GetParam().Info, Info );
}

std::vector< VFrameCase > FrameCases()
{
  std::vector< VFrameCase > Cases;
  for( std::uint32_t Format = 1; Format < PixelFormatCount; ++Format )
    Cases.push_back( { ToString( static_cast< EPixelFormat >( Format ) ),
                       Frame( 640, 480, static_cast< EPixelFormat >( Format ) ) } );
  IVideoFrameInfo Odd = Frame( 1, 1, PixelFormat_BayerGB8 );
  Odd.TwiceOffsetX = 3;
  Odd.TwiceOffsetY = 65535;
  Odd.SensorPixelsPerImagePixelX = 2;
  Odd.SensorPixelsPerImagePixelY = 255;
  Odd.Flags = IVideoFrameInfo::Flag_Inverted;
  Odd.PixelAspectRatio = 0.9;
  Odd.InterlacedFormat = InterlacedFormat_InterlacedFrameOddOlder;
  Cases.push_back( { "OddHalfPixelOffsetsInvertedInterlaced", Odd } );
  IVideoFrameInfo Large = Frame( 0x7FFFFFFF, 0x7FFFFFFF, PixelFormat_U10Y10V10Y10 );
  Large.InterlacedFormat = InterlacedFormat_InterlacedFrameUnspecifiedLineTiming;
  Cases.push_back( { "LargestSize", Large } );
  return Cases;
}

INSTANTIATE_TEST_SUITE_P( Records, FrameInfoRoundTripTest, testing::ValuesIn( FrameCases() ), LumekTest::VCaseName() );

TEST( FrameInfo, NoVideoWritesOnlyPresentFalseAndReadsBackAsDefault )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, IVideoFrameInfo() ) );
  EXPECT_EQ( 1u, Store.Size() );
  IVideoFrameInfo Info = Frame( 640, 480, PixelFormat_Luminance8 );
  Info.PixelAspectRatio = 2.0;
  EXPECT_TRUE( ReadVideoFrameInfo( Store, Store, Info ) );
  EXPECT_EQ( IVideoFrameInfo(), Info );
  EXPECT_EQ( 0.0, Info.PixelAspectRatio );
}

TEST( FrameInfo, UnusableDescriptionsAreNotWritten )
{
  for( const IVideoFrameInfo& rInfo :
       { Frame( 0, 480, PixelFormat_Luminance8 ), Frame( 640, -1, PixelFormat_Luminance8 ),
         Frame( 640, 480, PixelFormat_Unspecified ), Frame( 640, 480, static_cast< EPixelFormat >( 20 ) ) } )
  {
    IVideoAttributes Store;
    EXPECT_FALSE( WriteVideoFrameInfo( Store, rInfo ) );
    EXPECT_TRUE( Store.Empty() );
  }
}

TEST( FrameInfo, AbsentPresentKeyLeavesTheRecord )
{
  IVideoAttributes Store;
  WriteVideoFrameInfo( Store, Frame( 4, 4, PixelFormat_Luminance8 ) );
  Store.Remove( "VideoFrameInfo.Present" );
  IVideoFrameInfo Info = Frame( 2, 2, PixelFormat_R8G8B8 );
  EXPECT_FALSE( ReadVideoFrameInfo( Store, Store, Info ) );
  EXPECT_EQ( Frame( 2, 2, PixelFormat_R8G8B8 ), Info );
}

struct VOffsetCase
{
  std::string Name;
  std::function< void( IVideoAttributes& ) > Keys;
  bool Read;
  std::uint16_t TwiceOffsetX;
};

class FrameOffsetTest : public testing::TestWithParam< VOffsetCase >
{
};

TEST_P( FrameOffsetTest, TwiceOffsetWinsOverTheWholeOffset )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, Frame( 8, 8, PixelFormat_BayerRG8 ) ) );
  Store.Remove( "VideoFrameInfo.ImageX" );
  Store.Remove( "VideoFrameInfo.TwiceOffsetX" );
  GetParam().Keys( Store );
  IVideoFrameInfo Info;
  EXPECT_EQ( GetParam().Read, ReadVideoFrameInfo( Store, Store, Info ) );
  if( GetParam().Read )
  {
    EXPECT_EQ( GetParam().TwiceOffsetX, Info.TwiceOffsetX );
  }
}

INSTANTIATE_TEST_SUITE_P(
    Keys, FrameOffsetTest,
    testing::Values( VOffsetCase{ "TwiceOffsetAlone",
                                  []( IVideoAttributes& s )
                                  { s.Set( "VideoFrameInfo.TwiceOffsetX", std::uint16_t( 3 ) ); },
                                  true, 3 },
                     VOffsetCase{ "WholeOffsetIsDoubled",
                                  []( IVideoAttributes& s ) { s.Set( "VideoFrameInfo.ImageX", 3u ); }, true, 6 },
                     VOffsetCase{ "BothPresentTwiceWins",
                                  []( IVideoAttributes& s )
                                  {
                                    s.Set( "VideoFrameInfo.ImageX", 100u );
                                    s.Set( "VideoFrameInfo.TwiceOffsetX", std::uint16_t( 7 ) );
                                  },
                                  true, 7 },
                     VOffsetCase{ "WholeOffsetWrapsInto16Bits",
                                  []( IVideoAttributes& s ) { s.Set( "VideoFrameInfo.ImageX", 0x8001u ); }, true, 2 },
                     VOffsetCase{ "WrongTypeCountsAsAbsent",
                                  []( IVideoAttributes& s ) { s.Set( "VideoFrameInfo.ImageX", std::int32_t( 3 ) ); },
                                  false, 0 },
                     VOffsetCase{ "NeitherPresent", []( IVideoAttributes& ) {}, false, 0 } ),
    LumekTest::VCaseName() );

class FrameRequiredKeyTest : public testing::TestWithParam< std::string >
{
};

TEST_P( FrameRequiredKeyTest, MissingKeyFailsTheRead )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, Frame( 8, 8, PixelFormat_BayerRG8 ) ) );
  ASSERT_TRUE( Store.Remove( "VideoFrameInfo." + GetParam() ) );
  IVideoFrameInfo Info;
  EXPECT_FALSE( ReadVideoFrameInfo( Store, Store, Info ) );
}

INSTANTIATE_TEST_SUITE_P( Keys, FrameRequiredKeyTest,
                          testing::Values( "ImageWidth", "ImageHeight", "PixelFormat", "Inverted", "PixelAspectRatio" ),
                          []( const testing::TestParamInfo< std::string >& i_rInfo ) { return i_rInfo.param; } );

TEST( FrameInfo, OptionalKeysTakeTheirDefaults )
{
  IVideoAttributes Store;
  IVideoFrameInfo Written = Frame( 8, 8, PixelFormat_BayerRG8 );
  Written.SensorPixelsPerImagePixelX = 4;
  Written.InterlacedFormat = InterlacedFormat_NotInterlaced;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, Written ) );
  Store.Remove( "VideoFrameInfo.SensorPixelsPerImagePixelX" );
  Store.Remove( "VideoFrameInfo.InterlacedFormat" );
  IVideoFrameInfo Info;
  Info.SensorPixelsPerImagePixelX = 9;
  Info.InterlacedFormat = InterlacedFormat_InterlacedFrameEvenOlder;
  ASSERT_TRUE( ReadVideoFrameInfo( Store, Store, Info ) );
  EXPECT_EQ( 1, Info.SensorPixelsPerImagePixelX );
  EXPECT_EQ( InterlacedFormat_Unspecified, Info.InterlacedFormat );
}

TEST( FrameInfo, UnknownTextsKeepFormatAndClearInterlacing )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, Frame( 8, 8, PixelFormat_BayerRG8 ) ) );
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

TEST( FrameInfo, WidthBeyondSigned32IsInvalid )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoFrameInfo( Store, Frame( 8, 8, PixelFormat_BayerRG8 ) ) );
  Store.Set( "VideoFrameInfo.ImageWidth", 0x80000000u );
  IVideoFrameInfo Info;
  EXPECT_FALSE( ReadVideoFrameInfo( Store, Store, Info ) );
}

// ---------------------------------------------------------------------------------------------
// The conversion distortion flag, decided by the outer store.

struct VDistortionCase
{
  std::string Name;
  std::function< void( IVideoAttributes& ) > Outer;
  bool Flag;
};

class ConversionDistortionTest : public testing::TestWithParam< VDistortionCase >
{
};

VConversionRecord RecordWithLens( std::vector< double > i_Parameters )
{
  VConversionRecord Record;
  Record.LensDistortionCalibration.RadialModel =
      i_Parameters.size() == 3 ? RadialModel_Lumek3Parameter : RadialModel_Lumek2Parameter;
  Record.LensDistortionCalibration.RadialDistortionParameters = std::move( i_Parameters );
  return Record;
}

TEST_P( ConversionDistortionTest, FlagFollowsTheHistory )
{
  IVideoAttributes FrameKeys, Outer;
  ASSERT_TRUE( WriteVideoFrameInfo( FrameKeys, Frame( 8, 8, PixelFormat_BayerRG8 ) ) );
  GetParam().Outer( Outer );
  IVideoFrameInfo Info;
  Info.Flags = GetParam().Flag ? 0u : static_cast< std::uint32_t >( IVideoFrameInfo::Flag_HasConversionDistortion );
  ASSERT_TRUE( ReadVideoFrameInfo( FrameKeys, ThroughBytes( Outer ), Info ) );
  EXPECT_EQ( GetParam().Flag, Info.HasConversionDistortion() );
  // The frame keys' own store does not decide.
  IVideoFrameInfo Single;
  ASSERT_TRUE( ReadVideoFrameInfo( FrameKeys, FrameKeys, Single ) );
  EXPECT_FALSE( Single.HasConversionDistortion() );
}

INSTANTIATE_TEST_SUITE_P(
    History, ConversionDistortionTest,
    testing::Values(
        VDistortionCase{ "NoHistory", []( IVideoAttributes& ) {}, false },
        VDistortionCase{ "HistoryWithLens",
                         []( IVideoAttributes& s ) {
                           WriteConversionRecords( s, { RecordWithLens( { 0.0, -0.2 } ) } );
                         },
                         true },
        VDistortionCase{ "HistoryWithZeroLens",
                         []( IVideoAttributes& s ) {
                           WriteConversionRecords( s, { RecordWithLens( { 0.0, 0.0 } ) } );
                         },
                         false },
        VDistortionCase{
            "LensInTheLaterRecord",
            []( IVideoAttributes& s ) {
              WriteConversionRecords( s, { RecordWithLens( { 0.0, 0.0 } ), RecordWithLens( { 0.0, 0.0, 1e-9 } ) } );
            },
            true },
        VDistortionCase{ "RecordingHasItsOwnLens",
                         []( IVideoAttributes& s )
                         {
                           WriteConversionRecords( s, { RecordWithLens( { 0.1, 0.2 } ) } );
                           s.Set( "LensDistortionCalibration.RadialModel", 0 ); // any type counts
                         },
                         false },
        VDistortionCase{
            "LensOnlyBehindAGap",
            []( IVideoAttributes& s )
            {
              WriteConversionRecords( s, { RecordWithLens( { 0.0, 0.0 } ), RecordWithLens( { 0.5, 0.0 } ) } );
              for( const char* pKey : { "Container", "AudioPayload", "VideoPayload" } )
                s.Remove( std::string( "ConversionRecord.0." ) + pKey );
            },
            false } ),
    LumekTest::VCaseName() );

// ---------------------------------------------------------------------------------------------
// Audio, timing, settings, timecode.

struct VAudioCase
{
  std::string Name;
  IAudioFrameInfo Info;
  bool Usable;
};

class AudioRoundTripTest : public testing::TestWithParam< std::tuple< VAudioCase, std::string > >
{
};

TEST_P( AudioRoundTripTest, WriterAndReaderAgreeUnderAnyPrefix )
{
  const VAudioCase& rCase = std::get< 0 >( GetParam() );
  const std::string& rPrefix = std::get< 1 >( GetParam() );
  IVideoAttributes Store;
  ASSERT_TRUE( WriteAudioFrameInfo( Store, rPrefix, rCase.Info ) );
  const IVideoAttributes Read = ThroughBytes( Store );
  IAudioFrameInfo Info{ AudioSampleFormat_Int8, 1, 1 };
  EXPECT_EQ( rCase.Usable, ReadAudioFrameInfo( Read, rPrefix, Info ) );
  EXPECT_EQ( rCase.Info, Info );
  for( const auto& rEntry : Read.GetMap() )
    EXPECT_EQ( 0u, rEntry.first.rfind( rPrefix + "AudioFrameInfo.", 0 ) ) << rEntry.first;
}

INSTANTIATE_TEST_SUITE_P(
    Records, AudioRoundTripTest,
    testing::Combine( testing::Values( VAudioCase{ "NoAudio", {}, true },
                                       VAudioCase{ "Float32Stereo", { AudioSampleFormat_Float32, 48000, 2 }, true },
                                       VAudioCase{ "UInt8Mono", { AudioSampleFormat_UInt8, 8000, 1 }, true },
                                       VAudioCase{ "Int24Many", { AudioSampleFormat_Int24, 192000, 64 }, true },
                                       VAudioCase{ "ZeroChannels", { AudioSampleFormat_Int16, 44100, 0 }, false } ),
                      testing::Values( std::string(), std::string( "ConversionRecord.3." ) ) ),
    []( const testing::TestParamInfo< std::tuple< VAudioCase, std::string > >& i_rInfo )
    { return std::get< 0 >( i_rInfo.param ).Name + ( std::get< 1 >( i_rInfo.param ).empty() ? "" : "Prefixed" ); } );

TEST( AudioFrameInfo, EachSampleFormatNameMapsToItsOwnNumber )
{
  // UInt8 is 7 and Float32 is 6: a table written in row order would swap them silently.
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
}

TEST( AudioFrameInfo, UnknownFormatKeepsTheFieldAndMissingKeysFail )
{
  IVideoAttributes Store;
  WriteAudioFrameInfo( Store, "", { AudioSampleFormat_Int16, 48000, 2 } );
  Store.Set( "AudioFrameInfo.SampleFormat", "int16" );
  IAudioFrameInfo Info{ AudioSampleFormat_Int32, 0, 0 };
  EXPECT_TRUE( ReadAudioFrameInfo( Store, "", Info ) );
  EXPECT_EQ( AudioSampleFormat_Int32, Info.SampleFormat );

  for( const char* pKey : { "AudioFrameInfo.SampleFormat", "AudioFrameInfo.SampleRate", "AudioFrameInfo.Channels" } )
  {
    IVideoAttributes Missing;
    WriteAudioFrameInfo( Missing, "", { AudioSampleFormat_Int16, 48000, 2 } );
    Missing.Remove( pKey );
    IAudioFrameInfo Read;
    EXPECT_FALSE( ReadAudioFrameInfo( Missing, "", Read ) ) << pKey;
  }
  IAudioFrameInfo Kept{ AudioSampleFormat_Int8, 5, 5 };
  EXPECT_FALSE( ReadAudioFrameInfo( IVideoAttributes(), "", Kept ) );
  EXPECT_EQ( ( IAudioFrameInfo{ AudioSampleFormat_Int8, 5, 5 } ), Kept );
}

TEST( VideoTiming, BothRatesNeededStartOffsetOptional )
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
    IVideoAttributes Missing;
    WriteVideoTiming( Missing, Written );
    Missing.Remove( pKey );
    IVideoTiming Default;
    EXPECT_FALSE( ReadVideoTiming( Missing, Default ) ) << pKey;
    EXPECT_TRUE( Default == IVideoTiming() ) << pKey;
  }
}

TEST( VideoSettings, EachKeyIsOptional )
{
  IVideoAttributes Store;
  ASSERT_TRUE( WriteVideoSettings( Store, "P.", { 0.25f, 2.2f } ) );
  IVideoSettings Read;
  EXPECT_TRUE( ReadVideoSettings( ThroughBytes( Store ), "P.", Read ) );
  EXPECT_EQ( ( IVideoSettings{ 0.25f, 2.2f } ), Read );

  Store.Remove( "P.Saturation" );
  IVideoSettings Partial;
  EXPECT_FALSE( ReadVideoSettings( Store, "P.", Partial ) );
  EXPECT_EQ( 1.0f, Partial.Saturation );
  EXPECT_EQ( 2.2f, Partial.GammaCorrection );
}

TEST( Timecode, RoundTripCarriesEveryField )
{
  ITimecode Written;
  Written.Standards = TimecodeStandard_29_97_DF;
  Written.Hours = 23;
  Written.Minutes = 59;
  Written.Seconds = 58;
  Written.Frames = 29;
  Written.UserBits = 0xDEADBEEF;
  Written.Days = -3;
  Written.TickRemainder = 4504499;
  Written.SubFramePeriod = 1126125;
  IVideoAttributes Store;
  ASSERT_TRUE( WriteTimecode( Store, Written ) );
  ITimecode Read;
  EXPECT_TRUE( ReadTimecode( ThroughBytes( Store ), Read ) );
  EXPECT_EQ( Written, Read );
}

class TimecodeKeyTest : public testing::TestWithParam< int >
{
};

const char* const s_TimecodeKeys[] = { "Timecode.Standards", "Timecode.Hours",         "Timecode.Minutes",
                                       "Timecode.Seconds",   "Timecode.Frames",        "Timecode.UserBits",
                                       "Timecode.Days",      "Timecode.TickRemainder", "Timecode.SubFramePeriod" };

TEST_P( TimecodeKeyTest, FirstMissingKeyStopsAndLeavesTheLaterFields )
{
  ITimecode Written;
  Written.Standards = 2;
  Written.Hours = 1;
  Written.Minutes = 2;
  Written.Seconds = 3;
  Written.Frames = 4;
  Written.UserBits = 5;
  Written.Days = 6;
  Written.TickRemainder = 7;
  Written.SubFramePeriod = 8;
  IVideoAttributes Store;
  WriteTimecode( Store, Written );
  ASSERT_TRUE( Store.Remove( s_TimecodeKeys[GetParam()] ) );

  ITimecode Sentinel;
  Sentinel.Standards = 100;
  Sentinel.Hours = Sentinel.Minutes = Sentinel.Seconds = Sentinel.Frames = 100;
  Sentinel.UserBits = Sentinel.TickRemainder = Sentinel.SubFramePeriod = 100;
  Sentinel.Days = 100;
  ITimecode Read = Sentinel;
  EXPECT_FALSE( ReadTimecode( Store, Read ) );

  const std::uint64_t ReadFields[] = { Read.Standards,
                                       Read.Hours,
                                       Read.Minutes,
                                       Read.Seconds,
                                       Read.Frames,
                                       Read.UserBits,
                                       static_cast< std::uint64_t >( Read.Days ),
                                       Read.TickRemainder,
                                       Read.SubFramePeriod };
  for( int i = 0; i < 9; ++i )
    EXPECT_EQ( i < GetParam() ? ( i == 0 ? 2u : static_cast< std::uint64_t >( i ) ) : 100u, ReadFields[i] )
        << s_TimecodeKeys[i];
}

INSTANTIATE_TEST_SUITE_P( Keys, TimecodeKeyTest, testing::Range( 0, 9 ),
                          []( const testing::TestParamInfo< int >& i_rInfo )
                          { return LumekTest::TextCaseName( s_TimecodeKeys[i_rInfo.param] ); } );

// ---------------------------------------------------------------------------------------------
// Lens, camera and conversion records.

struct VLensCase
{
  std::string Name;
  VLensDistortionCalibration Lens;
  bool Writes;
  VLensDistortionCalibration Expected;
};

class LensRoundTripTest : public testing::TestWithParam< VLensCase >
{
};

TEST_P( LensRoundTripTest, WriterAndReaderAgree )
{
  IVideoAttributes Store;
  EXPECT_EQ( GetParam().Writes, WriteLensDistortionCalibration( Store, "Q.", GetParam().Lens ) );
  VLensDistortionCalibration Read;
  Read.RadialDistortionParameters = { 7, 7, 7, 7 };
  EXPECT_TRUE( ReadLensDistortionCalibration( ThroughBytes( Store ), "Q.", Read ) );
  EXPECT_EQ( GetParam().Expected, Read );
}

VLensDistortionCalibration Lens( ERadialModel i_Model, std::vector< double > i_Parameters, double i_X, double i_Y )
{
  VLensDistortionCalibration Calibration;
  Calibration.RadialModel = i_Model;
  Calibration.RadialDistortionParameters = std::move( i_Parameters );
  Calibration.RadialDistortionCentre_X = i_X;
  Calibration.RadialDistortionCentre_Y = i_Y;
  return Calibration;
}

INSTANTIATE_TEST_SUITE_P(
    Models, LensRoundTripTest,
    testing::Values( VLensCase{ "TwoParameters", Lens( RadialModel_Lumek2Parameter, { -0.2, 0.05 }, 960.5, 540.25 ),
                                true, Lens( RadialModel_Lumek2Parameter, { -0.2, 0.05 }, 960.5, 540.25 ) },
                     VLensCase{ "ThreeParameters", Lens( RadialModel_Lumek3Parameter, { 1, 2, 3 }, -1, 0 ), true,
                                Lens( RadialModel_Lumek3Parameter, { 1, 2, 3 }, -1, 0 ) },
                     VLensCase{ "ZeroParametersWriteFailsButReads", Lens( RadialModel_Lumek0Parameter, { 4, 5 }, 1, 2 ),
                                false, Lens( RadialModel_Lumek0Parameter, {}, 1, 2 ) },
                     VLensCase{ "BadModelReadsWithoutParameters", Lens( RadialModel_BadRadialModel, {}, 3, 4 ), false,
                                Lens( RadialModel_BadRadialModel, {}, 3, 4 ) } ),
    LumekTest::VCaseName() );

TEST( LensDistortion, ModelTextAndCentreAreRequired )
{
  auto Make = []( IVideoAttributes& o_rStore ) {
    WriteLensDistortionCalibration( o_rStore, "", Lens( RadialModel_Lumek2Parameter, { 1, 2 }, 3, 4 ) );
  };
  for( const char* pKey :
       { "LensDistortionCalibration.RadialModel", "LensDistortionCalibration.RadialDistortionCentre_X",
         "LensDistortionCalibration.RadialDistortionCentre_Y",
         "LensDistortionCalibration.RadialDistortionParameters_1" } )
  {
    IVideoAttributes Store;
    Make( Store );
    Store.Remove( pKey );
    VLensDistortionCalibration Read;
    EXPECT_FALSE( ReadLensDistortionCalibration( Store, "", Read ) ) << pKey;
  }
  IVideoAttributes Store;
  Make( Store );
  Store.Set( "LensDistortionCalibration.RadialModel", "Lumek4Parameter" );
  VLensDistortionCalibration Read;
  EXPECT_FALSE( ReadLensDistortionCalibration( Store, "", Read ) );
  EXPECT_EQ( VLensDistortionCalibration(), Read );
}

TEST( CameraHardware, RoundTrip )
{
  VCameraHardware Camera;
  Camera.DeviceURN = "urn:lumek:camera:0042";
  Camera.SerialNumber = "SN-12";
  Camera.Type = "Vantage";
  Camera.DisplayType = "Vantage V16";
  Camera.SensorWidthInPixels = 4096;
  Camera.SensorHeightInPixels = 3072;
  Camera.PixelAspectRatio = 1.25;
  IVideoAttributes Store;
  ASSERT_TRUE( WriteCameraHardware( Store, Camera ) );
  VCameraHardware Read;
  EXPECT_TRUE( ReadCameraHardware( ThroughBytes( Store ), Read ) );
  EXPECT_EQ( Camera, Read );
}

class CameraChainTest : public testing::TestWithParam< int >
{
};

const char* const s_Chain[] = { "CameraHardware.DeviceURN",           "CameraHardware.DisplayType",
                                "CameraHardware.PixelAspectRatio",    "CameraHardware.SensorHeightInPixels",
                                "CameraHardware.SensorWidthInPixels", "CameraHardware.Type" };

TEST_P( CameraChainTest, FirstAbsentKeyStopsTheChainButSerialIsReadAnyway )
{
  VCameraHardware Camera;
  Camera.DeviceURN = "urn";
  Camera.DisplayType = "display";
  Camera.PixelAspectRatio = 2.0;
  Camera.SensorHeightInPixels = 10;
  Camera.SensorWidthInPixels = 20;
  Camera.Type = "type";
  Camera.SerialNumber = "serial";
  IVideoAttributes Store;
  WriteCameraHardware( Store, Camera );
  Store.Remove( s_Chain[GetParam()] );

  VCameraHardware Read;
  Read.DeviceURN = Read.DisplayType = Read.Type = "old";
  Read.PixelAspectRatio = 9.0;
  Read.SensorHeightInPixels = Read.SensorWidthInPixels = 9;
  EXPECT_FALSE( ReadCameraHardware( Store, Read ) );
  EXPECT_EQ( "serial", Read.SerialNumber );
  const bool bRead[] = { Read.DeviceURN == "urn",         Read.DisplayType == "display",  Read.PixelAspectRatio == 2.0,
                         Read.SensorHeightInPixels == 10, Read.SensorWidthInPixels == 20, Read.Type == "type" };
  for( int i = 0; i < 6; ++i )
    EXPECT_EQ( i < GetParam(), bRead[i] ) << s_Chain[i];
}

INSTANTIATE_TEST_SUITE_P( Keys, CameraChainTest, testing::Range( 0, 6 ),
                          []( const testing::TestParamInfo< int >& i_rInfo )
                          { return LumekTest::TextCaseName( s_Chain[i_rInfo.param] ); } );

TEST( CameraHardware, SerialNumberIsNotRequired )
{
  VCameraHardware Camera;
  Camera.DeviceURN = "urn";
  IVideoAttributes Store;
  WriteCameraHardware( Store, Camera );
  Store.Remove( "CameraHardware.SerialNumber" );
  VCameraHardware Read;
  Read.SerialNumber = "kept";
  EXPECT_TRUE( ReadCameraHardware( Store, Read ) );
  EXPECT_EQ( "kept", Read.SerialNumber );
}

TEST( ConversionRecords, RoundTripInOrder )
{
  VConversionRecord First;
  First.Container = VideoContainer_AVI;
  First.VideoSettings = { 0.5f, 1.8f };
  First.AudioFrameInfo = { AudioSampleFormat_UInt8, 22050, 1 };
  First.AudioPayload = AudioPayload_Uncompressed;
  First.VideoPayload = VideoPayload_VideoH264;
  First.PixelFormat = PixelFormat_PlanarY8U8V8;
  First.LensDistortionCalibration = Lens( RadialModel_Lumek3Parameter, { 0.1, 0.2, 0.3 }, 5, 6 );
  VConversionRecord Second;
  Second.Container = VideoContainer_IMAGES;
  Second.VideoPayload = VideoPayload_ImageTIFF;
  std::vector< VConversionRecord > Records( 11, Second );
  Records[0] = First;

  IVideoAttributes Store;
  ASSERT_TRUE( WriteConversionRecords( Store, Records ) );
  std::string Container;
  EXPECT_TRUE( Store.Get( "ConversionRecord.10.Container", Container ) );
  EXPECT_EQ( "IMAGES", Container );

  std::vector< VConversionRecord > Read( 1 );
  ReadConversionRecords( ThroughBytes( Store ), Read );
  ASSERT_EQ( Records.size(), Read.size() );
  for( std::size_t i = 0; i < Records.size(); ++i )
  {
    EXPECT_EQ( Records[i].Container, Read[i].Container ) << i;
    EXPECT_EQ( Records[i].VideoSettings, Read[i].VideoSettings ) << i;
    EXPECT_EQ( Records[i].AudioFrameInfo, Read[i].AudioFrameInfo ) << i;
    EXPECT_EQ( Records[i].AudioPayload, Read[i].AudioPayload ) << i;
    EXPECT_EQ( Records[i].VideoPayload, Read[i].VideoPayload ) << i;
    EXPECT_EQ( Records[i].PixelFormat, Read[i].PixelFormat ) << i;
    EXPECT_EQ( Records[i].LensDistortionCalibration, Read[i].LensDistortionCalibration ) << i;
  }
}

TEST( ConversionRecords, GapEndsTheListAndUnknownTextsKeepDefaults )
{
  IVideoAttributes Store;
  std::vector< VConversionRecord > Written( 3 );
  Written[2].Container = VideoContainer_MKV;
  WriteConversionRecords( Store, Written );
  Store.Remove( "ConversionRecord.1.VideoFrameInfo.PixelFormat" );
  Store.Set( "ConversionRecord.0.Container", "lvid" );
  std::vector< VConversionRecord > Read;
  ReadConversionRecords( Store, Read );
  ASSERT_EQ( 1u, Read.size() );
  EXPECT_EQ( VideoContainer_LVID, Read[0].Container );
}
