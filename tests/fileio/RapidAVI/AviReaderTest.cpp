// Hand-built RIFF trees: each case of the chunk rules and timing, the dump, the guards against
// damaged fields, the audio each frame owns; damaged files, hand-built and ffmpeg's, cut short and
// with bytes flipped at many places; and files written by ffmpeg, compared with ffprobe's
// figures and ffmpeg's own decode.

#include "AviTestSupport.h"

#include "fileio/JPEGUtils/JPEGParser.h"
#include "fileio/VideoReaders/CreateVideoReader.h"

#include <cstdlib>
#include <gtest/gtest.h>

using namespace AviTest;
using namespace ContainerTest;

namespace
{
  VBytes Nested( int i_Depth )
  {
    VBytes Inner = Chunk( "JUNK", VBytes( 4, 0 ) );
    for( int i = 0; i < i_Depth; ++i )
      Inner = List( "rec ", { Inner } );
    return Inner;
  }

  VBytes Info( const std::string& i_rId, const std::string& i_rText )
  {
    return List( "INFO", { Chunk( i_rId, VLE().Text( i_rText ).Zeros( 1 ).Bytes ) } );
  }

  void Bitmap( VAviSpec& io_rSpec, std::uint32_t i_Compression, std::uint16_t i_Bits )
  {
    io_rSpec.Compression = i_Compression;
    io_rSpec.Bits = i_Bits;
  }

  void Timing( VAviSpec& io_rSpec, std::uint32_t i_Scale, std::uint32_t i_Rate, std::uint32_t i_MicrosecondsPerFrame )
  {
    io_rSpec.Scale = i_Scale;
    io_rSpec.Rate = i_Rate;
    io_rSpec.MicrosecondsPerFrame = i_MicrosecondsPerFrame;
  }

  struct VTreeCase
  {
    const char* Name;
    void ( *Change )( VAviSpec& );
    // 0 when the file is refused.
    std::uint64_t FrameCount;
    // A line the log must hold; empty for none.
    std::string LogLine;
    // The frame period in 135 MHz ticks.
    std::uint32_t Period = 5400000;
  };

