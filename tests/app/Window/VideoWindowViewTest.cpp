// Full screen, scale modes, keys, stored settings and the Help menu of the real window.

#include "tests/app/Window/WindowTestSupport.h"

#include "app/Window/VLegalDialog.h"
#include "app/Window/VPropertiesDialog.h"

#include <QAction>
#include <QDesktopServices>
#include <QGroupBox>
#include <QMenuBar>
#include <QMouseEvent>
#include <QQuickItem>
#include <QQuickWidget>
#include <QTextBrowser>

using namespace LumekVideoViewer;
using namespace WindowTest;

namespace
{
  class WindowView : public WindowFixture
  {
  protected:
    // The window's own, in the central layout; QMainWindow keeps a hidden one of its own.
    QMenuBar* MenuBar() const { return Child< QMenuBar >( "MenuBar" ); }
    QWidget* Logo() const { return Child< QWidget >( "Logo" ); }
    bool IsFull() const { return m_pWindow->windowState().testFlag( Qt::WindowFullScreen ); }
  };

  // Catches what the Help menu would open in a browser.
  class VUrlCatcher : public QObject
  {
    Q_OBJECT

  public:
    QList< QUrl > Urls;

  public slots:
    void Open( const QUrl& i_rUrl ) { Urls.append( i_rUrl ); }
  };
} // namespace

// A first start shows "Full Screen" checked while the window is normal: the first F only
// unchecks it, and the second goes to full screen.
TEST_F( WindowView, FullScreenKeysAndTheStoredMismatch )
{
  QAction* pFull = Action( EAction::FullScreen );
  EXPECT_TRUE( pFull->isChecked() );
  EXPECT_FALSE( IsFull() );

  Key( Qt::Key_F );
  EXPECT_FALSE( pFull->isChecked() );
  EXPECT_FALSE( IsFull() );

  Key( Qt::Key_F );
  EXPECT_TRUE( IsFull() );
  EXPECT_TRUE( MenuBar()->isHidden() );
  EXPECT_TRUE( Logo()->isHidden() );
  EXPECT_FALSE( Child< QGroupBox >( "Controls" )->isHidden() );

  Key( Qt::Key_Escape );
  EXPECT_FALSE( IsFull() );
  EXPECT_FALSE( MenuBar()->isHidden() );
  EXPECT_FALSE( Logo()->isHidden() );
  Key( Qt::Key_Escape );
  EXPECT_FALSE( pFull->isChecked() );

  Key( Qt::Key_F5 );
  EXPECT_TRUE( IsFull() );
  Key( Qt::Key_F5 );
  EXPECT_TRUE( pFull->isChecked() );
  EXPECT_TRUE( IsFull() );

  // A double click on the picture toggles the same action.
  QWidget* pSurface = m_pWindow->GetGLWidget();
  QMouseEvent Double( QEvent::MouseButtonDblClick, QPointF( 20, 20 ), Qt::LeftButton, Qt::LeftButton, Qt::NoModifier );
  QApplication::sendEvent( pSurface, &Double );
  EXPECT_FALSE( IsFull() );
  QApplication::sendEvent( pSurface, &Double );
  EXPECT_TRUE( IsFull() );

  // So does the button.
  Child< QWidget >( "FullScreen" )->setEnabled( true );
  QTest::mouseClick( Child< QWidget >( "FullScreen" ), Qt::LeftButton );
  EXPECT_FALSE( IsFull() );
}

// In full screen the menu bar is hidden; the window's own copies of the actions keep every key.
TEST_F( WindowView, KeysWorkWithTheMenuBarHidden )
{
  ASSERT_TRUE( Open( Recording( "keys.lvid" ) ) );
  Key( Qt::Key_F );
  Key( Qt::Key_F );
  ASSERT_TRUE( MenuBar()->isHidden() );

  Key( Qt::Key_L );
  EXPECT_FALSE( Action( EAction::Looping )->isChecked() );
  Key( Qt::Key_S );
  EXPECT_FALSE( Manager().GetDropFrame() );
  Key( Qt::Key_C );
  EXPECT_TRUE( Child< QWidget >( "Controls" )->isHidden() );
  Key( Qt::Key_I );
  EXPECT_TRUE( Child< QWidget >( "InfoPanel" )->isHidden() );
  Key( Qt::Key_Space );
  EXPECT_FALSE( Manager().IsPlaying() );
  Key( Qt::Key_Right );
  EXPECT_EQ( Manager().GetCurrentFrame(), 1u );
  Key( Qt::Key_P );
  EXPECT_TRUE( m_pWindow->GetPropertiesDialog()->isVisible() );
  m_pWindow->GetPropertiesDialog()->hide();
  Key( Qt::Key_C );
  Key( Qt::Key_I );
  EXPECT_FALSE( Child< QWidget >( "Controls" )->isHidden() );
  EXPECT_FALSE( Child< QWidget >( "InfoPanel" )->isHidden() );
}

