#include "fileio/H264Utils/H264BitStream.h"

#include "services/Log.h"

#include <algorithm>
#include <cstring>

namespace H264Utils
{
  bool RemoveEmulationPrevention( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                  std::vector< std::uint8_t >& o_rCleaned )
  {
    // Most units hold no escape at all: find the first before copying anything.
    std::uint64_t First = i_Size;
    unsigned Zeros = 0;
    for( std::uint64_t i = 0; i < i_Size; ++i )
    {
      if( Zeros >= 2 && i_pData[i] == 3 && i + 1 < i_Size && i_pData[i + 1] <= 3 )
      {
        First = i;
        break;
      }
      Zeros = i_pData[i] == 0 ? Zeros + 1 : 0;
    }
    if( First == i_Size )
      return false;
    o_rCleaned.assign( i_pData, i_pData + First );
    o_rCleaned.reserve( static_cast< std::size_t >( i_Size ) );
    // The scan stopped on the escape itself, behind its two zeros.
    Zeros = 2;
    for( std::uint64_t i = First; i < i_Size; ++i )
    {
      if( Zeros >= 2 && i_pData[i] == 3 && i + 1 < i_Size && i_pData[i + 1] <= 3 )
      {
        Zeros = 0;
        continue;
      }
      Zeros = i_pData[i] == 0 ? Zeros + 1 : 0;
      o_rCleaned.push_back( i_pData[i] );
    }
    return true;
  }

  void InsertEmulationPrevention( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                  std::vector< std::uint8_t >& o_rOutput )
  {
    o_rOutput.clear();
    o_rOutput.reserve( static_cast< std::size_t >( i_Size + i_Size / 2 ) );
    unsigned Zeros = 0;
    for( std::uint64_t i = 0; i < i_Size; ++i )
    {
      const std::uint8_t Byte = i_pData[i];
      if( Zeros >= 2 && Byte >= 1 && Byte <= 3 && i + 1 < i_Size )
      {
        o_rOutput.push_back( 3 );
        Zeros = 0;
      }
      Zeros = Byte == 0 ? Zeros + 1 : 0;
      o_rOutput.push_back( Byte );
    }
  }

  VInputBitStream::VInputBitStream( const std::uint8_t* i_pData, std::uint64_t i_Size )
  {
    if( i_pData == nullptr )
      i_Size = 0;
    if( RemoveEmulationPrevention( i_pData, i_Size, m_Cleaned ) )
    {
      m_pData = m_Cleaned.data();
      m_Size = m_Cleaned.size();
    }
    else
    {
      m_pData = i_pData;
      m_Size = i_Size;
    }
  }

  std::uint64_t VInputBitStream::GetBitsLeft() const
  {
    const std::uint64_t Bits = m_Size * 8;
    return m_bValid && m_BitPosition < Bits ? Bits - m_BitPosition : 0;
  }

  std::uint32_t VInputBitStream::ReadBit()
  {
    if( !m_bValid || m_BitPosition >= m_Size * 8 )
    {
      m_bValid = false;
      return 0;
    }
    const std::uint32_t Bit = ( m_pData[m_BitPosition / 8] >> ( 7 - m_BitPosition % 8 ) ) & 1u;
    ++m_BitPosition;
    return Bit;
  }

  std::uint32_t VInputBitStream::ReadBits( unsigned i_Count )
  {
    if( i_Count > 32 || GetBitsLeft() < i_Count )
    {
      m_bValid = false;
      return 0;
    }
    std::uint32_t Value = 0;
    // Whole bytes where the position allows it: slices and SEI payloads are read this way.
    while( i_Count > 0 )
    {
      const unsigned Offset = static_cast< unsigned >( m_BitPosition % 8 );
      const unsigned Take = std::min( i_Count, 8 - Offset );
      const std::uint32_t Byte = m_pData[m_BitPosition / 8];
      const std::uint32_t Bits = ( Byte >> ( 8 - Offset - Take ) ) & ( ( 1u << Take ) - 1 );
      Value = static_cast< std::uint32_t >( ( static_cast< std::uint64_t >( Value ) << Take ) | Bits );
      m_BitPosition += Take;
      i_Count -= Take;
    }
    return Value;
  }

  std::int32_t VInputBitStream::ReadSignedBits( unsigned i_Count )
  {
    const std::uint32_t Value = ReadBits( i_Count );
    if( i_Count == 0 || i_Count >= 32 )
      return static_cast< std::int32_t >( Value );
    const std::uint32_t Sign = 1u << ( i_Count - 1 );
    return static_cast< std::int32_t >( Value ^ Sign ) - static_cast< std::int32_t >( Sign );
  }

  std::uint32_t VInputBitStream::ReadUE()
  {
    unsigned LeadingZeros = 0;
    while( ReadBit() == 0 )
    {
      if( !m_bValid || ++LeadingZeros > 31 )
      {
        m_bValid = false;
        return 0;
      }
    }
    const std::uint64_t Value = ( ( std::uint64_t( 1 ) << LeadingZeros ) - 1 ) + ReadBits( LeadingZeros );
    return m_bValid ? static_cast< std::uint32_t >( Value ) : 0;
  }

  std::uint32_t VInputBitStream::ReadUE( std::uint32_t i_Maximum )
  {
    const std::uint32_t Value = ReadUE();
    if( Value > i_Maximum )
    {
      m_bValid = false;
      return 0;
    }
    return Value;
  }

