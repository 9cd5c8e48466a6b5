#include "AviTestSupport.h"

#include "tests/support/FfmpegFixtures.h"
#include "utils/MemoryStream.h"

#include <algorithm>
#include <cstring>
#include <fstream>
#include <iterator>

namespace AviTest
{
  namespace
  {
    using VEntries = std::vector< std::pair< std::uint64_t, std::uint64_t > >;

    struct VMoviContents
    {
      VBytes Bytes;
      // Absolute payload positions and sizes of the chunks, in order.
      VEntries Video;
      VEntries Audio;
    };

    // The chunks of one movi list whose list header starts at i_ListPosition.
    VMoviContents MoviChunks( std::uint64_t i_ListPosition, const VBytes& i_rLeading,
                              const std::vector< VBytes >& i_rFrames, const std::vector< VBytes >& i_rAudio )
    {
      VMoviContents Contents{ i_rLeading, {}, {} };
      const auto Add = [&]( const char* pId, const VBytes& rPayload, VEntries& rEntries )
      {
        rEntries.emplace_back( i_ListPosition + 12 + Contents.Bytes.size() + 8, rPayload.size() );
        const VBytes Bytes = Chunk( pId, rPayload );
        Contents.Bytes.insert( Contents.Bytes.end(), Bytes.begin(), Bytes.end() );
      };
      for( std::size_t i = 0; i < std::max( i_rFrames.size(), i_rAudio.size() ); ++i )
      {
        if( i < i_rFrames.size() )
          Add( "00dc", i_rFrames[i], Contents.Video );
        if( i < i_rAudio.size() )
          Add( "01wb", i_rAudio[i], Contents.Audio );
      }
      return Contents;
    }

    VBytes StandardIndex( const VEntries& i_rEntries, std::size_t i_Count, std::uint64_t i_Base )
    {
      VBytes Payload;
      AppendLE( Payload, 0x01000002, 4 ); // four-byte entries, of chunks
      AppendLE( Payload, i_Count, 4 );
      const VBytes Id = Text( "00dc" );
      Payload.insert( Payload.end(), Id.begin(), Id.end() );
      AppendLE( Payload, i_Base, 8 );
      AppendLE( Payload, 0, 4 );
      for( std::size_t i = 0; i < i_Count; ++i )
      {
        AppendLE( Payload, i_rEntries[i].first - i_Base, 4 );
        AppendLE( Payload, i_rEntries[i].second, 4 );
      }
      return Chunk( "ix00", Payload );
    }

    // A payload of i_Size bytes with these little-endian fields at their offsets.
    VBytes Fields( std::size_t i_Size, const std::vector< std::pair< std::size_t, std::uint64_t > >& i_rFields,
                   int i_Width = 4 )
    {
      VBytes Payload( i_Size, 0 );
      for( const auto& rField : i_rFields )
        for( int i = 0; i < i_Width; ++i )
          Payload[rField.first + static_cast< std::size_t >( i )] =
              static_cast< std::uint8_t >( rField.second >> ( 8 * i ) );
      return Payload;
    }
  } // namespace

  void AppendLE( VBytes& io_rBytes, std::uint64_t i_Value, int i_Width )
  {
    for( int i = 0; i < i_Width; ++i )
      io_rBytes.push_back( static_cast< std::uint8_t >( i_Value >> ( 8 * i ) ) );
  }

  VBytes Text( const std::string& i_rText )
  {
    return VBytes( i_rText.begin(), i_rText.end() );
  }

  VBytes Chunk( const std::string& i_rId, const VBytes& i_rPayload )
  {
    VBytes Bytes = Text( i_rId );
    AppendLE( Bytes, i_rPayload.size(), 4 );
    Bytes.insert( Bytes.end(), i_rPayload.begin(), i_rPayload.end() );
    if( i_rPayload.size() % 2 != 0 )
      Bytes.push_back( 0 );
    return Bytes;
  }

  VBytes List( const std::string& i_rType, const std::vector< VBytes >& i_rChildren )
  {
    VBytes Payload = Text( i_rType );
    for( const VBytes& rChild : i_rChildren )
      Payload.insert( Payload.end(), rChild.begin(), rChild.end() );
    return Chunk( "LIST", Payload );
  }

  VBytes Riff( const std::string& i_rForm, const std::vector< VBytes >& i_rChildren )
  {
    VBytes Bytes = List( i_rForm, i_rChildren );
    std::memcpy( Bytes.data(), "RIFF", 4 );
    return Bytes;
  }

  VBytes StreamHeader( const std::string& i_rType, std::uint32_t i_Scale, std::uint32_t i_Rate )
  {
    VBytes Payload = Fields( 56, { { 20, i_Scale }, { 24, i_Rate } } );
    std::copy( i_rType.begin(), i_rType.end(), Payload.begin() );
    return Chunk( "strh", Payload );
  }

