#pragma once

#include "videointerface/IVideoFrameInfo.h"

#include <QDialog>

class QPushButton;

namespace LumekVideoViewer
{
  class VEditSlider;

  // Gamma and saturation of a Bayer recording, edited live: every committed change goes straight
  // to the surface, and "Revert" returns to what the file says.
  class VVideoSettingsDialog : public QDialog
  {
    Q_OBJECT

  public:
    explicit VVideoSettingsDialog( QWidget* i_pParent = nullptr );

    void SetFileVideoSettings( const ZOL::IVideoSettings& i_rSettings );
    // Shows the values without telling anybody.
    void SetVideoSettings( const ZOL::IVideoSettings& i_rSettings );
    // "Close" stays usable so that a disabled dialog can still be put away.
    void SetControlsEnabled( bool i_bEnabled );

    const ZOL::IVideoSettings& GetVideoSettings() const { return m_Current; }
    VEditSlider* GetGammaEditor() const { return m_pGamma; }
    VEditSlider* GetSaturationEditor() const { return m_pSaturation; }
    QPushButton* GetRevertButton() const { return m_pRevert; }

  signals:
    void VideoSettingsChanged( const ZOL::IVideoSettings& i_rSettings );

  private:
    void ShowValues();
    void Revert();

    ZOL::IVideoSettings m_Current;
    ZOL::IVideoSettings m_FileValues;
    VEditSlider* m_pGamma;
    VEditSlider* m_pSaturation;
    QPushButton* m_pClose;
    QPushButton* m_pRevert;
  };
} // namespace LumekVideoViewer