TEST_F( WindowView, ScaleModesFollowTheMenuAndFullScreenLeavesTheFixedSize )
{
  VRecordingSpec Spec;
  Spec.Width = 320;
  Spec.Height = 200;
  Spec.Frames = 3;
  ASSERT_TRUE( Open( Recording( "scale.lvid", Spec ) ) );
  VGLWidget* pSurface = m_pWindow->GetGLWidget();
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleToWindow );

  const std::pair< EAction, EScaleMode > Modes[] = {
      { EAction::ScaleFreely, ScaleFreely },
      { EAction::ScaleOneToOne, ScaleOneToOne },
      { EAction::ScaleToWindow, ScaleToWindow },
  };
  for( const auto& rMode : Modes )
  {
    Action( rMode.first )->trigger();
    EXPECT_EQ( pSurface->GetScaleMode(), rMode.second );
    EXPECT_TRUE( Action( rMode.first )->isChecked() );
    EXPECT_NE( m_pWindow->minimumSize(), m_pWindow->maximumSize() );
  }

  // Dragging the picture frees the scale, and the menu follows.
  QMouseEvent Press( QEvent::MouseButtonPress, QPointF( 100, 100 ), Qt::LeftButton, Qt::LeftButton, Qt::NoModifier );
  QMouseEvent Move( QEvent::MouseMove, QPointF( 140, 110 ), Qt::NoButton, Qt::LeftButton, Qt::NoModifier );
  QMouseEvent Release( QEvent::MouseButtonRelease, QPointF( 140, 110 ), Qt::LeftButton, Qt::NoButton, Qt::NoModifier );
  QApplication::sendEvent( pSurface, &Press );
  QApplication::sendEvent( pSurface, &Move );
  QApplication::sendEvent( pSurface, &Release );
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleFreely );
  EXPECT_TRUE( Action( EAction::ScaleFreely )->isChecked() );
  EXPECT_FALSE( Action( EAction::ScaleToWindow )->isChecked() );

  // Leaving the fixed size adds the maximise button; the close and minimise buttons must stay.
  EXPECT_TRUE( m_pWindow->windowFlags().testFlag( Qt::WindowMaximizeButtonHint ) );
  EXPECT_TRUE( m_pWindow->windowFlags().testFlag( Qt::WindowCloseButtonHint ) );
  EXPECT_TRUE( m_pWindow->windowFlags().testFlag( Qt::WindowMinimizeButtonHint ) );

  Action( EAction::ScaleWindowToVideo )->trigger();
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleWindowToVideo );
  EXPECT_EQ( m_pWindow->minimumSize(), m_pWindow->maximumSize() );

  Key( Qt::Key_F ); // unchecks the stored state
  Key( Qt::Key_F );
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleOneToOne );
  EXPECT_TRUE( Action( EAction::ScaleOneToOne )->isChecked() );
  EXPECT_NE( m_pWindow->minimumSize(), m_pWindow->maximumSize() );
  Key( Qt::Key_Escape );

  // A new file starts from the window's fit again.
  ASSERT_TRUE( Open( Recording( "scale2.lvid", Spec ) ) );
  EXPECT_EQ( pSurface->GetScaleMode(), ScaleToWindow );
  EXPECT_TRUE( Action( EAction::ScaleToWindow )->isChecked() );
}

TEST_F( WindowView, SettingsSurviveARestart )
{
  Action( EAction::Looping )->setChecked( false );
  Action( EAction::SoftwareDecoder )->setChecked( true );
  Action( EAction::Controls )->setChecked( false );
  Key( Qt::Key_F ); // the stored "checked" becomes unchecked
  NewWindow();

  EXPECT_FALSE( Action( EAction::Looping )->isChecked() );
  EXPECT_TRUE( Action( EAction::SkipFrames )->isChecked() );
  EXPECT_TRUE( Action( EAction::SoftwareDecoder )->isChecked() );
  EXPECT_FALSE( Action( EAction::HardwareDecoder )->isChecked() );
  EXPECT_FALSE( Action( EAction::Controls )->isChecked() );
  EXPECT_TRUE( Child< QWidget >( "Controls" )->isHidden() );
  EXPECT_FALSE( Child< QWidget >( "InfoPanel" )->isHidden() );
  EXPECT_FALSE( Action( EAction::FullScreen )->isChecked() );

  // Without looping the end stops playback: the second window really loaded the value.
  ASSERT_TRUE( Open( Recording( "restart.lvid" ) ) );
  EXPECT_TRUE( m_pWindow->GetGLWidget()->GetDecoderName().contains( "Software" ) );
  EXPECT_TRUE( WaitFor( [this] { return !Manager().IsPlaying(); } ) );

  // A stored full screen is a checked action on a normal window.
  Key( Qt::Key_F );
  ASSERT_TRUE( Action( EAction::FullScreen )->isChecked() );
  NewWindow();
  EXPECT_TRUE( Action( EAction::FullScreen )->isChecked() );
  EXPECT_FALSE( m_pWindow->windowState().testFlag( Qt::WindowFullScreen ) );
}

