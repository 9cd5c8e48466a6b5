#include "fileio/LumekVideo/LvidFormat.h"

#include <cstring>
#include <limits>

namespace LumekVideo
{
  VFileHeader VFileHeader::MakeNew()
  {
    VFileHeader Header;
    std::memcpy( Header.Magic, HeaderMagic, HeaderMagicSize );
    return Header;
  }

  bool VFileHeader::IsSupported() const
  {
    return std::memcmp( Magic, HeaderMagic, HeaderMagicSize ) == 0 && FormatVersion == HeaderFormatVersion;
  }

  bool ReadFileHeader( ZOL::IInputStream& i_rStream, VFileHeader& o_rHeader )
  {
    // One read of the whole header: a file shorter than 48 bytes fails here and nowhere later.
    std::uint8_t Bytes[HeaderSize];
    if( !i_rStream.Read( Bytes, HeaderSize ) )
      return false;
    const auto Field = []( const std::uint8_t* i_pBytes, std::size_t i_Size )
    {
      std::uint64_t Value = 0;
      for( std::size_t i = 0; i < i_Size; ++i )
        Value |= static_cast< std::uint64_t >( i_pBytes[i] ) << ( 8 * i );
      return Value;
    };
    std::memcpy( o_rHeader.Magic, Bytes, HeaderMagicSize );
    o_rHeader.Signature = static_cast< std::uint32_t >( Field( Bytes + 20, 4 ) );
    o_rHeader.FormatVersion = static_cast< std::uint32_t >( Field( Bytes + 24, 4 ) );
    o_rHeader.Revision = static_cast< std::uint32_t >( Field( Bytes + 28, 4 ) );
    o_rHeader.Alignment = Field( Bytes + HeaderAlignmentOffset, 8 );
    o_rHeader.IndexOffset = Field( Bytes + HeaderIndexOffsetOffset, 8 );
    return true;
  }

  bool WriteFileHeader( ZOL::IOutputStream& i_rStream, const VFileHeader& i_rHeader )
  {
    return i_rStream.Write( i_rHeader.Magic, HeaderMagicSize ) && ZOL::WriteLE( i_rStream, i_rHeader.Signature ) &&
           ZOL::WriteLE( i_rStream, i_rHeader.FormatVersion ) && ZOL::WriteLE( i_rStream, i_rHeader.Revision ) &&
           ZOL::WriteLE( i_rStream, i_rHeader.Alignment ) && ZOL::WriteLE( i_rStream, i_rHeader.IndexOffset );
  }

  bool AlignUp( std::uint64_t i_Position, std::uint64_t i_Alignment, std::uint64_t& o_rAligned )
  {
    if( i_Alignment == 0 )
      return false;
    const std::uint64_t Remainder = i_Position % i_Alignment;
    if( Remainder == 0 )
    {
      o_rAligned = i_Position;
      return true;
    }
    const std::uint64_t Skip = i_Alignment - Remainder;
    constexpr std::uint64_t MaxPosition = static_cast< std::uint64_t >( std::numeric_limits< std::int64_t >::max() );
    if( i_Position > MaxPosition || Skip > MaxPosition - i_Position )
      return false;
    o_rAligned = i_Position + Skip;
    return true;
  }
} // namespace LumekVideo
