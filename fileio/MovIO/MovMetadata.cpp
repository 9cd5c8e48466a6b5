// Audio sample descriptions, the timecode track and the metadata atom that carries the same
// attribute stores as a .lvid recording.

#include "fileio/MovIO/MovReadAtom.h"
#include "videointerface/AttributeRecords.h"

#include <cmath>
#include <limits>

namespace MovIO
{
  namespace
  {
    struct VTimecodeStandardRow
    {
      std::uint64_t FramePeriod;
      std::uint8_t CountedFrames;
      std::uint64_t FramesPerDay;
    };

    // Drop-frame 29.97 skips two frame numbers a minute but not every tenth minute.
    constexpr std::uint64_t DropFrameFramesPerDay = 2592000 + 2 * ( 2592000 / 18000 - 2592000 / 1800 );

    // Indexed by ZOL::ETimecodeStandard; frame periods in ticks at 1080 MHz.
    constexpr VTimecodeStandardRow s_TimecodeStandards[] = {
        { 45000000, 24, 2073600 }, { 45045000, 24, 2073600 }, { 43200000, 25, 2160000 },
        { 36000000, 30, 2592000 }, { 36036000, 30, 2592000 }, { 36036000, 30, DropFrameFramesPerDay },
    };
    constexpr std::uint32_t TimecodeStandardCount = sizeof( s_TimecodeStandards ) / sizeof( s_TimecodeStandards[0] );

    struct VPeriodRow
    {
      std::uint64_t Constant;
      std::uint32_t Standard;
      std::uint32_t DropFrameStandard;
    };

    // The order matters: 30 fps is tried first, so a period that divides both 30 and 25 fps
    // frames counts as 30.
    constexpr VPeriodRow s_PeriodRows[] = {
        { 36000000, ZOL::TimecodeStandard_30, ZOL::TimecodeStandard_30 },
        { 36036000, ZOL::TimecodeStandard_29_97, ZOL::TimecodeStandard_29_97_DF },
        { 43200000, ZOL::TimecodeStandard_25, ZOL::TimecodeStandard_25 },
        { 45000000, ZOL::TimecodeStandard_24, ZOL::TimecodeStandard_24 },
        { 45045000, ZOL::TimecodeStandard_23_98, ZOL::TimecodeStandard_23_98 },
    };

    struct VAudioFormatRow
    {
      std::uint16_t SampleSize;
      std::uint32_t DataFormat;
      ZOL::EAudioSampleFormat Format;
      bool bBigEndian;
    };

    // Sound description version 0.
    constexpr VAudioFormatRow s_AudioFormatsV0[] = {
        { 8, FourCC( "raw " ), ZOL::AudioSampleFormat_UInt8, false },
        { 16, FourCC( "sowt" ), ZOL::AudioSampleFormat_Int16, false },
        { 16, FourCC( "twos" ), ZOL::AudioSampleFormat_Int16, true },
        { 32, FourCC( "sowt" ), ZOL::AudioSampleFormat_Int32, false },
        { 32, FourCC( "twos" ), ZOL::AudioSampleFormat_Int32, true },
    };

    bool RateAsInteger( double i_Rate, std::int32_t& o_rRate )
    {
      if( !( i_Rate >= 0.0 && i_Rate < 2147483648.0 ) )
        return false;
      o_rRate = static_cast< std::int32_t >( i_Rate );
      return true;
    }
  } // namespace

  std::uint32_t VMovReader::GetAudioSampleFrameBytes() const
  {
    return static_cast< std::uint32_t >( ZOL::GetAudioSampleGroupSizeInBytes( m_AudioFrameInfo ) );
  }

