#include "app/Window/VideoWindowLogic.h"

#include "videointerface/IBuffer.h"
#include "videointerface/PixelFormatDescriptor.h"

#include <QFileInfo>
#include <QSettings>

#include <boost/format.hpp>

namespace LumekVideoViewer
{
  const std::array< VSettingRow, 7 >& ViewerSettingRows()
  {
    static const std::array< VSettingRow, 7 > s_Rows = { {
        { "Looping", &VViewerSettings::Looping },
        { "SkipFrames", &VViewerSettings::SkipFrames },
        { "SoftwareDecoder", &VViewerSettings::SoftwareDecoder },
        { "FullScreen", &VViewerSettings::FullScreen },
        { "ControlsVisible", &VViewerSettings::ControlsVisible },
        { "VideoInfoVisible", &VViewerSettings::VideoInfoVisible },
        { "CorrectLensDistortion", &VViewerSettings::CorrectLensDistortion },
    } };
    return s_Rows;
  }

  VViewerSettings ReadViewerSettings( QSettings& io_rStore )
  {
    VViewerSettings Settings;
    io_rStore.beginGroup( SettingsGroup );
    for( const VSettingRow& rRow : ViewerSettingRows() )
      Settings.*rRow.pValue = io_rStore.value( rRow.Key, Settings.*rRow.pValue ).toBool();
    io_rStore.endGroup();
    return Settings;
  }

  void WriteViewerSettings( QSettings& io_rStore, const VViewerSettings& i_rSettings )
  {
    io_rStore.beginGroup( SettingsGroup );
    for( const VSettingRow& rRow : ViewerSettingRows() )
      io_rStore.setValue( rRow.Key, i_rSettings.*rRow.pValue );
    io_rStore.endGroup();
  }

  bool IsEmptyFrame( const ZOL::IVideoFrame& i_rFrame )
  {
    const ZOL::IVideoFrameInfo& rInfo = i_rFrame.VideoFrameInfo;
    return rInfo.ImageWidth == 0 || rInfo.ImageHeight == 0 || rInfo.PixelFormat == ZOL::PixelFormat_Unspecified;
  }

  namespace
  {
    // A frame that failed to read or decode is shown as missing, whatever its record already held.
    void ReadOrEmpty( const VFrameReader& i_rRead, std::uint64_t i_Index, ZOL::IVideoFrame& o_rFrame )
    {
      if( !i_rRead( i_Index, o_rFrame ) )
        o_rFrame = ZOL::IVideoFrame();
    }
  } // namespace

  VFrameChoice ChooseFrame( int i_FrameIndex, std::uint64_t i_FrameCount, bool i_bPlaying, const VFrameReader& i_rRead,
                            const VEarlierFrameFinder& i_rFindEarlier )
  {
    VFrameChoice Choice;
    if( i_FrameIndex < 0 )
      return Choice;
    std::uint64_t Index = static_cast< std::uint64_t >( i_FrameIndex );
    if( Index < i_FrameCount )
      ReadOrEmpty( i_rRead, Index, Choice.Frame );
    Choice.bMissingWarning = IsEmptyFrame( Choice.Frame ) && !i_bPlaying;
    // The playback clock runs a few frames past the end before it notices; those are never read.
    if( IsEmptyFrame( Choice.Frame ) && Index >= i_FrameCount )
      Index = i_FrameCount;
    while( IsEmptyFrame( Choice.Frame ) && Index > 0 )
    {
      const std::optional< std::uint64_t > Earlier =
          i_rFindEarlier ? i_rFindEarlier( Index - 1 ) : std::optional< std::uint64_t >( Index - 1 );
      if( !Earlier || *Earlier >= Index )
        break;
      Index = *Earlier;
      Choice.Frame = ZOL::IVideoFrame();
      ReadOrEmpty( i_rRead, Index, Choice.Frame );
    }
    if( !IsEmptyFrame( Choice.Frame ) )
      Choice.ShownIndex = static_cast< int >( Index );
    return Choice;
  }

  ZOL::IVideoFrameInfo SurfaceGeometry( const ZOL::IVideoFrameInfo& i_rFileInfo,
                                        const CoreLumekTypes::VCameraHardware& i_rCamera )
  {
    ZOL::IVideoFrameInfo Geometry = i_rFileInfo;
    const bool bNoSensor = i_rCamera.SensorWidthInPixels == 0 || i_rCamera.SensorHeightInPixels == 0;
    if( bNoSensor && ( Geometry.TwiceOffsetX != 0 || Geometry.TwiceOffsetY != 0 ) )
    {
      Geometry.TwiceOffsetX = 0;
      Geometry.TwiceOffsetY = 0;
    }
    return Geometry;
  }

