// The update check end to end against a version server that the test starts on 127.0.0.1: each
// reply format and message type, at start and on request; what is remembered between checks; the
// server that never answers, refuses or floods; the dialogs as the user would see them.

#include "services/IApplicationVersion.h"
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
#include <QTcpServer>
#include <QTcpSocket>
#include <QTemporaryDir>
#include <QTextBrowser>
#include <QTimer>
#include <QUrl>

#include <boost/algorithm/string/join.hpp>

#include <memory>
#include <string>
#include <thread>
#include <tuple>
#include <vector>

namespace
{
  using namespace VersionCheck;

  // A version server for the tests: plain HTTP on 127.0.0.1 at a port of its own choice, one reply
  // per connection, its length announced unless told not to (its end is then the close).
  struct VTestServer
  {
    VTestServer()
    {
      Listener.listen( QHostAddress::LocalHost, 0 );
      QObject::connect( &Listener, &QTcpServer::newConnection, &Listener,
                        [this]
                        {
                          while( QTcpSocket* pSocket = Listener.nextPendingConnection() )
                          {
                            QObject::connect( pSocket, &QTcpSocket::disconnected, pSocket, &QObject::deleteLater );
                            QObject::connect( pSocket, &QTcpSocket::readyRead, pSocket, [=] { Answer( *pSocket ); } );
                          }
                        } );
    }

    QString Url() const { return QStringLiteral( "http://127.0.0.1:%1/" ).arg( Listener.serverPort() ); }
    // The address of a port on 127.0.0.1 where nothing listens.
    static std::string ClosedUrl() { return VTestServer().Url().toStdString(); }

    void Answer( QTcpSocket& io_rSocket )
    {
      // Nothing before the blank line that ends the request's header; a GET sends nothing after it.
      if( !io_rSocket.peek( 1 << 16 ).contains( "\r\n\r\n" ) )
        return;
      const QByteArray Request = io_rSocket.readAll();
      Requests << QString::fromLatin1( Request.left( Request.indexOf( "\r\n" ) ).split( ' ' ).value( 1 ) );
      if( bSilent )
        return;
      QByteArray Header = "HTTP/1.1 " + QByteArray::number( Status ) + ( Status == 200 ? " OK" : " Not Found" ) +
                          "\r\nContent-Type: text/html\r\nConnection: close\r\n";
      if( bAnnounceLength )
        Header += "Content-Length: " + QByteArray::number( qsizetype( Body.size() ) ) + "\r\n";
      io_rSocket.write( Header + "\r\n" + QByteArray::fromStdString( Body ) );
      io_rSocket.disconnectFromHost();
    }

    QTcpServer Listener;
    std::string Body;
    int Status = 200;
    bool bSilent = false; // read the request and never answer
    bool bAnnounceLength = true;
    QStringList Requests; // the request targets received so far, e.g. "/?protocol=1.0&name=..."
  };

  // Runs the event loop until i_rCheck has no listener left or the time is up; deferred deletes
  // happen on the way. (QTest::qWaitFor sleeps 10 ms a round, which an exchange needs several of.)
  bool RunUntilIdle( const QObject& i_rCheck )
  {
    const auto Idle = [&] { return i_rCheck.findChildren< VVersionCheckListener* >().isEmpty(); };
    QEventLoop Loop;
    QTimer Poll;
    QObject::connect( &Poll, &QTimer::timeout, &Loop, [&] { Idle() ? Loop.quit() : void(); } );
    Poll.start( 5 );
    QTimer::singleShot( 15000, &Loop, &QEventLoop::quit );
    if( !Idle() )
      Loop.exec();
    return Idle();
  }

  // What a check reports at its end: status, message type, error text and the body.
  using IOutcome = std::tuple< int, std::string, std::string, std::string >;