  // GreySpec( 3 ) changed by each row.
  const VTreeCase s_TreeCases[] = {
      { "Plain", []( VAviSpec& ) {}, 3, "" },
      { "UnknownRiffFormAfterGoodPart",
        []( VAviSpec& s ) { s.Trailer = List( "WAVE", { Chunk( "data", VBytes( 6 ) ) }, "RIFF" ); }, 3,
        "Unknown RIFF chunk 'WAVE' ignored." },
      { "Creator511", []( VAviSpec& s ) { s.ExtraHeaderChunks = Info( "ISFT", std::string( 510, 'x' ) ); }, 3,
        "AVI file created by: " + std::string( 510, 'x' ) },
      { "Creator512", []( VAviSpec& s ) { s.ExtraHeaderChunks = Info( "ISFT", std::string( 511, 'x' ) ); }, 3,
        "File creator chunk too large to show." },
      { "SMPTETimecode", []( VAviSpec& s ) { s.ExtraHeaderChunks = Info( "ISMP", "01:02:03:04" ); }, 3,
        "AVI file SMPTE start timecode: 01:02:03:04" },
      { "OldIndexAheadOfMovi", []( VAviSpec& s ) { s.ExtraHeaderChunks = Chunk( "idx1", VBytes( 16, 0 ) ); }, 3,
        "Index 'idx1' ahead of any 'LIST-movi' chunk ignored." },
      { "RateZero", []( VAviSpec& s ) { s.Rate = 0; }, 0, "AVI video stream has a rate of 0." },
      { "PeriodBeyond32Bits", []( VAviSpec& s ) { s.Scale = 1000; }, 0,
        "AVI video frame period of 1000/25 seconds is too long." },
      { "ListsNestedTooDeep", []( VAviSpec& s ) { s.ExtraMoviChunks = Nested( 12 ); }, 0,
        "RIFF lists are nested deeper than 8 levels." },
      { "YUY2With32Bits", []( VAviSpec& s ) { Bitmap( s, RapidAVI::MakeFourCC( "YUY2" ), 32 ); }, 0,
        "Unexpected bit depth in AVI file." },
      { "Y800With16Bits", []( VAviSpec& s ) { s.Bits = 16; }, 0,
        "Unsupported bit depth for Y800 data format in AVI file." },
      { "RGBWith16Bits", []( VAviSpec& s ) { Bitmap( s, 0, 16 ); }, 0,
        "Unsupported bit depth for BGR or BGRu data format in AVI file." },
      { "EightBitWithoutPalette", []( VAviSpec& s ) { s.Compression = 0; }, 0,
        "Unsupported bitmap palette format.  Only a 256-colour BGRA palette is supported." },
      { "SuperIndexBeyondFile",
        []( VAviSpec& s ) { s.ExtraHeaderChunks = Chunk( "indx", VLE().Zeros( 4 ).U16( 0xFFFF ).Zeros( 18 ).Bytes ); },
        0, "AVI cannot be read because superindex cannot be read." },
      { "OpenDMLHeaderCut", []( VAviSpec& s ) { s.Trailer = List( "odml", { Chunk( "dmlh", VBytes( 4 ) ) } ); }, 0,
        "AVI cannot be read because superindex cannot be read, or doesn't contain exactly one entry." },
      // An AVIX part behind the AVI part, each with its own standard index.
      { "ExtendedPart",
        []( VAviSpec& s )
        {
          s.StandardIndexFrames = 3;
          s.ExtendedFrames = { VBytes( 32, 4 ), VBytes( 32, 5 ) };
        },
        5, "" },
      // Without a stream period the main header's rate gives it.
      { "Ntsc", []( VAviSpec& s ) { Timing( s, 1001, 30000, 33367 ); }, 3, "", 4504500 },
      { "SevenHz", []( VAviSpec& s ) { Timing( s, 1, 7, 142857 ); }, 3,
        "AVI video frame rate cannot be represented in 135000000Hz ticks.", 19285714 },
      { "MainHeaderOnly", []( VAviSpec& s ) { Timing( s, 0, 25, 33367 ); }, 3, "", 4504654 },
      { "NoPeriodAnywhere", []( VAviSpec& s ) { Timing( s, 0, 25, 0 ); }, 3, "", 0 },
  };

  void ReadEverything( const VBytes& i_rFile )
  {
    VOpenedAvi Avi = OpenAvi( i_rFile );
    std::ostringstream Dump;
    (void)Avi.pReader->DumpFileStructure( Dump );
    // A damaged count can promise many frames; a few past the start and the end show enough.
    const std::uint64_t Count = Avi.pReader->GetFrameCount();
    for( std::uint64_t i = 0; i < Count && i < 8; ++i )
    {
      ZOL::IVideoFrame Frame;
      (void)Avi.pReader->ReadFrame( i, Frame, true, true );
      (void)Avi.pReader->ReadFrame( Count - 1 - i, Frame, true, true );
    }
  }

  // Both index kinds, audio, an AVIX part and a pad byte; or ffmpeg's files.
  VBytes CorruptionFile( const std::string& i_rName )
  {
    if( i_rName == "FfmpegMjpegWithAudio" )
      return ReadFileBytes( FfmpegAvi(
          "CorruptMjpeg.avi", "-f lavfi -i sine=sample_rate=8000 -c:v mjpeg -c:a pcm_s16le -shortest -frames:v 3" ) );
    if( i_rName == "FfmpegH264" )
      return ReadFileBytes( FfmpegAvi( "CorruptH264.avi", "-c:v libx264 -bf 0 -frames:v 3" ) );
    VAviSpec Spec = GreySpec( 6 );
    Spec.StandardIndexFrames = 4;
    Spec.AudioFormat = WaveFormat( 1, 2, 48000, 16 );
    Spec.AudioChunks.assign( 6, VBytes( 7680, 0x55 ) );
    Spec.ExtendedFrames = { VBytes( 32, 50 ) };
    Spec.ExtraMoviChunks = Chunk( "JUNK", VBytes( 3 ) );
    return BuildAvi( Spec );
  }

