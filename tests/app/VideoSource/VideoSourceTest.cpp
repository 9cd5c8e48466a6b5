#include "tests/app/AppTestSupport.h"

#include "app/VideoSource/VVideoSource.h"
#include "app/VideoSource/VideoSourceTexts.h"
#include "fileio/LumekVideo/VReader.h"
#include "tests/support/AllocationWatch.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <map>

using namespace AppTest;
using LumekVideoViewer::VVideoSource;

namespace
{
  VRecordingSpec Bayer( std::vector< std::uint64_t > i_Frames, double i_FramesPerSecond = 50.0 )
  {
    VRecordingSpec Spec;
    Spec.Width = 8;
    Spec.Height = 4;
    Spec.Format = ZOL::PixelFormat_BayerGB8;
    Spec.Frames = std::move( i_Frames );
    Spec.FramePeriodInTicks = TicksAt( i_FramesPerSecond );
    return Spec;
  }

  // A recording whose reader names a payload no decoder knows.
  class VUnknownPayloadReader : public LumekVideo::VReader
  {
  public:
    ZOL::EVideoPayload GetVideoPayload() const override { return static_cast< ZOL::EVideoPayload >( 99 ); }
  };
} // namespace

// The window shows these while no file is open.
TEST( VideoSource, WithoutAFileAnswersFromDefaults )
{
  VVideoSource Source;
  EXPECT_FALSE( Source.IsOpen() );
  EXPECT_EQ( Source.GetVideoPayload(), ZOL::VideoPayload_None );
  ZOL::IVideoFrame Frame;
  EXPECT_FALSE( Source.GetFrame( 0, Frame ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 1 ), std::nullopt );
  EXPECT_EQ( LumekVideoViewer::ComposeInfoPanelTexts( Source, 0 ).Timecode, "No file open" );
  EXPECT_TRUE( LumekVideoViewer::ComposePropertyRows( Source ).empty() );
}

TEST( VideoSource, CountsMissingFramesAndReadsWhatIsThere )
{
  VRecordingSpec Spec = Bayer( { 0, 1, 5 } );
  Spec.bAudio = true;
  const VTempRecording Recording( Spec );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Path ) );
  EXPECT_EQ( Source.GetFrameCount(), 6u );
  EXPECT_EQ( Source.GetMissingFrameCount(), 3 );

  ZOL::IVideoFrame Frame;
  EXPECT_FALSE( Source.GetFrame( 3, Frame ) );
  EXPECT_FALSE( Frame.Video ); // left as it stood
  EXPECT_FALSE( Source.GetFrame( 6, Frame ) );

  ASSERT_TRUE( Source.GetFrame( 5, Frame ) );
  ASSERT_TRUE( Frame.Video );
  EXPECT_EQ( Frame.Video->GetSize(), 32u );
  EXPECT_EQ( Frame.Video->GetData()[31], FrameLevel( 5 ) );
  EXPECT_EQ( Frame.VideoFrameInfo.PixelFormat, ZOL::PixelFormat_BayerGB8 );
  ASSERT_EQ( Frame.Audio.size(), 1u );
  EXPECT_EQ( Frame.Audio[0]->GetSize(), ( 960u + 5 ) * 4 );
  EXPECT_EQ( Frame.AudioFrameInfo.SampleRate, 48000 );
}

TEST( VideoSource, AFailedOpenLeavesNoFileAndAnEmptyRecordingOpens )
{
  const VTempRecording Recording( Bayer( { 0, 1, 2 } ) );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Path ) );
  const std::string Upper = Recording.Path.substr( 0, Recording.Path.size() - 4 ) + "LVID";
  std::filesystem::copy_file( Recording.Path, Upper );
  EXPECT_FALSE( Source.Open( Upper ) ); // the name decides, and the comparison does not fold case
  std::filesystem::remove( Upper );
  EXPECT_FALSE( Source.IsOpen() );
  EXPECT_EQ( Source.GetVideoPayload(), ZOL::VideoPayload_None );
  EXPECT_FALSE( Source.Open( Recording.Path + ".absent.lvid" ) );

  const VTempRecording Empty( Bayer( {} ) );
  ASSERT_TRUE( Source.Open( Empty.Path ) );
  EXPECT_EQ( Source.GetFrameCount(), 0u );
  EXPECT_EQ( Source.GetMissingFrameCount(), 0 );
}

TEST( VideoSource, LensDistortionNeedsBothRecords )
{
  VRecordingSpec Spec = Bayer( { 0 } );
  Spec.bLens = true;
  const VTempRecording LensOnly( Spec );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( LensOnly.Path ) );
  EXPECT_FALSE( Source.HasLensDistortion() );

  Spec.bCamera = true;
  const VTempRecording Both( Spec );
  ASSERT_TRUE( Source.Open( Both.Path ) );
  EXPECT_TRUE( Source.HasLensDistortion() );
  Source.Close();
  EXPECT_TRUE( Source.HasLensDistortion() ); // kept until the next open
}

