#include "fileio/MkvIO/VMkvReader.h"

#include "fileio/MkvIO/MkvCodecs.h"
#include "fileio/MkvIO/MkvElements.h"
#include "fileio/MkvIO/MkvReaderLog.h"
#include "fileio/MkvIO/VMkvIOCallback.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/BufferAllocators.h"

#include <ebml/EbmlHead.h>
#include <matroska/KaxBlock.h>
#include <matroska/KaxCluster.h>
#include <matroska/KaxInfo.h>
#include <matroska/KaxSegment.h>
#include <matroska/KaxTags.h>
#include <matroska/KaxTracks.h>

#include <algorithm>
#include <cstring>
#include <exception>

using namespace libebml;
using namespace libmatroska;

namespace MkvIO
{
  namespace
  {
    // A Cluster keeps at most this many BlockGroups: a frame of the family has two or three, and a
    // damaged Cluster of tiny elements should not turn into millions of objects per frame.
    constexpr std::size_t MaxClusterChildren = 4096;

    void CopyFrame( KaxInternalBlock& i_rBlock, ZOL::IBufferAllocator& i_rAllocator,
                    std::shared_ptr< ZOL::IBuffer >& o_rBuffer )
    {
      DataBuffer& rFrame = i_rBlock.GetBuffer( 0 );
      std::shared_ptr< ZOL::IBuffer > pBuffer;
      i_rAllocator.Allocate( pBuffer, rFrame.Size() );
      if( !pBuffer )
        return;
      if( rFrame.Size() != 0 )
        std::memcpy( pBuffer->GetData(), rFrame.Buffer(), rFrame.Size() );
      o_rBuffer = std::move( pBuffer );
    }

    // Whether a block holds several frames. libmatroska loses the frames it made when a lace
    // turns out damaged, and the family never laces, so such blocks are not handed to it.
    bool IsLaced( EbmlStream& io_rStream, const EbmlElement& i_rBlock )
    {
      binary Head[5] = {};
      const std::uint64_t Size = std::min< std::uint64_t >( i_rBlock.GetSize(), sizeof( Head ) );
      const std::uint64_t Read = io_rStream.I_O().read( Head, static_cast< std::size_t >( Size ) );
      io_rStream.I_O().setFilePointer( static_cast< int64 >( DataStart( i_rBlock ) ) );
      // The track number is a one- or two-byte number, then two bytes of time, then the flags.
      const std::size_t FlagsAt = ( Head[0] & 0x80 ) ? 3 : 4;
      return Read > FlagsAt && ( Head[FlagsAt] & 0x06 ) != 0;
    }
  } // namespace

  VMkvReader::VMkvReader()
      : m_pVideoAllocator( std::make_shared< ZOL::VReaderBufferAllocator >( "Unnamed" ) ),
        m_pDecodeAllocator( std::make_shared< ZOL::VFrameBufferAllocator >( "Unnamed" ) ),
        m_pTemporaryAllocator( std::make_shared< ZOL::VFrameBufferAllocator >( "Unnamed" ) )
  {
  }

  VMkvReader::~VMkvReader()
  {
    Reset();
  }

  void VMkvReader::Reset()
  {
    // The elements refer to the stream and the stream to the callback: release in that order.
    m_Clusters.clear();
    m_pSegment.reset();
    m_pStream.reset();
    m_pCallback.reset();
    m_Tags.clear();
    m_InternalAttributes.Clear();
    m_ExternalAttributes.Clear();
    m_VideoFrameInfo = ZOL::IVideoFrameInfo();
    m_AudioFrameInfo = ZOL::IAudioFrameInfo();
    m_Timing = ZOL::IVideoTiming();
    m_Timecode = ZOL::ITimecode();
    m_Settings = ZOL::IVideoSettings();
    m_VideoPayload = ZOL::VideoPayload_None;
    m_AudioPayload = ZOL::AudioPayload_None;
    m_Duration = 0.0;
    m_TimecodeScale = 1000000;
    m_FileSize = 0;
    m_SegmentEnd = 0;
  }

  void VMkvReader::Close()
  {
    Reset();
  }

  bool VMkvReader::OpenReader( const std::string& i_rFileName )
  {
    auto pCallback = std::make_unique< VMkvIOCallback >();
    if( !pCallback->Open( i_rFileName, false ) )
    {
      MKV_LOG( ZOL::LogFailure, "File could not be opened." );
      return false;
    }
    return OpenCallback( std::move( pCallback ) );
  }

