#pragma once

// What the log receives while a test runs, for the tests that check the log line a failure
// gives. Standard error stays quiet meanwhile, so that expected failures do not fill the output.

#include "services/Log.h"

#include <algorithm>
#include <string>
#include <vector>

namespace LumekTest
{
  class VLogCapture
  {
  public:
    // An empty category keeps every category's records.
    explicit VLogCapture( std::string i_Category = "", int i_Level = ZOL::LogDetail )
        : m_Category( std::move( i_Category ) ), m_StandardErrorLevel( ZOL::GlobalLog().GetStandardErrorLevel() )
    {
      ZOL::GlobalLog().SetStandardErrorLevel( 0 );
      m_Sink = ZOL::GlobalLog().AddSink(
          [this]( const ZOL::ILogRecord& i_rRecord )
          {
            if( m_Category.empty() || i_rRecord.Category == m_Category )
            {
              Records.push_back( i_rRecord );
              Messages.push_back( i_rRecord.Message );
            }
          },
          i_Level );
    }
    ~VLogCapture()
    {
      ZOL::GlobalLog().RemoveSink( m_Sink );
      ZOL::GlobalLog().SetStandardErrorLevel( m_StandardErrorLevel );
    }
    VLogCapture( const VLogCapture& ) = delete;
    VLogCapture& operator=( const VLogCapture& ) = delete;

    bool Has( const std::string& i_rMessage ) const
    {
      return std::find( Messages.begin(), Messages.end(), i_rMessage ) != Messages.end();
    }
    bool Contains( const std::string& i_rText ) const
    {
      return std::any_of( Messages.begin(), Messages.end(),
                          [&]( const std::string& rMessage )
                          { return rMessage.find( i_rText ) != std::string::npos; } );
    }

    // Each record as its level and message: "2 Unsupported video payload format 'Unspecified'."
    std::vector< std::string > Lines() const
    {
      std::vector< std::string > Result;
      for( const ZOL::ILogRecord& rRecord : Records )
        Result.push_back( std::to_string( rRecord.Level ) + " " + rRecord.Message );
      return Result;
    }

    std::vector< ZOL::ILogRecord > Records;
    std::vector< std::string > Messages;

  private:
    std::string m_Category;
    int m_StandardErrorLevel;
    int m_Sink = 0;
  };
} // namespace LumekTest
