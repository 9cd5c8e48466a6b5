#include "tools/LumekVideoTool/ToolCommon.h"

#include <QImage>

#include <algorithm>
#include <cmath>

namespace po = boost::program_options;

namespace LumekVideoTool
{
  namespace
  {
    // A file manager asks for a preview of every file it lists: a damaged recording must not keep
    // it waiting while frame after frame fails.
    constexpr int s_MaximumFramesTried = 32;
    constexpr int s_LargestSize = 4096;

    // The first frame that reads and converts, as upright RGB.
    std::optional< QImage > FirstShownFrame( LumekVideoViewer::VVideoSource& io_rSource )
    {
      std::vector< std::uint8_t > RGB;
      auto Index = io_rSource.FindFrameAtOrAfter( 0 );
      for( int Tried = 0; Index && Tried < s_MaximumFramesTried; ++Tried )
      {
        ZOL::IVideoFrame Frame;
        if( !io_rSource.GetFrame( *Index, Frame ) || !ToDisplayRGB( io_rSource.GetVideoSettings(), Frame, RGB ) )
        {
          Index = *Index == UINT64_MAX ? std::nullopt : io_rSource.FindFrameAtOrAfter( *Index + 1 );
          continue;
        }
        const ZOL::IVideoFrameInfo& rInfo = Frame.VideoFrameInfo;
        // copy(): the picture outlives the conversion buffer.
        return QImage( RGB.data(), rInfo.ImageWidth, rInfo.ImageHeight, rInfo.ImageWidth * 3, QImage::Format_RGB888 )
            .copy();
      }
      return std::nullopt;
    }

    // The viewer draws an image pixel over as many sensor pixels as the frame states, so a binned
    // frame keeps the sensor's shape.
    QSize ShownSize( const ZOL::IVideoFrameInfo& i_rInfo )
    {
      const double Width = double( i_rInfo.ImageWidth ) * std::max< double >( 1.0, i_rInfo.SensorPixelsPerImagePixelX );
      const double Height =
          double( i_rInfo.ImageHeight ) * std::max< double >( 1.0, i_rInfo.SensorPixelsPerImagePixelY );
      return QSize( int( std::min( Width, 1e9 ) ), int( std::min( Height, 1e9 ) ) );
    }

    // Fits the shown shape into Size x Size; a thumbnail is never larger than the picture shown.
    QSize ThumbnailSize( const QSize& i_rShown, int i_Size )
    {
      const int Longest = std::max( i_rShown.width(), i_rShown.height() );
      const double Scale = std::min( 1.0, double( i_Size ) / Longest );
      return QSize( std::max( 1, int( std::lround( i_rShown.width() * Scale ) ) ),
                    std::max( 1, int( std::lround( i_rShown.height() * Scale ) ) ) );
    }
  } // namespace

  int RunThumbnail( const VArguments& i_rArguments, std::ostream& /*o_rOut*/, std::ostream& o_rErr )
  {
    po::options_description Options;
    Options.add_options()( "input", po::value< std::string >()->required() )(
        "output", po::value< std::string >()->required() )( "size", po::value< int >()->default_value( 256 ) );
    po::positional_options_description Positional;
    Positional.add( "input", 1 ).add( "output", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "thumbnail", o_rErr );
    if( !Variables )
      return Exit_Usage;
    const std::string Input = ( *Variables )["input"].as< std::string >();
    const std::string Output = ( *Variables )["output"].as< std::string >();
    const int Size = ( *Variables )["size"].as< int >();
    if( Size <= 0 || Size > s_LargestSize )
    {
      o_rErr << "lumekvideotool thumbnail: --size must be between 1 and " << s_LargestSize << "\n\n" << UsageText();
      return Exit_Usage;
    }

    LumekVideoViewer::VVideoSource Source;
    if( !OpenSource( Source, Input, o_rErr ) )
      return Exit_CannotOpen;
    const std::optional< QImage > Picture = FirstShownFrame( Source );
    if( !Picture )
    {
      o_rErr << "No frame of " << Input << " could be read or decoded." << std::endl;
      return Exit_FramesFailed;
    }
    const QSize Target = ThumbnailSize( ShownSize( Source.GetVideoFrameInfo() ), Size );
    const QImage Thumbnail = Target == Picture->size()
                                 ? *Picture
                                 : Picture->scaled( Target, Qt::IgnoreAspectRatio, Qt::SmoothTransformation );
    if( !Thumbnail.save( QString::fromStdString( Output ), "PNG" ) )
    {
      o_rErr << "Cannot write " << Output << std::endl;
      return Exit_CannotOpen;
    }
    return Exit_Success;
  }
} // namespace LumekVideoTool
