#pragma once

#include <string>

// The "system" the update check names to the server: the operating system's name, a blank and
// "64Bit", with every blank then turned into "+". There is one build of the program, so the
// "64Bit" is a constant.

namespace VersionCheck
{
  // The name a text in the os-release format gives: PRETTY_NAME, else NAME, else "Linux".
  std::string OperatingSystemName( const std::string& i_rOsRelease );

  // The system text for an operating system name: "Debian GNU/Linux 12" gives
  // "Debian+GNU/Linux+12+64Bit".
  std::string SystemTextFromName( const std::string& i_rName );

  // The system text of this machine, from /etc/os-release or /usr/lib/os-release.
  std::string SystemText();
} // namespace VersionCheck
