#pragma once

// Everything a recording says about itself apart from its frames: a sorted map from text key
// to typed value, with one binary form shared by .lvid, image sequence descriptors, MOV and AVI.

#include "utils/Streams.h"

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

namespace ZOL
{
  enum EValueType : std::uint32_t
  {
    ValueType_Bool = 0,
    ValueType_Int8 = 1,
    ValueType_Int16 = 2,
    ValueType_Int32 = 3,
    ValueType_Int64 = 4,
    ValueType_UInt8 = 5,
    ValueType_UInt16 = 6,
    ValueType_UInt32 = 7,
    ValueType_UInt64 = 8,
    ValueType_Float32 = 9,
    ValueType_Float64 = 10,
    ValueType_String = 11,
  };
  constexpr std::uint32_t ValueTypeLast = ValueType_String;

  class IVideoAttributes
  {
  public:
    class IValue
    {
    public:
      IValue() = default;
      IValue( const IValue& ) = delete;
      IValue& operator=( const IValue& ) = delete;
      virtual ~IValue() = default;

      // Same dynamic type and equal value; NaN differs from everything, 0.0 equals -0.0.
      virtual bool Equals( const IValue& i_rOther ) const = 0;
      virtual std::uint32_t GetType() const = 0;
      // The serial form, tag included.
      [[nodiscard]] virtual bool Write( IOutputStream& i_rStream ) const = 0;
    };

    // Keys compare byte-wise; a shorter key sorts before a longer one with the same prefix.
    using Map = std::map< std::string, std::shared_ptr< IValue > >;

    IVideoAttributes() = default;
    IVideoAttributes( const IVideoAttributes& ) = default;
    IVideoAttributes& operator=( const IVideoAttributes& ) = default;

    bool Get( const std::string& i_rKey, bool& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::int8_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::int16_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::int32_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::int64_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::uint8_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::uint16_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::uint32_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::uint64_t& o_rValue ) const;
    bool Get( const std::string& i_rKey, float& o_rValue ) const;
    bool Get( const std::string& i_rKey, double& o_rValue ) const;
    bool Get( const std::string& i_rKey, std::string& o_rValue ) const;

    void Set( const std::string& i_rKey, bool i_Value );
    void Set( const std::string& i_rKey, std::int8_t i_Value );
    void Set( const std::string& i_rKey, std::int16_t i_Value );
    void Set( const std::string& i_rKey, std::int32_t i_Value );
    void Set( const std::string& i_rKey, std::int64_t i_Value );
    void Set( const std::string& i_rKey, std::uint8_t i_Value );
    void Set( const std::string& i_rKey, std::uint16_t i_Value );
    void Set( const std::string& i_rKey, std::uint32_t i_Value );
    void Set( const std::string& i_rKey, std::uint64_t i_Value );
    void Set( const std::string& i_rKey, float i_Value );
    void Set( const std::string& i_rKey, double i_Value );
    void Set( const std::string& i_rKey, const std::string& i_rValue );
    void Set( const std::string& i_rKey, const char* i_pValue );

    bool GetType( const std::string& i_rKey, std::uint32_t& o_rType ) const;
    // The text the properties panel shows: numbers in the default stream form, bool as 0 or 1.
    bool GetValueAsString( const std::string& i_rKey, std::string& o_rText ) const;
    // Replaces the value of an existing key by the parsed text, in the key's existing type.
    [[nodiscard]] bool SetValueFromString( const std::string& i_rKey, const std::string& i_rText );
    bool Remove( const std::string& i_rKey );
    void GetKeys( std::vector< std::string >& o_rKeys ) const;
    bool Has( const std::string& i_rKey ) const { return m_Values.count( i_rKey ) != 0; }
    std::size_t Size() const { return m_Values.size(); }
    bool Empty() const { return m_Values.empty(); }
    void Clear() { m_Values.clear(); }
    const Map& GetMap() const { return m_Values; }

    bool operator==( const IVideoAttributes& i_rOther ) const;
    bool operator!=( const IVideoAttributes& i_rOther ) const { return !( *this == i_rOther ); }
    // Every entry of the other store is here with an equal value.
    bool ContainsAllOf( const IVideoAttributes& i_rOther ) const;

    // The serial form: a count, then key length, key, tag and value for each entry in map order.
    [[nodiscard]] bool WriteTo( IOutputStream& i_rStream ) const;
    // Reads the serial form. On failure the entries read so far stay. Key and string lengths are
    // bounded by what the stream can still hold, so a damaged length never allocates more than
    // the stream's size.
    [[nodiscard]] bool ReadFrom( IInputStream& i_rStream );

  private:
    Map m_Values;
  };

  template < typename T > class VValueTyped : public IVideoAttributes::IValue
  {
  public:
    VValueTyped( T i_Value, std::uint32_t i_Type ) : Value( std::move( i_Value ) ), Type( i_Type ) {}
    bool Equals( const IVideoAttributes::IValue& i_rOther ) const override;
    std::uint32_t GetType() const override { return Type; }
    bool Write( IOutputStream& i_rStream ) const override;

    T Value;
    const std::uint32_t Type;
  };
} // namespace ZOL
