#pragma once

#include "fileio/LumekVideo/VWriter.h"
#include "videointerface/AttributeRecords.h"

#include <boost/filesystem.hpp>

#include <gtest/gtest.h>

#include <string>
#include <vector>

// A small .lvid written by the test, with frame n filled with the byte n + 1 and, with audio,
// one block of n % 8 + 1 stereo 16-bit samples.
struct VSourceRecording
{
  ZOL::IVideoFrameInfo Video;
  ZOL::IAudioFrameInfo Audio;
  ZOL::IVideoAttributes Attributes;
  std::vector< std::uint64_t > Frames = { 0, 1, 2 };
  std::string Path;

  VSourceRecording()
  {
    Video.ImageWidth = 8;
    Video.ImageHeight = 4;
    Video.PixelFormat = ZOL::PixelFormat_BayerGB8;
    Video.PixelAspectRatio = 1.0;
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = 135000000u / 50;
    ZOL::WriteVideoTiming( Attributes, Timing );
    Path = ( boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "source-%%%%%%%%.lvid" ) )
               .string();
  }
  ~VSourceRecording() { boost::filesystem::remove( Path ); }

  const std::string& Write()
  {
    LumekVideo::VWriter Writer;
    EXPECT_TRUE( Writer.Create( Path, Video, Audio, Attributes ) );
    const std::uint64_t Size = ZOL::GetVideoFrameSizeInBytes64( Video );
    for( std::uint64_t Frame : Frames )
    {
      const std::vector< std::uint8_t > Pixels( Size, static_cast< std::uint8_t >( Frame + 1 ) );
      const std::vector< std::uint8_t > Samples( ( Frame % 8 + 1 ) * 4, static_cast< std::uint8_t >( 0x40 + Frame ) );
      EXPECT_TRUE( Writer.AppendFrame( Frame, Pixels.data(), Pixels.size(), Audio.IsUsable() ? Samples.data() : nullptr,
                                       Audio.IsUsable() ? Samples.size() : 0 ) );
    }
    EXPECT_TRUE( Writer.Close() );
    return Path;
  }
};
