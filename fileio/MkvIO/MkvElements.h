#pragma once

// Small helpers over libebml elements that the reader's parts share.

#include <ebml/EbmlElement.h>
#include <ebml/EbmlMaster.h>
#include <ebml/EbmlStream.h>
#include <ebml/EbmlUnicodeString.h>

#include <cstdint>
#include <memory>
#include <string>

namespace MkvIO
{
  // The first child of a read master that has the type, or null.
  template < typename TElement > TElement* ChildOf( libebml::EbmlMaster& i_rMaster )
  {
    return static_cast< TElement* >( i_rMaster.FindFirstElt( EBML_INFO( TElement ) ) );
  }

  // By type, not by ID: an unknown element carries whatever ID the file gave it, also one of a
  // known element, and must never be taken for one.
  template < typename TElement > bool Is( const libebml::EbmlElement& i_rElement )
  {
    return dynamic_cast< const TElement* >( &i_rElement ) != nullptr;
  }

  inline std::uint64_t DataStart( const libebml::EbmlElement& i_rElement )
  {
    return i_rElement.GetElementPosition() + i_rElement.HeadSize();
  }

  // Deletes the children of a master: its data goes back to the heap now, not at the next read.
  inline void ReleaseChildren( libebml::EbmlMaster& io_rMaster )
  {
    for( libebml::EbmlElement* pChild : io_rMaster.GetElementList() )
      delete pChild;
    io_rMaster.RemoveAll();
  }

  // Calls i_rVisit for every child of a master found in the file, one element alive at a time
  // unless the visitor takes it, with the stream at the child's data. Children must lie inside the parent with a known
  // size; the walk stops at the first one that does not. It never recurses: a caller that wants a grandchild walks
  // again, so nesting in the file cannot deepen the stack.
  template < typename TVisit >
  void ForEachChild( libebml::EbmlStream& io_rStream, libebml::EbmlElement& i_rParent, TVisit&& i_rVisit )
  {
    const std::uint64_t End = i_rParent.GetEndPosition();
    std::uint64_t Position = DataStart( i_rParent );
    while( Position < End )
    {
      io_rStream.I_O().setFilePointer( static_cast< std::int64_t >( Position ) );
      int UpperLevel = 0;
      std::unique_ptr< libebml::EbmlElement > pChild(
          io_rStream.FindNextElement( EBML_CONTEXT( &i_rParent ), UpperLevel, End - Position, true ) );
      if( !pChild || UpperLevel > 0 || !pChild->IsFiniteSize() || pChild->GetEndPosition() > End ||
          pChild->GetEndPosition() <= Position )
        return;
      Position = pChild->GetEndPosition();
      i_rVisit( pChild );
    }
  }
  // The text of a string element as the file holds it, up to a terminating zero. libebml's own
  // reading of UTF-8 throws on a bad byte and loses its buffer on the way out.
  inline std::string ReadText( libebml::EbmlStream& io_rStream, const libebml::EbmlElement& i_rElement )
  {
    // The element lies inside its parent and so inside the file: its size is bounded.
    std::string Text( static_cast< std::size_t >( i_rElement.GetSize() ), '\0' );
    if( !Text.empty() )
      Text.resize( io_rStream.I_O().read( &Text[0], Text.size() ) );
    const std::size_t End = Text.find( '\0' );
    if( End != std::string::npos )
      Text.resize( End );
    return Text;
  }

  // Nesting deeper than this is not read: Matroska's own elements nest far less.
  constexpr int MaxTreeDepth = 8;

  // Reads a master and everything in it, as libebml's own Read would, but walking the file
  // itself: every child checked to lie inside its parent, and the depth capped.
  inline void ReadTree( libebml::EbmlStream& io_rStream, libebml::EbmlElement& io_rMaster, int i_Depth = 0 )
  {
    auto& rMaster = static_cast< libebml::EbmlMaster& >( io_rMaster );
    // A new master holds its mandatory children with default values; the file's replace them.
    ReleaseChildren( rMaster );
    ForEachChild( io_rStream, io_rMaster,
                  [&]( std::unique_ptr< libebml::EbmlElement >& io_rpChild )
                  {
                    if( io_rpChild->IsMaster() )
                    {
                      if( i_Depth >= MaxTreeDepth )
                        return;
                      ReadTree( io_rStream, *io_rpChild, i_Depth + 1 );
                    }
                    else
                      io_rpChild->ReadData( io_rStream.I_O(), libebml::SCOPE_ALL_DATA );
                    rMaster.PushElement( *io_rpChild.release() );
                  } );
  }
} // namespace MkvIO
