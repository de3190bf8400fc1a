#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <random>
#include <vector>

#include "StageKernels.h"
#include "TestImages.h"

namespace {

using Kernel = decltype(&firstStagePassesScalar);

// scalar first, then NEON (SIMDe on x86), AVX2 and AVX-512 where they exist
std::vector<Kernel> kernels() {
    std::vector<Kernel> all{firstStagePassesScalar};
#if defined(LQ_HAVE_NEON)
    all.push_back(firstStagePassesNeon);
#endif
#if defined(LQ_HAVE_SSSE3)
    if (__builtin_cpu_supports("avx2")) all.push_back(firstStagePassesAvx2);
    if (haveAvx512Census()) all.push_back(firstStagePassesAvx512);
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

// The first-stage entry points over one stage (the several-stage test below covers random
// stages, steps and counts): sums at the ends of what 16 bits hold, thresholds inside and
// outside that range, and the 255 / 256 tests around the vector limit.
TEST(StageKernels, FirstStageAtTheSixteenBitLimits) {
    const std::vector<Kernel> variants = kernels();
    std::mt19937 random(5);
    const std::vector<LQ::schar> highest(256, 127), lowest(256, -128);
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

namespace {

using StagesKernel = decltype(&censusStagesPassScalar);

std::vector<StagesKernel> stagesKernels() {
    std::vector<StagesKernel> all{censusStagesPassScalar};
#if defined(LQ_HAVE_NEON)
    all.push_back(censusStagesPassNeon);
#endif
#if defined(LQ_HAVE_SSSE3)
    if (__builtin_cpu_supports("avx2")) all.push_back(censusStagesPassAvx2);
    if (haveAvx512Census()) all.push_back(censusStagesPassAvx512);
#endif
    return all;
}

struct StagesResult {
    std::vector<int> passed, sums, reached;
    bool operator==(const StagesResult& o) const {
        return passed == o.passed && sums == o.sums && reached == o.reached;
    }
};

// A window passes when the sum of every stage's tests reaches that stage's threshold; it
// keeps the last stage's sum.
StagesResult fromDefinition(const std::vector<unsigned char>& row, int step, int count,
                            const std::vector<std::vector<CensusTest>>& stages, const std::vector<int>& thresholds) {
    StagesResult r{{}, {}, std::vector<int>(stages.size(), 0)};
    for (int k = 0; k < count; ++k) {
        bool in = true;
        int sum = 0;
        for (size_t s = 0; s < stages.size() && in; ++s) {
            sum = 0;
            for (const CensusTest& t : stages[s]) sum += t.table[row[k * step + t.offset]];
            in = sum >= thresholds[s];
            r.reached[s] += in;
        }
        if (!in) continue;
        r.passed.push_back(k);
        r.sums.push_back(sum);
    }
    return r;
}

StagesResult runStages(StagesKernel kernel, const std::vector<unsigned char>& row, int step, int count,
                       const std::vector<std::vector<CensusTest>>& stages, const std::vector<int>& thresholds) {
    std::vector<CensusStage> packed;
    for (size_t s = 0; s < stages.size(); ++s)
        packed.push_back(CensusStage{stages[s].data(), static_cast<int>(stages[s].size()), thresholds[s]});
    StagesResult r{std::vector<int>(count, -1), std::vector<int>(count, -1),
                   std::vector<int>(stages.size(), -1)};
    const int found = kernel(row.data(), row.data() + row.size(), step, count, packed.data(),
                             static_cast<int>(packed.size()), r.passed.data(), r.sums.data(), r.reached.data());
    r.passed.resize(found);
    r.sums.resize(found);
    return r;
}

}  // namespace

// Every form of the several-stage kernel finds what the definition finds: the same windows,
// last-stage sums and counts per stage, over 1 to 5 stages of 0 to 40 tests, steps 1 to 4,
// counts that leave partial blocks, rows that end with the last byte read, thresholds that
// let few, half or most windows through, and each stage refusing all in turn so blocks end at
// every stage. Stages over 255 tests, whose sums would wrap in 16 bits, go the scalar way.
TEST(StageKernels, SeveralStagesEqualDefinition) {
    const std::vector<StagesKernel> variants = stagesKernels();
    std::mt19937 random(17);
    std::vector<std::vector<LQ::schar>> tables(200, std::vector<LQ::schar>(256));
    for (auto& table : tables)
        for (auto& v : table) v = static_cast<LQ::schar>(random() % 256);
    int cases = 0, partial = 0;
    std::vector<int> endAt(5, 0);
    for (int step = 1; step <= 4; ++step)
        for (int count = 1; count <= 150; count += 1 + count / 6)
            for (int stageCount : {1, 2, 3, 5}) {
                std::vector<std::vector<CensusTest>> stages(stageCount);
                int reach = 0;
                for (auto& stage : stages) {
                    stage.resize(random() % 41);
                    for (CensusTest& t : stage) {
                        t.table = tables[random() % tables.size()].data();
                        t.offset = static_cast<int>(random() % 80);
                        reach = std::max(reach, t.offset);
                    }
                }
                const std::vector<unsigned char> row = randomBytes((count - 1) * step + reach + 1, random);
                // per stage, the sum that a share of the windows reaching it passes
                std::vector<int> thresholds(stageCount, INT_MIN);
                for (int s = 0; s < stageCount; ++s) {
                    std::vector<int> sums;
                    for (int k = 0; k < count; ++k) {
                        int sum = 0;
                        for (const CensusTest& t : stages[s]) sum += t.table[row[k * step + t.offset]];
                        sums.push_back(sum);
                    }
                    const double share = std::vector<double>{0.1, 0.5, 0.9}[random() % 3];
                    const size_t at = std::min(sums.size() - 1, static_cast<size_t>(sums.size() * (1 - share)));
                    std::nth_element(sums.begin(), sums.begin() + at, sums.end());
                    thresholds[s] = sums[at];
                }
                std::vector<std::vector<int>> settings{thresholds};
                for (int s = 0; s < stageCount; ++s) {
                    settings.push_back(thresholds);
                    settings.back()[s] = INT_MAX;
                }
                for (const std::vector<int>& setting : settings) {
                    const StagesResult expected = fromDefinition(row, step, count, stages, setting);
                    ++cases;
                    partial += !expected.passed.empty() && static_cast<int>(expected.passed.size()) < count;
                    for (int s = 0; s < stageCount; ++s) endAt[s] += expected.reached[s] == 0;
                    for (size_t v = 0; v < variants.size(); ++v)
                        ASSERT_TRUE(runStages(variants[v], row, step, count, stages, setting) == expected)
                            << "variant " << v << " step " << step << " count " << count << " stages "
                            << stageCount;
                }
            }
    EXPECT_GT(cases, 1000);
    EXPECT_GT(partial, 150);
    for (int s = 0; s < 5; ++s) EXPECT_GT(endAt[s], 50) << s;

    // A middle stage of 255 top scores sums to 32385, the most 16 bits hold from 255 tests;
    // one of 300 sums to 38100, which only the scalar loop gets right.
    const std::vector<LQ::schar> highest(256, 127);
    std::vector<LQ::schar> half(256);
    for (int i = 0; i < 256; ++i) half[i] = static_cast<LQ::schar>(i % 2 ? 5 : -5);
    const std::vector<unsigned char> row = randomBytes(2 * 70 + 40, random);
    for (int testCount : {255, 300}) {
        std::vector<std::vector<CensusTest>> stages{{{half.data(), 3}, {half.data(), 17}},
                                                    std::vector<CensusTest>(testCount, {highest.data(), 0}),
                                                    {{half.data(), 8}}};
        for (int t = 0; t < testCount; ++t) stages[1][t].offset = t % 40;
        const int total = testCount * 127;
        for (int threshold : {total, total + 1, 32767, 32768}) {
            const std::vector<int> setting{-10, threshold, -5};
            const StagesResult expected = fromDefinition(row, 2, 70, stages, setting);
            ASSERT_EQ(expected.reached[1] == expected.reached[0], threshold <= total);
            ASSERT_GT(expected.reached[0], 0);
            for (size_t v = 0; v < variants.size(); ++v)
                EXPECT_TRUE(runStages(variants[v], row, 2, 70, stages, setting) == expected)
                    << "variant " << v << " tests " << testCount << " threshold " << threshold;
        }
    }
}
