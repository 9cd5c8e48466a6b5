#pragma once

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace CoreGraphics
{
  // MurmurHash3, the 32-bit x86 variant. Programs key their uniform locations by it, so a name
  // can be hashed once at compile time or start-up and looked up without string compares.
  std::uint32_t MurmurHash3_32( const void* i_pData, std::size_t i_Length, std::uint32_t i_Seed = 0 );

  inline std::uint32_t MurmurHash3_32( std::string_view i_Text, std::uint32_t i_Seed = 0 )
  {
    return MurmurHash3_32( i_Text.data(), i_Text.size(), i_Seed );
  }
} // namespace CoreGraphics