  QString WindowTitle( const QString& i_rPath )
  {
    if( i_rPath.isEmpty() )
      return ApplicationDisplayName;
    return QString( "%1 - %2" ).arg( QFileInfo( i_rPath ).fileName(), ApplicationDisplayName );
  }

  int TimebarTickInterval( int i_SliderWidth, std::uint64_t i_FrameCount )
  {
    if( i_FrameCount == 0 )
      return 0;
    return static_cast< int >( static_cast< std::int64_t >( i_SliderWidth ) /
                               static_cast< std::int64_t >( i_FrameCount ) );
  }

  bool HasDisplaySettings( ZOL::EVideoPayload i_Payload, ZOL::EPixelFormat i_PixelFormat )
  {
    if( i_Payload != ZOL::VideoPayload_Uncompressed )
      return false;
    return ZOL::IsBayerFormat( i_PixelFormat );
  }

  namespace
  {
    struct VSampleTypeRow
    {
      ZOL::EAudioSampleFormat Format;
      QAudioFormat::SampleType Type;
    };

    // Unspecified has no row: the device's preferred type stays.
    const VSampleTypeRow s_SampleTypes[] = {
        { ZOL::AudioSampleFormat_Int8, QAudioFormat::SignedInt },
        { ZOL::AudioSampleFormat_Int16, QAudioFormat::SignedInt },
        { ZOL::AudioSampleFormat_Int24, QAudioFormat::SignedInt },
        { ZOL::AudioSampleFormat_Int32, QAudioFormat::SignedInt },
        { ZOL::AudioSampleFormat_UInt8, QAudioFormat::UnSignedInt },
        { ZOL::AudioSampleFormat_UInt16, QAudioFormat::UnSignedInt },
        { ZOL::AudioSampleFormat_UInt24, QAudioFormat::UnSignedInt },
        { ZOL::AudioSampleFormat_UInt32, QAudioFormat::UnSignedInt },
        { ZOL::AudioSampleFormat_Float32, QAudioFormat::Float },
    };
  } // namespace

  QAudioFormat AudioOutputFormat( const ZOL::IAudioFrameInfo& i_rInfo, const QAudioFormat& i_rPreferred )
  {
    QAudioFormat Format = i_rPreferred;
    Format.setSampleRate( i_rInfo.SampleRate );
    Format.setSampleSize( static_cast< int >( 8 * ZOL::GetAudioSampleSizeInBytes( i_rInfo.SampleFormat ) ) );
    for( const VSampleTypeRow& rRow : s_SampleTypes )
      if( rRow.Format == i_rInfo.SampleFormat )
        Format.setSampleType( rRow.Type );
    Format.setByteOrder( QAudioFormat::LittleEndian );
    Format.setChannelCount( i_rInfo.Channels );
    Format.setCodec( "audio/pcm" );
    return Format;
  }

  const ZOL::IBuffer* AudioBlockToWrite( const ZOL::IVideoFrame& i_rFrame )
  {
    const ZOL::IAudioFrameInfo& rInfo = i_rFrame.AudioFrameInfo;
    if( rInfo.SampleFormat == ZOL::AudioSampleFormat_Unspecified || rInfo.SampleRate <= 0 || rInfo.Channels <= 0 )
      return nullptr;
    if( i_rFrame.Audio.empty() )
      return nullptr;
    return i_rFrame.Audio.front().get();
  }

  QUrl HelpUrl( const ZOL::IApplicationVersion& i_rVersion )
  {
    return QUrl( QString( DocumentationSiteHost ) +
                 QString( "/display/LVV%1%2/" ).arg( i_rVersion.Major ).arg( i_rVersion.Minor ) );
  }

  QString AboutVersionLine( const ZOL::IApplicationVersion& i_rVersion )
  {
    return QString( "%1 %2.%3.%4.%5 %6 %7" )
        .arg( ApplicationDisplayName )
        .arg( i_rVersion.Major )
        .arg( i_rVersion.Minor )
        .arg( i_rVersion.Point )
        .arg( i_rVersion.BuildTag, i_rVersion.Empty1, "x64" );
  }

  QString AboutRevisionLine( const ZOL::IApplicationVersion& i_rVersion )
  {
    return QString( "%1:%2" ).arg( i_rVersion.Revision ).arg( i_rVersion.Changeset );
  }

  const std::vector< VMenuRow >& MenuRows()
  {
    static const std::vector< VMenuRow > s_Rows = {
        { EMenu::File, "&File" }, { EMenu::Playback, "&Playback " }, { EMenu::Decoder, "Decoder" },
        { EMenu::View, "&View" }, { EMenu::Help, "&Help " },
    };
    return s_Rows;
  }

