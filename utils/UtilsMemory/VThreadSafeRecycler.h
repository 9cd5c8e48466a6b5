#pragma once

// A recycler of objects with one cache per thread and a shared pool behind it. Objects move
// between a thread's cache and the pool only in blocks of N, and a thread never caches more
// than 2N, so the common path takes no lock.

#include <boost/thread/tss.hpp>

#include <memory>
#include <mutex>
#include <vector>

namespace UtilsMemory
{
  template < typename T, std::size_t N > class VThreadSafeRecycler
  {
    static_assert( N > 0, "blocks of at least one object" );

  public:
    VThreadSafeRecycler()
        : m_Local( &VThreadSafeRecycler::DeleteLocal ), m_pPool( new std::vector< T* >,
                                                                 []( std::vector< T* >* i_pPool )
                                                                 {
                                                                   for( T* p : *i_pPool )
                                                                     delete p;
                                                                   delete i_pPool;
                                                                 } )
    {
    }
    VThreadSafeRecycler( const VThreadSafeRecycler& ) = delete;
    VThreadSafeRecycler& operator=( const VThreadSafeRecycler& ) = delete;

    ~VThreadSafeRecycler()
    {
      // The calling thread's cache goes with the recycler; other threads' caches are cleaned
      // up by their own end-of-thread routine only while the recycler lives, so empty ours here.
      DeleteLocal( m_Local.release() );
    }

    // An object nobody else holds.
    T* Acquire()
    {
      std::vector< T* >& rLocal = Local();
      if( rLocal.empty() )
      {
        std::lock_guard< std::mutex > Lock( m_Mutex );
        std::vector< T* >& rPool = *m_pPool;
        if( rPool.size() < N )
        {
          for( std::size_t i = 0; i < N; ++i )
            rLocal.push_back( new T );
        }
        else
        {
          rLocal.insert( rLocal.end(), rPool.end() - N, rPool.end() );
          rPool.resize( rPool.size() - N );
        }
      }
      T* p = rLocal.back();
      rLocal.pop_back();
      return p;
    }

    void Release( T* i_p )
    {
      std::vector< T* >& rLocal = Local();
      if( rLocal.size() == 2 * N )
      {
        std::lock_guard< std::mutex > Lock( m_Mutex );
        m_pPool->insert( m_pPool->end(), rLocal.end() - N, rLocal.end() );
        rLocal.resize( N );
      }
      rLocal.push_back( i_p );
    }

    // For tests and diagnostics: objects in the shared pool, and in this thread's cache.
    std::size_t GetPoolSize() const
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      return m_pPool->size();
    }
    std::size_t GetLocalSize() const
    {
      const std::vector< T* >* pLocal = m_Local.get();
      return pLocal ? pLocal->size() : 0;
    }

  private:
    std::vector< T* >& Local()
    {
      std::vector< T* >* pLocal = m_Local.get();
      if( pLocal == nullptr )
      {
        pLocal = new std::vector< T* >;
        pLocal->reserve( 2 * N );
        m_Local.reset( pLocal );
      }
      return *pLocal;
    }

    static void DeleteLocal( std::vector< T* >* i_pLocal )
    {
      if( i_pLocal == nullptr )
        return;
      for( T* p : *i_pLocal )
        delete p;
      delete i_pLocal;
    }

    mutable std::mutex m_Mutex;
    boost::thread_specific_ptr< std::vector< T* > > m_Local;
    std::shared_ptr< std::vector< T* > > m_pPool;
  };
} // namespace UtilsMemory

namespace ZOL
{
  class IStandardBuffer;
  template < typename TRecycler > class IStandardBufferAllocator;
} // namespace ZOL
