#include "utils/UtilsFileSystem/MemoryMappedFile.h"

#include "services/Log.h"
#include "utils/UtilsFileSystem/FileIO.h"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <csetjmp>
#include <csignal>
#include <cstring>
#include <limits>
#include <mutex>

namespace UtilsFileSystem
{
  namespace
  {
    constexpr const char* s_Category = "System";

    // A file that another program truncates under a mapping turns the next touch of a lost page
    // into SIGBUS. The size check before each read catches what happened before the read; this
    // guard catches a truncation during the copy itself, and turns it into a failed read.
    // Volatile and fenced: the copy does not read the pointer, so the compiler would otherwise drop
    // the store before it as dead.
    thread_local sigjmp_buf* volatile t_pRecovery = nullptr;
    struct sigaction s_PreviousBusHandler;

    void OnBusError( int, siginfo_t*, void* )
    {
      if( t_pRecovery != nullptr )
        siglongjmp( *t_pRecovery, 1 );
      // Not one of our copies: the fault repeats on return and goes to the handler there was.
      ::sigaction( SIGBUS, &s_PreviousBusHandler, nullptr );
    }

    void InstallBusErrorGuard()
    {
      static std::once_flag s_Installed;
      std::call_once( s_Installed,
                      []
                      {
                        struct sigaction Action;
                        std::memset( &Action, 0, sizeof( Action ) );
                        Action.sa_sigaction = &OnBusError;
                        // SIGBUS stays unblocked in the handler, so jumping out needs no saved mask.
                        Action.sa_flags = SA_SIGINFO | SA_NODEFER;
                        sigemptyset( &Action.sa_mask );
                        ::sigaction( SIGBUS, &Action, &s_PreviousBusHandler );
                      } );
    }

    bool GuardedCopy( void* o_pTarget, const void* i_pSource, std::size_t i_Size )
    {
      sigjmp_buf Recovery;
      if( sigsetjmp( Recovery, 0 ) != 0 )
      {
        t_pRecovery = nullptr;
        return false;
      }
      t_pRecovery = &Recovery;
      std::atomic_signal_fence( std::memory_order_seq_cst );
      std::memcpy( o_pTarget, i_pSource, i_Size );
      std::atomic_signal_fence( std::memory_order_seq_cst );
      t_pRecovery = nullptr;
      return true;
    }

    std::uint64_t SystemPageSize()
    {
      const long Size = ::sysconf( _SC_PAGESIZE );
      return Size > 0 ? static_cast< std::uint64_t >( Size ) : 4096u;
    }
  } // namespace

  VMemoryMappedFileBase::VMemoryMappedFileBase( bool i_bReadWrite ) : m_bReadWrite( i_bReadWrite ) {}

  VMemoryMappedFileBase::~VMemoryMappedFileBase()
  {
    CloseFile();
  }

  ZOL::ResultCode VMemoryMappedFileBase::OpenFile( const std::string& i_rPath )
  {
    CloseFile();
    int Error = 0;
    m_File = ::open( i_rPath.c_str(), ( m_bReadWrite ? O_RDWR : O_RDONLY ) | O_CLOEXEC );
    struct stat Status;
    if( m_File < 0 )
      Error = errno;
    else if( ::fstat( m_File, &Status ) != 0 )
      Error = errno;
    else if( !S_ISREG( Status.st_mode ) )
      Error = ENODEV; // a pipe or a device has no pages to map
    else if( Status.st_size <= 0 )
      Error = EINVAL; // as mapping zero bytes answers
    if( Error == 0 )
    {
      m_FileSize = static_cast< std::uint64_t >( Status.st_size );
      return ZOL::Result_Ok;
    }
    CloseFile();
    LUMEK_LOG( s_Category, ZOL::LogFailure, "Std error code: %1%", Error );
    return Error == ENOENT ? ZOL::Result_FileNotFound : ZOL::Result_FileIOFailure;
  }

