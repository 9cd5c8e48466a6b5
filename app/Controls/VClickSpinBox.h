#pragma once

#include <QSpinBox>

namespace LumekVideoViewer
{
  // The frame number box. The user's typing and arrow clicks emit valueChanged as usual; the
  // playback clock moves it through setValue, which emits nothing.
  class VClickSpinBox : public QSpinBox
  {
    Q_OBJECT

  public:
    explicit VClickSpinBox( QWidget* i_pParent = nullptr );

  public slots:
    void setValue( int i_Value );
  };
} // namespace LumekVideoViewer
