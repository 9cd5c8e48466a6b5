#pragma once

// Hand-built AVI files: RIFF chunks put together byte by byte, so that each case of the chunk
// rules can be made exactly; and the readers of the files ffmpeg makes.

#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "tests/fileio/MovIO/ContainerTestSupport.h"

#include <algorithm>

namespace AviTest
{
  using ContainerTest::VBytes;

  // Little-endian fields, one after another.
  struct VLE
  {
    VLE& U( std::uint64_t i_Value, int i_Width )
    {
      for( int i = 0; i < i_Width; ++i )
        Bytes.push_back( static_cast< std::uint8_t >( i_Value >> ( 8 * i ) ) );
      return *this;
    }
    VLE& U16( std::uint64_t i_Value ) { return U( i_Value, 2 ); }
    VLE& U32( std::uint64_t i_Value ) { return U( i_Value, 4 ); }
    VLE& Text( const std::string& i_rText ) { return Append( VBytes( i_rText.begin(), i_rText.end() ) ); }
    VLE& Zeros( std::size_t i_Count ) { return Append( VBytes( i_Count, 0 ) ); }
    VLE& Append( const VBytes& i_rBytes )
    {
      Bytes.insert( Bytes.end(), i_rBytes.begin(), i_rBytes.end() );
      return *this;
    }
    VBytes Bytes;
  };

  // A chunk with its pad byte when the payload is odd.
  inline VBytes Chunk( const std::string& i_rId, const VBytes& i_rPayload )
  {
    return VLE().Text( i_rId ).U32( i_rPayload.size() ).Append( i_rPayload ).Zeros( i_rPayload.size() % 2 ).Bytes;
  }

  // A LIST, or with i_rId "RIFF" a part of the file.
  inline VBytes List( const std::string& i_rType, const std::vector< VBytes >& i_rChildren,
                      const std::string& i_rId = "LIST" )
  {
    VLE Payload;
    Payload.Text( i_rType );
    for( const VBytes& rChild : i_rChildren )
      Payload.Append( rChild );
    return Chunk( i_rId, Payload.Bytes );
  }

  // Plain PCM's 16 bytes, as ffmpeg writes them.
  inline VBytes WaveFormat( std::uint16_t i_Tag, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits )
  {
    const int Group = i_Channels * i_Bits / 8;
    return Chunk(
        "strf",
        VLE().U16( i_Tag ).U16( i_Channels ).U32( i_Rate ).U32( i_Rate * Group ).U16( Group ).U16( i_Bits ).Bytes );
  }

  struct VAviSpec
  {
    std::uint32_t Width = 8;
    std::uint32_t Height = 4;
    std::uint32_t MicrosecondsPerFrame = 40000;
    std::uint32_t Scale = 1;
    std::uint32_t Rate = 25;
    // strf: compression 0 is BI_RGB.
    std::uint32_t Compression = RapidAVI::MakeFourCC( "Y800" );
    std::uint16_t Bits = 8;
    std::int32_t StrfHeight = -4;
    std::vector< VBytes > Frames;
    std::vector< VBytes > AudioChunks;
    // A whole "strf" chunk for the audio stream; empty for no audio stream.
    VBytes AudioFormat;
    // Entries of idx1 (video first n frames); no idx1 chunk when negative.
    int OldIndexFrames = -1;
    // Entries of an ix00 at the end of movi; none when negative.
    int StandardIndexFrames = -1;
    // Frames of one AVIX part behind the AVI part, with an ix00 of their own.
    std::vector< VBytes > ExtendedFrames;
    VBytes ExtraHeaderChunks; // inside hdrl, behind the stream lists
    VBytes ExtraMoviChunks;   // at the start of movi
    VBytes Trailer;           // behind everything
  };

  // A Y800 file of i_Frames frames of 8 x 4, frame i filled with i + 1, with an idx1 of all.
  inline VAviSpec GreySpec( int i_Frames )
  {
    VAviSpec Spec;
    for( int i = 0; i < i_Frames; ++i )
      Spec.Frames.push_back( VBytes( 32, static_cast< std::uint8_t >( i + 1 ) ) );
    Spec.OldIndexFrames = i_Frames;
    return Spec;
  }

  // Absolute payload positions and sizes of chunks, in order.
  using VEntries = std::vector< std::pair< std::uint64_t, std::uint64_t > >;

