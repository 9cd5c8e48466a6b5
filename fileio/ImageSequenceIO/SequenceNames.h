#pragma once

// How frame indices become file names, and back: the placeholders of a pattern, the descriptor
// that belongs to a name, and the frame number inside one numbered image's name.

#include "videointerface/Enumerations.h"
#include "videointerface/ITimecode.h"
#include "videointerface/IVideoFrameInfo.h"

#include <boost/regex.hpp>

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace ImageSequenceIO
{
  extern const char* const FramePlaceholder;       // "%FRAME%"
  extern const char* const FrameNumberPlaceholder; // "%FRAME_NUMBER%"
  extern const char* const TimecodePlaceholder;    // "%TIMECODE%"

  // The payload a pattern's or file's extension (dot included) names, compared exactly and
  // case-sensitively; None for any other extension.
  ZOL::EVideoPayload PayloadForExtension( const std::string& i_rExtension );

  // The descriptor paths tried for a name, in order. First the name with every placeholder
  // removed and the extension changed; then, when it differs, the same with one "_", "." or
  // "-" in front of each placeholder removed too, so that "take_%FRAME%.jpg" finds both
  // "take_.lumekimagesequence" and "take.lumekimagesequence".
  std::vector< std::string > DescriptorCandidates( const std::string& i_rFolder, const std::string& i_rFileName );

  // i_Value in decimal with leading zeros up to i_Width digits; a longer number keeps all its digits.
  std::string PadNumber( std::uint64_t i_Value, std::uint32_t i_Width );

  // A file name split around the run of digits nearest its end, the extension left out of the
  // search: "take_000123.jpg" is "take_", "000123", ".jpg". Nothing for a name without digits.
  struct VNumberedName
  {
    std::string Prefix;
    std::string Digits;
    std::string Suffix;
  };
  std::optional< VNumberedName > SplitNumberedName( const std::string& i_rFileName );

  // Turns frame indices into file names for one pattern, and finds which index a file name
  // stands for.
  class VFileNameExpander
  {
  public:
    // i_FirstIndex is added to the index for "%FRAME%" and "%FRAME_NUMBER%": a numbered run
    // that starts at 500 is a sequence whose index 0 is file 500.
    VFileNameExpander( const std::string& i_rPattern, std::uint32_t i_FrameIndexPadWidth,
                       std::uint32_t i_FrameNumberPadWidth, const ZOL::ITimecode& i_rStart,
                       const ZOL::IVideoTiming& i_rTiming, std::uint64_t i_FirstIndex = 0 );

    // The pattern with the placeholders of that index filled in.
    std::string Expand( std::uint64_t i_FrameIndex ) const;
    // The timecode form of a frame for names: the digits of "HHMMSSFF" and the percent of the
    // timecode frame, without separators ("0102030450").
    std::string TimecodeText( std::uint64_t i_FrameIndex ) const;
    // Whether different indices can give different names. A pattern without placeholders, or
    // with a timecode that cannot move, names one file for every frame.
    bool DependsOnIndex() const { return m_bDependsOnIndex; }

    // The index whose expansion is exactly i_rName (a path relative to the pattern's folder, as
    // the pattern writes it), among indices below i_Limit; worked out from the name's digits,
    // never by trying indices one by one.
    std::optional< std::uint64_t > FindIndex( const std::string& i_rName, std::uint64_t i_Limit ) const;

  private:
    enum EPlaceholder
    {
      Placeholder_Frame,
      Placeholder_FrameNumber,
      Placeholder_Timecode,
    };

    std::optional< std::uint64_t > IndexFromTimecodeDigits( const std::string& i_rDigits, const std::string& i_rName,
                                                            std::uint64_t i_Limit ) const;

    std::string m_Pattern;
    std::uint32_t m_FrameIndexPadWidth;
    std::uint32_t m_FrameNumberPadWidth;
    std::uint64_t m_FirstIndex;
    bool m_bHasIndex = false;
    bool m_bHasTimecode = false;
    bool m_bDependsOnIndex = false;
    // The start timecode made ready for per-frame arithmetic, and one frame in timecode ticks
    // (0 when the frame rate does not divide the timecode clock).
    ZOL::ITimecode m_Timecode;
    std::uint64_t m_TimecodePeriod = 0;
    // The pattern as a regular expression with one digit group a placeholder, in order.
    boost::regex m_Matcher;
    bool m_bMatcherValid = false;
    std::vector< EPlaceholder > m_Groups;
  };
} // namespace ImageSequenceIO
