#pragma once

namespace Shaders
{
  // Registers the shader resources. A static library's resources are only reachable after
  // this; calling it again is harmless.
  void RegisterResources();
} // namespace Shaders
