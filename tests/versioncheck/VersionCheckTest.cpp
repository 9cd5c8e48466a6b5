// The update check end to end against a version server that the test starts on 127.0.0.1: each
// reply format and message type, at start and on request; what is remembered between checks; the
// server that never answers, refuses or floods; the dialogs as the user would see them.

#include "services/IApplicationVersion.h"
#include "tests/support/TestNames.h"
#include "tests/versioncheck/TestServer.h"
#include "versioncheck/VersionCheck/VApplicationVersionCheck.h"
#include "versioncheck/VersionCheck/VVersionCheck.h"
#include "versioncheck/VersionCheck/VVersionCheckListener.h"
#include "versioncheck/VersionCheck/VVersionCheckMessageBox.h"
#include "versioncheck/VersionCheck/VVersionCheckSettings.h"
#include "versioncheck/VersionReply/SystemText.h"

#include <gtest/gtest.h>

#include <QApplication>
#include <QCheckBox>
#include <QElapsedTimer>
#include <QEventLoop>
#include <QPushButton>
#include <QSettings>
#include <QTextBrowser>
#include <QTimer>

#include <algorithm>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

namespace
{
  using namespace VersionCheck;

  // Runs the event loop until i_Done holds or the time is up; deferred deletes happen on the way.
  bool RunUntil( const std::function< bool() >& i_Done, int i_Milliseconds = 15000 )
  {
    if( i_Done() )
      return true;
    QEventLoop Loop;
    QTimer Poll;
    QObject::connect( &Poll, &QTimer::timeout, &Loop,
                      [&]
                      {
                        if( i_Done() )
                          Loop.quit();
                      } );
    Poll.start( 5 );
    QTimer::singleShot( i_Milliseconds, &Loop, &QEventLoop::quit );
    Loop.exec();
    return i_Done();
  }

  struct IOutcome
  {
    int Status;
    std::string Body;
    std::string MessageType;
    std::string Error;
  };

  // The application's settings over the test's store, with each check's outcome kept aside.
  class VRecordingSettings : public IVersionCheckSettings
  {
  public:
    explicit VRecordingSettings( QSettings* i_pStore ) : m_Settings( i_pStore, "LumekVideoViewer", false ) {}
    std::string GetMessageId() const override { return m_Settings.GetMessageId(); }
    void SetMessageId( const std::string& i_rId ) override { m_Settings.SetMessageId( i_rId ); }
    bool GetShowOnStartup() const override { return m_Settings.GetShowOnStartup(); }
    void SetShowOnStartup( bool i_bShow ) override { m_Settings.SetShowOnStartup( i_bShow ); }
    void Report( int i_Status, const std::string& i_rBody, const std::string& i_rType,
                 const std::string& i_rError ) override
    {
      Outcomes.push_back( { i_Status, i_rBody, i_rType, i_rError } );
      m_Settings.Report( i_Status, i_rBody, i_rType, i_rError );
    }

    std::vector< IOutcome > Outcomes;

  private:
    VVersionCheckSettings m_Settings;
  };

  struct IShownDialog
  {
    QString Title;
    QString Text;
    bool bCheckBox;
    bool bError;
  };

  // A reply page as the server sends it: a message to show, the record in a comment.
  std::string Page( const std::string& i_rCheckVersion, const std::string& i_rType, const std::string& i_rId,
                    const std::string& i_rMore = "" )
  {
    return "<html><body><p>Message " + i_rId + "</p><!--{\"CheckVersion\":\"" + i_rCheckVersion +
           "\",\"MessageType\":\"" + i_rType + "\",\"Id\":\"" + i_rId + "\",\"ProductVersion\":\"1.11.0.140100h\"" +
           i_rMore + "}--></body></html>";
  }

  class VersionCheckTest : public testing::Test
  {
  protected:
    void SetUp() override
    {
      m_Store.clear();
      m_Check.SetServer( m_Server.Url().toStdString() );
      m_Check.SetDialogRunner(
          [this]( VVersionCheckMessageBox& io_rBox )
          {
            m_Shown.push_back( { io_rBox.windowTitle(), io_rBox.GetTextBrowser()->toPlainText(),
                                 io_rBox.GetCheckBox() != nullptr, io_rBox.IsError() } );
            if( m_bTickBox && io_rBox.GetCheckBox() )
              io_rBox.GetCheckBox()->setChecked( true );
          } );
      m_Check.VersionUpdatedCallback.Set( [this]( const std::string& i_rVersion )
                                          { m_Versions.push_back( i_rVersion ); } );
      m_Check.WhitelistUpdatedCallback.Set( [this]( const std::vector< std::string >& i_rList )
                                            { m_Whitelists.push_back( i_rList ); } );
      m_Check.VersionCheckCompleteCallback.Set( [this]( bool i_bStartup ) { m_Completions.push_back( i_bStartup ); } );
    }

