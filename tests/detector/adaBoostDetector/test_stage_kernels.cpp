#include <gtest/gtest.h>

#include <climits>
#include <random>
#include <vector>

#include "StageKernels.h"
#include "TestImages.h"

namespace {

using Kernel = decltype(&firstStagePassesScalar);

// scalar first, then NEON (SIMDe on x86) and AVX2 where they exist
std::vector<Kernel> kernels() {
    std::vector<Kernel> all{firstStagePassesScalar};
#if defined(LQ_HAVE_NEON)
    all.push_back(firstStagePassesNeon);
#endif
#if defined(LQ_HAVE_SSSE3)
    if (__builtin_cpu_supports("avx2")) all.push_back(firstStagePassesAvx2);
#endif
    return all;
}

struct Result {
    std::vector<int> passed, sums;
    bool operator==(const Result& other) const { return passed == other.passed && sums == other.sums; }
};

Result run(Kernel kernel, const std::vector<unsigned char>& row, int step, int count,
           const std::vector<CensusTest>& tests, int threshold) {
    Result r{std::vector<int>(count, -1), std::vector<int>(count, -1)};
    const int found = kernel(row.data(), row.data() + row.size(), step, count, tests.data(),
                             static_cast<int>(tests.size()), threshold, r.passed.data(), r.sums.data());
    r.passed.resize(found);
    r.sums.resize(found);
    return r;
}

}  // namespace

// Every variant passes the same windows with the same sums: odd counts (vector blocks and
// scalar tails), steps 1 to 3, census rows that end right after the last byte read, random
// and extreme tables, thresholds inside and outside the 16-bit range of the vector sums, and
// the 255 / 256 tests around the vector limit.
TEST(StageKernels, FirstStageVariantsEqualScalar) {
    const std::vector<Kernel> variants = kernels();
    std::mt19937 random(5);
    std::vector<std::vector<LQ::schar>> tables(300, std::vector<LQ::schar>(256));
    for (auto& table : tables)
        for (auto& v : table) v = static_cast<LQ::schar>(random() % 256);
    std::vector<LQ::schar> highest(256, 127), lowest(256, -128);
    int nonTrivial = 0;
    for (int step = 1; step <= 3; ++step)
        for (int count = 1; count <= 140; count += 1 + count / 8)
            for (int testCount : {1, 3, 7, 30}) {
                std::vector<CensusTest> tests(testCount);
                int reach = 0;
                for (CensusTest& t : tests) {
                    t.table = tables[random() % tables.size()].data();
                    t.offset = static_cast<int>(random() % 90);
                    reach = std::max(reach, t.offset);
                }
                // the row buffer ends with the last byte a window reads
                const std::vector<unsigned char> row = randomBytes((count - 1) * step + reach + 1, random);
                std::vector<int> thresholds{INT_MIN, INT_MAX, 0, static_cast<int>(random() % 200) - 100};
                const Result all = run(firstStagePassesScalar, row, step, count, tests, INT_MIN);
                ASSERT_EQ(static_cast<int>(all.passed.size()), count);
                // the median sum: about half of the windows pass
                std::vector<int> sorted = all.sums;
                std::nth_element(sorted.begin(), sorted.begin() + count / 2, sorted.end());
                thresholds.push_back(sorted[count / 2]);
                for (int threshold : thresholds) {
                    const Result expected = run(firstStagePassesScalar, row, step, count, tests, threshold);
                    nonTrivial +=
                        !expected.passed.empty() && static_cast<int>(expected.passed.size()) < count;
                    for (size_t v = 1; v < variants.size(); ++v)
                        ASSERT_TRUE(run(variants[v], row, step, count, tests, threshold) == expected)
                            << "variant " << v << " step " << step << " count " << count << " tests "
                            << testCount << " threshold " << threshold;
                }
            }
    EXPECT_GT(nonTrivial, 300);

    // sums at the ends of what 16 bits hold, and beyond where the vector paths step aside
    const std::vector<unsigned char> row = randomBytes(2 * 70 + 40, random);
    for (const std::vector<LQ::schar>* table : {&highest, &lowest})
        for (int testCount : {255, 256}) {
            std::vector<CensusTest> tests(testCount, CensusTest{table->data(), 0});
            for (int t = 0; t < testCount; ++t) tests[t].offset = t % 40;
            const int total = testCount * (*table)[0];
            for (int threshold : {total, total + 1, 32767, 32768, -32768, -32769, INT_MIN, INT_MAX}) {
                const Result expected = run(firstStagePassesScalar, row, 2, 70, tests, threshold);
                EXPECT_EQ(expected.passed.size(), threshold <= total ? 70u : 0u);
                for (size_t v = 1; v < variants.size(); ++v)
                    EXPECT_TRUE(run(variants[v], row, 2, 70, tests, threshold) == expected)
                        << "variant " << v << " tests " << testCount << " threshold " << threshold;
            }
        }
}
