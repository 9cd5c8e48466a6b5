#pragma once

// What the image, sequence, Matroska and H.264 reader tests share: files read and written whole,
// a temporary folder, the bytes of a buffer, the distance between two pictures, the committed
// seeds and the frame a container would declare.

#include "tests/support/Files.h"
#include "tests/support/LogCapture.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/IVideoFrameInfo.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <random>

namespace LumekTest
{
  using VBytes = std::vector< std::uint8_t >;

  inline std::shared_ptr< ZOL::IBufferAllocator > MakeFrameAllocator()
  {
    return std::make_shared< ZOL::VFrameBufferAllocator >();
  }

  // The bytes cut at i_Position when i_Flip is zero, else whole with the byte there XORed with it.
  inline VBytes Damaged( const VBytes& i_rWhole, std::size_t i_Position, std::uint8_t i_Flip )
  {
    VBytes Bytes( i_rWhole.begin(),
                  i_rWhole.begin() + std::min( i_Flip ? i_rWhole.size() : i_Position, i_rWhole.size() ) );
    if( i_Flip && i_Position < Bytes.size() )
      Bytes[i_Position] ^= i_Flip;
    return Bytes;
  }

  inline VBytes Bytes( const ZOL::IBufferConst& i_rBuffer )
  {
    return VBytes( i_rBuffer.GetData(), i_rBuffer.GetData() + i_rBuffer.GetSize() );
  }

  inline VBytes Bytes( const std::shared_ptr< ZOL::IBuffer >& i_pBuffer )
  {
    return i_pBuffer ? Bytes( *i_pBuffer ) : VBytes();
  }

  // Whether the bytes at the start of i_rGot differ from i_rExpected by at most i_Largest and on
  // average by at most i_Mean, for decoders that may round their own way.
  inline ::testing::AssertionResult Near( const VBytes& i_rExpected, const ZOL::IBufferConst& i_rGot, int i_Largest,
                                          double i_Mean )
  {
    int Largest = 0;
    double Sum = 0.0;
    for( std::size_t i = 0; i < i_rExpected.size() && i < i_rGot.GetSize(); ++i )
    {
      Largest = std::max( Largest, std::abs( int( i_rExpected[i] ) - int( i_rGot.GetData()[i] ) ) );
      Sum += std::abs( int( i_rExpected[i] ) - int( i_rGot.GetData()[i] ) );
    }
    const double Mean = i_rExpected.empty() ? 0.0 : Sum / static_cast< double >( i_rExpected.size() );
    if( Largest <= i_Largest && Mean <= i_Mean )
      return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure() << "largest difference " << Largest << ", mean " << Mean;
  }

#ifdef LUMEK_SEED_DIR
  // A file of the committed fuzz seeds, by its path below fuzz/seeds.
  inline VBytes Seed( const std::string& i_rName )
  {
    return ReadFileBytes( std::string( LUMEK_SEED_DIR ) + "/" + i_rName );
  }
#endif

  inline ZOL::IVideoFrameInfo FrameInfo( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    return Info;
  }
} // namespace LumekTest