  void VMemoryMappedFileBase::CloseFile()
  {
    if( m_File >= 0 )
      ::close( m_File );
    m_File = -1;
    m_FileSize = 0;
  }

  bool VMemoryMappedFileBase::GetCurrentSize( std::uint64_t& o_rSize ) const
  {
    struct stat Status;
    if( m_File < 0 || ::fstat( m_File, &Status ) != 0 || Status.st_size < 0 )
      return false;
    o_rSize = static_cast< std::uint64_t >( Status.st_size );
    return true;
  }

  VMemoryMappedInputFile::VMemoryMappedInputFile( std::uint64_t i_PageSize, std::size_t i_MaxPages )
      : VMemoryMappedFileBase( false ), m_MaxPages( std::max< std::size_t >( i_MaxPages, 1 ) )
  {
    const std::uint64_t SystemPage = SystemPageSize();
    const std::uint64_t Pages = std::max< std::uint64_t >( ( i_PageSize + SystemPage - 1 ) / SystemPage, 1 );
    m_PageSize = Pages * SystemPage;
    m_Windows.reserve( m_MaxPages );
  }

  VMemoryMappedInputFile::~VMemoryMappedInputFile()
  {
    Close();
  }

  ZOL::ResultCode VMemoryMappedInputFile::Open( const std::string& i_rPath )
  {
    Close();
    m_SwapCount = 0;
    InstallBusErrorGuard();
    return OpenFile( i_rPath );
  }

  void VMemoryMappedInputFile::Close()
  {
    if( !IsOpen() )
      return;
    UnmapAll();
    LUMEK_LOG( s_Category, ZOL::LogDetail, "VMemoryMappedInputStream stats: %1% swaps, %2% pages in file.", m_SwapCount,
               GetFileSize() / m_PageSize + 1 );
    CloseFile();
  }

  void VMemoryMappedInputFile::UnmapAll()
  {
    for( const VWindow& rWindow : m_Windows )
      ::munmap( const_cast< std::uint8_t* >( rWindow.pData ), rWindow.Length );
    m_Windows.clear();
  }

  const VMemoryMappedInputFile::VWindow* VMemoryMappedInputFile::MakeAvailable( std::uint64_t i_Offset )
  {
    const auto Holds = [i_Offset]( const VWindow& i_rWindow )
    { return i_Offset >= i_rWindow.Begin && i_Offset < i_rWindow.End; };
    if( !m_Windows.empty() && Holds( m_Windows.front() ) )
      return &m_Windows.front();
    const auto It = std::find_if( m_Windows.begin(), m_Windows.end(), Holds );
    if( It != m_Windows.end() )
    {
      std::rotate( m_Windows.begin(), It, It + 1 );
      return &m_Windows.front();
    }

    VWindow Window;
    Window.Begin = i_Offset / m_PageSize * m_PageSize;
    const std::uint64_t Length = std::min( m_PageSize, GetFileSize() - Window.Begin );
    if( Length > std::numeric_limits< std::size_t >::max() )
      return nullptr;
    Window.Length = static_cast< std::size_t >( Length );
    Window.End = Window.Begin + Length;
    if( m_Windows.size() == m_MaxPages )
    {
      ::munmap( const_cast< std::uint8_t* >( m_Windows.back().pData ), m_Windows.back().Length );
      m_Windows.pop_back();
    }
    void* pData = ::mmap( nullptr, Window.Length, PROT_READ, MAP_SHARED, m_File, static_cast< off_t >( Window.Begin ) );
    if( pData == MAP_FAILED )
    {
      LUMEK_LOG( s_Category, ZOL::LogFailure, "Std error code: %1%", errno );
      return nullptr;
    }
    Window.pData = static_cast< const std::uint8_t* >( pData );
    m_Windows.insert( m_Windows.begin(), Window );
    ++m_SwapCount;
    return &m_Windows.front();
  }

