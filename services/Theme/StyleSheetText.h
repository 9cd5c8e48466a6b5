#pragma once

// The two passes that turn the style sheet resource into the sheet Qt is given.

#include <QString>

namespace ZOL
{
  class IApplicationStyling;
}

namespace Theme
{
  // "[" + the name with its first letter in lower case + "]": "ItemHeight" gives "[itemHeight]".
  QString TokenOf( const QString& i_rName );

  // First pass: every token that names a value of i_rStyling, case-sensitively, becomes that value:
  // a colour as QColor::name(), a whole number in decimal, a text as it is. Any other bracketed
  // word stays as it stands.
  QString SubstituteTokens( const QString& i_rText, const ZOL::IApplicationStyling& i_rStyling );

  // Second pass: a property value that holds arithmetic (": 20 * 2;" at the end of a line) is
  // evaluated as a script expression. A finite numeric result replaces the expression; anything
  // else, a syntax error included, leaves the line as it stood. Keep one declaration per line.
  QString EvaluateArithmetic( const QString& i_rText );
} // namespace Theme