    void TearDown() override { m_Store.clear(); }

    void Serve( const std::string& i_rBody, int i_Status = 200 )
    {
      m_Server.SetReply( i_Status, QByteArray::fromStdString( i_rBody ) );
    }

    // One check, run until its listener is gone.
    bool Run( bool i_bStartupCheck, unsigned i_TimeoutSeconds = 10 )
    {
      const bool bSent = m_Check.Check( "LumekVideoViewer", "1.10.0.137509h", "Debian+GNU/Linux+12+64Bit",
                                        i_bStartupCheck, m_pSettings, i_TimeoutSeconds, "1.0" );
      EXPECT_TRUE( RunUntil( [this] { return m_Check.findChildren< VVersionCheckListener* >().isEmpty(); } ) );
      return bSent;
    }

    QSettings m_Store{ "Lumek Labs Ltd", "LumekVideoViewer" };
    std::shared_ptr< VRecordingSettings > m_pSettings = std::make_shared< VRecordingSettings >( &m_Store );
    VTestServer m_Server;
    VVersionCheck m_Check{ nullptr, "" };
    bool m_bTickBox = false;
    std::vector< IShownDialog > m_Shown;
    std::vector< std::string > m_Versions;
    std::vector< std::vector< std::string > > m_Whitelists;
    std::vector< bool > m_Completions;
  };

  // One exchange with the server and everything that should follow from it.
  struct IExchangeCase
  {
    const char* Name;
    std::string Body;
    int HttpStatus;
    bool bStartupCheck;
    std::optional< std::string > StoredId;
    std::optional< bool > StoredShowOnStartup;
    // Expected:
    int Dialogs;
    bool bCheckBox;
    bool bErrorIcon;
    bool bComplete;
    int Status;
    std::string MessageType;
    std::string Error; // checked when not empty
    std::vector< std::string > Versions;
    std::vector< std::vector< std::string > > Whitelists;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const IExchangeCase& i_rCase )
  {
    return io_rStream << i_rCase.Name;
  }

  const std::string Optional = Page( "1.0", "OPTIONAL", "A" );
  const std::string Required = Page( "1.0", "REQUIRED", "A" );
  const std::string None = Page( "1.0", "NONE", "A" );
  const std::string Whitelisted = Page( "3.0", "NONE", "A", ",\"Whitelist\":[\"1.10.0.137509h\",\"1.9.0.1h\"]" );
  const std::string ListOnly = Page( "3.0", "NONE", "A" );
  const std::vector< std::string > Newest = { "1.11.0.140100h" };

