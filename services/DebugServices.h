#pragma once

#include "services/IApplicationVersion.h"
#include "services/ILogCategorised.h"

namespace DebugServices
{
  // Remembers the release record for the life of the process.
  bool SetApplicationVersion( const ZOL::IApplicationVersion* i_pVersion );
  const ZOL::IApplicationVersion* ApplicationVersion();

  // Reports a failed assertion to the log and standard error; the process goes on.
  void CallAssertFailHandler( const char* i_pExpression, const char* i_pFile, int i_Line );

  enum class CompanyID : unsigned int
  {
    Lumek = 1,
  };

  // A crash reporter. The viewer's own start-up constructs none; it exists for tools that want one.
  class VCrashHandler
  {
  public:
    explicit VCrashHandler( CompanyID i_Company = CompanyID::Lumek, unsigned int i_Flags = 8191 );
    CompanyID GetCompany() const { return m_Company; }
    unsigned int GetFlags() const { return m_Flags; }

  private:
    CompanyID m_Company;
    unsigned int m_Flags;
  };

  class VCrashHandlerForThread
  {
  public:
    explicit VCrashHandlerForThread( const VCrashHandler& i_rHandler ) : m_rHandler( i_rHandler ) {}
    const VCrashHandler& GetHandler() const { return m_rHandler; }

  private:
    const VCrashHandler& m_rHandler;
  };
} // namespace DebugServices

#define LUMEK_ASSERT( EXPRESSION )                                                                                     \
  ( ( EXPRESSION ) ? true : ( DebugServices::CallAssertFailHandler( #EXPRESSION, __FILE__, __LINE__ ), false ) )
