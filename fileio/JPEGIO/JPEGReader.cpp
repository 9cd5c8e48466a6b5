#include "fileio/JPEGIO/JPEGReader.h"

#include "services/Log.h"

#include <climits>
#include <turbojpeg.h>

#if defined( __SSE2__ )
#include <emmintrin.h>
#endif

namespace JPEGIO
{
  namespace
  {
    using namespace ZOL;

    static_assert( ReadFlags == ( TJFLAG_FASTDCT | TJFLAG_NOREALLOC | TJFLAG_FASTUPSAMPLE | TJFLAG_FORCEMMX |
                                  TJFLAG_FORCESSE | TJFLAG_FORCESSE2 | TJFLAG_FORCESSE3 ),
                   "the decode flags are these seven" );

    struct VOutputRow
    {
      EPixelFormat Wish;
      EPixelFormat Delivered;
      std::uint32_t BytesPerPixel;
      int TurboFormat; // TJPF_UNKNOWN: decoded to planes and interleaved here
    };

    // What a wish gives. A packed 4:2:2 wish is met only by a 4:2:2 image; everything not
    // listed, and a 4:2:2 wish that cannot be met, gives R8G8B8.
    constexpr VOutputRow s_Outputs[] = {
        { PixelFormat_U8Y8V8Y8, PixelFormat_U8Y8V8Y8, 2, TJPF_UNKNOWN },
        { PixelFormat_Y8U8Y8V8, PixelFormat_Y8U8Y8V8, 2, TJPF_UNKNOWN },
        { PixelFormat_Luminance8, PixelFormat_Luminance8, 1, TJPF_GRAY },
        { PixelFormat_B8G8R8, PixelFormat_B8G8R8, 3, TJPF_BGR },
        { PixelFormat_R8G8B8u8, PixelFormat_R8G8B8u8, 4, TJPF_RGBX },
        { PixelFormat_B8G8R8u8, PixelFormat_B8G8R8u8, 4, TJPF_BGRX },
    };
    constexpr VOutputRow s_DefaultOutput = { PixelFormat_R8G8B8, PixelFormat_R8G8B8, 3, TJPF_RGB };

    const VOutputRow& ChooseOutput( EPixelFormat i_Wish, int i_Subsampling, int i_Width )
    {
      for( const VOutputRow& rRow : s_Outputs )
        if( rRow.Wish == i_Wish )
        {
          // Packed 4:2:2 holds pixels in pairs, so an odd width has no such frame.
          const bool bPlanar = rRow.TurboFormat == TJPF_UNKNOWN;
          if( bPlanar && ( i_Subsampling != TJSAMP_422 || i_Width % 2 != 0 ) )
            break;
          return rRow;
        }
      return s_DefaultOutput;
    }

    // Closes the handle on every way out of a call.
    class VDecompressor
    {
    public:
      VDecompressor() : m_Handle( tjInitDecompress() ) {}
      ~VDecompressor()
      {
        if( m_Handle != nullptr )
          tjDestroy( m_Handle );
      }
      VDecompressor( const VDecompressor& ) = delete;
      VDecompressor& operator=( const VDecompressor& ) = delete;
      tjhandle Get() const { return m_Handle; }

    private:
      tjhandle m_Handle;
    };

    // Planes Y, U, V of a 4:2:2 image (Y of i_Pairs * 2 bytes, U and V of i_Pairs each, no
    // padding between rows) into one packed plane: U Y V Y, or Y U Y V when i_bLumaFirst.
    void Interleave422( const std::uint8_t* i_pY, const std::uint8_t* i_pU, const std::uint8_t* i_pV,
                        std::uint64_t i_Pairs, bool i_bLumaFirst, std::uint8_t* o_pOut )
    {
      std::uint64_t i = 0;
#if defined( __SSE2__ )
      // Eight pairs a step: U and V merge to UVUV..., which then merges with sixteen luma bytes.
      for( ; i + 8 <= i_Pairs; i += 8 )
      {
        const __m128i U = _mm_loadl_epi64( reinterpret_cast< const __m128i* >( i_pU + i ) );
        const __m128i V = _mm_loadl_epi64( reinterpret_cast< const __m128i* >( i_pV + i ) );
        const __m128i Y = _mm_loadu_si128( reinterpret_cast< const __m128i* >( i_pY + 2 * i ) );
        const __m128i UV = _mm_unpacklo_epi8( U, V );
        const __m128i Low = i_bLumaFirst ? _mm_unpacklo_epi8( Y, UV ) : _mm_unpacklo_epi8( UV, Y );
        const __m128i High = i_bLumaFirst ? _mm_unpackhi_epi8( Y, UV ) : _mm_unpackhi_epi8( UV, Y );
        _mm_storeu_si128( reinterpret_cast< __m128i* >( o_pOut + 4 * i ), Low );
        _mm_storeu_si128( reinterpret_cast< __m128i* >( o_pOut + 4 * i + 16 ), High );
      }
#endif
      for( ; i < i_Pairs; ++i )
      {
        std::uint8_t* pOut = o_pOut + 4 * i;
        const std::uint8_t Y0 = i_pY[2 * i];
        const std::uint8_t Y1 = i_pY[2 * i + 1];
        if( i_bLumaFirst )
        {
          pOut[0] = Y0;
          pOut[1] = i_pU[i];
          pOut[2] = Y1;
          pOut[3] = i_pV[i];
        }
        else
        {
          pOut[0] = i_pU[i];
          pOut[1] = Y0;
          pOut[2] = i_pV[i];
          pOut[3] = Y1;
        }
      }
    }