  // The application's settings over the test's store, with each check's outcome kept aside and
  // written down as "report <status> <message type>".
  struct VRecordingSettings : public VVersionCheckSettings
  {
    explicit VRecordingSettings( QSettings* i_pStore ) : VVersionCheckSettings( i_pStore, "LumekVideoViewer", false ) {}
    void Report( int i_Status, const std::string& i_rBody, const std::string& i_rType,
                 const std::string& i_rError ) override
    {
      Outcomes.emplace_back( i_Status, i_rType, i_rError, i_rBody );
      Events.push_back( "report " + std::to_string( i_Status ) + " " + i_rType );
    }

    std::vector< IOutcome > Outcomes;
    std::vector< std::string > Events;
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

  // A check against the test's own server, with what it does written down in order in Events: the
  // dialogs it shows (as Describe gives them, kept in Shown too), "version <newest>", "whitelist
  // [<versions>]", the report to the settings and "done at start" or "done on request". Each check
  // of a test shares one store of settings, cleared at both ends.
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
            Events.push_back( Shown.back() );
            if( bTickBox && io_rBox.GetCheckBox() )
              io_rBox.GetCheckBox()->setChecked( true );
          } );
      Check.VersionUpdatedCallback.Set( [this]( const std::string& i_rNewest )
                                        { Events.push_back( "version " + i_rNewest ); } );
      Check.WhitelistUpdatedCallback.Set( [this]( const std::vector< std::string >& i_rList )
                                          { Events.push_back( "whitelist [" + boost::join( i_rList, " " ) + "]" ); } );
      Check.VersionCheckCompleteCallback.Set(
          [this]( bool i_bStartup ) { Events.push_back( i_bStartup ? "done at start" : "done on request" ); } );
    }
    ~VCheckHarness() { Store.clear(); }

    bool Send( bool i_bStartupCheck, unsigned i_TimeoutSeconds = 10 )
    {
      return Check.Check( "LumekVideoViewer", "1.10.0.137509h", "Debian+GNU/Linux+12+64Bit", i_bStartupCheck, pSettings,
                          i_TimeoutSeconds, "1.0" );
    }

    // One check, sent and run until every listener is gone.
    void RunCheck( bool i_bStartupCheck, unsigned i_TimeoutSeconds = 10 )
    {
      EXPECT_TRUE( Send( i_bStartupCheck, i_TimeoutSeconds ) );
      EXPECT_TRUE( RunUntilIdle( Check ) );
    }

    QSettings Store{ "Lumek Labs Ltd", "LumekVideoViewer" };
    std::shared_ptr< VRecordingSettings > pSettings = std::make_shared< VRecordingSettings >( &Store );
    std::vector< std::string >& Events = pSettings->Events; // what the check did, in order
    std::vector< std::string > Shown;
    VTestServer Server;
    VVersionCheck Check{ nullptr, "" };
    bool bTickBox = false;
  };

  class VersionCheckTest : public testing::Test, public VCheckHarness
  {
  };

  const std::string Optional = Page( "1.0", "OPTIONAL", "A" );
  const std::string None = Page( "1.0", "NONE", "A" );

  // One exchange with the server and everything that should follow from it. The message types
  // at start and on request, and what a user's choice does, are DoNotShowAgainHoldsUntilTheIdChanges.
  TEST( VersionCheckExchange, ShowsAndReportsWhatTheReplyAsksFor )
  {
    const std::string Whitelisted = Page( "3.0", "NONE", "A", ",\"Whitelist\":[\"1.10.0.137509h\",\"1.9.0.1h\"]" );
    const std::string Newest = "version 1.11.0.140100h", Start = "done at start", Asked = "done on request";
    const struct
    {
      const char* Name;
      std::string Body;
      int HttpStatus; // 0: nothing listens
      bool bStartupCheck;
      bool bDeclined; // the store holds this message's id and the user's "do not show again"
      std::vector< std::string > Events;
    } Cases[] = {
        // clang-format off
        { "NoneAtStart", None, 200, true, false, { Newest, "report 0 NONE", Start } },
        // A "2.0" reply is answered by silence.
        { "Format2AtStart", Page( "2.0", "REQUIRED", "A" ), 200, true, false, {} },
        { "Format3NewAtStart", Whitelisted, 200, true, false,
          { "whitelist [1.10.0.137509h 1.9.0.1h]", Newest, "report 0 NONE", Start } },
        { "Format3DeclinedAtStart", Whitelisted, 200, true, true, { "report 0 NONE", Start } },
        { "Format3WithoutWhitelistDeclinedOnRequest", Page( "3.0", "NONE", "A" ), 200, false, true,
          { "whitelist []", Newest, "report 0 NONE", Asked } },
        { "UnknownFormatOnRequest", Page( "4.0", "REQUIRED", "A" ), 200, false, false, { "report 0 REQUIRED", Asked } },
        { "NoCommentAtStart", "<html><body>Down</body></html>", 200, true, false, { "report 0 NONE", Start } },
        // Nothing at start depends on the server: only a user who asked hears that it failed.
        { "NotFoundAtStart", Page( "1.0", "REQUIRED", "A" ), 404, true, false, { "report 203 NONE", Start } },
        { "RefusedOnRequest", "", 0, false, false,
          { "critical: Unable to contact version check server.\nPlease check your network connection and try again.\n"
            "https://support.lumek.example/LumekVideoViewer/", "report 1 NONE", Asked } },
        // clang-format on
    };
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      VCheckHarness H;
      H.pSettings->SetMessageId( rCase.bDeclined ? "A" : "" );
      H.pSettings->SetShowOnStartup( !rCase.bDeclined );
      H.Check.SetServer( rCase.HttpStatus == 0 ? VTestServer::ClosedUrl() : H.Server.Url().toStdString() );
      H.Server.Body = rCase.Body;
      H.Server.Status = rCase.HttpStatus;
      H.RunCheck( rCase.bStartupCheck );
      EXPECT_EQ( H.Events, rCase.Events );
      // The settings are given the body as it came, from a server that failed too.
      for( const IOutcome& rOutcome : H.pSettings->Outcomes )
        EXPECT_EQ( std::get< 3 >( rOutcome ), rCase.Body );
    }
  }

  TEST_F( VersionCheckTest, DoNotShowAgainHoldsUntilTheIdChanges )
  {
    EXPECT_TRUE( pSettings->GetShowOnStartup() ) << "nothing declined yet";
    Server.Body = Optional;
    bTickBox = true;
    RunCheck( true );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    // Two checks at once, each with its own answer; a check returns before its answer comes. The
    // declined message stays away at start; a user's check shows it anyway, without the box.
    ASSERT_TRUE( Send( true ) );
    EXPECT_EQ( pSettings->Outcomes.size(), 1u );
    RunCheck( false );
    EXPECT_EQ( pSettings->Outcomes.size(), 3u );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    // A new message clears the choice; not declined, it comes back at the next start.
    Server.Body = Page( "1.0", "OPTIONAL", "B" );
    bTickBox = false;
    RunCheck( true );
    EXPECT_TRUE( pSettings->GetShowOnStartup() );
    bTickBox = true;
    RunCheck( true );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );

    // A required message, declined or not, offers no box to tick and comes back at every start.
    Server.Body = Page( "1.0", "REQUIRED", "B" );
    for( int Start = 0; Start < 2; ++Start )
      RunCheck( true );
    EXPECT_EQ( Shown, ( std::vector< std::string >{ "information+box: Message A", "information: Message A",
                                                    "information+box: Message B", "information+box: Message B",
                                                    "information: Message B", "information: Message B" } ) );

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
    Server.bSilent = true;
    RunCheck( false, 1 );
    EXPECT_EQ( pSettings->Outcomes, ( std::vector< IOutcome >{ { 4, "NONE", "Version check request timeout", "" } } ) );

    Server.bSilent = false;
    Server.Body = std::string( 2 * VVersionCheck::MaximumReplyBytes, 'x' );
    for( const bool bAnnounce : { true, false } )
    {
      Server.bAnnounceLength = bAnnounce;
      RunCheck( true );
      // The body that came before the cut is given, never more than the limit.
      EXPECT_LE( std::get< 3 >( pSettings->Outcomes.back() ).size(), std::size_t( VVersionCheck::MaximumReplyBytes ) );
    }
    // 5: QNetworkReply::OperationCanceledError
    EXPECT_EQ( Events, ( std::vector< std::string >{ "report 4 NONE", "report 5 NONE", "done at start", "report 5 NONE",
                                                     "done at start" } ) )
        << "no dialog, and no completion without an answer";
  }

  TEST_F( VersionCheckTest, RefusesWithoutSettingsOrOffTheMainThread )
  {
    EXPECT_FALSE( Check.Check( "LumekVideoViewer", "1", "S", true, nullptr, 10, "1.0" ) );
    bool bSentFromThread = true;
    std::thread( [&] { bSentFromThread = Send( true ); } ).join();
    EXPECT_FALSE( bSentFromThread );
    EXPECT_TRUE( Check.findChildren< VVersionCheckListener* >().isEmpty() );

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
    Server.Body = Optional;
    VUrlCatcher Browser;
    QDesktopServices::setUrlHandler( "https", &Browser, "Open" );
    const QUrl News( "https://www.lumek.example/news" );
    const auto AnswerLikeAUser = [&]
    {
      auto* pBox = qobject_cast< VVersionCheckMessageBox* >( QApplication::activeModalWidget() );
      if( pBox == nullptr )
        return;
      Events.push_back( Describe( *pBox ) );
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
    EXPECT_EQ( Events, ( std::vector< std::string >{ "version 1.11.0.140100h", "information+box: Message A",
                                                     "report 0 OPTIONAL", "done at start" } ) );
    EXPECT_EQ( Browser.Urls, QList< QUrl >{ News } );
    EXPECT_FALSE( pSettings->GetShowOnStartup() );
  }

  // The object the window holds: the release it tells the server, or the version it is told to
  // claim, and the system it runs on.
  TEST_F( VersionCheckTest, ApplicationCheckTellsTheServerTheReleaseAndSystem )
  {
    VApplicationVersionCheck Unreleased( nullptr, nullptr, nullptr, "http://127.0.0.1:9/", "" );
    EXPECT_FALSE( Unreleased.CheckAtStartup() || Unreleased.CheckOnRequest() ) << "no release record, nothing sent";
    const VApplicationVersionCheck Released( nullptr, &Store, &LumekVideoViewer::ApplicationVersion(), "", "" );
    EXPECT_EQ( Released.GetVersionText(), "1.10.0.137509h" );

    Server.Body = None;
    VApplicationVersionCheck Spoofed( nullptr, &Store, &LumekVideoViewer::ApplicationVersion(),
                                      Server.Url().toStdString(), "0.3.0.55914h" );
    Spoofed.GetVersionCheck().SetDialogRunner( [&]( VVersionCheckMessageBox& io_rBox )
                                               { Shown.push_back( Describe( io_rBox ) ); } );
    ASSERT_TRUE( Spoofed.CheckAtStartup() && Spoofed.CheckOnRequest() );
    RunUntilIdle( Spoofed.GetVersionCheck() );
    const QString Request =
        QString::fromStdString( "/?protocol=1.0&name=LumekVideoViewer&version=0.3.0.55914h&system=" + SystemText() );
    EXPECT_EQ( Server.Requests, ( QStringList{ Request, Request } ) );
    EXPECT_EQ( Shown, std::vector< std::string >{ "information: Message A" } ) << "only a user's check shows NONE";
    // The outcome leaves no trace: the store holds the two values of the check and nothing else.
    Store.sync();
    EXPECT_EQ( Store.allKeys(), ( QStringList{ "LumekVideoViewer.MessageId", "LumekVideoViewer.ShowOnStartup" } ) );
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
