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
