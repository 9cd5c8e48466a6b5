#include "tools/LumekVideoTool/Json.h"

#include <cmath>
#include <cstdio>

namespace LumekVideoTool
{
  void VJsonWriter::Separate()
  {
    if( m_bAfterKey )
    {
      m_bAfterKey = false;
      return;
    }
    if( !m_First.empty() )
    {
      if( !m_First.back() )
        m_Text += ',';
      m_First.back() = false;
    }
  }

  VJsonWriter& VJsonWriter::BeginObject()
  {
    Separate();
    m_Text += '{';
    m_First.push_back( true );
    return *this;
  }

  VJsonWriter& VJsonWriter::EndObject()
  {
    m_Text += '}';
    m_First.pop_back();
    return *this;
  }

  VJsonWriter& VJsonWriter::BeginArray()
  {
    Separate();
    m_Text += '[';
    m_First.push_back( true );
    return *this;
  }

  VJsonWriter& VJsonWriter::EndArray()
  {
    m_Text += ']';
    m_First.pop_back();
    return *this;
  }

  VJsonWriter& VJsonWriter::Key( const std::string& i_rKey )
  {
    Separate();
    m_Text += Quote( i_rKey );
    m_Text += ':';
    m_bAfterKey = true;
    return *this;
  }

  VJsonWriter& VJsonWriter::Value( const std::string& i_rValue )
  {
    Separate();
    m_Text += Quote( i_rValue );
    return *this;
  }

  VJsonWriter& VJsonWriter::Value( bool i_bValue )
  {
    Separate();
    m_Text += i_bValue ? "true" : "false";
    return *this;
  }

  VJsonWriter& VJsonWriter::Value( std::int64_t i_Value )
  {
    Separate();
    m_Text += std::to_string( i_Value );
    return *this;
  }

  VJsonWriter& VJsonWriter::Value( std::uint64_t i_Value )
  {
    Separate();
    m_Text += std::to_string( i_Value );
    return *this;
  }

  VJsonWriter& VJsonWriter::Value( double i_Value )
  {
    Separate();
    if( !std::isfinite( i_Value ) )
    {
      m_Text += "null";
      return *this;
    }
    char Buffer[32];
    std::snprintf( Buffer, sizeof( Buffer ), "%.15g", i_Value );
    m_Text += Buffer;
    return *this;
  }

  namespace
  {
    // Length of the well-formed UTF-8 sequence at i, or 0. Texts from a damaged file may hold any
    // bytes, and the report must stay valid JSON.
    std::size_t Utf8SequenceLength( const std::string& i_rText, std::size_t i )
    {
      const auto Lead = static_cast< unsigned char >( i_rText[i] );
      std::size_t Length = 0;
      std::uint32_t CodePoint = 0;
      if( Lead >= 0xC2 && Lead <= 0xDF )
        Length = 2, CodePoint = Lead & 0x1Fu;
      else if( Lead >= 0xE0 && Lead <= 0xEF )
        Length = 3, CodePoint = Lead & 0x0Fu;
      else if( Lead >= 0xF0 && Lead <= 0xF4 )
        Length = 4, CodePoint = Lead & 0x07u;
      else
        return 0;
      if( i + Length > i_rText.size() )
        return 0;
      for( std::size_t k = 1; k < Length; ++k )
      {
        const auto Next = static_cast< unsigned char >( i_rText[i + k] );
        if( ( Next & 0xC0u ) != 0x80u )
          return 0;
        CodePoint = ( CodePoint << 6 ) | ( Next & 0x3Fu );
      }
      static const std::uint32_t s_Smallest[5] = { 0, 0, 0x80, 0x800, 0x10000 };
      if( CodePoint < s_Smallest[Length] || CodePoint > 0x10FFFF || ( CodePoint >= 0xD800 && CodePoint <= 0xDFFF ) )
        return 0;
      return Length;
    }
  } // namespace

  std::string VJsonWriter::Quote( const std::string& i_rText )
  {
    std::string Quoted = "\"";
    for( std::size_t i = 0; i < i_rText.size(); ++i )
    {
      const auto c = static_cast< unsigned char >( i_rText[i] );
      if( c >= 0x80 )
      {
        const std::size_t Length = Utf8SequenceLength( i_rText, i );
        if( Length == 0 )
          Quoted += "\\ufffd";
        else
        {
          Quoted.append( i_rText, i, Length );
          i += Length - 1;
        }
        continue;
      }
      switch( c )
      {
      case '"':
        Quoted += "\\\"";
        break;
      case '\\':
        Quoted += "\\\\";
        break;
      case '\n':
        Quoted += "\\n";
        break;
      case '\r':
        Quoted += "\\r";
        break;
      case '\t':
        Quoted += "\\t";
        break;
      default:
        if( c < 0x20 )
        {
          char Buffer[8];
          std::snprintf( Buffer, sizeof( Buffer ), "\\u%04x", c );
          Quoted += Buffer;
        }
        else
          Quoted += static_cast< char >( c );
      }
    }
    Quoted += '"';
    return Quoted;
  }
} // namespace LumekVideoTool
