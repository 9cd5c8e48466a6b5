#pragma once

// Reads AVI files, OpenDML parts past 1 GiB included: raw, MJPEG and H.264 video with PCM
// audio. Frames are found through the indexes alone (ix00/ix01, else idx1); movi is never
// scanned, so a file without an index has no frames.
//
// The work is split by file: the chunk tree (RiffChunkTree.cpp), the chunk rules
// (ChunkParser.cpp), the stream headers (StreamFormats.cpp), the indexes and audio ownership
// (AviIndex.cpp), MJPEG frames (MJPEGFrames.cpp) and the rest here.

#include "fileio/RapidAVI/RiffChunk.h"
#include "fileio/VideoEncoding/IH264Decoder.h"
#include "utils/Streams.h"
#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"
#include "videointerface/VideoReaderBase.h"

#include <cstdint>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

namespace RapidAVI
{
  // Lists nested deeper than this exist in no real file: a real one is at most RIFF, LIST,
  // LIST, chunk.
  constexpr int MaxChunkDepth = 8;

  class VRapidAVIReader : public ZOL::VVideoReaderBase, public ZOL::IFrameIndexQueries
  {
  public:
    VRapidAVIReader();
    ~VRapidAVIReader() override;
    VRapidAVIReader( const VRapidAVIReader& ) = delete;
    VRapidAVIReader& operator=( const VRapidAVIReader& ) = delete;

    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return m_Capabilities; }
    using ZOL::VVideoReaderBase::Open;
    // Reads a file from a stream that is already open (memory, for tests and fuzzing).
    [[nodiscard]] bool Open( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream );
    bool DumpFileStructure( std::ostream& o_rStream ) override;
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_Attributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override { return m_AudioPayload; }
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_AudioFrameInfo; }
    ZOL::EVideoPayload GetVideoPayload() const override { return m_VideoPayload; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_VideoFrameInfo; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override;
    bool HasFrame( std::uint64_t i_FrameIndex ) const override;
    bool ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                    bool i_bReadAudio ) override;
    bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                        ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio ) override;
    void Close() override;

    std::uint64_t GetStoredFrameCount() const override { return GetFrameCount(); }
    std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const override;
    std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const override;

    // Reads io_rParent's children from the stream's position up to its end.
    [[nodiscard]] bool BuildChunkTree( VRiffChunk& io_rParent );
    // Checks one chunk against the file, stores what it holds, then does the same for its
    // children.
    [[nodiscard]] bool ParseChunk( const VRiffChunk& i_rChunk );

    // What Open found, for tools and tests.
    double GetMainHeaderFrameRate() const { return m_FrameRate; }
    const VAviIndexTable& GetVideoIndex() const;
    const VAviIndexTable& GetAudioIndex() const;
    const std::vector< std::uint64_t >& GetAudioChunkOfFrame() const { return m_AudioChunkOfFrame; }
    const std::vector< std::uint64_t >& GetMoviPositions() const { return m_MoviPositions; }

  private:
    enum EStreamKind : int
    {
      StreamKind_Audio = 0,
      StreamKind_Video = 1,
      StreamKind_Other = 2,
    };

    bool OpenReader( const std::string& i_rFileName ) override;
    void Reset() override;
    bool OpenStream( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream );
    bool BuildChunkTree( VRiffChunk& io_rParent, int i_Depth );
    bool ParseRiff( const VRiffChunk& i_rChunk, bool i_bGood, bool& o_rParseChildren );
    bool ParseList( const VRiffChunk& i_rChunk, bool i_bGood, bool& o_rParseChildren );
    // The leaf chunks' rules, one signature for the rule table.
    bool ParseMainHeader( const VRiffChunk& i_rChunk );
    bool ParseStreamHeader( const VRiffChunk& i_rChunk );
    bool ParseStreamFormat( const VRiffChunk& i_rChunk );
    bool ParseSuperIndex( const VRiffChunk& i_rChunk );
    bool ParseOpenDMLHeader( const VRiffChunk& i_rChunk );
    bool ParseCreator( const VRiffChunk& i_rChunk );
    bool ParseSMPTE( const VRiffChunk& i_rChunk );
    bool ParseVideoStandardIndex( const VRiffChunk& i_rChunk );
    bool ParseAudioStandardIndex( const VRiffChunk& i_rChunk );
    bool ParseOldIndex( const VRiffChunk& i_rChunk );
    bool ParseNothing( const VRiffChunk& i_rChunk );
    bool ParseUnknown( const VRiffChunk& i_rChunk );
    bool ParseStandardIndex( const VRiffChunk& i_rChunk, VAviIndexTable& io_rTable );
    void ParseMetadata();
    bool ParseVideoFormat( const VRiffChunk& i_rChunk );
    void ParseAudioFormat();

    void ApplyStoredAttributes();
    void BuildAudioChunkOfFrame();

    bool ReadAudio( std::uint64_t i_FrameIndex, ZOL::IAudioBuffers& o_rAudio );
    bool ReadVideo( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo );
    // Reads an entry's bytes into a new buffer, which is stored also after a failed read.
    bool ReadEntry( const VAviIndexEntry& i_rEntry, std::shared_ptr< ZOL::IBuffer >& o_rBuffer );
    bool ReadMJPEG( const VAviIndexEntry& i_rEntry, std::shared_ptr< ZOL::IBuffer >& o_rVideo );

    // What the compression and audio format tables can yield.
    ZOL::VReaderCapabilities m_Capabilities{
        { ZOL::AudioSampleFormat_Int16, ZOL::AudioSampleFormat_Int24, ZOL::AudioSampleFormat_Int32,
          ZOL::AudioSampleFormat_Float32, ZOL::AudioSampleFormat_UInt8 },
        { ZOL::AudioPayload_None, ZOL::AudioPayload_Uncompressed },
        { ZOL::PixelFormat_Luminance8, ZOL::PixelFormat_BayerRG8, ZOL::PixelFormat_BayerGB8, ZOL::PixelFormat_BayerGR8,
          ZOL::PixelFormat_BayerBG8, ZOL::PixelFormat_B8G8R8, ZOL::PixelFormat_B8G8R8u8, ZOL::PixelFormat_U8Y8V8Y8,
          ZOL::PixelFormat_Y8U8Y8V8 },
        { ZOL::VideoPayload_Uncompressed, ZOL::VideoPayload_ImageJPEG, ZOL::VideoPayload_VideoH264 } };
    std::shared_ptr< ZOL::IInputStreamSeekable > m_pStream;
    std::shared_ptr< ZOL::IBufferAllocator > m_pAllocator;
    std::shared_ptr< ZOL::IH264Decoder > m_pH264Decoder;
    // Every count, size and offset in the file is checked against this before it is trusted.
    std::uint64_t m_FileSize = 0;
    ZOL::IAudioFrameInfo m_AudioFrameInfo;
    ZOL::EAudioPayload m_AudioPayload = ZOL::AudioPayload_None;
    ZOL::IVideoFrameInfo m_VideoFrameInfo;
    ZOL::EVideoPayload m_VideoPayload = ZOL::VideoPayload_None;
    double m_FrameRate = 0.0;
    std::vector< std::uint64_t > m_MoviPositions;
    EStreamKind m_CurrentStreamKind = StreamKind_Other;
    VAviIndexTable m_OldVideoIndex;
    VAviIndexTable m_OldAudioIndex;
    VAviIndexTable m_StandardVideoIndex;
    VAviIndexTable m_StandardAudioIndex;
    ZOL::IVideoAttributes m_FrameStore;
    ZOL::IVideoAttributes m_Attributes;
    ZOL::IVideoTiming m_Timing;
    ZOL::IVideoSettings m_Settings;
    ZOL::ITimecode m_Timecode;
    std::vector< std::uint64_t > m_AudioChunkOfFrame;
  };
} // namespace RapidAVI
