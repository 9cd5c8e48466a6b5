// Files written by ffmpeg, compared with ffprobe's figures and ffmpeg's own decode.

#include "AviTestSupport.h"

#include "fileio/JPEGUtils/JPEGParser.h"
#include "fileio/VideoReaders/CreateVideoReader.h"
#include "tests/support/FfmpegFixtures.h"

#include <cstdlib>
#include <gtest/gtest.h>

using namespace AviTest;

namespace
{
  constexpr int Width = 64;
  constexpr int Height = 48;
  constexpr int Frames = 5;

  std::vector< std::string > VideoInput()
  {
    return { "-f", "lavfi", "-i", "testsrc2=size=64x48:rate=25" };
  }

  std::vector< std::string > Concat( std::vector< std::string > i_First, const std::vector< std::string >& i_rSecond )
  {
    i_First.insert( i_First.end(), i_rSecond.begin(), i_rSecond.end() );
    return i_First;
  }

  std::shared_ptr< RapidAVI::VRapidAVIReader > OpenFile( const std::string& i_rPath )
  {
    auto pReader = std::dynamic_pointer_cast< RapidAVI::VRapidAVIReader >( CreateVideoReader( i_rPath ) );
    if( !pReader || !pReader->Open( i_rPath ) )
      return nullptr;
    return pReader;
  }

  VBytes ToBytes( const std::shared_ptr< ZOL::IBuffer >& i_rpBuffer )
  {
    return i_rpBuffer ? VBytes( i_rpBuffer->GetData(), i_rpBuffer->GetData() + i_rpBuffer->GetSize() ) : VBytes();
  }

  // Mean absolute difference of two equally long byte runs.
  double MeanDifference( const VBytes& i_rA, const std::vector< std::uint8_t >& i_rB )
  {
    double Sum = 0.0;
    for( std::size_t i = 0; i < i_rA.size(); ++i )
      Sum += std::abs( int( i_rA[i] ) - int( i_rB[i] ) );
    return i_rA.empty() ? 0.0 : Sum / i_rA.size();
  }

  struct VVideoCase
  {
    const char* Name;
    std::vector< std::string > Encode;
    ZOL::EVideoPayload Payload;
    ZOL::EPixelFormat StoredFormat;
    // ffmpeg's decode to compare with, in the pixel format the reader gives.
    const char* DecodedFormat;
    std::size_t BytesPerPixel;
    bool bInverted;
    // Raw frames are compared as stored; the others after decoding, within a mean difference.
    double Tolerance;
  };

  const VVideoCase s_VideoCases[] = {
      { "Bgr24TopDown",
        { "-c:v", "rawvideo", "-pix_fmt", "bgr24" },
        ZOL::VideoPayload_Uncompressed,
        ZOL::PixelFormat_B8G8R8,
        "bgr24",
        3,
        false,
        0.0 },
      { "Bgr24BottomUp",
        { "-c:v", "rawvideo", "-pix_fmt", "bgr24", "-flipped_raw_rgb", "1" },
        ZOL::VideoPayload_Uncompressed,
        ZOL::PixelFormat_B8G8R8,
        "bgr24",
        3,
        true,
        0.0 },
      { "Gray",
        { "-c:v", "rawvideo", "-pix_fmt", "gray" },
        ZOL::VideoPayload_Uncompressed,
        ZOL::PixelFormat_Luminance8,
        "gray",
        1,
        false,
        0.0 },
      { "Yuyv422",
        { "-c:v", "rawvideo", "-pix_fmt", "yuyv422" },
        ZOL::VideoPayload_Uncompressed,
        ZOL::PixelFormat_Y8U8Y8V8,
        "yuyv422",
        2,
        false,
        0.0 },
      { "Uyvy422",
        { "-c:v", "rawvideo", "-pix_fmt", "uyvy422" },
        ZOL::VideoPayload_Uncompressed,
        ZOL::PixelFormat_U8Y8V8Y8,
        "uyvy422",
        2,
        false,
        0.0 },
      { "Bgra",
        { "-c:v", "rawvideo", "-pix_fmt", "bgra" },
        ZOL::VideoPayload_Uncompressed,
        ZOL::PixelFormat_B8G8R8u8,
        "bgra",
        4,
        false,
        0.0 },
      { "Mjpeg422",
        { "-c:v", "mjpeg", "-pix_fmt", "yuvj422p", "-q:v", "2" },
        ZOL::VideoPayload_ImageJPEG,
        ZOL::PixelFormat_R8G8B8,
        "rgb24",
        3,
        false,
        3.0 },
      { "Mjpeg420",
        { "-c:v", "mjpeg", "-pix_fmt", "yuvj420p", "-q:v", "2" },
        ZOL::VideoPayload_ImageJPEG,
        ZOL::PixelFormat_R8G8B8,
        "rgb24",
        3,
        false,
        3.0 },
      // Luma is exact between two H.264 decoders; the chroma upsampling may differ slightly.
      { "H264",
        { "-c:v", "libx264", "-bf", "0", "-g", "3", "-pix_fmt", "yuv420p" },
        ZOL::VideoPayload_VideoH264,
        ZOL::PixelFormat_U8Y8V8Y8,
        "uyvy422",
        2,
        false,
        2.5 },
  };

