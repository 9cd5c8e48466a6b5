// Files written by ffmpeg in each data format the reader takes, checked against ffprobe's
// figures and ffmpeg's own demuxing and decoding; and ffmpeg's files that the reader refuses,
// each with the rule that refuses it.

#include "fileio/H264IO/VH264Decoder.h"
#include "fileio/MovIO/VMovReader.h"
#include "tests/support/FfmpegFixtures.h"
#include "tests/support/LogCapture.h"
#include "videointerface/BufferAllocators.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iterator>
#include <sstream>

namespace
{
  using VBytes = std::vector< std::uint8_t >;
  constexpr int FrameCount = 10;

  struct VFfmpegCase
  {
    const char* Name;
    // Video source rate, e.g. "25" or "30000/1001".
    const char* Rate;
    const char* Video;
    const char* Audio;    // "" for no audio
    const char* Timecode; // "" for no timecode track
    // The pixel format ffmpeg decodes raw frames to for a byte comparison, "" for compressed.
    const char* RawPixelFormat;
    ZOL::EVideoPayload Payload;
    ZOL::EAudioSampleFormat AudioFormat;
    // Largest difference from ffmpeg's decode of a compressed picture in any sample.
    int Tolerance = 0;
    const char* Extension = "mov";
    // For a file the reader refuses: the line of the rule that refuses it.
    const char* Refusal = "";
  };

  VFfmpegCase Refused( const char* i_pName, const char* i_pRate, const char* i_pVideo, const char* i_pAudio,
                       const char* i_pTimecode, const char* i_pRefusal )
  {
    VFfmpegCase Case{ i_pName,
                      i_pRate,
                      i_pVideo,
                      i_pAudio,
                      i_pTimecode,
                      "",
                      ZOL::VideoPayload_None,
                      ZOL::AudioSampleFormat_Unspecified };
    Case.Refusal = i_pRefusal;
    return Case;
  }

  constexpr auto Raw = ZOL::VideoPayload_Uncompressed;
  constexpr auto NoAudio = ZOL::AudioSampleFormat_Unspecified;
  constexpr auto Int16 = ZOL::AudioSampleFormat_Int16;
  constexpr const char* Uyvy = "-c:v rawvideo -pix_fmt uyvy422";

