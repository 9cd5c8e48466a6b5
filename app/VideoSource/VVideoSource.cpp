#include "app/VideoSource/VVideoSource.h"

#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "fileio/VideoReaders/CreateVideoReader.h"

#include <algorithm>
#include <climits>

namespace LumekVideoViewer
{
  VVideoSource::VVideoSource()
      : m_pFirstAllocator( std::make_shared< ZOL::VFrameBufferAllocator >() ),
        m_pSecondAllocator( std::make_shared< ZOL::VFrameBufferAllocator >() )
  {
  }

  VVideoSource::~VVideoSource() = default;

  bool VVideoSource::Open( const std::string& i_rPath )
  {
    // The previous reader goes only now, with the assignment.
    m_pReader = CreateVideoReader( i_rPath );
    if( !m_pReader || !m_pReader->Open( i_rPath ) )
    {
      Close();
      return false;
    }
    m_FilePath = i_rPath;

    // Counted once here: the number shows in the information panel and nowhere else. A reader
    // with gaps answers from its index; the others are walked, which for them is quick.
    m_pIndexQueries = dynamic_cast< const ZOL::IFrameIndexQueries* >( m_pReader.get() );
    const std::uint64_t FrameCount = m_pReader->GetFrameCount();
    std::uint64_t Missing = 0;
    if( m_pIndexQueries )
      Missing = FrameCount - std::min( FrameCount, m_pIndexQueries->GetStoredFrameCount() );
    else
      for( std::uint64_t i = 0; i < FrameCount; ++i )
        if( !m_pReader->HasFrame( i ) )
          ++Missing;
    m_MissingFrames = static_cast< std::int32_t >( std::min< std::uint64_t >( Missing, INT32_MAX ) );

    m_Camera = CoreLumekTypes::VCameraHardware();
    ZOL::ReadCameraHardware( m_pReader->GetAttributes(), m_Camera );
    m_Lens = CoreLumekTypes::VLensDistortionCalibration();
    ZOL::ReadLensDistortionCalibration( m_pReader->GetAttributes(), "", m_Lens );

    // Only H.264 payloads need a decoder object; without one such frames fail to decode, and say so.
    m_pH264Decoder.reset();
    return true;
  }

  bool VVideoSource::Close()
  {
    m_pIndexQueries = nullptr;
    m_pReader.reset();
    return true;
  }

  bool VVideoSource::GetFrame( std::uint64_t i_Index, ZOL::IVideoFrame& o_rFrame )
  {
    if( !m_pReader )
      return false;
    std::shared_ptr< ZOL::IBuffer > pBuffer;
    // The list is kept between frames, and copied into the caller's, so that a caller that keeps
    // its frame record plays without going back to the heap.
    m_AudioScratch.clear();
    if( !m_pReader->ReadFrameData( i_Index, pBuffer, m_AudioScratch, true, true ) )
      return false;
    o_rFrame.AudioFrameInfo = m_pReader->GetAudioFrameInfo();
    o_rFrame.Audio.assign( m_AudioScratch.begin(), m_AudioScratch.end() );
    m_AudioScratch.clear();

    const ZOL::EVideoPayload Payload = m_pReader->GetVideoPayload();
    ZOL::IVideoFrameInfo Info = m_pReader->GetVideoFrameInfo();
    VideoEncoding::PixelFormatForPayloadFormat( Payload, Info.PixelFormat, Info.PixelFormat, false );
    const std::shared_ptr< ZOL::IBufferAllocator > pFirst = m_pFirstAllocator;
    const std::shared_ptr< ZOL::IBufferAllocator > pSecond = m_pSecondAllocator;
    const bool bDecoded = VideoEncoding::VideoFrameDecoder( Payload, Info, pBuffer, pFirst, pSecond, m_pH264Decoder );
    o_rFrame.VideoFrameInfo = Info;
    o_rFrame.Video = std::move( pBuffer );
    return bDecoded;
  }

