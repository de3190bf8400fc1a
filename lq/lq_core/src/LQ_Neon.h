#pragma once
// NEON intrinsics: native on AArch64, mapped by SIMDe onto the host's vector unit
// elsewhere, so the vector paths are built and tested on every machine.

#if defined(LQ_HAVE_NEON)
#if defined(LQ_NEON_SIMDE)
#define SIMDE_ENABLE_NATIVE_ALIASES
#include <simde/arm/neon.h>
#else
#include <arm_neon.h>
#endif
#endif

// x86 hosts get their own vectors for the hottest kernels, chosen at run time.
#if defined(__x86_64__) || defined(__i386__)
#define LQ_HAVE_SSSE3 1
#include <immintrin.h>
#endif
