#pragma once

#include <string>

// Both readers of a reply recurse once per nesting level and know no limit of their own. These
// scans find how deep a text would take them, reading it the way each reader does, so that a
// reply nested too deep is refused before it is parsed. They stop as soon as the limit is passed.

namespace VersionCheck
{
  struct IMarkupDepth
  {
    int Depth = 0;          // the deepest level reached, at most one past the limit
    unsigned long Line = 1; // the line where the scan stopped
  };

  // Nesting of JSON arrays and objects; brackets inside strings do not count.
  IMarkupDepth JsonNestingDepth( const std::string& i_rText, int i_Limit );

  // Nesting of elements with contents as RapidXml reads them: comments, CDATA, processing
  // instructions and document types hold no elements, quoted attribute values hide "/>", and the
  // scan ends where RapidXml would give up on a malformed tag. RapidXml never goes deeper than
  // this plus one, for a self-closed element at the bottom.
  IMarkupDepth XmlNestingDepth( const std::string& i_rText, int i_Limit );
} // namespace VersionCheck
