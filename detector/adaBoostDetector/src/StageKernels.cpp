#include "StageKernels.h"

#include <algorithm>
#include <climits>

namespace {
// as censusStagesPassScalar, with the counts added to reached
int stagesScalar(const unsigned char* row, int step, int count, const CensusStage* stages, int stageCount,
                 int* passed, int* sums, int* reached) {
    int found = 0;
    for (int k = 0; k < count; ++k) {
        const unsigned char* window = row + static_cast<ptrdiff_t>(k) * step;
        int sum = 0, s = 0;
        for (; s < stageCount; ++s) {
            const CensusTest* tests = stages[s].tests;
            sum = 0;
            for (int t = 0; t < stages[s].testCount; ++t) sum += tests[t].table[window[tests[t].offset]];
            if (sum < stages[s].threshold) break;
            if (reached) ++reached[s];
        }
        if (s < stageCount) continue;
        passed[found] = k;
        sums[found] = sum;
        ++found;
    }
    return found;
}

[[maybe_unused]] bool vectorSums(const CensusStage* stages, int stageCount) {
    for (int s = 0; s < stageCount; ++s)
        if (stages[s].testCount > kMaxVectorCensusTests) return false;
    return true;
}

[[maybe_unused]] int largestOffset(const CensusStage* stages, int stageCount) {
    int largest = 0;
    for (int s = 0; s < stageCount; ++s)
        for (int t = 0; t < stages[s].testCount; ++t) largest = std::max(largest, stages[s].tests[t].offset);
    return largest;
}

// Windows left in a block from which the later stages go window by window: a quarter of
// it (bench_cascade's BM_CensusRowStages: a block's 36-test stage costs about as much as
// eight to twelve windows taken one by one).
[[maybe_unused]] constexpr int kFewLanes32 = 8;
[[maybe_unused]] constexpr int kFewLanes16 = 4;

// a threshold outside the 16-bit range passes all or nothing, as its clamped value does
[[maybe_unused]] short clampedThreshold(int threshold) {
    return static_cast<short>(
        std::min(std::max(threshold, static_cast<int>(SHRT_MIN)), static_cast<int>(SHRT_MAX)));
}

// the census bytes of windows 0, step, 2 step, ... copied side by side
[[maybe_unused]] void gatherCodes(const unsigned char* p, int step, int n, unsigned char* codes) {
    for (int j = 0; j < n; ++j) codes[j] = p[j * step];
}

// The windows k + lanes[0 .. n) of a block whose first census byte is p, through the stages
// window by window, four at a time: cheaper than whole blocks once few windows are left.
// Appends the passes to passed and sums from found and returns the new count.
[[maybe_unused]] int fewWindows(const unsigned char* p, int step, int k, int* lanes, int n, const CensusStage* stages,
                                int stageCount, int* passed, int* sums, int found, int* reached) {
    int last[32];
    for (int s = 0; s < stageCount && n > 0; ++s) {
        const CensusTest* tests = stages[s].tests;
        const int threshold = stages[s].threshold;
        int kept = 0;
        int c = 0;
        for (; c + 4 <= n; c += 4) {
            int group[4];
            const unsigned char* w[4];
            for (int j = 0; j < 4; ++j) {
                group[j] = lanes[c + j];
                w[j] = p + static_cast<ptrdiff_t>(group[j]) * step;
            }
            int sum[4] = {0, 0, 0, 0};
            for (int t = 0; t < stages[s].testCount; ++t) {
                const LQ::schar* table = tests[t].table;
                const int offset = tests[t].offset;
                for (int j = 0; j < 4; ++j) sum[j] += table[w[j][offset]];
            }
            // written behind the reading position: kept never passes c
            for (int j = 0; j < 4; ++j) {
                lanes[kept] = group[j];
                last[kept] = sum[j];
                kept += sum[j] >= threshold;
            }
        }
        // the rest one by one, in two running sums
        for (; c < n; ++c) {
            const int lane = lanes[c];
            const unsigned char* w = p + static_cast<ptrdiff_t>(lane) * step;
            int even = 0, odd = 0, t = 0;
            for (; t + 1 < stages[s].testCount; t += 2) {
                even += tests[t].table[w[tests[t].offset]];
                odd += tests[t + 1].table[w[tests[t + 1].offset]];
            }
            if (t < stages[s].testCount) even += tests[t].table[w[tests[t].offset]];
            lanes[kept] = lane;
            last[kept] = even + odd;
            kept += even + odd >= threshold;
        }
        n = kept;
        if (reached) reached[s] += n;
    }
    for (int i = 0; i < n; ++i) {
        passed[found] = k + lanes[i];
        sums[found] = last[i];
        ++found;
    }
    return found;
}

// A vector block's windows still in are the set bits of alive, window j at bit j * spacing.

// The stages from the given one on, window by window, for the windows still in; returns found
// with their passes appended.
[[maybe_unused]] int finishFew(uint64_t alive, int spacing, const unsigned char* p, int step, int k,
                               const CensusStage* stages, int stageCount, int* passed, int* sums, int found,
                               int* reached) {
    int lanes[64], n = 0;
    for (; alive; alive &= alive - 1) lanes[n++] = __builtin_ctzll(alive) / spacing;
    return fewWindows(p, step, k, lanes, n, stages, stageCount, passed, sums, found, reached);
}

// The windows still in after the last stage, with their sums sum[at(j)]; returns found with
// them appended.
template <class At>
int appendPasses(uint64_t alive, int spacing, int k, const short* sum, const At& at, int* passed, int* sums,
                 int found) {
    for (; alive; alive &= alive - 1) {
        const int j = __builtin_ctzll(alive) / spacing;
        passed[found] = k + j;
        sums[found] = sum[at(j)];
        ++found;
    }
    return found;
}

// Blocks of width windows from the first, then the last windows in a block that overlaps
// the one before, or the scalar loop where a block would read past end.
// block(k, first, found) takes windows k .. k + width - 1, of which those before k + first
// were done already, and returns found with its passes appended.
template <int width, class Block>
int overBlocks(const unsigned char* row, const unsigned char* end, int step, int count, const CensusStage* stages,
               int stageCount, int* passed, int* sums, int* reached, const Block& block) {
    if (reached) std::fill(reached, reached + stageCount, 0);
    if (!vectorSums(stages, stageCount))
        return stagesScalar(row, step, count, stages, stageCount, passed, sums, reached);
    const ptrdiff_t reach = largestOffset(stages, stageCount);
    const auto fits = [&](int k) { return row + static_cast<ptrdiff_t>(k + width) * step + reach <= end; };
    int found = 0, k = 0;
    for (; k + width <= count && fits(k); k += width) found = block(k, 0, found);
    if (k < count && count >= width && fits(count - width)) return block(count - width, k - (count - width), found);
    const int rest = stagesScalar(row + static_cast<ptrdiff_t>(k) * step, step, count - k, stages, stageCount,
                                  passed + found, sums + found, reached);
    for (int j = found; j < found + rest; ++j) passed[j] += k;
    return found + rest;
}
}  // namespace

