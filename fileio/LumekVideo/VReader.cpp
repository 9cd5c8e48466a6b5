#include "fileio/LumekVideo/VReader.h"

#include "utils/UtilsIO/VLargeFile.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/BufferAllocators.h"

#include <algorithm>
#include <iterator>
#include <limits>
#include <vector>

namespace LumekVideo
{
  namespace
  {
    constexpr std::uint64_t MaxPosition = static_cast< std::uint64_t >( std::numeric_limits< std::int64_t >::max() );
    // The index is read in blocks of this many entries: few read calls for a long recording,
    // and a bounded buffer whatever EntryCount claims.
    constexpr std::uint64_t IndexEntriesPerBlock = 4096;

    std::shared_ptr< ZOL::IBufferAllocator > MakeAllocator()
    {
      return std::make_shared< ZOL::VReaderBufferAllocator >( "Unnamed" );
    }

    std::uint64_t LoadLE64( const std::uint8_t* i_pBytes )
    {
      std::uint64_t Value = 0;
      for( int i = 0; i < 8; ++i )
        Value |= static_cast< std::uint64_t >( i_pBytes[i] ) << ( 8 * i );
      return Value;
    }

    // Whether i_Size bytes from i_Position lie inside a file of i_FileSize bytes.
    bool FitsInFile( std::uint64_t i_Position, std::uint64_t i_Size, std::uint64_t i_FileSize )
    {
      return i_Size <= i_FileSize && i_Position <= i_FileSize - i_Size;
    }
  } // namespace

  VReader::VReader()
      : m_pVideoAllocator( MakeAllocator() ), m_pAudioAllocator( MakeAllocator() ), m_pSpareAllocator( MakeAllocator() )
  {
  }

  VReader::~VReader()
  {
    m_Index.clear();
  }

  void VReader::Reset()
  {
    m_Timing = ZOL::IVideoTiming();
    m_VideoFrameInfo = ZOL::IVideoFrameInfo();
    m_Attributes.Clear();
    m_Timecode = ZOL::ITimecode();
    m_AudioFrameInfo = ZOL::IAudioFrameInfo();
    m_Settings = ZOL::IVideoSettings();
    m_Header = VFileHeader();
    m_pStream.reset();
    m_Index.clear();
    m_FileSize = 0;
    m_VideoFrameSize = 0;
    m_bIndexReached = false;
  }

  bool VReader::OpenReader( const std::string& i_rFileName )
  {
    auto pFile = std::make_shared< UtilsIO::VLargeFile >();
    if( !pFile->Open( i_rFileName, UtilsIO::OpenMode_Read ) )
      return false;
    return OpenStream( pFile );
  }

  bool VReader::Open( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream )
  {
    return OpenWith( [&] { return OpenStream( i_pStream ); } );
  }

  bool VReader::OpenStream( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream )
  {
    if( !i_pStream )
      return false;
    // The stream is the reader's from here: a failure in the index keeps it, so that the entries
    // read before a short read remain readable, as a capture cut off while writing its index is.
    m_pStream = i_pStream;
    if( !m_pStream->GetSize( m_FileSize ) || !m_pStream->Seek( 0 ) )
      return false;
    if( !ReadFileHeader( *m_pStream, m_Header ) || !m_Header.IsSupported() )
      return false;
    if( !ReadDescription() )
      return false;
    return ReadIndex();
  }

  bool VReader::ReadDescription()
  {
    // The frame description block only matters while opening; the file attributes stay.
    ZOL::IVideoAttributes FrameKeys;
    if( !FrameKeys.ReadFrom( *m_pStream ) || !m_Attributes.ReadFrom( *m_pStream ) )
      return false;
    if( !ZOL::ReadVideoFrameInfo( FrameKeys, m_Attributes, m_VideoFrameInfo ) )
      return false;
    if( !ZOL::ReadAudioFrameInfo( FrameKeys, "", m_AudioFrameInfo ) )
      return false;
    // Optional: what is missing keeps its default.
    ZOL::ReadVideoSettings( m_Attributes, "", m_Settings );
    ZOL::ReadVideoTiming( m_Attributes, m_Timing );
    ZOL::ReadTimecode( m_Attributes, m_Timecode );
    m_VideoFrameSize = ZOL::GetVideoFrameSizeInBytes64( m_VideoFrameInfo );
    return true;
  }

  bool VReader::ReadIndex()
  {
    m_bIndexReached = true;
    const std::uint64_t IndexOffset = m_Header.IndexOffset;
    if( !FitsInFile( IndexOffset, IndexCountSize, m_FileSize ) ||
        !m_pStream->Seek( static_cast< std::int64_t >( IndexOffset ) ) )
      return false;
    std::uint64_t EntryCount = 0;
    if( !ZOL::ReadLE( *m_pStream, EntryCount ) )
      return false;

    // A count beyond what the rest of the file can hold is a damaged or cut index: read the
    // entries that are there, then fail, as a short read would.
    const std::uint64_t Room = ( m_FileSize - IndexOffset - IndexCountSize ) / IndexEntrySize;
    std::uint64_t Remaining = std::min( EntryCount, Room );
    std::vector< std::uint8_t > Block(
        static_cast< std::size_t >( std::min( Remaining, IndexEntriesPerBlock ) * IndexEntrySize ) );
    while( Remaining != 0 )
    {
      const std::uint64_t Entries = std::min( Remaining, IndexEntriesPerBlock );
      if( !m_pStream->Read( Block.data(), Entries * IndexEntrySize ) )
        return false;
      for( std::uint64_t i = 0; i < Entries; ++i )
      {
        const std::uint8_t* pEntry = Block.data() + i * IndexEntrySize;
        const std::uint64_t FrameNumber = LoadLE64( pEntry );
        // The frame count is the last number plus one: the largest number has no count.
        if( FrameNumber == std::numeric_limits< std::uint64_t >::max() )
          return false;
        // A later entry for the same frame replaces the earlier one. Captures write their index
        // in frame order, so the end is nearly always the right place to look first.
        m_Index.insert_or_assign( m_Index.end(), FrameNumber, LoadLE64( pEntry + 8 ) );
      }
      Remaining -= Entries;
    }
    return EntryCount <= Room;
  }

