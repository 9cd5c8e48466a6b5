// The rules each chunk of the tree is checked by, and the chunks that are not stream headers:
// the lists, the OpenDML headers, the creator and timecode notes, and the metadata chunk.

#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "services/Log.h"

#include <algorithm>
#include <cstring>
#include <iterator>

namespace RapidAVI
{
  namespace
  {
    constexpr std::uint64_t SuperIndexHeaderSize = 24;
    constexpr std::uint64_t SuperIndexEntrySize = 16;
    constexpr std::uint64_t OpenDMLHeaderSize = 248;
    constexpr std::uint64_t CreatorTextLimit = 512;
    constexpr std::uint64_t SMPTETextSize = 12;

    std::size_t CountChildren( const VRiffChunk& i_rChunk, std::uint32_t i_Id, std::uint32_t i_ListType )
    {
      return static_cast< std::size_t >( std::count_if(
          i_rChunk.Children.begin(), i_rChunk.Children.end(),
          [&]( const VRiffChunk& rChild ) { return rChild.Id == i_Id && rChild.ListType == i_ListType; } ) );
    }

    // The text of a chunk up to its first zero byte.
    std::string TextOf( const std::vector< char >& i_rBytes )
    {
      const auto End = std::find( i_rBytes.begin(), i_rBytes.end(), '\0' );
      return std::string( i_rBytes.begin(), End );
    }
  } // namespace

  bool VRapidAVIReader::ParseChunk( const VRiffChunk& i_rChunk )
  {
    // Reading the header again proves the tree against the file once more. A mismatch does not
    // stop the chunk's own checks; it fails the chunk after them.
    std::uint32_t Id = 0;
    std::uint32_t Size = 0;
    std::uint32_t ListType = 0;
    bool bGood = m_pStream->Seek( static_cast< std::int64_t >( i_rChunk.Position ) ) && ZOL::ReadLE( *m_pStream, Id ) &&
                 Id == i_rChunk.Id && ZOL::ReadLE( *m_pStream, Size ) &&
                 Size == static_cast< std::uint32_t >( i_rChunk.Size );
    if( bGood && i_rChunk.ListType != 0 )
      bGood = ZOL::ReadLE( *m_pStream, ListType ) && ListType == i_rChunk.ListType;

    bool bParseChildren = false;
    if( i_rChunk.Id == FourCC::RIFF )
    {
      if( !ParseRiff( i_rChunk, bGood, bParseChildren ) )
        return false;
    }
    else if( i_rChunk.Id == FourCC::LIST )
    {
      if( !ParseList( i_rChunk, bGood, bParseChildren ) )
        return false;
    }
    else
    {
      struct VLeafRule
      {
        std::uint32_t Id;
        bool ( VRapidAVIReader::*Parse )( const VRiffChunk& );
      };
      static constexpr VLeafRule s_LeafRules[] = {
          { FourCC::avih, &VRapidAVIReader::ParseMainHeader },
          { FourCC::strh, &VRapidAVIReader::ParseStreamHeader },
          { FourCC::strf, &VRapidAVIReader::ParseStreamFormat },
          { FourCC::indx, &VRapidAVIReader::ParseSuperIndex },
          { FourCC::dmlh, &VRapidAVIReader::ParseOpenDMLHeader },
          { FourCC::ISFT, &VRapidAVIReader::ParseCreator },
          { FourCC::ISMP, &VRapidAVIReader::ParseSMPTE },
          { FourCC::ix00, &VRapidAVIReader::ParseVideoStandardIndex },
          { FourCC::ix01, &VRapidAVIReader::ParseAudioStandardIndex },
          { FourCC::idx1, &VRapidAVIReader::ParseOldIndex },
          { FourCC::JUNK, &VRapidAVIReader::ParseNothing },
          { FourCC::VideoBits, &VRapidAVIReader::ParseNothing },
          { FourCC::VideoCompressed, &VRapidAVIReader::ParseNothing },
          { FourCC::AudioWave, &VRapidAVIReader::ParseNothing },
      };
      const auto Rule = std::find_if( std::begin( s_LeafRules ), std::end( s_LeafRules ),
                                      [&]( const VLeafRule& rRule ) { return rRule.Id == i_rChunk.Id; } );
      const auto Parse = Rule == std::end( s_LeafRules ) ? &VRapidAVIReader::ParseUnknown : Rule->Parse;
      if( !( this->*Parse )( i_rChunk ) )
        return false;
    }

    if( bParseChildren && bGood )
      for( const VRiffChunk& rChild : i_rChunk.Children )
        if( !ParseChunk( rChild ) )
          return false;
    return bGood;
  }

