#pragma once

// The big-endian stream a MOV file is read through. It keeps its own position and a sticky
// good flag: once a read or seek has failed, nothing reaches the file any more, so a reader
// that ignores one failure cannot go on to misread what follows.

#include "utils/Streams.h"

#include <cstdint>
#include <memory>
#include <string>

namespace MovIO
{
  class VMovPrimitiveReader : public ZOL::IInputStream
  {
  public:
    // Opens the file; a file that cannot be opened gives a reader that is not good and has
    // size 0.
    explicit VMovPrimitiveReader( const std::string& i_rPath );
    // Reads a stream that is already open (a file in memory), from its position 0.
    explicit VMovPrimitiveReader( std::shared_ptr< ZOL::IInputStreamSeekable > i_pStream );
    VMovPrimitiveReader( const VMovPrimitiveReader& ) = delete;
    VMovPrimitiveReader& operator=( const VMovPrimitiveReader& ) = delete;
    ~VMovPrimitiveReader() override;

    bool Read( void* o_pBuffer, std::uint64_t i_Size ) override;
    bool IsAtEnd() override { return IsEndOfFile(); }

    // The position always takes the new value, even when the result is false.
    bool Seek( std::uint64_t i_Position );
    std::uint64_t Tell() const { return m_Position; }
    std::uint64_t GetFileSize() const { return m_FileSize; }
    bool IsEndOfFile() const { return m_Position >= m_FileSize; }
    bool IsGood() const { return m_bGood; }
    // False when it was closed already.
    bool Close();

    [[nodiscard]] bool ReadU8( std::uint8_t& o_rValue );
    [[nodiscard]] bool ReadU16( std::uint16_t& o_rValue );
    [[nodiscard]] bool ReadU32( std::uint32_t& o_rValue );
    [[nodiscard]] bool ReadU64( std::uint64_t& o_rValue );
    [[nodiscard]] bool ReadF64( double& o_rValue );

    [[nodiscard]] bool Skip1() { return SkipBytes( 1 ); }
    [[nodiscard]] bool Skip2() { return SkipBytes( 2 ); }
    [[nodiscard]] bool Skip3() { return SkipBytes( 3 ); }
    [[nodiscard]] bool Skip4() { return SkipBytes( 4 ); }
    [[nodiscard]] bool SkipPascalString();
    // i_Size bytes, the first of which is the unused length.
    [[nodiscard]] bool SkipFixedPascalString( std::uint32_t i_Size );

    [[nodiscard]] bool ExpectU8( std::uint8_t i_Value );
    [[nodiscard]] bool ExpectU16( std::uint16_t i_Value );
    [[nodiscard]] bool ExpectU24( std::uint32_t i_Value );
    [[nodiscard]] bool ExpectU32( std::uint32_t i_Value );
    [[nodiscard]] bool ExpectFourCC( const char* i_pText );
    [[nodiscard]] bool ExpectFixed16( double i_Value );

  private:
    bool SkipBytes( std::uint64_t i_Count );
    bool ReadBigEndian( std::uint64_t& o_rValue, unsigned i_Bytes );

    std::shared_ptr< ZOL::IInputStreamSeekable > m_pStream;
    std::uint64_t m_Position = 0;
    std::uint64_t m_FileSize = 0;
    bool m_bGood = true;
  };

  // A FourCC as its big-endian value: "trak" is 0x7472616B.
  constexpr std::uint32_t FourCC( const char* i_pText )
  {
    return ( static_cast< std::uint32_t >( static_cast< unsigned char >( i_pText[0] ) ) << 24 ) |
           ( static_cast< std::uint32_t >( static_cast< unsigned char >( i_pText[1] ) ) << 16 ) |
           ( static_cast< std::uint32_t >( static_cast< unsigned char >( i_pText[2] ) ) << 8 ) |
           static_cast< std::uint32_t >( static_cast< unsigned char >( i_pText[3] ) );
  }

  // The four bytes of a FourCC in file order, cut at the first zero byte.
  std::string FourCCText( std::uint32_t i_Type );
} // namespace MovIO
