#pragma once

// Hand-built AVI files: RIFF chunks put together byte by byte, so that each case of the chunk
// rules can be made exactly; and the readers of the files ffmpeg makes.

#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "tests/fileio/MovIO/ContainerTestSupport.h"
#include "tests/support/LogCapture.h"

namespace AviTest
{
  using ContainerTest::VBytes;

  // Little-endian fields, one after another.
  struct VLE
  {
    VLE& U( std::uint64_t i_Value, int i_Width );
    VLE& U16( std::uint64_t i_Value ) { return U( i_Value, 2 ); }
    VLE& U32( std::uint64_t i_Value ) { return U( i_Value, 4 ); }
    VLE& Text( const std::string& i_rText ) { return Append( VBytes( i_rText.begin(), i_rText.end() ) ); }
    VLE& Zeros( std::size_t i_Count ) { return Append( VBytes( i_Count, 0 ) ); }
    VLE& Append( const VBytes& i_rBytes );
    VBytes Bytes;
  };

  // A chunk with its pad byte when the payload is odd.
  VBytes Chunk( const std::string& i_rId, const VBytes& i_rPayload );
  VBytes List( const std::string& i_rType, const std::vector< VBytes >& i_rChildren,
               const std::string& i_rId = "LIST" );
  inline VBytes Riff( const std::string& i_rForm, const std::vector< VBytes >& i_rChildren )
  {
    return List( i_rForm, i_rChildren, "RIFF" );
  }
  // Plain PCM's 16 bytes, as ffmpeg writes them.
  VBytes WaveFormat( std::uint16_t i_Tag, std::uint16_t i_Channels, std::uint32_t i_Rate, std::uint16_t i_Bits );

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

  // A frame of i_Size bytes, every byte i_Value.
  inline VBytes Frame( std::size_t i_Size, std::uint8_t i_Value )
  {
    return VBytes( i_Size, i_Value );
  }
  // A Y800 file of i_Frames frames of 8 x 4, frame i filled with i + 1, with an idx1 of all.
  VAviSpec GreySpec( int i_Frames );
  VBytes BuildAvi( const VAviSpec& i_rSpec );
  // Overwrites i_Width bytes at i_Offset into the payload of the first chunk named i_rId.
  void Patch( VBytes& io_rFile, const std::string& i_rId, std::size_t i_Offset, std::uint64_t i_Value, int i_Width );

  // Keeps the bytes alive as long as the reader reads them.
  struct VOpenedAvi
  {
    std::shared_ptr< VBytes > pBytes;
    std::shared_ptr< RapidAVI::VRapidAVIReader > pReader;
    bool bOpened = false;
  };
  VOpenedAvi OpenAvi( const VBytes& i_rBytes );
  // The stored payload of a frame, or its decoded picture; empty when the read failed.
  VBytes ReadVideo( RapidAVI::VRapidAVIReader& io_rReader, std::uint64_t i_Frame, bool i_bDecode = false );

  // An AVI of ffmpeg's from testsrc2 at 64 x 48, 25 Hz, with these arguments behind the input;
  // empty when there is no ffmpeg.
  std::string FfmpegAvi( const std::string& i_rName, const std::string& i_rArguments );
} // namespace AviTest
