#pragma once

// Matroska files of the family for the tests and the fuzz seeds, written by the project's own
// writer from frames whose every byte is known.

#include "fileio/MkvIO/VMkvWriter.h"
#include "videointerface/Enumerations.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <functional>
#include <ostream>
#include <string>
#include <vector>

namespace MkvTest
{
  struct VFamilyCase
  {
    std::string Name;
    ZOL::EPixelFormat Format = ZOL::PixelFormat_R8G8B8u8; // the stored format, or the JPEG's
    bool bJPEG = false;
    ZOL::EAudioSampleFormat Audio = ZOL::AudioSampleFormat_Unspecified;
    int Width = 16;
    int Height = 8;
    int Frames = 5;
    double FramesPerSecond = 50.0;
  };

  // Test names show the case's name, not its bytes.
  void PrintTo( const VFamilyCase& i_rCase, std::ostream* o_pStream );

  ZOL::IVideoFrameInfo VideoInfo( const VFamilyCase& i_rCase );
  ZOL::IAudioFrameInfo AudioInfo( const VFamilyCase& i_rCase );
  ZOL::IVideoTiming Timing( const VFamilyCase& i_rCase );
  ZOL::ITimecode StartTimecode();

  // Frame i of a raw case: bytes that differ at every position and in every frame.
  std::vector< std::uint8_t > RawFrame( const VFamilyCase& i_rCase, int i_Frame );
  // The audio of frame i: a whole number of sample groups, differing from frame to frame.
  std::vector< std::uint8_t > AudioBlock( const VFamilyCase& i_rCase, int i_Frame );
  // What frame i holds: raw bytes, or for MJPEG the given JPEG file's bytes.
  std::vector< std::uint8_t > FrameBytes( const VFamilyCase& i_rCase, int i_Frame,
                                          const std::vector< std::uint8_t >& i_rJPEG );

  // The description the family writes for the case, tags and all.
  MkvIO::VMkvDescription Describe( const VFamilyCase& i_rCase );

  // Writes the case's file with one Cluster a frame; i_rEdit may change the description, and
  // i_rClusters, when set, gives the blocks of each frame instead of the usual two.
  bool WriteFamilyFile( const std::string& i_rPath, const VFamilyCase& i_rCase,
                        const std::vector< std::uint8_t >& i_rJPEG,
                        const std::function< void( MkvIO::VMkvDescription& ) >& i_rEdit = {},
                        const std::function< std::vector< MkvIO::VMkvBlock >( int ) >& i_rClusters = {} );

  std::vector< std::uint8_t > ReadWholeFile( const std::string& i_rPath );
  bool WriteWholeFile( const std::string& i_rPath, const std::vector< std::uint8_t >& i_rBytes );
  // A fresh path in the test's temporary folder.
  std::string TempPath( const std::string& i_rName );

  // Collects the "MkvReader" messages while alive.
  class VLogCapture
  {
  public:
    VLogCapture();
    ~VLogCapture();
    VLogCapture( const VLogCapture& ) = delete;
    VLogCapture& operator=( const VLogCapture& ) = delete;
    bool Contains( const std::string& i_rText ) const;
    const std::vector< std::string >& Messages() const { return m_Messages; }

  private:
    int m_Handle = -1;
    std::vector< std::string > m_Messages;
  };
} // namespace MkvTest
