#include "services/Theme/IApplicationStyling.h"

#include "services/Theme/StyleSheetText.h"

#include <QMetaEnum>

#include <cmath>

namespace ZOL
{
  namespace
  {
    using S = IApplicationStyling;

    // In record order; QML and the style sheet know the values by these names.
    const std::vector< S::VField > s_Fields = {
        { "Window", &S::m_Window },
        { "WindowText", &S::m_WindowText },
        { "Base", &S::m_Base },
        { "AlternateBase", &S::m_AlternateBase },
        { "ToolTipBase", &S::m_ToolTipBase },
        { "ToolTipText", &S::m_ToolTipText },
        { "Text", &S::m_Text },
        { "Button", &S::m_Button },
        { "ButtonText", &S::m_ButtonText },
        { "BrightText", &S::m_BrightText },
        { "Light", &S::m_Light },
        { "Midlight", &S::m_Midlight },
        { "Dark", &S::m_Dark },
        { "Mid", &S::m_Mid },
        { "Shadow", &S::m_Shadow },
        { "Highlight", &S::m_Highlight },
        { "HighlightedText", &S::m_HighlightedText },
        { "Link", &S::m_Link },
        { "LinkVisited", &S::m_LinkVisited },
        { "WindowTextDisabled", &S::m_WindowTextDisabled },
        { "ButtonDisabled", &S::m_ButtonDisabled },
        { "ButtonTextDisabled", &S::m_ButtonTextDisabled },
        { "HighlightDisabled", &S::m_HighlightDisabled },
        { "Bright", &S::m_Bright },
        { "Contrast", &S::m_Contrast },
        { "FieldBorder", &S::m_FieldBorder },
        { "FieldBorderDisabled", &S::m_FieldBorderDisabled },
        { "ButtonBorder", &S::m_ButtonBorder },
        { "ButtonBorderDisabled", &S::m_ButtonBorderDisabled },
        { "ButtonHover", &S::m_ButtonHover },
        { "StatusGood", &S::m_StatusGood },
        { "StatusBad", &S::m_StatusBad },
        { "StatusWarning", &S::m_StatusWarning },
        { "Margin", &S::m_Margin },
        { "ItemHeight", &S::m_ItemHeight },
        { "ItemSpacing", &S::m_ItemSpacing },
        { "ItemPadding", &S::m_ItemPadding },
        { "ButtonRadius", &S::m_ButtonRadius },
        { "ButtonWidth", &S::m_ButtonWidth },
        { "ButtonHeight", &S::m_ButtonHeight },
        { "ToolHeight", &S::m_ToolHeight },
        { "ScrollBarWidth", &S::m_ScrollBarWidth },
        { "DefaultFont", &S::m_DefaultFont },
        { "PointSizeNormal", &S::m_PointSizeNormal },
        { "PointSizeHeader", &S::m_PointSizeHeader },
        { "InfoToolTipDelay", &S::m_InfoToolTipDelay },
        { "WarnToolTipDelay", &S::m_WarnToolTipDelay },
        { "Default1", &S::m_Default1 },
        { "Default2", &S::m_Default2 },
        { "Default3", &S::m_Default3 },
        { "Default4", &S::m_Default4 },
        { "Default5", &S::m_Default5 },
        { "Default6", &S::m_Default6 },
    };

    // Font sizes follow the font's own density handling; scaling them here would count it twice.
    const QString s_UnscaledPrefix = QStringLiteral( "PointSize" );

    const IApplicationStyling::VField* FindField( const QString& i_rName )
    {
      for( const auto& rField : s_Fields )
        if( i_rName == QLatin1String( rField.Name ) )
          return &rField;
      return nullptr;
    }

    struct VValueOf
    {
      const IApplicationStyling& rStyling;
      QVariant operator()( QColor S::*i_pMember ) const { return rStyling.*i_pMember; }
      QVariant operator()( int S::*i_pMember ) const { return rStyling.*i_pMember; }
      QVariant operator()( QString S::*i_pMember ) const { return rStyling.*i_pMember; }
    };
  } // namespace

