#include "fileio/LumekVideo/VWriter.h"

#include "utils/UtilsIO/VLargeFile.h"
#include "videointerface/AttributeRecords.h"

#include <algorithm>
#include <limits>

namespace LumekVideo
{
  namespace
  {
    constexpr std::uint64_t MaxPosition = static_cast< std::uint64_t >( std::numeric_limits< std::int64_t >::max() );
    const std::uint8_t s_Zeros[4096] = {};

    void StoreLE64( std::uint8_t* o_pBytes, std::uint64_t i_Value )
    {
      for( int i = 0; i < 8; ++i )
        o_pBytes[i] = static_cast< std::uint8_t >( i_Value >> ( 8 * i ) );
    }

    // What makes a recording possible at all; checked before a file is created, so that a bad
    // call does not destroy a file that is already there.
    bool CanRecord( const ZOL::IVideoFrameInfo& i_rVideoFrameInfo, std::uint64_t i_Alignment )
    {
      return i_rVideoFrameInfo.IsValid() && ZOL::GetVideoFrameSizeInBytes64( i_rVideoFrameInfo ) != 0 &&
             i_Alignment != 0 && i_Alignment <= MaxPosition;
    }
  } // namespace

  VWriter::VWriter() = default;

  VWriter::~VWriter()
  {
    if( IsOpen() )
      Close();
  }

  bool VWriter::Create( const std::string& i_rPath, const ZOL::IVideoFrameInfo& i_rVideoFrameInfo,
                        const ZOL::IAudioFrameInfo& i_rAudioFrameInfo, const ZOL::IVideoAttributes& i_rFileAttributes,
                        std::uint64_t i_Alignment )
  {
    if( IsOpen() || !CanRecord( i_rVideoFrameInfo, i_Alignment ) )
      return false;
    auto pFile = std::make_shared< UtilsIO::VLargeFile >();
    if( !pFile->Open( i_rPath, UtilsIO::OpenMode_Create ) )
      return false;
    if( !Create( pFile, i_rVideoFrameInfo, i_rAudioFrameInfo, i_rFileAttributes, i_Alignment ) )
      return false;
    m_pFile = std::move( pFile );
    return true;
  }

  bool VWriter::Create( const std::shared_ptr< ZOL::IStreamSeekable >& i_pStream,
                        const ZOL::IVideoFrameInfo& i_rVideoFrameInfo, const ZOL::IAudioFrameInfo& i_rAudioFrameInfo,
                        const ZOL::IVideoAttributes& i_rFileAttributes, std::uint64_t i_Alignment )
  {
    if( IsOpen() || !i_pStream || !CanRecord( i_rVideoFrameInfo, i_Alignment ) )
      return false;

    // Audio that cannot be played is stored as no audio at all, so that readers agree on it.
    const ZOL::IAudioFrameInfo Audio = i_rAudioFrameInfo.IsUsable() ? i_rAudioFrameInfo : ZOL::IAudioFrameInfo();
    ZOL::IVideoAttributes Description;
    if( !ZOL::WriteVideoFrameInfo( Description, i_rVideoFrameInfo ) ||
        !ZOL::WriteAudioFrameInfo( Description, "", Audio ) )
      return false;

    m_pStream = i_pStream;
    m_VideoFrameInfo = i_rVideoFrameInfo;
    m_AudioFrameInfo = Audio;
    m_Alignment = i_Alignment;
    m_VideoFrameSize = ZOL::GetVideoFrameSizeInBytes64( i_rVideoFrameInfo );
    m_Position = 0;
    m_Index.clear();
    m_bGood = true;

    // Alignment and IndexOffset stay 0 until Close: a capture that never finishes leaves a file
    // that says so rather than one with a stale index position.
    if( !m_pStream->Seek( 0 ) || !WriteFileHeader( *m_pStream, VFileHeader::MakeNew() ) ||
        !Description.WriteTo( *m_pStream ) || !i_rFileAttributes.WriteTo( *m_pStream ) ||
        !m_pStream->GetPosition( m_Position ) || !PadToAlignment() )
    {
      Fail();
      m_pStream.reset();
      return false;
    }
    return true;
  }

