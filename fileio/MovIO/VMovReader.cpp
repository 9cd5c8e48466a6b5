#include "fileio/MovIO/VMovReader.h"

#include "fileio/MovIO/MovReadAtom.h"
#include "videointerface/BufferAllocators.h"

namespace MovIO
{
  namespace
  {
    void LogGeneralFailure()
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "There was an error parsing the MOV file." );
    }
  } // namespace

  VMovReader::VMovReader()
      : m_pFrameAllocator( std::make_shared< ZOL::VFrameBufferAllocator >( "Unnamed" ) ),
        m_pAudioAllocator( std::make_shared< ZOL::VReaderBufferAllocator >( "Unnamed" ) ),
        m_pCompressedAllocator( std::make_shared< ZOL::VReaderBufferAllocator >( "Unnamed" ) )
  {
  }

  VMovReader::~VMovReader()
  {
    Close();
  }

  void VMovReader::Reset()
  {
    m_pReader.reset();
    m_AudioPayload = ZOL::AudioPayload_None;
    m_VideoPayload = ZOL::VideoPayload_None;
    m_AudioFrameInfo = ZOL::IAudioFrameInfo();
    m_VideoFrameInfo = ZOL::IVideoFrameInfo();
    m_FrameStore.Clear();
    m_Attributes.Clear();
    m_SPS.clear();
    m_PPS.clear();
    m_Timing = ZOL::IVideoTiming();
    m_WorkingTimecode = ZOL::ITimecode();
    m_Timecode = ZOL::ITimecode();
    m_Settings = ZOL::IVideoSettings();
    m_FileTimescale = 0;
    m_FileDuration = 0;
    m_VideoTrack.Reset();
    m_TimecodeTrack.Reset();
    m_AudioTrack.Reset();
    m_Frames.clear();
    m_TimecodeDescription = VTimecodeDescription();
    m_AudioChunkCache.clear();
    m_CachedAudioChunk = NoIndex;
  }

  bool VMovReader::OpenReader( const std::string& i_rFileName )
  {
    m_pReader = std::make_shared< VMovPrimitiveReader >( i_rFileName );
    return OpenInternal();
  }

  bool VMovReader::Open( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream )
  {
    return OpenWith(
        [&]
        {
          m_pReader = std::make_shared< VMovPrimitiveReader >( i_pStream );
          return OpenInternal();
        } );
  }

  bool VMovReader::OpenInternal()
  {
    VMovAtom Root;
    Root.Size = m_pReader->GetFileSize();
    if( !BuildAtomTree( *m_pReader, Root ) )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "Could not parse atom tree in mov file." );
      return false;
    }
    const VMovAtom* pMoov = FindAtom( Root, { "moov" } );
    if( pMoov == nullptr )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "Could not find 'moov' atom in mov file." );
      return false;
    }
    VTraks Traks;
    bool bOk = SelectTracks( *pMoov, Traks ) && ReadMvhd( Root );
    if( bOk && Traks.pVideo == nullptr )
    {
      // Without a video track there is no frame table.
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "Could not find a video track in mov file." );
      bOk = false;
    }
    bOk = bOk && ReadVideoTrack( *Traks.pVideo );
    bOk = bOk && ( Traks.pAudio == nullptr || ReadAudioTrack( *Traks.pAudio ) );
    bOk = bOk && ( Traks.pTimecode == nullptr || ReadTimecodeTrack( *Traks.pTimecode ) );
    if( !bOk )
    {
      LogGeneralFailure();
      return false;
    }
    if( m_FileTimescale == 0 || MovTicksPerSecond % m_FileTimescale != 0 )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "File has a timescale that cannot be represented in 1080MHz ticks." );
      return false;
    }
    if( Traks.pAudio != nullptr )
      AssignAudioToFrames();

    m_Timing.TicksPerSecond = MovTicksPerSecond;
    m_Timing.FramePeriodInTicks = static_cast< std::uint32_t >( GetTrackPeriod( m_VideoTrack ) );
    m_Timing.StartOffsetInTicks = 0;
    if( !SetTimecode( Root, Traks.pTimecode != nullptr ) )
      return false;

    // The rest of the system counts timecode ticks at 135 MHz.
    m_Timecode = m_WorkingTimecode;
    m_Timecode.TickRemainder =
        static_cast< std::uint32_t >( static_cast< std::uint64_t >( m_WorkingTimecode.TickRemainder ) *
                                      ZOL::TimecodeTicksPerSecond / MovTicksPerSecond );
    m_Timecode.SubFramePeriod =
        static_cast< std::uint32_t >( static_cast< std::uint64_t >( m_WorkingTimecode.SubFramePeriod ) *
                                      ZOL::TimecodeTicksPerSecond / MovTicksPerSecond );
    return true;
  }

  bool VMovReader::SelectTracks( const VMovAtom& i_rMoov, VTraks& o_rTraks )
  {
    for( const auto& pTrak : i_rMoov.Children )
    {
      if( pTrak->Type != FourCC( "trak" ) )
        continue;
      // A track without a handler is no track of a kind this reader plays; it is passed over
      // like one of an unknown kind.
      const VMovAtom* pHdlr = FindAtom( *pTrak, { "mdia", "hdlr" } );
      if( pHdlr == nullptr )
        continue;
      std::uint32_t Subtype = 0;
      if( !m_pReader->Seek( pHdlr->Position + 16 ) || !m_pReader->ReadU32( Subtype ) )
      {
        LUMEK_LOG( "MovIO", ZOL::LogFailure, "Could not read '%s' atom.", pHdlr->Name );
        return false;
      }
      // The last track of each kind wins.
      if( Subtype == FourCC( "vide" ) )
        o_rTraks.pVideo = pTrak.get();
      else if( Subtype == FourCC( "soun" ) )
        o_rTraks.pAudio = pTrak.get();
      else if( Subtype == FourCC( "tmcd" ) )
        o_rTraks.pTimecode = pTrak.get();
    }
    return true;
  }

  bool VMovReader::ReadTrackHeaders( const VMovAtom& i_rTrak, ETrackKind i_Kind )
  {
    return ReadTkhd( i_rTrak, i_Kind ) && ReadElst( i_rTrak, i_Kind ) && ReadMdhd( i_rTrak, i_Kind );
  }

  bool VMovReader::ReadSampleTables( const VMovAtom& i_rStbl, ETrackKind i_Kind )
  {
    return ReadStts( i_rStbl, i_Kind ) && ReadStsz( i_rStbl, i_Kind ) && ReadStsc( i_rStbl, i_Kind ) &&
           CheckTrack( TrackOf( i_Kind ), m_FileTimescale );
  }

  bool VMovReader::ReadVideoTrack( const VMovAtom& i_rTrak )
  {
    if( !ReadTrackHeaders( i_rTrak, TrackKind_Video ) )
      return false;
    const VMovAtom* pStbl = FindAtom( i_rTrak, { "mdia", "minf", "stbl" } );
    if( pStbl == nullptr || !ReadVideoStsd( *pStbl ) || !ReadChunkOffsets( *pStbl, TrackKind_Video ) ||
        !ReadSampleTables( *pStbl, TrackKind_Video ) )
      return false;
    // Frame times are counted in the video's time scale; without one there are none.
    return m_VideoTrack.Timescale != 0;
  }

  bool VMovReader::ReadAudioTrack( const VMovAtom& i_rTrak )
  {
    if( !ReadTrackHeaders( i_rTrak, TrackKind_Audio ) )
      return false;
    const VMovAtom* pStbl = FindAtom( i_rTrak, { "mdia", "minf", "stbl" } );
    return pStbl != nullptr && ReadChunkOffsets( *pStbl, TrackKind_Audio ) && ReadAudioStsd( *pStbl ) &&
           ReadSampleTables( *pStbl, TrackKind_Audio );
  }

  bool VMovReader::ReadTimecodeTrack( const VMovAtom& i_rTrak )
  {
    if( !ReadTrackHeaders( i_rTrak, TrackKind_Timecode ) || !ReadTcmi( i_rTrak ) )
      return false;
    const VMovAtom* pStbl = FindAtom( i_rTrak, { "mdia", "minf", "stbl" } );
    return pStbl != nullptr && ReadChunkOffsets( *pStbl, TrackKind_Timecode ) && ReadTimecodeStsd( *pStbl ) &&
           ReadSampleTables( *pStbl, TrackKind_Timecode );
  }

  VMovTrack& VMovReader::TrackOf( ETrackKind i_Kind )
  {
    return i_Kind == TrackKind_Video ? m_VideoTrack : i_Kind == TrackKind_Audio ? m_AudioTrack : m_TimecodeTrack;
  }

  const VMovTrack& VMovReader::TrackOf( ETrackKind i_Kind ) const
  {
    return i_Kind == TrackKind_Video ? m_VideoTrack : i_Kind == TrackKind_Audio ? m_AudioTrack : m_TimecodeTrack;
  }

  bool VMovReader::DumpFileStructure( std::ostream& o_rStream )
  {
    if( !m_pReader )
      return false;
    const std::uint64_t Position = m_pReader->Tell();
    VMovAtom Root;
    Root.Size = m_pReader->GetFileSize();
    const bool bBuilt = m_pReader->Seek( 0 ) && BuildAtomTree( *m_pReader, Root );
    static_cast< void >( m_pReader->Seek( Position ) );
    if( !bBuilt )
    {
      LUMEK_LOG( "MovIO", ZOL::LogFailure, "Could not parse atom tree in mov file." );
      return false;
    }
    WriteAtomTree( Root, o_rStream );
    return true;
  }

  bool VMovReader::SetBufferAllocators( const std::shared_ptr< ZOL::IBufferAllocator >& i_pVideo,
                                        const std::shared_ptr< ZOL::IBufferAllocator >& i_pAudio,
                                        const std::shared_ptr< ZOL::IBufferAllocator >& i_pSpare )
  {
    m_pFrameAllocator = i_pVideo;
    m_pAudioAllocator = i_pAudio;
    m_pCompressedAllocator = i_pSpare;
    return true;
  }

  void VMovReader::Close()
  {
    if( m_pReader )
      static_cast< void >( m_pReader->Close() );
  }
} // namespace MovIO
