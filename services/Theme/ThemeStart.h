#pragma once

// The two halves of applying the theme that application start runs around the creation of the
// QApplication:
//
//   auto pStyling = ZOL::ApplicationStyling();      // lives until after the QApplication is gone
//   Theme::ApplyPreApplicationTheme( *pStyling );
//   QApplication Application( argc, argv );
//   Theme::ApplyPostApplicationTheme( *pStyling );
//
// Each half works on its own copy, so the shared record is never scaled.

#include <QString>

namespace ZOL
{
  class IApplicationStyling;
}

namespace Theme
{
  // Style name, palette and the QML registration. Scales for the display density only when a
  // screen already exists, which in a normal start it does not.
  void ApplyPreApplicationTheme( const ZOL::IApplicationStyling& i_rStyling );

  // The style sheet file of the record, scaled by DPIUtils::DPIRatio() and substituted; empty when
  // the file is absent or empty.
  QString PrepareStyleSheet( const ZOL::IApplicationStyling& i_rStyling );

  // Gives the application the prepared style sheet. An absent or empty file sets none and returns
  // false; start-up goes on either way.
  bool ApplyPostApplicationTheme( const ZOL::IApplicationStyling& i_rStyling );
} // namespace Theme
