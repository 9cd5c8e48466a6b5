#pragma once

// Reads the system's own capture container: a fixed header, the frame description and file
// attribute blocks, and frames of one fixed size at aligned positions that an index at the end
// of the file names. Frames missing from the index are the frames a capture lost.

#include "fileio/LumekVideo/LvidFormat.h"
#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"
#include "videointerface/VideoReaderBase.h"

#include <cstdint>
#include <map>
#include <memory>
#include <string>

namespace LumekVideo
{
  class VReader : public ZOL::VVideoReaderBase, public ZOL::IFrameIndexQueries
  {
  public:
    VReader();
    ~VReader() override;
    VReader( const VReader& ) = delete;
    VReader& operator=( const VReader& ) = delete;

    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return m_Capabilities; }
    using ZOL::VVideoReaderBase::Open;
    // Reads a recording from a stream that is already open, starting at its position 0. The
    // reader keeps the stream until Close. This is how recordings in memory are read.
    [[nodiscard]] bool Open( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream );
    bool SetBufferAllocators( const std::shared_ptr< ZOL::IBufferAllocator >& i_pVideo,
                              const std::shared_ptr< ZOL::IBufferAllocator >& i_pAudio,
                              const std::shared_ptr< ZOL::IBufferAllocator >& i_pSpare ) override;
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_Attributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override;
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_AudioFrameInfo; }
    ZOL::EVideoPayload GetVideoPayload() const override { return ZOL::VideoPayload_Uncompressed; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_VideoFrameInfo; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override;
    bool HasFrame( std::uint64_t i_FrameIndex ) const override;

    std::uint64_t GetStoredFrameCount() const override { return m_Index.size(); }
    std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const override;
    std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const override;
    bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                        ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio ) override;
    void Close() override;

    // What Open read, for tools that show a file's structure.
    const VFileHeader& GetFileHeader() const { return m_Header; }
    // Frame number to the position of its record, as the index gives it.
    const std::map< std::uint64_t, std::uint64_t >& GetFrameIndex() const { return m_Index; }

  protected:
    bool OpenReader( const std::string& i_rFileName ) override;
    void Reset() override;
    // A cut-off index keeps the frames it names before the cut, and the stream to read them.
    bool KeepsWhatAFailedOpenRead() const override { return m_bIndexReached; }

  private:
    bool OpenStream( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream );
    bool ReadDescription();
    bool ReadIndex();
    bool ReadAudio( ZOL::IAudioBuffers& o_rAudio );
    // Moves the stream forward to the next multiple of the alignment.
    bool AlignStream();

    // Frames of an .lvid recording are always raw, in any pixel format, with raw audio of any
    // sample format or none.
    ZOL::VReaderCapabilities m_Capabilities{ { ZOL::AudioSampleFormat_Unspecified, ZOL::AudioSampleFormat_Int8,
                                               ZOL::AudioSampleFormat_Int16, ZOL::AudioSampleFormat_Int24,
                                               ZOL::AudioSampleFormat_Int32, ZOL::AudioSampleFormat_UInt16,
                                               ZOL::AudioSampleFormat_Float32, ZOL::AudioSampleFormat_UInt8,
                                               ZOL::AudioSampleFormat_UInt24, ZOL::AudioSampleFormat_UInt32 },
                                             { ZOL::AudioPayload_None, ZOL::AudioPayload_Uncompressed },
                                             ZOL::VReaderCapabilities::EveryPixelFormat(),
                                             { ZOL::VideoPayload_Uncompressed } };
    std::shared_ptr< ZOL::IInputStreamSeekable > m_pStream;
    std::shared_ptr< ZOL::IBufferAllocator > m_pVideoAllocator;
    std::shared_ptr< ZOL::IBufferAllocator > m_pAudioAllocator;
    std::shared_ptr< ZOL::IBufferAllocator > m_pSpareAllocator;
    VFileHeader m_Header;
    ZOL::IVideoFrameInfo m_VideoFrameInfo;
    ZOL::IAudioFrameInfo m_AudioFrameInfo;
    ZOL::IVideoAttributes m_Attributes;
    ZOL::IVideoTiming m_Timing;
    ZOL::ITimecode m_Timecode;
    ZOL::IVideoSettings m_Settings;
    std::map< std::uint64_t, std::uint64_t > m_Index;
    // Every count, size and offset in the file is checked against this before it is trusted.
    std::uint64_t m_FileSize = 0;
    std::uint64_t m_VideoFrameSize = 0;
    bool m_bIndexReached = false;
  };
} // namespace LumekVideo
