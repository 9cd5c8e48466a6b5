// The reading of the version server's reply, without Qt: golden replies in, records or error texts
// out, hostile nesting refused; the spare page reading; the system text. How the depth scans
// bound the real readers is the fuzzer's to check.

#include "versioncheck/VersionReply/VersionReply.h"
#include "tests/support/LogCapture.h"
#include "versioncheck/VersionReply/DefaultServer.h"
#include "versioncheck/VersionReply/HtmlReply.h"
#include "versioncheck/VersionReply/SystemText.h"

#include <gtest/gtest.h>

#include <regex>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

namespace
{
  // The record's fields in order (CheckVersion, MessageType, Id, ProductVersion, whitelist...), or
  // the error when the reply does not parse.
  std::vector< std::string > Parse( const std::string& i_rBody )
  {
    VersionCheck::IVersionReply Reply;
    std::string Error;
    if( !VersionCheck::ParseVersionReply( i_rBody, Reply, Error ) )
      return { Error };
    std::vector< std::string > Result = { Reply.CheckVersion, Reply.MessageType, Reply.Id, Reply.ProductVersion };
    Result.insert( Result.end(), Reply.Whitelist.begin(), Reply.Whitelist.end() );
    return Result;
  }

  TEST( VersionReplyParse, GoldenRepliesGiveTheirRecordOrError )
  {
    const std::string NoComment = "Error parsing JSON data: expected value on line 1";
    const struct
    {
      const char* Name;
      std::string Body;
      std::vector< std::string > Result;
    } Cases[] = {
        { "OptionalMessageInPage",
          "<html><body><p>Version 1.11 is out.</p>\n<!--\n{ \"CheckVersion\": \"1.0\", \"MessageType\": \"OPTIONAL\","
          " \"Id\": \"2026-11-A\", \"ProductVersion\": \"1.11.0.140100h\" }\n--></body></html>",
          { "1.0", "OPTIONAL", "2026-11-A", "1.11.0.140100h" } },
        { "AbsentFieldsTakeDefaults", "<!--{}-->", { "", "NONE", "", "" } },
        { "NumbersReadAsText", "<!--{\"CheckVersion\": 3.0, \"Id\": 17}-->", { "3.0", "NONE", "17", "" } },
        { "WhitelistInOrder",
          "<!--{\"CheckVersion\":\"3.0\",\"ProductVersion\":\"2.0\",\"Whitelist\":[\"1.10.0.137509h\","
          "\"0.3.0.55914h\"]}-->",
          { "3.0", "NONE", "", "2.0", "1.10.0.137509h", "0.3.0.55914h" } },
        { "WhitelistObjectGivesItsValues",
          "<!--{\"Whitelist\":{\"a\":\"x\",\"b\":\"y\"}}-->",
          { "", "NONE", "", "", "x", "y" } },
        { "FirstCommentOnly", "<!--{\"Id\":\"first\"}--><!--{\"Id\":\"second\"}-->", { "", "NONE", "first", "" } },
        { "NoComment", "<html><body>Nothing to see</body></html>", { NoComment } },
        { "UnclosedComment", "<!--{\"Id\":\"x\"}", { NoComment } },
        { "CommentEndBeforeStart", "-->{\"Id\":\"x\"}<!--", { NoComment } },
        { "TrailingCommaOnLineThree",
          "<!--{\n\"CheckVersion\": \"1.0\",\n}-->",
          { "Error parsing JSON data: expected key string on line 3" } },
        { "GarbageAfterDocument",
          "<!--{\"Id\":\"x\"} and more-->",
          { "Error parsing JSON data: garbage after data on line 1" } },
        { "NestedTooDeep",
          "<!--" + std::string( 100000, '[' ) + "-->",
          { "Error parsing JSON data: nesting too deep on line 1" } },
        // Nesting right at the limit is still read.
        { "NestedToTheLimit",
          "<!--{\"Id\":\"deep\",\"x\":" + std::string( VersionCheck::MaximumJsonDepth - 1, '[' ) +
              std::string( VersionCheck::MaximumJsonDepth - 1, ']' ) + "}-->",
          { "", "NONE", "deep", "" } },
    };
    for( const auto& rCase : Cases )
      EXPECT_EQ( Parse( rCase.Body ), rCase.Result ) << rCase.Name;
  }

