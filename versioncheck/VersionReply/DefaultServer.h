#pragma once

// Addresses the update check knows without being told. They sit under a domain reserved for
// examples, so that a build that is never given a real server contacts no host at all. This
// header has no Qt in it: the command line is parsed before Qt starts.

namespace VersionCheck
{
  // The `--version-server` default.
  inline constexpr const char* DefaultVersionServer = "https://versions.lumek.example/";

  // What the window gives the check at construction, before the command line's address replaces it.
  inline constexpr const char* BuiltInVersionServer = "http://versions.lumek.example/";

  // Linked from the dialog a user sees when the server cannot be reached.
  inline constexpr const char* SupportPage = "https://support.lumek.example/LumekVideoViewer/";
} // namespace VersionCheck
