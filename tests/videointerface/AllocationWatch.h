#pragma once

// Records the largest single heap request made while a watch is alive, so that a test can
// show that a damaged length in a file was never turned into an allocation.

#include <cstddef>

namespace LumekTest
{
  class VAllocationWatch
  {
  public:
    VAllocationWatch();
    ~VAllocationWatch();
    VAllocationWatch( const VAllocationWatch& ) = delete;
    VAllocationWatch& operator=( const VAllocationWatch& ) = delete;

    std::size_t Largest() const;
  };
} // namespace LumekTest
