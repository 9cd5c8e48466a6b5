// The update check end to end against a version server that the test starts on 127.0.0.1: each
// reply format and message type, at start and on request; what is remembered between checks; the
// server that never answers, refuses or floods; the dialogs as the user would see them.

#include "services/IApplicationVersion.h"
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
  // (QTest::qWaitFor sleeps 10 ms a round, which an exchange needs several of.)
  bool RunUntil( const std::function< bool() >& i_Done )
  {
    QEventLoop Loop;
    QTimer Poll;
    QObject::connect( &Poll, &QTimer::timeout, &Loop, [&] { i_Done() ? Loop.quit() : void(); } );
    Poll.start( 5 );
    QTimer::singleShot( 15000, &Loop, &QEventLoop::quit );
    if( !i_Done() )
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
  struct VRecordingSettings : public VVersionCheckSettings
  {
    explicit VRecordingSettings( QSettings* i_pStore ) : VVersionCheckSettings( i_pStore, "LumekVideoViewer", false ) {}
    void Report( int i_Status, const std::string& i_rBody, const std::string& i_rType,
                 const std::string& i_rError ) override
    {
      Outcomes.push_back( { i_Status, i_rBody, i_rType, i_rError } );
      VVersionCheckSettings::Report( i_Status, i_rBody, i_rType, i_rError );
    }

    std::vector< IOutcome > Outcomes;
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

  // A check against the test's own server, with every dialog it would show and every callback
  // it makes written down. Each check of a test shares one store of settings, cleared at both ends.
  struct VCheckHarness
  {
    VCheckHarness()
    {
      Store.clear();
      Check.SetServer( Server.Url().toStdString() );
      Check.SetDialogRunner(
          [this]( VVersionCheckMessageBox& io_rBox )
          {
            Shown.push_back( { io_rBox.windowTitle(), io_rBox.GetTextBrowser()->toPlainText(),
                               io_rBox.GetCheckBox() != nullptr, io_rBox.IsError() } );
            if( bTickBox && io_rBox.GetCheckBox() )
              io_rBox.GetCheckBox()->setChecked( true );
          } );
      Check.VersionUpdatedCallback.Set( [this]( const std::string& i_rVersion ) { Versions.push_back( i_rVersion ); } );
      Check.WhitelistUpdatedCallback.Set( [this]( const std::vector< std::string >& i_rList )
                                          { Whitelists.push_back( i_rList ); } );
      Check.VersionCheckCompleteCallback.Set( [this]( bool i_bStartup ) { Completions.push_back( i_bStartup ); } );
    }
    ~VCheckHarness() { Store.clear(); }

    void Serve( const std::string& i_rBody, int i_Status = 200 )
    {
      Server.SetReply( i_Status, QByteArray::fromStdString( i_rBody ) );
    }

    // One check, run until its listener is gone.
    bool RunCheck( bool i_bStartupCheck, unsigned i_TimeoutSeconds = 10 )
    {
      const bool bSent = Check.Check( "LumekVideoViewer", "1.10.0.137509h", "Debian+GNU/Linux+12+64Bit",
                                      i_bStartupCheck, pSettings, i_TimeoutSeconds, "1.0" );
      EXPECT_TRUE( RunUntil( [this] { return Check.findChildren< VVersionCheckListener* >().isEmpty(); } ) );
      return bSent;
    }

    QSettings Store{ "Lumek Labs Ltd", "LumekVideoViewer" };
    std::shared_ptr< VRecordingSettings > pSettings = std::make_shared< VRecordingSettings >( &Store );
    VTestServer Server;
    VVersionCheck Check{ nullptr, "" };
    bool bTickBox = false;
    std::vector< IShownDialog > Shown;
    std::vector< std::string > Versions;
    std::vector< std::vector< std::string > > Whitelists;
    std::vector< bool > Completions;
  };

  class VersionCheckTest : public testing::Test, public VCheckHarness
  {
  };

  const std::string Optional = Page( "1.0", "OPTIONAL", "A" );
  const std::string Required = Page( "1.0", "REQUIRED", "A" );
  const std::string None = Page( "1.0", "NONE", "A" );

  // One exchange with the server and everything that should follow from it.
  TEST( VersionCheckExchange, ShowsAndReportsWhatTheReplyAsksFor )
  {
    const std::string Whitelisted = Page( "3.0", "NONE", "A", ",\"Whitelist\":[\"1.10.0.137509h\",\"1.9.0.1h\"]" );
    const std::vector< std::string > Newest = { "1.11.0.140100h" };
    const std::vector< std::vector< std::string > > Listed = { { "1.10.0.137509h", "1.9.0.1h" } };
    const struct
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
    } Cases[] = {
        // Each row: name, reply body, HTTP status, at start, stored id and show-at-start; then the
        // dialogs shown, with a check box, with the error icon, completed, the reported status and
        // message type, the error (when not empty), the versions and whitelists announced.
        // clang-format off
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
          0, false, false, true, 0, "NONE", "", Newest, Listed },
        { "Format3DeclinedAtStart", Whitelisted, 200, true, "A", false,
          0, false, false, true, 0, "NONE", "", {}, {} },
        { "Format3DeclinedOnRequest", Whitelisted, 200, false, "A", false,
          0, false, false, true, 0, "NONE", "", Newest, Listed },
        { "Format3WithoutWhitelist", Page( "3.0", "NONE", "A" ), 200, false, {}, {},
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
        // clang-format on
    };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VCheckHarness H;
      if( rCase.StoredId )
        H.pSettings->SetMessageId( *rCase.StoredId );
      if( rCase.StoredShowOnStartup )
        H.pSettings->SetShowOnStartup( *rCase.StoredShowOnStartup );
      H.Serve( rCase.Body, rCase.HttpStatus );
      ASSERT_TRUE( H.RunCheck( rCase.bStartupCheck ) );

      ASSERT_EQ( static_cast< int >( H.Shown.size() ), rCase.Dialogs );
      for( const auto& rShown : H.Shown )
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
      EXPECT_EQ( H.Versions, rCase.Versions );
      EXPECT_EQ( H.Whitelists, rCase.Whitelists );

      // A reply of a format the check does not know ends it without an outcome.
      EXPECT_EQ( H.Completions, rCase.bComplete ? std::vector< bool >{ rCase.bStartupCheck } : std::vector< bool >{} );
      ASSERT_EQ( H.pSettings->Outcomes.size(), rCase.bComplete ? 1u : 0u );
      if( !rCase.bComplete )
        continue;
      const IOutcome& rOutcome = H.pSettings->Outcomes[0];
      EXPECT_EQ( rOutcome.Status, rCase.Status );
      EXPECT_EQ( rOutcome.MessageType, rCase.MessageType );
      EXPECT_EQ( rOutcome.Body, rCase.Body );
      if( !rCase.Error.empty() )
      {
        EXPECT_EQ( rOutcome.Error, rCase.Error );
      }
    }
  }

  TEST_F( VersionCheckTest, DoNotShowAgainHoldsUntilTheIdChanges )
  {
    Serve( Optional );
    bTickBox = true;
    RunCheck( true );
    ASSERT_EQ( Shown.size(), 1u );
    EXPECT_TRUE( Shown.back().bCheckBox );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    RunCheck( true );
    EXPECT_EQ( Shown.size(), 1u ) << "the same message came back at start after the user declined it";

    RunCheck( false );
    ASSERT_EQ( Shown.size(), 2u ) << "a user's check shows the message anyway";
    EXPECT_FALSE( Shown.back().bCheckBox );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    Serve( Page( "1.0", "OPTIONAL", "B" ) );
    bTickBox = false;
    RunCheck( true );
    ASSERT_EQ( Shown.size(), 3u ) << "a new message clears the choice";
    EXPECT_EQ( Shown.back().Text, "Message B" );
    EXPECT_TRUE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( Store.value( "LumekVideoViewer.MessageId" ).toString(), "B" );
    EXPECT_EQ( Server.Requests().size(), 4 );

    // A required message offers no box to tick and comes back at every start.
    Serve( Required );
    bTickBox = true;
    for( int Start = 0; Start < 2; ++Start )
      RunCheck( true );
    ASSERT_EQ( Shown.size(), 5u );
    EXPECT_FALSE( Shown[3].bCheckBox || Shown[4].bCheckBox );
  }

  TEST_F( VersionCheckTest, SilentServerTimesOutWithoutADialog )
  {
    Server.SetMode( VTestServer::EMode::Silent );
    for( const bool bStartupCheck : { true, false } )
    {
      pSettings->Outcomes.clear();
      ASSERT_TRUE( RunCheck( bStartupCheck, 1 ) );
      ASSERT_EQ( pSettings->Outcomes.size(), 1u );
      const IOutcome& rOutcome = pSettings->Outcomes[0];
      EXPECT_EQ( rOutcome.Status, 4 );
      EXPECT_EQ( rOutcome.Body, "" );
      EXPECT_EQ( rOutcome.MessageType, "NONE" );
      EXPECT_EQ( rOutcome.Error, "Version check request timeout" );
    }
    EXPECT_TRUE( Shown.empty() );
    EXPECT_TRUE( Completions.empty() );
    EXPECT_EQ( Server.Requests().size(), 2 );
  }

  TEST_F( VersionCheckTest, RefusedConnectionIsSilentAtStartAndShownOnRequest )
  {
    Check.SetServer( QStringLiteral( "http://127.0.0.1:%1/" ).arg( VTestServer::ClosedPort() ).toStdString() );
    RunCheck( true );
    EXPECT_TRUE( Shown.empty() );
    RunCheck( false );
    ASSERT_EQ( Shown.size(), 1u );
    EXPECT_TRUE( Shown[0].bError );
    EXPECT_FALSE( Shown[0].bCheckBox );
    ASSERT_EQ( pSettings->Outcomes.size(), 2u );
    for( const auto& rOutcome : pSettings->Outcomes )
      EXPECT_EQ( rOutcome.Status, 1 ) << rOutcome.Error; // QNetworkReply::ConnectionRefusedError
    EXPECT_EQ( Completions, ( std::vector< bool >{ true, false } ) );
  }

  TEST_F( VersionCheckTest, EmptyServerFailsSilentlyAtStart )
  {
    Check.SetServer( "" );
    EXPECT_EQ( Check.RequestUrl( "LumekVideoViewer", "1.10.0.137509h", "X+64Bit", "1.0" ),
               "?protocol=1.0&name=LumekVideoViewer&version=1.10.0.137509h&system=X+64Bit" );
    ASSERT_TRUE( RunCheck( true ) );
    EXPECT_TRUE( Shown.empty() );
    ASSERT_EQ( pSettings->Outcomes.size(), 1u );
    EXPECT_NE( pSettings->Outcomes[0].Status, 0 );
    EXPECT_EQ( Completions, std::vector< bool >{ true } );
  }

  TEST_F( VersionCheckTest, FloodingServerIsCutOff )
  {
    for( const auto Mode : { VTestServer::EMode::Flood, VTestServer::EMode::Stream } )
    {
      pSettings->Outcomes.clear();
      Server.SetMode( Mode );
      RunCheck( true );
      EXPECT_TRUE( Shown.empty() );
      ASSERT_EQ( pSettings->Outcomes.size(), 1u );
      EXPECT_EQ( pSettings->Outcomes[0].Status, 5 ); // QNetworkReply::OperationCanceledError
      EXPECT_LE( pSettings->Outcomes[0].Body.size(), static_cast< std::size_t >( VVersionCheck::MaximumReplyBytes ) );
    }
  }

  TEST_F( VersionCheckTest, OverlappingChecksEachGetTheirAnswer )
  {
    Serve( None );
    ASSERT_TRUE( Check.Check( "LumekVideoViewer", "1", "S", true, pSettings, 10, "1.0" ) );
    EXPECT_TRUE( pSettings->Outcomes.empty() ) << "a check must return before its answer comes";
    ASSERT_TRUE( RunCheck( false ) );
    EXPECT_EQ( pSettings->Outcomes.size(), 2u );
    std::sort( Completions.begin(), Completions.end() );
    EXPECT_EQ( Completions, ( std::vector< bool >{ false, true } ) );
    EXPECT_EQ( Shown.size(), 1u );
  }

  TEST_F( VersionCheckTest, RefusesWithoutSettingsOrOffTheMainThread )
  {
    EXPECT_FALSE( Check.Check( "LumekVideoViewer", "1", "S", true, nullptr, 10, "1.0" ) );
    bool bSentFromThread = true;
    std::thread Other( [&]
                       { bSentFromThread = Check.Check( "LumekVideoViewer", "1", "S", true, pSettings, 10, "1.0" ); } );
    Other.join();
    EXPECT_FALSE( bSentFromThread );
    EXPECT_TRUE( Check.findChildren< VVersionCheckListener* >().isEmpty() );

    // A listener that finishes without a reply has nothing to read; a later timeout adds nothing.
    VVersionCheckListener Listener( "LumekVideoViewer", true, pSettings, nullptr, {}, nullptr );
    Listener.OnReplyFinished();
    Listener.OnTimeout();
    ASSERT_EQ( pSettings->Outcomes.size(), 1u );
    EXPECT_EQ( pSettings->Outcomes[0].Status, 99 );
    EXPECT_EQ( pSettings->Outcomes[0].Error, "Unknown error" );
  }

  // The application's own dialog, run modally: the test ticks the box and presses "OK" as a user would.
  TEST_F( VersionCheckTest, ModalDialogAnsweredLikeAUser )
  {
    Check.SetDialogRunner( {} );
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
    RunCheck( true );
    EXPECT_EQ( Title, "Checking LumekVideoViewer Version" );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( Completions, std::vector< bool >{ true } );
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

    // Without a store nothing is kept and the defaults are read.
    VVersionCheckSettings Nowhere( nullptr, "LumekVideoViewer", false );
    Nowhere.SetMessageId( "x" );
    Nowhere.SetShowOnStartup( false );
    EXPECT_EQ( Nowhere.GetMessageId(), "" );
    EXPECT_TRUE( Nowhere.GetShowOnStartup() );
  }

  // The object the window holds: the release and system it tells the server, or the version it is
  // told to claim.
  TEST_F( VersionCheckTest, ApplicationCheckTellsTheServerTheReleaseAndSystem )
  {
    VApplicationVersionCheck Unreleased( nullptr, nullptr, nullptr, "http://127.0.0.1:9/", "" );
    EXPECT_FALSE( Unreleased.CheckAtStartup() || Unreleased.CheckOnRequest() ) << "no release record, nothing sent";

    Serve( None );
    VApplicationVersionCheck UpdateCheck( nullptr, &Store, &LumekVideoViewer::ApplicationVersion(),
                                          Server.Url().toStdString(), "" );
    EXPECT_EQ( UpdateCheck.GetVersionText(), "1.10.0.137509h" );
    ASSERT_TRUE( UpdateCheck.CheckAtStartup() );
    RunUntil( [&] { return UpdateCheck.GetVersionCheck().findChildren< VVersionCheckListener* >().isEmpty(); } );
    ASSERT_EQ( Server.Requests().size(), 1 );
    EXPECT_EQ( Server.Requests()[0].toStdString(),
               "/?protocol=1.0&name=LumekVideoViewer&version=1.10.0.137509h&system=" + SystemText() );
    // The outcome leaves no trace: the store holds the two values of the check and nothing else.
    Store.sync();
    EXPECT_EQ( Store.allKeys(), ( QStringList{ "LumekVideoViewer.MessageId", "LumekVideoViewer.ShowOnStartup" } ) );

    Serve( Optional );
    VApplicationVersionCheck Spoofed( nullptr, &Store, &LumekVideoViewer::ApplicationVersion(),
                                      Server.Url().toStdString(), "0.3.0.55914h" );
    std::vector< bool > Boxes;
    Spoofed.GetVersionCheck().SetDialogRunner( [&]( VVersionCheckMessageBox& io_rBox )
                                               { Boxes.push_back( io_rBox.GetCheckBox() != nullptr ); } );
    ASSERT_TRUE( Spoofed.CheckOnRequest() );
    RunUntil( [&] { return Spoofed.GetVersionCheck().findChildren< VVersionCheckListener* >().isEmpty(); } );
    ASSERT_EQ( Server.Requests().size(), 2 );
    EXPECT_NE( Server.Requests()[1].indexOf( "&version=0.3.0.55914h&" ), -1 ) << Server.Requests()[1].toStdString();
    EXPECT_EQ( Boxes, std::vector< bool >{ false } ) << "a user's check offers no box to tick";
  }
} // namespace
