#include "app/Window/VVideoSettingsDialog.h"

#include "app/Controls/VEditSlider.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QVBoxLayout>

namespace LumekVideoViewer
{
  namespace
  {
    // Both editors share one grid of hundredths.
    int ToSliderPosition( float i_Value )
    {
      return static_cast< int >( i_Value * 100.0f );
    }
    float FromSliderPosition( int i_Position )
    {
      return static_cast< float >( i_Position * 0.01 );
    }

    QLabel* RowLabel( const QString& i_rText, const QString& i_rToolTip, QWidget* i_pParent )
    {
      QLabel* pLabel = new QLabel( i_rText, i_pParent );
      pLabel->setToolTip( i_rToolTip );
      pLabel->setFixedWidth( 130 );
      pLabel->setAlignment( Qt::AlignRight | Qt::AlignVCenter );
      return pLabel;
    }

    QPushButton* Button( const QString& i_rText, const QString& i_rToolTip, QWidget* i_pParent )
    {
      QPushButton* pButton = new QPushButton( i_rText, i_pParent );
      pButton->setToolTip( i_rToolTip );
      pButton->setFixedWidth( 100 );
      return pButton;
    }
  } // namespace

  VVideoSettingsDialog::VVideoSettingsDialog( QWidget* i_pParent )
      : QDialog( i_pParent ), m_pGamma( new VEditSlider( 0.0f, 2.0f, 2, ToSliderPosition, FromSliderPosition, this ) ),
        m_pSaturation( new VEditSlider( 0.0f, 4.0f, 2, ToSliderPosition, FromSliderPosition, this ) ),
        m_pClose( Button( "Close", "Close this window", this ) ),
        m_pRevert( Button( "Revert", "Revert to settings from video file", this ) )
  {
    setWindowFlags( windowFlags() & ~Qt::WindowContextHelpButtonHint );
    setWindowTitle( "Video Display Settings" );
    resize( 450, 180 );
    setMinimumSize( 300, 150 );

    QHBoxLayout* pGammaRow = new QHBoxLayout;
    pGammaRow->addWidget( RowLabel( "Gamma Correction:", "Set the gamma correction", this ) );
    pGammaRow->addWidget( m_pGamma );
    QHBoxLayout* pSaturationRow = new QHBoxLayout;
    pSaturationRow->addWidget( RowLabel( "Saturation:", "Set the color saturation", this ) );
    pSaturationRow->addWidget( m_pSaturation );
    QHBoxLayout* pButtonRow = new QHBoxLayout;
    pButtonRow->addWidget( m_pRevert );
    pButtonRow->addWidget( new QWidget( this ) );
    pButtonRow->addWidget( m_pClose );

    QVBoxLayout* pLayout = new QVBoxLayout( this );
    pLayout->addLayout( pGammaRow );
    pLayout->addLayout( pSaturationRow );
    pLayout->addLayout( pButtonRow );

    // Direct connections: the surface sees the value within the same event.
    connect( m_pGamma, &VEditSlider::Changed, this,
             [this]( float i_Value )
             {
               m_Current.GammaCorrection = i_Value;
               emit VideoSettingsChanged( m_Current );
             } );
    connect( m_pSaturation, &VEditSlider::Changed, this,
             [this]( float i_Value )
             {
               m_Current.Saturation = i_Value;
               emit VideoSettingsChanged( m_Current );
             } );
    connect( m_pRevert, &QPushButton::clicked, this, &VVideoSettingsDialog::Revert );
    connect( m_pClose, &QPushButton::clicked, this, &QDialog::hide );

    ShowValues();
  }

  void VVideoSettingsDialog::SetFileVideoSettings( const ZOL::IVideoSettings& i_rSettings )
  {
    m_FileValues = i_rSettings;
  }

  void VVideoSettingsDialog::SetVideoSettings( const ZOL::IVideoSettings& i_rSettings )
  {
    m_Current = i_rSettings;
    ShowValues();
  }

  void VVideoSettingsDialog::SetControlsEnabled( bool i_bEnabled )
  {
    m_pGamma->setEnabled( i_bEnabled );
    m_pSaturation->setEnabled( i_bEnabled );
    m_pRevert->setEnabled( i_bEnabled );
  }

  void VVideoSettingsDialog::ShowValues()
  {
    m_pGamma->SetText( QString( "%1" ).arg( static_cast< double >( m_Current.GammaCorrection ) ) );
    m_pSaturation->SetText( QString( "%1" ).arg( static_cast< double >( m_Current.Saturation ) ) );
  }

  void VVideoSettingsDialog::Revert()
  {
    m_Current = m_FileValues;
    ShowValues();
    emit VideoSettingsChanged( m_Current );
  }
} // namespace LumekVideoViewer
