// Descriptors and patterns against folders of small files: which frames exist, what each
// frame's file is called, which descriptor a name leads to. The files hold their own names, so
// a frame read from the wrong file shows at once.

#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/VideoReaders/CreateVideoReader.h"
#include "tests/fileio/ImageSequenceIO/SequenceTestSupport.h"

#include <gtest/gtest.h>

#include <set>

using namespace ImageSequenceTest;

namespace
{
  struct VPatternCase
  {
    const char* Label;
    const char* Pattern;
    std::uint32_t IndexPad;
    std::uint32_t NumberPad;
    std::uint32_t FrameCount;
    const char* DescriptorName;
    const char* OpenName; // what the user opens
    std::vector< std::string > Files;
    bool bOpens;
    std::set< std::uint64_t > Stored;
    std::uint64_t SampleIndex;
    const char* SampleName;
    // A 60 Hz sequence whose first frame has timecode 01:02:03:04 at 30 fps.
    bool bTimecode = false;
  };

  const VPatternCase s_Cases[] = {
      { "FrameIndexPadded",
        "take_%FRAME%.jpg",
        4,
        8,
        5,
        "take_.lumekimagesequence",
        "take_%FRAME%.jpg",
        { "take_0000.jpg", "take_0001.jpg", "take_0003.jpg", "take_0004.jpg", "take_0005.jpg", "take_003.jpg" },
        true,
        { 0, 1, 3, 4 },
        3,
        "take_0003.jpg" },
      { "FrameNumberThroughDescriptor",
        "shot%FRAME_NUMBER%.png",
        8,
        3,
        3,
        "shot.lumekimagesequence",
        "shot.lumekimagesequence",
        { "shot001.png", "shot002.png", "shot003.png", "shot000.png" },
        true,
        { 0, 1, 2 },
        2,
        "shot003.png" },
      { "UnderscoreDroppedSpelling",
        "take_%FRAME%.jpg",
        2,
        2,
        2,
        "take.lumekimagesequence",
        "take_%FRAME%.jpg",
        { "take_00.jpg", "take_01.jpg" },
        true,
        { 0, 1 },
        1,
        "take_01.jpg" },
      { "DotDroppedSpelling",
        "take.%FRAME%.tif",
        2,
        2,
        2,
        "take.lumekimagesequence",
        "take.%FRAME%.tif",
        { "take.01.tif" },
        true,
        { 1 },
        0,
        "take.00.tif" },
      { "DashDroppedSpelling",
        "take-%FRAME%.tiff",
        1,
        1,
        3,
        "take.lumekimagesequence",
        "take-%FRAME%.tiff",
        { "take-0.tiff", "take-2.tiff" },
        true,
        { 0, 2 },
        2,
        "take-2.tiff" },
      { "PadNarrowerThanNumber",
        "p%FRAME%.png",
        3,
        8,
        1235,
        "p.lumekimagesequence",
        "p%FRAME%.png",
        { "p000.png", "p999.png", "p1234.png", "p01234.png", "p1235.png" },
        true,
        { 0, 999, 1234 },
        1234,
        "p1234.png" },
      { "UpperCaseExtensionRefused",
        "IMG_%FRAME%.JPG",
        8,
        8,
        1,
        "IMG_.lumekimagesequence",
        "IMG_%FRAME%.JPG",
        { "IMG_00000000.JPG" },
        false,
        {},
        0,
        "" },
      { "NoPlaceholderOneFileForAll",
        "still.png",
        8,
        8,
        3,
        "still.lumekimagesequence",
        "still.lumekimagesequence",
        { "still.png" },
        true,
        { 0, 1, 2 },
        2,
        "still.png" },
      { "BothIndexPlaceholders",
        "a%FRAME%_b%FRAME_NUMBER%.jpeg",
        2,
        3,
        6,
        "a_b.lumekimagesequence",
        "a%FRAME%_b%FRAME_NUMBER%.jpeg",
        { "a04_b005.jpeg", "a04_b004.jpeg", "a00_b001.jpeg" },
        true,
        { 0, 4 },
        4,
        "a04_b005.jpeg" },
      { "TimecodeOnlyThroughDescriptor",
        "tc%TIMECODE%.jpg",
        8,
        8,
        4,
        "tc.lumekimagesequence",
        "tc.lumekimagesequence",
        { "tc0102030400.jpg", "tc0102030450.jpg", "tc0102030550.jpg", "tc0102030425.jpg" },
        true,
        { 0, 1, 3 },
        1,
        "tc0102030450.jpg",
        true },
      { "PathWithoutExtension",
        "clip%FRAME%.png",
        1,
        1,
        2,
        "clip.lumekimagesequence",
        "clip",
        { "clip1.png" },
        true,
        { 1 },
        1,
        "clip1.png" },
      { "LastFrameMissing",
        "f%FRAME%.png",
        1,
        1,
        10,
        "f.lumekimagesequence",
        "f%FRAME%.png",
        { "f0.png", "f1.png", "f2.png", "f3.png", "f4.png", "f5.png", "f6.png", "f7.png", "f8.png" },
        true,
        { 0, 1, 2, 3, 4, 5, 6, 7, 8 },
        9,
        "f9.png" },
      { "EmptyPatternRefused", "", 8, 8, 1, "x.lumekimagesequence", "x.lumekimagesequence", {}, false, {}, 0, "" },
      { "NoDescriptorRefused",
        "take_%FRAME%.jpg",
        8,
        8,
        1,
        "other.lumekimagesequence",
        "take_%FRAME%.jpg",
        { "take_00000000.jpg" },
        false,
        {},
        0,
        "" },
  };