  // The body's paragraphs are logged at the level the message type asks for; a page that is not
  // one gives one failure line.
  TEST( HtmlReply, LogsBodyTextAtTheTypesLevel )
  {
    const std::string Page = "<HTML><HEAD><TITLE>t</TITLE></HEAD><BODY><P>New release</P>"
                             "<P>Please update &amp; restart</P></BODY></HTML>";
    const std::vector< std::string > Failed = { "2 Could not parse VersionCheck reply." };
    std::string Deep = "<HTML><BODY>";
    for( int Index = 0; Index < 100000; ++Index )
      Deep += "<a>";
    // The page, the message type, the lines logged.
    const std::tuple< std::string, std::string, std::vector< std::string > > Cases[] = {
        { Page, "REQUIRED", { "2 New release", "2 Please update & restart" } },
        { Page, "NONE", { "5 New release", "5 Please update & restart" } },
        { Page, "OPTIONAL", { "3 New release", "3 Please update & restart" } },
        { "<PAGE><BODY>x</BODY></PAGE>", "NONE", Failed },
        { "<HTML><HEAD>x</HEAD></HTML>", "NONE", Failed },
        { "<HTML><BODY><p>unclosed</BODY>", "NONE", Failed },
        { Deep, "NONE", Failed },
    };
    for( const auto& [Body, MessageType, Lines] : Cases )
    {
      SCOPED_TRACE( Body.substr( 0, 40 ) + " as " + MessageType );
      LumekTest::VLogCapture Capture( "CheckVersion" );
      EXPECT_EQ( VersionCheck::ReadHtmlReply( Body, MessageType ), Lines != Failed );
      EXPECT_EQ( Capture.Lines(), Lines );
    }
  }

  TEST( SystemText, GoldenOsReleaseFiles )
  {
    const std::pair< std::string, std::string > Cases[] = {
        { "PRETTY_NAME=\"Debian GNU/Linux 12 (bookworm)\"\nNAME=\"Debian GNU/Linux\"\nVERSION_ID=\"12\"\n",
          "Debian+GNU/Linux+12+(bookworm)+64Bit" },
        { "NAME=x\nPRETTY_NAME='Fedora Linux 40'\n", "Fedora+Linux+40+64Bit" },
        { "PRETTY_NAME=Alpine\n", "Alpine+64Bit" },
        { "PRETTY_NAME=\"A \\\"B\\\" C\"\n", "A+\"B\"+C+64Bit" },
        { "PRETTY_NAME=\"Arch Linux\"\r\n", "Arch+Linux+64Bit" },
        { "ID=debian\nNAME=\"Debian GNU/Linux\"\n", "Debian+GNU/Linux+64Bit" }, // NAME when no PRETTY_NAME
        { "XPRETTY_NAME=no\nNAME=yes\n", "yes+64Bit" },                         // a prefix is not the key
        { "", "Linux+64Bit" },
    };
    for( const auto& [OsRelease, SystemText] : Cases )
      EXPECT_EQ( VersionCheck::SystemTextFromName( VersionCheck::OperatingSystemName( OsRelease ) ), SystemText )
          << OsRelease;
  }

  // A build that is never told a server must not reach a real host: every address the check knows
  // by itself lies under the domain reserved for examples, and the default is reached over https.
  TEST( BuiltInAddress, StaysUnderTheExampleDomain )
  {
    for( const char* pAddress :
         { VersionCheck::DefaultVersionServer, VersionCheck::BuiltInVersionServer, VersionCheck::SupportPage } )
      EXPECT_TRUE( std::regex_match( pAddress, std::regex( "https?://[-a-z.]+\\.example/([^/]+/)*" ) ) ) << pAddress;
    EXPECT_TRUE( std::regex_match( VersionCheck::DefaultVersionServer, std::regex( "https:.*" ) ) );
  }
} // namespace
