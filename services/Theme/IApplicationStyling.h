#pragma once

// How the application looks: one record of named colours, sizes and fonts, made once per process.
// Application start turns it into a Qt style, a palette and the style sheet, and hands it to QML as
// the singleton "Theme" of module "Lumek.Theme" 1.0. The style sheet and QML know each value by the
// name in Fields(); the sheet writes it as a token with the first letter in lower case: "[window]",
// "[itemHeight]", "[defaultFont]".

#include <QColor>
#include <QPalette>
#include <QString>
#include <QVariant>

#include <memory>
#include <variant>
#include <vector>

namespace ZOL
{
  class IApplicationStyling
  {
  public:
    // The generic look of the shared application layer; CreateApplicationStyling() then gives
    // this application its own accents.
    IApplicationStyling();

    // Corresponds to QPalette::Window or QPalette::Background.
    QColor m_Window;
    // Corresponds to QPalette::WindowText or QPalette::Foreground.
    QColor m_WindowText;
    QColor m_Base;
    QColor m_AlternateBase;
    QColor m_ToolTipBase;
    QColor m_ToolTipText;
    QColor m_Text;
    QColor m_Button;
    QColor m_ButtonText;
    QColor m_BrightText;
    QColor m_Light;
    QColor m_Midlight;
    QColor m_Dark;
    QColor m_Mid;
    QColor m_Shadow;
    QColor m_Highlight;
    QColor m_HighlightedText;
    QColor m_Link;
    QColor m_LinkVisited;
    // The disabled group's WindowText, Button, ButtonText and Highlight.
    QColor m_WindowTextDisabled;
    QColor m_ButtonDisabled;
    QColor m_ButtonTextDisabled;
    QColor m_HighlightDisabled;
    // A bright colour used for tabs and m_Text-coloured widget text.
    QColor m_Bright;
    // A contrast colour that can be used for custom application styling.
    QColor m_Contrast;
    // The border colour for parameter view controls.
    QColor m_FieldBorder;
    // The border colour for disabled parameter view controls.
    QColor m_FieldBorderDisabled;
    // The border colour for buttons.
    QColor m_ButtonBorder;
    // The border colour for disabled buttons.
    QColor m_ButtonBorderDisabled;
    // The colour for buttons hovered by the mouse cursor.
    QColor m_ButtonHover;
    // The colour used to indicate success.
    QColor m_StatusGood;
    // The colour used to indicate failure.
    QColor m_StatusBad;
    // The colour used to indicate a warning.
    QColor m_StatusWarning;

    // Whole numbers are pixels unless their name says otherwise.
    // The default margin size used by all items.
    int m_Margin;
    // The default height for all controls.
    int m_ItemHeight;
    // The default spacing between all controls within a layout.
    int m_ItemSpacing;
    // The default padding for controls.
    int m_ItemPadding;
    // The button corner radius.
    int m_ButtonRadius;
    // The width of buttons.
    int m_ButtonWidth;
    // The height of buttons.
    int m_ButtonHeight;
    // The height of toolbar buttons.
    int m_ToolHeight;
    // The width of scroll bars (the shared layer's description still calls it "The height of toolbar
    // buttons.", and is left so).
    int m_ScrollBarWidth;
    QString m_DefaultFont;
    // The point size of the application font used for most text.
    int m_PointSizeNormal;
    // The point size of the application font used for header text.
    int m_PointSizeHeader;
    // The delay before an informational tooltip appears in milliseconds.
    int m_InfoToolTipDelay;
    // The delay before a warning tooltip appears in milliseconds.
    int m_WarnToolTipDelay;

    QColor m_Default1;
    QColor m_Default2;
    QColor m_Default3;
    QColor m_Default4;
    QColor m_Default5;
    QColor m_Default6;

    // Given to QApplication::setStyle.
    QString m_StyleName;
    // The resource that holds the style sheet text, tokens and all.
    QString m_StyleSheetPath;

    // One named value of the record. Exactly one of the member pointers is set.
    struct VField
    {
      const char* Name;
      std::variant< QColor IApplicationStyling::*, int IApplicationStyling::*, QString IApplicationStyling::* > Member;
    };
    // Every named value, in record order.
    static const std::vector< VField >& Fields();

    // Multiplies every whole number whose name does not begin with "PointSize" by i_Ratio and keeps
    // the integer part. The tool tip delays are scaled too; callers rely on that staying so.
    // Call it on a copy: the shared instance is never scaled.
    void Scale( float i_Ratio );

    // The Active, Inactive and Disabled groups from the values of the same names as the roles, the
    // disabled group taking the "...Disabled" values where there is one.
    QPalette MakePalette() const;

    // Token substitution, then arithmetic evaluation, of a style sheet text. See StyleSheetText.h.
    QString Substitute( const QString& i_rText ) const;

    // The value of a name of Fields(): a QColor, an int or a QString; invalid for an unknown name.
    QVariant Value( const QString& i_rName ) const;

    // Registers singleton "Theme" of module "Lumek.Theme" 1.0, with a property of each name of
    // Fields() that gives this object's value as it is now.
    void RegisterForQml() const;
  };

  // The record of this application, created at the first call and shared from then on.
  std::shared_ptr< IApplicationStyling > ApplicationStyling();

  // The values of this application, over the generic ones.
  IApplicationStyling CreateApplicationStyling();
} // namespace ZOL
