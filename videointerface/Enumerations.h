#pragma once

// The video model's vocabulary. Files store enumerations by name, never by number: each
// enumeration has one constant table that converts both ways, and whose descriptions are
// the texts of the properties panel.

#include "utils/ResultCodes.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

namespace ZOL
{
  // Every pixel format with its number. A format added here does not build until it has its row
  // in PixelFormatDescriptor.cpp.
#define LUMEK_PIXEL_FORMATS( X )                                                                                       \
  X( Unspecified, 0 )                                                                                                  \
  X( Luminance8, 1 )                                                                                                   \
  X( BayerRG8, 2 )                                                                                                     \
  X( BayerGB8, 3 )                                                                                                     \
  X( BayerGR8, 4 )                                                                                                     \
  X( BayerBG8, 5 )                                                                                                     \
  X( R5G6B5, 6 )                                                                                                       \
  X( R8G8B8, 7 )                                                                                                       \
  X( B8G8R8, 8 )                                                                                                       \
  X( R8G8B8u8, 9 )                                                                                                     \
  X( B8G8R8u8, 10 )                                                                                                    \
  X( U8Y8V8Y8, 11 )                                                                                                    \
  X( Y8U8Y8V8, 12 )                                                                                                    \
  X( U10Y10V10Y10, 13 )                                                                                                \
  X( BayerGB7, 14 )                                                                                                    \
  X( BayerGB6, 15 )                                                                                                    \
  X( Luminance7, 16 )                                                                                                  \
  X( Luminance6, 17 )                                                                                                  \
  X( PlanarY8U8V8, 18 )                                                                                                \
  X( PlanarR8G8B8, 19 )

  enum EPixelFormat : std::uint32_t
  {
#define LUMEK_PIXEL_FORMAT_ENUMERATOR( NAME, VALUE ) PixelFormat_##NAME = VALUE,
    LUMEK_PIXEL_FORMATS( LUMEK_PIXEL_FORMAT_ENUMERATOR )
#undef LUMEK_PIXEL_FORMAT_ENUMERATOR
  };
#define LUMEK_PIXEL_FORMAT_ONE( NAME, VALUE ) +1
  constexpr std::uint32_t PixelFormatCount = 0 LUMEK_PIXEL_FORMATS( LUMEK_PIXEL_FORMAT_ONE );
#undef LUMEK_PIXEL_FORMAT_ONE

  enum EVideoPayload : std::uint32_t
  {
    VideoPayload_None = 0,
    VideoPayload_Uncompressed = 1,
    VideoPayload_ImageJPEG = 2,
    VideoPayload_ImagePNG = 3,
    VideoPayload_ImageTIFF = 4,
    VideoPayload_VideoH264 = 5,
  };

  enum EAudioPayload : std::uint32_t
  {
    AudioPayload_None = 0,
    AudioPayload_Uncompressed = 1,
    AudioPayload_LosslessFLAC = 2,
  };

  enum EAudioSampleFormat : std::uint32_t
  {
    AudioSampleFormat_Unspecified = 0,
    AudioSampleFormat_Int8 = 1,
    AudioSampleFormat_Int16 = 2,
    AudioSampleFormat_Int24 = 3,
    AudioSampleFormat_Int32 = 4,
    AudioSampleFormat_UInt16 = 5,
    AudioSampleFormat_Float32 = 6,
    AudioSampleFormat_UInt8 = 7,
    AudioSampleFormat_UInt24 = 8,
    AudioSampleFormat_UInt32 = 9,
  };

  enum EInterlacedFormat : std::uint32_t
  {
    InterlacedFormat_Unspecified = 0,
    InterlacedFormat_NotInterlaced = 1,
    InterlacedFormat_InterlacedFrameEvenOlder = 2,
    InterlacedFormat_InterlacedFrameOddOlder = 3,
    InterlacedFormat_InterlacedFrameUnspecifiedLineTiming = 4,
  };

  enum EVideoContainer : std::uint32_t
  {
    VideoContainer_MOV = 0,
    VideoContainer_MP4 = 1,
    VideoContainer_AVI = 2,
    VideoContainer_LVID = 3,
    VideoContainer_MKV = 4,
    VideoContainer_IMAGES = 5,
  };

  enum ERadialModel : std::uint32_t
  {
    RadialModel_Lumek2Parameter = 0,
    RadialModel_Lumek3Parameter = 1,
    RadialModel_Lumek0Parameter = 2,
    RadialModel_BadRadialModel = 3,
  };

  // One row of an enumeration table.
  struct IEnumRow
  {
    std::uint32_t Value;
    const char* Name;
    const char* Description;
  };

  // An immutable enumeration table: name (ending in ".Enum"), description and rows in table order.
  struct IEnumTable
  {
    const char* Name;
    const char* Description;
    const IEnumRow* Rows;
    std::size_t RowCount;

    // The row's name, or the fallback when the value is in no row.
    const char* ToName( std::uint32_t i_Value, const char* i_pFallback ) const;
    std::optional< std::string > ToNameOptional( std::uint32_t i_Value ) const;
    // The value of the row whose name has the same bytes (no case folding), or nothing.
    std::optional< std::uint32_t > FromName( std::string_view i_Name ) const;
    // The row's description, or the empty text.
    const char* ToDescription( std::uint32_t i_Value ) const;
  };

  const IEnumTable& PixelFormatTable();
  const IEnumTable& VideoPayloadTable();
  const IEnumTable& AudioPayloadTable();
  const IEnumTable& AudioSampleFormatTable();
  const IEnumTable& InterlacedFormatTable();
  const IEnumTable& VideoContainerTable();
  const IEnumTable& RadialModelTable();

  // The text every attribute reader passes as fallback.
  constexpr const char* UnspecifiedText = "Unspecified";

  // Typed conveniences over the tables.
  const char* ToString( EPixelFormat i_Value, const char* i_pFallback = UnspecifiedText );
  std::optional< std::string > ToStringOptional( EPixelFormat i_Value );
  const char* ToString( EVideoPayload i_Value, const char* i_pFallback = UnspecifiedText );
  const char* ToString( EAudioPayload i_Value, const char* i_pFallback = UnspecifiedText );
  const char* ToString( EAudioSampleFormat i_Value, const char* i_pFallback = UnspecifiedText );
  const char* ToString( EInterlacedFormat i_Value, const char* i_pFallback = UnspecifiedText );
  const char* ToString( EVideoContainer i_Value, const char* i_pFallback = UnspecifiedText );
  const char* ToString( ERadialModel i_Value, const char* i_pFallback = UnspecifiedText );

  bool FromString( std::string_view i_Name, EPixelFormat& o_rValue );
  bool FromString( std::string_view i_Name, EVideoPayload& o_rValue );
  bool FromString( std::string_view i_Name, EAudioPayload& o_rValue );
  bool FromString( std::string_view i_Name, EAudioSampleFormat& o_rValue );
  bool FromString( std::string_view i_Name, EInterlacedFormat& o_rValue );
  bool FromString( std::string_view i_Name, EVideoContainer& o_rValue );
  bool FromString( std::string_view i_Name, ERadialModel& o_rValue );

  // The extension of a container without the dot ("mov", "lvid", ...); empty for other values.
  const char* ContainerExtension( EVideoContainer i_Container );
  extern const char* const ImageSequenceExtension; // "lumekimagesequence"

  // Parameters a radial model takes; -1 for a model that is not usable.
  int RadialModelParameterCount( ERadialModel i_Model );
} // namespace ZOL
