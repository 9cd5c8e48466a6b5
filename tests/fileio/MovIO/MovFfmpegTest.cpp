// Files written by ffmpeg in each data format the reader takes, checked against ffprobe's
// figures and ffmpeg's own demuxing and decoding; and ffmpeg's files that the reader refuses,
// each with the rule that refuses it.

#include "MovTestSupport.h"

#include "fileio/H264IO/VH264Decoder.h"
#include "fileio/MovIO/VMovReader.h"
#include "tests/support/FfmpegFixtures.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/IBuffer.h"

#include <gtest/gtest.h>

#include <boost/filesystem.hpp>

#include <fstream>
#include <iterator>
#include <sstream>

namespace
{
  using LumekTest::FfmpegFixture;

  struct VFfmpegCase
  {
    const char* Name;
    const char* Extension;
    // Video source rate, e.g. "25" or "30000/1001".
    const char* Rate;
    std::vector< std::string > VideoArguments;
    std::vector< std::string > AudioArguments;
    // "" for no timecode track.
    const char* Timecode;
    // The pixel format ffmpeg decodes raw frames to for a byte comparison, "" for compressed.
    const char* RawPixelFormat;
    ZOL::EVideoPayload Payload;
    ZOL::EAudioSampleFormat AudioFormat;
    // For a file the reader refuses: the line of the rule that refuses it; "" if it opens.
    const char* Refusal;
  };

  std::ostream& operator<<( std::ostream& o_rStream, const VFfmpegCase& i_rCase )
  {
    return o_rStream << i_rCase.Name;
  }

  const std::vector< std::string > s_Pcm16 = { "-c:a", "pcm_s16le" };

  std::vector< std::string > Raw( const char* i_pPixelFormat )
  {
    return { "-c:v", "rawvideo", "-pix_fmt", i_pPixelFormat };
  }

