#pragma once

#include <QWidget>

#include <functional>

class QLineEdit;
class QSlider;

namespace LumekVideoViewer
{
  // A number editor: a line edit beside a horizontal slider. The slider holds the value on its
  // integer grid through the two conversion functions; the line edit shows it as text.
  //
  // Dragging updates the text only; the value is committed (Changed) when the drag ends, on a key
  // or click on the slider, or when the line edit's editing is finished.
  class VEditSlider : public QWidget
  {
    Q_OBJECT

  public:
    using ToPosition = std::function< int( float ) >;
    using FromPosition = std::function< float( int ) >;

    // The precision of the number text when none is given: the stream's default.
    static constexpr unsigned DefaultPrecision = ~0u;

    VEditSlider( float i_Min, float i_Max, unsigned i_Precision, ToPosition i_ToPosition, FromPosition i_FromPosition,
                 QWidget* i_pParent = nullptr );

    // Shows a value without committing it; ignored while the user holds the slider, and for text
    // that is not a number.
    void SetText( const QString& i_rText );
    QString GetText() const;
    // Moves the slider's upper end to a parsed number; the clamp of typed values stays as built.
    void SetMaximum( const QString& i_rText );

    // The fixed-notation text of a value at this editor's precision.
    QString NumberText( float i_Value ) const;

    QLineEdit* GetLineEdit() const { return m_pLineEdit; }
    QSlider* GetSlider() const { return m_pSlider; }

  signals:
    void Changed( float i_Value );

  public slots:
    void SliderChanged( int i_Value );
    void SliderCommitted();
    void LineEditChanged();
    void LineEditCommitted();

  private:
    QLineEdit* m_pLineEdit;
    QSlider* m_pSlider;
    float m_Min;
    float m_Max;
    unsigned m_Precision;
    ToPosition m_ToPosition;
    FromPosition m_FromPosition;
  };
} // namespace LumekVideoViewer
