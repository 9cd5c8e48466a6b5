#include "fileio/H264IO/VH264Decoder.h"

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "services/Log.h"

#include <wels/codec_api.h>

#include <climits>
#include <cstring>

namespace H264IO
{
  std::shared_ptr< ZOL::IH264Decoder >
  VH264Decoder::Create( const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator )
  {
    auto pDecoder = std::make_shared< VH264Decoder >( i_rAllocator );
    if( !pDecoder->Initialise() )
      return nullptr;
    return pDecoder;
  }

  VH264Decoder::VH264Decoder( std::shared_ptr< ZOL::IBufferAllocator > i_pAllocator )
      : m_pAllocator( std::move( i_pAllocator ) )
  {
  }

  VH264Decoder::~VH264Decoder()
  {
    if( m_pDecoder == nullptr )
      return;
    const long Result = m_pDecoder->Uninitialize();
    if( Result != 0 )
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not uninitialize decoder. Decoder returned error: %d.", Result );
    WelsDestroyDecoder( m_pDecoder );
  }

  bool VH264Decoder::Initialise()
  {
    if( m_pDecoder != nullptr )
      return true;
    ISVCDecoder* pDecoder = nullptr;
    const long Created = WelsCreateDecoder( &pDecoder );
    if( Created != 0 || pDecoder == nullptr )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not create decoder. Error code: %d.", Created );
      return false;
    }
    // No option is set: error concealment stays off, so a broken frame is reported rather
    // than shown patched, and threads and bitstream type keep the library's defaults.
    SDecodingParam Parameters;
    std::memset( &Parameters, 0, sizeof( Parameters ) );
    const long Initialised = pDecoder->Initialize( &Parameters );
    if( Initialised != 0 )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not initialize decoder. Decoder returned error: %d.", Initialised );
      WelsDestroyDecoder( pDecoder );
      return false;
    }
    m_pDecoder = pDecoder;
    return true;
  }

  bool VH264Decoder::Decode( const ZOL::IBufferConst& i_rInput, ZOL::EPixelFormat i_PixelFormat,
                             std::shared_ptr< ZOL::IBuffer >& o_rOutput, ZOL::IVideoFrameInfo& io_VideoFrameInfo )
  {
    const ZOL::EPixelFormat Format =
        i_PixelFormat == ZOL::PixelFormat_Y8U8Y8V8 ? ZOL::PixelFormat_Y8U8Y8V8 : ZOL::PixelFormat_U8Y8V8Y8;
    io_VideoFrameInfo.PixelFormat = Format;
    if( m_pDecoder == nullptr || !m_pAllocator )
      return false;
    // The library takes an int size; no access unit comes near it, but a broken index could.
    if( i_rInput.GetSize() > static_cast< std::uint64_t >( INT_MAX ) )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not decode frame. Decoder returned error: %d.",
                 static_cast< int >( dsInvalidArgument ) );
      return false;
    }

    SBufferInfo Info;
    std::memset( &Info, 0, sizeof( Info ) );
    unsigned char* pPlanes[3] = { nullptr, nullptr, nullptr };
    const DECODING_STATE Decoded =
        m_pDecoder->DecodeFrameNoDelay( i_rInput.GetData(), static_cast< int >( i_rInput.GetSize() ), pPlanes, &Info );
    if( Decoded != dsErrorFree )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not decode frame. Decoder returned error: %d.",
                 static_cast< int >( Decoded ) );
      return false;
    }
    // A frame held back for reordering comes out now: each call gives the picture of its unit.
    const DECODING_STATE Flushed = m_pDecoder->FlushFrame( pPlanes, &Info );
    if( Flushed != dsErrorFree )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not decode frame. Decoder returned error: %d.",
                 static_cast< int >( Flushed ) );
      return false;
    }
    if( Info.iBufferStatus != 1 )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not decode frame. Buffer status was %d, not 1.",
                 Info.iBufferStatus );
      return false;
    }
    const SSysMEMBuffer& rPicture = Info.UsrData.sSystemBuffer;
    io_VideoFrameInfo.ImageWidth = rPicture.iWidth;
    io_VideoFrameInfo.ImageHeight = rPicture.iHeight;
    if( rPicture.iWidth % 2 != 0 || rPicture.iHeight % 2 != 0 )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure,
                 "Decoder produced a frame of dimensions %d x %d. Only frames with even width and height are "
                 "supported.",
                 rPicture.iWidth, rPicture.iHeight );
      return false;
    }

    std::shared_ptr< ZOL::IBuffer > pOutput;
    const std::uint64_t Bytes = CoreVideoUtils::FrameSizeInBytes( rPicture.iWidth, rPicture.iHeight, Format );
    if( Bytes > 0 )
      m_pAllocator->Allocate( pOutput, Bytes );
    if( !pOutput || !CoreVideoUtils::PlanarYUV420ToInterleaved( pPlanes[0], pPlanes[1], pPlanes[2], pOutput->GetData(),
                                                                Format, rPicture.iWidth, rPicture.iHeight,
                                                                rPicture.iStride[0], rPicture.iStride[1] ) )
    {
      LUMEK_LOG( "H264IO", ZOL::LogFailure, "Could not convert frame with pixel format '%s' and dimensions %d x %d.",
                 ZOL::ToString( Format, "Unspecified" ), rPicture.iWidth, rPicture.iHeight );
      return false;
    }
    o_rOutput = std::move( pOutput );
    return true;
  }
} // namespace H264IO
