// Files written by ffmpeg, compared with ffprobe's figures and ffmpeg's own decode.

#include "AviTestSupport.h"

#include "fileio/JPEGUtils/JPEGParser.h"
#include "fileio/VideoReaders/CreateVideoReader.h"

#include <cstdlib>
#include <gtest/gtest.h>

using namespace AviTest;

namespace
{
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
} // namespace

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
    using ContainerTest::Probe;
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
    for( const auto& rGroup : ContainerTest::GroupsLastFirst( Path ) )
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
    const VBytes Stored = ContainerTest::StreamCopy( Path, "a:0" );
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

namespace
{
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