  const VFfmpegCase s_Cases[] = {
      { "Uyvy2vuyAudioTimecode", "mov", "25", Raw( "uyvy422" ), s_Pcm16, "01:02:03:04", "uyvy422",
        ZOL::VideoPayload_Uncompressed, ZOL::AudioSampleFormat_Int16, "" },
      { "Yuyv422yuvs30",
        "mov",
        "30",
        Raw( "yuyv422" ),
        {},
        "10:00:00:00",
        "yuyv422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "V210At24",
        "mov",
        "24",
        { "-c:v", "v210" },
        {},
        "",
        "",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "Rgb24Raw", "mov", "25", Raw( "rgb24" ), s_Pcm16, "00:00:10:00", "rgb24", ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Int16, "" },
      { "Bgr24At50",
        "mov",
        "50",
        Raw( "bgr24" ),
        {},
        "",
        "bgr24",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "Bgra",
        "mov",
        "25",
        Raw( "bgra" ),
        {},
        "",
        "bgra",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "Rgba",
        "mov",
        "25",
        Raw( "rgba" ),
        {},
        "",
        "rgba",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "Mjpeg",
        "mov",
        "25",
        { "-c:v", "mjpeg", "-pix_fmt", "yuvj422p" },
        s_Pcm16,
        "",
        "",
        ZOL::VideoPayload_ImageJPEG,
        ZOL::AudioSampleFormat_Int16,
        "" },
      { "Png",
        "mov",
        "25",
        { "-c:v", "png", "-pix_fmt", "rgb24" },
        {},
        "",
        "",
        ZOL::VideoPayload_ImagePNG,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "Tiff",
        "mov",
        "25",
        { "-c:v", "tiff", "-pix_fmt", "rgb24" },
        {},
        "",
        "",
        ZOL::VideoPayload_ImageTIFF,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "H264Baseline",
        "mov",
        "25",
        { "-c:v", "libx264", "-profile:v", "baseline", "-pix_fmt", "yuv420p", "-g", "30" },
        s_Pcm16,
        "00:59:59:00",
        "",
        ZOL::VideoPayload_VideoH264,
        ZOL::AudioSampleFormat_Int16,
        "" },
      { "H264InMp4",
        "mp4",
        "25",
        { "-c:v", "libx264", "-profile:v", "baseline", "-pix_fmt", "yuv420p" },
        {},
        "",
        "",
        ZOL::VideoPayload_VideoH264,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "DropFrame2997", "mov", "30000/1001", Raw( "uyvy422" ), s_Pcm16, "01:00:00;02", "uyvy422",
        ZOL::VideoPayload_Uncompressed, ZOL::AudioSampleFormat_Int16, "" },
      { "NonDrop2997",
        "mov",
        "30000/1001",
        Raw( "uyvy422" ),
        {},
        "01:00:00:02",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "Film23976",
        "mov",
        "24000/1001",
        Raw( "uyvy422" ),
        {},
        "00:00:01:23",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "TwosBigEndian",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "pcm_s16be" },
        "",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Int16,
        "" },
      { "RawU8Audio",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "pcm_u8" },
        "",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_UInt8,
        "" },
      { "In24Audio",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "pcm_s24be" },
        "",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Int24,
        "" },
      { "In32Audio",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "pcm_s32be" },
        "",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Int32,
        "" },
      { "LpcmAt96k",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "pcm_s16le", "-ar", "96000" },
        "",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Int16,
        "" },
      { "At60Truncated",
        "mov",
        "60",
        Raw( "uyvy422" ),
        {},
        "",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },
      { "At60Timescale600",
        "mov",
        "60",
        { "-c:v", "rawvideo", "-pix_fmt", "uyvy422", "-video_track_timescale", "600" },
        {},
        "",
        "uyvy422",
        ZOL::VideoPayload_Uncompressed,
        ZOL::AudioSampleFormat_Unspecified,
        "" },

      // Refused: ffmpeg stores argb as 'raw ' of depth 32, and 'raw ' is taken at depth 24 only.
      { "ArgbNotSupported",
        "mov",
        "25",
        Raw( "argb" ),
        {},
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 FourCC code '1918990112' is not supported." },
      // Refused: 'mp4v' is not in the table of data formats.
      { "Mpeg4NotSupported",
        "mov",
        "25",
        { "-c:v", "mpeg4" },
        {},
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 FourCC code '1836070006' is not supported." },
      // Refused: float audio has no row in the sound description tables.
      { "FloatAudio",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "pcm_f32le" },
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 Audio format unsupported (sample description version=1, FourCC=fl32)." },
      // Refused: 8-bit signed samples are written as 'sowt' with a size of 8.
      { "SignedByteAudio",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "pcm_s8" },
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 Audio format unsupported (sample description version=0, FourCC=sowt)." },
      // Refused: AAC's edit list starts the audio at a media time after its priming samples.
      { "AacEditList",
        "mov",
        "25",
        Raw( "uyvy422" ),
        { "-c:a", "aac" },
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 Could not read 'elst' atom." },
      // Refused: two fields a frame.
      { "Interlaced",
        "mov",
        "25",
        { "-c:v", "rawvideo", "-pix_fmt", "uyvy422", "-field_order", "tt" },
        {},
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 Opening interlaced files is not supported." },
      // Refused: colour described other than as BT.709.
      { "Bt601Colour",
        "mov",
        "25",
        { "-c:v", "rawvideo", "-pix_fmt", "uyvy422", "-color_primaries", "smpte170m", "-color_trc", "smpte170m",
          "-colorspace", "smpte170m" },
        {},
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 Could not read 'colr' atom." },
      // Refused: timecode at 50 frames a second counts 50 frames, and the 25 fps standard 25.
      { "Timecode50",
        "mov",
        "50",
        Raw( "uyvy422" ),
        {},
        "00:00:01:00",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 Number of timecode counting frames (2) does not match expected number for standard (25)." },
      // Refused: without an edit list the mandatory 'elst' is missing.
      { "NoEditList",
        "mov",
        "25",
        { "-c:v", "rawvideo", "-pix_fmt", "uyvy422", "-use_editlist", "0" },
        {},
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 There was an error parsing the MOV file." },
      // Refused: a fragmented file's empty 'moov' has no edit list either.
      { "Fragmented",
        "mov",
        "25",
        { "-c:v", "rawvideo", "-pix_fmt", "uyvy422", "-movflags", "frag_keyframe+empty_moov" },
        {},
        "",
        "",
        ZOL::VideoPayload_None,
        ZOL::AudioSampleFormat_Unspecified,
        "2 There was an error parsing the MOV file." },
  };

  constexpr int FrameCount = 10;

  std::string MakeFixture( const VFfmpegCase& i_rCase )
  {
    std::ostringstream Source;
    Source << "testsrc2=size=64x48:rate=" << i_rCase.Rate;
    std::vector< std::string > Arguments = { "-f", "lavfi", "-i", Source.str() };
    if( !i_rCase.AudioArguments.empty() )
      Arguments.insert( Arguments.end(), { "-f", "lavfi", "-i", "sine=f=440:r=48000" } );
    Arguments.insert( Arguments.end(), { "-frames:v", std::to_string( FrameCount ) } );
    Arguments.insert( Arguments.end(), i_rCase.VideoArguments.begin(), i_rCase.VideoArguments.end() );
    if( !i_rCase.AudioArguments.empty() )
    {
      Arguments.insert( Arguments.end(), i_rCase.AudioArguments.begin(), i_rCase.AudioArguments.end() );
      Arguments.push_back( "-shortest" );
    }
    if( *i_rCase.Timecode != 0 )
      Arguments.insert( Arguments.end(), { "-timecode", i_rCase.Timecode } );
    return FfmpegFixture( std::string( "mov-" ) + i_rCase.Name + "." + i_rCase.Extension, Arguments );
  }

  // ffmpeg's own demuxing of one stream: the stored bytes of its packets, back to back.
  std::vector< std::uint8_t > StreamCopy( const std::string& i_rPath, const char* i_pStream )
  {
    const std::string Output = i_rPath + "." + ( i_pStream[0] == 'v' ? "video" : "audio" ) + ".bin";
    int ExitCode = 0;
    LumekTest::RunCommand( "ffmpeg -y -v error -i " + LumekTest::ShellQuote( i_rPath ) + " -map 0:" + i_pStream +
                               " -c copy -f data " + LumekTest::ShellQuote( Output ),
                           &ExitCode );
    std::ifstream In( Output, std::ios::binary );
    return std::vector< std::uint8_t >( std::istreambuf_iterator< char >( In ), {} );
  }

  std::string Probe( const std::string& i_rPath, const char* i_pEntry, const char* i_pStream = "v:0" )
  {
    std::string Text = LumekTest::Ffprobe(
        i_rPath, { "-select_streams", i_pStream, "-show_entries", i_pEntry, "-of", "default=nw=1:nk=1" } );
    while( !Text.empty() && ( Text.back() == '\n' || Text.back() == '\r' ) )
      Text.pop_back();
    return Text;
  }

  std::string TimecodeText( const ZOL::ITimecode& i_rTimecode )
  {
    char Text[32];
    std::snprintf( Text, sizeof( Text ), "%02d:%02d:%02d%c%02d", i_rTimecode.Hours, i_rTimecode.Minutes,
                   i_rTimecode.Seconds, i_rTimecode.Standards == ZOL::TimecodeStandard_29_97_DF ? ';' : ':',
                   i_rTimecode.Frames );
    return Text;
  }

  double ParseRate( const std::string& i_rText )
  {
    const auto Slash = i_rText.find( '/' );
    if( Slash == std::string::npos )
      return std::stod( i_rText );
    return std::stod( i_rText.substr( 0, Slash ) ) / std::stod( i_rText.substr( Slash + 1 ) );
  }

  class MovFfmpegTest : public ::testing::TestWithParam< VFfmpegCase >
  {
  protected:
    void SetUp() override
    {
      if( !LumekTest::HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
    }
  };

  TEST_P( MovFfmpegTest, MatchesFfmpeg )
  {
    const VFfmpegCase& rCase = GetParam();
    const std::string Path = MakeFixture( rCase );
    ASSERT_FALSE( Path.empty() );
    MovTest::VLogCapture Log;
    MovIO::VMovReader Reader;
    const bool bOpened = Reader.Open( Path );
    if( *rCase.Refusal != 0 )
    {
      EXPECT_FALSE( bOpened );
      EXPECT_TRUE( Log.Contains( rCase.Refusal ) ) << Log.Text();
      return;
    }
    ASSERT_TRUE( bOpened ) << Log.Text();

    EXPECT_EQ( Reader.GetFrameCount(), std::stoull( Probe( Path, "stream=nb_frames" ) ) );
    EXPECT_EQ( Reader.GetVideoPayload(), rCase.Payload );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageWidth, 64 );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageHeight, 48 );
    // ffmpeg's scale of 15360 at 24, 30 and 60 Hz does not divide the 1080 MHz clock: the period is
    // truncated to whole ticks, a rate off by a few parts in a million.
    const double Rate = ParseRate( Probe( Path, "stream=r_frame_rate" ) );
    EXPECT_NEAR( Reader.GetVideoTiming().GetFrameRate(), Rate, Rate * 1e-5 );
    if( *rCase.Timecode != 0 )
    {
      EXPECT_EQ( TimecodeText( Reader.GetTimecode() ), Probe( Path, "stream_tags=timecode" ) );
    }
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleFormat, rCase.AudioFormat );

    // Every frame's stored bytes and audio, against ffmpeg's demuxing of the same file.
    std::vector< std::uint8_t > Video;
    std::vector< std::uint8_t > Audio;
    for( std::uint64_t i = 0; i < Reader.GetFrameCount(); ++i )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Blocks;
      ASSERT_TRUE( Reader.ReadFrameData( i, pVideo, Blocks, true, true ) ) << "frame " << i;
      ASSERT_TRUE( pVideo );
      if( rCase.Payload != ZOL::VideoPayload_VideoH264 )
        Video.insert( Video.end(), pVideo->GetData(), pVideo->GetData() + pVideo->GetSize() );
      for( const auto& pBlock : Blocks )
        Audio.insert( Audio.end(), pBlock->GetData(), pBlock->GetData() + pBlock->GetSize() );
    }
    if( rCase.Payload != ZOL::VideoPayload_VideoH264 )
    {
      EXPECT_TRUE( Video == StreamCopy( Path, "v:0" ) );
    }
    if( rCase.AudioFormat != ZOL::AudioSampleFormat_Unspecified )
    {
      EXPECT_EQ( Reader.GetAudioFrameInfo().SampleRate, std::stoi( Probe( Path, "stream=sample_rate", "a:0" ) ) );
      EXPECT_TRUE( Audio == StreamCopy( Path, "a:0" ) ) << Audio.size();
    }
    else
    {
      EXPECT_TRUE( Audio.empty() );
    }
    if( *rCase.RawPixelFormat != 0 )
    {
      EXPECT_TRUE( Video == LumekTest::FfmpegDecode( Path, rCase.RawPixelFormat ) );
    }
  }

  INSTANTIATE_TEST_SUITE_P( Formats, MovFfmpegTest, ::testing::ValuesIn( s_Cases ),
                            []( const ::testing::TestParamInfo< VFfmpegCase >& i_rInfo )
                            { return std::string( i_rInfo.param.Name ); } );

  struct VDecodeCase
  {
    const char* Name;
    // Largest difference from ffmpeg's decode in any sample; 0 for lossless payloads.
    int Tolerance;
  };

  std::ostream& operator<<( std::ostream& o_rStream, const VDecodeCase& i_rCase )
  {
    return o_rStream << i_rCase.Name;
  }

  // JPEG's colour conversion is the image library's, not swscale's: a few levels apart.
  const VDecodeCase s_DecodeCases[] = {
      { "Mjpeg", 8 }, { "Png", 0 }, { "Tiff", 0 }, { "H264Baseline", 0 }, { "H264InMp4", 0 } };

  const VFfmpegCase& FindCase( const std::string& i_rName )
  {
    for( const VFfmpegCase& rCase : s_Cases )
      if( i_rName == rCase.Name )
        return rCase;
    throw std::logic_error( "no case " + i_rName );
  }

  class MovDecodeTest : public ::testing::TestWithParam< VDecodeCase >
  {
  protected:
    void SetUp() override
    {
      if( !LumekTest::HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
    }
  };

  // The pictures, decoded from the payload this reader delivers, against ffmpeg's own decode.
  TEST_P( MovDecodeTest, PixelsMatchFfmpeg )
  {
    const VFfmpegCase& rCase = FindCase( GetParam().Name );
    const std::string Path = MakeFixture( rCase );
    ASSERT_FALSE( Path.empty() );
    MovIO::VMovReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    const bool bH264 = rCase.Payload == ZOL::VideoPayload_VideoH264;
    const auto pAllocator = std::make_shared< ZOL::VFrameBufferAllocator >( "Test" );
    const std::shared_ptr< ZOL::IH264Decoder > pDecoder = bH264 ? H264IO::VH264Decoder::Create( pAllocator ) : nullptr;
    ASSERT_TRUE( !bH264 || pDecoder );

    // H.264 is compared by its luma, which a conforming decoder gives bit for bit; the still
    // images by their RGB samples.
    const std::vector< std::uint8_t > Expected = LumekTest::FfmpegDecode( Path, bH264 ? "yuv420p" : "rgb24" );
    const std::size_t Pixels = 64 * 48;
    const std::size_t ExpectedFrameBytes = bH264 ? Pixels * 3 / 2 : Pixels * 3;
    ASSERT_EQ( Expected.size(), ExpectedFrameBytes * Reader.GetFrameCount() );
    for( std::uint64_t f = 0; f < Reader.GetFrameCount(); ++f )
    {
      ZOL::IVideoFrame Frame;
      if( bH264 )
      {
        std::shared_ptr< ZOL::IBuffer > pUnit;
        ZOL::IAudioBuffers Audio;
        ASSERT_TRUE( Reader.ReadFrameData( f, pUnit, Audio, true, false ) );
        Frame.VideoFrameInfo = Reader.GetVideoFrameInfo();
        ASSERT_TRUE( pDecoder->Decode( *pUnit, ZOL::PixelFormat_U8Y8V8Y8, Frame.Video, Frame.VideoFrameInfo ) )
            << "frame " << f;
      }
      else
      {
        ASSERT_TRUE( Reader.ReadFrame( f, Frame, true, false ) ) << "frame " << f;
      }
      ASSERT_TRUE( Frame.Video );
      const std::uint8_t* pWant = Expected.data() + f * ExpectedFrameBytes;
      const std::uint8_t* pHave = Frame.Video->GetData();
      const std::size_t Step = Frame.VideoFrameInfo.PixelFormat == ZOL::PixelFormat_R8G8B8u8 ? 4 : 3;
      int Worst = 0;
      for( std::size_t i = 0; i < Pixels; ++i )
        for( std::size_t c = 0; c < ( bH264 ? 1u : 3u ); ++c )
        {
          const int Have = bH264 ? pHave[2 * i + 1] : pHave[i * Step + c];
          const int Want = bH264 ? pWant[i] : pWant[i * 3 + c];
          Worst = std::max( Worst, std::abs( Have - Want ) );
        }
      EXPECT_LE( Worst, GetParam().Tolerance ) << "frame " << f;
    }
  }

  INSTANTIATE_TEST_SUITE_P( Payloads, MovDecodeTest, ::testing::ValuesIn( s_DecodeCases ),
                            []( const ::testing::TestParamInfo< VDecodeCase >& i_rInfo )
                            { return std::string( i_rInfo.param.Name ); } );
} // namespace
