// H.264 1080p baseline, one thread: the bare library, our decoder object, the video source's
// whole path, and ffmpeg's own decoder on the same stream. The gap between the first and the
// third is what our copies and the 4:2:0 to 4:2:2 packing cost.

#include "app/VideoSource/VVideoSource.h"
#include "fileio/H264IO/VH264Decoder.h"
#include "fileio/H264Utils/H264Utils.h"
#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "tests/support/AllocationWatch.h"
#include "videointerface/BufferAllocators.h"

#include <benchmark/benchmark.h>
#include <wels/codec_api.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

namespace
{
  constexpr int FrameCount = 240;
  using VBytes = std::vector< std::uint8_t >;

  // Made once with libx264 and kept in the temporary folder between runs.
  struct VBenchStream
  {
    VBenchStream()
    {
      Path = "/tmp/lumek-bench-h264-1080p-baseline.h264";
      if( !std::ifstream( Path ).good() )
      {
        const std::string Command = "ffmpeg -y -v error -f lavfi -i testsrc2=size=1920x1080:rate=25 -frames:v " +
                                    std::to_string( FrameCount ) +
                                    " -pix_fmt yuv420p -c:v libx264 -preset veryfast -profile:v baseline -bf 0 -g 30 "
                                    "-bsf:v h264_metadata=aud=insert -f h264 " +
                                    Path + ".part && mv " + Path + ".part " + Path;
        if( std::system( Command.c_str() ) != 0 )
          return;
      }
      std::ifstream File( Path, std::ios::binary );
      const VBytes Whole( ( std::istreambuf_iterator< char >( File ) ), std::istreambuf_iterator< char >() );
      // Each access unit begins at its delimiter.
      H264Utils::ForEachNALUnit( Whole.data(), Whole.size(), H264Utils::EH264StreamForm::AnnexB,
                                 [&]( const std::uint8_t* i_pUnit, std::uint64_t i_Size )
                                 {
                                   if( i_Size == 0 )
                                     return true;
                                   if( ( i_pUnit[0] & 0x1F ) == 9 || AccessUnits.empty() )
                                     AccessUnits.emplace_back();
                                   AccessUnits.back().insert( AccessUnits.back().end(), { 0, 0, 0, 1 } );
                                   AccessUnits.back().insert( AccessUnits.back().end(), i_pUnit, i_pUnit + i_Size );
                                   return true;
                                 } );
    }
    std::string Path;
    std::vector< VBytes > AccessUnits;
  };

  const VBenchStream& Stream()
  {
    static const VBenchStream s_Stream;
    return s_Stream;
  }

  class VBytesBuffer : public ZOL::IBufferConst
  {
  public:
    explicit VBytesBuffer( const VBytes& i_rBytes ) : m_rBytes( i_rBytes ) {}
    const std::uint8_t* GetData() const override { return m_rBytes.data(); }
    std::uint64_t GetSize() const override { return m_rBytes.size(); }

  private:
    const VBytes& m_rBytes;
  };

