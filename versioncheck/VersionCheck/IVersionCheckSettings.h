#pragma once

#include <string>

namespace VersionCheck
{
  // What the update check remembers between runs: the id of the last message the server sent and
  // whether the user still wants to see it at start-up. Report receives the outcome of each check.
  class IVersionCheckSettings
  {
  public:
    virtual ~IVersionCheckSettings() = default;
    virtual std::string GetMessageId() const = 0;
    virtual void SetMessageId( const std::string& i_rMessageId ) = 0;
    virtual bool GetShowOnStartup() const = 0;
    virtual void SetShowOnStartup( bool i_bShowOnStartup ) = 0;
    // i_Status is the network error code (0 when the reply arrived), 4 for a time-out and 99 when
    // no reply could be found.
    virtual void Report( int i_Status, const std::string& i_rBody, const std::string& i_rMessageType,
                         const std::string& i_rError ) = 0;
  };
} // namespace VersionCheck
