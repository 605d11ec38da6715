// What a file with vector code is compiled for, chosen when it runs: SSE4, AVX2 and AVX-512. Included before Highway's headers.
#pragma once

// Left out: what only very old processors need, and vectors whose size is not known when compiling.
#define HWY_DISABLED_TARGETS ( HWY_SSSE3 | HWY_SVE | HWY_SVE2 | HWY_SVE_256 | HWY_SVE2_128 | HWY_RVV )
// A processor with none of them gets HWY_SCALAR, where our files call the reference in place of emulated vectors.
#define HWY_BROKEN_EMU128 1
