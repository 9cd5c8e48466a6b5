#include "fileio/JPEGUtils/JPEGParser.h"

#include "services/Log.h"

#include <algorithm>
#include <boost/format.hpp>
#include <cctype>

namespace JPEGUtils
{
  namespace
  {
    constexpr std::uint8_t MarkerSOS = 0xDA;
    constexpr std::uint8_t MarkerSOI = 0xD8;
    constexpr std::uint8_t MarkerEOI = 0xD9;
    constexpr std::uint8_t MarkerAPP0 = 0xE0;
    constexpr std::uint8_t MarkerCOM = 0xFE;
    // A comment is shown up to this many characters.
    constexpr std::uint64_t CommentShown = 80;

    // Markers of this range carry no length: RST0 to RST7, SOI and EOI. Every other code is
    // followed by a 16-bit big-endian length.
    bool IsFixedSize( std::uint8_t i_Marker )
    {
      return i_Marker >= 0xD0 && i_Marker <= MarkerEOI;
    }

    struct VMarkerRow
    {
      std::uint8_t First;
      std::uint8_t Last;
      // A range's name is the prefix and the code's distance from NumberBase.
      const char* pName;
      std::uint8_t NumberBase;
      // Null: the description is the name.
      const char* pDescription;
    };

    constexpr std::uint8_t Unnumbered = 0xFF;

    constexpr VMarkerRow s_Markers[] = {
        { 0xC0, 0xC0, "SOF", 0xC0, "Start of frame\n  Type: Nondifferential/Huffman/Baseline DCT" },
        { 0xC1, 0xC1, "SOF", 0xC0, "Start of frame\n  Type: Nondifferential/Huffman/Sequential DCT" },
        { 0xC2, 0xC2, "SOF", 0xC0, "Start of frame\n  Type: Nondifferential/Huffman/Progressive DCT" },
        { 0xC3, 0xC3, "SOF", 0xC0, "Start of frame\n  Type: Nondifferential/Huffman/Lossless" },
        { 0xC4, 0xC4, "DHT", Unnumbered, "Define Huffman table" },
        { 0xC5, 0xC5, "SOF", 0xC0, "Start of frame\n  Type: Differential/Huffman/Sequential DCT" },
        { 0xC6, 0xC6, "SOF", 0xC0, "Start of frame\n  Type: Differential/Huffman/Progressive DCT" },
        { 0xC7, 0xC7, "SOF", 0xC0, "Start of frame\n  Type: Differential/Huffman/Lossless" },
        { 0xC8, 0xC8, "JPG", Unnumbered, "Reserved for extensions" },
        { 0xC9, 0xC9, "SOF", 0xC0, "Start of frame\n  Type: Nondifferential/Arithmetic/Sequential DCT" },
        { 0xCA, 0xCA, "SOF", 0xC0, "Start of frame\n  Type: Nondifferential/Arithmetic/Progressive DCT" },
        { 0xCB, 0xCB, "SOF", 0xC0, "Start of frame\n  Type: Nondifferential/Arithmetic/Lossless" },
        { 0xCC, 0xCC, "DAC", Unnumbered, "Define arithmetic table" },
        { 0xCD, 0xCD, "SOF", 0xC0, "Start of frame\n  Type: Differential/Arithmetic/Sequential DCT" },
        { 0xCE, 0xCE, "SOF", 0xC0, "Start of frame\n  Type: Differential/Arithmetic/Progressive DCT" },
        { 0xCF, 0xCF, "SOF", 0xC0, "Start of frame\n  Type: Differential/Arithmetic/Lossless" },
        { 0xD0, 0xD7, "RST", 0xD0, "Resync marker" },
        { 0xD8, 0xD8, "SOI", Unnumbered, "Start of image" },
        { 0xD9, 0xD9, "EOI", Unnumbered, "End of image" },
        { 0xDA, 0xDA, "SOS", Unnumbered, "Start of scan" },
        { 0xDB, 0xDB, "DQT", Unnumbered, "Define quantization table" },
        { 0xDC, 0xDC, "DNL", Unnumbered, "Define number of lines" },
        { 0xDD, 0xDD, "DRI", Unnumbered, "Define restart interval" },
        { 0xDE, 0xDE, "DHP", Unnumbered, "Define hierarchical progression" },
        { 0xDF, 0xDF, "EXP", Unnumbered, "Expand reference components" },
        { 0xE0, 0xE0, "APP", 0xE0, "Application specific\n  FourCC: '%c%c%c%c'" },
        { 0xE1, 0xE1, "APP", 0xE0, "Application specific (eg EXIF)" },
        { 0xE2, 0xE2, "APP", 0xE0, "Application specific (eg XMP, ICC, Flashpix)" },
        { 0xE3, 0xEC, "APP", 0xE0, nullptr },
        { 0xED, 0xED, "APP", 0xE0, "Application specific (eg Adobe Photoshop, IPTC)" },
        { 0xEE, 0xEF, "APP", 0xE0, nullptr },
        { 0xFE, 0xFE, "COM", Unnumbered, "Comment\n  Text: \"" },
    };

