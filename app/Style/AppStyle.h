#pragma once

// The application's style sheet and pictures, kept as resources under ":com.Lumek.LumekVideoViewer.".

#include <QString>

namespace ZOL
{
  class IApplicationStyling;
}

namespace LumekVideoViewer
{
  // Makes the style sheet and the pictures (":/com.Lumek.LumekVideoViewer.ButtonPlay.svg", the
  // logo, the application icon, ...) available. Safe to call more than once; ApplyStyleSheet calls
  // it, and so should anything that loads a picture before that.
  void InitialiseStyleResources();

  // The style sheet with the theme's values in and its arithmetic worked out, scaled for the
  // display density; empty if the resource is missing.
  QString PrepareStyleSheet( const ZOL::IApplicationStyling& i_rStyling );

  // Prepares the style sheet of i_rStyling (the application's own when none is given) and gives it
  // to the QApplication, which must exist. Returns false, leaving Qt's look, when there is none.
  bool ApplyStyleSheet();
  bool ApplyStyleSheet( const ZOL::IApplicationStyling& i_rStyling );
} // namespace LumekVideoViewer
