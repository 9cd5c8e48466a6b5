#include "AviTestSupport.h"

#include "tests/support/FfmpegFixtures.h"
#include "utils/MemoryStream.h"

#include <algorithm>
#include <fstream>
#include <iterator>

namespace AviTest
{
  namespace
  {
    using VEntries = std::vector< std::pair< std::uint64_t, std::uint64_t > >;

    struct VMoviContents
    {
      VLE Chunks;
      // Absolute payload positions and sizes of the chunks, in order.
      VEntries Video;
      VEntries Audio;
    };

    // The chunks of one movi list whose list header starts at i_ListPosition.
    VMoviContents MoviChunks( std::uint64_t i_ListPosition, const VBytes& i_rLeading,
                              const std::vector< VBytes >& i_rFrames, const std::vector< VBytes >& i_rAudio )
    {
      VMoviContents Contents;
      Contents.Chunks.Append( i_rLeading );
      const auto Add = [&]( const char* pId, const VBytes& rPayload, VEntries& rEntries )
      {
        rEntries.emplace_back( i_ListPosition + 12 + Contents.Chunks.Bytes.size() + 8, rPayload.size() );
        Contents.Chunks.Append( Chunk( pId, rPayload ) );
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

    // An ix00 of four-byte entries, of chunks.
    VBytes StandardIndex( const VEntries& i_rEntries, std::size_t i_Count, std::uint64_t i_Base )
    {
      VLE Payload;
      Payload.U32( 0x01000002 ).U32( i_Count ).Text( "00dc" ).U64( i_Base ).U32( 0 );
      for( std::size_t i = 0; i < i_Count; ++i )
        Payload.U32( i_rEntries[i].first - i_Base ).U32( i_rEntries[i].second );
      return Chunk( "ix00", Payload.Bytes );
    }
  } // namespace

  VLE& VLE::U( std::uint64_t i_Value, int i_Width )
  {
    for( int i = 0; i < i_Width; ++i )
      Bytes.push_back( static_cast< std::uint8_t >( i_Value >> ( 8 * i ) ) );
    return *this;
  }

  VLE& VLE::Append( const VBytes& i_rBytes )
  {
    Bytes.insert( Bytes.end(), i_rBytes.begin(), i_rBytes.end() );
    return *this;
  }

  VBytes Chunk( const std::string& i_rId, const VBytes& i_rPayload )
  {
    VLE Bytes;
    Bytes.Text( i_rId ).U32( i_rPayload.size() ).Append( i_rPayload ).Zeros( i_rPayload.size() % 2 );
    return Bytes.Bytes;
  }

  VBytes List( const std::string& i_rType, const std::vector< VBytes >& i_rChildren, const std::string& i_rId )
  {
    VLE Payload;
    Payload.Text( i_rType );
    for( const VBytes& rChild : i_rChildren )
      Payload.Append( rChild );
    return Chunk( i_rId, Payload.Bytes );
  }

  VBytes StreamHeader( const std::string& i_rType, std::uint32_t i_Scale, std::uint32_t i_Rate )
  {
    return Chunk( "strh", VLE().Text( i_rType ).Zeros( 16 ).U32( i_Scale ).U32( i_Rate ).Zeros( 28 ).Bytes );
  }

  VBytes WaveFormat( std::uint16_t i_Tag, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    // 16 bytes, as ffmpeg writes plain PCM.
    const int Group = i_Channels * i_Bits / 8;
    return Chunk(
        "strf",
        VLE().U16( i_Tag ).U16( i_Channels ).U32( i_Rate ).U32( i_Rate * Group ).U16( Group ).U16( i_Bits ).Bytes );
  }

  VBytes ExtensibleWaveFormat( bool i_bFloat, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    const VBytes Plain = WaveFormat( 0xFFFE, i_Channels, i_Rate, i_Bits );
    VLE Payload;
    Payload.Append( VBytes( Plain.begin() + 8, Plain.end() ) ).U16( 22 ).U16( i_Bits ).U32( i_Channels == 2 ? 3 : 4 );
    // KSDATAFORMAT_SUBTYPE_PCM, or _IEEE_FLOAT by its first field.
    Payload.U32( i_bFloat ? 3 : 1 ).U16( 0 ).U16( 0x10 ).U32( 0xAA000080 ).U32( 0x719B3800 );
    return Chunk( "strf", Payload.Bytes );
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
    VLE Bitmap;
    Bitmap.U32( 40 ).U32( i_rSpec.Width ).U32( static_cast< std::uint32_t >( i_rSpec.StrfHeight ) ).U16( 1 );
    Bitmap.U16( i_rSpec.Bits ).U32( i_rSpec.Compression ).Zeros( 20 ).Append( i_rSpec.Palette );
    VLE MainHeader;
    MainHeader.U32( i_rSpec.MicrosecondsPerFrame ).Zeros( 28 ).U32( i_rSpec.Width ).U32( i_rSpec.Height ).Zeros( 16 );
    std::vector< VBytes > HeaderChildren = {
        Chunk( "avih", MainHeader.Bytes ),
        List( "strl", { StreamHeader( "vids", i_rSpec.Scale, i_rSpec.Rate ), Chunk( "strf", Bitmap.Bytes ) } ) };
    if( !i_rSpec.AudioFormat.empty() )
      HeaderChildren.push_back( List( "strl", { StreamHeader( "auds", 1, 48000 ), i_rSpec.AudioFormat } ) );
    HeaderChildren.push_back( i_rSpec.ExtraHeaderChunks );
    const VBytes Header = List( "hdrl", HeaderChildren );

    const std::uint64_t MoviPosition = 12 + Header.size();
    VMoviContents Movi = MoviChunks( MoviPosition, i_rSpec.ExtraMoviChunks, i_rSpec.Frames, i_rSpec.AudioChunks );
    if( i_rSpec.StandardIndexFrames >= 0 )
      Movi.Chunks.Append( StandardIndex( Movi.Video, std::size_t( i_rSpec.StandardIndexFrames ), MoviPosition + 8 ) );
    std::vector< VBytes > Parts = { Header, List( "movi", { Movi.Chunks.Bytes } ) };
    if( i_rSpec.OldIndexFrames >= 0 )
    {
      // Offsets count from the movi FourCC to each chunk's header.
      VLE Entries;
      const auto Add = [&]( const char* pId, const std::pair< std::uint64_t, std::uint64_t >& rEntry )
      { Entries.Text( pId ).U32( 0x10 ).U32( rEntry.first - 8 - ( MoviPosition + 8 ) ).U32( rEntry.second ); };
      for( std::size_t i = 0; i < std::min( std::size_t( i_rSpec.OldIndexFrames ), Movi.Video.size() ); ++i )
        Add( "00dc", Movi.Video[i] );
      for( const auto& rAudio : Movi.Audio )
        Add( "01wb", rAudio );
      Parts.push_back( Chunk( "idx1", Entries.Bytes ) );
    }
    VBytes File = Riff( "AVI ", Parts );
    if( !i_rSpec.ExtendedFrames.empty() )
    {
      const std::uint64_t ListPosition = File.size() + 12;
      VMoviContents Extended = MoviChunks( ListPosition, {}, i_rSpec.ExtendedFrames, {} );
      Extended.Chunks.Append( StandardIndex( Extended.Video, Extended.Video.size(), ListPosition ) );
      const VBytes Part = Riff( "AVIX", { List( "movi", { Extended.Chunks.Bytes } ) } );
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

  VBytes ReadVideo( RapidAVI::VRapidAVIReader& io_rReader, std::uint64_t i_Frame, bool i_bDecode )
  {
    ZOL::IVideoFrame Frame;
    ZOL::IAudioBuffers Audio;
    if( !( i_bDecode ? io_rReader.ReadFrame( i_Frame, Frame, true, false )
                     : io_rReader.ReadFrameData( i_Frame, Frame.Video, Audio, true, false ) ) ||
        !Frame.Video )
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
