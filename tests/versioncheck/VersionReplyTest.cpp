// The reading of the version server's reply, without Qt: golden replies in, records or error texts
// out, hostile nesting refused; the spare page reading; the system text. How the depth scans
// bound the real readers is the fuzzer's to check.

#include "versioncheck/VersionReply/VersionReply.h"
#include "services/ILogCategorised.h"
#include "tests/support/LogCapture.h"
#include "tests/support/TestNames.h"
#include "versioncheck/VersionReply/DefaultServer.h"
#include "versioncheck/VersionReply/HtmlReply.h"
#include "versioncheck/VersionReply/SystemText.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace
{
  using VersionCheck::IVersionReply;

  struct IReplyCase
  {
    const char* Name;
    std::string Body;
    bool bParses;
    IVersionReply Expected; // when it parses
    std::string Error;      // when it does not
  };

  std::ostream& operator<<( std::ostream& io_rStream, const IReplyCase& i_rCase )
  {
    return io_rStream << i_rCase.Name;
  }

  IVersionReply Reply( std::string i_CheckVersion, std::string i_MessageType, std::string i_Id, std::string i_Product,
                       std::vector< std::string > i_Whitelist = {} )
  {
    return IVersionReply{ std::move( i_CheckVersion ), std::move( i_MessageType ), std::move( i_Id ),
                          std::move( i_Product ), std::move( i_Whitelist ) };
  }

  // clang-format off
  const IReplyCase ReplyCases[] = {
      { "OptionalMessageInPage",
        "<html><body><p>Version 1.11 is out.</p>\n<!--\n{ \"CheckVersion\": \"1.0\", \"MessageType\": \"OPTIONAL\","
        " \"Id\": \"2026-11-A\", \"ProductVersion\": \"1.11.0.140100h\" }\n--></body></html>",
        true, Reply( "1.0", "OPTIONAL", "2026-11-A", "1.11.0.140100h" ), "" },
      { "AbsentFieldsTakeDefaults", "<!--{}-->", true, Reply( "", "NONE", "", "" ), "" },
      { "NumbersReadAsText", "<!--{\"CheckVersion\": 3.0, \"Id\": 17}-->", true, Reply( "3.0", "NONE", "17", "" ), "" },
      { "WhitelistInOrder",
        "<!--{\"CheckVersion\":\"3.0\",\"ProductVersion\":\"2.0\",\"Whitelist\":[\"1.10.0.137509h\",\"0.3.0.55914h\"]}-"
        "->",
        true, Reply( "3.0", "NONE", "", "2.0", { "1.10.0.137509h", "0.3.0.55914h" } ), "" },
      { "WhitelistAbsentIsEmpty", "<!--{\"CheckVersion\":\"3.0\"}-->", true, Reply( "3.0", "NONE", "", "" ), "" },
      { "WhitelistObjectGivesItsValues", "<!--{\"Whitelist\":{\"a\":\"x\",\"b\":\"y\"}}-->", true,
        Reply( "", "NONE", "", "", { "x", "y" } ), "" },
      { "FirstCommentOnly", "<!--{\"Id\":\"first\"}--><!--{\"Id\":\"second\"}-->", true,
        Reply( "", "NONE", "first", "" ), "" },
      { "NoComment", "<html><body>Nothing to see</body></html>", false, {},
        "Error parsing JSON data: expected value on line 1" },
      { "UnclosedComment", "<!--{\"Id\":\"x\"}", false, {}, "Error parsing JSON data: expected value on line 1" },
      { "CommentEndBeforeStart", "-->{\"Id\":\"x\"}<!--", false, {},
        "Error parsing JSON data: expected value on line 1" },
      { "TrailingCommaOnLineThree", "<!--{\n\"CheckVersion\": \"1.0\",\n}-->", false, {},
        "Error parsing JSON data: expected key string on line 3" },
      { "GarbageAfterDocument", "<!--{\"Id\":\"x\"} and more-->", false, {},
        "Error parsing JSON data: garbage after data on line 1" },
      { "NestedTooDeep", "<!--" + std::string( 100000, '[' ) + "-->", false, {},
        "Error parsing JSON data: nesting too deep on line 1" },
  };
  // clang-format on

  class VersionReplyParse : public testing::TestWithParam< IReplyCase >
  {
  };

  TEST_P( VersionReplyParse, GivesRecordOrError )
  {
    const IReplyCase& rCase = GetParam();
    IVersionReply Result;
    std::string Error;
    ASSERT_EQ( VersionCheck::ParseVersionReply( rCase.Body, Result, Error ), rCase.bParses ) << Error;
    if( !rCase.bParses )
    {
      EXPECT_EQ( Error, rCase.Error );
      return;
    }
    EXPECT_EQ( Result.CheckVersion, rCase.Expected.CheckVersion );
    EXPECT_EQ( Result.MessageType, rCase.Expected.MessageType );
    EXPECT_EQ( Result.Id, rCase.Expected.Id );
    EXPECT_EQ( Result.ProductVersion, rCase.Expected.ProductVersion );
    EXPECT_EQ( Result.Whitelist, rCase.Expected.Whitelist );
  }

  INSTANTIATE_TEST_SUITE_P( Golden, VersionReplyParse, testing::ValuesIn( ReplyCases ), LumekTest::VCaseName() );

  TEST( VersionReplyParse, DepthAtTheLimitStillParses )
  {
    const int Depth = VersionCheck::MaximumJsonDepth;
    const std::string Json =
        "{\"Id\":\"deep\",\"x\":" + std::string( Depth - 1, '[' ) + std::string( Depth - 1, ']' ) + "}";
    IVersionReply Result;
    std::string Error;
    ASSERT_TRUE( VersionCheck::ParseVersionReply( "<!--" + Json + "-->", Result, Error ) ) << Error;
    EXPECT_EQ( Result.Id, "deep" );
  }

  struct IHtmlLevelCase
  {
    const char* MessageType;
    int Level;
  };

  class HtmlReply : public testing::TestWithParam< IHtmlLevelCase >
  {
  };

  TEST_P( HtmlReply, LogsBodyTextAtTheTypesLevel )
  {
    LumekTest::VLogCapture Capture( "CheckVersion" );
    ASSERT_TRUE( VersionCheck::ReadHtmlReply(
        "<HTML><HEAD><TITLE>t</TITLE></HEAD><BODY><P>New release</P><P>Please update &amp; restart</P></BODY></HTML>",
        GetParam().MessageType ) );
    ASSERT_EQ( Capture.Records.size(), 2u );
    EXPECT_EQ( Capture.Records[0].Message, "New release" );
    EXPECT_EQ( Capture.Records[1].Message, "Please update & restart" );
    for( const auto& rRecord : Capture.Records )
      EXPECT_EQ( rRecord.Level, GetParam().Level );
  }

  INSTANTIATE_TEST_SUITE_P( Types, HtmlReply,
                            testing::Values( IHtmlLevelCase{ "REQUIRED", 2 }, IHtmlLevelCase{ "NONE", 5 },
                                             IHtmlLevelCase{ "OPTIONAL", 3 }, IHtmlLevelCase{ "", 3 } ),
                            []( const testing::TestParamInfo< IHtmlLevelCase >& i_rInfo ) {
                              return std::string( i_rInfo.param.MessageType[0] ? i_rInfo.param.MessageType : "Empty" );
                            } );

  struct IBadPageCase
  {
    const char* Name;
    std::string Body;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const IBadPageCase& i_rCase )
  {
    return io_rStream << i_rCase.Name;
  }

  class HtmlReplyFailure : public testing::TestWithParam< IBadPageCase >
  {
  };

  TEST_P( HtmlReplyFailure, LogsOneFailureLine )
  {
    LumekTest::VLogCapture Capture( "CheckVersion" );
    EXPECT_FALSE( VersionCheck::ReadHtmlReply( GetParam().Body, "NONE" ) );
    ASSERT_EQ( Capture.Records.size(), 1u );
    EXPECT_EQ( Capture.Records[0].Message, "Could not parse VersionCheck reply." );
    EXPECT_EQ( Capture.Records[0].Level, ZOL::LogFailure );
  }

  INSTANTIATE_TEST_SUITE_P( Cases, HtmlReplyFailure,
                            testing::Values( IBadPageCase{ "NoHtml", "<PAGE><BODY>x</BODY></PAGE>" },
                                             IBadPageCase{ "NoBody", "<HTML><HEAD>x</HEAD></HTML>" },
                                             IBadPageCase{ "NamesAreCaseSensitive", "<html><body>x</body></html>" },
                                             IBadPageCase{ "NotXml", "<HTML><BODY><p>unclosed</BODY>" },
                                             IBadPageCase{ "Empty", "" },
                                             IBadPageCase{ "NestedTooDeep",
                                                           []
                                                           {
                                                             std::string Text = "<HTML><BODY>";
                                                             for( int Index = 0; Index < 100000; ++Index )
                                                               Text += "<a>";
                                                             return Text;
                                                           }() } ),
                            LumekTest::VCaseName() );

  struct ISystemCase
  {
    const char* Name;
    std::string OsRelease;
    std::string SystemText;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const ISystemCase& i_rCase )
  {
    return io_rStream << i_rCase.Name;
  }

  class SystemText : public testing::TestWithParam< ISystemCase >
  {
  };

  TEST_P( SystemText, FromOsRelease )
  {
    EXPECT_EQ( VersionCheck::SystemTextFromName( VersionCheck::OperatingSystemName( GetParam().OsRelease ) ),
               GetParam().SystemText );
  }

  INSTANTIATE_TEST_SUITE_P(
      Golden, SystemText,
      testing::Values(
          ISystemCase{ "Debian",
                       "PRETTY_NAME=\"Debian GNU/Linux 12 (bookworm)\"\nNAME=\"Debian GNU/Linux\"\nVERSION_ID=\"12\"\n",
                       "Debian+GNU/Linux+12+(bookworm)+64Bit" },
          ISystemCase{ "SingleQuotes", "NAME=x\nPRETTY_NAME='Fedora Linux 40'\n", "Fedora+Linux+40+64Bit" },
          ISystemCase{ "Unquoted", "PRETTY_NAME=Alpine\n", "Alpine+64Bit" },
          ISystemCase{ "Escapes", "PRETTY_NAME=\"A \\\"B\\\" C\"\n", "A+\"B\"+C+64Bit" },
          ISystemCase{ "WindowsLineEnds", "PRETTY_NAME=\"Arch Linux\"\r\n", "Arch+Linux+64Bit" },
          ISystemCase{ "NameWhenNoPrettyName", "ID=debian\nNAME=\"Debian GNU/Linux\"\n", "Debian+GNU/Linux+64Bit" },
          ISystemCase{ "PrefixIsNotKey", "XPRETTY_NAME=no\nNAME=yes\n", "yes+64Bit" },
          ISystemCase{ "Nothing", "", "Linux+64Bit" } ),
      LumekTest::VCaseName() );

  TEST( SystemText, OfThisMachineHasNoBlanks )
  {
    const std::string Text = VersionCheck::SystemText();
    EXPECT_EQ( Text.find( ' ' ), std::string::npos ) << Text;
    EXPECT_GT( Text.size(), std::string( "+64Bit" ).size() );
    EXPECT_EQ( Text.substr( Text.size() - 6 ), "+64Bit" );
  }
} // namespace

