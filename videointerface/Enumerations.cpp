#include "videointerface/Enumerations.h"

#include <unordered_map>

namespace ZOL
{
  namespace
  {
    constexpr IEnumRow s_PixelFormatRows[] = {
#define LUMEK_PIXEL_FORMAT_ROW( NAME, VALUE ) { PixelFormat_##NAME, #NAME, "" },
        LUMEK_PIXEL_FORMATS( LUMEK_PIXEL_FORMAT_ROW )
#undef LUMEK_PIXEL_FORMAT_ROW
    };

    constexpr IEnumRow s_VideoPayloadRows[] = {
        { VideoPayload_None, "None", "No video present." },
        { VideoPayload_Uncompressed, "Uncompressed",
          "Uncompressed data.  Pixel format must be given with ZOL::IPixelFormat." },
        { VideoPayload_ImageJPEG, "ImageJPEG", "Image sequence of JPEG with complete headers." },
        { VideoPayload_ImagePNG, "ImagePNG", "Image sequence of PNG." },
        { VideoPayload_ImageTIFF, "ImageTIFF", "Image sequence of TIFF." },
        { VideoPayload_VideoH264, "VideoH264", "Video compressed as H.264." },
    };

    constexpr IEnumRow s_AudioPayloadRows[] = {
        { AudioPayload_None, "None", "No audio present." },
        { AudioPayload_Uncompressed, "Uncompressed",
          "Uncompressed data.  Pixel format must be given with ZOL::ISampleFormat." },
        { AudioPayload_LosslessFLAC, "LosslessFLAC", "Lossless encoding with FLAC." },
    };

    // Row order and numbers differ on purpose (UInt8 is 7, Float32 is 6): files store the
    // names and code compares the numbers, so neither order may be "tidied" into the other.
    constexpr IEnumRow s_AudioSampleFormatRows[] = {
        { AudioSampleFormat_Unspecified, "Unspecified", "Unspecified sample format." },
        { AudioSampleFormat_Int8, "Int8", "8-bit signed integer sample (-128 to 127)." },
        { AudioSampleFormat_Int16, "Int16", "16-bit signed integer sample (-32768 to 32767)." },
        { AudioSampleFormat_Int24, "Int24", "24-bit signed integer sample (-8388608 to 8388607)." },
        { AudioSampleFormat_Int32, "Int32", "32-bit signed integer sample (-2147483648 to 2147483647)." },
        { AudioSampleFormat_UInt8, "UInt8", "8-bit unsigned integer sample (0 to 255)." },
        { AudioSampleFormat_UInt16, "UInt16", "16-bit unsigned integer sample (0 to 65535)." },
        { AudioSampleFormat_UInt24, "UInt24", "24-bit unsigned integer sample (0 to 16777216)." },
        { AudioSampleFormat_UInt32, "UInt32", "32-bit unsigned integer sample (0 to 4294967296)." },
        { AudioSampleFormat_Float32, "Float32", "IEEE floating point sample (using full range)." },
    };

    constexpr IEnumRow s_InterlacedFormatRows[] = {
        { InterlacedFormat_Unspecified, "Unspecified", "" },
        { InterlacedFormat_NotInterlaced, "NotInterlaced", "" },
        { InterlacedFormat_InterlacedFrameEvenOlder, "InterlacedFrameEvenOlder", "" },
        { InterlacedFormat_InterlacedFrameOddOlder, "InterlacedFrameOddOlder", "" },
        { InterlacedFormat_InterlacedFrameUnspecifiedLineTiming, "InterlacedFrameUnspecifiedLineTiming", "" },
    };

    constexpr IEnumRow s_VideoContainerRows[] = {
        { VideoContainer_MOV, "MOV", "Apple QuickTime container format (*.mov, *.moov)" },
        { VideoContainer_MP4, "MP4", "MPEG4 container based on Apple QuickTime (*.mp4)" },
        { VideoContainer_AVI, "AVI",
          "Container developed by Microsoft and used for VideoForWindows/DirectShow (*.avi)" },
        { VideoContainer_LVID, "LVID", "Lumek video container (*.lvid)" },
        { VideoContainer_MKV, "MKV", "Matroska container (*.mkv, *.mka)" },
        { VideoContainer_IMAGES, "IMAGES",
          "Sequence of image files in directory containing attributes file (*.lumekimagesequence)" },
    };

