#include "app/Controls/VProxyStyle.h"

#include <QApplication>

namespace LumekVideoViewer
{
  namespace
  {
    QStyle* OwnableStyle( QStyle* i_pStyle )
    {
      if( !i_pStyle || i_pStyle == QApplication::style() || i_pStyle->parent() ||
          i_pStyle->inherits( "QStyleSheetStyle" ) )
        return nullptr;
      return i_pStyle;
    }
  } // namespace

  VProxyStyle::VProxyStyle( QStyle* i_pStyle ) : QProxyStyle( OwnableStyle( i_pStyle ) ) {}

  int VProxyStyle::styleHint( StyleHint i_Hint, const QStyleOption* i_pOption, const QWidget* i_pWidget,
                              QStyleHintReturn* o_pReturnData ) const
  {
    if( i_Hint == QStyle::SH_Slider_AbsoluteSetButtons )
      return Qt::LeftButton;
    return QProxyStyle::styleHint( i_Hint, i_pOption, i_pWidget, o_pReturnData );
  }
} // namespace LumekVideoViewer
