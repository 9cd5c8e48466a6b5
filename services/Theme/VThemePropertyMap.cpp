#include "services/Theme/VThemePropertyMap.h"

#include <QQmlEngine>

namespace Theme
{
  VThemePropertyMap::VThemePropertyMap( const ZOL::IApplicationStyling& i_rStyling, QObject* i_pParent )
      : QQmlPropertyMap( this, i_pParent )
  {
    for( const auto& rField : ZOL::IApplicationStyling::Fields() )
    {
      const QString Name = QLatin1String( rField.Name );
      insert( Name, i_rStyling.Value( Name ) );
    }
  }

  QVariant VThemePropertyMap::updateValue( const QString& i_rKey, const QVariant& )
  {
    return value( i_rKey );
  }
} // namespace Theme

namespace ZOL
{
  void IApplicationStyling::RegisterForQml() const
  {
    // Each engine gets its own map, which the engine owns; all of them show this record's values.
    const IApplicationStyling Copy = *this;
    qmlRegisterSingletonType< Theme::VThemePropertyMap >( "Lumek.Theme", 1, 0, "Theme",
                                                          [Copy]( QQmlEngine*, QJSEngine* ) -> QObject*
                                                          { return new Theme::VThemePropertyMap( Copy ); } );
  }
} // namespace ZOL
