// Files of the family written by the project's writer read back equal, and ffprobe and ffmpeg
// see in them what the reader sees. The damaged and odd files a reader meets are refused with
// their log line or read as far as they can be; cut and flipped files never crash or hang.

#include "fileio/MkvIO/VMkvReader.h"
#include "tests/fileio/MkvIO/MkvTestSupport.h"
#include "tests/support/FfmpegFixtures.h"
#include "tests/support/LogCapture.h"

#include <ebml/MemReadIOCallback.h>
#include <gtest/gtest.h>

#include <malloc.h>

using namespace MkvTest;
using VDescription = MkvIO::VMkvDescription;
using VBlock = MkvIO::VMkvBlock;

namespace
{
  // Each test writes its files as one path in a folder of its own.
  class MkvReader : public ::testing::Test
  {
  protected:
    const VTempFolder Folder;
    const std::string Path = Folder / "test.mkv";
  };

  TEST_F( MkvReader, WriterToReaderAndToFfmpeg )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    // One small JPEG for every MJPEG frame, made by ffmpeg.
    const std::string JPEGPath = FfmpegFixture( "mkv_frame.jpg", { "-f", "lavfi", "-i", "testsrc=size=16x8:rate=1",
                                                                   "-frames:v", "1", "-pix_fmt", "yuvj420p" } );
    const VBytes JPEG = ReadFileBytes( JPEGPath );
    ASSERT_FALSE( JPEG.empty() );
    // The case, and ffmpeg's names of its pixel format and audio codec.
    const std::tuple< VFamilyCase, const char*, const char* > Rows[] = {
        { { ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16 }, "rgba", "pcm_s16le" },
        { { ZOL::PixelFormat_U8Y8V8Y8, ZOL::AudioSampleFormat_Int24 }, "uyvy422", "pcm_s24le" },
        { { ZOL::PixelFormat_Y8U8Y8V8, ZOL::AudioSampleFormat_Int32 }, "yuyv422", "pcm_s32le" },
        { { ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Float32 }, "gray", "pcm_f32le" },
        { { ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Unspecified }, "gray", "" },
        { { ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16, true }, "rgb24", "pcm_s16le" },
    };
    for( const auto& [Case, pFfmpegFormat, pAudioCodec] : Rows )
    {
      SCOPED_TRACE( std::string( pFfmpegFormat ) + ( Case.bJPEG ? " JPEG " : " " ) + pAudioCodec );
      ASSERT_TRUE( WriteFamilyFile( Path, Case, JPEG ) );
      MkvIO::VMkvReader Reader;
      ASSERT_TRUE( Reader.Open( Path ) );
      EXPECT_EQ( Reader.GetFrameCount(), static_cast< std::uint64_t >( Case.Frames ) );
      EXPECT_EQ( Reader.GetVideoPayload(), Case.bJPEG ? ZOL::VideoPayload_ImageJPEG : ZOL::VideoPayload_Uncompressed );
      const ZOL::IVideoFrameInfo& rVideo = Reader.GetVideoFrameInfo();
      EXPECT_EQ( std::tie( rVideo.ImageWidth, rVideo.ImageHeight, rVideo.PixelFormat ),
                 std::tie( Case.Width, Case.Height, Case.Format ) );
      const ZOL::IAudioFrameInfo Audio = AudioInfo( Case );
      EXPECT_EQ( Reader.GetAudioPayload(), Audio.IsUsable() ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None );
      EXPECT_EQ( Reader.GetAudioFrameInfo(), Audio );
      // The tags carry the timing, the timecode and the settings exactly.
      EXPECT_EQ( Reader.GetVideoTiming(), s_Timing );
      EXPECT_EQ( Reader.GetTimecode(), s_StartTimecode );
      EXPECT_EQ( std::tie( Reader.GetVideoSettings().Saturation, Reader.GetVideoSettings().GammaCorrection ),
                 std::tuple( 0.75f, 1.25f ) );
      std::string WritingApp;
      EXPECT_TRUE( Reader.GetAttributes().Get( "Matroska.WritingApp", WritingApp ) &&
                   WritingApp == "LumekVideoViewer" );

      for( int Frame = 0; Frame <= Case.Frames; ++Frame )
      {
        std::shared_ptr< ZOL::IBuffer > pVideo;
        ZOL::IAudioBuffers Blocks;
        ASSERT_EQ( Reader.ReadFrameData( Frame, pVideo, Blocks, true, true ), Frame < Case.Frames ) << Frame;
        if( Frame == Case.Frames )
          break;
        EXPECT_EQ( Bytes( pVideo ), Case.bJPEG ? JPEG : RawFrame( Case, Frame ) ) << Frame;
        ASSERT_EQ( Blocks.size(), Audio.IsUsable() ? 1u : 0u ) << Frame;
        EXPECT_TRUE( Blocks.empty() || Bytes( Blocks[0] ) == AudioBlock( Case, Frame ) ) << Frame;
      }
      EXPECT_TRUE( Reader.HasFrame( Case.Frames - 1 ) && !Reader.HasFrame( Case.Frames ) );
      EXPECT_EQ( Reader.FindStoredFrameAtOrBefore( 1000 ), std::optional< std::uint64_t >( Case.Frames - 1 ) );
      EXPECT_EQ( Reader.FindStoredFrameAtOrAfter( Case.Frames ), std::nullopt );

      // One audio block a frame.
      EXPECT_EQ( Ffprobe( Path, { "-count_frames", "-show_entries",
                                  "stream=codec_name,width,height,r_frame_rate,nb_read_frames,sample_rate,channels",
                                  "-of", "default=noprint_wrappers=1" } ),
                 std::string( "codec_name=" ) + ( Case.bJPEG ? "mjpeg" : "rawvideo" ) +
                     "\nwidth=16\nheight=8\nr_frame_rate=50/1\nnb_read_frames=5\n" +
                     ( *pAudioCodec ? std::string( "codec_name=" ) + pAudioCodec +
                                          "\nsample_rate=48000\nchannels=2\nr_frame_rate=0/0\nnb_read_frames=5\n"
                                    : "" ) );
      // ffmpeg reads the raw frames in its own pixel format names: the FourCC and the layout
      // agree. MJPEG frames decode as the JPEG they were made from.
      VBytes Expected;
      const VBytes Picture = Case.bJPEG ? FfmpegDecode( JPEGPath, pFfmpegFormat ) : VBytes();
      for( int Frame = 0; Frame < Case.Frames; ++Frame )
        for( const std::uint8_t Byte : Case.bJPEG ? Picture : RawFrame( Case, Frame ) )
          Expected.push_back( Byte );
      EXPECT_EQ( FfmpegDecode( Path, pFfmpegFormat ), Expected );
    }
  }

  // Reading frames must not leave their blocks behind: the heap after thousands of frames is
  // what it was after the first hundred.
  TEST_F( MkvReader, MemoryDoesNotGrowWithFramesRead )
  {
    const VFamilyCase Case{ ZOL::PixelFormat_Luminance8, ZOL::AudioSampleFormat_Int16, false, 8, 4, 3000 };
    ASSERT_TRUE( WriteFamilyFile( Path, Case ) );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    std::size_t HeapAfterWarmUp = 0;
    for( int Read = 0; Read < 2 * Case.Frames; ++Read )
    {
      ZOL::IVideoFrame Frame;
      ASSERT_TRUE( Reader.ReadFrame( Read % Case.Frames, Frame, true, true ) );
      HeapAfterWarmUp = Read == 100 ? mallinfo2().uordblks : HeapAfterWarmUp;
    }
    // The first read of a frame drops what opening kept of its blocks, so the heap may shrink.
    EXPECT_LT( mallinfo2().uordblks, HeapAfterWarmUp + 16 * 1024 );
  }

  TEST_F( MkvReader, BrokenFilesAreRefusedWithTheirLine )
  {
    const std::pair< std::function< void( VDescription& ) >, const char* > Cases[] = {
        { []( VDescription& io_rD ) { io_rD.bUnknownSegmentSize = true; }, "KaxSegment missing or not a finite size." },
        { []( VDescription& io_rD ) { io_rD.Video.DisplayWidth = 8; }, "Invalid image width." },
        { []( VDescription& io_rD ) { io_rD.Video.DisplayHeight = 1; }, "Invalid image height." },
        { []( VDescription& io_rD ) { io_rD.Video.FourCC = "ABCD"; }, "Unknown video FourCC code 'ABCD' found." },
        { []( VDescription& io_rD ) { io_rD.Video.CodecID = "V_MS/VFW/FOURCC", io_rD.Video.FourCC = "H264"; },
          "Unknown video FourCC code 'H264' found." },
        { []( VDescription& io_rD ) { io_rD.Video.CodecID = "V_MPEG4/ISO/AVC"; },
          "Unknown video codec 'V_MPEG4/ISO/AVC' found." },
    };
    for( const auto& [Edit, pMessage] : Cases )
    {
      ASSERT_TRUE( WriteFamilyFile( Path, s_SmallCase, {}, Edit ) );
      VLogCapture Log( "MkvReader" );
      MkvIO::VMkvReader Reader;
      EXPECT_FALSE( Reader.Open( Path ) );
      EXPECT_TRUE( Log.Contains( pMessage ) ) << pMessage << " not in " << ::testing::PrintToString( Log.Messages );
      // Refused means closed and empty.
      EXPECT_EQ( Reader.GetFrameCount(), 0u );
      EXPECT_EQ( Reader.GetVideoPayload(), ZOL::VideoPayload_None );
    }

    VLogCapture Log( "MkvReader" );
    MkvIO::VMkvReader Reader;
    EXPECT_FALSE( Reader.Open( Folder / "absent.mkv" ) );
    EXPECT_TRUE( Log.Has( "File could not be opened." ) );
    ASSERT_TRUE( WriteFileBytes( Path, std::string( 300, 'x' ) ) );
    EXPECT_FALSE( Reader.Open( Path ) );
    EXPECT_TRUE( Log.Has( "EbmlHead missing." ) );
  }

  TEST_F( MkvReader, OddClustersReadWhatIsThere )
  {
    const VFamilyCase Case = s_SmallCase;
    const VBytes Video = RawFrame( Case, 1 ), AudioA( 8, 0x11 ), AudioB( 12, 0x22 );
    struct VCase
    {
      const char* Name;
      std::vector< VBlock > Blocks; // frame 1's Cluster; the others are ordinary
      VBytes Video;                 // what frame 1 reads as
      std::vector< VBytes > Audio;
    };
    const VCase Cases[] = {
        { "ThirdTrackBlock", { VBlock{ 3, { 1, 2, 3 } }, VBlock{ 1, Video }, VBlock{ 2, AudioA } }, Video, { AudioA } },
        { "NoVideoBlock", { VBlock{ 2, AudioA } }, {}, { AudioA } },
        { "GroupWithoutBlock", { VBlock{ 1, {}, false }, VBlock{ 1, Video }, VBlock{ 2, AudioA } }, Video, { AudioA } },
        { "TwoAudioBlocks", { VBlock{ 1, Video }, VBlock{ 2, AudioA }, VBlock{ 2, AudioB } }, Video, { AudioB } },
        { "EmptyCluster", {}, {}, {} },
    };
    for( const VCase& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      ASSERT_TRUE( WriteFamilyFile( Path, Case, {}, {},
                                    [&]( int i_Frame )
                                    {
                                      if( i_Frame == 1 )
                                        return rCase.Blocks;
                                      return std::vector< VBlock >{ VBlock{ 1, RawFrame( Case, i_Frame ) },
                                                                    VBlock{ 2, AudioBlock( Case, i_Frame ) } };
                                    } ) );
      MkvIO::VMkvReader Reader;
      ASSERT_TRUE( Reader.Open( Path ) );
      ASSERT_EQ( Reader.GetFrameCount(), 3u );
      VLogCapture Log( "MkvReader" );
      std::shared_ptr< ZOL::IBuffer > pVideo;
      ZOL::IAudioBuffers Audio;
      ASSERT_TRUE( Reader.ReadFrameData( 1, pVideo, Audio, true, true ) );
      EXPECT_EQ( Bytes( pVideo ), rCase.Video );
      std::vector< VBytes > AudioBytes;
      for( const auto& pBlock : Audio )
        AudioBytes.push_back( Bytes( pBlock ) );
      EXPECT_EQ( AudioBytes, rCase.Audio );
      EXPECT_EQ( rCase.Blocks.size() == 3 && rCase.Blocks[0].Track == 3,
                 Log.Has( "Track '3' found, but only tracks numbered '1' or '2' are allowed." ) );
      // The frames around it are untouched.
      ASSERT_TRUE( Reader.ReadFrameData( 2, pVideo, Audio, true, false ) );
      EXPECT_EQ( Bytes( pVideo ), RawFrame( Case, 2 ) );
    }
  }

  // Tags change the records through SetValueFromString; the period comes from Duration only
  // when nothing set the timing. An audio depth the family has no format for leaves the audio
  // out.
  TEST_F( MkvReader, TagsAndTrackFieldsDecideTheRecords )
  {
    const std::string Aspect = "Lumek.Internal.VideoFrameInfo.PixelAspectRatio";
    // The tags, and the frame rate and pixel aspect ratio they give.
    const std::tuple< std::vector< std::pair< std::string, std::string > >, double, double > Cases[] = {
        // 10 frames over a Duration of 200 ms: 50 frames a second, 2700000 ticks.
        { {}, 50.0, 1.0 },
        { { { "Lumek.External.TicksPerSecond", "25" }, { "Lumek.External.FramePeriodInTicks", "1" } }, 25.0, 1.0 },
        { { { "Lumek.Internal.Unknown", "7" } }, 50.0, 1.0 }, // read, and not kept
        { { { Aspect, "2.5" } }, 50.0, 2.5 },
        { { { Aspect, "wide" } }, 50.0, 1.0 }, // unparsable: the value stays
    };
    const VFamilyCase Case{ ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16, false, 4, 2, 10 };
    for( const auto& [Tags, FrameRate, PixelAspectRatio] : Cases )
    {
      SCOPED_TRACE( ::testing::PrintToString( Tags ) );
      ASSERT_TRUE( WriteFamilyFile( Path, Case, {}, [&]( VDescription& io_rD ) { io_rD.Tags = Tags; } ) );
      MkvIO::VMkvReader Reader;
      ASSERT_TRUE( Reader.Open( Path ) );
      EXPECT_DOUBLE_EQ( Reader.GetVideoTiming().GetFrameRate(), FrameRate );
      EXPECT_DOUBLE_EQ( Reader.GetVideoFrameInfo().PixelAspectRatio, PixelAspectRatio );
      std::string Unknown;
      EXPECT_FALSE( Reader.GetInternalAttributes().GetValueAsString( "Unknown", Unknown ) );
    }

    ASSERT_TRUE( WriteFamilyFile( Path, s_SmallCase, {},
                                  []( VDescription& io_rD ) { io_rD.Audio.BitDepth = 8, io_rD.Tags = {}; } ) );
    VLogCapture Log( "MkvReader" );
    MkvIO::VMkvReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) );
    EXPECT_EQ( Reader.GetAudioPayload(), ZOL::AudioPayload_None );
    EXPECT_TRUE( Log.Contains( "Unsupported sample format 8" ) );
  }

  // Cuts at every point and flips at every byte: no crash, no hang, and whatever opens reads.
  TEST_F( MkvReader, SurvivesEveryCutAndFlip )
  {
    ASSERT_TRUE( WriteFamilyFile( Path, s_SmallCase ) );
    const VBytes Original = ReadFileBytes( Path );
    ASSERT_GT( Original.size(), 100u );
    const VLogCapture Quiet;
    for( std::size_t Position = 0; Position < Original.size(); ++Position )
      for( const bool bFlip : { false, true } )
      {
        const VBytes Changed = Damaged(
            Original, Position,
            bFlip ? static_cast< std::uint8_t >( 0x80 >> ( Position % 8 ) | ( Position % 3 == 0 ? 0xFF : 0 ) ) : 0 );
        MkvIO::VMkvReader Reader;
        if( !Reader.Open( std::make_unique< libebml::MemReadIOCallback >( Changed.data(), Changed.size() ) ) )
          continue;
        for( std::uint64_t Frame = 0; Frame < Reader.GetFrameCount() && Frame < 16; ++Frame )
        {
          ZOL::IVideoFrame Decoded;
          (void)Reader.ReadFrame( Frame, Decoded, true, true );
        }
      }
  }
} // namespace
