#include "versioncheck/VersionCheck/VApplicationVersionCheck.h"

#include "versioncheck/VersionReply/DefaultServer.h"
#include "versioncheck/VersionReply/SystemText.h"

#include <boost/format.hpp>

namespace VersionCheck
{
  std::string VersionText( const ZOL::IApplicationVersion& i_rVersion, const std::string& i_rSpoofVersion )
  {
    if( !i_rSpoofVersion.empty() )
      return i_rSpoofVersion;
    return ( boost::format( "%d.%d.%d.%s" ) % i_rVersion.Major % i_rVersion.Minor % i_rVersion.Point %
             ( i_rVersion.BuildTag ? i_rVersion.BuildTag : "" ) )
        .str();
  }

  VApplicationVersionCheck::VApplicationVersionCheck( QWidget* i_pParent, QSettings* i_pSettings,
                                                      const ZOL::IApplicationVersion* i_pVersion,
                                                      const std::string& i_rVersionServer,
                                                      const std::string& i_rSpoofVersion )
      : m_pVersion( i_pVersion ),
        m_VersionText( i_pVersion ? VersionText( *i_pVersion, i_rSpoofVersion ) : i_rSpoofVersion ),
        m_SystemText( SystemText() ),
        m_pSettings( std::make_shared< VVersionCheckSettings >( i_pSettings, "LumekVideoViewer", false ) ),
        m_pVersionCheck( std::make_shared< VVersionCheck >( i_pParent, BuiltInVersionServer ) )
  {
    m_pVersionCheck->SetServer( i_rVersionServer );
  }

  bool VApplicationVersionCheck::CheckAtStartup()
  {
    return Check( true );
  }

  bool VApplicationVersionCheck::CheckOnRequest()
  {
    return Check( false );
  }

  bool VApplicationVersionCheck::Check( bool i_bStartupCheck )
  {
    if( m_pVersion == nullptr )
      return false;
    const std::string Name = m_pVersion->ProductKey ? m_pVersion->ProductKey : "";
    return m_pVersionCheck->Check( Name, m_VersionText, m_SystemText, i_bStartupCheck, m_pSettings, TimeoutSeconds,
                                   Protocol );
  }
} // namespace VersionCheck