  class SequencePattern : public testing::TestWithParam< VPatternCase >
  {
  protected:
    void SetUp() override
    {
      const VPatternCase& rCase = GetParam();
      ImageSequenceIO::VDescriptor Descriptor =
          MakeDescriptor( rCase.Pattern, rCase.FrameCount, rCase.IndexPad, rCase.NumberPad );
      if( rCase.bTimecode )
      {
        Descriptor.Timing.FramePeriodInTicks = Descriptor.Timing.TicksPerSecond / 60;
        Descriptor.Timecode.Standards = ZOL::TimecodeStandard_30;
        Descriptor.Timecode.Hours = 1;
        Descriptor.Timecode.Minutes = 2;
        Descriptor.Timecode.Seconds = 3;
        Descriptor.Timecode.Frames = 4;
      }
      ASSERT_TRUE( ImageSequenceIO::WriteDescriptor( m_Folder / rCase.DescriptorName, Descriptor ) );
      for( const std::string& rFile : rCase.Files )
        WriteFile( m_Folder / rFile, rFile );
    }

    VTempFolder m_Folder;
  };

  TEST_P( SequencePattern, FindsTheFramesThatExist )
  {
    const VPatternCase& rCase = GetParam();
    ImageSequenceIO::VImageSequenceReader Reader;
    ASSERT_EQ( rCase.bOpens, Reader.Open( m_Folder / rCase.OpenName ) );
    if( !rCase.bOpens )
      return;
    EXPECT_EQ( rCase.FrameCount, Reader.GetFrameCount() );
    EXPECT_EQ( m_Folder / rCase.SampleName, Reader.ExpandFileName( rCase.SampleIndex ) );

    // The index answers and the disk answers agree, frame by frame.
    std::set< std::uint64_t > ByDisk, ByIndex;
    for( std::uint64_t i = 0; i < rCase.FrameCount; ++i )
    {
      if( Reader.HasFrame( i ) )
        ByDisk.insert( i );
      if( Reader.FindStoredFrameAtOrAfter( i ) == i )
        ByIndex.insert( i );
    }
    EXPECT_EQ( rCase.Stored, ByDisk );
    EXPECT_EQ( rCase.Stored, ByIndex );
    EXPECT_EQ( rCase.Stored.size(), Reader.GetStoredFrameCount() );
  }

