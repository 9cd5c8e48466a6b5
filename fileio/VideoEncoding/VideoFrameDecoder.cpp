#include "fileio/VideoEncoding/VideoFrameDecoder.h"

#include "fileio/VideoEncoding/ImageDecoders.h"
#include "services/DebugServices.h"
#include "services/Log.h"
#include "videointerface/PixelFormatDescriptor.h"

#include <algorithm>
#include <cstring>

namespace VideoEncoding
{
  namespace
  {
    using namespace ZOL;

    const std::uint8_t s_MagicPNG[8] = { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A };
    // Little-endian TIFF only: the image library path never sees big-endian files.
    const std::uint8_t s_MagicTIFF[4] = { 0x49, 0x49, 0x2A, 0x00 };

    // The first bytes of a payload, zero-padded, so that a short payload fails the check
    // instead of being read past its end.
    struct VHead
    {
      std::uint8_t Bytes[8] = {};
      VHead( const std::uint8_t* i_pData, std::uint64_t i_Size )
      {
        // An empty buffer may have no data pointer at all.
        if( i_pData != nullptr && i_Size > 0 )
          std::memcpy( Bytes, i_pData,
                       static_cast< std::size_t >( std::min< std::uint64_t >( i_Size, sizeof( Bytes ) ) ) );
      }
    };

    bool HasPNGSignature( const std::uint8_t* i_pData, std::uint64_t i_Size )
    {
      const VHead Head( i_pData, i_Size );
      const std::uint8_t* pInData = Head.Bytes;
      // A file can hold anything: a frame of the wrong kind is a missing frame, not the end
      // of the program.
      if( std::memcmp( pInData, s_MagicPNG, sizeof( s_MagicPNG ) ) == 0 )
        return true;
      LUMEK_LOG( "VideoEncoding", ZOL::LogFailure, "PNG frame does not start with the PNG signature." );
      return false;
    }

    bool HasTIFFSignature( const std::uint8_t* i_pData, std::uint64_t i_Size )
    {
      const VHead Head( i_pData, i_Size );
      const std::uint8_t* pInData = Head.Bytes;
      if( std::memcmp( pInData, s_MagicTIFF, sizeof( s_MagicTIFF ) ) == 0 )
        return true;
      LUMEK_LOG( "VideoEncoding", ZOL::LogFailure, "TIFF frame does not start with the little-endian TIFF mark." );
      return false;
    }

    // No still-image format stored here expands more than this: deflate stops near 1032:1
    // and 12-bit LZW near 2730:1. A description beyond it is not believed.
    constexpr std::uint64_t MaxExpansion = 4096;

    // PNG and TIFF: the output is allocated here at the size of the described frame, once the
    // payload has shown that it is of the right kind and could hold such a frame.
    bool DecodeImage( ImageDecodeFunction i_Decode, bool ( *i_HasSignature )( const std::uint8_t*, std::uint64_t ),
                      const std::uint8_t* i_pData, std::uint64_t i_Size, IVideoFrameInfo& io_rInfo,
                      const std::shared_ptr< IBufferAllocator >& i_rAllocator, std::shared_ptr< IBuffer >& o_rOutput )
    {
      if( !i_HasSignature( i_pData, i_Size ) || i_Decode == nullptr || !i_rAllocator )
        return false;
      const std::uint32_t Bytes = FrameBufferSize( io_rInfo );
      // A size that does not survive the truncation to 32 bits is no frame this program can hold.
      if( Bytes == 0 || Bytes != GetVideoFrameSizeInBytes64( io_rInfo ) || Bytes / MaxExpansion > i_Size )
      {
        LUMEK_LOG( "VideoEncoding", ZOL::LogFailure,
                   "Image of %d bytes cannot hold a %d x %d frame of pixel format '%s'.", i_Size, io_rInfo.ImageWidth,
                   io_rInfo.ImageHeight, ZOL::ToString( io_rInfo.PixelFormat, "Unspecified" ) );
        return false;
      }
      i_rAllocator->Allocate( o_rOutput, Bytes );
      if( !o_rOutput )
        return false;
      return i_Decode( i_pData, i_Size, io_rInfo, o_rOutput->GetData(), o_rOutput->GetSize() );
    }

    EPixelFormat JPEGOutput( EPixelFormat F, bool i_bForceColour )
    {
      return i_bForceColour ? PixelFormat_R8G8B8u8 : DescribePixelFormat( F ).JPEGOutput;
    }

    EPixelFormat StillImageOutput( EPixelFormat F, bool )
    {
      return DescribePixelFormat( F ).Family == EPixelFamily::Luminance ? PixelFormat_Luminance8 : PixelFormat_R8G8B8;
    }

    EPixelFormat NoOutput( EPixelFormat, bool )
    {
      return PixelFormat_Unspecified;
    }
    EPixelFormat StoredOutput( EPixelFormat F, bool )
    {
      return F;
    }
    EPixelFormat H264Output( EPixelFormat, bool )
    {
      return PixelFormat_U8Y8V8Y8;
    }

    struct VPayloadRule
    {
      EVideoPayload Payload;
      EPixelFormat ( *Output )( EPixelFormat, bool );
    };

    constexpr VPayloadRule s_PayloadRules[] = {
        { VideoPayload_None, NoOutput },
        { VideoPayload_Uncompressed, StoredOutput },
        { VideoPayload_ImageJPEG, JPEGOutput },
        { VideoPayload_ImagePNG, StillImageOutput },
        { VideoPayload_ImageTIFF, StillImageOutput },
        { VideoPayload_VideoH264, H264Output },
    };
  } // namespace

