#pragma once

// The attribute store's serial form, for the store's and the records' tests.

#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/IVideoAttributes.h"

#include <gtest/gtest.h>

namespace LumekTest
{
  inline std::vector< std::uint8_t > Serialise( const ZOL::IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    EXPECT_TRUE( i_rStore.WriteTo( Stream ) );
    return Stream.GetData();
  }

  inline ZOL::IVideoFrameInfo Frame( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format )
  {
    return { 0, 0, 1, 1, i_Width, i_Height, i_Format, 0, 1.0, ZOL::InterlacedFormat_Unspecified };
  }

  inline CoreLumekTypes::VLensDistortionCalibration Lens( ZOL::ERadialModel i_Model, std::vector< double > i_Parameters,
                                                          double i_X = 0, double i_Y = 0 )
  {
    return { i_Model, std::move( i_Parameters ), i_X, i_Y };
  }
} // namespace LumekTest
