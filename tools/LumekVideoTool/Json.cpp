#include "tools/LumekVideoTool/Json.h"

#include <QJsonDocument>

#include <unistd.h>

#include <cmath>
#include <iostream>
#include <limits>

namespace po = boost::program_options;

namespace LumekVideoTool
{
  void AddJsonLayoutOptions( po::options_description& io_rOptions )
  {
    io_rOptions.add_options()( "compact", po::bool_switch() )( "pretty", po::bool_switch() );
  }

  std::optional< EJsonLayout > JsonLayoutFrom( const po::variables_map& i_rVariables, std::ostream& o_rErr )
  {
    const bool bCompact = i_rVariables.count( "compact" ) && i_rVariables["compact"].as< bool >();
    const bool bPretty = i_rVariables.count( "pretty" ) && i_rVariables["pretty"].as< bool >();
    if( bCompact && bPretty )
    {
      o_rErr << "lumekvideotool: choose one of --compact and --pretty" << std::endl;
      return std::nullopt;
    }
    if( bCompact )
      return EJsonLayout::Compact;
    return bPretty ? EJsonLayout::Indented : EJsonLayout::Automatic;
  }

  void WriteJson( std::ostream& o_rOut, const QJsonObject& i_rReport, EJsonLayout i_Layout )
  {
    // Only std::cout is standard output; any other stream is a file or a test's buffer.
    const bool bIndented = i_Layout == EJsonLayout::Indented ||
                           ( i_Layout == EJsonLayout::Automatic && &o_rOut == &std::cout && isatty( STDOUT_FILENO ) );
    const QByteArray Text =
        QJsonDocument( i_rReport ).toJson( bIndented ? QJsonDocument::Indented : QJsonDocument::Compact );
    o_rOut.write( Text.constData(), Text.size() );
    // The indented form ends in a newline already.
    if( !Text.endsWith( '\n' ) )
      o_rOut << '\n';
    o_rOut.flush();
  }

  QJsonValue JsonText( const std::string& i_rText )
  {
    return QString::fromUtf8( i_rText.data(), static_cast< int >( i_rText.size() ) );
  }

  QJsonValue JsonCount( std::uint64_t i_Count )
  {
    if( i_Count <= static_cast< std::uint64_t >( std::numeric_limits< qint64 >::max() ) )
      return static_cast< qint64 >( i_Count );
    return static_cast< double >( i_Count );
  }

  QJsonValue JsonNumber( double i_Value )
  {
    return std::isfinite( i_Value ) ? QJsonValue( i_Value ) : QJsonValue();
  }
} // namespace LumekVideoTool
