#pragma once

// A small writer of compact JSON text, enough for the tool's reports.

#include <cstdint>
#include <string>
#include <vector>

namespace LumekVideoTool
{
  class VJsonWriter
  {
  public:
    VJsonWriter& BeginObject();
    VJsonWriter& EndObject();
    VJsonWriter& BeginArray();
    VJsonWriter& EndArray();
    // The key of the next value inside an object.
    VJsonWriter& Key( const std::string& i_rKey );
    VJsonWriter& Value( const std::string& i_rValue );
    VJsonWriter& Value( const char* i_pValue ) { return Value( std::string( i_pValue ) ); }
    VJsonWriter& Value( bool i_bValue );
    VJsonWriter& Value( std::int64_t i_Value );
    VJsonWriter& Value( std::uint64_t i_Value );
    VJsonWriter& Value( int i_Value ) { return Value( static_cast< std::int64_t >( i_Value ) ); }
    VJsonWriter& Value( double i_Value );

    const std::string& GetText() const { return m_Text; }

    static std::string Quote( const std::string& i_rText );

  private:
    void Separate();

    std::string m_Text;
    std::vector< bool > m_First; // per open object or array: nothing written in it yet
    bool m_bAfterKey = false;
  };
} // namespace LumekVideoTool
