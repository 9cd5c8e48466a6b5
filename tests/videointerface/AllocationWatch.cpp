#include "tests/videointerface/AllocationWatch.h"

#include <atomic>
#include <cstdlib>
#include <new>

namespace
{
  std::atomic< bool > s_bWatching{ false };
  std::atomic< std::size_t > s_Largest{ 0 };

  void* Allocate( std::size_t i_Size )
  {
    if( s_bWatching.load( std::memory_order_relaxed ) )
    {
      std::size_t Seen = s_Largest.load( std::memory_order_relaxed );
      while( i_Size > Seen && !s_Largest.compare_exchange_weak( Seen, i_Size ) )
      {
      }
    }
    if( void* p = std::malloc( i_Size == 0 ? 1 : i_Size ) )
      return p;
    throw std::bad_alloc();
  }
} // namespace

void* operator new( std::size_t i_Size )
{
  return Allocate( i_Size );
}
void* operator new[]( std::size_t i_Size )
{
  return Allocate( i_Size );
}
void operator delete( void* i_p ) noexcept
{
  std::free( i_p );
}
void operator delete[]( void* i_p ) noexcept
{
  std::free( i_p );
}
void operator delete( void* i_p, std::size_t ) noexcept
{
  std::free( i_p );
}
void operator delete[]( void* i_p, std::size_t ) noexcept
{
  std::free( i_p );
}

namespace LumekTest
{
  VAllocationWatch::VAllocationWatch()
  {
    s_Largest.store( 0 );
    s_bWatching.store( true );
  }

  VAllocationWatch::~VAllocationWatch()
  {
    s_bWatching.store( false );
  }

  std::size_t VAllocationWatch::Largest() const
  {
    return s_Largest.load();
  }
} // namespace LumekTest