  // Access units from memory through a reader's recycled buffers, as a container reader gives them.
  class VMemoryReader : public ZOL::IVideoReader, private ZOL::IVideoReaderCapabilities
  {
  public:
    explicit VMemoryReader( const VBenchStream& i_rStream ) : m_rStream( i_rStream )
    {
      m_Info.ImageWidth = 1920;
      m_Info.ImageHeight = 1080;
      m_Info.PixelFormat = ZOL::PixelFormat_U8Y8V8Y8;
      m_Timing.FramePeriodInTicks = m_Timing.TicksPerSecond / 25;
    }
    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return *this; }
    bool Open( const std::string& ) override { return true; }
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_Attributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override { return ZOL::AudioPayload_None; }
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_Audio; }
    ZOL::EVideoPayload GetVideoPayload() const override { return ZOL::VideoPayload_VideoH264; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_Info; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override { return m_rStream.AccessUnits.size(); }
    bool HasFrame( std::uint64_t i_Index ) const override { return i_Index < GetFrameCount(); }
    bool ReadFrameData( std::uint64_t i_Index, std::shared_ptr< ZOL::IBuffer >& o_rVideo, ZOL::IAudioBuffers&,
                        bool i_bVideo, bool ) override
    {
      if( !HasFrame( i_Index ) )
        return false;
      const VBytes& rUnit = m_rStream.AccessUnits[i_Index];
      if( i_bVideo )
      {
        m_pAllocator->Allocate( o_rVideo, rUnit.size() );
        if( !o_rVideo )
          return false;
        std::memcpy( o_rVideo->GetData(), rUnit.data(), rUnit.size() );
      }
      return true;
    }
    void Close() override {}

  private:
    bool SupportsAudioSampleFormat( ZOL::EAudioSampleFormat ) const override { return false; }
    bool SupportsAudioPayload( ZOL::EAudioPayload ) const override { return false; }
    bool SupportsPixelFormat( ZOL::EPixelFormat ) const override { return true; }
    bool SupportsVideoPayload( ZOL::EVideoPayload ) const override { return true; }

    const VBenchStream& m_rStream;
    std::shared_ptr< ZOL::VReaderBufferAllocator > m_pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
    ZOL::IVideoAttributes m_Attributes;
    ZOL::IVideoTiming m_Timing;
    ZOL::ITimecode m_Timecode;
    ZOL::IAudioFrameInfo m_Audio;
    ZOL::IVideoFrameInfo m_Info;
    ZOL::IVideoSettings m_Settings;
  };

  void Report( benchmark::State& io_rState, std::uint64_t i_HeapCallsBefore )
  {
    io_rState.counters["frames/s"] =
        benchmark::Counter( static_cast< double >( io_rState.iterations() ), benchmark::Counter::kIsRate );
    io_rState.counters["heap calls/frame"] =
        static_cast< double >( LumekTest::HeapCalls() - i_HeapCallsBefore ) / io_rState.iterations();
  }

  // The library alone: decode and flush into its own planes, nothing copied.
  void BM_OpenH264Bare( benchmark::State& io_rState )
  {
    const VBenchStream& rStream = Stream();
    ISVCDecoder* pDecoder = nullptr;
    if( rStream.AccessUnits.empty() || WelsCreateDecoder( &pDecoder ) != 0 )
    {
      io_rState.SkipWithError( "no stream or no decoder" );
      return;
    }
    SDecodingParam Parameters;
    std::memset( &Parameters, 0, sizeof( Parameters ) );
    pDecoder->Initialize( &Parameters );
    std::size_t Frame = 0;
    const std::uint64_t HeapCallsBefore = LumekTest::HeapCalls();
    for( auto _ : io_rState )
    {
      const VBytes& rUnit = rStream.AccessUnits[Frame];
      unsigned char* pPlanes[3] = {};
      SBufferInfo Info;
      std::memset( &Info, 0, sizeof( Info ) );
      pDecoder->DecodeFrameNoDelay( rUnit.data(), static_cast< int >( rUnit.size() ), pPlanes, &Info );
      pDecoder->FlushFrame( pPlanes, &Info );
      benchmark::DoNotOptimize( pPlanes[0] );
      Frame = ( Frame + 1 ) % rStream.AccessUnits.size();
    }
    Report( io_rState, HeapCallsBefore );
    pDecoder->Uninitialize();
    WelsDestroyDecoder( pDecoder );
  }
  BENCHMARK( BM_OpenH264Bare )->Unit( benchmark::kMillisecond )->Iterations( FrameCount * 2 );

  // Our decoder object: the library, then the packing into a recycled frame buffer.
  void BM_H264DecoderObject( benchmark::State& io_rState )
  {
    const VBenchStream& rStream = Stream();
    const auto pDecoder = H264IO::VH264Decoder::Create( std::make_shared< ZOL::VFrameBufferAllocator >() );
    if( rStream.AccessUnits.empty() || !pDecoder )
    {
      io_rState.SkipWithError( "no stream or no decoder" );
      return;
    }
    std::size_t Frame = 0;
    const std::uint64_t HeapCallsBefore = LumekTest::HeapCalls();
    for( auto _ : io_rState )
    {
      std::shared_ptr< ZOL::IBuffer > pOutput;
      ZOL::IVideoFrameInfo Info;
      if( !pDecoder->Decode( VBytesBuffer( rStream.AccessUnits[Frame] ), ZOL::PixelFormat_U8Y8V8Y8, pOutput, Info ) )
      {
        io_rState.SkipWithError( "decode failed" );
        break;
      }
      Frame = ( Frame + 1 ) % rStream.AccessUnits.size();
    }
    Report( io_rState, HeapCallsBefore );
  }
  BENCHMARK( BM_H264DecoderObject )->Unit( benchmark::kMillisecond )->Iterations( FrameCount * 2 );

  // The viewer's path: the reader's copy, the frame decoder, the decoder object, playing in order.
  void BM_H264VideoSource( benchmark::State& io_rState )
  {
    const VBenchStream& rStream = Stream();
    LumekVideoViewer::VVideoSource Source;
    if( rStream.AccessUnits.empty() || !Source.Open( rStream.Path, std::make_shared< VMemoryReader >( rStream ) ) )
    {
      io_rState.SkipWithError( "no stream" );
      return;
    }
    ZOL::IVideoFrame Frame;
    // The first frames fill the recyclers; the steady state is what is counted, in order and
    // without the return to the start.
    for( std::uint64_t i = 0; i < 8; ++i )
      if( !Source.GetFrame( i, Frame ) )
      {
        io_rState.SkipWithError( "decode failed" );
        return;
      }
    std::uint64_t Index = 8;
    const std::uint64_t HeapCallsBefore = LumekTest::HeapCalls();
    for( auto _ : io_rState )
    {
      if( !Source.GetFrame( Index, Frame ) )
      {
        io_rState.SkipWithError( "decode failed" );
        break;
      }
      Index = ( Index + 1 ) % rStream.AccessUnits.size();
    }
    Report( io_rState, HeapCallsBefore );
  }
  BENCHMARK( BM_H264VideoSource )->Unit( benchmark::kMillisecond )->Iterations( FrameCount - 8 );

  // The packing alone, 4:2:0 planes of a 1080p frame to U8Y8V8Y8: the part of our path that
  // the library does not do.
  void BM_PackPlanarToUYVY( benchmark::State& io_rState )
  {
    const int Width = 1920, Height = 1080;
    const VBytes Y( Width * Height, 16 ), U( Width * Height / 4, 128 ), V( Width * Height / 4, 128 );
    VBytes Output( Width * Height * 2 );
    for( auto _ : io_rState )
    {
      benchmark::DoNotOptimize( CoreVideoUtils::PlanarYUV420ToInterleaved(
          Y.data(), U.data(), V.data(), Output.data(), ZOL::PixelFormat_U8Y8V8Y8, Width, Height, Width, Width / 2 ) );
      benchmark::DoNotOptimize( Output.data() );
    }
    io_rState.counters["frames/s"] =
        benchmark::Counter( static_cast< double >( io_rState.iterations() ), benchmark::Counter::kIsRate );
  }
  BENCHMARK( BM_PackPlanarToUYVY )->Unit( benchmark::kMillisecond );

  // ffmpeg's h264 decoder on one thread, the whole file per iteration. Its own processor time
  // ("-benchmark": user plus system) is what is compared, so that the start of the process and
  // other work on the machine stay out of the figure.
  void BM_FfmpegDecode( benchmark::State& io_rState )
  {
    const VBenchStream& rStream = Stream();
    const std::string Command =
        "ffmpeg -nostdin -hide_banner -benchmark -threads 1 -i " + rStream.Path + " -f null - 2>&1 | grep '^bench:'";
    double Seconds = 0;
    for( auto _ : io_rState )
    {
      FILE* pPipe = ::popen( Command.c_str(), "r" );
      double User = 0, System = 0;
      const bool bRead = pPipe && std::fscanf( pPipe, "bench: utime=%lfs stime=%lfs", &User, &System ) == 2;
      if( pPipe )
        ::pclose( pPipe );
      if( !bRead )
      {
        io_rState.SkipWithError( "ffmpeg failed" );
        break;
      }
      Seconds += User + System;
    }
    io_rState.counters["frames/s"] =
        static_cast< double >( rStream.AccessUnits.size() ) * io_rState.iterations() / std::max( Seconds, 1e-9 );
  }
  BENCHMARK( BM_FfmpegDecode )->Unit( benchmark::kMillisecond )->Iterations( 3 )->UseRealTime();
} // namespace

BENCHMARK_MAIN();
