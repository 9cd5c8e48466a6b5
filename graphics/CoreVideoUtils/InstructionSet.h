#pragma once

// The vector forms of the hot loops are picked once per process from what the processor
// offers. Every form gives the bytes of the scalar rule; tests run each form the machine has.

namespace CoreVideoUtils
{
  enum class EInstructionSet
  {
    Scalar,
    SSE2,
    AVX2,
    // AVX-512 with byte permutes (F, BW, VBMI). Kernels without a form of their own run AVX2.
    AVX512,
  };

  // The widest form this processor runs.
  EInstructionSet BestInstructionSet();
  // Whether this processor runs a form (Scalar always).
  bool IsSupported( EInstructionSet i_Set );
  const char* ToString( EInstructionSet i_Set );
} // namespace CoreVideoUtils
