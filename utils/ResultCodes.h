#pragma once

// The system's common language of results: top bit clear is success, set is failure. It lives
// at the bottom of the layers because the file functions answer in it as much as the readers.

#include <cstdint>
#include <string>

namespace ZOL
{
  using ResultCode = std::uint32_t;
  constexpr ResultCode Result_Ok = 0x0;
  constexpr ResultCode Result_Failed = 0x80000000u;
  constexpr ResultCode Result_NotSupported = 0x80000005u;
  constexpr ResultCode Result_NotPermitted = 0x80000006u;
  constexpr ResultCode Result_AlreadyPresent = 0x8000000Cu;
  constexpr ResultCode Result_InvalidArgument = 0x8000000Fu;
  constexpr ResultCode Result_InvalidType = 0x80000017u;
  constexpr ResultCode Result_FileIOFailure = 0x80000021u;
  constexpr ResultCode Result_FileNotOpen = 0x80000026u;
  constexpr ResultCode Result_FileNotFound = 0x8000002Au;
  inline bool Succeeded( ResultCode i_Code )
  {
    return ( i_Code & 0x80000000u ) == 0;
  }

  // The message of a result code, or "Unknown result code".
  const std::string& GetResultText( ResultCode i_Code );
} // namespace ZOL
