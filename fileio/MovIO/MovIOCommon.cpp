#include "fileio/MovIO/MovIOCommon.h"

#include "services/Log.h"

#include <cmath>

namespace MovIO
{
  namespace
  {
    void LogTimescale( const VMovTrack& i_rTrack )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure,
                 "%s track (%d) has a timescale that cannot be exactly represented in 1080MHz ticks.", i_rTrack.Name,
                 i_rTrack.TrackId );
    }
  } // namespace

  void VMovTrack::Reset()
  {
    TrackId = 0;
    FileDuration = 0;
    Timescale = 0;
    Duration = 0;
    SampleDuration = 0;
    SampleCount = 0;
    Chunks.clear();
  }

  bool CheckTrack( const VMovTrack& i_rTrack, std::uint32_t i_FileTimescale )
  {
    if( i_rTrack.SampleCount == 0 )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "%s track (%d) has no samples.", i_rTrack.Name, i_rTrack.TrackId );
      return false;
    }
    if( i_rTrack.Chunks.empty() )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "%s track (%d) has no chunks.", i_rTrack.Name, i_rTrack.TrackId );
      return false;
    }
    if( i_rTrack.Timescale == 0 || MovTicksPerSecond % i_rTrack.Timescale != 0 )
      LogTimescale( i_rTrack );
    if( static_cast< std::uint32_t >( i_rTrack.SampleCount * i_rTrack.SampleDuration ) != i_rTrack.Duration )
      LUMEK_LOG( "MovIO", ZOL::LogFailure,
                 "%s track (%d) has a duration that does not match total of duration of its samples.", i_rTrack.Name,
                 i_rTrack.TrackId );
    if( static_cast< std::uint64_t >( i_rTrack.Duration ) * i_FileTimescale !=
        static_cast< std::uint64_t >( i_rTrack.Timescale ) * i_rTrack.FileDuration )
    {
      // A zero scale on either side gives an infinite or undefined length; such a track is
      // reported as differing.
      const double FileSeconds = static_cast< double >( i_rTrack.FileDuration ) / i_FileTimescale;
      const double TrackSeconds = static_cast< double >( i_rTrack.Duration ) / i_rTrack.Timescale;
      const double Difference = std::fabs( FileSeconds - TrackSeconds );
      if( !( Difference <= 0.1 ) )
        LUMEK_LOG( "MovIO", ZOL::LogFailure,
                   "%s track (%d) has a duration in the file timescale (%ds) that doesn't match the duration in the "
                   "track timescale (%ds). Difference is %ds.",
                   i_rTrack.Name, i_rTrack.TrackId, FileSeconds, TrackSeconds, Difference );
    }
    return true;
  }

  std::uint64_t GetTrackPeriod( const VMovTrack& i_rTrack )
  {
    if( i_rTrack.Timescale == 0 )
    {
      LogTimescale( i_rTrack );
      return 0;
    }
    if( static_cast< std::uint64_t >( i_rTrack.SampleDuration ) * MovTicksPerSecond % i_rTrack.Timescale != 0 )
      LogTimescale( i_rTrack );
    return static_cast< std::uint64_t >( MovTicksPerSecond / i_rTrack.Timescale ) * i_rTrack.SampleDuration;
  }
} // namespace MovIO
