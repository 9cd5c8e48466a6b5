#include "fileio/LumekVideo/VWriter.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "tools/LumekVideoTool/ToolCommon.h"
#include "utils/UtilsFileSystem/FileIO.h"

#include <boost/filesystem.hpp>

#include <unistd.h>

#include <csignal>
#include <cstdio>
#include <random>

namespace po = boost::program_options;
namespace fs = boost::filesystem;

namespace LumekVideoTool
{
  namespace
  {
    bool SameFile( const std::string& i_rA, const std::string& i_rB )
    {
      boost::system::error_code Error;
      if( fs::exists( i_rB, Error ) )
        return fs::equivalent( i_rA, i_rB, Error );
      return fs::weakly_canonical( i_rA, Error ) == fs::weakly_canonical( i_rB, Error );
    }

    // Everything the input says about itself, with this conversion added to its history.
    ZOL::IVideoAttributes ConvertedAttributes( const LumekVideoViewer::VVideoSource& i_rSource,
                                               const std::string& i_rInput )
    {
      ZOL::IVideoAttributes Attributes = i_rSource.GetAttributes();
      ZOL::WriteVideoTiming( Attributes, i_rSource.GetVideoTiming() );
      ZOL::WriteVideoSettings( Attributes, "", i_rSource.GetVideoSettings() );
      if( i_rSource.GetTimecode().IsValid() )
        ZOL::WriteTimecode( Attributes, i_rSource.GetTimecode() );
      if( i_rSource.GetCameraHardware() != CoreLumekTypes::VCameraHardware() )
        ZOL::WriteCameraHardware( Attributes, i_rSource.GetCameraHardware() );
      if( i_rSource.GetLensDistortionCalibration() != CoreLumekTypes::VLensDistortionCalibration() )
        ZOL::WriteLensDistortionCalibration( Attributes, "", i_rSource.GetLensDistortionCalibration() );

      std::vector< ZOL::VConversionRecord > History;
      ZOL::ReadConversionRecords( Attributes, History );
      ZOL::VConversionRecord Record;
      const auto Container = ZOL::FindVideoContainer( i_rInput );
      Record.Container = Container ? *Container : ZOL::VideoContainer_LVID;
      Record.VideoSettings = i_rSource.GetVideoSettings();
      Record.AudioFrameInfo = i_rSource.GetAudioFrameInfo();
      Record.AudioPayload = i_rSource.GetAudioPayload();
      Record.VideoPayload = i_rSource.GetVideoPayload();
      Record.PixelFormat = i_rSource.GetVideoFrameInfo().PixelFormat;
      Record.LensDistortionCalibration = i_rSource.GetLensDistortionCalibration();
      History.push_back( Record );
      ZOL::WriteConversionRecords( Attributes, History );
      return Attributes;
    }

    // An interrupted conversion removes its temporary file: no half recording is left behind.
    char s_TemporaryPath[4096] = {};

    void RemoveTemporaryAndExit( int i_Signal )
    {
      if( s_TemporaryPath[0] != 0 )
        ::unlink( s_TemporaryPath );
      std::signal( i_Signal, SIG_DFL );
      std::raise( i_Signal );
    }

    class VInterruptGuard
    {
    public:
      explicit VInterruptGuard( const std::string& i_rTemporary )
      {
        std::snprintf( s_TemporaryPath, sizeof( s_TemporaryPath ), "%s", i_rTemporary.c_str() );
        for( int Signal : { SIGINT, SIGTERM, SIGHUP } )
          std::signal( Signal, &RemoveTemporaryAndExit );
      }
      ~VInterruptGuard()
      {
        for( int Signal : { SIGINT, SIGTERM, SIGHUP } )
          std::signal( Signal, SIG_DFL );
        s_TemporaryPath[0] = 0;
      }
    };

    class VProgress
    {
    public:
      explicit VProgress( std::uint64_t i_Total ) : m_Total( i_Total ), m_bShown( isatty( STDERR_FILENO ) != 0 ) {}
      void Update( std::uint64_t i_Done )
      {
        if( !m_bShown || m_Total == 0 )
          return;
        const int Percent = static_cast< int >( i_Done * 100 / m_Total );
        if( Percent == m_LastPercent )
          return;
        m_LastPercent = Percent;
        const int Filled = Percent * 40 / 100;
        std::fprintf( stderr, "\r[%s%s] %3d%%", std::string( Filled, '#' ).c_str(),
                      std::string( 40 - Filled, '-' ).c_str(), Percent );
        std::fflush( stderr );
      }
      ~VProgress()
      {
        if( m_bShown && m_LastPercent >= 0 )
          std::fprintf( stderr, "\n" );
      }

    private:
      std::uint64_t m_Total;
      bool m_bShown;
      int m_LastPercent = -1;
    };
  } // namespace

