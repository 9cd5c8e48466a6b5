// The Segment's description: Info, Tracks with the codec table, and the Lumek tags.

#include "fileio/MkvIO/MkvCodecs.h"
#include "fileio/MkvIO/MkvElements.h"
#include "fileio/MkvIO/MkvReaderLog.h"
#include "fileio/MkvIO/VMkvReader.h"

#include <ebml/EbmlDate.h>
#include <matroska/KaxInfo.h>
#include <matroska/KaxInfoData.h>
#include <matroska/KaxSemantic.h>
#include <matroska/KaxTag.h>
#include <matroska/KaxTags.h>
#include <matroska/KaxTrackAudio.h>
#include <matroska/KaxTrackEntryData.h>
#include <matroska/KaxTrackVideo.h>
#include <matroska/KaxTracks.h>

#include <cctype>
#include <cstdio>
#include <ctime>
#include <limits>

using namespace libebml;
using namespace libmatroska;

namespace MkvIO
{
  namespace
  {
    constexpr std::uint64_t TrackTypeVideo = 1;
    constexpr std::uint64_t TrackTypeAudio = 2;

    template < typename TElement > std::uint64_t UIntOr( EbmlMaster& i_rMaster, std::uint64_t i_Default )
    {
      TElement* pElement = ChildOf< TElement >( i_rMaster );
      return pElement ? static_cast< std::uint64_t >( *pElement ) : i_Default;
    }

    std::string Hex( const binary* i_pData, std::uint64_t i_Size )
    {
      static const char s_Digits[] = "0123456789abcdef";
      std::string Text;
      for( std::uint64_t i = 0; i < i_Size; ++i )
      {
        Text += s_Digits[i_pData[i] >> 4];
        Text += s_Digits[i_pData[i] & 15];
      }
      return Text;
    }

    // A FourCC as the log shows it: unprintable bytes as '?'.
    std::string FourCCText( const binary* i_pData )
    {
      std::string Text;
      for( int i = 0; i < 4; ++i )
        Text += std::isprint( i_pData[i] ) ? static_cast< char >( i_pData[i] ) : '?';
      return Text;
    }

    std::string DateText( std::int64_t i_EpochSeconds )
    {
      const std::time_t Time = static_cast< std::time_t >( i_EpochSeconds );
      std::tm Parts{};
      if( gmtime_r( &Time, &Parts ) == nullptr )
        return std::to_string( i_EpochSeconds );
      char Text[64];
      std::strftime( Text, sizeof( Text ), "%Y-%m-%d %H:%M:%S UTC", &Parts );
      return Text;
    }

    // The FourCC of a raw video track, or empty when the track holds none.
    std::string FindFourCC( KaxTrackEntry& i_rEntry, KaxTrackVideo& i_rVideo, const std::string& i_rCodecID )
    {
      if( i_rCodecID == CodecVfwFourCC )
      {
        KaxCodecPrivate* pPrivate = ChildOf< KaxCodecPrivate >( i_rEntry );
        if( pPrivate && pPrivate->GetBuffer() && pPrivate->GetSize() >= BitmapInfoFourCCOffset + 4 )
          return std::string( reinterpret_cast< const char* >( pPrivate->GetBuffer() ) + BitmapInfoFourCCOffset, 4 );
        return std::string();
      }
      KaxVideoColourSpace* pColourSpace = ChildOf< KaxVideoColourSpace >( i_rVideo );
      if( pColourSpace && pColourSpace->GetBuffer() && pColourSpace->GetSize() == 4 )
        return std::string( reinterpret_cast< const char* >( pColourSpace->GetBuffer() ), 4 );
      return std::string();
    }
  } // namespace

  bool VMkvReader::ReadInfo( EbmlElement& io_rInfo )
  {
    ForEachChild( *m_pStream, io_rInfo,
                  [this]( std::unique_ptr< EbmlElement >& io_rpChild )
                  {
                    EbmlElement& rChild = *io_rpChild;
                    if( Is< KaxWritingApp >( rChild ) )
                      m_ExternalAttributes.Set( "Matroska.WritingApp", ReadText( *m_pStream, rChild ) );
                    else if( Is< KaxMuxingApp >( rChild ) )
                      m_ExternalAttributes.Set( "Matroska.MuxingApp", ReadText( *m_pStream, rChild ) );
                    else if( Is< KaxTimecodeScale >( rChild ) || Is< KaxDuration >( rChild ) ||
                             Is< KaxDateUTC >( rChild ) || Is< KaxSegmentUID >( rChild ) )
                      ReadInfoValue( rChild );
                  } );
    return true;
  }

