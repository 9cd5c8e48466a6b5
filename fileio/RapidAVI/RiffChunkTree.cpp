// The RIFF structure of an AVI file as a tree of chunks, and its text dump.

#include "fileio/RapidAVI/RiffChunk.h"
#include "fileio/RapidAVI/VRapidAVIReader.h"
#include "services/Log.h"

#include <algorithm>
#include <boost/format.hpp>

namespace RapidAVI
{
  namespace
  {
    constexpr std::uint64_t ChunkHeaderSize = 8;

    char PrintableByte( std::uint32_t i_FourCC, int i_Byte )
    {
      return static_cast< char >( ( i_FourCC >> ( 8 * i_Byte ) ) & 0xFF );
    }

    void DumpChildren( const VRiffChunk& i_rParent, int i_Depth, std::ostream& o_rStream )
    {
      for( const VRiffChunk& rChunk : i_rParent.Children )
      {
        const std::string Indent( static_cast< std::size_t >( 2 * i_Depth ), ' ' );
        o_rStream << boost::format( "%s%s size: %d pos: %d" ) % Indent % GetChunkText( rChunk ) % rChunk.Size %
                         rChunk.Position
                  << '\n';
        DumpChildren( rChunk, i_Depth + 1, o_rStream );
      }
    }
  } // namespace

  std::string FourCCText( std::uint32_t i_FourCC )
  {
    return ( boost::format( "%c%c%c%c" ) % PrintableByte( i_FourCC, 0 ) % PrintableByte( i_FourCC, 1 ) %
             PrintableByte( i_FourCC, 2 ) % PrintableByte( i_FourCC, 3 ) )
        .str();
  }

  std::string GetChunkText( const VRiffChunk& i_rChunk )
  {
    std::string Text = FourCCText( i_rChunk.Id );
    if( i_rChunk.ListType != 0 )
      Text += "-" + FourCCText( i_rChunk.ListType );
    return Text;
  }

  bool VRapidAVIReader::BuildChunkTree( VRiffChunk& io_rParent )
  {
    return BuildChunkTree( io_rParent, 0 );
  }

  bool VRapidAVIReader::BuildChunkTree( VRiffChunk& io_rParent, int i_Depth )
  {
    if( i_Depth > MaxChunkDepth )
    {
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "RIFF lists are nested deeper than %d levels.", MaxChunkDepth );
      return false;
    }
    // The loop stops 8 bytes short of a list's true end, since Size leaves out the header: a
    // child of 8 bytes or less right at the end of a list is not seen. A list that claims more
    // than the file holds ends with the file.
    const std::uint64_t End = std::min( io_rParent.Position + io_rParent.Size, m_FileSize );
    bool bOk = true;
    while( bOk )
    {
      std::uint64_t Start = 0;
      if( !m_pStream->GetPosition( Start ) )
        return false;
      if( Start >= End )
        break;
      // Chunks begin on even offsets: the pad byte behind an odd-sized chunk is taken here, at
      // the start of the next one.
      if( ( Start & 1 ) != 0 && !m_pStream->Seek( static_cast< std::int64_t >( ++Start ) ) )
        return false;
      // A header cut off by the end of the file is where a truncated recording stops; what came
      // before it stays usable.
      if( Start + ChunkHeaderSize > m_FileSize )
        break;

      VRiffChunk Chunk;
      Chunk.Position = Start;
      std::uint32_t Size = 0;
      bOk = ZOL::ReadLE( *m_pStream, Chunk.Id ) && ZOL::ReadLE( *m_pStream, Size );
      Chunk.Size = Size;
      if( bOk && Chunk.Id == FourCC::RIFF )
      {
        std::uint32_t Form = 0;
        bOk = ZOL::ReadLE( *m_pStream, Form );
        if( bOk && ( Form == FourCC::AVI || Form == FourCC::AVIX ) )
          bOk = BuildChunkTree( Chunk, i_Depth + 1 );
        else if( bOk && Form != FourCC::QMDT )
        {
          LUMEK_LOG( "RapidAVI", ZOL::LogWarning, "Unknown RIFF chunk '%c%c%c%c' ignored.", PrintableByte( Form, 0 ),
                     PrintableByte( Form, 1 ), PrintableByte( Form, 2 ), PrintableByte( Form, 3 ) );
          return true;
        }
      }
      else if( bOk && Chunk.Id == FourCC::LIST )
      {
        bOk = ZOL::ReadLE( *m_pStream, Chunk.ListType ) && BuildChunkTree( Chunk, i_Depth + 1 );
      }
      io_rParent.Children.push_back( std::move( Chunk ) );
      if( !m_pStream->Seek( static_cast< std::int64_t >( Start + Size + ChunkHeaderSize ) ) )
        return false;
    }
    return bOk;
  }

  bool VRapidAVIReader::DumpFileStructure( std::ostream& o_rStream )
  {
    if( !m_pStream )
      return false;
    std::uint64_t Position = 0;
    m_pStream->GetPosition( Position );
    VRiffChunk Root;
    Root.Size = m_FileSize;
    const bool bBuilt = m_pStream->Seek( 0 ) && BuildChunkTree( Root );
    if( bBuilt )
      DumpChildren( Root, 0, o_rStream );
    else
      LUMEK_LOG( "RapidAVI", ZOL::LogFailure, "Could not build tree of AVI chunks.  File may be corrupt." );
    m_pStream->Seek( static_cast< std::int64_t >( Position ) );
    return bBuilt;
  }
} // namespace RapidAVI
