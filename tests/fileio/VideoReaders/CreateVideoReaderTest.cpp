// The reader is chosen by the file's name alone, with exact, case-sensitive extensions.

#include "fileio/VideoReaders/CreateVideoReader.h"
#include "fileio/LumekVideo/VReader.h"

#include <gtest/gtest.h>

namespace
{
  enum EExpected
  {
    LumekVideoReader,
    NoReader,
    // An image sequence: a reader of its own, or none while that reader is not in the table.
    ImageSequence,
  };

  struct VNameCase
  {
    const char* Label;
    const char* FileName;
    EExpected Expected;
  };

  const VNameCase s_Cases[] = {
      { "LowerCaseLvid", "x.lvid", LumekVideoReader },
      { "LvidInAFolder", "/captures/day 1/take.2.lvid", LumekVideoReader },
      { "UpperCaseMov", "clip.MOV", NoReader },
      { "UpperCaseLvid", "clip.LVID", NoReader },
      { "UnknownExtension", "notes.txt", NoReader },
      { "NoExtension", "clip", ImageSequence },
      { "LvidOnlyInTheFolderName", "/data.lvid/readme", ImageSequence },
      { "FramePlaceholder", "shot_%FRAME%.lvid", ImageSequence },
      { "FrameNumberPlaceholder", "shot_%FRAME_NUMBER%.lvid", ImageSequence },
  };

  class CreateVideoReaderByName : public testing::TestWithParam< VNameCase >
  {
  };

  TEST_P( CreateVideoReaderByName, PicksTheReader )
  {
    const VNameCase& rCase = GetParam();
    const std::shared_ptr< ZOL::IVideoReader > pReader = CreateVideoReader( rCase.FileName );
    EXPECT_EQ( dynamic_cast< LumekVideo::VReader* >( pReader.get() ) != nullptr, rCase.Expected == LumekVideoReader );
    if( rCase.Expected == NoReader )
    {
      EXPECT_FALSE( pReader );
    }
    if( rCase.Expected == ImageSequence )
    {
      EXPECT_EQ( ZOL::FindVideoContainer( rCase.FileName ), ZOL::VideoContainer_IMAGES );
    }
  }

  INSTANTIATE_TEST_SUITE_P( Names, CreateVideoReaderByName, testing::ValuesIn( s_Cases ),
                            []( const testing::TestParamInfo< VNameCase >& i_rInfo ) { return i_rInfo.param.Label; } );

  TEST( CreateVideoReader, EachCallGivesANewUnopenedReader )
  {
    const auto pFirst = CreateVideoReader( "a.lvid" );
    const auto pSecond = CreateVideoReader( "a.lvid" );
    ASSERT_TRUE( pFirst && pSecond );
    EXPECT_NE( pFirst, pSecond );
    EXPECT_EQ( pFirst->GetFrameCount(), 0u );
  }
} // namespace