  bool VMemoryMappedInputFile::Read( std::uint64_t i_Offset, void* o_pBuffer, std::uint64_t i_Size )
  {
    if( !IsOpen() || i_Offset > GetFileSize() || i_Size > GetFileSize() - i_Offset )
      return false;
    if( i_Size == 0 )
      return true;
    std::uint64_t CurrentSize = 0;
    if( !GetCurrentSize( CurrentSize ) || i_Offset + i_Size > CurrentSize )
      return false;
    std::uint8_t* pTarget = static_cast< std::uint8_t* >( o_pBuffer );
    std::uint64_t Offset = i_Offset;
    const std::uint64_t End = i_Offset + i_Size;
    while( Offset < End )
    {
      const VWindow* pWindow = MakeAvailable( Offset );
      if( pWindow == nullptr )
        return false;
      const std::uint64_t Count = std::min( End, pWindow->End ) - Offset;
      if( !GuardedCopy( pTarget, pWindow->pData + ( Offset - pWindow->Begin ), static_cast< std::size_t >( Count ) ) )
        return false;
      pTarget += Count;
      Offset += Count;
    }
    return true;
  }

  VMemoryMappedInputStream::VMemoryMappedInputStream( std::uint64_t i_PageSize, std::size_t i_MaxPages )
      : m_File( i_PageSize, i_MaxPages )
  {
  }

  ZOL::ResultCode VMemoryMappedInputStream::Open( const std::string& i_rPath )
  {
    m_Position = 0;
    m_bAtEnd = false;
    return m_File.Open( i_rPath );
  }

  void VMemoryMappedInputStream::Close()
  {
    m_File.Close();
    m_Position = 0;
    m_bAtEnd = false;
  }

  bool VMemoryMappedInputStream::Read( void* o_pBuffer, std::uint64_t i_Size )
  {
    if( !m_File.IsOpen() )
      return false;
    if( i_Size == 0 )
      return true;
    const std::uint64_t Size = m_File.GetFileSize();
    if( m_Position > Size || i_Size > Size - m_Position )
    {
      m_bAtEnd = true;
      return false;
    }
    if( !m_File.Read( m_Position, o_pBuffer, i_Size ) )
      return false;
    m_Position += i_Size;
    return true;
  }

  bool VMemoryMappedInputStream::GetSize( std::uint64_t& o_rSize )
  {
    if( !m_File.IsOpen() )
      return false;
    o_rSize = m_File.GetFileSize();
    return true;
  }

  bool VMemoryMappedInputStream::GetPosition( std::uint64_t& o_rPosition )
  {
    if( !m_File.IsOpen() )
      return false;
    o_rPosition = m_Position;
    return true;
  }

  bool VMemoryMappedInputStream::Seek( std::int64_t i_Position )
  {
    if( !m_File.IsOpen() || i_Position < 0 )
      return false;
    m_Position = static_cast< std::uint64_t >( i_Position );
    if( m_Position <= m_File.GetFileSize() )
      m_bAtEnd = false;
    return true;
  }

  ZOL::ResultCode OpenMemoryMappedInputStream( const std::string& i_rPath,
                                               std::shared_ptr< ZOL::IInputStreamSeekable >& o_rpStream )
  {
    o_rpStream.reset();
    auto pMapped = std::make_shared< VMemoryMappedInputStreamVirtual >();
    const ZOL::ResultCode Result = pMapped->Get().Open( i_rPath );
    if( ZOL::Succeeded( Result ) )
    {
      o_rpStream = pMapped;
      return Result;
    }
    if( Result == ZOL::Result_FileNotFound )
      return Result;
    LUMEK_LOG( s_Category, ZOL::LogWarning,
               "Failed to open memory mapped input file stream %1% (%2%), falling back to a standard input file "
               "stream.",
               i_rPath, ZOL::GetResultText( Result ) );
    auto pPlain = std::make_shared< VFileInputStreamVirtual >();
    const ZOL::ResultCode PlainResult = OpenInputStream( i_rPath, pPlain->Get() );
    if( ZOL::Succeeded( PlainResult ) )
      o_rpStream = pPlain;
    return PlainResult;
  }
} // namespace UtilsFileSystem
