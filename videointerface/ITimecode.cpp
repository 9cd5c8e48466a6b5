#include "videointerface/ITimecode.h"

#include "videointerface/IVideoFrameInfo.h"

#include <iomanip>
#include <limits>
#include <sstream>

namespace ZOL
{
  namespace
  {
    // Arithmetic on ticks runs wider than 64 bits: a file's Days times the ticks of a day
    // does not fit in 64 bits, and neither does a large frame index times a long period.
    using VWide = __int128;

    struct VStandardRow
    {
      const char* ShortText;
      const char* LongText;
      std::uint32_t FramesPerSecond;
      std::uint32_t TicksPerFrame;
      std::uint32_t FramesPerDay;
    };

    constexpr std::uint32_t s_DropFrameFramesPerDay = 2592000 + ( 2592000 / 18000 - 2592000 / 1800 ) * 2;

    constexpr VStandardRow s_Standards[] = {
        { "24 fps", "24 fps timecode (Sometimes referred to as 'FILM')", 24, 5625000, 2073600 },
        { "23.98 fps",
          "23.98 fps timecode (Counts 24 frames to a second but with an underlying frame rate of 23.98Hz - "
          "sometimes referred to as 'NTSC compatible FILM')",
          24, 5630625, 2073600 },
        { "25 fps", "25 fps timecode (Sometimes referred to as 'PAL')", 25, 5400000, 2160000 },
        { "30 fps", "30 fps timecode (Runs at a true underlying frame rate of 30Hz)", 30, 4500000, 2592000 },
        { "29.97 fps",
          "29.97 fps timecode (Counts 30 frames to a second but with an underlying frame rate of 29.97Hz - "
          "sometimes referred to as 'NTSC')",
          30, 4504500, 2592000 },
        { "29.97 fps DF",
          "29.97 fps drop frame timecode (Counts 30 frames to a second, with drop frame corrections, at an "
          "underlying frame rate of 29.97Hz - sometimes referred to as 'Drop Frame NTSC')",
          30, 4504500, s_DropFrameFramesPerDay },
    };
    constexpr std::uint32_t s_StandardCount = sizeof( s_Standards ) / sizeof( s_Standards[0] );
    static_assert( s_DropFrameFramesPerDay == 2589408, "drop frame loses 2592 labels a day" );

    const VStandardRow* FindStandard( std::uint32_t i_Standard )
    {
      return i_Standard < s_StandardCount ? &s_Standards[i_Standard] : nullptr;
    }

    // Floor division: a negative tick count belongs to the day before.
    VWide FloorDivide( VWide i_Numerator, VWide i_Denominator )
    {
      VWide Quotient = i_Numerator / i_Denominator;
      if( ( i_Numerator % i_Denominator ) != 0 && ( ( i_Numerator < 0 ) != ( i_Denominator < 0 ) ) )
        --Quotient;
      return Quotient;
    }

    bool SetFromWideTicks( ITimecode& io_rTimecode, VWide i_Ticks )
    {
      const VStandardRow* pRow = FindStandard( io_rTimecode.Standards );
      if( pRow == nullptr )
        return false;
      const VWide TicksPerFrame = pRow->TicksPerFrame;
      const VWide TicksPerDay = static_cast< VWide >( pRow->FramesPerDay ) * TicksPerFrame;
      const VWide Days = FloorDivide( i_Ticks, TicksPerDay );
      const VWide Rest = i_Ticks - Days * TicksPerDay;
      std::int64_t Frame = static_cast< std::int64_t >( Rest / TicksPerFrame );
      io_rTimecode.Days = static_cast< std::int32_t >( Days );
      io_rTimecode.TickRemainder = static_cast< std::uint32_t >( Rest - Frame * TicksPerFrame );
      if( io_rTimecode.Standards == TimecodeStandard_29_97_DF )
      {
        // Real frames to labels: every ten minutes hold 17982 real frames, and each minute but
        // the first of the ten skips labels 0 and 1. Computed per ten-minute block, so that the
        // count stays exact at the end of every block and AddTicks, which counts labels back to
        // frames, is its exact inverse.
        const std::int64_t Blocks = Frame / 17982;
        const std::int64_t InBlock = Frame % 17982;
        Frame += 18 * Blocks + ( InBlock >= 2 ? 2 * ( ( InBlock - 2 ) / 1798 ) : 0 );
      }
      const std::int64_t Counted = pRow->FramesPerSecond;
      io_rTimecode.Frames = static_cast< std::uint8_t >( Frame % Counted );
      const std::int64_t Seconds = Frame / Counted;
      io_rTimecode.Seconds = static_cast< std::uint8_t >( Seconds % 60 );
      const std::int64_t Minutes = Seconds / 60;
      io_rTimecode.Minutes = static_cast< std::uint8_t >( Minutes % 60 );
      io_rTimecode.Hours = static_cast< std::uint8_t >( Minutes / 60 );
      return true;
    }

