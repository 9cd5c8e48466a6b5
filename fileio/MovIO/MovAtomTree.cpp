#include "fileio/MovIO/VMovAtom.h"

#include <limits>

namespace MovIO
{
  namespace
  {
    struct VContainerPair
    {
      std::uint32_t Parent;
      std::uint32_t Child;
    };

    // 'wave' under a synthetic root: an audio sample description's extensions.
    constexpr VContainerPair s_Containers[] = {
        { 0, FourCC( "moov" ) },
        { FourCC( "moov" ), FourCC( "trak" ) },
        { FourCC( "trak" ), FourCC( "edts" ) },
        { FourCC( "trak" ), FourCC( "mdia" ) },
        { FourCC( "trak" ), FourCC( "tref" ) },
        { FourCC( "mdia" ), FourCC( "minf" ) },
        { FourCC( "minf" ), FourCC( "gmhd" ) },
        { FourCC( "minf" ), FourCC( "dinf" ) },
        { FourCC( "minf" ), FourCC( "stbl" ) },
        { FourCC( "gmhd" ), FourCC( "tmcd" ) },
        { 0, FourCC( "wave" ) },
    };

    std::uint64_t SaturatingAdd( std::uint64_t i_A, std::uint64_t i_B )
    {
      return i_B > std::numeric_limits< std::uint64_t >::max() - i_A ? std::numeric_limits< std::uint64_t >::max()
                                                                     : i_A + i_B;
    }
  } // namespace

  bool IsContainerPair( std::uint32_t i_Parent, std::uint32_t i_Child )
  {
    for( const VContainerPair& rPair : s_Containers )
      if( rPair.Parent == i_Parent && rPair.Child == i_Child )
        return true;
    return false;
  }

  bool BuildAtomTree( VMovPrimitiveReader& io_rReader, VMovAtom& io_rAtom, unsigned i_Depth )
  {
    if( i_Depth > MaxAtomDepth )
      return false;
    const std::uint64_t End = SaturatingAdd( io_rAtom.Position, io_rAtom.Size );
    bool bOk = true;
    while( bOk )
    {
      if( io_rReader.Tell() >= End )
        return bOk;
      const std::uint64_t Start = io_rReader.Tell();
      std::uint32_t SizeField = 0;
      bOk = io_rReader.ReadU32( SizeField );
      // Four spare bytes at the end of a container (QuickTime's terminating zero word) end the
      // walk without a child; one to three fail the read above.
      if( io_rReader.Tell() >= End )
        return bOk;
      bool bHeaderOk = true;
      std::uint32_t Type = 0;
      if( bOk )
        bHeaderOk = io_rReader.ReadU32( Type );
      std::uint64_t Length = SizeField;
      if( SizeField == 1 && bHeaderOk )
        bHeaderOk = io_rReader.ReadU64( Length );
      // Size 0 would mean "to the end of the file"; this reader does not take it.
      if( Length == 0 )
        return false;

      auto pChild = std::make_shared< VMovAtom >();
      pChild->Name = FourCCText( Type );
      pChild->Type = Type;
      pChild->Position = Start;
      pChild->Size = SizeField;
      io_rAtom.Children.push_back( pChild );
      // A broken container inside does not fail the walk of its parent.
      if( IsContainerPair( io_rAtom.Type, Type ) )
        static_cast< void >( BuildAtomTree( io_rReader, *pChild, i_Depth + 1 ) );

      // A length past the end of the file is a valid place to stand: the loop test ends the
      // walk there. Saturation keeps a length near 2^64 from wrapping back into the file.
      bOk = bHeaderOk && io_rReader.Seek( SaturatingAdd( Start, Length ) );
    }
    return false;
  }

  const VMovAtom* FindAtom( const VMovAtom& i_rAtom, const VAtomPath& i_rPath, std::size_t i_Index )
  {
    if( i_Index == i_rPath.size() )
      return &i_rAtom;
    const std::uint32_t Type = FourCC( i_rPath[i_Index] );
    for( const auto& pChild : i_rAtom.Children )
    {
      if( pChild->Type != Type )
        continue;
      if( const VMovAtom* pFound = FindAtom( *pChild, i_rPath, i_Index + 1 ) )
        return pFound;
    }
    return nullptr;
  }

  void WriteAtomTree( const VMovAtom& i_rAtom, std::ostream& o_rStream, unsigned i_Depth )
  {
    o_rStream << std::string( i_Depth, ' ' ) << i_rAtom.Name << '\n';
    for( const auto& pChild : i_rAtom.Children )
      WriteAtomTree( *pChild, o_rStream, i_Depth + 1 );
  }
} // namespace MovIO
