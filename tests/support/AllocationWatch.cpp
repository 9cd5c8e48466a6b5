#include "tests/support/AllocationWatch.h"

#include <atomic>
#include <cstdlib>
#include <new>

namespace
{
  std::atomic< int > s_Watches{ 0 };
  std::atomic< std::size_t > s_Largest{ 0 };
  std::atomic< std::uint64_t > s_Calls{ 0 };
  std::atomic< std::uint64_t > s_Bytes{ 0 };

  void* Allocate( std::size_t i_Size )
  {
    s_Calls.fetch_add( 1, std::memory_order_relaxed );
    s_Bytes.fetch_add( i_Size, std::memory_order_relaxed );
    if( s_Watches.load( std::memory_order_relaxed ) > 0 )
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
  VAllocationWatch::VAllocationWatch() : m_CallsAtStart( s_Calls.load() ), m_BytesAtStart( s_Bytes.load() )
  {
    s_Largest.store( 0 );
    s_Watches.fetch_add( 1 );
  }

  VAllocationWatch::~VAllocationWatch()
  {
    s_Watches.fetch_sub( 1 );
  }

  std::size_t VAllocationWatch::Largest() const
  {
    return s_Largest.load();
  }

  std::uint64_t VAllocationWatch::Calls() const
  {
    return s_Calls.load() - m_CallsAtStart;
  }

  std::uint64_t VAllocationWatch::Bytes() const
  {
    return s_Bytes.load() - m_BytesAtStart;
  }

  std::uint64_t HeapCalls()
  {
    return s_Calls.load();
  }

  std::uint64_t HeapBytes()
  {
    return s_Bytes.load();
  }
} // namespace LumekTest
