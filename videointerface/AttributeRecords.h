#pragma once

// The records spread over named attribute keys, and how each is read from and written to a
// store. A record is never stored as a binary structure.

#include "videointerface/ITimecode.h"
#include "videointerface/IVideoAttributes.h"
#include "videointerface/IVideoFrameInfo.h"

#include <string>
#include <vector>

namespace CoreLumekTypes
{
  struct VCameraHardware
  {
    std::string DeviceURN;
    std::string SerialNumber;
    std::string Type;
    std::string DisplayType;
    std::uint32_t SensorWidthInPixels = 0;
    std::uint32_t SensorHeightInPixels = 0;
    double PixelAspectRatio = 1.0;

    bool operator==( const VCameraHardware& i_rOther ) const;
    bool operator!=( const VCameraHardware& i_rOther ) const { return !( *this == i_rOther ); }
  };

  struct VLensDistortionCalibration
  {
    ZOL::ERadialModel RadialModel = ZOL::RadialModel_Lumek2Parameter;
    std::vector< double > RadialDistortionParameters = { 0.0, 0.0 };
    double RadialDistortionCentre_X = 0.0;
    double RadialDistortionCentre_Y = 0.0;

    bool operator==( const VLensDistortionCalibration& i_rOther ) const;
    bool operator!=( const VLensDistortionCalibration& i_rOther ) const { return !( *this == i_rOther ); }
  };
} // namespace CoreLumekTypes

namespace ZOL
{
  // One step in the history of a recording.
  struct VConversionRecord
  {
    EVideoContainer Container = VideoContainer_LVID;
    IVideoSettings VideoSettings;
    IAudioFrameInfo AudioFrameInfo;
    EAudioPayload AudioPayload = AudioPayload_None;
    EVideoPayload VideoPayload = VideoPayload_None;
    EPixelFormat PixelFormat = PixelFormat_Unspecified;
    CoreLumekTypes::VLensDistortionCalibration LensDistortionCalibration;
  };

  // i_rFrameKeys holds the "VideoFrameInfo." keys; i_rOuter is the file's attributes, which
  // decide the conversion distortion flag. With a single store both are that store.
  bool ReadVideoFrameInfo( const IVideoAttributes& i_rFrameKeys, const IVideoAttributes& i_rOuter,
                           IVideoFrameInfo& io_rInfo );
  bool WriteVideoFrameInfo( IVideoAttributes& io_rStore, const IVideoFrameInfo& i_rInfo );

  bool ReadAudioFrameInfo( const IVideoAttributes& i_rStore, const std::string& i_rPrefix, IAudioFrameInfo& io_rInfo );
  bool WriteAudioFrameInfo( IVideoAttributes& io_rStore, const std::string& i_rPrefix, const IAudioFrameInfo& i_rInfo );

  bool ReadVideoTiming( const IVideoAttributes& i_rStore, IVideoTiming& io_rTiming );
  bool WriteVideoTiming( IVideoAttributes& io_rStore, const IVideoTiming& i_rTiming );

  // Both keys are optional: a missing one keeps the record's value. True when both were there.
  bool ReadVideoSettings( const IVideoAttributes& i_rStore, const std::string& i_rPrefix,
                          IVideoSettings& io_rSettings );
  bool WriteVideoSettings( IVideoAttributes& io_rStore, const std::string& i_rPrefix,
                           const IVideoSettings& i_rSettings );

  bool ReadTimecode( const IVideoAttributes& i_rStore, ITimecode& io_rTimecode );
  bool WriteTimecode( IVideoAttributes& io_rStore, const ITimecode& i_rTimecode );

  bool ReadLensDistortionCalibration( const IVideoAttributes& i_rStore, const std::string& i_rPrefix,
                                      CoreLumekTypes::VLensDistortionCalibration& io_rCalibration );
  bool WriteLensDistortionCalibration( IVideoAttributes& io_rStore, const std::string& i_rPrefix,
                                       const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration );

  bool ReadCameraHardware( const IVideoAttributes& i_rStore, CoreLumekTypes::VCameraHardware& io_rCamera );
  bool WriteCameraHardware( IVideoAttributes& io_rStore, const CoreLumekTypes::VCameraHardware& i_rCamera );

  // Records "ConversionRecord.0.", "ConversionRecord.1.", ... up to the first incomplete one.
  void ReadConversionRecords( const IVideoAttributes& i_rStore, std::vector< VConversionRecord >& o_rRecords );
  bool WriteConversionRecords( IVideoAttributes& io_rStore, const std::vector< VConversionRecord >& i_rRecords );
  std::string ConversionRecordPrefix( std::size_t i_Index );
} // namespace ZOL
