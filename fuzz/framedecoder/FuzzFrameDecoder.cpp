// The frame decoder with any payload bytes and any description of the frame they claim to be.

#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "videointerface/BufferAllocators.h"

#include <turbojpeg.h>

#include <cstdint>
#include <cstring>

namespace
{
  // Decodes nothing and says so, like a decoder that has only seen parameter sets.
  class VRefusingDecoder : public ZOL::IH264Decoder
  {
  public:
    bool Decode( const ZOL::IBufferConst& i_rInput, ZOL::EPixelFormat, std::shared_ptr< ZOL::IBuffer >&,
                 ZOL::IVideoFrameInfo& ) override
    {
      return i_rInput.GetSize() == 0;
    }
  };

  // A JPEG header the reader accepts may still describe a frame of up to 2 GB; beyond this
  // many pixels the fuzzer would spend its time clearing buffers rather than finding faults.
  bool SmallEnoughJPEG( const std::uint8_t* i_pData, std::size_t i_Size )
  {
    constexpr std::uint64_t MaxFuzzPixels = 4u << 20;
    tjhandle Handle = tjInitDecompress();
    int Width = 0;
    int Height = 0;
    int Subsampling = 0;
    const bool bHeader = Handle != nullptr && tjDecompressHeader2( Handle, const_cast< unsigned char* >( i_pData ),
                                                                   i_Size, &Width, &Height, &Subsampling ) == 0;
    if( Handle != nullptr )
      tjDestroy( Handle );
    return !bHeader || static_cast< std::uint64_t >( Width ) * static_cast< std::uint64_t >( Height ) <= MaxFuzzPixels;
  }
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  if( i_Size < 7 )
    return 0;
  static const auto s_pAllocator = std::make_shared< ZOL::VFrameBufferAllocator >();
  static const auto s_pDecoder = std::make_shared< VRefusingDecoder >();
  const auto Payload = static_cast< ZOL::EVideoPayload >( i_pData[0] % 8 );
  ZOL::IVideoFrameInfo Info;
  // Sizes of up to 16 bits each: the decoder must refuse what the payload cannot hold
  // without allocating for it.
  Info.ImageWidth = static_cast< std::int16_t >( i_pData[1] | ( i_pData[2] << 8 ) );
  Info.ImageHeight = static_cast< std::int16_t >( i_pData[3] | ( i_pData[4] << 8 ) );
  Info.PixelFormat = static_cast< ZOL::EPixelFormat >( i_pData[5] % 21 );
  const bool bWithDecoder = ( i_pData[6] & 1 ) != 0;
  if( Payload == ZOL::VideoPayload_ImageJPEG && !SmallEnoughJPEG( i_pData + 7, i_Size - 7 ) )
    return 0;

  std::shared_ptr< ZOL::IBuffer > pBuffer;
  s_pAllocator->Allocate( pBuffer, i_Size - 7 );
  if( i_Size > 7 )
    std::memcpy( pBuffer->GetData(), i_pData + 7, i_Size - 7 );
  ZOL::EPixelFormat Announced = ZOL::PixelFormat_Unspecified;
  // Either may refuse the bytes; only how they answer matters here.
  if( !VideoEncoding::PixelFormatForPayloadFormat( Payload, Info.PixelFormat, Announced, ( i_pData[6] & 2 ) != 0 ) )
    return 0;
  if( !VideoEncoding::VideoFrameDecoder( Payload, Info, pBuffer, s_pAllocator, s_pAllocator,
                                         bWithDecoder ? s_pDecoder : nullptr ) )
    return 0;
  return 0;
}
