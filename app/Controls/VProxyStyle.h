#pragma once

#include <QProxyStyle>

namespace LumekVideoViewer
{
  // Makes a left click on a slider's groove jump the handle to that place instead of paging.
  //
  //   auto* pStyle = new VProxyStyle( pSlider->style() );
  //   pStyle->setParent( pSlider );   // a widget does not own the style it is given
  //   pSlider->setStyle( pStyle );
  class VProxyStyle : public QProxyStyle
  {
    Q_OBJECT

  public:
    // Takes i_pStyle over when it is a style of its own. The application's style, and the style
    // sheet's wrapper of it, are shared by every widget: taking one of those over would reparent
    // it and route every widget through this proxy, so for them a private instance of the
    // application's kind of style is used instead.
    explicit VProxyStyle( QStyle* i_pStyle = nullptr );

    int styleHint( StyleHint i_Hint, const QStyleOption* i_pOption = nullptr, const QWidget* i_pWidget = nullptr,
                   QStyleHintReturn* o_pReturnData = nullptr ) const override;
  };
} // namespace LumekVideoViewer
