#pragma once

// H.264 streams made by ffmpeg in the run, cut into access units, and a reader that serves them
// from memory so that the video source can be driven without a container that stores H.264.

#include "tests/support/LogCapture.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace LumekTest
{
  using VBytes = std::vector< std::uint8_t >;

  struct VH264Stream
  {
    std::string Path;
    std::int32_t Width = 0;
    std::int32_t Height = 0;
    // Each unit in Annex B form, as a reader hands it to the decoder.
    std::vector< VBytes > AccessUnits;
  };

  // A libx264 stream without B-frames, a key frame every i_KeyInterval frames and an access
  // unit delimiter before each unit, so that it can be cut without parsing slices.
  VH264Stream MakeH264Stream( std::int32_t i_Width, std::int32_t i_Height, int i_Frames, int i_KeyInterval = 30,
                              const std::vector< std::string >& i_rEncoderArguments = { "-profile:v", "baseline" },
                              const std::string& i_rPixelFormat = "yuv420p" );

  // ffmpeg's decode of the stream, each 4:2:0 frame packed to U8Y8V8Y8 by letting each chroma
  // row serve two rows, one vector a frame.
  std::vector< VBytes > ExpectedUYVYFrames( const VH264Stream& i_rStream );

  // The units of an Annex B byte string, without start codes.
  std::vector< VBytes > SplitNALUnits( const VBytes& i_rAnnexB );
  // The units joined again, behind 4-byte start codes or 4-byte big-endian lengths.
  VBytes JoinNALUnits( const std::vector< VBytes >& i_rUnits, bool i_bLengthPrefixed );
  // The units of one type (7 SPS, 8 PPS, 6 SEI) in an access unit.
  std::vector< VBytes > UnitsOfType( const VBytes& i_rAccessUnit, unsigned i_Type );

  inline VBytes Bytes( const ZOL::IBufferConst& i_rBuffer )
  {
    return VBytes( i_rBuffer.GetData(), i_rBuffer.GetData() + i_rBuffer.GetSize() );
  }

  // A buffer over bytes the test holds.
  class VBytesBuffer : public ZOL::IBufferConst
  {
  public:
    explicit VBytesBuffer( const VBytes& i_rBytes ) : m_rBytes( i_rBytes ) {}
    const std::uint8_t* GetData() const override { return m_rBytes.data(); }
    std::uint64_t GetSize() const override { return m_rBytes.size(); }

  private:
    const VBytes& m_rBytes;
  };

  // Serves access units as an H.264 file would, under frame numbers the test chooses (gaps
  // allowed), and counts the reads.
  class VMemoryH264Reader : public ZOL::IVideoReader, public ZOL::IFrameIndexQueries
  {
  public:
    VMemoryH264Reader( const VH264Stream& i_rStream, const std::vector< std::uint64_t >& i_rFrameNumbers = {} );

    std::uint64_t Reads = 0;

    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return m_Capabilities; }
    bool Open( const std::string& ) override { return true; }
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_Attributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override { return ZOL::AudioPayload_None; }
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_AudioInfo; }
    ZOL::EVideoPayload GetVideoPayload() const override { return ZOL::VideoPayload_VideoH264; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_VideoInfo; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override { return m_Frames.empty() ? 0 : m_Frames.rbegin()->first + 1; }
    bool HasFrame( std::uint64_t i_FrameIndex ) const override { return m_Frames.count( i_FrameIndex ) != 0; }
    bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                        ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio ) override;
    void Close() override {}

    std::uint64_t GetStoredFrameCount() const override { return m_Frames.size(); }
    std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const override;
    std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const override;

  private:
    ZOL::VReaderCapabilities m_Capabilities{
        {}, {}, ZOL::VReaderCapabilities::EveryPixelFormat(), { ZOL::VideoPayload_VideoH264 } };
    std::map< std::uint64_t, VBytes > m_Frames;
    std::shared_ptr< ZOL::VReaderBufferAllocator > m_pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
    ZOL::IVideoAttributes m_Attributes;
    ZOL::IVideoTiming m_Timing;
    ZOL::ITimecode m_Timecode;
    ZOL::IAudioFrameInfo m_AudioInfo;
    ZOL::IVideoFrameInfo m_VideoInfo;
    ZOL::IVideoSettings m_Settings;
  };
} // namespace LumekTest
