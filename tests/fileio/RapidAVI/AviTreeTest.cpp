// Hand-built RIFF trees: each case of the chunk rules, the guards against damaged fields, and
// the dump.

#include "AviTestSupport.h"

#include "fileio/LumekVideo/VReader.h"
#include "fileio/LumekVideo/VWriter.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <algorithm>
#include <functional>
#include <gtest/gtest.h>
#include <sstream>

using namespace AviTest;

namespace
{
  // Sets the first byte of the named chunk's payload at i_Offset.
  void Patch( VBytes& io_rFile, const std::string& i_rId, std::size_t i_Offset, std::uint64_t i_Value, int i_Width )
  {
    const auto Found = std::search( io_rFile.begin(), io_rFile.end(), i_rId.begin(), i_rId.end() );
    ASSERT_NE( Found, io_rFile.end() ) << i_rId;
    const std::size_t At = static_cast< std::size_t >( Found - io_rFile.begin() ) + 8 + i_Offset;
    for( int i = 0; i < i_Width; ++i )
      io_rFile[At + static_cast< std::size_t >( i )] = static_cast< std::uint8_t >( i_Value >> ( 8 * i ) );
  }

  VBytes Nested( int i_Depth )
  {
    VBytes Inner = Chunk( "JUNK", VBytes( 4, 0 ) );
    for( int i = 0; i < i_Depth; ++i )
      Inner = List( "rec ", { Inner } );
    return Inner;
  }

  VBytes GreyPalette( bool i_bColourChanged, bool i_bAlphaChanged )
  {
    VBytes Palette;
    for( int i = 0; i < 256; ++i )
      Palette.insert( Palette.end(), { static_cast< std::uint8_t >( i ), static_cast< std::uint8_t >( i ),
                                       static_cast< std::uint8_t >( i ), 0 } );
    if( i_bColourChanged )
      Palette[4 * 17 + 1] ^= 1;
    if( i_bAlphaChanged )
      Palette[4 * 17 + 3] = 0xFF;
    return Palette;
  }

  struct VTreeCase
  {
    const char* Name;
    std::function< VBytes() > Build;
    bool bOpens;
    std::uint64_t FrameCount;
    // A line the log must hold; empty for none.
    std::string LogLine;
  };

  VBytes WithSpec( int i_Frames, const std::function< void( VAviSpec& ) >& i_rChange )
  {
    VAviSpec Spec = GreySpec( i_Frames );
    i_rChange( Spec );
    return BuildAvi( Spec );
  }

