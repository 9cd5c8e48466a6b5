// Feeds one server reply to every reading of it: the JSON in the comment, the RapidXml page
// reading, and the os-release reading of the system text.

#include "services/ILogCategorised.h"
#include "versioncheck/VersionReply/HtmlReply.h"
#include "versioncheck/VersionReply/SystemText.h"
#include "versioncheck/VersionReply/VersionReply.h"

#include <cstddef>
#include <cstdint>
#include <string>

namespace
{
  // Replies are a page or two; larger inputs only slow the search down.
  constexpr std::size_t MaximumInput = 256 * 1024;
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  // Nothing on standard error, but every message is still formatted and delivered.
  static const int s_Sink = ( ZOL::GlobalLog().SetStandardErrorLevel( 0 ),
                              ZOL::GlobalLog().AddSink( []( const ZOL::ILogRecord& ) {}, ZOL::LogDetail ) );
  (void)s_Sink;
  if( i_Size > MaximumInput )
    return 0;
  const std::string Body( reinterpret_cast< const char* >( i_pData ), i_Size );

  VersionCheck::IVersionReply Reply;
  std::string Error;
  if( !VersionCheck::ParseVersionReply( Body, Reply, Error ) && Error.empty() )
    __builtin_trap();

  for( const char* pType : { "REQUIRED", "OPTIONAL", "NONE" } )
    VersionCheck::ReadHtmlReply( Body, pType );

  VersionCheck::SystemTextFromName( VersionCheck::OperatingSystemName( Body ) );
  return 0;
}