  class AviFfmpegVideo : public ::testing::TestWithParam< VVideoCase >
  {
  };
} // namespace

TEST_P( AviFfmpegVideo, MatchesFfprobeAndFfmpegDecode )
{
  const VVideoCase& rCase = GetParam();
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  const std::string Path = LumekTest::FfmpegFixture(
      std::string( rCase.Name ) + ".avi", Concat( VideoInput(), Concat( rCase.Encode, { "-frames:v", "5" } ) ) );
  ASSERT_FALSE( Path.empty() );
  auto pReader = OpenFile( Path );
  ASSERT_TRUE( pReader );

  const std::string Counted = LumekTest::Ffprobe(
      Path, { "-count_frames", "-select_streams", "v:0", "-show_entries", "stream=nb_read_frames", "-of", "csv=p=0" } );
  EXPECT_EQ( pReader->GetFrameCount(), std::stoull( Counted ) );
  EXPECT_DOUBLE_EQ( pReader->GetVideoTiming().GetFrameRate(), 25.0 );
  EXPECT_EQ( pReader->GetVideoPayload(), rCase.Payload );
  EXPECT_EQ( pReader->GetVideoFrameInfo().PixelFormat, rCase.StoredFormat );
  EXPECT_EQ( pReader->GetVideoFrameInfo().ImageWidth, Width );
  EXPECT_EQ( pReader->GetVideoFrameInfo().ImageHeight, Height );
  EXPECT_EQ( pReader->GetVideoFrameInfo().IsInverted(), rCase.bInverted );

  const std::vector< std::uint8_t > Expected = LumekTest::FfmpegDecode( Path, rCase.DecodedFormat );
  const std::size_t FrameBytes = Width * Height * rCase.BytesPerPixel;
  ASSERT_EQ( Expected.size(), FrameBytes * Frames );
  for( std::uint64_t i = 0; i < Frames; ++i )
  {
    const std::vector< std::uint8_t > Want( Expected.begin() + static_cast< std::ptrdiff_t >( i * FrameBytes ),
                                            Expected.begin() +
                                                static_cast< std::ptrdiff_t >( ( i + 1 ) * FrameBytes ) );
    ZOL::IVideoFrame Frame;
    ASSERT_TRUE( pReader->ReadFrame( i, Frame, true, false ) ) << "frame " << i;
    VBytes Got = ToBytes( Frame.Video );
    ASSERT_EQ( Got.size(), FrameBytes ) << "frame " << i;
    if( rCase.bInverted )
    {
      // Stored bottom row first; ffmpeg gives the picture top row first.
      VBytes Flipped;
      const std::size_t Row = Width * rCase.BytesPerPixel;
      for( int y = Height - 1; y >= 0; --y )
        Flipped.insert( Flipped.end(), Got.begin() + y * Row, Got.begin() + ( y + 1 ) * Row );
      Got = Flipped;
    }
    if( rCase.Tolerance == 0.0 )
    {
      EXPECT_TRUE( Got == Want ) << "frame " << i;
      continue;
    }
    EXPECT_LE( MeanDifference( Got, Want ), rCase.Tolerance ) << "frame " << i;
    if( rCase.Payload != ZOL::VideoPayload_VideoH264 )
      continue;
    for( std::size_t p = 1; p < Got.size(); p += 2 )
    {
      ASSERT_EQ( Got[p], Want[p] ) << "luma byte " << p << " of frame " << i;
    }
  }
}

