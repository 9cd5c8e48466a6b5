#pragma once

#include "app/VideoSource/VVideoSource.h"
#include "app/Window/VideoWindowLogic.h"
#include "graphics/VideoSurface/VGLWidget.h"

#include <QMainWindow>

#include <array>
#include <memory>
#include <string>

class QAction;
class QActionGroup;
class QAudioOutput;
class QBoxLayout;
class QGroupBox;
class QIODevice;
class QLabel;
class QMenuBar;
class QPushButton;
class QSettings;

namespace VersionCheck
{
  class VApplicationVersionCheck;
}

namespace LumekVideoViewer
{
  class VClickSpinBox;
  class VLabelSlider;
  class VPlayBackManager;
  class VPropertiesDialog;
  class VQuickWidgetServices;
  class VVideoSettingsDialog;

  // The application's one main window. It owns the file, the surface, the clock, the audio output
  // and the dialogs, and a frame reaches the screen only through PrepareFrame. Everything here is
  // made once in the constructor and lives to the end; the decisions it needs are the plain
  // functions of VideoWindowLogic.h.
  class VVideoWindow : public QMainWindow
  {
    Q_OBJECT

  public:
    VVideoWindow( bool i_bDeveloper, const std::string& i_rVersionServer, const std::string& i_rSpoofVersion,
                  QWidget* i_pParent );
    ~VVideoWindow() override;

    // The one path from a name to the first frame. A file that cannot be opened gets the
    // "Invalid file" dialog and leaves the window with no file.
    bool OpenFile( QString i_Path );

    QAction* GetAction( EAction i_Action ) const { return m_Actions[static_cast< std::size_t >( i_Action )]; }
    VPlayBackManager* GetPlayBackManager() const { return m_pPlayBackManager.get(); }
    const VVideoSource& GetVideoSource() const { return m_VideoSource; }
    VGLWidget* GetGLWidget() const { return m_pGLWidget; }
    VPropertiesDialog* GetPropertiesDialog() const { return m_pPropertiesDialog; }
    VVideoSettingsDialog* GetVideoSettingsDialog() const { return m_pVideoSettingsDialog; }
    bool GetLensCorrectionWanted() const { return m_bLensCorrectionWanted; }
    // The frame whose picture the surface was last given: the one asked for, or the nearest
    // earlier one that exists; -1 when there was none.
    int GetShownFrameIndex() const { return m_ShownFrameIndex; }

  public slots:
    void SetScaleMode( EScaleMode i_ScaleMode );
    void PrepareFrame( int i_FrameIndex );
    void OpenFileDialog();
    void CloseFile();
    void PlayPause();
    void Stop();
    void UpdateControls();
    void ReloadCurrentFrame();
    void SetDecoder();
    void ViewLatestHelp();
    void ShowAbout();
    void CheckForUpdates();
    void LoadSettings();
    void SaveSettings();

  protected:
    void dragEnterEvent( QDragEnterEvent* i_pEvent ) override;
    void dropEvent( QDropEvent* i_pEvent ) override;
    void wheelEvent( QWheelEvent* i_pEvent ) override;
    bool eventFilter( QObject* i_pWatched, QEvent* i_pEvent ) override;

  private:
    void BuildLayout();
    QWidget* BuildInfoPanel();
    QWidget* BuildControls();
    void BuildActions();
    void BuildShortcuts();
    void ConnectControls();
    void ConnectActions();
    void SetFullScreen( bool i_bFullScreen );
    void SetPanelVisible( QWidget* i_pPanel, bool i_bVisible );
    void SetPlayButtonName( const QString& i_rName );
    void UpdateLensAction();
    void CreateAudioOutput();
    void WriteAudio( const ZOL::IVideoFrame& i_rFrame );
    void ShowLicenses();
    int CurrentFrame() const;

    VVideoSource m_VideoSource;
    QSettings* m_pSettings = nullptr;
    std::unique_ptr< VersionCheck::VApplicationVersionCheck > m_pUpdateCheck;
    std::string m_VersionText;
    VPropertiesDialog* m_pPropertiesDialog = nullptr;
    VVideoSettingsDialog* m_pVideoSettingsDialog = nullptr;

    QBoxLayout* m_pCentralLayout = nullptr;
    QMenuBar* m_pMenuBar = nullptr;
    QLabel* m_pLogo = nullptr;
    VGLWidget* m_pGLWidget = nullptr;
    QWidget* m_pInfoPanel = nullptr;
    QLabel* m_pTimecodeLabel = nullptr;
    QLabel* m_pDecoderLabel = nullptr;
    QLabel* m_pAudioLabel = nullptr;
    QWidget* m_pAudioSpacer = nullptr;
    QLabel* m_pVideoLabel = nullptr;
    QGroupBox* m_pControls = nullptr;
    VLabelSlider* m_pTimebar = nullptr;
    VClickSpinBox* m_pFrameSpinBox = nullptr;
    QPushButton* m_pPlayButton = nullptr;
    QPushButton* m_pStopButton = nullptr;
    QPushButton* m_pFullScreenButton = nullptr;

    std::array< QAction*, static_cast< std::size_t >( EAction::Count ) > m_Actions{};
    QActionGroup* m_pDecoderGroup = nullptr;
    QActionGroup* m_pScaleGroup = nullptr;

    // Owned, with no parent: the manager is gone before the source it reads.
    std::unique_ptr< VPlayBackManager > m_pPlayBackManager;

    // Null when the file has no audio or the system has no sound device; the viewer is silent then.
    std::unique_ptr< QAudioOutput > m_pAudioOutput;
    QIODevice* m_pAudioDevice = nullptr;

    bool m_bDeveloper;
    bool m_bLensCorrectionWanted = true;
    int m_ShownFrameIndex = -1;
    std::shared_ptr< VQuickWidgetServices > m_pQuickWidgetServices;
  };
} // namespace LumekVideoViewer