    bool DecodePacked422( tjhandle i_Handle, const std::uint8_t* i_pData, std::uint64_t i_Size,
                          const IVideoFrameInfo& i_rInfo, std::uint64_t i_Bytes,
                          const std::shared_ptr< IBufferAllocator >& i_rTemporaryAllocator, IBuffer& o_rOutput )
    {
      std::shared_ptr< IBuffer > pPlanes;
      if( i_rTemporaryAllocator )
        i_rTemporaryAllocator->Allocate( pPlanes, i_Bytes );
      if( !pPlanes )
      {
        LUMEK_LOG( "JPEGIO", LogFailure, "Temporary buffer allocation failed." );
        return false;
      }
      // The planes are laid out without row padding (strides of exactly the plane widths), so
      // Y fills the first half, U the next quarter and V the last: what the interleave reads,
      // for every even width.
      const int Width = i_rInfo.ImageWidth;
      std::uint8_t* pY = pPlanes->GetData();
      std::uint8_t* pU = pY + i_Bytes / 2;
      std::uint8_t* pV = pU + i_Bytes / 4;
      unsigned char* Planes[3] = { pY, pU, pV };
      int Strides[3] = { Width, Width / 2, Width / 2 };
      if( tjDecompressToYUVPlanes( i_Handle, const_cast< unsigned char* >( i_pData ),
                                   static_cast< unsigned long >( i_Size ), Planes, Width, Strides, i_rInfo.ImageHeight,
                                   ReadFlags ) != 0 )
      {
        LUMEK_LOG( "JPEGIO", LogFailure, "Failed to decompress to YUV." );
        return false;
      }
      if( i_rInfo.PixelFormat != PixelFormat_U8Y8V8Y8 && i_rInfo.PixelFormat != PixelFormat_Y8U8Y8V8 )
      {
        LUMEK_LOG( "JPEGIO", LogFailure, "Unsupported pixel format." );
        return false;
      }
      Interleave422( pY, pU, pV, i_Bytes / 4, i_rInfo.PixelFormat == PixelFormat_Y8U8Y8V8, o_rOutput.GetData() );
      return true;
    }
  } // namespace

  bool ReadJPEG( const std::uint8_t* i_pData, std::uint64_t i_Size,
                 const std::shared_ptr< ZOL::IBufferAllocator >& i_rAllocator,
                 const std::shared_ptr< ZOL::IBufferAllocator >& i_rTemporaryAllocator,
                 ZOL::IVideoFrameInfo& io_VideoFrameInfo, std::shared_ptr< ZOL::IBuffer >& o_rOutput )
  {
    const VDecompressor Decompressor;
    if( Decompressor.Get() == nullptr )
    {
      LUMEK_LOG( "JPEGIO", LogFailure, "Couldn't initialise JPEG library for decompression." );
      return false;
    }
    int Width = 0;
    int Height = 0;
    int Subsampling = 0;
    if( i_pData == nullptr || i_Size == 0 || i_Size > ULONG_MAX ||
        tjDecompressHeader2( Decompressor.Get(), const_cast< unsigned char* >( i_pData ),
                             static_cast< unsigned long >( i_Size ), &Width, &Height, &Subsampling ) != 0 ||
        Width <= 0 || Height <= 0 )
    {
      LUMEK_LOG( "JPEGIO", LogFailure, "Couldn't decode JPEG header." );
      return false;
    }
    const VOutputRow& rOutput = ChooseOutput( io_VideoFrameInfo.PixelFormat, Subsampling, Width );
    const std::uint64_t Bytes =
        static_cast< std::uint64_t >( Width ) * static_cast< std::uint64_t >( Height ) * rOutput.BytesPerPixel;
    if( Width > MaxImageSide || Height > MaxImageSide || Bytes >= MaxImageBytes )
    {
      LUMEK_LOG( "JPEGIO", LogFailure, "JPEG image of %d x %d is too large to decode.", Width, Height );
      return false;
    }
    io_VideoFrameInfo.PixelFormat = rOutput.Delivered;
    io_VideoFrameInfo.ImageWidth = Width;
    io_VideoFrameInfo.ImageHeight = Height;

    if( i_rAllocator )
      i_rAllocator->Allocate( o_rOutput, Bytes );
    if( !o_rOutput || o_rOutput->GetSize() != Bytes )
    {
      o_rOutput.reset();
      LUMEK_LOG( "JPEGIO", LogFailure, "Output buffer allocation failed." );
      return false;
    }

    if( rOutput.TurboFormat == TJPF_UNKNOWN )
    {
      if( DecodePacked422( Decompressor.Get(), i_pData, i_Size, io_VideoFrameInfo, Bytes, i_rTemporaryAllocator,
                           *o_rOutput ) )
        return true;
    }
    else if( tjDecompress2( Decompressor.Get(), const_cast< unsigned char* >( i_pData ),
                            static_cast< unsigned long >( i_Size ), o_rOutput->GetData(), Width,
                            Width * static_cast< int >( rOutput.BytesPerPixel ), Height, rOutput.TurboFormat,
                            ReadFlags ) == 0 )
      return true;
    else
      LUMEK_LOG( "JPEGIO", LogFailure, "Failed to decompress." );
    o_rOutput.reset();
    return false;
  }
} // namespace JPEGIO
