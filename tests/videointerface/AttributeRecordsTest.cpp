#include "videointerface/AttributeRecords.h"

#include "tests/videointerface/AttributeTestSupport.h"

#include <gtest/gtest.h>

using namespace ZOL;
using CoreLumekTypes::VCameraHardware;
using CoreLumekTypes::VLensDistortionCalibration;
using LumekTest::Frame;
using LumekTest::Lens;

namespace
{
  // One of every record a recording's header holds, the audio, settings and lens under prefixes.
  struct VRecords
  {
    IVideoFrameInfo Frame;
    IAudioFrameInfo Audio;
    IVideoTiming Timing;
    IVideoSettings Settings;
    ITimecode Timecode;
    VLensDistortionCalibration Lens;
    VCameraHardware Camera;

    // Which records read, in the order of the fields.
    std::vector< bool > ReadFrom( const IVideoAttributes& i_rStore )
    {
      return { ReadVideoFrameInfo( i_rStore, i_rStore, Frame ),
               ReadAudioFrameInfo( i_rStore, "A.", Audio ),
               ReadVideoTiming( i_rStore, Timing ),
               ReadVideoSettings( i_rStore, "P.", Settings ),
               ReadTimecode( i_rStore, Timecode ),
               ReadLensDistortionCalibration( i_rStore, "Q.", Lens ),
               ReadCameraHardware( i_rStore, Camera ) };
    }
  };

