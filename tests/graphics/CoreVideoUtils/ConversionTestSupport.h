#pragma once

#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "services/Log.h"

#include <cstdint>
#include <random>
#include <string>
#include <vector>

namespace CoreVideoUtilsTest
{
  using Bytes = std::vector< std::uint8_t >;

  inline Bytes RandomBytes( std::size_t i_Count, std::uint32_t i_Seed )
  {
    std::mt19937 Generator( i_Seed );
    Bytes Result( i_Count );
    for( auto& b : Result )
      b = static_cast< std::uint8_t >( Generator() );
    return Result;
  }

  inline ZOL::IVideoFrameInfo Info( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format )
  {
    ZOL::IVideoFrameInfo Result;
    Result.ImageWidth = i_Width;
    Result.ImageHeight = i_Height;
    Result.PixelFormat = i_Format;
    return Result;
  }

  // Converts with a fresh converter; the target is sized for the format and starts as 0xCD.
  inline bool Convert( const Bytes& i_rSource, std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_From,
                       ZOL::EPixelFormat i_To, Bytes& o_rTarget,
                       CoreVideoUtils::EInstructionSet i_Set = CoreVideoUtils::BestInstructionSet(),
                       const ZOL::IVideoSettings& i_rSettings = ZOL::IVideoSettings() )
  {
    o_rTarget.assign( CoreVideoUtils::FrameSizeInBytes( i_Width, i_Height, i_To ), 0xCD );
    CoreVideoUtils::VPixelFormatConverter Converter;
    Converter.SetInstructionSet( i_Set );
    Converter.SetVideoSettings( i_rSettings );
    return Converter.Convert( Info( i_Width, i_Height, i_From ), i_rSource.data(), i_rSource.size(), i_To,
                              o_rTarget.data(), o_rTarget.size() );
  }

  inline Bytes MustConvert( const Bytes& i_rSource, std::int32_t i_Width, std::int32_t i_Height,
                            ZOL::EPixelFormat i_From, ZOL::EPixelFormat i_To )
  {
    Bytes Result;
    if( !Convert( i_rSource, i_Width, i_Height, i_From, i_To, Result ) )
      Result.clear();
    return Result;
  }

  // Collects the log lines of one category while it lives.
  class VLogCapture
  {
  public:
    explicit VLogCapture( std::string i_Category ) : m_Category( std::move( i_Category ) )
    {
      m_Handle = ZOL::GlobalLog().AddSink(
          [this]( const ZOL::ILogRecord& i_rRecord )
          {
            if( i_rRecord.Category == m_Category )
              m_Lines.push_back( std::to_string( i_rRecord.Level ) + " " + i_rRecord.Message );
          },
          ZOL::LogDetail );
    }
    ~VLogCapture() { ZOL::GlobalLog().RemoveSink( m_Handle ); }
    const std::vector< std::string >& Lines() const { return m_Lines; }

  private:
    std::string m_Category;
    std::vector< std::string > m_Lines;
    int m_Handle = 0;
  };
} // namespace CoreVideoUtilsTest
