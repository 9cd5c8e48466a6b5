#pragma once

// Shared by the MOV reader's tests: a log capture, a writer of atom trees, and a small MOV
// writer whose files can be bent into each case the reader must refuse or accept.

#include "services/ILogCategorised.h"

#include <cstdint>
#include <string>
#include <vector>

namespace MovTest
{
  class VLogCapture
  {
  public:
    VLogCapture();
    ~VLogCapture();
    VLogCapture( const VLogCapture& ) = delete;
    VLogCapture& operator=( const VLogCapture& ) = delete;
    // "LEVEL message" for each line of the "MovIO" category.
    const std::vector< std::string >& Lines() const { return m_Lines; }
    bool Contains( const std::string& i_rLine ) const;
    std::string Text() const;

  private:
    std::vector< std::string > m_Lines;
    int m_Handle = 0;
  };

  // Big-endian bytes with nested atoms: Begin writes a header whose size End fills in.
  class VAtomWriter
  {
  public:
    VAtomWriter& U8( std::uint32_t i_Value );
    VAtomWriter& U16( std::uint32_t i_Value );
    VAtomWriter& U24( std::uint32_t i_Value );
    VAtomWriter& U32( std::uint32_t i_Value );
    VAtomWriter& U64( std::uint64_t i_Value );
    VAtomWriter& F64( double i_Value );
    VAtomWriter& Text( const std::string& i_rFourCC );
    VAtomWriter& Bytes( const std::vector< std::uint8_t >& i_rBytes );
    VAtomWriter& Zeros( std::size_t i_Count );
    VAtomWriter& Begin( const std::string& i_rType );
    VAtomWriter& End();
    // A whole atom from its body.
    VAtomWriter& Atom( const std::string& i_rType, const std::vector< std::uint8_t >& i_rBody );

    std::size_t Size() const { return m_Data.size(); }
    std::vector< std::uint8_t >& Data() { return m_Data; }
    // Overwrites a 32-bit value already written.
    void PatchU32( std::size_t i_Offset, std::uint32_t i_Value );

  private:
    std::vector< std::uint8_t > m_Data;
    std::vector< std::size_t > m_Open;
  };

  // What the small MOV writer puts in a file. The defaults make a valid 2vuy file.
  struct VMovSpec
  {
    std::uint32_t Width = 16;
    std::uint32_t Height = 8;
    std::uint32_t Frames = 6;
    std::uint32_t Timescale = 600;
    std::uint32_t SampleDuration = 24;
    std::string DataFormat = "2vuy";
    std::uint16_t Depth = 24;
    std::uint32_t BytesPerPixelTimes2 = 4;
    // 16-bit stereo sowt at this rate; 0 for no audio.
    std::uint32_t AudioRate = 0;
    // Timecode track with this start frame; -1 for none.
    std::int64_t TimecodeFrame = -1;
    std::uint32_t TimecodeScale = 25;
    std::uint32_t TimecodeFrameDuration = 1;
    std::uint8_t TimecodeCountingFrames = 25;
    bool bDropFrame = false;
    // The frame store and attribute store, serialised, for a QMDT atom; empty for none.
    std::vector< std::uint8_t > Qmdt;

    // Deliberate faults and variants.
    bool bTwoSttsEntries = false;
    bool bBrokenCo64WithGoodStco = false;
    bool bCo64Only = false;
    bool bTwoMdiaFirstEmpty = false;
    bool bLargeMdatFirst = false;
    bool bMdatSizeZero = false;
    std::uint32_t StrayBytes = 0;
    bool bMoovEndsWithZeroWord = false;
    std::uint32_t FirstChunk = 1;
    std::uint32_t SamplesPerChunk = 0; // 0: all frames in one chunk
    std::uint32_t StscPromiseExtra = 0;
    std::uint32_t MovieTimescale = 600;
    std::uint32_t MdhdTimescaleOverride = 0xFFFFFFFF;
    bool bNoVideo = false;
    bool bTrakWithoutMdia = false;
    bool bWideColr = false;
    bool bInterlacedFiel = false;
    std::uint32_t SampleCountOverride = 0;
  };

  // The byte of pixel i of frame f, as the writer fills frames.
  std::uint8_t PixelByte( std::uint32_t i_Frame, std::uint64_t i_Byte );
  std::uint64_t FrameBytes( const VMovSpec& i_rSpec );
  std::vector< std::uint8_t > WriteMov( const VMovSpec& i_rSpec );
  // Writes the bytes to a file in the test's temporary folder and returns its path.
  std::string WriteTempFile( const std::string& i_rName, const std::vector< std::uint8_t >& i_rBytes );
} // namespace MovTest
