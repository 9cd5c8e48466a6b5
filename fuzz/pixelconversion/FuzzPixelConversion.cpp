// Conversion of arbitrary frames: the first bytes choose formats, size, settings and the
// vector form, the rest is the source frame, as long or as short as it happens to be.

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include <cstdint>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  constexpr std::size_t HeaderBytes = 6;
  if( i_Size < HeaderBytes )
    return 0;
  const auto Source = static_cast< ZOL::EPixelFormat >( i_pData[0] % 21 );
  const auto Target = static_cast< ZOL::EPixelFormat >( i_pData[1] % 21 );
  // Up to 128 x 64 pixels: wide enough for every vector block and 10-bit row padding.
  const std::int32_t Width = 1 + i_pData[2] % 128, Height = 1 + i_pData[3] % 64;
  const std::uint8_t Flags = i_pData[4];
  const std::uint8_t Setting = i_pData[5];

  CoreVideoUtils::VPixelFormatConverter Converter;
  const CoreVideoUtils::EInstructionSet Set = static_cast< CoreVideoUtils::EInstructionSet >( Flags % 4 );
  if( CoreVideoUtils::IsSupported( Set ) )
    Converter.SetInstructionSet( Set );
  ZOL::IVideoSettings Settings;
  Settings.GammaCorrection = ( Flags & 0x08 ) ? 0.1f + Setting / 32.0f : 1.0f;
  Settings.Saturation = ( Flags & 0x10 ) ? Setting / 64.0f - 1.0f : 1.0f;
  Converter.SetVideoSettings( Settings );

  ZOL::IVideoFrameInfo Info;
  Info.ImageWidth = Width;
  Info.ImageHeight = Height;
  Info.PixelFormat = Source;
  std::uint64_t TargetBytes = CoreVideoUtils::FrameSizeInBytes( Width, Height, Target );
  if( ( Flags & 0x20 ) && TargetBytes > 0 )
    --TargetBytes; // one byte short must fail before writing anything
  std::vector< std::uint8_t > TargetFrame( TargetBytes + 1 );
  // The source is copied so that AddressSanitizer sees its exact end.
  const std::vector< std::uint8_t > SourceFrame( i_pData + HeaderBytes, i_pData + i_Size );
  static_cast< void >(
      Converter.Convert( Info, SourceFrame.data(), SourceFrame.size(), Target, TargetFrame.data(), TargetBytes ) );
  return 0;
}
