#pragma once

// Recordings for the .lvid tests, assembled byte by byte here, apart from the writer, so that a
// mistake in the writer's layout cannot hide behind the same mistake in the reader.

#include "fileio/LumekVideo/VReader.h"
#include "fileio/LumekVideo/VWriter.h"
#include "tests/support/Files.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <boost/filesystem.hpp>

#include <cstdint>
#include <fstream>
#include <iterator>
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
  inline VBytes PatternBytes( std::size_t i_Size, std::uint32_t i_Seed )
  {
    // A small xorshift: every byte position and every seed gives different content, so a frame
    // read from the wrong place or shifted by a byte cannot match.
    VBytes Bytes( i_Size );
    std::uint32_t State = i_Seed * 2654435761u + 0x9E3779B9u;
    for( auto& rByte : Bytes )
    {
      State ^= State << 13;
      State ^= State >> 17;
      State ^= State << 5;
      rByte = static_cast< std::uint8_t >( State >> 24 );
    }
    return Bytes;
  }

  // No bytes at all when the store cannot be written: every block built from them fails to read.
  inline VBytes SerialiseStore( const ZOL::IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    return i_rStore.WriteTo( Stream ) ? Stream.GetData() : VBytes();
  }

  // The frame description block of a recording with this video and audio, less one key if named.
  inline VBytes DescriptionBlock( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio,
                                  const std::string& i_rWithoutKey = "" )
  {
    ZOL::IVideoAttributes Store;
    ZOL::WriteVideoFrameInfo( Store, i_rVideo );
    ZOL::WriteAudioFrameInfo( Store, "", i_rAudio );
    Store.Remove( i_rWithoutKey );
    return SerialiseStore( Store );
  }

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
  inline VAssembled Assemble( const VRecordingPlan& i_rPlan,
                              std::vector< std::pair< std::uint64_t, std::size_t > > i_Index = {} )
  {
    VAssembled Result;
    VBytes& rFile = Result.Bytes;
    const auto Put = [&]( std::uint64_t i_Value, int i_Bytes )
    {
      rFile.resize( rFile.size() + i_Bytes );
      Patch( rFile, rFile.size() - i_Bytes, i_Value, i_Bytes );
    };
    // Bytes, then zeros up to the next boundary unless told otherwise.
    const auto Raw = [&]( const VBytes& i_rBytes, bool i_bPad = true )
    {
      rFile.insert( rFile.end(), i_rBytes.begin(), i_rBytes.end() );
      if( i_bPad )
        rFile.resize( ( rFile.size() + i_rPlan.Alignment - 1 ) / i_rPlan.Alignment * i_rPlan.Alignment );
    };
    const std::string Magic = "###LumekVideoFile###";
    rFile.assign( Magic.begin(), Magic.end() );
    Put( 0xF355BDACu, 4 );
    Put( 1, 4 );
    Put( 3, 4 );
    Put( i_rPlan.Alignment, 8 );
    Put( 0, 8 ); // the index offset, known at the end
    Raw( i_rPlan.DescriptionBlock, false );
    Raw( i_rPlan.AttributeBlock );
    for( const VRecord& rRecord : i_rPlan.Records )
    {
      Result.RecordOffsets.push_back( rFile.size() );
      Raw( rRecord.Video );
      if( rRecord.Audio )
      {
        Put( rRecord.Audio->size(), 4 );
        Raw( *rRecord.Audio );
      }
    }
    Result.IndexOffset = rFile.size();
    if( i_Index.empty() )
      for( std::size_t i = 0; i < i_rPlan.Records.size(); ++i )
        i_Index.emplace_back( i_rPlan.Records[i].FrameNumber, i );
    Put( i_Index.size(), 8 );
    for( const auto& [Frame, Record] : i_Index )
    {
      Put( Frame, 8 );
      Put( Result.RecordOffsets.at( Record ), 8 );
    }
    Patch( rFile, 40, Result.IndexOffset );
    return Result;
  }

  // A frame description for tests: a size and a format, all else at the usual values.
  inline ZOL::IVideoFrameInfo MakeVideo( ZOL::EPixelFormat i_Format, int i_Width, int i_Height )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    Info.PixelAspectRatio = 1.0;
    Info.InterlacedFormat = ZOL::InterlacedFormat_NotInterlaced;
    return Info;
  }
  // File attributes with timing, settings and a key of the recording's own.
  inline ZOL::IVideoAttributes MakeFileAttributes()
  {
    ZOL::IVideoAttributes Attributes;
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = 135000000u / 100u;
    Timing.StartOffsetInTicks = -270000;
    ZOL::WriteVideoTiming( Attributes, Timing );
    ZOL::IVideoSettings Settings;
    Settings.Saturation = 1.25f;
    Settings.GammaCorrection = 0.5f;
    ZOL::WriteVideoSettings( Attributes, "", Settings );
    Attributes.Set( "Recording.Take", std::uint32_t( 7 ) );
    Attributes.Set( "Recording.Note", "lvid test" );
    return Attributes;
  }

  // Frames 0, 1 and 2 of 5 x 3 Luminance8 with 16-bit stereo sound, aligned to 16: small enough
  // to cut and damage at every byte.
  inline const ZOL::IVideoFrameInfo s_SmallVideo = MakeVideo( ZOL::PixelFormat_Luminance8, 5, 3 );
  inline const ZOL::IAudioFrameInfo s_Stereo16 = { ZOL::AudioSampleFormat_Int16, 48000, 2 };
  inline VRecordingPlan SmallPlan()
  {
    VRecordingPlan Plan;
    Plan.DescriptionBlock = DescriptionBlock( s_SmallVideo, s_Stereo16 );
    Plan.AttributeBlock = SerialiseStore( MakeFileAttributes() );
    Plan.Alignment = 16;
    for( std::uint32_t i = 0; i < 3; ++i )
      Plan.Records.push_back( { i, PatternBytes( 15, i ), PatternBytes( 4 * ( i + 1 ), 40 + i ) } );
    return Plan;
  }

  struct VFrameContent
  {
    std::uint64_t FrameNumber;
    VBytes Video;
    VBytes Audio;
  };

  // The writer's recording of these frames with MakeFileAttributes, or nothing when any call fails.
  inline VBytes WriteToMemory( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio,
                               const std::vector< VFrameContent >& i_rFrames,
                               std::uint64_t i_Alignment = LumekVideo::DefaultAlignment )
  {
    auto pStream = std::make_shared< UtilsIO::VMemoryStream >();
    LumekVideo::VWriter Writer;
    if( !Writer.Create( pStream, i_rVideo, i_rAudio, MakeFileAttributes(), i_Alignment ) )
      return {};
    for( const VFrameContent& rFrame : i_rFrames )
      if( !Writer.AppendFrame( rFrame.FrameNumber, rFrame.Video.data(), rFrame.Video.size(),
                               rFrame.Audio.empty() ? nullptr : rFrame.Audio.data(), rFrame.Audio.size() ) )
        return {};
    return Writer.Close() ? pStream->GetData() : VBytes();
  }

  // A reader of a recording held in memory.
  struct VMemoryRecording
  {
    explicit VMemoryRecording( VBytes i_Bytes ) : Bytes( std::move( i_Bytes ) )
    {
      bOpened = Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( Bytes.data(), Bytes.size() ) );
    }
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
  inline std::optional< VFrameBytes > ReadBytes( LumekVideo::VReader& io_rReader, std::uint64_t i_Frame,
                                                 bool i_bVideo = true, bool i_bAudio = true )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    if( !io_rReader.ReadFrameData( i_Frame, pVideo, Audio, i_bVideo, i_bAudio ) )
      return std::nullopt;
    VFrameBytes Result;
    if( pVideo )
      Result.Video = BytesOf( *pVideo );
    for( const auto& rpBlock : Audio )
      Result.Audio.push_back( BytesOf( *rpBlock ) );
    return Result;
  }

  using LumekTest::ReadFileBytes;
  using LumekTest::VTempFolder;
  using LumekTest::WriteFileBytes;
} // namespace LumekVideoTest
