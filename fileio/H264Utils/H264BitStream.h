#pragma once

// RBSP bit streams: a reader that removes emulation prevention bytes before it starts, and a
// writer that puts them back when its bytes are emitted. Both take the most significant bit
// first, as every H.264 syntax element is stored.

#include "videointerface/IBuffer.h"

#include <cstdint>
#include <memory>
#include <vector>

namespace H264Utils
{
  struct VNALHeader
  {
    std::uint32_t NALRefIdc = 0;
    std::uint32_t NALUnitType = 0;
  };

  class VInputBitStream
  {
  public:
    // Reads the caller's memory in place unless emulation prevention bytes had to be removed,
    // in which case a cleaned copy is kept. The memory must outlive the stream.
    VInputBitStream( const std::uint8_t* i_pData, std::uint64_t i_Size );
    VInputBitStream( const VInputBitStream& ) = delete;
    VInputBitStream& operator=( const VInputBitStream& ) = delete;

    // False once anything was read past the end or a check failed; every read then gives 0.
    bool IsValid() const { return m_bValid; }
    void Invalidate() { m_bValid = false; }

    std::uint64_t GetBitPosition() const { return m_BitPosition; }
    std::uint64_t GetBitsLeft() const;
    bool IsByteAligned() const { return m_BitPosition % 8 == 0; }
    // The bytes read from, after emulation prevention was removed.
    const std::uint8_t* GetData() const { return m_pData; }
    std::uint64_t GetSize() const { return m_Size; }

    std::uint32_t ReadBit();
    // i_Count may be 0 to 32.
    std::uint32_t ReadBits( unsigned i_Count );
    std::int32_t ReadSignedBits( unsigned i_Count );
    // ue(v) and se(v). A code of more than 31 leading zeros holds no 32-bit value: the stream
    // goes invalid rather than giving a number nobody can bound.
    std::uint32_t ReadUE();
    std::int32_t ReadSE();
    // A ue(v) that must not exceed i_Maximum; a larger one invalidates the stream and gives 0.
    std::uint32_t ReadUE( std::uint32_t i_Maximum );
    // Whether syntax remains before the RBSP trailing bits.
    bool MoreRBSPData() const;

    bool ReadNALHeader( VNALHeader& o_rHeader );
    bool ReadTrailingBits();

  private:
    const std::uint8_t* m_pData = nullptr;
    std::uint64_t m_Size = 0;
    std::uint64_t m_BitPosition = 0;
    bool m_bValid = true;
    std::vector< std::uint8_t > m_Cleaned;
  };

  class VOutputBitStream
  {
  public:
    VOutputBitStream();

    void WriteBit( std::uint32_t i_Bit );
    // The low i_Count bits of i_Value, i_Count up to 32.
    void WriteBits( std::uint32_t i_Value, unsigned i_Count );
    void WriteUE( std::uint32_t i_Value );
    void WriteSE( std::int32_t i_Value );
    void WriteNALHeader( const VNALHeader& i_rHeader );
    // The stop bit and zero bits up to the next byte.
    void WriteTrailingBits();

    std::uint64_t GetBitPosition() const { return m_BitPosition; }
    // Bytes written so far; a started byte counts, with a log line, since it means a syntax
    // structure was left without its trailing bits.
    std::uint64_t GetByteCount() const;
    // The bytes with emulation prevention inserted.
    std::vector< std::uint8_t > Emit() const;
    bool Emit( std::shared_ptr< ZOL::IBuffer >& o_rBuffer, ZOL::IBufferAllocator& i_rAllocator ) const;

  private:
    std::vector< std::uint8_t > m_Data;
    std::uint64_t m_BitPosition = 0;
  };

  // Removes emulation prevention: 00 00 03 followed by a byte of at most 3 loses the 03.
  // Returns false, leaving o_rCleaned untouched, when there is nothing to remove.
  bool RemoveEmulationPrevention( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                  std::vector< std::uint8_t >& o_rCleaned );
  // The reverse, as the writer emits: 00 00 followed by 1 to 3 and one more byte gets an 03.
  // A zero third byte is left alone, so that the two stay exact inverses of each other.
  void InsertEmulationPrevention( const std::uint8_t* i_pData, std::uint64_t i_Size,
                                  std::vector< std::uint8_t >& o_rOutput );
} // namespace H264Utils
