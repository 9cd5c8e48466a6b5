#pragma once

// Recordings for the .lvid tests, assembled byte by byte here, apart from the writer, so that a
// mistake in the writer's layout cannot hide behind the same mistake in the reader.

#include "fileio/LumekVideo/VReader.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <boost/filesystem.hpp>

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace LumekVideoTest
{
  using VBytes = std::vector< std::uint8_t >;

  // Overwrites a little-endian number of i_Bytes bytes.
  inline void Patch( VBytes& io_rBytes, std::size_t i_Offset, std::uint64_t i_Value, int i_Bytes = 8 )
  {
    for( int i = 0; i < i_Bytes; ++i )
      io_rBytes.at( i_Offset + i ) = static_cast< std::uint8_t >( i_Value >> ( 8 * i ) );
  }

  // Deterministic bytes that differ from frame to frame and from seed to seed.
  VBytes PatternBytes( std::size_t i_Size, std::uint32_t i_Seed );

  // The frame description block of a recording with this video and audio, less one key if named.
  VBytes DescriptionBlock( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio,
                           const std::string& i_rWithoutKey = "" );

  struct VRecord
  {
    std::uint64_t FrameNumber = 0;
    VBytes Video;
    std::optional< VBytes > Audio; // absent: the recording has no sound
  };

  // A recording as a capture lays it out: header, both blocks, aligned records, index last.
  struct VRecordingPlan
  {
    VBytes DescriptionBlock;
    VBytes AttributeBlock;
    std::uint64_t Alignment = 64;
    std::vector< VRecord > Records;
  };

  struct VAssembled
  {
    VBytes Bytes;
    std::vector< std::uint64_t > RecordOffsets;
    std::uint64_t IndexOffset = 0;
  };

  // The index names each record by its frame number, unless (frame number, record number)
  // entries are given to write instead.
  VAssembled Assemble( const VRecordingPlan& i_rPlan,
                       std::vector< std::pair< std::uint64_t, std::size_t > > i_Index = {} );

  // A frame description for tests: a size and a format, all else at the usual values.
  ZOL::IVideoFrameInfo MakeVideo( ZOL::EPixelFormat i_Format, int i_Width, int i_Height );
  // File attributes with timing, settings and a key of the recording's own.
  ZOL::IVideoAttributes MakeFileAttributes();

  // Frames 0, 1 and 2 of 5 x 3 Luminance8 with 16-bit stereo sound, aligned to 16: small enough
  // to cut and damage at every byte.
  inline const ZOL::IVideoFrameInfo s_SmallVideo = MakeVideo( ZOL::PixelFormat_Luminance8, 5, 3 );
  inline const ZOL::IAudioFrameInfo s_Stereo16 = { ZOL::AudioSampleFormat_Int16, 48000, 2 };
  VRecordingPlan SmallPlan();

  struct VFrameContent
  {
    std::uint64_t FrameNumber;
    VBytes Video;
    VBytes Audio;
  };

  // The writer's recording of these frames with MakeFileAttributes, or nothing when any call fails.
  VBytes WriteToMemory( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio,
                        const std::vector< VFrameContent >& i_rFrames,
                        std::uint64_t i_Alignment = LumekVideo::DefaultAlignment );

  // A reader of a recording held in memory.
  struct VMemoryRecording
  {
    explicit VMemoryRecording( VBytes i_Bytes );
    VBytes Bytes;
    LumekVideo::VReader Reader;
    bool bOpened = false;
  };

  inline VBytes BytesOf( const ZOL::IBufferConst& i_rBuffer )
  {
    return VBytes( i_rBuffer.GetData(), i_rBuffer.GetData() + i_rBuffer.GetSize() );
  }
  // What ReadFrameData gave, copied out, or nothing when it failed.
  struct VFrameBytes
  {
    VBytes Video;
    std::vector< VBytes > Audio;
  };
  std::optional< VFrameBytes > ReadBytes( LumekVideo::VReader& io_rReader, std::uint64_t i_Frame, bool i_bVideo = true,
                                          bool i_bAudio = true );

  // A folder of its own under the temp folder, removed with everything in it.
  struct VTempDir
  {
    VTempDir() { boost::filesystem::create_directories( Path ); }
    ~VTempDir() { boost::filesystem::remove_all( Path, Error ); }
    std::string File( const std::string& i_rName ) const { return ( Path / i_rName ).string(); }
    const boost::filesystem::path Path =
        boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "lvid-test-%%%%-%%%%-%%%%" );
    boost::system::error_code Error;
  };

  bool WriteFile( const std::string& i_rPath, const VBytes& i_rBytes );
  VBytes ReadFile( const std::string& i_rPath );
} // namespace LumekVideoTest
