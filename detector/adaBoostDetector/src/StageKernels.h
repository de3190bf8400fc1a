#pragma once
// The first stage of a census-only cascade over one row of windows. Nineteen windows in
// twenty end there, so it is evaluated for many windows at once: the census bytes of
// neighbouring windows lie side by side, and a 256-entry table is read by byte shuffles.

#include "LQ_Neon.h"
#include "LQ_Utils.h"

// A census classifier as the scan reads it: its table and the offset of its byte from the
// window's first census byte.
struct CensusTest {
    const LQ::schar* table;
    int offset;
};

// The windows at row[0], row[step], ..., row[(count - 1) * step] whose sum of
// tests[t].table[window[tests[t].offset]] reaches threshold: their indices go to passed and
// their sums to sums, in order; returns how many. end is one past the last census byte that
// may be read.
int firstStagePassesScalar(const unsigned char* row, const unsigned char* end, int step, int count,
                           const CensusTest* tests, int testCount, int threshold, int* passed, int* sums);
#if defined(LQ_HAVE_NEON)
int firstStagePassesNeon(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusTest* tests, int testCount, int threshold, int* passed, int* sums);
#endif
#if defined(LQ_HAVE_SSSE3)
// only where the processor has AVX2
int firstStagePassesAvx2(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusTest* tests, int testCount, int threshold, int* passed, int* sums);
#endif
// the fastest of them on this processor
int firstStagePasses(const unsigned char* row, const unsigned char* end, int step, int count,
                     const CensusTest* tests, int testCount, int threshold, int* passed, int* sums);
