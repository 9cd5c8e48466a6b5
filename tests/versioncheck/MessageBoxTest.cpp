// The dialog that shows a server's message: its parts, its links and its button.

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

  TEST( MessageBox, HasItsParts )
  {
    for( const auto& [bCheckBox, bError] :
         { std::make_pair( false, false ), std::make_pair( true, false ), std::make_pair( false, true ) } )
    {
      SCOPED_TRACE( std::string( bCheckBox ? "with" : "without" ) + " check box, error " + ( bError ? "yes" : "no" ) );
      VersionCheck::VVersionCheckMessageBox Box( bCheckBox, "LumekVideoViewer", nullptr, bError );
      EXPECT_EQ( Box.windowTitle(), "Checking LumekVideoViewer Version" );
      EXPECT_FALSE( Box.windowFlags().testFlag( Qt::WindowContextHelpButtonHint ) );
      EXPECT_EQ( Box.IsError(), bError );
      ASSERT_EQ( Box.GetCheckBox() != nullptr, bCheckBox );
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
      const int Size = Box.style()->pixelMetric( QStyle::PM_MessageBoxIconSize );
      const QImage Wanted =
          Box.style()
              ->standardIcon( bError ? QStyle::SP_MessageBoxCritical : QStyle::SP_MessageBoxInformation )
              .pixmap( Size, Size )
              .toImage();
      int Matches = 0;
      for( const QLabel* pLabel : Box.findChildren< QLabel* >() )
        Matches += pLabel->pixmap( Qt::ReturnByValue ).toImage() == Wanted ? 1 : 0;
      EXPECT_EQ( Matches, 1 );
    }
  }

  TEST( MessageBox, LinksOpenInTheSystemBrowserAndOkCloses )
  {
    VUrlCatcher Catcher;
    QDesktopServices::setUrlHandler( "https", &Catcher, "Open" );
    VersionCheck::VVersionCheckMessageBox Box( true, "LumekVideoViewer", nullptr, false );
    Box.GetTextBrowser()->setHtml( "<p>See <a href=\"https://www.lumek.example/news\">the news</a></p>" );
    Box.show();
    const QString Before = Box.GetTextBrowser()->toHtml();
    emit Box.GetTextBrowser()->anchorClicked( QUrl( "https://www.lumek.example/news" ) );
    QDesktopServices::unsetUrlHandler( "https" );
    EXPECT_EQ( Catcher.Urls, QList< QUrl >{ QUrl( "https://www.lumek.example/news" ) } );
    EXPECT_TRUE( Box.isVisible() ) << "the dialog stays while the browser opens";
    EXPECT_EQ( Box.GetTextBrowser()->toHtml(), Before );

    Box.findChild< QPushButton* >()->click();
    EXPECT_FALSE( Box.isVisible() );
  }
} // namespace

#include "MessageBoxTest.moc"
