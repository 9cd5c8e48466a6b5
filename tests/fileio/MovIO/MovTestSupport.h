#pragma once

// Shared by the MOV reader's tests and the fuzz seed maker: a writer of atom trees, and a small
// MOV writer whose files can be bent into each case the reader must refuse or accept.

#include <algorithm>
#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

namespace MovTest
{
  using VBytes = std::vector< std::uint8_t >;

  // Big-endian bytes with nested atoms: Begin writes a header whose size End fills in.
  class VAtomWriter
  {
  public:
    VAtomWriter& U8( std::uint32_t i_Value )
    {
      m_Data.push_back( static_cast< std::uint8_t >( i_Value ) );
      return *this;
    }
    VAtomWriter& U16( std::uint32_t i_Value ) { return U8( i_Value >> 8 ).U8( i_Value ); }
    VAtomWriter& U32( std::uint32_t i_Value ) { return U16( i_Value >> 16 ).U16( i_Value ); }
    VAtomWriter& U64( std::uint64_t i_Value ) { return U32( std::uint32_t( i_Value >> 32 ) ).U32( i_Value ); }
    VAtomWriter& Text( const std::string& i_rFourCC ) { return Append( i_rFourCC.data(), 4 ); }
    VAtomWriter& Zeros( std::size_t i_Count ) { return Append( VBytes( i_Count ).data(), i_Count ); }
    VAtomWriter& Append( const void* i_pData, std::size_t i_Size )
    {
      m_Data.insert( m_Data.end(), static_cast< const char* >( i_pData ),
                     static_cast< const char* >( i_pData ) + i_Size );
      return *this;
    }
    // An atom's header; a full atom's also has its version and flags.
    VAtomWriter& Begin( const std::string& i_rType )
    {
      m_Open.push_back( m_Data.size() );
      return U32( 0 ).Text( i_rType );
    }
    VAtomWriter& BeginFull( const std::string& i_rType, std::uint32_t i_Flags = 0 )
    {
      return Begin( i_rType ).U32( i_Flags );
    }
    VAtomWriter& End()
    {
      PatchU32( m_Open.back(), static_cast< std::uint32_t >( m_Data.size() - m_Open.back() ) );
      m_Open.pop_back();
      return *this;
    }
    // Overwrites a 32-bit value already written.
    void PatchU32( std::size_t i_Offset, std::uint32_t i_Value )
    {
      for( std::size_t i = 0; i < 4; ++i )
        m_Data.at( i_Offset + i ) = static_cast< std::uint8_t >( i_Value >> ( 24 - 8 * i ) );
    }
    std::size_t Size() const { return m_Data.size(); }
    VBytes& Data() { return m_Data; }

  private:
    VBytes m_Data;
    std::vector< std::size_t > m_Open;
  };

  // What the small MOV writer puts in a file: 2vuy frames of 24 ticks of 600 a second.
  struct VMovSpec
  {
    std::uint32_t Width = 16;
    std::uint32_t Height = 8;
    std::uint32_t Frames = 6;
    std::uint32_t BytesPerPixelTimes2 = 4;
    // 16-bit stereo sowt at this rate; 0 for no audio.
    std::uint32_t AudioRate = 0;
    // Timecode track with this start frame; -1 for none.
    std::int64_t TimecodeFrame = -1;
    std::uint32_t TimecodeScale = 25;
    // The frame store and attribute store, serialised, for a QMDT atom; empty for none.
    VBytes Qmdt;
    std::uint32_t SamplesPerChunk = 0; // 0: all frames in one chunk
    // Variants of the layout.
    bool bCo64Only = false;
    bool bTwoMdiaFirstEmpty = false;
    bool bLargeMdatFirst = false;
    std::uint32_t StrayBytes = 0;
  };
  constexpr std::uint32_t Timescale = 600;
  constexpr std::uint32_t SampleDuration = 24;

  // The byte i of frame f, as the writer fills frames.
  inline std::uint8_t PixelByte( std::uint32_t i_Frame, std::uint64_t i_Byte )
  {
    return static_cast< std::uint8_t >( i_Frame * 37 + i_Byte * 11 + ( i_Byte >> 7 ) );
  }