  bool VMkvReader::Open( std::unique_ptr< libebml::IOCallback > i_pCallback )
  {
    return OpenWith( [&] { return OpenCallback( std::move( i_pCallback ) ); } );
  }

  bool VMkvReader::OpenCallback( std::unique_ptr< libebml::IOCallback > i_pCallback )
  {
    if( !i_pCallback )
      return false;
    m_pCallback = std::move( i_pCallback );
    bool bOpened = false;
    // libebml reports damage by throwing; nothing of that crosses this reader.
    try
    {
      bOpened = OpenSegment() && WalkSegment();
    }
    catch( const std::exception& rError )
    {
      MKV_LOG( ZOL::LogFailure, "Matroska parsing failed: %s", rError.what() );
    }
    catch( ... )
    {
      MKV_LOG( ZOL::LogFailure, "Matroska parsing failed: %s", "unknown error" );
    }
    return bOpened;
  }

  bool VMkvReader::OpenSegment()
  {
    m_pCallback->setFilePointer( 0, seek_end );
    m_FileSize = m_pCallback->getFilePointer();
    m_pCallback->setFilePointer( 0 );
    m_pStream = std::make_unique< EbmlStream >( *m_pCallback );

    std::unique_ptr< EbmlElement > pHead( m_pStream->FindNextID( EBML_INFO( EbmlHead ), m_FileSize ) );
    if( !pHead || !Is< EbmlHead >( *pHead ) || !pHead->IsFiniteSize() || pHead->GetEndPosition() > m_FileSize )
    {
      MKV_LOG( ZOL::LogFailure, "EbmlHead missing." );
      return false;
    }
    m_pCallback->setFilePointer( static_cast< int64 >( pHead->GetEndPosition() ) );

    const std::uint64_t Remaining = m_FileSize - pHead->GetEndPosition();
    std::unique_ptr< EbmlElement > pSegment( m_pStream->FindNextID( EBML_INFO( KaxSegment ), Remaining ) );
    // A live stream leaves the size unknown; such a file has no end to walk to.
    if( !pSegment || !Is< KaxSegment >( *pSegment ) || !pSegment->IsFiniteSize() ||
        pSegment->GetSize() >= ( std::uint64_t( 1 ) << ( 7 * pSegment->GetSizeLength() ) ) - 1 )
    {
      MKV_LOG( ZOL::LogFailure, "KaxSegment missing or not a finite size." );
      return false;
    }
    m_pSegment.reset( static_cast< KaxSegment* >( pSegment.release() ) );
    // A file cut short keeps the Clusters that are whole.
    const std::uint64_t Start = DataStart( *m_pSegment );
    m_SegmentEnd = std::min( m_FileSize, Start + std::min( m_pSegment->GetSize(), m_FileSize ) );
    return true;
  }

