// Image sequences: descriptors, patterns and numbered runs against folders of small files, ffmpeg's
// images decoded as ffmpeg decodes them, and damaged descriptors and images survived. The files
// of a pattern hold their own names, so a frame read from the wrong file shows at once; numbered
// images are only headers, as the size is all the reader takes from them when it opens.

#include "fileio/ImageSequenceIO/ImageHeader.h"
#include "fileio/ImageSequenceIO/SequenceDescriptor.h"
#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/VideoReaders/CreateVideoReader.h"
#include "tests/fileio/ImageDecoders/ImageTestSupport.h"
#include "tests/support/FfmpegFixtures.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

#include <map>
#include <sstream>

using namespace LumekTest;
using ImageSequenceIO::VImageSequenceReader;

namespace
{
  // The words of a text: file names, frame numbers.
  std::vector< std::string > Words( const std::string& i_rText )
  {
    std::istringstream Stream( i_rText );
    return { std::istream_iterator< std::string >( Stream ), std::istream_iterator< std::string >() };
  }

  // A PNG signature and IHDR of a 40 x 30 RGB image, big-endian as PNG stores its numbers: all
  // a reader takes from an image to open.
  VBytes PngHeader()
  {
    return { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A, 0, 0, 0, 13, 'I', 'H', 'D', 'R', 0,
             0,    0,   40,  0,   0,    0,    30,   8,    2, 0, 0, 0,  0,   0,   0,   0 };
  }

  // A descriptor of a 48 x 32 sequence at 25 frames a second: pattern, pad widths, frame count.
  ImageSequenceIO::VDescriptor MakeDescriptor( const ImageSequenceIO::VSequenceInfo& i_rSequence )
  {
    ImageSequenceIO::VDescriptor Descriptor;
    Descriptor.FrameInfo = FrameInfo( 48, 32, ZOL::PixelFormat_R8G8B8 );
    Descriptor.FrameInfo.PixelAspectRatio = 1.0;
    Descriptor.Timing.FramePeriodInTicks = Descriptor.Timing.TicksPerSecond / 25;
    Descriptor.Sequence = i_rSequence;
    return Descriptor;
  }

  // The frames below i_Count that the reader says are on disk, as "0 1 3", expecting its index
  // to say the same of each.
  std::string StoredFrames( const VImageSequenceReader& i_rReader, std::uint64_t i_Count )
  {
    std::string Stored;
    std::uint64_t Count = 0;
    for( std::uint64_t i = 0; i < i_Count; ++i )
    {
      EXPECT_EQ( i_rReader.HasFrame( i ), i_rReader.FindStoredFrameAtOrAfter( i ) == i ) << "frame " << i;
      if( i_rReader.HasFrame( i ) )
        Stored += ( Count++ == 0 ? "" : " " ) + std::to_string( i );
    }
    EXPECT_EQ( Count, i_rReader.GetStoredFrameCount() );
    return Stored;
  }

  struct VPatternCase
  {
    const char* Name;
    const char* Pattern;
    std::uint32_t IndexPad, NumberPad, FrameCount;
    const char* Descriptor;
    const char* Opened; // what the user opens
    bool bOpens;
    const char* Files;
    const char* Stored; // the frames on disk
    std::uint64_t SampleIndex;
    const char* SampleName;
  };

