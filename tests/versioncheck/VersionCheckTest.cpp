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
#include <QPushButton>
#include <QSettings>
#include <QStyle>
#include <QTextBrowser>
#include <QTimer>
#include <QUrl>

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

  bool Idle( const VVersionCheck& i_rCheck )
  {
    return i_rCheck.findChildren< VVersionCheckListener* >().isEmpty();
  }

  struct IOutcome
  {
    int Status;
    std::string Body, MessageType, Error;
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

  // A dialog as the user sees it; the icon is the style's own message box icon at the size the
  // style gives them: "information" or "critical".
  struct IShownDialog
  {
    QString Title, Text;
    bool bCheckBox;
    std::string Icon;
  };

  IShownDialog Describe( const VVersionCheckMessageBox& i_rBox )
  {
    IShownDialog Shown{ i_rBox.windowTitle(), i_rBox.GetTextBrowser()->toPlainText(), i_rBox.GetCheckBox() != nullptr,
                        "" };
    const int Size = i_rBox.style()->pixelMetric( QStyle::PM_MessageBoxIconSize );
    for( const auto& [Icon, pName] : { std::pair( QStyle::SP_MessageBoxInformation, "information" ),
                                       std::pair( QStyle::SP_MessageBoxCritical, "critical" ) } )
    {
      const QImage Wanted = i_rBox.style()->standardIcon( Icon ).pixmap( Size, Size ).toImage();
      for( const QLabel* pLabel : i_rBox.findChildren< QLabel* >() )
        if( pLabel->pixmap( Qt::ReturnByValue ).toImage() == Wanted )
          Shown.Icon += pName;
    }
    return Shown;
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

    void Serve( const std::string& i_rBody, int i_Status = 200 )
    {
      Server.SetReply( i_Status, QByteArray::fromStdString( i_rBody ) );
    }

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
      int HttpStatus; // 0: nothing listens
      bool bStartupCheck;
      std::optional< std::string > StoredId;
      std::optional< bool > StoredShowOnStartup;
      // Expected:
      std::string Dialog; // "", "plain", "box" (with the box to tick) or "error"
      int Status;
      std::string MessageType; // empty: no outcome and no completion
      std::string Error;       // checked when not empty
      std::vector< std::string > Versions;
      std::vector< std::vector< std::string > > Whitelists;
    } Cases[] = {
        // Each row: name, reply body, HTTP status, at start, stored id and show-at-start; then the
        // dialog shown, the reported status, message type and error, the versions and whitelists
        // announced. What a user's earlier choice does is DoNotShowAgainHoldsUntilTheIdChanges.
        // clang-format off
        { "OptionalNewAtStart", Optional, 200, true, {}, {}, "box", 0, "OPTIONAL", "", Newest, {} },
        { "NoneAtStart", None, 200, true, {}, {}, "", 0, "NONE", "", Newest, {} },
        { "NoneOnRequest", None, 200, false, "A", true, "plain", 0, "NONE", "", Newest, {} },
        // A "2.0" reply is answered by silence.
        { "Format2AtStart", Page( "2.0", "REQUIRED", "A" ), 200, true, {}, {}, "", 0, "", "", {}, {} },
        { "Format3NewAtStart", Whitelisted, 200, true, {}, {}, "", 0, "NONE", "", Newest, Listed },
        { "Format3DeclinedAtStart", Whitelisted, 200, true, "A", false, "", 0, "NONE", "", {}, {} },
        { "Format3WithoutWhitelistDeclinedOnRequest", Page( "3.0", "NONE", "A" ), 200, false, "A", false,
          "", 0, "NONE", "", Newest, { {} } },
        { "UnknownFormatOnRequest", Page( "4.0", "REQUIRED", "A" ), 200, false, {}, {},
          "", 0, "REQUIRED", "", {}, {} },
        { "NoCommentAtStart", "<html><body>Down for maintenance</body></html>", 200, true, {}, {},
          "", 0, "NONE", "Error parsing JSON data: expected value on line 1", {}, {} },
        // Nothing at start depends on the server: only a user who asked hears that it failed.
        { "NotFoundAtStart", Required, 404, true, {}, {}, "", 203, "NONE", "", {}, {} },
        { "RefusedOnRequest", "", 0, false, {}, {}, "error", 1, "NONE", "", {}, {} },
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
      if( rCase.HttpStatus == 0 )
        H.Check.SetServer( VTestServer::ClosedUrl() );
      H.Serve( rCase.Body, rCase.HttpStatus );
      ASSERT_TRUE( H.RunCheck( rCase.bStartupCheck ) );

      ASSERT_EQ( H.Shown.size(), rCase.Dialog.empty() ? 0u : 1u );
      for( const auto& rShown : H.Shown )
      {
        EXPECT_EQ( rShown.Title, "Checking LumekVideoViewer Version" );
        EXPECT_EQ( rShown.bCheckBox, rCase.Dialog == "box" );
        EXPECT_EQ( rShown.Icon, rCase.Dialog == "error" ? "critical" : "information" );
        if( rCase.Dialog == "error" )
          EXPECT_TRUE( rShown.Text.startsWith( "Unable to contact version check server.\n"
                                               "Please check your network connection and try again.\n" ) )
              << rShown.Text.toStdString();
        else
          EXPECT_EQ( rShown.Text, "Message A" );
      }
      EXPECT_EQ( H.Versions, rCase.Versions );
      EXPECT_EQ( H.Whitelists, rCase.Whitelists );

      const bool bOutcome = !rCase.MessageType.empty();
      EXPECT_EQ( H.Completions, bOutcome ? std::vector< bool >{ rCase.bStartupCheck } : std::vector< bool >{} );
      ASSERT_EQ( H.pSettings->Outcomes.size(), bOutcome ? 1u : 0u );
      if( !bOutcome )
        continue;
      const IOutcome& rOutcome = H.pSettings->Outcomes[0];
      EXPECT_EQ( rOutcome.Status, rCase.Status ) << rOutcome.Error;
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

    // Two checks at once, each with its own answer; a check returns before its answer comes.
    ASSERT_TRUE( Send( true ) );
    EXPECT_EQ( pSettings->Outcomes.size(), 1u );
    RunCheck( false );
    ASSERT_EQ( Shown.size(), 2u ) << "the declined message stays away at start; a user's check shows it anyway";
    EXPECT_FALSE( Shown.back().bCheckBox );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( pSettings->Outcomes.size(), 3u );
    std::sort( Completions.begin(), Completions.end() );
    EXPECT_EQ( Completions, ( std::vector< bool >{ false, true, true } ) );

    Serve( Page( "1.0", "OPTIONAL", "B" ) );
    bTickBox = false;
    RunCheck( true );
    ASSERT_EQ( Shown.size(), 3u ) << "a new message clears the choice";
    EXPECT_EQ( Shown.back().Text, "Message B" );
    EXPECT_TRUE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( Store.value( "LumekVideoViewer.MessageId" ).toString(), "B" );

    // Not declined, it comes back at the next start; now declined, and then required.
    bTickBox = true;
    RunCheck( true );
    ASSERT_EQ( Shown.size(), 4u );
    EXPECT_TRUE( Shown.back().bCheckBox );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( Server.Requests().size(), 5 );

    // A required message offers no box to tick and comes back at every start.
    Serve( Page( "1.0", "REQUIRED", "B" ) );
    for( int Start = 0; Start < 2; ++Start )
      RunCheck( true );
    ASSERT_EQ( Shown.size(), 6u );
    EXPECT_FALSE( Shown[4].bCheckBox || Shown[5].bCheckBox );
  }

  TEST_F( VersionCheckTest, SilentServerTimesOutWithoutADialog )
  {
    Server.SetMode( VTestServer::EMode::Silent );
    ASSERT_TRUE( RunCheck( false, 1 ) );
    ASSERT_EQ( pSettings->Outcomes.size(), 1u );
    const IOutcome& rOutcome = pSettings->Outcomes[0];
    EXPECT_EQ( rOutcome.Status, 4 );
    EXPECT_EQ( rOutcome.Body, "" );
    EXPECT_EQ( rOutcome.MessageType, "NONE" );
    EXPECT_EQ( rOutcome.Error, "Version check request timeout" );
    EXPECT_TRUE( Shown.empty() ) << "not even a user's check reports the silence";
    EXPECT_TRUE( Completions.empty() );
    EXPECT_EQ( Server.Requests().size(), 1 );
  }

  TEST_F( VersionCheckTest, FloodingServerIsCutOff )
  {
    // Flood is cut off by the announced length, Stream by the bytes that came.
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
    ASSERT_EQ( pSettings->Outcomes.size(), 1u );
    EXPECT_EQ( pSettings->Outcomes[0].Status, 99 );
    EXPECT_EQ( pSettings->Outcomes[0].Error, "Unknown error" );
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
    Serve( Optional );
    VUrlCatcher Browser;
    QDesktopServices::setUrlHandler( "https", &Browser, "Open" );
    const QUrl News( "https://www.lumek.example/news" );
    QTimer Answer;
    QObject::connect( &Answer, &QTimer::timeout,
                      [&]
                      {
                        for( QWidget* pWidget : QApplication::topLevelWidgets() )
                        {
                          auto* pBox = qobject_cast< VVersionCheckMessageBox* >( pWidget );
                          if( pBox == nullptr || !pBox->isVisible() )
                            continue;
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
                        }
                      } );
    Answer.start( 20 );
    RunCheck( true );
    QDesktopServices::unsetUrlHandler( "https" );
    ASSERT_EQ( Shown.size(), 1u );
    EXPECT_EQ( Shown[0].Title, "Checking LumekVideoViewer Version" );
    EXPECT_EQ( Shown[0].Icon, "information" );
    EXPECT_EQ( Browser.Urls, QList< QUrl >{ News } );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );
    EXPECT_EQ( Completions, std::vector< bool >{ true } );
  }

  // Without a store nothing is kept and the defaults are read; a forced setting shows at start
  // whatever the store says.
  TEST( VersionCheckSettings, WithoutAStoreOrForced )
  {
    VVersionCheckSettings Nowhere( nullptr, "LumekVideoViewer", false );
    Nowhere.SetMessageId( "x" );
    Nowhere.SetShowOnStartup( false );
    EXPECT_EQ( Nowhere.GetMessageId(), "" );
    EXPECT_TRUE( Nowhere.GetShowOnStartup() );

    QSettings Store( "Lumek Labs Ltd", "LumekVideoViewer" );
    VVersionCheckSettings( &Store, "LumekVideoViewer", false ).SetShowOnStartup( false );
    EXPECT_TRUE( VVersionCheckSettings( &Store, "LumekVideoViewer", true ).GetShowOnStartup() );
    Store.clear();
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
    RunUntil( [&] { return Idle( UpdateCheck.GetVersionCheck() ); } );
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
    RunUntil( [&] { return Idle( Spoofed.GetVersionCheck() ); } );
    ASSERT_EQ( Server.Requests().size(), 2 );
    EXPECT_NE( Server.Requests()[1].indexOf( "&version=0.3.0.55914h&" ), -1 ) << Server.Requests()[1].toStdString();
    EXPECT_EQ( Boxes, std::vector< bool >{ false } ) << "a user's check offers no box to tick";
  }
} // namespace

#include "VersionCheckTest.moc"
