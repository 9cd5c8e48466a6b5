#include "RecordingFixture.h"

#include "app/VideoSource/VVideoSource.h"
#include "app/VideoSource/VideoSourceTexts.h"
#include "fileio/LumekVideo/VReader.h"
#include "services/ILogCategorised.h"

using LumekVideoViewer::VVideoSource;

TEST( VideoSource, WithoutAFileAnswersFromDefaults )
{
  VVideoSource Source;
  EXPECT_FALSE( Source.IsOpen() );
  EXPECT_EQ( Source.GetVideoPayload(), ZOL::VideoPayload_None );
  EXPECT_EQ( Source.GetAudioPayload(), ZOL::AudioPayload_None );
  EXPECT_EQ( Source.GetVideoFrameInfo().SensorPixelsPerImagePixelX, 1 );
  EXPECT_EQ( Source.GetVideoFrameInfo().ImageWidth, 0 );
  EXPECT_EQ( Source.GetVideoSettings().GammaCorrection, 1.0f );
  EXPECT_TRUE( Source.GetAttributes().Empty() );
  EXPECT_FALSE( Source.HasLensDistortion() );
  ZOL::IVideoFrame Frame;
  EXPECT_FALSE( Source.GetFrame( 0, Frame ) );
  EXPECT_EQ( LumekVideoViewer::ComposeInfoPanelTexts( Source, 0 ).Timecode, "No file open" );
  EXPECT_TRUE( LumekVideoViewer::ComposePropertyRows( Source ).empty() );
}

TEST( VideoSource, CountsMissingFramesAndReadsWhatIsThere )
{
  VSourceRecording Recording;
  Recording.Frames = { 0, 1, 5 };
  Recording.Audio = { ZOL::AudioSampleFormat_Int16, 48000, 2 };
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write() ) );
  EXPECT_EQ( Source.GetFrameCount(), 6u );
  EXPECT_EQ( Source.GetMissingFrameCount(), 3 );
  EXPECT_DOUBLE_EQ( Source.GetFrameRate(), 50.0 );
  EXPECT_DOUBLE_EQ( Source.GetDurationInSeconds(), 0.12 );

  ZOL::IVideoFrame Frame;
  EXPECT_FALSE( Source.GetFrame( 3, Frame ) );
  EXPECT_FALSE( Frame.Video ); // left as it stood
  EXPECT_FALSE( Source.GetFrame( 6, Frame ) );

  ASSERT_TRUE( Source.GetFrame( 5, Frame ) );
  ASSERT_TRUE( Frame.Video );
  EXPECT_EQ( Frame.Video->GetSize(), 32u );
  EXPECT_EQ( Frame.Video->GetData()[31], 6 );
  EXPECT_EQ( Frame.VideoFrameInfo.PixelFormat, ZOL::PixelFormat_BayerGB8 );
  ASSERT_EQ( Frame.Audio.size(), 1u );
  EXPECT_EQ( Frame.Audio[0]->GetSize(), 24u );
  EXPECT_EQ( Frame.AudioFrameInfo.SampleRate, 48000 );
}

TEST( VideoSource, AFailedOpenLeavesNoFile )
{
  VSourceRecording Recording;
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write() ) );
  const std::string Upper = Recording.Path.substr( 0, Recording.Path.size() - 4 ) + "LVID";
  boost::filesystem::copy_file( Recording.Path, Upper );
  EXPECT_FALSE( Source.Open( Upper ) ); // the name decides, and the comparison does not fold case
  boost::filesystem::remove( Upper );
  EXPECT_FALSE( Source.IsOpen() );
  EXPECT_EQ( Source.GetVideoPayload(), ZOL::VideoPayload_None );
  EXPECT_FALSE( Source.Open( Recording.Path + ".absent.lvid" ) );
}

TEST( VideoSource, AnEmptyRecordingOpens )
{
  VSourceRecording Recording;
  Recording.Frames.clear();
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write() ) );
  EXPECT_EQ( Source.GetFrameCount(), 0u );
  EXPECT_EQ( Source.GetMissingFrameCount(), 0 );
}

TEST( VideoSource, LensDistortionNeedsBothRecords )
{
  CoreLumekTypes::VLensDistortionCalibration Lens;
  Lens.RadialModel = ZOL::RadialModel_Lumek3Parameter;
  Lens.RadialDistortionParameters = { 1e-7, 0.0, 0.0 };
  Lens.RadialDistortionCentre_X = 4;
  Lens.RadialDistortionCentre_Y = 2;
  CoreLumekTypes::VCameraHardware Camera;
  Camera.DeviceURN = "urn:test";
  Camera.DisplayType = "Test";
  Camera.Type = "T";
  Camera.SensorWidthInPixels = 8;
  Camera.SensorHeightInPixels = 4;

  VSourceRecording LensOnly;
  ZOL::WriteLensDistortionCalibration( LensOnly.Attributes, "", Lens );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( LensOnly.Write() ) );
  EXPECT_EQ( Source.GetLensDistortionCalibration(), Lens );
  EXPECT_FALSE( Source.HasLensDistortion() );

  VSourceRecording Both;
  ZOL::WriteLensDistortionCalibration( Both.Attributes, "", Lens );
  ZOL::WriteCameraHardware( Both.Attributes, Camera );
  ASSERT_TRUE( Source.Open( Both.Write() ) );
  EXPECT_EQ( Source.GetCameraHardware(), Camera );
  EXPECT_TRUE( Source.HasLensDistortion() );
  Source.Close();
  EXPECT_TRUE( Source.HasLensDistortion() ); // kept until the next open
}

