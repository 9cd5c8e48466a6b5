#pragma once

// A folder of image files, one a frame, read as a video. A .lumekimagesequence descriptor beside
// the files says how frame indices become file names; a single numbered image with no
// descriptor stands for the run of numbered files it belongs to. A frame whose file is absent
// is a missing frame.

#include "fileio/ImageSequenceIO/SequenceDescriptor.h"
#include "fileio/ImageSequenceIO/SequenceNames.h"
#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"
#include "videointerface/VideoReaderBase.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace ImageSequenceIO
{
  // Shown with the sequence keys when a numbered run was opened without a descriptor: the
  // number in the file name of frame 0.
  extern const char* const FirstFileNumberKey; // "ImageSequenceInfo.FirstFileNumber"

  class VImageSequenceReader : public ZOL::VVideoReaderBase, public ZOL::IFrameIndexQueries
  {
  public:
    VImageSequenceReader();
    VImageSequenceReader( const VImageSequenceReader& ) = delete;
    VImageSequenceReader& operator=( const VImageSequenceReader& ) = delete;

    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return m_Capabilities; }
    // A descriptor, a pattern holding placeholders, a path without extension, or one image
    // file of a numbered run.
    using ZOL::VVideoReaderBase::Open;
    // A descriptor given as a stream, for files in i_rFolder. This is how descriptors in memory
    // are read.
    [[nodiscard]] bool Open( const std::string& i_rFolder, ZOL::IInputStream& i_rDescriptor );
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_Attributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override { return ZOL::AudioPayload_None; }
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_AudioFrameInfo; }
    ZOL::EVideoPayload GetVideoPayload() const override { return m_Payload; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_VideoFrameInfo; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override { return m_Sequence.FrameCount; }
    // Asks the disk, so that files that arrive while a sequence is open are seen.
    bool HasFrame( std::uint64_t i_FrameIndex ) const override;
    bool ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                    bool i_bReadAudio ) override;
    bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                        ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio ) override;
    // No file stays open between reads.
    void Close() override {}

    // Answered from the list of files found when the sequence was opened.
    std::uint64_t GetStoredFrameCount() const override;
    std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const override;
    std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const override;

    // The path of a frame's file.
    std::string ExpandFileName( std::uint64_t i_FrameIndex ) const;
    const VSequenceInfo& GetSequenceInfo() const { return m_Sequence; }
    // The descriptor the sequence was opened through; empty for a numbered run without one.
    const std::string& GetDescriptorPath() const { return m_DescriptorPath; }

  protected:
    bool OpenReader( const std::string& i_rFileName ) override;
    void Reset() override;

  private:
    bool OpenDescriptorFile( const std::string& i_rFolder, const std::string& i_rFileName );
    bool ApplyDescriptor( const std::string& i_rFolder );
    bool OpenNumberedImage( const std::string& i_rFolder, const std::string& i_rFileName );
    void FindStoredFrames();
    void ScanFolder( const std::string& i_rSubFolder );
    bool ReadSizeFromImage( const std::string& i_rPath );

    // A sequence is still images without sound.
    ZOL::VReaderCapabilities m_Capabilities{
        {},
        { ZOL::AudioPayload_None },
        {},
        { ZOL::VideoPayload_ImageJPEG, ZOL::VideoPayload_ImagePNG, ZOL::VideoPayload_ImageTIFF } };
    std::string m_Folder;
    std::shared_ptr< ZOL::IBufferAllocator > m_pAllocator;
    ZOL::EVideoPayload m_Payload = ZOL::VideoPayload_None;
    ZOL::IVideoFrameInfo m_VideoFrameInfo;
    ZOL::IVideoAttributes m_FrameKeys;
    ZOL::IVideoAttributes m_Attributes;
    ZOL::IVideoTiming m_Timing;
    ZOL::ITimecode m_Timecode;
    VSequenceInfo m_Sequence;
    ZOL::IVideoSettings m_Settings;

    ZOL::IAudioFrameInfo m_AudioFrameInfo;
    std::string m_DescriptorPath;
    // The number in the name of frame 0's file, for a numbered run; 0 for descriptors.
    std::uint64_t m_FirstFileNumber = 0;
    std::optional< VFileNameExpander > m_Expander;
    // Indices below the frame count whose files were there at Open, sorted.
    std::vector< std::uint64_t > m_StoredFrames;
    // A pattern that names one file for every frame: all frames are there, or none.
    bool m_bOneFile = false;
    bool m_bOneFileExists = false;
  };
} // namespace ImageSequenceIO
