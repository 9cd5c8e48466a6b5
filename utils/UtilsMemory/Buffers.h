#pragma once

// Reference-counted byte buffers out of recycling allocators. At playback speed a frame of
// megabytes is made and dropped dozens of times a second, so buffers go back to a recycler
// rather than the heap and keep their capacity between uses.

#include "services/Log.h"
#include "utils/UtilsMemory/VBlockPool.h"

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace ZOL
{
  class IBufferConst
  {
  public:
    virtual ~IBufferConst() = default;
    virtual const std::uint8_t* GetData() const = 0;
    virtual std::uint64_t GetSize() const = 0;
    virtual std::uint64_t GetLength() const { return GetSize(); }
    virtual std::uint64_t GetByteCount() const { return GetSize(); }
  };

  class IBuffer : public IBufferConst
  {
  public:
    using IBufferConst::GetData;
    virtual std::uint8_t* GetData() = 0;
  };

  // A buffer over one growable byte vector.
  class IStandardBuffer : public IBuffer
  {
  public:
    const std::uint8_t* GetData() const override { return m_Data.data(); }
    std::uint8_t* GetData() override { return m_Data.data(); }
    std::uint64_t GetSize() const override { return m_Data.size(); }

    // Resizing keeps the capacity; bytes added by growing are zero, bytes below the old length stay.
    void Resize( std::uint64_t i_Size ) { m_Data.resize( static_cast< std::size_t >( i_Size ) ); }
    std::size_t GetCapacity() const { return m_Data.capacity(); }

  private:
    std::vector< std::uint8_t > m_Data;
  };

  // Wraps a byte array with static storage so that it can join a list of buffers without a copy.
  template < const std::uint8_t* pData, std::uint64_t Size > class VTrivialBuffer : public IBufferConst
  {
  public:
    const std::uint8_t* GetData() const override { return pData; }
    std::uint64_t GetSize() const override { return Size; }
  };

  class IBufferAllocator
  {
  public:
    // Gives a buffer of exactly i_Size bytes, or an empty pointer.
    virtual void Allocate( std::shared_ptr< IBuffer >& o_rBuffer, std::uint64_t i_Size ) = 0;
    virtual ~IBufferAllocator() = default;
  };

  // An allocator over a recycler of IStandardBuffer. It must be owned by a shared pointer: each
  // buffer it gives out keeps it alive, so buffers may outlive whoever made the allocator.
  template < typename TRecycler >
  class IStandardBufferAllocator : public IBufferAllocator,
                                   public std::enable_shared_from_this< IStandardBufferAllocator< TRecycler > >
  {
  public:
    explicit IStandardBufferAllocator( std::string i_Name = "Unnamed" ) : Name( std::move( i_Name ) ) {}

    void Allocate( std::shared_ptr< IBuffer >& o_rBuffer, std::uint64_t i_Size ) override
    {
      IStandardBuffer* pBuffer = nullptr;
      try
      {
        pBuffer = Recycler.Acquire();
      }
      catch( const std::bad_alloc& )
      {
        pBuffer = nullptr;
      }
      if( pBuffer == nullptr )
      {
        LogAllocationFailure( i_Size );
        o_rBuffer.reset();
        return;
      }
      // Throws std::bad_weak_ptr for an allocator that is not owned by a shared pointer; the
      // buffer goes back first, or it would be lost to the recycler for good.
      std::shared_ptr< IStandardBufferAllocator > pSelf;
      try
      {
        pSelf = this->shared_from_this();
      }
      catch( const std::bad_weak_ptr& )
      {
        Recycler.Release( pBuffer );
        throw;
      }
      // The control block comes from a pool too: with it, a recycled frame costs no allocation.
      std::shared_ptr< IStandardBuffer > pShared(
          pBuffer, [pSelf]( IStandardBuffer* i_pBuffer ) { pSelf->Recycler.Release( i_pBuffer ); },
          UtilsMemory::VPooledAllocator< IStandardBuffer >() );
      try
      {
        pShared->Resize( i_Size );
      }
      catch( const std::exception& )
      {
        LogAllocationFailure( i_Size );
        o_rBuffer.reset();
        return;
      }
      o_rBuffer = std::move( pShared );
    }

    const std::string Name;
    TRecycler Recycler;

  private:
    void LogAllocationFailure( std::uint64_t i_Size ) const
    {
      const ILogCategory& rCategory = GlobalLog().GetCategory( Name );
      if( rCategory.Enabled( LogFailure ) )
        LogFormatted( rCategory, LogFailure, "IBufferAllocator", 0, "Could not create buffer of size %d bytes.",
                      i_Size );
    }
  };
} // namespace ZOL