  class AviCorruption : public ::testing::TestWithParam< std::string >
  {
  };

  constexpr int Width = 64;
  constexpr int Height = 48;
  constexpr std::uint64_t Frames = 5;

  std::shared_ptr< RapidAVI::VRapidAVIReader > OpenFile( const std::string& i_rPath )
  {
    auto pReader = std::dynamic_pointer_cast< RapidAVI::VRapidAVIReader >( CreateVideoReader( i_rPath ) );
    return pReader && pReader->Open( i_rPath ) ? pReader : nullptr;
  }

  struct VFfmpegCase
  {
    const char* Name;
    const char* Encode;
    ZOL::EVideoPayload Payload;
    ZOL::EPixelFormat StoredFormat;
    // ffmpeg's decode to compare with, in the pixel format the reader gives.
    const char* DecodedFormat;
    std::size_t BytesPerPixel;
    bool bInverted;
    // Raw frames are compared as stored; the others after decoding, within a mean difference.
    double Tolerance;
    // The audio stream's codec and channels; the format the reader gives.
    const char* Audio;
    ZOL::EAudioSampleFormat SampleFormat;
  };

  // Luma is exact between two H.264 decoders; the chroma upsampling may differ slightly. Float
  // and samples of more than 16 bits come in the extensible form of the audio header.
  const VFfmpegCase s_Cases[] = {
      { "Bgr24BottomUp", "-c:v rawvideo -pix_fmt bgr24 -flipped_raw_rgb 1", ZOL::VideoPayload_Uncompressed,
        ZOL::PixelFormat_B8G8R8, "bgr24", 3, true, 0.0, "-c:a pcm_s24le -ac 2", ZOL::AudioSampleFormat_Int24 },
      { "Uyvy422", "-c:v rawvideo -pix_fmt uyvy422", ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_U8Y8V8Y8,
        "uyvy422", 2, false, 0.0, "-c:a pcm_u8 -ac 1", ZOL::AudioSampleFormat_UInt8 },
      { "H264", "-c:v libx264 -bf 0 -g 3 -pix_fmt yuv420p", ZOL::VideoPayload_VideoH264, ZOL::PixelFormat_U8Y8V8Y8,
        "uyvy422", 2, false, 2.5, "-c:a pcm_f32le -ac 2", ZOL::AudioSampleFormat_Float32 },
  };

  // An ffmpeg frame made into the AVI1 form: its JFIF APP0 and DHT segments left out, an AVI1
  // APP0 in second place. i_bWithAPP0 false leaves out the APP0 as well.
  VBytes ToAVI1( const VBytes& i_rFrame, bool i_bWithAPP0 )
  {
    UtilsIO::VMemoryInputStream Stream( i_rFrame.data(), i_rFrame.size() );
    std::vector< JPEGUtils::VJPEGSegment > Segments;
    EXPECT_TRUE( JPEGUtils::ParseJPEG( Stream, i_rFrame.size(), Segments ) );
    VBytes Frame = { 0xFF, 0xD8 };
    const VBytes App = { 0xFF, 0xE0, 0x00, 0x10, 'A', 'V', 'I', '1', 0, 0, 0, 0, 0, 0, 0, 0, 0, 0 };
    if( i_bWithAPP0 )
      Frame.insert( Frame.end(), App.begin(), App.end() );
    for( std::size_t i = 1; i < Segments.size(); ++i )
    {
      if( Segments[i].Marker == 0xC4 || Segments[i].Marker == 0xE0 )
        continue;
      const std::uint64_t End = i + 1 < Segments.size() ? Segments[i + 1].Start : i_rFrame.size();
      Frame.insert( Frame.end(), i_rFrame.begin() + static_cast< std::ptrdiff_t >( Segments[i].Start ),
                    i_rFrame.begin() + static_cast< std::ptrdiff_t >( End ) );
    }
    return Frame;
  }
} // namespace

