#include "tests/graphics/VideoSurface/SurfaceTestSupport.h"

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include <QApplication>
#include <QTest>

#include <algorithm>
#include <cmath>
#include <random>

namespace SurfaceTest
{
  ZOL::IVideoFrameInfo FrameInfo( ZOL::EPixelFormat i_Format, int i_Width, int i_Height )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    Info.PixelAspectRatio = 1.0;
    return Info;
  }

  namespace
  {
    ZOL::IVideoFrame MakeFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height )
    {
      ZOL::IVideoFrame Frame;
      Frame.VideoFrameInfo = FrameInfo( i_Format, i_Width, i_Height );
      auto pBuffer = std::make_shared< ZOL::IStandardBuffer >();
      pBuffer->Resize( ZOL::GetVideoFrameSizeInBytes64( Frame.VideoFrameInfo ) );
      Frame.Video = pBuffer;
      return Frame;
    }

    int Clamp8( double i_Value )
    {
      return int( std::lround( std::min( std::max( i_Value, 0.0 ), 255.0 ) ) );
    }
  } // namespace

  ZOL::IVideoFrame RandomFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height, std::uint32_t i_Seed )
  {
    ZOL::IVideoFrame Frame = MakeFrame( i_Format, i_Width, i_Height );
    std::mt19937 Random( i_Seed );
    std::uint8_t* p = Frame.Video->GetData();
    for( std::uint64_t i = 0; i < Frame.Video->GetSize(); ++i )
      p[i] = std::uint8_t( Random() >> 24 );
    return Frame;
  }

  ZOL::IVideoFrame SmoothBayerFrame( ZOL::EPixelFormat i_Format, int i_Width, int i_Height )
  {
    ZOL::IVideoFrame Frame = MakeFrame( i_Format, i_Width, i_Height );
    // Which colour each site of the 2 by 2 tile holds, by format: 0 red, 1 green, 2 blue.
    int Tile[4] = { 0, 1, 1, 2 };
    if( i_Format == ZOL::PixelFormat_BayerGB8 )
      Tile[0] = 1, Tile[1] = 2, Tile[2] = 0, Tile[3] = 1;
    else if( i_Format == ZOL::PixelFormat_BayerGR8 )
      Tile[0] = 1, Tile[1] = 0, Tile[2] = 2, Tile[3] = 1;
    else if( i_Format == ZOL::PixelFormat_BayerBG8 )
      Tile[0] = 2, Tile[1] = 1, Tile[2] = 1, Tile[3] = 0;
    std::uint8_t* p = Frame.Video->GetData();
    for( int y = 0; y < i_Height; ++y )
      for( int x = 0; x < i_Width; ++x )
      {
        const double Channels[3] = { 128 + 60 * std::sin( x / 9.0 ) * std::cos( y / 11.0 ), 100 + x * 2.0 + y,
                                     150 - 50 * std::cos( ( x + y ) / 13.0 ) };
        p[y * i_Width + x] = std::uint8_t( Clamp8( Channels[Tile[( y & 1 ) * 2 + ( x & 1 )]] ) );
      }
    return Frame;
  }

  VRGBImage ProcessorPicture( const ZOL::IVideoFrame& i_rFrame )
  {
    const ZOL::IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
    VRGBImage Picture( rInfo.ImageWidth, rInfo.ImageHeight );
    const bool bConverted = CoreVideoUtils::ConvertFrame(
        rInfo.ImageWidth, rInfo.ImageHeight, rInfo.PixelFormat, i_rFrame.Video->GetData(), i_rFrame.Video->GetSize(),
        ZOL::PixelFormat_R8G8B8, Picture.Bytes.data(), Picture.Bytes.size() );
    EXPECT_TRUE( bConverted ) << "format " << rInfo.PixelFormat;
    return Picture;
  }

  VRGBImage MalvarPicture( const ZOL::IVideoFrameInfo& i_rInfo, const std::uint8_t* i_pMosaic, float i_Gamma,
                           float i_Saturation )
  {
    const int W = i_rInfo.ImageWidth;
    const int H = i_rInfo.ImageHeight;
    // The colour of the site at (0, 0) and whether red shares rows with it.
    int RedX = 0, RedY = 0;
    switch( i_rInfo.PixelFormat )
    {
    case ZOL::PixelFormat_BayerGB8:
      RedX = 0, RedY = 1;
      break;
    case ZOL::PixelFormat_BayerGR8:
      RedX = 1, RedY = 0;
      break;
    case ZOL::PixelFormat_BayerBG8:
      RedX = 1, RedY = 1;
      break;
    default:
      break;
    }
    auto P = [&]( int x, int y )
    {
      x = std::min( std::max( x, 0 ), W - 1 );
      y = std::min( std::max( y, 0 ), H - 1 );
      return i_pMosaic[y * W + x] / 255.0;
    };
    VRGBImage Picture( W, H );
    for( int y = 0; y < H; ++y )
      for( int x = 0; x < W; ++x )
      {
        const double C = P( x, y );
        const double Axial = P( x - 1, y ) + P( x + 1, y ) + P( x, y - 1 ) + P( x, y + 1 );
        const double Far = P( x - 2, y ) + P( x + 2, y ) + P( x, y - 2 ) + P( x, y + 2 );
        const double Diagonal = P( x - 1, y - 1 ) + P( x + 1, y - 1 ) + P( x - 1, y + 1 ) + P( x + 1, y + 1 );
        const double Horizontal = P( x - 1, y ) + P( x + 1, y );
        const double Vertical = P( x, y - 1 ) + P( x, y + 1 );
        const double FarHorizontal = P( x - 2, y ) + P( x + 2, y );
        const double FarVertical = P( x, y - 2 ) + P( x, y + 2 );

        // Green at a red or blue site; the other chroma at a chroma site; a chroma at a green site
        // from the neighbours in its row (or its column).
        const double GreenAtChroma = ( 4 * C + 2 * Axial - Far ) / 8;
        const double ChromaAtChroma = ( 6 * C + 2 * Diagonal - 1.5 * Far ) / 8;
        const double FromRow = ( 5 * C + 4 * Horizontal - FarHorizontal + 0.5 * FarVertical - Diagonal ) / 8;
        const double FromColumn = ( 5 * C + 4 * Vertical - FarVertical + 0.5 * FarHorizontal - Diagonal ) / 8;

        const bool bRedRow = ( ( y + RedY ) & 1 ) == 0;
        const bool bRedColumn = ( ( x + RedX ) & 1 ) == 0;
        double R, G, B;
        if( bRedRow && bRedColumn )
          R = C, G = GreenAtChroma, B = ChromaAtChroma;
        else if( !bRedRow && !bRedColumn )
          R = ChromaAtChroma, G = GreenAtChroma, B = C;
        else if( bRedRow )
          R = FromRow, G = C, B = FromColumn;
        else
          R = FromColumn, G = C, B = FromRow;

        double Colour[3] = { R, G, B };
        for( double& rValue : Colour )
          rValue = std::copysign( std::pow( std::abs( rValue ), 1.0 / i_Gamma ), rValue );
        const double Grey =
            ( std::max( Colour[0], 0.0 ) + std::max( Colour[1], 0.0 ) + std::max( Colour[2], 0.0 ) ) / 3;
        const double Amount = std::min( 1.0 - i_Saturation, 1.0 );
        std::uint8_t* pOut = Picture.At( x, y );
        for( int i = 0; i < 3; ++i )
          pOut[i] = std::uint8_t( Clamp8( ( Colour[i] + ( Grey - Colour[i] ) * Amount ) * 255.0 ) );
      }
    return Picture;
  }

  std::unique_ptr< LumekVideoViewer::VGLWidget > MakeWidget( int i_Width, int i_Height )
  {
    auto pWidget = std::make_unique< LumekVideoViewer::VGLWidget >();
    pWidget->setFixedSize( i_Width, i_Height );
    pWidget->show();
    EXPECT_TRUE( QTest::qWaitForWindowExposed( pWidget.get() ) );
    return pWidget;
  }

  QImage Grab( LumekVideoViewer::VGLWidget& io_rWidget )
  {
    return io_rWidget.grabFramebuffer().convertToFormat( QImage::Format_RGB32 );
  }

  int Difference( QRgb i_Colour, int i_R, int i_G, int i_B )
  {
    return std::max( { std::abs( qRed( i_Colour ) - i_R ), std::abs( qGreen( i_Colour ) - i_G ),
                       std::abs( qBlue( i_Colour ) - i_B ) } );
  }

  void SavePictures( const QImage& i_rActual, const VRGBImage& i_rExpected, QPoint i_Origin )
  {
    const ::testing::TestInfo* pInfo = ::testing::UnitTest::GetInstance()->current_test_info();
    QString Name = QString( "%1_%2" ).arg( pInfo->test_suite_name(), pInfo->name() );
    Name.replace( '/', '_' );
    QImage Expected( i_rActual.size(), QImage::Format_RGB32 );
    Expected.fill( Qt::black );
    for( int y = 0; y < i_rExpected.Height; ++y )
      for( int x = 0; x < i_rExpected.Width; ++x )
      {
        const std::uint8_t* p = i_rExpected.At( x, y );
        if( Expected.rect().contains( i_Origin + QPoint( x, y ) ) )
          Expected.setPixel( i_Origin + QPoint( x, y ), qRgb( p[0], p[1], p[2] ) );
      }
    i_rActual.save( Name + "_actual.png" );
    Expected.save( Name + "_expected.png" );
  }

  ::testing::AssertionResult SamePicture( const QImage& i_rActual, const VRGBImage& i_rExpected, QPoint i_Origin,
                                          int i_Tolerance, int i_Inset )
  {
    int Worst = 0;
    int Differing = 0;
    QPoint WorstAt;
    for( int y = i_Inset; y < i_rExpected.Height - i_Inset; ++y )
      for( int x = i_Inset; x < i_rExpected.Width - i_Inset; ++x )
      {
        const QPoint At = i_Origin + QPoint( x, y );
        if( !i_rActual.rect().contains( At ) )
          return ::testing::AssertionFailure() << "picture too small for " << x << ", " << y;
        const std::uint8_t* p = i_rExpected.At( x, y );
        const int D = Difference( i_rActual.pixel( At ), p[0], p[1], p[2] );
        if( D > i_Tolerance )
          ++Differing;
        if( D > Worst )
          Worst = D, WorstAt = QPoint( x, y );
      }
    // LUMEK_SAVE_PICTURES=1 keeps the pictures of passing comparisons too, to look at.
    if( Differing == 0 && qEnvironmentVariableIsSet( "LUMEK_SAVE_PICTURES" ) )
      SavePictures( i_rActual, i_rExpected, i_Origin );
    if( Differing == 0 )
      return ::testing::AssertionSuccess() << "largest difference " << Worst;
    SavePictures( i_rActual, i_rExpected, i_Origin );
    const std::uint8_t* p = i_rExpected.At( WorstAt.x(), WorstAt.y() );
    const QRgb Got = i_rActual.pixel( i_Origin + WorstAt );
    return ::testing::AssertionFailure() << Differing << " pixels differ by more than " << i_Tolerance << "; worst "
                                         << Worst << " at image pixel (" << WorstAt.x() << ", " << WorstAt.y()
                                         << "): got (" << qRed( Got ) << ", " << qGreen( Got ) << ", " << qBlue( Got )
                                         << "), expected (" << int( p[0] ) << ", " << int( p[1] ) << ", " << int( p[2] )
                                         << ")";
  }
} // namespace SurfaceTest
