// Feeds one server reply to every reading of it: the JSON in the comment, the RapidXml page
// reading, and the os-release reading of the system text.

#include "services/ILogCategorised.h"
#include "versioncheck/VersionReply/HtmlReply.h"
#include "versioncheck/VersionReply/MarkupDepth.h"
#include "versioncheck/VersionReply/SystemText.h"
#include "versioncheck/VersionReply/VersionReply.h"

#include <boost/property_tree/json_parser.hpp>
#include <boost/property_tree/ptree.hpp>
#include <rapidxml/rapidxml.hpp>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <sstream>
#include <string>

namespace
{
  int TreeDepth( const rapidxml::xml_node<>& i_rNode )
  {
    int Deepest = 0;
    for( const auto* pChild = i_rNode.first_node(); pChild != nullptr; pChild = pChild->next_sibling() )
      if( pChild->type() == rapidxml::node_element )
        Deepest = std::max( Deepest, TreeDepth( *pChild ) );
    return 1 + Deepest;
  }

  int TreeDepth( const boost::property_tree::ptree& i_rTree )
  {
    int Deepest = 0;
    for( const auto& rChild : i_rTree )
      Deepest = std::max( Deepest, TreeDepth( rChild.second ) );
    return 1 + Deepest;
  }

  // Likewise for the JSON reader: a tree of n levels below its root needs n brackets.
  void CheckJsonDepthBound( const std::string& i_rBody )
  {
    const std::string Json = VersionCheck::ExtractCommentText( i_rBody );
    const int Scanned = VersionCheck::JsonNestingDepth( Json, VersionCheck::MaximumJsonDepth ).Depth;
    if( Scanned > VersionCheck::MaximumJsonDepth )
      return;
    try
    {
      std::istringstream Stream( Json );
      boost::property_tree::ptree Tree;
      boost::property_tree::read_json( Stream, Tree );
      if( TreeDepth( Tree ) - 1 > Scanned )
        __builtin_trap();
    }
    catch( const boost::property_tree::json_parser_error& )
    {
    }
  }

  // The depth scan is what keeps RapidXml off a deep stack, so it must never count fewer levels
  // than RapidXml builds. It counts elements with contents; a self-closed one may sit one below.
  void CheckXmlDepthBound( const std::string& i_rText )
  {
    const int Limit = VersionCheck::MaximumHtmlDepth;
    const int Scanned = VersionCheck::XmlNestingDepth( i_rText, Limit ).Depth;
    if( Scanned > Limit )
      return;
    std::string Copy = i_rText;
    try
    {
      rapidxml::xml_document<> Document;
      Document.parse< 0 >( &Copy[0] );
      const int ElementDepth = TreeDepth( Document ) - 1;
      if( ElementDepth > Scanned + 1 )
        __builtin_trap();
    }
    catch( const rapidxml::parse_error& )
    {
    }
  }

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

  CheckXmlDepthBound( Body );
  CheckJsonDepthBound( Body );
  VersionCheck::SystemTextFromName( VersionCheck::OperatingSystemName( Body ) );
  return 0;
}
