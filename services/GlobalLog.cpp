#include "services/Log.h"

#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <map>
#include <memory>
#include <mutex>
#include <vector>

namespace
{
  class VLog;

  class VLogCategory : public ZOL::ILogCategory
  {
  public:
    VLogCategory( std::string i_Name, const std::atomic< int >& i_rLevel )
        : m_Name( std::move( i_Name ) ), m_rLevel( i_rLevel )
    {
    }
    const std::string& GetName() const override { return m_Name; }
    int GetLevel() const override { return m_rLevel.load( std::memory_order_relaxed ); }

  private:
    std::string m_Name;
    const std::atomic< int >& m_rLevel;
  };

  int DefaultStandardErrorLevel()
  {
    const char* pText = std::getenv( "LUMEK_LOG_LEVEL" );
    if( pText == nullptr || *pText == 0 )
      return ZOL::LogWarning;
    char* pEnd = nullptr;
    const long Level = std::strtol( pText, &pEnd, 10 );
    return ( *pEnd == 0 ) ? static_cast< int >( Level ) : ZOL::LogWarning;
  }

  class VLog : public ZOL::ILogCategorised
  {
  public:
    VLog() : m_StandardErrorLevel( DefaultStandardErrorLevel() ) { UpdateLevel(); }

    const ZOL::ILogCategory& GetCategory( const std::string& i_rName ) override
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      auto& rpCategory = m_Categories[i_rName];
      if( !rpCategory )
        rpCategory = std::make_unique< VLogCategory >( i_rName, m_Level );
      return *rpCategory;
    }

    void Log( const std::string& i_rMessage, const ZOL::ILogCategory& i_rCategory, int i_Level,
              const char* i_pSourceFile, int i_Line ) override
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      if( i_Level <= m_StandardErrorLevel )
        std::fprintf( stderr, "[%s:%d] %s\n", i_rCategory.GetName().c_str(), i_Level, i_rMessage.c_str() );
      if( m_Sinks.empty() )
        return;
      ZOL::ILogRecord Record{ i_rMessage, i_rCategory.GetName(), i_Level, i_pSourceFile ? i_pSourceFile : "", i_Line };
      for( const auto& rSink : m_Sinks )
        if( i_Level <= rSink.Level )
          rSink.Sink( Record );
    }

    void SetStandardErrorLevel( int i_Level ) override
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      m_StandardErrorLevel = i_Level;
      UpdateLevel();
    }

    int GetStandardErrorLevel() const override
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      return m_StandardErrorLevel;
    }

    int AddSink( ZOL::LogSink i_Sink, int i_Level ) override
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      m_Sinks.push_back( { ++m_LastSinkHandle, i_Level, std::move( i_Sink ) } );
      UpdateLevel();
      return m_LastSinkHandle;
    }

    void RemoveSink( int i_Handle ) override
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      m_Sinks.erase( std::remove_if( m_Sinks.begin(), m_Sinks.end(),
                                     [i_Handle]( const VSink& rSink ) { return rSink.Handle == i_Handle; } ),
                     m_Sinks.end() );
      UpdateLevel();
    }

  private:
    struct VSink
    {
      int Handle;
      int Level;
      ZOL::LogSink Sink;
    };

    // Categories share one level: the highest that anything listens at.
    void UpdateLevel()
    {
      int Level = m_StandardErrorLevel;
      for( const auto& rSink : m_Sinks )
        Level = std::max( Level, rSink.Level );
      m_Level.store( Level, std::memory_order_relaxed );
    }

    mutable std::mutex m_Mutex;
    std::map< std::string, std::unique_ptr< VLogCategory > > m_Categories;
    std::vector< VSink > m_Sinks;
    int m_StandardErrorLevel;
    int m_LastSinkHandle = 0;
    std::atomic< int > m_Level{ ZOL::LogWarning };
  };
} // namespace

namespace ZOL
{
  ILogCategorised& GlobalLog()
  {
    static VLog s_Log;
    return s_Log;
  }

  std::string CannotFormatMessage( const char* i_pFormat )
  {
    try
    {
      return ( boost::format( "Cannot Format Log Message \"%s\"" ) % i_pFormat ).str();
    }
    catch( ... )
    {
      return "Cannot Format Log Message";
    }
  }
} // namespace ZOL
