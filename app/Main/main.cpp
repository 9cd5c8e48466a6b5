#include "app/CommandLine/CommandLine.h"
#include "app/Start/ApplicationStart.h"
#include "services/DebugServices.h"
#include "versioncheck/VersionReply/DefaultServer.h"

#include <iostream>

int main( int argc, char** argv )
{
  DebugServices::SetApplicationVersion( &LumekVideoViewer::ApplicationVersion() );

  LumekVideoViewer::VCommandLine CommandLine;
  const int Result =
      LumekVideoViewer::ParseCommandLine( argc, argv, VersionCheck::DefaultVersionServer, CommandLine, std::cerr );
  if( Result != 0 )
    return Result;
  return LumekVideoViewer::RunApplication( argc, argv, CommandLine );
}