    constexpr IEnumRow s_RadialModelRows[] = {
        { RadialModel_Lumek2Parameter, "Lumek2Parameter", "" },
        { RadialModel_Lumek3Parameter, "Lumek3Parameter", "" },
        { RadialModel_Lumek0Parameter, "Lumek0Parameter", "" },
        { RadialModel_BadRadialModel, "BadRadialModel", "" },
    };

    template < std::size_t Count >
    constexpr IEnumTable MakeTable( const char* i_pName, const char* i_pDescription,
                                    const IEnumRow ( &i_rRows )[Count] )
    {
      return IEnumTable{ i_pName, i_pDescription, i_rRows, Count };
    }

    constexpr IEnumTable s_PixelFormatTable = MakeTable( "PixelFormat.Enum", "Enumeration.", s_PixelFormatRows );
    constexpr IEnumTable s_VideoPayloadTable =
        MakeTable( "VideoPayload.Enum", "Enumeration of payload types.", s_VideoPayloadRows );
    constexpr IEnumTable s_AudioPayloadTable =
        MakeTable( "AudioPayload.Enum", "Enumeration of payload types.", s_AudioPayloadRows );
    constexpr IEnumTable s_AudioSampleFormatTable = MakeTable( "AudioSampleFormat.Enum", "", s_AudioSampleFormatRows );
    constexpr IEnumTable s_InterlacedFormatTable = MakeTable( "InterlacedFormat.Enum", "", s_InterlacedFormatRows );
    constexpr IEnumTable s_VideoContainerTable =
        MakeTable( "VideoContainer.Enum", "Enumeration of container formats.", s_VideoContainerRows );
    constexpr IEnumTable s_RadialModelTable =
        MakeTable( "LensDistortionCalibration.ERadialModel", "Possible lens model types", s_RadialModelRows );

    constexpr char s_ImageSequenceExtension[] = "lumekimagesequence";

    // The extension column of the container table, indexed by container value.
    constexpr const char* s_ContainerExtensions[] = { "mov", "mp4", "avi", "lvid", "mkv", s_ImageSequenceExtension };

    const IEnumRow* FindRow( const IEnumTable& i_rTable, std::uint32_t i_Value )
    {
      for( std::size_t i = 0; i < i_rTable.RowCount; ++i )
        if( i_rTable.Rows[i].Value == i_Value )
          return &i_rTable.Rows[i];
      return nullptr;
    }

    template < typename E > bool FromTable( const IEnumTable& i_rTable, std::string_view i_Name, E& o_rValue )
    {
      const std::optional< std::uint32_t > Value = i_rTable.FromName( i_Name );
      if( !Value )
        return false;
      o_rValue = static_cast< E >( *Value );
      return true;
    }
  } // namespace

  const char* IEnumTable::ToName( std::uint32_t i_Value, const char* i_pFallback ) const
  {
    const IEnumRow* pRow = FindRow( *this, i_Value );
    return pRow ? pRow->Name : i_pFallback;
  }

  std::optional< std::string > IEnumTable::ToNameOptional( std::uint32_t i_Value ) const
  {
    const IEnumRow* pRow = FindRow( *this, i_Value );
    if( pRow == nullptr )
      return std::nullopt;
    return std::string( pRow->Name );
  }

  std::optional< std::uint32_t > IEnumTable::FromName( std::string_view i_Name ) const
  {
    // Exact bytes and length: a file that says "bayerGB8" has no pixel format.
    for( std::size_t i = 0; i < RowCount; ++i )
      if( i_Name == std::string_view( Rows[i].Name ) )
        return Rows[i].Value;
    return std::nullopt;
  }

  const char* IEnumTable::ToDescription( std::uint32_t i_Value ) const
  {
    const IEnumRow* pRow = FindRow( *this, i_Value );
    return pRow ? pRow->Description : "";
  }

