// The dialog that shows a server's message: its parts, its links and its button.

#include "tests/support/TestNames.h"
#include "versioncheck/VersionCheck/VVersionCheckMessageBox.h"

#include <gtest/gtest.h>

#include <QCheckBox>
#include <QDesktopServices>
#include <QLabel>
#include <QPushButton>
#include <QStyle>
#include <QTextBrowser>
#include <QUrl>

namespace
{
  // Stands in for the system's browser.
  class VUrlCatcher : public QObject
  {
    Q_OBJECT

  public:
    QList< QUrl > Urls;

  public slots:
    void Open( const QUrl& i_rUrl ) { Urls << i_rUrl; }
  };

  struct IBoxCase
  {
    const char* Name;
    bool bCheckBox;
    bool bError;
  };

  class MessageBox : public testing::TestWithParam< IBoxCase >
  {
  };

  TEST_P( MessageBox, HasItsParts )
  {
    VersionCheck::VVersionCheckMessageBox Box( GetParam().bCheckBox, "LumekVideoViewer", nullptr, GetParam().bError );
    EXPECT_EQ( Box.windowTitle(), "Checking LumekVideoViewer Version" );
    EXPECT_FALSE( Box.windowFlags().testFlag( Qt::WindowContextHelpButtonHint ) );
    EXPECT_EQ( Box.IsError(), GetParam().bError );
    ASSERT_EQ( Box.GetCheckBox() != nullptr, GetParam().bCheckBox );
    if( Box.GetCheckBox() )
    {
      EXPECT_EQ( Box.GetCheckBox()->text(), "Do not show this message again." );
      EXPECT_FALSE( Box.GetCheckBox()->isChecked() );
    }
    EXPECT_FALSE( Box.GetTextBrowser()->openLinks() );
    const auto Buttons = Box.findChildren< QPushButton* >();
    ASSERT_EQ( Buttons.size(), 1 );
    EXPECT_EQ( Buttons[0]->text(), "OK" );

    // The icon is the style's own, at the size the style gives message box icons.
    const QStyle::StandardPixmap Expected =
        GetParam().bError ? QStyle::SP_MessageBoxCritical : QStyle::SP_MessageBoxInformation;
    const int Size = Box.style()->pixelMetric( QStyle::PM_MessageBoxIconSize );
    const QImage Wanted = Box.style()->standardIcon( Expected ).pixmap( Size, Size ).toImage();
    int Matches = 0;
    for( const QLabel* pLabel : Box.findChildren< QLabel* >() )
      if( pLabel->pixmap( Qt::ReturnByValue ).toImage() == Wanted )
        ++Matches;
    EXPECT_EQ( Matches, 1 );
  }

  INSTANTIATE_TEST_SUITE_P( Kinds, MessageBox,
                            testing::Values( IBoxCase{ "Message", false, false },
                                             IBoxCase{ "WithCheckBox", true, false },
                                             IBoxCase{ "Error", false, true } ),
                            LumekTest::VCaseName() );

  TEST( MessageBoxLinks, OpenInTheSystemBrowserAndTheDialogStays )
  {
    VUrlCatcher Catcher;
    QDesktopServices::setUrlHandler( "https", &Catcher, "Open" );
    VersionCheck::VVersionCheckMessageBox Box( false, "LumekVideoViewer", nullptr, false );
    Box.GetTextBrowser()->setHtml( "<p>See <a href=\"https://www.lumek.example/news\">the news</a></p>" );
    Box.show();
    const QString Before = Box.GetTextBrowser()->toHtml();
    emit Box.GetTextBrowser()->anchorClicked( QUrl( "https://www.lumek.example/news" ) );
    QDesktopServices::unsetUrlHandler( "https" );
    EXPECT_EQ( Catcher.Urls, QList< QUrl >{ QUrl( "https://www.lumek.example/news" ) } );
    EXPECT_TRUE( Box.isVisible() );
    EXPECT_EQ( Box.GetTextBrowser()->toHtml(), Before );
  }

  TEST( MessageBoxButton, OkCloses )
  {
    VersionCheck::VVersionCheckMessageBox Box( true, "LumekVideoViewer", nullptr, false );
    Box.show();
    Box.findChild< QPushButton* >()->click();
    EXPECT_FALSE( Box.isVisible() );
  }
} // namespace

#include "MessageBoxTest.moc"
