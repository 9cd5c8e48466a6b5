#include "utils/Streams.h"

#include "utils/UtilsMemory/Buffers.h"

namespace ZOL
{
  bool IInputStream::ReadAll( const IReadBlocks& i_rBlocks )
  {
    for( const auto& rBlock : i_rBlocks )
      if( !Read( rBlock.first, rBlock.second ) )
        return false;
    return true;
  }

  bool IOutputStream::WriteAll( const IWriteBlocks& i_rBlocks )
  {
    for( const auto& rBlock : i_rBlocks )
      if( !Write( rBlock.first, rBlock.second ) )
        return false;
    return true;
  }

  bool IOutputStream::WriteBuffer( const IBufferConst& i_rBuffer )
  {
    return Write( i_rBuffer.GetData(), i_rBuffer.GetSize() );
  }

  bool Skip( IInputStreamSeekable& i_rStream, std::int64_t i_Bytes )
  {
    std::uint64_t Position = 0;
    if( !i_rStream.GetPosition( Position ) )
      return false;
    return i_rStream.Seek( static_cast< std::int64_t >( Position ) + i_Bytes );
  }
} // namespace ZOL
