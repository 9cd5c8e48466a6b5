#pragma once

// A .lumekimagesequence descriptor: two attribute stores one behind the other, no header. The
// first holds the frame description, the second everything else, the sequence keys among them.

#include "videointerface/ITimecode.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <string>

namespace ImageSequenceIO
{
  extern const char* const FileNamePatternKey;     // "ImageSequenceInfo.FileNamePattern"
  extern const char* const FrameIndexPadWidthKey;  // "ImageSequenceInfo.FrameIndexPadWidth"
  extern const char* const FrameNumberPadWidthKey; // "ImageSequenceInfo.FrameNumberPadWidth"
  extern const char* const FrameCountKey;          // "ImageSequenceInfo.FrameCount"

  constexpr std::uint32_t DefaultPadWidth = 8;

  struct VSequenceInfo
  {
    // A file name relative to the descriptor's folder, with "%FRAME%" (the zero-based index),
    // "%FRAME_NUMBER%" (the index plus one) and "%TIMECODE%", each any number of times.
    std::string FileNamePattern;
    std::uint32_t FrameIndexPadWidth = DefaultPadWidth;
    std::uint32_t FrameNumberPadWidth = DefaultPadWidth;
    std::uint32_t FrameCount = 0;
  };

  // The keys in the order above; the first absent one ends the reading. True when all were there.
  bool ReadSequenceInfo( const ZOL::IVideoAttributes& i_rStore, VSequenceInfo& io_rInfo );
  void WriteSequenceInfo( ZOL::IVideoAttributes& io_rStore, const VSequenceInfo& i_rInfo );

  // Reads the two stores; each keeps what it got as far as the data went. True when both read.
  bool ReadDescriptor( ZOL::IInputStream& i_rStream, ZOL::IVideoAttributes& o_rFrameKeys,
                       ZOL::IVideoAttributes& o_rAttributes );

  // What a descriptor says, as records.
  struct VDescriptor
  {
    ZOL::IVideoFrameInfo FrameInfo;
    ZOL::IVideoTiming Timing;
    // Written only when it names a standard.
    ZOL::ITimecode Timecode;
    ZOL::IVideoSettings Settings;
    VSequenceInfo Sequence;
    // Further keys of the second store (camera, lens, anything a recording carries).
    ZOL::IVideoAttributes Attributes;
  };

  // The two stores of a descriptor, ready to write.
  [[nodiscard]] bool MakeDescriptorStores( const VDescriptor& i_rDescriptor, ZOL::IVideoAttributes& o_rFrameKeys,
                                           ZOL::IVideoAttributes& o_rAttributes );
  // Writes the descriptor file; false when a record cannot be written or the file fails.
  [[nodiscard]] bool WriteDescriptor( const std::string& i_rPath, const VDescriptor& i_rDescriptor );
} // namespace ImageSequenceIO
