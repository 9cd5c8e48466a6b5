#pragma once

#include "videointerface/AttributeRecords.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/IVideoReader.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

namespace ZOL
{
  class IH264Decoder;
}

namespace LumekVideoViewer
{
  // The one object between the user interface and the file. Every frame asked of it is read and
  // decoded on the calling thread at the moment of the call: no timing, no caching, no prefetch.
  // The command-line tool uses it too, so that it shows exactly what the viewer shows.
  class VVideoSource
  {
  public:
    VVideoSource();
    ~VVideoSource();
    VVideoSource( const VVideoSource& ) = delete;
    VVideoSource& operator=( const VVideoSource& ) = delete;

    // Picks a reader by the path's name alone and opens it; false when no reader takes the file.
    [[nodiscard]] bool Open( const std::string& i_rPath );
    // The same with a reader the caller made, for containers not reached by name (tests).
    [[nodiscard]] bool Open( const std::string& i_rPath, std::shared_ptr< ZOL::IVideoReader > i_pReader );
    bool Close();
    bool IsOpen() const { return m_pReader != nullptr; }

    // Reads and decodes one frame. The record gets the frame's description and buffer also when
    // decoding fails; false with no reader, or when the frame cannot be read or decoded.
    [[nodiscard]] bool GetFrame( std::uint64_t i_Index, ZOL::IVideoFrame& o_rFrame );

    // These need an open file.
    std::uint64_t GetFrameCount() const;
    double GetFrameRate() const;
    double GetDurationInSeconds() const;
    std::string GetFrameTimecodeText( std::uint64_t i_Index ) const;

    std::int32_t GetMissingFrameCount() const { return m_MissingFrames; }
    // The nearest frame that exists at or below, or at or above, the index; nothing when there is
    // none or no file is open. Missing frames fall back to the frame before them.
    std::optional< std::uint64_t > FindFrameAtOrBefore( std::uint64_t i_Index ) const;
    std::optional< std::uint64_t > FindFrameAtOrAfter( std::uint64_t i_Index ) const;
    const std::string& GetFilePath() const { return m_FilePath; }

    // With no reader these answer from default records.
    ZOL::EAudioPayload GetAudioPayload() const;
    ZOL::EVideoPayload GetVideoPayload() const;
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const;
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const;
    const ZOL::IVideoSettings& GetVideoSettings() const;
    const ZOL::IVideoAttributes& GetAttributes() const;
    const ZOL::IVideoTiming& GetVideoTiming() const;
    const ZOL::ITimecode& GetTimecode() const;

    const CoreLumekTypes::VLensDistortionCalibration& GetLensDistortionCalibration() const { return m_Lens; }
    const CoreLumekTypes::VCameraHardware& GetCameraHardware() const { return m_Camera; }
    // A lens model and a camera to place it on both came with the file.
    bool HasLensDistortion() const;

    // The open reader, for the command-line tool's structure dump; null when closed.
    const std::shared_ptr< ZOL::IVideoReader >& GetReader() const { return m_pReader; }

  private:
    // H.264 frames depend on earlier ones: a frame that does not follow the last one decoded
    // is reached by decoding forward from the key frame before it.
    bool SeekH264( std::uint64_t i_Index );
    std::optional< std::uint64_t > FindH264KeyFrame( std::uint64_t i_Index );
    bool DecodeH264Frame( std::uint64_t i_Index );

    std::shared_ptr< ZOL::IVideoReader > m_pReader;
    const ZOL::IFrameIndexQueries* m_pIndexQueries = nullptr;
    std::string m_FilePath;
    std::int32_t m_MissingFrames = 0;
    std::shared_ptr< ZOL::VFrameBufferAllocator > m_pFirstAllocator;
    std::shared_ptr< ZOL::VFrameBufferAllocator > m_pSecondAllocator;
    std::shared_ptr< ZOL::IH264Decoder > m_pH264Decoder;
    CoreLumekTypes::VLensDistortionCalibration m_Lens;
    CoreLumekTypes::VCameraHardware m_Camera;
    ZOL::IAudioBuffers m_AudioScratch;
    // The frame the H.264 decoder's references belong to: the last one it decoded in order.
    std::optional< std::uint64_t > m_LastH264Frame;
  };
} // namespace LumekVideoViewer
