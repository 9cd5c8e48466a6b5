// The reading of the version server's reply, without Qt: golden replies in, records or error texts
// out, hostile nesting refused; the spare page reading; the system text. How the depth scans
// bound the real readers is the fuzzer's to check.

#include "versioncheck/VersionReply/VersionReply.h"
#include "services/ILogCategorised.h"
#include "tests/support/LogCapture.h"
#include "versioncheck/VersionReply/DefaultServer.h"
#include "versioncheck/VersionReply/HtmlReply.h"
#include "versioncheck/VersionReply/SystemText.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace
{
  using VersionCheck::IVersionReply;

  // The record's fields in order, or the error when the reply does not parse.
  std::vector< std::string > Fields( const IVersionReply& i_rReply )
  {
    std::vector< std::string > Result = { i_rReply.CheckVersion, i_rReply.MessageType, i_rReply.Id,
                                          i_rReply.ProductVersion };
    Result.insert( Result.end(), i_rReply.Whitelist.begin(), i_rReply.Whitelist.end() );
    return Result;
  }

  std::vector< std::string > Parse( const std::string& i_rBody )
  {
    IVersionReply Reply;
    std::string Error;
    if( !VersionCheck::ParseVersionReply( i_rBody, Reply, Error ) )
      return { Error };
    return Fields( Reply );
  }

  TEST( VersionReplyParse, GoldenRepliesGiveTheirRecordOrError )
  {
    const std::string Expected = "Error parsing JSON data: expected value on line 1";
    const struct
    {
      const char* Name;
      std::string Body;
      std::vector< std::string > Result; // CheckVersion, MessageType, Id, ProductVersion, whitelist...
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
        { "NoComment", "<html><body>Nothing to see</body></html>", { Expected } },
        { "UnclosedComment", "<!--{\"Id\":\"x\"}", { Expected } },
        { "CommentEndBeforeStart", "-->{\"Id\":\"x\"}<!--", { Expected } },
        { "TrailingCommaOnLineThree",
          "<!--{\n\"CheckVersion\": \"1.0\",\n}-->",
          { "Error parsing JSON data: expected key string on line 3" } },
        { "GarbageAfterDocument",
          "<!--{\"Id\":\"x\"} and more-->",
          { "Error parsing JSON data: garbage after data on line 1" } },
        { "NestedTooDeep",
          "<!--" + std::string( 100000, '[' ) + "-->",
          { "Error parsing JSON data: nesting too deep on line 1" } },
    };
    for( const auto& rCase : Cases )
      EXPECT_EQ( Parse( rCase.Body ), rCase.Result ) << rCase.Name;

    // Nesting right at the limit is still read.
    const int Depth = VersionCheck::MaximumJsonDepth;
    EXPECT_EQ(
        Parse( "<!--{\"Id\":\"deep\",\"x\":" + std::string( Depth - 1, '[' ) + std::string( Depth - 1, ']' ) + "}-->" ),
        ( std::vector< std::string >{ "", "NONE", "deep", "" } ) );
  }

  TEST( HtmlReply, LogsBodyTextAtTheTypesLevel )
  {
    const struct
    {
      const char* MessageType;
      int Level;
    } Cases[] = { { "REQUIRED", 2 }, { "NONE", 5 }, { "OPTIONAL", 3 }, { "", 3 } };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.MessageType );
      LumekTest::VLogCapture Capture( "CheckVersion" );
      ASSERT_TRUE( VersionCheck::ReadHtmlReply( "<HTML><HEAD><TITLE>t</TITLE></HEAD><BODY><P>New release</P>"
                                                "<P>Please update &amp; restart</P></BODY></HTML>",
                                                rCase.MessageType ) );
      const std::string Level = std::to_string( rCase.Level ) + " ";
      EXPECT_EQ( Capture.Lines(),
                 ( std::vector< std::string >{ Level + "New release", Level + "Please update & restart" } ) );
    }
  }

  TEST( HtmlReply, BadPagesLogOneFailureLine )
  {
    std::string Deep = "<HTML><BODY>";
    for( int Index = 0; Index < 100000; ++Index )
      Deep += "<a>";
    for( const std::string& rBody :
         { std::string( "<PAGE><BODY>x</BODY></PAGE>" ), std::string( "<HTML><HEAD>x</HEAD></HTML>" ),
           std::string( "<html><body>x</body></html>" ), // names are case sensitive
           std::string( "<HTML><BODY><p>unclosed</BODY>" ), std::string(), Deep } )
    {
      SCOPED_TRACE( rBody.substr( 0, 40 ) );
      LumekTest::VLogCapture Capture( "CheckVersion" );
      EXPECT_FALSE( VersionCheck::ReadHtmlReply( rBody, "NONE" ) );
      EXPECT_EQ( Capture.Lines(), std::vector< std::string >{ std::to_string( ZOL::LogFailure ) +
                                                              " Could not parse VersionCheck reply." } );
    }
  }

  TEST( SystemText, GoldenOsReleaseFiles )
  {
    const struct
    {
      std::string OsRelease, SystemText;
    } Cases[] = {
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
    for( const auto& rCase : Cases )
      EXPECT_EQ( VersionCheck::SystemTextFromName( VersionCheck::OperatingSystemName( rCase.OsRelease ) ),
                 rCase.SystemText )
          << rCase.OsRelease;

    const std::string Text = VersionCheck::SystemText();
    EXPECT_EQ( Text.find( ' ' ), std::string::npos ) << Text;
    ASSERT_GT( Text.size(), 6u );
    EXPECT_EQ( Text.substr( Text.size() - 6 ), "+64Bit" );
  }

  // A build that is never told a server must not reach a real host: every address the check knows
  // by itself lies under the domain reserved for examples, and the default is reached over https.
  TEST( BuiltInAddress, StaysUnderTheExampleDomain )
  {
    for( const std::string Address :
         { VersionCheck::DefaultVersionServer, VersionCheck::BuiltInVersionServer, VersionCheck::SupportPage } )
    {
      const auto HostStart = Address.find( "://" );
      ASSERT_NE( HostStart, std::string::npos ) << Address;
      const std::string Host = Address.substr( HostStart + 3, Address.find( '/', HostStart + 3 ) - HostStart - 3 );
      EXPECT_EQ( Host.substr( Host.size() - 8 ), ".example" ) << Address;
      EXPECT_EQ( Address.back(), '/' ) << Address;
    }
    EXPECT_EQ( std::string( VersionCheck::DefaultVersionServer ).rfind( "https://", 0 ), 0u );
  }
} // namespace
