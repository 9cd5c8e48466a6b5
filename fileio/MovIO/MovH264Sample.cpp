#include "fileio/MovIO/MovH264Sample.h"

#include "fileio/H264Utils/H264Utils.h"

namespace MovIO
{
  bool AssembleH264AccessUnit( const std::shared_ptr< ZOL::IBuffer >& i_pSample,
                               const std::vector< std::shared_ptr< ZOL::IBuffer > >& i_rSPS,
                               const std::vector< std::shared_ptr< ZOL::IBuffer > >& i_rPPS,
                               const std::shared_ptr< ZOL::IBufferAllocator >& i_pAllocator,
                               std::shared_ptr< ZOL::IBuffer >& o_rAccessUnit )
  {
    if( !i_pSample || !i_pAllocator )
      return false;
    // The parameter sets are kept length-prefixed, like the units of a sample, so the whole list
    // passes one conversion. A file that repeats them in its samples gets no second copy.
    H264Utils::VBufferList Parts;
    if( !H264Utils::ContainsNALUnit( *i_pSample, H264Utils::H264NALUnitType_SPS ) )
      Parts.insert( Parts.end(), i_rSPS.begin(), i_rSPS.end() );
    if( !H264Utils::ContainsNALUnit( *i_pSample, H264Utils::H264NALUnitType_PPS ) )
      Parts.insert( Parts.end(), i_rPPS.begin(), i_rPPS.end() );
    Parts.push_back( i_pSample );
    const std::shared_ptr< const ZOL::IBufferConst > pJoined = H264Utils::JoinBuffers( Parts, *i_pAllocator );
    if( !pJoined )
      return false;
    return H264Utils::LengthPrefixedToAnnexB( pJoined->GetData(), pJoined->GetSize(), o_rAccessUnit, *i_pAllocator );
  }
} // namespace MovIO