  // JPEG's colour conversion is the image library's, not swscale's: a few levels apart. H.264 is
  // compared by its luma, which a conforming decoder gives bit for bit.
  const VFfmpegCase s_Cases[] = {
      { "Uyvy2vuyAudioTimecode", "25", Uyvy, "-c:a pcm_s16le", "01:02:03:04", "uyvy422", Raw, Int16 },
      { "Yuyv422yuvs30", "30", "-c:v rawvideo -pix_fmt yuyv422", "", "10:00:00:00", "yuyv422", Raw, NoAudio },
      { "V210At24", "24", "-c:v v210", "", "", "", Raw, NoAudio },
      { "Rgb24Raw", "25", "-c:v rawvideo -pix_fmt rgb24", "-c:a pcm_s16le", "00:00:10:00", "rgb24", Raw, Int16 },
      { "Bgr24At50", "50", "-c:v rawvideo -pix_fmt bgr24", "", "", "bgr24", Raw, NoAudio },
      { "Bgra", "25", "-c:v rawvideo -pix_fmt bgra", "", "", "bgra", Raw, NoAudio },
      { "Rgba", "25", "-c:v rawvideo -pix_fmt rgba", "", "", "rgba", Raw, NoAudio },
      { "Mjpeg", "25", "-c:v mjpeg -pix_fmt yuvj422p", "-c:a pcm_s16le", "", "", ZOL::VideoPayload_ImageJPEG, Int16,
        8 },
      { "Png", "25", "-c:v png -pix_fmt rgb24", "", "", "", ZOL::VideoPayload_ImagePNG, NoAudio },
      { "Tiff", "25", "-c:v tiff -pix_fmt rgb24", "", "", "", ZOL::VideoPayload_ImageTIFF, NoAudio },
      { "H264Baseline", "25", "-c:v libx264 -profile:v baseline -pix_fmt yuv420p -g 4", "-c:a pcm_s16le", "00:59:59:00",
        "", ZOL::VideoPayload_VideoH264, Int16 },
      { "H264InMp4", "25", "-c:v libx264 -profile:v baseline -pix_fmt yuv420p", "", "", "", ZOL::VideoPayload_VideoH264,
        NoAudio, 0, "mp4" },
      { "DropFrame2997", "30000/1001", Uyvy, "-c:a pcm_s16le", "01:00:00;02", "uyvy422", Raw, Int16 },
      { "NonDrop2997", "30000/1001", Uyvy, "", "01:00:00:02", "uyvy422", Raw, NoAudio },
      { "Film23976", "24000/1001", Uyvy, "", "00:00:01:23", "uyvy422", Raw, NoAudio },
      { "TwosBigEndian", "25", Uyvy, "-c:a pcm_s16be", "", "uyvy422", Raw, Int16 },
      { "RawU8Audio", "25", Uyvy, "-c:a pcm_u8", "", "uyvy422", Raw, ZOL::AudioSampleFormat_UInt8 },
      { "In24Audio", "25", Uyvy, "-c:a pcm_s24be", "", "uyvy422", Raw, ZOL::AudioSampleFormat_Int24 },
      { "In32Audio", "25", Uyvy, "-c:a pcm_s32be", "", "uyvy422", Raw, ZOL::AudioSampleFormat_Int32 },
      { "LpcmAt96k", "25", Uyvy, "-c:a pcm_s16le -ar 96000", "", "uyvy422", Raw, Int16 },
      { "At60Truncated", "60", Uyvy, "", "", "uyvy422", Raw, NoAudio },
      { "At60Timescale600", "60", "-c:v rawvideo -pix_fmt uyvy422 -video_track_timescale 600", "", "", "uyvy422", Raw,
        NoAudio },

      // Refused, each by its rule.
      // ffmpeg stores argb as 'raw ' of depth 32, and 'raw ' is taken at depth 24 only.
      Refused( "ArgbNotSupported", "25", "-c:v rawvideo -pix_fmt argb", "", "",
               "2 FourCC code '1918990112' is not supported." ),
      // 'mp4v' is not in the table of data formats.
      Refused( "Mpeg4NotSupported", "25", "-c:v mpeg4", "", "", "2 FourCC code '1836070006' is not supported." ),
      // Float audio has no row in the sound description tables.
      Refused( "FloatAudio", "25", Uyvy, "-c:a pcm_f32le", "",
               "2 Audio format unsupported (sample description version=1, FourCC=fl32)." ),
      // 8-bit signed samples are written as 'sowt' with a size of 8.
      Refused( "SignedByteAudio", "25", Uyvy, "-c:a pcm_s8", "",
               "2 Audio format unsupported (sample description version=0, FourCC=sowt)." ),
      // AAC's edit list starts the audio at a media time after its priming samples.
      Refused( "AacEditList", "25", Uyvy, "-c:a aac", "", "2 Could not read 'elst' atom." ),
      Refused( "Interlaced", "25", "-c:v rawvideo -pix_fmt uyvy422 -field_order tt", "", "",
               "2 Opening interlaced files is not supported." ),
      // Colour described other than as BT.709.
      Refused( "Bt601Colour", "25",
               "-c:v rawvideo -pix_fmt uyvy422 -color_primaries smpte170m -color_trc smpte170m -colorspace smpte170m",
               "", "", "2 Could not read 'colr' atom." ),
      // Timecode at 50 frames a second counts 50 frames, and the 25 fps standard 25.
      Refused( "Timecode50", "50", Uyvy, "", "00:00:01:00",
               "2 Number of timecode counting frames (2) does not match expected number for standard (25)." ),
      // Without an edit list the mandatory 'elst' is missing.
      Refused( "NoEditList", "25", "-c:v rawvideo -pix_fmt uyvy422 -use_editlist 0", "", "",
               "2 There was an error parsing the MOV file." ),
      // A fragmented file's empty 'moov' has no edit list either.
      Refused( "Fragmented", "25", "-c:v rawvideo -pix_fmt uyvy422 -movflags frag_keyframe+empty_moov", "", "",
               "2 There was an error parsing the MOV file." ),
  };

  std::vector< std::string > Words( const std::string& i_rText )
  {
    std::istringstream Stream( i_rText );
    return std::vector< std::string >( std::istream_iterator< std::string >( Stream ), {} );
  }

