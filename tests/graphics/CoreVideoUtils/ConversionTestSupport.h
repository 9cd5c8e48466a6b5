#pragma once

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include <cstdint>
#include <random>
#include <vector>

namespace CoreVideoUtilsTest
{
  using Bytes = std::vector< std::uint8_t >;
  using CoreVideoUtils::EInstructionSet;

  inline Bytes RandomBytes( std::size_t i_Count, std::uint32_t i_Seed )
  {
    std::mt19937 Generator( i_Seed );
    Bytes Result( i_Count );
    for( auto& b : Result )
      b = static_cast< std::uint8_t >( Generator() );
    return Result;
  }

  // The instruction sets this processor runs, the scalar rule first.
  inline std::vector< EInstructionSet > SupportedSets()
  {
    std::vector< EInstructionSet > Sets;
    for( auto Set : { EInstructionSet::Scalar, EInstructionSet::SSE2, EInstructionSet::AVX2, EInstructionSet::AVX512 } )
      if( CoreVideoUtils::IsSupported( Set ) )
        Sets.push_back( Set );
    return Sets;
  }

  inline ZOL::IVideoFrameInfo Info( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format )
  {
    ZOL::IVideoFrameInfo Result;
    Result.ImageWidth = i_Width;
    Result.ImageHeight = i_Height;
    Result.PixelFormat = i_Format;
    return Result;
  }

  // The frame converted by a fresh converter into a target that starts as 0xCD, or nothing when
  // the conversion fails.
  inline Bytes Converted( const Bytes& i_rSource, std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_From,
                          ZOL::EPixelFormat i_To, EInstructionSet i_Set = CoreVideoUtils::BestInstructionSet(),
                          const ZOL::IVideoSettings& i_rSettings = ZOL::IVideoSettings() )
  {
    Bytes Target( CoreVideoUtils::FrameSizeInBytes( i_Width, i_Height, i_To ), 0xCD );
    CoreVideoUtils::VPixelFormatConverter Converter;
    Converter.SetInstructionSet( i_Set );
    Converter.SetVideoSettings( i_rSettings );
    return Converter.Convert( Info( i_Width, i_Height, i_From ), i_rSource.data(), i_rSource.size(), i_To,
                              Target.data(), Target.size() )
               ? Target
               : Bytes();
  }
} // namespace CoreVideoUtilsTest