int censusStagesPassScalar(const unsigned char* row, const unsigned char*, int step, int count,
                           const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached) {
    if (reached) std::fill(reached, reached + stageCount, 0);
    return stagesScalar(row, step, count, stages, stageCount, passed, sums, reached);
}

int firstStagePassesScalar(const unsigned char* row, const unsigned char* end, int step, int count,
                           const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
    const CensusStage stage{tests, testCount, threshold};
    return censusStagesPassScalar(row, end, step, count, &stage, 1, passed, sums, nullptr);
}

#if defined(LQ_HAVE_NEON)
namespace {
// the 16-bit sums of one stage for the 16 windows whose first census bytes are p, p + step, ...
inline void sums16(const unsigned char* p, int step, const CensusStage& stage, int16x8_t& low, int16x8_t& high) {
    low = high = vdupq_n_s16(0);
    for (int t = 0; t < stage.testCount; ++t) {
        const unsigned char* codeAt = p + stage.tests[t].offset;
        uint8x16_t codes;
        if (step == 1) {
            codes = vld1q_u8(codeAt);
        } else if (step == 2) {
            codes = vld2q_u8(codeAt).val[0];
        } else if (step == 3) {
            codes = vld3q_u8(codeAt).val[0];
        } else {
            unsigned char gathered[16];
            gatherCodes(codeAt, step, 16, gathered);
            codes = vld1q_u8(gathered);
        }
        // four look-ups of 64 entries: each keeps the lanes whose code lies outside its quarter
        const unsigned char* table = reinterpret_cast<const unsigned char*>(stage.tests[t].table);
        uint8x16_t scores = vdupq_n_u8(0);
        for (int q = 0; q < 4; ++q) {
            uint8x16x4_t quarter;
            for (int v = 0; v < 4; ++v) quarter.val[v] = vld1q_u8(table + 64 * q + 16 * v);
            const uint8x16_t index = vsubq_u8(codes, vdupq_n_u8(static_cast<uint8_t>(64 * q)));
            scores = q ? vqtbx4q_u8(scores, quarter, index) : vqtbl4q_u8(quarter, index);
        }
        const int8x16_t s = vreinterpretq_s8_u8(scores);
        low = vaddw_s8(low, vget_low_s8(s));
        high = vaddw_s8(high, vget_high_s8(s));
    }
}
}  // namespace