  IApplicationStyling::IApplicationStyling()
      : m_Window( "#303030" ), m_WindowText( "#ffffff" ), m_Base( "#303030" ), m_AlternateBase( "#404040" ),
        m_ToolTipBase( "#202020" ), m_ToolTipText( "#ffffff" ), m_Text( "#ffffff" ), m_Button( "#4d4d4d" ),
        m_ButtonText( "#ffffff" ), m_BrightText( "#ffffff" ), m_Light( "#808080" ), m_Midlight( "#707070" ),
        m_Dark( "#404040" ), m_Mid( "#606060" ), m_Shadow( "#202020" ), m_Highlight( "#2e78fc" ),
        m_HighlightedText( "#ffffff" ), m_Link( "#4c8bfc" ), m_LinkVisited( "#4b78aa" ),
        m_WindowTextDisabled( "#999999" ), m_ButtonDisabled( "#3d3d3d" ), m_ButtonTextDisabled( "#999999" ),
        m_HighlightDisabled( "#2e78fc" ), m_Bright( "#009fe3" ), m_Contrast( "#e6007e" ), m_FieldBorder( "#7d7d7d" ),
        m_FieldBorderDisabled( "#5d5d5d" ), m_ButtonBorder( "#2d2d2d" ), m_ButtonBorderDisabled( "#202020" ),
        m_ButtonHover( "#2e78fc" ), m_StatusGood( "#33cc33" ), m_StatusBad( "#cc3333" ), m_StatusWarning( "#ffd400" ),
        m_Margin( 10 ), m_ItemHeight( 20 ), m_ItemSpacing( 4 ), m_ItemPadding( 4 ), m_ButtonRadius( 5 ),
        m_ButtonWidth( 80 ), m_ButtonHeight( 24 ), m_ToolHeight( 28 ), m_ScrollBarWidth( 14 ),
        m_DefaultFont( "Segoe UI" ), m_PointSizeNormal( 9 ), m_PointSizeHeader( 10 ), m_InfoToolTipDelay( 500 ),
        m_WarnToolTipDelay( 0 ), m_Default1( "#2e78fc" ), m_Default2( "#0055ff" ), m_Default3( "#55aa00" ),
        m_Default4( "#e4b90a" ), m_Default5( "#58abd1" ), m_Default6( "#d12e1f" ), m_StyleName( "fusion" )
  {
  }

  const std::vector< IApplicationStyling::VField >& IApplicationStyling::Fields()
  {
    return s_Fields;
  }

  void IApplicationStyling::Scale( float i_Ratio )
  {
    for( const auto& rField : s_Fields )
    {
      const auto* ppNumber = std::get_if< int S::* >( &rField.Member );
      if( !ppNumber || QLatin1String( rField.Name ).startsWith( s_UnscaledPrefix ) )
        continue;
      int& rNumber = this->**ppNumber;
      rNumber = static_cast< int >( std::trunc( static_cast< float >( rNumber ) * i_Ratio ) );
    }
  }

  QPalette IApplicationStyling::MakePalette() const
  {
    static const QPalette::ColorGroup s_Groups[] = { QPalette::Active, QPalette::Inactive, QPalette::Disabled };
    static const QString s_DisabledSuffix = QStringLiteral( "Disabled" );

    QPalette Palette;
    const QMetaEnum Roles = QMetaEnum::fromType< QPalette::ColorRole >();
    for( QPalette::ColorGroup Group : s_Groups )
    {
      for( int Key = 0; Key < Roles.keyCount(); ++Key )
      {
        const QString Name = QLatin1String( Roles.key( Key ) );
        const auto Role = static_cast< QPalette::ColorRole >( Roles.value( Key ) );
        // Every role of the record has a colour of its own name; the disabled group prefers the
        // "...Disabled" colour where the record has one. Other roles keep Qt's default.
        const VField* pField = nullptr;
        if( Group == QPalette::Disabled )
          pField = FindField( Name + s_DisabledSuffix );
        if( !pField )
          pField = FindField( Name );
        if( !pField || !std::holds_alternative< QColor S::* >( pField->Member ) )
          continue;
        Palette.setColor( Group, Role, this->*std::get< QColor S::* >( pField->Member ) );
      }
    }
    return Palette;
  }

  QString IApplicationStyling::Substitute( const QString& i_rText ) const
  {
    return Theme::EvaluateArithmetic( Theme::SubstituteTokens( i_rText, *this ) );
  }

  QVariant IApplicationStyling::Value( const QString& i_rName ) const
  {
    const VField* pField = FindField( i_rName );
    return pField ? std::visit( VValueOf{ *this }, pField->Member ) : QVariant();
  }

  IApplicationStyling CreateApplicationStyling()
  {
    IApplicationStyling Styling;
    // The viewer's gold accent: selection, hover and the time bar's handle share it.
    Styling.m_Highlight = QColor( "#c89810" );
    Styling.m_ButtonHover = QColor( "#c89810" );
    Styling.m_BrightText = QColor( "#e76500" );
    Styling.m_StyleName = QStringLiteral( "plastique" );
    Styling.m_StyleSheetPath = QStringLiteral( ":com.Lumek.LumekVideoViewer.LumekVideoViewer.qss" );
    return Styling;
  }

  std::shared_ptr< IApplicationStyling > ApplicationStyling()
  {
    static const std::shared_ptr< IApplicationStyling > s_pStyling =
        std::make_shared< IApplicationStyling >( CreateApplicationStyling() );
    return s_pStyling;
  }
} // namespace ZOL
