#include "fileio/H264Utils/H264ParameterSets.h"

#include <algorithm>

namespace H264Utils
{
  namespace
  {
    // One description of each syntax structure serves both directions: the reader fills the
    // record, the writer stores it, and the two cannot drift apart.
    class VReadSyntax
    {
    public:
      static constexpr bool Reading = true;
      explicit VReadSyntax( VInputBitStream& i_rStream ) : m_rStream( i_rStream ) {}

      void Bits( std::uint32_t& io_rValue, unsigned i_Count ) { io_rValue = m_rStream.ReadBits( i_Count ); }
      void Flag( bool& io_rValue ) { io_rValue = m_rStream.ReadBit() != 0; }
      void UE( std::uint32_t& io_rValue, std::uint32_t i_Maximum = 0xFFFFFFFE )
      {
        io_rValue = m_rStream.ReadUE( i_Maximum );
      }
      void SE( std::int32_t& io_rValue, std::int32_t i_Minimum = INT32_MIN, std::int32_t i_Maximum = INT32_MAX )
      {
        io_rValue = m_rStream.ReadSE();
        if( io_rValue < i_Minimum || io_rValue > i_Maximum )
          Fail();
      }
      // A list sized by the stream: every element takes at least one bit, so a count beyond
      // the bits left is a lie, refused before anything is allocated.
      template < typename T > bool Count( std::vector< T >& io_rList, std::uint64_t i_Count )
      {
        if( !Ok() || i_Count > m_rStream.GetBitsLeft() )
        {
          Fail();
          return false;
        }
        io_rList.assign( static_cast< std::size_t >( i_Count ), T() );
        return true;
      }
      void More( bool& io_rValue ) { io_rValue = m_rStream.MoreRBSPData(); }
      bool Ok() const { return m_rStream.IsValid(); }
      void Fail() { m_rStream.Invalidate(); }

    private:
      VInputBitStream& m_rStream;
    };

    class VWriteSyntax
    {
    public:
      static constexpr bool Reading = false;
      explicit VWriteSyntax( VOutputBitStream& i_rStream ) : m_rStream( i_rStream ) {}

      void Bits( std::uint32_t& io_rValue, unsigned i_Count ) { m_rStream.WriteBits( io_rValue, i_Count ); }
      void Flag( bool& io_rValue ) { m_rStream.WriteBit( io_rValue ? 1 : 0 ); }
      void UE( std::uint32_t& io_rValue, std::uint32_t i_Maximum = 0xFFFFFFFE )
      {
        if( io_rValue > i_Maximum )
          Fail();
        m_rStream.WriteUE( io_rValue );
      }
      void SE( std::int32_t& io_rValue, std::int32_t i_Minimum = INT32_MIN, std::int32_t i_Maximum = INT32_MAX )
      {
        if( io_rValue < i_Minimum || io_rValue > i_Maximum )
          Fail();
        m_rStream.WriteSE( io_rValue );
      }
      template < typename T > bool Count( std::vector< T >& io_rList, std::uint64_t i_Count )
      {
        if( io_rList.size() != i_Count )
          Fail();
        return m_bOk;
      }
      void More( bool& ) {}
      bool Ok() const { return m_bOk; }
      void Fail() { m_bOk = false; }

    private:
      VOutputBitStream& m_rStream;
      bool m_bOk = true;
    };

    // vector< bool > hands out proxies; this gives the walker a plain flag to work on.
    template < typename S > void FlagAt( S& s, std::vector< bool >& io_rFlags, std::size_t i_Index )
    {
      bool bValue = io_rFlags[i_Index];
      s.Flag( bValue );
      io_rFlags[i_Index] = bValue;
    }

    template < typename S > void ScalingList( S& s, VH264ScalingList& io_rList, unsigned i_Size )
    {
      if constexpr( S::Reading )
        io_rList.delta_scale.clear();
      std::int32_t LastScale = 8, NextScale = 8;
      std::size_t k = 0;
      for( unsigned j = 0; j < i_Size && s.Ok(); ++j )
      {
        if( NextScale != 0 )
        {
          std::int32_t Delta = 0;
          if constexpr( !S::Reading )
          {
            if( k >= io_rList.delta_scale.size() )
            {
              s.Fail();
              return;
            }
            Delta = io_rList.delta_scale[k];
          }
          s.SE( Delta, -128, 127 );
          if constexpr( S::Reading )
            io_rList.delta_scale.push_back( Delta );
          ++k;
          NextScale = ( LastScale + Delta + 256 ) % 256;
        }
        LastScale = NextScale == 0 ? LastScale : NextScale;
      }
      if( k != io_rList.delta_scale.size() )
        s.Fail();
    }

