#pragma once

// The one way the system writes to its category log:
//
//   LUMEK_LOG( "MovIO", ZOL::LogFailure, "Bad atom size %d at %d", size, offset );
//
// The category handle is looked up once per call site. The message is formatted with
// boost::format only when the category's level lets it through; a format that throws is
// logged as "Cannot Format Log Message" with the raw text.

#include "services/ILogCategorised.h"

#include <boost/format.hpp>

#include <string>

namespace ZOL
{
  namespace Detail
  {
    inline void FeedFormat( boost::format& ) {}

    template < typename T, typename... Rest >
    void FeedFormat( boost::format& io_rFormat, const T& i_rValue, const Rest&... i_rRest )
    {
      io_rFormat % i_rValue;
      FeedFormat( io_rFormat, i_rRest... );
    }
  } // namespace Detail

  std::string CannotFormatMessage( const char* i_pFormat );

  template < typename... Args >
  void LogFormatted( const ILogCategory& i_rCategory, int i_Level, const char* i_pFile, int i_Line,
                     const char* i_pFormat, const Args&... i_rArgs )
  {
    std::string Message;
    int Level = i_Level;
    try
    {
      boost::format Format( i_pFormat );
      Detail::FeedFormat( Format, i_rArgs... );
      Message = Format.str();
    }
    catch( ... )
    {
      Message = CannotFormatMessage( i_pFormat );
      Level = LogFailure;
    }
    GlobalLog().Log( Message, i_rCategory, Level, i_pFile, i_Line );
  }
} // namespace ZOL

#define LUMEK_LOG( CATEGORY, LEVEL, ... )                                                                              \
  do                                                                                                                   \
  {                                                                                                                    \
    static const ZOL::ILogCategory& s_rLogCategory = ZOL::GlobalLog().GetCategory( CATEGORY );                         \
    if( s_rLogCategory.Enabled( LEVEL ) )                                                                              \
      ZOL::LogFormatted( s_rLogCategory, LEVEL, __FILE__, __LINE__, __VA_ARGS__ );                                     \
  } while( false )
