#include "fileio/RapidAVI/VRapidAVIReader.h"

#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "services/Log.h"
#include "utils/UtilsIO/VLargeFile.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/BufferAllocators.h"

#if defined( LUMEK_HAVE_H264IO )
#include "fileio/H264IO/VH264Decoder.h"
#endif

#include <cmath>
#include <limits>

namespace RapidAVI
{
  namespace
  {
    // The tick rate of stored timecode fields, which this reader speaks at 135 MHz.
    constexpr std::uint64_t StoredTimecodeTicksPerSecond = 1080000000;
    // No frame or audio chunk of a real file comes near this; an index entry that claims more
    // is damage, and is refused before anything is allocated for it.
    constexpr std::uint64_t MaxPayloadSize = 1ull << 30;

    std::uint32_t ScaleTimecodeTicks( std::uint32_t i_Ticks )
    {
      return static_cast< std::uint32_t >( static_cast< std::uint64_t >( i_Ticks ) * ZOL::DefaultTicksPerSecond /
                                           StoredTimecodeTicksPerSecond );
    }
  } // namespace

  VRapidAVIReader::VRapidAVIReader() : m_pAllocator( std::make_shared< ZOL::VReaderBufferAllocator >( "Unnamed" ) ) {}

  VRapidAVIReader::~VRapidAVIReader() = default;

  void VRapidAVIReader::Reset()
  {
    m_pStream.reset();
    m_pH264Decoder.reset();
    m_FileSize = 0;
    m_AudioFrameInfo = ZOL::IAudioFrameInfo();
    m_AudioPayload = ZOL::AudioPayload_None;
    m_VideoFrameInfo = ZOL::IVideoFrameInfo();
    m_VideoPayload = ZOL::VideoPayload_None;
    m_FrameRate = 0.0;
    m_MoviPositions.clear();
    m_CurrentStreamKind = StreamKind_Other;
    m_OldVideoIndex.clear();
    m_OldAudioIndex.clear();
    m_StandardVideoIndex.clear();
    m_StandardAudioIndex.clear();
    m_FrameStore.Clear();
    m_Attributes.Clear();
    m_Timing = ZOL::IVideoTiming();
    m_Settings = ZOL::IVideoSettings();
    m_Timecode = ZOL::ITimecode();
    m_AudioChunkOfFrame.clear();
  }

  bool VRapidAVIReader::OpenReader( const std::string& i_rFileName )
  {
    auto pFile = std::make_shared< UtilsIO::VLargeFile >();
    if( !pFile->Open( i_rFileName, UtilsIO::OpenMode_Read ) )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Could not open AVI file for reading." );
      return false;
    }
    return OpenStream( pFile );
  }

  bool VRapidAVIReader::Open( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream )
  {
    return OpenWith( [&] { return OpenStream( i_pStream ); } );
  }

  bool VRapidAVIReader::OpenStream( const std::shared_ptr< ZOL::IInputStreamSeekable >& i_pStream )
  {
    if( !i_pStream )
      return false;
    m_pStream = i_pStream;
    if( !m_pStream->GetSize( m_FileSize ) ||
        m_FileSize > static_cast< std::uint64_t >( std::numeric_limits< std::int64_t >::max() ) ||
        !m_pStream->Seek( 0 ) )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Could not open AVI file for reading." );
      return false;
    }
    VRiffChunk Root;
    Root.Size = m_FileSize;
    if( !BuildChunkTree( Root ) )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Could not build tree of AVI chunks.  File may be corrupt." );
      return false;
    }
    for( const VRiffChunk& rChunk : Root.Children )
      if( !ParseChunk( rChunk ) )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
                   "Could not parse tree of AVI chunks.  File may be corrupt or unsupported." );
        return false;
      }
    ApplyStoredAttributes();
    BuildAudioChunkOfFrame();
#if defined( LUMEK_HAVE_H264IO )
    if( m_VideoPayload == ZOL::VideoPayload_VideoH264 )
      m_pH264Decoder = H264IO::VH264Decoder::Create( m_pAllocator );
