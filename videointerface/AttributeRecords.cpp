#include "videointerface/AttributeRecords.h"

#include <boost/format.hpp>

#include <algorithm>
#include <limits>

namespace CoreLumekTypes
{
  bool VCameraHardware::operator==( const VCameraHardware& i_rOther ) const
  {
    return DeviceURN == i_rOther.DeviceURN && SerialNumber == i_rOther.SerialNumber && Type == i_rOther.Type &&
           DisplayType == i_rOther.DisplayType && SensorWidthInPixels == i_rOther.SensorWidthInPixels &&
           SensorHeightInPixels == i_rOther.SensorHeightInPixels && PixelAspectRatio == i_rOther.PixelAspectRatio;
  }

  bool VLensDistortionCalibration::operator==( const VLensDistortionCalibration& i_rOther ) const
  {
    return RadialModel == i_rOther.RadialModel && RadialDistortionParameters == i_rOther.RadialDistortionParameters &&
           RadialDistortionCentre_X == i_rOther.RadialDistortionCentre_X &&
           RadialDistortionCentre_Y == i_rOther.RadialDistortionCentre_Y;
  }
} // namespace CoreLumekTypes

namespace ZOL
{
  namespace
  {
    const std::string s_FramePresent = "VideoFrameInfo.Present";
    const std::string s_FrameImageX = "VideoFrameInfo.ImageX";
    const std::string s_FrameTwiceOffsetX = "VideoFrameInfo.TwiceOffsetX";
    const std::string s_FrameImageY = "VideoFrameInfo.ImageY";
    const std::string s_FrameTwiceOffsetY = "VideoFrameInfo.TwiceOffsetY";
    const std::string s_FrameSensorX = "VideoFrameInfo.SensorPixelsPerImagePixelX";
    const std::string s_FrameSensorY = "VideoFrameInfo.SensorPixelsPerImagePixelY";
    const std::string s_FrameWidth = "VideoFrameInfo.ImageWidth";
    const std::string s_FrameHeight = "VideoFrameInfo.ImageHeight";
    const std::string s_FramePixelFormat = "VideoFrameInfo.PixelFormat";
    const std::string s_FrameInverted = "VideoFrameInfo.Inverted";
    const std::string s_FramePixelAspectRatio = "VideoFrameInfo.PixelAspectRatio";
    const std::string s_FrameInterlacedFormat = "VideoFrameInfo.InterlacedFormat";

    const std::string s_AudioPresent = "AudioFrameInfo.Present";
    const std::string s_AudioSampleFormat = "AudioFrameInfo.SampleFormat";
    const std::string s_AudioSampleRate = "AudioFrameInfo.SampleRate";
    const std::string s_AudioChannels = "AudioFrameInfo.Channels";

    const std::string s_TicksPerSecond = "TicksPerSecond";
    const std::string s_FramePeriodInTicks = "FramePeriodInTicks";
    const std::string s_StartOffsetInTicks = "StartOffsetInTicks";

    const std::string s_Saturation = "Saturation";
    const std::string s_GammaCorrection = "GammaCorrection";

    const std::string s_TimecodeStandards = "Timecode.Standards";
    const std::string s_TimecodeHours = "Timecode.Hours";
    const std::string s_TimecodeMinutes = "Timecode.Minutes";
    const std::string s_TimecodeSeconds = "Timecode.Seconds";
    const std::string s_TimecodeFrames = "Timecode.Frames";
    const std::string s_TimecodeUserBits = "Timecode.UserBits";
    const std::string s_TimecodeDays = "Timecode.Days";
    const std::string s_TimecodeTickRemainder = "Timecode.TickRemainder";
    const std::string s_TimecodeSubFramePeriod = "Timecode.SubFramePeriod";

    const std::string s_LensModel = "LensDistortionCalibration.RadialModel";
    const std::string s_LensCentreX = "LensDistortionCalibration.RadialDistortionCentre_X";
    const std::string s_LensCentreY = "LensDistortionCalibration.RadialDistortionCentre_Y";
    const std::string s_LensParameter = "LensDistortionCalibration.RadialDistortionParameters_";

