// The reader is chosen by the file's name alone, with exact, case-sensitive extensions.

#include "fileio/VideoReaders/CreateVideoReader.h"
#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/LumekVideo/VReader.h"
#include "fileio/MkvIO/VMkvReader.h"
#include "fileio/MovIO/VMovReader.h"
#include "fileio/RapidAVI/VRapidAVIReader.h"

#include <gtest/gtest.h>

#include <typeinfo>

namespace
{
  TEST( CreateVideoReader, PicksTheReaderByTheName )
  {
    const std::type_info* const None = nullptr;
    const std::type_info* const Lvid = &typeid( LumekVideo::VReader );
    const std::type_info* const Mov = &typeid( MovIO::VMovReader );
    const std::type_info* const Images = &typeid( ImageSequenceIO::VImageSequenceReader );
    const std::pair< const char*, const std::type_info* > Cases[] = {
        { "x.lvid", Lvid },
        { "/captures/day 1/take.2.lvid", Lvid },
        { "clip.mov", Mov },
        { "clip.mp4", Mov },
        { "clip.avi", &typeid( RapidAVI::VRapidAVIReader ) },
        { "clip.mkv", &typeid( MkvIO::VMkvReader ) },
        { "take.lumekimagesequence", Images },
        // One numbered image stands for its sequence.
        { "take_000123.jpg", Images },
        { "clip.MOV", None },
        { "take_0001.JPG", None },
        { "notes.txt", None },
        { "clip", Images },
        { "/data.lvid/readme", Images },
        { "shot_%FRAME%.lvid", Images },
        { "shot_%FRAME_NUMBER%.lvid", Images },
    };
    for( const auto& [pName, pExpected] : Cases )
    {
      const auto pReader = CreateVideoReader( pName );
      EXPECT_EQ( pReader ? &typeid( *pReader ) : nullptr, pExpected ) << pName;
    }
    // Each call gives a reader of its own, not yet open.
    const auto pFirst = CreateVideoReader( "a.lvid" ), pSecond = CreateVideoReader( "a.lvid" );
    EXPECT_NE( pFirst, pSecond );
    EXPECT_EQ( pFirst->GetFrameCount(), 0u );
  }
} // namespace
