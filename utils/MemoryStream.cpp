#include "utils/MemoryStream.h"

#include <cstring>
#include <limits>

namespace UtilsIO
{
  VMemoryInputStream::VMemoryInputStream( const void* i_pData, std::uint64_t i_Size )
      : m_pData( static_cast< const std::uint8_t* >( i_pData ) ), m_Size( i_Size )
  {
  }

  bool VMemoryInputStream::Read( void* o_pBuffer, std::uint64_t i_Size )
  {
    if( i_Size == 0 )
      return true;
    if( m_Position > m_Size || i_Size > m_Size - m_Position )
    {
      const std::uint64_t Available = m_Position < m_Size ? m_Size - m_Position : 0;
      if( Available != 0 )
        std::memcpy( o_pBuffer, m_pData + m_Position, static_cast< std::size_t >( Available ) );
      m_Position = m_Size;
      m_bAtEnd = true;
      return false;
    }
    std::memcpy( o_pBuffer, m_pData + m_Position, static_cast< std::size_t >( i_Size ) );
    m_Position += i_Size;
    return true;
  }

  bool VMemoryInputStream::GetSize( std::uint64_t& o_rSize )
  {
    o_rSize = m_Size;
    return true;
  }

  bool VMemoryInputStream::GetPosition( std::uint64_t& o_rPosition )
  {
    o_rPosition = m_Position;
    return true;
  }

  bool VMemoryInputStream::Seek( std::int64_t i_Position )
  {
    if( i_Position < 0 )
      return false;
    m_Position = static_cast< std::uint64_t >( i_Position );
    m_bAtEnd = false;
    return true;
  }

  bool VMemoryStream::Read( void* o_pBuffer, std::uint64_t i_Size )
  {
    if( i_Size == 0 )
      return true;
    const std::uint64_t Size = m_Data.size();
    if( m_Position > Size || i_Size > Size - m_Position )
    {
      m_Position = Size;
      m_bAtEnd = true;
      return false;
    }
    std::memcpy( o_pBuffer, m_Data.data() + m_Position, static_cast< std::size_t >( i_Size ) );
    m_Position += i_Size;
    return true;
  }

  bool VMemoryStream::Write( const void* i_pBuffer, std::uint64_t i_Size )
  {
    if( i_Size == 0 )
      return true;
    if( i_Size > std::numeric_limits< std::size_t >::max() - m_Position )
      return false;
    const std::uint64_t End = m_Position + i_Size;
    if( End > m_Data.size() )
      m_Data.resize( static_cast< std::size_t >( End ) );
    std::memcpy( m_Data.data() + m_Position, i_pBuffer, static_cast< std::size_t >( i_Size ) );
    m_Position = End;
    return true;
  }

  bool VMemoryStream::GetSize( std::uint64_t& o_rSize )
  {
    o_rSize = m_Data.size();
    return true;
  }

  bool VMemoryStream::GetPosition( std::uint64_t& o_rPosition )
  {
    o_rPosition = m_Position;
    return true;
  }

  bool VMemoryStream::Seek( std::int64_t i_Position )
  {
    if( i_Position < 0 )
      return false;
    m_Position = static_cast< std::uint64_t >( i_Position );
    m_bAtEnd = false;
    return true;
  }
} // namespace UtilsIO
