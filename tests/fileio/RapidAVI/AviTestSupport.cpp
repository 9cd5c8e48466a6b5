#include "AviTestSupport.h"

#include <algorithm>

namespace AviTest
{
  namespace
  {
    // Absolute payload positions and sizes of chunks, in order.
    using VEntries = std::vector< std::pair< std::uint64_t, std::uint64_t > >;

    // The chunks of one movi list whose list header starts at i_ListPosition, frames and audio
    // in turn; the positions of each kind go to o_rVideo and o_rAudio.
    VBytes MoviChunks( std::uint64_t i_ListPosition, const VBytes& i_rLeading, const std::vector< VBytes >& i_rFrames,
                       const std::vector< VBytes >& i_rAudio, VEntries& o_rVideo, VEntries& o_rAudio )
    {
      VLE Chunks;
      Chunks.Append( i_rLeading );
      const auto Add = [&]( const char* pId, const VBytes& rPayload, VEntries& rEntries )
      {
        rEntries.emplace_back( i_ListPosition + 12 + Chunks.Bytes.size() + 8, rPayload.size() );
        Chunks.Append( Chunk( pId, rPayload ) );
      };
      for( std::size_t i = 0; i < std::max( i_rFrames.size(), i_rAudio.size() ); ++i )
      {
        if( i < i_rFrames.size() )
          Add( "00dc", i_rFrames[i], o_rVideo );
        if( i < i_rAudio.size() )
          Add( "01wb", i_rAudio[i], o_rAudio );
      }
      return Chunks.Bytes;
    }

    // An ix00 of four-byte entries, of the first i_Count chunks.
    VBytes StandardIndex( const VEntries& i_rEntries, std::size_t i_Count, std::uint64_t i_Base )
    {
      VLE Payload;
      Payload.U32( 0x01000002 ).U32( i_Count ).Text( "00dc" ).U( i_Base, 8 ).U32( 0 );
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
    return VLE().Text( i_rId ).U32( i_rPayload.size() ).Append( i_rPayload ).Zeros( i_rPayload.size() % 2 ).Bytes;
  }

  VBytes List( const std::string& i_rType, const std::vector< VBytes >& i_rChildren, const std::string& i_rId )
  {
    VLE Payload;
    Payload.Text( i_rType );
    for( const VBytes& rChild : i_rChildren )
      Payload.Append( rChild );
    return Chunk( i_rId, Payload.Bytes );
  }

  VBytes WaveFormat( std::uint16_t i_Tag, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    const int Group = i_Channels * i_Bits / 8;
    return Chunk(
        "strf",
        VLE().U16( i_Tag ).U16( i_Channels ).U32( i_Rate ).U32( i_Rate * Group ).U16( Group ).U16( i_Bits ).Bytes );
  }

  VAviSpec GreySpec( int i_Frames )
  {
    VAviSpec Spec;
    for( int i = 0; i < i_Frames; ++i )
      Spec.Frames.push_back( Frame( 32, static_cast< std::uint8_t >( i + 1 ) ) );
    Spec.OldIndexFrames = i_Frames;
    return Spec;
  }

  VBytes BuildAvi( const VAviSpec& s )
  {
    const auto StreamHeader = []( const char* pType, std::uint32_t i_Scale, std::uint32_t i_Rate )
    { return Chunk( "strh", VLE().Text( pType ).Zeros( 16 ).U32( i_Scale ).U32( i_Rate ).Zeros( 28 ).Bytes ); };
    VLE Bitmap;
    Bitmap.U32( 40 ).U32( s.Width ).U32( static_cast< std::uint32_t >( s.StrfHeight ) ).U16( 1 ).U16( s.Bits );
    Bitmap.U32( s.Compression ).Zeros( 20 );
    const VBytes MainHeader =
        VLE().U32( s.MicrosecondsPerFrame ).Zeros( 28 ).U32( s.Width ).U32( s.Height ).Zeros( 16 ).Bytes;
    std::vector< VBytes > HeaderChildren = {
        Chunk( "avih", MainHeader ),
        List( "strl", { StreamHeader( "vids", s.Scale, s.Rate ), Chunk( "strf", Bitmap.Bytes ) } ) };
    if( !s.AudioFormat.empty() )
      HeaderChildren.push_back( List( "strl", { StreamHeader( "auds", 1, 48000 ), s.AudioFormat } ) );
    HeaderChildren.push_back( s.ExtraHeaderChunks );
    const VBytes Header = List( "hdrl", HeaderChildren );

    const std::uint64_t MoviPosition = 12 + Header.size();
    VEntries Video, Audio;
    VLE Movi{ MoviChunks( MoviPosition, s.ExtraMoviChunks, s.Frames, s.AudioChunks, Video, Audio ) };
    if( s.StandardIndexFrames >= 0 )
      Movi.Append( StandardIndex( Video, std::size_t( s.StandardIndexFrames ), MoviPosition + 8 ) );
    std::vector< VBytes > Parts = { Header, List( "movi", { Movi.Bytes } ) };
    if( s.OldIndexFrames >= 0 )
    {
      // Offsets count from the movi FourCC to each chunk's header.
      VLE Entries;
      const auto Add = [&]( const char* pId, const std::pair< std::uint64_t, std::uint64_t >& rEntry )
      { Entries.Text( pId ).U32( 0x10 ).U32( rEntry.first - 8 - ( MoviPosition + 8 ) ).U32( rEntry.second ); };
      for( std::size_t i = 0; i < std::min( std::size_t( s.OldIndexFrames ), Video.size() ); ++i )
        Add( "00dc", Video[i] );
      for( const auto& rAudio : Audio )
        Add( "01wb", rAudio );
      Parts.push_back( Chunk( "idx1", Entries.Bytes ) );
    }
    VLE File{ Riff( "AVI ", Parts ) };
    if( !s.ExtendedFrames.empty() )
    {
      const std::uint64_t ListPosition = File.Bytes.size() + 12;
      VEntries Extended, None;
      VLE Chunks{ MoviChunks( ListPosition, {}, s.ExtendedFrames, {}, Extended, None ) };
      Chunks.Append( StandardIndex( Extended, Extended.size(), ListPosition ) );
      File.Append( Riff( "AVIX", { List( "movi", { Chunks.Bytes } ) } ) );
    }
    return File.Append( s.Trailer ).Bytes;
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
    VOpenedAvi Opened{ std::make_shared< VBytes >( i_rBytes ), std::make_shared< RapidAVI::VRapidAVIReader >() };
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

  std::string FfmpegAvi( const std::string& i_rName, const std::string& i_rArguments )
  {
    if( !LumekTest::HaveFfmpeg() )
      return {};
    return LumekTest::FfmpegFixture(
        i_rName, ContainerTest::Words( "-f lavfi -i testsrc2=size=64x48:rate=25 " + i_rArguments ) );
  }
} // namespace AviTest
