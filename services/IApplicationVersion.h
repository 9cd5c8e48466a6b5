#pragma once

#include <cstdint>

namespace ZOL
{
  // The constant release record. One static instance exists per program.
  struct IApplicationVersion
  {
    std::uint32_t Major;
    std::uint32_t Minor;
    std::uint32_t Point;
    std::uint32_t Reserved;
    const char* SourceControlKind;
    std::uint32_t Revision;
    std::uint32_t SecondRevision;
    const char* BuildTag;
    const char* Empty1;
    const char* Empty2;
    const char* Branch;
    const char* RepositoryLocation;
    const char* Changeset;
    const char* Changeset2;
    const char* Branch2;
    const char* FullVersion;
    const char* ShortVersion;
    const char* Company;
    const char* Copyright;
    const char* Trademark;
    const char* ProductKey;
  };
} // namespace ZOL

namespace LumekVideoViewer
{
  // The release record of this build of LumekVideoViewer and lumekvideotool.
  const ZOL::IApplicationVersion& ApplicationVersion();
} // namespace LumekVideoViewer