  // Each row: name, reply body, HTTP status, at start, stored id and show-at-start; then the dialogs
  // shown, with a check box, with the error icon, completed, the reported status and message type,
  // the error (when not empty), the versions and whitelists announced.
  // clang-format off
  const IExchangeCase ExchangeCases[] = {
      { "OptionalNewAtStart", Optional, 200, true, {}, {},
        1, true, false, true, 0, "OPTIONAL", "", Newest, {} },
      { "OptionalSeenAndDeclinedAtStart", Optional, 200, true, "A", false,
        0, false, false, true, 0, "OPTIONAL", "", Newest, {} },
      { "OptionalSeenStillWantedAtStart", Optional, 200, true, "A", true,
        1, true, false, true, 0, "OPTIONAL", "", Newest, {} },
      { "OptionalDeclinedButNewIdAtStart", Optional, 200, true, "old", false,
        1, true, false, true, 0, "OPTIONAL", "", Newest, {} },
      { "OptionalDeclinedOnRequest", Optional, 200, false, "A", false,
        1, false, false, true, 0, "OPTIONAL", "", Newest, {} },
      { "RequiredDeclinedAtStart", Required, 200, true, "A", false,
        1, false, false, true, 0, "REQUIRED", "", Newest, {} },
      { "NoneAtStart", None, 200, true, {}, {},
        0, false, false, true, 0, "NONE", "", Newest, {} },
      { "NoneOnRequest", None, 200, false, "A", true,
        1, false, false, true, 0, "NONE", "", Newest, {} },
      { "TypeAbsentAtStart", "<!--{\"CheckVersion\":\"1.0\",\"Id\":\"A\"}-->", 200, true, {}, {},
        0, false, false, true, 0, "NONE", "", { "" }, {} },
      { "Format2AtStart", Page( "2.0", "REQUIRED", "A" ), 200, true, {}, {},
        0, false, false, false, 0, "", "", {}, {} },
      { "Format2OnRequest", Page( "2.0", "REQUIRED", "A" ), 200, false, {}, {},
        0, false, false, false, 0, "", "", {}, {} },
      { "Format3NewAtStart", Whitelisted, 200, true, {}, {},
        0, false, false, true, 0, "NONE", "", Newest, { { "1.10.0.137509h", "1.9.0.1h" } } },
      { "Format3DeclinedAtStart", Whitelisted, 200, true, "A", false,
        0, false, false, true, 0, "NONE", "", {}, {} },
      { "Format3DeclinedOnRequest", Whitelisted, 200, false, "A", false,
        0, false, false, true, 0, "NONE", "", Newest, { { "1.10.0.137509h", "1.9.0.1h" } } },
      { "Format3WithoutWhitelist", ListOnly, 200, false, {}, {},
        0, false, false, true, 0, "NONE", "", Newest, { {} } },
      { "UnknownFormatOnRequest", Page( "4.0", "REQUIRED", "A" ), 200, false, {}, {},
        0, false, false, true, 0, "REQUIRED", "", {}, {} },
      { "BadJsonOnRequest", "<!--{\n\"CheckVersion\": \"1.0\",\n}-->", 200, false, {}, {},
        0, false, false, true, 0, "NONE", "Error parsing JSON data: expected key string on line 3", {}, {} },
      { "NoCommentAtStart", "<html><body>Down for maintenance</body></html>", 200, true, {}, {},
        0, false, false, true, 0, "NONE", "Error parsing JSON data: expected value on line 1", {}, {} },
      { "NotFoundAtStart", Required, 404, true, {}, {},
        0, false, false, true, 203, "NONE", "", {}, {} },
      { "NotFoundOnRequest", Required, 404, false, {}, {},
        1, false, true, true, 203, "NONE", "", {}, {} },
  };
  // clang-format on

  class VersionCheckExchange : public VersionCheckTest, public testing::WithParamInterface< IExchangeCase >
  {
  };

  TEST_P( VersionCheckExchange, ShowsAndReportsWhatTheReplyAsksFor )
  {
    const IExchangeCase& rCase = GetParam();
    if( rCase.StoredId )
      m_pSettings->SetMessageId( *rCase.StoredId );
    if( rCase.StoredShowOnStartup )
      m_pSettings->SetShowOnStartup( *rCase.StoredShowOnStartup );
    Serve( rCase.Body, rCase.HttpStatus );

    ASSERT_TRUE( Run( rCase.bStartupCheck ) );

    ASSERT_EQ( static_cast< int >( m_Shown.size() ), rCase.Dialogs );
    for( const auto& rShown : m_Shown )
    {
      EXPECT_EQ( rShown.Title, "Checking LumekVideoViewer Version" );
      EXPECT_EQ( rShown.bCheckBox, rCase.bCheckBox );
      EXPECT_EQ( rShown.bError, rCase.bErrorIcon );
      if( rCase.bErrorIcon )
        EXPECT_TRUE( rShown.Text.startsWith( "Unable to contact version check server.\n"
                                             "Please check your network connection and try again.\n" ) )
            << rShown.Text.toStdString();
      else
        EXPECT_EQ( rShown.Text, "Message A" );
    }
    EXPECT_EQ( m_Versions, rCase.Versions );
    EXPECT_EQ( m_Whitelists, rCase.Whitelists );

    if( !rCase.bComplete )
    {
      EXPECT_TRUE( m_Completions.empty() );
      EXPECT_TRUE( m_pSettings->Outcomes.empty() );
    }
    else
    {
      EXPECT_EQ( m_Completions, std::vector< bool >{ rCase.bStartupCheck } );
      ASSERT_EQ( m_pSettings->Outcomes.size(), 1u );
      const IOutcome& rOutcome = m_pSettings->Outcomes[0];
      EXPECT_EQ( rOutcome.Status, rCase.Status );
      EXPECT_EQ( rOutcome.MessageType, rCase.MessageType );
      EXPECT_EQ( rOutcome.Body, rCase.Body );
      if( !rCase.Error.empty() )
      {
        EXPECT_EQ( rOutcome.Error, rCase.Error );
      }
    }
  }

