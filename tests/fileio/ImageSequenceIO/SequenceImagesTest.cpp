// Real image sequences made by ffmpeg, described by the project's own descriptor writer, read
// and decoded by the reader and compared with ffmpeg's decode of the same files; and damaged
// descriptors and images, cut and flipped at many points, which the reader answers false or
// reads as far as it can, never crashing, hanging or allocating without bound.

#include "fileio/VideoReaders/CreateVideoReader.h"
#include "tests/fileio/ImageSequenceIO/SequenceTestSupport.h"
#include "tests/support/FfmpegFixtures.h"
#include "tests/support/LogCapture.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <map>

using namespace ImageSequenceTest;
using ImageSequenceIO::VImageSequenceReader;

namespace
{
  std::string MakeImage( const std::string& i_rName, const char* i_pPixelFormat, const std::string& i_rSize,
                         std::uint64_t i_Frame = 0 )
  {
    const std::string Path = LumekTest::FfmpegFixture(
        i_rName, { "-f", "lavfi", "-i", "testsrc2=size=" + i_rSize + ":rate=25:duration=1", "-vf",
                   "trim=start_frame=" + std::to_string( i_Frame ), "-frames:v", "1", "-pix_fmt", i_pPixelFormat } );
    EXPECT_FALSE( Path.empty() ) << i_rName;
    return Path;
  }

  struct VImageCase
  {
    const char* Name;
    const char* Extension;
    const char* FfmpegPixelFormat;
    // JPEG decoders may round and upsample chroma their own way; lossless files match exactly.
    int MaxDifference;
    double MaxMeanDifference;
    // Grey images stay grey; everything else decodes to colour.
    ZOL::EPixelFormat Decoded = ZOL::PixelFormat_R8G8B8;
    const char* FfmpegDecodeFormat = "rgb24";
  };

  // Chroma subsampling is the JPEG reader's own matter, tested there.
  const VImageCase s_Images[] = {
      { "Jpeg420", ".jpeg", "yuvj420p", 48, 2.0 },
      { "PngRgb", ".png", "rgb24", 0, 0.0 },
      { "PngGrey", ".png", "gray", 0, 0.0, ZOL::PixelFormat_Luminance8, "gray" },
      { "Tiff", ".tif", "rgb24", 0, 0.0 },
  };

  // Through the pattern. Opening through a middle image, with or without a descriptor beside it,
  // only finds the same files: the numbered-run tests hold those paths with headers alone.
  TEST( SequenceImages, DecodeAsFfmpegDoes )
  {
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    for( const VImageCase& rCase : s_Images )
    {
      SCOPED_TRACE( rCase.Name );
      VTempFolder Folder;
      const std::string Pattern = std::string( "take_%FRAME%" ) + rCase.Extension;
      ImageSequenceIO::VDescriptor Descriptor = MakeDescriptor( Pattern, 4, 4 );
      Descriptor.Timecode.Standards = ZOL::TimecodeStandard_25;
      Descriptor.Timecode.Hours = 10;
      ASSERT_TRUE( WriteDescriptor( Folder / "take_.lumekimagesequence", Descriptor ) );
      // Frame 1 is left out: a missing frame.
      std::map< std::uint64_t, VBytes > Expected;
      for( const std::uint64_t Frame : { 0, 2, 3 } )
      {
        const std::string Suffix = std::to_string( Frame ) + rCase.Extension;
        const std::string Fixture = MakeImage( std::string( "sequence-" ) + rCase.Name + "-" + Suffix,
                                               rCase.FfmpegPixelFormat, "48x32", Frame );
        WriteWholeFile( Folder / ( "take_000" + Suffix ), ReadWholeFile( Fixture ) );
        Expected[Frame] = LumekTest::FfmpegDecode( Fixture, rCase.FfmpegDecodeFormat );
        ASSERT_FALSE( Expected[Frame].empty() );
      }
      const auto pReader = CreateVideoReader( Folder / Pattern );
      ASSERT_TRUE( pReader && pReader->Open( Folder / Pattern ) );
      EXPECT_EQ( 4u, pReader->GetFrameCount() );
      EXPECT_EQ( 10, pReader->GetTimecode().Hours );
      EXPECT_DOUBLE_EQ( 25.0, pReader->GetVideoTiming().GetFrameRate() );
      for( const auto& [Frame, rExpected] : Expected )
      {
        ZOL::IVideoFrame Decoded;
        ASSERT_TRUE( pReader->ReadFrame( Frame, Decoded, true, true ) ) << Frame;
        const ZOL::IVideoFrameInfo& rInfo = Decoded.VideoFrameInfo;
        ASSERT_EQ( std::tie( rInfo.PixelFormat, rInfo.ImageWidth, rInfo.ImageHeight ),
                   std::tuple( rCase.Decoded, 48, 32 ) );
        // The frame's buffer is sized for colour before the image says it is grey: the pixels
        // are at its start.
        ASSERT_LE( rExpected.size(), Decoded.Video->GetSize() );
        const VDifference Distance = Difference( rExpected, *Decoded.Video );
        EXPECT_LE( Distance.Largest, rCase.MaxDifference ) << "frame " << Frame;
        EXPECT_LE( Distance.Mean, rCase.MaxMeanDifference ) << "frame " << Frame;
      }
      ZOL::IVideoFrame Missing;
      EXPECT_FALSE( pReader->ReadFrame( 1, Missing, true, false ) );
    }
  }