  const std::vector< VActionRow >& ActionRows()
  {
    using A = EAction;
    using M = EMenu;
    using C = ECheck;
    static const std::vector< VActionRow > s_Rows = {
        { A::Open, M::File, false, "Open", "&Open...", "Ctrl+O", C::NotCheckable, "" },
        { A::Close, M::File, false, "Close", "&Close", "", C::NotCheckable, "" },
        { A::Exit, M::File, true, "Exit", "&Exit", "Alt+F4", C::NotCheckable, "" },
        { A::Looping, M::Playback, false, "Looping", "&Looping", "L", C::Checked, "Restart video when end is reached" },
        { A::SkipFrames, M::Playback, false, "SkipFrames", "&Skip Frames", "S", C::Checked,
          "Skip frames if necessary to play video at correct speed (recommended)" },
        { A::HardwareDecoder, M::Decoder, false, "HardwareDecoder", "Hardware (GPU)", "", C::Checked,
          "Use graphics GPU for decoding video (recommended)" },
        { A::SoftwareDecoder, M::Decoder, false, "SoftwareDecoder", "Software (CPU)", "", C::Unchecked,
          "Don't use graphics GPU for decoding video" },
        { A::Play, M::Playback, true, "PlayAction", "Play", "Space", C::NotCheckable, "Start or pause playing video" },
        { A::Stop, M::Playback, false, "StopAction", "Stop", "", C::NotCheckable, "Stop playing video" },
        { A::PreviousFrame, M::Playback, true, "PreviousFrame", "Previous Frame", "Left", C::NotCheckable,
          "Go back one frame" },
        { A::NextFrame, M::Playback, false, "NextFrame", "Next Frame", "Right", C::NotCheckable,
          "Go forward one frame" },
        { A::ScaleToWindow, M::View, false, "ScaleToWindow", "Scale Video to &Window", "W", C::Checked,
          "Fit video to display window (recommended)" },
        { A::ScaleFreely, M::View, false, "ScaleFreely", "Scale Freely", "", C::Unchecked,
          "Allow video and window to be scaled arbitrarily with mouse" },
        { A::ScaleOneToOne, M::View, false, "ScaleOneToOne", "Scale Video 1:1", "", C::Unchecked,
          "Scale video so one display pixel equals one video pixel, without resizing window" },
        { A::ScaleWindowToVideo, M::View, false, "ScaleWindowToVideo", "Scale Window to &Video 1:1", "", C::Unchecked,
          "Resize window to fit video at 1:1" },
        { A::CorrectRadialDistortion, M::View, true, "CorrectRadialDistortion", "Correct &Radial Distortion", "",
          C::Unchecked, "Whether to apply radial distortion if there is a lens calibration available in the file." },
        { A::VideoInformation, M::View, true, "VideoInformation", "Video &Information", "I", C::Checked,
          "Show video information panel" },
        { A::Controls, M::View, false, "ControlsAction", "&Controls", "C", C::Checked, "Show video controls panel" },
        { A::Properties, M::View, true, "Properties", "Video &Properties", "P", C::NotCheckable,
          "Show video properties dialog" },
        { A::DisplaySettings, M::View, true, "DisplaySettings", "Video Display Settings", "", C::NotCheckable,
          "Show video display settings dialog" },
        { A::FullScreen, M::View, true, "FullScreenAction", "&Full Screen", "F", C::Unchecked,
          "Toggle full screen mode" },
        { A::ViewHelp, M::Help, false, "ViewHelp", "View Latest &Help on %1", "", C::NotCheckable,
          "Open a web browser pointing to the latest online documentation" },
        { A::Licenses, M::Help, false, "Licenses", "&Third-Party Licenses...", "", C::NotCheckable, "" },
        { A::CheckForUpdates, M::Help, false, "CheckForUpdates", "&Check for Updates...", "", C::NotCheckable, "" },
        { A::About, M::Help, false, "About", "&About %1...", "", C::NotCheckable, "" },
    };
    return s_Rows;
  }

  const VActionRow& ActionRow( EAction i_Action )
  {
    for( const VActionRow& rRow : ActionRows() )
      if( rRow.Id == i_Action )
        return rRow;
    return ActionRows().front();
  }

  QString ActionText( const VActionRow& i_rRow )
  {
    const QString Text( i_rRow.Text );
    if( i_rRow.Id == EAction::ViewHelp )
      return Text.arg( DocumentationSiteName );
    if( i_rRow.Id == EAction::About )
      return Text.arg( ApplicationDisplayName );
    return Text;
  }
} // namespace LumekVideoViewer
