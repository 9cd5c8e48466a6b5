#include "fileio/ImageSequenceIO/SequenceNames.h"

#include <boost/filesystem/path.hpp>

#include <algorithm>
#include <cctype>
#include <limits>

namespace ImageSequenceIO
{
  const char* const FramePlaceholder = "%FRAME%";
  const char* const FrameNumberPlaceholder = "%FRAME_NUMBER%";
  const char* const TimecodePlaceholder = "%TIMECODE%";

  namespace
  {
    struct VPayloadRow
    {
      const char* Extension;
      ZOL::EVideoPayload Payload;
    };

    constexpr VPayloadRow s_Payloads[] = {
        { ".tif", ZOL::VideoPayload_ImageTIFF }, { ".tiff", ZOL::VideoPayload_ImageTIFF },
        { ".jpg", ZOL::VideoPayload_ImageJPEG }, { ".jpeg", ZOL::VideoPayload_ImageJPEG },
        { ".png", ZOL::VideoPayload_ImagePNG },
    };

    // No file system takes a name longer than this, so no wider number can name a file. It also
    // keeps a damaged width from asking for gigabytes of zeros.
    constexpr std::uint32_t MaxPadWidth = 255;
    // More digit groups than this in one name make matching costly and name no real sequence.
    constexpr std::size_t MaxPlaceholders = 16;
    // Indices tried around the one a timecode name points at: the percent in the name is cut
    // short, so the frame can be a little later than it says.
    constexpr std::uint64_t MaxTimecodeCandidates = 16;

    // The timecode standard a frame period belongs to; the 30 Hz family is asked first, so
    // 120 Hz counts as 30 fps.
    std::uint32_t ChooseStandard( std::uint64_t i_Period )
    {
      constexpr struct
      {
        std::uint32_t Standard;
        std::uint64_t TicksPerFrame;
      } s_Order[] = { { ZOL::TimecodeStandard_30, 4500000 },
                      { ZOL::TimecodeStandard_29_97, 4504500 },
                      { ZOL::TimecodeStandard_25, 5400000 },
                      { ZOL::TimecodeStandard_24, 5625000 },
                      { ZOL::TimecodeStandard_23_98, 5630625 } };
      if( i_Period == 0 )
        return ZOL::TimecodeStandard_30;
      for( const auto& rCandidate : s_Order )
        if( rCandidate.TicksPerFrame % i_Period == 0 )
          return rCandidate.Standard;
      return ZOL::TimecodeStandard_30;
    }

    void ReplaceAll( std::string& io_rText, const std::string& i_rFind, const std::string& i_rReplacement )
    {
      for( std::size_t Position = io_rText.find( i_rFind ); Position != std::string::npos;
           Position = io_rText.find( i_rFind, Position + i_rReplacement.size() ) )
        io_rText.replace( Position, i_rFind.size(), i_rReplacement );
    }

    std::optional< std::uint64_t > ParseDecimal( const std::string& i_rDigits )
    {
      if( i_rDigits.empty() || i_rDigits.size() > 20 )
        return std::nullopt;
      std::uint64_t Value = 0;
      for( const char Digit : i_rDigits )
      {
        const std::uint64_t d = static_cast< std::uint64_t >( Digit - '0' );
        if( Value > ( std::numeric_limits< std::uint64_t >::max() - d ) / 10 )
          return std::nullopt;
        Value = Value * 10 + d;
      }
      return Value;
    }

    std::string ToRegexLiteral( const std::string& i_rText )
    {
      std::string Escaped;
      for( const char c : i_rText )
      {
        if( !std::isalnum( static_cast< unsigned char >( c ) ) )
          Escaped += '\\';
        Escaped += c;
      }
      return Escaped;
    }
  } // namespace

  ZOL::EVideoPayload PayloadForExtension( const std::string& i_rExtension )
  {
    for( const VPayloadRow& rRow : s_Payloads )
      if( i_rExtension == rRow.Extension )
        return rRow.Payload;
    return ZOL::VideoPayload_None;
  }

