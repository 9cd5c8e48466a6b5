#include "AviTestSupport.h"

#include "services/ILogCategorised.h"

#include <algorithm>
#include <cstring>

namespace AviTest
{
  namespace
  {
    constexpr std::uint8_t s_SubFormatPCM[16] = { 0x01, 0x00, 0x00, 0x00, 0x00, 0x00, 0x10, 0x00,
                                                  0x80, 0x00, 0x00, 0xAA, 0x00, 0x38, 0x9B, 0x71 };

    struct VMoviContents
    {
      VBytes Bytes;
      // Absolute payload positions and sizes of the video chunks, in order.
      std::vector< std::pair< std::uint64_t, std::uint64_t > > Video;
      std::vector< std::pair< std::uint64_t, std::uint64_t > > Audio;
    };

    // The chunks of one movi list whose list header starts at i_ListPosition.
    VMoviContents MoviChunks( std::uint64_t i_ListPosition, const VBytes& i_rLeading,
                              const std::vector< VBytes >& i_rFrames, const std::vector< VBytes >& i_rAudio )
    {
      VMoviContents Contents;
      Contents.Bytes = i_rLeading;
      const std::uint64_t DataStart = i_ListPosition + 12;
      for( std::size_t i = 0; i < std::max( i_rFrames.size(), i_rAudio.size() ); ++i )
      {
        if( i < i_rFrames.size() )
        {
          Contents.Video.emplace_back( DataStart + Contents.Bytes.size() + 8, i_rFrames[i].size() );
          const VBytes Video = Chunk( "00dc", i_rFrames[i] );
          Contents.Bytes.insert( Contents.Bytes.end(), Video.begin(), Video.end() );
        }
        if( i < i_rAudio.size() )
        {
          Contents.Audio.emplace_back( DataStart + Contents.Bytes.size() + 8, i_rAudio[i].size() );
          const VBytes Audio = Chunk( "01wb", i_rAudio[i] );
          Contents.Bytes.insert( Contents.Bytes.end(), Audio.begin(), Audio.end() );
        }
      }
      return Contents;
    }

    VBytes StandardIndex( const std::vector< std::pair< std::uint64_t, std::uint64_t > >& i_rEntries,
                          std::size_t i_Count, std::uint64_t i_Base )
    {
      VBytes Payload;
      AppendLE( Payload, 2, 2 );
      AppendLE( Payload, 0, 1 );
      AppendLE( Payload, 1, 1 );
      AppendLE( Payload, i_Count, 4 );
      AppendText( Payload, "00dc" );
      AppendLE( Payload, i_Base, 8 );
      AppendLE( Payload, 0, 4 );
      for( std::size_t i = 0; i < i_Count; ++i )
      {
        AppendLE( Payload, i_rEntries[i].first - i_Base, 4 );
        AppendLE( Payload, i_rEntries[i].second, 4 );
      }
      return Chunk( "ix00", Payload );
    }
  } // namespace

  void AppendLE( VBytes& io_rBytes, std::uint64_t i_Value, int i_Width )
  {
    for( int i = 0; i < i_Width; ++i )
      io_rBytes.push_back( static_cast< std::uint8_t >( i_Value >> ( 8 * i ) ) );
  }

  void AppendText( VBytes& io_rBytes, const std::string& i_rText )
  {
    io_rBytes.insert( io_rBytes.end(), i_rText.begin(), i_rText.end() );
  }

  VBytes Join( const std::vector< VBytes >& i_rParts )
  {
    VBytes Bytes;
    for( const VBytes& rPart : i_rParts )
      Bytes.insert( Bytes.end(), rPart.begin(), rPart.end() );
    return Bytes;
  }

  VBytes Chunk( const std::string& i_rId, const VBytes& i_rPayload )
  {
    VBytes Bytes;
    AppendText( Bytes, i_rId );
    AppendLE( Bytes, i_rPayload.size(), 4 );
    Bytes.insert( Bytes.end(), i_rPayload.begin(), i_rPayload.end() );
    if( i_rPayload.size() % 2 != 0 )
      Bytes.push_back( 0 );
    return Bytes;
  }

  VBytes List( const std::string& i_rType, const std::vector< VBytes >& i_rChildren )
  {
    VBytes Payload;
    AppendText( Payload, i_rType );
    const VBytes Children = Join( i_rChildren );
    Payload.insert( Payload.end(), Children.begin(), Children.end() );
    return Chunk( "LIST", Payload );
  }

  VBytes Riff( const std::string& i_rForm, const std::vector< VBytes >& i_rChildren )
  {
    VBytes Bytes = List( i_rForm, i_rChildren );
    std::memcpy( Bytes.data(), "RIFF", 4 );
    return Bytes;
  }

