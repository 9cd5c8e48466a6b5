#include "services/Theme/ThemeStart.h"

#include "services/DPIUtils.h"
#include "services/Theme/IApplicationStyling.h"

#include <QApplication>
#include <QFile>
#include <QScreen>

#include <cmath>

namespace Theme
{
  void ApplyPreApplicationTheme( const ZOL::IApplicationStyling& i_rStyling )
  {
    ZOL::IApplicationStyling Styling = i_rStyling;
    if( const QScreen* pScreen = QGuiApplication::primaryScreen() )
    {
      DPIUtils::SetDPI( static_cast< int >( std::trunc( pScreen->logicalDotsPerInch() ) ) );
      Styling.Scale( DPIUtils::DPIRatio() );
    }
    // An unknown style name leaves Qt's own choice in place.
    QApplication::setStyle( Styling.m_StyleName );
    QApplication::setPalette( Styling.MakePalette() );
    Styling.RegisterForQml();
  }

  QString PrepareStyleSheet( const ZOL::IApplicationStyling& i_rStyling )
  {
    ZOL::IApplicationStyling Styling = i_rStyling;
    Styling.Scale( DPIUtils::DPIRatio() );
    QFile File( Styling.m_StyleSheetPath );
    if( Styling.m_StyleSheetPath.isEmpty() || !File.open( QIODevice::ReadOnly | QIODevice::Text ) )
      return QString();
    const QString Text = QString::fromUtf8( File.readAll() );
    if( Text.isEmpty() )
      return QString();
    return Styling.Substitute( Text );
  }

  bool ApplyPostApplicationTheme( const ZOL::IApplicationStyling& i_rStyling )
  {
    const QString Sheet = PrepareStyleSheet( i_rStyling );
    if( Sheet.isEmpty() || !qApp )
      return false;
    qApp->setStyleSheet( Sheet );
    return true;
  }
} // namespace Theme
