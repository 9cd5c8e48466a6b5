#pragma once

// Sequence and picture parameter sets, with their VUI and HRD parameters, and the picture
// timing SEI message that needs them. Fields carry the names of the syntax elements of
// ITU-T H.264 clause 7.3.2 and annex E, so that a field can be found in the standard.

#include "fileio/H264Utils/H264BitStream.h"

#include <array>
#include <cstdint>
#include <vector>

namespace H264Utils
{
  struct VH264HRD
  {
    std::uint32_t cpb_cnt_minus1 = 0;
    std::uint32_t bit_rate_scale = 0;
    std::uint32_t cpb_size_scale = 0;
    std::vector< std::uint32_t > bit_rate_value_minus1;
    std::vector< std::uint32_t > cpb_size_value_minus1;
    std::vector< bool > cbr_flag;
    std::uint32_t initial_cpb_removal_delay_length_minus1 = 23;
    std::uint32_t cpb_removal_delay_length_minus1 = 23;
    std::uint32_t dpb_output_delay_length_minus1 = 23;
    std::uint32_t time_offset_length = 24;
  };

  struct VH264VUI
  {
    bool aspect_ratio_info_present_flag = false;
    std::uint32_t aspect_ratio_idc = 0;
    std::uint32_t sar_width = 0;
    std::uint32_t sar_height = 0;
    bool overscan_info_present_flag = false;
    bool overscan_appropriate_flag = false;
    bool video_signal_type_present_flag = false;
    std::uint32_t video_format = 5;
    bool video_full_range_flag = false;
    bool colour_description_present_flag = false;
    std::uint32_t colour_primaries = 2;
    std::uint32_t transfer_characteristics = 2;
    std::uint32_t matrix_coefficients = 2;
    bool chroma_loc_info_present_flag = false;
    std::uint32_t chroma_sample_loc_type_top_field = 0;
    std::uint32_t chroma_sample_loc_type_bottom_field = 0;
    bool timing_info_present_flag = false;
    std::uint32_t num_units_in_tick = 0;
    std::uint32_t time_scale = 0;
    bool fixed_frame_rate_flag = false;
    bool nal_hrd_parameters_present_flag = false;
    VH264HRD nal_hrd;
    bool vcl_hrd_parameters_present_flag = false;
    VH264HRD vcl_hrd;
    bool low_delay_hrd_flag = false;
    bool pic_struct_present_flag = false;
    bool bitstream_restriction_flag = false;
    bool motion_vectors_over_pic_boundaries_flag = false;
    std::uint32_t max_bytes_per_pic_denom = 0;
    std::uint32_t max_bits_per_mb_denom = 0;
    std::uint32_t log2_max_mv_length_horizontal = 0;
    std::uint32_t log2_max_mv_length_vertical = 0;
    std::uint32_t max_num_reorder_frames = 0;
    std::uint32_t max_dec_frame_buffering = 0;
  };

  // A scaling list as stored: the delta_scale values up to the one that ends the list early.
  struct VH264ScalingList
  {
    bool present_flag = false;
    std::vector< std::int32_t > delta_scale;
  };

  struct VH264SPS
  {
    VNALHeader Header{ 3, 7 };
    std::uint32_t profile_idc = 66;
    std::uint32_t constraint_set_flags = 0; // constraint_set0_flag to constraint_set5_flag, first in the top bit
    std::uint32_t reserved_zero_2bits = 0;
    std::uint32_t level_idc = 0;
    std::uint32_t seq_parameter_set_id = 0;
    std::uint32_t chroma_format_idc = 1;
    bool separate_colour_plane_flag = false;
    std::uint32_t bit_depth_luma_minus8 = 0;
    std::uint32_t bit_depth_chroma_minus8 = 0;
    bool qpprime_y_zero_transform_bypass_flag = false;
    bool seq_scaling_matrix_present_flag = false;
    std::vector< VH264ScalingList > seq_scaling_lists;
    std::uint32_t log2_max_frame_num_minus4 = 0;
    std::uint32_t pic_order_cnt_type = 0;
    std::uint32_t log2_max_pic_order_cnt_lsb_minus4 = 0;
    bool delta_pic_order_always_zero_flag = false;
    std::int32_t offset_for_non_ref_pic = 0;
    std::int32_t offset_for_top_to_bottom_field = 0;
    std::uint32_t num_ref_frames_in_pic_order_cnt_cycle = 0;
    std::vector< std::int32_t > offset_for_ref_frame;
    std::uint32_t max_num_ref_frames = 0;
    bool gaps_in_frame_num_value_allowed_flag = false;
    std::uint32_t pic_width_in_mbs_minus1 = 0;
    std::uint32_t pic_height_in_map_units_minus1 = 0;
    bool frame_mbs_only_flag = true;
    bool mb_adaptive_frame_field_flag = false;
    bool direct_8x8_inference_flag = false;
    bool frame_cropping_flag = false;
    std::uint32_t frame_crop_left_offset = 0;
    std::uint32_t frame_crop_right_offset = 0;
    std::uint32_t frame_crop_top_offset = 0;
    std::uint32_t frame_crop_bottom_offset = 0;
    bool vui_parameters_present_flag = false;
    VH264VUI vui;

