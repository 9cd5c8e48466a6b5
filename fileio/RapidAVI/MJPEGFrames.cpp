// Motion JPEG frames. Frames that are whole JPEG files go to the decoder as they are stored;
// frames in the AVI1 form, which leaves out the Huffman tables, are rebuilt into whole files
// with the typical tables of ITU-T T.81 Annex K.3.

#include "fileio/RapidAVI/MJPEGFrames.h"
#include "fileio/JPEGUtils/JPEGParser.h"
#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "services/Log.h"
#include "utils/MemoryStream.h"

#include <algorithm>
#include <cstring>

namespace RapidAVI
{
  namespace
  {
    constexpr std::uint8_t MarkerDHT = 0xC4;
    constexpr std::uint8_t MarkerSOS = 0xDA;
    constexpr std::uint8_t MarkerAPP0 = 0xE0;

    // SOI and a JFIF APP0 of version 1.1, no density, no thumbnail.
    constexpr std::uint8_t s_StartOfImage[] = { 0xFF, 0xD8, 0xFF, 0xE0, 0x00, 0x10, 'J',  'F',  'I',  'F',
                                                0x00, 0x01, 0x01, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00 };

    // One DHT segment with the four tables in the order DC 0, DC 1, AC 0, AC 1: class and
    // identifier, the 16 code counts by length, the values.
    constexpr std::uint8_t s_TypicalHuffmanTables[] = {
        0xFF,
        0xC4,
        0x01,
        0xA2,
        // DC luminance (K.3.3.1).
        0x00,
        0x00,
        0x01,
        0x05,
        0x01,
        0x01,
        0x01,
        0x01,
        0x01,
        0x01,
        0x00,
        0x00,
        0x00,
        0x00,
        0x00,
        0x00,
        0x00,
        0x00,
        0x01,
        0x02,
        0x03,
        0x04,
        0x05,
        0x06,
        0x07,
        0x08,
        0x09,
        0x0A,
        0x0B,
        // DC chrominance.
        0x01,
        0x00,
        0x03,
        0x01,
        0x01,
        0x01,
        0x01,
        0x01,
        0x01,
        0x01,
        0x01,
        0x01,
        0x00,
        0x00,
        0x00,
        0x00,
        0x00,
        0x00,
        0x01,
        0x02,
        0x03,
        0x04,
        0x05,
        0x06,
        0x07,
        0x08,
        0x09,
        0x0A,
        0x0B,
        // AC luminance (K.3.3.2).
        0x10,
        0x00,
        0x02,
        0x01,
        0x03,
        0x03,
        0x02,
        0x04,
        0x03,
        0x05,
        0x05,
        0x04,
        0x04,
        0x00,
        0x00,
        0x01,
        0x7D,
        0x01,
        0x02,
        0x03,
        0x00,
        0x04,
        0x11,
        0x05,
        0x12,
        0x21,
        0x31,
        0x41,
        0x06,
        0x13,
        0x51,
        0x61,
        0x07,
        0x22,
        0x71,
        0x14,
        0x32,
        0x81,
        0x91,
        0xA1,
        0x08,
        0x23,
        0x42,
        0xB1,
        0xC1,
        0x15,
        0x52,
        0xD1,
        0xF0,
        0x24,
        0x33,
        0x62,
        0x72,
        0x82,
        0x09,
        0x0A,
        0x16,
        0x17,
        0x18,
        0x19,
        0x1A,
        0x25,
        0x26,
        0x27,
        0x28,
        0x29,
        0x2A,
        0x34,
        0x35,
        0x36,
        0x37,
        0x38,
        0x39,
        0x3A,
        0x43,
        0x44,
        0x45,
        0x46,
        0x47,
        0x48,
        0x49,
        0x4A,
        0x53,
        0x54,
        0x55,
        0x56,
        0x57,
        0x58,
        0x59,
        0x5A,
        0x63,
        0x64,
        0x65,
        0x66,
        0x67,
        0x68,
        0x69,
        0x6A,
        0x73,
        0x74,
        0x75,
        0x76,
        0x77,
        0x78,
        0x79,
        0x7A,
        0x83,
        0x84,
        0x85,
        0x86,
        0x87,
        0x88,
        0x89,
        0x8A,
        0x92,
        0x93,
        0x94,
        0x95,
        0x96,
        0x97,
        0x98,
        0x99,
        0x9A,
        0xA2,
        0xA3,
        0xA4,
        0xA5,
        0xA6,
        0xA7,
        0xA8,
        0xA9,
        0xAA,
        0xB2,
        0xB3,
        0xB4,
        0xB5,
        0xB6,
        0xB7,
        0xB8,
        0xB9,
        0xBA,
        0xC2,
        0xC3,
        0xC4,
        0xC5,
        0xC6,
        0xC7,
        0xC8,
        0xC9,
        0xCA,
        0xD2,
        0xD3,
        0xD4,
        0xD5,
        0xD6,
        0xD7,
        0xD8,
        0xD9,
        0xDA,
        0xE1,
        0xE2,
        0xE3,
        0xE4,
        0xE5,
        0xE6,
        0xE7,
        0xE8,
        0xE9,
        0xEA,
        0xF1,
        0xF2,
        0xF3,
        0xF4,
        0xF5,
        0xF6,
        0xF7,
        0xF8,
        0xF9,
        0xFA,
        // AC chrominance.
        0x11,
        0x00,
        0x02,
        0x01,
        0x02,
        0x04,
        0x04,
        0x03,
        0x04,
        0x07,
        0x05,
        0x04,
        0x04,
        0x00,
        0x01,
        0x02,
        0x77,
        0x00,
        0x01,
        0x02,
        0x03,
        0x11,
        0x04,
        0x05,
        0x21,
        0x31,
        0x06,
        0x12,
        0x41,
        0x51,
        0x07,
        0x61,
        0x71,
        0x13,
        0x22,
        0x32,
        0x81,
        0x08,
        0x14,
        0x42,
        0x91,
        0xA1,
        0xB1,
        0xC1,
        0x09,
        0x23,
        0x33,
        0x52,
        0xF0,
        0x15,
        0x62,
        0x72,
        0xD1,
        0x0A,
        0x16,
        0x24,
        0x34,
        0xE1,
        0x25,
        0xF1,
        0x17,
        0x18,
        0x19,
        0x1A,
        0x26,
        0x27,
        0x28,
        0x29,
        0x2A,
        0x35,
        0x36,
        0x37,
        0x38,
        0x39,
        0x3A,
        0x43,
        0x44,
        0x45,
        0x46,
        0x47,
        0x48,
        0x49,
        0x4A,
        0x53,
        0x54,
        0x55,
        0x56,
        0x57,
        0x58,
        0x59,
        0x5A,
        0x63,
        0x64,
        0x65,
        0x66,
        0x67,
        0x68,
        0x69,
        0x6A,
        0x73,
        0x74,
        0x75,
        0x76,
        0x77,
        0x78,
        0x79,
        0x7A,
        0x82,
        0x83,
        0x84,
        0x85,
        0x86,
        0x87,
        0x88,
        0x89,
        0x8A,
        0x92,
        0x93,
        0x94,
        0x95,
        0x96,
        0x97,
        0x98,
        0x99,
        0x9A,
        0xA2,
        0xA3,
        0xA4,
        0xA5,
        0xA6,
        0xA7,
        0xA8,
        0xA9,
        0xAA,
        0xB2,
        0xB3,
        0xB4,
        0xB5,
        0xB6,
        0xB7,
        0xB8,
        0xB9,
        0xBA,
        0xC2,
        0xC3,
        0xC4,
        0xC5,
        0xC6,
        0xC7,
        0xC8,
        0xC9,
        0xCA,
        0xD2,
        0xD3,
        0xD4,
        0xD5,
        0xD6,
        0xD7,
        0xD8,
        0xD9,
        0xDA,
        0xE2,
        0xE3,
        0xE4,
        0xE5,
        0xE6,
        0xE7,
        0xE8,
        0xE9,
        0xEA,
        0xF2,
        0xF3,
        0xF4,
        0xF5,
        0xF6,
        0xF7,
        0xF8,
        0xF9,
        0xFA,
    };
    static_assert( sizeof( s_TypicalHuffmanTables ) == 420, "one DHT segment of 418 bytes and its marker" );
    static_assert( sizeof( s_StartOfImage ) + sizeof( s_TypicalHuffmanTables ) == 440, "the rebuilt head" );

