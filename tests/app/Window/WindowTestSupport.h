#pragma once

// A fresh window on an empty settings store, with recordings in a folder of the test's own, and
// what its tests reach into it for.

#include "tests/app/AppTestSupport.h"

#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Playback/VPlayBackManager.h"
#include "app/Window/VPropertiesDialog.h"
#include "app/Window/VVideoSettingsDialog.h"
#include "app/Window/VVideoWindow.h"

#include <QAction>
#include <QApplication>
#include <QLabel>
#include <QPushButton>
#include <QSettings>
#include <QTableWidget>
#include <QTemporaryDir>
#include <QTest>
#include <QTimer>

#include <gtest/gtest.h>

#include <functional>
#include <memory>

namespace WindowTest
{
  using namespace AppTest;
  using namespace LumekVideoViewer;

  // Runs the event loop until the condition holds or the time is up.
  inline bool WaitFor( const std::function< bool() >& i_rCondition, int i_Milliseconds = 3000 )
  {
    return QTest::qWaitFor( i_rCondition, i_Milliseconds );
  }

  // Closes every modal dialog of type T that appears, with its done(), and keeps what it showed;
  // the dialog's own event loop would otherwise hold the test forever.
  template < typename T > class VDialogCloser
  {
  public:
    explicit VDialogCloser( std::function< void( T* ) > i_Inspect = {} ) : m_Inspect( std::move( i_Inspect ) )
    {
      QObject::connect( &m_Timer, &QTimer::timeout,
                        [this]
                        {
                          for( QWidget* pWidget : QApplication::topLevelWidgets() )
                            if( T* pDialog = qobject_cast< T* >( pWidget ); pDialog && pDialog->isVisible() )
                            {
                              ++m_Count;
                              if( m_Inspect )
                                m_Inspect( pDialog );
                              pDialog->done( 0 );
                            }
                        } );
      m_Timer.start( 20 );
    }
    int GetCount() const { return m_Count; }

  private:
    std::function< void( T* ) > m_Inspect;
    QTimer m_Timer;
    int m_Count = 0;
  };

  class WindowFixture : public testing::Test
  {
  protected:
    void SetUp() override
    {
      ASSERT_TRUE( m_Dir.isValid() );
      QSettings Store( SettingsOrganisation, SettingsApplication );
      Store.clear();
      Store.sync();
      NewWindow();
    }

    void TearDown() override { m_pWindow.reset(); }

    void NewWindow()
    {
      m_pWindow.reset();
      // No version server: the start-up check fails at once and silently.
      m_pWindow = std::make_unique< VVideoWindow >( false, "", "", nullptr );
      m_pWindow->resize( 900, 700 );
      m_pWindow->show();
      QApplication::setActiveWindow( m_pWindow.get() );
      ASSERT_TRUE( QTest::qWaitForWindowExposed( m_pWindow.get() ) );
    }

    std::string Recording( const std::string& i_rName, const VRecordingSpec& i_rSpec = VRecordingSpec() )
    {
      return WriteRecording( m_Dir.filePath( QString::fromStdString( i_rName ) ).toStdString(), i_rSpec );
    }
    bool Open( const std::string& i_rPath ) { return m_pWindow->OpenFile( QString::fromStdString( i_rPath ) ); }

    QString Label( const char* i_pName ) const
    {
      QLabel* pLabel = Child< QLabel >( i_pName );
      return pLabel ? pLabel->text() : QString( "<no label %1>" ).arg( i_pName );
    }
    template < typename T > T* Child( const char* i_pName ) const { return m_pWindow->findChild< T* >( i_pName ); }
    VPlayBackManager& Manager() const { return *m_pWindow->GetPlayBackManager(); }
    QAction* Action( EAction i_Action ) const { return m_pWindow->GetAction( i_Action ); }
    VLabelSlider* Timebar() const { return Child< VLabelSlider >( "Timebar" ); }
    QSpinBox* SpinBox() const { return m_pWindow->findChild< VClickSpinBox* >(); }
    QPushButton* PlayButton() const
    {
      QPushButton* pButton = Child< QPushButton >( "Play" );
      return pButton ? pButton : Child< QPushButton >( "Pause" );
    }
    bool IsFull() const { return m_pWindow->windowState().testFlag( Qt::WindowFullScreen ); }

    void Pause()
    {
      if( Manager().IsPlaying() )
        m_pWindow->PlayPause();
    }
    // As a user typing into the box: the plain QSpinBox::setValue tells the connected slots.
    void TypeFrame( int i_Frame ) { SpinBox()->QSpinBox::setValue( i_Frame ); }
    // A shortcut reaches only the active window.
    void Key( int i_Key, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
    {
      QApplication::setActiveWindow( m_pWindow.get() );
      QTest::keyClick( m_pWindow.get(), static_cast< Qt::Key >( i_Key ), i_Modifiers );
    }

    // The grey level the surface shows at a point inside the picture, off the centre where the
    // missing frame plate sits and off the outline at the edges.
    int ShownLevel() const
    {
      const QImage Image = m_pWindow->GetGLWidget()->grabFramebuffer();
      return qGray( Image.pixel( Image.width() / 4, Image.height() / 2 ) );
    }

    void ExpectNoFileState() const
    {
      EXPECT_EQ( m_pWindow->windowTitle(), "Lumek Video Viewer" );
      EXPECT_EQ( Label( "TimecodeLabel" ), "No file open" );
      EXPECT_EQ( Label( "VideoLabel" ), "" );
      EXPECT_EQ( Label( "DecoderLabel" ), "" );
      EXPECT_FALSE( Timebar()->isEnabled() );
      EXPECT_EQ( Timebar()->maximum(), 100 );
      EXPECT_EQ( Timebar()->value(), 0 );
      EXPECT_FALSE( SpinBox()->isEnabled() );
      EXPECT_FALSE( PlayButton()->isEnabled() );
      EXPECT_FALSE( Action( EAction::Play )->isEnabled() );
      EXPECT_FALSE( m_pWindow->GetVideoSettingsDialog()->GetRevertButton()->isEnabled() );
      EXPECT_EQ( m_pWindow->GetPropertiesDialog()->GetTable()->rowCount(), 0 );
    }

    QTemporaryDir m_Dir;
    std::unique_ptr< VVideoWindow > m_pWindow;
  };
} // namespace WindowTest
