#include "videointerface/BufferAllocators.h"

#include "tests/support/LogCapture.h"

#include <gtest/gtest.h>

#include <atomic>
#include <mutex>
#include <set>
#include <thread>

using namespace ZOL;

namespace
{
  // Counts live objects, so a test can see every object created and every one deleted, and
  // marks which are handed out, so that two holders of one object show.
  struct VCounted
  {
    VCounted() { ++s_Live; }
    ~VCounted() { --s_Live; }
    std::atomic< bool > InUse{ false };
    static std::atomic< int > s_Live;
  };
  std::atomic< int > VCounted::s_Live{ 0 };

  template < std::size_t N > using VRecycler = UtilsMemory::VThreadSafeRecycler< VCounted, N >;

  template < typename F > void OnOtherThread( F&& i_rFunction )
  {
    std::thread( std::forward< F >( i_rFunction ) ).join();
  }
} // namespace

// A thread's first acquire creates a block of N, and so does every acquire that finds its cache
// empty; a thread's end deletes its cache, and only a full cache sends a block to the pool.
TEST( Recycler, AFullCacheSendsABlockToThePoolForOtherThreads )
{
  VRecycler< 4 > Recycler;
  OnOtherThread(
      [&]
      {
        std::vector< VCounted* > Held( 1, Recycler.Acquire() );
        EXPECT_EQ( 4, VCounted::s_Live );
        for( int i = 1; i < 12; ++i )
          Held.push_back( Recycler.Acquire() );
        EXPECT_EQ( 12, VCounted::s_Live ) << "three empty caches, three blocks";
        for( int i = 0; i < 8; ++i )
          Recycler.Release( Held[i] );
        EXPECT_EQ( 0u, Recycler.GetPoolSize() );
        Recycler.Release( Held[8] ); // finds 2N cached and moves the last N first
        EXPECT_EQ( 5u, Recycler.GetLocalSize() );
        EXPECT_EQ( 4u, Recycler.GetPoolSize() );
        for( int i = 9; i < 12; ++i )
          Recycler.Release( Held[i] );
        // Keep this thread's cache alive while another thread takes the block.
        OnOtherThread(
            [&]
            {
              std::set< VCounted* > Taken;
              for( int i = 0; i < 4; ++i )
                Taken.insert( Recycler.Acquire() );
              EXPECT_EQ( 12, VCounted::s_Live ) << "the block came from the pool, not the heap";
              EXPECT_EQ( std::set< VCounted* >( Held.begin() + 4, Held.begin() + 8 ), Taken );
              EXPECT_EQ( 0u, Recycler.GetPoolSize() );
              for( VCounted* p : Taken )
                Recycler.Release( p );
            } );
        EXPECT_EQ( 8, VCounted::s_Live ) << "the other thread's end deleted its cache";
      } );
  EXPECT_EQ( 0, VCounted::s_Live );
}

// Objects acquired on one thread and released on the next, as frames travel from the reading
// thread to the drawing thread.
TEST( Recycler, ManyThreadsNeverShareAnObject )
{
  constexpr int Threads = 4, Rounds = 20000;
  std::atomic< int > Faults{ 0 };
  {
    VRecycler< 3 > Recycler;
    std::vector< std::vector< VCounted* > > Handoff( Threads );
    std::mutex Lock;
    auto Release = [&]( std::vector< VCounted* >& io_rList )
    {
      for( VCounted* p : io_rList )
      {
        p->InUse = false;
        Recycler.Release( p );
      }
      io_rList.clear();
    };
    std::vector< std::thread > Workers;
    for( int t = 0; t < Threads; ++t )
      Workers.emplace_back(
          [&, t]
          {
            std::vector< VCounted* > Mine;
            for( int r = 0; r < Rounds; ++r )
            {
              VCounted* p = Recycler.Acquire();
              Faults += p->InUse.exchange( true ) ? 1 : 0;
              {
                const std::lock_guard< std::mutex > Guard( Lock );
                Handoff[( t + 1 ) % Threads].push_back( p );
                Mine.swap( Handoff[t] );
              }
              Release( Mine );
            }
          } );
    for( auto& rWorker : Workers )
      rWorker.join();
    for( auto& rList : Handoff )
      Release( rList );
  }
  EXPECT_EQ( 0, Faults );
  EXPECT_EQ( 0, VCounted::s_Live );
}

// N is 1, so the buffer released is the next one acquired on this thread: it keeps its capacity
// and its old bytes. Buffers hold their allocator, so it outlives the reader that made it, and one
// not owned by a shared pointer cannot hand any out.
TEST( BufferAllocator, ARecycledBufferKeepsItsCapacityAndBuffersKeepTheirAllocatorAlive )
{
  using VAllocator = IStandardBufferAllocator< UtilsMemory::VThreadSafeRecycler< IStandardBuffer, 1 > >;
  auto pAllocator = std::make_shared< VAllocator >();
  const std::weak_ptr< VAllocator > pWeak = pAllocator;
  std::shared_ptr< IBuffer > pBuffer;
  pAllocator->Allocate( pBuffer, 100 );
  for( int i = 0; i < 100; ++i )
    pBuffer->GetData()[i] = static_cast< std::uint8_t >( i + 1 );
  const IBuffer* pFirst = pBuffer.get();
  pBuffer.reset();
  pAllocator->Allocate( pBuffer, 10 );
  ASSERT_EQ( pFirst, pBuffer.get() );
  const std::uint8_t* pData = pBuffer->GetData();
  pBuffer.reset();
  pAllocator->Allocate( pBuffer, 100 );
  ASSERT_EQ( pFirst, pBuffer.get() );
  EXPECT_EQ( pData, pBuffer->GetData() ) << "no reallocation for a size it has held";
  for( int i = 0; i < 100; ++i )
    EXPECT_EQ( i < 10 ? i + 1 : 0, pBuffer->GetData()[i] ) << i;

  pAllocator.reset();
  EXPECT_FALSE( pWeak.expired() );
  OnOtherThread( [&] { pBuffer.reset(); } ); // released on the drawing side
  EXPECT_TRUE( pWeak.expired() );
  VReaderBufferAllocator Unowned;
  EXPECT_THROW( Unowned.Allocate( pBuffer, 8 ), std::bad_weak_ptr );
}

TEST( BufferAllocator, ImpossibleSizeGivesAnEmptyPointerAndALogLineZeroAValidBuffer )
{
  LumekTest::VLogCapture Log( "", LogFailure );
  auto pAllocator = std::make_shared< VReaderBufferAllocator >();
  std::shared_ptr< IBuffer > pBuffer;
  pAllocator->Allocate( pBuffer, ~std::uint64_t( 0 ) );
  EXPECT_FALSE( pBuffer );
  EXPECT_EQ( std::vector< std::string >{ "Could not create buffer of size 18446744073709551615 bytes." },
             Log.Messages );
  // The failed buffer went back to the recycler and the allocator still works.
  for( std::uint64_t Size : { 16u, 0u } )
  {
    pAllocator->Allocate( pBuffer, Size );
    ASSERT_TRUE( pBuffer );
    EXPECT_EQ( Size, pBuffer->GetByteCount() );
  }
}
