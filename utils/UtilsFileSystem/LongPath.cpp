#include "utils/UtilsFileSystem/LongPath.h"

namespace UtilsFileSystem
{
  namespace
  {
    template < typename Text > Text MakeLongPathOf( Text i_Path )
    {
      using Char = typename Text::value_type;
      const Char Slash = static_cast< Char >( '/' );
      const Char Backslash = static_cast< Char >( '\\' );
      for( Char& rChar : i_Path )
        if( rChar == Slash )
          rChar = Backslash;
      if( i_Path.size() < 2 )
        return i_Path;
      const bool bNetwork = i_Path[0] == Backslash && i_Path[1] == Backslash;
      const Char Letter = i_Path[0];
      const bool bLetter = ( Letter >= static_cast< Char >( 'A' ) && Letter <= static_cast< Char >( 'Z' ) ) ||
                           ( Letter >= static_cast< Char >( 'a' ) && Letter <= static_cast< Char >( 'z' ) );
      const bool bDrive =
          bLetter && i_Path.size() >= 3 && i_Path[1] == static_cast< Char >( ':' ) && i_Path[2] == Backslash;
      if( bNetwork )
      {
        if( i_Path.size() >= 3 && i_Path[2] == static_cast< Char >( '?' ) )
          return i_Path;
        const Char Prefix[] = { '\\', '\\', '?', '\\', 'U', 'N', 'C' };
        return Text( Prefix, Prefix + 7 ) + i_Path.substr( 1 );
      }
      if( bDrive )
      {
        const Char Prefix[] = { '\\', '\\', '?', '\\' };
        return Text( Prefix, Prefix + 4 ) + i_Path;
      }
      return i_Path;
    }
  } // namespace

  std::wstring MakeLongPath( const std::wstring& i_rPath )
  {
    return MakeLongPathOf( i_rPath );
  }
  std::string MakeLongPath( const std::string& i_rPath )
  {
    return MakeLongPathOf( i_rPath );
  }
} // namespace UtilsFileSystem
