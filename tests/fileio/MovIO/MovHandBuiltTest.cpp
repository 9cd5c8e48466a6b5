// Atom trees written by the tests' own writer: the tree walk's cases, each bound the reader
// must hold, the timecode arithmetic, the metadata atom, and damaged files at many points.

#include "MovTestSupport.h"

#include "fileio/MovIO/VMovReader.h"
#include "tests/support/LogCapture.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <gtest/gtest.h>

#include <sstream>

using namespace MovTest;

namespace
{
  bool OpenBytes( MovIO::VMovReader& io_rReader, const VBytes& i_rBytes )
  {
    return io_rReader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( i_rBytes.data(), i_rBytes.size() ) );
  }

  struct VSpecCase
  {
    const char* Name;
    void ( *Change )( VMovSpec& );
    // "" when the file opens; otherwise a line the refusal must log.
    const char* Refusal;
    // A 32-bit field set in the written file: the atom, the offset from its start, the value.
    const char* PatchAtom = nullptr;
    std::size_t PatchOffset = 0;
    std::uint32_t PatchValue = 0;
  };

  constexpr const char* AtomTree = "2 Could not parse atom tree in mov file.";
  constexpr const char* Stsc = "2 Could not read 'stsc' atom.";
  constexpr const char* Parsing = "2 There was an error parsing the MOV file.";

  const VSpecCase s_SpecCases[] = {
      { "Plain", []( VMovSpec& ) {}, "" },
      { "LargeMdatAheadOfMoov", []( VMovSpec& s ) { s.bLargeMdatFirst = true; }, "" },
      { "MdatSizeZero", []( VMovSpec& s ) { s.bMdatSizeZero = true; }, AtomTree },
      { "FourStrayBytes", []( VMovSpec& s ) { s.StrayBytes = 4; }, "" },
      { "ThreeStrayBytes", []( VMovSpec& s ) { s.StrayBytes = 3; }, AtomTree },
      { "SixStrayBytes", []( VMovSpec& s ) { s.StrayBytes = 6; }, AtomTree },
      { "MoovEndsWithZeroWord", []( VMovSpec& s ) { s.bMoovEndsWithZeroWord = true; }, "" },
      { "TwoMdiaBacktrack", []( VMovSpec& s ) { s.bTwoMdiaFirstEmpty = true; }, "" },
      { "SttsTwoEntries", []( VMovSpec& s ) { s.bTwoSttsEntries = true; }, "2 Could not read 'stts' atom." },
      { "BrokenCo64GoodStco", []( VMovSpec& s ) { s.bBrokenCo64WithGoodStco = true; }, "" },
      { "Co64Only", []( VMovSpec& s ) { s.bCo64Only = true; }, "" },
      { "ChunksOfTwo", []( VMovSpec& s ) { s.SamplesPerChunk = 2; }, "" },
      { "TrakWithoutMdia", []( VMovSpec& s ) { s.bTrakWithoutMdia = true; }, "" },
      { "NoVideoTrack",
        []( VMovSpec& s )
        {
          s.bNoVideo = true;
          s.AudioRate = 8000;
        },
        Parsing },
      { "TimecodeScaleZero",
        []( VMovSpec& s )
        {
          s.TimecodeFrame = 0;
          s.TimecodeScale = 0;
        },
        "2 Could not read 'stsd' atom." },
      // stsc's first entry: its first chunk, then its samples a chunk.
      { "FirstChunkZero", []( VMovSpec& ) {}, Stsc, "stsc", 16, 0 },
      { "FirstChunkBeyondTable", []( VMovSpec& ) {}, Stsc, "stsc", 16, 9 },
      { "StscPromisesTooMany", []( VMovSpec& ) {}, Stsc, "stsc", 20, 11 },
      { "SampleCountBeyondFile", []( VMovSpec& ) {}, "2 Could not read 'stsz' atom.", "stsz", 16, 4000000000u },
      { "VideoTimescaleZero", []( VMovSpec& ) {}, Parsing, "mdhd", 20, 0 },
      { "MovieTimescaleNotDividing", []( VMovSpec& ) {},
        "2 File has a timescale that cannot be represented in 1080MHz ticks.", "mvhd", 20, 44100 },
  };
} // namespace

