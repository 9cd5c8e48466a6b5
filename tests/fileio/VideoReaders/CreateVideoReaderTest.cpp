// The reader is chosen by the file's name alone, with exact, case-sensitive extensions.

#include "fileio/VideoReaders/CreateVideoReader.h"
#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/LumekVideo/VReader.h"
#include "fileio/MkvIO/VMkvReader.h"
#include "fileio/MovIO/VMovReader.h"
#include "fileio/RapidAVI/VRapidAVIReader.h"

#include <gtest/gtest.h>

namespace
{
  enum EExpected
  {
    NoReader,
    LumekVideoReader,
    MovReader,
    AviReader,
    MkvReader,
    ImageSequence,
  };

  EExpected KindOf( const ZOL::IVideoReader* i_pReader )
  {
    if( !i_pReader )
      return NoReader;
    if( dynamic_cast< const LumekVideo::VReader* >( i_pReader ) )
      return LumekVideoReader;
    if( dynamic_cast< const MovIO::VMovReader* >( i_pReader ) )
      return MovReader;
    if( dynamic_cast< const RapidAVI::VRapidAVIReader* >( i_pReader ) )
      return AviReader;
    if( dynamic_cast< const MkvIO::VMkvReader* >( i_pReader ) )
      return MkvReader;
    if( dynamic_cast< const ImageSequenceIO::VImageSequenceReader* >( i_pReader ) )
      return ImageSequence;
    ADD_FAILURE() << "a reader of no known kind";
    return NoReader;
  }

  struct VNameCase
  {
    const char* Label;
    const char* FileName;
    EExpected Expected;
  };

  const VNameCase s_Cases[] = {
      { "LowerCaseLvid", "x.lvid", LumekVideoReader },
      { "LvidInAFolder", "/captures/day 1/take.2.lvid", LumekVideoReader },
      { "Mov", "clip.mov", MovReader },
      { "Mp4", "clip.mp4", MovReader },
      { "Avi", "clip.avi", AviReader },
      { "Mkv", "clip.mkv", MkvReader },
      { "Descriptor", "take.lumekimagesequence", ImageSequence },
      { "NumberedJpeg", "take_000123.jpg", ImageSequence },
      { "NumberedTiff", "take_000123.tiff", ImageSequence },
      { "UpperCaseMov", "clip.MOV", NoReader },
      { "UpperCaseLvid", "clip.LVID", NoReader },
      { "UpperCaseJpeg", "take_0001.JPG", NoReader },
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
    EXPECT_EQ( KindOf( CreateVideoReader( rCase.FileName ).get() ), rCase.Expected );
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
