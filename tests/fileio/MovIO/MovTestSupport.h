#pragma once

// Shared by the MOV reader's tests and the fuzz seed maker: a writer of atom trees, and a small
// MOV writer whose files can be bent into each case the reader must refuse or accept.

#include <cstdint>
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
    bool bNoVideo = false;
    std::uint32_t StrayBytes = 0;
  };
  constexpr std::uint32_t Timescale = 600;
  constexpr std::uint32_t SampleDuration = 24;

  // The byte i of frame f, as the writer fills frames.
  std::uint8_t PixelByte( std::uint32_t i_Frame, std::uint64_t i_Byte );
  std::uint64_t FrameBytes( const VMovSpec& i_rSpec );
  VBytes WriteMov( const VMovSpec& i_rSpec );
  // Overwrites a 32-bit field of the first atom of that type, i_Offset bytes from its start.
  void Patch( VBytes& io_rFile, const std::string& i_rType, std::size_t i_Offset, std::uint32_t i_Value );
} // namespace MovTest
