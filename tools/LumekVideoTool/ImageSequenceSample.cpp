#include "tools/LumekVideoTool/ImageSequenceSample.h"

#include "fileio/ImageSequenceIO/SequenceDescriptor.h"
#include "fileio/ImageSequenceIO/SequenceNames.h"

#include <QImage>
#include <QImageWriter>

#include <boost/filesystem.hpp>

namespace fs = boost::filesystem;

namespace LumekVideoTool
{
  namespace
  {
    struct VImageFormatRow
    {
      ZOL::EVideoPayload Payload;
      const char* Extension;
      // As QImageWriter names its formats.
      const char* QtFormat;
      // Near-lossless: the sample is for looking at, and the reader's decoder is what it tests.
      int Quality;
    };

    constexpr VImageFormatRow s_ImageFormats[] = {
        { ZOL::VideoPayload_ImagePNG, ".png", "png", -1 },
        { ZOL::VideoPayload_ImageJPEG, ".jpg", "jpeg", 95 },
    };

    const VImageFormatRow* FindImageFormat( ZOL::EVideoPayload i_Payload )
    {
      for( const VImageFormatRow& rRow : s_ImageFormats )
        if( rRow.Payload == i_Payload )
          return &rRow;
      return nullptr;
    }

    bool WriteImage( const VRGBImage& i_rImage, const std::string& i_rPath, const VImageFormatRow& i_rFormat )
    {
      // QImage only wraps the pixels; the writer reads them before the image goes.
      const QImage Image( i_rImage.Pixels.data(), i_rImage.Width, i_rImage.Height, i_rImage.Width * 3,
                          QImage::Format_RGB888 );
      QImageWriter Writer( QString::fromStdString( i_rPath ), i_rFormat.QtFormat );
      Writer.setQuality( i_rFormat.Quality );
      return Writer.write( Image );
    }
  } // namespace

  bool WriteSampleImageSequence( const std::string& i_rPath, const VSampleOptions& i_rOptions, std::string& o_rError )
  {
    const VImageFormatRow* pFormat = FindImageFormat( i_rOptions.ImagePayload );
    if( pFormat == nullptr )
    {
      o_rError = "image sequence frames are PNG or JPEG";
      return false;
    }
    if( !QImageWriter::supportedImageFormats().contains( pFormat->QtFormat ) )
    {
      o_rError = std::string( "this Qt cannot write " ) + pFormat->QtFormat + " pictures (image format plugin missing)";
      return false;
    }

    const fs::path Descriptor( i_rPath );
    ImageSequenceIO::VDescriptor Sequence;
    Sequence.FrameInfo.ImageWidth = i_rOptions.Width;
    Sequence.FrameInfo.ImageHeight = i_rOptions.Height;
    Sequence.FrameInfo.PixelFormat = ZOL::PixelFormat_R8G8B8;
    Sequence.FrameInfo.PixelAspectRatio = 1.0;
    Sequence.FrameInfo.InterlacedFormat = ZOL::InterlacedFormat_NotInterlaced;
    Sequence.Timing = SampleTiming( i_rOptions.FramesPerSecond );
    Sequence.Timecode = SampleTimecode();
    Sequence.Attributes = SampleAttributes( i_rOptions );
    // The reader finds take.lumekimagesequence from take_%FRAME%.png as well, so either name opens it.
    Sequence.Sequence.FileNamePattern =
        Descriptor.stem().string() + "_" + ImageSequenceIO::FramePlaceholder + pFormat->Extension;
    Sequence.Sequence.FrameCount = static_cast< std::uint32_t >( i_rOptions.Frames );

    if( !ImageSequenceIO::WriteDescriptor( i_rPath, Sequence ) )
    {
      o_rError = "cannot write " + i_rPath;
      return false;
    }

    const fs::path Folder = Descriptor.parent_path();
    const ImageSequenceIO::VFileNameExpander Names(
        Sequence.Sequence.FileNamePattern, Sequence.Sequence.FrameIndexPadWidth, Sequence.Sequence.FrameNumberPadWidth,
        Sequence.Timecode, Sequence.Timing );
    VRGBImage Image( i_rOptions.Width, i_rOptions.Height );
    for( int Frame = 0; Frame < i_rOptions.Frames; ++Frame )
    {
      const std::string FramePath = ( Folder / Names.Expand( static_cast< std::uint64_t >( Frame ) ) ).string();
      if( IsSampleFrameLeftOut( Frame, i_rOptions.Frames ) )
      {
        // A file left from an earlier sample of the same name would fill the gap.
        boost::system::error_code Error;
        fs::remove( FramePath, Error );
        continue;
      }
      RenderSampleScene( Frame, i_rOptions.FramesPerSecond, Image );
      if( !WriteImage( Image, FramePath, *pFormat ) )
      {
        o_rError = "cannot write frame " + std::to_string( Frame ) + " to " + FramePath;
        return false;
      }
    }
    return true;
  }
} // namespace LumekVideoTool