  VBytes MainHeader( std::uint32_t i_MicrosecondsPerFrame, std::uint32_t i_Width, std::uint32_t i_Height )
  {
    VBytes Payload( 56, 0 );
    VBytes Fields;
    AppendLE( Fields, i_MicrosecondsPerFrame, 4 );
    std::copy( Fields.begin(), Fields.end(), Payload.begin() );
    Fields.clear();
    AppendLE( Fields, i_Width, 4 );
    AppendLE( Fields, i_Height, 4 );
    std::copy( Fields.begin(), Fields.end(), Payload.begin() + 32 );
    return Chunk( "avih", Payload );
  }

  VBytes StreamHeader( const std::string& i_rType, std::uint32_t i_Scale, std::uint32_t i_Rate )
  {
    VBytes Payload;
    AppendText( Payload, i_rType );
    Payload.resize( 20, 0 );
    AppendLE( Payload, i_Scale, 4 );
    AppendLE( Payload, i_Rate, 4 );
    Payload.resize( 56, 0 );
    return Chunk( "strh", Payload );
  }

  VBytes BitmapFormat( std::int32_t i_Width, std::int32_t i_Height, std::uint16_t i_Bits, std::uint32_t i_Compression )
  {
    VBytes Payload;
    AppendLE( Payload, 40, 4 );
    AppendLE( Payload, static_cast< std::uint32_t >( i_Width ), 4 );
    AppendLE( Payload, static_cast< std::uint32_t >( i_Height ), 4 );
    AppendLE( Payload, 1, 2 );
    AppendLE( Payload, i_Bits, 2 );
    AppendLE( Payload, i_Compression, 4 );
    Payload.resize( 40, 0 );
    return Chunk( "strf", Payload );
  }

  VBytes WaveFormat( std::uint16_t i_Tag, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    VBytes Payload;
    AppendLE( Payload, i_Tag, 2 );
    AppendLE( Payload, i_Channels, 2 );
    AppendLE( Payload, i_Rate, 4 );
    AppendLE( Payload, i_Rate * i_Channels * i_Bits / 8, 4 );
    AppendLE( Payload, i_Channels * i_Bits / 8, 2 );
    AppendLE( Payload, i_Bits, 2 );
    // 16 bytes, as ffmpeg writes plain PCM.
    return Chunk( "strf", Payload );
  }

  VBytes ExtensibleWaveFormat( bool i_bFloat, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    const VBytes Plain = WaveFormat( 0xFFFE, i_Channels, i_Rate, i_Bits );
    VBytes Payload( Plain.begin() + 8, Plain.end() );
    AppendLE( Payload, 22, 2 );
    AppendLE( Payload, i_Bits, 2 );
    AppendLE( Payload, i_Channels == 2 ? 3 : 4, 4 );
    VBytes SubFormat( std::begin( s_SubFormatPCM ), std::end( s_SubFormatPCM ) );
    if( i_bFloat )
      SubFormat[0] = 3;
    Payload.insert( Payload.end(), SubFormat.begin(), SubFormat.end() );
    return Chunk( "strf", Payload );
  }

  VBytes Creator( std::size_t i_Length )
  {
    VBytes Payload( i_Length, 'x' );
    Payload.back() = 0;
    return Chunk( "ISFT", Payload );
  }

  VBytes Frame( std::size_t i_Size, std::uint8_t i_Value )
  {
    return VBytes( i_Size, i_Value );
  }

  VAviSpec GreySpec( int i_Frames )
  {
    VAviSpec Spec;
    for( int i = 0; i < i_Frames; ++i )
      Spec.Frames.push_back( Frame( 32, static_cast< std::uint8_t >( i + 1 ) ) );
    Spec.OldIndexFrames = i_Frames;
    return Spec;
  }