TEST( AviTree, OpensCountsAndDumpsAsTheRulesSay )
{
  for( const VTreeCase& rCase : s_TreeCases )
  {
    SCOPED_TRACE( rCase.Name );
    VAviSpec Spec = GreySpec( 3 );
    rCase.Change( Spec );
    LumekTest::VLogCapture Log;
    VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
    EXPECT_EQ( Avi.bOpened, rCase.FrameCount > 0 );
    EXPECT_TRUE( !Avi.bOpened || Avi.pReader->GetVideoTiming().FramePeriodInTicks == rCase.Period );
    EXPECT_TRUE( rCase.LogLine.empty() || Log.Has( rCase.LogLine ) ) << rCase.LogLine;
    ASSERT_EQ( Avi.pReader->GetFrameCount(), rCase.FrameCount );
    for( std::uint64_t i = 0; i < rCase.FrameCount; ++i )
      EXPECT_EQ( ReadVideo( *Avi.pReader, i ), VBytes( 32, static_cast< std::uint8_t >( i + 1 ) ) ) << "frame " << i;
  }
  // An ix00 whose count runs past its chunk, and a file that is no RIFF at all.
  VAviSpec Spec = GreySpec( 3 );
  Spec.StandardIndexFrames = 3;
  VBytes File = BuildAvi( Spec );
  Patch( File, "ix00", 4, 0x10000000, 4 );
  LumekTest::VLogCapture Log;
  EXPECT_FALSE( OpenAvi( File ).bOpened );
  EXPECT_TRUE( Log.Has( "Could not read AVI file index." ) );
  VOpenedAvi Garbage = OpenAvi( VBytes( 64, 0x5A ) );
  EXPECT_TRUE( Garbage.bOpened );
  EXPECT_EQ( Garbage.pReader->GetFrameCount(), 0u );
  EXPECT_TRUE( Log.Has( "Unknown chunk 'ZZZZ' ignored." ) );

  // The chunk tree as the dump prints it, the pad byte of an odd chunk and all.
  VAviSpec Odd = GreySpec( 1 );
  Odd.ExtraMoviChunks = Chunk( "JUNK", VBytes( 3, 0 ) );
  std::ostringstream Text;
  ASSERT_TRUE( OpenAvi( BuildAvi( Odd ) ).pReader->DumpFileStructure( Text ) );
  const VBytes Golden = ReadFileBytes( AVI_GOLDEN_FOLDER "/dump-odd-junk.txt" );
  EXPECT_EQ( Text.str(), std::string( Golden.begin(), Golden.end() ) );

  // Bitmaps of positive height are stored bottom row first, whichever name they go by; the
  // other formats never are.
  for( const std::uint32_t FourCC :
       { RapidAVI::MakeFourCC( "RGB " ), RapidAVI::MakeFourCC( "DIB " ), RapidAVI::MakeFourCC( "YUY2" ) } )
  {
    VAviSpec Positive;
    Bitmap( Positive, FourCC, FourCC == RapidAVI::MakeFourCC( "YUY2" ) ? 16 : 32 );
    Positive.StrfHeight = 4;
    Positive.Frames = { VBytes( 8 * 4 * Positive.Bits / 8, 1 ) };
    Positive.OldIndexFrames = 1;
    VOpenedAvi Avi = OpenAvi( BuildAvi( Positive ) );
    ASSERT_TRUE( Avi.bOpened );
    EXPECT_EQ( Avi.pReader->GetVideoFrameInfo().IsInverted(), Positive.Bits == 32 ) << Positive.Bits;
    EXPECT_EQ( ReadVideo( *Avi.pReader, 0 ), Positive.Frames[0] );
  }
}