namespace
{
  // A build that is never told a server must not reach a real host: every address the check knows
  // by itself lies under the domain reserved for examples.
  class BuiltInAddress : public testing::TestWithParam< const char* >
  {
  };

  TEST_P( BuiltInAddress, StaysUnderTheExampleDomain )
  {
    const std::string Address = GetParam();
    const auto HostStart = Address.find( "://" );
    ASSERT_NE( HostStart, std::string::npos );
    const std::string Host = Address.substr( HostStart + 3, Address.find( '/', HostStart + 3 ) - HostStart - 3 );
    EXPECT_EQ( Host.substr( Host.size() - 8 ), ".example" ) << Address;
    EXPECT_EQ( Address.back(), '/' ) << Address;
  }

  const char* const s_AddressNames[] = { "DefaultVersionServer", "BuiltInVersionServer", "SupportPage" };

  INSTANTIATE_TEST_SUITE_P( All, BuiltInAddress,
                            testing::Values( VersionCheck::DefaultVersionServer, VersionCheck::BuiltInVersionServer,
                                             VersionCheck::SupportPage ),
                            []( const testing::TestParamInfo< const char* >& i_rInfo )
                            { return std::string( s_AddressNames[i_rInfo.index] ); } );

  TEST( BuiltInAddress, CommandLineDefaultIsHttps )
  {
    EXPECT_EQ( std::string( VersionCheck::DefaultVersionServer ).rfind( "https://", 0 ), 0u );
  }
} // namespace