  const VTreeCase s_TreeCases[] = {
      { "Plain", [] { return WithSpec( 3, []( VAviSpec& ) {} ); }, true, 3, "" },
      { "OddJunkWithPadByte",
        []
        { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.ExtraMoviChunks = Chunk( "JUNK", VBytes( 3, 7 ) ); } ); },
        true, 3, "" },
      { "ThirdStreamList",
        []
        {
          return WithSpec( 3,
                           []( VAviSpec& rSpec )
                           {
                             rSpec.AudioFormat = WaveFormat( 1, 1, 48000, 16 );
                             rSpec.ExtraHeaderChunks =
                                 List( "strl", { StreamHeader( "auds", 1, 48000 ), WaveFormat( 1, 1, 48000, 16 ) } );
                           } );
        },
        false, 0, "'LIST-hdlr' chunk must contain a single 'avih' and either 1 or 2 'LIST-strl' chunks." },
      { "UnknownRiffFormAfterGoodPart",
        [] {
          return WithSpec( 3, []( VAviSpec& rSpec )
                           { rSpec.Trailer = Riff( "WAVE", { Chunk( "data", VBytes( 6 ) ) } ); } );
        },
        true, 3, "Unknown RIFF chunk 'WAVE' ignored." },
      { "RecordListInMovi",
        []
        {
          return WithSpec( 3, []( VAviSpec& rSpec )
                           { rSpec.ExtraMoviChunks = List( "rec ", { Chunk( "00dc", VBytes( 32, 9 ) ) } ); } );
        },
        true, 3, "Unknown chunk 'LIST-rec ' ignored." },
      { "Creator511",
        [] {
          return WithSpec( 1, []( VAviSpec& rSpec ) { rSpec.ExtraHeaderChunks = List( "INFO", { Creator( 511 ) } ); } );
        },
        true, 1, "AVI file created by: " + std::string( 510, 'x' ) },
      { "Creator512",
        [] {
          return WithSpec( 1, []( VAviSpec& rSpec ) { rSpec.ExtraHeaderChunks = List( "INFO", { Creator( 512 ) } ); } );
        },
        true, 1, "File creator chunk too large to show." },
      { "SMPTETimecode",
        []
        {
          return WithSpec( 1,
                           []( VAviSpec& rSpec )
                           {
                             VBytes Text;
                             AppendText( Text, "01:02:03:04" );
                             Text.push_back( 0 );
                             rSpec.ExtraHeaderChunks = List( "INFO", { Chunk( "ISMP", Text ) } );
                           } );
        },
        true, 1, "AVI file SMPTE start timecode: 01:02:03:04" },
      { "OldIndexAheadOfMovi",
        [] {
          return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.ExtraHeaderChunks = Chunk( "idx1", VBytes( 16, 0 ) ); } );
        },
        true, 3, "Index 'idx1' ahead of any 'LIST-movi' chunk ignored." },
      { "NoIndexNoFrames", [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.OldIndexFrames = -1; } ); }, true, 0,
        "" },
      { "RateZero", [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.Rate = 0; } ); }, false, 0,
        "AVI video stream has a rate of 0." },
      { "PeriodBeyond32Bits", [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.Scale = 1000; } ); }, false, 0,
        "AVI video frame period of 1000/25 seconds is too long." },
      { "ListsNestedTooDeep",
        [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.ExtraMoviChunks = Nested( 12 ); } ); }, false, 0,
        "RIFF lists are nested deeper than 8 levels." },
      { "ListsNestedDeepButFine",
        [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.ExtraMoviChunks = Nested( 4 ); } ); }, true, 3, "" },
      { "UnsupportedCompression",
        [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.Compression = RapidAVI::MakeFourCC( "FMP4" ); } ); },
        false, 0, "Unsupported compression format in AVI file." },
      { "YUY2With32Bits",
        []
        {
          return WithSpec( 3,
                           []( VAviSpec& rSpec )
                           {
                             rSpec.Compression = RapidAVI::MakeFourCC( "YUY2" );
                             rSpec.Bits = 32;
                           } );
        },
        false, 0, "Unexpected bit depth in AVI file." },
      { "Y800With16Bits", [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.Bits = 16; } ); }, false, 0,
        "Unsupported bit depth for Y800 data format in AVI file." },
      { "RGBWith16Bits",
        []
        {
          return WithSpec( 3,
                           []( VAviSpec& rSpec )
                           {
                             rSpec.Compression = 0;
                             rSpec.Bits = 16;
                           } );
        },
        false, 0, "Unsupported bit depth for BGR or BGRu data format in AVI file." },
      { "GreyPalette",
        []
        {
          return WithSpec( 3,
                           []( VAviSpec& rSpec )
                           {
                             rSpec.Compression = 0;
                             rSpec.Palette = GreyPalette( false, false );
                           } );
        },
        true, 3, "" },
      { "GreyPaletteOtherAlpha",
        []
        {
          return WithSpec( 3,
                           []( VAviSpec& rSpec )
                           {
                             rSpec.Compression = 0;
                             rSpec.Palette = GreyPalette( false, true );
                           } );
        },
        true, 3, "" },
      { "ColourPalette",
        []
        {
          return WithSpec( 3,
                           []( VAviSpec& rSpec )
                           {
                             rSpec.Compression = 0;
                             rSpec.Palette = GreyPalette( true, false );
                           } );
        },
        false, 0, "Invalid palette contents.  If a palette is defined it must be greyscale." },
      { "EightBitWithoutPalette", [] { return WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.Compression = 0; } ); }, false,
        0, "Unsupported bitmap palette format.  Only a 256-colour BGRA palette is supported." },
      { "StandardIndexCountBeyondChunk",
        []
        {
          VBytes File = WithSpec( 3, []( VAviSpec& rSpec ) { rSpec.StandardIndexFrames = 3; } );
          Patch( File, "ix00", 4, 0x10000000, 4 );
          return File;
        },
        false, 0, "Could not read AVI file index." },
      { "SuperIndexBeyondFile",
        []
        {
          VBytes Index( 24, 0 );
          Index[4] = 0xFF;
          Index[5] = 0xFF;
          return WithSpec( 3, [&]( VAviSpec& rSpec ) { rSpec.ExtraHeaderChunks = Chunk( "indx", Index ); } );
        },
        false, 0, "AVI cannot be read because superindex cannot be read." },
      { "OpenDMLHeaderCut",
        [] {
          return WithSpec( 1, []( VAviSpec& rSpec )
                           { rSpec.Trailer = List( "odml", { Chunk( "dmlh", VBytes( 4 ) ) } ); } );
        },
        false, 0, "AVI cannot be read because superindex cannot be read, or doesn't contain exactly one entry." },
      { "TrailingBytesShorterThanAHeader",
        [] { return WithSpec( 2, []( VAviSpec& rSpec ) { rSpec.Trailer = VBytes( 5, 0xAB ); } ); }, true, 2, "" },
      { "GarbageFile", [] { return VBytes( 64, 0x5A ); }, true, 0, "Unknown chunk 'ZZZZ' ignored." },
  };

  class AviTree : public ::testing::TestWithParam< VTreeCase >
  {
  };
} // namespace