// An old index of a hundred frames against a standard index of ninety; entries that lie.
TEST( AviIndex, EntriesBeyondTheFileFailOnlyTheirFrame )
{
  VAviSpec Spec = GreySpec( 100 );
  Spec.StandardIndexFrames = 90;
  LumekTest::VLogCapture Log;
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetFrameCount(), 100u );
  EXPECT_TRUE( Avi.pReader->HasFrame( 99 ) );
  EXPECT_EQ( Avi.pReader->FindStoredFrameAtOrAfter( 99 ), std::optional< std::uint64_t >( 99 ) );
  EXPECT_FALSE( Avi.pReader->FindStoredFrameAtOrAfter( 100 ) );
  EXPECT_EQ( ReadVideo( *Avi.pReader, 89 ), VBytes( 32, 90 ) );
  for( std::uint64_t Frame = 90; Frame < 100; ++Frame )
    EXPECT_TRUE( ReadVideo( *Avi.pReader, Frame ).empty() ) << Frame;
  EXPECT_TRUE( Log.Has( "Attempting to read frame beyond end of file." ) );

  // Frame 1's audio runs past the file by its idx1 entry: the frame fails only when its audio is
  // asked for. (Damaged video entries in either index are among the flips of AviCorruption.)
  VAviSpec Audible = GreySpec( 3 );
  Audible.AudioFormat = WaveFormat( 1, 1, 48000, 16 );
  Audible.AudioChunks.assign( 3, VBytes( 3840, 0x80 ) );
  VBytes File = BuildAvi( Audible );
  Patch( File, "idx1", 4 * 16 + 12, 0x40000F00, 4 );
  VOpenedAvi Damaged = OpenAvi( File );
  ASSERT_TRUE( Damaged.bOpened );
  for( std::uint64_t i = 0; i < 3; ++i )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    EXPECT_EQ( Damaged.pReader->ReadFrameData( i, pVideo, Audio, true, true ), i != 1 ) << "frame " << i;
    EXPECT_FALSE( ReadVideo( *Damaged.pReader, i ).empty() ) << "frame " << i;
  }
  // A raw frame one byte too long fails without a word: a player asks for it again and again.
  Spec = GreySpec( 2 );
  Spec.Frames[1] = VBytes( 33, 2 );
  VOpenedAvi Long = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Long.bOpened );
  EXPECT_EQ( ReadVideo( *Long.pReader, 0 ), VBytes( 32, 1 ) );
  LumekTest::VLogCapture Quiet;
  EXPECT_TRUE( ReadVideo( *Long.pReader, 1 ).empty() );
  EXPECT_TRUE( Quiet.Records.empty() );
}

TEST( AviAudio, ChunksBelongToFramesByPlayTime )
{
  // Half-frame chunks, two a frame; then a chunk of two frames, after which each chunk starts a
  // frame one frame early, and the last frame is left without audio.
  const std::vector< std::uint64_t > ChunkOfFrame = { 0, 2, 4, 5, 6 };
  const std::vector< std::vector< std::uint64_t > > Blocks = { { 1920, 1920 }, { 1920, 1920 }, { 7680 },
                                                               { 3840 },       { 3840 },       {} };
  // A format refused leaves every frame readable without sound. The formats taken are ffmpeg's
  // (AviFfmpeg.MatchesFfprobeAndFfmpegDecodeAfterEachSeek); IEEE float is taken in its extensible form only.
  const struct
  {
    const char* Name;
    VBytes Format;
    std::string LogLine;
  } Formats[] = { { "Pcm16", WaveFormat( 1, 1, 48000, 16 ), "" },
                  { "NoSampleRate", WaveFormat( 1, 1, 0, 16 ), "" },
                  { "Pcm12", WaveFormat( 1, 1, 48000, 12 ), "Unsupported audio bits per sample in AVI file." },
                  { "PlainFloatTag", WaveFormat( 3, 1, 48000, 32 ), "Unsupported audio payload in AVI file." } };
  for( const auto& rFormat : Formats )
  {
    const bool bTaken = &rFormat == &Formats[0];
    SCOPED_TRACE( rFormat.Name );
    VAviSpec Spec = GreySpec( 6 );
    Spec.AudioFormat = rFormat.Format;
    for( std::size_t Bytes : { 1920, 1920, 1920, 1920, 7680, 3840, 3840 } )
      Spec.AudioChunks.push_back( VBytes( Bytes, 0x80 ) );
    LumekTest::VLogCapture Log;
    VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
    ASSERT_TRUE( Avi.bOpened );
    EXPECT_TRUE( rFormat.LogLine.empty() || Log.Has( rFormat.LogLine ) ) << rFormat.LogLine;
    EXPECT_TRUE( rFormat.LogLine.empty() || Avi.pReader->GetAudioPayload() == ZOL::AudioPayload_None );
    EXPECT_EQ( Avi.pReader->GetAudioChunkOfFrame(), bTaken ? ChunkOfFrame : std::vector< std::uint64_t >() );
    for( std::uint64_t i = 0; i < Blocks.size(); ++i )
    {
      ZOL::IVideoFrame Frame;
      ASSERT_TRUE( Avi.pReader->ReadFrame( i, Frame, true, true ) );
      std::vector< std::uint64_t > Sizes;
      for( const auto& pBlock : Frame.Audio )
        Sizes.push_back( pBlock->GetSize() );
      EXPECT_EQ( Sizes, bTaken ? Blocks[i] : std::vector< std::uint64_t >() ) << "frame " << i;
    }
  }
}

