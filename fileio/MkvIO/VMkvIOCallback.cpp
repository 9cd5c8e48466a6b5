#include "fileio/MkvIO/VMkvIOCallback.h"

#include "utils/UtilsFileSystem/LongPath.h"

#include <algorithm>
#include <cassert>
#include <cerrno>
#include <fcntl.h>
#include <limits>
#include <sys/types.h>
#include <unistd.h>

namespace MkvIO
{
  VMkvIOCallback::~VMkvIOCallback()
  {
    close();
  }

  bool VMkvIOCallback::Open( const std::string& i_rFileName, bool i_bWrite )
  {
    close();
#ifdef _WIN32
    const std::string Path = UtilsFileSystem::MakeLongPath( i_rFileName );
#else
    // Linux takes the path as given: the long form only matters where names are limited.
    const std::string& Path = i_rFileName;
#endif
    const int Flags = i_bWrite ? ( O_RDWR | O_CREAT | O_TRUNC ) : O_RDONLY;
    m_FileDescriptor = ::open( Path.c_str(), Flags | O_CLOEXEC, 0644 );
    m_bWritesGood = true;
    return m_FileDescriptor >= 0;
  }

  std::uint32_t VMkvIOCallback::read( void* o_pBuffer, size_t i_Size )
  {
    if( m_FileDescriptor < 0 || i_Size == 0 )
      return 0;
    // The result is 32 bits wide: larger requests are cut, and libebml sees a short read.
    size_t Remaining = std::min< size_t >( i_Size, std::numeric_limits< std::uint32_t >::max() );
    auto* pOut = static_cast< char* >( o_pBuffer );
    size_t Done = 0;
    while( Remaining != 0 )
    {
      const ssize_t Count = ::read( m_FileDescriptor, pOut + Done, Remaining );
      if( Count < 0 && errno == EINTR )
        continue;
      if( Count <= 0 )
        break;
      Done += static_cast< size_t >( Count );
      Remaining -= static_cast< size_t >( Count );
    }
    return static_cast< std::uint32_t >( Done );
  }

  void VMkvIOCallback::setFilePointer( std::int64_t i_Offset, libebml::seek_mode i_Mode )
  {
    int Whence = SEEK_SET;
    switch( i_Mode )
    {
    case libebml::seek_beginning:
      Whence = SEEK_SET;
      break;
    case libebml::seek_current:
      Whence = SEEK_CUR;
      break;
    case libebml::seek_end:
      Whence = SEEK_END;
      break;
    default:
      assert( !"Unknown seek" );
      return;
    }
    if( m_FileDescriptor >= 0 )
      ::lseek( m_FileDescriptor, static_cast< off_t >( i_Offset ), Whence );
  }

  size_t VMkvIOCallback::write( const void* i_pBuffer, size_t i_Size )
  {
    if( m_FileDescriptor < 0 )
    {
      m_bWritesGood = m_bWritesGood && i_Size == 0;
      return 0;
    }
    const auto* pIn = static_cast< const char* >( i_pBuffer );
    size_t Done = 0;
    while( Done < i_Size )
    {
      const ssize_t Count = ::write( m_FileDescriptor, pIn + Done, i_Size - Done );
      if( Count < 0 && errno == EINTR )
        continue;
      if( Count <= 0 )
        break;
      Done += static_cast< size_t >( Count );
    }
    m_bWritesGood = m_bWritesGood && Done == i_Size;
    return Done;
  }

  std::uint64_t VMkvIOCallback::getFilePointer()
  {
    if( m_FileDescriptor < 0 )
      return 0;
    const off_t Position = ::lseek( m_FileDescriptor, 0, SEEK_CUR );
    return Position < 0 ? 0 : static_cast< std::uint64_t >( Position );
  }

  void VMkvIOCallback::close()
  {
    if( m_FileDescriptor < 0 )
      return;
    ::close( m_FileDescriptor );
    m_FileDescriptor = -1;
  }
} // namespace MkvIO
