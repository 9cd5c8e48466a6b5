#include "services/Theme/StyleSheetText.h"

#include "services/Theme/IApplicationStyling.h"

#include <QJSEngine>
#include <QRegularExpression>

#include <cmath>
#include <unordered_map>

namespace Theme
{
  namespace
  {
    QString TextOf( const QVariant& i_rValue )
    {
      if( i_rValue.type() == QVariant::Color )
        return i_rValue.value< QColor >().name();
      return i_rValue.toString();
    }

    QString ReplaceTokens( const QString& i_rText, const std::unordered_map< QString, QString >& i_rValues )
    {
      static const QRegularExpression s_Token( QStringLiteral( R"(\[([A-Za-z][A-Za-z0-9]*)\])" ) );
      QString Result;
      Result.reserve( i_rText.size() );
      int Copied = 0;
      auto Matches = s_Token.globalMatch( i_rText );
      while( Matches.hasNext() )
      {
        const auto Match = Matches.next();
        const auto Found = i_rValues.find( Match.captured( 0 ) );
        if( Found == i_rValues.end() )
          continue;
        Result += i_rText.midRef( Copied, Match.capturedStart() - Copied );
        Result += Found->second;
        Copied = Match.capturedEnd();
      }
      Result += i_rText.midRef( Copied );
      return Result;
    }
  } // namespace

  QString TokenOf( const QString& i_rName )
  {
    if( i_rName.isEmpty() )
      return QString();
    return QLatin1Char( '[' ) + i_rName.left( 1 ).toLower() + i_rName.mid( 1 ) + QLatin1Char( ']' );
  }

  QString SubstituteTokens( const QString& i_rText, const ZOL::IApplicationStyling& i_rStyling )
  {
    std::unordered_map< QString, QString > Values;
    for( const auto& rField : ZOL::IApplicationStyling::Fields() )
    {
      const QString Name = QLatin1String( rField.Name );
      Values.emplace( TokenOf( Name ), TextOf( i_rStyling.Value( Name ) ) );
    }
    return ReplaceTokens( i_rText, Values );
  }

  QString EvaluateArithmetic( const QString& i_rText )
  {
    static const QRegularExpression s_Arithmetic( QStringLiteral( R"(:(.+[+\-\/*]+.+);\s*$)" ),
                                                  QRegularExpression::MultilineOption );
    QJSEngine Engine;
    QString Result;
    Result.reserve( i_rText.size() );
    int Copied = 0;
    auto Matches = s_Arithmetic.globalMatch( i_rText );
    while( Matches.hasNext() )
    {
      const auto Match = Matches.next();
      const QString Expression = Match.captured( 1 );
      const QJSValue Value = Engine.evaluate( Expression );
      if( Value.isError() || !Value.isNumber() || !std::isfinite( Value.toNumber() ) )
        continue;
      // Keep the blank after the colon, so the line reads as it was written.
      int Blank = 0;
      while( Blank < Expression.size() && Expression.at( Blank ).isSpace() )
        ++Blank;
      Result += i_rText.midRef( Copied, Match.capturedStart( 1 ) - Copied );
      Result += Expression.left( Blank );
      Result += QString::number( Value.toNumber(), 'g', 10 );
      Copied = Match.capturedEnd( 1 );
    }
    Result += i_rText.midRef( Copied );
    return Result;
  }
} // namespace Theme