TEST_P( AviTree, OpensAndCountsAsTheRulesSay )
{
  const VTreeCase& rCase = GetParam();
  VLogCapture Log;
  VOpenedAvi Avi = OpenAvi( rCase.Build() );
  EXPECT_EQ( Avi.bOpened, rCase.bOpens );
  if( !rCase.LogLine.empty() )
  {
    EXPECT_TRUE( Log.Contains( rCase.LogLine ) ) << rCase.LogLine;
  }
  if( !rCase.bOpens )
  {
    EXPECT_EQ( Avi.pReader->GetFrameCount(), 0u );
    return;
  }
  ASSERT_EQ( Avi.pReader->GetFrameCount(), rCase.FrameCount );
  // GreySpec frames are filled with their number plus one.
  for( std::uint64_t i = 0; i < rCase.FrameCount; ++i )
    EXPECT_EQ( ReadVideo( *Avi.pReader, i ), Frame( 32, static_cast< std::uint8_t >( i + 1 ) ) ) << "frame " << i;
}

INSTANTIATE_TEST_SUITE_P( Cases, AviTree, ::testing::ValuesIn( s_TreeCases ),
                          []( const ::testing::TestParamInfo< VTreeCase >& rInfo ) { return rInfo.param.Name; } );

TEST( AviTreeIndex, OldIndexOfHundredAgainstStandardIndexOfNinety )
{
  VAviSpec Spec = GreySpec( 100 );
  Spec.StandardIndexFrames = 90;
  VLogCapture Log;
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetFrameCount(), 100u );
  EXPECT_TRUE( Avi.pReader->HasFrame( 99 ) );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 89 ), Frame( 32, 90 ) );
  for( std::uint64_t Frame = 90; Frame < 100; ++Frame )
    EXPECT_TRUE( ReadVideo( *Avi.pReader, Frame ).empty() ) << Frame;
  EXPECT_TRUE( Log.Contains( "Attempting to read frame beyond end of file." ) );
}

TEST( AviTreeIndex, ExtendedPartAddsFrames )
{
  VAviSpec Spec = GreySpec( 3 );
  Spec.OldIndexFrames = 3;
  Spec.StandardIndexFrames = 3;
  Spec.ExtendedFrames = { Frame( 32, 40 ), Frame( 32, 41 ) };
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetMoviPositions().size(), 2u );
  ASSERT_EQ( Avi.pReader->GetFrameCount(), 5u );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 2 ), Frame( 32, 3 ) );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 3 ), Frame( 32, 40 ) );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 4 ), Frame( 32, 41 ) );
}

TEST( AviTreeIndex, TruncationInsideMoviKeepsTheWalkQuiet )
{
  VAviSpec Spec = GreySpec( 6 );
  const VBytes Whole = BuildAvi( Spec );
  // Cut in the middle of the fourth frame's payload: idx1 is gone, so there are no frames.
  const auto Movi = std::search( Whole.begin(), Whole.end(), std::begin( "movi" ), std::end( "movi" ) - 1 );
  const std::size_t Cut = static_cast< std::size_t >( Movi - Whole.begin() ) + 4 + 3 * 40 + 20;
  VOpenedAvi Avi = OpenAvi( VBytes( Whole.begin(), Whole.begin() + static_cast< std::ptrdiff_t >( Cut ) ) );
  EXPECT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetFrameCount(), 0u );
}

