// The index tables: OpenDML standard indexes and the old idx1, which table is used, and which
// audio chunks belong to which frame.

#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "services/Log.h"

#include <algorithm>
#include <limits>

namespace RapidAVI
{
  namespace
  {
    constexpr std::uint64_t StandardIndexHeaderSize = 24;
    constexpr std::uint64_t StandardIndexEntrySize = 8;
    constexpr std::uint64_t OldIndexEntrySize = 16;
    // Entries are read in blocks of this many: few read calls for a long file, and a bounded
    // buffer whatever a count claims.
    constexpr std::uint64_t EntriesPerBlock = 4096;

    std::uint64_t AddClamped( std::uint64_t i_A, std::uint64_t i_B )
    {
      // A sum that wraps would name a position inside the file; the largest value names none.
      return i_A > std::numeric_limits< std::uint64_t >::max() - i_B ? std::numeric_limits< std::uint64_t >::max()
                                                                     : i_A + i_B;
    }

    // Reads i_Count entries of i_EntrySize bytes in blocks, giving each to i_rTake.
    template < typename TTake >
    bool ReadEntries( ZOL::IInputStream& i_rStream, std::uint64_t i_Count, std::uint64_t i_EntrySize, TTake&& i_rTake )
    {
      std::vector< std::uint8_t > Block(
          static_cast< std::size_t >( std::min( i_Count, EntriesPerBlock ) * i_EntrySize ) );
      while( i_Count != 0 )
      {
        const std::uint64_t Entries = std::min( i_Count, EntriesPerBlock );
        if( !i_rStream.Read( Block.data(), Entries * i_EntrySize ) )
          return false;
        for( std::uint64_t i = 0; i < Entries; ++i )
          i_rTake( Block.data() + i * i_EntrySize );
        i_Count -= Entries;
      }
      return true;
    }
  } // namespace

  bool VRapidAVIReader::ParseVideoStandardIndex( const VRiffChunk& i_rChunk )
  {
    return ParseStandardIndex( i_rChunk, m_StandardVideoIndex );
  }

  bool VRapidAVIReader::ParseAudioStandardIndex( const VRiffChunk& i_rChunk )
  {
    return ParseStandardIndex( i_rChunk, m_StandardAudioIndex );
  }

