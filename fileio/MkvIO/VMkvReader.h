#pragma once

// Reads the Matroska files this family of systems writes: one video track numbered 1, at most
// one audio track numbered 2, and one Cluster for each video frame. A frame is found by the
// position of its Cluster; Cues and block timestamps are not looked at.

#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"
#include "videointerface/VideoReaderBase.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace libebml
{
  class EbmlElement;
  class EbmlStream;
  class IOCallback;
} // namespace libebml

namespace libmatroska
{
  class KaxBlock;
  class KaxCluster;
  class KaxSegment;
  class KaxTrackEntry;
} // namespace libmatroska

namespace MkvIO
{
  class VMkvReader : public ZOL::VVideoReaderBase, public ZOL::IFrameIndexQueries
  {
  public:
    VMkvReader();
    ~VMkvReader() override;
    VMkvReader( const VMkvReader& ) = delete;
    VMkvReader& operator=( const VMkvReader& ) = delete;

    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return m_Capabilities; }
    using ZOL::VVideoReaderBase::Open;
    // Reads a file through a callback that is already open, from its position 0: how the fuzz
    // target reads files held in memory. The reader keeps the callback until Close.
    [[nodiscard]] bool Open( std::unique_ptr< libebml::IOCallback > i_pCallback );
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_ExternalAttributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override { return m_AudioPayload; }
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_AudioFrameInfo; }
    ZOL::EVideoPayload GetVideoPayload() const override { return m_VideoPayload; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_VideoFrameInfo; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override { return m_Clusters.size(); }
    bool HasFrame( std::uint64_t i_FrameIndex ) const override { return i_FrameIndex < m_Clusters.size(); }

    // A Matroska file has no gaps: these answer from the count alone.
    std::uint64_t GetStoredFrameCount() const override { return m_Clusters.size(); }
    std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const override;
    std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const override;

    // Reads the frame's payload and passes it through the frame decoder.
    bool ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                    bool i_bReadAudio ) override;
    bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                        ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio ) override;
    void Close() override;

    // The frame description store, which the "Lumek.Internal." tags change.
    const ZOL::IVideoAttributes& GetInternalAttributes() const { return m_InternalAttributes; }
    // Values of the Segment's Info, kept for the properties and for the frame rate.
    double GetDuration() const { return m_Duration; }
    std::uint64_t GetTimecodeScale() const { return m_TimecodeScale; }

  private:
    bool OpenReader( const std::string& i_rFileName ) override;
    void Reset() override;
    bool OpenCallback( std::unique_ptr< libebml::IOCallback > i_pCallback );
    bool OpenSegment();
    bool WalkSegment();
    bool ReadInfo( libebml::EbmlElement& io_rInfo );
    void ReadInfoValue( libebml::EbmlElement& io_rValue );
    bool ReadTracks( libebml::EbmlElement& io_rTracks );
    bool ReadVideoTrack( libmatroska::KaxTrackEntry& i_rEntry, const std::string& i_rCodecID );
    void ReadAudioTrack( libmatroska::KaxTrackEntry& i_rEntry, const std::string& i_rCodecID );
    void ReadTags( libebml::EbmlElement& i_rTags );
    void ReadSimpleTag( libebml::EbmlElement& i_rSimpleTag );
    void ApplyTags();
    void ComputeFramePeriod();
    void KeepBlockGroups( libmatroska::KaxCluster& io_rCluster );
    void TakeBlock( libmatroska::KaxBlock& i_rBlock, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                    std::shared_ptr< ZOL::IBuffer >& o_rAudio, bool i_bReadVideo, bool i_bReadAudio );
    bool ReadFrameBlocks( libmatroska::KaxCluster& io_rCluster, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                          std::shared_ptr< ZOL::IBuffer >& o_rAudio, bool i_bReadVideo, bool i_bReadAudio );

    // What the codec table can yield.
    ZOL::VReaderCapabilities m_Capabilities{ { ZOL::AudioSampleFormat_Int16, ZOL::AudioSampleFormat_Int24,
                                               ZOL::AudioSampleFormat_Int32, ZOL::AudioSampleFormat_Float32 },
                                             { ZOL::AudioPayload_None, ZOL::AudioPayload_Uncompressed },
                                             { ZOL::PixelFormat_Luminance8, ZOL::PixelFormat_BayerGB8,
                                               ZOL::PixelFormat_R8G8B8u8, ZOL::PixelFormat_U8Y8V8Y8,
                                               ZOL::PixelFormat_Y8U8Y8V8 },
                                             { ZOL::VideoPayload_Uncompressed, ZOL::VideoPayload_ImageJPEG } };
    std::unique_ptr< libebml::IOCallback > m_pCallback;
    std::unique_ptr< libebml::EbmlStream > m_pStream;
    std::unique_ptr< libmatroska::KaxSegment > m_pSegment;
    // One Cluster a frame, its BlockGroups known and their contents still in the file.
    std::vector< std::unique_ptr< libmatroska::KaxCluster > > m_Clusters;
    // The tags are kept as name and text until the records are in the stores.
    std::vector< std::pair< std::string, std::string > > m_Tags;
    std::shared_ptr< ZOL::IBufferAllocator > m_pVideoAllocator;
    std::shared_ptr< ZOL::IBufferAllocator > m_pDecodeAllocator;
    std::shared_ptr< ZOL::IBufferAllocator > m_pTemporaryAllocator;

    ZOL::IVideoAttributes m_InternalAttributes;
    ZOL::IVideoAttributes m_ExternalAttributes;
    ZOL::IVideoFrameInfo m_VideoFrameInfo;
    ZOL::IAudioFrameInfo m_AudioFrameInfo;
    ZOL::IVideoTiming m_Timing;
    ZOL::ITimecode m_Timecode;
    ZOL::IVideoSettings m_Settings;
    ZOL::EVideoPayload m_VideoPayload = ZOL::VideoPayload_None;
    ZOL::EAudioPayload m_AudioPayload = ZOL::AudioPayload_None;
    double m_Duration = 0.0;
    std::uint64_t m_TimecodeScale = 1000000;
    // Every element the file names is checked against this before it is read.
    std::uint64_t m_FileSize = 0;
    std::uint64_t m_SegmentEnd = 0;
  };
} // namespace MkvIO
