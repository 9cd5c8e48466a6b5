#include "MovTestSupport.h"

#include <boost/filesystem.hpp>

#include <cstring>
#include <fstream>

namespace MovTest
{
  VLogCapture::VLogCapture()
  {
    m_Handle = ZOL::GlobalLog().AddSink(
        [this]( const ZOL::ILogRecord& i_rRecord )
        {
          if( i_rRecord.Category == "MovIO" )
            m_Lines.push_back( std::to_string( i_rRecord.Level ) + " " + i_rRecord.Message );
        },
        ZOL::LogDetail );
  }

  VLogCapture::~VLogCapture()
  {
    ZOL::GlobalLog().RemoveSink( m_Handle );
  }

  bool VLogCapture::Contains( const std::string& i_rLine ) const
  {
    for( const std::string& rLine : m_Lines )
      if( rLine == i_rLine )
        return true;
    return false;
  }

  std::string VLogCapture::Text() const
  {
    std::string Text;
    for( const std::string& rLine : m_Lines )
      Text += rLine + "\n";
    return Text;
  }

  VAtomWriter& VAtomWriter::U8( std::uint32_t i_Value )
  {
    m_Data.push_back( static_cast< std::uint8_t >( i_Value ) );
    return *this;
  }
  VAtomWriter& VAtomWriter::U16( std::uint32_t i_Value )
  {
    return U8( i_Value >> 8 ).U8( i_Value );
  }
  VAtomWriter& VAtomWriter::U24( std::uint32_t i_Value )
  {
    return U8( i_Value >> 16 ).U16( i_Value );
  }
  VAtomWriter& VAtomWriter::U32( std::uint32_t i_Value )
  {
    return U16( i_Value >> 16 ).U16( i_Value );
  }
  VAtomWriter& VAtomWriter::U64( std::uint64_t i_Value )
  {
    return U32( static_cast< std::uint32_t >( i_Value >> 32 ) ).U32( static_cast< std::uint32_t >( i_Value ) );
  }
  VAtomWriter& VAtomWriter::F64( double i_Value )
  {
    std::uint64_t Bits = 0;
    std::memcpy( &Bits, &i_Value, sizeof( Bits ) );
    return U64( Bits );
  }
  VAtomWriter& VAtomWriter::Text( const std::string& i_rFourCC )
  {
    for( std::size_t i = 0; i < 4; ++i )
      U8( i < i_rFourCC.size() ? static_cast< std::uint8_t >( i_rFourCC[i] ) : 0 );
    return *this;
  }
  VAtomWriter& VAtomWriter::Bytes( const std::vector< std::uint8_t >& i_rBytes )
  {
    m_Data.insert( m_Data.end(), i_rBytes.begin(), i_rBytes.end() );
    return *this;
  }
  VAtomWriter& VAtomWriter::Zeros( std::size_t i_Count )
  {
    m_Data.insert( m_Data.end(), i_Count, 0 );
    return *this;
  }
  VAtomWriter& VAtomWriter::Begin( const std::string& i_rType )
  {
    m_Open.push_back( m_Data.size() );
    return U32( 0 ).Text( i_rType );
  }
  VAtomWriter& VAtomWriter::End()
  {
    const std::size_t Start = m_Open.back();
    m_Open.pop_back();
    PatchU32( Start, static_cast< std::uint32_t >( m_Data.size() - Start ) );
    return *this;
  }
  VAtomWriter& VAtomWriter::Atom( const std::string& i_rType, const std::vector< std::uint8_t >& i_rBody )
  {
    return Begin( i_rType ).Bytes( i_rBody ).End();
  }
  void VAtomWriter::PatchU32( std::size_t i_Offset, std::uint32_t i_Value )
  {
    for( int i = 0; i < 4; ++i )
      m_Data[i_Offset + i] = static_cast< std::uint8_t >( i_Value >> ( 24 - 8 * i ) );
  }

  std::uint8_t PixelByte( std::uint32_t i_Frame, std::uint64_t i_Byte )
  {
    return static_cast< std::uint8_t >( i_Frame * 37 + i_Byte * 11 + ( i_Byte >> 7 ) );
  }

  std::uint64_t FrameBytes( const VMovSpec& i_rSpec )
  {
    return static_cast< std::uint64_t >( i_rSpec.Width ) * i_rSpec.Height * i_rSpec.BytesPerPixelTimes2 / 2;
  }

