// What the main header, the stream headers and the stream formats turn into.

#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "services/Log.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <iterator>
#include <limits>

namespace RapidAVI
{
  namespace
  {
    constexpr std::uint64_t MainHeaderSize = 56;
    constexpr std::uint64_t StreamHeaderSize = 56;
    constexpr std::uint64_t BitmapHeaderSize = 40;
    constexpr std::uint64_t PaletteEntries = 256;
    constexpr std::uint64_t PalettedFormatSize = BitmapHeaderSize + PaletteEntries * 4;
    constexpr std::uint64_t WaveHeaderSize = 18;
    constexpr std::uint64_t WaveExtensionSize = 22;
    constexpr std::uint16_t WaveFormatPCM = 1;
    constexpr std::uint16_t WaveFormatExtensible = 0xFFFE;

    // KSDATAFORMAT_SUBTYPE_PCM and _IEEE_FLOAT as they lie in the file.
    constexpr std::uint8_t s_SubFormatPCM[16] = { 0x01, 0x00, 0x00, 0x00, 0x00, 0x00, 0x10, 0x00,
                                                  0x80, 0x00, 0x00, 0xAA, 0x00, 0x38, 0x9B, 0x71 };
    constexpr std::uint8_t s_SubFormatFloat[16] = { 0x03, 0x00, 0x00, 0x00, 0x00, 0x00, 0x10, 0x00,
                                                    0x80, 0x00, 0x00, 0xAA, 0x00, 0x38, 0x9B, 0x71 };

    struct VBitDepthRow
    {
      std::uint16_t BitCount;
      ZOL::EPixelFormat PixelFormat;
    };

    constexpr VBitDepthRow s_RGBDepths[] = {
        { 8, ZOL::PixelFormat_Luminance8 }, { 24, ZOL::PixelFormat_B8G8R8 }, { 32, ZOL::PixelFormat_B8G8R8u8 } };
    constexpr VBitDepthRow s_Y800Depths[] = { { 8, ZOL::PixelFormat_Luminance8 } };

    // One row per compression: a row with depths takes its format from the bit count, the
    // others take any bit count.
    struct VCompressionRow
    {
      std::uint32_t Compression;
      ZOL::EVideoPayload Payload;
      ZOL::EPixelFormat AnyDepthFormat;
      const VBitDepthRow* pDepths;
      std::size_t DepthCount;
      const char* pDepthMessage;
      // Bitmaps of this kind are bottom-up unless their height is negative; 8-bit ones carry a
      // palette.
      bool bBitmap;
    };

    constexpr const char* s_RGBDepthMessage = "Unsupported bit depth for BGR or BGRu data format in AVI file.";
    constexpr const char* s_Y800DepthMessage = "Unsupported bit depth for Y800 data format in AVI file.";

    constexpr VCompressionRow s_Compressions[] = {
        { 0, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_Unspecified, s_RGBDepths, std::size( s_RGBDepths ),
          s_RGBDepthMessage, true },
        { MakeFourCC( "RGB " ), ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_Unspecified, s_RGBDepths,
          std::size( s_RGBDepths ), s_RGBDepthMessage, true },
        { MakeFourCC( "DIB " ), ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_Unspecified, s_RGBDepths,
          std::size( s_RGBDepths ), s_RGBDepthMessage, true },
        { MakeFourCC( "Y800" ), ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_Unspecified, s_Y800Depths,
          std::size( s_Y800Depths ), s_Y800DepthMessage, false },
        { MakeFourCC( "YUY2" ), ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_Y8U8Y8V8, nullptr, 0, nullptr, false },
        { MakeFourCC( "UYVY" ), ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_U8Y8V8Y8, nullptr, 0, nullptr, false },
        { MakeFourCC( "MJPG" ), ZOL::VideoPayload_ImageJPEG, ZOL::PixelFormat_R8G8B8, nullptr, 0, nullptr, false },
        { MakeFourCC( "H264" ), ZOL::VideoPayload_VideoH264, ZOL::PixelFormat_U8Y8V8Y8, nullptr, 0, nullptr, false },
    };

    // Bits a pixel of the raw formats strf can name.
    std::uint16_t BitsPerPixel( ZOL::EPixelFormat i_Format )
    {
      switch( i_Format )
      {
      case ZOL::PixelFormat_Luminance8:
        return 8;
      case ZOL::PixelFormat_U8Y8V8Y8:
      case ZOL::PixelFormat_Y8U8Y8V8:
        return 16;
      case ZOL::PixelFormat_B8G8R8:
        return 24;
      case ZOL::PixelFormat_B8G8R8u8:
        return 32;
      default:
        return 0;
      }
    }

