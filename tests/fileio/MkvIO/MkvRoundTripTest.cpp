// Files of the family written by the project's writer read back equal, and ffprobe and ffmpeg
// see in them what the reader sees.

#include "fileio/MkvIO/VMkvReader.h"
#include "tests/fileio/MkvIO/MkvTestSupport.h"
#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <malloc.h>

using namespace MkvTest;

namespace
{
  void ExpectReadsBack( const std::string& i_rPath, const VFamilyCase& i_rCase, const VBytes& i_rJPEG )
  {
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( i_rPath ) );
    EXPECT_EQ( Reader.GetFrameCount(), static_cast< std::uint64_t >( i_rCase.Frames ) );
    EXPECT_EQ( Reader.GetVideoPayload(), i_rCase.bJPEG ? ZOL::VideoPayload_ImageJPEG : ZOL::VideoPayload_Uncompressed );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageWidth, i_rCase.Width );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageHeight, i_rCase.Height );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, i_rCase.Format );
    const ZOL::IAudioFrameInfo Audio = AudioInfo( i_rCase );
    EXPECT_EQ( Reader.GetAudioPayload(), Audio.IsUsable() ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None );
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleFormat, Audio.SampleFormat );
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleRate, Audio.SampleRate );
    EXPECT_EQ( Reader.GetAudioFrameInfo().Channels, Audio.Channels );

    // The tags carry the timing, the timecode and the settings exactly.
    EXPECT_EQ( Reader.GetVideoTiming().FramePeriodInTicks, Timing( i_rCase ).FramePeriodInTicks );
    EXPECT_EQ( Reader.GetVideoTiming().StartOffsetInTicks, Timing( i_rCase ).StartOffsetInTicks );
    const ZOL::ITimecode Timecode = StartTimecode();
    EXPECT_EQ( Reader.GetTimecode().Standards, Timecode.Standards );
    EXPECT_EQ( Reader.GetTimecode().Hours, Timecode.Hours );
    EXPECT_EQ( Reader.GetTimecode().Frames, Timecode.Frames );
    EXPECT_EQ( Reader.GetTimecode().UserBits, Timecode.UserBits );
    EXPECT_FLOAT_EQ( Reader.GetVideoSettings().Saturation, 0.75f );
    EXPECT_FLOAT_EQ( Reader.GetVideoSettings().GammaCorrection, 1.25f );
    std::string WritingApp;
    EXPECT_TRUE( Reader.GetAttributes().Get( "Matroska.WritingApp", WritingApp ) );
    EXPECT_EQ( WritingApp, "LumekVideoViewer" );

    for( int Frame = 0; Frame <= i_rCase.Frames; ++Frame )
    {
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Blocks;
      ASSERT_EQ( Reader.ReadFrameData( Frame, pVideo, Blocks, true, true ), Frame < i_rCase.Frames ) << Frame;
      if( Frame == i_rCase.Frames )
        break;
      EXPECT_EQ( Bytes( pVideo ), FrameBytes( i_rCase, Frame, i_rJPEG ) ) << Frame;
      ASSERT_EQ( Blocks.size(), Audio.IsUsable() ? 1u : 0u ) << Frame;
      if( Audio.IsUsable() )
      {
        EXPECT_EQ( Bytes( Blocks[0] ), AudioBlock( i_rCase, Frame ) ) << Frame;
      }
    }
    EXPECT_TRUE( Reader.HasFrame( i_rCase.Frames - 1 ) );
    EXPECT_FALSE( Reader.HasFrame( i_rCase.Frames ) );
    EXPECT_EQ( Reader.FindStoredFrameAtOrBefore( 1000 ), std::optional< std::uint64_t >( i_rCase.Frames - 1 ) );
    EXPECT_EQ( Reader.FindStoredFrameAtOrAfter( i_rCase.Frames ), std::nullopt );
  }

  void ExpectFfmpegAgrees( const std::string& i_rPath, const VFamilyCase& i_rCase, const std::string& i_rJPEGPath,
                           const char* i_pFfmpegFormat, const char* i_pAudioCodec )
  {
    const std::string Video =
        LumekTest::Ffprobe( i_rPath, { "-select_streams", "v:0", "-count_frames", "-show_entries",
                                       "stream=codec_name,width,height,nb_read_frames,r_frame_rate", "-of",
                                       "default=noprint_wrappers=1" } );
    const std::string Fps = std::to_string( static_cast< int >( i_rCase.FramesPerSecond ) );
    for( const std::string& rLine :
         { std::string( "codec_name=" ) + ( i_rCase.bJPEG ? "mjpeg" : "rawvideo" ),
           "width=" + std::to_string( i_rCase.Width ), "height=" + std::to_string( i_rCase.Height ),
           "nb_read_frames=" + std::to_string( i_rCase.Frames ), "r_frame_rate=" + Fps + "/1" } )
      EXPECT_NE( Video.find( rLine ), std::string::npos ) << rLine << " not in\n" << Video;
    if( *i_pAudioCodec )
    {
      const std::string Audio = LumekTest::Ffprobe( i_rPath, { "-select_streams", "a:0", "-show_entries",
                                                               "stream=codec_name,sample_rate,channels", "-of",
                                                               "default=noprint_wrappers=1" } );
      EXPECT_EQ( Audio, std::string( "codec_name=" ) + i_pAudioCodec + "\nsample_rate=48000\nchannels=2\n" );
    }
    // ffmpeg reads the raw frames in its own pixel format names: the FourCC and the layout
    // agree. MJPEG frames decode as the JPEG they were made from.
    VBytes Expected;
    const VBytes Picture = i_rCase.bJPEG ? LumekTest::FfmpegDecode( i_rJPEGPath, "rgb24" ) : VBytes();
    for( int Frame = 0; Frame < i_rCase.Frames; ++Frame )
    {
      const VBytes FrameBytes = i_rCase.bJPEG ? Picture : RawFrame( i_rCase, Frame );
      Expected.insert( Expected.end(), FrameBytes.begin(), FrameBytes.end() );
    }
    EXPECT_EQ( LumekTest::FfmpegDecode( i_rPath, i_rCase.bJPEG ? "rgb24" : i_pFfmpegFormat ), Expected );
  }

  TEST( MkvFamily, WriterToReaderAndToFfmpeg )
  {
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    // One small JPEG for every MJPEG frame, made by ffmpeg.
    const std::string JPEGPath =
        LumekTest::FfmpegFixture( "mkv_frame.jpg", { "-f", "lavfi", "-i", "testsrc=size=16x8:rate=1", "-frames:v", "1",
                                                     "-pix_fmt", "yuvj420p" } );
    ASSERT_FALSE( JPEGPath.empty() );
    const VBytes JPEG = ReadWholeFile( JPEGPath );
    struct VRow
    {
      const char* Name;
      ZOL::EPixelFormat Format;
      ZOL::EAudioSampleFormat Audio;
      bool bJPEG;
      const char* FfmpegFormat;
      const char* AudioCodec;
    };
    const VRow Rows[] = {
        { "RGBA_Int16", ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16, false, "rgba", "pcm_s16le" },
        { "UYVY_Int24", ZOL::PixelFormat_U8Y8V8Y8, ZOL::AudioSampleFormat_Int24, false, "uyvy422", "pcm_s24le" },
        { "YUY2_Int32", ZOL::PixelFormat_Y8U8Y8V8, ZOL::AudioSampleFormat_Int32, false, "yuyv422", "pcm_s32le" },
        { "GREY_Float32", ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Float32, false, "gray", "pcm_f32le" },
        { "GREY_NoAudio", ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Unspecified, false, "gray", "" },
        { "MJPEG_Int16", ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16, true, "", "pcm_s16le" },
    };
    for( const VRow& rRow : Rows )
    {
      SCOPED_TRACE( rRow.Name );
      VFamilyCase Case;
      Case.Name = rRow.Name;
      Case.Format = rRow.Format;
      Case.Audio = rRow.Audio;
      Case.bJPEG = rRow.bJPEG;
      const std::string Path = TempPath( Case.Name + ".mkv" );
      ASSERT_TRUE( WriteFamilyFile( Path, Case, JPEG ) );
      ExpectReadsBack( Path, Case, JPEG );
      ExpectFfmpegAgrees( Path, Case, JPEGPath, rRow.FfmpegFormat, rRow.AudioCodec );
      std::remove( Path.c_str() );
    }
  }

  // The FourCC in a BITMAPINFOHEADER reads as the colour space one does.
  TEST( MkvReader, VfwFourCCReadsAsUncompressed )
  {
    VFamilyCase Case;
    Case.Format = ZOL::PixelFormat_U8Y8V8Y8;
    const std::string Path = TempPath( "vfw.mkv" );
    ASSERT_TRUE( WriteFamilyFile( Path, Case, {},
                                  []( MkvIO::VMkvDescription& io_rD ) { io_rD.Video.CodecID = "V_MS/VFW/FOURCC"; } ) );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetVideoPayload(), ZOL::VideoPayload_Uncompressed );
    EXPECT_EQ( Reader.GetVideoFrameInfo().PixelFormat, ZOL::PixelFormat_U8Y8V8Y8 );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    ASSERT_TRUE( Reader.ReadFrameData( 2, pVideo, Audio, true, true ) );
    EXPECT_EQ( Bytes( pVideo ), RawFrame( Case, 2 ) );
    std::remove( Path.c_str() );
  }

  // Reading frames must not leave their blocks behind: the heap after thousands of frames is
  // what it was after the first hundred.
  TEST( MkvReader, MemoryDoesNotGrowWithFramesRead )
  {
    VFamilyCase Case;
    Case.Format = ZOL::PixelFormat_Luminance8;
    Case.Audio = ZOL::AudioSampleFormat_Int16;
    Case.Width = 8;
    Case.Height = 4;
    Case.Frames = 3000;
    const std::string Path = TempPath( "long.mkv" );
    ASSERT_TRUE( WriteFamilyFile( Path, Case, {} ) );
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
          HeapAfterWarmUp = mallinfo2().uordblks;
      }
    const std::size_t HeapAtEnd = mallinfo2().uordblks;
    // The first read of a frame drops what opening kept of its blocks, so the heap may shrink.
    EXPECT_LT( static_cast< double >( HeapAtEnd ), static_cast< double >( HeapAfterWarmUp ) + 16 * 1024 )
        << "after warm-up " << HeapAfterWarmUp << ", at end " << HeapAtEnd;
    std::remove( Path.c_str() );
  }
} // namespace
