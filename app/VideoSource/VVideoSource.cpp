#include "app/VideoSource/VVideoSource.h"

#include "fileio/H264IO/VH264Decoder.h"
#include "fileio/H264Utils/H264Utils.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "fileio/VideoReaders/CreateVideoReader.h"
#include "services/Log.h"

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
    return Open( i_rPath, CreateVideoReader( i_rPath ) );
  }

  bool VVideoSource::Open( const std::string& i_rPath, std::shared_ptr< ZOL::IVideoReader > i_pReader )
  {
    // The previous reader goes only now, with the assignment.
    m_pReader = std::move( i_pReader );
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
    m_LastH264Frame.reset();
    if( m_pReader->GetVideoPayload() == ZOL::VideoPayload_VideoH264 )
      m_pH264Decoder = H264IO::VH264Decoder::Create( m_pFirstAllocator );
    return true;
  }

  bool VVideoSource::Close()
  {
    m_pIndexQueries = nullptr;
    m_pReader.reset();
    m_LastH264Frame.reset();
    return true;
  }

  bool VVideoSource::GetFrame( std::uint64_t i_Index, ZOL::IVideoFrame& o_rFrame )
  {
    if( !m_pReader )
      return false;
    const bool bH264 = m_pH264Decoder && m_pReader->GetVideoPayload() == ZOL::VideoPayload_VideoH264;
    if( bH264 && !( m_LastH264Frame && *m_LastH264Frame + 1 == i_Index ) && !SeekH264( i_Index ) )
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
    // A payload without a decoded form has nothing to give; the decoder would refuse it anyway,
    // but only after the stored format had been taken for the decoded one.
    if( !VideoEncoding::PixelFormatForPayloadFormat( Payload, Info.PixelFormat, Info.PixelFormat, false ) )
      return false;
    const std::shared_ptr< ZOL::IBufferAllocator > pFirst = m_pFirstAllocator;
    const std::shared_ptr< ZOL::IBufferAllocator > pSecond = m_pSecondAllocator;
    const bool bDecoded = VideoEncoding::VideoFrameDecoder( Payload, Info, pBuffer, pFirst, pSecond, m_pH264Decoder );
    o_rFrame.VideoFrameInfo = Info;
    o_rFrame.Video = std::move( pBuffer );
    if( bH264 )
      m_LastH264Frame = bDecoded ? std::optional< std::uint64_t >( i_Index ) : std::nullopt;
    return bDecoded;
  }

  namespace
  {
    // How far back a key frame is looked for. Encoders put one every few seconds; a file
    // without one in this many frames cannot be scrubbed, and says so rather than stalling.
    constexpr std::uint64_t MaxH264WalkBack = 1200;
  } // namespace

  bool VVideoSource::SeekH264( std::uint64_t i_Index )
  {
    // Frames missing from the index between the last decoded frame and this one cost nothing:
    // the next stored frame still follows in decoding order.
    if( m_LastH264Frame && *m_LastH264Frame < i_Index && FindFrameAtOrAfter( *m_LastH264Frame + 1 ) == i_Index )
      return true;
    const std::optional< std::uint64_t > Start = FindH264KeyFrame( i_Index );
    if( !Start )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "No key frame within %d frames before frame %d.", MaxH264WalkBack,
                 i_Index );
      m_LastH264Frame.reset();
      return false;
    }
    // Only the last picture is kept; a frame that fails on the way leaves a gap in the
    // references, as it would in playback.
    for( std::optional< std::uint64_t > Frame = FindFrameAtOrAfter( *Start ); Frame && *Frame < i_Index;
         Frame = FindFrameAtOrAfter( *Frame + 1 ) )
      DecodeH264Frame( *Frame );
    return true;
  }

  std::optional< std::uint64_t > VVideoSource::FindH264KeyFrame( std::uint64_t i_Index )
  {
    std::shared_ptr< ZOL::IBuffer > pBuffer;
    std::optional< std::uint64_t > Frame = FindFrameAtOrBefore( i_Index );
    for( std::uint64_t Walked = 0; Frame && *Frame <= i_Index && Walked < MaxH264WalkBack; ++Walked )
    {
      // Reached the frame the decoder stands on: going on from there is cheaper than a key frame.
      if( m_LastH264Frame && *m_LastH264Frame == *Frame && *Frame < i_Index )
        return *Frame + 1;
      m_AudioScratch.clear();
      if( m_pReader->ReadFrameData( *Frame, pBuffer, m_AudioScratch, true, false ) && pBuffer &&
          H264Utils::ContainsNALUnit( *pBuffer, H264Utils::H264NALUnitType_CodedSliceIDR,
                                      H264Utils::EH264StreamForm::AnnexB ) )
        return *Frame;
      const std::optional< std::uint64_t > Earlier = *Frame > 0 ? FindFrameAtOrBefore( *Frame - 1 ) : std::nullopt;
      // The first frame of the file is where playback starts decoding anyway: a stream that
      // opens on a recovery point rather than an IDR picture plays from there.
      if( !Earlier || *Earlier >= *Frame )
        return *Frame;
      Frame = Earlier;
    }
    return std::nullopt;
  }

  bool VVideoSource::DecodeH264Frame( std::uint64_t i_Index )
  {
    std::shared_ptr< ZOL::IBuffer > pBuffer;
    m_AudioScratch.clear();
    if( !m_pReader->ReadFrameData( i_Index, pBuffer, m_AudioScratch, true, false ) )
      return false;
    ZOL::IVideoFrameInfo Info = m_pReader->GetVideoFrameInfo();
    Info.PixelFormat = ZOL::PixelFormat_U8Y8V8Y8;
    const std::shared_ptr< ZOL::IBufferAllocator > pFirst = m_pFirstAllocator;
    const bool bDecoded =
        VideoEncoding::VideoFrameDecoder( ZOL::VideoPayload_VideoH264, Info, pBuffer, pFirst, pFirst, m_pH264Decoder );
    m_LastH264Frame = bDecoded ? std::optional< std::uint64_t >( i_Index ) : std::nullopt;
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