TEST( AviTreeIndex, DamagedEntriesFailOnlyTheirFrame )
{
  // An ix00 size with its top bit set, and an idx1 offset beyond the file.
  VAviSpec Spec = GreySpec( 3 );
  Spec.StandardIndexFrames = 3;
  VBytes File = BuildAvi( Spec );
  Patch( File, "ix00", 24 + 8 + 4, 0x80000020, 4 );
  VOpenedAvi Avi = OpenAvi( File );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 0 ), Frame( 32, 1 ) );
  EXPECT_TRUE( ReadVideo( *Avi.pReader, 1 ).empty() );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 2 ), Frame( 32, 3 ) );

  VBytes Far = BuildAvi( GreySpec( 3 ) );
  Patch( Far, "idx1", 16 + 8, 0x7FFFFFF0, 4 );
  VOpenedAvi FarAvi = OpenAvi( Far );
  ASSERT_TRUE( FarAvi.bOpened );
  EXPECT_TRUE( ReadVideo( *FarAvi.pReader, 1 ).empty() );
  EXPECT_EQ( ReadVideo( *FarAvi.pReader, 2 ), Frame( 32, 3 ) );
}

TEST( AviTreeIndex, RawFrameOfTheWrongSizeFailsSilently )
{
  VAviSpec Spec = GreySpec( 2 );
  Spec.Frames[1] = Frame( 33, 2 );
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 0 ), Frame( 32, 1 ) );
  VLogCapture Log;
  EXPECT_TRUE( ReadVideo( *Avi.pReader, 1 ).empty() );
  EXPECT_TRUE( Log.GetRecords().empty() );
}

struct VTimingCase
{
  const char* Name;
  std::uint32_t Scale;
  std::uint32_t Rate;
  std::uint32_t MicrosecondsPerFrame;
  std::uint32_t Period;
  double MainHeaderRate;
  bool bInexact;
};

class AviTiming : public ::testing::TestWithParam< VTimingCase >
{
};

TEST_P( AviTiming, PeriodInTicks )
{
  const VTimingCase& rCase = GetParam();
  VAviSpec Spec = GreySpec( 1 );
  Spec.Scale = rCase.Scale;
  Spec.Rate = rCase.Rate;
  Spec.MicrosecondsPerFrame = rCase.MicrosecondsPerFrame;
  VLogCapture Log;
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetVideoTiming().TicksPerSecond, 135000000u );
  EXPECT_EQ( Avi.pReader->GetVideoTiming().FramePeriodInTicks, rCase.Period );
  EXPECT_DOUBLE_EQ( Avi.pReader->GetMainHeaderFrameRate(), rCase.MainHeaderRate );
  EXPECT_EQ( Log.Contains( "AVI video frame rate cannot be represented in 135000000Hz ticks." ), rCase.bInexact );
}

INSTANTIATE_TEST_SUITE_P( Cases, AviTiming,
                          ::testing::Values( VTimingCase{ "Pal25", 1, 25, 40000, 5400000, 25.0, false },
                                             VTimingCase{ "Ntsc", 1001, 30000, 33367, 4504500, 29.969, false },
                                             VTimingCase{ "Seven", 1, 7, 142857, 19285714, 7.0, true },
                                             // No stream period: the main header's rate gives it.
                                             VTimingCase{ "MainHeaderOnly", 0, 25, 33367, 4504654, 29.969, false },
                                             VTimingCase{ "NoPeriodAnywhere", 0, 25, 0, 0, 0.0, false } ),
                          []( const ::testing::TestParamInfo< VTimingCase >& rInfo ) { return rInfo.param.Name; } );

struct VInvertedCase
{
  const char* Name;
  std::uint32_t Compression;
  std::uint16_t Bits;
  std::int32_t StrfHeight;
  bool bInverted;
};

class AviInverted : public ::testing::TestWithParam< VInvertedCase >
{
};

TEST_P( AviInverted, BottomUpFlag )
{
  const VInvertedCase& rCase = GetParam();
  VAviSpec Spec;
  Spec.Compression = rCase.Compression;
  Spec.Bits = rCase.Bits;
  Spec.StrfHeight = rCase.StrfHeight;
  Spec.Frames = { Frame( 8 * 4 * rCase.Bits / 8, 1 ) };
  Spec.OldIndexFrames = 1;
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetVideoFrameInfo().IsInverted(), rCase.bInverted );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 0 ).size(), Spec.Frames[0].size() );
}