INSTANTIATE_TEST_SUITE_P( Cases, AviFfmpegVideo, ::testing::ValuesIn( s_VideoCases ),
                          []( const ::testing::TestParamInfo< VVideoCase >& rInfo ) { return rInfo.param.Name; } );

namespace
{
  struct VAudioCase
  {
    const char* Name;
    const char* Codec;
    const char* RawFormat;
    int Channels;
    ZOL::EAudioSampleFormat SampleFormat;
  };

  class AviFfmpegAudio : public ::testing::TestWithParam< VAudioCase >
  {
  };
} // namespace

TEST_P( AviFfmpegAudio, EveryByteOnceInOrder )
{
  const VAudioCase& rCase = GetParam();
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  const std::string Path = LumekTest::FfmpegFixture(
      std::string( "Audio" ) + rCase.Name + ".avi",
      Concat( VideoInput(),
              { "-f", "lavfi", "-i", "sine=frequency=440:sample_rate=48000", "-ac", std::to_string( rCase.Channels ),
                "-c:v", "rawvideo", "-pix_fmt", "gray", "-c:a", rCase.Codec, "-frames:v", "5", "-shortest" } ) );
  ASSERT_FALSE( Path.empty() );
  auto pReader = OpenFile( Path );
  ASSERT_TRUE( pReader );
  EXPECT_EQ( pReader->GetAudioPayload(), ZOL::AudioPayload_Uncompressed );
  EXPECT_EQ( pReader->GetAudioFrameInfo().SampleFormat, rCase.SampleFormat );
  EXPECT_EQ( pReader->GetAudioFrameInfo().Channels, rCase.Channels );
  EXPECT_EQ( pReader->GetAudioFrameInfo().SampleRate, 48000 );

  const std::string Expected = LumekTest::RunCommand( "ffmpeg -nostdin -v error -i " + LumekTest::ShellQuote( Path ) +
                                                      " -map 0:a -f " + rCase.RawFormat + " -" );
  std::string Got;
  const std::uint64_t GroupSize = ZOL::GetAudioSampleGroupSizeInBytes( pReader->GetAudioFrameInfo() );
  for( std::uint64_t i = 0; i < pReader->GetFrameCount(); ++i )
  {
    ZOL::IVideoFrame Frame;
    ASSERT_TRUE( pReader->ReadFrame( i, Frame, true, true ) ) << "frame " << i;
    for( const auto& pBlock : Frame.Audio )
    {
      EXPECT_EQ( pBlock->GetSize() % GroupSize, 0u );
      Got.append( reinterpret_cast< const char* >( pBlock->GetData() ), pBlock->GetSize() );
    }
  }
  EXPECT_FALSE( Expected.empty() );
  EXPECT_TRUE( Got == Expected ) << Got.size() << " bytes against " << Expected.size();
}

