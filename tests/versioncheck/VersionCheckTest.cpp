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
#include <QDesktopServices>
#include <QEventLoop>
#include <QLabel>
#include <QNetworkProxy>
#include <QPushButton>
#include <QSettings>
#include <QStyle>
#include <QTemporaryDir>
#include <QTextBrowser>
#include <QTimer>
#include <QUrl>

#include <algorithm>
#include <functional>
#include <thread>
#include <tuple>

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

  bool Idle( const QObject& i_rCheck )
  {
    return i_rCheck.findChildren< VVersionCheckListener* >().isEmpty();
  }

  // What a check reports at its end: status, message type, error text and the body.
  using IOutcome = std::tuple< int, std::string, std::string, std::string >;

  // The application's settings over the test's store, with each check's outcome kept aside.
  struct VRecordingSettings : public VVersionCheckSettings
  {
    explicit VRecordingSettings( QSettings* i_pStore ) : VVersionCheckSettings( i_pStore, "LumekVideoViewer", false ) {}
    void Report( int i_Status, const std::string& i_rBody, const std::string& i_rType,
                 const std::string& i_rError ) override
    {
      Outcomes.emplace_back( i_Status, i_rType, i_rError, i_rBody );
    }

    std::vector< IOutcome > Outcomes;
  };

  // A dialog as the user sees it: "<icon>[+box]: <text>", the icon being the one of the style's
  // message box icons it shows at the size the style gives them, "+box" the box to tick.
  std::string Describe( const VVersionCheckMessageBox& i_rBox )
  {
    EXPECT_EQ( i_rBox.windowTitle(), "Checking LumekVideoViewer Version" );
    std::string Icon;
    const int Size = i_rBox.style()->pixelMetric( QStyle::PM_MessageBoxIconSize );
    for( const auto& [Kind, pName] : { std::pair( QStyle::SP_MessageBoxInformation, "information" ),
                                       std::pair( QStyle::SP_MessageBoxCritical, "critical" ) } )
      for( const QLabel* pLabel : i_rBox.findChildren< QLabel* >() )
        if( pLabel->pixmap( Qt::ReturnByValue ).toImage() ==
            i_rBox.style()->standardIcon( Kind ).pixmap( Size, Size ).toImage() )
          Icon += pName;
    return Icon + ( i_rBox.GetCheckBox() ? "+box: " : ": " ) + i_rBox.GetTextBrowser()->toPlainText().toStdString();
  }

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
            Shown.push_back( Describe( io_rBox ) );
            if( bTickBox && io_rBox.GetCheckBox() )
              io_rBox.GetCheckBox()->setChecked( true );
          } );
      Check.VersionUpdatedCallback.Set( [this]( const std::string& i_rVersion ) { Versions.push_back( i_rVersion ); } );
      Check.WhitelistUpdatedCallback.Set( [this]( const std::vector< std::string >& i_rList )
                                          { Whitelists.push_back( i_rList ); } );
      Check.VersionCheckCompleteCallback.Set( [this]( bool i_bStartup ) { Completions.push_back( i_bStartup ); } );
    }
    ~VCheckHarness() { Store.clear(); }

    bool Send( bool i_bStartupCheck, unsigned i_TimeoutSeconds = 10 )
    {
      return Check.Check( "LumekVideoViewer", "1.10.0.137509h", "Debian+GNU/Linux+12+64Bit", i_bStartupCheck, pSettings,
                          i_TimeoutSeconds, "1.0" );
    }

    // One check, run until every listener is gone.
    bool RunCheck( bool i_bStartupCheck, unsigned i_TimeoutSeconds = 10 )
    {
      const bool bSent = Send( i_bStartupCheck, i_TimeoutSeconds );
      EXPECT_TRUE( RunUntil( [this] { return Idle( Check ); } ) );
      return bSent;
    }

    QSettings Store{ "Lumek Labs Ltd", "LumekVideoViewer" };
    std::shared_ptr< VRecordingSettings > pSettings = std::make_shared< VRecordingSettings >( &Store );
    VTestServer Server;
    VVersionCheck Check{ nullptr, "" };
    bool bTickBox = false;
    std::vector< std::string > Shown, Versions;
    std::vector< std::vector< std::string > > Whitelists;
    std::vector< bool > Completions;
  };

  class VersionCheckTest : public testing::Test, public VCheckHarness
  {
  };

  const std::string Optional = Page( "1.0", "OPTIONAL", "A" );
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
      int HttpStatus; // 0: nothing listens
      bool bStartupCheck;
      bool bDeclined; // the store holds this message's id and the user's "do not show again"
      // Expected:
      std::string Dialog; // empty: none
      int Status;
      std::string MessageType; // empty: no outcome and no completion
      std::string Error;       // checked when not empty
      std::vector< std::string > Versions;
      std::vector< std::vector< std::string > > Whitelists;
    } Cases[] = {
        // clang-format off
        { "OptionalNewAtStart", Optional, 200, true, false, "information+box: Message A", 0, "OPTIONAL", "",
          Newest, {} },
        { "NoneAtStart", None, 200, true, false, "", 0, "NONE", "", Newest, {} },
        { "NoneOnRequest", None, 200, false, false, "information: Message A", 0, "NONE", "", Newest, {} },
        // A "2.0" reply is answered by silence.
        { "Format2AtStart", Page( "2.0", "REQUIRED", "A" ), 200, true, false, "", 0, "", "", {}, {} },
        { "Format3NewAtStart", Whitelisted, 200, true, false, "", 0, "NONE", "", Newest, Listed },
        { "Format3DeclinedAtStart", Whitelisted, 200, true, true, "", 0, "NONE", "", {}, {} },
        { "Format3WithoutWhitelistDeclinedOnRequest", Page( "3.0", "NONE", "A" ), 200, false, true, "", 0, "NONE", "",
          Newest, { {} } },
        { "UnknownFormatOnRequest", Page( "4.0", "REQUIRED", "A" ), 200, false, false, "", 0, "REQUIRED", "", {}, {} },
        { "NoCommentAtStart", "<html><body>Down for maintenance</body></html>", 200, true, false, "", 0, "NONE",
          "Error parsing JSON data: expected value on line 1", {}, {} },
        // Nothing at start depends on the server: only a user who asked hears that it failed.
        { "NotFoundAtStart", Page( "1.0", "REQUIRED", "A" ), 404, true, false, "", 203, "NONE", "", {}, {} },
        { "RefusedOnRequest", "", 0, false, false, "critical: Unable to contact version check server.\n"
          "Please check your network connection and try again.\nhttps://support.lumek.example/LumekVideoViewer/",
          1, "NONE", "", {}, {} },
        // clang-format on
    };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VCheckHarness H;
      if( rCase.bDeclined )
      {
        H.pSettings->SetMessageId( "A" );
        H.pSettings->SetShowOnStartup( false );
      }
      H.Check.SetServer( rCase.HttpStatus == 0 ? VTestServer::ClosedUrl() : H.Server.Url().toStdString() );
      H.Server.Serve( rCase.Body, rCase.HttpStatus );
      ASSERT_TRUE( H.RunCheck( rCase.bStartupCheck ) );

      EXPECT_EQ( H.Shown, rCase.Dialog.empty() ? std::vector< std::string >{} : std::vector{ rCase.Dialog } );
      EXPECT_EQ( H.Versions, rCase.Versions );
      EXPECT_EQ( H.Whitelists, rCase.Whitelists );
      const bool bOutcome = !rCase.MessageType.empty();
      EXPECT_EQ( H.Completions, bOutcome ? std::vector{ rCase.bStartupCheck } : std::vector< bool >{} );
      ASSERT_EQ( H.pSettings->Outcomes.size(), bOutcome ? 1u : 0u );
      if( !bOutcome )
        continue;
      IOutcome Outcome = H.pSettings->Outcomes[0];
      if( rCase.Error.empty() )
        std::get< 2 >( Outcome ) = "";
      EXPECT_EQ( Outcome, IOutcome( rCase.Status, rCase.MessageType, rCase.Error, rCase.Body ) );
    }
  }

  TEST_F( VersionCheckTest, DoNotShowAgainHoldsUntilTheIdChanges )
  {
    EXPECT_TRUE( pSettings->GetShowOnStartup() ) << "nothing declined yet";
    Server.Serve( Optional );
    bTickBox = true;
    RunCheck( true );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    // Two checks at once, each with its own answer; a check returns before its answer comes. The
    // declined message stays away at start; a user's check shows it anyway, without the box.
    ASSERT_TRUE( Send( true ) );
    EXPECT_EQ( pSettings->Outcomes.size(), 1u );
    RunCheck( false );
    EXPECT_EQ( pSettings->Outcomes.size(), 3u );
    std::sort( Completions.begin(), Completions.end() );
    EXPECT_EQ( Completions, ( std::vector{ false, true, true } ) );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    // A new message clears the choice; not declined, it comes back at the next start.
    Server.Serve( Page( "1.0", "OPTIONAL", "B" ) );
    bTickBox = false;
    RunCheck( true );
    EXPECT_TRUE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( Store.value( "LumekVideoViewer.MessageId" ).toString(), "B" );
    bTickBox = true;
    RunCheck( true );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    // A required message, declined or not, offers no box to tick and comes back at every start.
    Server.Serve( Page( "1.0", "REQUIRED", "B" ) );
    for( int Start = 0; Start < 2; ++Start )
      RunCheck( true );
    EXPECT_EQ( Shown, ( std::vector< std::string >{ "information+box: Message A", "information: Message A",
                                                    "information+box: Message B", "information+box: Message B",
                                                    "information: Message B", "information: Message B" } ) );
    EXPECT_EQ( Server.Requests().size(), 7 );

    // A forced setting shows at start whatever the store says; without a store nothing is kept.
    EXPECT_TRUE( VVersionCheckSettings( &Store, "LumekVideoViewer", true ).GetShowOnStartup() );
    VVersionCheckSettings Nowhere( nullptr, "LumekVideoViewer", false );
    Nowhere.SetMessageId( "x" );
    Nowhere.SetShowOnStartup( false );
    EXPECT_EQ( Nowhere.GetMessageId(), "" );
    EXPECT_TRUE( Nowhere.GetShowOnStartup() );
  }

  // A server that never answers is given up when the time is up, without a word to the user even
  // when asked; one that sends too much is cut off by the length it announces or by what it sends.
  TEST_F( VersionCheckTest, SilentOrFloodingServerFailsQuietly )
  {
    Server.SetMode( VTestServer::EMode::Silent );
    ASSERT_TRUE( RunCheck( false, 1 ) );
    EXPECT_EQ( pSettings->Outcomes, ( std::vector< IOutcome >{ { 4, "NONE", "Version check request timeout", "" } } ) );
    EXPECT_TRUE( Completions.empty() );
    EXPECT_EQ( Server.Requests().size(), 1 );

    for( const auto Mode : { VTestServer::EMode::Flood, VTestServer::EMode::Stream } )
    {
      pSettings->Outcomes.clear();
      Server.SetMode( Mode );
      RunCheck( true );
      ASSERT_EQ( pSettings->Outcomes.size(), 1u );
      EXPECT_EQ( std::get< 0 >( pSettings->Outcomes[0] ), 5 ); // QNetworkReply::OperationCanceledError
      EXPECT_LE( std::get< 3 >( pSettings->Outcomes[0] ).size(), std::size_t( VVersionCheck::MaximumReplyBytes ) );
    }
    EXPECT_TRUE( Shown.empty() );
  }

  TEST_F( VersionCheckTest, RefusesWithoutSettingsOrOffTheMainThread )
  {
    EXPECT_FALSE( Check.Check( "LumekVideoViewer", "1", "S", true, nullptr, 10, "1.0" ) );
    bool bSentFromThread = true;
    std::thread( [&] { bSentFromThread = Send( true ); } ).join();
    EXPECT_FALSE( bSentFromThread );
    EXPECT_TRUE( Idle( Check ) );

    // A listener that finishes without a reply has nothing to read; a later timeout adds nothing.
    VVersionCheckListener Listener( "LumekVideoViewer", true, pSettings, nullptr, {}, nullptr );
    Listener.OnReplyFinished();
    Listener.OnTimeout();
    EXPECT_EQ( pSettings->Outcomes, ( std::vector< IOutcome >{ { 99, "NONE", "Unknown error", "" } } ) );
  }

  // Stands in for the system's browser.
  class VUrlCatcher : public QObject
  {
    Q_OBJECT

  public:
    QList< QUrl > Urls;

  public slots:
    void Open( const QUrl& i_rUrl ) { Urls << i_rUrl; }
  };

  // The application's own dialog, run modally: the test follows its link, ticks the box and
  // presses its one button as a user would.
  TEST_F( VersionCheckTest, ModalDialogAnsweredLikeAUser )
  {
    Check.SetDialogRunner( {} );
    Server.Serve( Optional );
    VUrlCatcher Browser;
    QDesktopServices::setUrlHandler( "https", &Browser, "Open" );
    const QUrl News( "https://www.lumek.example/news" );
    const auto AnswerLikeAUser = [&]
    {
      auto* pBox = qobject_cast< VVersionCheckMessageBox* >( QApplication::activeModalWidget() );
      if( pBox == nullptr )
        return;
      Shown.push_back( Describe( *pBox ) );
      EXPECT_FALSE( pBox->windowFlags().testFlag( Qt::WindowContextHelpButtonHint ) );
      EXPECT_FALSE( pBox->GetTextBrowser()->openLinks() ) << "links go to the system's browser";
      emit pBox->GetTextBrowser()->anchorClicked( News );
      EXPECT_TRUE( pBox->isVisible() ) << "the dialog stays while the browser opens";
      EXPECT_EQ( pBox->GetCheckBox()->text(), "Do not show this message again." );
      EXPECT_FALSE( pBox->GetCheckBox()->isChecked() );
      pBox->GetCheckBox()->setChecked( true );
      const auto Buttons = pBox->findChildren< QPushButton* >();
      EXPECT_EQ( Buttons.size(), 1 );
      EXPECT_EQ( Buttons.value( 0 )->text(), "OK" );
      Buttons.value( 0 )->click();
      EXPECT_FALSE( pBox->isVisible() );
    };
    QTimer Answer;
    QObject::connect( &Answer, &QTimer::timeout, AnswerLikeAUser );
    Answer.start( 20 );
    RunCheck( true );
    QDesktopServices::unsetUrlHandler( "https" );
    EXPECT_EQ( Shown, std::vector< std::string >{ "information+box: Message A" } );
    EXPECT_EQ( Browser.Urls, QList< QUrl >{ News } );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( Completions, std::vector{ true } );
  }

  // The object the window holds: the release and system it tells the server, or the version it is
  // told to claim.
  TEST_F( VersionCheckTest, ApplicationCheckTellsTheServerTheReleaseAndSystem )
  {
    VApplicationVersionCheck Unreleased( nullptr, nullptr, nullptr, "http://127.0.0.1:9/", "" );
    EXPECT_FALSE( Unreleased.CheckAtStartup() || Unreleased.CheckOnRequest() ) << "no release record, nothing sent";

    Server.Serve( None );
    VApplicationVersionCheck UpdateCheck( nullptr, &Store, &LumekVideoViewer::ApplicationVersion(),
                                          Server.Url().toStdString(), "" );
    EXPECT_EQ( UpdateCheck.GetVersionText(), "1.10.0.137509h" );
    ASSERT_TRUE( UpdateCheck.CheckAtStartup() );
    RunUntil( [&] { return Idle( UpdateCheck.GetVersionCheck() ); } );
    ASSERT_EQ( Server.Requests().size(), 1 );
    EXPECT_EQ( Server.Requests()[0].toStdString(),
               "/?protocol=1.0&name=LumekVideoViewer&version=1.10.0.137509h&system=" + SystemText() );
    // The outcome leaves no trace: the store holds the two values of the check and nothing else.
    Store.sync();
    EXPECT_EQ( Store.allKeys(), ( QStringList{ "LumekVideoViewer.MessageId", "LumekVideoViewer.ShowOnStartup" } ) );

    Server.Serve( Optional );
    VApplicationVersionCheck Spoofed( nullptr, &Store, &LumekVideoViewer::ApplicationVersion(),
                                      Server.Url().toStdString(), "0.3.0.55914h" );
    Spoofed.GetVersionCheck().SetDialogRunner( [&]( VVersionCheckMessageBox& io_rBox )
                                               { Shown.push_back( Describe( io_rBox ) ); } );
    ASSERT_TRUE( Spoofed.CheckOnRequest() );
    RunUntil( [&] { return Idle( Spoofed.GetVersionCheck() ); } );
    ASSERT_EQ( Server.Requests().size(), 2 );
    EXPECT_NE( Server.Requests()[1].indexOf( "&version=0.3.0.55914h&" ), -1 ) << Server.Requests()[1].toStdString();
    EXPECT_EQ( Shown, std::vector< std::string >{ "information: Message A" } ) << "a user's check offers no box";
  }
} // namespace

