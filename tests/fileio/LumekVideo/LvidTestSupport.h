#pragma once

// Recordings for the .lvid tests, assembled byte by byte here, apart from the writer, so that a
// mistake in the writer's layout cannot hide behind the same mistake in the reader.

#include "fileio/LumekVideo/VReader.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace LumekVideoTest
{
  using VBytes = std::vector< std::uint8_t >;

  // Little-endian assembly with its own encoding.
  class VByteWriter
  {
  public:
    VByteWriter& Int( std::uint64_t i_Value, int i_Bytes );
    VByteWriter& U32( std::uint32_t i_Value ) { return Int( i_Value, 4 ); }
    VByteWriter& U64( std::uint64_t i_Value ) { return Int( i_Value, 8 ); }
    VByteWriter& Raw( const VBytes& i_rBytes );
    VByteWriter& Text( const std::string& i_rText ) { return Raw( VBytes( i_rText.begin(), i_rText.end() ) ); }
    VByteWriter& PadTo( std::uint64_t i_Alignment );

    std::size_t Size() const { return Bytes.size(); }
    VBytes Bytes;
  };

  // Overwrites a little-endian number of i_Bytes bytes.
  void Patch( VBytes& io_rBytes, std::size_t i_Offset, std::uint64_t i_Value, int i_Bytes );
  inline void PatchU32( VBytes& io_rBytes, std::size_t i_Offset, std::uint32_t i_Value )
  {
    Patch( io_rBytes, i_Offset, i_Value, 4 );
  }
  inline void PatchU64( VBytes& io_rBytes, std::size_t i_Offset, std::uint64_t i_Value )
  {
    Patch( io_rBytes, i_Offset, i_Value, 8 );
  }

  // Deterministic bytes that differ from frame to frame and from seed to seed.
  VBytes PatternBytes( std::size_t i_Size, std::uint32_t i_Seed );

  // The serial form of a store, as its own WriteTo gives it.
  VBytes SerialiseStore( const ZOL::IVideoAttributes& i_rStore );
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
  ZOL::IAudioFrameInfo MakeAudio( ZOL::EAudioSampleFormat i_Format, int i_Channels, int i_Rate = 48000 );
  // File attributes with timing, settings and a key of the recording's own.
  ZOL::IVideoAttributes MakeFileAttributes();

  // Frames 0, 1 and 2 of 5 x 3 Luminance8 with 16-bit stereo sound, aligned to 16: small enough
  // to cut and damage at every byte.
  inline const ZOL::IVideoFrameInfo s_SmallVideo = MakeVideo( ZOL::PixelFormat_Luminance8, 5, 3 );
  inline const ZOL::IAudioFrameInfo s_Stereo16 = MakeAudio( ZOL::AudioSampleFormat_Int16, 2 );
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

  // A folder of its own under the test temp folder, removed with everything in it.
  class VTempDir
  {
  public:
    VTempDir();
    ~VTempDir();
    std::string File( const std::string& i_rName ) const;
    const std::string& Path() const { return m_Path; }

  private:
    std::string m_Path;
  };

  bool WriteFile( const std::string& i_rPath, const VBytes& i_rBytes );
  VBytes ReadFile( const std::string& i_rPath );
} // namespace LumekVideoTest