    // A JFIF APP0 or a DHT of its own ahead of the first scan makes a frame a whole JPEG file.
    bool IsWholeJPEG( const std::vector< JPEGUtils::VJPEGSegment >& i_rSegments, const std::uint8_t* i_pData,
                      std::uint64_t i_Size )
    {
      for( const JPEGUtils::VJPEGSegment& rSegment : i_rSegments )
      {
        if( rSegment.Marker == MarkerSOS )
          return false;
        if( rSegment.Marker == MarkerDHT )
          return true;
        if( rSegment.Marker == MarkerAPP0 && FitsInFile( rSegment.Start, 8, i_Size ) &&
            std::memcmp( i_pData + rSegment.Start + 4, "JFIF", 4 ) == 0 )
          return true;
      }
      return false;
    }
  } // namespace

  const std::uint8_t* TypicalHuffmanTableSegment( std::size_t& o_rSize )
  {
    o_rSize = sizeof( s_TypicalHuffmanTables );
    return s_TypicalHuffmanTables;
  }

  bool VRapidAVIReader::ReadMJPEG( const VAviIndexEntry& i_rEntry, std::shared_ptr< ZOL::IBuffer >& o_rVideo )
  {
    // The frame is read once; the markers are found in memory.
    std::shared_ptr< ZOL::IBuffer > pStored;
    if( !ReadEntry( i_rEntry, pStored ) )
      return false;
    const std::uint8_t* pData = pStored->GetData();
    const std::uint64_t Size = pStored->GetSize();
    std::vector< JPEGUtils::VJPEGSegment > Segments;
    UtilsIO::VMemoryInputStream Stream( pData, Size );
    if( !JPEGUtils::ParseJPEG( Stream, Size, Segments ) )
      return false;
    if( Segments.size() < 3 )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "MJPEG frame has fewer than three JPEG markers." );
      return false;
    }
    if( IsWholeJPEG( Segments, pData, Size ) )
    {
      o_rVideo = std::move( pStored );
      return true;
    }

    const JPEGUtils::VJPEGSegment& rApp = Segments[1];
    if( rApp.Marker != MarkerAPP0 )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "MJPEG not in expected format for AVI: missing APP0." );
      return false;
    }
    if( !FitsInFile( rApp.Start, 8, Size ) || std::memcmp( pData + rApp.Start + 4, "AVI1", 4 ) != 0 )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "MJPEG not in expected format for AVI: APP0 is not 'AVI1' type." );
      return false;
    }
    // Byte 8 is the field polarity: 0 for a progressive frame.
    if( !FitsInFile( rApp.Start, 18, Size ) )
      return false;
    if( pData[rApp.Start + 8] != 0 )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "MJPEG not in expected format: Interlaced MJPEG not supported." );
      return false;
    }

    // Everything from the third marker on follows the new head.
    const std::uint64_t Tail = Segments[2].Start;
    const std::uint64_t Length = Size - Tail;
    std::shared_ptr< ZOL::IBuffer > pWhole;
    m_pAllocator->Allocate( pWhole, Length + sizeof( s_StartOfImage ) + sizeof( s_TypicalHuffmanTables ) );
    if( !pWhole )
      return false;
    std::uint8_t* pOut = pWhole->GetData();
    pOut = std::copy( std::begin( s_StartOfImage ), std::end( s_StartOfImage ), pOut );
    pOut = std::copy( std::begin( s_TypicalHuffmanTables ), std::end( s_TypicalHuffmanTables ), pOut );
    std::memcpy( pOut, pData + Tail, static_cast< std::size_t >( Length ) );
    o_rVideo = std::move( pWhole );
    return true;
  }
} // namespace RapidAVI
