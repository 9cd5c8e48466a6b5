#pragma once

// The H.264 numbers a dump or a log line names: NAL unit types, slice types and SEI payload
// types, one table each.

#include <cstdint>

namespace H264Utils
{
  enum EH264NALUnitType : std::uint32_t
  {
    H264NALUnitType_CodedSliceNonIDR = 1,
    H264NALUnitType_CodedSlicePartitionA = 2,
    H264NALUnitType_CodedSlicePartitionB = 3,
    H264NALUnitType_CodedSlicePartitionC = 4,
    H264NALUnitType_CodedSliceIDR = 5,
    H264NALUnitType_SEI = 6,
    H264NALUnitType_SPS = 7,
    H264NALUnitType_PPS = 8,
    H264NALUnitType_AccessUnitDelimiter = 9,
    H264NALUnitType_EndOfSequence = 10,
    H264NALUnitType_EndOfStream = 11,
    H264NALUnitType_FillerData = 12,
    H264NALUnitType_SPSExtension = 13,
    H264NALUnitType_PrefixNALUnit = 14,
    H264NALUnitType_SubsetSPS = 15,
    H264NALUnitType_DepthParameterSet = 16,
    H264NALUnitType_Reserved17 = 17,
    H264NALUnitType_Reserved18 = 18,
    H264NALUnitType_CodedSliceAuxillary = 19,
    H264NALUnitType_CodedSliceExtension = 20,
    H264NALUnitType_CodedSliceExtensionForDepthView = 21,
    H264NALUnitType_Reserved22 = 22,
    H264NALUnitType_Reserved23 = 23,
  };

  enum EH264CodedSliceType : std::uint32_t
  {
    H264CodedSliceType_PSlice0 = 0,
    H264CodedSliceType_BSlice0 = 1,
    H264CodedSliceType_ISlice0 = 2,
    H264CodedSliceType_SPSlice0 = 3,
    H264CodedSliceType_SISlice0 = 4,
    H264CodedSliceType_PSlice5 = 5,
    H264CodedSliceType_BSlice5 = 6,
    H264CodedSliceType_ISlice5 = 7,
    H264CodedSliceType_SPSlice5 = 8,
    H264CodedSliceType_SISlice5 = 9,
  };

  enum EH264SEIPayload : std::uint32_t
  {
    H264SEIPayload_PicTiming = 1,
  };

  constexpr const char* H264NALUnitTypeCategory = "NAL unit types.";
  constexpr const char* H264SEIPayloadCategory = "SEI Payload types.";

  // The name of a value, or i_pFallback when the table has none.
  const char* ToString( EH264NALUnitType i_Value, const char* i_pFallback = "Unspecified" );
  const char* ToString( EH264CodedSliceType i_Value, const char* i_pFallback = "Unspecified" );
  const char* ToString( EH264SEIPayload i_Value, const char* i_pFallback = "Unspecified" );
} // namespace H264Utils