int censusStagesPassNeon(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached) {
    const auto block = [&](int k, int first, int found) {
        const unsigned char* p = row + static_cast<ptrdiff_t>(k) * step;
        // one bit per window still in, at four times its index
        uint64_t alive = 0x1111111111111111ull & (~0ull << (4 * first));
        int16x8_t low = vdupq_n_s16(0), high = low;
        for (int s = 0; s < stageCount; ++s) {
            sums16(p, step, stages[s], low, high);
            const int16x8_t limit = vdupq_n_s16(clampedThreshold(stages[s].threshold));
            const uint8x16_t pass =
                vcombine_u8(vmovn_u16(vcgeq_s16(low, limit)), vmovn_u16(vcgeq_s16(high, limit)));
            alive &= vget_lane_u64(vreinterpret_u64_u8(vshrn_n_u16(vreinterpretq_u16_u8(pass), 4)), 0);
            if (reached) reached[s] += __builtin_popcountll(alive);
            if (!alive) return found;
            if (s + 1 < stageCount && __builtin_popcountll(alive) <= kFewLanes16)
                return finishFew(alive, 4, p, step, k, stages + s + 1, stageCount - s - 1, passed, sums, found,
                                 reached ? reached + s + 1 : nullptr);
        }
        short sum[16];
        vst1q_s16(sum, low);
        vst1q_s16(sum + 8, high);
        return appendPasses(alive, 4, k, sum, [](int j) { return j; }, passed, sums, found);
    };
    return overBlocks<16>(row, end, step, count, stages, stageCount, passed, sums, reached, block);
}

