#pragma once

// The tool's JSON reports are built as Qt JSON objects and written by QJsonDocument. Like ffprobe
// and jq, a report is indented for a person at a terminal and compact for a pipe or a file.

#include <QJsonArray>
#include <QJsonObject>
#include <QJsonValue>

#include <boost/program_options.hpp>

#include <cstdint>
#include <optional>
#include <ostream>
#include <string>

namespace LumekVideoTool
{
  enum class EJsonLayout
  {
    Automatic, // indented when standard output is a terminal
    Compact,
    Indented,
  };

  // Adds "--compact" and "--pretty" to a command's options.
  void AddJsonLayoutOptions( boost::program_options::options_description& io_rOptions );

  // The layout the options chose; nothing (and the reason on o_rErr) when both were given.
  std::optional< EJsonLayout > JsonLayoutFrom( const boost::program_options::variables_map& i_rVariables,
                                               std::ostream& o_rErr );

  // Writes the report and a newline.
  void WriteJson( std::ostream& o_rOut, const QJsonObject& i_rReport, EJsonLayout i_Layout );

  // Texts from a file may hold any bytes: a broken UTF-8 sequence becomes U+FFFD, so the report
  // stays valid JSON.
  QJsonValue JsonText( const std::string& i_rText );

  // Qt writes every number through a double: counts are exact up to 2^53.
  QJsonValue JsonCount( std::uint64_t i_Count );

  // JSON has no infinity or NaN; they are written as null.
  QJsonValue JsonNumber( double i_Value );
} // namespace LumekVideoTool
