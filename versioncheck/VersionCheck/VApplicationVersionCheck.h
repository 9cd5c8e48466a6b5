#pragma once

#include "services/IApplicationVersion.h"
#include "versioncheck/VersionCheck/VVersionCheck.h"
#include "versioncheck/VersionCheck/VVersionCheckSettings.h"

#include <memory>
#include <string>

class QSettings;
class QWidget;

namespace VersionCheck
{
  // The version text the server is told: the spoofed text when there is one, otherwise
  // "<major>.<minor>.<point>.<build tag>" of the release record ("1.10.0.137509h").
  std::string VersionText( const ZOL::IApplicationVersion& i_rVersion, const std::string& i_rSpoofVersion );

  // The update check as the window uses it. Build one in the window's constructor, after the
  // settings store, and call CheckAtStartup right away; call CheckOnRequest from
  // "&Check for Updates...":
  //
  //   m_pUpdateCheck = std::make_unique< VersionCheck::VApplicationVersionCheck >(
  //       this, m_pSettings, DebugServices::ApplicationVersion(), i_rVersionServer, i_rSpoofVersion );
  //   m_pUpdateCheck->CheckAtStartup();
  //
  // A check at start is silent unless the server has a message for the start; a user's check shows
  // the server's message, or an error dialog when the server cannot be reached. Both run through
  // the event loop and return at once.
  class VApplicationVersionCheck
  {
  public:
    static constexpr unsigned TimeoutSeconds = 20;
    static constexpr const char* Protocol = "1.0";

    // i_pParent: the window, parent of the dialogs. i_pSettings: the window's store, borrowed.
    // i_pVersion: the release record; without one nothing is ever sent. i_rVersionServer: the
    // `--version-server` text, used as it stands (empty too). i_rSpoofVersion: `--spoof-version`.
    VApplicationVersionCheck( QWidget* i_pParent, QSettings* i_pSettings, const ZOL::IApplicationVersion* i_pVersion,
                              const std::string& i_rVersionServer, const std::string& i_rSpoofVersion );

    // Return whether a request was sent.
    bool CheckAtStartup();
    bool CheckOnRequest();

    // What the server is told this release is.
    const std::string& GetVersionText() const { return m_VersionText; }
    VVersionCheck& GetVersionCheck() { return *m_pVersionCheck; }
    const std::shared_ptr< VVersionCheckSettings >& GetSettings() const { return m_pSettings; }

  private:
    bool Check( bool i_bStartupCheck );

    const ZOL::IApplicationVersion* m_pVersion;
    std::string m_VersionText;
    std::string m_SystemText;
    std::shared_ptr< VVersionCheckSettings > m_pSettings;
    std::shared_ptr< VVersionCheck > m_pVersionCheck;
  };
} // namespace VersionCheck
