// Linux has no sharing violations and no restart manager: the holders of a file are the
// processes whose descriptor table has an entry for it, found under /proc. Any process can vanish
// between two reads there, and another user's entries are not readable; both are skipped.

#include "utils/UtilsFileSystem/FileIO.h"

#include <dirent.h>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <string>

namespace UtilsFileSystem
{
  namespace
  {
    constexpr std::size_t s_MaxProcesses = 10;

    struct VHolder
    {
      long ProcessId = 0;
      bool bWriting = false;
    };

    class VFolder
    {
    public:
      explicit VFolder( const std::string& i_rPath ) : m_pFolder( ::opendir( i_rPath.c_str() ) ) {}
      ~VFolder()
      {
        if( m_pFolder != nullptr )
          ::closedir( m_pFolder );
      }
      VFolder( const VFolder& ) = delete;
      VFolder& operator=( const VFolder& ) = delete;
      bool IsOpen() const { return m_pFolder != nullptr; }
      const char* Next()
      {
        const dirent* pEntry = ::readdir( m_pFolder );
        return pEntry != nullptr ? pEntry->d_name : nullptr;
      }

    private:
      DIR* m_pFolder;
    };

    bool ParseNumber( const char* i_pText, long& o_rNumber )
    {
      if( *i_pText < '0' || *i_pText > '9' )
        return false;
      char* pEnd = nullptr;
      o_rNumber = std::strtol( i_pText, &pEnd, 10 );
      return *pEnd == 0;
    }

    // The "flags:" line of a descriptor's fdinfo is the open mode, in octal.
    bool OpenForWriting( const std::string& i_rProcess, const char* i_pDescriptor )
    {
      std::ifstream Info( i_rProcess + "/fdinfo/" + i_pDescriptor );
      std::string Line;
      while( std::getline( Info, Line ) )
        if( Line.compare( 0, 6, "flags:" ) == 0 )
        {
          const long Flags = std::strtol( Line.c_str() + 6, nullptr, 8 );
          return ( Flags & O_ACCMODE ) == O_WRONLY || ( Flags & O_ACCMODE ) == O_RDWR;
        }
      return false;
    }

    // Whether the process holds the file, and how. False for a process whose descriptors cannot be
    // read, which includes one that has exited.
    bool FindInProcess( const std::string& i_rProcess, const struct stat& i_rFile, bool& o_rbHolds, bool& o_rbWriting )
    {
      o_rbHolds = false;
      o_rbWriting = false;
      VFolder Descriptors( i_rProcess + "/fd" );
      if( !Descriptors.IsOpen() )
        return false;
      while( const char* pName = Descriptors.Next() )
      {
        long Descriptor = 0;
        struct stat Target;
        // stat follows the link to the open file itself, so a renamed or deleted name still matches.
        if( !ParseNumber( pName, Descriptor ) || ::stat( ( i_rProcess + "/fd/" + pName ).c_str(), &Target ) != 0 )
          continue;
        if( Target.st_dev != i_rFile.st_dev || Target.st_ino != i_rFile.st_ino )
          continue;
        o_rbHolds = true;
        o_rbWriting = o_rbWriting || OpenForWriting( i_rProcess, pName );
      }
      return true;
    }

    // The executable's path, else the command name, else "unknown process".
    std::string ProcessName( long i_ProcessId )
    {
      const std::string Folder = "/proc/" + std::to_string( i_ProcessId );
      char Path[4096];
      const ssize_t Length = ::readlink( ( Folder + "/exe" ).c_str(), Path, sizeof( Path ) - 1 );
      if( Length > 0 )
        return std::string( Path, static_cast< std::size_t >( Length ) );
      std::ifstream Command( Folder + "/comm" );
      std::string Name;
      if( std::getline( Command, Name ) && !Name.empty() )
        return Name;
      return "unknown process";
    }

    bool FindHolders( const std::string& i_rPath, std::vector< VHolder >& o_rHolders )
    {
      o_rHolders.clear();
      struct stat File;
      if( ::stat( i_rPath.c_str(), &File ) != 0 )
        return false;
      VFolder Processes( "/proc" );
      if( !Processes.IsOpen() )
        return false;
      const long Self = static_cast< long >( ::getpid() );
      while( const char* pName = Processes.Next() )
      {
        VHolder Holder;
        bool bHolds = false;
        if( !ParseNumber( pName, Holder.ProcessId ) || Holder.ProcessId == Self ||
            !FindInProcess( std::string( "/proc/" ) + pName, File, bHolds, Holder.bWriting ) || !bHolds )
          continue;
        if( o_rHolders.size() == s_MaxProcesses )
        {
          o_rHolders.clear();
          return false;
        }
        o_rHolders.push_back( Holder );
      }
      return true;
    }
  } // namespace

  bool GetLockingProcesses( const std::string& i_rPath, std::vector< std::string >& o_rNames )
  {
    std::vector< VHolder > Holders;
    if( !FindHolders( i_rPath, Holders ) )
      return false;
    for( const VHolder& rHolder : Holders )
      o_rNames.push_back( ProcessName( rHolder.ProcessId ) );
    return true;
  }

  bool GetWritingProcesses( const std::string& i_rPath, std::vector< std::string >& o_rNames )
  {
    std::vector< VHolder > Holders;
    if( !FindHolders( i_rPath, Holders ) )
      return false;
    for( const VHolder& rHolder : Holders )
      if( rHolder.bWriting )
        o_rNames.push_back( ProcessName( rHolder.ProcessId ) + " (process " + std::to_string( rHolder.ProcessId ) +
                            ")" );
    return true;
  }
} // namespace UtilsFileSystem
