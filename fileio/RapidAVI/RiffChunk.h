#pragma once

// The pieces of a RIFF file that the AVI reader walks: chunks, FourCCs and index entries.

#include <cstdint>
#include <string>
#include <vector>

namespace RapidAVI
{
  // A FourCC as the four bytes appear in the file, read as a little-endian word.
  constexpr std::uint32_t MakeFourCC( const char ( &i_rText )[5] )
  {
    return static_cast< std::uint32_t >( static_cast< std::uint8_t >( i_rText[0] ) ) |
           static_cast< std::uint32_t >( static_cast< std::uint8_t >( i_rText[1] ) ) << 8 |
           static_cast< std::uint32_t >( static_cast< std::uint8_t >( i_rText[2] ) ) << 16 |
           static_cast< std::uint32_t >( static_cast< std::uint8_t >( i_rText[3] ) ) << 24;
  }

  // The characters of a FourCC in file order.
  std::string FourCCText( std::uint32_t i_FourCC );

  struct VRiffChunk
  {
    // 0 for the synthetic root.
    std::uint32_t Id = 0;
    // The list's type for a LIST chunk; a RIFF chunk's form type is not kept, it stays 0.
    std::uint32_t ListType = 0;
    // First header byte.
    std::uint64_t Position = 0;
    // The size field as stored: the header is not counted.
    std::uint64_t Size = 0;
    std::vector< VRiffChunk > Children;
  };

  struct VAviIndexEntry
  {
    // Absolute position of the payload.
    std::uint64_t Offset = 0;
    std::uint64_t Size = 0;
  };

  using VAviIndexTable = std::vector< VAviIndexEntry >;

  // Whether i_Size bytes from i_Position lie inside a file of i_FileSize bytes.
  constexpr bool FitsInFile( std::uint64_t i_Position, std::uint64_t i_Size, std::uint64_t i_FileSize )
  {
    return i_Size <= i_FileSize && i_Position <= i_FileSize - i_Size;
  }

  // Little-endian fields of a header read as a block.
  inline std::uint64_t LoadLE( const std::uint8_t* i_pBytes, int i_Width )
  {
    std::uint64_t Value = 0;
    for( int i = 0; i < i_Width; ++i )
      Value |= static_cast< std::uint64_t >( i_pBytes[i] ) << ( 8 * i );
    return Value;
  }
  inline std::uint32_t LoadLE32( const std::uint8_t* i_pBytes )
  {
    return static_cast< std::uint32_t >( LoadLE( i_pBytes, 4 ) );
  }
  inline std::uint16_t LoadLE16( const std::uint8_t* i_pBytes )
  {
    return static_cast< std::uint16_t >( LoadLE( i_pBytes, 2 ) );
  }

  // "00dc", or "LIST-movi" for a list.
  std::string GetChunkText( const VRiffChunk& i_rChunk );

  namespace FourCC
  {
    constexpr std::uint32_t RIFF = MakeFourCC( "RIFF" );
    constexpr std::uint32_t LIST = MakeFourCC( "LIST" );
    constexpr std::uint32_t AVI = MakeFourCC( "AVI " );
    constexpr std::uint32_t AVIX = MakeFourCC( "AVIX" );
    constexpr std::uint32_t QMDT = MakeFourCC( "QMDT" );
    constexpr std::uint32_t hdrl = MakeFourCC( "hdrl" );
    constexpr std::uint32_t strl = MakeFourCC( "strl" );
    constexpr std::uint32_t odml = MakeFourCC( "odml" );
    constexpr std::uint32_t movi = MakeFourCC( "movi" );
    constexpr std::uint32_t INFO = MakeFourCC( "INFO" );
    constexpr std::uint32_t avih = MakeFourCC( "avih" );
    constexpr std::uint32_t strh = MakeFourCC( "strh" );
    constexpr std::uint32_t strf = MakeFourCC( "strf" );
    constexpr std::uint32_t indx = MakeFourCC( "indx" );
    constexpr std::uint32_t dmlh = MakeFourCC( "dmlh" );
    constexpr std::uint32_t ISFT = MakeFourCC( "ISFT" );
    constexpr std::uint32_t ISMP = MakeFourCC( "ISMP" );
    constexpr std::uint32_t ix00 = MakeFourCC( "ix00" );
    constexpr std::uint32_t ix01 = MakeFourCC( "ix01" );
    constexpr std::uint32_t idx1 = MakeFourCC( "idx1" );
    constexpr std::uint32_t JUNK = MakeFourCC( "JUNK" );
    constexpr std::uint32_t VideoBits = MakeFourCC( "00db" );
    constexpr std::uint32_t VideoCompressed = MakeFourCC( "00dc" );
    constexpr std::uint32_t AudioWave = MakeFourCC( "01wb" );
    constexpr std::uint32_t vids = MakeFourCC( "vids" );
    constexpr std::uint32_t auds = MakeFourCC( "auds" );
  } // namespace FourCC
} // namespace RapidAVI