  INSTANTIATE_TEST_SUITE_P( Replies, VersionCheckExchange, testing::ValuesIn( ExchangeCases ), LumekTest::VCaseName() );

  TEST_F( VersionCheckTest, DoNotShowAgainHoldsUntilTheIdChanges )
  {
    Serve( Optional );
    m_bTickBox = true;
    Run( true );
    ASSERT_EQ( m_Shown.size(), 1u );
    EXPECT_TRUE( m_Shown.back().bCheckBox );
    EXPECT_FALSE( m_pSettings->GetShowOnStartup() );

    Run( true );
    EXPECT_EQ( m_Shown.size(), 1u ) << "the same message came back at start after the user declined it";

    Run( false );
    ASSERT_EQ( m_Shown.size(), 2u ) << "a user's check shows the message anyway";
    EXPECT_FALSE( m_Shown.back().bCheckBox );
    EXPECT_FALSE( m_pSettings->GetShowOnStartup() );

    Serve( Page( "1.0", "OPTIONAL", "B" ) );
    m_bTickBox = false;
    Run( true );
    ASSERT_EQ( m_Shown.size(), 3u ) << "a new message clears the choice";
    EXPECT_EQ( m_Shown.back().Text, "Message B" );
    EXPECT_TRUE( m_pSettings->GetShowOnStartup() );
    EXPECT_EQ( m_Store.value( "LumekVideoViewer.MessageId" ).toString(), "B" );
    EXPECT_EQ( m_Server.Requests().size(), 4 );
  }

  TEST_F( VersionCheckTest, RequiredIsShownAtEveryStart )
  {
    Serve( Required );
    m_bTickBox = true;
    for( int Start = 0; Start < 3; ++Start )
      Run( true );
    ASSERT_EQ( m_Shown.size(), 3u );
    for( const auto& rShown : m_Shown )
      EXPECT_FALSE( rShown.bCheckBox );
  }

  TEST_F( VersionCheckTest, SilentServerTimesOutWithoutADialog )
  {
    m_Server.SetMode( VTestServer::EMode::Silent );
    for( const bool bStartupCheck : { true, false } )
    {
      m_pSettings->Outcomes.clear();
      ASSERT_TRUE( Run( bStartupCheck, 1 ) );
      ASSERT_EQ( m_pSettings->Outcomes.size(), 1u );
      const IOutcome& rOutcome = m_pSettings->Outcomes[0];
      EXPECT_EQ( rOutcome.Status, 4 );
      EXPECT_EQ( rOutcome.Body, "" );
      EXPECT_EQ( rOutcome.MessageType, "NONE" );
      EXPECT_EQ( rOutcome.Error, "Version check request timeout" );
    }
    EXPECT_TRUE( m_Shown.empty() );
    EXPECT_TRUE( m_Completions.empty() );
    EXPECT_EQ( m_Server.Requests().size(), 2 );
  }

  TEST_F( VersionCheckTest, RefusedConnectionIsSilentAtStartAndShownOnRequest )
  {
    m_Check.SetServer( QStringLiteral( "http://127.0.0.1:%1/" ).arg( VTestServer::ClosedPort() ).toStdString() );
    Run( true );
    EXPECT_TRUE( m_Shown.empty() );
    Run( false );
    ASSERT_EQ( m_Shown.size(), 1u );
    EXPECT_TRUE( m_Shown[0].bError );
    EXPECT_FALSE( m_Shown[0].bCheckBox );
    ASSERT_EQ( m_pSettings->Outcomes.size(), 2u );
    for( const auto& rOutcome : m_pSettings->Outcomes )
      EXPECT_EQ( rOutcome.Status, 1 ) << rOutcome.Error; // QNetworkReply::ConnectionRefusedError
    EXPECT_EQ( m_Completions, ( std::vector< bool >{ true, false } ) );
  }

  TEST_F( VersionCheckTest, EmptyServerFailsSilentlyAtStart )
  {
    m_Check.SetServer( "" );
    EXPECT_EQ( m_Check.RequestUrl( "LumekVideoViewer", "1.10.0.137509h", "X+64Bit", "1.0" ),
               "?protocol=1.0&name=LumekVideoViewer&version=1.10.0.137509h&system=X+64Bit" );
    ASSERT_TRUE( Run( true ) );
    EXPECT_TRUE( m_Shown.empty() );
    ASSERT_EQ( m_pSettings->Outcomes.size(), 1u );
    EXPECT_NE( m_pSettings->Outcomes[0].Status, 0 );
    EXPECT_EQ( m_Completions, std::vector< bool >{ true } );
  }

