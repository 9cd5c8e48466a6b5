#pragma once

#include <string>

namespace UtilsFileSystem
{
  // The long form of an absolute path, so that long names work on systems that limit the plain
  // form: slashes become backslashes, "C:\x" becomes "\\?\C:\x", "\\host\share" becomes
  // "\\?\UNC\host\share"; a relative or already converted path stays. A pure transform: on
  // Linux files are opened with the path as given, and this exists for the paths that cross
  // to systems that need it.
  std::wstring MakeLongPath( const std::wstring& i_rPath );
  std::string MakeLongPath( const std::string& i_rPath );
} // namespace UtilsFileSystem
