#pragma once

// The texts the viewer shows about a file, composed in one place so that the window and the
// command-line tool show the same words.

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

namespace LumekVideoViewer
{
  class VVideoSource;

  struct VInfoPanelTexts
  {
    std::string Audio;    // "A: 2 channels / Int16 / 48000Hz"; empty without audio
    std::string Video;    // "V: 64 x 48 / BayerGB8 / 25.00Hz / 6 frames (3 missing) / 0.24s"
    std::string Timecode; // "T: 10:00:00:00+00 [30 fps]", or "No file open"
  };

  // The information panel for one frame. With no file open: "No file open" and empty texts.
  VInfoPanelTexts ComposeInfoPanelTexts( const VVideoSource& i_rSource, std::uint64_t i_Frame );

  // "Hardware (GPU) @ 99.8fps"
  std::string ComposeDecoderText( const std::string& i_rDecoderName, double i_FramesPerSecond );

  // The "Invalid file" message for a path that would not open: "The video file could not be
  // opened.", and when another program holds the file open for writing, a second sentence that
  // names it, since a recording still being captured has no index yet.
  std::string ComposeOpenFailureText( const std::string& i_rPath );

  using VPropertyRows = std::vector< std::pair< std::string, std::string > >;

  // Every attribute of the file, with the audio, video and display records added in their
  // attribute form, in key order: the rows of the properties dialog.
  VPropertyRows ComposePropertyRows( const VVideoSource& i_rSource );
} // namespace LumekVideoViewer