  std::vector< std::string > DescriptorCandidates( const std::string& i_rFolder, const std::string& i_rFileName )
  {
    const std::string Extension = std::string( "." ) + ZOL::ImageSequenceExtension;
    auto InFolder = [&]( const std::string& i_rName )
    {
      return ( boost::filesystem::path( i_rFolder ) /
               boost::filesystem::path( i_rName ).replace_extension( Extension ) )
          .string();
    };

    std::string RuleName = i_rFileName;
    for( const char* pPlaceholder : { FramePlaceholder, FrameNumberPlaceholder, TimecodePlaceholder } )
      ReplaceAll( RuleName, pPlaceholder, "" );
    std::vector< std::string > Candidates{ InFolder( RuleName ) };

    static const boost::regex s_WithSeparator( "[_.\\-]?(%FRAME%|%FRAME_NUMBER%|%TIMECODE%)" );
    const std::string ExampleName = boost::regex_replace( i_rFileName, s_WithSeparator, "" );
    if( ExampleName != RuleName )
      Candidates.push_back( InFolder( ExampleName ) );
    return Candidates;
  }

  std::string PadNumber( std::uint64_t i_Value, std::uint32_t i_Width )
  {
    std::string Digits = std::to_string( i_Value );
    const std::size_t Width = std::min( i_Width, MaxPadWidth );
    if( Digits.size() < Width )
      Digits.insert( 0, Width - Digits.size(), '0' );
    return Digits;
  }

  std::optional< VNumberedName > SplitNumberedName( const std::string& i_rFileName )
  {
    const std::size_t ExtensionSize = boost::filesystem::path( i_rFileName ).extension().string().size();
    const std::size_t StemEnd = i_rFileName.size() - ExtensionSize;
    std::size_t End = StemEnd;
    while( End > 0 && !std::isdigit( static_cast< unsigned char >( i_rFileName[End - 1] ) ) )
      --End;
    if( End == 0 )
      return std::nullopt;
    std::size_t Start = End;
    while( Start > 0 && std::isdigit( static_cast< unsigned char >( i_rFileName[Start - 1] ) ) )
      --Start;
    return VNumberedName{ i_rFileName.substr( 0, Start ), i_rFileName.substr( Start, End - Start ),
                          i_rFileName.substr( End ) };
  }

