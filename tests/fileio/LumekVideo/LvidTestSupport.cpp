#include "tests/fileio/LumekVideo/LvidTestSupport.h"

#include "fileio/LumekVideo/VWriter.h"
#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <boost/filesystem.hpp>

#include <fstream>
#include <iterator>

namespace LumekVideoTest
{
  VByteWriter& VByteWriter::Int( std::uint64_t i_Value, int i_Bytes )
  {
    for( int i = 0; i < i_Bytes; ++i )
      Bytes.push_back( static_cast< std::uint8_t >( i_Value >> ( 8 * i ) ) );
    return *this;
  }

  VByteWriter& VByteWriter::Raw( const VBytes& i_rBytes )
  {
    Bytes.insert( Bytes.end(), i_rBytes.begin(), i_rBytes.end() );
    return *this;
  }

  VByteWriter& VByteWriter::PadTo( std::uint64_t i_Alignment )
  {
    while( Bytes.size() % i_Alignment != 0 )
      Bytes.push_back( 0 );
    return *this;
  }

  void Patch( VBytes& io_rBytes, std::size_t i_Offset, std::uint64_t i_Value, int i_Bytes )
  {
    for( int i = 0; i < i_Bytes; ++i )
      io_rBytes.at( i_Offset + i ) = static_cast< std::uint8_t >( i_Value >> ( 8 * i ) );
  }

  VBytes PatternBytes( std::size_t i_Size, std::uint32_t i_Seed )
  {
    // A small xorshift: every byte position and every seed gives different content, so a frame
    // read from the wrong place or shifted by a byte cannot match.
    VBytes Bytes( i_Size );
    std::uint32_t State = i_Seed * 2654435761u + 0x9E3779B9u;
    for( auto& rByte : Bytes )
    {
      State ^= State << 13;
      State ^= State >> 17;
      State ^= State << 5;
      rByte = static_cast< std::uint8_t >( State >> 24 );
    }
    return Bytes;
  }

  VBytes SerialiseStore( const ZOL::IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    // No bytes at all when the store cannot be written: every block built from them fails to read.
    return i_rStore.WriteTo( Stream ) ? Stream.GetData() : VBytes();
  }

  VBytes DescriptionBlock( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio,
                           const std::string& i_rWithoutKey )
  {
    ZOL::IVideoAttributes Store;
    ZOL::WriteVideoFrameInfo( Store, i_rVideo );
    ZOL::WriteAudioFrameInfo( Store, "", i_rAudio );
    Store.Remove( i_rWithoutKey );
    return SerialiseStore( Store );
  }

  VAssembled Assemble( const VRecordingPlan& i_rPlan, std::vector< std::pair< std::uint64_t, std::size_t > > i_Index )
  {
    VAssembled Result;
    VByteWriter File;
    File.Text( "###LumekVideoFile###" ).U32( 0xF355BDACu ).U32( 1 ).U32( 3 ).U64( i_rPlan.Alignment ).U64( 0 );
    File.Raw( i_rPlan.DescriptionBlock ).Raw( i_rPlan.AttributeBlock ).PadTo( i_rPlan.Alignment );
    for( const VRecord& rRecord : i_rPlan.Records )
    {
      Result.RecordOffsets.push_back( File.Size() );
      File.Raw( rRecord.Video ).PadTo( i_rPlan.Alignment );
      if( rRecord.Audio )
        File.U32( static_cast< std::uint32_t >( rRecord.Audio->size() ) )
            .Raw( *rRecord.Audio )
            .PadTo( i_rPlan.Alignment );
    }
    Result.IndexOffset = File.Size();
    if( i_Index.empty() )
      for( std::size_t i = 0; i < i_rPlan.Records.size(); ++i )
        i_Index.emplace_back( i_rPlan.Records[i].FrameNumber, i );
    File.U64( i_Index.size() );
    for( const auto& [Frame, Record] : i_Index )
      File.U64( Frame ).U64( Result.RecordOffsets.at( Record ) );
    PatchU64( File.Bytes, 40, Result.IndexOffset );
    Result.Bytes = std::move( File.Bytes );
    return Result;
  }

