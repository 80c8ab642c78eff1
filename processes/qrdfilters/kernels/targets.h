#pragma once

// Instruction sets that the kernels are not compiled for; included before any header of Highway.
// SSSE3 alone is met on no machine of the last fifteen years, and vectors whose size is not known
// to the compiler (SVE, RVV) cannot stand in arrays.
#define HWY_DISABLED_TARGETS (HWY_SSSE3 | HWY_SVE | HWY_SVE2 | HWY_SVE_256 | HWY_SVE2_128 | HWY_RVV)