    const VMarkerRow* FindMarker( std::uint8_t i_Marker )
    {
      for( const VMarkerRow& rRow : s_Markers )
        if( i_Marker >= rRow.First && i_Marker <= rRow.Last )
          return &rRow;
      return nullptr;
    }

    // Reads a range of the stream through a window, so that the byte scan over entropy-coded
    // data costs one stream call per window rather than one per byte.
    class VByteWindow
    {
    public:
      VByteWindow( ZOL::IInputStreamSeekable& io_rStream, std::uint64_t i_Start, std::uint64_t i_End )
          : m_rStream( io_rStream ), m_Position( i_Start ), m_End( i_End )
      {
      }

      std::uint64_t Position() const { return m_Position; }
      bool Good() const { return m_bGood; }
      void Seek( std::uint64_t i_Position ) { m_Position = i_Position; }

      // The byte at the position, moving one on. A read beyond the range or the stream spoils
      // the window for good.
      bool Next( std::uint8_t& o_rByte )
      {
        if( m_Position < m_WindowStart || m_Position >= m_WindowStart + m_WindowSize )
          if( !Fill() )
            return false;
        o_rByte = m_Window[m_Position - m_WindowStart];
        ++m_Position;
        return true;
      }

    private:
      bool Fill()
      {
        m_WindowSize = 0;
        if( !m_bGood || m_Position >= m_End || m_Position > static_cast< std::uint64_t >( INT64_MAX ) )
          return m_bGood = false;
        const std::uint64_t Count = std::min< std::uint64_t >( sizeof( m_Window ), m_End - m_Position );
        if( !m_rStream.Seek( static_cast< std::int64_t >( m_Position ) ) || !m_rStream.Read( m_Window, Count ) )
          return m_bGood = false;
        m_WindowStart = m_Position;
        m_WindowSize = Count;
        return true;
      }

      ZOL::IInputStreamSeekable& m_rStream;
      std::uint64_t m_Position;
      std::uint64_t m_End;
      std::uint64_t m_WindowStart = 0;
      std::uint64_t m_WindowSize = 0;
      bool m_bGood = true;
      std::uint8_t m_Window[4096];
    };

    bool CheckSegmentSequence( const std::vector< VJPEGSegment >& i_rSegments )
    {
      if( i_rSegments.size() < 4 )
      {
        LUMEK_LOG( "JPEGIO", ZOL::LogFailure, "Not enough segments.  Data may be truncated or corrupt." );
        return false;
      }
      if( i_rSegments.front().Marker != MarkerSOI )
      {
        LUMEK_LOG( "JPEGIO", ZOL::LogFailure, "Missing SOI marker." );
        return false;
      }
      if( i_rSegments.back().Marker != MarkerEOI )
      {
        LUMEK_LOG( "JPEGIO", ZOL::LogFailure, "Missing EOI marker." );
        return false;
      }
      return true;
    }

    // Up to i_Count bytes of a segment's payload; fewer when the segment or the stream ends.
    std::string PayloadText( ZOL::IInputStreamSeekable& io_rStream, const VJPEGSegment& i_rSegment,
                             std::uint64_t i_Count )
    {
      std::string Text;
      if( i_rSegment.Length <= 4 || i_rSegment.Start > static_cast< std::uint64_t >( INT64_MAX ) - 4 )
        return Text;
      const std::uint64_t Count = std::min( i_Count, i_rSegment.Length - 4 );
      if( !io_rStream.Seek( static_cast< std::int64_t >( i_rSegment.Start + 4 ) ) )
        return Text;
      for( std::uint64_t i = 0; i < Count; ++i )
      {
        std::uint8_t Byte = 0;
        if( !io_rStream.Read( &Byte, 1 ) )
          break;
        // The table stays one row a segment whatever the file holds.
        Text += std::isprint( Byte ) ? static_cast< char >( Byte ) : '.';
      }
      return Text;
    }

