// Atom trees written by the tests' own writer: the tree walk's cases, each bound the reader
// must hold, the metadata atom, and damaged files at many points. Files written by ffmpeg in
// each data format the reader takes, checked against ffprobe's figures and ffmpeg's own
// demuxing and decoding; and ffmpeg's files that the reader refuses, each with its rule.

#include "ContainerTestSupport.h"
#include "MovTestSupport.h"

#include "fileio/H264IO/VH264Decoder.h"
#include "fileio/MovIO/VMovReader.h"
#include "videointerface/BufferAllocators.h"

#include <gtest/gtest.h>

using namespace ContainerTest;
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
      ZOL::IVideoFrame Frame;
      static_cast< void >( Reader.ReadFrame( f, Frame, true, true ) );
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

  constexpr auto Raw = ZOL::VideoPayload_Uncompressed;
  constexpr auto NoAudio = ZOL::AudioSampleFormat_Unspecified;
  constexpr auto Int16 = ZOL::AudioSampleFormat_Int16;

  // Ten frames of testsrc2 at 64 x 48 and this rate; a sine behind them when the arguments have
  // an audio codec.
  std::string MakeFixture( const std::string& i_rName, const std::string& i_rRate, const std::string& i_rArguments )
  {
    const bool bAudio = i_rArguments.find( "-c:a" ) != std::string::npos;
    return LumekTest::FfmpegFixture( "mov-" + i_rName + ".mov",
                                     Words( "-f lavfi -i testsrc2=size=64x48:rate=" + i_rRate +
                                            ( bAudio ? " -f lavfi -i sine=f=440:r=48000 -shortest" : "" ) +
                                            " -frames:v 10 -c:v rawvideo -pix_fmt uyvy422 " + i_rArguments ) );
  }

  struct VFfmpegCase
  {
    const char* Name;
    const char* Rate; // e.g. "25" or "30000/1001"
    // Behind a uyvy422 rawvideo default.
    const char* Arguments;
    // The pixel format ffmpeg decodes raw frames to for a byte comparison, "" for compressed.
    const char* RawPixelFormat;
    ZOL::EVideoPayload Payload;
    ZOL::EAudioSampleFormat AudioFormat;
    // Largest difference from ffmpeg's decode of a compressed picture in any sample.
    int Tolerance = 0;
  };

  // JPEG's colour conversion is the image library's, not swscale's: a few levels apart. H.264 is
  // compared by its luma, which a conforming decoder gives bit for bit.
  const VFfmpegCase s_Cases[] = {
      { "Uyvy2vuyAudioTimecode", "25", "-c:a pcm_s16le -timecode 01:02:03:04", "uyvy422", Raw, Int16 },
      { "V210At24", "24", "-c:v v210 -pix_fmt yuv422p10le", "", Raw, NoAudio },
      { "Rgb24Raw", "25", "-pix_fmt rgb24 -c:a pcm_s16le -timecode 00:00:10:00", "rgb24", Raw, Int16 },
      { "Mjpeg", "25", "-c:v mjpeg -pix_fmt yuvj422p -c:a pcm_s16le", "", ZOL::VideoPayload_ImageJPEG, Int16, 8 },
      { "Png", "25", "-c:v png -pix_fmt rgb24", "", ZOL::VideoPayload_ImagePNG, NoAudio },
      { "Tiff", "25", "-c:v tiff -pix_fmt rgb24", "", ZOL::VideoPayload_ImageTIFF, NoAudio },
      { "H264Baseline", "25",
        "-c:v libx264 -profile:v baseline -pix_fmt yuv420p -g 4 -c:a pcm_s16le -timecode 00:59:59:00", "",
        ZOL::VideoPayload_VideoH264, Int16 },
      { "DropFrame2997", "30000/1001", "-c:a pcm_s16le -timecode 01:00:00;02", "uyvy422", Raw, Int16 },
      { "TwosBigEndian", "25", "-c:a pcm_s16be", "uyvy422", Raw, Int16 },
      { "RawU8Audio", "25", "-c:a pcm_u8", "uyvy422", Raw, ZOL::AudioSampleFormat_UInt8 },
      { "In24Audio", "25", "-c:a pcm_s24be", "uyvy422", Raw, ZOL::AudioSampleFormat_Int24 },
      { "In32Audio", "25", "-c:a pcm_s32be", "uyvy422", Raw, ZOL::AudioSampleFormat_Int32 },
      { "LpcmAt96k", "25", "-c:a pcm_s16le -ar 96000", "uyvy422", Raw, Int16 },
  };

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
        std::shared_ptr< ZOL::IBuffer > pUnit;
        ZOL::IAudioBuffers Audio;
        Frame.VideoFrameInfo = io_rReader.GetVideoFrameInfo();
        ASSERT_TRUE( bH264
                         ? io_rReader.ReadFrameData( f, pUnit, Audio, true, false ) &&
                               pDecoder->Decode( *pUnit, ZOL::PixelFormat_U8Y8V8Y8, Frame.Video, Frame.VideoFrameInfo )
                         : io_rReader.ReadFrame( f, Frame, true, false ) )
            << "frame " << f;
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
  const VBytes Golden = ReadFileBytes( MOV_GOLDEN_FOLDER "/dump-timecode-track.txt" );
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
  Spec.Qmdt = BayerStores( 16, 8, Attributes, Timing );
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
  CutsAndFlips( Good, Good.size() - 1200, Good.size(), 7, ReadFrames );
}