  void VMkvReader::ReadInfoValue( EbmlElement& io_rValue )
  {
    io_rValue.ReadData( m_pStream->I_O(), SCOPE_ALL_DATA );
    if( !io_rValue.ValueIsSet() )
      return;
    if( auto* pScale = dynamic_cast< KaxTimecodeScale* >( &io_rValue ) )
      m_TimecodeScale = static_cast< std::uint64_t >( *pScale );
    else if( auto* pDuration = dynamic_cast< KaxDuration* >( &io_rValue ) )
      m_Duration = static_cast< double >( *pDuration );
    else if( auto* pDate = dynamic_cast< KaxDateUTC* >( &io_rValue ) )
      m_ExternalAttributes.Set( "Matroska.DateUTC", DateText( pDate->GetEpochDate() ) );
    else if( auto* pUID = dynamic_cast< KaxSegmentUID* >( &io_rValue ); pUID && pUID->GetBuffer() )
      m_ExternalAttributes.Set( "Matroska.SegmentUID", Hex( pUID->GetBuffer(), pUID->GetSize() ) );
  }

  bool VMkvReader::ReadTracks( EbmlElement& io_rTracks )
  {
    ReadTree( *m_pStream, io_rTracks );
    auto& rTracks = static_cast< EbmlMaster& >( io_rTracks );
    bool bHaveVideo = false;
    bool bHaveAudio = false;
    for( EbmlElement* pChild : rTracks.GetElementList() )
    {
      if( !Is< KaxTrackEntry >( *pChild ) )
        continue;
      auto& rEntry = static_cast< KaxTrackEntry& >( *pChild );
      const std::uint64_t Type = UIntOr< KaxTrackType >( rEntry, 0 );
      KaxCodecID* pCodec = ChildOf< KaxCodecID >( rEntry );
      const std::string CodecID = pCodec ? std::string( *pCodec ) : std::string();
      if( Type == TrackTypeVideo && !bHaveVideo )
      {
        bHaveVideo = true;
        if( !ReadVideoTrack( rEntry, CodecID ) )
          return false;
      }
      else if( Type == TrackTypeAudio && !bHaveAudio )
      {
        bHaveAudio = true;
        ReadAudioTrack( rEntry, CodecID );
      }
    }
    ReleaseChildren( rTracks );
    return true;
  }

  bool VMkvReader::ReadVideoTrack( KaxTrackEntry& i_rEntry, const std::string& i_rCodecID )
  {
    KaxTrackVideo* pVideo = ChildOf< KaxTrackVideo >( i_rEntry );
    if( !pVideo )
    {
      MKV_LOG( ZOL::LogFailure, "KaxTrackVideo missing." );
      return false;
    }
    constexpr std::uint64_t MaxSide = static_cast< std::uint64_t >( std::numeric_limits< std::int32_t >::max() );
    const std::uint64_t Width = UIntOr< KaxVideoPixelWidth >( *pVideo, 0 );
    const std::uint64_t Height = UIntOr< KaxVideoPixelHeight >( *pVideo, 0 );
    // The viewer takes no scaling from the container: a display size must be the pixel size.
    if( Height == 0 || Height > MaxSide || UIntOr< KaxVideoDisplayHeight >( *pVideo, Height ) != Height )
    {
      MKV_LOG( ZOL::LogFailure, "Invalid image height." );
      return false;
    }
    if( Width == 0 || Width > MaxSide || UIntOr< KaxVideoDisplayWidth >( *pVideo, Width ) != Width )
    {
      MKV_LOG( ZOL::LogFailure, "Invalid image width." );
      return false;
    }

    ZOL::EPixelFormat Format = ZOL::PixelFormat_Unspecified;
    switch( FindVideoCodec( i_rCodecID ) )
    {
    case EVideoCodec::MJPEG:
      // What the JPEG decoder makes of a stream whose stored format is not known.
      Format = ZOL::PixelFormat_R8G8B8u8;
      m_VideoPayload = ZOL::VideoPayload_ImageJPEG;
      break;
    case EVideoCodec::FourCC:
    {
      const std::string FourCC = FindFourCC( i_rEntry, *pVideo, i_rCodecID );
      const std::optional< ZOL::EPixelFormat > Found = PixelFormatForFourCC( FourCC );
      if( !Found )
      {
        MKV_LOG( ZOL::LogFailure, "Unknown video FourCC code '%s' found.",
                 FourCC.size() == 4 ? FourCCText( reinterpret_cast< const binary* >( FourCC.data() ) ) : FourCC );
        return false;
      }
      Format = *Found;
      m_VideoPayload = ZOL::VideoPayload_Uncompressed;
      break;
    }
    case EVideoCodec::Unknown:
      MKV_LOG( ZOL::LogFailure, "Unknown video codec '%s' found.", i_rCodecID );
      return false;
    }
    m_VideoFrameInfo.ImageWidth = static_cast< std::int32_t >( Width );
    m_VideoFrameInfo.ImageHeight = static_cast< std::int32_t >( Height );
    m_VideoFrameInfo.PixelFormat = Format;
    m_VideoFrameInfo.PixelAspectRatio = 1.0;
    return true;
  }