    void AddWideTicks( ITimecode& io_rTimecode, VWide i_Ticks )
    {
      if( !io_rTimecode.IsValid() )
        return;
      const VStandardRow& rRow = s_Standards[io_rTimecode.Standards];
      std::int64_t Labels = ( ( static_cast< std::int64_t >( io_rTimecode.Hours ) * 60 + io_rTimecode.Minutes ) * 60 +
                              io_rTimecode.Seconds ) *
                                rRow.FramesPerSecond +
                            io_rTimecode.Frames;
      if( io_rTimecode.Standards == TimecodeStandard_29_97_DF )
        Labels = Labels + ( Labels / 18000 - Labels / 1800 ) * 2;
      const VWide TicksPerDay = static_cast< VWide >( rRow.FramesPerDay ) * rRow.TicksPerFrame;
      const VWide Ticks = static_cast< VWide >( Labels ) * rRow.TicksPerFrame + io_rTimecode.TickRemainder +
                          static_cast< VWide >( io_rTimecode.Days ) * TicksPerDay;
      SetFromWideTicks( io_rTimecode, Ticks + i_Ticks );
    }

    void PutField( std::ostream& io_rStream, unsigned i_Value, unsigned i_Limit )
    {
      if( i_Value >= i_Limit )
        io_rStream << "??";
      else
        io_rStream << std::setw( 2 ) << i_Value;
    }

    // Digits of the largest sub-frame number, period / sub-frame period - 1; none when there
    // is only one sub-frame.
    int SubFrameWidth( std::uint64_t i_TicksPerFrame, std::uint32_t i_SubFramePeriod )
    {
      std::uint64_t Largest = i_TicksPerFrame / i_SubFramePeriod;
      Largest = Largest > 0 ? Largest - 1 : 0;
      int Width = 0;
      for( ; Largest > 0; Largest /= 10 )
        ++Width;
      return Width;
    }

    // The fill is still '0' from the time fields, so a width above 2 pads the opening text,
    // not the number: that is the form the status line has always had.
    void PutSubFrame( std::ostream& io_rStream, std::uint64_t i_TicksPerFrame, std::uint32_t i_TickRemainder,
                      std::uint32_t i_SubFramePeriod )
    {
      io_rStream << std::setw( SubFrameWidth( i_TicksPerFrame, i_SubFramePeriod ) ) << " ("
                 << i_TickRemainder / i_SubFramePeriod << ")";
    }

    std::uint32_t ChooseStandard( std::uint64_t i_Period )
    {
      // The 30 Hz family is asked first, so 120 Hz, which divides both 30 and 25, counts as 30.
      static constexpr struct
      {
        std::uint32_t Standard;
        std::uint64_t TicksPerFrame;
      } s_Order[] = { { TimecodeStandard_30, 4500000 },
                      { TimecodeStandard_29_97, 4504500 },
                      { TimecodeStandard_25, 5400000 },
                      { TimecodeStandard_24, 5625000 },
                      { TimecodeStandard_23_98, 5630625 } };
      if( i_Period == 0 )
        return TimecodeStandard_30;
      for( const auto& rCandidate : s_Order )
        if( rCandidate.TicksPerFrame % i_Period == 0 )
          return rCandidate.Standard;
      return TimecodeStandard_30;
    }
  } // namespace

  bool ITimecode::IsValid() const
  {
    const VStandardRow* pRow = FindStandard( Standards );
    if( pRow == nullptr )
      return false;
    if( Hours >= 24 || Minutes >= 60 || Seconds >= 60 || Frames >= pRow->FramesPerSecond ||
        TickRemainder >= pRow->TicksPerFrame )
      return false;
    // Drop frame: labels 0 and 1 do not exist at the start of a minute that is not a tenth.
    if( Standards == TimecodeStandard_29_97_DF && Seconds == 0 && Minutes % 10 != 0 && Frames < 2 )
      return false;
    return true;
  }

  std::uint64_t ITimecode::GetTicksPerFrame() const
  {
    const VStandardRow* pRow = FindStandard( Standards );
    return pRow ? pRow->TicksPerFrame : 0;
  }

  std::uint64_t ITimecode::GetTicksPerDay() const
  {
    const VStandardRow* pRow = FindStandard( Standards );
    return pRow ? static_cast< std::uint64_t >( pRow->FramesPerDay ) * pRow->TicksPerFrame : 0;
  }