    struct VSampleFormatRow
    {
      bool bFloat;
      std::uint16_t Bits;
      ZOL::EAudioSampleFormat Format;
    };

    constexpr VSampleFormatRow s_SampleFormats[] = { { false, 8, ZOL::AudioSampleFormat_UInt8 },
                                                     { false, 16, ZOL::AudioSampleFormat_Int16 },
                                                     { false, 24, ZOL::AudioSampleFormat_Int24 },
                                                     { false, 32, ZOL::AudioSampleFormat_Int32 },
                                                     { true, 32, ZOL::AudioSampleFormat_Float32 } };
  } // namespace

  bool VRapidAVIReader::ParseMainHeader( const VRiffChunk& )
  {
    std::uint8_t Header[MainHeaderSize];
    if( !m_pStream->Read( Header, sizeof( Header ) ) )
      return false;
    // Three decimals, as the header's whole microseconds allow. No period means no rate.
    const std::uint32_t MicrosecondsPerFrame = LoadLE32( Header );
    m_FrameRate = MicrosecondsPerFrame == 0 ? 0.0 : std::floor( 1000000000.0 / MicrosecondsPerFrame ) * 0.001;
    m_VideoFrameInfo.ImageWidth = static_cast< std::int32_t >( LoadLE32( Header + 32 ) );
    m_VideoFrameInfo.ImageHeight = static_cast< std::int32_t >( LoadLE32( Header + 36 ) );
    return true;
  }