// A QMDT part describes what strf cannot, Bayer formats among them, and replaces it whole.
TEST( AviMetadata, BayerDescriptionFromTheStores )
{
  ZOL::IVideoAttributes Attributes;
  Attributes.Set( "Recording.Take", std::string( "Take 7" ) );
  ZOL::IVideoTiming Timing;
  VAviSpec Spec = GreySpec( 4 );
  Spec.Trailer = List( "QMDT", { BayerStores( 8, 4, Attributes, Timing ) }, "RIFF" );
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  EXPECT_EQ( Avi.pReader->GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_BayerGB8 );
  EXPECT_EQ( Avi.pReader->GetVideoFrameInfo().ImageWidth, 8 );
  EXPECT_EQ( Avi.pReader->GetVideoFrameInfo().ImageHeight, 4 );
  EXPECT_EQ( Avi.pReader->GetVideoTiming(), Timing );
  EXPECT_EQ( Avi.pReader->GetAttributes(), Attributes );
  ASSERT_EQ( Avi.pReader->GetFrameCount(), 4u );
  for( std::uint64_t i = 0; i < 4; ++i )
    EXPECT_EQ( ReadVideo( *Avi.pReader, i ), Spec.Frames[i] );
}

// Every byte of the headers, then a spread over the rest.
TEST_P( AviCorruption, CutsAndFlips )
{
  const VBytes File = CorruptionFile( GetParam() );
  if( File.empty() )
    GTEST_SKIP() << "no fixture";
  CutsAndFlips( File, 0, 512, std::max< std::size_t >( 1, File.size() / 300 ), ReadEverything );
}

INSTANTIATE_TEST_SUITE_P( Files, AviCorruption, ::testing::Values( "HandBuilt", "FfmpegMjpegWithAudio", "FfmpegH264" ),
                          []( const ::testing::TestParamInfo< std::string >& i_rInfo ) { return i_rInfo.param; } );