  bool ITimecode::SetFromTicks( std::int64_t i_Ticks )
  {
    return SetFromWideTicks( *this, i_Ticks );
  }

  void ITimecode::AddTicks( std::int64_t i_Ticks )
  {
    AddWideTicks( *this, i_Ticks );
  }

  std::string ITimecode::ToText( int i_Style, bool i_bWithStandard, bool i_bSubFrameMark ) const
  {
    if( !IsValid() )
      return std::string();
    const std::uint32_t TicksPerFrame = s_Standards[Standards].TicksPerFrame;
    const bool bDropFrame = Standards == TimecodeStandard_29_97_DF;
    const bool bSecondHalf = static_cast< std::uint32_t >( TickRemainder * 2u ) >= TicksPerFrame;
    const char* pSeparator = bDropFrame ? ";" : ":";
    if( i_bSubFrameMark && !bSecondHalf )
      pSeparator = bDropFrame ? "," : ".";

    std::ostringstream Text;
    Text << std::setfill( '0' );
    PutField( Text, Hours, 24 );
    Text << ":";
    PutField( Text, Minutes, 60 );
    Text << ":";
    PutField( Text, Seconds, 60 );
    Text << pSeparator;
    PutField( Text, Frames, 30 );

    switch( i_Style )
    {
    case 1:
      if( SubFramePeriod != 0 && TicksPerFrame % SubFramePeriod == 0 )
        PutSubFrame( Text, TicksPerFrame, TickRemainder, SubFramePeriod );
      break;
    case 2:
      Text << "+" << static_cast< float >( TickRemainder ) / static_cast< float >( TicksPerFrame );
      break;
    case 3:
      Text << "r" << TickRemainder;
      break;
    case 4:
      Text << "+" << std::setw( 2 ) << static_cast< std::uint64_t >( TickRemainder ) * 100 / TicksPerFrame;
      break;
    case 5:
      if( SubFramePeriod != 0 )
      {
        PutSubFrame( Text, TicksPerFrame, TickRemainder, SubFramePeriod );
        if( TickRemainder % SubFramePeriod != 0 )
          Text << "r" << TickRemainder % SubFramePeriod;
      }
      break;
    default:
      break;
    }
    if( i_bWithStandard )
      Text << " [" << s_Standards[Standards].ShortText << "]";
    return Text.str();
  }

  std::string ITimecode::GetStandardText( std::uint32_t i_Standard, bool i_bLong )
  {
    const VStandardRow* pRow = FindStandard( i_Standard );
    if( pRow == nullptr )
      return std::string();
    return i_bLong ? pRow->LongText : pRow->ShortText;
  }

  bool ITimecode::operator==( const ITimecode& i_rOther ) const
  {
    return Standards == i_rOther.Standards && Hours == i_rOther.Hours && Minutes == i_rOther.Minutes &&
           Seconds == i_rOther.Seconds && Frames == i_rOther.Frames && UserBits == i_rOther.UserBits &&
           Days == i_rOther.Days && TickRemainder == i_rOther.TickRemainder &&
           SubFramePeriod == i_rOther.SubFramePeriod;
  }

  std::string GetFrameTimecodeText( const ITimecode& i_rStart, const IVideoTiming& i_rTiming,
                                    std::uint64_t i_FrameIndex )
  {
    ITimecode Timecode = i_rStart;
    // A rate that does not divide the timecode clock exactly gets no per-frame timecode: every
    // frame shows the start timecode.
    if( i_rTiming.TicksPerSecond != 0 )
    {
      using VUnsignedWide = unsigned __int128;
      const VUnsignedWide Product =
          static_cast< VUnsignedWide >( i_rTiming.FramePeriodInTicks ) * TimecodeTicksPerSecond;
      const VUnsignedWide Quotient = Product / i_rTiming.TicksPerSecond;
      const VUnsignedWide Remainder = Product % i_rTiming.TicksPerSecond;
      if( Remainder == 0 && Quotient <= std::numeric_limits< std::uint64_t >::max() )
      {
        const std::uint64_t Period = static_cast< std::uint64_t >( Quotient );
        Timecode.SubFramePeriod = static_cast< std::uint32_t >( Period );
        Timecode.Standards = ChooseStandard( Period );
        AddWideTicks( Timecode, static_cast< VWide >( i_FrameIndex ) * static_cast< VWide >( Period ) );
      }
    }
    return Timecode.ToText( 4, true, false );
  }
} // namespace ZOL
