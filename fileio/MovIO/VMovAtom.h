#pragma once

// The atom tree of a MOV file: one node per atom, children only for the (parent, child) pairs
// of the container table. Everything else stays a leaf that the walk skips by its size, so an
// atom this reader does not know is never an error.

#include "fileio/MovIO/VMovPrimitiveReader.h"

#include <cstdint>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

namespace MovIO
{
  struct VMovAtom
  {
    // The FourCC's bytes in file order, cut at the first zero byte.
    std::string Name;
    // 0 marks a synthetic root: the file, or the extensions of a sample description.
    std::uint32_t Type = 0;
    std::uint64_t Position = 0;
    // The 32-bit size field as stored: 1 for an atom with a 64-bit size, which therefore
    // never gets children.
    std::uint64_t Size = 0;
    std::vector< std::shared_ptr< VMovAtom > > Children;
  };

  using VAtomPath = std::vector< const char* >;

  // No real file nests deeper than the container table allows (six levels); this guards the
  // recursion against a table that someone widens by mistake.
  constexpr unsigned MaxAtomDepth = 16;

  // Whether an atom of type i_Child under an atom of type i_Parent is descended into.
  bool IsContainerPair( std::uint32_t i_Parent, std::uint32_t i_Child );

  // Reads the children of io_rAtom from the reader's current position up to the atom's end.
  [[nodiscard]] bool BuildAtomTree( VMovPrimitiveReader& io_rReader, VMovAtom& io_rAtom, unsigned i_Depth = 0 );

  // Walks i_rPath from element i_Index on, trying every child of the right type in turn (so a
  // path through the first of two 'mdia' atoms that ends nowhere goes on in the second).
  // Null when nothing matches.
  const VMovAtom* FindAtom( const VMovAtom& i_rAtom, const VAtomPath& i_rPath, std::size_t i_Index = 0 );

  // One line per atom, depth first, indented by one blank a level; the root is an empty line.
  void WriteAtomTree( const VMovAtom& i_rAtom, std::ostream& o_rStream, unsigned i_Depth = 0 );
} // namespace MovIO