    const std::string s_CameraDeviceURN = "CameraHardware.DeviceURN";
    const std::string s_CameraDisplayType = "CameraHardware.DisplayType";
    const std::string s_CameraType = "CameraHardware.Type";
    const std::string s_CameraSerialNumber = "CameraHardware.SerialNumber";
    const std::string s_CameraPixelAspectRatio = "CameraHardware.PixelAspectRatio";
    const std::string s_CameraSensorHeight = "CameraHardware.SensorHeightInPixels";
    const std::string s_CameraSensorWidth = "CameraHardware.SensorWidthInPixels";

    const std::string s_RecordContainer = "Container";
    const std::string s_RecordAudioPayload = "AudioPayload";
    const std::string s_RecordVideoPayload = "VideoPayload";

    std::string LensParameterKey( const std::string& i_rPrefix, std::size_t i_Index )
    {
      return i_rPrefix + s_LensParameter + std::to_string( i_Index );
    }

    // Reads a name and converts it through its table; an unknown name keeps the old value.
    template < typename E > bool GetEnum( const IVideoAttributes& i_rStore, const std::string& i_rKey, E& io_rValue )
    {
      std::string Text;
      if( !i_rStore.Get( i_rKey, Text ) )
        return false;
      FromString( Text, io_rValue );
      return true;
    }

    // Set when the history carries a lens model that the recording itself lacks: the picture
    // was re-encoded from a distorted source and its lens data did not come along.
    bool HasConversionDistortion( const IVideoAttributes& i_rOuter )
    {
      std::uint32_t Type = 0;
      if( i_rOuter.GetType( s_LensModel, Type ) )
        return false;
      std::vector< VConversionRecord > Records;
      ReadConversionRecords( i_rOuter, Records );
      return std::any_of( Records.begin(), Records.end(),
                          []( const VConversionRecord& i_rRecord )
                          {
                            const auto& rParameters = i_rRecord.LensDistortionCalibration.RadialDistortionParameters;
                            return std::any_of( rParameters.begin(), rParameters.end(),
                                                []( double i_Value ) { return i_Value != 0.0; } );
                          } );
    }

    // Older files store the whole offset and so cannot state odd half-pixels; newer ones store
    // twice the offset. The newer key wins.
    bool ReadTwiceOffset( const IVideoAttributes& i_rStore, const std::string& i_rTwiceKey,
                          const std::string& i_rWholeKey, std::uint16_t& o_rTwiceOffset )
    {
      if( i_rStore.Get( i_rTwiceKey, o_rTwiceOffset ) )
        return true;
      std::uint32_t Whole = 0;
      if( !i_rStore.Get( i_rWholeKey, Whole ) )
        return false;
      o_rTwiceOffset = static_cast< std::uint16_t >( Whole * 2 );
      return true;
    }
  } // namespace

  std::string ConversionRecordPrefix( std::size_t i_Index )
  {
    return ( boost::format( "ConversionRecord.%d." ) % i_Index ).str();
  }