TEST( VideoSource, TextsOfTheInformationPanel )
{
  VRecordingSpec Spec = Bayer( { 0, 2 } );
  ZOL::ITimecode Timecode;
  Timecode.Standards = ZOL::TimecodeStandard_30;
  Timecode.Minutes = 5;
  ZOL::WriteTimecode( Spec.Attributes, Timecode );
  const VTempRecording Recording( Spec );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Path ) );
  const auto Texts = LumekVideoViewer::ComposeInfoPanelTexts( Source, 1 );
  EXPECT_EQ( Texts.Video, "V: 8 x 4 / BayerGB8 / 50.00Hz / 3 frames (1 missing) / 0.06s" );
  EXPECT_EQ( Texts.Audio, "" );
  // 50 Hz divides the 25 fps period: half a timecode frame per video frame.
  EXPECT_EQ( Texts.Timecode, "T: 00:05:00:00+50 [25 fps]" );
  EXPECT_EQ( LumekVideoViewer::ComposeDecoderText( "Hardware (GPU)", 99.84 ), "Hardware (GPU) @ 99.8fps" );
}

TEST( VideoSource, PropertiesListEveryKeyWithTheRecords )
{
  const VTempRecording Recording( Bayer( { 0 } ) );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Path ) );
  const auto Rows = LumekVideoViewer::ComposePropertyRows( Source );
  std::map< std::string, std::string > Map( Rows.begin(), Rows.end() );
  EXPECT_EQ( Map.size(), Rows.size() );
  EXPECT_EQ( Map["VideoFrameInfo.PixelFormat"], "BayerGB8" );
  EXPECT_EQ( Map["VideoFrameInfo.ImageWidth"], "8" );
  EXPECT_EQ( Map["AudioFrameInfo.Present"], "0" );
  EXPECT_EQ( Map["GammaCorrection"], "1" );
  EXPECT_EQ( Map["FramePeriodInTicks"], "2700000" );
  EXPECT_TRUE( std::is_sorted( Rows.begin(), Rows.end(),
                               []( const auto& i_rA, const auto& i_rB ) { return i_rA.first < i_rB.first; } ) );
}

TEST( VideoSource, FindsStoredFramesEitherSideOfAGap )
{
  const VTempRecording Recording( Bayer( { 1, 2 } ) );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Path ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 0 ), std::nullopt );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 99 ), std::optional< std::uint64_t >( 2 ) ); // past the end: the last
  EXPECT_EQ( Source.FindFrameAtOrAfter( 0 ), std::optional< std::uint64_t >( 1 ) );

  // A damaged index naming frame 2^40: opening, the fallback to an earlier frame and the next
  // stored frame all answer from the index at once, without walking to it.
  const std::uint64_t Far = std::uint64_t( 1 ) << 40;
  const VTempRecording Damaged( Bayer( { 0, 7, Far } ) );
  ASSERT_TRUE( Source.Open( Damaged.Path ) );
  EXPECT_EQ( Source.GetFrameCount(), Far + 1 );
  EXPECT_EQ( Source.GetMissingFrameCount(), INT32_MAX );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 6 ), std::optional< std::uint64_t >( 0 ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 1000000000 ), std::optional< std::uint64_t >( 7 ) );
  EXPECT_EQ( Source.FindFrameAtOrAfter( 8 ), std::optional< std::uint64_t >( Far ) );
  EXPECT_EQ( Source.FindFrameAtOrAfter( Far + 1 ), std::nullopt );
}

TEST( VideoSource, APayloadWithoutADecodedFormatGivesNoFrame )
{
  const VTempRecording Recording( Bayer( { 0 } ) );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Path, std::make_shared< VUnknownPayloadReader >() ) );
  LumekTest::VLogCapture Log( "", ZOL::LogFailure );
  ZOL::IVideoFrame Frame;
  EXPECT_FALSE( Source.GetFrame( 0, Frame ) );
  EXPECT_FALSE( Frame.Video );
  ASSERT_FALSE( Log.Messages.empty() );
  EXPECT_EQ( Log.Messages.front(), "Unsupported video payload format 'Unspecified'." );
}

// Playback reads and drops frames dozens of times a second: after warm-up the path from file to
// decoded frame must not go back to the heap.
TEST( SteadyPlayback, NoFrameSizedAllocationAfterWarmUp )
{
  VRecordingSpec Spec = Bayer( FramesWithout( 40, {} ) );
  Spec.Width = 640;
  Spec.Height = 480;
  Spec.bAudio = true;
  const VTempRecording Recording( Spec );
  VVideoSource Source;
  ASSERT_TRUE( Source.Open( Recording.Path ) );

  // The window keeps one frame record and replaces its contents frame by frame.
  ZOL::IVideoFrame Frame;
  for( int i = 0; i < 80; ++i )
    ASSERT_TRUE( Source.GetFrame( static_cast< std::uint64_t >( i % 40 ), Frame ) );

  const int Frames = 400;
  LumekTest::VAllocationWatch Watch;
  int Read = 0;
  for( int i = 0; i < Frames; ++i )
    Read += Source.GetFrame( static_cast< std::uint64_t >( i % 40 ), Frame ) ? 1 : 0;
  EXPECT_EQ( Read, Frames );
  // Frame buffers and their control blocks are recycled: playback takes nothing from the heap.
  EXPECT_EQ( Watch.Calls(), 0u ) << "allocations over " << Frames << " frames, the largest " << Watch.Largest();
}