TEST( MovHandBuilt, OpensOrRefusesWithItsRule )
{
  for( const VSpecCase& rCase : s_SpecCases )
  {
    SCOPED_TRACE( rCase.Name );
    VMovSpec Spec;
    rCase.Change( Spec );
    VBytes Bytes = WriteMov( Spec );
    if( rCase.PatchAtom )
      PatchMoov( Bytes, rCase.PatchAtom, rCase.PatchOffset, rCase.PatchValue );
    LumekTest::VLogCapture Log( "MovIO" );
    MovIO::VMovReader Reader;
    const bool bOpened = OpenBytes( Reader, Bytes );
    const std::vector< std::string > Lines = Log.Lines();
    if( *rCase.Refusal != 0 )
    {
      EXPECT_FALSE( bOpened );
      EXPECT_NE( std::find( Lines.begin(), Lines.end(), rCase.Refusal ), Lines.end() )
          << testing::PrintToString( Lines );
      continue;
    }
    ASSERT_TRUE( bOpened ) << testing::PrintToString( Lines );
    ASSERT_EQ( Reader.GetFrameCount(), Spec.Frames );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_U8Y8V8Y8 );
    EXPECT_EQ( Reader.GetVideoTiming().TicksPerSecond, 1080000000u );
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, 1080000000u / Spec.Timescale * Spec.SampleDuration );
    // Every byte of every frame where the writer put it.
    for( std::uint32_t f = 0; f < Spec.Frames; ++f )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      ASSERT_TRUE( Reader.ReadFrameData( f, pVideo, Audio, true, true ) );
      ASSERT_EQ( pVideo->GetSize(), FrameBytes( Spec ) );
      for( std::uint64_t b = 0; b < pVideo->GetSize(); ++b )
        ASSERT_EQ( pVideo->GetData()[b], PixelByte( f, b ) ) << "frame " << f << " byte " << b;
    }
    EXPECT_FALSE( Reader.HasFrame( Spec.Frames ) );
  }
}

TEST( MovAtomTree, DumpShowsTheTreeAndTheSizeOneOfA64BitMdat )
{
  VMovSpec Spec;
  Spec.bLargeMdatFirst = true;
  Spec.TimecodeFrame = 5;
  const VBytes Bytes = WriteMov( Spec );
  MovIO::VMovReader Reader;
  ASSERT_TRUE( OpenBytes( Reader, Bytes ) );
  std::ostringstream Dump;
  ASSERT_TRUE( Reader.DumpFileStructure( Dump ) );
  const std::string Expected = "\n ftyp\n mdat\n moov\n  mvhd\n  trak\n   tkhd\n   edts\n    elst\n   mdia\n"
                               "    mdhd\n    hdlr\n    minf\n     vmhd\n     stbl\n      stsd\n      stts\n"
                               "      stsc\n      stsz\n      stco\n  trak\n   tkhd\n   edts\n    elst\n   mdia\n"
                               "    mdhd\n    hdlr\n    minf\n     gmhd\n      tmcd\n       tcmi\n     stbl\n"
                               "      stsd\n      stts\n      stsc\n      stsz\n      stco\n";
  EXPECT_EQ( Dump.str(), Expected );
}

TEST( MovAtomTree, HugeUnknownAtomEndsItsContainerQuietly )
{
  VAtomWriter w;
  w.Begin( "moov" ).U32( 0xFFFFFFF0u ).Text( "junk" ).End();
  w.U32( 1 ).Text( "wide" ).U64( 0xFFFFFFFFFFFFFFF0ull );
  MovIO::VMovPrimitiveReader Reader( std::make_shared< UtilsIO::VMemoryInputStream >( w.Data().data(), w.Size() ) );
  MovIO::VMovAtom Root;
  Root.Size = Reader.GetFileSize();
  ASSERT_TRUE( MovIO::BuildAtomTree( Reader, Root ) );
  ASSERT_EQ( Root.Children.size(), 2u );
  EXPECT_EQ( Root.Children[0]->Children.size(), 1u );
  EXPECT_EQ( Root.Children[1]->Size, 1u );
}

TEST( MovTimecode, CountsFromTicks )
{
  // Hand-counted: drop-frame numbering skips ;00 and ;01 at each minute but the tenth.
  const struct
  {
    std::uint32_t Standard;
    std::int64_t Frames;
    const char* Text;
  } Cases[] = {
      { ZOL::TimecodeStandard_29_97_DF, 1800, "00:01:00:02" },
      { ZOL::TimecodeStandard_29_97_DF, 17982, "00:10:00:00" },
      { ZOL::TimecodeStandard_29_97_DF, 1799, "00:00:59:29" },
      { ZOL::TimecodeStandard_29_97, 1800, "00:01:00:00" },
      { ZOL::TimecodeStandard_25, 90000, "01:00:00:00" },
      { ZOL::TimecodeStandard_24, 86399, "00:59:59:23" },
      { ZOL::TimecodeStandard_25, 2160000 + 25, "00:00:01:00" }, // the next day
  };
  static constexpr std::uint64_t s_Periods[] = { 45000000, 45045000, 43200000, 36000000, 36036000, 36036000 };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Text );
    ZOL::ITimecode Timecode;
    Timecode.Standards = rCase.Standard;
    ASSERT_TRUE( MovIO::SetTimecodeFromTicks(
        Timecode, static_cast< std::int64_t >( rCase.Frames * s_Periods[rCase.Standard] + 7 ) ) );
    char Text[32];
    std::snprintf( Text, sizeof( Text ), "%02d:%02d:%02d:%02d", Timecode.Hours, Timecode.Minutes, Timecode.Seconds,
                   Timecode.Frames );
    EXPECT_EQ( std::string( Text ), rCase.Text );
    EXPECT_EQ( Timecode.TickRemainder, 7u );
  }
  // The standard is chosen by the period, 30 ahead of 25; an unknown one leaves it as it was.
  ZOL::ITimecode Timecode;
  EXPECT_TRUE( MovIO::SelectTimecodeStandard( Timecode, 18000000, false, 99 ) );
  EXPECT_EQ( Timecode.Standards, ZOL::TimecodeStandard_30 );
  EXPECT_TRUE( MovIO::SelectTimecodeStandard( Timecode, 21600000, false, 99 ) );
  EXPECT_EQ( Timecode.Standards, ZOL::TimecodeStandard_25 );
  EXPECT_TRUE( MovIO::SelectTimecodeStandard( Timecode, 36036000, true, 99 ) );
  EXPECT_EQ( Timecode.Standards, ZOL::TimecodeStandard_29_97_DF );
  EXPECT_FALSE( MovIO::SelectTimecodeStandard( Timecode, 108000000, false, 3 ) );
  EXPECT_EQ( Timecode.Standards, 3u );
  EXPECT_FALSE( MovIO::SelectTimecodeStandard( Timecode, 0, false, 7 ) );
}