    template < typename S >
    void ScalingMatrix( S& s, std::vector< VH264ScalingList >& io_rLists, std::uint32_t i_Count )
    {
      if( !s.Count( io_rLists, i_Count ) )
        return;
      for( std::uint32_t i = 0; i < i_Count && s.Ok(); ++i )
      {
        s.Flag( io_rLists[i].present_flag );
        if( io_rLists[i].present_flag )
          ScalingList( s, io_rLists[i], i < 6 ? 16 : 64 );
        else
          io_rLists[i].delta_scale.clear();
      }
    }

    template < typename S > void HRD( S& s, VH264HRD& h )
    {
      s.UE( h.cpb_cnt_minus1, 31 );
      s.Bits( h.bit_rate_scale, 4 );
      s.Bits( h.cpb_size_scale, 4 );
      const std::uint32_t Count = h.cpb_cnt_minus1 + 1;
      if( !s.Count( h.bit_rate_value_minus1, Count ) || !s.Count( h.cpb_size_value_minus1, Count ) ||
          !s.Count( h.cbr_flag, Count ) )
        return;
      for( std::uint32_t i = 0; i < Count && s.Ok(); ++i )
      {
        s.UE( h.bit_rate_value_minus1[i] );
        s.UE( h.cpb_size_value_minus1[i] );
        FlagAt( s, h.cbr_flag, i );
      }
      s.Bits( h.initial_cpb_removal_delay_length_minus1, 5 );
      s.Bits( h.cpb_removal_delay_length_minus1, 5 );
      s.Bits( h.dpb_output_delay_length_minus1, 5 );
      s.Bits( h.time_offset_length, 5 );
    }

    template < typename S > void VUI( S& s, VH264VUI& v )
    {
      s.Flag( v.aspect_ratio_info_present_flag );
      if( v.aspect_ratio_info_present_flag )
      {
        s.Bits( v.aspect_ratio_idc, 8 );
        if( v.aspect_ratio_idc == 255 ) // Extended_SAR
        {
          s.Bits( v.sar_width, 16 );
          s.Bits( v.sar_height, 16 );
        }
      }
      s.Flag( v.overscan_info_present_flag );
      if( v.overscan_info_present_flag )
        s.Flag( v.overscan_appropriate_flag );
      s.Flag( v.video_signal_type_present_flag );
      if( v.video_signal_type_present_flag )
      {
        s.Bits( v.video_format, 3 );
        s.Flag( v.video_full_range_flag );
        s.Flag( v.colour_description_present_flag );
        if( v.colour_description_present_flag )
        {
          s.Bits( v.colour_primaries, 8 );
          s.Bits( v.transfer_characteristics, 8 );
          s.Bits( v.matrix_coefficients, 8 );
        }
      }
      s.Flag( v.chroma_loc_info_present_flag );
      if( v.chroma_loc_info_present_flag )
      {
        s.UE( v.chroma_sample_loc_type_top_field, 5 );
        s.UE( v.chroma_sample_loc_type_bottom_field, 5 );
      }
      s.Flag( v.timing_info_present_flag );
      if( v.timing_info_present_flag )
      {
        s.Bits( v.num_units_in_tick, 32 );
        s.Bits( v.time_scale, 32 );
        s.Flag( v.fixed_frame_rate_flag );
      }
      s.Flag( v.nal_hrd_parameters_present_flag );
      if( v.nal_hrd_parameters_present_flag )
        HRD( s, v.nal_hrd );
      s.Flag( v.vcl_hrd_parameters_present_flag );
      if( v.vcl_hrd_parameters_present_flag )
        HRD( s, v.vcl_hrd );
      if( v.nal_hrd_parameters_present_flag || v.vcl_hrd_parameters_present_flag )
        s.Flag( v.low_delay_hrd_flag );
      s.Flag( v.pic_struct_present_flag );
      s.Flag( v.bitstream_restriction_flag );
      if( v.bitstream_restriction_flag )
      {
        s.Flag( v.motion_vectors_over_pic_boundaries_flag );
        s.UE( v.max_bytes_per_pic_denom, 16 );
        s.UE( v.max_bits_per_mb_denom, 16 );
        s.UE( v.log2_max_mv_length_horizontal, 16 );
        s.UE( v.log2_max_mv_length_vertical, 16 );
        s.UE( v.max_num_reorder_frames );
        s.UE( v.max_dec_frame_buffering );
      }
    }