#include "VersionCheckTest.moc"

// The widget tests run inside a QApplication, with settings, cache and runtime folders of their own
// so that a run by hand never touches the user's.
int main( int i_ArgumentCount, char** i_pArguments )
{
  testing::InitGoogleTest( &i_ArgumentCount, i_pArguments );
  // Listing the tests happens at build time, where there may be no display.
  if( testing::GTEST_FLAG( list_tests ) )
    return RUN_ALL_TESTS();

  // A temporary folder is its owner's alone, as a runtime folder must be; settings and cache go
  // inside it.
  QTemporaryDir Scratch;
  if( !Scratch.isValid() )
    return 1;
  qputenv( "XDG_CONFIG_HOME", Scratch.filePath( "config" ).toLocal8Bit() );
  qputenv( "XDG_CACHE_HOME", Scratch.filePath( "cache" ).toLocal8Bit() );
  if( qEnvironmentVariableIsEmpty( "XDG_RUNTIME_DIR" ) )
    qputenv( "XDG_RUNTIME_DIR", Scratch.path().toLocal8Bit() );

  QApplication Application( i_ArgumentCount, i_pArguments );
  // The tests' server is on this machine; a proxy from the environment must not stand between.
  QNetworkProxy::setApplicationProxy( QNetworkProxy::NoProxy );
  return RUN_ALL_TESTS();
}