TEST( MovMetadata, QmdtWithBayerShowsLikeARecording )
{
  ZOL::IVideoAttributes FrameStore;
  ZOL::IVideoFrameInfo Info;
  Info.ImageWidth = 16;
  Info.ImageHeight = 8;
  Info.PixelFormat = ZOL::PixelFormat_BayerGB8;
  ASSERT_TRUE( ZOL::WriteVideoFrameInfo( FrameStore, Info ) );
  ZOL::IVideoAttributes Attributes;
  ZOL::IVideoTiming Timing;
  Timing.TicksPerSecond = 135000000;
  Timing.FramePeriodInTicks = 1350000;
  ASSERT_TRUE( ZOL::WriteVideoTiming( Attributes, Timing ) );
  ZOL::IVideoSettings Settings;
  Settings.Saturation = 1.5f;
  Settings.GammaCorrection = 0.8f;
  ASSERT_TRUE( ZOL::WriteVideoSettings( Attributes, "", Settings ) );
  CoreLumekTypes::VLensDistortionCalibration Lens;
  Lens.RadialDistortionParameters = { 0.1, -0.02 };
  Lens.RadialDistortionCentre_X = 8.5;
  ASSERT_TRUE( ZOL::WriteLensDistortionCalibration( Attributes, "", Lens ) );
  Attributes.Set( "Camera.Name", std::string( "Lumek test camera" ) );
  UtilsIO::VMemoryStream Stores;
  ASSERT_TRUE( FrameStore.WriteTo( Stores ) && Attributes.WriteTo( Stores ) );

  VMovSpec Spec;
  Spec.BytesPerPixelTimes2 = 2;
  Spec.Qmdt = Stores.GetData();
  // The stream reads these bytes in place: they must outlive the reader.
  const VBytes Bytes = WriteMov( Spec );
  MovIO::VMovReader Reader;
  ASSERT_TRUE( OpenBytes( Reader, Bytes ) );
  EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_BayerGB8 );
  EXPECT_TRUE( Reader.GetVideoTiming() == Timing );
  EXPECT_TRUE( Reader.GetVideoSettings() == Settings );
  EXPECT_TRUE( Reader.GetAttributes() == Attributes );
  // The frame table is the atoms' own.
  std::shared_ptr< ZOL::IBuffer > pVideo;
  ZOL::IAudioBuffers Audio;
  ASSERT_TRUE( Reader.ReadFrameData( 3, pVideo, Audio, true, false ) );
  EXPECT_EQ( pVideo->GetData()[5], PixelByte( 3, 5 ) );
}

// Cut and flipped files: every outcome is allowed but a crash, a hang or a read outside the
// file; the sanitizer build turns those into failures.
TEST( MovCorruption, CutAndFlippedFilesFailCleanly )
{
  VMovSpec Spec;
  Spec.AudioRate = 8000;
  Spec.TimecodeFrame = 1234;
  Spec.SamplesPerChunk = 2;
  const VBytes Good = WriteMov( Spec );
  const auto Exercise = []( const VBytes& i_rBytes )
  {
    MovIO::VMovReader Reader;
    if( !OpenBytes( Reader, i_rBytes ) )
      return;
    for( std::uint64_t f = 0; f < std::min< std::uint64_t >( Reader.GetFrameCount(), 16 ); ++f )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      static_cast< void >( Reader.ReadFrameData( f, pVideo, Audio, true, true ) );
    }
  };
  LumekTest::VLogCapture Quiet( "", 0 );
  for( std::size_t Cut = 0; Cut < Good.size(); Cut += 7 )
    Exercise( VBytes( Good.begin(), Good.begin() + static_cast< std::ptrdiff_t >( Cut ) ) );
  // Every byte of the movie header, which follows the media data.
  for( std::size_t At = Good.size() - 1200; At < Good.size(); ++At )
    for( std::uint8_t Flip : { 0x01, 0x80, 0xFF } )
    {
      VBytes Bad = Good;
      Bad[At] ^= Flip;
      Exercise( Bad );
    }
}