int firstStagePassesNeon(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
    const CensusStage stage{tests, testCount, threshold};
    return censusStagesPassNeon(row, end, step, count, &stage, 1, passed, sums, nullptr);
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// 32 scores of one table. A shuffle reads 16 entries by the low half of each code and gives
// 0 where the code's top bit is set: rows h and h + 8, read by the code and by the code with
// its top bit flipped, combine by an or. Bits 4, 5 and 6, moved in turn to the top of each
// byte, then choose among the eight pairs.
__attribute__((target("avx2"))) inline __m256i tableRow(const LQ::schar* table, int h, __m256i codes) {
    const __m128i entries = _mm_loadu_si128(reinterpret_cast<const __m128i*>(table + 16 * h));
    return _mm256_shuffle_epi8(_mm256_broadcastsi128_si256(entries), codes);
}

__attribute__((target("avx2"))) inline __m256i lookup256(const LQ::schar* table, __m256i codes) {
    const __m256i flipped = _mm256_xor_si256(codes, _mm256_set1_epi8(static_cast<char>(0x80)));
    __m256i pair[8];
    for (int h = 0; h < 8; ++h)
        pair[h] = _mm256_or_si256(tableRow(table, h, codes), tableRow(table, h + 8, flipped));
    const __m256i bit4 = _mm256_slli_epi16(codes, 3);
    for (int j = 0; j < 4; ++j) pair[j] = _mm256_blendv_epi8(pair[2 * j], pair[2 * j + 1], bit4);
    const __m256i bit5 = _mm256_slli_epi16(codes, 2);
    for (int j = 0; j < 2; ++j) pair[j] = _mm256_blendv_epi8(pair[2 * j], pair[2 * j + 1], bit5);
    const __m256i bit6 = _mm256_slli_epi16(codes, 1);
    return _mm256_blendv_epi8(pair[0], pair[1], bit6);
}

// The census bytes of 32 windows in the order 0-7, 16-23, 8-15, 24-31 by 8-byte quarters:
// the order of a 16-bit pack, which the byte unpacks in sums32 undo. Steps 1 to 3, those of
// the triggers and trackers, by vector loads; others byte by byte.
__attribute__((target("avx2"))) inline __m256i loadCodes(const unsigned char* p, int step) {
    if (step == 1) return _mm256_permute4x64_epi64(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)), 0xD8);
    if (step == 2) {
        const __m256i even = _mm256_set1_epi16(0x00FF);
        const __m256i a = _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)), even);
        const __m256i b =
            _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p + 32)), even);
        return _mm256_packus_epi16(a, b);
    }
    if (step == 3) {
        // every third byte of 48: six from the first 16, five from each of the next two
        const __m128i first = _mm_setr_epi8(0, 3, 6, 9, 12, 15, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1);
        const __m128i second = _mm_setr_epi8(-1, -1, -1, -1, -1, -1, 2, 5, 8, 11, 14, -1, -1, -1, -1, -1);
        const __m128i third = _mm_setr_epi8(-1, -1, -1, -1, -1, -1, -1, -1, -1, -1, -1, 1, 4, 7, 10, 13);
        const auto sixteen = [&](const unsigned char* q) __attribute__((target("avx2"))) {
            const __m128i a = _mm_loadu_si128(reinterpret_cast<const __m128i*>(q));
            const __m128i b = _mm_loadu_si128(reinterpret_cast<const __m128i*>(q + 16));
            const __m128i c = _mm_loadu_si128(reinterpret_cast<const __m128i*>(q + 32));
            return _mm_or_si128(_mm_or_si128(_mm_shuffle_epi8(a, first), _mm_shuffle_epi8(b, second)),
                                _mm_shuffle_epi8(c, third));
        };
        const __m128i low = sixteen(p), high = sixteen(p + 48);
        return _mm256_set_m128i(_mm_unpackhi_epi64(low, high), _mm_unpacklo_epi64(low, high));
    }
    alignas(32) unsigned char gathered[32];
    for (int q = 0; q < 4; ++q)
        gatherCodes(p + static_cast<ptrdiff_t>((q & 1) * 16 + (q >> 1) * 8) * step, step, 8, gathered + 8 * q);
    return _mm256_load_si256(reinterpret_cast<const __m256i*>(gathered));
}

// The 16-bit sums of one stage for the 32 windows whose first census bytes are p, p + step,
// ...: windows 0-15 in low, 16-31 in high. Two tests at a time: their scores interleaved by
// the unpacks, then added in pairs by a multiply-add with ones.
__attribute__((target("avx2"))) inline void sums32(const unsigned char* p, int step, const CensusStage& stage,
                                                   __m256i& low, __m256i& high) {
    const __m256i ones = _mm256_set1_epi8(1);
    const CensusTest* tests = stage.tests;
    low = high = _mm256_setzero_si256();
    int t = 0;
    for (; t < stage.testCount; t += 2) {
        const __m256i a = lookup256(tests[t].table, loadCodes(p + tests[t].offset, step));
        const __m256i b = t + 1 < stage.testCount
                              ? lookup256(tests[t + 1].table, loadCodes(p + tests[t + 1].offset, step))
                              : _mm256_setzero_si256();
        low = _mm256_add_epi16(low, _mm256_maddubs_epi16(ones, _mm256_unpacklo_epi8(a, b)));
        high = _mm256_add_epi16(high, _mm256_maddubs_epi16(ones, _mm256_unpackhi_epi8(a, b)));
    }
}
}  // namespace

