#include "versioncheck/VersionReply/SystemText.h"

#include <algorithm>
#include <fstream>
#include <sstream>

namespace VersionCheck
{
  namespace
  {
    // An os-release file is a few hundred bytes; more than this is not one.
    constexpr std::streamsize MaximumOsReleaseSize = 64 * 1024;

    // Values may be quoted with either quote and use backslash escapes, as in a shell.
    std::string Unquote( const std::string& i_rValue )
    {
      if( i_rValue.empty() || ( i_rValue.front() != '"' && i_rValue.front() != '\'' ) )
        return i_rValue;
      const char Quote = i_rValue.front();
      std::string Result;
      for( std::size_t Index = 1; Index < i_rValue.size() && i_rValue[Index] != Quote; ++Index )
      {
        if( i_rValue[Index] == '\\' && Quote == '"' && Index + 1 < i_rValue.size() )
          ++Index;
        Result += i_rValue[Index];
      }
      return Result;
    }

    std::string ReadValue( const std::string& i_rOsRelease, const std::string& i_rKey )
    {
      std::istringstream Lines( i_rOsRelease );
      std::string Line;
      const std::string Prefix = i_rKey + "=";
      while( std::getline( Lines, Line ) )
      {
        if( !Line.empty() && Line.back() == '\r' )
          Line.pop_back();
        if( Line.compare( 0, Prefix.size(), Prefix ) == 0 )
          return Unquote( Line.substr( Prefix.size() ) );
      }
      return {};
    }

    std::string ReadFile( const char* i_pPath )
    {
      std::ifstream File( i_pPath, std::ios::binary );
      if( !File )
        return {};
      std::string Text( static_cast< std::size_t >( MaximumOsReleaseSize ), '\0' );
      File.read( &Text[0], MaximumOsReleaseSize );
      Text.resize( static_cast< std::size_t >( File.gcount() ) );
      return Text;
    }
  } // namespace

  std::string OperatingSystemName( const std::string& i_rOsRelease )
  {
    for( const char* pKey : { "PRETTY_NAME", "NAME" } )
    {
      const std::string Value = ReadValue( i_rOsRelease, pKey );
      if( !Value.empty() )
        return Value;
    }
    return "Linux";
  }

  std::string SystemTextFromName( const std::string& i_rName )
  {
    std::string Text = i_rName + " 64Bit";
    std::replace( Text.begin(), Text.end(), ' ', '+' );
    return Text;
  }

  std::string SystemText()
  {
    std::string OsRelease = ReadFile( "/etc/os-release" );
    if( OsRelease.empty() )
      OsRelease = ReadFile( "/usr/lib/os-release" );
    return SystemTextFromName( OperatingSystemName( OsRelease ) );
  }
} // namespace VersionCheck
