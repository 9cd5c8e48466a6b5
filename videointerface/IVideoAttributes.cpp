#include "videointerface/IVideoAttributes.h"

#include <boost/lexical_cast.hpp>

#include <algorithm>
#include <limits>
#include <sstream>
#include <tuple>
#include <type_traits>
#include <utility>

namespace ZOL
{
  namespace
  {
    // The value types in the order of their tags: the tag of a type is its place here.
    using VValueTypes = std::tuple< bool, std::int8_t, std::int16_t, std::int32_t, std::int64_t, std::uint8_t,
                                    std::uint16_t, std::uint32_t, std::uint64_t, float, double, std::string >;
    static_assert( std::tuple_size_v< VValueTypes > == ValueTypeLast + 1, "one type a tag" );

    template < typename T, std::size_t Index = 0 > constexpr std::uint32_t TypeTag()
    {
      if constexpr( std::is_same_v< T, std::tuple_element_t< Index, VValueTypes > > )
        return static_cast< std::uint32_t >( Index );
      else
        return TypeTag< T, Index + 1 >();
    }

    // Calls the visitor with a default value of the type a tag names; false for an unknown tag.
    template < typename Visitor, std::size_t... Index >
    bool VisitTypes( std::uint32_t i_Type, Visitor&& i_rVisitor, std::index_sequence< Index... > )
    {
      bool bResult = false;
      auto Visit = [&]( auto i_Default )
      {
        bResult = i_rVisitor( i_Default );
        return true;
      };
      static_cast< void >( ( ( i_Type == Index && Visit( std::tuple_element_t< Index, VValueTypes >{} ) ) || ... ) );
      return bResult;
    }

    template < typename Visitor > bool VisitType( std::uint32_t i_Type, Visitor&& i_rVisitor )
    {
      return VisitTypes( i_Type, i_rVisitor, std::make_index_sequence< std::tuple_size_v< VValueTypes > >() );
    }

    template < typename T > std::shared_ptr< IVideoAttributes::IValue > MakeValue( T i_Value )
    {
      return std::make_shared< VValueTyped< T > >( std::move( i_Value ), TypeTag< T >() );
    }

    // Longer keys and strings are read in pieces of this size when the stream cannot say how
    // much it still holds, so a damaged length ends at the end of the data, not in the heap.
    constexpr std::uint64_t s_ReadChunkSize = 64 * 1024;

    // Reads i_Length bytes into o_rText without trusting i_Length: a seekable stream is asked
    // how much is left before anything is allocated; any other stream grows the text chunk by
    // chunk as the bytes actually arrive.
    bool ReadBoundedBytes( IInputStream& i_rStream, std::uint32_t i_Length, std::string& o_rText )
    {
      o_rText.clear();
      if( i_Length == 0 )
        return true;
      if( auto* pSeekable = dynamic_cast< ISeekable* >( &i_rStream ) )
      {
        std::uint64_t Size = 0;
        std::uint64_t Position = 0;
        if( pSeekable->GetSize( Size ) && pSeekable->GetPosition( Position ) )
        {
          if( Position > Size || i_Length > Size - Position )
          {
            // Leave the stream as a short read would: at its end and, for a file, failed.
            std::uint8_t Byte = 0;
            pSeekable->Seek( static_cast< std::int64_t >( Size ) );
            i_rStream.Read( &Byte, 1 );
            return false;
          }
          o_rText.resize( i_Length );
          return i_rStream.Read( &o_rText[0], i_Length );
        }
      }
      std::uint64_t Done = 0;
      while( Done < i_Length )
      {
        const std::uint64_t Piece = std::min< std::uint64_t >( s_ReadChunkSize, i_Length - Done );
        o_rText.resize( static_cast< std::size_t >( Done + Piece ) );
        if( !i_rStream.Read( &o_rText[static_cast< std::size_t >( Done )], Piece ) )
          return false;
        Done += Piece;
      }
      return true;
    }

    bool WriteBytes( IOutputStream& i_rStream, const std::string& i_rText )
    {
      if( i_rText.size() > std::numeric_limits< std::uint32_t >::max() )
        return false;
      return WriteLE( i_rStream, static_cast< std::uint32_t >( i_rText.size() ) ) &&
             i_rStream.Write( i_rText.data(), i_rText.size() );
    }

    template < typename T >
    bool ReadValue( IInputStream& i_rStream, std::shared_ptr< IVideoAttributes::IValue >& o_rpValue )
    {
      T Value{};
      if constexpr( std::is_same_v< T, std::string > )
      {
        std::uint32_t Length = 0;
        if( !ReadLE( i_rStream, Length ) || !ReadBoundedBytes( i_rStream, Length, Value ) )
          return false;
      }
      else if constexpr( std::is_same_v< T, bool > )
      {
        std::uint8_t Byte = 0;
        if( !ReadLE( i_rStream, Byte ) )
          return false;
        Value = Byte != 0;
      }
      else if( !ReadLE( i_rStream, Value ) )
        return false;
      o_rpValue = MakeValue( std::move( Value ) );
      return true;
    }

