#pragma once

namespace DPIUtils
{
  // The density the user interface is designed at.
  constexpr int DesignDPI = 96;

  void SetDPI( int i_DPI );
  int DPI();
  // Logical dots per inch over the design density.
  float DPIRatio();
  // A length in design pixels, scaled to the display.
  int Scale( int i_Pixels );
} // namespace DPIUtils