  namespace
  {
    void Matrix( VAtomWriter& io_rWriter )
    {
      io_rWriter.U32( 0x10000 ).U32( 0 ).U32( 0 ).U32( 0 ).U32( 0x10000 ).U32( 0 ).U32( 0 ).U32( 0 ).U32( 0x40000000 );
    }

    void Tkhd( VAtomWriter& w, std::uint32_t i_Id, std::uint32_t i_Duration, std::uint32_t i_Volume,
               std::uint32_t i_Width, std::uint32_t i_Height )
    {
      w.Begin( "tkhd" ).U8( 0 ).U24( 15 ).U32( 0 ).U32( 0 ).U32( i_Id ).U32( 0 ).U32( i_Duration ).U32( 0 ).U32( 0 );
      w.U16( 0 ).U16( 0 ).U16( i_Volume ).U16( 0 );
      Matrix( w );
      w.U32( i_Width << 16 ).U32( i_Height << 16 ).End();
    }

    void Elst( VAtomWriter& w, std::uint32_t i_Duration )
    {
      w.Begin( "edts" ).Begin( "elst" ).U8( 0 ).U24( 0 ).U32( 1 ).U32( i_Duration ).U32( 0 ).U32( 0x10000 ).End().End();
    }

    void Mdhd( VAtomWriter& w, std::uint32_t i_Scale, std::uint32_t i_Duration )
    {
      w.Begin( "mdhd" ).U8( 0 ).U24( 0 ).U32( 0 ).U32( 0 ).U32( i_Scale ).U32( i_Duration ).U16( 0 ).U16( 0 ).End();
    }

    void Hdlr( VAtomWriter& w, const char* i_pSubtype )
    {
      w.Begin( "hdlr" ).U8( 0 ).U24( 0 ).Text( "mhlr" ).Text( i_pSubtype ).U32( 0 ).U32( 0 ).U32( 0 ).U8( 0 ).End();
    }

    void Stts( VAtomWriter& w, std::uint32_t i_Count, std::uint32_t i_Duration, bool i_bTwoEntries )
    {
      w.Begin( "stts" ).U8( 0 ).U24( 0 );
      if( i_bTwoEntries )
        w.U32( 2 ).U32( i_Count - 1 ).U32( i_Duration ).U32( 1 ).U32( i_Duration * 2 );
      else
        w.U32( 1 ).U32( i_Count ).U32( i_Duration );
      w.End();
    }

    void Stsz( VAtomWriter& w, std::uint32_t i_Size, std::uint32_t i_Count )
    {
      w.Begin( "stsz" ).U8( 0 ).U24( 0 ).U32( i_Size ).U32( i_Count ).End();
    }

    void Stco( VAtomWriter& w, const std::vector< std::uint64_t >& i_rOffsets, bool i_b64 )
    {
      w.Begin( i_b64 ? "co64" : "stco" ).U8( 0 ).U24( 0 ).U32( static_cast< std::uint32_t >( i_rOffsets.size() ) );
      for( std::uint64_t Offset : i_rOffsets )
        i_b64 ? w.U64( Offset ) : w.U32( static_cast< std::uint32_t >( Offset ) );
      w.End();
    }
  } // namespace

