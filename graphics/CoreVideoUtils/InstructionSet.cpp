#include "graphics/CoreVideoUtils/InstructionSet.h"

namespace CoreVideoUtils
{
  bool IsSupported( EInstructionSet i_Set )
  {
    switch( i_Set )
    {
    case EInstructionSet::Scalar:
      return true;
#if defined( __x86_64__ )
    case EInstructionSet::SSE2:
      return true; // the baseline of the 64-bit instruction set
    case EInstructionSet::AVX2:
      return __builtin_cpu_supports( "avx2" );
    case EInstructionSet::AVX512:
      return __builtin_cpu_supports( "avx2" ) && __builtin_cpu_supports( "avx512f" ) &&
             __builtin_cpu_supports( "avx512bw" ) && __builtin_cpu_supports( "avx512vbmi" );
#endif
    default:
      return false;
    }
  }

  EInstructionSet BestInstructionSet()
  {
    static const EInstructionSet s_Best = IsSupported( EInstructionSet::AVX512 ) ? EInstructionSet::AVX512
                                          : IsSupported( EInstructionSet::AVX2 ) ? EInstructionSet::AVX2
                                          : IsSupported( EInstructionSet::SSE2 ) ? EInstructionSet::SSE2
                                                                                 : EInstructionSet::Scalar;
    return s_Best;
  }

  const char* ToString( EInstructionSet i_Set )
  {
    switch( i_Set )
    {
    case EInstructionSet::Scalar:
      return "Scalar";
    case EInstructionSet::SSE2:
      return "SSE2";
    case EInstructionSet::AVX2:
      return "AVX2";
    case EInstructionSet::AVX512:
      return "AVX512";
    }
    return "Unknown";
  }
} // namespace CoreVideoUtils
