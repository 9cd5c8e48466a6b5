#pragma once

#include "services/NotificationSystem/VCallback.h"
#include "versioncheck/VersionCheck/IVersionCheckSettings.h"
#include "versioncheck/VersionCheck/VVersionCheckListener.h"

#include <QObject>
#include <QPointer>
#include <QWidget>

#include <memory>
#include <string>
#include <vector>

class QNetworkAccessManager;

namespace VersionCheck
{
  // Asks the version server about this release: one HTTP GET per Check, whose reply a
  // VVersionCheckListener reads. Main thread only. Requests may overlap; each has its listener.
  class VVersionCheck : public QObject
  {
    Q_OBJECT

  public:
    // A reply larger than this is cut off and treated as a failed request.
    static constexpr qint64 MaximumReplyBytes = 1024 * 1024;

    // No request yet. i_pParent is the parent of the dialogs, not of this object.
    VVersionCheck( QWidget* i_pParent, const std::string& i_rServer );
    ~VVersionCheck() override;

    void SetServer( const std::string& i_rServer );
    const std::string& GetServer() const { return m_Server; }

    // The URL of a request: "<server>?protocol=<protocol>&name=<name>&version=<version>&system=<system>",
    // taken as it stands, without further encoding.
    std::string RequestUrl( const std::string& i_rName, const std::string& i_rVersion, const std::string& i_rSystem,
                            const std::string& i_rProtocol ) const;

    // Sends one request. i_bStartupCheck: a check at start shows only what the server wants shown
    // at start and never an error; a user's check shows the message or the error. Returns false,
    // sending nothing, off the main thread, without an application or without settings.
    bool Check( const std::string& i_rName, const std::string& i_rVersion, const std::string& i_rSystem,
                bool i_bStartupCheck, std::shared_ptr< IVersionCheckSettings > i_pSettings, unsigned i_TimeoutSeconds,
                const std::string& i_rProtocol );

    // Replaces how a filled message box is run (normally exec()); an empty runner restores that.
    void SetDialogRunner( VDialogRunner i_Runner );

    // Called with the server's newest version, its whitelist ("3.0" replies), and at the end of a
    // check with whether it was the start-up check. Nothing is registered by the application.
    NotificationSystem::VCallback< void( const std::string& ) > VersionUpdatedCallback;
    NotificationSystem::VCallback< void( const std::vector< std::string >& ) > WhitelistUpdatedCallback;
    NotificationSystem::VCallback< void( bool ) > VersionCheckCompleteCallback;

  private:
    void RelayVersionUpdated( std::string i_Version );
    void RelayWhitelistUpdated( std::vector< std::string > i_Whitelist );
    void RelayVersionCheckComplete( bool i_bStartupCheck );

    std::string m_Server;
    QPointer< QWidget > m_pParent;
    QNetworkAccessManager* m_pNetwork;
    VDialogRunner m_DialogRunner;
  };
} // namespace VersionCheck
