// The window's decisions, checked without a display.

#include "app/Window/VideoWindowLogic.h"

#include "videointerface/BufferAllocators.h"
#include "videointerface/IBuffer.h"

#include <QKeySequence>
#include <QSettings>
#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <set>

using namespace LumekVideoViewer;

namespace
{
  // A recording whose frames exist only at the given indices.
  VFrameReader GappyFile( std::set< std::uint64_t > i_Present, std::vector< std::uint64_t >* o_pReads = nullptr )
  {
    return [i_Present, o_pReads]( std::uint64_t i_Index, ZOL::IVideoFrame& o_rFrame )
    {
      if( o_pReads )
        o_pReads->push_back( i_Index );
      // A frame that fails still has its description filled in, as the video source leaves it.
      o_rFrame.VideoFrameInfo.ImageWidth = 8;
      o_rFrame.VideoFrameInfo.ImageHeight = 4;
      o_rFrame.VideoFrameInfo.PixelFormat = ZOL::PixelFormat_Luminance8;
      return i_Present.count( i_Index ) == 1;
    };
  }
} // namespace

// The store written by earlier releases: the keys in the group "General", any boolean text. What
// the window writes survives a restart in the window's own test.
TEST( ViewerSettings, KeysLiveInTheGeneralGroupAndReadAnyBooleanText )
{
  QTemporaryDir Dir;
  QSettings Store( Dir.filePath( "viewer.ini" ), QSettings::IniFormat );
  Store.setValue( "General/ControlsVisible", "false" );
  Store.setValue( "General/SoftwareDecoder", 1 );
  Store.setValue( "Looping", false ); // outside the group: not ours
  const VViewerSettings Settings = ReadViewerSettings( Store );
  EXPECT_FALSE( Settings.ControlsVisible );
  EXPECT_TRUE( Settings.SoftwareDecoder && Settings.Looping );
  WriteViewerSettings( Store, Settings );
  Store.beginGroup( SettingsGroup );
  EXPECT_EQ( Store.childKeys().size(), 7 );
}

// Frames 0, 1, 2 and 5 of 8 exist: a gap falls back to the nearest earlier frame, and warns only
// while paused.
TEST( FrameChoice, FallsBackToTheNearestEarlierFrame )
{
  const struct
  {
    const char* Name;
    int Asked;
    bool bPlaying;
    int Shown;
    bool bWarning;
  } Rows[] = { { "PresentPaused", 2, false, 2, false },   { "PresentPlaying", 5, true, 5, false },
               { "GapPausedWarns", 4, false, 2, true },   { "GapPlayingIsQuiet", 3, true, 2, false },
               { "AfterLastPresent", 7, false, 5, true }, { "PastTheEndWhilePlaying", 11, true, 5, false },
               { "Negative", -1, false, -1, false } };
  for( const auto& rRow : Rows )
  {
    SCOPED_TRACE( rRow.Name );
    const VFrameChoice Choice = ChooseFrame( rRow.Asked, 8, rRow.bPlaying, GappyFile( { 0, 1, 2, 5 } ) );
    EXPECT_EQ( Choice.ShownIndex, rRow.Shown );
    EXPECT_EQ( Choice.bMissingWarning, rRow.bWarning );
    EXPECT_EQ( IsEmptyFrame( Choice.Frame ), rRow.Shown < 0 );
  }

  const VFrameChoice NothingBefore = ChooseFrame( 3, 10, false, GappyFile( { 4, 5 } ) );
  EXPECT_EQ( NothingBefore.ShownIndex, -1 );
  EXPECT_TRUE( NothingBefore.bMissingWarning );
  EXPECT_TRUE( IsEmptyFrame( NothingBefore.Frame ) );
}

// Two faults once found: the clock overshooting the end must not read the billions of indices
// past it, and a damaged index may leave a gap of billions of numbers below the asked frame,
// which must be crossed in one step.
TEST( FrameChoice, WildIndicesAreNotWalked )
{
  std::vector< std::uint64_t > Reads;
  EXPECT_EQ( ChooseFrame( 2000000000, 3, true, GappyFile( { 0, 1, 2 }, &Reads ) ).ShownIndex, 2 );
  EXPECT_EQ( Reads, std::vector< std::uint64_t >{ 2 } );

  Reads.clear();
  const auto FindEarlier = []( std::uint64_t i_Index ) -> std::optional< std::uint64_t >
  { return i_Index >= 2000000000u ? 2000000000u : 0u; };
  const VFrameChoice Choice = ChooseFrame( 2000000001, 2000000002, false, GappyFile( { 0 }, &Reads ), FindEarlier );
  EXPECT_EQ( Choice.ShownIndex, 0 );
  EXPECT_TRUE( Choice.bMissingWarning );
  EXPECT_EQ( Reads, ( std::vector< std::uint64_t >{ 2000000001, 2000000000, 0 } ) );
}

