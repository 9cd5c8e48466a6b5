#include "app/Style/AppStyle.h"

#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/ThemeStart.h"

// Resources of a static library are only linked in when something refers to their initialiser,
// which has to be named outside any namespace.
static void InitialiseLumekStyleResource()
{
  Q_INIT_RESOURCE( LumekStyle );
}

namespace LumekVideoViewer
{
  void InitialiseStyleResources()
  {
    static const bool s_bDone = ( InitialiseLumekStyleResource(), true );
    (void)s_bDone;
  }

  QString PrepareStyleSheet( const ZOL::IApplicationStyling& i_rStyling )
  {
    InitialiseStyleResources();
    return Theme::PrepareStyleSheet( i_rStyling );
  }

  bool ApplyStyleSheet()
  {
    return ApplyStyleSheet( *ZOL::ApplicationStyling() );
  }

  bool ApplyStyleSheet( const ZOL::IApplicationStyling& i_rStyling )
  {
    InitialiseStyleResources();
    return Theme::ApplyPostApplicationTheme( i_rStyling );
  }
} // namespace LumekVideoViewer
