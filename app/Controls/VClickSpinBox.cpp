#include "app/Controls/VClickSpinBox.h"

namespace LumekVideoViewer
{
  VClickSpinBox::VClickSpinBox( QWidget* i_pParent ) : QSpinBox( i_pParent ) {}

  void VClickSpinBox::setValue( int i_Value )
  {
    const bool bWasBlocked = blockSignals( true );
    QSpinBox::setValue( i_Value );
    blockSignals( bWasBlocked );
  }
} // namespace LumekVideoViewer