  const VPatternCase s_Patterns[] = {
      { "FrameIndexPadded", "take_%FRAME%.jpg", 4, 8, 5, "take_", "take_%FRAME%.jpg", true,
        "take_0000.jpg take_0001.jpg take_0003.jpg take_0004.jpg take_0005.jpg take_003.jpg", "0 1 3 4", 3,
        "take_0003.jpg" },
      { "FrameNumberThroughDescriptor", "shot%FRAME_NUMBER%.png", 8, 3, 3, "shot", "shot.lumekimagesequence", true,
        "shot001.png shot002.png shot003.png shot000.png", "0 1 2", 2, "shot003.png" },
      { "UnderscoreDroppedSpelling", "take_%FRAME%.jpg", 2, 2, 2, "take", "take_%FRAME%.jpg", true,
        "take_00.jpg take_01.jpg", "0 1", 1, "take_01.jpg" },
      { "NoPlaceholderOneFileForAll", "still.png", 8, 8, 3, "still", "still.lumekimagesequence", true, "still.png",
        "0 1 2", 2, "still.png" },
      { "BothIndexPlaceholders", "a%FRAME%_b%FRAME_NUMBER%.jpeg", 2, 3, 6, "a_b", "a%FRAME%_b%FRAME_NUMBER%.jpeg", true,
        "a04_b005.jpeg a04_b004.jpeg a00_b001.jpeg", "0 4", 4, "a04_b005.jpeg" },
      // Frames at 60 Hz from 01:02:03:04 at 30 fps.
      { "TimecodeOnlyThroughDescriptor", "tc%TIMECODE%.jpg", 8, 8, 4, "tc", "tc.lumekimagesequence", true,
        "tc0102030400.jpg tc0102030450.jpg tc0102030550.jpg tc0102030425.jpg", "0 1 3", 1, "tc0102030450.jpg" },
      { "UpperCaseExtensionRefused", "IMG_%FRAME%.JPG", 8, 8, 1, "IMG_", "IMG_%FRAME%.JPG", false, "IMG_00000000.JPG",
        "", 0, "" },
      { "EmptyPatternRefused", "", 8, 8, 1, "x", "x.lumekimagesequence", false, "", "", 0, "" },
      { "NoDescriptorRefused", "take_%FRAME%.jpg", 8, 8, 1, "other", "take_%FRAME%.jpg", false, "take_00000000.jpg", "",
        0, "" },
  };

