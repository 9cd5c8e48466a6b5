// Files of the family written by the project's writer read back equal, and ffprobe and ffmpeg
// see in them what the reader sees.

#include "fileio/MkvIO/VMkvReader.h"
#include "tests/fileio/MkvIO/MkvTestSupport.h"
#include "tests/support/FfmpegFixtures.h"
#include "videointerface/AttributeRecords.h"

#include <gtest/gtest.h>

#include <malloc.h>

#include <cstring>

using MkvTest::VFamilyCase;

namespace
{
  std::vector< std::uint8_t > Bytes( const std::shared_ptr< ZOL::IBuffer >& i_pBuffer )
  {
    if( !i_pBuffer )
      return {};
    const auto* pData = static_cast< const std::uint8_t* >( i_pBuffer->GetData() );
    return std::vector< std::uint8_t >( pData, pData + i_pBuffer->GetSize() );
  }

  // One small JPEG for every MJPEG frame, made by ffmpeg.
  std::string TestJPEGPath()
  {
    return LumekTest::FfmpegFixture( "mkv_frame.jpg", { "-f", "lavfi", "-i", "testsrc=size=16x8:rate=1", "-frames:v",
                                                        "1", "-pix_fmt", "yuvj420p" } );
  }

  std::vector< std::uint8_t > TestJPEG()
  {
    const std::string Path = TestJPEGPath();
    return Path.empty() ? std::vector< std::uint8_t >() : MkvTest::ReadWholeFile( Path );
  }

  struct VProbeRow
  {
    ZOL::EPixelFormat Format;
    const char* FfmpegPixelFormat;
  };
  constexpr VProbeRow s_FfmpegFormats[] = {
      { ZOL::PixelFormat_R8G8B8u8, "rgba" },
      { ZOL::PixelFormat_U8Y8V8Y8, "uyvy422" },
      { ZOL::PixelFormat_Y8U8Y8V8, "yuyv422" },
      { ZOL::PixelFormat_Luminance8, "gray" },
  };

  const char* FfmpegPixelFormat( ZOL::EPixelFormat i_Format )
  {
    for( const VProbeRow& rRow : s_FfmpegFormats )
      if( rRow.Format == i_Format )
        return rRow.FfmpegPixelFormat;
    return "";
  }

  const char* FfmpegAudioCodec( ZOL::EAudioSampleFormat i_Format )
  {
    switch( i_Format )
    {
    case ZOL::AudioSampleFormat_Int16:
      return "pcm_s16le";
    case ZOL::AudioSampleFormat_Int24:
      return "pcm_s24le";
    case ZOL::AudioSampleFormat_Int32:
      return "pcm_s32le";
    case ZOL::AudioSampleFormat_Float32:
      return "pcm_f32le";
    default:
      return "";
    }
  }

  class MkvFamilyTest : public ::testing::TestWithParam< VFamilyCase >
  {
  protected:
    void SetUp() override
    {
      if( GetParam().bJPEG )
      {
        m_JPEG = TestJPEG();
        ASSERT_FALSE( m_JPEG.empty() );
      }
      m_Path = MkvTest::TempPath( GetParam().Name + ".mkv" );
      ASSERT_TRUE( MkvTest::WriteFamilyFile( m_Path, GetParam(), m_JPEG ) );
    }
    void TearDown() override { std::remove( m_Path.c_str() ); }

    std::string m_Path;
    std::vector< std::uint8_t > m_JPEG;
  };

