#include "StageKernels.h"

#include <algorithm>
#include <climits>

int firstStagePassesScalar(const unsigned char* row, const unsigned char* end, int step, int count,
                           const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
    int found = 0;
    for (int k = 0; k < count; ++k) {
        const unsigned char* window = row + static_cast<ptrdiff_t>(k) * step;
        int sum = 0;
        for (int t = 0; t < testCount; ++t) sum += tests[t].table[window[tests[t].offset]];
        if (sum >= threshold) {
            passed[found] = k;
            sums[found] = sum;
            ++found;
        }
    }
    return found;
}

namespace {
// The vector sums are 16-bit: 255 scores of -128 .. 127 stay inside.
constexpr int kMaxVectorTests = 255;

bool vectorSums(const CensusTest* tests, int testCount) {
    return testCount > 0 && testCount <= kMaxVectorTests;
}

int largestOffset(const CensusTest* tests, int testCount) {
    int largest = 0;
    for (int t = 0; t < testCount; ++t) largest = std::max(largest, tests[t].offset);
    return largest;
}

// a threshold outside the 16-bit range passes all or nothing, as its clamped value does
short clampedThreshold(int threshold) {
    return static_cast<short>(
        std::min(std::max(threshold, static_cast<int>(SHRT_MIN)), static_cast<int>(SHRT_MAX)));
}

// the census bytes of windows 0, step, 2 step, ... copied side by side
void gatherCodes(const unsigned char* p, int step, int n, unsigned char* codes) {
    for (int j = 0; j < n; ++j) codes[j] = p[j * step];
}
}  // namespace

#if defined(LQ_HAVE_NEON)
int firstStagePassesNeon(const unsigned char* row, const unsigned char* end, int step, int count,
                         const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
    if (!vectorSums(tests, testCount))
        return firstStagePassesScalar(row, end, step, count, tests, testCount, threshold, passed, sums);
    const ptrdiff_t reach = largestOffset(tests, testCount);
    const int16x8_t limit = vdupq_n_s16(clampedThreshold(threshold));
    int found = 0;
    // windows k .. k + 15, of which those before first were done already
    const auto block = [&](int k, int first) {
        int16x8_t low = vdupq_n_s16(0), high = vdupq_n_s16(0);
        for (int t = 0; t < testCount; ++t) {
            const unsigned char* p = row + static_cast<ptrdiff_t>(k) * step + tests[t].offset;
            uint8x16_t codes;
            if (step == 1) {
                codes = vld1q_u8(p);
            } else if (step == 2) {
                codes = vld2q_u8(p).val[0];
            } else {
                unsigned char gathered[16];
                gatherCodes(p, step, 16, gathered);
                codes = vld1q_u8(gathered);
            }
            // four look-ups of 64 entries: each keeps the lanes whose code lies outside its quarter
            const unsigned char* table = reinterpret_cast<const unsigned char*>(tests[t].table);
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
        const uint8x16_t pass =
            vcombine_u8(vmovn_u16(vcgeq_s16(low, limit)), vmovn_u16(vcgeq_s16(high, limit)));
        // one bit per window, at four times its index
        uint64_t bits = vget_lane_u64(vreinterpret_u64_u8(vshrn_n_u16(vreinterpretq_u16_u8(pass), 4)), 0) &
                        0x1111111111111111ull & (~0ull << (4 * first));
        if (!bits) return;
        short sum[16];
        vst1q_s16(sum, low);
        vst1q_s16(sum + 8, high);
        for (; bits; bits &= bits - 1) {
            const int j = __builtin_ctzll(bits) >> 2;
            passed[found] = k + j;
            sums[found] = sum[j];
            ++found;
        }
    };
    const auto fits = [&](int k) { return row + static_cast<ptrdiff_t>(k + 16) * step + reach <= end; };
    int k = 0;
    for (; k + 16 <= count && fits(k); k += 16) block(k, 0);
    // the last windows of a row in a block that overlaps the one before
    if (k < count && count >= 16 && fits(count - 16)) {
        block(count - 16, k - (count - 16));
        return found;
    }
    const int rest = firstStagePassesScalar(row + static_cast<ptrdiff_t>(k) * step, end, step, count - k,
                                            tests, testCount, threshold, passed + found, sums + found);
    for (int j = found; j < found + rest; ++j) passed[j] += k;
    return found + rest;
}
#endif

#if defined(LQ_HAVE_SSSE3)
namespace {
// 32 scores of one table: sixteen shuffles of its sixteen rows by the low half of each code,
// then the high half's bits, moved in turn to the top of each byte, choose among them.
__attribute__((target("avx2"))) inline __m256i tableRow(const LQ::schar* table, int h, __m256i low) {
    const __m128i entries = _mm_loadu_si128(reinterpret_cast<const __m128i*>(table + 16 * h));
    return _mm256_shuffle_epi8(_mm256_broadcastsi128_si256(entries), low);
}

__attribute__((target("avx2"))) inline __m256i lookup256(const LQ::schar* table, __m256i codes) {
    const __m256i low = _mm256_and_si256(codes, _mm256_set1_epi8(0x0F));
    __m256i pair[8];
    const __m256i bit4 = _mm256_slli_epi16(codes, 3);
    for (int j = 0; j < 8; ++j)
        pair[j] = _mm256_blendv_epi8(tableRow(table, 2 * j, low), tableRow(table, 2 * j + 1, low), bit4);
    const __m256i bit5 = _mm256_slli_epi16(codes, 2);
    for (int j = 0; j < 4; ++j) pair[j] = _mm256_blendv_epi8(pair[2 * j], pair[2 * j + 1], bit5);
    const __m256i bit6 = _mm256_slli_epi16(codes, 1);
    for (int j = 0; j < 2; ++j) pair[j] = _mm256_blendv_epi8(pair[2 * j], pair[2 * j + 1], bit6);
    return _mm256_blendv_epi8(pair[0], pair[1], codes);
}

__attribute__((target("avx2"))) inline __m256i loadCodes(const unsigned char* p, int step) {
    if (step == 1) return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(p));
    if (step == 2) {
        // the even bytes of 64; the pack works per 128-bit half, the permute restores the order
        const __m256i even = _mm256_set1_epi16(0x00FF);
        const __m256i a = _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p)), even);
        const __m256i b =
            _mm256_and_si256(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(p + 32)), even);
        return _mm256_permute4x64_epi64(_mm256_packus_epi16(a, b), 0xD8);
    }
    alignas(32) unsigned char gathered[32];
    gatherCodes(p, step, 32, gathered);
    return _mm256_load_si256(reinterpret_cast<const __m256i*>(gathered));
}
}  // namespace