  bool VMkvReader::WalkSegment()
  {
    std::uint64_t Position = DataStart( *m_pSegment );
    bool bFoundAny = false;
    while( Position < m_SegmentEnd )
    {
      m_pCallback->setFilePointer( static_cast< int64 >( Position ) );
      int UpperLevel = 0;
      std::unique_ptr< EbmlElement > pElement(
          m_pStream->FindNextElement( EBML_CONTEXT( m_pSegment.get() ), UpperLevel, m_SegmentEnd - Position, true ) );
      if( !pElement || UpperLevel > 0 )
        break;
      bFoundAny = true;
      if( !pElement->IsFiniteSize() )
      {
        MKV_LOG( ZOL::LogFailure, "Element of unknown size found in the KaxSegment." );
        return false;
      }
      const std::uint64_t End = pElement->GetEndPosition();
      if( End > m_SegmentEnd || End <= Position )
      {
        MKV_LOG( ZOL::LogWarning, "Element at %d runs past the end of the file; the frames before it are kept.",
                 Position );
        break;
      }

      if( Is< KaxInfo >( *pElement ) )
      {
        if( !ReadInfo( *pElement ) )
          return false;
      }
      else if( Is< KaxTracks >( *pElement ) )
      {
        if( !ReadTracks( *pElement ) )
          return false;
      }
      else if( Is< KaxTags >( *pElement ) )
      {
        ReadTags( *pElement );
      }
      else if( Is< KaxCluster >( *pElement ) )
      {
        auto* pCluster = static_cast< KaxCluster* >( pElement.release() );
        m_Clusters.emplace_back( pCluster );
        KeepBlockGroups( *pCluster );
      }
      Position = End;
    }
    if( !bFoundAny )
    {
      MKV_LOG( ZOL::LogFailure, "Next element could not be found." );
      return false;
    }
    if( m_VideoPayload == ZOL::VideoPayload_None )
    {
      MKV_LOG( ZOL::LogFailure, "No video track found." );
      return false;
    }

    // The records go into the stores first, so that a tag can change any of their fields.
    ZOL::WriteVideoFrameInfo( m_InternalAttributes, m_VideoFrameInfo );
    ZOL::WriteAudioFrameInfo( m_InternalAttributes, "", m_AudioFrameInfo );
    ZOL::WriteVideoTiming( m_ExternalAttributes, m_Timing );
    ZOL::WriteTimecode( m_ExternalAttributes, m_Timecode );
    ZOL::WriteVideoSettings( m_ExternalAttributes, "", m_Settings );
    ApplyTags();
    // Results ignored: a record a tag spoiled keeps the fields that did read. Only a frame
    // description that no longer describes a picture falls back to the track's.
    const ZOL::IVideoFrameInfo TrackVideo = m_VideoFrameInfo;
    ZOL::ReadVideoFrameInfo( m_InternalAttributes, m_InternalAttributes, m_VideoFrameInfo );
    if( m_VideoFrameInfo.ImageWidth <= 0 || m_VideoFrameInfo.ImageHeight <= 0 ||
        m_VideoFrameInfo.PixelFormat == ZOL::PixelFormat_Unspecified )
      m_VideoFrameInfo = TrackVideo;
    ZOL::ReadAudioFrameInfo( m_InternalAttributes, "", m_AudioFrameInfo );
    ZOL::ReadVideoTiming( m_ExternalAttributes, m_Timing );
    ZOL::ReadTimecode( m_ExternalAttributes, m_Timecode );
    ZOL::ReadVideoSettings( m_ExternalAttributes, "", m_Settings );
    ComputeFramePeriod();
    return true;
  }

  void VMkvReader::ApplyTags()
  {
    static const std::string Internal = "Lumek.Internal.";
    static const std::string External = "Lumek.External.";
    for( const auto& rTag : m_Tags )
    {
      ZOL::IVideoAttributes* pStore = nullptr;
      std::string Key;
      if( rTag.first.compare( 0, Internal.size(), Internal ) == 0 )
      {
        pStore = &m_InternalAttributes;
        Key = rTag.first.substr( Internal.size() );
      }
      else if( rTag.first.compare( 0, External.size(), External ) == 0 )
      {
        pStore = &m_ExternalAttributes;
        Key = rTag.first.substr( External.size() );
      }
      // Only keys the reader wrote can change; a text that does not parse keeps the value.
      if( pStore && pStore->Has( Key ) )
        (void)pStore->SetValueFromString( Key, rTag.second );
    }
    m_Tags.clear();
  }

  void VMkvReader::ComputeFramePeriod()
  {
    const ZOL::IVideoTiming Default;
    if( m_Timing.TicksPerSecond != Default.TicksPerSecond || m_Timing.FramePeriodInTicks != 0 ||
        m_Timing.StartOffsetInTicks != 0 )
      return;
    if( m_Clusters.empty() || !( m_Duration > 0.0 ) || m_TimecodeScale == 0 )
      return;
    const double Rate = ( static_cast< double >( m_Clusters.size() ) / m_Duration ) * 999999999.9999999 /
                        static_cast< double >( m_TimecodeScale );
    if( !( Rate > 0.0 ) )
      return;
    const double Period = static_cast< double >( Default.TicksPerSecond ) / Rate;
    // A damaged Duration must not become an out-of-range conversion.
    if( Period >= 0.0 && Period < 4294967296.0 )
      m_Timing.FramePeriodInTicks = static_cast< std::uint32_t >( Period );
  }

  std::optional< std::uint64_t > VMkvReader::FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const
  {
    if( m_Clusters.empty() )
      return std::nullopt;
    return std::min< std::uint64_t >( i_FrameIndex, m_Clusters.size() - 1 );
  }

  std::optional< std::uint64_t > VMkvReader::FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const
  {
    if( i_FrameIndex >= m_Clusters.size() )
      return std::nullopt;
    return i_FrameIndex;
  }

