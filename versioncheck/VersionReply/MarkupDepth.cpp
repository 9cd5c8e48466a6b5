#include "versioncheck/VersionReply/MarkupDepth.h"

#include <algorithm>
#include <cstring>

namespace VersionCheck
{
  namespace
  {
    bool IsXmlSpace( char i_Char )
    {
      return i_Char == ' ' || i_Char == '\n' || i_Char == '\r' || i_Char == '\t';
    }

    // The characters RapidXml takes into element and attribute names.
    bool IsNodeNameChar( char i_Char )
    {
      return i_Char != 0 && !IsXmlSpace( i_Char ) && i_Char != '/' && i_Char != '>' && i_Char != '?';
    }

    bool IsAttributeNameChar( char i_Char )
    {
      return IsNodeNameChar( i_Char ) && i_Char != '<' && i_Char != '=' && i_Char != '!';
    }

    // A cursor over the text that treats a zero byte as the end, as RapidXml does.
    class VCursor
    {
    public:
      explicit VCursor( const std::string& i_rText )
          : m_pText( i_rText.c_str() ), m_Size( std::strlen( i_rText.c_str() ) )
      {
      }
      bool AtEnd() const { return m_Position >= m_Size; }
      char Peek( std::size_t i_Ahead = 0 ) const
      {
        return m_Position + i_Ahead < m_Size ? m_pText[m_Position + i_Ahead] : 0;
      }
      bool StartsWith( const char* i_pPrefix ) const
      {
        const std::size_t Length = std::strlen( i_pPrefix );
        return m_Size - m_Position >= Length && std::memcmp( m_pText + m_Position, i_pPrefix, Length ) == 0;
      }
      void Advance( std::size_t i_Count = 1 ) { m_Position = std::min( m_Size, m_Position + i_Count ); }
      // Moves past the next occurrence of i_pEnd, or to the end.
      void SkipPast( const char* i_pEnd )
      {
        const std::size_t Length = std::strlen( i_pEnd );
        while( !AtEnd() && !StartsWith( i_pEnd ) )
          Advance();
        Advance( Length );
      }
      template < typename Predicate > std::size_t SkipWhile( Predicate i_Predicate )
      {
        const std::size_t Start = m_Position;
        while( !AtEnd() && i_Predicate( Peek() ) )
          Advance();
        return m_Position - Start;
      }
      unsigned long Line() const
      {
        return 1 + static_cast< unsigned long >( std::count( m_pText, m_pText + m_Position, '\n' ) );
      }

    private:
      const char* m_pText;
      std::size_t m_Size;
      std::size_t m_Position = 0;
    };

    // A document type's internal subset may hold '>' between brackets.
    void SkipDocumentType( VCursor& io_rCursor )
    {
      int Brackets = 0;
      while( !io_rCursor.AtEnd() )
      {
        const char Char = io_rCursor.Peek();
        io_rCursor.Advance();
        if( Char == '[' )
          ++Brackets;
        else if( Char == ']' && Brackets > 0 )
          --Brackets;
        else if( Char == '>' && Brackets == 0 )
          return;
      }
    }

    enum class ETag
    {
      Opened,
      SelfClosed,
      Malformed
    };

    // Reads an element's start tag after its '<' the way RapidXml does.
    ETag ReadStartTag( VCursor& io_rCursor )
    {
      if( io_rCursor.SkipWhile( IsNodeNameChar ) == 0 )
        return ETag::Malformed;
      io_rCursor.SkipWhile( IsXmlSpace );
      while( IsAttributeNameChar( io_rCursor.Peek() ) )
      {
        io_rCursor.SkipWhile( IsAttributeNameChar );
        io_rCursor.SkipWhile( IsXmlSpace );
        if( io_rCursor.Peek() != '=' )
          return ETag::Malformed;
        io_rCursor.Advance();
        io_rCursor.SkipWhile( IsXmlSpace );
        const char Quote = io_rCursor.Peek();
        if( Quote != '"' && Quote != '\'' )
          return ETag::Malformed;
        io_rCursor.Advance();
        io_rCursor.SkipWhile( [Quote]( char i_Char ) { return i_Char != Quote; } );
        if( io_rCursor.AtEnd() )
          return ETag::Malformed;
        io_rCursor.Advance();
        io_rCursor.SkipWhile( IsXmlSpace );
      }
      if( io_rCursor.Peek() == '>' )
      {
        io_rCursor.Advance();
        return ETag::Opened;
      }
      if( io_rCursor.Peek() == '/' && io_rCursor.Peek( 1 ) == '>' )
      {
        io_rCursor.Advance( 2 );
        return ETag::SelfClosed;
      }
      return ETag::Malformed;
    }
  } // namespace

  IMarkupDepth JsonNestingDepth( const std::string& i_rText, int i_Limit )
  {
    IMarkupDepth Result;
    int Depth = 0;
    bool bInString = false;
    for( std::size_t Index = 0; Index < i_rText.size(); ++Index )
    {
      const char Char = i_rText[Index];
      if( Char == '\n' )
        ++Result.Line;
      if( bInString )
      {
        if( Char == '\\' )
          ++Index;
        else if( Char == '"' )
          bInString = false;
        continue;
      }
      if( Char == '"' )
        bInString = true;
      else if( Char == '[' || Char == '{' )
      {
        Result.Depth = std::max( Result.Depth, ++Depth );
        if( Depth > i_Limit )
          return Result;
      }
      else if( ( Char == ']' || Char == '}' ) && Depth > 0 )
        --Depth;
    }
    return Result;
  }

  IMarkupDepth XmlNestingDepth( const std::string& i_rText, int i_Limit )
  {
    IMarkupDepth Result;
    VCursor Cursor( i_rText );
    int Depth = 0;
    while( !Cursor.AtEnd() )
    {
      if( Cursor.Peek() != '<' )
      {
        Cursor.Advance();
        continue;
      }
      if( Cursor.StartsWith( "<!--" ) )
        Cursor.SkipPast( "-->" );
      else if( Cursor.StartsWith( "<![CDATA[" ) )
        Cursor.SkipPast( "]]>" );
      else if( Cursor.StartsWith( "<!DOCTYPE" ) && IsXmlSpace( Cursor.Peek( 9 ) ) )
        SkipDocumentType( Cursor );
      else if( Cursor.StartsWith( "<!" ) )
        Cursor.SkipPast( ">" );
      else if( Cursor.StartsWith( "<?" ) )
        Cursor.SkipPast( "?>" );
      else if( Cursor.StartsWith( "</" ) )
      {
        Cursor.SkipPast( ">" );
        Depth = std::max( 0, Depth - 1 );
      }
      else
      {
        Cursor.Advance();
        const ETag Tag = ReadStartTag( Cursor );
        if( Tag == ETag::Malformed )
          break;
        if( Tag == ETag::Opened )
        {
          Result.Depth = std::max( Result.Depth, ++Depth );
          if( Depth > i_Limit )
            break;
        }
      }
    }
    Result.Line = Cursor.Line();
    return Result;
  }
} // namespace VersionCheck
