#include "fileio/H264Utils/H264Utils.h"

#include "services/Log.h"

#include <boost/format.hpp>

#include <algorithm>
#include <cstring>
#include <string>

namespace H264Utils
{
  namespace
  {
    void StoreBE32( std::uint8_t* o_pBytes, std::uint64_t i_Value )
    {
      o_pBytes[0] = static_cast< std::uint8_t >( i_Value >> 24 );
      o_pBytes[1] = static_cast< std::uint8_t >( i_Value >> 16 );
      o_pBytes[2] = static_cast< std::uint8_t >( i_Value >> 8 );
      o_pBytes[3] = static_cast< std::uint8_t >( i_Value );
    }

    // The type of a unit from its first byte; no emulation prevention can reach it.
    bool ReadUnitType( const std::uint8_t* i_pUnit, std::uint64_t i_Size, std::uint32_t& o_Type )
    {
      VInputBitStream Stream( i_pUnit, std::min< std::uint64_t >( i_Size, 1 ) );
      VNALHeader Header;
      if( !Stream.ReadNALHeader( Header ) )
        return false;
      o_Type = Header.NALUnitType;
      return true;
    }
  } // namespace

  const std::shared_ptr< const ZOL::IBufferConst >& StartCodeBuffer()
  {
    static const std::shared_ptr< const ZOL::IBufferConst > s_pStartCode =
        std::make_shared< ZOL::VTrivialBuffer< s_H264StartCode4Bytes, 4 > >();
    return s_pStartCode;
  }

  std::uint64_t FindStartCode( const std::uint8_t* i_pData, std::uint64_t i_Size, std::uint64_t i_From )
  {
    if( i_Size < 3 )
      return i_Size;
    std::uint64_t i = i_From;
    while( i + 2 < i_Size )
    {
      // Step by the third byte: anything but 0 or 1 there rules out three positions at once.
      const std::uint8_t Third = i_pData[i + 2];
      if( Third > 1 )
        i += 3;
      else if( Third == 1 && i_pData[i + 1] == 0 && i_pData[i] == 0 )
        return i;
      else
        ++i;
    }
    return i_Size;
  }

  bool LengthPrefixedToAnnexB( const std::uint8_t* i_pData, std::uint64_t i_Size,
                               std::shared_ptr< ZOL::IBuffer >& o_rBuffer, ZOL::IBufferAllocator& i_rAllocator )
  {
    i_rAllocator.Allocate( o_rBuffer, i_Size );
    if( !o_rBuffer )
      return false;
    if( i_Size == 0 )
      return true;
    if( i_pData == nullptr )
      return false;
    std::uint8_t* pOut = o_rBuffer->GetData();
    std::memcpy( pOut, i_pData, static_cast< std::size_t >( i_Size ) );
    std::uint64_t Position = 0;
    while( Position < i_Size )
    {
      if( i_Size - Position < 4 )
        return false;
      std::uint8_t* p = pOut + Position;
      const std::uint64_t Length = ( std::uint64_t( p[0] ) << 24 ) | ( p[1] << 16 ) | ( p[2] << 8 ) | p[3];
      std::memcpy( p, s_H264StartCode4Bytes, 4 );
      if( Length > i_Size - Position - 4 )
        return false;
      Position += 4 + Length;
    }
    return true;
  }