  bool ReadVideoFrameInfo( const IVideoAttributes& i_rFrameKeys, const IVideoAttributes& i_rOuter,
                           IVideoFrameInfo& io_rInfo )
  {
    bool bPresent = false;
    if( !i_rFrameKeys.Get( s_FramePresent, bPresent ) )
      return false;
    if( !bPresent )
    {
      io_rInfo = IVideoFrameInfo();
      io_rInfo.PixelAspectRatio = 0.0;
      return true;
    }

    io_rInfo.TwiceOffsetX = 0;
    io_rInfo.TwiceOffsetY = 0;
    io_rInfo.SensorPixelsPerImagePixelX = 1;
    io_rInfo.SensorPixelsPerImagePixelY = 1;
    io_rInfo.PixelAspectRatio = 1.0;
    // Both flags are decided by this read: Inverted below, the conversion flag from the history.
    io_rInfo.Flags = 0;

    i_rFrameKeys.Get( s_FrameSensorX, io_rInfo.SensorPixelsPerImagePixelX );
    i_rFrameKeys.Get( s_FrameSensorY, io_rInfo.SensorPixelsPerImagePixelY );

    if( !ReadTwiceOffset( i_rFrameKeys, s_FrameTwiceOffsetX, s_FrameImageX, io_rInfo.TwiceOffsetX ) ||
        !ReadTwiceOffset( i_rFrameKeys, s_FrameTwiceOffsetY, s_FrameImageY, io_rInfo.TwiceOffsetY ) )
      return false;

    std::uint32_t Width = 0;
    std::uint32_t Height = 0;
    std::string PixelFormatText;
    bool bInverted = false;
    if( !i_rFrameKeys.Get( s_FrameWidth, Width ) )
      return false;
    io_rInfo.ImageWidth = static_cast< std::int32_t >( Width );
    if( !i_rFrameKeys.Get( s_FrameHeight, Height ) )
      return false;
    io_rInfo.ImageHeight = static_cast< std::int32_t >( Height );
    if( !i_rFrameKeys.Get( s_FramePixelFormat, PixelFormatText ) || !i_rFrameKeys.Get( s_FrameInverted, bInverted ) )
      return false;
    if( bInverted )
      io_rInfo.Flags |= IVideoFrameInfo::Flag_Inverted;
    if( !i_rFrameKeys.Get( s_FramePixelAspectRatio, io_rInfo.PixelAspectRatio ) )
      return false;

    io_rInfo.InterlacedFormat = InterlacedFormat_Unspecified;
    std::string InterlacedText;
    if( i_rFrameKeys.Get( s_FrameInterlacedFormat, InterlacedText ) &&
        !FromString( InterlacedText, io_rInfo.InterlacedFormat ) )
      io_rInfo.InterlacedFormat = InterlacedFormat_Unspecified;

    if( HasConversionDistortion( i_rOuter ) )
      io_rInfo.Flags |= IVideoFrameInfo::Flag_HasConversionDistortion;

    FromString( PixelFormatText, io_rInfo.PixelFormat );
    return io_rInfo.IsValid();
  }

  bool WriteVideoFrameInfo( IVideoAttributes& io_rStore, const IVideoFrameInfo& i_rInfo )
  {
    IVideoFrameInfo NoVideo;
    if( i_rInfo == NoVideo )
    {
      io_rStore.Set( s_FramePresent, false );
      return true;
    }
    const std::optional< std::string > PixelFormatText = ToStringOptional( i_rInfo.PixelFormat );
    if( !i_rInfo.IsValid() || !PixelFormatText )
      return false;
    io_rStore.Set( s_FramePresent, true );
    io_rStore.Set( s_FrameImageX, static_cast< std::uint32_t >( i_rInfo.TwiceOffsetX / 2 ) );
    io_rStore.Set( s_FrameTwiceOffsetX, i_rInfo.TwiceOffsetX );
    io_rStore.Set( s_FrameImageY, static_cast< std::uint32_t >( i_rInfo.TwiceOffsetY / 2 ) );
    io_rStore.Set( s_FrameTwiceOffsetY, i_rInfo.TwiceOffsetY );
    io_rStore.Set( s_FrameSensorX, i_rInfo.SensorPixelsPerImagePixelX );
    io_rStore.Set( s_FrameSensorY, i_rInfo.SensorPixelsPerImagePixelY );
    io_rStore.Set( s_FrameWidth, static_cast< std::uint32_t >( i_rInfo.ImageWidth ) );
    io_rStore.Set( s_FrameHeight, static_cast< std::uint32_t >( i_rInfo.ImageHeight ) );
    io_rStore.Set( s_FramePixelFormat, *PixelFormatText );
    io_rStore.Set( s_FrameInverted, i_rInfo.IsInverted() );
    io_rStore.Set( s_FramePixelAspectRatio, i_rInfo.PixelAspectRatio );
    io_rStore.Set( s_FrameInterlacedFormat, ToString( i_rInfo.InterlacedFormat ) );
    return true;
  }

