#include "utils/UtilsFileSystem/LongPath.h"

#include <gtest/gtest.h>

using UtilsFileSystem::MakeLongPath;

TEST( LongPath, NarrowAndWideFormsAgreeAndASecondConversionChangesNothing )
{
  const struct
  {
    const char* Path;
    const char* Long;
  } Cases[] = { { "C:\\data\\clip.lvid", "\\\\?\\C:\\data\\clip.lvid" },
                { "d:/data/clip.lvid", "\\\\?\\d:\\data\\clip.lvid" },
                { "C:clip.lvid", "C:clip.lvid" }, // relative to the drive's current folder
                { "C:", "C:" },
                { "1:\\clip", "1:\\clip" }, // not a drive letter
                { "\\\\host\\share\\x", "\\\\?\\UNC\\host\\share\\x" },
                { "//host/share/x", "\\\\?\\UNC\\host\\share\\x" },
                { "\\\\?\\C:\\x", "\\\\?\\C:\\x" },
                { "\\\\?\\UNC\\host\\x", "\\\\?\\UNC\\host\\x" },
                { "\\\\", "\\\\?\\UNC\\" },
                { "data/clip.lvid", "data\\clip.lvid" },
                { "/data/clip.lvid", "\\data\\clip.lvid" }, // a POSIX absolute path is not absolute there
                { "", "" } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Path );
    const std::string Path = rCase.Path, Long = rCase.Long;
    EXPECT_EQ( Long, MakeLongPath( Path ) );
    EXPECT_EQ( std::wstring( Long.begin(), Long.end() ), MakeLongPath( std::wstring( Path.begin(), Path.end() ) ) );
    EXPECT_EQ( Long, MakeLongPath( MakeLongPath( Path ) ) );
  }
}
