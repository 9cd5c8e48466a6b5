#pragma once

// Reads the narrow family of QuickTime files that cameras and our own tools write: one edit
// per track, one sample description, a constant frame duration, identity matrices. Nearly every
// fixed field is compared with the one value that family uses, and a mismatch refuses the
// file: the frame table and the timing below rely on those facts.

#include "fileio/MovIO/MovIOCommon.h"
#include "fileio/MovIO/VMovAtom.h"
#include "fileio/MovIO/VMovPrimitiveReader.h"
#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"
#include "videointerface/VideoReaderBase.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace MovIO
{
  enum ETrackKind
  {
    TrackKind_Video,
    TrackKind_Audio,
    TrackKind_Timecode,
  };

  class VMovReader : public ZOL::VVideoReaderBase, public ZOL::IFrameIndexQueries
  {
  public:
    VMovReader();
    ~VMovReader() override;
    VMovReader( const VMovReader& ) = delete;
    VMovReader& operator=( const VMovReader& ) = delete;

    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return m_Capabilities; }
    using ZOL::VVideoReaderBase::Open;
    // Reads a file that is already open (one held in memory), from its position 0.
    [[nodiscard]] bool Open( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream );
    bool DumpFileStructure( std::ostream& o_rStream ) override;
    bool SetBufferAllocators( const std::shared_ptr< ZOL::IBufferAllocator >& i_pVideo,
                              const std::shared_ptr< ZOL::IBufferAllocator >& i_pAudio,
                              const std::shared_ptr< ZOL::IBufferAllocator >& i_pSpare ) override;
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_Attributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override { return m_AudioPayload; }
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_AudioFrameInfo; }
    ZOL::EVideoPayload GetVideoPayload() const override { return m_VideoPayload; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_VideoFrameInfo; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override { return m_VideoTrack.SampleCount; }
    bool HasFrame( std::uint64_t i_FrameIndex ) const override { return i_FrameIndex < m_VideoTrack.SampleCount; }
    bool ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                    bool i_bReadAudio ) override;
    bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                        ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio ) override;
    void Close() override;

    // A MOV file has no gaps: every number below the count is a frame.
    std::uint64_t GetStoredFrameCount() const override { return m_VideoTrack.SampleCount; }
    std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const override;
    std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const override;

    // What Open read, for tests and tools.
    const std::vector< VMovFrame >& GetFrameTable() const { return m_Frames; }
    const VMovTrack& GetTrack( ETrackKind i_Kind ) const { return TrackOf( i_Kind ); }

  protected:
    bool OpenReader( const std::string& i_rFileName ) override;
    void Reset() override;

  private:
    struct VTimecodeDescription
    {
      std::uint8_t DropFrame = 0;
      std::uint64_t FramePeriod = 0;
      std::uint32_t MediaTime = 0;
      std::uint8_t CountingFrames = 0;
    };

    struct VTraks
    {
      const VMovAtom* pVideo = nullptr;
      const VMovAtom* pAudio = nullptr;
      const VMovAtom* pTimecode = nullptr;
    };

    [[nodiscard]] bool OpenInternal();
    [[nodiscard]] bool SelectTracks( const VMovAtom& i_rMoov, VTraks& o_rTraks );
    [[nodiscard]] bool ReadVideoTrack( const VMovAtom& i_rTrak );
    [[nodiscard]] bool ReadAudioTrack( const VMovAtom& i_rTrak );
    [[nodiscard]] bool ReadTimecodeTrack( const VMovAtom& i_rTrak );
    [[nodiscard]] bool ReadTrackHeaders( const VMovAtom& i_rTrak, ETrackKind i_Kind );
    [[nodiscard]] bool ReadSampleTables( const VMovAtom& i_rStbl, ETrackKind i_Kind );
    [[nodiscard]] bool ReadChunkOffsets( const VMovAtom& i_rStbl, ETrackKind i_Kind );
    VMovTrack& TrackOf( ETrackKind i_Kind );
    const VMovTrack& TrackOf( ETrackKind i_Kind ) const;

    // The read protocol of every atom: find it, check its header, read its fields by
    // i_Body, and log what did not fit. i_FixedSize 0 means the atom has no fixed size.
    template < typename TBody >
    [[nodiscard]] bool ReadAtom( const VMovAtom& i_rParent, const VAtomPath& i_rPath, std::uint32_t i_FixedSize,
                                 TBody&& i_Body );

    // Atom layouts.
    [[nodiscard]] bool ReadMvhd( const VMovAtom& i_rRoot );
    [[nodiscard]] bool ReadTkhd( const VMovAtom& i_rTrak, ETrackKind i_Kind );
    [[nodiscard]] bool ReadElst( const VMovAtom& i_rTrak, ETrackKind i_Kind );
    [[nodiscard]] bool ReadMdhd( const VMovAtom& i_rTrak, ETrackKind i_Kind );
    [[nodiscard]] bool ReadStts( const VMovAtom& i_rStbl, ETrackKind i_Kind );
    [[nodiscard]] bool ReadStsz( const VMovAtom& i_rStbl, ETrackKind i_Kind );
    [[nodiscard]] bool ReadStsc( const VMovAtom& i_rStbl, ETrackKind i_Kind );
    [[nodiscard]] bool ReadChunkOffsetTable( const VMovAtom& i_rStbl, ETrackKind i_Kind, bool i_b64 );
    [[nodiscard]] bool ReadVideoStsd( const VMovAtom& i_rStbl );
    [[nodiscard]] bool ReadVideoExtensions( std::uint64_t i_Length );
    [[nodiscard]] bool ReadAvcC( const VMovAtom& i_rExtensions );
    [[nodiscard]] bool ReadParameterSet( std::vector< std::shared_ptr< ZOL::IBuffer > >& io_rList );

    // Audio, timecode and metadata.
    [[nodiscard]] bool ReadAudioStsd( const VMovAtom& i_rStbl );
    [[nodiscard]] bool ReadTcmi( const VMovAtom& i_rTrak );
    [[nodiscard]] bool ReadTimecodeStsd( const VMovAtom& i_rStbl );
    [[nodiscard]] bool ReadQmdt( const VMovAtom& i_rRoot );
    [[nodiscard]] bool SetTimecode( const VMovAtom& i_rRoot, bool i_bHasTimecodeTrak );
    std::uint32_t GetAudioSampleFrameBytes() const;

    // The frame table.
    [[nodiscard]] bool ExpandSampleToChunk( VMovTrack& io_rTrack, const std::vector< std::uint32_t >& i_rEntries,
                                            bool i_bVideo );
    void AssignAudioToFrames();
    [[nodiscard]] bool ReadAudio( const VMovFrame& i_rFrame, ZOL::IAudioBuffers& o_rAudio );
    [[nodiscard]] bool ReadVideo( const VMovFrame& i_rFrame, std::shared_ptr< ZOL::IBuffer >& o_rVideo );

    // What the sample description tables can yield: raw RGB and YUV frames, JPEG, PNG, TIFF and
    // H.264, with integer PCM audio.
    ZOL::VReaderCapabilities m_Capabilities{
        { ZOL::AudioSampleFormat_Int16, ZOL::AudioSampleFormat_Int24, ZOL::AudioSampleFormat_Int32,
          ZOL::AudioSampleFormat_UInt8 },
        { ZOL::AudioPayload_None, ZOL::AudioPayload_Uncompressed },
        { ZOL::PixelFormat_R8G8B8, ZOL::PixelFormat_B8G8R8, ZOL::PixelFormat_R8G8B8u8, ZOL::PixelFormat_B8G8R8u8,
          ZOL::PixelFormat_U8Y8V8Y8, ZOL::PixelFormat_Y8U8Y8V8, ZOL::PixelFormat_U10Y10V10Y10 },
        { ZOL::VideoPayload_Uncompressed, ZOL::VideoPayload_ImageJPEG, ZOL::VideoPayload_ImagePNG,
          ZOL::VideoPayload_ImageTIFF, ZOL::VideoPayload_VideoH264 } };
    std::shared_ptr< VMovPrimitiveReader > m_pReader;
    ZOL::EAudioPayload m_AudioPayload = ZOL::AudioPayload_None;
    ZOL::EVideoPayload m_VideoPayload = ZOL::VideoPayload_None;
    ZOL::IAudioFrameInfo m_AudioFrameInfo;
    ZOL::IVideoFrameInfo m_VideoFrameInfo;
    ZOL::IVideoAttributes m_FrameStore;
    ZOL::IVideoAttributes m_Attributes;
    std::vector< std::shared_ptr< ZOL::IBuffer > > m_SPS;
    std::vector< std::shared_ptr< ZOL::IBuffer > > m_PPS;
    ZOL::IVideoTiming m_Timing;
    ZOL::ITimecode m_WorkingTimecode;
    ZOL::ITimecode m_Timecode;
    ZOL::IVideoSettings m_Settings;
    std::uint32_t m_FileTimescale = 0;
    std::uint32_t m_FileDuration = 0;
    VMovTrack m_VideoTrack{ "Video" };
    VMovTrack m_TimecodeTrack{ "Timecode" };
    VMovTrack m_AudioTrack{ "Audio" };
    std::shared_ptr< ZOL::IBufferAllocator > m_pFrameAllocator;
    std::shared_ptr< ZOL::IBufferAllocator > m_pAudioAllocator;
    std::shared_ptr< ZOL::IBufferAllocator > m_pCompressedAllocator;
    std::vector< VMovFrame > m_Frames;
    VTimecodeDescription m_TimecodeDescription;
    std::vector< std::uint8_t > m_AudioChunkCache;
    std::uint32_t m_CachedAudioChunk = NoIndex;
  };

  // Chooses the timecode standard whose frame period i_Period divides (30 fps first); false,
  // with the fallback standard, when none does.
  bool SelectTimecodeStandard( ZOL::ITimecode& io_rTimecode, std::uint64_t i_Period, bool i_bDropFrame,
                               std::uint32_t i_Fallback );
  // The timecode i_Ticks after midnight, in ticks at 1080 MHz, in the record's standard.
  bool SetTimecodeFromTicks( ZOL::ITimecode& io_rTimecode, std::int64_t i_Ticks );
} // namespace MovIO
