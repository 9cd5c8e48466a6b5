#include "versioncheck/VersionCheck/VVersionCheckSettings.h"

#include <QSettings>

namespace VersionCheck
{
  VVersionCheckSettings::VVersionCheckSettings( QSettings* i_pSettings, const QString& i_rPrefix,
                                                bool i_bForceShowOnStartup )
      : m_pSettings( i_pSettings ), m_Prefix( i_rPrefix ), m_bForceShowOnStartup( i_bForceShowOnStartup )
  {
  }

  QString VVersionCheckSettings::Key( const char* i_pName ) const
  {
    return QStringLiteral( "%1.%2" ).arg( m_Prefix, QLatin1String( i_pName ) );
  }

  std::string VVersionCheckSettings::GetMessageId() const
  {
    if( m_pSettings == nullptr )
      return {};
    const QVariant Value = m_pSettings->value( Key( "MessageId" ) );
    return Value.isNull() ? std::string() : Value.toString().toStdString();
  }

  void VVersionCheckSettings::SetMessageId( const std::string& i_rMessageId )
  {
    if( m_pSettings != nullptr )
      m_pSettings->setValue( Key( "MessageId" ), QString::fromStdString( i_rMessageId ) );
  }

  bool VVersionCheckSettings::GetShowOnStartup() const
  {
    if( m_bForceShowOnStartup || m_pSettings == nullptr )
      return true;
    const QVariant Value = m_pSettings->value( Key( "ShowOnStartup" ) );
    return Value.isNull() || Value.toBool();
  }

  void VVersionCheckSettings::SetShowOnStartup( bool i_bShowOnStartup )
  {
    if( m_pSettings != nullptr )
      m_pSettings->setValue( Key( "ShowOnStartup" ), i_bShowOnStartup );
  }

  void VVersionCheckSettings::Report( int, const std::string&, const std::string&, const std::string& ) {}
} // namespace VersionCheck
