#pragma once

// Counts the heap calls of the whole program, for tests and benchmarks that must show, not
// assume, what a path takes from the heap: that a damaged length in a file never became an
// allocation, or that steady playback does not allocate at all. Linking this library replaces
// the global operator new of the executable.

#include <cstddef>
#include <cstdint>

namespace LumekTest
{
  // What the heap was asked for while a watch is alive.
  class VAllocationWatch
  {
  public:
    VAllocationWatch();
    ~VAllocationWatch();
    VAllocationWatch( const VAllocationWatch& ) = delete;
    VAllocationWatch& operator=( const VAllocationWatch& ) = delete;

    // The largest single request since the watch began.
    std::size_t Largest() const;
    // Heap calls and bytes since the watch began.
    std::uint64_t Calls() const;
    std::uint64_t Bytes() const;

  private:
    std::uint64_t m_CallsAtStart;
    std::uint64_t m_BytesAtStart;
  };

  // Heap calls and bytes since the program started; benchmarks take differences.
  std::uint64_t HeapCalls();
  std::uint64_t HeapBytes();
} // namespace LumekTest
