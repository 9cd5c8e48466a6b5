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

    std::vector< std::uint8_t > Convert( const ZOL::IVideoFrame& i_rFrame, ZOL::EPixelFormat i_To )
    {
      const ZOL::IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
      std::vector< std::uint8_t > Result(
          CoreVideoUtils::FrameSizeInBytes( rInfo.ImageWidth, rInfo.ImageHeight, i_To ) );
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
    ZOL::IVideoFrame Frame;
    Frame.VideoFrameInfo.ImageWidth = i_Width;
    Frame.VideoFrameInfo.ImageHeight = i_Height;
    Frame.VideoFrameInfo.PixelFormat = i_Format;
    Frame.VideoFrameInfo.PixelAspectRatio = 1.0;
    auto pBuffer = std::make_shared< ZOL::IStandardBuffer >();
    pBuffer->Resize( ZOL::GetVideoFrameSizeInBytes64( Frame.VideoFrameInfo ) );
    std::mt19937 Random( i_Seed );
    for( std::uint64_t i = 0; i < pBuffer->GetSize(); ++i )
      pBuffer->GetData()[i] = std::uint8_t( i_Fill >= 0 ? i_Fill : Random() >> 24 );
    Frame.Video = pBuffer;
    return Frame;
  }

  QImage ProcessorPicture( const ZOL::IVideoFrame& i_rFrame )
  {
    // The four-byte target, the only one every format converts to.
    const std::vector< std::uint8_t > Bytes = Convert( i_rFrame, ZOL::PixelFormat_R8G8B8u8 );
    const int W = i_rFrame.VideoFrameInfo.ImageWidth;
    return QImage( Bytes.data(), W, i_rFrame.VideoFrameInfo.ImageHeight, W * 4, QImage::Format_RGBX8888 )
        .convertToFormat( QImage::Format_RGB32 );
  }

  QImage MalvarPicture( const ZOL::IVideoFrame& i_rFrame, float i_Gamma, float i_Saturation )
  {
    const int W = i_rFrame.VideoFrameInfo.ImageWidth, H = i_rFrame.VideoFrameInfo.ImageHeight;
    const ZOL::EPixelFormat Format = i_rFrame.VideoFrameInfo.PixelFormat;
    const std::uint8_t* pData = i_rFrame.Video->GetData();
    const std::vector< std::uint8_t > Mosaic =
        Format == ZOL::PixelFormat_BayerGB7 || Format == ZOL::PixelFormat_BayerGB6
            ? Convert( i_rFrame, ZOL::PixelFormat_BayerGB8 )
            : std::vector< std::uint8_t >( pData, pData + W * H );
    auto P = [&]( int x, int y ) { return Mosaic[std::clamp( y, 0, H - 1 ) * W + std::clamp( x, 0, W - 1 )] / 255.0; };
    auto Channel = []( char i_Colour ) { return i_Colour == 'R' ? 0 : i_Colour == 'G' ? 1 : 2; };
    QImage Picture( W, H, QImage::Format_RGB32 );
    for( int y = 0; y < H; ++y )
      for( int x = 0; x < W; ++x )
      {
        const double C = P( x, y );
        const double Diagonal = P( x - 1, y - 1 ) + P( x + 1, y - 1 ) + P( x - 1, y + 1 ) + P( x + 1, y + 1 );
        const double Horizontal = P( x - 1, y ) + P( x + 1, y ), Vertical = P( x, y - 1 ) + P( x, y + 1 );
        const double FarHorizontal = P( x - 2, y ) + P( x + 2, y ), FarVertical = P( x, y - 2 ) + P( x, y + 2 );
        const double Far = FarHorizontal + FarVertical;
        // The site's own colour, and the other colour of its row.
        const char Site = BayerTile( Format )[( y & 1 ) * 2 + ( x & 1 )];
        const char Beside = BayerTile( Format )[( y & 1 ) * 2 + ( ~x & 1 )];
        double Colour[3];
        Colour[Channel( Site )] = C;
        if( Site == 'G' ) // each chroma from the neighbours in its row, or in its column
        {
          Colour[Channel( Beside )] = ( 5 * C + 4 * Horizontal - FarHorizontal + 0.5 * FarVertical - Diagonal ) / 8;
          Colour[2 - Channel( Beside )] = ( 5 * C + 4 * Vertical - FarVertical + 0.5 * FarHorizontal - Diagonal ) / 8;
        }
        else // green, and the other chroma across the corners
        {
          Colour[1] = ( 4 * C + 2 * ( Horizontal + Vertical ) - Far ) / 8;
          Colour[2 - Channel( Site )] = ( 6 * C + 2 * Diagonal - 1.5 * Far ) / 8;
        }
        double Grey = 0;
        for( double& rValue : Colour )
        {
          rValue = std::copysign( std::pow( std::abs( rValue ), 1.0 / i_Gamma ), rValue );
          Grey += std::max( rValue, 0.0 ) / 3;
        }
        const double Amount = std::min( 1.0 - i_Saturation, 1.0 );
        auto Shown = [&]( int i ) { return Clamp8( ( Colour[i] + ( Grey - Colour[i] ) * Amount ) * 255.0 ); };
        Picture.setPixel( x, y, qRgb( Shown( 0 ), Shown( 1 ), Shown( 2 ) ) );
      }
    return Picture;
  }

  ::testing::AssertionResult SamePicture( const QImage& i_rActual, const QImage& i_rExpected, QPoint i_Origin,
                                          int i_Tolerance )
  {
    int Worst = 0, Differing = 0;
    QPoint WorstAt;
    for( int y = 1; y < i_rExpected.height() - 1; ++y )
      for( int x = 1; x < i_rExpected.width() - 1; ++x )
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
