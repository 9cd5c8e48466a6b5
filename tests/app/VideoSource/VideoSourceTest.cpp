// The viewer's one way to a recording's frames and texts, on recordings written by the test.

#include "tests/app/AppTestSupport.h"

#include "app/VideoSource/VVideoSource.h"
#include "app/VideoSource/VideoSourceTexts.h"
#include "fileio/LumekVideo/VReader.h"
#include "tests/support/AllocationWatch.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <list>
#include <map>

using namespace AppTest;
using LumekVideoViewer::VVideoSource;

namespace
{
  using Index = std::optional< std::uint64_t >;

  // A reader whose recording names a payload no decoder knows.
  class VUnknownPayloadReader : public LumekVideo::VReader
  {
  public:
    ZOL::EVideoPayload GetVideoPayload() const override { return static_cast< ZOL::EVideoPayload >( 99 ); }
  };

  class VideoSource : public testing::Test
  {
  protected:
    // An 8 x 4 Bayer recording at 50 Hz with the given frames stored, opened in Source.
    static VRecordingSpec Bayer( std::vector< std::uint64_t > i_Frames )
    {
      VRecordingSpec Spec;
      Spec.Width = 8;
      Spec.Height = 4;
      Spec.Format = ZOL::PixelFormat_BayerGB8;
      Spec.Frames = std::move( i_Frames );
      Spec.FramePeriodInTicks = TicksAt( 50.0 );
      return Spec;
    }
    bool Open( const VRecordingSpec& i_rSpec, std::shared_ptr< ZOL::IVideoReader > i_pReader = nullptr )
    {
      const std::string& rPath = m_Files.emplace_back( i_rSpec ).Path;
      return i_pReader ? Source.Open( rPath, std::move( i_pReader ) ) : Source.Open( rPath );
    }

    std::list< VTempRecording > m_Files;
    VVideoSource Source;
    ZOL::IVideoFrame Frame;
  };
} // namespace

TEST_F( VideoSource, AFailedOpenLeavesNoFileAndAnEmptyRecordingOpens )
{
  ASSERT_TRUE( Open( Bayer( { 0, 1, 2 } ) ) );
  const std::string& rPath = m_Files.back().Path;
  const std::string Upper = rPath.substr( 0, rPath.size() - 4 ) + "LVID";
  std::filesystem::copy_file( rPath, Upper );
  EXPECT_FALSE( Source.Open( Upper ) ); // the name decides, and the comparison does not fold case
  std::filesystem::remove( Upper );
  EXPECT_FALSE( Source.Open( rPath + ".absent.lvid" ) );
  // What the window shows while no file is open.
  EXPECT_FALSE( Source.IsOpen() );
  EXPECT_EQ( Source.GetVideoPayload(), ZOL::VideoPayload_None );
  EXPECT_FALSE( Source.GetFrame( 0, Frame ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 1 ), std::nullopt );
  EXPECT_EQ( LumekVideoViewer::ComposeInfoPanelTexts( Source, 0 ).Timecode, "No file open" );
  EXPECT_TRUE( LumekVideoViewer::ComposePropertyRows( Source ).empty() );

  ASSERT_TRUE( Open( Bayer( {} ) ) );
  EXPECT_EQ( std::make_pair( Source.GetFrameCount(), Source.GetMissingFrameCount() ),
             std::make_pair( std::uint64_t( 0 ), 0 ) );
}

TEST_F( VideoSource, LensDistortionNeedsBothRecords )
{
  VRecordingSpec Spec = Bayer( { 0 } );
  Spec.bLens = true;
  ASSERT_TRUE( Open( Spec ) );
  EXPECT_FALSE( Source.HasLensDistortion() );
  Spec.bCamera = true;
  ASSERT_TRUE( Open( Spec ) );
  EXPECT_TRUE( Source.HasLensDistortion() );
  Source.Close();
  EXPECT_TRUE( Source.HasLensDistortion() ); // kept until the next open
}

// The information panel's golden texts, and the properties listing every key of the records.
TEST_F( VideoSource, TextsOfTheInformationPanelAndTheProperties )
{
  VRecordingSpec Spec = Bayer( { 0, 2 } );
  ZOL::ITimecode Timecode;
  Timecode.Standards = ZOL::TimecodeStandard_30;
  Timecode.Minutes = 5;
  ZOL::WriteTimecode( Spec.Attributes, Timecode );
  ASSERT_TRUE( Open( Spec ) );
  const auto Texts = LumekVideoViewer::ComposeInfoPanelTexts( Source, 1 );
  EXPECT_EQ( Texts.Video, "V: 8 x 4 / BayerGB8 / 50.00Hz / 3 frames (1 missing) / 0.06s" );
  EXPECT_EQ( Texts.Audio, "" );
  // 50 Hz divides the 25 fps period: half a timecode frame per video frame.
  EXPECT_EQ( Texts.Timecode, "T: 00:05:00:00+50 [25 fps]" );
  EXPECT_EQ( LumekVideoViewer::ComposeDecoderText( "Hardware (GPU)", 99.84 ), "Hardware (GPU) @ 99.8fps" );

  const auto Rows = LumekVideoViewer::ComposePropertyRows( Source );
  std::map< std::string, std::string > Map( Rows.begin(), Rows.end() );
  EXPECT_EQ( Map.size(), Rows.size() );
  EXPECT_TRUE( std::is_sorted( Rows.begin(), Rows.end() ) );
  for( const auto& [Key, Value] : { std::pair( "VideoFrameInfo.PixelFormat", "BayerGB8" ),
                                    { "VideoFrameInfo.ImageWidth", "8" },
                                    { "AudioFrameInfo.Present", "0" },
                                    { "GammaCorrection", "1" },
                                    { "FramePeriodInTicks", "2700000" } } )
    EXPECT_EQ( Map[Key], Value ) << Key;
}

