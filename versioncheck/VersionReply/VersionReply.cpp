#include "versioncheck/VersionReply/VersionReply.h"

#include "versioncheck/VersionReply/MarkupDepth.h"

#include <boost/format.hpp>
#include <boost/property_tree/json_parser.hpp>
#include <boost/property_tree/ptree.hpp>

#include <sstream>

namespace pt = boost::property_tree;

namespace VersionCheck
{
  namespace
  {
    std::string JsonError( const std::string& i_rMessage, unsigned long i_Line )
    {
      return ( boost::format( "Error parsing JSON data: %1% on line %2%" ) % i_rMessage % i_Line ).str();
    }

    void ReadFields( const pt::ptree& i_rTree, IVersionReply& o_rReply )
    {
      o_rReply.CheckVersion = i_rTree.get< std::string >( "CheckVersion", "" );
      o_rReply.MessageType = i_rTree.get< std::string >( "MessageType", "NONE" );
      o_rReply.Id = i_rTree.get< std::string >( "Id", "" );
      o_rReply.ProductVersion = i_rTree.get< std::string >( "ProductVersion", "" );
      // A "3.0" reply without a whitelist is read as an empty one rather than as an error.
      o_rReply.Whitelist.clear();
      if( const auto Whitelist = i_rTree.get_child_optional( "Whitelist" ) )
        for( const auto& rChild : *Whitelist )
          o_rReply.Whitelist.push_back( rChild.second.get_value< std::string >() );
    }
  } // namespace

  std::string ExtractCommentText( const std::string& i_rBody )
  {
    const auto Start = i_rBody.find( "<!--" );
    const auto End = i_rBody.find( "-->" );
    if( Start == std::string::npos || End == std::string::npos || End < Start + 4 )
      return {};
    return i_rBody.substr( Start + 4, End - Start - 4 );
  }

  bool ParseVersionReply( const std::string& i_rBody, IVersionReply& o_rReply, std::string& o_rError )
  {
    o_rReply = IVersionReply();
    const std::string Json = ExtractCommentText( i_rBody );
    // The JSON reader recurses once per level; a hostile reply must not take the stack with it.
    const auto Depth = JsonNestingDepth( Json, MaximumJsonDepth );
    if( Depth.Depth > MaximumJsonDepth )
    {
      o_rError = JsonError( "nesting too deep", Depth.Line );
      return false;
    }
    try
    {
      std::istringstream Stream( Json );
      pt::ptree Tree;
      pt::read_json( Stream, Tree );
      ReadFields( Tree, o_rReply );
      return true;
    }
    catch( const pt::json_parser_error& rError )
    {
      o_rError = JsonError( rError.message(), rError.line() );
    }
    catch( const std::exception& rError )
    {
      o_rError = JsonError( rError.what(), 0 );
    }
    o_rReply = IVersionReply();
    return false;
  }
} // namespace VersionCheck