  std::string MakeFixture( const std::string& i_rName, const std::string& i_rRate, const std::string& i_rVideo,
                           const std::string& i_rAudio, const std::string& i_rTimecode,
                           const std::string& i_rExtension )
  {
    std::string Arguments = "-f lavfi -i testsrc2=size=64x48:rate=" + i_rRate;
    if( !i_rAudio.empty() )
      Arguments += " -f lavfi -i sine=f=440:r=48000";
    Arguments += " -frames:v " + std::to_string( FrameCount ) + " " + i_rVideo;
    if( !i_rAudio.empty() )
      Arguments += " " + i_rAudio + " -shortest";
    if( !i_rTimecode.empty() )
      Arguments += " -timecode " + i_rTimecode;
    return LumekTest::FfmpegFixture( "mov-" + i_rName + "." + i_rExtension, Words( Arguments ) );
  }

  // ffmpeg's own demuxing of one stream: the stored bytes of its packets, back to back.
  VBytes StreamCopy( const std::string& i_rPath, const std::string& i_rStream )
  {
    const std::string Output = i_rPath + "." + ( i_rStream[0] == 'v' ? "video" : "audio" ) + ".bin";
    LumekTest::RunCommand( "ffmpeg -y -v error -i " + LumekTest::ShellQuote( i_rPath ) + " -map 0:" + i_rStream +
                           " -c copy -f data " + LumekTest::ShellQuote( Output ) );
    std::ifstream In( Output, std::ios::binary );
    return VBytes( std::istreambuf_iterator< char >( In ), {} );
  }

  std::string Probe( const std::string& i_rPath, const char* i_pEntry, const char* i_pStream = "v:0" )
  {
    std::string Text = LumekTest::Ffprobe(
        i_rPath, { "-select_streams", i_pStream, "-show_entries", i_pEntry, "-of", "default=nw=1:nk=1" } );
    return Text.substr( 0, Text.find_last_not_of( "\r\n" ) + 1 );
  }

  double ParseRate( const std::string& i_rText )
  {
    const auto Slash = i_rText.find( '/' );
    return Slash == std::string::npos
               ? std::stod( i_rText )
               : std::stod( i_rText.substr( 0, Slash ) ) / std::stod( i_rText.substr( Slash + 1 ) );
  }

  // Groups of pictures by ffprobe's key-frame flags, last group first: the order of a viewer
  // jumping back through the file.
  std::vector< std::vector< std::uint64_t > > GroupsLastFirst( const std::string& i_rPath )
  {
    std::istringstream Flags( Probe( i_rPath, "packet=flags" ) );
    std::vector< std::vector< std::uint64_t > > Groups;
    std::string Line;
    for( std::uint64_t i = 0; std::getline( Flags, Line ); ++i )
    {
      if( Groups.empty() || Line[0] == 'K' )
        Groups.emplace_back();
      Groups.back().push_back( i );
    }
    return std::vector< std::vector< std::uint64_t > >( Groups.rbegin(), Groups.rend() );
  }

  // The pictures decoded from the payload this reader delivers, against ffmpeg's own decode.
  // H.264 starts a fresh decoder at each key frame, as a seek does.
  void ExpectPicturesMatch( MovIO::VMovReader& io_rReader, const std::string& i_rPath, int i_Tolerance )
  {
    const bool bH264 = io_rReader.GetVideoPayload() == ZOL::VideoPayload_VideoH264;
    const VBytes Expected = LumekTest::FfmpegDecode( i_rPath, bH264 ? "yuv420p" : "rgb24" );
    const std::size_t Pixels = 64 * 48;
    const std::size_t ExpectedFrameBytes = bH264 ? Pixels * 3 / 2 : Pixels * 3;
    ASSERT_EQ( Expected.size(), ExpectedFrameBytes * io_rReader.GetFrameCount() );
    const auto pAllocator = std::make_shared< ZOL::VFrameBufferAllocator >( "Test" );
    for( const std::vector< std::uint64_t >& rGroup : GroupsLastFirst( i_rPath ) )
    {
      const std::shared_ptr< ZOL::IH264Decoder > pDecoder =
          bH264 ? H264IO::VH264Decoder::Create( pAllocator ) : nullptr;
      for( const std::uint64_t f : rGroup )
      {
        ZOL::IVideoFrame Frame;
        if( bH264 )
        {
          std::shared_ptr< ZOL::IBuffer > pUnit;
          ZOL::IAudioBuffers Audio;
          ASSERT_TRUE( io_rReader.ReadFrameData( f, pUnit, Audio, true, false ) );
          Frame.VideoFrameInfo = io_rReader.GetVideoFrameInfo();
          ASSERT_TRUE( pDecoder->Decode( *pUnit, ZOL::PixelFormat_U8Y8V8Y8, Frame.Video, Frame.VideoFrameInfo ) )
              << "frame " << f;
        }
        else
        {
          ASSERT_TRUE( io_rReader.ReadFrame( f, Frame, true, false ) ) << "frame " << f;
        }
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
        EXPECT_LE( Worst, i_Tolerance ) << "frame " << f;
      }
    }
  }
} // namespace