  TEST_F( VersionCheckTest, FloodingServerIsCutOff )
  {
    for( const auto Mode : { VTestServer::EMode::Flood, VTestServer::EMode::Stream } )
    {
      m_pSettings->Outcomes.clear();
      m_Server.SetMode( Mode );
      Run( true );
      EXPECT_TRUE( m_Shown.empty() );
      ASSERT_EQ( m_pSettings->Outcomes.size(), 1u );
      EXPECT_EQ( m_pSettings->Outcomes[0].Status, 5 ); // QNetworkReply::OperationCanceledError
      EXPECT_LE( m_pSettings->Outcomes[0].Body.size(), static_cast< std::size_t >( VVersionCheck::MaximumReplyBytes ) );
    }
  }

  TEST_F( VersionCheckTest, OverlappingChecksEachGetTheirAnswer )
  {
    Serve( None );
    ASSERT_TRUE( m_Check.Check( "LumekVideoViewer", "1", "S", true, m_pSettings, 10, "1.0" ) );
    EXPECT_TRUE( m_pSettings->Outcomes.empty() ) << "a check must return before its answer comes";
    ASSERT_TRUE( Run( false ) );
    EXPECT_EQ( m_pSettings->Outcomes.size(), 2u );
    std::sort( m_Completions.begin(), m_Completions.end() );
    EXPECT_EQ( m_Completions, ( std::vector< bool >{ false, true } ) );
    EXPECT_EQ( m_Shown.size(), 1u );
  }

  TEST_F( VersionCheckTest, RefusesWithoutSettingsOrOffTheMainThread )
  {
    EXPECT_FALSE( m_Check.Check( "LumekVideoViewer", "1", "S", true, nullptr, 10, "1.0" ) );
    bool bSentFromThread = true;
    std::thread Other(
        [&] { bSentFromThread = m_Check.Check( "LumekVideoViewer", "1", "S", true, m_pSettings, 10, "1.0" ); } );
    Other.join();
    EXPECT_FALSE( bSentFromThread );
    EXPECT_TRUE( m_Check.findChildren< VVersionCheckListener* >().isEmpty() );
  }

  TEST_F( VersionCheckTest, ListenerWithoutAReplyReportsUnknownError )
  {
    VVersionCheckListener Listener( "LumekVideoViewer", true, m_pSettings, nullptr, {}, nullptr );
    Listener.OnReplyFinished();
    Listener.OnTimeout(); // finished already: no second outcome
    ASSERT_EQ( m_pSettings->Outcomes.size(), 1u );
    EXPECT_EQ( m_pSettings->Outcomes[0].Status, 99 );
    EXPECT_EQ( m_pSettings->Outcomes[0].Error, "Unknown error" );
  }

  // The application's own dialog, run modally: the test ticks the box and presses "OK" as a user would.
  TEST_F( VersionCheckTest, ModalDialogAnsweredLikeAUser )
  {
    m_Check.SetDialogRunner( {} );
    Serve( Optional );
    QString Title;
    QTimer Answer;
    QObject::connect( &Answer, &QTimer::timeout,
                      [&]
                      {
                        for( QWidget* pWidget : QApplication::topLevelWidgets() )
                        {
                          auto* pBox = qobject_cast< VVersionCheckMessageBox* >( pWidget );
                          if( pBox == nullptr || !pBox->isVisible() )
                            continue;
                          Title = pBox->windowTitle();
                          pBox->GetCheckBox()->setChecked( true );
                          for( QPushButton* pButton : pBox->findChildren< QPushButton* >() )
                            if( pButton->text() == "OK" )
                              pButton->click();
                        }
                      } );
    Answer.start( 20 );
    Run( true );
    EXPECT_EQ( Title, "Checking LumekVideoViewer Version" );
    EXPECT_FALSE( m_pSettings->GetShowOnStartup() );
    EXPECT_EQ( m_Completions, std::vector< bool >{ true } );
  }

