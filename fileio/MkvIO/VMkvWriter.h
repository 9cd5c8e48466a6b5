#pragma once

// Writes Matroska files of the family: a video track numbered 1, an optional PCM audio track
// numbered 2, one Cluster a frame, and the frame description as "Lumek.Internal." and
// "Lumek.External." tags. lumekvideotool make-sample and the tests write through it; the tests
// also use its lower-level calls to write the damaged variants a reader must survive.

#include "videointerface/ITimecode.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace MkvIO
{
  class VMkvIOCallback;

  struct VMkvVideoTrack
  {
    // "V_UNCOMPRESSED" (FourCC as the colour space), "V_MS/VFW/FOURCC" (FourCC in a
    // BITMAPINFOHEADER) or "V_MJPEG".
    std::string CodecID = "V_UNCOMPRESSED";
    std::string FourCC;
    std::uint32_t Width = 0;
    std::uint32_t Height = 0;
    // 0: the pixel size.
    std::uint32_t DisplayWidth = 0;
    std::uint32_t DisplayHeight = 0;
  };

  struct VMkvAudioTrack
  {
    std::string CodecID; // empty: no audio track
    std::uint32_t Channels = 0;
    double SamplingFrequency = 0.0;
    std::uint32_t BitDepth = 0;
  };

  struct VMkvDescription
  {
    VMkvVideoTrack Video;
    VMkvAudioTrack Audio;
    double FramesPerSecond = 25.0;
    // Tag name and text, written in this order.
    std::vector< std::pair< std::string, std::string > > Tags;
    // A live stream's layout: the Segment's size stays unknown.
    bool bUnknownSegmentSize = false;
    std::string WritingApp = "LumekVideoViewer";
  };

  // One block of a Cluster: its track number and bytes. Without bWithBlock the BlockGroup is
  // written with a duration and no Block at all.
  struct VMkvBlock
  {
    std::uint16_t Track = 1;
    std::vector< std::uint8_t > Bytes;
    bool bWithBlock = true;
  };

  // The description of a frame of the system as a Matroska track, and the tags that carry
  // every field of its records. False when the pixel format or the sample format has no
  // Matroska form here.
  bool DescribeForMatroska( const ZOL::IVideoFrameInfo& i_rVideo, bool i_bJPEG, const ZOL::IAudioFrameInfo& i_rAudio,
                            const ZOL::IVideoTiming& i_rTiming, const ZOL::ITimecode& i_rTimecode,
                            const ZOL::IVideoSettings& i_rSettings, VMkvDescription& o_rDescription );

  class VMkvWriter
  {
  public:
    VMkvWriter();
    ~VMkvWriter();
    VMkvWriter( const VMkvWriter& ) = delete;
    VMkvWriter& operator=( const VMkvWriter& ) = delete;

    // Writes the head, Info, Tracks and Tags. False when the file cannot be created.
    [[nodiscard]] bool Create( const std::string& i_rPath, const VMkvDescription& i_rDescription );
    // One Cluster holding the video frame and, when there is audio, one audio block.
    [[nodiscard]] bool WriteFrame( const std::vector< std::uint8_t >& i_rVideo,
                                   const std::vector< std::uint8_t >& i_rAudio );
    // One Cluster of exactly these blocks, in order.
    [[nodiscard]] bool WriteCluster( const std::vector< VMkvBlock >& i_rBlocks );
    // Completes the Duration and the Segment's size. False when any write failed.
    [[nodiscard]] bool Close();

  private:
    struct VState;
    std::unique_ptr< VState > m_pState;
  };
} // namespace MkvIO
