// Instruction sets that the kernels are compiled for: all that Highway offers on the processor family, except
// those with vectors of unknown length, which could not be kept in the arrays of the transposition. Comes
// before any Highway header in the kernels' sources.
#pragma once

#define HWY_DISABLED_TARGETS (HWY_SVE | HWY_SVE2 | HWY_SVE_256 | HWY_SVE2_128 | HWY_RVV)