  bool VReader::SetBufferAllocators( const std::shared_ptr< ZOL::IBufferAllocator >& i_pVideo,
                                     const std::shared_ptr< ZOL::IBufferAllocator >& i_pAudio,
                                     const std::shared_ptr< ZOL::IBufferAllocator >& i_pSpare )
  {
    m_pVideoAllocator = i_pVideo;
    m_pAudioAllocator = i_pAudio;
    m_pSpareAllocator = i_pSpare;
    return true;
  }

  ZOL::EAudioPayload VReader::GetAudioPayload() const
  {
    return m_AudioFrameInfo.IsUsable() ? ZOL::AudioPayload_Uncompressed : ZOL::AudioPayload_None;
  }

  std::uint64_t VReader::GetFrameCount() const
  {
    return m_Index.empty() ? 0 : m_Index.rbegin()->first + 1;
  }

  std::optional< std::uint64_t > VReader::FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const
  {
    auto Found = m_Index.upper_bound( i_FrameIndex );
    if( Found == m_Index.begin() )
      return std::nullopt;
    return std::prev( Found )->first;
  }

  std::optional< std::uint64_t > VReader::FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const
  {
    const auto Found = m_Index.lower_bound( i_FrameIndex );
    if( Found == m_Index.end() )
      return std::nullopt;
    return Found->first;
  }

  bool VReader::HasFrame( std::uint64_t i_FrameIndex ) const
  {
    return m_Index.count( i_FrameIndex ) != 0;
  }

  bool VReader::ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                               ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio )
  {
    if( !m_pStream )
      return false;
    const auto Entry = m_Index.find( i_FrameIndex );
    if( Entry == m_Index.end() )
      return false;
    if( !i_bReadVideo && !i_bReadAudio )
      return true;
    const std::uint64_t FrameOffset = Entry->second;
    if( FrameOffset > MaxPosition || !m_pStream->Seek( static_cast< std::int64_t >( FrameOffset ) ) )
      return false;

    // The size comes from the file's description, so it is checked against the file before a
    // single byte is allocated for it.
    const bool bFrameInFile = FitsInFile( FrameOffset, m_VideoFrameSize, m_FileSize );
    if( i_bReadVideo )
    {
      if( !bFrameInFile || !m_pVideoAllocator )
        return false;
      std::shared_ptr< ZOL::IBuffer > pVideo;
      m_pVideoAllocator->Allocate( pVideo, m_VideoFrameSize );
      if( !pVideo || !m_pStream->Read( pVideo->GetData(), m_VideoFrameSize ) )
        return false;
      o_rVideo = std::move( pVideo );
    }
    else if( !bFrameInFile || !m_pStream->Seek( static_cast< std::int64_t >( FrameOffset + m_VideoFrameSize ) ) )
    {
      // The audio would sit beyond the end of the file, or a failed seek would start the audio
      // read inside the video bytes.
      return false;
    }

    if( !i_bReadAudio )
      return true;
    if( !AlignStream() )
      return false;
    if( !m_AudioFrameInfo.IsUsable() )
      return true;
    return ReadAudio( o_rAudio );
  }

  bool VReader::ReadAudio( ZOL::IAudioBuffers& o_rAudio )
  {
    std::uint32_t AudioByteCount = 0;
    if( !ZOL::ReadLE( *m_pStream, AudioByteCount ) )
      return false;
    if( AudioByteCount == 0 )
      return AlignStream();

    // Only whole sample groups are read; a partial group at the end is left in the file.
    const std::uint64_t GroupSize = ZOL::GetAudioSampleGroupSizeInBytes( m_AudioFrameInfo );
    if( GroupSize == 0 )
      return false;
    const std::uint64_t Bytes = AudioByteCount / GroupSize * GroupSize;
    std::uint64_t Position = 0;
    if( !m_pStream->GetPosition( Position ) || !FitsInFile( Position, Bytes, m_FileSize ) || !m_pAudioAllocator )
      return false;
    std::shared_ptr< ZOL::IBuffer > pAudio;
    m_pAudioAllocator->Allocate( pAudio, Bytes );
    if( !pAudio || !m_pStream->Read( pAudio->GetData(), Bytes ) )
      return false;
    o_rAudio.clear();
    o_rAudio.push_back( std::move( pAudio ) );
    return AlignStream();
  }

  bool VReader::AlignStream()
  {
    std::uint64_t Position = 0;
    std::uint64_t Aligned = 0;
    // An alignment of 0 cannot come from a file that has frames; it fails here rather than
    // dividing by zero.
    if( !m_pStream->GetPosition( Position ) || !AlignUp( Position, m_Header.Alignment, Aligned ) )
      return false;
    return Aligned == Position || m_pStream->Seek( static_cast< std::int64_t >( Aligned ) );
  }

  void VReader::Close()
  {
    if( !m_pStream )
      return;
    m_pStream.reset();
    m_Index.clear();
    m_VideoFrameInfo = ZOL::IVideoFrameInfo();
    m_AudioFrameInfo = ZOL::IAudioFrameInfo();
  }
} // namespace LumekVideo