TEST( MovFfmpeg, MatchesFfprobeAndFfmpegOrRefusedByItsRule )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "ffmpeg is not installed";
  for( const VFfmpegCase& rCase : s_Cases )
  {
    SCOPED_TRACE( rCase.Name );
    const std::string Path =
        MakeFixture( rCase.Name, rCase.Rate, rCase.Video, rCase.Audio, rCase.Timecode, rCase.Extension );
    LumekTest::VLogCapture Log( "MovIO" );
    MovIO::VMovReader Reader;
    const bool bOpened = Reader.Open( Path );
    const std::vector< std::string > Lines = Log.Lines();
    if( *rCase.Refusal != 0 )
    {
      EXPECT_FALSE( bOpened );
      EXPECT_NE( std::find( Lines.begin(), Lines.end(), rCase.Refusal ), Lines.end() )
          << testing::PrintToString( Lines );
      continue;
    }
    ASSERT_TRUE( bOpened ) << testing::PrintToString( Lines );

    EXPECT_EQ( Reader.GetFrameCount(), std::stoull( Probe( Path, "stream=nb_frames" ) ) );
    EXPECT_EQ( Reader.GetVideoPayload(), rCase.Payload );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageWidth, 64 );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageHeight, 48 );
    // ffmpeg's scale of 15360 at 24, 30 and 60 Hz does not divide the 1080 MHz clock: the period
    // is truncated to whole ticks, a rate off by a few parts in a million.
    const double Rate = ParseRate( Probe( Path, "stream=r_frame_rate" ) );
    EXPECT_NEAR( Reader.GetVideoTiming().GetFrameRate(), Rate, Rate * 1e-5 );
    if( *rCase.Timecode != 0 )
    {
      const ZOL::ITimecode& rTimecode = Reader.GetTimecode();
      char Text[32];
      std::snprintf( Text, sizeof( Text ), "%02d:%02d:%02d%c%02d", rTimecode.Hours, rTimecode.Minutes,
                     rTimecode.Seconds, rTimecode.Standards == ZOL::TimecodeStandard_29_97_DF ? ';' : ':',
                     rTimecode.Frames );
      EXPECT_EQ( Text, Probe( Path, "stream_tags=timecode" ) );
    }
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleFormat, rCase.AudioFormat );

    // Every frame's stored bytes and audio, against ffmpeg's demuxing of the same file.
    VBytes Video;
    VBytes Audio;
    for( std::uint64_t i = 0; i < Reader.GetFrameCount(); ++i )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Blocks;
      ASSERT_TRUE( Reader.ReadFrameData( i, pVideo, Blocks, true, true ) ) << "frame " << i;
      Video.insert( Video.end(), pVideo->GetData(), pVideo->GetData() + pVideo->GetSize() );
      for( const auto& pBlock : Blocks )
        Audio.insert( Audio.end(), pBlock->GetData(), pBlock->GetData() + pBlock->GetSize() );
    }
    // H.264 is delivered as access units with the parameter sets, not as stored.
    if( rCase.Payload != ZOL::VideoPayload_VideoH264 )
    {
      EXPECT_TRUE( Video == StreamCopy( Path, "v:0" ) );
    }
    if( rCase.AudioFormat != NoAudio )
    {
      EXPECT_EQ( Reader.GetAudioFrameInfo().SampleRate, std::stoi( Probe( Path, "stream=sample_rate", "a:0" ) ) );
    }
    EXPECT_TRUE( Audio == ( rCase.AudioFormat != NoAudio ? StreamCopy( Path, "a:0" ) : VBytes() ) ) << Audio.size();
    if( *rCase.RawPixelFormat != 0 )
    {
      EXPECT_TRUE( Video == LumekTest::FfmpegDecode( Path, rCase.RawPixelFormat ) );
    }
    else if( rCase.Payload != Raw )
    {
      ExpectPicturesMatch( Reader, Path, rCase.Tolerance );
    }
  }
}