  inline std::uint64_t FrameBytes( const VMovSpec& i_rSpec )
  {
    return std::uint64_t( i_rSpec.Width ) * i_rSpec.Height * i_rSpec.BytesPerPixelTimes2 / 2;
  }

  // A track's tkhd, elst, and its mdia up to the hdlr, left open.
  inline void BeginTrack( VAtomWriter& w, std::uint32_t i_Id, std::uint32_t i_MovieDuration, std::uint32_t i_Volume,
                          std::uint32_t i_Width, std::uint32_t i_Height, std::uint32_t i_Scale,
                          std::uint32_t i_Duration, const char* i_pHandler, bool i_bEmptyMdiaFirst = false )
  {
    w.Begin( "trak" ).BeginFull( "tkhd", 15 ).Zeros( 8 ).U32( i_Id ).U32( 0 ).U32( i_MovieDuration ).Zeros( 12 );
    w.U16( i_Volume ).U16( 0 ).U32( 0x10000 ).Zeros( 12 ).U32( 0x10000 ).Zeros( 12 ).U32( 0x40000000 ); // matrix
    w.U32( i_Width << 16 ).U32( i_Height << 16 ).End();
    w.Begin( "edts" ).BeginFull( "elst" ).U32( 1 ).U32( i_MovieDuration ).U32( 0 ).U32( 0x10000 ).End().End();
    // The reader must step back out of an mdia without minf and take the next.
    if( i_bEmptyMdiaFirst )
      w.Begin( "mdia" ).BeginFull( "hdlr" ).Text( "mhlr" ).Text( i_pHandler ).Zeros( 13 ).End().End();
    w.Begin( "mdia" ).BeginFull( "mdhd" ).Zeros( 8 ).U32( i_Scale ).U32( i_Duration ).U32( 0 ).End();
    w.BeginFull( "hdlr" ).Text( "mhlr" ).Text( i_pHandler ).Zeros( 13 ).End();
  }

  // stts, stsc, stsz and stco of equal samples in chunks of i_PerChunk, then the track closed.
  inline void SampleTables( VAtomWriter& w, std::uint32_t i_Count, std::uint32_t i_Duration, std::uint32_t i_Size,
                            std::uint32_t i_PerChunk, const std::vector< std::uint64_t >& i_rOffsets,
                            bool i_b64 = false )
  {
    w.BeginFull( "stts" ).U32( 1 ).U32( i_Count ).U32( i_Duration ).End();
    w.BeginFull( "stsc" ).U32( 1 ).U32( 1 ).U32( i_PerChunk ).U32( 1 ).End();
    w.BeginFull( "stsz" ).U32( i_Size ).U32( i_Count ).End();
    w.BeginFull( i_b64 ? "co64" : "stco" ).U32( static_cast< std::uint32_t >( i_rOffsets.size() ) );
    for( std::uint64_t Offset : i_rOffsets )
      i_b64 ? w.U64( Offset ) : w.U32( static_cast< std::uint32_t >( Offset ) );
    w.End().End().End().End().End(); // stco, stbl, minf, mdia, trak
  }