  VFileNameExpander::VFileNameExpander( const std::string& i_rPattern, std::uint32_t i_FrameIndexPadWidth,
                                        std::uint32_t i_FrameNumberPadWidth, const ZOL::ITimecode& i_rStart,
                                        const ZOL::IVideoTiming& i_rTiming, std::uint64_t i_FirstIndex )
      : m_Pattern( i_rPattern ), m_FrameIndexPadWidth( i_FrameIndexPadWidth ),
        m_FrameNumberPadWidth( i_FrameNumberPadWidth ), m_FirstIndex( i_FirstIndex ), m_Timecode( i_rStart )
  {
    m_bHasIndex = m_Pattern.find( FramePlaceholder ) != std::string::npos ||
                  m_Pattern.find( FrameNumberPlaceholder ) != std::string::npos;
    m_bHasTimecode = m_Pattern.find( TimecodePlaceholder ) != std::string::npos;
    if( m_bHasTimecode )
    {
      // One frame in timecode ticks; a rate that does not divide the timecode clock exactly, or
      // a frame longer than the field can say, gives 0 and every frame the start timecode.
      if( i_rTiming.TicksPerSecond != 0 )
      {
        const std::uint64_t Product =
            static_cast< std::uint64_t >( i_rTiming.FramePeriodInTicks ) * ZOL::TimecodeTicksPerSecond;
        if( Product % i_rTiming.TicksPerSecond == 0 &&
            Product / i_rTiming.TicksPerSecond <= std::numeric_limits< std::uint32_t >::max() )
          m_TimecodePeriod = Product / i_rTiming.TicksPerSecond;
      }
      m_Timecode.SubFramePeriod = static_cast< std::uint32_t >( m_TimecodePeriod );
      m_Timecode.Standards = ChooseStandard( m_TimecodePeriod );
    }
    m_bDependsOnIndex = m_bHasIndex || ( m_bHasTimecode && m_TimecodePeriod != 0 && m_Timecode.IsValid() );

    // The same walk as Expand's replacements, left to right: each placeholder becomes a group.
    std::string Expression;
    std::size_t Position = 0;
    while( m_Groups.size() <= MaxPlaceholders )
    {
      struct
      {
        const char* Text;
        EPlaceholder Kind;
        const char* Group;
      } const s_Kinds[] = { { FramePlaceholder, Placeholder_Frame, "([0-9]+)" },
                            { FrameNumberPlaceholder, Placeholder_FrameNumber, "([0-9]+)" },
                            { TimecodePlaceholder, Placeholder_Timecode, "([0-9]*)" } };
      std::size_t Nearest = std::string::npos;
      const auto* pKind = &s_Kinds[0];
      for( const auto& rKind : s_Kinds )
      {
        const std::size_t Found = m_Pattern.find( rKind.Text, Position );
        if( Found < Nearest )
        {
          Nearest = Found;
          pKind = &rKind;
        }
      }
      Expression += ToRegexLiteral( m_Pattern.substr( Position, Nearest - Position ) );
      if( Nearest == std::string::npos )
        break;
      Expression += pKind->Group;
      m_Groups.push_back( pKind->Kind );
      Position = Nearest + std::char_traits< char >::length( pKind->Text );
    }
    if( m_Groups.size() > MaxPlaceholders )
      return;
    try
    {
      m_Matcher.assign( Expression );
      m_bMatcherValid = true;
    }
    catch( const std::exception& )
    {
      m_bMatcherValid = false;
    }
  }

  std::string VFileNameExpander::TimecodeText( std::uint64_t i_FrameIndex ) const
  {
    ZOL::ITimecode Timecode = m_Timecode;
    // Timecode wraps at midnight and the name shows no days, so whole days can go first; that
    // keeps the product of a large index and a long period inside 64 bits.
    const std::uint64_t TicksPerDay = Timecode.GetTicksPerDay();
    if( TicksPerDay != 0 && m_TimecodePeriod != 0 )
    {
      const auto Wide = static_cast< unsigned __int128 >( i_FrameIndex ) * m_TimecodePeriod % TicksPerDay;
      Timecode.AddTicks( static_cast< std::int64_t >( Wide ) );
    }
    std::string Text = Timecode.ToText( 4, false, false );
    Text.erase( std::remove_if( Text.begin(), Text.end(), []( char c ) { return c == ':' || c == ';' || c == '+'; } ),
                Text.end() );
    return Text;
  }

  std::string VFileNameExpander::Expand( std::uint64_t i_FrameIndex ) const
  {
    std::string Name = m_Pattern;
    if( m_bHasIndex )
    {
      const std::uint64_t Index = m_FirstIndex + i_FrameIndex;
      ReplaceAll( Name, FramePlaceholder, PadNumber( Index, m_FrameIndexPadWidth ) );
      ReplaceAll( Name, FrameNumberPlaceholder, PadNumber( Index + 1, m_FrameNumberPadWidth ) );
    }
    if( m_bHasTimecode )
      ReplaceAll( Name, TimecodePlaceholder, TimecodeText( i_FrameIndex ) );
    return Name;
  }