  // The settings the window builds over its store.
  TEST( VersionCheckSettings, RoundTripUnderTopLevelKeys )
  {
    QSettings Store( "Lumek Labs Ltd", "LumekVideoViewer" );
    Store.clear();
    VVersionCheckSettings Settings( &Store, "LumekVideoViewer", false );
    EXPECT_EQ( Settings.GetMessageId(), "" );
    EXPECT_TRUE( Settings.GetShowOnStartup() );
    Settings.SetMessageId( "2026-11-A" );
    Settings.SetShowOnStartup( false );
    Settings.Report( 0, "<html/>", "OPTIONAL", "Unknown error" );
    Store.sync();

    QSettings Again( "Lumek Labs Ltd", "LumekVideoViewer" );
    EXPECT_EQ( Again.allKeys(), ( QStringList{ "LumekVideoViewer.MessageId", "LumekVideoViewer.ShowOnStartup" } ) );
    VVersionCheckSettings Reader( &Again, "LumekVideoViewer", false );
    EXPECT_EQ( Reader.GetMessageId(), "2026-11-A" );
    EXPECT_FALSE( Reader.GetShowOnStartup() );
    EXPECT_TRUE( VVersionCheckSettings( &Again, "LumekVideoViewer", true ).GetShowOnStartup() );
    Store.clear();
  }

  TEST( VersionCheckSettings, MissingStoreReadsDefaults )
  {
    VVersionCheckSettings Settings( nullptr, "LumekVideoViewer", false );
    Settings.SetMessageId( "x" );
    Settings.SetShowOnStartup( false );
    EXPECT_EQ( Settings.GetMessageId(), "" );
    EXPECT_TRUE( Settings.GetShowOnStartup() );
  }

  // The object the window holds.
  class ApplicationVersionCheckTest : public VersionCheckTest
  {
  };

  TEST_F( ApplicationVersionCheckTest, TellsTheServerTheReleaseAndSystem )
  {
    Serve( None );
    VApplicationVersionCheck UpdateCheck( nullptr, &m_Store, &LumekVideoViewer::ApplicationVersion(),
                                          m_Server.Url().toStdString(), "" );
    EXPECT_EQ( UpdateCheck.GetVersionText(), "1.10.0.137509h" );
    ASSERT_TRUE( UpdateCheck.CheckAtStartup() );
    RunUntil( [&] { return UpdateCheck.GetVersionCheck().findChildren< VVersionCheckListener* >().isEmpty(); } );
    ASSERT_EQ( m_Server.Requests().size(), 1 );
    EXPECT_EQ( m_Server.Requests()[0].toStdString(),
               "/?protocol=1.0&name=LumekVideoViewer&version=1.10.0.137509h&system=" + SystemText() );
    // The outcome leaves no trace: the store holds the two values of the check and nothing else.
    m_Store.sync();
    EXPECT_EQ( m_Store.allKeys(), ( QStringList{ "LumekVideoViewer.MessageId", "LumekVideoViewer.ShowOnStartup" } ) );
  }

  TEST_F( ApplicationVersionCheckTest, SpoofedVersionAndUsersCheck )
  {
    Serve( Optional );
    VApplicationVersionCheck UpdateCheck( nullptr, &m_Store, &LumekVideoViewer::ApplicationVersion(),
                                          m_Server.Url().toStdString(), "0.3.0.55914h" );
    std::vector< bool > Boxes;
    UpdateCheck.GetVersionCheck().SetDialogRunner( [&]( VVersionCheckMessageBox& io_rBox )
                                                   { Boxes.push_back( io_rBox.GetCheckBox() != nullptr ); } );
    ASSERT_TRUE( UpdateCheck.CheckOnRequest() );
    RunUntil( [&] { return UpdateCheck.GetVersionCheck().findChildren< VVersionCheckListener* >().isEmpty(); } );
    ASSERT_EQ( m_Server.Requests().size(), 1 );
    EXPECT_NE( m_Server.Requests()[0].indexOf( "&version=0.3.0.55914h&" ), -1 ) << m_Server.Requests()[0].toStdString();
    EXPECT_EQ( Boxes, std::vector< bool >{ false } );
  }

  TEST( ApplicationVersionCheck, WithoutAReleaseRecordSendsNothing )
  {
    VApplicationVersionCheck UpdateCheck( nullptr, nullptr, nullptr, "http://127.0.0.1:9/", "" );
    EXPECT_FALSE( UpdateCheck.CheckAtStartup() );
    EXPECT_FALSE( UpdateCheck.CheckOnRequest() );
  }
} // namespace