  bool VMovReader::ReadAudioStsd( const VMovAtom& i_rStbl )
  {
    return ReadAtom(
        i_rStbl, { "stsd" }, 0,
        [this]( VMovPrimitiveReader& r, std::uint64_t )
        {
          std::uint32_t DescriptionSize = 0;
          std::uint32_t DataFormat = 0;
          std::uint16_t SoundVersion = 0;
          std::uint16_t Channels = 0;
          std::uint16_t SampleSize = 0;
          std::uint16_t CompressionId = 0;
          std::uint32_t SampleRateFixed = 0;
          if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( 1 ) ) )
            return false;
          const std::uint64_t DescriptionStart = r.Tell();
          if( !( r.ReadU32( DescriptionSize ) && r.ReadU32( DataFormat ) && r.ExpectU32( 0 ) && r.ExpectU16( 0 ) &&
                 r.Skip2() && r.ReadU16( SoundVersion ) && r.ExpectU16( 0 ) && r.ExpectU32( 0 ) &&
                 r.ReadU16( Channels ) && r.ReadU16( SampleSize ) && r.ReadU16( CompressionId ) && r.ExpectU16( 0 ) &&
                 r.ReadU32( SampleRateFixed ) ) )
            return false;

          ZOL::IAudioFrameInfo Info;
          Info.Channels = Channels;
          Info.SampleRate = static_cast< std::int32_t >( SampleRateFixed >> 16 );
          bool bBigEndian = false;
          if( SoundVersion == 0 )
          {
            for( const VAudioFormatRow& rRow : s_AudioFormatsV0 )
              if( rRow.SampleSize == SampleSize && rRow.DataFormat == DataFormat )
              {
                Info.SampleFormat = rRow.Format;
                bBigEndian = rRow.bBigEndian;
              }
          }
          else if( SoundVersion == 1 && SampleSize == 16 )
          {
            std::uint32_t BytesPerFrame = 0;
            std::uint32_t BytesPerSample = 0;
            if( !( r.Skip4() && r.Skip4() && r.ReadU32( BytesPerFrame ) && r.ReadU32( BytesPerSample ) ) )
              return false;
            // Two bytes a sample in both shapes, although the samples are wider: that is how
            // these descriptions are written.
            if( BytesPerSample == 2 && BytesPerFrame == Channels * 3u && DataFormat == FourCC( "in24" ) )
              Info.SampleFormat = ZOL::AudioSampleFormat_Int24;
            else if( BytesPerSample == 2 && BytesPerFrame == Channels * 4u && DataFormat == FourCC( "in32" ) )
              Info.SampleFormat = ZOL::AudioSampleFormat_Int32;
          }
          else if( SoundVersion == 2 && Channels == 3 && SampleSize == 16 && CompressionId == 65534 &&
                   SampleRateFixed == 0x00010000 )
          {
            double Rate = 0.0;
            std::uint32_t Channels32 = 0;
            std::uint32_t BitsPerChannel = 0;
            if( !( r.Skip4() && r.ReadF64( Rate ) && r.ReadU32( Channels32 ) && r.ExpectU32( 0x7F000000 ) &&
                   r.ReadU32( BitsPerChannel ) && r.Skip4() && r.Skip4() && r.Skip4() ) )
              return false;
            // The format flags are not consulted: endianness and float flags have no effect.
            const bool bInteger = RateAsInteger( Rate, Info.SampleRate ) && Channels32 <= 0x7FFFFFFFu;
            Info.Channels = static_cast< std::int32_t >( Channels32 );
            if( bInteger && DataFormat == FourCC( "lpcm" ) )
            {
              if( BitsPerChannel == 16 )
                Info.SampleFormat = ZOL::AudioSampleFormat_Int16;
              else if( BitsPerChannel == 24 )
                Info.SampleFormat = ZOL::AudioSampleFormat_Int24;
              else if( BitsPerChannel == 32 )
                Info.SampleFormat = ZOL::AudioSampleFormat_Int32;
            }
          }
          if( Info.SampleFormat == ZOL::AudioSampleFormat_Unspecified )
          {
            LUMEK_LOG( "MovIO", ZOL::LogFailure, "Audio format unsupported (sample description version=%d, FourCC=%s).",
                       SoundVersion, FourCCText( DataFormat ) );
            return false;
          }
          if( bBigEndian )
            LUMEK_LOG( "MovIO", ZOL::LogWarning,
                       "Audio samples are big-endian. This is not supported and audio will be corrupt." );
          m_AudioFrameInfo = Info;
          m_AudioPayload = ZOL::AudioPayload_Uncompressed;

          // Extensions ('wave' and what it holds) are walked so that a broken one is noticed, but
          // nothing in them changes the format.
          const std::uint64_t Consumed = r.Tell() - DescriptionStart;
          if( DescriptionSize <= Consumed )
            return true;
          VMovAtom Extensions;
          Extensions.Position = r.Tell();
          Extensions.Size = DescriptionSize - Consumed;
          return BuildAtomTree( r, Extensions );
        } );
  }

  bool VMovReader::ReadTcmi( const VMovAtom& i_rTrak )
  {
    return ReadAtom( i_rTrak, { "mdia", "minf", "gmhd", "tmcd", "tcmi" }, 0,
                     []( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       return r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU16( 0 ) && r.ExpectU16( 0 ) &&
                              r.ExpectU16( 12 ) && r.ExpectU16( 0 ) && r.Skip2() && r.Skip4() && r.Skip2() &&
                              r.Skip4() && r.SkipPascalString();
                     } );
  }

  bool VMovReader::ReadTimecodeStsd( const VMovAtom& i_rStbl )
  {
    return ReadAtom( i_rStbl, { "stsd" }, 0,
                     [this]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       std::uint32_t Flags = 0;
                       std::uint32_t TimeScale = 0;
                       std::uint32_t FrameDuration = 0;
                       if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( 1 ) && r.Skip4() &&
                              r.ExpectFourCC( "tmcd" ) && r.ExpectU32( 0 ) && r.ExpectU16( 0 ) && r.ExpectU16( 1 ) &&
                              r.ExpectU32( 0 ) && r.ReadU32( Flags ) && r.ReadU32( TimeScale ) &&
                              r.ReadU32( FrameDuration ) && r.ReadU8( m_TimecodeDescription.CountingFrames ) &&
                              r.ExpectU8( 0 ) && r.ExpectU16( 0 ) ) )
                         return false;
                       // A time scale of 0 has no frame period.
                       if( TimeScale == 0 )
                         return false;
                       m_TimecodeDescription.DropFrame = static_cast< std::uint8_t >( Flags & 1u );
                       // The one rounded time of this reader: 29.97 at a scale of 2997 is not whole in ticks.
                       const std::uint64_t Scaled = static_cast< std::uint64_t >( FrameDuration ) * MovTicksPerSecond;
                       std::uint64_t Period = Scaled / TimeScale;
                       if( Scaled % TimeScale >= TimeScale / 2 )
                         ++Period;
                       m_TimecodeDescription.FramePeriod = Period;
                       return true;
                     } );
  }

  bool VMovReader::ReadQmdt( const VMovAtom& i_rRoot )
  {
    const bool bRead = ReadAtom( i_rRoot, { "QMDT" }, 0,
                                 [this]( VMovPrimitiveReader& r, std::uint64_t )
                                 { return m_FrameStore.ReadFrom( r ) && m_Attributes.ReadFrom( r ); } );
    // An unreadable metadata atom is one that is not there.
    if( !bRead )
    {
      m_FrameStore.Clear();
      m_Attributes.Clear();
    }
    return bRead;
  }

  bool VMovReader::SetTimecode( const VMovAtom& i_rRoot, bool i_bHasTimecodeTrak )
  {
    if( ReadQmdt( i_rRoot ) )
    {
      // Each record that the stores lack keeps what the atoms gave.
      static_cast< void >( ZOL::ReadVideoFrameInfo( m_FrameStore, m_Attributes, m_VideoFrameInfo ) );
      static_cast< void >( ZOL::ReadAudioFrameInfo( m_FrameStore, "", m_AudioFrameInfo ) );
      static_cast< void >( ZOL::ReadVideoTiming( m_Attributes, m_Timing ) );
      static_cast< void >( ZOL::ReadTimecode( m_Attributes, m_WorkingTimecode ) );
      static_cast< void >( ZOL::ReadVideoSettings( m_Attributes, "", m_Settings ) );
      return true;
    }
    if( !i_bHasTimecodeTrak )
    {
      static_cast< void >( SelectTimecodeStandard( m_WorkingTimecode, GetTrackPeriod( m_VideoTrack ), false,
                                                   ZOL::TimecodeStandard_30 ) );
      return true;
    }

    const VTimecodeDescription& rDescription = m_TimecodeDescription;
    static_cast< void >( SelectTimecodeStandard( m_WorkingTimecode, rDescription.FramePeriod,
                                                 rDescription.DropFrame != 0, ZOL::TimecodeStandard_None ) );
    if( m_WorkingTimecode.Standards == ZOL::TimecodeStandard_None )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure,
                 "Could not find suitable timecode standard with period of %d ticks at 1080MHz.",
                 rDescription.FramePeriod );
      return false;
    }
    const std::uint8_t Expected = s_TimecodeStandards[m_WorkingTimecode.Standards].CountedFrames;
    if( Expected != rDescription.CountingFrames )
    {
      // The stored count goes in as a character; the line has always shown it so.
      LUMEK_LOG( "MovIO", ZOL::LogFailure,
                 "Number of timecode counting frames (%d) does not match expected number for standard (%d).",
                 static_cast< char >( rDescription.CountingFrames ), static_cast< int >( Expected ) );
      return false;
    }
    if( m_TimecodeTrack.Chunks.size() != 1 )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "Timecode offset missing." );
      return false;
    }
    if( m_TimecodeTrack.Timescale == 0 || m_FileTimescale == 0 )
      return false;
    // The picture starts this far into the one timecode sample. The video's duration is in the
    // movie's time scale and is brought into the timecode track's before the two meet.
    const std::uint64_t VideoDuration =
        ( static_cast< std::uint64_t >( m_VideoTrack.FileDuration ) * m_TimecodeTrack.Timescale +
          m_FileTimescale / 2 ) /
        m_FileTimescale;
    // The movie's duration is rounded up to its scale, so a picture that fills the sample can
    // come out a little longer than it; that is an offset of 0, not one of four billion.
    m_TimecodeDescription.MediaTime =
        VideoDuration >= m_TimecodeTrack.SampleDuration
            ? 0
            : static_cast< std::uint32_t >( m_TimecodeTrack.SampleDuration - VideoDuration );

    std::uint32_t FrameNumber = 0;
    if( !m_pReader->Seek( m_TimecodeTrack.Chunks[0].Offset ) || !m_pReader->ReadU32( FrameNumber ) )
      FrameNumber = 0;
    const std::uint64_t Ticks =
        FrameNumber * rDescription.FramePeriod +
        static_cast< std::uint64_t >( m_TimecodeDescription.MediaTime ) * MovTicksPerSecond / m_TimecodeTrack.Timescale;
    static_cast< void >( SetTimecodeFromTicks( m_WorkingTimecode, static_cast< std::int64_t >( Ticks ) ) );
    return true;
  }

  bool SelectTimecodeStandard( ZOL::ITimecode& io_rTimecode, std::uint64_t i_Period, bool i_bDropFrame,
                               std::uint32_t i_Fallback )
  {
    io_rTimecode.Standards = i_Fallback;
    io_rTimecode.SubFramePeriod = static_cast< std::uint32_t >( i_Period );
    if( i_Period == 0 )
      return false;
    for( const VPeriodRow& rRow : s_PeriodRows )
      if( rRow.Constant % i_Period == 0 )
      {
        io_rTimecode.Standards = i_bDropFrame ? rRow.DropFrameStandard : rRow.Standard;
        return true;
      }
    return false;
  }

  bool SetTimecodeFromTicks( ZOL::ITimecode& io_rTimecode, std::int64_t i_Ticks )
  {
    if( io_rTimecode.Standards >= TimecodeStandardCount )
      return false;
    const VTimecodeStandardRow& rRow = s_TimecodeStandards[io_rTimecode.Standards];
    const auto Period = static_cast< std::int64_t >( rRow.FramePeriod );
    const auto DayTicks = static_cast< std::int64_t >( rRow.FramesPerDay ) * Period;
    std::int64_t Days = i_Ticks / DayTicks;
    if( i_Ticks % DayTicks < 0 )
      --Days;
    const std::int64_t Rest = i_Ticks - Days * DayTicks;
    std::int64_t Frames = Rest / Period;
    io_rTimecode.TickRemainder = static_cast< std::uint32_t >( Rest % Period );
    io_rTimecode.Days = static_cast< std::int32_t >( Days );
    if( io_rTimecode.Standards == ZOL::TimecodeStandard_29_97_DF )
    {
      const std::int64_t D = ( Frames - 2 ) / 17982;
      const std::int64_t M = ( Frames - 2 * D - 2 ) / 1798;
      const std::int64_t N = Frames + 2 * M;
      Frames = N - 2 * ( N / 18002 );
    }
    const std::int64_t Counted = rRow.CountedFrames;
    io_rTimecode.Frames = static_cast< std::uint8_t >( Frames % Counted );
    std::int64_t Rest2 = Frames / Counted;
    io_rTimecode.Seconds = static_cast< std::uint8_t >( Rest2 % 60 );
    Rest2 /= 60;
    io_rTimecode.Minutes = static_cast< std::uint8_t >( Rest2 % 60 );
    io_rTimecode.Hours = static_cast< std::uint8_t >( Rest2 / 60 );
    return true;
  }
} // namespace MovIO
