#pragma once

#include "utils/UtilsMemory/VThreadSafeRecycler.h"
#include "videointerface/IBuffer.h"

namespace ZOL
{
  // Readers handle many small and large blocks: blocks of 16.
  using VReaderBufferAllocator = IStandardBufferAllocator< UtilsMemory::VThreadSafeRecycler< IStandardBuffer, 16 > >;
  // Decoded frames are large: blocks of 4.
  using VFrameBufferAllocator = IStandardBufferAllocator< UtilsMemory::VThreadSafeRecycler< IStandardBuffer, 4 > >;
} // namespace ZOL