    template < typename S > void SPS( S& s, VH264SPS& p )
    {
      s.Bits( p.profile_idc, 8 );
      s.Bits( p.constraint_set_flags, 6 );
      s.Bits( p.reserved_zero_2bits, 2 );
      s.Bits( p.level_idc, 8 );
      s.UE( p.seq_parameter_set_id, 31 );
      if( p.HasHighProfileSyntax() )
      {
        s.UE( p.chroma_format_idc, 3 );
        if( p.chroma_format_idc == 3 )
          s.Flag( p.separate_colour_plane_flag );
        s.UE( p.bit_depth_luma_minus8, 6 );
        s.UE( p.bit_depth_chroma_minus8, 6 );
        s.Flag( p.qpprime_y_zero_transform_bypass_flag );
        s.Flag( p.seq_scaling_matrix_present_flag );
        if( p.seq_scaling_matrix_present_flag )
          ScalingMatrix( s, p.seq_scaling_lists, p.chroma_format_idc != 3 ? 8 : 12 );
      }
      s.UE( p.log2_max_frame_num_minus4, 12 );
      s.UE( p.pic_order_cnt_type, 2 );
      if( p.pic_order_cnt_type == 0 )
        s.UE( p.log2_max_pic_order_cnt_lsb_minus4, 12 );
      else if( p.pic_order_cnt_type == 1 )
      {
        s.Flag( p.delta_pic_order_always_zero_flag );
        s.SE( p.offset_for_non_ref_pic );
        s.SE( p.offset_for_top_to_bottom_field );
        s.UE( p.num_ref_frames_in_pic_order_cnt_cycle, 255 );
        if( s.Count( p.offset_for_ref_frame, p.num_ref_frames_in_pic_order_cnt_cycle ) )
          for( std::uint32_t i = 0; i < p.num_ref_frames_in_pic_order_cnt_cycle && s.Ok(); ++i )
            s.SE( p.offset_for_ref_frame[i] );
      }
      s.UE( p.max_num_ref_frames, 16 );
      s.Flag( p.gaps_in_frame_num_value_allowed_flag );
      // Level 6.2 stops at 139264 macroblocks a frame; no side goes near 65536 of them.
      s.UE( p.pic_width_in_mbs_minus1, 65535 );
      s.UE( p.pic_height_in_map_units_minus1, 65535 );
      s.Flag( p.frame_mbs_only_flag );
      if( !p.frame_mbs_only_flag )
        s.Flag( p.mb_adaptive_frame_field_flag );
      s.Flag( p.direct_8x8_inference_flag );
      s.Flag( p.frame_cropping_flag );
      if( p.frame_cropping_flag )
      {
        s.UE( p.frame_crop_left_offset );
        s.UE( p.frame_crop_right_offset );
        s.UE( p.frame_crop_top_offset );
        s.UE( p.frame_crop_bottom_offset );
      }
      s.Flag( p.vui_parameters_present_flag );
      if( p.vui_parameters_present_flag )
        VUI( s, p.vui );
    }

    unsigned CeilLog2( std::uint32_t i_Value )
    {
      unsigned Bits = 0;
      while( ( std::uint64_t( 1 ) << Bits ) < i_Value )
        ++Bits;
      return Bits;
    }

