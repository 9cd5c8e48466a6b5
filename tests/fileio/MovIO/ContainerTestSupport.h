#pragma once

// Shared by the MOV and AVI readers' tests: ffmpeg's own view of a file, the two stores of a
// recording's description that either container carries in a QMDT part, and damaged files.

#include "tests/support/FfmpegFixtures.h"
#include "tests/support/Files.h"
#include "tests/support/LogCapture.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <fstream>
#include <functional>
#include <gtest/gtest.h>
#include <iterator>
#include <sstream>

namespace ContainerTest
{
  using VBytes = std::vector< std::uint8_t >;

  inline std::vector< std::string > Words( const std::string& i_rText )
  {
    std::istringstream Stream( i_rText );
    return std::vector< std::string >( std::istream_iterator< std::string >( Stream ), {} );
  }

  // One figure of ffprobe's for one stream, without the line end.
  inline std::string Probe( const std::string& i_rPath, const char* i_pEntry, const char* i_pStream = "v:0" )
  {
    const std::string Text = LumekTest::Ffprobe(
        i_rPath, { "-select_streams", i_pStream, "-show_entries", i_pEntry, "-of", "default=nw=1:nk=1" } );
    return Text.substr( 0, Text.find_last_not_of( "\r\n" ) + 1 );
  }

  // Groups of pictures by ffprobe's key-frame flags, last group first: the order of a viewer
  // jumping back through the file.
  inline std::vector< std::vector< std::uint64_t > > GroupsLastFirst( const std::string& i_rPath )
  {
    std::istringstream Flags( Probe( i_rPath, "packet=flags" ) );
    std::vector< std::vector< std::uint64_t > > Groups;
    std::string Line;
    for( std::uint64_t i = 0; std::getline( Flags, Line ); ++i )
    {
      if( Groups.empty() || Line[0] == 'K' )
        Groups.emplace_back();
      Groups.back().push_back( i );
    }
    return std::vector< std::vector< std::uint64_t > >( Groups.rbegin(), Groups.rend() );
  }

  using LumekTest::ReadFileBytes;

  // ffmpeg's own demuxing of one stream ("v:0", "a:0"): the stored bytes of its packets.
  inline VBytes StreamCopy( const std::string& i_rPath, const std::string& i_rStream )
  {
    const std::string Output = i_rPath + "." + i_rStream[0] + ".bin";
    LumekTest::RunCommand( "ffmpeg -y -v error -i " + LumekTest::ShellQuote( i_rPath ) + " -map 0:" + i_rStream +
                           " -c copy -f data " + LumekTest::ShellQuote( Output ) );
    return ReadFileBytes( Output );
  }
  // A Bayer GB 8 frame store and 100 Hz timing written to io_rAttributes, both stores serialised.
  inline VBytes BayerStores( int i_Width, int i_Height, ZOL::IVideoAttributes& io_rAttributes,
                             ZOL::IVideoTiming& o_rTiming )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = ZOL::PixelFormat_BayerGB8;
    ZOL::IVideoAttributes FrameStore;
    o_rTiming.TicksPerSecond = 135000000;
    o_rTiming.FramePeriodInTicks = 1350000;
    UtilsIO::VMemoryStream Stores;
    EXPECT_TRUE( ZOL::WriteVideoFrameInfo( FrameStore, Info ) && ZOL::WriteVideoTiming( io_rAttributes, o_rTiming ) &&
                 FrameStore.WriteTo( Stores ) && io_rAttributes.WriteTo( Stores ) );
    return Stores.GetData();
  }

  // i_Read on the file cut short, and with one byte zeroed or its lowest or highest bit flipped, at
  // every byte of [i_DenseFrom, i_DenseTo) and at every i_Step-th byte elsewhere. Every outcome is
  // allowed but a crash, a hang or a read outside the file; the sanitizer build fails those.
  inline void CutsAndFlips( const VBytes& i_rFile, std::size_t i_DenseFrom, std::size_t i_DenseTo, std::size_t i_Step,
                            const std::function< void( const VBytes& ) >& i_Read )
  {
    // Thousands of refusals each say why; only a crash or a hang would matter here.
    LumekTest::VLogCapture Quiet( "", 0 );
    for( std::size_t At = 0; At < i_rFile.size(); At += At >= i_DenseFrom && At < i_DenseTo ? 1 : i_Step )
    {
      i_Read( VBytes( i_rFile.begin(), i_rFile.begin() + static_cast< std::ptrdiff_t >( At ) ) );
      for( const int Value : { 0, i_rFile[At] ^ 0x01, i_rFile[At] ^ 0x80 } )
      {
        VBytes Damaged = i_rFile;
        Damaged[At] = static_cast< std::uint8_t >( Value );
        i_Read( Damaged );
      }
    }
  }
} // namespace ContainerTest