  std::int32_t VInputBitStream::ReadSE()
  {
    const std::int64_t k = ReadUE();
    const std::int64_t Value = ( k + 1 ) % 2 == 0 ? ( k + 1 ) / 2 : -( k / 2 );
    return static_cast< std::int32_t >( Value );
  }

  bool VInputBitStream::MoreRBSPData() const
  {
    if( !m_bValid )
      return false;
    // The last 1 bit of the data is the stop bit; anything before it is syntax.
    std::uint64_t Last = m_Size;
    while( Last > 0 && m_pData[Last - 1] == 0 )
      --Last;
    if( Last == 0 )
      return false;
    const std::uint8_t Byte = m_pData[Last - 1];
    unsigned TrailingZeros = 0;
    while( ( ( Byte >> TrailingZeros ) & 1u ) == 0 )
      ++TrailingZeros;
    const std::uint64_t StopBit = ( Last - 1 ) * 8 + ( 7 - TrailingZeros );
    return m_BitPosition < StopBit;
  }

  bool VInputBitStream::ReadNALHeader( VNALHeader& o_rHeader )
  {
    if( ReadBit() != 0 )
    {
      LUMEK_LOG( "H264Utils", ZOL::LogFailure, "Forbidden zero bit was not zero." );
      m_bValid = false;
      return false;
    }
    o_rHeader.NALRefIdc = ReadBits( 2 );
    o_rHeader.NALUnitType = ReadBits( 5 );
    return m_bValid;
  }

  bool VInputBitStream::ReadTrailingBits()
  {
    if( ReadBit() != 1 )
    {
      LUMEK_LOG( "H264Utils", ZOL::LogWarning, "Stop bit was not set." );
      m_bValid = false;
      return false;
    }
    while( m_bValid && !IsByteAligned() )
      if( ReadBit() != 0 )
      {
        LUMEK_LOG( "H264Utils", ZOL::LogWarning, "Trailing bits were not zero." );
        m_bValid = false;
        return false;
      }
    return m_bValid;
  }

  VOutputBitStream::VOutputBitStream() : m_Data( 1024, 0 ) {}

  void VOutputBitStream::WriteBit( std::uint32_t i_Bit )
  {
    if( m_BitPosition / 8 >= m_Data.size() )
      m_Data.resize( m_Data.size() * 2, 0 );
    std::uint8_t& rByte = m_Data[static_cast< std::size_t >( m_BitPosition / 8 )];
    const unsigned Shift = 7 - static_cast< unsigned >( m_BitPosition % 8 );
    rByte = static_cast< std::uint8_t >( ( rByte & ~( 1u << Shift ) ) | ( ( i_Bit & 1u ) << Shift ) );
    ++m_BitPosition;
  }

  void VOutputBitStream::WriteBits( std::uint32_t i_Value, unsigned i_Count )
  {
    for( unsigned i = i_Count; i-- > 0; )
      WriteBit( i < 32 ? ( i_Value >> i ) & 1u : 0 );
  }

  void VOutputBitStream::WriteUE( std::uint32_t i_Value )
  {
    const std::uint64_t Code = static_cast< std::uint64_t >( i_Value ) + 1;
    unsigned Bits = 0;
    while( ( Code >> Bits ) > 1 )
      ++Bits;
    for( unsigned i = 0; i < Bits; ++i )
      WriteBit( 0 );
    for( unsigned i = Bits + 1; i-- > 0; )
      WriteBit( static_cast< std::uint32_t >( ( Code >> i ) & 1u ) );
  }

  void VOutputBitStream::WriteSE( std::int32_t i_Value )
  {
    const std::int64_t v = i_Value;
    const std::int64_t Code = v > 0 ? 2 * v - 1 : -2 * v;
    // -2^31 has no 32-bit code; the nearest one is written.
    WriteUE( static_cast< std::uint32_t >( std::min< std::int64_t >( Code, 0xFFFFFFFE ) ) );
  }

  void VOutputBitStream::WriteNALHeader( const VNALHeader& i_rHeader )
  {
    WriteBit( 0 );
    WriteBits( i_rHeader.NALRefIdc, 2 );
    WriteBits( i_rHeader.NALUnitType, 5 );
  }

  void VOutputBitStream::WriteTrailingBits()
  {
    WriteBit( 1 );
    while( m_BitPosition % 8 != 0 )
      WriteBit( 0 );
  }

  std::uint64_t VOutputBitStream::GetByteCount() const
  {
    if( m_BitPosition % 8 != 0 )
      LUMEK_LOG( "H264Utils", ZOL::LogWarning, "Bit position of a buffer is not a whole number of bytes." );
    return ( m_BitPosition + 7 ) / 8;
  }

  std::vector< std::uint8_t > VOutputBitStream::Emit() const
  {
    std::vector< std::uint8_t > Output;
    InsertEmulationPrevention( m_Data.data(), GetByteCount(), Output );
    return Output;
  }

  bool VOutputBitStream::Emit( std::shared_ptr< ZOL::IBuffer >& o_rBuffer, ZOL::IBufferAllocator& i_rAllocator ) const
  {
    const std::vector< std::uint8_t > Output = Emit();
    i_rAllocator.Allocate( o_rBuffer, Output.size() );
    if( !o_rBuffer )
      return false;
    if( !Output.empty() )
      std::memcpy( o_rBuffer->GetData(), Output.data(), Output.size() );
    return true;
  }
} // namespace H264Utils