  inline VBytes WriteMov( const VMovSpec& s )
  {
    VAtomWriter w;
    w.Begin( "ftyp" ).Text( "qt  " ).U32( 0x200 ).Text( "qt  " ).End();
    const std::uint64_t Bytes = FrameBytes( s );
    const std::uint32_t Duration = s.Frames * SampleDuration;
    const auto InScale = [&]( std::uint32_t i_Scale )
    { return static_cast< std::uint32_t >( std::uint64_t( Duration ) * i_Scale / Timescale ); };
    const std::uint32_t AudioSamples = InScale( s.AudioRate );

    // The media data: frames, then the audio chunk, then the timecode sample.
    const std::size_t MdatStart = w.Size();
    s.bLargeMdatFirst ? w.U32( 1 ).Text( "mdat" ).U64( 0 ) : w.U32( 0 ).Text( "mdat" );
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
    w.PatchU32( MdatStart + ( s.bLargeMdatFirst ? 12 : 0 ), static_cast< std::uint32_t >( w.Size() - MdatStart ) );

    w.Begin( "moov" ).BeginFull( "mvhd" ).Zeros( 8 ).U32( 600 ).U32( Duration ).U32( 0x10000 ).U16( 0x100 ).Zeros( 10 );
    w.U32( 0x10000 ).Zeros( 12 ).U32( 0x10000 ).Zeros( 12 ).U32( 0x40000000 ).Zeros( 24 ).U32( 4 ).End();
    BeginTrack( w, 1, Duration, 0, s.Width, s.Height, Timescale, Duration, "vide", s.bTwoMdiaFirstEmpty );
    // The sample description, with its extensions.
    w.Begin( "minf" ).BeginFull( "vmhd", 1 ).Zeros( 8 ).End().Begin( "stbl" ).BeginFull( "stsd" ).U32( 1 );
    w.Begin( "2vuy" ).Zeros( 6 ).U16( 1 ).U32( 0 ).Text( "lumk" ).U32( 0 ).U32( 512 ).U16( s.Width );
    w.U16( s.Height ).U32( 72 << 16 ).U32( 72 << 16 ).U32( 0 ).U16( 1 ).Zeros( 32 ).U16( 24 ).U16( 0xFFFF );
    w.Begin( "pasp" ).U32( 1 ).U32( 1 ).End().Begin( "colr" ).Text( "nclc" ).U16( 1 ).U16( 1 ).U16( 1 ).End();
    w.End().End(); // 2vuy, stsd
    const std::uint32_t PerChunk = s.SamplesPerChunk ? s.SamplesPerChunk : s.Frames;
    std::vector< std::uint64_t > Offsets;
    for( std::uint32_t f = 0; f < s.Frames; f += PerChunk )
      Offsets.push_back( VideoStart + f * Bytes );
    SampleTables( w, s.Frames, SampleDuration, std::uint32_t( Bytes ), PerChunk, Offsets, s.bCo64Only );
    if( s.AudioRate != 0 )
    {
      BeginTrack( w, 2, Duration, 0x100, 0, 0, s.AudioRate, AudioSamples, "soun" );
      w.Begin( "minf" ).Begin( "smhd" ).Zeros( 8 ).End().Begin( "stbl" ).BeginFull( "stsd" ).U32( 1 ).Begin( "sowt" );
      w.Zeros( 6 ).U16( 1 ).Zeros( 8 ).U16( 2 ).U16( 16 ).U32( 0 ).U32( s.AudioRate << 16 ).End().End();
      SampleTables( w, AudioSamples, 1, 4, AudioSamples, { AudioStart } );
    }
    if( s.TimecodeFrame >= 0 )
    {
      const std::uint32_t TimecodeDuration = InScale( s.TimecodeScale );
      BeginTrack( w, 3, Duration, 0, 0, 0, s.TimecodeScale, TimecodeDuration, "tmcd" );
      w.Begin( "minf" ).Begin( "gmhd" ).Begin( "tmcd" ).BeginFull( "tcmi" ).U32( 0 ).U16( 12 );
      w.Zeros( 15 ).End().End().End();
      w.Begin( "stbl" ).BeginFull( "stsd" ).U32( 1 ).Begin( "tmcd" ).Zeros( 6 ).U16( 1 ).Zeros( 8 );
      w.U32( s.TimecodeScale ).U32( 1 ).U8( 25 ).Zeros( 3 ).End().End();
      SampleTables( w, 1, TimecodeDuration, 4, 1, { TimecodeStart } );
    }
    w.End();
    if( !s.Qmdt.empty() )
      w.Begin( "QMDT" ).Append( s.Qmdt.data(), s.Qmdt.size() ).End();
    return w.Zeros( s.StrayBytes ).Data();
  }

  // Overwrites a 32-bit field of the first atom of that type, i_Offset bytes from its start.
  inline void Patch( VBytes& io_rFile, const std::string& i_rType, std::size_t i_Offset, std::uint32_t i_Value )
  {
    const auto Found = std::search( io_rFile.begin(), io_rFile.end(), i_rType.begin(), i_rType.end() );
    if( Found == io_rFile.end() )
      throw std::logic_error( "no " + i_rType + " atom" );
    for( std::size_t i = 0; i < 4; ++i )
      *( Found - 4 + static_cast< std::ptrdiff_t >( i_Offset + i ) ) =
          static_cast< std::uint8_t >( i_Value >> ( 24 - 8 * i ) );
  }
} // namespace MovTest