  std::uint32_t FrameBufferSize( const ZOL::IVideoFrameInfo& i_rVideoFrameInfo )
  {
    return ZOL::GetVideoFrameSizeInBytes( i_rVideoFrameInfo );
  }

  bool PixelFormatForPayloadFormat( ZOL::EVideoPayload i_Payload, ZOL::EPixelFormat i_PixelFormat,
                                    ZOL::EPixelFormat& o_rPixelFormat, bool i_bForceColour )
  {
    for( const VPayloadRule& rRule : s_PayloadRules )
      if( rRule.Payload == i_Payload )
      {
        o_rPixelFormat = rRule.Output( i_PixelFormat, i_bForceColour );
        return true;
      }
    LUMEK_LOG( "VideoEncoding", ZOL::LogFailure, "Unsupported video payload format '%s'.",
               ZOL::ToString( i_Payload, "Unspecified" ) );
    return false;
  }

  bool VideoFrameDecoder( ZOL::EVideoPayload i_Payload, ZOL::IVideoFrameInfo& io_VideoFrameInfo,
                          std::shared_ptr< ZOL::IBuffer >& io_rBuffer,
                          const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                          const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                          const std::shared_ptr< ZOL::IH264Decoder >& i_rH264Decoder )
  {
    if( !io_rBuffer )
      return false;
    if( i_Payload == VideoPayload_Uncompressed )
    {
      // The frame is used where it lies, so it must hold what its description says: the
      // surface reads that many bytes from it.
      const std::uint64_t Needed = GetVideoFrameSizeInBytes64( io_VideoFrameInfo );
      if( Needed == 0 || io_rBuffer->GetSize() < Needed )
      {
        LUMEK_LOG( "VideoEncoding", ZOL::LogFailure,
                   "Uncompressed frame of %d bytes does not hold a %d x %d frame of pixel format '%s' (%d bytes).",
                   io_rBuffer->GetSize(), io_VideoFrameInfo.ImageWidth, io_VideoFrameInfo.ImageHeight,
                   ZOL::ToString( io_VideoFrameInfo.PixelFormat, "Unspecified" ), Needed );
        return false;
      }
      return true;
    }

    const std::uint8_t* pData = io_rBuffer->GetData();
    const std::uint64_t Size = io_rBuffer->GetSize();
    const VImageDecoders& rDecoders = ImageDecoders();
    std::shared_ptr< ZOL::IBuffer > pOutput;
    bool bResult = false;
    switch( i_Payload )
    {
    case VideoPayload_ImageJPEG:
      bResult = rDecoders.JPEG != nullptr && rDecoders.JPEG( pData, Size, io_VideoFrameInfo.PixelFormat, i_rAllocator,
                                                             i_rTemporaryAllocator, io_VideoFrameInfo, pOutput );
      break;
    case VideoPayload_ImagePNG:
      bResult = DecodeImage( rDecoders.PNG, HasPNGSignature, pData, Size, io_VideoFrameInfo, i_rAllocator, pOutput );
      break;
    case VideoPayload_ImageTIFF:
      bResult = DecodeImage( rDecoders.TIFF, HasTIFFSignature, pData, Size, io_VideoFrameInfo, i_rAllocator, pOutput );
      break;
    case VideoPayload_VideoH264:
      if( !i_rH264Decoder )
      {
        LUMEK_LOG( "VideoEncoding", ZOL::LogFailure, "H.264 video for decoding but no H.264 decoder provided." );
        return false;
      }
      bResult = i_rH264Decoder->Decode( *io_rBuffer, io_VideoFrameInfo.PixelFormat, pOutput, io_VideoFrameInfo ) &&
                pOutput != nullptr;
      break;
    default:
      return false;
    }
    // The stored bytes go now, whether or not a frame came out of them.
    io_rBuffer = std::move( pOutput );
    return bResult;
  }

  bool ReadDecodedFrame( ZOL::IVideoReader& io_rReader, std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame,
                         bool i_bReadVideo, bool i_bReadAudio,
                         const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                         const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                         const std::shared_ptr< ZOL::IH264Decoder >& i_rH264Decoder )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    if( !io_rReader.ReadFrameData( i_FrameIndex, pVideo, Audio, i_bReadVideo, i_bReadAudio ) )
      return false;
    ZOL::IVideoFrameInfo Info = io_rReader.GetVideoFrameInfo();
    if( i_bReadVideo )
    {
      const ZOL::EVideoPayload Payload = io_rReader.GetVideoPayload();
      if( !PixelFormatForPayloadFormat( Payload, Info.PixelFormat, Info.PixelFormat, false ) ||
          !VideoFrameDecoder( Payload, Info, pVideo, i_rAllocator, i_rTemporaryAllocator, i_rH264Decoder ) )
        return false;
    }
    if( i_bReadAudio )
    {
      o_rFrame.AudioFrameInfo = io_rReader.GetAudioFrameInfo();
      o_rFrame.Audio = std::move( Audio );
    }
    if( i_bReadVideo )
    {
      o_rFrame.VideoFrameInfo = Info;
      o_rFrame.Video = std::move( pVideo );
    }
    return true;
  }
} // namespace VideoEncoding
