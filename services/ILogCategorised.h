#pragma once

#include <functional>
#include <string>

namespace ZOL
{
  // Severity of a log message: lower is more serious.
  enum ELogLevel : int
  {
    LogFailure = 2,
    LogWarning = 3,
    LogInfo = 4,
    LogInfoDetail = 5,
    LogDetail = 6,
  };

  // One category of the process-wide log, by module name ("MovIO", "VideoEncoding", ...).
  // A call site asks for its category once and keeps the handle.
  class ILogCategory
  {
  public:
    virtual ~ILogCategory() = default;
    virtual const std::string& GetName() const = 0;
    // The highest level that gets through; a message above it is neither formatted nor written.
    virtual int GetLevel() const = 0;
    bool Enabled( int i_Level ) const { return i_Level <= GetLevel(); }
  };

  struct ILogRecord
  {
    std::string Message;
    std::string Category;
    int Level = 0;
    std::string SourceFile;
    int Line = 0;
  };

  using LogSink = std::function< void( const ILogRecord& ) >;

  class ILogCategorised
  {
  public:
    virtual ~ILogCategorised() = default;

    // The category of a module; the reference stays valid for the life of the process.
    virtual const ILogCategory& GetCategory( const std::string& i_rName ) = 0;

    virtual void Log( const std::string& i_rMessage, const ILogCategory& i_rCategory, int i_Level,
                      const char* i_pSourceFile, int i_Line ) = 0;

    // Messages at or below this level are written to standard error.
    virtual void SetStandardErrorLevel( int i_Level ) = 0;
    virtual int GetStandardErrorLevel() const = 0;

    // A sink sees every message at or below its level. Returns a handle for RemoveSink.
    virtual int AddSink( LogSink i_Sink, int i_Level ) = 0;
    virtual void RemoveSink( int i_Handle ) = 0;
  };

  ILogCategorised& GlobalLog();
} // namespace ZOL
