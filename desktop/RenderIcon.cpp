// Renders the application's SVG icon into the PNG sizes of the hicolor theme at build time, so
// only the SVG is kept in the source tree.

#include <QGuiApplication>
#include <QImage>
#include <QPainter>
#include <QSvgRenderer>

#include <cstdio>
#include <cstdlib>
#include <string>

int main( int argc, char** argv )
{
  if( argc != 4 )
  {
    std::fprintf( stderr, "Usage: lumekrendericon ICON.svg OUTPUT.png SIZE\n" );
    return 2;
  }
  const int Size = std::atoi( argv[3] );
  if( Size <= 0 || Size > 1024 )
  {
    std::fprintf( stderr, "lumekrendericon: SIZE must be between 1 and 1024\n" );
    return 2;
  }
  // The build machine may have no display.
  qputenv( "QT_QPA_PLATFORM", "offscreen" );
  int AppArguments = 1;
  QGuiApplication Application( AppArguments, argv );

  QSvgRenderer Renderer( QString::fromLocal8Bit( argv[1] ) );
  if( !Renderer.isValid() )
  {
    std::fprintf( stderr, "lumekrendericon: cannot read %s\n", argv[1] );
    return 1;
  }
  QImage Icon( Size, Size, QImage::Format_ARGB32_Premultiplied );
  Icon.fill( Qt::transparent );
  {
    QPainter Painter( &Icon );
    Painter.setRenderHints( QPainter::Antialiasing | QPainter::SmoothPixmapTransform );
    Renderer.render( &Painter );
  }
  if( !Icon.save( QString::fromLocal8Bit( argv[2] ), "PNG" ) )
  {
    std::fprintf( stderr, "lumekrendericon: cannot write %s\n", argv[2] );
    return 1;
  }
  return 0;
}