INSTANTIATE_TEST_SUITE_P(
    Cases, AviInverted,
    ::testing::Values( VInvertedCase{ "RgbBottomUp", RapidAVI::MakeFourCC( "RGB " ), 24, 4, true },
                       VInvertedCase{ "RgbTopDown", RapidAVI::MakeFourCC( "RGB " ), 24, -4, false },
                       VInvertedCase{ "DibBottomUp32", RapidAVI::MakeFourCC( "DIB " ), 32, 4, true },
                       VInvertedCase{ "Y800PositiveHeight", RapidAVI::MakeFourCC( "Y800" ), 8, 4, false },
                       VInvertedCase{ "Yuy2PositiveHeight", RapidAVI::MakeFourCC( "YUY2" ), 16, 4, false } ),
    []( const ::testing::TestParamInfo< VInvertedCase >& rInfo ) { return rInfo.param.Name; } );

TEST( AviDump, PrintsTheChunkTree )
{
  VAviSpec Spec = GreySpec( 1 );
  Spec.ExtraMoviChunks = Chunk( "JUNK", VBytes( 3, 0 ) );
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  std::ostringstream Text;
  ASSERT_TRUE( Avi.pReader->DumpFileStructure( Text ) );
  EXPECT_EQ( Text.str(), "RIFF size: 292 pos: 0\n"
                         "  LIST-hdrl size: 192 pos: 12\n"
                         "    avih size: 56 pos: 24\n"
                         "    LIST-strl size: 116 pos: 88\n"
                         "      strh size: 56 pos: 100\n"
                         "      strf size: 40 pos: 164\n"
                         "  LIST-movi size: 56 pos: 212\n"
                         "    JUNK size: 3 pos: 224\n"
                         "    00dc size: 32 pos: 236\n"
                         "  idx1 size: 16 pos: 276\n" );
}

TEST( AviMetadata, BayerDescriptionPlaysLikeAnLvid )
{
  ZOL::IVideoFrameInfo Info;
  Info.ImageWidth = 8;
  Info.ImageHeight = 4;
  Info.PixelFormat = ZOL::PixelFormat_BayerGB8;
  ZOL::IVideoAttributes FrameStore;
  ASSERT_TRUE( ZOL::WriteVideoFrameInfo( FrameStore, Info ) );
  ZOL::IVideoAttributes Attributes;
  ZOL::IVideoTiming Timing;
  Timing.FramePeriodInTicks = 1350000;
  ASSERT_TRUE( ZOL::WriteVideoTiming( Attributes, Timing ) );
  Attributes.Set( "Recording.Take", std::string( "Take 7" ) );
  UtilsIO::VMemoryStream Stores;
  ASSERT_TRUE( FrameStore.WriteTo( Stores ) && Attributes.WriteTo( Stores ) );

  VAviSpec Spec = GreySpec( 4 );
  Spec.Trailer = Riff( "QMDT", { Stores.GetData() } );
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );

  // The same frames and description through the .lvid writer and reader.
  auto pLvid = std::make_shared< UtilsIO::VMemoryStream >();
  {
    LumekVideo::VWriter Writer;
    ASSERT_TRUE( Writer.Create( pLvid, Info, ZOL::IAudioFrameInfo(), Attributes ) );
    for( std::uint64_t i = 0; i < 4; ++i )
      ASSERT_TRUE( Writer.AppendFrame( i, Spec.Frames[i].data(), Spec.Frames[i].size() ) );
    ASSERT_TRUE( Writer.Close() );
  }
  LumekVideo::VReader Lvid;
  ASSERT_TRUE( Lvid.Open( std::shared_ptr< ZOL::IInputStreamSeekable >( pLvid ) ) );

  EXPECT_EQ( Avi.pReader->GetVideoFrameInfo(), Lvid.GetVideoFrameInfo() );
  EXPECT_EQ( Avi.pReader->GetVideoTiming(), Lvid.GetVideoTiming() );
  EXPECT_EQ( Avi.pReader->GetAttributes(), Attributes );
  ASSERT_EQ( Avi.pReader->GetFrameCount(), Lvid.GetFrameCount() );
  for( std::uint64_t i = 0; i < 4; ++i )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Lvid.ReadFrameData( i, pVideo, Audio, true, false ) );
    EXPECT_EQ( ReadVideo( *Avi.pReader, i ), VBytes( pVideo->GetData(), pVideo->GetData() + pVideo->GetSize() ) );
  }
}