  std::optional< std::uint64_t > VFileNameExpander::FindIndex( const std::string& i_rName, std::uint64_t i_Limit ) const
  {
    if( !m_bMatcherValid || i_Limit == 0 )
      return std::nullopt;
    if( !m_bDependsOnIndex )
      return Expand( 0 ) == i_rName ? std::optional< std::uint64_t >( 0 ) : std::nullopt;
    boost::smatch Match;
    try
    {
      if( !boost::regex_match( i_rName, Match, m_Matcher ) )
        return std::nullopt;
    }
    catch( const std::exception& )
    {
      return std::nullopt;
    }

    std::optional< std::uint64_t > Index;
    for( std::size_t Group = 0; Group < m_Groups.size() && !Index; ++Group )
    {
      const std::string Digits = Match[static_cast< int >( Group + 1 )].str();
      if( m_Groups[Group] == Placeholder_Timecode )
        continue;
      const std::optional< std::uint64_t > Value = ParseDecimal( Digits );
      const std::uint64_t First = m_Groups[Group] == Placeholder_FrameNumber ? m_FirstIndex + 1 : m_FirstIndex;
      if( !Value || *Value < First )
        return std::nullopt;
      Index = *Value - First;
    }
    if( !Index )
    {
      const auto Timecode = std::find( m_Groups.begin(), m_Groups.end(), Placeholder_Timecode );
      return IndexFromTimecodeDigits( Match[static_cast< int >( Timecode - m_Groups.begin() + 1 )].str(), i_rName,
                                      i_Limit );
    }
    // The digits may carry padding the pattern would not write, or disagree with another
    // placeholder: only a name that expands back to itself is the frame's file.
    if( *Index >= i_Limit || Expand( *Index ) != i_rName )
      return std::nullopt;
    return Index;
  }

  std::optional< std::uint64_t > VFileNameExpander::IndexFromTimecodeDigits( const std::string& i_rDigits,
                                                                             const std::string& i_rName,
                                                                             std::uint64_t i_Limit ) const
  {
    // "HHMMSSFFPP": the four fields and the percent of the timecode frame.
    if( i_rDigits.size() != 10 )
      return std::nullopt;
    auto Field = [&]( std::size_t i_Position ) {
      return static_cast< std::uint64_t >( ( i_rDigits[i_Position] - '0' ) * 10 + ( i_rDigits[i_Position + 1] - '0' ) );
    };
    const std::uint64_t TicksPerFrame = m_Timecode.GetTicksPerFrame();
    const std::uint64_t TicksPerDay = m_Timecode.GetTicksPerDay();
    if( TicksPerFrame == 0 || m_TimecodePeriod == 0 )
      return std::nullopt;
    // Never drop-frame here, so a day holds a whole number of seconds of labels.
    const std::uint64_t FramesPerSecond = TicksPerDay / TicksPerFrame / 86400;
    auto LabelTicks =
        [&]( std::uint64_t i_Hours, std::uint64_t i_Minutes, std::uint64_t i_Seconds, std::uint64_t i_Frames )
    { return ( ( ( i_Hours * 60 + i_Minutes ) * 60 + i_Seconds ) * FramesPerSecond + i_Frames ) * TicksPerFrame; };

    const std::uint64_t Named =
        LabelTicks( Field( 0 ), Field( 2 ), Field( 4 ), Field( 6 ) ) + Field( 8 ) * TicksPerFrame / 100;
    const std::uint64_t Start =
        LabelTicks( m_Timecode.Hours, m_Timecode.Minutes, m_Timecode.Seconds, m_Timecode.Frames ) +
        m_Timecode.TickRemainder;
    const std::uint64_t Offset = ( Named % TicksPerDay + TicksPerDay - Start % TicksPerDay ) % TicksPerDay;
    const std::uint64_t First = Offset / m_TimecodePeriod;
    const std::uint64_t Last =
        std::min( ( Offset + TicksPerFrame / 100 + 1 ) / m_TimecodePeriod + 1, First + MaxTimecodeCandidates );
    for( std::uint64_t Index = First > 0 ? First - 1 : 0; Index <= Last && Index < i_Limit; ++Index )
      if( Expand( Index ) == i_rName )
        return Index;
    return std::nullopt;
  }
} // namespace ImageSequenceIO