  bool VWriter::AppendFrame( std::uint64_t i_FrameNumber, const void* i_pVideo, std::uint64_t i_VideoSize,
                             const void* i_pAudio, std::uint64_t i_AudioSize )
  {
    if( !IsOpen() || !m_bGood )
      return false;
    // Wrong arguments leave the recording as it was; only a failed write spoils it.
    const bool bHasAudio = m_AudioFrameInfo.IsUsable();
    if( i_VideoSize != m_VideoFrameSize || i_pVideo == nullptr )
      return false;
    if( i_AudioSize != 0 && ( !bHasAudio || i_pAudio == nullptr ) )
      return false;
    if( i_AudioSize > std::numeric_limits< std::uint32_t >::max() )
      return false;
    // The count has no room for the largest number.
    if( i_FrameNumber == std::numeric_limits< std::uint64_t >::max() )
      return false;

    const std::uint64_t RecordOffset = m_Position;
    if( !Write( i_pVideo, i_VideoSize ) || !PadToAlignment() )
      return Fail();
    if( bHasAudio )
    {
      if( !ZOL::WriteLE( *m_pStream, static_cast< std::uint32_t >( i_AudioSize ) ) )
        return Fail();
      m_Position += AudioByteCountSize;
      if( !Write( i_pAudio, i_AudioSize ) || !PadToAlignment() )
        return Fail();
    }
    m_Index.emplace_back( i_FrameNumber, RecordOffset );
    return true;
  }

  bool VWriter::SkipBytes( std::uint64_t i_Bytes )
  {
    if( !IsOpen() || !m_bGood )
      return false;
    std::uint64_t Next = 0;
    if( i_Bytes > MaxPosition - m_Position || !AlignUp( m_Position + i_Bytes, m_Alignment, Next ) )
      return false;
    // Seeking past the end and writing there later leaves a hole that reads as zeros.
    if( !m_pStream->Seek( static_cast< std::int64_t >( Next ) ) )
      return Fail();
    m_Position = Next;
    return true;
  }

  bool VWriter::Close()
  {
    if( !IsOpen() )
      return false;
    bool bGood = m_bGood;
    if( bGood )
    {
      // The index goes out in one write, in the order the frames came.
      const std::uint64_t IndexOffset = m_Position;
      std::vector< std::uint8_t > Index(
          static_cast< std::size_t >( IndexCountSize + m_Index.size() * IndexEntrySize ) );
      StoreLE64( Index.data(), m_Index.size() );
      std::uint8_t* pEntry = Index.data() + IndexCountSize;
      for( const auto& rEntry : m_Index )
      {
        StoreLE64( pEntry, rEntry.first );
        StoreLE64( pEntry + 8, rEntry.second );
        pEntry += IndexEntrySize;
      }
      bGood = Write( Index.data(), Index.size() ) &&
              m_pStream->Seek( static_cast< std::int64_t >( HeaderAlignmentOffset ) ) &&
              ZOL::WriteLE( *m_pStream, m_Alignment ) && ZOL::WriteLE( *m_pStream, IndexOffset );
    }
    // Closing the file does not report a failed last flush (a full disc shows there), so flush
    // first and ask.
    if( m_pFile && ( !m_pFile->Flush() || !m_pFile->Close() ) )
      bGood = false;
    m_pFile.reset();
    m_pStream.reset();
    m_Index.clear();
    m_bGood = false;
    return bGood;
  }

  bool VWriter::Write( const void* i_pData, std::uint64_t i_Size )
  {
    if( !m_pStream->Write( i_pData, i_Size ) )
      return false;
    m_Position += i_Size;
    return true;
  }

  bool VWriter::PadToAlignment()
  {
    std::uint64_t Aligned = 0;
    if( !AlignUp( m_Position, m_Alignment, Aligned ) )
      return false;
    while( m_Position < Aligned )
    {
      const std::uint64_t Chunk = std::min< std::uint64_t >( Aligned - m_Position, sizeof( s_Zeros ) );
      if( !Write( s_Zeros, Chunk ) )
        return false;
    }
    return true;
  }

  bool VWriter::Fail()
  {
    m_bGood = false;
    return false;
  }
} // namespace LumekVideo