  // The chunks of one movi list whose list header starts at i_ListPosition, frames and audio in
  // turn, with an ix00 of the first i_Indexed frames (none when negative) counted from i_Base.
  inline VLE MoviChunks( std::uint64_t i_ListPosition, const VBytes& i_rLeading, const std::vector< VBytes >& i_rFrames,
                         const std::vector< VBytes >& i_rAudio, int i_Indexed, std::uint64_t i_Base, VEntries& o_rVideo,
                         VEntries& o_rAudio )
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
    if( i_Indexed < 0 )
      return Chunks;
    VLE Index;
    Index.U32( 0x01000002 ).U32( i_Indexed ).Text( "00dc" ).U( i_Base, 8 ).U32( 0 );
    for( int i = 0; i < i_Indexed; ++i )
      Index.U32( o_rVideo[i].first - i_Base ).U32( o_rVideo[i].second );
    return Chunks.Append( Chunk( "ix00", Index.Bytes ) );
  }

  inline VBytes BuildAvi( const VAviSpec& s )
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
    const VLE Movi = MoviChunks( MoviPosition, s.ExtraMoviChunks, s.Frames, s.AudioChunks, s.StandardIndexFrames,
                                 MoviPosition + 8, Video, Audio );
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
    VLE File{ List( "AVI ", Parts, "RIFF" ) };
    if( !s.ExtendedFrames.empty() )
    {
      const std::uint64_t ListPosition = File.Bytes.size() + 12;
      VEntries Extended, None;
      const VLE Chunks = MoviChunks( ListPosition, {}, s.ExtendedFrames, {}, int( s.ExtendedFrames.size() ),
                                     ListPosition, Extended, None );
      File.Append( List( "AVIX", { List( "movi", { Chunks.Bytes } ) }, "RIFF" ) );
    }
    return File.Append( s.Trailer ).Bytes;
  }

  // Overwrites i_Width bytes at i_Offset into the payload of the first chunk named i_rId.
  inline void Patch( VBytes& io_rFile, const std::string& i_rId, std::size_t i_Offset, std::uint64_t i_Value,
                     int i_Width )
  {
    const auto Found = std::search( io_rFile.begin(), io_rFile.end(), i_rId.begin(), i_rId.end() );
    const std::size_t At = static_cast< std::size_t >( Found - io_rFile.begin() ) + 8 + i_Offset;
    for( int i = 0; i < i_Width; ++i )
      io_rFile.at( At + static_cast< std::size_t >( i ) ) = static_cast< std::uint8_t >( i_Value >> ( 8 * i ) );
  }

  // Keeps the bytes alive as long as the reader reads them.
  struct VOpenedAvi
  {
    std::shared_ptr< VBytes > pBytes;
    std::shared_ptr< RapidAVI::VRapidAVIReader > pReader;
    bool bOpened = false;
  };

  inline VOpenedAvi OpenAvi( const VBytes& i_rBytes )
  {
    VOpenedAvi Opened{ std::make_shared< VBytes >( i_rBytes ), std::make_shared< RapidAVI::VRapidAVIReader >() };
    Opened.bOpened = Opened.pReader->Open(
        std::make_shared< UtilsIO::VMemoryInputStream >( Opened.pBytes->data(), Opened.pBytes->size() ) );
    return Opened;
  }

  // The stored payload of a frame, or its decoded picture; empty when the read failed.
  inline VBytes ReadVideo( RapidAVI::VRapidAVIReader& io_rReader, std::uint64_t i_Frame, bool i_bDecode = false )
  {
    ZOL::IVideoFrame Frame;
    ZOL::IAudioBuffers Audio;
    if( !( i_bDecode ? io_rReader.ReadFrame( i_Frame, Frame, true, false )
                     : io_rReader.ReadFrameData( i_Frame, Frame.Video, Audio, true, false ) ) ||
        !Frame.Video )
      return {};
    return VBytes( Frame.Video->GetData(), Frame.Video->GetData() + Frame.Video->GetSize() );
  }

  // An AVI of ffmpeg's from testsrc2 at 64 x 48, 25 Hz, with these arguments behind the input;
  // empty when there is no ffmpeg.
  inline std::string FfmpegAvi( const std::string& i_rName, const std::string& i_rArguments )
  {
    if( !LumekTest::HaveFfmpeg() )
      return {};
    return LumekTest::FfmpegFixture(
        i_rName, ContainerTest::Words( "-f lavfi -i testsrc2=size=64x48:rate=25 " + i_rArguments ) );
  }
} // namespace AviTest