  bool AnnexBToLengthPrefixed( const std::uint8_t* i_pData, std::uint64_t i_Size,
                               std::shared_ptr< ZOL::IBuffer >& o_rBuffer, ZOL::IBufferAllocator& i_rAllocator )
  {
    std::uint64_t Total = 0;
    bool bFits = true;
    ForEachNALUnit( i_pData, i_Size, EH264StreamForm::AnnexB,
                    [&]( const std::uint8_t*, std::uint64_t i_Length )
                    {
                      bFits = bFits && i_Length <= 0xFFFFFFFF;
                      Total += i_Length + 4;
                      return true;
                    } );
    if( !bFits )
      return false;
    i_rAllocator.Allocate( o_rBuffer, Total );
    if( !o_rBuffer )
      return false;
    std::uint8_t* pOut = o_rBuffer->GetData();
    ForEachNALUnit( i_pData, i_Size, EH264StreamForm::AnnexB,
                    [&]( const std::uint8_t* i_pUnit, std::uint64_t i_Length )
                    {
                      StoreBE32( pOut, i_Length );
                      if( i_Length > 0 )
                        std::memcpy( pOut + 4, i_pUnit, static_cast< std::size_t >( i_Length ) );
                      pOut += 4 + i_Length;
                      return true;
                    } );
    return true;
  }

  bool ContainsNALUnit( const ZOL::IBufferConst& i_rBuffer, std::uint32_t i_NALUnitType, EH264StreamForm i_Form )
  {
    bool bFound = false;
    ForEachNALUnit( i_rBuffer.GetData(), i_rBuffer.GetSize(), i_Form,
                    [&]( const std::uint8_t* i_pUnit, std::uint64_t i_Length )
                    {
                      std::uint32_t Type = 0;
                      if( !ReadUnitType( i_pUnit, i_Length, Type ) )
                        return false;
                      bFound = Type == i_NALUnitType;
                      return !bFound;
                    } );
    return bFound;
  }

  std::shared_ptr< const ZOL::IBufferConst > JoinBuffers( VBufferList& io_rBuffers,
                                                          ZOL::IBufferAllocator& i_rAllocator )
  {
    if( io_rBuffers.size() == 1 && io_rBuffers.front() )
    {
      std::shared_ptr< const ZOL::IBufferConst > pOnly = std::move( io_rBuffers.front() );
      io_rBuffers.clear();
      return pOnly;
    }
    std::uint64_t Total = 0;
    for( const auto& pPart : io_rBuffers )
      if( pPart )
        Total += pPart->GetSize();
    std::shared_ptr< ZOL::IBuffer > pJoined;
    i_rAllocator.Allocate( pJoined, Total );
    if( pJoined )
    {
      std::uint8_t* pOut = pJoined->GetData();
      for( const auto& pPart : io_rBuffers )
        if( pPart && pPart->GetSize() > 0 )
        {
          std::memcpy( pOut, pPart->GetData(), static_cast< std::size_t >( pPart->GetSize() ) );
          pOut += pPart->GetSize();
        }
    }
    io_rBuffers.clear();
    return pJoined;
  }

  bool GetSliceType( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, char& o_SliceType )
  {
    VInputBitStream Stream( i_pNALUnit, i_Size );
    VNALHeader Header;
    if( !Stream.ReadNALHeader( Header ) || ( ( Header.NALUnitType - 1 ) & ~4u ) != 0 )
      return false;
    Stream.ReadUE(); // first_mb_in_slice
    const std::uint32_t SliceType = Stream.ReadUE();
    if( !Stream.IsValid() )
      return false;
    static constexpr char s_Types[] = { 'P', 'B', 'I' };
    if( SliceType <= 7 && SliceType % 5 <= 2 )
    {
      o_SliceType = s_Types[SliceType % 5];
      return true;
    }
    LUMEK_LOG( "H264Utils", ZOL::LogFailure, "Unknown slice type: '%s'.",
               ToString( static_cast< EH264CodedSliceType >( SliceType ) ) );
    return false;
  }

  bool IsSingleSlice( const ZOL::IBufferConst& i_rBuffer, char& o_SliceType )
  {
    unsigned Slices = 0;
    const bool bWhole = ForEachNALUnit( i_rBuffer.GetData(), i_rBuffer.GetSize(), EH264StreamForm::LengthPrefixed,
                                        [&]( const std::uint8_t* i_pUnit, std::uint64_t i_Length )
                                        {
                                          char Type = 0;
                                          if( GetSliceType( i_pUnit, i_Length, Type ) )
                                          {
                                            o_SliceType = Type;
                                            ++Slices;
                                          }
                                          return true;
                                        } );
    return bWhole && Slices == 1;
  }

