#include "fileio/H264Utils/H264Enumerations.h"

#include <iterator>

namespace H264Utils
{
  namespace
  {
    struct VName
    {
      std::uint32_t Value;
      const char* Name;
    };

    constexpr VName s_NALUnitTypes[] = {
        { 1, "CodedSliceNonIDR" },
        { 2, "CodedSlicePartitionA" },
        { 3, "CodedSlicePartitionB" },
        { 4, "CodedSlicePartitionC" },
        { 5, "CodedSliceIDR" },
        { 6, "SEI" },
        { 7, "SPS" },
        { 8, "PPS" },
        { 9, "AccessUnitDelimiter" },
        { 10, "EndOfSequence" },
        { 11, "EndOfStream" },
        { 12, "FillerData" },
        { 13, "SPSExtension" },
        { 14, "PrefixNALUnit" },
        { 15, "SubsetSPS" },
        { 16, "DepthParameterSet" },
        { 17, "Reserved17" },
        { 18, "Reserved18" },
        { 19, "CodedSliceAuxillary" },
        { 20, "CodedSliceExtension" },
        { 21, "CodedSliceExtensionForDepthView" },
        { 22, "Reserved22" },
        { 23, "Reserved23" },
    };

    constexpr VName s_SliceTypes[] = {
        { 0, "PSlice0" }, { 1, "BSlice0" }, { 2, "ISlice0" }, { 3, "SPSlice0" }, { 4, "SISlice0" },
        { 5, "PSlice5" }, { 6, "BSlice5" }, { 7, "ISlice5" }, { 8, "SPSlice5" }, { 9, "SISlice5" },
    };

    // payloadType numbers shared by H.264 and H.265; a dump of either names them alike.
    constexpr VName s_SEIPayloads[] = {
        { 1, "PicTiming" },
        { 2, "PanScanRect" },
        { 3, "FillerPayload" },
        { 4, "UserDataRegisteredITUT_T35" },
        { 5, "UserDataUnregistered" },
        { 6, "RecoveryPoint" },
        { 9, "SceneInfo" },
        { 15, "PictureSnapshot" },
        { 16, "ProgressiveRefinementSegmentStart" },
        { 17, "ProgressiveRefinementSegmentEnd" },
        { 19, "FilmGrainCharacteristics" },
        { 22, "PostFilterHint" },
        { 23, "ToneMappingInfo" },
        { 45, "FramePackingArrangement" },
        { 47, "DisplayOrientation" },
        { 56, "GreenMetadata" },
        { 128, "StructureOfPicturesInfo" },
        { 129, "ActiveParameterSets" },
        { 130, "DecodingUnitInfo" },
        { 131, "TemporalSubLayerZeroIndex" },
        { 133, "ScalableNesting" },
        { 134, "RegionRefreshInfo" },
        { 135, "NoDisplay" },
        { 136, "Timecode" },
        { 137, "MasteringDisplayColourVolume" },
        { 138, "SegmentedRectFramePackingArrangement" },
        { 139, "TemporalMotionConstrainedTileSets" },
        { 140, "ChromaResamplingFilterHint" },
        { 141, "KneeFunctionInfo" },
        { 142, "ColourRemappingInfo" },
        { 143, "DeinterlacedFieldIdentification" },
        { 144, "ContentLightLevelInfo" },
        { 145, "DependentRapIndication" },
        { 146, "CodedRegionCompletion" },
        { 147, "AlternativeTransferCharacteristics" },
        { 148, "AmbientViewingEnvironment" },
        { 149, "ContentColourVolume" },
        { 150, "EquirectangularProjection" },
        { 151, "CubemapProjection" },
        { 152, "FisheyeVideoInfo" },
        { 154, "SphereRotation" },
        { 155, "RegionwisePacking" },
        { 156, "OmniViewport" },
        { 157, "RegionalNesting" },
        { 158, "MctsExtractionInfoSets" },
        { 159, "MctsExtractionInfoNesting" },
        { 160, "LayersNotPresent" },
        { 161, "InterLayerConstrainedTileSets" },
        { 162, "BSPNesting" },
        { 163, "BSPInitialArrivalTime" },
        { 164, "SubBitstreamProperty" },
        { 165, "AlphaChannelInfo" },
        { 166, "OverlayInfo" },
        { 167, "TemporalMVPredictionConstraints" },
        { 168, "FrameFieldInfo" },
        { 176, "ThreeDimensionalReferenceDisplaysInfo" },
        { 177, "DepthRepresentationInfo" },
        { 178, "MultiviewSceneInfo" },
        { 179, "MultiviewAcquisitionInfo" },
        { 180, "MultiviewViewPosition" },
        { 181, "AlternativeDepthInfo" },
        { 200, "SEIManifest" },
        { 201, "SEIPrefixIndication" },
        { 202, "AnnotatedRegions" },
        { 205, "ShutterIntervalInfo" },
    };
    static_assert( std::size( s_SEIPayloads ) == 65, "one row per SEI payload type named" );

    template < std::size_t N >
    const char* Find( const VName ( &i_rTable )[N], std::uint32_t i_Value, const char* i_pFallback )
    {
      for( const VName& rRow : i_rTable )
        if( rRow.Value == i_Value )
          return rRow.Name;
      return i_pFallback;
    }
  } // namespace

  const char* ToString( EH264NALUnitType i_Value, const char* i_pFallback )
  {
    return Find( s_NALUnitTypes, i_Value, i_pFallback );
  }

  const char* ToString( EH264CodedSliceType i_Value, const char* i_pFallback )
  {
    return Find( s_SliceTypes, i_Value, i_pFallback );
  }

  const char* ToString( EH264SEIPayload i_Value, const char* i_pFallback )
  {
    return Find( s_SEIPayloads, i_Value, i_pFallback );
  }
} // namespace H264Utils