__attribute__((target("avx2"))) int firstStagePassesAvx2(const unsigned char* row, const unsigned char* end,
                                                         int step, int count, const CensusTest* tests,
                                                         int testCount, int threshold, int* passed,
                                                         int* sums) {
    if (!vectorSums(tests, testCount))
        return firstStagePassesScalar(row, end, step, count, tests, testCount, threshold, passed, sums);
    const ptrdiff_t reach = largestOffset(tests, testCount);
    const __m256i limit = _mm256_set1_epi16(clampedThreshold(threshold));
    int found = 0;
    // windows k .. k + 31, of which those before first were done already
    const auto block = [&](int k, int first) __attribute__((target("avx2"))) {
        __m256i low = _mm256_setzero_si256(), high = _mm256_setzero_si256();
        for (int t = 0; t < testCount; ++t) {
            const __m256i scores = lookup256(
                tests[t].table, loadCodes(row + static_cast<ptrdiff_t>(k) * step + tests[t].offset, step));
            low = _mm256_add_epi16(low, _mm256_cvtepi8_epi16(_mm256_castsi256_si128(scores)));
            high = _mm256_add_epi16(high, _mm256_cvtepi8_epi16(_mm256_extracti128_si256(scores, 1)));
        }
        const __m256i fail =
            _mm256_packs_epi16(_mm256_cmpgt_epi16(limit, low), _mm256_cmpgt_epi16(limit, high));
        unsigned int bits =
            ~static_cast<unsigned int>(_mm256_movemask_epi8(_mm256_permute4x64_epi64(fail, 0xD8)));
        bits &= ~0u << first;
        if (!bits) return;
        alignas(32) short sum[32];
        _mm256_store_si256(reinterpret_cast<__m256i*>(sum), low);
        _mm256_store_si256(reinterpret_cast<__m256i*>(sum + 16), high);
        for (; bits; bits &= bits - 1) {
            const int j = __builtin_ctz(bits);
            passed[found] = k + j;
            sums[found] = sum[j];
            ++found;
        }
    };
    const auto fits = [&](int k) { return row + static_cast<ptrdiff_t>(k + 32) * step + reach <= end; };
    int k = 0;
    for (; k + 32 <= count && fits(k); k += 32) block(k, 0);
    // the last windows of a row in a block that overlaps the one before
    if (k < count && count >= 32 && fits(count - 32)) {
        block(count - 32, k - (count - 32));
        return found;
    }
    const int rest = firstStagePassesScalar(row + static_cast<ptrdiff_t>(k) * step, end, step, count - k,
                                            tests, testCount, threshold, passed + found, sums + found);
    for (int j = found; j < found + rest; ++j) passed[j] += k;
    return found + rest;
}
#endif

int firstStagePasses(const unsigned char* row, const unsigned char* end, int step, int count,
                     const CensusTest* tests, int testCount, int threshold, int* passed, int* sums) {
#if defined(LQ_HAVE_NEON) && !defined(LQ_NEON_SIMDE)
    return firstStagePassesNeon(row, end, step, count, tests, testCount, threshold, passed, sums);
#elif defined(LQ_HAVE_SSSE3)
    static const auto kernel = __builtin_cpu_supports("avx2") ? firstStagePassesAvx2 : firstStagePassesScalar;
    return kernel(row, end, step, count, tests, testCount, threshold, passed, sums);
#else
    return firstStagePassesScalar(row, end, step, count, tests, testCount, threshold, passed, sums);
#endif
}