__attribute__((target("avx2"))) int censusStagesPassAvx2(const unsigned char* row, const unsigned char* end,
                                                         int step, int count, const CensusStage* stages,
                                                         int stageCount, int* passed, int* sums, int* reached) {
    const auto block = [&](int k, int first, int found) __attribute__((target("avx2"))) {
        const unsigned char* p = row + static_cast<ptrdiff_t>(k) * step;
        unsigned int alive = ~0u << first;
        __m256i low = _mm256_setzero_si256(), high = low;
        for (int s = 0; s < stageCount; ++s) {
            sums32(p, step, stages[s], low, high);
            const __m256i limit = _mm256_set1_epi16(clampedThreshold(stages[s].threshold));
            const __m256i fail =
                _mm256_packs_epi16(_mm256_cmpgt_epi16(limit, low), _mm256_cmpgt_epi16(limit, high));
            alive &= ~static_cast<unsigned int>(_mm256_movemask_epi8(_mm256_permute4x64_epi64(fail, 0xD8)));
            if (reached) reached[s] += __builtin_popcount(alive);
            if (!alive) return found;
            if (s + 1 < stageCount && __builtin_popcount(alive) <= kFewLanes32)
                return finishFew(alive, 1, p, step, k, stages + s + 1, stageCount - s - 1, passed, sums, found,
                                 reached ? reached + s + 1 : nullptr);
        }
        alignas(32) short sum[32];
        _mm256_store_si256(reinterpret_cast<__m256i*>(sum), low);
        _mm256_store_si256(reinterpret_cast<__m256i*>(sum + 16), high);
        return appendPasses(alive, 1, k, sum, [](int j) { return j; }, passed, sums, found);
    };
    return overBlocks<32>(row, end, step, count, stages, stageCount, passed, sums, reached, block);
}

int firstStagePassesAvx2(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
    const CensusStage stage{tests, testCount, threshold};
    return censusStagesPassAvx2(row, end, step, count, &stage, 1, passed, sums, nullptr);
}

#define LQ_TARGET_VBMI __attribute__((target("avx512f,avx512bw,avx512vbmi,bmi2")))
namespace {
// 64 scores of one table: a two-register byte permute reads 128 entries by the low seven
// bits of each code, once for each half of the table; the top bit chooses between them.
LQ_TARGET_VBMI inline __m512i lookup256(const LQ::schar* table, __m512i codes) {
    const __m512i* t = reinterpret_cast<const __m512i*>(table);
    const __m512i low = _mm512_permutex2var_epi8(_mm512_loadu_si512(t), codes, _mm512_loadu_si512(t + 1));
    const __m512i high = _mm512_permutex2var_epi8(_mm512_loadu_si512(t + 2), codes, _mm512_loadu_si512(t + 3));
    return _mm512_mask_blend_epi8(_mm512_movepi8_mask(codes), low, high);
}

// byte j of the 64 windows at step 2 and at step 3, from two registers
struct PermuteIndices {
    alignas(64) unsigned char step2[64];
    alignas(64) unsigned char step3First[64];
    alignas(64) unsigned char step3Second[64];
    PermuteIndices() {
        for (int j = 0; j < 64; ++j) {
            step2[j] = static_cast<unsigned char>(2 * j);
            step3First[j] = static_cast<unsigned char>(3 * j);
            step3Second[j] = static_cast<unsigned char>(3 * j - 64);
        }
    }
};
const PermuteIndices kPermute;

// The census bytes of 64 windows in order: steps 1 to 3 by vector loads and byte permutes,
// others byte by byte.
LQ_TARGET_VBMI inline __m512i loadCodes64(const unsigned char* p, int step) {
    if (step == 1) return _mm512_loadu_si512(p);
    if (step == 2)
        return _mm512_permutex2var_epi8(_mm512_loadu_si512(p), _mm512_load_si512(kPermute.step2),
                                        _mm512_loadu_si512(p + 64));
    if (step == 3) {
        // windows 0-42 lie in the first 128 bytes, 43-63 in the 128 from byte 64
        const __m512i middle = _mm512_loadu_si512(p + 64);
        const __m512i first =
            _mm512_permutex2var_epi8(_mm512_loadu_si512(p), _mm512_load_si512(kPermute.step3First), middle);
        const __m512i second = _mm512_permutex2var_epi8(middle, _mm512_load_si512(kPermute.step3Second),
                                                        _mm512_loadu_si512(p + 128));
        return _mm512_mask_blend_epi8(~0ull << 43, first, second);
    }
    alignas(64) unsigned char gathered[64];
    gatherCodes(p, step, 64, gathered);
    return _mm512_load_si512(gathered);
}

// The 16-bit sums of one stage for the 64 windows whose first census bytes are p, p + step,
// ...: by the unpacks within 16-byte lanes, low holds windows 16 L + 0-7 and high 16 L + 8-15
// of each lane L. Two tests at a time, as in sums32.
LQ_TARGET_VBMI inline void sums64(const unsigned char* p, int step, const CensusStage& stage, __m512i& low,
                                  __m512i& high) {
    const __m512i ones = _mm512_set1_epi8(1);
    const CensusTest* tests = stage.tests;
    low = high = _mm512_setzero_si512();
    for (int t = 0; t < stage.testCount; t += 2) {
        const __m512i a = lookup256(tests[t].table, loadCodes64(p + tests[t].offset, step));
        const __m512i b = t + 1 < stage.testCount
                              ? lookup256(tests[t + 1].table, loadCodes64(p + tests[t + 1].offset, step))
                              : _mm512_setzero_si512();
        low = _mm512_add_epi16(low, _mm512_maddubs_epi16(ones, _mm512_unpacklo_epi8(a, b)));
        high = _mm512_add_epi16(high, _mm512_maddubs_epi16(ones, _mm512_unpackhi_epi8(a, b)));
    }
}

constexpr int kFewLanes64 = 16;
}  // namespace

