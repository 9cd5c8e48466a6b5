#include "app/VideoSource/VideoSourceTexts.h"

#include "app/VideoSource/VVideoSource.h"
#include "utils/UtilsFileSystem/FileIO.h"

#include <boost/algorithm/string/join.hpp>
#include <boost/format.hpp>

namespace LumekVideoViewer
{
  VInfoPanelTexts ComposeInfoPanelTexts( const VVideoSource& i_rSource, std::uint64_t i_Frame )
  {
    VInfoPanelTexts Texts;
    if( i_rSource.GetVideoPayload() == ZOL::VideoPayload_None )
    {
      Texts.Timecode = "No file open";
      return Texts;
    }

    if( i_rSource.GetAudioPayload() != ZOL::AudioPayload_None )
    {
      static const boost::format s_AudioFormat( "A: %d channels / %s / %dHz" );
      const ZOL::IAudioFrameInfo& rAudio = i_rSource.GetAudioFrameInfo();
      const char* pFormatName = i_rSource.GetAudioPayload() == ZOL::AudioPayload_Uncompressed
                                    ? ZOL::ToString( rAudio.SampleFormat )
                                    : ZOL::ToString( i_rSource.GetAudioPayload() );
      Texts.Audio = ( boost::format( s_AudioFormat ) % rAudio.Channels % pFormatName % rAudio.SampleRate ).str();
    }

    static const boost::format s_VideoFormat( "V: %d x %d / %s / %5.2fHz / %d frames (%d missing) / %.2fs" );
    const ZOL::IVideoFrameInfo& rVideo = i_rSource.GetVideoFrameInfo();
    const char* pFormatName = i_rSource.GetVideoPayload() == ZOL::VideoPayload_Uncompressed
                                  ? ZOL::ToString( rVideo.PixelFormat )
                                  : ZOL::ToString( i_rSource.GetVideoPayload() );
    Texts.Video = ( boost::format( s_VideoFormat ) % rVideo.ImageWidth % rVideo.ImageHeight % pFormatName %
                    i_rSource.GetFrameRate() % i_rSource.GetFrameCount() % i_rSource.GetMissingFrameCount() %
                    i_rSource.GetDurationInSeconds() )
                      .str();

    static const boost::format s_TimecodeFormat( "T: %s" );
    Texts.Timecode = ( boost::format( s_TimecodeFormat ) % i_rSource.GetFrameTimecodeText( i_Frame ) ).str();
    return Texts;
  }

  std::string ComposeDecoderText( const std::string& i_rDecoderName, double i_FramesPerSecond )
  {
    static const boost::format s_DecoderFormat( "%s @ %.1ffps" );
    return ( boost::format( s_DecoderFormat ) % i_rDecoderName % i_FramesPerSecond ).str();
  }

  std::string ComposeOpenFailureText( const std::string& i_rPath )
  {
    std::string Text = "The video file could not be opened.";
    std::vector< std::string > Writers;
    if( UtilsFileSystem::GetWritingProcesses( i_rPath, Writers ) && !Writers.empty() )
      Text += " It is still being written by " + boost::algorithm::join( Writers, ", " ) + ".";
    return Text;
  }

  VPropertyRows ComposePropertyRows( const VVideoSource& i_rSource )
  {
    VPropertyRows Rows;
    if( !i_rSource.IsOpen() )
      return Rows;
    ZOL::IVideoAttributes Store = i_rSource.GetAttributes();
    ZOL::WriteAudioFrameInfo( Store, "", i_rSource.GetAudioFrameInfo() );
    ZOL::WriteVideoFrameInfo( Store, i_rSource.GetVideoFrameInfo() );
    ZOL::WriteVideoSettings( Store, "", i_rSource.GetVideoSettings() );

    std::vector< std::string > Keys;
    Store.GetKeys( Keys );
    Rows.reserve( Keys.size() );
    for( const std::string& rKey : Keys )
    {
      std::string Value;
      Store.GetValueAsString( rKey, Value );
      Rows.emplace_back( rKey, Value );
    }
    return Rows;
  }
} // namespace LumekVideoViewer
