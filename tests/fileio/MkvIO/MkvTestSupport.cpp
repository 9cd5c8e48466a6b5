#include "tests/fileio/MkvIO/MkvTestSupport.h"

#include "services/ILogCategorised.h"

#include <boost/filesystem.hpp>

#include <fstream>
#include <iterator>

namespace MkvTest
{
  void PrintTo( const VFamilyCase& i_rCase, std::ostream* o_pStream )
  {
    *o_pStream << i_rCase.Name;
  }

  ZOL::IVideoFrameInfo VideoInfo( const VFamilyCase& i_rCase )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_rCase.Width;
    Info.ImageHeight = i_rCase.Height;
    Info.PixelFormat = i_rCase.Format;
    Info.PixelAspectRatio = 1.0;
    return Info;
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

  std::vector< std::uint8_t > RawFrame( const VFamilyCase& i_rCase, int i_Frame )
  {
    std::vector< std::uint8_t > Bytes( ZOL::GetVideoFrameSizeInBytes64( VideoInfo( i_rCase ) ) );
    for( std::size_t i = 0; i < Bytes.size(); ++i )
      Bytes[i] = static_cast< std::uint8_t >( i * 7 + i / 5 + i_Frame * 29 );
    return Bytes;
  }

  std::vector< std::uint8_t > AudioBlock( const VFamilyCase& i_rCase, int i_Frame )
  {
    const ZOL::IAudioFrameInfo Info = AudioInfo( i_rCase );
    if( !Info.IsUsable() )
      return {};
    // A sample count that changes from frame to frame, as 48 kHz at odd frame rates does.
    const std::uint64_t Samples = 40 + static_cast< std::uint64_t >( i_Frame % 3 );
    std::vector< std::uint8_t > Bytes( Samples * ZOL::GetAudioSampleGroupSizeInBytes( Info ) );
    for( std::size_t i = 0; i < Bytes.size(); ++i )
      Bytes[i] = static_cast< std::uint8_t >( i * 3 + i_Frame * 101 );
    return Bytes;
  }

  std::vector< std::uint8_t > FrameBytes( const VFamilyCase& i_rCase, int i_Frame,
                                          const std::vector< std::uint8_t >& i_rJPEG )
  {
    return i_rCase.bJPEG ? i_rJPEG : RawFrame( i_rCase, i_Frame );
  }

  MkvIO::VMkvDescription Describe( const VFamilyCase& i_rCase )
  {
    MkvIO::VMkvDescription Description;
    ZOL::IVideoSettings Settings;
    Settings.Saturation = 0.75f;
    Settings.GammaCorrection = 1.25f;
    if( !MkvIO::DescribeForMatroska( VideoInfo( i_rCase ), i_rCase.bJPEG, AudioInfo( i_rCase ), Timing( i_rCase ),
                                     StartTimecode(), Settings, Description ) )
      return MkvIO::VMkvDescription();
    return Description;
  }

  bool WriteFamilyFile( const std::string& i_rPath, const VFamilyCase& i_rCase,
                        const std::vector< std::uint8_t >& i_rJPEG,
                        const std::function< void( MkvIO::VMkvDescription& ) >& i_rEdit,
                        const std::function< std::vector< MkvIO::VMkvBlock >( int ) >& i_rClusters )
  {
    MkvIO::VMkvDescription Description = Describe( i_rCase );
    if( i_rEdit )
      i_rEdit( Description );
    MkvIO::VMkvWriter Writer;
    if( !Writer.Create( i_rPath, Description ) )
      return false;
    for( int Frame = 0; Frame < i_rCase.Frames; ++Frame )
    {
      const bool bWritten =
          i_rClusters ? Writer.WriteCluster( i_rClusters( Frame ) )
                      : Writer.WriteFrame( FrameBytes( i_rCase, Frame, i_rJPEG ), AudioBlock( i_rCase, Frame ) );
      if( !bWritten )
        return false;
    }
    return Writer.Close();
  }

  std::vector< std::uint8_t > ReadWholeFile( const std::string& i_rPath )
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return std::vector< std::uint8_t >( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
  }

  bool WriteWholeFile( const std::string& i_rPath, const std::vector< std::uint8_t >& i_rBytes )
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

  VLogCapture::VLogCapture()
  {
    m_Handle = ZOL::GlobalLog().AddSink(
        [this]( const ZOL::ILogRecord& i_rRecord )
        {
          if( i_rRecord.Category == "MkvReader" )
            m_Messages.push_back( i_rRecord.Message );
        },
        ZOL::LogDetail );
  }

  VLogCapture::~VLogCapture()
  {
    ZOL::GlobalLog().RemoveSink( m_Handle );
  }

  bool VLogCapture::Contains( const std::string& i_rText ) const
  {
    for( const std::string& rMessage : m_Messages )
      if( rMessage.find( i_rText ) != std::string::npos )
        return true;
    return false;
  }
} // namespace MkvTest