LQ_TARGET_VBMI int censusStagesPassAvx512(const unsigned char* row, const unsigned char* end, int step, int count,
                                          const CensusStage* stages, int stageCount, int* passed, int* sums,
                                          int* reached) {
    const auto block = [&](int k, int first, int found) LQ_TARGET_VBMI {
        const unsigned char* p = row + static_cast<ptrdiff_t>(k) * step;
        uint64_t alive = ~0ull << first;
        __m512i low = _mm512_setzero_si512(), high = low;
        for (int s = 0; s < stageCount; ++s) {
            sums64(p, step, stages[s], low, high);
            const __m512i limit = _mm512_set1_epi16(clampedThreshold(stages[s].threshold));
            alive &= _pdep_u64(_mm512_cmpge_epi16_mask(low, limit), 0x00FF00FF00FF00FFull) |
                     _pdep_u64(_mm512_cmpge_epi16_mask(high, limit), 0xFF00FF00FF00FF00ull);
            if (reached) reached[s] += __builtin_popcountll(alive);
            if (!alive) return found;
            if (s + 1 < stageCount && __builtin_popcountll(alive) <= kFewLanes64)
                return finishFew(alive, 1, p, step, k, stages + s + 1, stageCount - s - 1, passed, sums, found,
                                 reached ? reached + s + 1 : nullptr);
        }
        alignas(64) short sum[64];
        _mm512_store_si512(sum, low);
        _mm512_store_si512(sum + 32, high);
        // low holds windows 16 L + 0-7 of each lane L, high 16 L + 8-15
        const auto at = [](int j) { return (j & 8 ? 32 : 0) + (j >> 4) * 8 + (j & 7); };
        return appendPasses(alive, 1, k, sum, at, passed, sums, found);
    };
    return overBlocks<64>(row, end, step, count, stages, stageCount, passed, sums, reached, block);
}

int firstStagePassesAvx512(const unsigned char* row, const unsigned char* end, int step, int count,
                           const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
    const CensusStage stage{tests, testCount, threshold};
    return censusStagesPassAvx512(row, end, step, count, &stage, 1, passed, sums, nullptr);
}

bool haveAvx512Census() {
    return __builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512bw") &&
           __builtin_cpu_supports("avx512vbmi") && __builtin_cpu_supports("bmi2");
}
#endif

int censusStagesPass(const unsigned char* row, const unsigned char* end, int step, int count,
                     const CensusStage* stages, int stageCount, int* passed, int* sums, int* reached) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    return censusStagesPassNeon(row, end, step, count, stages, stageCount, passed, sums, reached);
#elif defined(LQ_HAVE_SSSE3)
    static const auto kernel = haveAvx512Census()             ? censusStagesPassAvx512
                               : __builtin_cpu_supports("avx2") ? censusStagesPassAvx2
                                                                : censusStagesPassScalar;
    return kernel(row, end, step, count, stages, stageCount, passed, sums, reached);
#else
    return censusStagesPassScalar(row, end, step, count, stages, stageCount, passed, sums, reached);
#endif
}

int firstStagePasses(const unsigned char* row, const unsigned char* end, int step, int count,
                     const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
    const CensusStage stage{tests, testCount, threshold};
    return censusStagesPass(row, end, step, count, &stage, 1, passed, sums, nullptr);
}

double denseCensusShare() {
#if defined(LQ_HAVE_SSSE3) && !(defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE))
    if (haveAvx512Census()) return 0.2;
#endif
    return 0.3;
}
