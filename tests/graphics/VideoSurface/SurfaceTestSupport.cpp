#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include <QTest>

#include <algorithm>
#include <cmath>
#include <random>

namespace SurfaceTest
{
  namespace
  {
    ZOL::IVideoFrame MakeFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height )
    {
      ZOL::IVideoFrame Frame;
      Frame.VideoFrameInfo.ImageWidth = i_Width;
      Frame.VideoFrameInfo.ImageHeight = i_Height;
      Frame.VideoFrameInfo.PixelFormat = i_Format;
      Frame.VideoFrameInfo.PixelAspectRatio = 1.0;
      auto pBuffer = std::make_shared< ZOL::IStandardBuffer >();
      pBuffer->Resize( ZOL::GetVideoFrameSizeInBytes64( Frame.VideoFrameInfo ) );
      Frame.Video = pBuffer;
      return Frame;
    }

    int Clamp8( double i_Value )
    {
      return int( std::lround( std::clamp( i_Value, 0.0, 255.0 ) ) );
    }

    // The colours of the mosaic's 2 by 2 tile, row by row; BayerGB8 for its packed forms too.
    const char* BayerTile( ZOL::EPixelFormat i_Format )
    {
      return i_Format == ZOL::PixelFormat_BayerRG8   ? "RGGB"
             : i_Format == ZOL::PixelFormat_BayerGR8 ? "GRBG"
             : i_Format == ZOL::PixelFormat_BayerBG8 ? "BGGR"
                                                     : "GBRG";
    }