TEST( MovFfmpeg, MatchesFfprobeAndFfmpeg )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "ffmpeg is not installed";
  for( const VFfmpegCase& rCase : s_Cases )
  {
    SCOPED_TRACE( rCase.Name );
    const std::string Path = MakeFixture( rCase.Name, rCase.Rate, rCase.Arguments );
    LumekTest::VLogCapture Log( "MovIO" );
    MovIO::VMovReader Reader;
    ASSERT_TRUE( Reader.Open( Path ) ) << testing::PrintToString( Log.Lines() );
    EXPECT_EQ( Reader.GetFrameCount(), std::stoull( Probe( Path, "stream=nb_frames" ) ) );
    EXPECT_EQ( Reader.FindStoredFrameAtOrBefore( 1u << 30 ), std::optional( Reader.GetFrameCount() - 1 ) );
    EXPECT_EQ( Reader.GetVideoPayload(), rCase.Payload );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageWidth, 64 );
    EXPECT_EQ( Reader.GetVideoFrameInfo().ImageHeight, 48 );
    // ffmpeg's scale of 15360 at 24, 30 and 60 Hz does not divide the 1080 MHz clock: the period
    // is truncated to whole ticks, a rate off by a few parts in a million.
    const std::string Rate = Probe( Path, "stream=r_frame_rate" );
    const double Expected = std::stod( Rate ) / std::stod( Rate.substr( Rate.find( '/' ) + 1 ) );
    EXPECT_NEAR( Reader.GetVideoTiming().GetFrameRate(), Expected, Expected * 1e-5 );
    if( std::string( rCase.Arguments ).find( "-timecode" ) != std::string::npos )
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
    const bool bAudio = rCase.AudioFormat != NoAudio;
    EXPECT_TRUE( rCase.Payload == ZOL::VideoPayload_VideoH264 || Video == StreamCopy( Path, "v:0" ) );
    EXPECT_EQ( Reader.GetAudioFrameInfo().SampleRate,
               bAudio ? std::stoi( Probe( Path, "stream=sample_rate", "a:0" ) ) : 0 );
    EXPECT_TRUE( Audio == ( bAudio ? StreamCopy( Path, "a:0" ) : VBytes() ) ) << Audio.size();
    EXPECT_TRUE( *rCase.RawPixelFormat == 0 || Video == LumekTest::FfmpegDecode( Path, rCase.RawPixelFormat ) );
    if( rCase.Payload != Raw )
      ExpectPicturesMatch( Reader, Path, rCase.Tolerance );
  }
}

TEST( MovFfmpeg, RefusedByItsRule )
{
  if( !LumekTest::HaveFfmpeg() )
    GTEST_SKIP() << "ffmpeg is not installed";
  const struct
  {
    const char* Name;
    const char* Rate;
    const char* Arguments; // behind a uyvy422 rawvideo default
    const char* Refusal;
  } Cases[] = {
      // ffmpeg stores argb as 'raw ' of depth 32, and 'raw ' is taken at depth 24 only.
      { "ArgbNotSupported", "25", "-pix_fmt argb", "2 FourCC code '1918990112' is not supported." },
      // Float audio has no row in the sound description tables.
      { "FloatAudio", "25", "-c:a pcm_f32le",
        "2 Audio format unsupported (sample description version=1, FourCC=fl32)." },
      // AAC's edit list starts the audio at a media time after its priming samples.
      { "AacEditList", "25", "-c:a aac", "2 Could not read 'elst' atom." },
      { "Interlaced", "25", "-field_order tt", "2 Opening interlaced files is not supported." },
      // Colour described other than as BT.709.
      { "Bt601Colour", "25", "-color_primaries smpte170m -color_trc smpte170m -colorspace smpte170m",
        "2 Could not read 'colr' atom." },
      // Timecode at 50 frames a second counts 50 frames, and the 25 fps standard 25.
      { "Timecode50", "50", "-timecode 00:00:01:00",
        "2 Number of timecode counting frames (2) does not match expected number for standard (25)." },
      // Without an edit list the mandatory 'elst' is missing.
      { "NoEditList", "25", "-use_editlist 0", "2 There was an error parsing the MOV file." },
  };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Name );
    const std::string Path = MakeFixture( rCase.Name, rCase.Rate, rCase.Arguments );
    LumekTest::VLogCapture Log( "MovIO" );
    MovIO::VMovReader Reader;
    EXPECT_FALSE( Reader.Open( Path ) );
    const std::vector< std::string > Lines = Log.Lines();
    EXPECT_NE( std::find( Lines.begin(), Lines.end(), rCase.Refusal ), Lines.end() ) << testing::PrintToString( Lines );
  }
}