    bool ReadTaggedValue( IInputStream& i_rStream, std::uint32_t i_Type,
                          std::shared_ptr< IVideoAttributes::IValue >& o_rpValue )
    {
      return VisitType( i_Type,
                        [&]( auto i_Default ) { return ReadValue< decltype( i_Default ) >( i_rStream, o_rpValue ); } );
    }

    template < typename T >
    const VValueTyped< T >* FindTyped( const IVideoAttributes::Map& i_rValues, const std::string& i_rKey )
    {
      const auto It = i_rValues.find( i_rKey );
      if( It == i_rValues.end() || !It->second )
        return nullptr;
      return dynamic_cast< const VValueTyped< T >* >( It->second.get() );
    }

    template < typename T >
    bool GetTyped( const IVideoAttributes::Map& i_rValues, const std::string& i_rKey, T& o_rValue )
    {
      const VValueTyped< T >* pValue = FindTyped< T >( i_rValues, i_rKey );
      if( pValue == nullptr )
        return false;
      o_rValue = pValue->Value;
      return true;
    }

    // The panel text of a value. 8-bit numbers go out as numbers: a stream would print them as
    // raw characters.
    template < typename T > bool AppendText( const IVideoAttributes::IValue& i_rValue, std::ostringstream& io_rText )
    {
      const auto* pTyped = dynamic_cast< const VValueTyped< T >* >( &i_rValue );
      if( pTyped == nullptr )
        return false;
      if constexpr( std::is_same_v< T, std::int8_t > || std::is_same_v< T, std::uint8_t > || std::is_same_v< T, bool > )
        io_rText << static_cast< int >( pTyped->Value );
      else
        io_rText << pTyped->Value;
      return true;
    }

    // Parses a text in the type T. The 8-bit types are read as numbers, the same form
    // GetValueAsString gives them, so a value shown in the panel parses back to itself.
    template < typename T >
    bool ParseText( const std::string& i_rText, std::shared_ptr< IVideoAttributes::IValue >& o_rpValue )
    {
      try
      {
        if constexpr( std::is_same_v< T, std::string > )
          o_rpValue = MakeValue( i_rText );
        else if constexpr( std::is_same_v< T, std::int8_t > || std::is_same_v< T, std::uint8_t > )
        {
          const int Wide = boost::lexical_cast< int >( i_rText );
          if( Wide < std::numeric_limits< T >::min() || Wide > std::numeric_limits< T >::max() )
            return false;
          o_rpValue = MakeValue( static_cast< T >( Wide ) );
        }
        else
        {
          // lexical_cast reads "-1" as an unsigned number and wraps it round; a field typed
          // unsigned takes no sign.
          if constexpr( std::is_unsigned_v< T > && !std::is_same_v< T, bool > )
            if( i_rText.find( '-' ) != std::string::npos )
              return false;
          o_rpValue = MakeValue( boost::lexical_cast< T >( i_rText ) );
        }
        return true;
      }
      catch( const boost::bad_lexical_cast& )
      {
        return false;
      }
    }

  } // namespace

  template < typename T > bool VValueTyped< T >::Equals( const IVideoAttributes::IValue& i_rOther ) const
  {
    const auto* pOther = dynamic_cast< const VValueTyped< T >* >( &i_rOther );
    // Floats compare with ==: NaN differs from everything, 0.0 equals -0.0.
    return pOther != nullptr && Value == pOther->Value;
  }

  template < typename T > bool VValueTyped< T >::Write( IOutputStream& i_rStream ) const
  {
    if( !WriteLE( i_rStream, Type ) )
      return false;
    if constexpr( std::is_same_v< T, std::string > )
      return WriteBytes( i_rStream, Value );
    else if constexpr( std::is_same_v< T, bool > )
      return WriteLE( i_rStream, static_cast< std::uint8_t >( Value ? 1 : 0 ) );
    else
      return WriteLE( i_rStream, Value );
  }

  template class VValueTyped< bool >;
  template class VValueTyped< std::int8_t >;
  template class VValueTyped< std::int16_t >;
  template class VValueTyped< std::int32_t >;
  template class VValueTyped< std::int64_t >;
  template class VValueTyped< std::uint8_t >;
  template class VValueTyped< std::uint16_t >;
  template class VValueTyped< std::uint32_t >;
  template class VValueTyped< std::uint64_t >;
  template class VValueTyped< float >;
  template class VValueTyped< double >;
  template class VValueTyped< std::string >;

  bool IVideoAttributes::Get( const std::string& i_rKey, bool& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::int8_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::int16_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::int32_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::int64_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::uint8_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::uint16_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::uint32_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::uint64_t& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, float& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, double& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }
  bool IVideoAttributes::Get( const std::string& i_rKey, std::string& o_rValue ) const
  {
    return GetTyped( m_Values, i_rKey, o_rValue );
  }