    std::vector< std::uint8_t > Convert( const ZOL::IVideoFrame& i_rFrame, ZOL::EPixelFormat i_To, int i_Bytes )
    {
      const ZOL::IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
      std::vector< std::uint8_t > Result( std::size_t( rInfo.ImageWidth ) * rInfo.ImageHeight * i_Bytes );
      EXPECT_TRUE( CoreVideoUtils::ConvertFrame( rInfo.ImageWidth, rInfo.ImageHeight, rInfo.PixelFormat,
                                                 i_rFrame.Video->GetData(), i_rFrame.Video->GetSize(), i_To,
                                                 Result.data(), Result.size() ) )
          << "format " << rInfo.PixelFormat << " to " << i_To;
      return Result;
    }
  } // namespace

  ZOL::IVideoFrame RandomFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height, std::uint32_t i_Seed,
                                int i_Fill )
  {
    ZOL::IVideoFrame Frame = MakeFrame( i_Format, i_Width, i_Height );
    std::mt19937 Random( i_Seed );
    std::uint8_t* p = Frame.Video->GetData();
    for( std::uint64_t i = 0; i < Frame.Video->GetSize(); ++i )
      p[i] = std::uint8_t( i_Fill >= 0 ? i_Fill : Random() >> 24 );
    return Frame;
  }

  ZOL::IVideoFrame SmoothBayerFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height )
  {
    ZOL::IVideoFrame Frame = MakeFrame( i_Format, i_Width, i_Height );
    const char* pTile = BayerTile( i_Format );
    for( int y = 0; y < i_Height; ++y )
      for( int x = 0; x < i_Width; ++x )
      {
        const double Channels[3] = { 128 + 60 * std::sin( x / 9.0 ) * std::cos( y / 11.0 ), 100 + x * 2.0 + y,
                                     150 - 50 * std::cos( ( x + y ) / 13.0 ) };
        const char Site = pTile[( y & 1 ) * 2 + ( x & 1 )];
        Frame.Video->GetData()[y * i_Width + x] = std::uint8_t( Clamp8( Channels[Site == 'R'   ? 0
                                                                                 : Site == 'G' ? 1
                                                                                               : 2] ) );
      }
    return Frame;
  }

  QImage ProcessorPicture( const ZOL::IVideoFrame& i_rFrame )
  {
    const ZOL::IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
    const bool bFourBytes = rInfo.PixelFormat == ZOL::PixelFormat_PlanarY8U8V8;
    const std::vector< std::uint8_t > Bytes =
        Convert( i_rFrame, bFourBytes ? ZOL::PixelFormat_R8G8B8u8 : ZOL::PixelFormat_R8G8B8, bFourBytes ? 4 : 3 );
    return QImage( Bytes.data(), rInfo.ImageWidth, rInfo.ImageHeight, rInfo.ImageWidth * ( bFourBytes ? 4 : 3 ),
                   bFourBytes ? QImage::Format_RGBX8888 : QImage::Format_RGB888 )
        .convertToFormat( QImage::Format_RGB32 );
  }

  QImage MalvarPicture( const ZOL::IVideoFrame& i_rFrame, float i_Gamma, float i_Saturation )
  {
    const int W = i_rFrame.VideoFrameInfo.ImageWidth;
    const int H = i_rFrame.VideoFrameInfo.ImageHeight;
    const ZOL::EPixelFormat Format = i_rFrame.VideoFrameInfo.PixelFormat;
    const bool bPacked = Format == ZOL::PixelFormat_BayerGB7 || Format == ZOL::PixelFormat_BayerGB6;
    const std::vector< std::uint8_t > Mosaic =
        bPacked ? Convert( i_rFrame, ZOL::PixelFormat_BayerGB8, 1 )
                : std::vector< std::uint8_t >( i_rFrame.Video->GetData(), i_rFrame.Video->GetData() + W * H );
    // Where red sits in the tile.
    const int Red = int( std::string( BayerTile( Format ) ).find( 'R' ) );
    auto P = [&]( int x, int y ) { return Mosaic[std::clamp( y, 0, H - 1 ) * W + std::clamp( x, 0, W - 1 )] / 255.0; };
    QImage Picture( W, H, QImage::Format_RGB32 );
    for( int y = 0; y < H; ++y )
      for( int x = 0; x < W; ++x )
      {
        const double C = P( x, y );
        const double Diagonal = P( x - 1, y - 1 ) + P( x + 1, y - 1 ) + P( x - 1, y + 1 ) + P( x + 1, y + 1 );
        const double Horizontal = P( x - 1, y ) + P( x + 1, y ), Vertical = P( x, y - 1 ) + P( x, y + 1 );
        const double FarHorizontal = P( x - 2, y ) + P( x + 2, y ), FarVertical = P( x, y - 2 ) + P( x, y + 2 );
        const double Far = FarHorizontal + FarVertical;

        // Green at a red or blue site; the other chroma at a chroma site; a chroma at a green site
        // from the neighbours in its row (or its column).
        const double GreenAtChroma = ( 4 * C + 2 * ( Horizontal + Vertical ) - Far ) / 8;
        const double ChromaAtChroma = ( 6 * C + 2 * Diagonal - 1.5 * Far ) / 8;
        const double FromRow = ( 5 * C + 4 * Horizontal - FarHorizontal + 0.5 * FarVertical - Diagonal ) / 8;
        const double FromColumn = ( 5 * C + 4 * Vertical - FarVertical + 0.5 * FarHorizontal - Diagonal ) / 8;

        const bool bRedRow = ( ( y + ( Red >> 1 ) ) & 1 ) == 0;
        const bool bRedColumn = ( ( x + ( Red & 1 ) ) & 1 ) == 0;
        double Colour[3];
        if( bRedRow && bRedColumn )
          Colour[0] = C, Colour[1] = GreenAtChroma, Colour[2] = ChromaAtChroma;
        else if( !bRedRow && !bRedColumn )
          Colour[0] = ChromaAtChroma, Colour[1] = GreenAtChroma, Colour[2] = C;
        else if( bRedRow )
          Colour[0] = FromRow, Colour[1] = C, Colour[2] = FromColumn;
        else
          Colour[0] = FromColumn, Colour[1] = C, Colour[2] = FromRow;

        double Grey = 0;
        for( double& rValue : Colour )
        {
          rValue = std::copysign( std::pow( std::abs( rValue ), 1.0 / i_Gamma ), rValue );
          Grey += std::max( rValue, 0.0 ) / 3;
        }
        const double Amount = std::min( 1.0 - i_Saturation, 1.0 );
        int Out[3];
        for( int i = 0; i < 3; ++i )
          Out[i] = Clamp8( ( Colour[i] + ( Grey - Colour[i] ) * Amount ) * 255.0 );
        Picture.setPixel( x, y, qRgb( Out[0], Out[1], Out[2] ) );
      }
    return Picture;
  }

  ::testing::AssertionResult SamePicture( const QImage& i_rActual, const QImage& i_rExpected, QPoint i_Origin,
                                          int i_Tolerance, int i_Inset )
  {
    int Worst = 0, Differing = 0;
    QPoint WorstAt;
    for( int y = i_Inset; y < i_rExpected.height() - i_Inset; ++y )
      for( int x = i_Inset; x < i_rExpected.width() - i_Inset; ++x )
      {
        if( !i_rActual.rect().contains( i_Origin + QPoint( x, y ) ) )
          return ::testing::AssertionFailure() << "picture too small for " << x << ", " << y;
        const QRgb Want = i_rExpected.pixel( x, y ), Got = i_rActual.pixel( i_Origin + QPoint( x, y ) );
        const int D = std::max( { std::abs( qRed( Got ) - qRed( Want ) ), std::abs( qGreen( Got ) - qGreen( Want ) ),
                                  std::abs( qBlue( Got ) - qBlue( Want ) ) } );
        Differing += D > i_Tolerance ? 1 : 0;
        if( D > Worst )
          Worst = D, WorstAt = QPoint( x, y );
      }
    if( Differing != 0 || qEnvironmentVariableIsSet( "LUMEK_SAVE_PICTURES" ) )
    {
      const ::testing::TestInfo* pInfo = ::testing::UnitTest::GetInstance()->current_test_info();
      const QString Name = QString( "%1_%2" ).arg( pInfo->test_suite_name(), pInfo->name() ).replace( '/', '_' );
      i_rActual.save( Name + "_actual.png" );
      i_rExpected.save( Name + "_expected.png" );
    }
    if( Differing == 0 )
      return ::testing::AssertionSuccess() << "largest difference " << Worst;
    return ::testing::AssertionFailure() << Differing << " pixels differ by more than " << i_Tolerance << "; worst "
                                         << Worst << " at image pixel (" << WorstAt.x() << ", " << WorstAt.y() << ")";
  }

  LumekVideoViewer::VGLWidget& SurfaceDisplayTest::MakeWidget( int i_Width, int i_Height )
  {
    m_pWidget = std::make_unique< LumekVideoViewer::VGLWidget >();
    m_pWidget->setFixedSize( i_Width, i_Height );
    m_pWidget->show();
    EXPECT_TRUE( QTest::qWaitForWindowExposed( m_pWidget.get() ) );
    return *m_pWidget;
  }

  void SurfaceDisplayTest::Show( const ZOL::IVideoFrame& i_rFrame, LumekVideoViewer::EDecoder i_Decoder,
                                 bool i_bNewWidget )
  {
    const ZOL::IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
    const QSize Size( rInfo.ImageWidth + 2 * Margin, rInfo.ImageHeight + 2 * Margin );
    const bool bReuse = !i_bNewWidget && m_pWidget;
    if( bReuse )
      m_pWidget->setFixedSize( Size );
    else
      MakeWidget( Size.width(), Size.height() );
    m_pWidget->SetScaleMode( LumekVideoViewer::ScaleOneToOne );
    // A new widget starts in Hardware mode, as the viewer's does.
    if( bReuse || i_Decoder != LumekVideoViewer::Hardware )
      m_pWidget->SetDecoder( i_Decoder );
    m_pWidget->PrepareFrame( 0, rInfo, i_rFrame, false );
  }
} // namespace SurfaceTest