  ZOL::IVideoFrameInfo MakeVideo( ZOL::EPixelFormat i_Format, int i_Width, int i_Height )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    Info.PixelAspectRatio = 1.0;
    Info.InterlacedFormat = ZOL::InterlacedFormat_NotInterlaced;
    return Info;
  }

  ZOL::IAudioFrameInfo MakeAudio( ZOL::EAudioSampleFormat i_Format, int i_Channels, int i_Rate )
  {
    ZOL::IAudioFrameInfo Info;
    Info.SampleFormat = i_Format;
    Info.SampleRate = i_Rate;
    Info.Channels = i_Channels;
    return Info;
  }

  ZOL::IVideoAttributes MakeFileAttributes()
  {
    ZOL::IVideoAttributes Attributes;
    ZOL::IVideoTiming Timing;
    Timing.FramePeriodInTicks = 135000000u / 100u;
    Timing.StartOffsetInTicks = -270000;
    ZOL::WriteVideoTiming( Attributes, Timing );
    ZOL::IVideoSettings Settings;
    Settings.Saturation = 1.25f;
    Settings.GammaCorrection = 0.5f;
    ZOL::WriteVideoSettings( Attributes, "", Settings );
    Attributes.Set( "Recording.Take", std::uint32_t( 7 ) );
    Attributes.Set( "Recording.Note", "lvid test" );
    return Attributes;
  }

  VRecordingPlan SmallPlan()
  {
    VRecordingPlan Plan;
    Plan.DescriptionBlock = DescriptionBlock( s_SmallVideo, s_Stereo16 );
    Plan.AttributeBlock = SerialiseStore( MakeFileAttributes() );
    Plan.Alignment = 16;
    for( std::uint32_t i = 0; i < 3; ++i )
      Plan.Records.push_back( { i, PatternBytes( 15, i ), PatternBytes( 4 * ( i + 1 ), 40 + i ) } );
    return Plan;
  }

  VBytes WriteToMemory( const ZOL::IVideoFrameInfo& i_rVideo, const ZOL::IAudioFrameInfo& i_rAudio,
                        const std::vector< VFrameContent >& i_rFrames, std::uint64_t i_Alignment )
  {
    auto pStream = std::make_shared< UtilsIO::VMemoryStream >();
    LumekVideo::VWriter Writer;
    if( !Writer.Create( pStream, i_rVideo, i_rAudio, MakeFileAttributes(), i_Alignment ) )
      return {};
    for( const VFrameContent& rFrame : i_rFrames )
      if( !Writer.AppendFrame( rFrame.FrameNumber, rFrame.Video.data(), rFrame.Video.size(),
                               rFrame.Audio.empty() ? nullptr : rFrame.Audio.data(), rFrame.Audio.size() ) )
        return {};
    return Writer.Close() ? pStream->GetData() : VBytes();
  }

  VMemoryRecording::VMemoryRecording( VBytes i_Bytes ) : Bytes( std::move( i_Bytes ) )
  {
    bOpened = Reader.Open( std::make_shared< UtilsIO::VMemoryInputStream >( Bytes.data(), Bytes.size() ) );
  }

  std::optional< VFrameBytes > ReadBytes( LumekVideo::VReader& io_rReader, std::uint64_t i_Frame, bool i_bVideo,
                                          bool i_bAudio )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    if( !io_rReader.ReadFrameData( i_Frame, pVideo, Audio, i_bVideo, i_bAudio ) )
      return std::nullopt;
    VFrameBytes Result;
    if( pVideo )
      Result.Video = BytesOf( *pVideo );
    for( const auto& rpBlock : Audio )
      Result.Audio.push_back( BytesOf( *rpBlock ) );
    return Result;
  }

  VTempDir::VTempDir()
  {
    const boost::filesystem::path Dir =
        boost::filesystem::temp_directory_path() / boost::filesystem::unique_path( "lvid-test-%%%%-%%%%-%%%%" );
    boost::filesystem::create_directories( Dir );
    m_Path = Dir.string();
  }

  VTempDir::~VTempDir()
  {
    boost::system::error_code Error;
    boost::filesystem::remove_all( m_Path, Error );
  }

  std::string VTempDir::File( const std::string& i_rName ) const
  {
    return ( boost::filesystem::path( m_Path ) / i_rName ).string();
  }

  bool WriteFile( const std::string& i_rPath, const VBytes& i_rBytes )
  {
    std::ofstream Stream( i_rPath, std::ios::binary | std::ios::trunc );
    Stream.write( reinterpret_cast< const char* >( i_rBytes.data() ),
                  static_cast< std::streamsize >( i_rBytes.size() ) );
    return static_cast< bool >( Stream );
  }

  VBytes ReadFile( const std::string& i_rPath )
  {
    std::ifstream Stream( i_rPath, std::ios::binary );
    return VBytes( std::istreambuf_iterator< char >( Stream ), std::istreambuf_iterator< char >() );
  }
} // namespace LumekVideoTest
