#include "utils/UtilsIO/VLargeFile.h"

#include "utils/UtilsFileSystem/LongPath.h"

#include <sys/types.h>

namespace UtilsIO
{
  const char* OpenModeText( int i_Mode )
  {
    static constexpr const char* s_Modes[] = { "rb", "r+b", "w+b", "wb" };
    if( i_Mode < 0 || i_Mode >= static_cast< int >( sizeof( s_Modes ) / sizeof( s_Modes[0] ) ) )
      return "";
    return s_Modes[i_Mode];
  }

  VLargeFile::~VLargeFile()
  {
    Close();
  }

  bool VLargeFile::Open( const std::string& i_rPath, int i_Mode )
  {
    if( m_pFile != nullptr )
      return false;
    const char* pMode = OpenModeText( i_Mode );
    if( *pMode == 0 )
      return false;
    // Linux takes the path as given: the long form only matters where names are limited.
    m_pFile = std::fopen( i_rPath.c_str(), pMode );
    if( m_pFile == nullptr )
      return false;
    m_bGood = fseeko( m_pFile, 0, SEEK_END ) == 0;
    m_CachedSize = 0;
    GetPosition( m_CachedSize );
    Seek( 0 );
    return true;
  }

  bool VLargeFile::Close()
  {
    if( m_pFile == nullptr )
      return false;
    std::fclose( m_pFile );
    m_pFile = nullptr;
    m_bGood = true;
    return true;
  }

  bool VLargeFile::SeekToEnd()
  {
    m_bGood = m_pFile != nullptr && fseeko( m_pFile, 0, SEEK_END ) == 0;
    return m_bGood;
  }

  bool VLargeFile::Read( void* o_pBuffer, std::uint64_t i_Size )
  {
    // A failed stream stays failed until a Seek, so a reader that ignores one short read
    // cannot go on to misread what follows.
    if( !m_bGood || m_pFile == nullptr )
      return false;
    if( i_Size == 0 )
      return true;
    m_bGood = std::fread( o_pBuffer, 1, static_cast< std::size_t >( i_Size ), m_pFile ) == i_Size;
    return m_bGood;
  }

  bool VLargeFile::IsAtEnd()
  {
    return m_pFile != nullptr && std::feof( m_pFile ) != 0;
  }

  bool VLargeFile::Write( const void* i_pBuffer, std::uint64_t i_Size )
  {
    if( !m_bGood || m_pFile == nullptr )
      return false;
    if( i_Size == 0 )
      return true;
    m_bGood = std::fwrite( i_pBuffer, 1, static_cast< std::size_t >( i_Size ), m_pFile ) == i_Size;
    return m_bGood;
  }

  bool VLargeFile::GetSize( std::uint64_t& o_rSize )
  {
    // The file, not the cache: a file that is still being written grows.
    if( m_pFile == nullptr )
      return false;
    const off_t Position = ftello( m_pFile );
    if( Position < 0 || fseeko( m_pFile, 0, SEEK_END ) != 0 )
      return false;
    const off_t End = ftello( m_pFile );
    if( fseeko( m_pFile, Position, SEEK_SET ) != 0 || End < 0 )
      return false;
    o_rSize = static_cast< std::uint64_t >( End );
    return true;
  }

  bool VLargeFile::GetPosition( std::uint64_t& o_rPosition )
  {
    if( m_pFile == nullptr )
      return false;
    const off_t Position = ftello( m_pFile );
    if( Position < 0 )
      return false;
    o_rPosition = static_cast< std::uint64_t >( Position );
    return true;
  }

  bool VLargeFile::Seek( std::int64_t i_Position )
  {
    m_bGood =
        m_pFile != nullptr && i_Position >= 0 && fseeko( m_pFile, static_cast< off_t >( i_Position ), SEEK_SET ) == 0;
    return m_bGood;
  }

  bool VLargeFile::Flush()
  {
    return m_pFile != nullptr && std::fflush( m_pFile ) == 0;
  }
} // namespace UtilsIO
