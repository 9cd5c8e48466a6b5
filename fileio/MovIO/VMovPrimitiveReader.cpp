#include "fileio/MovIO/VMovPrimitiveReader.h"

#include "utils/UtilsIO/VLargeFile.h"

#include <cstring>
#include <limits>

namespace MovIO
{
  namespace
  {
    constexpr std::uint64_t MaxStreamPosition =
        static_cast< std::uint64_t >( std::numeric_limits< std::int64_t >::max() );
  }

  std::string FourCCText( std::uint32_t i_Type )
  {
    std::string Text;
    for( int Shift = 24; Shift >= 0; Shift -= 8 )
    {
      const char Byte = static_cast< char >( ( i_Type >> Shift ) & 0xFF );
      if( Byte == 0 )
        break;
      Text.push_back( Byte );
    }
    return Text;
  }

  VMovPrimitiveReader::VMovPrimitiveReader( const std::string& i_rPath )
  {
    auto pFile = std::make_shared< UtilsIO::VLargeFile >();
    if( pFile->Open( i_rPath, UtilsIO::OpenMode_Read ) )
      m_pStream = std::move( pFile );
    m_bGood = m_pStream != nullptr;
    if( m_bGood )
      m_bGood = m_pStream->GetSize( m_FileSize ) && m_pStream->Seek( 0 );
    if( !m_bGood )
      m_FileSize = 0;
  }

  VMovPrimitiveReader::VMovPrimitiveReader( std::shared_ptr< ZOL::IInputStreamSeekable > i_pStream )
      : m_pStream( std::move( i_pStream ) )
  {
    m_bGood = m_pStream != nullptr && m_pStream->GetSize( m_FileSize ) && m_pStream->Seek( 0 );
    if( !m_bGood )
      m_FileSize = 0;
  }

  VMovPrimitiveReader::~VMovPrimitiveReader()
  {
    Close();
  }

  bool VMovPrimitiveReader::Close()
  {
    if( !m_pStream )
      return false;
    m_pStream.reset();
    m_bGood = false;
    return true;
  }

  bool VMovPrimitiveReader::Read( void* o_pBuffer, std::uint64_t i_Size )
  {
    const std::uint64_t Start = m_Position;
    // The position moves on even when the read fails, so that a caller comparing it with an
    // end sees that it went past.
    m_Position = i_Size > std::numeric_limits< std::uint64_t >::max() - Start
                     ? std::numeric_limits< std::uint64_t >::max()
                     : Start + i_Size;
    if( !m_bGood )
      return false;
    // A read that would pass the end cannot succeed; it is not even tried, so a size from a
    // damaged table never reaches the file.
    if( i_Size > m_FileSize || Start > m_FileSize - i_Size )
    {
      m_bGood = false;
      return false;
    }
    if( i_Size == 0 )
      return true;
    m_bGood = m_pStream->Read( o_pBuffer, i_Size );
    return m_bGood;
  }

  bool VMovPrimitiveReader::Seek( std::uint64_t i_Position )
  {
    m_Position = i_Position;
    if( !m_bGood )
      return false;
    // A position past the end is where a too-long atom ends; it is valid to stand there, and
    // the next read fails. The file itself is only moved within its size.
    const std::uint64_t Target = i_Position < m_FileSize ? i_Position : m_FileSize;
    m_bGood = Target <= MaxStreamPosition && m_pStream->Seek( static_cast< std::int64_t >( Target ) );
    return m_bGood;
  }

  bool VMovPrimitiveReader::SkipBytes( std::uint64_t i_Count )
  {
    return Seek( m_Position + i_Count );
  }

  bool VMovPrimitiveReader::ReadBigEndian( std::uint64_t& o_rValue, unsigned i_Bytes )
  {
    std::uint8_t Bytes[8];
    if( !Read( Bytes, i_Bytes ) )
      return false;
    std::uint64_t Value = 0;
    for( unsigned i = 0; i < i_Bytes; ++i )
      Value = ( Value << 8 ) | Bytes[i];
    o_rValue = Value;
    return true;
  }

  bool VMovPrimitiveReader::ReadU8( std::uint8_t& o_rValue )
  {
    std::uint64_t Value = 0;
    if( !ReadBigEndian( Value, 1 ) )
      return false;
    o_rValue = static_cast< std::uint8_t >( Value );
    return true;
  }

  bool VMovPrimitiveReader::ReadU16( std::uint16_t& o_rValue )
  {
    std::uint64_t Value = 0;
    if( !ReadBigEndian( Value, 2 ) )
      return false;
    o_rValue = static_cast< std::uint16_t >( Value );
    return true;
  }

  bool VMovPrimitiveReader::ReadU32( std::uint32_t& o_rValue )
  {
    std::uint64_t Value = 0;
    if( !ReadBigEndian( Value, 4 ) )
      return false;
    o_rValue = static_cast< std::uint32_t >( Value );
    return true;
  }

  bool VMovPrimitiveReader::ReadU64( std::uint64_t& o_rValue )
  {
    return ReadBigEndian( o_rValue, 8 );
  }

  bool VMovPrimitiveReader::ReadF64( double& o_rValue )
  {
    std::uint64_t Bits = 0;
    if( !ReadBigEndian( Bits, 8 ) )
      return false;
    std::memcpy( &o_rValue, &Bits, sizeof( o_rValue ) );
    return true;
  }

  bool VMovPrimitiveReader::SkipPascalString()
  {
    std::uint8_t Length = 0;
    return ReadU8( Length ) && SkipFixedPascalString( Length );
  }

  bool VMovPrimitiveReader::SkipFixedPascalString( std::uint32_t i_Size )
  {
    for( std::uint32_t i = 0; i < i_Size; ++i )
    {
      std::uint8_t Byte = 0;
      if( !ReadU8( Byte ) )
        return false;
    }
    return true;
  }

  bool VMovPrimitiveReader::ExpectU8( std::uint8_t i_Value )
  {
    std::uint8_t Value = 0;
    return ReadU8( Value ) && Value == i_Value;
  }

  bool VMovPrimitiveReader::ExpectU16( std::uint16_t i_Value )
  {
    std::uint16_t Value = 0;
    return ReadU16( Value ) && Value == i_Value;
  }

  bool VMovPrimitiveReader::ExpectU24( std::uint32_t i_Value )
  {
    std::uint64_t Value = 0;
    return ReadBigEndian( Value, 3 ) && Value == i_Value;
  }

  bool VMovPrimitiveReader::ExpectU32( std::uint32_t i_Value )
  {
    std::uint32_t Value = 0;
    return ReadU32( Value ) && Value == i_Value;
  }

  bool VMovPrimitiveReader::ExpectFourCC( const char* i_pText )
  {
    return ExpectU32( FourCC( i_pText ) );
  }

  bool VMovPrimitiveReader::ExpectFixed16( double i_Value )
  {
    return ExpectU32( static_cast< std::uint32_t >( i_Value * 65536.0 ) );
  }
} // namespace MovIO
