#pragma once

// Writes .lvid recordings the way a capture does: the header and both attribute blocks first,
// then each frame's record at the next aligned position as it arrives, in any order, and the
// index last. The sample recordings, the command-line tool and the tests make files with it.

#include "fileio/LumekVideo/LvidFormat.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace UtilsIO
{
  class VLargeFile;
}

namespace LumekVideo
{
  class VWriter
  {
  public:
    VWriter();
    // Closes an open recording, so that a writer that goes out of scope still leaves a file
    // that reads.
    ~VWriter();
    VWriter( const VWriter& ) = delete;
    VWriter& operator=( const VWriter& ) = delete;

    // Starts a recording at the path, replacing any file there. The description must be valid
    // (a size and a pixel format); audio that is not usable means a recording without audio.
    // i_rFileAttributes is the file attribute block: timing, settings, timecode, camera, lens
    // and the recording's own keys, as the caller wrote them. i_Alignment must not be 0.
    bool Create( const std::string& i_rPath, const ZOL::IVideoFrameInfo& i_rVideoFrameInfo,
                 const ZOL::IAudioFrameInfo& i_rAudioFrameInfo, const ZOL::IVideoAttributes& i_rFileAttributes,
                 std::uint64_t i_Alignment = DefaultAlignment );
    // The same into a stream the caller opened, written from its position 0.
    bool Create( const std::shared_ptr< ZOL::IStreamSeekable >& i_pStream,
                 const ZOL::IVideoFrameInfo& i_rVideoFrameInfo, const ZOL::IAudioFrameInfo& i_rAudioFrameInfo,
                 const ZOL::IVideoAttributes& i_rFileAttributes, std::uint64_t i_Alignment = DefaultAlignment );

    // One frame's record: i_VideoSize must be the frame size of the description; audio bytes
    // are only accepted when the recording has audio, and may be absent then. Frame numbers
    // come in any order; a number given twice gets two index entries and the later one wins.
    bool AppendFrame( std::uint64_t i_FrameNumber, const void* i_pVideo, std::uint64_t i_VideoSize,
                      const void* i_pAudio = nullptr, std::uint64_t i_AudioSize = 0 );
    // Leaves i_Bytes unwritten before the next record, as a capture that pre-allocates does;
    // most file systems store the gap sparsely. Tests reach positions beyond 4 GiB with it.
    bool SkipBytes( std::uint64_t i_Bytes );
    // Writes the index and completes the header. False when anything since Create failed.
    bool Close();

    bool IsOpen() const { return m_pStream != nullptr; }
    std::uint64_t GetVideoFrameSize() const { return m_VideoFrameSize; }
    // Where the next record goes.
    std::uint64_t GetPosition() const { return m_Position; }

  private:
    bool Write( const void* i_pData, std::uint64_t i_Size );
    bool PadToAlignment();
    bool Fail();

    std::shared_ptr< ZOL::IStreamSeekable > m_pStream;
    // Set when the writer opened the file itself, so that Close can close it and report a
    // failure of the last flush.
    std::shared_ptr< UtilsIO::VLargeFile > m_pFile;
    ZOL::IVideoFrameInfo m_VideoFrameInfo;
    ZOL::IAudioFrameInfo m_AudioFrameInfo;
    std::uint64_t m_Alignment = DefaultAlignment;
    std::uint64_t m_VideoFrameSize = 0;
    std::uint64_t m_Position = 0;
    bool m_bGood = false;
    std::vector< std::pair< std::uint64_t, std::uint64_t > > m_Index;
  };
} // namespace LumekVideo