    template < typename S > void PPS( S& s, VH264PPS& p, std::uint32_t i_ChromaFormatIdc )
    {
      s.UE( p.pic_parameter_set_id, 255 );
      s.UE( p.seq_parameter_set_id, 31 );
      s.Flag( p.entropy_coding_mode_flag );
      s.Flag( p.bottom_field_pic_order_in_frame_present_flag );
      s.UE( p.num_slice_groups_minus1, 7 );
      if( p.num_slice_groups_minus1 > 0 )
      {
        const std::uint32_t Groups = p.num_slice_groups_minus1 + 1;
        s.UE( p.slice_group_map_type, 6 );
        if( p.slice_group_map_type == 0 )
        {
          if( s.Count( p.run_length_minus1, Groups ) )
            for( std::uint32_t i = 0; i < Groups && s.Ok(); ++i )
              s.UE( p.run_length_minus1[i] );
        }
        else if( p.slice_group_map_type == 2 )
        {
          if( s.Count( p.top_left, Groups - 1 ) && s.Count( p.bottom_right, Groups - 1 ) )
            for( std::uint32_t i = 0; i + 1 < Groups && s.Ok(); ++i )
            {
              s.UE( p.top_left[i] );
              s.UE( p.bottom_right[i] );
            }
        }
        else if( p.slice_group_map_type >= 3 && p.slice_group_map_type <= 5 )
        {
          s.Flag( p.slice_group_change_direction_flag );
          s.UE( p.slice_group_change_rate_minus1 );
        }
        else if( p.slice_group_map_type == 6 )
        {
          s.UE( p.pic_size_in_map_units_minus1 );
          const std::uint64_t Units = std::uint64_t( p.pic_size_in_map_units_minus1 ) + 1;
          const unsigned Bits = CeilLog2( Groups );
          if( s.Ok() && s.Count( p.slice_group_id, Units ) )
            for( std::uint64_t i = 0; i < Units && s.Ok(); ++i )
              s.Bits( p.slice_group_id[static_cast< std::size_t >( i )], Bits );
        }
      }
      s.UE( p.num_ref_idx_l0_default_active_minus1, 31 );
      s.UE( p.num_ref_idx_l1_default_active_minus1, 31 );
      s.Flag( p.weighted_pred_flag );
      s.Bits( p.weighted_bipred_idc, 2 );
      s.SE( p.pic_init_qp_minus26, -26 - 48, 25 );
      s.SE( p.pic_init_qs_minus26, -26, 25 );
      s.SE( p.chroma_qp_index_offset, -12, 12 );
      s.Flag( p.deblocking_filter_control_present_flag );
      s.Flag( p.constrained_intra_pred_flag );
      s.Flag( p.redundant_pic_cnt_present_flag );
      s.More( p.has_extension );
      if( p.has_extension )
      {
        s.Flag( p.transform_8x8_mode_flag );
        s.Flag( p.pic_scaling_matrix_present_flag );
        if( p.pic_scaling_matrix_present_flag )
          ScalingMatrix( s, p.pic_scaling_lists,
                         6 + ( i_ChromaFormatIdc != 3 ? 2 : 6 ) * ( p.transform_8x8_mode_flag ? 1 : 0 ) );
        s.SE( p.second_chroma_qp_index_offset, -12, 12 );
      }
    }

    // Header, structure and trailing bits of one parameter set unit.
    template < typename TRecord, typename TSyntax >
    bool ParseUnit( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, std::uint32_t i_Type, TRecord& o_rRecord,
                    TSyntax i_Syntax )
    {
      VInputBitStream Stream( i_pNALUnit, i_Size );
      TRecord Record;
      if( !Stream.ReadNALHeader( Record.Header ) || Record.Header.NALUnitType != i_Type )
        return false;
      VReadSyntax Reader( Stream );
      i_Syntax( Reader, Record );
      if( !Stream.IsValid() || !Stream.ReadTrailingBits() )
        return false;
      o_rRecord = std::move( Record );
      return true;
    }

    template < typename TRecord, typename TSyntax >
    bool WriteUnit( const TRecord& i_rRecord, std::vector< std::uint8_t >& o_rNALUnit, TSyntax i_Syntax )
    {
      VOutputBitStream Stream;
      Stream.WriteNALHeader( i_rRecord.Header );
      TRecord Copy = i_rRecord;
      VWriteSyntax Writer( Stream );
      i_Syntax( Writer, Copy );
      if( !Writer.Ok() )
        return false;
      Stream.WriteTrailingBits();
      o_rNALUnit = Stream.Emit();
      return true;
    }
  } // namespace