TEST_F( WindowView, HelpOpensTheDocumentationOfThisRelease )
{
  VUrlCatcher Catcher;
  QDesktopServices::setUrlHandler( "https", &Catcher, "Open" );
  Action( EAction::ViewHelp )->trigger();
  QDesktopServices::unsetUrlHandler( "https" );
  ASSERT_EQ( Catcher.Urls.size(), 1 );
  EXPECT_EQ( Catcher.Urls.front().path(), "/display/LVV110/" );
}

TEST_F( WindowView, AboutShowsThisRelease )
{
  QString VersionLine;
  VDialogCloser< QDialog > Closer(
      [&]( QDialog* i_pDialog )
      {
        if( QLabel* pLabel = i_pDialog->findChild< QLabel* >( "VersionLine" ) )
          VersionLine = pLabel->text();
      } );
  Action( EAction::About )->trigger();
  EXPECT_EQ( Closer.GetCount(), 1 );
  EXPECT_EQ( VersionLine, "Lumek Video Viewer 1.10.0.137509h  x64" );
}

// The user's check always answers; with no server to ask, the answer is the error dialog.
TEST_F( WindowView, CheckForUpdatesAnswersEvenWithoutAServer )
{
  QString Text;
  VDialogCloser< QDialog > Closer(
      [&]( QDialog* i_pDialog )
      {
        if( QTextBrowser* pBrowser = i_pDialog->findChild< QTextBrowser* >() )
          Text = pBrowser->toPlainText();
      } );
  Action( EAction::CheckForUpdates )->trigger();
  EXPECT_TRUE( WaitFor( [&] { return Closer.GetCount() == 1; } ) );
  EXPECT_TRUE( Text.contains( "Unable to contact version check server." ) ) << Text.toStdString();
}

TEST( LegalComponents, EveryLicenceTextIsThereWithItsCopyright )
{
  const QStringList Expected = { "Qt 5",          "Boost",    "libebml",     "libmatroska",
                                 "libjpeg-turbo", "OpenH264", "ImageMagick", "RapidXml" };
  QStringList Names;
  for( const VLegalComponent& rComponent : LegalComponents() )
  {
    SCOPED_TRACE( rComponent.Name.toStdString() );
    Names.append( rComponent.Name );
    const QString Text = LicenceText( rComponent );
    EXPECT_GT( Text.size(), 800 );
    EXPECT_TRUE( Text.contains( rComponent.Copyright ) );
    // Every one of these licences disclaims warranty; a text without it is cut short.
    EXPECT_TRUE( Text.contains( "warrant", Qt::CaseInsensitive ) );
  }
  EXPECT_EQ( Names, Expected );
}

TEST_F( WindowView, TheLegalPageLoadsWithTheTheme )
{
  QString Title;
  QQuickWidget::Status Status = QQuickWidget::Null;
  QString Errors;
  VDialogCloser< VLegalDialog > Closer(
      [&]( VLegalDialog* i_pDialog )
      {
        QQuickWidget* pPage = i_pDialog->GetQuickWidget();
        Status = pPage->status();
        for( const QQmlError& rError : pPage->errors() )
          Errors += rError.toString() + "\n";
        if( QQuickItem* pRoot = pPage->rootObject() )
          if( QObject* pTitle = pRoot->findChild< QObject* >( "ComponentTitle" ) )
            Title = pTitle->property( "text" ).toString();
      } );
  Action( EAction::Licenses )->trigger();
  EXPECT_EQ( Closer.GetCount(), 1 );
  EXPECT_EQ( Status, QQuickWidget::Ready ) << Errors.toStdString();
  EXPECT_TRUE( Title.startsWith( "Qt 5" ) ) << Title.toStdString();
}

#include "VideoWindowViewTest.moc"
