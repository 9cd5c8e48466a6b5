#include "app/Style/AppStyle.h"
#include "services/Theme/IApplicationStyling.h"

#include <QDir>
#include <QFile>
#include <QImage>
#include <QPainter>
#include <QRegularExpression>
#include <QSvgRenderer>

#include <gtest/gtest.h>

#include <cmath>
#include <set>

// Parameter names in failure messages.
void PrintTo( const QString& i_rText, std::ostream* o_pStream )
{
  *o_pStream << i_rText.toStdString();
}

namespace
{
  const QString s_Prefix = QStringLiteral( "com.Lumek.LumekVideoViewer." );

  // Pictures the window shows by itself rather than through the sheet.
  const char* const s_WindowPictures[] = { "LumekLogo", "AppIcon", "AboutLogo" };

  std::set< QString > PicturesInResources()
  {
    LumekVideoViewer::InitialiseStyleResources();
    std::set< QString > Names;
    for( const QString& rEntry : QDir( ":/" ).entryList( { s_Prefix + "*.svg" }, QDir::Files ) )
      Names.insert( rEntry.mid( s_Prefix.size() ).chopped( 4 ) );
    return Names;
  }

  std::set< QString > PicturesInSheet()
  {
    const QString Sheet = LumekVideoViewer::PrepareStyleSheet( *ZOL::ApplicationStyling() );
    static const QRegularExpression s_Url( QStringLiteral( R"(url\(:/com\.Lumek\.LumekVideoViewer\.(\w+)\.svg\))" ) );
    std::set< QString > Names;
    for( auto Matches = s_Url.globalMatch( Sheet ); Matches.hasNext(); )
      Names.insert( Matches.next().captured( 1 ) );
    return Names;
  }

  QString PathOf( const QString& i_rName )
  {
    return ":/" + s_Prefix + i_rName + ".svg";
  }

  QImage Render( const QString& i_rName, QSize i_Size )
  {
    QSvgRenderer Renderer( PathOf( i_rName ) );
    QImage Image( i_Size, QImage::Format_ARGB32_Premultiplied );
    Image.fill( Qt::transparent );
    QPainter Painter( &Image );
    Renderer.render( &Painter );
    return Image;
  }

  struct VCoverage
  {
    int Opaque = 0;
    double Luminance = 0.0;
    QRect Bounds;
  };

  VCoverage Measure( const QImage& i_rImage )
  {
    VCoverage Coverage;
    double Weight = 0.0;
    for( int y = 0; y < i_rImage.height(); ++y )
      for( int x = 0; x < i_rImage.width(); ++x )
      {
        const QColor Pixel = QColor::fromRgba( i_rImage.pixel( x, y ) );
        if( Pixel.alpha() == 0 )
          continue;
        ++Coverage.Opaque;
        Coverage.Bounds |= QRect( x, y, 1, 1 );
        Coverage.Luminance += Pixel.alphaF() * Pixel.lightnessF();
        Weight += Pixel.alphaF();
      }
    if( Weight > 0.0 )
      Coverage.Luminance /= Weight;
    return Coverage;
  }

  TEST( Pictures, EveryPictureTheSheetNamesIsThere )
  {
    const auto InResources = PicturesInResources();
    const auto InSheet = PicturesInSheet();
    ASSERT_FALSE( InSheet.empty() );
    for( const QString& rName : InSheet )
      EXPECT_TRUE( InResources.count( rName ) ) << rName.toStdString();
    for( const char* pName : s_WindowPictures )
      EXPECT_TRUE( InResources.count( pName ) ) << pName;
  }

  TEST( Pictures, EveryPictureIsUsed )
  {
    auto Used = PicturesInSheet();
    for( const char* pName : s_WindowPictures )
      Used.insert( pName );
    for( const QString& rName : PicturesInResources() )
      EXPECT_TRUE( Used.count( rName ) ) << rName.toStdString() << " is in the resources but nothing shows it";
  }

  class Picture : public testing::TestWithParam< QString >
  {
  };

  TEST_P( Picture, IsAValidDrawingThatFillsItsBox )
  {
    QSvgRenderer Renderer( PathOf( GetParam() ) );
    ASSERT_TRUE( Renderer.isValid() );
    const QSize Size = Renderer.defaultSize();
    ASSERT_FALSE( Size.isEmpty() );
    // Drawn on a view box of the same shape, so it scales to any density without distortion.
    const QRectF ViewBox = Renderer.viewBoxF();
    EXPECT_NEAR( ViewBox.width() / ViewBox.height(), double( Size.width() ) / Size.height(), 1e-6 );

    const VCoverage Coverage = Measure( Render( GetParam(), Size * 4 ) );
    EXPECT_GT( Coverage.Opaque, 0 );
    // Something is drawn but not a full rectangle: these are glyphs on a transparent ground.
    EXPECT_LT( Coverage.Opaque, Size.width() * Size.height() * 16 );
  }

  INSTANTIATE_TEST_SUITE_P( Style, Picture, testing::ValuesIn( PicturesInResources() ),
                            []( const auto& i_rInfo ) { return i_rInfo.param.toStdString(); } );

  class DisabledPicture : public testing::TestWithParam< QString >
  {
  };

  TEST_P( DisabledPicture, IsTheSameShapeButDimmer )
  {
    QSvgRenderer Renderer( PathOf( GetParam() ) );
    const QSize Size = Renderer.defaultSize() * 4;
    const VCoverage Enabled = Measure( Render( GetParam(), Size ) );
    const VCoverage Disabled = Measure( Render( GetParam() + "Disabled", Size ) );
    EXPECT_EQ( Disabled.Bounds, Enabled.Bounds );
    EXPECT_LT( Disabled.Luminance, Enabled.Luminance - 0.2 );
  }

  std::vector< QString > PicturesWithDisabledForms()
  {
    std::vector< QString > Names;
    const auto All = PicturesInResources();
    for( const QString& rName : All )
      if( All.count( rName + "Disabled" ) )
        Names.push_back( rName );
    return Names;
  }

  INSTANTIATE_TEST_SUITE_P( Style, DisabledPicture, testing::ValuesIn( PicturesWithDisabledForms() ),
                            []( const auto& i_rInfo ) { return i_rInfo.param.toStdString(); } );
} // namespace