  bool VRapidAVIReader::ParseRiff( const VRiffChunk& i_rChunk, bool i_bGood, bool& o_rParseChildren )
  {
    // The tree keeps no form type, so it is read again behind the header.
    std::uint32_t Form = 0;
    if( !ZOL::ReadLE( *m_pStream, Form ) )
      return false;
    if( Form == FourCC::AVI )
    {
      if( !i_bGood || CountChildren( i_rChunk, FourCC::LIST, FourCC::hdrl ) != 1 )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
                   "'RIFF' chunk of type AVI must contain exactly one 'LIST-hdlr' chunk." );
        return false;
      }
      o_rParseChildren = true;
    }
    else if( Form == FourCC::AVIX )
    {
      if( !i_bGood || CountChildren( i_rChunk, FourCC::LIST, FourCC::movi ) != 1 )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
                   "'RIFF' chunk of type AVIX must contain exactly one 'LIST-movi' chunk." );
        return false;
      }
      o_rParseChildren = true;
    }
    else if( Form == FourCC::QMDT )
    {
      ParseMetadata();
    }
    return true;
  }

  bool VRapidAVIReader::ParseList( const VRiffChunk& i_rChunk, bool i_bGood, bool& o_rParseChildren )
  {
    switch( i_rChunk.ListType )
    {
    case FourCC::hdrl:
    {
      const std::size_t StreamLists = CountChildren( i_rChunk, FourCC::LIST, FourCC::strl );
      if( !i_bGood || CountChildren( i_rChunk, FourCC::avih, 0 ) != 1 || StreamLists < 1 || StreamLists > 2 )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
                   "'LIST-hdlr' chunk must contain a single 'avih' and either 1 or 2 'LIST-strl' chunks." );
        return false;
      }
      break;
    }
    case FourCC::strl:
      if( !i_bGood || CountChildren( i_rChunk, FourCC::strh, 0 ) != 1 ||
          CountChildren( i_rChunk, FourCC::strf, 0 ) != 1 )
      {
        LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
                   "'LIST-strl' chunk must contain a single 'strh' and a single 'strf' chunk." );
        return false;
      }
      break;
    case FourCC::movi:
    {
      // idx1 counts its offsets from the first of these.
      std::uint64_t Position = 0;
      if( m_pStream->GetPosition( Position ) )
        m_MoviPositions.push_back( Position );
      break;
    }
    case FourCC::odml:
    case FourCC::INFO:
      break;
    default:
      // "LIST-rec " among them: its chunks are skipped, frames still come from the index.
      return ParseUnknown( i_rChunk );
    }
    o_rParseChildren = true;
    return true;
  }

  bool VRapidAVIReader::ParseNothing( const VRiffChunk& )
  {
    return true;
  }

  bool VRapidAVIReader::ParseUnknown( const VRiffChunk& i_rChunk )
  {
    LUMEK_LOG( "RapidAVI", ZOL::LogWarning, "Unknown chunk '%s' ignored.", GetChunkText( i_rChunk ) );
    return true;
  }

  bool VRapidAVIReader::ParseSuperIndex( const VRiffChunk& )
  {
    // Read as a test only: the standard indexes are found by walking movi. The entries are
    // never used, so they are checked against the file rather than read.
    std::uint8_t Header[SuperIndexHeaderSize];
    std::uint64_t Position = 0;
    const bool bRead = m_pStream->Read( Header, sizeof( Header ) ) && m_pStream->GetPosition( Position ) &&
                       FitsInFile( Position, LoadLE32( Header + 4 ) * SuperIndexEntrySize, m_FileSize );
    if( !bRead )
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "AVI cannot be read because superindex cannot be read." );
    return bRead;
  }

  bool VRapidAVIReader::ParseOpenDMLHeader( const VRiffChunk& )
  {
    std::uint8_t Header[OpenDMLHeaderSize];
    if( m_pStream->Read( Header, sizeof( Header ) ) )
      return true;
    LUMEK_LOG( "RapidAVI", ZOL::LogFailure,
               "AVI cannot be read because superindex cannot be read, or doesn't contain exactly one entry." );
    return false;
  }

  bool VRapidAVIReader::ParseCreator( const VRiffChunk& i_rChunk )
  {
    if( i_rChunk.Size >= CreatorTextLimit )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogWarning, "File creator chunk too large to show." );
      return true;
    }
    std::vector< char > Text( static_cast< std::size_t >( i_rChunk.Size ) );
    if( m_pStream->Read( Text.data(), Text.size() ) )
      LUMEK_LOG( "RapidAVI", ZOL::LogInfoDetail, "AVI file created by: %s", TextOf( Text ) );
    return true;
  }

  bool VRapidAVIReader::ParseSMPTE( const VRiffChunk& i_rChunk )
  {
    if( i_rChunk.Size != SMPTETextSize )
      return true;
    std::vector< char > Text( SMPTETextSize );
    if( m_pStream->Read( Text.data(), Text.size() ) )
      LUMEK_LOG( "RapidAVI", ZOL::LogInfoDetail, "AVI file SMPTE start timecode: %s", TextOf( Text ) );
    return true;
  }

  void VRapidAVIReader::ParseMetadata()
  {
    // Either store may be missing or damaged; what was read stays, the rest keeps defaults. The
    // file attributes follow the frame store, so they cannot be found behind a broken one.
    if( m_FrameStore.ReadFrom( *m_pStream ) && !m_Attributes.ReadFrom( *m_pStream ) )
      return;
  }
} // namespace RapidAVI
