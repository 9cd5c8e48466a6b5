#include "graphics/CoreGraphics/MurmurHash3.h"

namespace CoreGraphics
{
  namespace
  {
    constexpr std::uint32_t RotateLeft( std::uint32_t i_Value, int i_Bits )
    {
      return ( i_Value << i_Bits ) | ( i_Value >> ( 32 - i_Bits ) );
    }

    constexpr std::uint32_t MixKey( std::uint32_t i_Key )
    {
      i_Key *= 0xcc9e2d51u;
      i_Key = RotateLeft( i_Key, 15 );
      return i_Key * 0x1b873593u;
    }
  } // namespace

  std::uint32_t MurmurHash3_32( const void* i_pData, std::size_t i_Length, std::uint32_t i_Seed )
  {
    const auto* pBytes = static_cast< const std::uint8_t* >( i_pData );
    const std::size_t BlockCount = i_Length / 4;
    std::uint32_t Hash = i_Seed;

    // Blocks are read as little-endian words byte by byte, so the hash is the same on any
    // machine and no unaligned load happens.
    for( std::size_t i = 0; i < BlockCount; ++i )
    {
      const std::uint8_t* p = pBytes + i * 4;
      const std::uint32_t Key = std::uint32_t( p[0] ) | ( std::uint32_t( p[1] ) << 8 ) |
                                ( std::uint32_t( p[2] ) << 16 ) | ( std::uint32_t( p[3] ) << 24 );
      Hash ^= MixKey( Key );
      Hash = RotateLeft( Hash, 13 );
      Hash = Hash * 5 + 0xe6546b64u;
    }

    const std::uint8_t* pTail = pBytes + BlockCount * 4;
    std::uint32_t Key = 0;
    switch( i_Length & 3 )
    {
    case 3:
      Key ^= std::uint32_t( pTail[2] ) << 16;
      [[fallthrough]];
    case 2:
      Key ^= std::uint32_t( pTail[1] ) << 8;
      [[fallthrough]];
    case 1:
      Key ^= pTail[0];
      Hash ^= MixKey( Key );
    }

    Hash ^= static_cast< std::uint32_t >( i_Length );
    Hash ^= Hash >> 16;
    Hash *= 0x85ebca6bu;
    Hash ^= Hash >> 13;
    Hash *= 0xc2b2ae35u;
    Hash ^= Hash >> 16;
    return Hash;
  }
} // namespace CoreGraphics
