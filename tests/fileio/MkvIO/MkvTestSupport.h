#pragma once

// Matroska files of the family for the tests and the fuzz seeds, written by the project's own
// writer from frames whose every byte is known.

#include "fileio/MkvIO/VMkvWriter.h"
#include "videointerface/Enumerations.h"
#include "videointerface/IBuffer.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace MkvTest
{
  using VBytes = std::vector< std::uint8_t >;

  struct VFamilyCase
  {
    std::string Name;
    ZOL::EPixelFormat Format = ZOL::PixelFormat_R8G8B8u8; // the stored format, or the JPEG's
    ZOL::EAudioSampleFormat Audio = ZOL::AudioSampleFormat_Unspecified;
    bool bJPEG = false;
    int Width = 16;
    int Height = 8;
    int Frames = 5;
    double FramesPerSecond = 50.0;
  };

  // 4 x 2 RGBA with 16-bit audio, three frames: small enough to cut at every byte.
  VFamilyCase SmallCase();

  ZOL::IAudioFrameInfo AudioInfo( const VFamilyCase& i_rCase );
  ZOL::IVideoTiming Timing( const VFamilyCase& i_rCase );
  ZOL::ITimecode StartTimecode();

  // Frame i of a raw case: bytes that differ at every position and in every frame.
  VBytes RawFrame( const VFamilyCase& i_rCase, int i_Frame );
  // The audio of frame i: a whole number of sample groups, differing from frame to frame.
  VBytes AudioBlock( const VFamilyCase& i_rCase, int i_Frame );
  // What frame i holds: raw bytes, or for MJPEG the given JPEG file's bytes.
  VBytes FrameBytes( const VFamilyCase& i_rCase, int i_Frame, const VBytes& i_rJPEG );

  // Writes the case's file with one Cluster a frame; i_rEdit may change the description, and
  // i_rClusters, when set, gives the blocks of each frame instead of the usual two.
  bool WriteFamilyFile( const std::string& i_rPath, const VFamilyCase& i_rCase, const VBytes& i_rJPEG,
                        const std::function< void( MkvIO::VMkvDescription& ) >& i_rEdit = {},
                        const std::function< std::vector< MkvIO::VMkvBlock >( int ) >& i_rClusters = {} );

  VBytes Bytes( const std::shared_ptr< ZOL::IBuffer >& i_pBuffer );
  VBytes ReadWholeFile( const std::string& i_rPath );
  bool WriteWholeFile( const std::string& i_rPath, const VBytes& i_rBytes );
  // A fresh path in the test's temporary folder.
  std::string TempPath( const std::string& i_rName );
} // namespace MkvTest