  VBytes BuildAvi( const VAviSpec& i_rSpec )
  {
    VBytes VideoFormat = BitmapFormat( static_cast< std::int32_t >( i_rSpec.Width ), i_rSpec.StrfHeight, i_rSpec.Bits,
                                       i_rSpec.Compression );
    if( !i_rSpec.Palette.empty() )
    {
      VBytes Payload( VideoFormat.begin() + 8, VideoFormat.end() );
      Payload.insert( Payload.end(), i_rSpec.Palette.begin(), i_rSpec.Palette.end() );
      VideoFormat = Chunk( "strf", Payload );
    }
    std::vector< VBytes > StreamLists = {
        List( "strl", { StreamHeader( "vids", i_rSpec.Scale, i_rSpec.Rate ), VideoFormat } ) };
    if( !i_rSpec.AudioFormat.empty() )
      StreamLists.push_back( List( "strl", { StreamHeader( "auds", 1, 48000 ), i_rSpec.AudioFormat } ) );
    std::vector< VBytes > HeaderChildren = {
        MainHeader( i_rSpec.MicrosecondsPerFrame, i_rSpec.Width, i_rSpec.Height ) };
    HeaderChildren.insert( HeaderChildren.end(), StreamLists.begin(), StreamLists.end() );
    HeaderChildren.push_back( i_rSpec.ExtraHeaderChunks );
    const VBytes Header = List( "hdrl", HeaderChildren );

    const std::uint64_t MoviPosition = 12 + Header.size();
    VMoviContents Movi = MoviChunks( MoviPosition, i_rSpec.ExtraMoviChunks, i_rSpec.Frames, i_rSpec.AudioChunks );
    if( i_rSpec.StandardIndexFrames >= 0 )
    {
      const VBytes Index =
          StandardIndex( Movi.Video, static_cast< std::size_t >( i_rSpec.StandardIndexFrames ), MoviPosition + 8 );
      Movi.Bytes.insert( Movi.Bytes.end(), Index.begin(), Index.end() );
    }
    std::vector< VBytes > Parts = { Header, List( "movi", { Movi.Bytes } ) };
    if( i_rSpec.OldIndexFrames >= 0 )
    {
      // Offsets count from the movi FourCC to each chunk's header.
      const std::uint64_t Origin = MoviPosition + 8;
      VBytes Entries;
      auto Add = [&]( const char* pId, const std::pair< std::uint64_t, std::uint64_t >& rEntry )
      {
        AppendText( Entries, pId );
        AppendLE( Entries, 0x10, 4 );
        AppendLE( Entries, rEntry.first - 8 - Origin, 4 );
        AppendLE( Entries, rEntry.second, 4 );
      };
      for( int i = 0; i < i_rSpec.OldIndexFrames && i < static_cast< int >( Movi.Video.size() ); ++i )
        Add( "00dc", Movi.Video[static_cast< std::size_t >( i )] );
      for( const auto& rAudio : Movi.Audio )
        Add( "01wb", rAudio );
      Parts.push_back( Chunk( "idx1", Entries ) );
    }
    VBytes File = Riff( "AVI ", Parts );
    if( !i_rSpec.ExtendedFrames.empty() )
    {
      const std::uint64_t ListPosition = File.size() + 12;
      VMoviContents Extended = MoviChunks( ListPosition, {}, i_rSpec.ExtendedFrames, {} );
      const VBytes Index = StandardIndex( Extended.Video, Extended.Video.size(), ListPosition );
      Extended.Bytes.insert( Extended.Bytes.end(), Index.begin(), Index.end() );
      const VBytes Part = Riff( "AVIX", { List( "movi", { Extended.Bytes } ) } );
      File.insert( File.end(), Part.begin(), Part.end() );
    }
    File.insert( File.end(), i_rSpec.Trailer.begin(), i_rSpec.Trailer.end() );
    return File;
  }

  VOpenedAvi OpenAvi( const VBytes& i_rBytes )
  {
    VOpenedAvi Opened;
    Opened.pBytes = std::make_shared< VBytes >( i_rBytes );
    Opened.pReader = std::make_shared< RapidAVI::VRapidAVIReader >();
    Opened.bOpened = Opened.pReader->Open(
        std::make_shared< UtilsIO::VMemoryInputStream >( Opened.pBytes->data(), Opened.pBytes->size() ) );
    return Opened;
  }

  VBytes ReadVideo( RapidAVI::VRapidAVIReader& io_rReader, std::uint64_t i_Frame )
  {
    std::shared_ptr< ZOL::IBuffer > pVideo;
    ZOL::IAudioBuffers Audio;
    if( !io_rReader.ReadFrameData( i_Frame, pVideo, Audio, true, false ) || !pVideo )
      return {};
    return VBytes( pVideo->GetData(), pVideo->GetData() + pVideo->GetSize() );
  }

  VLogCapture::VLogCapture() : m_pRecords( std::make_shared< std::vector< ZOL::ILogRecord > >() )
  {
    auto pRecords = m_pRecords;
    m_Handle = ZOL::GlobalLog().AddSink(
        [pRecords]( const ZOL::ILogRecord& rRecord ) { pRecords->push_back( rRecord ); }, ZOL::LogDetail );
  }

  VLogCapture::~VLogCapture()
  {
    ZOL::GlobalLog().RemoveSink( m_Handle );
  }

  bool VLogCapture::Contains( const std::string& i_rText ) const
  {
    return std::any_of( m_pRecords->begin(), m_pRecords->end(),
                        [&]( const ZOL::ILogRecord& rRecord ) { return rRecord.Message == i_rText; } );
  }
} // namespace AviTest
