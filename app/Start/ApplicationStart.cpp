#include "app/Start/ApplicationStart.h"

#include "app/Style/AppStyle.h"
#include "app/Window/VVideoWindow.h"
#include "services/Theme/IApplicationStyling.h"
#include "services/Theme/ThemeStart.h"

#include <QApplication>

#include <memory>

namespace LumekVideoViewer
{
  int RunApplication( int& io_rArgumentCount, char** io_pArguments, const VCommandLine& i_rCommandLine )
  {
    // The surface keeps its textures in a hidden context shared with every widget's: sharing must
    // be switched on before the application object exists.
    QCoreApplication::setAttribute( Qt::AA_ShareOpenGLContexts, true );

    // The theme outlives the application, which may still reach it while tearing down.
    const std::shared_ptr< ZOL::IApplicationStyling > pStyling = ZOL::ApplicationStyling();
    Theme::ApplyPreApplicationTheme( *pStyling );

    QApplication Application( io_rArgumentCount, io_pArguments );
    ApplyStyleSheet( *pStyling );

    VVideoWindow Window( i_rCommandLine.bDeveloper, i_rCommandLine.VersionServer, i_rCommandLine.SpoofVersion,
                         nullptr );
    Window.show();
    // A file that does not open has had its dialog; the viewer stays up with no file.
    if( !i_rCommandLine.InputFile.empty() )
      Window.OpenFile( QString::fromStdString( i_rCommandLine.InputFile ) );
    return Application.exec();
  }
} // namespace LumekVideoViewer
