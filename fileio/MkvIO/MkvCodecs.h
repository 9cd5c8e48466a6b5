#pragma once

// What the codec texts of a Matroska track mean to this system: one table for video, one for
// audio. The writer and the reader both look them up here.

#include "videointerface/Enumerations.h"

#include <cstdint>
#include <optional>
#include <string>

namespace MkvIO
{
  extern const char* const CodecMJPEG;        // "V_MJPEG"
  extern const char* const CodecVfwFourCC;    // "V_MS/VFW/FOURCC": the FourCC sits in a BITMAPINFOHEADER
  extern const char* const CodecUncompressed; // "V_UNCOMPRESSED": the FourCC is the colour space
  extern const char* const CodecPcmInteger;   // "A_PCM/INT/LIT"
  extern const char* const CodecPcmFloat;     // "A_PCM/FLOAT/IEEE"

  // The two video track numbers this system writes and reads.
  constexpr std::uint64_t VideoTrackNumber = 1;
  constexpr std::uint64_t AudioTrackNumber = 2;

  // The byte offset of the FourCC in a BITMAPINFOHEADER, and the header's size.
  constexpr std::size_t BitmapInfoFourCCOffset = 16;
  constexpr std::size_t BitmapInfoHeaderSize = 40;

  enum class EVideoCodec
  {
    MJPEG,
    FourCC, // raw frames, described by a FourCC
    Unknown,
  };
  EVideoCodec FindVideoCodec( const std::string& i_rCodecID );

  // The raw pixel format a FourCC names ("RGBA", "UYVY", "YUY2", "GREY").
  std::optional< ZOL::EPixelFormat > PixelFormatForFourCC( const std::string& i_rFourCC );
  // The reverse: the FourCC that stores a pixel format, or empty when none does.
  std::string FourCCForPixelFormat( ZOL::EPixelFormat i_Format );

  // The sample format of a PCM track; nullopt for an unknown codec or an integer depth this
  // system does not play.
  std::optional< ZOL::EAudioSampleFormat > SampleFormatForCodec( const std::string& i_rCodecID,
                                                                 std::uint64_t i_BitDepth );
  bool IsPcmCodec( const std::string& i_rCodecID );
  // The codec text and bit depth that store a sample format; false for formats Matroska PCM
  // cannot hold here.
  bool CodecForSampleFormat( ZOL::EAudioSampleFormat i_Format, std::string& o_rCodecID, std::uint64_t& o_rBitDepth );
} // namespace MkvIO