  bool ReadAudioFrameInfo( const IVideoAttributes& i_rStore, const std::string& i_rPrefix, IAudioFrameInfo& io_rInfo )
  {
    bool bPresent = false;
    if( !i_rStore.Get( i_rPrefix + s_AudioPresent, bPresent ) )
      return false;
    if( !bPresent )
    {
      io_rInfo = IAudioFrameInfo();
      return true;
    }
    std::uint32_t Rate = 0;
    std::uint32_t Channels = 0;
    if( !GetEnum( i_rStore, i_rPrefix + s_AudioSampleFormat, io_rInfo.SampleFormat ) ||
        !i_rStore.Get( i_rPrefix + s_AudioSampleRate, Rate ) || !i_rStore.Get( i_rPrefix + s_AudioChannels, Channels ) )
      return false;
    io_rInfo.SampleRate = static_cast< std::int32_t >( Rate );
    io_rInfo.Channels = static_cast< std::int32_t >( Channels );
    return io_rInfo.SampleFormat != AudioSampleFormat_Unspecified && io_rInfo.SampleRate != 0 && io_rInfo.Channels != 0;
  }

  bool WriteAudioFrameInfo( IVideoAttributes& io_rStore, const std::string& i_rPrefix, const IAudioFrameInfo& i_rInfo )
  {
    if( i_rInfo == IAudioFrameInfo() )
    {
      io_rStore.Set( i_rPrefix + s_AudioPresent, false );
      return true;
    }
    const char* pFormat = ToString( i_rInfo.SampleFormat, nullptr );
    if( pFormat == nullptr )
      return false;
    io_rStore.Set( i_rPrefix + s_AudioPresent, true );
    io_rStore.Set( i_rPrefix + s_AudioSampleFormat, pFormat );
    io_rStore.Set( i_rPrefix + s_AudioSampleRate, static_cast< std::uint32_t >( i_rInfo.SampleRate ) );
    io_rStore.Set( i_rPrefix + s_AudioChannels, static_cast< std::uint32_t >( i_rInfo.Channels ) );
    return true;
  }

  bool ReadVideoTiming( const IVideoAttributes& i_rStore, IVideoTiming& io_rTiming )
  {
    std::uint32_t TicksPerSecond = 0;
    std::uint32_t FramePeriod = 0;
    if( !i_rStore.Get( s_TicksPerSecond, TicksPerSecond ) || !i_rStore.Get( s_FramePeriodInTicks, FramePeriod ) )
      return false;
    io_rTiming.TicksPerSecond = TicksPerSecond;
    io_rTiming.FramePeriodInTicks = FramePeriod;
    io_rTiming.StartOffsetInTicks = 0;
    i_rStore.Get( s_StartOffsetInTicks, io_rTiming.StartOffsetInTicks );
    return true;
  }

  bool WriteVideoTiming( IVideoAttributes& io_rStore, const IVideoTiming& i_rTiming )
  {
    io_rStore.Set( s_TicksPerSecond, i_rTiming.TicksPerSecond );
    io_rStore.Set( s_FramePeriodInTicks, i_rTiming.FramePeriodInTicks );
    io_rStore.Set( s_StartOffsetInTicks, i_rTiming.StartOffsetInTicks );
    return true;
  }

  bool ReadVideoSettings( const IVideoAttributes& i_rStore, const std::string& i_rPrefix, IVideoSettings& io_rSettings )
  {
    const bool bSaturation = i_rStore.Get( i_rPrefix + s_Saturation, io_rSettings.Saturation );
    const bool bGamma = i_rStore.Get( i_rPrefix + s_GammaCorrection, io_rSettings.GammaCorrection );
    return bSaturation && bGamma;
  }

  bool WriteVideoSettings( IVideoAttributes& io_rStore, const std::string& i_rPrefix,
                           const IVideoSettings& i_rSettings )
  {
    io_rStore.Set( i_rPrefix + s_Saturation, i_rSettings.Saturation );
    io_rStore.Set( i_rPrefix + s_GammaCorrection, i_rSettings.GammaCorrection );
    return true;
  }

  bool ReadTimecode( const IVideoAttributes& i_rStore, ITimecode& io_rTimecode )
  {
    // The first missing key stops the reading and leaves the later fields as they were.
    return i_rStore.Get( s_TimecodeStandards, io_rTimecode.Standards ) &&
           i_rStore.Get( s_TimecodeHours, io_rTimecode.Hours ) &&
           i_rStore.Get( s_TimecodeMinutes, io_rTimecode.Minutes ) &&
           i_rStore.Get( s_TimecodeSeconds, io_rTimecode.Seconds ) &&
           i_rStore.Get( s_TimecodeFrames, io_rTimecode.Frames ) &&
           i_rStore.Get( s_TimecodeUserBits, io_rTimecode.UserBits ) &&
           i_rStore.Get( s_TimecodeDays, io_rTimecode.Days ) &&
           i_rStore.Get( s_TimecodeTickRemainder, io_rTimecode.TickRemainder ) &&
           i_rStore.Get( s_TimecodeSubFramePeriod, io_rTimecode.SubFramePeriod );
  }

