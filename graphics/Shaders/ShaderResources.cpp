#include "graphics/Shaders/ShaderResources.h"

#include <QtGlobal>

// Q_INIT_RESOURCE declares a function and must stand outside any namespace.
static void InitialiseShaderResources()
{
  Q_INIT_RESOURCE( Shaders );
}

namespace Shaders
{
  void RegisterResources()
  {
    InitialiseShaderResources();
  }
} // namespace Shaders