TEST( Timebar, TickIntervalGuardsAnEmptyFile )
{
  // Pixels per frame: one frame spans the bar, and an empty file gives none instead of a division by 0.
  for( const auto& [Frames, Interval] : { std::pair( 1, 700 ), { 100, 7 }, { 1000, 0 }, { 0, 0 } } )
    EXPECT_EQ( TimebarTickInterval( 700, Frames ), Interval ) << Frames;
}

// An offset needs a sensor to place it on; gamma and saturation act on raw Bayer frames only.
TEST( Surface, OffsetsNeedASensorAndSettingsNeedRawBayer )
{
  ZOL::IVideoFrameInfo File;
  File.TwiceOffsetX = 6;
  File.TwiceOffsetY = 4;
  EXPECT_EQ( SurfaceGeometry( File, {} ).TwiceOffsetX, 0 );
  EXPECT_EQ( SurfaceGeometry( File, { "", "", "", "", 64, 48, 1.0 } ).TwiceOffsetY, 4 );
  EXPECT_TRUE( HasDisplaySettings( ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_BayerGB8 ) );
  EXPECT_FALSE( HasDisplaySettings( ZOL::VideoPayload_ImageJPEG, ZOL::PixelFormat_BayerGB8 ) );
  EXPECT_FALSE( HasDisplaySettings( ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_R8G8B8 ) );
}

// The sample layout, rate and channels follow the file, and the rest stays the device's; only
// the first block of a frame with usable sound is written.
TEST( AudioOutput, FormatAndBlockFollowTheFile )
{
  QAudioFormat Preferred;
  Preferred.setSampleType( QAudioFormat::Float );
  Preferred.setSampleRate( 44100 );
  Preferred.setByteOrder( QAudioFormat::BigEndian );
  const QAudioFormat Format = AudioOutputFormat( { ZOL::AudioSampleFormat_UInt16, 48000, 2 }, Preferred );
  EXPECT_EQ( std::make_pair( Format.sampleSize(), Format.sampleType() ),
             std::make_pair( 16, QAudioFormat::UnSignedInt ) );
  EXPECT_EQ( std::make_pair( Format.sampleRate(), Format.channelCount() ), std::make_pair( 48000, 2 ) );
  EXPECT_EQ( Format.byteOrder(), QAudioFormat::LittleEndian );
  EXPECT_EQ( Format.codec(), "audio/pcm" );
  // A kind the file does not name keeps the device's.
  EXPECT_EQ( AudioOutputFormat( { ZOL::AudioSampleFormat_Unspecified, 48000, 2 }, Preferred ).sampleType(),
             QAudioFormat::Float );

  const auto pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
  ZOL::IVideoFrame Frame;
  Frame.AudioFrameInfo = { ZOL::AudioSampleFormat_Int16, 48000, 2 };
  EXPECT_EQ( AudioBlockToWrite( Frame ), nullptr );
  std::shared_ptr< ZOL::IBuffer > pFirst, pSecond;
  pAllocator->Allocate( pFirst, 16 );
  pAllocator->Allocate( pSecond, 16 );
  Frame.Audio = { pFirst, pSecond };
  EXPECT_EQ( AudioBlockToWrite( Frame ), pFirst.get() );
  Frame.AudioFrameInfo.Channels = 0;
  EXPECT_EQ( AudioBlockToWrite( Frame ), nullptr );
  Frame.AudioFrameInfo = { ZOL::AudioSampleFormat_Unspecified, 48000, 2 };
  EXPECT_EQ( AudioBlockToWrite( Frame ), nullptr );
}

// Two actions on one key make Qt fire neither; every key must be unique, and every action must
// land in a menu that exists.
TEST( MenuTable, KeysAreUniqueAndEveryActionHasItsMenu )
{
  std::set< QString > Keys;
  std::set< EMenu > Menus;
  for( const VMenuRow& rMenu : MenuRows() )
    Menus.insert( rMenu.Menu );
  std::set< EAction > Actions;
  for( const VActionRow& rRow : ActionRows() )
  {
    SCOPED_TRACE( rRow.Text );
    EXPECT_EQ( Menus.count( rRow.Menu ), 1u );
    EXPECT_TRUE( Actions.insert( rRow.Id ).second );
    EXPECT_EQ( &ActionRow( rRow.Id ), &rRow );
    if( *rRow.Shortcut == '\0' )
      continue;
    const QString Key = QKeySequence( rRow.Shortcut ).toString();
    EXPECT_FALSE( Key.isEmpty() );
    EXPECT_TRUE( Keys.insert( Key ).second ) << Key.toStdString();
    EXPECT_NE( rRow.Menu, EMenu::Help );
  }
  EXPECT_EQ( Actions.size(), static_cast< std::size_t >( EAction::Count ) );
  EXPECT_EQ( ActionText( ActionRow( EAction::About ) ), "&About Lumek Video Viewer..." );
  EXPECT_EQ( ActionText( ActionRow( EAction::ViewHelp ) ), QString( "View Latest &Help on " ) + DocumentationSiteName );
  // The documentation it opens is this release's.
  ZOL::IApplicationVersion Version{};
  Version.Major = 1;
  Version.Minor = 10;
  EXPECT_EQ( HelpUrl( Version ).path(), "/display/LVV110/" );
}