  // Reads every frame the way the viewer does; the result does not matter, surviving does.
  void ReadAll( VImageSequenceReader& io_rReader )
  {
    for( std::uint64_t i = 0; i < std::min< std::uint64_t >( io_rReader.GetFrameCount(), 8 ); ++i )
    {
      (void)io_rReader.HasFrame( i );
      ZOL::IVideoFrame Frame;
      (void)io_rReader.ReadFrame( i, Frame, true, true );
    }
    (void)io_rReader.GetStoredFrameCount();
    (void)io_rReader.FindStoredFrameAtOrBefore( ~std::uint64_t( 0 ) );
  }

  TEST( SequenceDamage, EveryCutAndFlipOfADescriptorIsSurvived )
  {
    VTempFolder Folder;
    for( const char* pName : { "t_00.png", "t_01.png", "t_0102030400.png" } )
      WriteWholeFile( Folder / pName, std::string( "\x89PNG\r\n\x1a\n not really" ) );
    const LumekTest::VLogCapture Quiet;
    for( const char* pPattern : { "t_%FRAME%.png", "t_%TIMECODE%.png" } )
    {
      SCOPED_TRACE( pPattern );
      ImageSequenceIO::VDescriptor Descriptor = MakeDescriptor( pPattern, 3, 2, 2 );
      if( std::string( pPattern ).find( "%TIMECODE%" ) != std::string::npos )
      {
        Descriptor.Timecode.Standards = ZOL::TimecodeStandard_30;
        Descriptor.Timecode.Hours = 1;
      }
      ZOL::IVideoAttributes FrameKeys, Attributes;
      ASSERT_TRUE( ImageSequenceIO::MakeDescriptorStores( Descriptor, FrameKeys, Attributes ) );
      UtilsIO::VMemoryStream Stream;
      ASSERT_TRUE( FrameKeys.WriteTo( Stream ) && Attributes.WriteTo( Stream ) );
      const VBytes Bytes = Stream.GetData();
      VImageSequenceReader Reader;
      for( std::size_t Position = 0; Position <= Bytes.size(); ++Position )
        for( const std::uint8_t Flip : { 0x00, 0x01, 0x80, 0xFF } )
        {
          // A flip of nothing is the cut at this position.
          VBytes Damaged( Bytes.begin(),
                          Flip ? Bytes.end() : Bytes.begin() + static_cast< std::ptrdiff_t >( Position ) );
          if( Flip && Position == Bytes.size() )
            continue;
          if( Flip )
            Damaged[Position] ^= Flip;
          UtilsIO::VMemoryInputStream Input( Damaged.data(), Damaged.size() );
          if( Reader.Open( Folder.Path(), Input ) )
            ReadAll( Reader );
        }
      // The same through a file: a cut descriptor on disk.
      WriteWholeFile( Folder / "t.lumekimagesequence", VBytes( Bytes.begin(), Bytes.begin() + Bytes.size() / 2 ) );
      EXPECT_FALSE( Reader.Open( Folder / "t.lumekimagesequence" ) );
    }
  }

  TEST( SequenceDamage, EveryCutAndFlipOfAnImageIsSurvived )
  {
    if( !LumekTest::HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const LumekTest::VLogCapture Quiet;
    VTempFolder Folder;
    for( const auto& [pExtension, pPixelFormat] :
         { std::pair( ".jpg", "yuvj420p" ), std::pair( ".png", "rgb24" ), std::pair( ".tiff", "rgb24" ) } )
    {
      SCOPED_TRACE( pExtension );
      const VBytes Image = ReadWholeFile( MakeImage( std::string( "damaged" ) + pExtension, pPixelFormat, "24x16" ) );
      ASSERT_FALSE( Image.empty() );
      const std::string Name = Folder / ( std::string( "d_0" ) + pExtension );
      // Steps that reach every part of a small file without a run per byte.
      const std::size_t Step = std::max< std::size_t >( 1, Image.size() / 97 );
      VImageSequenceReader Reader;
      for( std::size_t Position = 0; Position <= Image.size(); Position += Step )
        for( const bool bFlip : { false, true } )
        {
          VBytes Damaged( Image.begin(),
                          bFlip ? Image.end() : Image.begin() + static_cast< std::ptrdiff_t >( Position ) );
          if( bFlip && Position == Image.size() )
            continue;
          if( bFlip )
            Damaged[Position] ^= 0xA5;
          WriteWholeFile( Name, Damaged );
          if( Reader.Open( Name ) )
            ReadAll( Reader );
        }
    }
  }
} // namespace
