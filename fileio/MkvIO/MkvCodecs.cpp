#include "fileio/MkvIO/MkvCodecs.h"

namespace MkvIO
{
  const char* const CodecMJPEG = "V_MJPEG";
  const char* const CodecVfwFourCC = "V_MS/VFW/FOURCC";
  const char* const CodecUncompressed = "V_UNCOMPRESSED";
  const char* const CodecPcmInteger = "A_PCM/INT/LIT";
  const char* const CodecPcmFloat = "A_PCM/FLOAT/IEEE";

  namespace
  {
    struct VFourCCRow
    {
      const char* FourCC;
      ZOL::EPixelFormat Format;
    };
    constexpr VFourCCRow s_FourCCs[] = {
        { "RGBA", ZOL::PixelFormat_R8G8B8u8 },
        { "UYVY", ZOL::PixelFormat_U8Y8V8Y8 },
        { "YUY2", ZOL::PixelFormat_Y8U8Y8V8 },
        { "GREY", ZOL::PixelFormat_Luminance8 },
    };

    struct VPcmRow
    {
      const char* const* CodecID;
      std::uint64_t BitDepth; // 0: any depth
      ZOL::EAudioSampleFormat Format;
    };
    const VPcmRow s_PcmFormats[] = {
        { &CodecPcmInteger, 16, ZOL::AudioSampleFormat_Int16 },
        { &CodecPcmInteger, 24, ZOL::AudioSampleFormat_Int24 },
        { &CodecPcmInteger, 32, ZOL::AudioSampleFormat_Int32 },
        { &CodecPcmFloat, 0, ZOL::AudioSampleFormat_Float32 },
    };
  } // namespace

  EVideoCodec FindVideoCodec( const std::string& i_rCodecID )
  {
    if( i_rCodecID == CodecMJPEG )
      return EVideoCodec::MJPEG;
    if( i_rCodecID == CodecVfwFourCC || i_rCodecID == CodecUncompressed )
      return EVideoCodec::FourCC;
    return EVideoCodec::Unknown;
  }

  std::optional< ZOL::EPixelFormat > PixelFormatForFourCC( const std::string& i_rFourCC )
  {
    for( const VFourCCRow& rRow : s_FourCCs )
      if( i_rFourCC == rRow.FourCC )
        return rRow.Format;
    return std::nullopt;
  }

  std::string FourCCForPixelFormat( ZOL::EPixelFormat i_Format )
  {
    for( const VFourCCRow& rRow : s_FourCCs )
      if( rRow.Format == i_Format )
        return rRow.FourCC;
    return std::string();
  }

  bool IsPcmCodec( const std::string& i_rCodecID )
  {
    return i_rCodecID == CodecPcmInteger || i_rCodecID == CodecPcmFloat;
  }

  std::optional< ZOL::EAudioSampleFormat > SampleFormatForCodec( const std::string& i_rCodecID,
                                                                 std::uint64_t i_BitDepth )
  {
    for( const VPcmRow& rRow : s_PcmFormats )
      if( i_rCodecID == *rRow.CodecID && ( rRow.BitDepth == 0 || rRow.BitDepth == i_BitDepth ) )
        return rRow.Format;
    return std::nullopt;
  }

  bool CodecForSampleFormat( ZOL::EAudioSampleFormat i_Format, std::string& o_rCodecID, std::uint64_t& o_rBitDepth )
  {
    for( const VPcmRow& rRow : s_PcmFormats )
      if( rRow.Format == i_Format )
      {
        o_rCodecID = *rRow.CodecID;
        o_rBitDepth = rRow.BitDepth == 0 ? 32 : rRow.BitDepth;
        return true;
      }
    return false;
  }
} // namespace MkvIO