  // The oddest fields: half-pixel offsets, an inverted interlaced frame of the largest width.
  IVideoAttributes OddHeader( VRecords& o_rWritten )
  {
    o_rWritten = { { 3, 65535, 2, 255, 0x7FFFFFFF, 1, PixelFormat_BayerGB8, IVideoFrameInfo::Flag_Inverted, 0.9,
                     InterlacedFormat_InterlacedFrameOddOlder },
                   { AudioSampleFormat_Int24, 192000, 64 },
                   { 1080000000u, 9000000u, -123456789012345 },
                   { 0.25f, 2.2f },
                   { TimecodeStandard_29_97_DF, 23, 59, 58, 29, 0xDEADBEEF, -3, 4504499, 1126125 },
                   Lens( RadialModel_Lumek2Parameter, { -0.2, 0.05 }, 960.5, 7 ),
                   { "urn:lumek:camera:0042", "SN-12", "Vantage", "Vantage V16", 4096, 3072, 1.25 } };
    IVideoAttributes Store;
    const VRecords& r = o_rWritten;
    EXPECT_TRUE( WriteVideoFrameInfo( Store, r.Frame ) && WriteAudioFrameInfo( Store, "A.", r.Audio ) &&
                 WriteVideoTiming( Store, r.Timing ) && WriteVideoSettings( Store, "P.", r.Settings ) &&
                 WriteTimecode( Store, r.Timecode ) && WriteLensDistortionCalibration( Store, "Q.", r.Lens ) &&
                 WriteCameraHardware( Store, r.Camera ) );
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

TEST( AttributeRecords, EveryRecordReadsBackAsWritten )
{
  VRecords Written, Read;
  const IVideoAttributes Store = OddHeader( Written );
  Read.Frame.Flags = ~0u; // both flags are decided by the read
  Read.Lens.RadialDistortionParameters = { 7, 7, 7, 7 };
  ASSERT_EQ( std::vector< bool >( 7, true ), Read.ReadFrom( Store ) );
  EXPECT_EQ( Written.Frame, Read.Frame );
  EXPECT_EQ( Written.Audio, Read.Audio );
  EXPECT_TRUE( Written.Timing == Read.Timing );
  EXPECT_EQ( Written.Settings, Read.Settings );
  EXPECT_EQ( Written.Timecode, Read.Timecode );
  EXPECT_EQ( Written.Lens, Read.Lens );
  EXPECT_EQ( Written.Camera, Read.Camera );

  // Missing optional keys read as their defaults, not as they were; unknown interlacing reads as
  // unspecified; without the half-pixel offset the older whole one counts, doubled into 16 bits;
  // a missing setting leaves the other read.
  IVideoAttributes Partial = Store;
  for( const char* pKey : { "StartOffsetInTicks", "P.Saturation", "VideoFrameInfo.SensorPixelsPerImagePixelX",
                            "VideoFrameInfo.TwiceOffsetX" } )
    Partial.Remove( pKey );
  Partial.Set( "VideoFrameInfo.InterlacedFormat", "Interlaced" );
  Partial.Set( "VideoFrameInfo.ImageX", 0x8001u );
  Read.Settings = IVideoSettings();
  EXPECT_EQ( ( std::vector< bool >{ true, true, true, false, true, true, true } ), Read.ReadFrom( Partial ) );
  EXPECT_EQ( 0, Read.Timing.StartOffsetInTicks );
  EXPECT_EQ( ( IVideoSettings{ 1.0f, 2.2f } ), Read.Settings );
  EXPECT_EQ( 1, Read.Frame.SensorPixelsPerImagePixelX );
  EXPECT_EQ( InterlacedFormat_Unspecified, Read.Frame.InterlacedFormat );
  EXPECT_EQ( 2, Read.Frame.TwiceOffsetX );

  // No horizontal offset of either kind, a width beyond a signed one, or an unknown format name
  // fails the frame.
  IVideoAttributes NoOffset = Store, Wide = Store, Unknown = Store;
  NoOffset.Remove( "VideoFrameInfo.ImageX" );
  NoOffset.Remove( "VideoFrameInfo.TwiceOffsetX" );
  Wide.Set( "VideoFrameInfo.ImageWidth", 0x80000000u );
  Unknown.Set( "VideoFrameInfo.PixelFormat", "bayerGB8" ); // names compare exactly
  const IVideoAttributes* const Broken[] = { &NoOffset, &Wide, &Unknown };
  for( int i = 0; i < 3; ++i )
  {
    IVideoFrameInfo Fresh; // an unknown name keeps the format a reused record had
    EXPECT_FALSE( ReadVideoFrameInfo( *Broken[i], *Broken[i], Fresh ) ) << i;
  }
}

// Every key of the header removed in turn: a required one fails its own record's read and no
// other; an optional one fails nothing.
TEST( AttributeRecords, EachRequiredKeyFailsItsOwnRecordAlone )
{
  VRecords Written;
  const IVideoAttributes Store = OddHeader( Written );
  // The keys a reader does without, by their last name.
  const std::string Optional = " ImageX ImageY TwiceOffsetX TwiceOffsetY SensorPixelsPerImagePixelX "
                               "SensorPixelsPerImagePixelY InterlacedFormat StartOffsetInTicks SerialNumber ";
  // The record a key belongs to, by its prefix; the timing's keys have none.
  const char* const Prefixes[] = { "VideoFrameInfo.", "A.", "", "P.", "Timecode.", "Q.", "CameraHardware." };
  std::vector< std::string > Keys;
  Store.GetKeys( Keys );
  for( const std::string& rKey : Keys )
  {
    SCOPED_TRACE( rKey );
    std::vector< bool > Expected( 7, true );
    const bool bOptional = Optional.find( " " + rKey.substr( rKey.rfind( '.' ) + 1 ) + " " ) != std::string::npos;
    for( std::size_t i = 0; i < 7 && !bOptional; ++i )
      if( rKey.rfind( Prefixes[i], 0 ) == 0 && ( i != 2 || rKey.find( '.' ) == std::string::npos ) )
        Expected[i] = false;
    IVideoAttributes Partial = Store;
    ASSERT_TRUE( Partial.Remove( rKey ) );
    EXPECT_EQ( Expected, VRecords().ReadFrom( Partial ) );
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

  for( const IVideoFrameInfo& rInfo :
       { Frame( 0, 480, PixelFormat_Luminance8 ), Frame( 640, -1, PixelFormat_Luminance8 ),
         Frame( 640, 480, PixelFormat_Unspecified ), Frame( 640, 480, static_cast< EPixelFormat >( 20 ) ) } )
  {
    IVideoAttributes Unwritten;
    EXPECT_FALSE( WriteVideoFrameInfo( Unwritten, rInfo ) );
    EXPECT_TRUE( Unwritten.Empty() );
  }
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
      { "history with a lens", { RecordWithLens( { 0.0, -0.2 } ) }, false, false, true },
      { "history with a zero lens", { RecordWithLens( { 0.0, 0.0 } ) }, false, false, false },
      { "later lens", { RecordWithLens( { 0, 0 } ), RecordWithLens( { 0, 0, 1e-9 } ) }, false, false, true },
      { "recording has its own lens", { RecordWithLens( { 0.1, 0.2 } ) }, true, false, false },
      { "lens only behind a gap", { RecordWithLens( { 0, 0 } ), RecordWithLens( { 0.5, 0 } ) }, false, true, false } };
  IVideoAttributes Keys;
  ASSERT_TRUE( WriteVideoFrameInfo( Keys, Frame( 8, 8, PixelFormat_BayerRG8 ) ) );
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Name );
    IVideoAttributes Outer;
    WriteConversionRecords( Outer, rCase.History );
    if( rCase.bOwnLens )
      Outer.Set( "LensDistortionCalibration.RadialModel", 0 ); // any type counts
    if( rCase.bGapBeforeTheLens )
      Outer.Remove( "ConversionRecord.0.VideoFrameInfo.PixelFormat" );
    IVideoFrameInfo Info;
    Info.Flags = rCase.Flag ? 0u : static_cast< std::uint32_t >( IVideoFrameInfo::Flag_HasConversionDistortion );
    ASSERT_TRUE( ReadVideoFrameInfo( Keys, Outer, Info ) );
    EXPECT_EQ( rCase.Flag, Info.HasConversionDistortion() );
  }
}

