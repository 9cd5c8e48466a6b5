#pragma once

// Byte handling between the containers and the H.264 decoder: length-prefixed samples (the MOV
// form, 4-byte big-endian lengths) and the Annex B byte stream, inspection of NAL units, and a
// text dump of one unit.

#include "fileio/H264Utils/H264Enumerations.h"
#include "fileio/H264Utils/H264ParameterSets.h"
#include "videointerface/IBuffer.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <ostream>
#include <vector>

namespace H264Utils
{
  inline constexpr std::uint8_t s_H264StartCode4Bytes[4] = { 0, 0, 0, 1 };

  using VBufferList = std::vector< std::shared_ptr< const ZOL::IBufferConst > >;

  // How the units of a buffer are delimited.
  enum class EH264StreamForm
  {
    LengthPrefixed,
    AnnexB,
  };

  // The four start code bytes as one shared buffer, so that a gather list can put start codes
  // between buffers without copying them.
  const std::shared_ptr< const ZOL::IBufferConst >& StartCodeBuffer();

  // Copies the sample and turns each 4-byte length into a start code. True if the lengths
  // walked to the end exactly; a length past the end stops the walk.
  [[nodiscard]] bool LengthPrefixedToAnnexB( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                             std::shared_ptr< ZOL::IBuffer >& o_rBuffer,
                                             ZOL::IBufferAllocator& i_rAllocator );
  // Start codes of 3 or 4 bytes to 4-byte big-endian lengths. Bytes before the first start
  // code are no unit and are dropped.
  [[nodiscard]] bool AnnexBToLengthPrefixed( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                             std::shared_ptr< ZOL::IBuffer >& o_rBuffer,
                                             ZOL::IBufferAllocator& i_rAllocator );

  // Whether a unit of the type is in the buffer. A unit whose header is broken ends the search.
  [[nodiscard]] bool ContainsNALUnit( const ZOL::IBufferConst& i_rBuffer, std::uint32_t i_NALUnitType,
                                      EH264StreamForm i_Form = EH264StreamForm::LengthPrefixed );
  // Calls i_rVisit( pUnit, Size ) for each unit, header first, until it answers false. True if
  // the buffer was walked to its end exactly.
  template < typename TVisit >
  bool ForEachNALUnit( const std::uint8_t* i_pData, std::uint64_t i_Size, EH264StreamForm i_Form, TVisit&& i_rVisit );

  // One buffer of the parts in order; the list is emptied. A list of one is handed back as it is.
  std::shared_ptr< const ZOL::IBufferConst > JoinBuffers( VBufferList& io_rBuffers,
                                                          ZOL::IBufferAllocator& i_rAllocator );

  // 'P', 'B' or 'I' for a coded slice unit (header included).
  [[nodiscard]] bool GetSliceType( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, char& o_SliceType );
  // True if exactly one unit of the length-prefixed buffer is a slice and the walk ended exactly.
  [[nodiscard]] bool IsSingleSlice( const ZOL::IBufferConst& i_rBuffer, char& o_SliceType );

  // A text dump of one unit (header included); an SPS lets picture timing be read.
  void DescribeNALUnit( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, std::ostream& io_rStream,
                        unsigned i_Indent, const std::optional< VH264SPS >& i_rSPS );

  // Finds the next 00 00 01 at or after i_From; i_Size when there is none.
  std::uint64_t FindStartCode( const std::uint8_t* i_pData, std::uint64_t i_Size, std::uint64_t i_From );

  template < typename TVisit >
  bool ForEachNALUnit( const std::uint8_t* i_pData, std::uint64_t i_Size, EH264StreamForm i_Form, TVisit&& i_rVisit )
  {
    if( i_pData == nullptr )
      return i_Size == 0;
    if( i_Form == EH264StreamForm::LengthPrefixed )
    {
      std::uint64_t Position = 0;
      while( Position < i_Size )
      {
        if( i_Size - Position < 4 )
          return false;
        const std::uint8_t* p = i_pData + Position;
        const std::uint64_t Length = ( std::uint64_t( p[0] ) << 24 ) | ( p[1] << 16 ) | ( p[2] << 8 ) | p[3];
        if( Length > i_Size - Position - 4 )
          return false;
        if( !i_rVisit( p + 4, Length ) )
          return true;
        Position += 4 + Length;
      }
      return true;
    }
    std::uint64_t Start = FindStartCode( i_pData, i_Size, 0 );
    while( Start < i_Size )
    {
      const std::uint64_t UnitStart = Start + 3;
      const std::uint64_t Next = FindStartCode( i_pData, i_Size, UnitStart );
      // The zero before a following 00 00 01 is the first byte of its 4-byte start code.
      std::uint64_t UnitEnd = Next;
      if( Next < i_Size && UnitEnd > UnitStart && i_pData[UnitEnd - 1] == 0 )
        --UnitEnd;
      if( !i_rVisit( i_pData + UnitStart, UnitEnd - UnitStart ) )
        return true;
      Start = Next;
    }
    return true;
  }
} // namespace H264Utils