  VBytes WaveFormat( std::uint16_t i_Tag, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    // 16 bytes, as ffmpeg writes plain PCM.
    VBytes Payload;
    AppendLE( Payload, i_Tag, 2 );
    AppendLE( Payload, i_Channels, 2 );
    AppendLE( Payload, i_Rate, 4 );
    AppendLE( Payload, i_Rate * i_Channels * i_Bits / 8, 4 );
    AppendLE( Payload, i_Channels * i_Bits / 8, 2 );
    AppendLE( Payload, i_Bits, 2 );
    return Chunk( "strf", Payload );
  }

  VBytes ExtensibleWaveFormat( bool i_bFloat, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    const VBytes Plain = WaveFormat( 0xFFFE, i_Channels, i_Rate, i_Bits );
    VBytes Payload( Plain.begin() + 8, Plain.end() );
    AppendLE( Payload, 22, 2 );
    AppendLE( Payload, i_Bits, 2 );
    AppendLE( Payload, i_Channels == 2 ? 3 : 4, 4 );
    // KSDATAFORMAT_SUBTYPE_PCM, or _IEEE_FLOAT by its first byte.
    Payload.insert( Payload.end(), { std::uint8_t( i_bFloat ? 3 : 1 ), 0x00, 0x00, 0x00, 0x00, 0x00, 0x10, 0x00, 0x80,
                                     0x00, 0x00, 0xAA, 0x00, 0x38, 0x9B, 0x71 } );
    return Chunk( "strf", Payload );
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
    VBytes Bitmap = Fields( 40, { { 0, 40 },
                                  { 4, i_rSpec.Width },
                                  { 8, static_cast< std::uint32_t >( i_rSpec.StrfHeight ) },
                                  { 12, 1u | ( std::uint32_t( i_rSpec.Bits ) << 16 ) },
                                  { 16, i_rSpec.Compression } } );
    Bitmap.insert( Bitmap.end(), i_rSpec.Palette.begin(), i_rSpec.Palette.end() );
    std::vector< VBytes > HeaderChildren = {
        Chunk( "avih",
               Fields( 56, { { 0, i_rSpec.MicrosecondsPerFrame }, { 32, i_rSpec.Width }, { 36, i_rSpec.Height } } ) ),
        List( "strl", { StreamHeader( "vids", i_rSpec.Scale, i_rSpec.Rate ), Chunk( "strf", Bitmap ) } ) };
    if( !i_rSpec.AudioFormat.empty() )
      HeaderChildren.push_back( List( "strl", { StreamHeader( "auds", 1, 48000 ), i_rSpec.AudioFormat } ) );
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
      VBytes Entries;
      const auto Add = [&]( const char* pId, const std::pair< std::uint64_t, std::uint64_t >& rEntry )
      {
        const VBytes Id = Text( pId );
        Entries.insert( Entries.end(), Id.begin(), Id.end() );
        AppendLE( Entries, 0x10, 4 );
        AppendLE( Entries, rEntry.first - 8 - ( MoviPosition + 8 ), 4 );
        AppendLE( Entries, rEntry.second, 4 );
      };
      for( std::size_t i = 0; i < std::min( std::size_t( i_rSpec.OldIndexFrames ), Movi.Video.size() ); ++i )
        Add( "00dc", Movi.Video[i] );
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

  void Patch( VBytes& io_rFile, const std::string& i_rId, std::size_t i_Offset, std::uint64_t i_Value, int i_Width )
  {
    const auto Found = std::search( io_rFile.begin(), io_rFile.end(), i_rId.begin(), i_rId.end() );
    const std::size_t At = static_cast< std::size_t >( Found - io_rFile.begin() ) + 8 + i_Offset;
    for( int i = 0; i < i_Width; ++i )
      io_rFile.at( At + static_cast< std::size_t >( i ) ) = static_cast< std::uint8_t >( i_Value >> ( 8 * i ) );
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

  VBytes DecodeVideo( RapidAVI::VRapidAVIReader& io_rReader, std::uint64_t i_Frame )
  {
    ZOL::IVideoFrame Frame;
    if( !io_rReader.ReadFrame( i_Frame, Frame, true, false ) || !Frame.Video )
      return {};
    return VBytes( Frame.Video->GetData(), Frame.Video->GetData() + Frame.Video->GetSize() );
  }

  std::string FfmpegAvi( const std::string& i_rName, const std::vector< std::string >& i_rArguments )
  {
    if( !LumekTest::HaveFfmpeg() )
      return {};
    std::vector< std::string > Arguments = { "-f", "lavfi", "-i", "testsrc2=size=64x48:rate=25" };
    Arguments.insert( Arguments.end(), i_rArguments.begin(), i_rArguments.end() );
    return LumekTest::FfmpegFixture( i_rName, Arguments );
  }

  VBytes ReadFile( const std::string& i_rPath )
  {
    std::ifstream Stream( i_rPath, std::ios::binary );
    return VBytes( std::istreambuf_iterator< char >( Stream ), {} );
  }
} // namespace AviTest
