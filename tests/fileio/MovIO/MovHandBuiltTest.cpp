// Atom trees written by the tests' own writer: the tree walk's cases, each bound the reader
// must hold, the metadata atom, and damaged files at many points.

#include "ContainerTestSupport.h"
#include "MovTestSupport.h"

#include "fileio/MovIO/VMovReader.h"
#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

using namespace MovTest;

namespace
{
  bool OpenBytes( MovIO::VMovReader& io_rReader, const VBytes& i_rBytes )
  {
    return io_rReader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( i_rBytes.data(), i_rBytes.size() ) );
  }

  // Opens the file and reads its first frames, whatever they hold.
  void ReadFrames( const VBytes& i_rBytes )
  {
    MovIO::VMovReader Reader;
    const std::uint64_t Count =
        OpenBytes( Reader, i_rBytes ) ? std::min< std::uint64_t >( Reader.GetFrameCount(), 16 ) : 0;
    for( std::uint64_t f = 0; f < Count; ++f )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      static_cast< void >( Reader.ReadFrameData( f, pVideo, Audio, true, true ) );
    }
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
  constexpr const char* Parsing = "2 There was an error parsing the MOV file.";
  const auto Same = []( VMovSpec& ) {};

  const VSpecCase s_SpecCases[] = {
      { "Plain", Same, "" },
      { "LargeMdatAheadOfMoov", []( VMovSpec& s ) { s.bLargeMdatFirst = true; }, "" },
      { "MdatSizeZero", Same, AtomTree, "mdat", 0, 0 },
      // Four spare bytes end the walk like QuickTime's terminating zero word; fewer fail it.
      { "FourStrayBytes", []( VMovSpec& s ) { s.StrayBytes = 4; }, "" },
      { "ThreeStrayBytes", []( VMovSpec& s ) { s.StrayBytes = 3; }, AtomTree },
      { "TwoMdiaBacktrack", []( VMovSpec& s ) { s.bTwoMdiaFirstEmpty = true; }, "" },
      { "SttsTwoEntries", Same, "2 Could not read 'stts' atom.", "stts", 12, 2 },
      { "Co64Only", []( VMovSpec& s ) { s.bCo64Only = true; }, "" },
      { "ChunksOfTwo", []( VMovSpec& s ) { s.SamplesPerChunk = 2; }, "" },
      // The video track's handler made unknown: a track of a kind this reader does not play.
      { "NoVideoTrack", Same, "2 Could not find a video track in mov file.", "vide", 4, 0x78787878 },
      { "TimecodeScaleZero", []( VMovSpec& s ) { s.TimecodeFrame = s.TimecodeScale = 0; },
        "2 Could not read 'stsd' atom." },
      // stsc's first entry's first chunk.
      { "FirstChunkZero", Same, "2 Could not read 'stsc' atom.", "stsc", 16, 0 },
      { "SampleCountBeyondFile", Same, "2 Could not read 'stsz' atom.", "stsz", 16, 4000000000u },
      { "VideoTimescaleZero", Same, Parsing, "mdhd", 20, 0 },
      { "MovieTimescaleNotDividing", Same, "2 File has a timescale that cannot be represented in 1080MHz ticks.",
        "mvhd", 20, 44100 },
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
      Patch( Bytes, rCase.PatchAtom, rCase.PatchOffset, rCase.PatchValue );
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
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, 1080000000u / Timescale * SampleDuration );
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
  const VBytes Golden = ContainerTest::ReadFile( MOV_GOLDEN_FOLDER "/dump-timecode-track.txt" );
  EXPECT_EQ( Dump.str(), std::string( Golden.begin(), Golden.end() ) );

  // A size past the file's end ends its container where the file ends, inside or outside.
  VAtomWriter w;
  w.Begin( "moov" ).U32( 0xFFFFFFF0u ).Text( "junk" ).End();
  w.U32( 1 ).Text( "wide" ).U64( 0xFFFFFFFFFFFFFFF0ull );
  MovIO::VMovPrimitiveReader Primitive( std::make_shared< UtilsIO::VMemoryInputStream >( w.Data().data(), w.Size() ) );
  MovIO::VMovAtom Root;
  Root.Size = Primitive.GetFileSize();
  ASSERT_TRUE( MovIO::BuildAtomTree( Primitive, Root ) );
  ASSERT_EQ( Root.Children.size(), 2u );
  EXPECT_EQ( Root.Children[0]->Children.size(), 1u );
  EXPECT_EQ( Root.Children[1]->Size, 1u );
}

TEST( MovMetadata, QmdtWithBayerShowsLikeARecording )
{
  ZOL::IVideoAttributes Attributes;
  ZOL::IVideoSettings Settings;
  Settings.Saturation = 1.5f;
  Settings.GammaCorrection = 0.8f;
  ASSERT_TRUE( ZOL::WriteVideoSettings( Attributes, "", Settings ) );
  Attributes.Set( "Camera.Name", std::string( "Lumek test camera" ) );
  ZOL::IVideoTiming Timing;
  VMovSpec Spec;
  Spec.BytesPerPixelTimes2 = 2;
  Spec.Qmdt = ContainerTest::BayerStores( 16, 8, Attributes, Timing );
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

// Every byte of the movie header, which follows the media data; a spread over the media data.
TEST( MovCorruption, CutAndFlippedFilesFailCleanly )
{
  VMovSpec Spec;
  Spec.AudioRate = 8000;
  Spec.TimecodeFrame = 1234;
  Spec.SamplesPerChunk = 2;
  const VBytes Good = WriteMov( Spec );
  ContainerTest::CutsAndFlips( Good, Good.size() - 1200, Good.size(), 7, ReadFrames );
}
