#include "graphics/CoreGraphics/MurmurHash3.h"

#include <gtest/gtest.h>

#include <string>

namespace
{
  // Reference values of the published MurmurHash3_x86_32; the lengths walk through every tail size.
  TEST( MurmurHash3, MatchesTheReference )
  {
    const struct
    {
      std::string Text;
      std::uint32_t Seed;
      std::uint32_t Expected;
    } Cases[] = {
        { "", 0, 0x00000000u },           { "", 1, 0x514E28B7u },
        { "", 0xffffffffu, 0x81F16F39u }, { std::string( 4, '\0' ), 0, 0x2362F9DEu },
        { "a", 0, 0x3C2569B2u },          { "ab", 0, 0x9BBFD75Fu },
        { "abc", 0, 0xB3DD93FAu },        { "abcd", 0, 0x43ED676Au },
        { "hello", 0, 0x248BFA47u },      { "The quick brown fox jumps over the lazy dog", 0, 0x2E4FF723u },
    };
    for( const auto& rCase : Cases )
      EXPECT_EQ( CoreGraphics::MurmurHash3_32( rCase.Text, rCase.Seed ), rCase.Expected )
          << "'" << rCase.Text << "' seed " << rCase.Seed;

    // The same bytes at an odd address hash the same: blocks are read without alignment.
    const char Buffer[] = "xThe quick brown fox jumps over the lazy dog";
    EXPECT_EQ( CoreGraphics::MurmurHash3_32( Buffer + 1, sizeof( Buffer ) - 2 ), 0x2E4FF723u );
  }
} // namespace