  const IEnumTable& PixelFormatTable()
  {
    return s_PixelFormatTable;
  }
  const IEnumTable& VideoPayloadTable()
  {
    return s_VideoPayloadTable;
  }
  const IEnumTable& AudioPayloadTable()
  {
    return s_AudioPayloadTable;
  }
  const IEnumTable& AudioSampleFormatTable()
  {
    return s_AudioSampleFormatTable;
  }
  const IEnumTable& InterlacedFormatTable()
  {
    return s_InterlacedFormatTable;
  }
  const IEnumTable& VideoContainerTable()
  {
    return s_VideoContainerTable;
  }
  const IEnumTable& RadialModelTable()
  {
    return s_RadialModelTable;
  }

  const char* ToString( EPixelFormat i_Value, const char* i_pFallback )
  {
    return s_PixelFormatTable.ToName( i_Value, i_pFallback );
  }
  std::optional< std::string > ToStringOptional( EPixelFormat i_Value )
  {
    return s_PixelFormatTable.ToNameOptional( i_Value );
  }
  const char* ToString( EVideoPayload i_Value, const char* i_pFallback )
  {
    return s_VideoPayloadTable.ToName( i_Value, i_pFallback );
  }
  const char* ToString( EAudioPayload i_Value, const char* i_pFallback )
  {
    return s_AudioPayloadTable.ToName( i_Value, i_pFallback );
  }
  const char* ToString( EAudioSampleFormat i_Value, const char* i_pFallback )
  {
    return s_AudioSampleFormatTable.ToName( i_Value, i_pFallback );
  }
  const char* ToString( EInterlacedFormat i_Value, const char* i_pFallback )
  {
    return s_InterlacedFormatTable.ToName( i_Value, i_pFallback );
  }
  const char* ToString( EVideoContainer i_Value, const char* i_pFallback )
  {
    return s_VideoContainerTable.ToName( i_Value, i_pFallback );
  }
  const char* ToString( ERadialModel i_Value, const char* i_pFallback )
  {
    return s_RadialModelTable.ToName( i_Value, i_pFallback );
  }

  bool FromString( std::string_view i_Name, EPixelFormat& o_rValue )
  {
    return FromTable( s_PixelFormatTable, i_Name, o_rValue );
  }
  bool FromString( std::string_view i_Name, EVideoPayload& o_rValue )
  {
    return FromTable( s_VideoPayloadTable, i_Name, o_rValue );
  }
  bool FromString( std::string_view i_Name, EAudioPayload& o_rValue )
  {
    return FromTable( s_AudioPayloadTable, i_Name, o_rValue );
  }
  bool FromString( std::string_view i_Name, EAudioSampleFormat& o_rValue )
  {
    return FromTable( s_AudioSampleFormatTable, i_Name, o_rValue );
  }
  bool FromString( std::string_view i_Name, EInterlacedFormat& o_rValue )
  {
    return FromTable( s_InterlacedFormatTable, i_Name, o_rValue );
  }
  bool FromString( std::string_view i_Name, EVideoContainer& o_rValue )
  {
    return FromTable( s_VideoContainerTable, i_Name, o_rValue );
  }
  bool FromString( std::string_view i_Name, ERadialModel& o_rValue )
  {
    return FromTable( s_RadialModelTable, i_Name, o_rValue );
  }

  const char* const ImageSequenceExtension = s_ImageSequenceExtension;

  const char* ContainerExtension( EVideoContainer i_Container )
  {
    constexpr std::size_t Count = sizeof( s_ContainerExtensions ) / sizeof( s_ContainerExtensions[0] );
    return i_Container < Count ? s_ContainerExtensions[i_Container] : "";
  }

  int RadialModelParameterCount( ERadialModel i_Model )
  {
    switch( i_Model )
    {
    case RadialModel_Lumek2Parameter:
      return 2;
    case RadialModel_Lumek3Parameter:
      return 3;
    case RadialModel_Lumek0Parameter:
      return 0;
    default:
      return -1;
    }
  }

} // namespace ZOL