TEST_F( VideoSource, FindsStoredFramesEitherSideOfAGap )
{
  ASSERT_TRUE( Open( Bayer( { 1, 2, 5 } ) ) );
  EXPECT_EQ( Source.GetFrameCount(), 6u );
  EXPECT_EQ( Source.GetMissingFrameCount(), 3 );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 0 ), std::nullopt );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 4 ), Index( 2 ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 99 ), Index( 5 ) ); // past the end: the last
  EXPECT_EQ( Source.FindFrameAtOrAfter( 0 ), Index( 1 ) );

  // A damaged index naming frame 2^40: opening, the fallback to an earlier frame and the next
  // stored frame all answer from the index at once, without walking to it.
  const std::uint64_t Far = std::uint64_t( 1 ) << 40;
  ASSERT_TRUE( Open( Bayer( { 0, 7, Far } ) ) );
  EXPECT_EQ( Source.GetFrameCount(), Far + 1 );
  EXPECT_EQ( Source.GetMissingFrameCount(), INT32_MAX );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 6 ), Index( 0 ) );
  EXPECT_EQ( Source.FindFrameAtOrBefore( 1000000000 ), Index( 7 ) );
  EXPECT_EQ( Source.FindFrameAtOrAfter( 8 ), Index( Far ) );
  EXPECT_EQ( Source.FindFrameAtOrAfter( Far + 1 ), std::nullopt );
}

// The stored bytes once came back as the frame when the payload was one no decoder knows.
TEST_F( VideoSource, APayloadWithoutADecodedFormatGivesNoFrame )
{
  ASSERT_TRUE( Open( Bayer( { 0 } ), std::make_shared< VUnknownPayloadReader >() ) );
  LumekTest::VLogCapture Log( "", ZOL::LogFailure );
  EXPECT_FALSE( Source.GetFrame( 0, Frame ) );
  EXPECT_FALSE( Frame.Video );
  ASSERT_FALSE( Log.Messages.empty() );
  EXPECT_EQ( Log.Messages.front(), "Unsupported video payload format 'Unspecified'." );
}

// What is there is read, with its own block of sound; a frame not there leaves the record as it
// stood. Playback reads and drops frames dozens of times a second: after warm-up the path from
// file to decoded frame must not go back to the heap.
TEST_F( VideoSource, ReadsWhatIsThereWithNoAllocationOnTheSteadyPath )
{
  VRecordingSpec Spec = Bayer( FramesWithout( 40, { 3 } ) );
  Spec.Width = 640;
  Spec.Height = 480;
  Spec.bAudio = true;
  ASSERT_TRUE( Open( Spec ) );
  EXPECT_FALSE( Source.GetFrame( 3, Frame ) );
  EXPECT_FALSE( Frame.Video );
  EXPECT_FALSE( Source.GetFrame( 40, Frame ) );
  ASSERT_TRUE( Source.GetFrame( 5, Frame ) );
  ASSERT_TRUE( Frame.Video && Frame.Audio.size() == 1 );
  EXPECT_EQ( Frame.Video->GetSize(), 640u * 480 );
  EXPECT_EQ( Frame.Video->GetData()[640 * 480 - 1], FrameLevel( 5 ) );
  EXPECT_EQ( Frame.VideoFrameInfo.PixelFormat, ZOL::PixelFormat_BayerGB8 );
  EXPECT_EQ( Frame.Audio[0]->GetSize(), ( 960u + 5 ) * 4 );
  // The window keeps one frame record and replaces its contents frame by frame.
  auto ReadAll = [this]( int i_Times )
  {
    int Read = 0;
    for( int i = 0; i < i_Times; ++i )
      Read += Source.GetFrame( static_cast< std::uint64_t >( i % 40 ), Frame ) ? 1 : 0;
    return Read;
  };
  EXPECT_EQ( ReadAll( 80 ), 78 );
  const int Frames = 400;
  LumekTest::VAllocationWatch Watch;
  EXPECT_EQ( ReadAll( Frames ), Frames - 10 );
  // Frame buffers and their control blocks are recycled: playback takes nothing from the heap.
  EXPECT_EQ( Watch.Calls(), 0u ) << "allocations over " << Frames << " frames, the largest " << Watch.Largest();
}