#endif
    return true;
  }

  void VRapidAVIReader::ApplyStoredAttributes()
  {
    // A QMDT chunk describes what strf cannot (Bayer formats among them) and replaces it whole.
    ZOL::IVideoFrameInfo StoredFrameInfo;
    if( ZOL::ReadVideoFrameInfo( m_FrameStore, m_Attributes, StoredFrameInfo ) )
      m_VideoFrameInfo = StoredFrameInfo;
    ZOL::IAudioFrameInfo StoredAudioFrameInfo;
    if( ZOL::ReadAudioFrameInfo( m_FrameStore, "", StoredAudioFrameInfo ) )
      m_AudioFrameInfo = StoredAudioFrameInfo;

    // Missing keys keep what strh gave.
    const bool bStoredTiming = ZOL::ReadVideoTiming( m_Attributes, m_Timing );
    if( !bStoredTiming && m_Timing == ZOL::IVideoTiming() && m_FrameRate > 0.0 )
    {
      // Only the main header spoke of the rate.
      const double Period = std::floor( ZOL::DefaultTicksPerSecond / m_FrameRate );
      if( Period <= std::numeric_limits< std::uint32_t >::max() )
        m_Timing.FramePeriodInTicks = static_cast< std::uint32_t >( Period );
    }

    // AVI has no timecode of its own: without the keys the standard stays unset. A store cut
    // short keeps the fields read before the first missing key.
    ZOL::ITimecode StoredTimecode;
    if( ZOL::ReadTimecode( m_Attributes, StoredTimecode ) || StoredTimecode.Standards != ZOL::ITimecode().Standards )
    {
      StoredTimecode.TickRemainder = ScaleTimecodeTicks( StoredTimecode.TickRemainder );
      StoredTimecode.SubFramePeriod = ScaleTimecodeTicks( StoredTimecode.SubFramePeriod );
    }
    m_Timecode = StoredTimecode;

    if( !ZOL::ReadVideoSettings( m_Attributes, "", m_Settings ) )
      LUMEK_LOG( "RapidAVI", ZOL::LogDetail, "AVI file stores no complete display settings; defaults fill the gaps." );
  }

  bool VRapidAVIReader::ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                                       ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio )
  {
    if( !m_pStream )
      return false;
    if( i_bReadAudio && !ReadAudio( i_FrameIndex, o_rAudio ) )
      return false;
    if( i_bReadVideo )
      return ReadVideo( i_FrameIndex, o_rVideo );
    return true;
  }

  bool VRapidAVIReader::ReadAudio( std::uint64_t i_FrameIndex, ZOL::IAudioBuffers& o_rAudio )
  {
    o_rAudio.clear();
    // Frames past the end of the table have no audio of their own: chunks longer than a frame,
    // or audio shorter than the video, would otherwise freeze the end of the picture, since
    // the viewer always asks for audio.
    if( i_FrameIndex >= m_AudioChunkOfFrame.size() )
      return true;
    const VAviIndexTable& rAudio = GetAudioIndex();
    const std::uint64_t First = m_AudioChunkOfFrame[i_FrameIndex];
    const std::uint64_t End =
        i_FrameIndex + 1 < m_AudioChunkOfFrame.size() ? m_AudioChunkOfFrame[i_FrameIndex + 1] : rAudio.size();
    for( std::uint64_t i = First; i < End && i < rAudio.size(); ++i )
    {
      std::shared_ptr< ZOL::IBuffer > pBlock;
      const bool bRead = ReadEntry( rAudio[i], pBlock );
      if( pBlock )
        o_rAudio.push_back( std::move( pBlock ) );
      if( !bRead )
        return false;
    }
    return true;
  }

  bool VRapidAVIReader::ReadVideo( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo )
  {
    const VAviIndexTable& rVideo = GetVideoIndex();
    if( i_FrameIndex >= rVideo.size() )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Attempting to read frame beyond end of file." );
      return false;
    }
    const VAviIndexEntry& rEntry = rVideo[i_FrameIndex];
    if( m_VideoPayload == ZOL::VideoPayload_ImageJPEG )
      return ReadMJPEG( rEntry, o_rVideo );
    // A padded or cut raw frame would show as a sheared picture: it is not a frame at all.
    if( m_VideoPayload == ZOL::VideoPayload_Uncompressed &&
        rEntry.Size != ZOL::GetVideoFrameSizeInBytes64( m_VideoFrameInfo ) )
      return false;
    return ReadEntry( rEntry, o_rVideo );
  }

  bool VRapidAVIReader::ReadEntry( const VAviIndexEntry& i_rEntry, std::shared_ptr< ZOL::IBuffer >& o_rBuffer )
  {
    if( i_rEntry.Size > MaxPayloadSize || !FitsInFile( i_rEntry.Offset, i_rEntry.Size, m_FileSize ) || !m_pAllocator )
      return false;
    m_pAllocator->Allocate( o_rBuffer, i_rEntry.Size );
    if( !o_rBuffer )
      return false;
    return m_pStream->Seek( static_cast< std::int64_t >( i_rEntry.Offset ) ) &&
           m_pStream->Read( o_rBuffer->GetData(), i_rEntry.Size );
  }

  bool VRapidAVIReader::ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                                   bool i_bReadAudio )
  {
    return VideoEncoding::ReadDecodedFrame( *this, i_FrameIndex, o_rFrame, i_bReadVideo, i_bReadAudio, m_pAllocator,
                                            m_pAllocator, m_pH264Decoder );
  }

  void VRapidAVIReader::Close()
  {
    m_pStream.reset();
  }
} // namespace RapidAVI