TEST( VideoSource, TextsOfTheInformationPanel )
{
  VSourceRecording Recording;
  Recording.Frames = { 0, 2 };
  ZOL::ITimecode Timecode;
  Timecode.Standards = ZOL::TimecodeStandard_30;
  Timecode.Minutes = 5;
  ZOL::WriteTimecode( Recording.Attributes, Timecode );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write() ) );
  const auto Texts = LumekVideoViewer::ComposeInfoPanelTexts( Source, 1 );
  EXPECT_EQ( Texts.Video, "V: 8 x 4 / BayerGB8 / 50.00Hz / 3 frames (1 missing) / 0.06s" );
  EXPECT_EQ( Texts.Audio, "" );
  // 50 Hz divides the 25 fps period: half a timecode frame per video frame.
  EXPECT_EQ( Texts.Timecode, "T: 00:05:00:00+50 [25 fps]" );
  EXPECT_EQ( LumekVideoViewer::ComposeDecoderText( "Hardware (GPU)", 99.84 ), "Hardware (GPU) @ 99.8fps" );
}

TEST( VideoSource, PropertiesListEveryKeyWithTheRecords )
{
  VSourceRecording Recording; // only the timing keys of its own
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write() ) );
  const auto Rows = LumekVideoViewer::ComposePropertyRows( Source );
  std::map< std::string, std::string > Map( Rows.begin(), Rows.end() );
  EXPECT_EQ( Map.size(), Rows.size() );
  EXPECT_EQ( Map["VideoFrameInfo.PixelFormat"], "BayerGB8" );
  EXPECT_EQ( Map["VideoFrameInfo.ImageWidth"], "8" );
  EXPECT_EQ( Map["AudioFrameInfo.Present"], "0" );
  EXPECT_EQ( Map["GammaCorrection"], "1" );
  EXPECT_EQ( Map["FramePeriodInTicks"], "2700000" );
  std::vector< std::string > Keys;
  for( const auto& rRow : Rows )
    Keys.push_back( rRow.first );
  EXPECT_TRUE( std::is_sorted( Keys.begin(), Keys.end() ) );
}

TEST( VideoSource, AHugeFrameNumberIsCountedWithoutWalkingToIt )
{
  // A damaged index naming frame 2^40: opening, the fallback to an earlier frame and the next
  // stored frame all answer from the index at once.
  VSourceRecording Recording;
  Recording.Frames = { 0, 7, std::uint64_t( 1 ) << 40 };
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write() ) );
  EXPECT_EQ( Source.GetFrameCount(), ( std::uint64_t( 1 ) << 40 ) + 1 );
  EXPECT_EQ( Source.GetMissingFrameCount(), INT32_MAX );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 6 ), std::optional< std::uint64_t >( 0 ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 1000000000 ), std::optional< std::uint64_t >( 7 ) );
  EXPECT_EQ( Source.FindFrameAtOrAfter( 8 ), std::optional< std::uint64_t >( std::uint64_t( 1 ) << 40 ) );
  EXPECT_EQ( Source.FindFrameAtOrAfter( ( std::uint64_t( 1 ) << 40 ) + 1 ), std::nullopt );
}

TEST( VideoSource, FallbackWithoutGaps )
{
  VSourceRecording Recording;
  Recording.Frames = { 1, 2 };
  VVideoSource Source;
  EXPECT_EQ( Source.FindFrameAtOrBefore( 1 ), std::nullopt ); // no file
  ASSERT_TRUE( Source.Open( Recording.Write() ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 0 ), std::nullopt );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 99 ), std::optional< std::uint64_t >( 2 ) ); // past the end: the last
  EXPECT_EQ( Source.FindFrameAtOrAfter( 0 ), std::optional< std::uint64_t >( 1 ) );
}

namespace
{
  // A recording whose reader names a payload no decoder knows.
  class VUnknownPayloadReader : public LumekVideo::VReader
  {
  public:
    ZOL::EVideoPayload GetVideoPayload() const override { return static_cast< ZOL::EVideoPayload >( 99 ); }
  };
} // namespace

TEST( VideoSource, APayloadWithoutADecodedFormatGivesNoFrame )
{
  VSourceRecording Recording;
  Recording.Frames = { 0 };
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Write(), std::make_shared< VUnknownPayloadReader >() ) );
  std::vector< std::string > Lines;
  const int Sink = ZOL::GlobalLog().AddSink(
      [&]( const ZOL::ILogRecord& i_rRecord ) { Lines.push_back( i_rRecord.Message ); }, ZOL::LogFailure );
  ZOL::IVideoFrame Frame;
  EXPECT_FALSE( Source.GetFrame( 0, Frame ) );
  ZOL::GlobalLog().RemoveSink( Sink );
  EXPECT_FALSE( Frame.Video );
  ASSERT_FALSE( Lines.empty() );
  EXPECT_EQ( Lines.front(), "Unsupported video payload format 'Unspecified'." );
}
