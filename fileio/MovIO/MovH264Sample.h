#pragma once

// Turns one stored H.264 sample (NAL units behind 4-byte lengths) into a self-contained access
// unit in start-code form: the stored parameter sets go in front when the sample lacks them.

#include "videointerface/IBuffer.h"

#include <memory>
#include <vector>

namespace MovIO
{
  [[nodiscard]] bool AssembleH264AccessUnit( const std::shared_ptr< ZOL::IBuffer >& i_pSample,
                                             const std::vector< std::shared_ptr< ZOL::IBuffer > >& i_rSPS,
                                             const std::vector< std::shared_ptr< ZOL::IBuffer > >& i_rPPS,
                                             const std::shared_ptr< ZOL::IBufferAllocator >& i_pAllocator,
                                             std::shared_ptr< ZOL::IBuffer >& o_rAccessUnit );
} // namespace MovIO