  bool VMkvReader::ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                                  ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio )
  {
    if( i_FrameIndex >= m_Clusters.size() || !m_pStream )
      return false;
    KaxCluster& rCluster = *m_Clusters[static_cast< std::uint32_t >( i_FrameIndex )];
    std::shared_ptr< ZOL::IBuffer > pVideo;
    std::shared_ptr< ZOL::IBuffer > pAudio;
    try
    {
      if( !ReadFrameBlocks( rCluster, pVideo, pAudio, i_bReadVideo, i_bReadAudio ) )
        return false;
    }
    catch( const std::exception& rError )
    {
      MKV_LOG( ZOL::LogFailure, "Frame %d could not be read: %s", i_FrameIndex, rError.what() );
      return false;
    }
    catch( ... )
    {
      MKV_LOG( ZOL::LogFailure, "Frame %d could not be read: %s", i_FrameIndex, "unknown error" );
      return false;
    }
    // A Cluster without audio adds nothing: every buffer handed on holds bytes to play.
    if( i_bReadAudio && pAudio )
      o_rAudio.push_back( std::move( pAudio ) );
    if( i_bReadVideo )
      o_rVideo = std::move( pVideo );
    return true;
  }

  bool VMkvReader::ReadFrameBlocks( KaxCluster& io_rCluster, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                                    std::shared_ptr< ZOL::IBuffer >& o_rAudio, bool i_bReadVideo, bool i_bReadAudio )
  {
    // Each group's Block is read whole and destroyed before the next: one block alive at a time.
    for( EbmlElement* pChild : io_rCluster.GetElementList() )
    {
      if( !Is< KaxBlockGroup >( *pChild ) )
        continue;
      auto& rGroup = static_cast< KaxBlockGroup& >( *pChild );
      bool bBlockSeen = false;
      ForEachChild( *m_pStream, rGroup,
                    [&]( std::unique_ptr< EbmlElement >& io_rpElement )
                    {
                      if( bBlockSeen || !Is< KaxBlock >( *io_rpElement ) )
                        return;
                      bBlockSeen = true;
                      auto& rBlock = static_cast< KaxBlock& >( *io_rpElement );
                      if( IsLaced( *m_pStream, rBlock ) )
                      {
                        MKV_LOG( ZOL::LogWarning, "Laced block at %d skipped: frames of this family are never laced.",
                                 rBlock.GetElementPosition() );
                        return;
                      }
                      rBlock.ReadData( m_pStream->I_O(), SCOPE_ALL_DATA );
                      if( rBlock.ValueIsSet() && rBlock.NumberFrames() != 0 )
                        TakeBlock( rBlock, o_rVideo, o_rAudio, i_bReadVideo, i_bReadAudio );
                    } );
    }
    return true;
  }

  void VMkvReader::KeepBlockGroups( KaxCluster& io_rCluster )
  {
    // Partial scope: the groups are known by position and size, their contents stay in the file.
    ReleaseChildren( io_rCluster );
    ForEachChild( *m_pStream, io_rCluster,
                  [&]( std::unique_ptr< EbmlElement >& io_rpChild )
                  {
                    if( !Is< KaxBlockGroup >( *io_rpChild ) || io_rCluster.ListSize() >= MaxClusterChildren )
                      return;
                    // Without the defaults a new group holds, a kept group is a few dozen bytes.
                    ReleaseChildren( static_cast< EbmlMaster& >( *io_rpChild ) );
                    io_rCluster.PushElement( *io_rpChild.release() );
                  } );
  }

  void VMkvReader::TakeBlock( KaxBlock& i_rBlock, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                              std::shared_ptr< ZOL::IBuffer >& o_rAudio, bool i_bReadVideo, bool i_bReadAudio )
  {
    const unsigned Track = i_rBlock.TrackNum();
    if( Track == VideoTrackNumber )
    {
      if( i_bReadVideo )
        CopyFrame( i_rBlock, *m_pVideoAllocator, o_rVideo );
    }
    else if( Track == AudioTrackNumber )
    {
      // One audio block a Cluster is what the family writes; of more, the last one counts.
      if( i_bReadAudio )
        CopyFrame( i_rBlock, *m_pVideoAllocator, o_rAudio );
    }
    else
    {
      MKV_LOG( ZOL::LogFailure, "Track '%d' found, but only tracks numbered '1' or '2' are allowed.", Track );
    }
  }

  bool VMkvReader::ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                              bool i_bReadAudio )
  {
    return VideoEncoding::ReadDecodedFrame( *this, i_FrameIndex, o_rFrame, i_bReadVideo, i_bReadAudio,
                                            m_pDecodeAllocator, m_pTemporaryAllocator, nullptr );
  }
} // namespace MkvIO
