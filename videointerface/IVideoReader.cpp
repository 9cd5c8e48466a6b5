#include "videointerface/IVideoReader.h"

#include <boost/filesystem/path.hpp>

namespace ZOL
{
  bool IVideoReader::ReadFrame( std::uint64_t i_FrameIndex, IVideoFrame& o_rFrame, bool i_bReadVideo,
                                bool i_bReadAudio )
  {
    std::shared_ptr< IBuffer > pVideo;
    IAudioBuffers Audio;
    if( !ReadFrameData( i_FrameIndex, pVideo, Audio, i_bReadVideo, i_bReadAudio ) )
      return false;
    if( i_bReadAudio )
    {
      o_rFrame.AudioFrameInfo = GetAudioFrameInfo();
      o_rFrame.Audio = std::move( Audio );
    }
    if( i_bReadVideo )
    {
      o_rFrame.VideoFrameInfo = GetVideoFrameInfo();
      o_rFrame.Video = std::move( pVideo );
    }
    return true;
  }

  std::optional< EVideoContainer > FindVideoContainer( const std::string& i_rFileName )
  {
    if( i_rFileName.find( "%FRAME%" ) != std::string::npos ||
        i_rFileName.find( "%FRAME_NUMBER%" ) != std::string::npos )
      return VideoContainer_IMAGES;
    const std::string Extension = boost::filesystem::path( i_rFileName ).extension().string();
    if( Extension.empty() )
      return VideoContainer_IMAGES;
    // Exact comparison on purpose: "CLIP.MOV" is not a MOV file to this system.
    const std::string Name = Extension.substr( 1 );
    // One numbered image stands for the sequence it belongs to.
    for( const char* pImage : { "jpg", "jpeg", "png", "tif", "tiff" } )
      if( Name == pImage )
        return VideoContainer_IMAGES;
    const IEnumTable& rTable = VideoContainerTable();
    for( std::size_t i = 0; i < rTable.RowCount; ++i )
    {
      const auto Container = static_cast< EVideoContainer >( rTable.Rows[i].Value );
      if( Name == ContainerExtension( Container ) )
        return Container;
    }
    return std::nullopt;
  }
} // namespace ZOL