  std::vector< std::uint8_t > WriteMov( const VMovSpec& s )
  {
    VAtomWriter w;
    w.Begin( "ftyp" ).Text( "qt  " ).U32( 0x200 ).Text( "qt  " ).End();

    const std::uint64_t Bytes = FrameBytes( s );
    const std::uint32_t VideoDuration = s.Frames * s.SampleDuration;
    const std::uint32_t MovieDuration =
        static_cast< std::uint32_t >( static_cast< std::uint64_t >( VideoDuration ) * s.MovieTimescale / s.Timescale );
    const std::uint32_t AudioSamples =
        static_cast< std::uint32_t >( static_cast< std::uint64_t >( s.AudioRate ) * VideoDuration / s.Timescale );

    // The media data: frames, then the audio chunk, then the timecode sample.
    std::size_t MdatStart = w.Size();
    if( s.bLargeMdatFirst )
      w.U32( 1 ).Text( "mdat" ).U64( 0 );
    else
      w.U32( 0 ).Text( "mdat" );
    const std::uint64_t VideoStart = w.Size();
    for( std::uint32_t f = 0; f < s.Frames; ++f )
      for( std::uint64_t b = 0; b < Bytes; ++b )
        w.U8( PixelByte( f, b ) );
    const std::uint64_t AudioStart = w.Size();
    for( std::uint32_t i = 0; i < AudioSamples * 2; ++i )
      w.U16( ( i * 7 ) & 0xFFFF );
    const std::uint64_t TimecodeStart = w.Size();
    if( s.TimecodeFrame >= 0 )
      w.U32( static_cast< std::uint32_t >( s.TimecodeFrame ) );
    const std::uint64_t MdatSize = w.Size() - MdatStart;
    if( s.bLargeMdatFirst )
    {
      w.PatchU32( MdatStart + 8, static_cast< std::uint32_t >( MdatSize >> 32 ) );
      w.PatchU32( MdatStart + 12, static_cast< std::uint32_t >( MdatSize ) );
    }
    else if( !s.bMdatSizeZero )
      w.PatchU32( MdatStart, static_cast< std::uint32_t >( MdatSize ) );

    w.Begin( "moov" );
    w.Begin( "mvhd" ).U8( 0 ).U24( 0 ).U32( 0 ).U32( 0 ).U32( s.MovieTimescale ).U32( MovieDuration ).U32( 0x10000 );
    w.U16( 0x100 ).Zeros( 10 );
    Matrix( w );
    w.Zeros( 24 ).U32( 4 ).End();

    if( s.bTrakWithoutMdia )
    {
      w.Begin( "trak" );
      Tkhd( w, 9, MovieDuration, 0, 0, 0 );
      w.End();
    }

    if( !s.bNoVideo )
    {
      w.Begin( "trak" );
      Tkhd( w, 1, MovieDuration, 0, s.Width, s.Height );
      Elst( w, MovieDuration );
      if( s.bTwoMdiaFirstEmpty )
      {
        w.Begin( "mdia" );
        Hdlr( w, "vide" );
        w.End();
      }
      w.Begin( "mdia" );
      Mdhd( w, s.MdhdTimescaleOverride != 0xFFFFFFFF ? s.MdhdTimescaleOverride : s.Timescale, VideoDuration );
      Hdlr( w, "vide" );
      w.Begin( "minf" ).Begin( "vmhd" ).U32( 1 ).Zeros( 8 ).End().Begin( "stbl" );
      // The sample description, with its extensions.
      w.Begin( "stsd" ).U8( 0 ).U24( 0 ).U32( 1 );
      const std::size_t EntryStart = w.Size();
      w.U32( 0 ).Text( s.DataFormat ).Zeros( 6 ).U16( 1 ).U16( 0 ).U16( 0 ).Text( "lumk" ).U32( 0 ).U32( 512 );
      w.U16( s.Width ).U16( s.Height ).U32( 72 << 16 ).U32( 72 << 16 ).U32( 0 ).U16( 1 ).Zeros( 32 );
      w.U16( s.Depth ).U16( 0xFFFF );
      if( s.bInterlacedFiel )
        w.Begin( "fiel" ).U8( 2 ).U8( 9 ).End();
      w.Begin( "pasp" ).U32( 1 ).U32( 1 ).End();
      w.Begin( "colr" ).Text( "nclc" ).U16( s.bWideColr ? 9 : 1 ).U16( 1 ).U16( 1 ).End();
      w.PatchU32( EntryStart, static_cast< std::uint32_t >( w.Size() - EntryStart ) );
      w.End();
      Stts( w, s.SampleCountOverride ? s.SampleCountOverride : s.Frames, s.SampleDuration, s.bTwoSttsEntries );
      // Chunks of SamplesPerChunk frames each.
      const std::uint32_t PerChunk = s.SamplesPerChunk ? s.SamplesPerChunk : s.Frames;
      std::vector< std::uint64_t > Offsets;
      for( std::uint32_t f = 0; f < s.Frames; f += PerChunk )
        Offsets.push_back( VideoStart + f * Bytes );
      w.Begin( "stsc" )
          .U8( 0 )
          .U24( 0 )
          .U32( 1 )
          .U32( s.FirstChunk )
          .U32( PerChunk + s.StscPromiseExtra )
          .U32( 1 )
          .End();
      Stsz( w, static_cast< std::uint32_t >( Bytes ), s.SampleCountOverride ? s.SampleCountOverride : s.Frames );
      if( s.bBrokenCo64WithGoodStco )
      {
        w.Begin( "co64" ).U8( 1 ).U24( 0 ).U32( 1 ).U64( 0 ).End();
        Stco( w, Offsets, false );
      }
      else
        Stco( w, Offsets, s.bCo64Only );
      w.End().End().End().End();
    }

    if( s.AudioRate != 0 )
    {
      w.Begin( "trak" );
      Tkhd( w, 2, MovieDuration, 0x100, 0, 0 );
      Elst( w, MovieDuration );
      w.Begin( "mdia" );
      Mdhd( w, s.AudioRate, AudioSamples );
      Hdlr( w, "soun" );
      w.Begin( "minf" ).Begin( "smhd" ).Zeros( 8 ).End().Begin( "stbl" );
      w.Begin( "stsd" ).U8( 0 ).U24( 0 ).U32( 1 ).U32( 36 ).Text( "sowt" ).Zeros( 6 ).U16( 1 ).U16( 0 ).U16( 0 );
      w.U32( 0 ).U16( 2 ).U16( 16 ).U16( 0 ).U16( 0 ).U32( s.AudioRate << 16 ).End();
      Stts( w, AudioSamples, 1, false );
      w.Begin( "stsc" ).U8( 0 ).U24( 0 ).U32( 1 ).U32( 1 ).U32( AudioSamples ).U32( 1 ).End();
      Stsz( w, 4, AudioSamples );
      Stco( w, { AudioStart }, false );
      w.End().End().End().End();
    }

    if( s.TimecodeFrame >= 0 )
    {
      const std::uint32_t TimecodeDuration =
          static_cast< std::uint32_t >( static_cast< std::uint64_t >( VideoDuration ) * s.TimecodeScale / s.Timescale );
      w.Begin( "trak" );
      Tkhd( w, 3, MovieDuration, 0, 0, 0 );
      Elst( w, MovieDuration );
      w.Begin( "mdia" );
      Mdhd( w, s.TimecodeScale, TimecodeDuration );
      Hdlr( w, "tmcd" );
      w.Begin( "minf" ).Begin( "gmhd" ).Begin( "tmcd" ).Begin( "tcmi" ).U8( 0 ).U24( 0 ).U16( 0 ).U16( 0 ).U16( 12 );
      w.U16( 0 ).Zeros( 12 ).U8( 0 ).End().End().End();
      w.Begin( "stbl" );
      w.Begin( "stsd" ).U8( 0 ).U24( 0 ).U32( 1 ).U32( 36 ).Text( "tmcd" ).Zeros( 6 ).U16( 1 ).U32( 0 );
      w.U32( s.bDropFrame ? 1 : 0 )
          .U32( s.TimecodeScale )
          .U32( s.TimecodeFrameDuration )
          .U8( s.TimecodeCountingFrames );
      w.U8( 0 ).U16( 0 ).End();
      Stts( w, 1, TimecodeDuration, false );
      w.Begin( "stsc" ).U8( 0 ).U24( 0 ).U32( 1 ).U32( 1 ).U32( 1 ).U32( 1 ).End();
      Stsz( w, 4, 1 );
      Stco( w, { TimecodeStart }, false );
      w.End().End().End().End();
    }
    if( s.bMoovEndsWithZeroWord )
      w.U32( 0 );
    w.End();

    if( !s.Qmdt.empty() )
      w.Atom( "QMDT", s.Qmdt );
    w.Zeros( s.StrayBytes );
    return w.Data();
  }

  std::string WriteTempFile( const std::string& i_rName, const std::vector< std::uint8_t >& i_rBytes )
  {
    const boost::filesystem::path Folder = boost::filesystem::temp_directory_path() / "lumek-movio-tests";
    boost::filesystem::create_directories( Folder );
    const boost::filesystem::path Path = Folder / ( boost::filesystem::unique_path( "%%%%%%%%-" ).string() + i_rName );
    std::ofstream Out( Path.string(), std::ios::binary );
    Out.write( reinterpret_cast< const char* >( i_rBytes.data() ), static_cast< std::streamsize >( i_rBytes.size() ) );
    return Path.string();
  }
} // namespace MovTest