  bool VH264SPS::HasHighProfileSyntax() const
  {
    static constexpr std::uint32_t s_Profiles[] = { 100, 110, 122, 244, 44, 83, 86, 118, 128, 138, 139, 134, 135 };
    return std::find( std::begin( s_Profiles ), std::end( s_Profiles ), profile_idc ) != std::end( s_Profiles );
  }

  std::uint64_t VH264SPS::GetWidth() const
  {
    const std::uint64_t CropUnitX = chroma_format_idc == 0 || separate_colour_plane_flag ? 1
                                    : chroma_format_idc == 3                             ? 1
                                                                                         : 2;
    const std::uint64_t Width = ( std::uint64_t( pic_width_in_mbs_minus1 ) + 1 ) * 16;
    const std::uint64_t Crop = CropUnitX * ( std::uint64_t( frame_crop_left_offset ) + frame_crop_right_offset );
    return frame_cropping_flag ? ( Crop < Width ? Width - Crop : 0 ) : Width;
  }

  std::uint64_t VH264SPS::GetHeight() const
  {
    const std::uint64_t FrameFactor = frame_mbs_only_flag ? 1 : 2;
    const std::uint64_t SubHeightC = chroma_format_idc == 1 && !separate_colour_plane_flag ? 2 : 1;
    const std::uint64_t CropUnitY =
        ( chroma_format_idc == 0 || separate_colour_plane_flag ? 1 : SubHeightC ) * FrameFactor;
    const std::uint64_t Height = ( std::uint64_t( pic_height_in_map_units_minus1 ) + 1 ) * 16 * FrameFactor;
    const std::uint64_t Crop = CropUnitY * ( std::uint64_t( frame_crop_top_offset ) + frame_crop_bottom_offset );
    return frame_cropping_flag ? ( Crop < Height ? Height - Crop : 0 ) : Height;
  }

  bool ParseSPS( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, VH264SPS& o_rSPS )
  {
    return ParseUnit( i_pNALUnit, i_Size, 7, o_rSPS, []( VReadSyntax& s, VH264SPS& p ) { SPS( s, p ); } );
  }

  bool WriteSPS( const VH264SPS& i_rSPS, std::vector< std::uint8_t >& o_rNALUnit )
  {
    return WriteUnit( i_rSPS, o_rNALUnit, []( VWriteSyntax& s, VH264SPS& p ) { SPS( s, p ); } );
  }

  bool ParsePPS( const std::uint8_t* i_pNALUnit, std::uint64_t i_Size, VH264PPS& o_rPPS, const VH264SPS* i_pSPS )
  {
    const std::uint32_t ChromaFormatIdc = i_pSPS ? i_pSPS->chroma_format_idc : 1;
    return ParseUnit( i_pNALUnit, i_Size, 8, o_rPPS,
                      [ChromaFormatIdc]( VReadSyntax& s, VH264PPS& p ) { PPS( s, p, ChromaFormatIdc ); } );
  }

  bool WritePPS( const VH264PPS& i_rPPS, std::vector< std::uint8_t >& o_rNALUnit, const VH264SPS* i_pSPS )
  {
    const std::uint32_t ChromaFormatIdc = i_pSPS ? i_pSPS->chroma_format_idc : 1;
    return WriteUnit( i_rPPS, o_rNALUnit,
                      [ChromaFormatIdc]( VWriteSyntax& s, VH264PPS& p ) { PPS( s, p, ChromaFormatIdc ); } );
  }

  namespace
  {
    // payloadType and payloadSize: runs of 0xFF, each adding 255, then the last byte.
    std::uint64_t ReadSEIValue( VInputBitStream& io_rStream )
    {
      std::uint64_t Value = 0;
      std::uint32_t Byte = 0xFF;
      while( Byte == 0xFF && io_rStream.IsValid() )
      {
        Byte = io_rStream.ReadBits( 8 );
        Value += Byte;
      }
      return Value;
    }
  } // namespace