  std::optional< std::uint64_t > VVideoSource::FindFrameAtOrBefore( std::uint64_t i_Index ) const
  {
    if( !m_pReader )
      return std::nullopt;
    const std::uint64_t FrameCount = m_pReader->GetFrameCount();
    if( FrameCount == 0 )
      return std::nullopt;
    const std::uint64_t Start = std::min( i_Index, FrameCount - 1 );
    if( m_pIndexQueries )
      return m_pIndexQueries->FindStoredFrameAtOrBefore( Start );
    for( std::uint64_t i = Start + 1; i-- > 0; )
      if( m_pReader->HasFrame( i ) )
        return i;
    return std::nullopt;
  }

  std::optional< std::uint64_t > VVideoSource::FindFrameAtOrAfter( std::uint64_t i_Index ) const
  {
    if( !m_pReader )
      return std::nullopt;
    const std::uint64_t FrameCount = m_pReader->GetFrameCount();
    if( m_pIndexQueries )
    {
      const auto Found = m_pIndexQueries->FindStoredFrameAtOrAfter( i_Index );
      return Found && *Found < FrameCount ? Found : std::nullopt;
    }
    for( std::uint64_t i = i_Index; i < FrameCount; ++i )
      if( m_pReader->HasFrame( i ) )
        return i;
    return std::nullopt;
  }

  std::uint64_t VVideoSource::GetFrameCount() const
  {
    return m_pReader->GetFrameCount();
  }

  double VVideoSource::GetFrameRate() const
  {
    return m_pReader->GetVideoTiming().GetFrameRate();
  }

  double VVideoSource::GetDurationInSeconds() const
  {
    const ZOL::IVideoTiming& rTiming = m_pReader->GetVideoTiming();
    if( rTiming.TicksPerSecond == 0 )
      return 0.0;
    return static_cast< double >( m_pReader->GetFrameCount() ) * rTiming.FramePeriodInTicks / rTiming.TicksPerSecond;
  }

  std::string VVideoSource::GetFrameTimecodeText( std::uint64_t i_Index ) const
  {
    return ZOL::GetFrameTimecodeText( m_pReader->GetTimecode(), m_pReader->GetVideoTiming(), i_Index );
  }

  ZOL::EAudioPayload VVideoSource::GetAudioPayload() const
  {
    return m_pReader ? m_pReader->GetAudioPayload() : ZOL::AudioPayload_None;
  }

  ZOL::EVideoPayload VVideoSource::GetVideoPayload() const
  {
    return m_pReader ? m_pReader->GetVideoPayload() : ZOL::VideoPayload_None;
  }

  const ZOL::IAudioFrameInfo& VVideoSource::GetAudioFrameInfo() const
  {
    static const ZOL::IAudioFrameInfo s_Default;
    return m_pReader ? m_pReader->GetAudioFrameInfo() : s_Default;
  }

  const ZOL::IVideoFrameInfo& VVideoSource::GetVideoFrameInfo() const
  {
    static const ZOL::IVideoFrameInfo s_Default;
    return m_pReader ? m_pReader->GetVideoFrameInfo() : s_Default;
  }

  const ZOL::IVideoSettings& VVideoSource::GetVideoSettings() const
  {
    static const ZOL::IVideoSettings s_Default;
    return m_pReader ? m_pReader->GetVideoSettings() : s_Default;
  }

  const ZOL::IVideoAttributes& VVideoSource::GetAttributes() const
  {
    static const ZOL::IVideoAttributes s_Default;
    return m_pReader ? m_pReader->GetAttributes() : s_Default;
  }

  const ZOL::IVideoTiming& VVideoSource::GetVideoTiming() const
  {
    static const ZOL::IVideoTiming s_Default;
    return m_pReader ? m_pReader->GetVideoTiming() : s_Default;
  }

  const ZOL::ITimecode& VVideoSource::GetTimecode() const
  {
    static const ZOL::ITimecode s_Default;
    return m_pReader ? m_pReader->GetTimecode() : s_Default;
  }

  bool VVideoSource::HasLensDistortion() const
  {
    return m_Lens != CoreLumekTypes::VLensDistortionCalibration() && m_Camera != CoreLumekTypes::VCameraHardware();
  }
} // namespace LumekVideoViewer