TEST( AviFfmpeg, MatchesFfprobeAndFfmpegDecodeAfterEachSeek )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  for( const VFfmpegCase& rCase : s_Cases )
  {
    SCOPED_TRACE( rCase.Name );
    const std::string Path = FfmpegAvi( std::string( rCase.Name ) + ".avi",
                                        std::string( "-f lavfi -i sine=frequency=440:sample_rate=48000 -shortest " ) +
                                            rCase.Encode + " " + rCase.Audio + " -frames:v 5" );
    auto pReader = OpenFile( Path );
    ASSERT_TRUE( pReader );
    EXPECT_EQ( pReader->GetFrameCount(), std::stoull( Probe( Path, "stream=nb_frames" ) ) );
    EXPECT_DOUBLE_EQ( pReader->GetVideoTiming().GetFrameRate(), 25.0 );
    EXPECT_EQ( pReader->GetVideoPayload(), rCase.Payload );
    EXPECT_EQ( pReader->GetVideoFrameInfo().PixelFormat, rCase.StoredFormat );
    EXPECT_EQ( pReader->GetVideoFrameInfo().ImageWidth, Width );
    EXPECT_EQ( pReader->GetVideoFrameInfo().ImageHeight, Height );
    EXPECT_EQ( pReader->GetVideoFrameInfo().IsInverted(), rCase.bInverted );
    EXPECT_EQ( pReader->GetAudioPayload(), ZOL::AudioPayload_Uncompressed );
    EXPECT_EQ( pReader->GetAudioFrameInfo().SampleFormat, rCase.SampleFormat );
    EXPECT_EQ( pReader->GetAudioFrameInfo().Channels, std::stoi( Probe( Path, "stream=channels", "a:0" ) ) );
    EXPECT_EQ( pReader->GetAudioFrameInfo().SampleRate, std::stoi( Probe( Path, "stream=sample_rate", "a:0" ) ) );

    const std::vector< std::uint8_t > Expected = LumekTest::FfmpegDecode( Path, rCase.DecodedFormat );
    const std::size_t Row = Width * rCase.BytesPerPixel;
    const std::size_t FrameBytes = Row * Height;
    ASSERT_EQ( Expected.size(), FrameBytes * Frames );
    // In the order a viewer jumping back through the file reads them.
    std::vector< std::uint64_t > Order;
    for( const auto& rGroup : GroupsLastFirst( Path ) )
      Order.insert( Order.end(), rGroup.begin(), rGroup.end() );
    ASSERT_EQ( Order.size(), Frames );
    for( const std::uint64_t i : Order )
    {
      const auto Want = Expected.begin() + static_cast< std::ptrdiff_t >( i * FrameBytes );
      VBytes Got = ReadVideo( *pReader, i, true );
      ASSERT_EQ( Got.size(), FrameBytes ) << "frame " << i;
      // Stored bottom row first; ffmpeg gives the picture top row first.
      for( std::size_t y = 0; rCase.bInverted && y < Height / 2; ++y )
        std::swap_ranges( Got.begin() + y * Row, Got.begin() + ( y + 1 ) * Row, Got.end() - ( y + 1 ) * Row );
      double Difference = 0.0;
      for( std::size_t p = 0; p < FrameBytes; ++p )
      {
        Difference += std::abs( int( Got[p] ) - int( Want[p] ) );
        ASSERT_TRUE( rCase.Payload != ZOL::VideoPayload_VideoH264 || p % 2 == 0 || Got[p] == Want[p] )
            << "luma byte " << p << " of frame " << i << ": " << int( Got[p] ) << " for " << int( Want[p] );
      }
      EXPECT_LE( Difference / FrameBytes, rCase.Tolerance ) << "frame " << i;
    }

    // Every audio byte once, in order, in whole sample groups.
    VBytes Audio;
    const std::uint64_t GroupSize = ZOL::GetAudioSampleGroupSizeInBytes( pReader->GetAudioFrameInfo() );
    for( std::uint64_t i = 0; i < pReader->GetFrameCount(); ++i )
    {
      ZOL::IVideoFrame Frame;
      ASSERT_TRUE( pReader->ReadFrame( i, Frame, false, true ) ) << "frame " << i;
      for( const auto& pBlock : Frame.Audio )
      {
        EXPECT_EQ( pBlock->GetSize() % GroupSize, 0u );
        Audio.insert( Audio.end(), pBlock->GetData(), pBlock->GetData() + pBlock->GetSize() );
      }
    }
    const VBytes Stored = StreamCopy( Path, "a:0" );
    EXPECT_FALSE( Stored.empty() );
    EXPECT_TRUE( Audio == Stored ) << Audio.size() << " bytes against " << Stored.size();
  }
}

