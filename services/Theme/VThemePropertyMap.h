#pragma once

#include "services/Theme/IApplicationStyling.h"

#include <QQmlPropertyMap>

namespace Theme
{
  // What QML sees as the singleton "Theme": one property per name of the styling record, read-only,
  // so that "Theme.Window" or "Theme.ItemHeight" give the values of the record it was made from.
  class VThemePropertyMap : public QQmlPropertyMap
  {
    Q_OBJECT

  public:
    explicit VThemePropertyMap( const ZOL::IApplicationStyling& i_rStyling, QObject* i_pParent = nullptr );

  protected:
    // QML may not repaint the application by writing to the theme.
    QVariant updateValue( const QString& i_rKey, const QVariant& i_rInput ) override;
  };
} // namespace Theme
