#pragma once

#include <string>
#include <vector>

namespace VersionCheck
{
  // What the version server says, read from the JSON hidden in its HTML reply. Absent fields keep
  // these defaults.
  struct IVersionReply
  {
    std::string CheckVersion;         // "1.0", "2.0" or "3.0"
    std::string MessageType = "NONE"; // "OPTIONAL", "REQUIRED" or "NONE"
    std::string Id;
    std::string ProductVersion;
    std::vector< std::string > Whitelist; // empty when the reply has none
  };

  // JSON nested deeper than this is refused before it reaches the recursive parser.
  constexpr int MaximumJsonDepth = 64;

  // The text between the first "<!--" and the first "-->" of the body; empty when either is
  // missing or they are out of order.
  std::string ExtractCommentText( const std::string& i_rBody );

  // Reads the reply record out of a whole reply body. On failure returns false and sets o_rError to
  // "Error parsing JSON data: <message> on line <line>"; a body without a comment fails the same way,
  // as an empty JSON document. Never throws.
  bool ParseVersionReply( const std::string& i_rBody, IVersionReply& o_rReply, std::string& o_rError );
} // namespace VersionCheck
