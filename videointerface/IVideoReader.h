#pragma once

// The one interface every container is read through.

#include "videointerface/Enumerations.h"
#include "videointerface/IBuffer.h"
#include "videointerface/ITimecode.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

namespace ZOL
{
  class IVideoReaderCapabilities
  {
  public:
    virtual ~IVideoReaderCapabilities() = default;
    virtual bool SupportsAudioSampleFormat( EAudioSampleFormat i_Format ) const = 0;
    virtual bool SupportsAudioPayload( EAudioPayload i_Payload ) const = 0;
    virtual bool SupportsPixelFormat( EPixelFormat i_Format ) const = 0;
    virtual bool SupportsVideoPayload( EVideoPayload i_Payload ) const = 0;
  };

  using IAudioBuffers = std::vector< std::shared_ptr< IBuffer > >;

  // Calling order: Open, any getters and reads, Close (or destruction). Getters return
  // references into the reader, valid until the next Open or Close. Nothing here throws for a
  // bad file: failures are false results, with a log line in the reader's category.
  class IVideoReader
  {
  public:
    virtual ~IVideoReader() = default;

    virtual const IVideoReaderCapabilities& GetCapabilities() const = 0;
    // Reads the file's description and index; false when the file is not usable.
    [[nodiscard]] virtual bool Open( const std::string& i_rFileName ) = 0;
    // Writes the container's tree as text; readers without one answer false.
    [[nodiscard]] virtual bool DumpFileStructure( std::ostream& o_rStream ) { return false; }
    [[nodiscard]] virtual bool SetBufferAllocators( const std::shared_ptr< IBufferAllocator >& i_pVideo,
                                                    const std::shared_ptr< IBufferAllocator >& i_pAudio,
                                                    const std::shared_ptr< IBufferAllocator >& i_pSpare )
    {
      return false;
    }
    virtual const IVideoAttributes& GetAttributes() const = 0;
    virtual const IVideoTiming& GetVideoTiming() const = 0;
    virtual const ITimecode& GetTimecode() const = 0;
    virtual EAudioPayload GetAudioPayload() const = 0;
    virtual const IAudioFrameInfo& GetAudioFrameInfo() const = 0;
    virtual EVideoPayload GetVideoPayload() const = 0;
    virtual const IVideoFrameInfo& GetVideoFrameInfo() const = 0;
    virtual const IVideoSettings& GetVideoSettings() const = 0;
    // One more than the last frame index, not the number of frames stored.
    virtual std::uint64_t GetFrameCount() const = 0;
    virtual bool HasFrame( std::uint64_t i_FrameIndex ) const = 0;
    // Reads one frame and fills the requested halves of the record. Built on ReadFrameData, so
    // a reader that overrides only that keeps these semantics.
    [[nodiscard]] virtual bool ReadFrame( std::uint64_t i_FrameIndex, IVideoFrame& o_rFrame, bool i_bReadVideo,
                                          bool i_bReadAudio );
    // The stored payload and audio blocks of one frame, without decoding.
    [[nodiscard]] virtual bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< IBuffer >& o_rVideo,
                                              IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio ) = 0;
    virtual void Close() = 0;
  };

  // A companion of readers whose index can have gaps (.lvid, image sequences). Callers would
  // otherwise ask HasFrame of every number, and a damaged index that names a frame in the
  // billions turns such a walk into a hang. Found by dynamic_cast on the reader.
  class IFrameIndexQueries
  {
  public:
    virtual ~IFrameIndexQueries() = default;
    // Frames the index really holds.
    virtual std::uint64_t GetStoredFrameCount() const = 0;
    // The nearest stored frame number at or below, or at or above, the index.
    virtual std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const = 0;
    virtual std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const = 0;
  };

  // The container a file name names: "%FRAME%" or "%FRAME_NUMBER%" anywhere, or no extension,
  // means an image sequence; otherwise the extension compared exactly, case and all.
  std::optional< EVideoContainer > FindVideoContainer( const std::string& i_rFileName );
} // namespace ZOL