  TEST_P( SequencePattern, ReadsEachFrameFromItsOwnFile )
  {
    const VPatternCase& rCase = GetParam();
    ImageSequenceIO::VImageSequenceReader Reader;
    if( !Reader.Open( m_Folder / rCase.OpenName ) )
      return;
    const VQuietLog Quiet;
    for( std::uint64_t i = 0; i < rCase.FrameCount; ++i )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      VLogCapture Log( "ImageSequenceIO" );
      const bool bRead = Reader.ReadFrameData( i, pVideo, Audio, true, true );
      ASSERT_EQ( rCase.Stored.count( i ) != 0, bRead ) << i;
      if( bRead )
      {
        ASSERT_TRUE( pVideo );
        const std::string Expected = Reader.ExpandFileName( i ).substr( m_Folder.Path().size() + 1 );
        EXPECT_EQ( Expected, std::string( pVideo->GetData(), pVideo->GetData() + pVideo->GetSize() ) );
        EXPECT_TRUE( Audio.empty() );
      }
      else
      {
        ASSERT_EQ( 1u, Log.Records().size() );
        EXPECT_EQ( "Could not determine file size for file " + Reader.ExpandFileName( i ) + ".",
                   Log.Records()[0].Message );
        EXPECT_EQ( 2, Log.Records()[0].Level );
      }
    }
  }

  TEST_P( SequencePattern, FactoryChoosesTheSequenceReaderForPlaceholderNames )
  {
    const VPatternCase& rCase = GetParam();
    const std::string Name = rCase.OpenName;
    if( Name.find( "%FRAME" ) == std::string::npos )
      return;
    const auto pReader = CreateVideoReader( m_Folder / Name );
    ASSERT_TRUE( dynamic_cast< ImageSequenceIO::VImageSequenceReader* >( pReader.get() ) );
    EXPECT_EQ( rCase.bOpens, pReader->Open( m_Folder / Name ) );
  }

  INSTANTIATE_TEST_SUITE_P( Patterns, SequencePattern, testing::ValuesIn( s_Cases ),
                            []( const testing::TestParamInfo< VPatternCase >& i_rInfo )
                            { return i_rInfo.param.Label; } );

  TEST( SequenceReadFrameData, AllOnesIndexIsRefusedWithItsLine )
  {
    VTempFolder Folder;
    ASSERT_TRUE(
        ImageSequenceIO::WriteDescriptor( Folder / "a.lumekimagesequence", MakeDescriptor( "a%FRAME%.png", 1 ) ) );
    ImageSequenceIO::VImageSequenceReader Reader;
    ASSERT_TRUE( Reader.Open( Folder / "a.lumekimagesequence" ) );
    VLogCapture Log( "ImageSequenceIO" );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    EXPECT_FALSE( Reader.ReadFrameData( ~std::uint64_t( 0 ), pVideo, Audio, true, false ) );
    ASSERT_EQ( 1u, Log.Records().size() );
    EXPECT_EQ( "Frame index must be set.", Log.Records()[0].Message );
    // Nothing asked, nothing read, and no failure.
    EXPECT_TRUE( Reader.ReadFrameData( ~std::uint64_t( 0 ), pVideo, Audio, false, true ) );
  }

  TEST( SequenceTimecodeNames, FiftyPercentIntoATimecodeFrame )
  {
    // 01:02:03:04 with a frame half a timecode frame long: frame 1 is "+50".
    ZOL::ITimecode Start;
    Start.Standards = ZOL::TimecodeStandard_30;
    Start.Hours = 1;
    Start.Minutes = 2;
    Start.Seconds = 3;
    Start.Frames = 4;
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = Timing.TicksPerSecond / 60;
    const ImageSequenceIO::VFileNameExpander Expander( "%TIMECODE%", 8, 8, Start, Timing );
    EXPECT_EQ( "0102030400", Expander.TimecodeText( 0 ) );
    EXPECT_EQ( "0102030450", Expander.TimecodeText( 1 ) );
    EXPECT_EQ( "0102030500", Expander.TimecodeText( 2 ) );
    // A day later the names come round again.
    EXPECT_EQ( "0102030450", Expander.TimecodeText( 1 + 60ull * 86400 ) );
    for( std::uint64_t Index : { 0ull, 1ull, 77ull, 60ull * 3600 * 5 + 1 } )
      EXPECT_EQ( Index, Expander.FindIndex( Expander.Expand( Index ), ~std::uint64_t( 0 ) ) ) << Index;

    // A rate that does not divide the timecode clock: every frame shows the start, at 30 fps.
    Timing.TicksPerSecond = 7;
    Timing.FramePeriodInTicks = 1;
    const ImageSequenceIO::VFileNameExpander Still( "x%TIMECODE%.png", 8, 8, Start, Timing );
    EXPECT_FALSE( Still.DependsOnIndex() );
    EXPECT_EQ( "x0102030400.png", Still.Expand( 12345 ) );
  }

  TEST( SequenceIndexQueries, LongGapIsAnsweredFromTheListing )
  {
    VTempFolder Folder;
    constexpr std::uint32_t Count = 4000000000u;
    ASSERT_TRUE( ImageSequenceIO::WriteDescriptor( Folder / "g.lumekimagesequence",
                                                   MakeDescriptor( "g%FRAME%.png", Count, 1 ) ) );
    WriteFile( Folder / "g5.png", "g5.png" );
    WriteFile( Folder / "g3999999998.png", "g3999999998.png" );
    WriteFile( Folder / "g4000000000.png", "beyond the count" );
    ImageSequenceIO::VImageSequenceReader Reader;
    ASSERT_TRUE( Reader.Open( Folder / "g.lumekimagesequence" ) );
    EXPECT_EQ( 2u, Reader.GetStoredFrameCount() );
    EXPECT_EQ( std::nullopt, Reader.FindStoredFrameAtOrBefore( 4 ) );
    EXPECT_EQ( 5u, Reader.FindStoredFrameAtOrBefore( 3999999997u ) );
    EXPECT_EQ( 3999999998u, Reader.FindStoredFrameAtOrAfter( 6 ) );
    EXPECT_EQ( std::nullopt, Reader.FindStoredFrameAtOrAfter( 3999999999u ) );
  }

  struct VCandidateCase
  {
    const char* Label;
    const char* Name;
    std::vector< std::string > Expected;
  };

  class DescriptorCandidates : public testing::TestWithParam< VCandidateCase >
  {
  };

  TEST_P( DescriptorCandidates, RuleNameFirstThenWithoutSeparator )
  {
    EXPECT_EQ( GetParam().Expected, ImageSequenceIO::DescriptorCandidates( "/d", GetParam().Name ) );
  }

  INSTANTIATE_TEST_SUITE_P(
      Names, DescriptorCandidates,
      testing::Values(
          VCandidateCase{
              "Underscore", "take_%FRAME%.jpg", { "/d/take_.lumekimagesequence", "/d/take.lumekimagesequence" } },
          VCandidateCase{
              "Dot", "take.%FRAME_NUMBER%.png", { "/d/take..lumekimagesequence", "/d/take.lumekimagesequence" } },
          VCandidateCase{ "NoSeparator", "take%TIMECODE%.tif", { "/d/take.lumekimagesequence" } },
          VCandidateCase{ "TwoPlaceholders",
                          "a_%FRAME%-%TIMECODE%.jpg",
                          { "/d/a_-.lumekimagesequence", "/d/a.lumekimagesequence" } },
          VCandidateCase{ "DescriptorItself", "take.lumekimagesequence", { "/d/take.lumekimagesequence" } },
          VCandidateCase{ "NoExtension", "take", { "/d/take.lumekimagesequence" } } ),
      []( const testing::TestParamInfo< VCandidateCase >& i_rInfo ) { return i_rInfo.param.Label; } );
} // namespace
