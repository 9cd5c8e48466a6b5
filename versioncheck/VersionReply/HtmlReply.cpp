#include "versioncheck/VersionReply/HtmlReply.h"

#include "services/Log.h"
#include "versioncheck/VersionReply/MarkupDepth.h"

#include <rapidxml/rapidxml.hpp>

#include <vector>

namespace VersionCheck
{
  namespace
  {
    const char* const LogCategory = "CheckVersion";

    const rapidxml::xml_node<>& FindBody( const rapidxml::xml_document<>& i_rDocument )
    {
      const auto* pHtml = i_rDocument.first_node( "HTML" );
      if( pHtml == nullptr )
        throw VNoHTMLException();
      const auto* pBody = pHtml->first_node( "BODY" );
      if( pBody == nullptr )
        throw VBadHTMLException();
      return *pBody;
    }

    void LogBody( const rapidxml::xml_node<>& i_rBody, int i_Level )
    {
      for( const auto* pChild = i_rBody.first_node(); pChild != nullptr; pChild = pChild->next_sibling() )
      {
        const std::string Text( pChild->value(), pChild->value_size() );
        LUMEK_LOG( LogCategory, i_Level, "%s", Text );
      }
    }
  } // namespace

  int HtmlReplyLogLevel( const std::string& i_rMessageType )
  {
    if( i_rMessageType == "REQUIRED" )
      return ZOL::LogFailure;
    if( i_rMessageType == "NONE" )
      return ZOL::LogInfoDetail;
    return ZOL::LogWarning;
  }

  bool ReadHtmlReply( const std::string& i_rBody, const std::string& i_rMessageType )
  {
    try
    {
      if( XmlNestingDepth( i_rBody, MaximumHtmlDepth ).Depth > MaximumHtmlDepth )
        throw VBadHTMLException();
      // RapidXml parses in place and needs the terminating zero.
      std::vector< char > Text( i_rBody.begin(), i_rBody.end() );
      Text.push_back( 0 );
      rapidxml::xml_document<> Document;
      Document.parse< 0 >( Text.data() );
      LogBody( FindBody( Document ), HtmlReplyLogLevel( i_rMessageType ) );
      return true;
    }
    catch( ... )
    {
      LUMEK_LOG( LogCategory, ZOL::LogFailure, "Could not parse VersionCheck reply." );
    }
    return false;
  }
} // namespace VersionCheck
