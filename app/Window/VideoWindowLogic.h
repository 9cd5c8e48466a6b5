#pragma once

// What the video window decides without a display: the stored settings, which frame to show,
// the title, the audio format and the menu table. The window only wires these to widgets.

#include "services/IApplicationVersion.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/IVideoFrameInfo.h"

#include <QAudioFormat>
#include <QString>
#include <QUrl>

#include <array>
#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

class QSettings;

namespace LumekVideoViewer
{
  constexpr const char* ApplicationDisplayName = "Lumek Video Viewer";
  constexpr const char* SettingsOrganisation = "Lumek Labs Ltd";
  constexpr const char* SettingsApplication = "LumekVideoViewer";
  constexpr const char* SettingsGroup = "General";
  constexpr const char* VersionCheckSettingsPrefix = "LumekVideoViewer";

  // The seven booleans kept between runs. Defaults are those of a first start.
  struct VViewerSettings
  {
    bool Looping = true;
    bool SkipFrames = true;
    bool SoftwareDecoder = false;
    // Only the action's check state: a stored true never starts the window in full screen.
    bool FullScreen = true;
    bool ControlsVisible = true;
    bool VideoInfoVisible = true;
    bool CorrectLensDistortion = true;
  };

  struct VSettingRow
  {
    const char* Key;
    bool VViewerSettings::*pValue;
  };

  // In the order they are written.
  const std::array< VSettingRow, 7 >& ViewerSettingRows();

  // Missing keys keep the defaults of VViewerSettings.
  VViewerSettings ReadViewerSettings( QSettings& io_rStore );
  // Writes all seven keys, every time, within the group "General".
  void WriteViewerSettings( QSettings& io_rStore, const VViewerSettings& i_rSettings );

  // A frame counts as missing when it has no size or no pixel format.
  bool IsEmptyFrame( const ZOL::IVideoFrame& i_rFrame );

  using VFrameReader = std::function< bool( std::uint64_t i_Index, ZOL::IVideoFrame& o_rFrame ) >;
  // The nearest stored frame at or below an index, from the file's index.
  using VEarlierFrameFinder = std::function< std::optional< std::uint64_t >( std::uint64_t i_Index ) >;

  struct VFrameChoice
  {
    ZOL::IVideoFrame Frame;
    // The index whose frame was found; -1 when none at or before the asked one exists.
    int ShownIndex = -1;
    bool bMissingWarning = false;
  };

  // The frame for i_FrameIndex, or else the nearest earlier one that exists: a gap in a recording
  // keeps the last picture on screen, and an index past the end shows the last frame. The warning
  // is raised for a missing frame only while paused; during playback a gap just holds the picture.
  // Indices at or past i_FrameCount are known to be empty and are not read. With a finder, the
  // walk down jumps over a gap in one step instead of reading every missing number in it.
  VFrameChoice ChooseFrame( int i_FrameIndex, std::uint64_t i_FrameCount, bool i_bPlaying, const VFrameReader& i_rRead,
                            const VEarlierFrameFinder& i_rFindEarlier = nullptr );

  // Where the surface places the image on the sensor. Offsets without a sensor size to measure
  // them against would push the picture off the outline, so they are dropped.
  ZOL::IVideoFrameInfo SurfaceGeometry( const ZOL::IVideoFrameInfo& i_rFileInfo,
                                        const CoreLumekTypes::VCameraHardware& i_rCamera );

  // "name.lvid - Lumek Video Viewer", or the bare display name with no file.
  QString WindowTitle( const QString& i_rPath );

  // Pixels between the time bar's ticks; 0 for a file without frames.
  int TimebarTickInterval( int i_SliderWidth, std::uint64_t i_FrameCount );

  // Gamma and saturation act on uncompressed Bayer frames only.
  bool HasDisplaySettings( ZOL::EVideoPayload i_Payload, ZOL::EPixelFormat i_PixelFormat );

  // The output format for a file's audio, starting from the device's preferred one so that what
  // the file does not say stays as the device wants it.
  QAudioFormat AudioOutputFormat( const ZOL::IAudioFrameInfo& i_rInfo, const QAudioFormat& i_rPreferred );

  // The one block of sound a frame carries, or null when there is nothing to play.
  const ZOL::IBuffer* AudioBlockToWrite( const ZOL::IVideoFrame& i_rFrame );

  constexpr const char* DocumentationSiteName = "Lumek Docs";
  constexpr const char* DocumentationSiteHost = "https://docs.lumek.example";
  // The documentation of this major and minor release.
  QUrl HelpUrl( const ZOL::IApplicationVersion& i_rVersion );

  // "Lumek Video Viewer 1.10.0.137509h  x64" and "137509:<changeset>" for the about dialog.
  QString AboutVersionLine( const ZOL::IApplicationVersion& i_rVersion );
  QString AboutRevisionLine( const ZOL::IApplicationVersion& i_rVersion );

  enum class EMenu
  {
    File,
    Playback,
    Decoder,
    View,
    Help,
  };

  enum class EAction
  {
    Open,
    Close,
    Exit,
    Looping,
    SkipFrames,
    HardwareDecoder,
    SoftwareDecoder,
    Play,
    Stop,
    PreviousFrame,
    NextFrame,
    ScaleToWindow,
    ScaleFreely,
    ScaleOneToOne,
    ScaleWindowToVideo,
    CorrectRadialDistortion,
    VideoInformation,
    Controls,
    Properties,
    DisplaySettings,
    FullScreen,
    ViewHelp,
    Licenses,
    CheckForUpdates,
    About,
    Count
  };

  enum class ECheck
  {
    NotCheckable,
    Checked,
    Unchecked,
  };

  struct VActionRow
  {
    EAction Id;
    EMenu Menu;
    bool bSeparatorBefore;
    const char* ObjectName;
    // "%1" stands for the documentation site or the display name.
    const char* Text;
    const char* Shortcut;
    ECheck Check;
    const char* ToolTip;
  };

  struct VMenuRow
  {
    EMenu Menu;
    const char* Title;
  };

  // The menus in menu bar order; Decoder is the sub-menu of Playback.
  const std::vector< VMenuRow >& MenuRows();
  // Every action, in menu order.
  const std::vector< VActionRow >& ActionRows();
  const VActionRow& ActionRow( EAction i_Action );
  // The text shown for an action, with its placeholder filled in.
  QString ActionText( const VActionRow& i_rRow );
} // namespace LumekVideoViewer
