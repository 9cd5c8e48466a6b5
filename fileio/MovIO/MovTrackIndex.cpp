// The frame table: samples to chunks, audio to frames, and the reads of one frame.

#include "fileio/MovIO/MovH264Sample.h"
#include "fileio/MovIO/MovReadAtom.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"

#include <algorithm>
#include <cstring>
#include <limits>

namespace MovIO
{
  namespace
  {
    std::uint64_t SaturatingAdd( std::uint64_t i_A, std::uint64_t i_B )
    {
      return i_B > std::numeric_limits< std::uint64_t >::max() - i_A ? std::numeric_limits< std::uint64_t >::max()
                                                                     : i_A + i_B;
    }

    bool FitsInFile( std::uint64_t i_Position, std::uint64_t i_Size, std::uint64_t i_FileSize )
    {
      return i_Size <= i_FileSize && i_Position <= i_FileSize - i_Size;
    }
  } // namespace

  bool VMovReader::ExpandSampleToChunk( VMovTrack& io_rTrack, const std::vector< std::uint32_t >& i_rEntries,
                                        bool i_bVideo )
  {
    std::vector< VMovChunk >& rChunks = io_rTrack.Chunks;
    std::size_t Next = 0;
    std::uint32_t Previous = 0;
    for( std::size_t i = 0; i + 1 < i_rEntries.size(); i += 2 )
    {
      const std::uint32_t FirstChunk = i_rEntries[i];
      // Chunk numbers start at 1 and entries run forward within the table; anything else
      // would write outside it or give one chunk two counts.
      if( FirstChunk == 0 || FirstChunk - 1 < Next || FirstChunk - 1 > rChunks.size() )
        return false;
      for( ; Next < FirstChunk - 1; ++Next )
        rChunks[Next].SampleCount = Previous;
      Previous = i_rEntries[i + 1];
    }
    for( ; Next < rChunks.size(); ++Next )
      rChunks[Next].SampleCount = Previous;

    std::uint64_t Total = 0;
    for( VMovChunk& rChunk : rChunks )
    {
      rChunk.FirstSample = static_cast< std::uint32_t >( Total );
      Total += rChunk.SampleCount;
      // Chunks may not promise more samples than the track has: frames and audio are looked up
      // by these numbers.
      if( Total > io_rTrack.SampleCount )
        return false;
      rChunk.EndSample = static_cast< std::uint32_t >( Total );
    }
    if( !i_bVideo )
      return true;
    // Every frame needs a place in the file.
    if( Total != io_rTrack.SampleCount || m_Frames.size() != Total )
      return false;
    for( const VMovChunk& rChunk : rChunks )
    {
      std::uint64_t Running = 0;
      for( std::uint32_t Sample = rChunk.FirstSample; Sample < rChunk.EndSample; ++Sample )
      {
        VMovFrame& rFrame = m_Frames[Sample];
        rFrame.Offset = SaturatingAdd( rChunk.Offset, Running );
        Running += rFrame.Size;
      }
    }
    return true;
  }

  void VMovReader::AssignAudioToFrames()
  {
    const std::uint32_t AudioCount = m_AudioTrack.SampleCount;
    const std::uint32_t VideoCount = m_VideoTrack.SampleCount;
    if( AudioCount == 0 || m_Frames.empty() )
      return;
    // By position in the track alone: sample s of n goes to the frame at the same fraction of
    // the video, whatever the time stamps say.
    for( std::uint32_t Chunk = 0; Chunk < m_AudioTrack.Chunks.size(); ++Chunk )
    {
      const VMovChunk& rChunk = m_AudioTrack.Chunks[Chunk];
      for( std::uint32_t Sample = rChunk.FirstSample; Sample < rChunk.EndSample; ++Sample )
      {
        const auto Index = static_cast< std::size_t >( static_cast< double >( Sample ) / AudioCount * VideoCount );
        if( Index >= m_Frames.size() )
          continue;
        VMovFrame& rFrame = m_Frames[Index];
        if( rFrame.AudioChunk == NoIndex )
        {
          rFrame.AudioChunk = Chunk;
          rFrame.AudioFirstSample = Sample;
        }
        ++rFrame.AudioSampleCount;
      }
    }
  }

  std::optional< std::uint64_t > VMovReader::FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const
  {
    if( m_VideoTrack.SampleCount == 0 )
      return std::nullopt;
    return std::min< std::uint64_t >( i_FrameIndex, m_VideoTrack.SampleCount - 1u );
  }

  std::optional< std::uint64_t > VMovReader::FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const
  {
    if( i_FrameIndex >= m_VideoTrack.SampleCount )
      return std::nullopt;
    return i_FrameIndex;
  }

