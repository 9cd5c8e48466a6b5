#include "videointerface/VideoReaderBase.h"

namespace ZOL
{
  bool VVideoReaderBase::Open( const std::string& i_rFileName )
  {
    return OpenWith( [&] { return OpenReader( i_rFileName ); } );
  }

  bool VVideoReaderBase::OpenWith( const std::function< bool() >& i_rOpen )
  {
    Close();
    Reset();
    if( i_rOpen() )
      return true;
    if( !KeepsWhatAFailedOpenRead() )
    {
      Close();
      Reset();
    }
    return false;
  }
} // namespace ZOL
