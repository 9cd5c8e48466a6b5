#pragma once

// Boolean-result binary streams. Position and size live in a virtual base so that a class can
// be read and written through one position. Nothing here throws for a file problem.

#include <cstdint>
#include <cstring>
#include <type_traits>
#include <utility>
#include <vector>

namespace ZOL
{
  class IBufferConst;

  class ISeekable
  {
  public:
    virtual ~ISeekable() = default;
    // The size in bytes; the position stays where it was.
    [[nodiscard]] virtual bool GetSize( std::uint64_t& o_rSize ) = 0;
    [[nodiscard]] virtual bool GetPosition( std::uint64_t& o_rPosition ) = 0;
    // Absolute position.
    [[nodiscard]] virtual bool Seek( std::int64_t i_Position ) = 0;
  };

  using IReadBlocks = std::vector< std::pair< void*, std::uint64_t > >;
  using IWriteBlocks = std::vector< std::pair< const void*, std::uint64_t > >;

  class IInputStream
  {
  public:
    virtual ~IInputStream() = default;
    // Reads exactly i_Size bytes; false when fewer came.
    [[nodiscard]] virtual bool Read( void* o_pBuffer, std::uint64_t i_Size ) = 0;
    // The end of the data was hit by a read.
    virtual bool IsAtEnd() = 0;
    [[nodiscard]] virtual bool ReadAll( const IReadBlocks& i_rBlocks );
    virtual bool IsReserved() { return false; }
  };

  class IOutputStream
  {
  public:
    virtual ~IOutputStream() = default;
    // Writes exactly i_Size bytes; false when fewer went out.
    [[nodiscard]] virtual bool Write( const void* i_pBuffer, std::uint64_t i_Size ) = 0;
    [[nodiscard]] virtual bool WriteAll( const IWriteBlocks& i_rBlocks );
    [[nodiscard]] virtual bool WriteBuffer( const IBufferConst& i_rBuffer );
  };

  class IInputStreamSeekable : public IInputStream, public virtual ISeekable
  {
  };

  class IOutputStreamSeekable : public IOutputStream, public virtual ISeekable
  {
  };

  class IStreamSeekable : public IInputStreamSeekable, public IOutputStreamSeekable
  {
  };

  // Skips i_Bytes from the current position.
  [[nodiscard]] bool Skip( IInputStreamSeekable& i_rStream, std::int64_t i_Bytes );

  // Little-endian values on a stream.
  template < typename T > [[nodiscard]] bool ReadLE( IInputStream& i_rStream, T& o_rValue )
  {
    std::uint8_t Bytes[sizeof( T )];
    if( !i_rStream.Read( Bytes, sizeof( T ) ) )
      return false;
    std::uint64_t Value = 0;
    for( std::size_t i = 0; i < sizeof( T ); ++i )
      Value |= static_cast< std::uint64_t >( Bytes[i] ) << ( 8 * i );
    if constexpr( sizeof( T ) == 4 && std::is_floating_point_v< T > )
    {
      std::uint32_t Bits = static_cast< std::uint32_t >( Value );
      std::memcpy( &o_rValue, &Bits, sizeof( T ) );
    }
    else if constexpr( std::is_floating_point_v< T > )
      std::memcpy( &o_rValue, &Value, sizeof( T ) );
    else
      o_rValue = static_cast< T >( Value );
    return true;
  }

  template < typename T > [[nodiscard]] bool WriteLE( IOutputStream& i_rStream, T i_Value )
  {
    std::uint64_t Value = 0;
    if constexpr( sizeof( T ) == 4 && std::is_floating_point_v< T > )
    {
      std::uint32_t Bits;
      std::memcpy( &Bits, &i_Value, sizeof( T ) );
      Value = Bits;
    }
    else if constexpr( std::is_floating_point_v< T > )
      std::memcpy( &Value, &i_Value, sizeof( T ) );
    else
      Value = static_cast< std::uint64_t >( i_Value );
    std::uint8_t Bytes[sizeof( T )];
    for( std::size_t i = 0; i < sizeof( T ); ++i )
      Bytes[i] = static_cast< std::uint8_t >( Value >> ( 8 * i ) );
    return i_rStream.Write( Bytes, sizeof( T ) );
  }
} // namespace ZOL
