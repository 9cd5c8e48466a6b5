#include "utils/UtilsFileSystem/LongPath.h"
#include "tests/support/TestNames.h"

#include <gtest/gtest.h>

using UtilsFileSystem::MakeLongPath;

namespace
{
  struct VPathCase
  {
    const char* Name;
    const char* Path;
    const char* Long;
  };

  std::wstring Wide( const std::string& i_rText )
  {
    return std::wstring( i_rText.begin(), i_rText.end() );
  }
} // namespace

class LongPathTest : public testing::TestWithParam< VPathCase >
{
};

TEST_P( LongPathTest, NarrowAndWideFormsAgree )
{
  EXPECT_EQ( GetParam().Long, MakeLongPath( std::string( GetParam().Path ) ) );
  EXPECT_EQ( Wide( GetParam().Long ), MakeLongPath( Wide( GetParam().Path ) ) );
  // Converting twice changes nothing more.
  EXPECT_EQ( GetParam().Long, MakeLongPath( MakeLongPath( std::string( GetParam().Path ) ) ) );
}

INSTANTIATE_TEST_SUITE_P(
    Paths, LongPathTest,
    testing::Values( VPathCase{ "Drive", "C:\\data\\clip.lvid", "\\\\?\\C:\\data\\clip.lvid" },
                     VPathCase{ "DriveWithSlashes", "d:/data/clip.lvid", "\\\\?\\d:\\data\\clip.lvid" },
                     VPathCase{ "DriveRoot", "C:\\", "\\\\?\\C:\\" },
                     VPathCase{ "DriveRelative", "C:clip.lvid", "C:clip.lvid" }, VPathCase{ "DriveAlone", "C:", "C:" },
                     VPathCase{ "NotADriveLetter", "1:\\clip", "1:\\clip" },
                     VPathCase{ "Network", "\\\\host\\share\\x", "\\\\?\\UNC\\host\\share\\x" },
                     VPathCase{ "NetworkWithSlashes", "//host/share/x", "\\\\?\\UNC\\host\\share\\x" },
                     VPathCase{ "AlreadyLong", "\\\\?\\C:\\x", "\\\\?\\C:\\x" },
                     VPathCase{ "AlreadyLongNetwork", "\\\\?\\UNC\\host\\x", "\\\\?\\UNC\\host\\x" },
                     VPathCase{ "TwoBackslashesOnly", "\\\\", "\\\\?\\UNC\\" },
                     VPathCase{ "Relative", "data/clip.lvid", "data\\clip.lvid" },
                     VPathCase{ "PosixAbsoluteIsNotAbsoluteHere", "/data/clip.lvid", "\\data\\clip.lvid" },
                     VPathCase{ "OneCharacter", "/", "\\" }, VPathCase{ "Empty", "", "" } ),
    LumekTest::VCaseName() );
