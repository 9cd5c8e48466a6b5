#include "app/Controls/VEditSlider.h"

#include <QHBoxLayout>
#include <QLineEdit>
#include <QSignalBlocker>
#include <QSlider>

#include <iomanip>
#include <sstream>

namespace LumekVideoViewer
{
  namespace
  {
    constexpr int s_LineEditMaximumWidth = 60;
  }

  VEditSlider::VEditSlider( float i_Min, float i_Max, unsigned i_Precision, ToPosition i_ToPosition,
                            FromPosition i_FromPosition, QWidget* i_pParent )
      : QWidget( i_pParent ), m_pLineEdit( new QLineEdit( this ) ), m_pSlider( new QSlider( Qt::Horizontal, this ) ),
        m_Min( i_Min ), m_Max( i_Max ), m_Precision( i_Precision ), m_ToPosition( std::move( i_ToPosition ) ),
        m_FromPosition( std::move( i_FromPosition ) )
  {
    m_pLineEdit->setMaximumWidth( s_LineEditMaximumWidth );
    m_pSlider->setRange( m_ToPosition( m_Min ), m_ToPosition( m_Max ) );
    m_pSlider->setTracking( true );

    auto* pLayout = new QHBoxLayout( this );
    pLayout->setContentsMargins( 0, 0, 0, 0 );
    pLayout->setSpacing( 0 );
    pLayout->addWidget( m_pLineEdit );
    pLayout->addWidget( m_pSlider );
    setFocusProxy( m_pLineEdit );

    connect( m_pSlider, &QSlider::sliderMoved, this, &VEditSlider::SliderChanged );
    connect( m_pSlider, &QSlider::valueChanged, this, &VEditSlider::SliderChanged );
    connect( m_pSlider, &QSlider::sliderReleased, this, &VEditSlider::SliderCommitted );
    connect( m_pLineEdit, &QLineEdit::textChanged, this, &VEditSlider::LineEditChanged );
    connect( m_pLineEdit, &QLineEdit::editingFinished, this, &VEditSlider::LineEditCommitted );
  }

  QString VEditSlider::NumberText( float i_Value ) const
  {
    std::ostringstream Stream;
    Stream << std::fixed << std::setfill( '0' );
    if( m_Precision != DefaultPrecision )
      Stream << std::setprecision( static_cast< int >( m_Precision ) );
    Stream << i_Value;
    return QString::fromStdString( Stream.str() );
  }

  void VEditSlider::SliderChanged( int i_Value )
  {
    {
      const QSignalBlocker Blocker( m_pLineEdit );
      m_pLineEdit->setText( NumberText( m_FromPosition( i_Value ) ) );
    }
    // While the handle is held the number follows it, but nobody hears of it until the release.
    if( !m_pSlider->isSliderDown() )
      emit Changed( m_FromPosition( m_pSlider->value() ) );
  }

  void VEditSlider::SliderCommitted()
  {
    SliderChanged( m_pSlider->value() );
  }

  void VEditSlider::LineEditChanged()
  {
    bool bOk = false;
    float Value = m_pLineEdit->text().toFloat( &bOk );
    if( !bOk )
      return;
    if( Value > m_Max )
    {
      Value = m_Max;
      const QSignalBlocker Blocker( m_pLineEdit );
      m_pLineEdit->setText( QStringLiteral( "%1" ).arg( Value ) );
    }
    if( !( Value >= m_Min ) )
    {
      // Written with signals on: this slot runs once more with the clamped text, which then passes.
      Value = m_Min;
      m_pLineEdit->setText( QStringLiteral( "%1" ).arg( Value ) );
    }
    const QSignalBlocker Blocker( m_pSlider );
    m_pSlider->setValue( m_ToPosition( Value ) );
  }

  void VEditSlider::LineEditCommitted()
  {
    LineEditChanged();
    // The slider's grid decides the committed value, so what is stored is what the slider shows.
    emit Changed( m_FromPosition( m_pSlider->value() ) );
  }

  void VEditSlider::SetText( const QString& i_rText )
  {
    if( m_pSlider->isSliderDown() )
      return;
    bool bOk = false;
    const float Value = i_rText.toFloat( &bOk );
    if( !bOk )
      return;
    {
      const QSignalBlocker Blocker( m_pSlider );
      m_pSlider->setValue( m_ToPosition( Value ) );
    }
    const QSignalBlocker Blocker( m_pLineEdit );
    m_pLineEdit->setText( NumberText( Value ) );
  }

  QString VEditSlider::GetText() const
  {
    return m_pLineEdit->text();
  }

  void VEditSlider::SetMaximum( const QString& i_rText )
  {
    bool bOk = false;
    const float Value = i_rText.toFloat( &bOk );
    if( bOk )
      m_pSlider->setMaximum( m_ToPosition( Value ) );
  }
} // namespace LumekVideoViewer
