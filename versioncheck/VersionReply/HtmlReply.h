#pragma once

#include <stdexcept>
#include <string>

// A second way to read a reply: as an XHTML page, writing what its body says to the log. Nothing
// calls it today; it stays ready for a server that sends its message as the page itself.

namespace VersionCheck
{
  // The reply has no "HTML" element at its top.
  class VNoHTMLException : public std::runtime_error
  {
  public:
    VNoHTMLException() : std::runtime_error( "No HTML element in the reply" ) {}
  };

  // The "HTML" element has no "BODY".
  class VBadHTMLException : public std::runtime_error
  {
  public:
    VBadHTMLException() : std::runtime_error( "No BODY element in the reply's HTML" ) {}
  };

  // Elements nested deeper than this are refused before RapidXml sees them.
  constexpr int MaximumHtmlDepth = 256;

  // The log level at which a message of this type is written: "REQUIRED" 2, "NONE" 5, others 3.
  int HtmlReplyLogLevel( const std::string& i_rMessageType );

  // Parses the body with RapidXml and logs the text of each child of HTML/BODY in the category
  // "CheckVersion" at HtmlReplyLogLevel. On any failure logs "Could not parse VersionCheck reply."
  // at level 2 and returns false. Never throws.
  bool ReadHtmlReply( const std::string& i_rBody, const std::string& i_rMessageType );
} // namespace VersionCheck