  bool WriteTimecode( IVideoAttributes& io_rStore, const ITimecode& i_rTimecode )
  {
    io_rStore.Set( s_TimecodeStandards, i_rTimecode.Standards );
    io_rStore.Set( s_TimecodeHours, i_rTimecode.Hours );
    io_rStore.Set( s_TimecodeMinutes, i_rTimecode.Minutes );
    io_rStore.Set( s_TimecodeSeconds, i_rTimecode.Seconds );
    io_rStore.Set( s_TimecodeFrames, i_rTimecode.Frames );
    io_rStore.Set( s_TimecodeUserBits, i_rTimecode.UserBits );
    io_rStore.Set( s_TimecodeDays, i_rTimecode.Days );
    io_rStore.Set( s_TimecodeTickRemainder, i_rTimecode.TickRemainder );
    io_rStore.Set( s_TimecodeSubFramePeriod, i_rTimecode.SubFramePeriod );
    return true;
  }

  bool ReadLensDistortionCalibration( const IVideoAttributes& i_rStore, const std::string& i_rPrefix,
                                      CoreLumekTypes::VLensDistortionCalibration& io_rCalibration )
  {
    std::string ModelText;
    ERadialModel Model = RadialModel_Lumek2Parameter;
    if( !i_rStore.Get( i_rPrefix + s_LensModel, ModelText ) || !FromString( ModelText, Model ) )
      return false;
    io_rCalibration.RadialModel = Model;
    if( !i_rStore.Get( i_rPrefix + s_LensCentreX, io_rCalibration.RadialDistortionCentre_X ) ||
        !i_rStore.Get( i_rPrefix + s_LensCentreY, io_rCalibration.RadialDistortionCentre_Y ) )
      return false;
    const int Count = RadialModelParameterCount( Model );
    if( Model != RadialModel_Lumek2Parameter && Model != RadialModel_Lumek3Parameter )
    {
      io_rCalibration.RadialDistortionParameters.clear();
      return true;
    }
    io_rCalibration.RadialDistortionParameters.resize( static_cast< std::size_t >( Count ) );
    for( int i = 0; i < Count; ++i )
      if( !i_rStore.Get( LensParameterKey( i_rPrefix, i ), io_rCalibration.RadialDistortionParameters[i] ) )
        return false;
    return true;
  }

  bool WriteLensDistortionCalibration( IVideoAttributes& io_rStore, const std::string& i_rPrefix,
                                       const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration )
  {
    io_rStore.Set( i_rPrefix + s_LensModel, ToString( i_rCalibration.RadialModel ) );
    io_rStore.Set( i_rPrefix + s_LensCentreX, i_rCalibration.RadialDistortionCentre_X );
    io_rStore.Set( i_rPrefix + s_LensCentreY, i_rCalibration.RadialDistortionCentre_Y );
    if( i_rCalibration.RadialModel != RadialModel_Lumek2Parameter &&
        i_rCalibration.RadialModel != RadialModel_Lumek3Parameter )
      return false;
    const std::size_t Count = static_cast< std::size_t >( RadialModelParameterCount( i_rCalibration.RadialModel ) );
    if( i_rCalibration.RadialDistortionParameters.size() < Count )
      return false;
    for( std::size_t i = 0; i < Count; ++i )
      io_rStore.Set( LensParameterKey( i_rPrefix, i ), i_rCalibration.RadialDistortionParameters[i] );
    return true;
  }