  int RunConvert( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    po::options_description Options;
    Options.add_options()( "input", po::value< std::string >()->required() )( "output",
                                                                              po::value< std::string >()->required() );
    po::positional_options_description Positional;
    Positional.add( "input", 1 ).add( "output", 1 );
    const auto Variables = ParseArguments( i_rArguments, Options, Positional, "convert", o_rErr );
    if( !Variables )
      return Exit_Usage;
    const std::string Input = ( *Variables )["input"].as< std::string >();
    const std::string Output = ( *Variables )["output"].as< std::string >();
    if( fs::path( Output ).extension() != ".lvid" )
    {
      o_rErr << "lumekvideotool convert: the output must be a .lvid file\n\n" << UsageText();
      return Exit_Usage;
    }
    if( SameFile( Input, Output ) )
    {
      o_rErr << "lumekvideotool convert: the output would overwrite the input\n\n" << UsageText();
      return Exit_Usage;
    }

    LumekVideoViewer::VVideoSource Source;
    if( !OpenSource( Source, Input, o_rErr ) )
      return Exit_CannotOpen;

    // Decoded payloads are stored in the format their decoder delivers.
    ZOL::IVideoFrameInfo OutputInfo = Source.GetVideoFrameInfo();
    if( !VideoEncoding::PixelFormatForPayloadFormat( Source.GetVideoPayload(), OutputInfo.PixelFormat,
                                                     OutputInfo.PixelFormat, false ) )
    {
      o_rErr << "lumekvideotool convert: " << Input << " has no video that can be decoded." << std::endl;
      return Exit_CannotOpen;
    }
    const std::uint64_t FrameCount = Source.GetFrameCount();
    for( auto Index = Source.FindFrameAtOrAfter( 0 ); Index; Index = Source.FindFrameAtOrAfter( *Index + 1 ) )
    {
      ZOL::IVideoFrame Frame;
      if( Source.GetFrame( *Index, Frame ) )
      {
        OutputInfo = Frame.VideoFrameInfo; // a decoder may report the true size
        break;
      }
    }

    // Written beside the output and renamed when complete, so a failed conversion leaves no half file.
    std::random_device Random;
    const std::string Temporary = Output + ".partial-" + std::to_string( Random() );
    const ZOL::IAudioFrameInfo Audio = Source.GetAudioPayload() == ZOL::AudioPayload_Uncompressed
                                           ? Source.GetAudioFrameInfo()
                                           : ZOL::IAudioFrameInfo();
    const VInterruptGuard Guard( Temporary );
    LumekVideo::VWriter Writer;
    if( !Writer.Create( Temporary, OutputInfo, Audio, ConvertedAttributes( Source, Input ) ) )
    {
      o_rErr << "Cannot create " << Temporary << std::endl;
      return Exit_CannotOpen;
    }

    bool bAllCopied = true;
    const std::uint64_t FrameSize = ZOL::GetVideoFrameSizeInBytes64( OutputInfo );
    VProgress Progress( FrameCount );
    // Only stored frames are visited: missing frames stay missing.
    for( auto Next = Source.FindFrameAtOrAfter( 0 ); Next; Next = Source.FindFrameAtOrAfter( *Next + 1 ) )
    {
      const std::uint64_t Index = *Next;
      Progress.Update( Index + 1 );
      ZOL::IVideoFrame Frame;
      if( !Source.GetFrame( Index, Frame ) || !Frame.Video || Frame.Video->GetSize() < FrameSize ||
          Frame.VideoFrameInfo.PixelFormat != OutputInfo.PixelFormat ||
          Frame.VideoFrameInfo.ImageWidth != OutputInfo.ImageWidth ||
          Frame.VideoFrameInfo.ImageHeight != OutputInfo.ImageHeight )
      {
        o_rErr << "Frame " << Index << " could not be read or decoded." << std::endl;
        bAllCopied = false;
        continue;
      }
      std::vector< std::uint8_t > AudioBytes;
      if( Audio.IsUsable() )
        for( const auto& rpBlock : Frame.Audio )
          if( rpBlock )
            AudioBytes.insert( AudioBytes.end(), rpBlock->GetData(), rpBlock->GetData() + rpBlock->GetSize() );
      if( !Writer.AppendFrame( Index, Frame.Video->GetData(), FrameSize,
                               AudioBytes.empty() ? nullptr : AudioBytes.data(), AudioBytes.size() ) )
      {
        o_rErr << "Cannot write frame " << Index << " to " << Temporary << std::endl;
        Writer.Close();
        fs::remove( Temporary );
        return Exit_CannotOpen;
      }
    }
    // The output's name holds the old file or the whole new one at every moment, even if the
    // process is killed or the machine stops here.
    boost::system::error_code Error;
    if( !Writer.Close() || !ZOL::Succeeded( UtilsFileSystem::ReplaceFileAtomic( Output, Temporary ) ) )
    {
      o_rErr << "Cannot finish " << Output << std::endl;
      fs::remove( Temporary, Error );
      return Exit_CannotOpen;
    }
    return bAllCopied ? Exit_Success : Exit_FramesFailed;
  }
} // namespace LumekVideoTool
