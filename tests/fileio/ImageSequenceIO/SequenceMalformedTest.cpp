// Damaged descriptors and damaged images, cut and flipped at many points: the reader answers
// false or reads what is there, and never crashes, hangs or allocates without bound.

#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "tests/fileio/ImageSequenceIO/SequenceTestSupport.h"
#include "tests/support/FfmpegFixtures.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

using namespace ImageSequenceTest;

namespace
{
  VBytes DescriptorBytes( const ImageSequenceIO::VDescriptor& i_rDescriptor )
  {
    ZOL::IVideoAttributes FrameKeys, Attributes;
    EXPECT_TRUE( ImageSequenceIO::MakeDescriptorStores( i_rDescriptor, FrameKeys, Attributes ) );
    UtilsIO::VMemoryStream Stream;
    EXPECT_TRUE( FrameKeys.WriteTo( Stream ) && Attributes.WriteTo( Stream ) );
    return Stream.GetData();
  }

  // Reads every frame the way the viewer does; the result does not matter, surviving does.
  void ReadAll( ImageSequenceIO::VImageSequenceReader& io_rReader )
  {
    const std::uint64_t Count = std::min< std::uint64_t >( io_rReader.GetFrameCount(), 8 );
    for( std::uint64_t i = 0; i < Count; ++i )
    {
      io_rReader.HasFrame( i );
      ZOL::IVideoFrame Frame;
      io_rReader.ReadFrame( i, Frame, true, true );
    }
    io_rReader.GetStoredFrameCount();
    io_rReader.FindStoredFrameAtOrBefore( ~std::uint64_t( 0 ) );
  }

  struct VDamageCase
  {
    const char* Label;
    const char* Pattern;
    bool bTimecode;
  };

  class DamagedDescriptor : public testing::TestWithParam< VDamageCase >
  {
  };

  TEST_P( DamagedDescriptor, EveryCutAndFlipIsSurvived )
  {
    VTempFolder Folder;
    for( const char* pName : { "t_00.png", "t_01.png", "t_0102030400.png" } )
      WriteFile( Folder / pName, std::string( "\x89PNG\r\n\x1a\n not really" ) );
    ImageSequenceIO::VDescriptor Descriptor = MakeDescriptor( GetParam().Pattern, 3, 2, 2 );
    if( GetParam().bTimecode )
    {
      Descriptor.Timecode.Standards = ZOL::TimecodeStandard_30;
      Descriptor.Timecode.Hours = 1;
    }
    const VBytes Bytes = DescriptorBytes( Descriptor );
    const VQuietLog Quiet;
    ImageSequenceIO::VImageSequenceReader Reader;
    for( std::size_t Cut = 0; Cut <= Bytes.size(); ++Cut )
    {
      UtilsIO::VMemoryInputStream Stream( Bytes.data(), Cut );
      if( Reader.Open( Folder.Path(), Stream ) )
        ReadAll( Reader );
    }
    for( std::size_t Position = 0; Position < Bytes.size(); ++Position )
      for( const std::uint8_t Flip : { 0x01, 0x80, 0xFF } )
      {
        VBytes Damaged = Bytes;
        Damaged[Position] ^= Flip;
        UtilsIO::VMemoryInputStream Stream( Damaged.data(), Damaged.size() );
        if( Reader.Open( Folder.Path(), Stream ) )
          ReadAll( Reader );
      }
    // The same through a file: a cut descriptor on disk.
    WriteFile( Folder / "t.lumekimagesequence", VBytes( Bytes.begin(), Bytes.begin() + Bytes.size() / 2 ) );
    EXPECT_FALSE( Reader.Open( Folder / "t.lumekimagesequence" ) );
  }

  INSTANTIATE_TEST_SUITE_P( Patterns, DamagedDescriptor,
                            testing::Values( VDamageCase{ "Frame", "t_%FRAME%.png", false },
                                             VDamageCase{ "Timecode", "t_%TIMECODE%.png", true } ),
                            []( const testing::TestParamInfo< VDamageCase >& i_rInfo )
                            { return i_rInfo.param.Label; } );

  struct VImageDamageCase
  {
    const char* Label;
    const char* Extension;
    const char* FfmpegPixelFormat;
  };

  class DamagedImages : public testing::TestWithParam< VImageDamageCase >
  {
  };

  TEST_P( DamagedImages, EveryCutAndFlipIsSurvived )
  {
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const VImageDamageCase& rCase = GetParam();
    const std::string Fixture =
        LumekTest::FfmpegFixture( std::string( "damaged-" ) + rCase.Label + rCase.Extension,
                                  { "-f", "lavfi", "-i", "testsrc2=size=24x16:rate=25:duration=1", "-frames:v", "1",
                                    "-pix_fmt", rCase.FfmpegPixelFormat } );
    ASSERT_FALSE( Fixture.empty() );
    const VBytes Image = ReadFile( Fixture );
    const VQuietLog Quiet;
    VTempFolder Folder;
    const std::string Name = std::string( "d_0" ) + rCase.Extension;
    // Steps that reach every part of a small file without a run per byte.
    const std::size_t Step = std::max< std::size_t >( 1, Image.size() / 97 );
    ImageSequenceIO::VImageSequenceReader Reader;
    for( std::size_t Position = 0; Position <= Image.size(); Position += Step )
    {
      WriteFile( Folder / Name, VBytes( Image.begin(), Image.begin() + static_cast< std::ptrdiff_t >( Position ) ) );
      if( Reader.Open( Folder / Name ) )
        ReadAll( Reader );
      if( Position == Image.size() )
        break;
      VBytes Flipped = Image;
      Flipped[Position] ^= 0xA5;
      WriteFile( Folder / Name, Flipped );
      if( Reader.Open( Folder / Name ) )
        ReadAll( Reader );
    }
  }

  INSTANTIATE_TEST_SUITE_P( Formats, DamagedImages,
                            testing::Values( VImageDamageCase{ "Jpeg", ".jpg", "yuvj420p" },
                                             VImageDamageCase{ "Png", ".png", "rgb24" },
                                             VImageDamageCase{ "Tiff", ".tiff", "rgb24" } ),
                            []( const testing::TestParamInfo< VImageDamageCase >& i_rInfo )
                            { return i_rInfo.param.Label; } );
} // namespace