  TEST_P( MkvFamilyTest, ReadsBackWhatWasWritten )
  {
    const VFamilyCase& rCase = GetParam();
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( m_Path ) );
    EXPECT_EQ( Reader.GetFrameCount(), static_cast< std::uint64_t >( rCase.Frames ) );
    EXPECT_EQ( Reader.GetVideoPayload(), rCase.bJPEG ? ZOL::VideoPayload_ImageJPEG : ZOL::VideoPayload_Uncompressed );
    const ZOL::IVideoFrameInfo& rVideo = Reader.GetVideoFrameInfo();
    EXPECT_EQ( rVideo.ImageWidth, rCase.Width );
    EXPECT_EQ( rVideo.ImageHeight, rCase.Height );
    EXPECT_EQ( rVideo.PixelFormat, rCase.Format );
    const ZOL::IAudioFrameInfo Audio = MkvTest::AudioInfo( rCase );
    EXPECT_EQ( Reader.GetAudioPayload(), Audio.IsUsable() ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None );
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleFormat, Audio.SampleFormat );
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleRate, Audio.SampleRate );
    EXPECT_EQ( Reader.GetAudioFrameInfo().Channels, Audio.Channels );

    // The tags carry the timing, the timecode and the settings exactly.
    const ZOL::IVideoTiming Timing = MkvTest::Timing( rCase );
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, Timing.FramePeriodInTicks );
    EXPECT_EQ( Reader.GetVideoTiming().StartOffsetInTicks, Timing.StartOffsetInTicks );
    const ZOL::ITimecode Timecode = MkvTest::StartTimecode();
    EXPECT_EQ( Reader.GetTimecode().Standards, Timecode.Standards );
    EXPECT_EQ( Reader.GetTimecode().Hours, Timecode.Hours );
    EXPECT_EQ( Reader.GetTimecode().Frames, Timecode.Frames );
    EXPECT_EQ( Reader.GetTimecode().UserBits, Timecode.UserBits );
    EXPECT_FLOAT_EQ( Reader.GetVideoSettings().Saturation, 0.75f );
    EXPECT_FLOAT_EQ( Reader.GetVideoSettings().GammaCorrection, 1.25f );
    std::string WritingApp;
    EXPECT_TRUE( Reader.GetAttributes().Get( "Matroska.WritingApp", WritingApp ) );
    EXPECT_EQ( WritingApp, "LumekVideoViewer" );

    for( int Frame = 0; Frame < rCase.Frames; ++Frame )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers AudioBlocks;
      ASSERT_TRUE( Reader.ReadFrameData( Frame, pVideo, AudioBlocks, true, true ) ) << Frame;
      EXPECT_EQ( Bytes( pVideo ), MkvTest::FrameBytes( rCase, Frame, m_JPEG ) ) << Frame;
      if( Audio.IsUsable() )
      {
        ASSERT_EQ( AudioBlocks.size(), 1u ) << Frame;
        EXPECT_EQ( Bytes( AudioBlocks[0] ), MkvTest::AudioBlock( rCase, Frame ) ) << Frame;
      }
      else
      {
        EXPECT_TRUE( AudioBlocks.empty() );
      }
    }
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers AudioBlocks;
    EXPECT_FALSE( Reader.ReadFrameData( rCase.Frames, pVideo, AudioBlocks, true, true ) );
    EXPECT_TRUE( Reader.HasFrame( rCase.Frames - 1 ) );
    EXPECT_FALSE( Reader.HasFrame( rCase.Frames ) );
    EXPECT_EQ( Reader.FindStoredFrameAtOrBefore( 1000 ), std::optional< std::uint64_t >( rCase.Frames - 1 ) );
    EXPECT_EQ( Reader.FindStoredFrameAtOrAfter( rCase.Frames ), std::nullopt );
  }

  TEST_P( MkvFamilyTest, FfprobeSeesTheSameStreams )
  {
    const VFamilyCase& rCase = GetParam();
    const std::string Video = LumekTest::Ffprobe(
        m_Path, { "-select_streams", "v:0", "-count_frames", "-show_entries",
                  "stream=codec_name,width,height,nb_read_frames,r_frame_rate", "-of", "default=noprint_wrappers=1" } );
    EXPECT_NE( Video.find( std::string( "codec_name=" ) + ( rCase.bJPEG ? "mjpeg" : "rawvideo" ) ), std::string::npos )
        << Video;
    EXPECT_NE( Video.find( "width=" + std::to_string( rCase.Width ) ), std::string::npos ) << Video;
    EXPECT_NE( Video.find( "height=" + std::to_string( rCase.Height ) ), std::string::npos ) << Video;
    EXPECT_NE( Video.find( "nb_read_frames=" + std::to_string( rCase.Frames ) ), std::string::npos ) << Video;
    EXPECT_NE( Video.find( "r_frame_rate=" + std::to_string( static_cast< int >( rCase.FramesPerSecond ) ) + "/1" ),
               std::string::npos )
        << Video;
    if( rCase.Audio != ZOL::AudioSampleFormat_Unspecified )
    {
      const std::string Audio = LumekTest::Ffprobe( m_Path, { "-select_streams", "a:0", "-show_entries",
                                                              "stream=codec_name,sample_rate,channels", "-of",
                                                              "default=noprint_wrappers=1" } );
      EXPECT_NE( Audio.find( std::string( "codec_name=" ) + FfmpegAudioCodec( rCase.Audio ) ), std::string::npos )
          << Audio;
      EXPECT_NE( Audio.find( "sample_rate=48000" ), std::string::npos ) << Audio;
      EXPECT_NE( Audio.find( "channels=2" ), std::string::npos ) << Audio;
    }
  }

  // ffmpeg reads the raw frames in its own pixel format names: the FourCC and the layout agree.
  // MJPEG frames decode as the JPEG they were made from.
  TEST_P( MkvFamilyTest, FfmpegDecodesTheSamePixels )
  {
    const VFamilyCase& rCase = GetParam();
    std::vector< std::uint8_t > Expected;
    const std::vector< std::uint8_t > Picture =
        rCase.bJPEG ? LumekTest::FfmpegDecode( TestJPEGPath(), "rgb24" ) : std::vector< std::uint8_t >();
    for( int Frame = 0; Frame < rCase.Frames; ++Frame )
    {
      const auto FrameBytes = rCase.bJPEG ? Picture : MkvTest::RawFrame( rCase, Frame );
      Expected.insert( Expected.end(), FrameBytes.begin(), FrameBytes.end() );
    }
    EXPECT_EQ( LumekTest::FfmpegDecode( m_Path, rCase.bJPEG ? "rgb24" : FfmpegPixelFormat( rCase.Format ) ), Expected );
  }

  VFamilyCase Case( const char* i_pName, ZOL::EPixelFormat i_Format, ZOL::EAudioSampleFormat i_Audio,
                    bool i_bJPEG = false )
  {
    VFamilyCase Case;
    Case.Name = i_pName;
    Case.Format = i_Format;
    Case.Audio = i_Audio;
    Case.bJPEG = i_bJPEG;
    return Case;
  }

  INSTANTIATE_TEST_SUITE_P(
      Family, MkvFamilyTest,
      ::testing::Values( Case( "RGBA_Int16", ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16 ),
                         Case( "UYVY_Int24", ZOL::PixelFormat_U8Y8V8Y8, ZOL::AudioSampleFormat_Int24 ),
                         Case( "YUY2_Int32", ZOL::PixelFormat_Y8U8Y8V8, ZOL::AudioSampleFormat_Int32 ),
                         Case( "GREY_Float32", ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Float32 ),
                         Case( "GREY_NoAudio", ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Unspecified ),
                         Case( "MJPEG_Int16", ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16, true ) ),
      []( const ::testing::TestParamInfo< VFamilyCase >& i_rInfo ) { return i_rInfo.param.Name; } );

  // The FourCC in a BITMAPINFOHEADER reads as the colour space one does.
  TEST( MkvReader, VfwFourCCReadsAsUncompressed )
  {
    VFamilyCase Case = ::Case( "UYVY_Vfw", ZOL::PixelFormat_U8Y8V8Y8, ZOL::AudioSampleFormat_Unspecified );
    const std::string Path = MkvTest::TempPath( "vfw.mkv" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Path, Case, {},
                                           []( MkvIO::VMkvDescription& io_rDescription )
                                           { io_rDescription.Video.CodecID = "V_MS/VFW/FOURCC"; } ) );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetVideoPayload(), ZOL::VideoPayload_Uncompressed );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_U8Y8V8Y8 );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Reader.ReadFrameData( 2, pVideo, Audio, true, true ) );
    EXPECT_EQ( Bytes( pVideo ), MkvTest::RawFrame( Case, 2 ) );
    std::remove( Path.c_str() );
  }

  // Bytes the heap holds right now.
  std::size_t LiveHeap()
  {
    return mallinfo2().uordblks;
  }

  // Reading frames must not leave their blocks behind: the heap after thousands of frames is
  // what it was after the first hundred.
  TEST( MkvReader, MemoryDoesNotGrowWithFramesRead )
  {
    VFamilyCase Case = ::Case( "Long", ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Int16 );
    Case.Width = 8;
    Case.Height = 4;
    Case.Frames = 3000;
    const std::string Path = MkvTest::TempPath( "long.mkv" );
    ASSERT_TRUE( MkvTest::WriteFamilyFile( Path, Case, {} ) );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    ASSERT_EQ( Reader.GetFrameCount(), 3000u );
    std::size_t HeapAfterWarmUp = 0;
    for( int Pass = 0; Pass < 2; ++Pass )
      for( int Frame = 0; Frame < Case.Frames; ++Frame )
      {
        std::shared_ptr< ZOL::IBuffer > pVideo;
        ZOL::IAudioBuffers Audio;
        ASSERT_TRUE( Reader.ReadFrameData( Frame, pVideo, Audio, true, true ) );
        if( Pass == 0 && Frame == 100 )
          HeapAfterWarmUp = LiveHeap();
      }
    const std::size_t HeapAtEnd = LiveHeap();
    RecordProperty( "HeapAfterWarmUp", static_cast< int >( HeapAfterWarmUp ) );
    RecordProperty( "HeapAfterTwoPasses", static_cast< int >( HeapAtEnd ) );
    // The first read of a frame drops what opening kept of its blocks, so the heap may shrink.
    EXPECT_LT( static_cast< double >( HeapAtEnd ), static_cast< double >( HeapAfterWarmUp ) + 16 * 1024 )
        << "after warm-up " << HeapAfterWarmUp << ", at end " << HeapAtEnd;
    std::remove( Path.c_str() );
  }
} // namespace
