#include "services/DebugServices.h"

#include "services/Log.h"

#include <atomic>

namespace
{
  std::atomic< const ZOL::IApplicationVersion* > s_pApplicationVersion{ nullptr };
}

namespace DebugServices
{
  bool SetApplicationVersion( const ZOL::IApplicationVersion* i_pVersion )
  {
    s_pApplicationVersion = i_pVersion;
    return i_pVersion != nullptr;
  }

  const ZOL::IApplicationVersion* ApplicationVersion()
  {
    return s_pApplicationVersion;
  }

  void CallAssertFailHandler( const char* i_pExpression, const char* i_pFile, int i_Line )
  {
    LUMEK_LOG( "System", ZOL::LogFailure, "Assertion failed: %s (%s:%d)", i_pExpression, i_pFile, i_Line );
  }

  VCrashHandler::VCrashHandler( CompanyID i_Company, unsigned int i_Flags ) : m_Company( i_Company ), m_Flags( i_Flags )
  {
  }
} // namespace DebugServices