INSTANTIATE_TEST_SUITE_P(
    Cases, AviFfmpegAudio,
    ::testing::Values( VAudioCase{ "U8Mono", "pcm_u8", "u8", 1, ZOL::AudioSampleFormat_UInt8 },
                       VAudioCase{ "U8Stereo", "pcm_u8", "u8", 2, ZOL::AudioSampleFormat_UInt8 },
                       VAudioCase{ "S16Mono", "pcm_s16le", "s16le", 1, ZOL::AudioSampleFormat_Int16 },
                       VAudioCase{ "S16Stereo", "pcm_s16le", "s16le", 2, ZOL::AudioSampleFormat_Int16 },
                       VAudioCase{ "S24Mono", "pcm_s24le", "s24le", 1, ZOL::AudioSampleFormat_Int24 },
                       VAudioCase{ "S24Stereo", "pcm_s24le", "s24le", 2, ZOL::AudioSampleFormat_Int24 },
                       VAudioCase{ "S32Mono", "pcm_s32le", "s32le", 1, ZOL::AudioSampleFormat_Int32 },
                       VAudioCase{ "S32Stereo", "pcm_s32le", "s32le", 2, ZOL::AudioSampleFormat_Int32 },
                       VAudioCase{ "F32Mono", "pcm_f32le", "f32le", 1, ZOL::AudioSampleFormat_Float32 },
                       VAudioCase{ "F32Stereo", "pcm_f32le", "f32le", 2, ZOL::AudioSampleFormat_Float32 } ),
    []( const ::testing::TestParamInfo< VAudioCase >& rInfo ) { return rInfo.param.Name; } );

namespace
{
  struct VRefusedCase
  {
    const char* Name;
    std::vector< std::string > Arguments;
    std::string LogLine;
  };

  class AviFfmpegRefused : public ::testing::TestWithParam< VRefusedCase >
  {
  };
} // namespace

TEST_P( AviFfmpegRefused, ByTheirRule )
{
  const VRefusedCase& rCase = GetParam();
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  const std::string Path = LumekTest::FfmpegFixture( std::string( rCase.Name ) + ".avi", rCase.Arguments );
  ASSERT_FALSE( Path.empty() );
  VLogCapture Log;
  RapidAVI::VRapidAVIReader Reader;
  EXPECT_FALSE( Reader.Open( Path ) );
  EXPECT_TRUE( Log.Contains( rCase.LogLine ) ) << rCase.LogLine;
  EXPECT_TRUE( Log.Contains( "Could not parse tree of AVI chunks.  File may be corrupt or unsupported." ) );
}

INSTANTIATE_TEST_SUITE_P(
    Cases, AviFfmpegRefused,
    ::testing::Values(
        // 8-bit bitmaps are shown as grey: a colour palette cannot be honoured.
        VRefusedCase{ "Pal8", Concat( VideoInput(), { "-c:v", "rawvideo", "-pix_fmt", "pal8", "-frames:v", "2" } ),
                      "Invalid palette contents.  If a palette is defined it must be greyscale." },
        VRefusedCase{ "Mpeg4", Concat( VideoInput(), { "-c:v", "mpeg4", "-frames:v", "2" } ),
                      "Unsupported compression format in AVI file." },
        // One video and at most one audio stream: a third stream list breaks the header rule.
        VRefusedCase{ "TwoAudioStreams",
                      Concat( VideoInput(), { "-f", "lavfi", "-i", "sine=sample_rate=48000", "-map", "0:v", "-map",
                                              "1:a", "-map", "1:a", "-c:v", "rawvideo", "-pix_fmt", "gray", "-c:a",
                                              "pcm_s16le", "-frames:v", "2", "-shortest" } ),
                      "'LIST-hdlr' chunk must contain a single 'avih' and either 1 or 2 'LIST-strl' chunks." } ),
    []( const ::testing::TestParamInfo< VRefusedCase >& rInfo ) { return rInfo.param.Name; } );

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
    if( i_bWithAPP0 )
    {
      const VBytes App = { 0xFF, 0xE0, 0x00, 0x10, 'A', 'V', 'I', '1', 0, 0, 0, 0, 0, 0, 0, 0, 0, 0 };
      Frame.insert( Frame.end(), App.begin(), App.end() );
    }
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

  VBytes DecodedFrame( RapidAVI::VRapidAVIReader& io_rReader, std::uint64_t i_Frame )
  {
    ZOL::IVideoFrame Frame;
    if( !io_rReader.ReadFrame( i_Frame, Frame, true, false ) )
      return {};
    return ToBytes( Frame.Video );
  }
} // namespace