  bool VRapidAVIReader::ParseStreamHeader( const VRiffChunk& )
  {
    std::uint8_t Header[StreamHeaderSize];
    if( !m_pStream->Read( Header, sizeof( Header ) ) )
      return false;
    const std::uint32_t Type = LoadLE32( Header );
    if( Type == FourCC::vids )
    {
      m_CurrentStreamKind = StreamKind_Video;
      const std::uint64_t Scale = LoadLE32( Header + 20 );
      const std::uint64_t Rate = LoadLE32( Header + 24 );
      if( Rate == 0 )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "AVI video stream has a rate of 0." );
        return false;
      }
      const std::uint64_t Period = Scale * ZOL::DefaultTicksPerSecond / Rate;
      if( Period > std::numeric_limits< std::uint32_t >::max() )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "AVI video frame period of %d/%d seconds is too long.", Scale, Rate );
        return false;
      }
      if( Scale * ZOL::DefaultTicksPerSecond % Rate != 0 )
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "AVI video frame rate cannot be represented in %dHz ticks.",
                   ZOL::DefaultTicksPerSecond );
      m_Timing.TicksPerSecond = ZOL::DefaultTicksPerSecond;
      m_Timing.FramePeriodInTicks = static_cast< std::uint32_t >( Period );
    }
    else if( Type == FourCC::auds )
    {
      m_CurrentStreamKind = StreamKind_Audio;
    }
    else
    {
      m_CurrentStreamKind = StreamKind_Other;
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Unknown track type (not video or audio)." );
    }
    return true;
  }

  bool VRapidAVIReader::ParseStreamFormat( const VRiffChunk& i_rChunk )
  {
    switch( m_CurrentStreamKind )
    {
    case StreamKind_Video:
      return ParseVideoFormat( i_rChunk );
    case StreamKind_Audio:
      ParseAudioFormat();
      return true;
    default:
      LUMEK_LOG( "RapidAVI", ZOL::LogWarning, "Skipping stream format for unknown track in AVI file." );
      return true;
    }
  }

  bool VRapidAVIReader::ParseVideoFormat( const VRiffChunk& i_rChunk )
  {
    std::uint8_t Header[BitmapHeaderSize];
    const bool bRead = m_pStream->Read( Header, sizeof( Header ) );
    const std::uint16_t BitCount = bRead ? LoadLE16( Header + 14 ) : 0;
    if( bRead )
    {
      const std::uint32_t Compression = LoadLE32( Header + 16 );
      const auto Row = std::find_if( std::begin( s_Compressions ), std::end( s_Compressions ),
                                     [&]( const VCompressionRow& rRow ) { return rRow.Compression == Compression; } );
      if( Row == std::end( s_Compressions ) )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Unsupported compression format in AVI file." );
        return false;
      }
      ZOL::EPixelFormat PixelFormat = Row->AnyDepthFormat;
      if( Row->pDepths != nullptr )
      {
        const VBitDepthRow* pEnd = Row->pDepths + Row->DepthCount;
        const VBitDepthRow* pDepth = std::find_if(
            Row->pDepths, pEnd, [&]( const VBitDepthRow& rDepth ) { return rDepth.BitCount == BitCount; } );
        if( pDepth == pEnd )
        {
          LUMEK_LOG( "RapidAVI", ZOL::LogFailure, Row->pDepthMessage );
          return false;
        }
        PixelFormat = pDepth->PixelFormat;
      }
      m_VideoPayload = Row->Payload;
      m_VideoFrameInfo.PixelFormat = PixelFormat;
      if( Row->bBitmap && static_cast< std::int32_t >( LoadLE32( Header + 8 ) ) > 0 )
        m_VideoFrameInfo.Flags |= ZOL::IVideoFrameInfo::Flag_Inverted;

      // 8-bit bitmaps are shown as grey, so the only palette that can be honoured is the ramp.
      if( Row->bBitmap && BitCount == 8 )
      {
        if( i_rChunk.Size != PalettedFormatSize )
        {
          LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
                     "Unsupported bitmap palette format.  Only a 256-colour BGRA palette is supported." );
          return false;
        }
        std::uint8_t Palette[PaletteEntries * 4];
        bool bGrey = m_pStream->Read( Palette, sizeof( Palette ) );
        for( std::size_t i = 0; bGrey && i < PaletteEntries; ++i )
          bGrey = Palette[4 * i] == i && Palette[4 * i + 1] == i && Palette[4 * i + 2] == i;
        if( !bGrey )
        {
          LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
                     "Invalid palette contents.  If a palette is defined it must be greyscale." );
          return false;
        }
      }
    }
    const bool bCompressed =
        m_VideoPayload == ZOL::VideoPayload_ImageJPEG || m_VideoPayload == ZOL::VideoPayload_VideoH264;
    if( !bRead || ( !bCompressed && BitCount != BitsPerPixel( m_VideoFrameInfo.PixelFormat ) ) )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Unexpected bit depth in AVI file." );
      return false;
    }
    return true;
  }

  void VRapidAVIReader::ParseAudioFormat()
  {
    // ffmpeg's plain PCM format is 16 bytes; the extra size then comes from the next chunk's
    // header and is not looked at, since only the extensible format uses it.
    std::uint8_t Header[WaveHeaderSize];
    bool bUsable = m_pStream->Read( Header, sizeof( Header ) );
    bool bFloat = false;
    const std::uint16_t Tag = bUsable ? LoadLE16( Header ) : 0;
    if( Tag == WaveFormatExtensible && LoadLE16( Header + 16 ) >= WaveExtensionSize )
    {
      std::uint8_t Extension[WaveExtensionSize];
      bUsable = m_pStream->Read( Extension, sizeof( Extension ) );
      const std::uint8_t* pSubFormat = Extension + 6;
      bFloat = bUsable && std::memcmp( pSubFormat, s_SubFormatFloat, sizeof( s_SubFormatFloat ) ) == 0;
      bUsable = bUsable && ( bFloat || std::memcmp( pSubFormat, s_SubFormatPCM, sizeof( s_SubFormatPCM ) ) == 0 );
    }
    else
    {
      bUsable = bUsable && Tag == WaveFormatPCM;
    }
    if( !bUsable )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogWarning, "Unsupported audio payload in AVI file." );
      return;
    }

    m_AudioFrameInfo.Channels = LoadLE16( Header + 2 );
    m_AudioFrameInfo.SampleRate = static_cast< std::int32_t >( LoadLE32( Header + 4 ) );
    const std::uint16_t Bits = LoadLE16( Header + 14 );
    const auto Row =
        std::find_if( std::begin( s_SampleFormats ), std::end( s_SampleFormats ),
                      [&]( const VSampleFormatRow& rRow ) { return rRow.bFloat == bFloat && rRow.Bits == Bits; } );
    if( Row == std::end( s_SampleFormats ) )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogWarning, "Unsupported audio bits per sample in AVI file." );
      return;
    }
    m_AudioFrameInfo.SampleFormat = Row->Format;
    m_AudioPayload = ZOL::AudioPayload_Uncompressed;
  }
} // namespace RapidAVI
