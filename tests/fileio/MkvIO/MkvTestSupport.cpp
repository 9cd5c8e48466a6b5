#include "tests/fileio/MkvIO/MkvTestSupport.h"

#include <boost/filesystem.hpp>

#include <fstream>
#include <iterator>

namespace MkvTest
{
  VFamilyCase SmallCase()
  {
    VFamilyCase Case;
    Case.Name = "Small";
    Case.Audio = ZOL::AudioSampleFormat_Int16;
    Case.Width = 4;
    Case.Height = 2;
    Case.Frames = 3;
    return Case;
  }

  ZOL::IAudioFrameInfo AudioInfo( const VFamilyCase& i_rCase )
  {
    ZOL::IAudioFrameInfo Info;
    if( i_rCase.Audio == ZOL::AudioSampleFormat_Unspecified )
      return Info;
    Info.SampleFormat = i_rCase.Audio;
    Info.SampleRate = 48000;
    Info.Channels = 2;
    return Info;
  }

  ZOL::IVideoTiming Timing( const VFamilyCase& i_rCase )
  {
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = static_cast< std::uint32_t >( Timing.TicksPerSecond / i_rCase.FramesPerSecond );
    Timing.StartOffsetInTicks = 1234;
    return Timing;
  }

  ZOL::ITimecode StartTimecode()
  {
    ZOL::ITimecode Timecode;
    Timecode.Standards = ZOL::TimecodeStandard_25;
    Timecode.Hours = 10;
    Timecode.Minutes = 20;
    Timecode.Seconds = 30;
    Timecode.Frames = 12;
    Timecode.UserBits = 0xA5A5;
    return Timecode;
  }

  VBytes RawFrame( const VFamilyCase& i_rCase, int i_Frame )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_rCase.Width;
    Info.ImageHeight = i_rCase.Height;
    Info.PixelFormat = i_rCase.Format;
    VBytes Bytes( ZOL::GetVideoFrameSizeInBytes64( Info ) );
    for( std::size_t i = 0; i < Bytes.size(); ++i )
      Bytes[i] = static_cast< std::uint8_t >( i * 7 + i / 5 + i_Frame * 29 );
    return Bytes;
  }

  VBytes AudioBlock( const VFamilyCase& i_rCase, int i_Frame )
  {
    const ZOL::IAudioFrameInfo Info = AudioInfo( i_rCase );
    if( !Info.IsUsable() )
      return {};
    // A sample count that changes from frame to frame, as 48 kHz at odd frame rates does.
    const std::uint64_t Samples = 40 + static_cast< std::uint64_t >( i_Frame % 3 );
    VBytes Bytes( Samples * ZOL::GetAudioSampleGroupSizeInBytes( Info ) );
    for( std::size_t i = 0; i < Bytes.size(); ++i )
      Bytes[i] = static_cast< std::uint8_t >( i * 3 + i_Frame * 101 );
    return Bytes;
  }

  VBytes FrameBytes( const VFamilyCase& i_rCase, int i_Frame, const VBytes& i_rJPEG )
  {
    return i_rCase.bJPEG ? i_rJPEG : RawFrame( i_rCase, i_Frame );
  }

  bool WriteFamilyFile( const std::string& i_rPath, const VFamilyCase& i_rCase, const VBytes& i_rJPEG,
                        const std::function< void( MkvIO::VMkvDescription& ) >& i_rEdit,
                        const std::function< std::vector< MkvIO::VMkvBlock >( int ) >& i_rClusters )
  {
    ZOL::IVideoFrameInfo Video;
    Video.ImageWidth = i_rCase.Width;
    Video.ImageHeight = i_rCase.Height;
    Video.PixelFormat = i_rCase.Format;
    Video.PixelAspectRatio = 1.0;
    ZOL::IVideoSettings Settings;
    Settings.Saturation = 0.75f;
    Settings.GammaCorrection = 1.25f;
    MkvIO::VMkvDescription Description;
    if( !MkvIO::DescribeForMatroska( Video, i_rCase.bJPEG, AudioInfo( i_rCase ), Timing( i_rCase ), StartTimecode(),
                                     Settings, Description ) )
      return false;
    if( i_rEdit )
      i_rEdit( Description );
    MkvIO::VMkvWriter Writer;
    if( !Writer.Create( i_rPath, Description ) )
      return false;
    for( int Frame = 0; Frame < i_rCase.Frames; ++Frame )
      if( !( i_rClusters ? Writer.WriteCluster( i_rClusters( Frame ) )
                         : Writer.WriteFrame( FrameBytes( i_rCase, Frame, i_rJPEG ), AudioBlock( i_rCase, Frame ) ) ) )
        return false;
    return Writer.Close();
  }

  VBytes Bytes( const std::shared_ptr< ZOL::IBuffer >& i_pBuffer )
  {
    if( !i_pBuffer )
      return {};
    const auto* pData = static_cast< const std::uint8_t* >( i_pBuffer->GetData() );
    return VBytes( pData, pData + i_pBuffer->GetSize() );
  }

  VBytes ReadWholeFile( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return VBytes( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
  }

  bool WriteWholeFile( const std::string& i_rPath, const VBytes& i_rBytes )
  {
    std::ofstream File( i_rPath, std::ios::binary | std::ios::trunc );
    File.write( reinterpret_cast< const char* >( i_rBytes.data() ), static_cast< std::streamsize >( i_rBytes.size() ) );
    return static_cast< bool >( File );
  }

  std::string TempPath( const std::string& i_rName )
  {
    const boost::filesystem::path Folder = boost::filesystem::temp_directory_path() / "lumek-mkv-tests";
    boost::filesystem::create_directories( Folder );
    return ( Folder / boost::filesystem::unique_path( "%%%%%%%%-" + i_rName ) ).string();
  }
} // namespace MkvTest
