#pragma once
// The census-only stages of a cascade over one row of windows. Most windows end in the
// first, so it is evaluated for many windows at once: the census bytes of neighbouring
// windows lie side by side, and a 256-entry table is read by byte shuffles. Where many pass
// the first stage, the census stages after it are cheaper the same way than window by window.

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
// only where the processor has AVX-512 with byte permutes (VBMI) and BMI2: haveAvx512Census
int firstStagePassesAvx512(const unsigned char* row, const unsigned char* end, int step, int count,
                           const CensusTest* tests, int testCount, int threshold, int* passed, int* sums);
bool haveAvx512Census();
#endif
// the fastest of them on this processor
int firstStagePasses(const unsigned char* row, const unsigned char* end, int step, int count,
                     const CensusTest* tests, int testCount, int threshold, int* passed, int* sums);

// The vector sums are 16-bit: a stage of up to this many scores of -128 .. 127 stays inside;
// the vector forms take larger ones by the scalar loop.
constexpr int kMaxVectorCensusTests = 255;

// One census-only stage: its tests and the sum they must reach.
struct CensusStage {
    const CensusTest* tests;
    int testCount;
    int threshold;
};

// The windows as above that pass stages[0], ..., stages[stageCount - 1] in turn (stageCount
// at least 1): their indices go to passed and the sums of the last stage to sums, in order;
// returns how many. reached, where given, gets per stage how many windows pass it and every
// stage before. Windows go through the stages in blocks that stop once none of them is left
// and go on window by window once few are.
int censusStagesPassScalar(const unsigned char* row, const unsigned char* end, int step, int count,
                           const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached);
#if defined(LQ_HAVE_NEON)
int censusStagesPassNeon(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached);
#endif
#if defined(LQ_HAVE_SSSE3)
// only where the processor has AVX2
int censusStagesPassAvx2(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached);
// only where haveAvx512Census
int censusStagesPassAvx512(const unsigned char* row, const unsigned char* end, int step, int count,
                           const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached);
#endif
// the fastest of them on this processor
int censusStagesPass(const unsigned char* row, const unsigned char* end, int step, int count,
                     const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached);

// The share of a row's windows passing the first stage from which the census stages after it
// cost less taken densely by censusStagesPass than window by window. Dense rows cost about
// the same whatever their share, lists grow with it; they cross near 30 % with 16 or 32
// windows per block and near 20 % with 64 (bench_cascade's BM_CensusRowStages).
double denseCensusShare();