  void VMkvReader::ReadAudioTrack( KaxTrackEntry& i_rEntry, const std::string& i_rCodecID )
  {
    KaxTrackAudio* pAudio = ChildOf< KaxTrackAudio >( i_rEntry );
    if( !pAudio || !IsPcmCodec( i_rCodecID ) )
    {
      MKV_LOG( ZOL::LogWarning, "Unknown audio codec '%s' found; the audio is left out.", i_rCodecID );
      return;
    }
    const std::uint64_t BitDepth = UIntOr< KaxAudioBitDepth >( *pAudio, 0 );
    const std::optional< ZOL::EAudioSampleFormat > Format = SampleFormatForCodec( i_rCodecID, BitDepth );
    if( !Format )
    {
      MKV_LOG( ZOL::LogFailure, "Unsupported sample format %d", BitDepth );
      return;
    }
    const std::uint64_t Channels = UIntOr< KaxAudioChannels >( *pAudio, 1 );
    KaxAudioSamplingFreq* pRate = ChildOf< KaxAudioSamplingFreq >( *pAudio );
    const double Rate = pRate ? static_cast< double >( *pRate ) : 8000.0;
    // Out-of-range values would not survive the conversion to the record's integers.
    if( Channels == 0 || Channels > 1024 || !( Rate >= 1.0 && Rate < 2147483647.0 ) )
    {
      MKV_LOG( ZOL::LogFailure, "Unsupported audio layout: %d channels at %d Hz", Channels, Rate );
      return;
    }
    m_AudioFrameInfo.SampleFormat = *Format;
    m_AudioFrameInfo.SampleRate = static_cast< std::int32_t >( Rate );
    m_AudioFrameInfo.Channels = static_cast< std::int32_t >( Channels );
    m_AudioPayload = ZOL::AudioPayload_Uncompressed;
  }

  void VMkvReader::ReadTags( EbmlElement& i_rTags )
  {
    // Tags nest without limit in Matroska (a SimpleTag may hold SimpleTags), so they are walked
    // level by level here rather than read whole: only the SimpleTags of each Tag count.
    ForEachChild( *m_pStream, i_rTags,
                  [this]( std::unique_ptr< EbmlElement >& io_rpTag )
                  {
                    if( !Is< KaxTag >( *io_rpTag ) )
                      return;
                    ForEachChild( *m_pStream, *io_rpTag,
                                  [this]( std::unique_ptr< EbmlElement >& io_rpSimple )
                                  {
                                    if( Is< KaxTagSimple >( *io_rpSimple ) )
                                      ReadSimpleTag( *io_rpSimple );
                                  } );
                  } );
  }

  void VMkvReader::ReadSimpleTag( EbmlElement& i_rSimpleTag )
  {
    std::optional< std::string > Name;
    std::optional< std::string > Text;
    ForEachChild( *m_pStream, i_rSimpleTag,
                  [&]( std::unique_ptr< EbmlElement >& io_rpField )
                  {
                    if( Is< KaxTagName >( *io_rpField ) )
                      Name = ReadText( *m_pStream, *io_rpField );
                    else if( Is< KaxTagString >( *io_rpField ) )
                      Text = ReadText( *m_pStream, *io_rpField );
                  } );
    if( Name && Text )
      m_Tags.emplace_back( std::move( *Name ), std::move( *Text ) );
  }
} // namespace MkvIO