  bool ReadCameraHardware( const IVideoAttributes& i_rStore, CoreLumekTypes::VCameraHardware& io_rCamera )
  {
    // Older recordings have no serial number, so it is read whatever happens and never decides.
    i_rStore.Get( s_CameraSerialNumber, io_rCamera.SerialNumber );
    return i_rStore.Get( s_CameraDeviceURN, io_rCamera.DeviceURN ) &&
           i_rStore.Get( s_CameraDisplayType, io_rCamera.DisplayType ) &&
           i_rStore.Get( s_CameraPixelAspectRatio, io_rCamera.PixelAspectRatio ) &&
           i_rStore.Get( s_CameraSensorHeight, io_rCamera.SensorHeightInPixels ) &&
           i_rStore.Get( s_CameraSensorWidth, io_rCamera.SensorWidthInPixels ) &&
           i_rStore.Get( s_CameraType, io_rCamera.Type );
  }

  bool WriteCameraHardware( IVideoAttributes& io_rStore, const CoreLumekTypes::VCameraHardware& i_rCamera )
  {
    io_rStore.Set( s_CameraDeviceURN, i_rCamera.DeviceURN );
    io_rStore.Set( s_CameraDisplayType, i_rCamera.DisplayType );
    io_rStore.Set( s_CameraType, i_rCamera.Type );
    io_rStore.Set( s_CameraSerialNumber, i_rCamera.SerialNumber );
    io_rStore.Set( s_CameraPixelAspectRatio, i_rCamera.PixelAspectRatio );
    io_rStore.Set( s_CameraSensorHeight, i_rCamera.SensorHeightInPixels );
    io_rStore.Set( s_CameraSensorWidth, i_rCamera.SensorWidthInPixels );
    return true;
  }

  void ReadConversionRecords( const IVideoAttributes& i_rStore, std::vector< VConversionRecord >& o_rRecords )
  {
    o_rRecords.clear();
    // Every record needs four keys of its own, so the store's size bounds the loop.
    for( std::size_t N = 0; N <= i_rStore.Size(); ++N )
    {
      const std::string Prefix = ConversionRecordPrefix( N );
      std::string ContainerText, AudioPayloadText, VideoPayloadText, PixelFormatText;
      if( !i_rStore.Get( Prefix + s_RecordContainer, ContainerText ) ||
          !i_rStore.Get( Prefix + s_RecordAudioPayload, AudioPayloadText ) ||
          !i_rStore.Get( Prefix + s_RecordVideoPayload, VideoPayloadText ) ||
          !i_rStore.Get( Prefix + s_FramePixelFormat, PixelFormatText ) )
        return;
      VConversionRecord Record;
      FromString( ContainerText, Record.Container );
      FromString( AudioPayloadText, Record.AudioPayload );
      FromString( VideoPayloadText, Record.VideoPayload );
      FromString( PixelFormatText, Record.PixelFormat );
      ReadVideoSettings( i_rStore, Prefix, Record.VideoSettings );
      ReadAudioFrameInfo( i_rStore, Prefix, Record.AudioFrameInfo );
      ReadLensDistortionCalibration( i_rStore, Prefix, Record.LensDistortionCalibration );
      o_rRecords.push_back( std::move( Record ) );
    }
  }

  bool WriteConversionRecords( IVideoAttributes& io_rStore, const std::vector< VConversionRecord >& i_rRecords )
  {
    bool bAll = true;
    for( std::size_t N = 0; N < i_rRecords.size(); ++N )
    {
      const VConversionRecord& rRecord = i_rRecords[N];
      const std::string Prefix = ConversionRecordPrefix( N );
      io_rStore.Set( Prefix + s_RecordContainer, ToString( rRecord.Container ) );
      io_rStore.Set( Prefix + s_RecordAudioPayload, ToString( rRecord.AudioPayload ) );
      io_rStore.Set( Prefix + s_RecordVideoPayload, ToString( rRecord.VideoPayload ) );
      io_rStore.Set( Prefix + s_FramePixelFormat, ToString( rRecord.PixelFormat ) );
      bAll = WriteVideoSettings( io_rStore, Prefix, rRecord.VideoSettings ) && bAll;
      bAll = WriteAudioFrameInfo( io_rStore, Prefix, rRecord.AudioFrameInfo ) && bAll;
      bAll = WriteLensDistortionCalibration( io_rStore, Prefix, rRecord.LensDistortionCalibration ) && bAll;
    }
    return bAll;
  }
} // namespace ZOL