  bool VMovReader::ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                                  ZOL::IAudioBuffers& o_rAudio, bool i_bReadVideo, bool i_bReadAudio )
  {
    if( !m_pReader || i_FrameIndex >= m_VideoTrack.SampleCount || i_FrameIndex >= m_Frames.size() )
      return false;
    const VMovFrame& rFrame = m_Frames[static_cast< std::size_t >( i_FrameIndex )];
    if( i_bReadAudio && !ReadAudio( rFrame, o_rAudio ) )
      return false;
    // A sample of size 0 is a frame with an empty picture.
    if( !i_bReadVideo || rFrame.Size == 0 )
      return true;
    return ReadVideo( rFrame, o_rVideo );
  }

  bool VMovReader::ReadAudio( const VMovFrame& i_rFrame, ZOL::IAudioBuffers& o_rAudio )
  {
    const std::uint64_t FrameBytes = GetAudioSampleFrameBytes();
    const std::uint64_t Bytes = static_cast< std::uint64_t >( i_rFrame.AudioSampleCount ) * FrameBytes;
    if( !m_AudioFrameInfo.IsUsable() || Bytes == 0 )
      return true;
    if( !m_pAudioAllocator || i_rFrame.AudioChunk >= m_AudioTrack.Chunks.size() )
      return false;
    std::shared_ptr< ZOL::IBuffer > pBlock;
    m_pAudioAllocator->Allocate( pBlock, Bytes );
    if( !pBlock )
      return false;
    VMovPrimitiveReader& rReader = *m_pReader;
    std::uint8_t* pOut = pBlock->GetData();
    const std::uint64_t EndSample =
        static_cast< std::uint64_t >( i_rFrame.AudioFirstSample ) + i_rFrame.AudioSampleCount;
    std::uint64_t Sample = i_rFrame.AudioFirstSample;
    std::size_t Chunk = i_rFrame.AudioChunk;
    while( Sample < EndSample )
    {
      while( Chunk < m_AudioTrack.Chunks.size() && Sample >= m_AudioTrack.Chunks[Chunk].EndSample )
        ++Chunk;
      if( Chunk >= m_AudioTrack.Chunks.size() || Sample < m_AudioTrack.Chunks[Chunk].FirstSample )
        return false;
      const VMovChunk& rChunk = m_AudioTrack.Chunks[Chunk];
      if( m_CachedAudioChunk != Chunk )
      {
        // A chunk usually spans several frames; it is read once.
        const std::uint64_t ChunkBytes = static_cast< std::uint64_t >( rChunk.SampleCount ) * FrameBytes;
        if( !FitsInFile( rChunk.Offset, ChunkBytes, rReader.GetFileSize() ) )
          return false;
        m_AudioChunkCache.resize( static_cast< std::size_t >( ChunkBytes ) );
        const bool bRead = rReader.Seek( rChunk.Offset ) && rReader.Read( m_AudioChunkCache.data(), ChunkBytes );
        m_CachedAudioChunk = static_cast< std::uint32_t >( Chunk );
        if( !bRead )
          return false;
      }
      const std::uint64_t Count = std::min< std::uint64_t >( rChunk.EndSample - Sample, EndSample - Sample );
      std::memcpy( pOut, m_AudioChunkCache.data() + ( Sample - rChunk.FirstSample ) * FrameBytes,
                   static_cast< std::size_t >( Count * FrameBytes ) );
      pOut += Count * FrameBytes;
      Sample += Count;
    }
    o_rAudio.push_back( std::move( pBlock ) );
    return true;
  }

  bool VMovReader::ReadVideo( const VMovFrame& i_rFrame, std::shared_ptr< ZOL::IBuffer >& o_rVideo )
  {
    VMovPrimitiveReader& rReader = *m_pReader;
    // The size comes from the sample table: it is checked against the file before a byte is
    // allocated for it.
    if( !m_pCompressedAllocator || !FitsInFile( i_rFrame.Offset, i_rFrame.Size, rReader.GetFileSize() ) )
      return false;
    // A raw sample shorter than its picture would be read past its end when it is drawn.
    if( m_VideoPayload == ZOL::VideoPayload_Uncompressed &&
        i_rFrame.Size < ZOL::GetVideoFrameSizeInBytes64( m_VideoFrameInfo ) )
      return false;
    std::shared_ptr< ZOL::IBuffer > pSample;
    m_pCompressedAllocator->Allocate( pSample, i_rFrame.Size );
    if( !pSample || !rReader.Seek( i_rFrame.Offset ) || !rReader.Read( pSample->GetData(), i_rFrame.Size ) )
      return false;
    if( m_VideoPayload != ZOL::VideoPayload_VideoH264 )
    {
      o_rVideo = std::move( pSample );
      return true;
    }
    return AssembleH264AccessUnit( pSample, m_SPS, m_PPS, m_pCompressedAllocator, o_rVideo );
  }

  bool VMovReader::ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                              bool i_bReadAudio )
  {
    // The reader has no H.264 decoder of its own: that lives with the video source, which keeps
    // its reference pictures from frame to frame.
    return VideoEncoding::ReadDecodedFrame( *this, i_FrameIndex, o_rFrame, i_bReadVideo, i_bReadAudio,
                                            m_pFrameAllocator, m_pCompressedAllocator, nullptr );
  }
} // namespace MovIO
