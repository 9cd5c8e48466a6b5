#pragma once

// Matroska files of the family for the tests and the fuzz seeds, written by the project's own
// writer from frames whose every byte is known.

#include "fileio/MkvIO/VMkvWriter.h"
#include "tests/fileio/ImageDecoders/ImageTestSupport.h"

#include <functional>

namespace MkvTest
{
  using namespace LumekTest;

  struct VFamilyCase
  {
    ZOL::EPixelFormat Format = ZOL::PixelFormat_R8G8B8u8; // the stored format, or the JPEG's
    ZOL::EAudioSampleFormat Audio = ZOL::AudioSampleFormat_Unspecified;
    bool bJPEG = false;
    int Width = 16, Height = 8, Frames = 5;
  };

  // 4 x 2 RGBA with 16-bit audio, three frames: small enough to cut at every byte.
  inline const VFamilyCase s_SmallCase{ ZOL::PixelFormat_R8G8B8u8, ZOL::AudioSampleFormat_Int16, false, 4, 2, 3 };

  inline ZOL::IAudioFrameInfo AudioInfo( const VFamilyCase& i_rCase )
  {
    return i_rCase.Audio != ZOL::AudioSampleFormat_Unspecified ? ZOL::IAudioFrameInfo{ i_rCase.Audio, 48000, 2 }
                                                               : ZOL::IAudioFrameInfo();
  }

  // 50 frames a second, starting 1234 ticks in, at 10:20:30:12 with user bits A5A5.
  inline const ZOL::IVideoTiming s_Timing{ ZOL::DefaultTicksPerSecond, ZOL::DefaultTicksPerSecond / 50, 1234 };
  inline const ZOL::ITimecode s_StartTimecode{ ZOL::TimecodeStandard_25, 10, 20, 30, 12, 0xA5A5 };

  // Frame i of a raw case: bytes that differ at every position and in every frame.
  inline VBytes RawFrame( const VFamilyCase& i_rCase, int i_Frame )
  {
    VBytes Bytes( ZOL::GetVideoFrameSizeInBytes64( FrameInfo( i_rCase.Width, i_rCase.Height, i_rCase.Format ) ) );
    for( std::size_t i = 0; i < Bytes.size(); ++i )
      Bytes[i] = static_cast< std::uint8_t >( i * 7 + i / 5 + i_Frame * 29 );
    return Bytes;
  }

  // The audio of frame i: a whole number of sample groups, and a sample count that changes from
  // frame to frame, as 48 kHz at odd frame rates does.
  inline VBytes AudioBlock( const VFamilyCase& i_rCase, int i_Frame )
  {
    const ZOL::IAudioFrameInfo Info = AudioInfo( i_rCase );
    VBytes Bytes( Info.IsUsable() ? ( 40 + i_Frame % 3 ) * ZOL::GetAudioSampleGroupSizeInBytes( Info ) : 0 );
    for( std::size_t i = 0; i < Bytes.size(); ++i )
      Bytes[i] = static_cast< std::uint8_t >( i * 3 + i_Frame * 101 );
    return Bytes;
  }

  // Writes the case's file with one Cluster a frame, each holding the raw frame (or i_rJPEG) and
  // its audio; i_rEdit may change the description, and i_rClusters, when set, gives the blocks
  // of each frame instead.
  inline bool WriteFamilyFile( const std::string& i_rPath, const VFamilyCase& i_rCase, const VBytes& i_rJPEG = {},
                               const std::function< void( MkvIO::VMkvDescription& ) >& i_rEdit = {},
                               const std::function< std::vector< MkvIO::VMkvBlock >( int ) >& i_rClusters = {} )
  {
    ZOL::IVideoFrameInfo Video = FrameInfo( i_rCase.Width, i_rCase.Height, i_rCase.Format );
    Video.PixelAspectRatio = 1.0;
    ZOL::IVideoSettings Settings;
    Settings.Saturation = 0.75f;
    Settings.GammaCorrection = 1.25f;
    MkvIO::VMkvDescription Description;
    MkvIO::VMkvWriter Writer;
    if( !MkvIO::DescribeForMatroska( Video, i_rCase.bJPEG, AudioInfo( i_rCase ), s_Timing, s_StartTimecode, Settings,
                                     Description ) )
      return false;
    if( i_rEdit )
      i_rEdit( Description );
    if( !Writer.Create( i_rPath, Description ) )
      return false;
    for( int Frame = 0; Frame < i_rCase.Frames; ++Frame )
      if( !( i_rClusters ? Writer.WriteCluster( i_rClusters( Frame ) )
                         : Writer.WriteFrame( i_rCase.bJPEG ? i_rJPEG : RawFrame( i_rCase, Frame ),
                                              AudioBlock( i_rCase, Frame ) ) ) )
        return false;
    return Writer.Close();
  }
} // namespace MkvTest
