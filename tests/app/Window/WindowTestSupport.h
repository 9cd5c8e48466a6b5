#pragma once

#include "app/Playback/VPlayBackManager.h"
#include "app/Window/VVideoWindow.h"
#include "tests/app/Window/TestRecordings.h"

#include <QApplication>
#include <QLabel>
#include <QSettings>
#include <QTemporaryDir>
#include <QTest>
#include <QTimer>

#include <gtest/gtest.h>

#include <functional>
#include <memory>

namespace WindowTest
{
  // Runs the event loop until the condition holds or the time is up.
  inline bool WaitFor( const std::function< bool() >& i_rCondition, int i_Milliseconds = 3000 )
  {
    return QTest::qWaitFor( i_rCondition, i_Milliseconds );
  }

  // Closes the first modal dialog that appears (any top-level widget of type T) with its done(),
  // and keeps what it showed; the dialog's own event loop would otherwise hold the test forever.
  template < typename T > class VDialogCloser
  {
  public:
    explicit VDialogCloser( std::function< void( T* ) > i_Inspect = {} ) : m_Inspect( std::move( i_Inspect ) )
    {
      m_pTimer = std::make_unique< QTimer >();
      QObject::connect( m_pTimer.get(), &QTimer::timeout,
                        [this]
                        {
                          for( QWidget* pWidget : QApplication::topLevelWidgets() )
                            if( T* pDialog = qobject_cast< T* >( pWidget ) )
                              if( pDialog->isVisible() )
                              {
                                ++m_Count;
                                if( m_Inspect )
                                  m_Inspect( pDialog );
                                pDialog->done( 0 );
                              }
                        } );
      m_pTimer->start( 20 );
    }
    int GetCount() const { return m_Count; }

  private:
    std::function< void( T* ) > m_Inspect;
    std::unique_ptr< QTimer > m_pTimer;
    int m_Count = 0;
  };

  // A fresh window on an empty settings store, with recordings in a folder of the test's own.
  class WindowFixture : public testing::Test
  {
  protected:
    void SetUp() override
    {
      ASSERT_TRUE( m_Dir.isValid() );
      ClearSettings();
      NewWindow();
    }

    void TearDown() override { m_pWindow.reset(); }

    static void ClearSettings()
    {
      QSettings Store( LumekVideoViewer::SettingsOrganisation, LumekVideoViewer::SettingsApplication );
      Store.clear();
      Store.sync();
    }

    void NewWindow()
    {
      m_pWindow.reset();
      // No version server: the start-up check fails at once and silently.
      m_pWindow = std::make_unique< LumekVideoViewer::VVideoWindow >( false, "", "", nullptr );
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
      QLabel* pLabel = m_pWindow->findChild< QLabel* >( i_pName );
      return pLabel ? pLabel->text() : QString( "<no label %1>" ).arg( i_pName );
    }

    template < typename T > T* Child( const char* i_pName ) const { return m_pWindow->findChild< T* >( i_pName ); }

    LumekVideoViewer::VPlayBackManager& Manager() const { return *m_pWindow->GetPlayBackManager(); }
    QAction* Action( LumekVideoViewer::EAction i_Action ) const { return m_pWindow->GetAction( i_Action ); }

    void Pause()
    {
      if( Manager().IsPlaying() )
        m_pWindow->PlayPause();
    }

    // The grey level the surface shows at a point inside the picture, off the centre where the
    // missing frame plate sits and off the outline at the edges.
    int ShownLevel() const
    {
      const QImage Image = m_pWindow->GetGLWidget()->grabFramebuffer();
      return qGray( Image.pixel( Image.width() / 4, Image.height() / 2 ) );
    }

    void Key( int i_Key, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
    {
      QApplication::setActiveWindow( m_pWindow.get() );
      QTest::keyClick( m_pWindow.get(), static_cast< Qt::Key >( i_Key ), i_Modifiers );
    }

    QTemporaryDir m_Dir;
    std::unique_ptr< LumekVideoViewer::VVideoWindow > m_pWindow;
  };
} // namespace WindowTest