    bool HasHighProfileSyntax() const;
    // The picture size after cropping, in pixels, computed in 64 bits.
    std::uint64_t GetWidth() const;
    std::uint64_t GetHeight() const;
  };

  struct VH264PPS
  {
    VNALHeader Header{ 3, 8 };
    std::uint32_t pic_parameter_set_id = 0;
    std::uint32_t seq_parameter_set_id = 0;
    bool entropy_coding_mode_flag = false;
    bool bottom_field_pic_order_in_frame_present_flag = false;
    std::uint32_t num_slice_groups_minus1 = 0;
    std::uint32_t slice_group_map_type = 0;
    std::vector< std::uint32_t > run_length_minus1;
    std::vector< std::uint32_t > top_left;
    std::vector< std::uint32_t > bottom_right;
    bool slice_group_change_direction_flag = false;
    std::uint32_t slice_group_change_rate_minus1 = 0;
    std::uint32_t pic_size_in_map_units_minus1 = 0;
    std::vector< std::uint32_t > slice_group_id;
    std::uint32_t num_ref_idx_l0_default_active_minus1 = 0;
    std::uint32_t num_ref_idx_l1_default_active_minus1 = 0;
    bool weighted_pred_flag = false;
    std::uint32_t weighted_bipred_idc = 0;
    std::int32_t pic_init_qp_minus26 = 0;
    std::int32_t pic_init_qs_minus26 = 0;
    std::int32_t chroma_qp_index_offset = 0;
    bool deblocking_filter_control_present_flag = false;
    bool constrained_intra_pred_flag = false;
    bool redundant_pic_cnt_present_flag = false;
    // Whether the optional tail (transform_8x8_mode_flag onwards) is there.
    bool has_extension = false;
    bool transform_8x8_mode_flag = false;
    bool pic_scaling_matrix_present_flag = false;
    std::vector< VH264ScalingList > pic_scaling_lists;
    std::int32_t second_chroma_qp_index_offset = 0;
  };

  struct VH264ClockTimestamp
  {
    bool clock_timestamp_flag = false;
    std::uint32_t ct_type = 0;
    bool nuit_field_based_flag = false;
    std::uint32_t counting_type = 0;
    bool full_timestamp_flag = false;
    bool discontinuity_flag = false;
    bool cnt_dropped_flag = false;
    std::uint32_t n_frames = 0;
    std::uint32_t seconds_value = 0;
    std::uint32_t minutes_value = 0;
    std::uint32_t hours_value = 0;
    std::int32_t time_offset = 0;
  };

  struct VH264PicTiming
  {
    std::uint32_t cpb_removal_delay = 0;
    std::uint32_t dpb_output_delay = 0;
    std::uint32_t pic_struct = 0;
    std::array< VH264ClockTimestamp, 3 > ClockTimestamps;
  };

  // One message of an SEI unit; its payload lies at PayloadOffset bytes into the unit's RBSP.
  struct VH264SEIMessage
  {
    std::uint32_t PayloadType = 0;
    std::uint64_t PayloadSize = 0;
    std::uint64_t PayloadOffset = 0;
  };

  // A whole NAL unit, header included, without a start code. False for a unit of another
  // type or one that breaks the syntax or its value ranges.
  [[nodiscard]] bool ParseSPS( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, VH264SPS& o_rSPS );
  // i_pSPS gives chroma_format_idc for the scaling lists; without it 4:2:0 is assumed.
  [[nodiscard]] bool ParsePPS( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, VH264PPS& o_rPPS,
                               const VH264SPS* i_pSPS = nullptr );
  // The unit with its header and emulation prevention; false when the record's lists do not
  // match its counts.
  [[nodiscard]] bool WriteSPS( const VH264SPS& i_rSPS, std::vector< std::uint8_t >& o_rNALUnit );
  [[nodiscard]] bool WritePPS( const VH264PPS& i_rPPS, std::vector< std::uint8_t >& o_rNALUnit,
                               const VH264SPS* i_pSPS = nullptr );

  // The messages of an SEI unit (header included), read from its RBSP in i_rStream, which
  // must have been made over the whole unit.
  [[nodiscard]] bool ParseSEIMessages( VInputBitStream& i_rStream, std::vector< VH264SEIMessage >& o_rMessages );
  // A pic_timing payload; the SPS says which fields it holds.
  [[nodiscard]] bool ParsePicTiming( const std::uint8_t* i_pPayload, std::uint64_t i_Size, const VH264SPS& i_rSPS,
                                     VH264PicTiming& o_rPicTiming );
} // namespace H264Utils
