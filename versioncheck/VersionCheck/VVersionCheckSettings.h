#pragma once

#include "versioncheck/VersionCheck/IVersionCheckSettings.h"

#include <QString>

class QSettings;

namespace VersionCheck
{
  // The update check's two values in the application's settings store, under "<prefix>.MessageId"
  // and "<prefix>.ShowOnStartup" at the top level of the store. The window passes its store, the
  // prefix "LumekVideoViewer" and false.
  class VVersionCheckSettings : public IVersionCheckSettings
  {
  public:
    // i_pSettings is borrowed and may be null: then nothing is stored and the defaults are read.
    // i_bForceShowOnStartup makes GetShowOnStartup true whatever is stored.
    VVersionCheckSettings( QSettings* i_pSettings, const QString& i_rPrefix, bool i_bForceShowOnStartup );

    std::string GetMessageId() const override;
    void SetMessageId( const std::string& i_rMessageId ) override;
    bool GetShowOnStartup() const override;
    void SetShowOnStartup( bool i_bShowOnStartup ) override;
    // The application keeps no record of outcomes: this does nothing.
    void Report( int i_Status, const std::string& i_rBody, const std::string& i_rMessageType,
                 const std::string& i_rError ) override;

  private:
    QString Key( const char* i_pName ) const;

    QSettings* m_pSettings;
    QString m_Prefix;
    bool m_bForceShowOnStartup;
  };
} // namespace VersionCheck