  TEST( SequencePattern, FindsAndReadsTheFramesThatExist )
  {
    for( const VPatternCase& rCase : s_Patterns )
    {
      SCOPED_TRACE( rCase.Name );
      VTempFolder Folder;
      ImageSequenceIO::VDescriptor Descriptor =
          MakeDescriptor( { rCase.Pattern, rCase.IndexPad, rCase.NumberPad, rCase.FrameCount } );
      // 01:02:03:04 at 30 fps, frames at 60 Hz: every other frame is half a timecode frame on.
      if( std::string( rCase.Pattern ).find( "%TIMECODE%" ) != std::string::npos )
      {
        Descriptor.Timecode = { ZOL::TimecodeStandard_30, 1, 2, 3, 4 };
        Descriptor.Timing.FramePeriodInTicks = Descriptor.Timing.TicksPerSecond / 60;
      }
      ASSERT_TRUE(
          WriteDescriptor( Folder / ( std::string( rCase.Descriptor ) + ".lumekimagesequence" ), Descriptor ) );
      for( const std::string& rFile : Words( rCase.Files ) )
        WriteFileBytes( Folder / rFile, rFile );
      const std::string Opened = Folder / rCase.Opened;
      // Names with a placeholder choose the sequence reader, whether or not they then open.
      if( Opened.find( "%FRAME" ) != std::string::npos )
      {
        const auto pReader = CreateVideoReader( Opened );
        ASSERT_TRUE( dynamic_cast< VImageSequenceReader* >( pReader.get() ) );
        EXPECT_EQ( rCase.bOpens, pReader->Open( Opened ) );
      }
      VImageSequenceReader Reader;
      ASSERT_EQ( rCase.bOpens, Reader.Open( Opened ) );
      if( !rCase.bOpens )
        continue;
      EXPECT_EQ( rCase.FrameCount, Reader.GetFrameCount() );
      EXPECT_EQ( Folder / rCase.SampleName, Reader.ExpandFileName( rCase.SampleIndex ) );
      EXPECT_EQ( rCase.Stored, StoredFrames( Reader, rCase.FrameCount ) );
      for( std::uint64_t i = 0; i < rCase.FrameCount; ++i )
      {
        std::shared_ptr< ZOL::IBuffer > pVideo;
        ZOL::IAudioBuffers Audio;
        VLogCapture Log( "ImageSequenceIO" );
        const bool bRead = Reader.ReadFrameData( i, pVideo, Audio, true, true );
        ASSERT_EQ( Reader.HasFrame( i ), bRead ) << i;
        const std::string Name = Reader.ExpandFileName( i ).substr( Folder.Path().size() + 1 );
        if( bRead )
          EXPECT_TRUE( Bytes( pVideo ) == VBytes( Name.begin(), Name.end() ) && Audio.empty() ) << Name;
        else
          EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Could not determine file size for file " +
                                                              Reader.ExpandFileName( i ) + "." } );
      }
    }
  }

  // A count of four billion is answered from the folder's listing, not by looking for each file; the
  // all-ones index is no frame.
  TEST( SequencePattern, ExtremeIndices )
  {
    VTempFolder Folder;
    ASSERT_TRUE(
        WriteDescriptor( Folder / "g.lumekimagesequence", MakeDescriptor( { "g%FRAME%.png", 1, 8, 4000000000u } ) ) );
    WriteFileBytes( Folder / "g5.png", "g5.png" );
    WriteFileBytes( Folder / "g3999999998.png", "g3999999998.png" );
    WriteFileBytes( Folder / "g4000000000.png", "beyond the count" );
    VImageSequenceReader Reader;
    ASSERT_TRUE( Reader.Open( Folder / "g.lumekimagesequence" ) );
    using VFound = std::optional< std::uint64_t >;
    EXPECT_EQ( std::tuple( Reader.GetStoredFrameCount(), Reader.FindStoredFrameAtOrBefore( 4 ),
                           Reader.FindStoredFrameAtOrBefore( 3999999997u ), Reader.FindStoredFrameAtOrAfter( 6 ),
                           Reader.FindStoredFrameAtOrAfter( 3999999999u ) ),
               std::tuple( 2u, VFound(), VFound( 5 ), VFound( 3999999998u ), VFound() ) );

    VLogCapture Log( "ImageSequenceIO" );
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    EXPECT_FALSE( Reader.ReadFrameData( ~std::uint64_t( 0 ), pVideo, Audio, true, false ) );
    EXPECT_EQ( Log.Messages, std::vector< std::string >{ "Frame index must be set." } );
    // Nothing asked, nothing read, and no failure.
    EXPECT_TRUE( Reader.ReadFrameData( ~std::uint64_t( 0 ), pVideo, Audio, false, true ) );
  }

  // Opening one numbered image opens the run of files it belongs to.
  TEST( NumberedRun, OpensTheWholeRun )
  {
    struct VCase
    {
      const char* Name;
      const char* Files;
      const char* Opened;
      std::uint64_t FrameCount;
      const char* FirstFile;
      const char* Stored;
      std::uint32_t PadWidth;
    };
    const VCase Cases[] = {
        { "MiddleOfPaddedRunWithGap",
          "take_000100.png take_000101.png take_000102.png take_000104.png take_000105.png take_00099.png "
          "other_000050.png take_000106.jpg",
          "take_000102.png", 6, "take_000100.png", "0 1 2 4 5", 6 },
        { "UnpaddedRun", "n9.png n10.png n11.png n011.png", "n10.png", 3, "n9.png", "0 1 2", 1 },
        { "DigitsNearestTheEnd", "cam2_take7_0001.png cam2_take7_0003.png cam3_take7_0002.png", "cam2_take7_0003.png",
          3, "cam2_take7_0001.png", "0 2", 4 },
        { "NoDigitsOneFrame", "still.png still2.png", "still.png", 1, "still.png", "0", 8 },
    };
    for( const VCase& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VTempFolder Folder;
      for( const std::string& rFile : Words( rCase.Files ) )
        WriteFileBytes( Folder / rFile, PngHeader() );
      const auto pReader = CreateVideoReader( Folder / rCase.Opened );
      auto* pSequence = dynamic_cast< VImageSequenceReader* >( pReader.get() );
      ASSERT_TRUE( pSequence );
      ASSERT_TRUE( pSequence->Open( Folder / rCase.Opened ) );
      EXPECT_EQ( rCase.FrameCount, pSequence->GetFrameCount() );
      EXPECT_EQ( Folder / rCase.FirstFile, pSequence->ExpandFileName( 0 ) );
      EXPECT_EQ( rCase.PadWidth, pSequence->GetSequenceInfo().FrameIndexPadWidth );
      const ZOL::IVideoFrameInfo& rInfo = pSequence->GetVideoFrameInfo();
      EXPECT_EQ( std::tuple( rInfo.ImageWidth, rInfo.ImageHeight, rInfo.PixelFormat, pSequence->GetVideoPayload(),
                             pSequence->GetVideoTiming().GetFrameRate() ),
                 std::tuple( 40, 30, ZOL::PixelFormat_R8G8B8, ZOL::VideoPayload_ImagePNG, 30.0 ) );
      EXPECT_EQ( rCase.Stored, StoredFrames( *pSequence, rCase.FrameCount ) );
    }

    // An image without a readable size, or none at all, opens nothing.
    VTempFolder Folder;
    WriteFileBytes( Folder / "bad_01.png", "not a png" );
    VImageSequenceReader Reader;
    for( const std::string& rPath :
         { Folder / "bad_01.png", Folder / "absent_01.png", std::string( "/no/such/x_01.png" ) } )
      EXPECT_FALSE( Reader.Open( rPath ) ) << rPath;
  }

  TEST( NumberedRun, ADescriptorBesideTheRunIsUsedWhenItDescribesTheRun )
  {
    VTempFolder Folder;
    for( const char* pFile : { "shot_0001.png", "shot_0002.png", "shot_0004.png" } )
      WriteFileBytes( Folder / pFile, PngHeader() );
    ASSERT_TRUE( WriteDescriptor( Folder / "shot.lumekimagesequence",
                                  MakeDescriptor( { "shot_%FRAME_NUMBER%.png", 8, 4, 10 } ) ) );
    VImageSequenceReader Reader;
    ASSERT_TRUE( Reader.Open( Folder / "shot_0002.png" ) );
    EXPECT_EQ( std::tuple( Reader.GetDescriptorPath(), Reader.GetFrameCount(), Reader.GetVideoFrameInfo().ImageWidth,
                           Reader.GetVideoTiming().GetFrameRate(), Reader.GetStoredFrameCount() ),
               std::tuple( Folder / "shot.lumekimagesequence", 10u, 48, 25.0, 3u ) );

    // A descriptor of other files is not the run's.
    ASSERT_TRUE(
        WriteDescriptor( Folder / "shot.lumekimagesequence", MakeDescriptor( { "shot_%FRAME%.jpg", 8, 8, 10 } ) ) );
    ASSERT_TRUE( Reader.Open( Folder / "shot_0002.png" ) );
    EXPECT_EQ( std::tuple( Reader.GetDescriptorPath(), Reader.GetFrameCount(), Reader.GetVideoFrameInfo().ImageWidth ),
               std::tuple( "", 4u, 40 ) );
  }

  TEST( ImageHeader, ReadsTheStatedSizeAndSurvivesEveryCut )
  {
    // SOI, an APP0 of 4 bytes, fill bytes, then SOF2 (progressive) of 0x123 x 0x45; and a scan
    // before any frame header.
    const VBytes Jpeg = { 0xFF, 0xD8, 0xFF, 0xE0, 0,    4,    1,    2, 0xFF, 0xFF, 0xC2,
                          0,    11,   8,    0,    0x45, 0x01, 0x23, 1, 1,    0x11, 0 };
    const VBytes JpegScanFirst = { 0xFF, 0xD8, 0xFF, 0xDA, 0, 2, 0xFF, 0xC0, 0, 11, 8, 0, 1, 0, 1, 1, 1, 0x11, 0 };
    // A big-endian TIFF of 7 x 5, and one whose directory is beyond the end.
    const VBytes TiffBig = { 'M', 'M',  0,    0x2A, 0, 0,    0,    8, 0, 2, 0x01, 0x00, 0, 3, 0, 0, 0,
                             1,   0x00, 0x07, 0,    0, 0x01, 0x01, 0, 4, 0, 0,    0,    1, 0, 0, 0, 0x05 };
    const VBytes TiffAway = { 'I', 'I', 0x2A, 0, 0xFF, 0xFF, 0xFF, 0xFF };
    // The payload, the header and the size it states ("" when it states none).
    const std::tuple< ZOL::EVideoPayload, VBytes, std::string > Cases[] = {
        { ZOL::VideoPayload_ImagePNG, PngHeader(), "40x30" },
        { ZOL::VideoPayload_ImageJPEG, Jpeg, "291x69" },
        { ZOL::VideoPayload_ImageJPEG, JpegScanFirst, "" },
        { ZOL::VideoPayload_ImageTIFF, TiffBig, "7x5" },
        { ZOL::VideoPayload_ImageTIFF, TiffAway, "" } };
    for( const auto& [Payload, rBytes, rSize] : Cases )
    {
      const auto Size = ImageSequenceIO::ReadImageSize( Payload, rBytes.data(), rBytes.size() );
      EXPECT_EQ( Size ? std::to_string( Size->Width ) + "x" + std::to_string( Size->Height ) : "", rSize );
      // Every cut of the header fails or reads nothing beyond its end.
      for( std::size_t Cut = 0; Cut < rBytes.size(); ++Cut )
        (void)ImageSequenceIO::ReadImageSize( Payload, VBytes( rBytes.begin(), rBytes.begin() + Cut ).data(), Cut );
    }
  }

  std::string MakeImage( const std::string& i_rName, const char* i_pPixelFormat, const std::string& i_rSize,
                         std::uint64_t i_Frame = 0 )
  {
    const std::string Path = FfmpegFixture(
        i_rName, { "-f", "lavfi", "-i", "testsrc2=size=" + i_rSize + ":rate=25:duration=1", "-vf",
                   "trim=start_frame=" + std::to_string( i_Frame ), "-frames:v", "1", "-pix_fmt", i_pPixelFormat } );
    EXPECT_FALSE( Path.empty() ) << i_rName;
    return Path;
  }

  // Through the pattern. Opening through a middle image, with or without a descriptor beside it,
  // only finds the same files: the numbered-run tests hold those paths with headers alone. Each
  // payload once; the JPEG reader's tests hold the ways of chroma.
  TEST( SequenceImages, DecodeAsFfmpegDoes )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    // JPEG decoders may round and upsample chroma their own way; lossless files match exactly.
    // Grey images stay grey; everything else decodes to colour.
    for( const auto& [pExtension, pStored, MaxDifference] :
         { std::tuple( ".jpeg", "yuvj420p", 48 ), std::tuple( ".png", "gray", 0 ), std::tuple( ".tif", "rgb24", 0 ) } )
    {
      SCOPED_TRACE( pExtension );
      const bool bGrey = std::string( pStored ) == "gray";
      VTempFolder Folder;
      const std::string Pattern = std::string( "take_%FRAME%" ) + pExtension;
      ImageSequenceIO::VDescriptor Descriptor = MakeDescriptor( { Pattern, 4, 8, 3 } );
      Descriptor.Timecode = { ZOL::TimecodeStandard_25, 10 };
      ASSERT_TRUE( WriteDescriptor( Folder / "take_.lumekimagesequence", Descriptor ) );
      // Frame 1 is left out: a missing frame.
      std::map< std::uint64_t, VBytes > Expected;
      for( const std::uint64_t Frame : { 0, 2 } )
      {
        const std::string Suffix = std::to_string( Frame ) + pExtension;
        const std::string Fixture = MakeImage( std::string( "sequence-" ) + pStored + Suffix, pStored, "48x32", Frame );
        WriteFileBytes( Folder / ( "take_000" + Suffix ), ReadFileBytes( Fixture ) );
        Expected[Frame] = FfmpegDecode( Fixture, bGrey ? "gray" : "rgb24" );
        ASSERT_FALSE( Expected[Frame].empty() );
      }
      const auto pReader = CreateVideoReader( Folder / Pattern );
      ASSERT_TRUE( pReader && pReader->Open( Folder / Pattern ) );
      EXPECT_EQ( 3u, pReader->GetFrameCount() );
      EXPECT_EQ( 10, pReader->GetTimecode().Hours );
      EXPECT_DOUBLE_EQ( 25.0, pReader->GetVideoTiming().GetFrameRate() );
      for( const auto& [Frame, rExpected] : Expected )
      {
        ZOL::IVideoFrame Decoded;
        ASSERT_TRUE( pReader->ReadFrame( Frame, Decoded, true, true ) ) << Frame;
        const ZOL::IVideoFrameInfo& rInfo = Decoded.VideoFrameInfo;
        ASSERT_EQ( std::tie( rInfo.PixelFormat, rInfo.ImageWidth, rInfo.ImageHeight ),
                   std::tuple( bGrey ? ZOL::PixelFormat_Luminance8 : ZOL::PixelFormat_R8G8B8, 48, 32 ) );
        // The frame's buffer is sized for colour before the image says it is grey: the pixels
        // are at its start.
        ASSERT_LE( rExpected.size(), Decoded.Video->GetSize() );
        EXPECT_TRUE( Near( rExpected, *Decoded.Video, MaxDifference, MaxDifference / 24.0 ) ) << "frame " << Frame;
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
      WriteFileBytes( Folder / pName, std::string( "\x89PNG\r\n\x1a\n not really" ) );
    const VLogCapture Quiet;
    for( const char* pPattern : { "t_%FRAME%.png", "t_%TIMECODE%.png" } )
    {
      SCOPED_TRACE( pPattern );
      ImageSequenceIO::VDescriptor Descriptor = MakeDescriptor( { pPattern, 2, 2, 3 } );
      if( std::string( pPattern ).find( "%TIMECODE%" ) != std::string::npos )
        Descriptor.Timecode = { ZOL::TimecodeStandard_30, 1 };
      ZOL::IVideoAttributes FrameKeys, Attributes;
      ASSERT_TRUE( ImageSequenceIO::MakeDescriptorStores( Descriptor, FrameKeys, Attributes ) );
      UtilsIO::VMemoryStream Stream;
      ASSERT_TRUE( FrameKeys.WriteTo( Stream ) && Attributes.WriteTo( Stream ) );
      const VBytes Bytes = Stream.GetData();
      VImageSequenceReader Reader;
      for( std::size_t Position = 0; Position <= Bytes.size(); ++Position )
        for( const std::uint8_t Flip : { 0x00, 0x01, 0x80, 0xFF } )
        {
          const VBytes Changed = Damaged( Bytes, Position, Flip );
          UtilsIO::VMemoryInputStream Input( Changed.data(), Changed.size() );
          if( Reader.Open( Folder.Path(), Input ) )
            ReadAll( Reader );
        }
      // The same through a file: a cut descriptor on disk.
      WriteFileBytes( Folder / "t.lumekimagesequence", VBytes( Bytes.begin(), Bytes.begin() + Bytes.size() / 2 ) );
      EXPECT_FALSE( Reader.Open( Folder / "t.lumekimagesequence" ) );
    }
  }

  TEST( SequenceDamage, EveryCutAndFlipOfAnImageIsSurvived )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const VLogCapture Quiet;
    VTempFolder Folder;
    for( const auto& [pExtension, pPixelFormat] :
         { std::pair( ".jpg", "yuvj420p" ), std::pair( ".png", "rgb24" ), std::pair( ".tiff", "rgb24" ) } )
    {
      SCOPED_TRACE( pExtension );
      const VBytes Image = ReadFileBytes( MakeImage( std::string( "damaged" ) + pExtension, pPixelFormat, "24x16" ) );
      ASSERT_FALSE( Image.empty() );
      const std::string Name = Folder / ( std::string( "d_0" ) + pExtension );
      // Steps that reach every part of a small file without a run per byte.
      const std::size_t Step = std::max< std::size_t >( 1, Image.size() / 97 );
      VImageSequenceReader Reader;
      for( std::size_t Position = 0; Position <= Image.size(); Position += Step )
        for( const std::uint8_t Flip : { 0x00, 0xA5 } )
          if( WriteFileBytes( Name, Damaged( Image, Position, Flip ) ) && Reader.Open( Name ) )
            ReadAll( Reader );
    }
  }
} // namespace
