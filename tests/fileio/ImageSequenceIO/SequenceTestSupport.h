#pragma once

// Folders of image files for the sequence tests: made in a fresh temporary folder, with
// descriptors written by the project's own writer.

#include "fileio/ImageSequenceIO/SequenceDescriptor.h"
#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "tests/fileio/ImageDecoders/ImageTestSupport.h"

#include <gtest/gtest.h>

#include <set>
#include <sstream>

namespace ImageSequenceTest
{
  using namespace LumekTest;

  // The words of a text: file names, frame numbers.
  inline std::vector< std::string > Words( const std::string& i_rText )
  {
    std::istringstream Stream( i_rText );
    return { std::istream_iterator< std::string >( Stream ), std::istream_iterator< std::string >() };
  }

  // A PNG signature and IHDR of a 40 x 30 RGB image, big-endian as PNG stores its numbers: all
  // a reader takes from an image to open.
  inline VBytes PngHeader()
  {
    return { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A, 0, 0, 0, 13, 'I', 'H', 'D', 'R', 0,
             0,    0,   40,  0,   0,    0,    30,   8,    2, 0, 0, 0,  0,   0,   0,   0 };
  }

  // A descriptor of a 48 x 32 sequence at 25 frames a second with this pattern and count.
  inline ImageSequenceIO::VDescriptor MakeDescriptor( const std::string& i_rPattern, std::uint32_t i_FrameCount,
                                                      std::uint32_t i_IndexPad = 8, std::uint32_t i_NumberPad = 8 )
  {
    ImageSequenceIO::VDescriptor Descriptor;
    Descriptor.FrameInfo = FrameInfo( 48, 32, ZOL::PixelFormat_R8G8B8 );
    Descriptor.FrameInfo.PixelAspectRatio = 1.0;
    Descriptor.Timing.FramePeriodInTicks = Descriptor.Timing.TicksPerSecond / 25;
    Descriptor.Sequence.FileNamePattern = i_rPattern;
    Descriptor.Sequence.FrameCount = i_FrameCount;
    Descriptor.Sequence.FrameIndexPadWidth = i_IndexPad;
    Descriptor.Sequence.FrameNumberPadWidth = i_NumberPad;
    return Descriptor;
  }

  // The frames below i_Count that the reader says are on disk, expecting its index to say the
  // same of each.
  inline std::set< std::uint64_t > StoredFrames( const ImageSequenceIO::VImageSequenceReader& i_rReader,
                                                 std::uint64_t i_Count )
  {
    std::set< std::uint64_t > Stored;
    for( std::uint64_t i = 0; i < i_Count; ++i )
    {
      EXPECT_EQ( i_rReader.HasFrame( i ), i_rReader.FindStoredFrameAtOrAfter( i ) == i ) << "frame " << i;
      if( i_rReader.HasFrame( i ) )
        Stored.insert( i );
    }
    EXPECT_EQ( Stored.size(), i_rReader.GetStoredFrameCount() );
    return Stored;
  }
} // namespace ImageSequenceTest
