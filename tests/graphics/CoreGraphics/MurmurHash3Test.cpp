#include "graphics/CoreGraphics/MurmurHash3.h"
#include "tests/support/TestNames.h"

#include <gtest/gtest.h>

#include <string>

namespace
{
  struct VHashCase
  {
    const char* Name;
    std::string Text;
    std::uint32_t Seed;
    std::uint32_t Expected;
  };

  // Reference values of the published MurmurHash3_x86_32; the lengths walk through every tail size.
  const VHashCase HashCases[] = {
      { "Empty", "", 0, 0x00000000u },
      { "EmptySeedOne", "", 1, 0x514E28B7u },
      { "EmptySeedAllOnes", "", 0xffffffffu, 0x81F16F39u },
      { "FourZeroBytes", std::string( 4, '\0' ), 0, 0x2362F9DEu },
      { "OneByte", "a", 0, 0x3C2569B2u },
      { "TwoBytes", "ab", 0, 0x9BBFD75Fu },
      { "ThreeBytes", "abc", 0, 0xB3DD93FAu },
      { "FourBytes", "abcd", 0, 0x43ED676Au },
      { "Hello", "hello", 0, 0x248BFA47u },
      { "QuickBrownFox", "The quick brown fox jumps over the lazy dog", 0, 0x2E4FF723u },
  };

  class MurmurHash3Test : public ::testing::TestWithParam< VHashCase >
  {
  };

  TEST_P( MurmurHash3Test, MatchesReference )
  {
    const VHashCase& rCase = GetParam();
    EXPECT_EQ( CoreGraphics::MurmurHash3_32( rCase.Text, rCase.Seed ), rCase.Expected );
  }

  INSTANTIATE_TEST_SUITE_P( Reference, MurmurHash3Test, ::testing::ValuesIn( HashCases ), LumekTest::VCaseName() );

  TEST( MurmurHash3, ReadsBlocksWithoutAlignment )
  {
    // The same bytes at an odd address hash the same.
    const char Buffer[] = "xThe quick brown fox jumps over the lazy dog";
    EXPECT_EQ( CoreGraphics::MurmurHash3_32( Buffer + 1, sizeof( Buffer ) - 2 ), 0x2E4FF723u );
  }
} // namespace