  bool ParseSEIMessages( VInputBitStream& i_rStream, std::vector< VH264SEIMessage >& o_rMessages )
  {
    o_rMessages.clear();
    VNALHeader Header;
    if( !i_rStream.ReadNALHeader( Header ) || Header.NALUnitType != 6 )
      return false;
    // Messages are byte-aligned; each is a type and a size in runs of 255, then the payload.
    while( i_rStream.IsValid() && i_rStream.MoreRBSPData() )
    {
      VH264SEIMessage Message;
      const std::uint64_t Type = ReadSEIValue( i_rStream );
      Message.PayloadType = static_cast< std::uint32_t >( std::min< std::uint64_t >( Type, 0xFFFFFFFF ) );
      Message.PayloadSize = ReadSEIValue( i_rStream );
      Message.PayloadOffset = i_rStream.GetBitPosition() / 8;
      if( !i_rStream.IsValid() || Message.PayloadSize > i_rStream.GetBitsLeft() / 8 )
      {
        i_rStream.Invalidate();
        return false;
      }
      o_rMessages.push_back( Message );
      for( std::uint64_t i = 0; i < Message.PayloadSize; ++i )
        i_rStream.ReadBits( 8 );
    }
    return i_rStream.IsValid();
  }

  bool ParsePicTiming( const std::uint8_t* i_pPayload, std::uint64_t i_Size, const VH264SPS& i_rSPS,
                       VH264PicTiming& o_rPicTiming )
  {
    // The payload was cleaned of emulation prevention with its unit; a copy-free stream over it.
    VInputBitStream Stream( i_pPayload, i_Size );
    VH264PicTiming Timing;
    const VH264VUI& v = i_rSPS.vui;
    const bool bHasVUI = i_rSPS.vui_parameters_present_flag;
    if( bHasVUI && ( v.nal_hrd_parameters_present_flag || v.vcl_hrd_parameters_present_flag ) )
    {
      const VH264HRD& h = v.nal_hrd_parameters_present_flag ? v.nal_hrd : v.vcl_hrd;
      Timing.cpb_removal_delay = Stream.ReadBits( h.cpb_removal_delay_length_minus1 + 1 );
      Timing.dpb_output_delay = Stream.ReadBits( h.dpb_output_delay_length_minus1 + 1 );
    }
    if( bHasVUI && v.pic_struct_present_flag )
    {
      static constexpr unsigned s_NumClockTS[] = { 1, 1, 1, 2, 2, 3, 3, 2, 3 };
      Timing.pic_struct = Stream.ReadBits( 4 );
      if( Timing.pic_struct > 8 )
        return false;
      const unsigned TimeOffsetLength = v.nal_hrd_parameters_present_flag   ? v.nal_hrd.time_offset_length
                                        : v.vcl_hrd_parameters_present_flag ? v.vcl_hrd.time_offset_length
                                                                            : 24;
      for( unsigned i = 0; i < s_NumClockTS[Timing.pic_struct] && Stream.IsValid(); ++i )
      {
        VH264ClockTimestamp& c = Timing.ClockTimestamps[i];
        c.clock_timestamp_flag = Stream.ReadBit() != 0;
        if( !c.clock_timestamp_flag )
          continue;
        c.ct_type = Stream.ReadBits( 2 );
        c.nuit_field_based_flag = Stream.ReadBit() != 0;
        c.counting_type = Stream.ReadBits( 5 );
        c.full_timestamp_flag = Stream.ReadBit() != 0;
        c.discontinuity_flag = Stream.ReadBit() != 0;
        c.cnt_dropped_flag = Stream.ReadBit() != 0;
        c.n_frames = Stream.ReadBits( 8 );
        if( c.full_timestamp_flag )
        {
          c.seconds_value = Stream.ReadBits( 6 );
          c.minutes_value = Stream.ReadBits( 6 );
          c.hours_value = Stream.ReadBits( 5 );
        }
        else if( Stream.ReadBit() != 0 )
        {
          c.seconds_value = Stream.ReadBits( 6 );
          if( Stream.ReadBit() != 0 )
          {
            c.minutes_value = Stream.ReadBits( 6 );
            if( Stream.ReadBit() != 0 )
              c.hours_value = Stream.ReadBits( 5 );
          }
        }
        if( TimeOffsetLength > 0 )
          c.time_offset = Stream.ReadSignedBits( TimeOffsetLength );
      }
    }
    if( !Stream.IsValid() )
      return false;
    o_rPicTiming = Timing;
    return true;
  }
} // namespace H264Utils
