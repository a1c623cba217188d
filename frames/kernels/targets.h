// Instruction sets that the kernels are compiled for: all that Highway offers on the processor family, except
// those with vectors of unknown length, which could not be kept in the arrays of the transposition. With
// OMXBRIDGE_FEW_TARGETS of the x86 ones only AVX2 and plain code. Comes before any Highway header in the
// kernels' sources.
#pragma once

#define OMXBRIDGE_SIZELESS_TARGETS (HWY_SVE | HWY_SVE2 | HWY_SVE_256 | HWY_SVE2_128 | HWY_RVV)
#ifdef OMXBRIDGE_FEW_TARGETS
#define HWY_DISABLED_TARGETS (OMXBRIDGE_SIZELESS_TARGETS | HWY_AVX3 | HWY_AVX3_DL | HWY_SSE4 | HWY_SSSE3)
#else
#define HWY_DISABLED_TARGETS OMXBRIDGE_SIZELESS_TARGETS
#endif