TEST( AviFfmpeg, RefusedByTheirRule )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  const struct
  {
    const char* Name;
    const char* Arguments;
    const char* LogLine;
  } Cases[] = {
      // 8-bit bitmaps are shown as grey: a colour palette cannot be honoured.
      { "Pal8", "-c:v rawvideo -pix_fmt pal8",
        "Invalid palette contents.  If a palette is defined it must be greyscale." },
      { "Mpeg4", "-c:v mpeg4", "Unsupported compression format in AVI file." },
      // One video and at most one audio stream: a third stream list breaks the header rule.
      { "TwoAudioStreams",
        "-f lavfi -i sine=sample_rate=48000 -map 0:v -map 1:a -map 1:a -c:v rawvideo -pix_fmt gray -c:a pcm_s16le "
        "-shortest",
        "'LIST-hdlr' chunk must contain a single 'avih' and either 1 or 2 'LIST-strl' chunks." } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Name );
    const std::string Path =
        FfmpegAvi( std::string( rCase.Name ) + ".avi", rCase.Arguments + std::string( " -frames:v 2" ) );
    ASSERT_FALSE( Path.empty() );
    LumekTest::VLogCapture Log;
    RapidAVI::VRapidAVIReader Reader;
    EXPECT_FALSE( Reader.Open( Path ) );
    EXPECT_TRUE( Log.Has( rCase.LogLine ) ) << rCase.LogLine;
    EXPECT_TRUE( Log.Has( "Could not parse tree of AVI chunks.  File may be corrupt or unsupported." ) );
  }
}

TEST( AviMJPEG, AVI1FramesRebuiltWithTheTypicalTablesAndTheOnesRefused )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  // The typical tables, so that leaving them out and putting them back changes nothing.
  auto pWhole = OpenFile(
      FfmpegAvi( "MjpegTypicalTables.avi", "-c:v mjpeg -huffman default -pix_fmt yuvj422p -bitexact -frames:v 5" ) );
  ASSERT_TRUE( pWhole );
  VAviSpec Spec;
  Spec.Width = Width;
  Spec.Height = Height;
  Spec.Compression = RapidAVI::MakeFourCC( "MJPG" );
  Spec.Bits = 24;
  // Frame 2 is neither whole nor AVI1.
  for( std::uint64_t i = 0; i < Frames; ++i )
    Spec.Frames.push_back( ToAVI1( ReadVideo( *pWhole, i ), i != 2 ) );
  VBytes Other = ToAVI1( ReadVideo( *pWhole, 0 ), true );
  Other[7] = '2'; // "AVI2"
  VBytes Interlaced = ToAVI1( ReadVideo( *pWhole, 0 ), true );
  Interlaced[2 + 8] = 1;
  Spec.Frames.insert( Spec.Frames.end(), { Other, Interlaced, VBytes{ 0xFF, 0xD8, 0xFF, 0xD9 } } );
  Spec.OldIndexFrames = static_cast< int >( Spec.Frames.size() );

  LumekTest::VLogCapture Log;
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  // The refused frames fail alone; their neighbours decode to the whole frames' pictures.
  for( std::uint64_t i = 0; i < Spec.Frames.size(); ++i )
  {
    const bool bRefused = i >= Frames || i == 2;
    const VBytes Whole = bRefused ? VBytes() : ReadVideo( *pWhole, i, true );
    EXPECT_EQ( Whole.size(), bRefused ? 0 : std::size_t( Width * Height * 3 ) );
    EXPECT_TRUE( ReadVideo( *Avi.pReader, i, true ) == Whole ) << "frame " << i;
  }
  EXPECT_TRUE( Log.Has( "MJPEG not in expected format for AVI: missing APP0." ) );
  EXPECT_TRUE( Log.Has( "MJPEG not in expected format for AVI: APP0 is not 'AVI1' type." ) );
  EXPECT_TRUE( Log.Has( "MJPEG not in expected format: Interlaced MJPEG not supported." ) );
}