  namespace
  {
    void DescribeSEI( VInputBitStream& io_rStream, std::ostream& io_rOut, const std::string& i_rIndent,
                      const std::optional< VH264SPS >& i_rSPS )
    {
      std::vector< VH264SEIMessage > Messages;
      const bool bParsed = ParseSEIMessages( io_rStream, Messages );
      for( const VH264SEIMessage& rMessage : Messages )
      {
        io_rOut << i_rIndent << "  Type: " << ToString( static_cast< EH264SEIPayload >( rMessage.PayloadType ) )
                << " Size: " << rMessage.PayloadSize << "\n";
        if( rMessage.PayloadType != H264SEIPayload_PicTiming )
          continue;
        if( !i_rSPS )
        {
          io_rOut << i_rIndent << "    Can't parse SEI Picture Timing without SPS.\n";
          continue;
        }
        VH264PicTiming Timing;
        if( !ParsePicTiming( io_rStream.GetData() + rMessage.PayloadOffset, rMessage.PayloadSize, *i_rSPS, Timing ) )
        {
          io_rOut << i_rIndent << "    Parse failure\n";
          continue;
        }
        io_rOut << i_rIndent << "    CPBRemovalDelay: " << Timing.cpb_removal_delay << "\n";
        io_rOut << i_rIndent << "    DPBOutputDelay: " << Timing.dpb_output_delay << "\n";
        for( std::size_t i = 0; i < Timing.ClockTimestamps.size(); ++i )
        {
          const VH264ClockTimestamp& c = Timing.ClockTimestamps[i];
          io_rOut << i_rIndent << "    "
                  << boost::format( "Timecode[%d]: %02d:%02d:%02d:%02d (%d)" ) % i % c.hours_value % c.minutes_value %
                         c.seconds_value % c.n_frames % ( c.clock_timestamp_flag ? 1 : 0 )
                  << "\n";
        }
      }
      if( !bParsed )
        io_rOut << i_rIndent << "  Parse failure\n";
    }
  } // namespace

  void DescribeNALUnit( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, std::ostream& io_rStream,
                        unsigned i_Indent, const std::optional< VH264SPS >& i_rSPS )
  {
    const std::string Indent( std::min( i_Indent, 64u ), ' ' );
    VInputBitStream Stream( i_pNALUnit, i_Size );
    VNALHeader Header;
    const bool bHeader = Stream.ReadNALHeader( Header );
    io_rStream << Indent
               << ( bHeader ? ToString( static_cast< EH264NALUnitType >( Header.NALUnitType ) ) : "Unspecified" )
               << ":\n";
    if( !bHeader )
      return;
    switch( Header.NALUnitType )
    {
    case H264NALUnitType_CodedSliceNonIDR:
    case H264NALUnitType_CodedSliceIDR:
    {
      Stream.ReadUE(); // first_mb_in_slice
      const std::uint32_t SliceType = Stream.ReadUE();
      io_rStream << Indent << "  Type: "
                 << ( Stream.IsValid() ? ToString( static_cast< EH264CodedSliceType >( SliceType ) ) : "Unspecified" )
                 << "\n";
      break;
    }
    case H264NALUnitType_SEI:
    {
      VInputBitStream SEIStream( i_pNALUnit, i_Size );
      DescribeSEI( SEIStream, io_rStream, Indent, i_rSPS );
      break;
    }
    case H264NALUnitType_PPS:
    {
      VH264PPS PPS;
      const bool bParsed = ParsePPS( i_pNALUnit, i_Size, PPS, i_rSPS ? &*i_rSPS : nullptr );
      io_rStream << Indent << ( bParsed ? "  Parsed ok" : "  Parse failure" ) << "\n";
      break;
    }
    default:
      break;
    }
  }
} // namespace H264Utils
