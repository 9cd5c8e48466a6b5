#include "services/DPIUtils.h"

#include <atomic>
#include <cmath>

namespace
{
  std::atomic< int > s_DPI{ DPIUtils::DesignDPI };
}

namespace DPIUtils
{
  void SetDPI( int i_DPI )
  {
    s_DPI = i_DPI > 0 ? i_DPI : DesignDPI;
  }
  int DPI()
  {
    return s_DPI;
  }
  float DPIRatio()
  {
    return static_cast< float >( s_DPI ) / static_cast< float >( DesignDPI );
  }
  int Scale( int i_Pixels )
  {
    return static_cast< int >( std::lround( i_Pixels * DPIRatio() ) );
  }
} // namespace DPIUtils