    std::string Describe( const VJPEGSegment& i_rSegment, ZOL::IInputStreamSeekable& io_rStream )
    {
      const VMarkerRow* pRow = FindMarker( i_rSegment.Marker );
      if( pRow == nullptr )
        return "Unknown marker";
      if( pRow->pDescription == nullptr )
        return JPEGMarkerName( i_rSegment.Marker );
      if( i_rSegment.Marker == MarkerAPP0 )
      {
        std::string FourCC = PayloadText( io_rStream, i_rSegment, 4 );
        FourCC.resize( 4, ' ' );
        return ( boost::format( pRow->pDescription ) % FourCC[0] % FourCC[1] % FourCC[2] % FourCC[3] ).str();
      }
      if( i_rSegment.Marker == MarkerCOM )
        return pRow->pDescription + PayloadText( io_rStream, i_rSegment, CommentShown ) + "\"";
      return pRow->pDescription;
    }
  } // namespace

  std::string JPEGMarkerName( std::uint8_t i_Marker )
  {
    const VMarkerRow* pRow = FindMarker( i_Marker );
    if( pRow == nullptr )
      return ( boost::format( "0xff%02x" ) % static_cast< unsigned >( i_Marker ) ).str();
    if( pRow->NumberBase == Unnumbered )
      return pRow->pName;
    return pRow->pName + std::to_string( i_Marker - pRow->NumberBase );
  }

  bool ParseJPEG( ZOL::IInputStreamSeekable& io_rStream, std::uint64_t i_Length,
                  std::vector< VJPEGSegment >& o_rSegments )
  {
    o_rSegments.clear();
    std::uint64_t Begin = 0;
    if( !io_rStream.GetPosition( Begin ) || i_Length > UINT64_MAX - Begin )
      return false;
    const std::uint64_t End = Begin + i_Length;
    VByteWindow Window( io_rStream, Begin, End );
    // Set by the first SOS and kept: everything after it may be entropy-coded data, in which
    // only markers count.
    bool bInScan = false;
    while( Window.Position() < End && Window.Good() )
    {
      const std::uint64_t Start = Window.Position();
      std::uint8_t First = 0;
      if( !Window.Next( First ) )
        break;
      if( First != 0xFF )
      {
        if( !bInScan )
        {
          LUMEK_LOG( "JPEGIO", ZOL::LogFailure, "Unrecognised data found in buffer at 0x%x", Start );
          return false;
        }
        // Entropy-coded data, or bytes after the image: only a marker ends them, and the last
        // byte of the range may be one of them.
        continue;
      }
      std::uint8_t Second = 0;
      if( !Window.Next( Second ) )
        break;
      if( Second == 0 )
      {
        if( bInScan )
          continue; // a stuffed 0xFF of the entropy-coded data
        LUMEK_LOG( "JPEGIO", ZOL::LogFailure, "0xff00 found outside of image scan." );
        return false;
      }
      if( IsFixedSize( Second ) )
      {
        o_rSegments.push_back( { Second, Start, 2 } );
        continue;
      }
      std::uint8_t High = 0;
      std::uint8_t Low = 0;
      if( !Window.Next( High ) || !Window.Next( Low ) )
        break;
      const std::uint64_t Length = ( static_cast< std::uint64_t >( High ) << 8 | Low ) + 2;
      o_rSegments.push_back( { Second, Start, Length } );
      Window.Seek( Start + Length );
      if( Second == MarkerSOS )
        bInScan = true;
    }
    if( Window.Position() != End || !Window.Good() )
    {
      LUMEK_LOG( "JPEGIO", ZOL::LogFailure, "Did not end cleanly.  Data may be truncated or corrupt." );
      return false;
    }
    return CheckSegmentSequence( o_rSegments );
  }

  std::string DumpJPEG( const std::vector< VJPEGSegment >& i_rSegments, ZOL::IInputStreamSeekable& io_rStream )
  {
    std::string Table = "Type\tStart\tEnd\tLength\tDescription\n";
    for( const VJPEGSegment& rSegment : i_rSegments )
      Table += ( boost::format( "%s\t%d\t%d\t%d\t%s\n" ) % JPEGMarkerName( rSegment.Marker ) % rSegment.Start %
                 ( rSegment.Start + rSegment.Length ) % rSegment.Length % Describe( rSegment, io_rStream ) )
                   .str();
    return Table;
  }
} // namespace JPEGUtils