// No audio is an answer (a history's empty records read so); zero channels and unknown formats are not.
TEST( AudioFrameInfo, ZeroChannelsAndUnknownFormatsAreNoAudio )
{
  IVideoAttributes Store;
  EXPECT_FALSE( WriteAudioFrameInfo( Store, "", { static_cast< EAudioSampleFormat >( 10 ), 48000, 2 } ) );
  ASSERT_TRUE( WriteAudioFrameInfo( Store, "", { AudioSampleFormat_Float32, 48000, 0 } ) );
  IAudioFrameInfo Info;
  EXPECT_FALSE( ReadAudioFrameInfo( Store, "", Info ) ) << "zero channels";
  Store.Set( "AudioFrameInfo.Channels", 2u );
  Store.Set( "AudioFrameInfo.SampleFormat", "float32" ); // names compare exactly
  Info.SampleFormat = AudioSampleFormat_Int32;
  EXPECT_TRUE( ReadAudioFrameInfo( Store, "", Info ) );
  EXPECT_EQ( AudioSampleFormat_Int32, Info.SampleFormat );
}

TEST( LensDistortion, ModelsWithoutParametersReadWithoutThemAndAnUnknownModelFails )
{
  IVideoAttributes Store;
  VLensDistortionCalibration Read;
  EXPECT_FALSE( WriteLensDistortionCalibration( Store, "", Lens( RadialModel_Lumek3Parameter, { 1, 2 } ) ) );
  EXPECT_FALSE( ReadLensDistortionCalibration( Store, "", Read ) ) << "fewer parameters than the model takes";
  for( ERadialModel Model : { RadialModel_Lumek0Parameter, RadialModel_BadRadialModel } )
  {
    IVideoAttributes Written; // the write fails, but what it wrote reads
    EXPECT_FALSE( WriteLensDistortionCalibration( Written, "", Lens( Model, { 4, 5 }, 1, 2 ) ) );
    Read.RadialDistortionParameters = { 7, 7, 7 };
    EXPECT_TRUE( ReadLensDistortionCalibration( Written, "", Read ) );
    EXPECT_EQ( Lens( Model, {}, 1, 2 ), Read );
  }
  Store.Set( "LensDistortionCalibration.RadialModel", "Lumek4Parameter" );
  Read = VLensDistortionCalibration();
  EXPECT_FALSE( ReadLensDistortionCalibration( Store, "", Read ) );
  EXPECT_EQ( VLensDistortionCalibration(), Read );
}

// Written again, what was read gives the same keys: no field of any record lost, moved or changed.
// An unknown container text keeps the default. (A gap ending the list is a row of the flag's test.)
TEST( ConversionRecords, RoundTripInOrderAndAnUnknownContainerKeepsTheDefault )
{
  const VConversionRecord Full{ VideoContainer_AVI,
                                { 0.5f, 1.8f },
                                { AudioSampleFormat_UInt8, 22050, 1 },
                                AudioPayload_Uncompressed,
                                VideoPayload_VideoH264,
                                PixelFormat_PlanarY8U8V8,
                                Lens( RadialModel_Lumek3Parameter, { 0.1, 0.2, 0.3 }, 5, 6 ) };
  IVideoAttributes Store, Again;
  ASSERT_TRUE( WriteConversionRecords( Store, std::vector< VConversionRecord >( 11, Full ) ) );
  std::vector< VConversionRecord > Read( 1 );
  ReadConversionRecords( Store, Read );
  ASSERT_EQ( 11u, Read.size() );
  ASSERT_TRUE( WriteConversionRecords( Again, Read ) );
  EXPECT_TRUE( Again == Store );
  Store.Set( "ConversionRecord.0.Container", "avi" );
  ReadConversionRecords( Store, Read );
  EXPECT_EQ( VideoContainer_LVID, Read[0].Container );
}
