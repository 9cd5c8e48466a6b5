#pragma once

// Memory for small objects of one size that are made and dropped at frame rate, such as the
// control blocks of shared buffer pointers. Freed blocks stay in the pool for the next request,
// so the steady playback path does not go back to the heap. The pool only grows to the largest
// number of blocks alive at once.

#include <cstddef>
#include <mutex>
#include <new>
#include <vector>

namespace UtilsMemory
{
  template < std::size_t Size, std::size_t Alignment > class VBlockPool
  {
  public:
    static VBlockPool& Instance()
    {
      // Never destroyed: blocks may be freed by static destructors after main returns.
      static VBlockPool* s_pPool = new VBlockPool;
      return *s_pPool;
    }

    void* Allocate()
    {
      {
        std::lock_guard< std::mutex > Lock( m_Mutex );
        if( !m_Free.empty() )
        {
          void* p = m_Free.back();
          m_Free.pop_back();
          return p;
        }
      }
      return ::operator new( Size, std::align_val_t( Alignment ) );
    }

    void Free( void* i_p )
    {
      std::lock_guard< std::mutex > Lock( m_Mutex );
      m_Free.push_back( i_p );
    }

  private:
    VBlockPool() { m_Free.reserve( 64 ); }

    std::mutex m_Mutex;
    std::vector< void* > m_Free;
  };

  // A standard allocator over the pool of its type's size: give it to std::shared_ptr's
  // constructor so that the control block comes from the pool.
  template < typename T > struct VPooledAllocator
  {
    using value_type = T;

    VPooledAllocator() = default;
    template < typename U > VPooledAllocator( const VPooledAllocator< U >& ) noexcept {}

    T* allocate( std::size_t i_Count )
    {
      if( i_Count != 1 )
        return static_cast< T* >( ::operator new( i_Count * sizeof( T ), std::align_val_t( alignof( T ) ) ) );
      return static_cast< T* >( VBlockPool< sizeof( T ), alignof( T ) >::Instance().Allocate() );
    }

    void deallocate( T* i_p, std::size_t i_Count ) noexcept
    {
      if( i_Count != 1 )
        ::operator delete( i_p, std::align_val_t( alignof( T ) ) );
      else
        VBlockPool< sizeof( T ), alignof( T ) >::Instance().Free( i_p );
    }

    template < typename U > bool operator==( const VPooledAllocator< U >& ) const noexcept { return true; }
    template < typename U > bool operator!=( const VPooledAllocator< U >& ) const noexcept { return false; }
  };
} // namespace UtilsMemory