TEST( AviMJPEG, AVI1FramesRebuiltWithTheTypicalTablesDecodeAsTheWholeFrames )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  // The typical tables, so that leaving them out and putting them back changes nothing.
  const std::string Path = LumekTest::FfmpegFixture(
      "MjpegTypicalTables.avi", Concat( VideoInput(), { "-c:v", "mjpeg", "-huffman", "default", "-pix_fmt", "yuvj422p",
                                                        "-bitexact", "-frames:v", "5" } ) );
  ASSERT_FALSE( Path.empty() );
  auto pWhole = OpenFile( Path );
  ASSERT_TRUE( pWhole );

  VAviSpec Spec;
  Spec.Width = Width;
  Spec.Height = Height;
  Spec.Compression = RapidAVI::MakeFourCC( "MJPG" );
  Spec.Bits = 24;
  for( std::uint64_t i = 0; i < Frames; ++i )
    Spec.Frames.push_back( ToAVI1( ReadVideo( *pWhole, i ), i != 2 ) );
  Spec.OldIndexFrames = Frames;
  VLogCapture Log;
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  for( std::uint64_t i = 0; i < Frames; ++i )
  {
    const VBytes Rebuilt = DecodedFrame( *Avi.pReader, i );
    if( i == 2 )
    {
      // Neither whole nor AVI1: that frame fails, its neighbours decode.
      EXPECT_TRUE( Rebuilt.empty() );
      continue;
    }
    const VBytes Whole = DecodedFrame( *pWhole, i );
    ASSERT_EQ( Whole.size(), std::size_t( Width * Height * 3 ) );
    EXPECT_TRUE( Rebuilt == Whole ) << "frame " << i;
  }
  EXPECT_TRUE( Log.Contains( "MJPEG not in expected format for AVI: missing APP0." ) );
}

TEST( AviMJPEG, AVI1ChecksRefuseOtherAndInterlacedFrames )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "no ffmpeg";
  const std::string Path = LumekTest::FfmpegFixture(
      "MjpegTypicalTables.avi", Concat( VideoInput(), { "-c:v", "mjpeg", "-huffman", "default", "-pix_fmt", "yuvj422p",
                                                        "-bitexact", "-frames:v", "5" } ) );
  auto pWhole = OpenFile( Path );
  ASSERT_TRUE( pWhole );
  VBytes Other = ToAVI1( ReadVideo( *pWhole, 0 ), true );
  Other[7] = '2'; // "AVI2"
  VBytes Interlaced = ToAVI1( ReadVideo( *pWhole, 0 ), true );
  Interlaced[2 + 8] = 1;
  VAviSpec Spec;
  Spec.Width = Width;
  Spec.Height = Height;
  Spec.Compression = RapidAVI::MakeFourCC( "MJPG" );
  Spec.Bits = 24;
  Spec.Frames = { Other, Interlaced, VBytes{ 0xFF, 0xD8, 0xFF, 0xD9 } };
  Spec.OldIndexFrames = 3;
  VLogCapture Log;
  VOpenedAvi Avi = OpenAvi( BuildAvi( Spec ) );
  ASSERT_TRUE( Avi.bOpened );
  for( std::uint64_t i = 0; i < 3; ++i )
    EXPECT_TRUE( ReadVideo( *Avi.pReader, i ).empty() ) << i;
  EXPECT_TRUE( Log.Contains( "MJPEG not in expected format for AVI: APP0 is not 'AVI1' type." ) );
  EXPECT_TRUE( Log.Contains( "MJPEG not in expected format: Interlaced MJPEG not supported." ) );
}
