#pragma once

// The read protocol around every atom layout of the MOV reader. Included only by the reader's
// own source files.

#include "fileio/MovIO/VMovReader.h"
#include "services/Log.h"

#include <cstdint>

namespace MovIO
{
  // An atom's fields are read by a body that gets the primitive reader and the position where
  // the atom's stored size says it ends, and stops at its first failed read or comparison.
  template < typename TBody >
  bool VMovReader::ReadAtom( const VMovAtom& i_rParent, const VAtomPath& i_rPath, std::uint32_t i_FixedSize,
                             TBody&& i_Body )
  {
    // Absent optional and absent mandatory atoms look alike here; the caller decides.
    const VMovAtom* pAtom = FindAtom( i_rParent, i_rPath );
    if( pAtom == nullptr )
      return false;
    VMovPrimitiveReader& rReader = *m_pReader;
    static_cast< void >( rReader.Seek( pAtom->Position ) );
    const std::uint64_t Start = rReader.Tell();
    std::uint32_t AtomSize = 0;
    const bool bOk =
        rReader.ReadU32( AtomSize ) && rReader.ExpectU32( pAtom->Type ) && i_Body( rReader, Start + AtomSize );
    if( bOk )
    {
      const std::uint64_t End = Start + AtomSize;
      if( rReader.Tell() != End )
      {
        const std::int64_t Remaining = static_cast< std::int64_t >( End - rReader.Tell() );
        LUMEK_LOG( "MovIO", ZOL::LogWarning, "Incompletely read '%s' atom. %d bytes remaining.", pAtom->Name,
                   Remaining );
        static_cast< void >( rReader.Seek( End ) );
      }
    }
    else
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "Could not read '%s' atom.", pAtom->Name );
    }
    if( i_FixedSize != 0 && AtomSize != i_FixedSize )
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "Read '%s' atom, but size was %d, and not %d as expected.", pAtom->Name,
                 AtomSize, i_FixedSize );
    return bOk;
  }

  // The nine words of an identity matrix, as every accepted header stores it.
  inline bool ExpectIdentityMatrix( VMovPrimitiveReader& io_rReader )
  {
    return io_rReader.ExpectU32( 0x00010000 ) && io_rReader.ExpectU32( 0 ) && io_rReader.ExpectU32( 0 ) &&
           io_rReader.ExpectU32( 0 ) && io_rReader.ExpectU32( 0x00010000 ) && io_rReader.ExpectU32( 0 ) &&
           io_rReader.ExpectU32( 0 ) && io_rReader.ExpectU32( 0 ) && io_rReader.ExpectU32( 0x40000000 );
  }

  // Whether a table of i_Count entries of i_EntrySize bytes, starting at the reader's position,
  // fits inside an atom that ends at i_AtomEnd. Tables are sized by counts from the file, so
  // nothing is allocated before this holds.
  inline bool TableFitsInAtom( const VMovPrimitiveReader& i_rReader, std::uint64_t i_AtomEnd, std::uint64_t i_Count,
                               std::uint64_t i_EntrySize )
  {
    return i_rReader.Tell() <= i_AtomEnd && i_Count * i_EntrySize <= i_AtomEnd - i_rReader.Tell();
  }
} // namespace MovIO
