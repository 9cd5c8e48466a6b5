#include "app/Start/ApplicationStart.h"

namespace LumekVideoViewer
{
  int RunApplication( int& io_rArgumentCount, char** io_pArguments, const VCommandLine& i_rCommandLine )
  {
    return 0;
  }
}