  // A fresh value each time, never an assignment into the old one: copies of a store share
  // their values, and a change to one copy must not show in the other.
  void IVideoAttributes::Set( const std::string& i_rKey, bool i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::int8_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::int16_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::int32_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::int64_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::uint8_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::uint16_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::uint32_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, std::uint64_t i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, float i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, double i_Value )
  {
    m_Values[i_rKey] = MakeValue( i_Value );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, const std::string& i_rValue )
  {
    m_Values[i_rKey] = MakeValue( i_rValue );
  }
  void IVideoAttributes::Set( const std::string& i_rKey, const char* i_pValue )
  {
    m_Values[i_rKey] = MakeValue( std::string( i_pValue ? i_pValue : "" ) );
  }

  bool IVideoAttributes::GetType( const std::string& i_rKey, std::uint32_t& o_rType ) const
  {
    const auto It = m_Values.find( i_rKey );
    if( It == m_Values.end() || !It->second )
      return false;
    o_rType = It->second->GetType();
    return true;
  }

  bool IVideoAttributes::GetValueAsString( const std::string& i_rKey, std::string& o_rText ) const
  {
    const auto It = m_Values.find( i_rKey );
    if( It == m_Values.end() || !It->second )
      return false;
    const IValue& rValue = *It->second;
    std::ostringstream Text;
    const bool bDone = VisitType( rValue.GetType(), [&]( auto i_Default )
                                  { return AppendText< decltype( i_Default ) >( rValue, Text ); } );
    if( !bDone )
      return false;
    o_rText = Text.str();
    return true;
  }

  bool IVideoAttributes::SetValueFromString( const std::string& i_rKey, const std::string& i_rText )
  {
    const auto It = m_Values.find( i_rKey );
    if( It == m_Values.end() || !It->second )
      return false;
    std::shared_ptr< IValue > pNew;
    const bool bParsed = VisitType( It->second->GetType(), [&]( auto i_Default )
                                    { return ParseText< decltype( i_Default ) >( i_rText, pNew ); } );
    if( !bParsed )
      return false;
    It->second = std::move( pNew );
    return true;
  }

  bool IVideoAttributes::Remove( const std::string& i_rKey )
  {
    return m_Values.erase( i_rKey ) != 0;
  }

  void IVideoAttributes::GetKeys( std::vector< std::string >& o_rKeys ) const
  {
    o_rKeys.clear();
    o_rKeys.reserve( m_Values.size() );
    for( const auto& rEntry : m_Values )
      o_rKeys.push_back( rEntry.first );
  }

  bool IVideoAttributes::operator==( const IVideoAttributes& i_rOther ) const
  {
    if( m_Values.size() != i_rOther.m_Values.size() )
      return false;
    auto It = m_Values.begin();
    auto OtherIt = i_rOther.m_Values.begin();
    for( ; It != m_Values.end(); ++It, ++OtherIt )
    {
      if( It->first != OtherIt->first || !It->second || !OtherIt->second )
        return false;
      if( !It->second->Equals( *OtherIt->second ) )
        return false;
    }
    return true;
  }

  bool IVideoAttributes::ContainsAllOf( const IVideoAttributes& i_rOther ) const
  {
    for( const auto& rEntry : i_rOther.m_Values )
    {
      const auto It = m_Values.find( rEntry.first );
      if( It == m_Values.end() || !It->second || !rEntry.second || !It->second->Equals( *rEntry.second ) )
        return false;
    }
    return true;
  }

  bool IVideoAttributes::WriteTo( IOutputStream& i_rStream ) const
  {
    if( m_Values.size() > std::numeric_limits< std::uint32_t >::max() )
      return false;
    if( !WriteLE( i_rStream, static_cast< std::uint32_t >( m_Values.size() ) ) )
      return false;
    for( const auto& rEntry : m_Values )
    {
      if( !rEntry.second || !WriteBytes( i_rStream, rEntry.first ) || !rEntry.second->Write( i_rStream ) )
        return false;
    }
    return true;
  }

  bool IVideoAttributes::ReadFrom( IInputStream& i_rStream )
  {
    m_Values.clear();
    std::uint32_t Count = 0;
    if( !ReadLE( i_rStream, Count ) )
      return false;
    // Each entry takes at least nine bytes of the stream, so a damaged count ends at the end of
    // the data without the loop allocating anything for entries that are not there.
    for( std::uint32_t i = 0; i < Count; ++i )
    {
      std::uint32_t KeyLength = 0;
      std::string Key;
      std::uint32_t Type = 0;
      if( !ReadLE( i_rStream, KeyLength ) || !ReadBoundedBytes( i_rStream, KeyLength, Key ) ||
          !ReadLE( i_rStream, Type ) )
        return false;
      if( Type > ValueTypeLast )
        return false;
      std::shared_ptr< IValue > pValue;
      if( !ReadTaggedValue( i_rStream, Type, pValue ) )
        return false;
      m_Values[std::move( Key )] = std::move( pValue );
    }
    return true;
  }
} // namespace ZOL