  bool VRapidAVIReader::ParseStandardIndex( const VRiffChunk& i_rChunk, VAviIndexTable& io_rTable )
  {
    std::uint8_t Header[StandardIndexHeaderSize];
    // A count beyond what the chunk holds would read the chunks behind it as entries.
    const bool bHeader = i_rChunk.Size >= StandardIndexHeaderSize && m_pStream->Read( Header, sizeof( Header ) );
    const std::uint64_t Count = bHeader ? LoadLE32( Header + 4 ) : 0;
    const std::uint64_t Base = bHeader ? LoadLE( Header + 12, 8 ) : 0;
    const bool bFits =
        bHeader && Count <= ( i_rChunk.Size - StandardIndexHeaderSize ) / StandardIndexEntrySize &&
        FitsInFile( i_rChunk.Position + 8 + StandardIndexHeaderSize, Count * StandardIndexEntrySize, m_FileSize );
    // The size word is kept whole: an entry with the top bit (not a key frame) set has a size
    // no frame can have, and reading it fails.
    if( !bFits ||
        !ReadEntries( *m_pStream, Count, StandardIndexEntrySize,
                      [&]( const std::uint8_t* pEntry ) {
                        io_rTable.push_back( { AddClamped( Base, LoadLE32( pEntry ) ), LoadLE32( pEntry + 4 ) } );
                      } ) )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Could not read AVI file index." );
      return false;
    }
    return true;
  }

  bool VRapidAVIReader::ParseOldIndex( const VRiffChunk& i_rChunk )
  {
    if( m_MoviPositions.empty() )
    {
      // Its offsets count from a movi list that is not there: nothing in it can be placed.
      LUMEK_LOG( "RapidAVI", ZOL::LogWarning, "Index 'idx1' ahead of any 'LIST-movi' chunk ignored." );
      return true;
    }
    // The entry's offset runs from the movi FourCC to the chunk's header: the payload is 4
    // bytes behind the position after the FourCC plus that offset.
    const std::uint64_t Origin = m_MoviPositions.front() + 4;
    const std::uint64_t Count = i_rChunk.Size / OldIndexEntrySize;
    const std::uint64_t Start = i_rChunk.Position + 8;
    const std::uint64_t Room = Start < m_FileSize ? ( m_FileSize - Start ) / OldIndexEntrySize : 0;
    const bool bRead =
        ReadEntries( *m_pStream, std::min( Count, Room ), OldIndexEntrySize,
                     [&]( const std::uint8_t* pEntry )
                     {
                       const std::uint32_t Id = LoadLE32( pEntry );
                       const VAviIndexEntry Entry{ Origin + LoadLE32( pEntry + 8 ), LoadLE32( pEntry + 12 ) };
                       if( Id == FourCC::VideoBits || Id == FourCC::VideoCompressed )
                         m_OldVideoIndex.push_back( Entry );
                       else if( Id == FourCC::AudioWave )
                         m_OldAudioIndex.push_back( Entry );
                     } );
    return bRead && Count <= Room;
  }

  const VAviIndexTable& VRapidAVIReader::GetVideoIndex() const
  {
    return m_StandardVideoIndex.empty() ? m_OldVideoIndex : m_StandardVideoIndex;
  }

  const VAviIndexTable& VRapidAVIReader::GetAudioIndex() const
  {
    return m_StandardAudioIndex.empty() ? m_OldAudioIndex : m_StandardAudioIndex;
  }

  std::uint64_t VRapidAVIReader::GetFrameCount() const
  {
    // Either table may promise more frames than the chosen one holds; those frames fail.
    return std::max( m_StandardVideoIndex.size(), m_OldVideoIndex.size() );
  }

  bool VRapidAVIReader::HasFrame( std::uint64_t i_FrameIndex ) const
  {
    return i_FrameIndex < GetFrameCount();
  }

  std::optional< std::uint64_t > VRapidAVIReader::FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const
  {
    const std::uint64_t Count = GetFrameCount();
    if( Count == 0 )
      return std::nullopt;
    return std::min( i_FrameIndex, Count - 1 );
  }

  std::optional< std::uint64_t > VRapidAVIReader::FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const
  {
    if( i_FrameIndex >= GetFrameCount() )
      return std::nullopt;
    return i_FrameIndex;
  }

  void VRapidAVIReader::BuildAudioChunkOfFrame()
  {
    m_AudioChunkOfFrame.clear();
    // Audio that cannot be played is not read at all, and neither is audio whose play time
    // cannot be worked out: the file then plays without sound.
    const std::uint64_t SampleSize = ZOL::GetAudioSampleSizeInBytes( m_AudioFrameInfo.SampleFormat );
    if( m_AudioPayload != ZOL::AudioPayload_Uncompressed || !m_AudioFrameInfo.IsUsable() || SampleSize == 0 ||
        m_Timing.FramePeriodInTicks == 0 || m_Timing.TicksPerSecond == 0 )
      return;

    const std::uint64_t GroupSize = SampleSize * static_cast< std::uint64_t >( m_AudioFrameInfo.Channels );
    const std::uint64_t SampleRate = static_cast< std::uint64_t >( m_AudioFrameInfo.SampleRate );
    const VAviIndexTable& rAudio = GetAudioIndex();
    std::uint64_t Ticks = 0;
    for( std::uint64_t i = 0; i < rAudio.size(); ++i )
    {
      // At most one entry a chunk: a chunk longer than a frame leaves the table shorter than
      // the video, and the frames past its end read without audio.
      if( m_AudioChunkOfFrame.size() <= Ticks / m_Timing.FramePeriodInTicks )
        m_AudioChunkOfFrame.push_back( i );
      // A chunk's size is 32 bits, so samples times ticks a second stays far inside 64 bits.
      const std::uint64_t Samples = rAudio[i].Size / GroupSize;
      Ticks = AddClamped( Ticks, Samples * m_Timing.TicksPerSecond / SampleRate );
    }
  }
} // namespace RapidAVI
