#include <gtest/gtest.h>

#include <atomic>
#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <new>
#include <random>
#include <sstream>

#include "ConvolutionKernels.h"
#include "ConvolutionLayer.h"
#include "DataLayer.h"
#include "DeConvolutionLayer.h"
#include "InnerProductLayer.h"
#include "LocallyConnectedLayer.h"
#include "LogCapture.h"

// Every allocation of this test program is counted, so a test can tell that a forward
// pass allocates nothing once its scratch exists.
namespace {
std::atomic<long> allocationCount{0};
}
void* operator new(std::size_t size) {
    ++allocationCount;
    if (void* p = std::malloc(size ? size : 1)) return p;
    throw std::bad_alloc();
}
// kept out of line so that the compiler doesn't pair an inlined free with a new expression
__attribute__((noinline)) void operator delete(void* p) noexcept {
    std::free(p);
}
__attribute__((noinline)) void operator delete(void* p, std::size_t) noexcept {
    std::free(p);
}

namespace {
// the bottom only holds the input: it is never run
const Blob& run(BaseLayer& layer, const Blob& input) {
    if (layer.getNumBottomLayers() == 0)
        layer.addBottomLayer(LQ::SharedPtr<BaseLayer>(new DataLayer("data")));
    layer.getBottomLayer(0)->setBlob(input);
    layer.forward();
    return layer.getBlob();
}

Blob make(int n, int c, int h, int w, const std::vector<float>& values) {
    Blob blob(n, c, h, w);
    EXPECT_EQ(blob.size(), static_cast<int>(values.size()));
    std::copy(values.begin(), values.end(), blob.data());
    return blob;
}

Blob random(int n, int c, int h, int w, std::mt19937& rng) {
    std::uniform_real_distribution<float> value(-1.f, 1.f);
    Blob blob(n, c, h, w);
    for (int i = 0; i < blob.size(); ++i) blob.data()[i] = value(rng);
    return blob;
}

std::vector<float> values(const Blob& blob) { return blob; }

using Path = ConvolutionLayer::Path;

// the layer's parameters in a given file version, then a marker that must be read back next
template <class Layer>
std::string save(const Layer& layer, const std::string& version) {
    std::ostringstream out;
    LQ::ArchiveO archive(out);
    archive.setVersion(version);
    layer.serialize(archive);
    archive & int32_t(0x600D);
    return out.str();
}

template <class Layer>
void load(Layer& layer, const std::string& bytes, const std::string& version) {
    std::istringstream in(bytes);
    LQ::ArchiveI archive(in);
    archive.setVersion(version);
    layer.serialize(archive);
    int32_t marker = 0;
    archive & marker;
    EXPECT_EQ(marker, 0x600D) << "the layer read a different number of bytes than it wrote";
}

// the generated source of a layer or a blob
template <class T>
std::string source(T& object, const std::string& name) {
    std::ostringstream out;
    object.saveToCpp(out, name);
    return out.str();
}

// read back from the current file form into a default layer, and cloned: both equal the
// layer, the clone without bottoms or output
template <class Layer>
void expectFileAndClone(Layer& layer) {
    Layer loaded(layer.name());
    load(loaded, save(layer, "Version 8"), "Version 8");
    EXPECT_TRUE(loaded == layer);
    LQ::SharedPtr<BaseLayer> clone = layer.clone();
    EXPECT_TRUE(*clone == layer);
    EXPECT_EQ(clone->name(), layer.name());
    EXPECT_EQ(clone->getNumBottomLayers(), 0);
    EXPECT_EQ(clone->getBlob().size(), 0);
}
}  // namespace

// Kernels on small cases worked out by hand: the window arithmetic of both filter forms,
// the running order of the dot product and the clamp's treatment of -0 and NaN.
TEST(ConvolutionKernels, ByHand) {
    // 5 x 4 plane holding 0 .. 19, kernel [[1, 2], [3, 4]]
    std::vector<float> src(20);
    for (int i = 0; i < 20; ++i) src[i] = static_cast<float>(i);
    const float kernel[4] = {1, 2, 3, 4};
    // output (x, y) = 10 * (5 * y + x) + 1 * 0 + 2 * 1 + 3 * 5 + 4 * 6 at the window's corner;
    // stride 2: (5 - 2) / 2 + 1 = 2 columns, (4 - 2) / 2 + 1 = 2 rows; the last column is dropped
    std::vector<float> dst(5, -1.f);
    LQ::applyFilter(src.data(), dst.data(), 5, 4, kernel, 2, 2, 0.f, 2);
    EXPECT_EQ(dst, (std::vector<float>{41, 61, 141, 161, -1}));
    // explicit steps: a 3 x 3 region at (1, 1) of the 5-wide plane into rows 4 apart
    dst.assign(8, -1.f);
    LQ::applyFilter(src.data() + 6, dst.data(), 3, 3, kernel, 2, 2, 0.f, 5, 4);
    EXPECT_EQ(dst, (std::vector<float>{101, 111, -1, -1, 151, 161, -1, -1}));

    const float big[3] = {1e8f, 1.f, -1e8f}, ones[3] = {1, 1, 1};
    EXPECT_EQ(LQ::dotProduct(big, ones, 3, 0.f), 0.f);  // 1e8 + 1 rounds back to 1e8 before the -1e8
    EXPECT_EQ(LQ::dotProduct(big, ones, 0, 2.5f), 2.5f);

    // 37 values: two groups of 16 and a scalar tail
    std::vector<float> p(37), expected(37);
    for (int i = 0; i < 37; ++i) p[i] = (i % 3 == 0) ? -0.5f * i : 0.25f * i;
    p[5] = -0.f;
    p[20] = p[36] = std::numeric_limits<float>::quiet_NaN();
    for (int i = 0; i < 37; ++i) expected[i] = p[i] < 0.f ? 0.f : p[i];
    LQ::maxVector(p.data(), 37, 0.f);
    EXPECT_EQ(std::memcmp(p.data(), expected.data(), sizeof(float) * 37), 0);
    EXPECT_TRUE(std::signbit(p[5]));
}

// The vector form of the panel product gives the scalar bits on random matrices of odd
// shapes, and writes nothing outside its rows and columns.
TEST(ConvolutionKernels, PanelProduct) {
    using Product = void (*)(const float*, const float*, int, int, const float*, int, int, float*, int);
    std::vector<Product> forms;
#if defined(LQ_HAVE_NEON)
    forms.push_back(LQ::multiplyPanelsNeon);
#endif
#if defined(__x86_64__) || defined(__i386__)
    if (__builtin_cpu_supports("avx2")) forms.push_back(LQ::multiplyPanelsAvx2);
#endif
    if (forms.empty()) GTEST_SKIP() << "no vector form in this build";
    std::mt19937 rng(11);
    std::vector<float> packed;
    for (Product form : forms)
        for (int rows : {1, 3, 4, 6, 9})
            for (int depth : {1, 7, 90})
                for (int count : {1, 3, 4, 5, 8, 13, 21, 37}) {
                    const Blob w = random(1, 1, rows, depth, rng), b = random(1, 1, 1, rows, rng);
                    const int columnStride = count + 3, outStride = count + 2;
                    const Blob m = random(1, 1, depth, columnStride, rng);
                    LQ::packPanels(w.data(), rows, depth, packed);
                    std::vector<float> scalar(rows * outStride + 1, 7.f), vector(scalar);
                    LQ::multiplyPanelsScalar(packed.data(), b.data(), rows, depth, m.data(), columnStride, count,
                                             scalar.data(), outStride);
                    form(packed.data(), b.data(), rows, depth, m.data(), columnStride, count, vector.data(), outStride);
                    ASSERT_EQ(std::memcmp(scalar.data(), vector.data(), sizeof(float) * scalar.size()), 0)
                        << rows << " x " << depth << " x " << count;
                    EXPECT_EQ(vector[outStride - 1], 7.f);
                    EXPECT_EQ(vector.back(), 7.f);
                }
}

// The vector forms of the in-place product give the scalar bits on random inputs of odd
// shapes, read through scattered tap offsets, and write nothing outside their rows and
// columns; with the taps evenly spaced the scalar form is the matrix product, bit for bit.
// The dot products taken several at a time keep the order of one taken alone.
TEST(ConvolutionKernels, TapProduct) {
    using Product =
        void (*)(const float*, const float*, int, int, const float*, const int*, int, float*, int);
    std::vector<Product> forms;
#if defined(LQ_HAVE_NEON)
    forms.push_back(LQ::convolveTapsNeon);
#endif
#if defined(__x86_64__) || defined(__i386__)
    if (__builtin_cpu_supports("avx2")) forms.push_back(LQ::convolveTapsAvx2);
#endif
    std::mt19937 rng(12);
    std::uniform_int_distribution<int> pick(0, 1 << 20);
    std::vector<float> groups, panels;
    for (int rows = 1; rows <= 13; ++rows)
        for (int depth : {1, 9, 90})
            for (int count : {1, 3, 4, 5, 7, 8, 9, 13, 16, 17, 20, 24, 37}) {
                const Blob w = random(1, 1, rows, depth, rng), b = random(1, 1, 1, rows, rng);
                const int span = count + 50, outStride = count + 2;
                const Blob planes = random(1, 1, 1, span, rng);
                std::vector<int> offsets(depth);
                for (int& offset : offsets) offset = pick(rng) % (span - count + 1);
                LQ::packTapGroups(w.data(), rows, depth, groups);
                std::vector<float> scalar(rows * outStride + 1, 7.f);
                LQ::convolveTapsScalar(groups.data(), b.data(), rows, depth, planes.data(), offsets.data(),
                                       count, scalar.data(), outStride);
                for (Product form : forms) {
                    std::vector<float> vector(rows * outStride + 1, 7.f);
                    form(groups.data(), b.data(), rows, depth, planes.data(), offsets.data(), count,
                         vector.data(), outStride);
                    ASSERT_EQ(std::memcmp(scalar.data(), vector.data(), sizeof(float) * scalar.size()), 0)
                        << rows << " x " << depth << " x " << count;
                }
                for (int r = 0; r < rows; ++r) ASSERT_EQ(scalar[r * outStride + count], 7.f);
                ASSERT_EQ(scalar.back(), 7.f);

                // taps one row of a matrix apart
                const Blob m = random(1, 1, depth, count, rng);
                for (int k = 0; k < depth; ++k) offsets[k] = k * count;
                LQ::convolveTapsScalar(groups.data(), b.data(), rows, depth, m.data(), offsets.data(), count,
                                       scalar.data(), outStride);
                LQ::packPanels(w.data(), rows, depth, panels);
                std::vector<float> matrix(scalar.size(), 7.f);
                LQ::multiplyPanelsScalar(panels.data(), b.data(), rows, depth, m.data(), count, count,
                                         matrix.data(), outStride);
                ASSERT_EQ(std::memcmp(scalar.data(), matrix.data(), sizeof(float) * scalar.size()), 0);
            }

    // terms from 1e-6 to 1e6, so that any change of order shows in the low bits
    std::uniform_real_distribution<float> exponent(-6.f, 6.f);
    std::vector<float> a(9 * 61), x(61), init(9), out(9);
    for (float& v : a) v = std::pow(10.f, exponent(rng)) * (pick(rng) % 2 ? 1.f : -1.f);
    for (float& v : x) v = std::pow(10.f, exponent(rng));
    for (float& v : init) v = std::pow(10.f, exponent(rng));
    for (int rows = 1; rows <= 9; ++rows)
        for (int n : {0, 1, 7, 61}) {
            LQ::dotProducts(a.data(), rows, 61, x.data(), n, init.data(), out.data());
            for (int r = 0; r < rows; ++r)
                ASSERT_EQ(out[r], LQ::dotProduct(a.data() + r * 61, x.data(), n, init[r]))
                    << rows << " " << n;
        }
}

// Outputs worked out by hand: two channels summed, the window dropped at stride 2, the
// zero border, and the clamp after the bias. Both kernel paths must give these values.
TEST(ConvolutionLayer, ByHand) {
    // channel 0 holds 4y + x + 1, channel 1 holds x
    const Blob input =
        make(1, 2, 3, 4, {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 0, 1, 2, 3, 0, 1, 2, 3, 0, 1, 2, 3});
    // filter 0: a(y, x) - a(y + 1, x + 1) = -5 on channel 0, 2x + 2(x + 1) on channel 1, bias 0.5
    // filter 1: 2 a(y + 1, x + 1) = 8y + 2x + 12 on channel 0, nothing on channel 1, bias -1
    const Blob filter = make(2, 2, 2, 2, {1, 0, 0, -1, 1, 1, 1, 1, 0, 0, 0, 2, 0, 0, 0, 0});
    for (Path path : {Path::Direct, Path::SlidingWindow}) {
        const auto on = [path](ConvolutionLayer& layer) -> ConvolutionLayer& {
            layer.setPath(path);
            return layer;
        };
        ConvolutionLayer layer(filter, make(1, 1, 1, 2, {0.5f, -1}), "conv", 1, 0);
        const Blob& out = run(on(layer), input);
        EXPECT_EQ(out.shape(), "1 x 2 x 3 x 2");
        EXPECT_EQ(values(out),
                  (std::vector<float>{-2.5f, 1.5f, 5.5f, -2.5f, 1.5f, 5.5f, 11, 13, 15, 19, 21, 23}));

        // all ones through a 3 x 3 of ones with a border of 1: the count of cells inside
        const Blob zero = make(1, 1, 1, 1, {0});
        ConvolutionLayer bordered(make(1, 1, 3, 3, std::vector<float>(9, 1.f)), zero, "b", 1, 1);
        EXPECT_EQ(values(run(on(bordered), make(1, 1, 2, 5, std::vector<float>(10, 1.f)))),
                  (std::vector<float>{4, 6, 6, 6, 4, 4, 6, 6, 6, 4}));

        ConvolutionLayer strided(make(1, 1, 3, 3, std::vector<float>(9, 0.f)), zero, "s", 2, 0);
        EXPECT_EQ(run(on(strided), make(1, 1, 60, 35, std::vector<float>(2100, 0.f))).shape(),
                  "1 x 1 x 17 x 29");

        ConvolutionLayer clamped(make(1, 1, 1, 1, {1}), make(1, 1, 1, 1, {-2}), "r", 1, 0);
        EXPECT_EQ(values(run(on(clamped), make(1, 1, 1, 2, {1, 3}))), (std::vector<float>{-1, 1}));
        clamped.setDoRelu(true);
        EXPECT_EQ(values(run(clamped, make(1, 1, 1, 2, {1, 3}))), (std::vector<float>{0, 1}));
    }
}

// The direct path and the matrix product against the plain loops on random blobs: odd sizes,
// many kernel shapes, strides and borders, batches, pruned planes, the clamp, and one layer
// fed changing sizes so that stale scratch would show. The first two add the same terms in
// the same order and agree bit for bit; the plain loops sum plane by plane and differ in
// rounding.
TEST(ConvolutionLayer, FastPathsMatchSlidingWindow) {
    std::mt19937 rng(5);
    std::uniform_int_distribution<int> pick(0, 1 << 20);
    const int kernels[][2] = {{1, 1}, {3, 3}, {3, 2}, {2, 3}, {5, 5}, {1, 4}};
    int compared = 0;
    for (const auto& kernel : kernels)
        for (int stride : {1, 2, 3})
            for (int pad : {0, 1, 2}) {
                const int channels = 1 + pick(rng) % 13, filters = 1 + pick(rng) % 13,
                          num = 1 + pick(rng) % 2;
                Blob filter = random(filters, channels, kernel[1], kernel[0], rng);
                if (pick(rng) % 2)  // some planes all but zero, and then pruned
                    for (int p = 0; p < filters * channels; p += 3)
                        std::fill_n(filter.data() + p * filter.area(), filter.area(), 1e-9f);
                ConvolutionLayer fast(filter, random(1, 1, 1, filters, rng), "fast", stride, pad);
                if (pick(rng) % 2) fast.prune();
                fast.setDoRelu(pick(rng) % 2);
                EXPECT_EQ(fast.getPath(), Path::Direct);
                LQ::SharedPtr<BaseLayer> copy = fast.clone(), other = fast.clone();
                ConvolutionLayer& slow = static_cast<ConvolutionLayer&>(*copy);
                ConvolutionLayer& matrix = static_cast<ConvolutionLayer&>(*other);
                slow.setPath(Path::SlidingWindow);
                matrix.setPath(Path::MatrixProduct);
                for (int trial = 0; trial < 4; ++trial) {
                    const int width = std::max(1, kernel[0] - 2 * pad) + pick(rng) % 20;
                    const int height = std::max(1, kernel[1] - 2 * pad) + pick(rng) % 20;
                    const Blob input = random(num, channels, height, width, rng);
                    const std::vector<float> a = values(run(fast, input)), b = values(run(slow, input)),
                                             m = values(run(matrix, input));
                    SCOPED_TRACE("kernel " + std::to_string(kernel[0]) + " x " + std::to_string(kernel[1]) +
                                 " stride " + std::to_string(stride) + " pad " + std::to_string(pad) +
                                 " input " + input.shape());
                    ASSERT_EQ(fast.getBlob().shape(), slow.getBlob().shape());
                    ASSERT_TRUE(a.size() == m.size() &&
                                std::memcmp(a.data(), m.data(), sizeof(float) * a.size()) == 0);
                    for (size_t i = 0; i < a.size(); ++i)
                        ASSERT_NEAR(a[i], b[i], 4.f * FLT_EPSILON * (filter.volume() + 1)) << i;
                    compared += static_cast<int>(a.size());
                }
            }
    EXPECT_GT(compared, 10000);
}

// The direct path packs the weights once and keeps them while they stay the same: weights
// written through a shared blob, and planes pruned after a first frame, still count.
TEST(ConvolutionLayer, DirectPathFollowsChangedWeights) {
    std::mt19937 rng(14);
    Blob filter = random(7, 3, 3, 3, rng);
    const Blob bias = random(1, 1, 1, 7, rng);
    Blob input = random(1, 3, 12, 11, rng);
    // large on channel 2, so that the weights pruned there below make a difference
    for (int i = 0; i < input.area(); ++i) input.data(0, 2, 0, 0)[i] *= 1e6f;
    ConvolutionLayer layer(filter, bias, "c", 1, 0);
    const std::vector<float> before = values(run(layer, input));
    const auto fresh = [&](bool pruned) {
        ConvolutionLayer made(filter, bias, "f", 1, 0);
        if (pruned) made.prune();
        return values(run(made, input));
    };
    EXPECT_EQ(before, fresh(false));

    filter.data()[40] += 0.5f;  // filter 1, channel 1
    const std::vector<float> changed = values(run(layer, input));
    EXPECT_EQ(changed, fresh(false));
    EXPECT_NE(changed, before);

    std::fill_n(filter.data(filter.num() - 1, 2, 0, 0), 9, 1e-9f);
    const std::vector<float> unpruned = values(run(layer, input));
    layer.prune();
    const std::vector<float> pruned = values(run(layer, input));
    EXPECT_EQ(pruned, fresh(true));
    EXPECT_NE(pruned, unpruned);
}

// A kernel as large as its (bordered) input is one dot product per filter, which ignores the
// pruned flags; elsewhere a pruned pair adds nothing, and a filter pruned whole is its bias.
TEST(ConvolutionLayer, ScalarProductAndPruning) {
    ConvolutionLayer layer(make(2, 2, 1, 1, {1, 5e-8f, 0, 0}), make(1, 1, 1, 2, {0, 0.25f}), "p", 1, 0);
    layer.prune();
    EXPECT_EQ(layer.getPrunedFlags(), (std::vector<bool>{false, true, true, true}));
    const Blob& whole = run(layer, make(1, 2, 1, 1, {1, 1e6f}));
    EXPECT_EQ(whole.shape(), "1 x 2 x 1 x 1");
    EXPECT_FLOAT_EQ(whole.data()[0], 1.05f);
    for (Path path : {Path::Direct, Path::SlidingWindow}) {
        layer.setPath(path);
        EXPECT_EQ(values(run(layer, make(1, 2, 1, 2, {1, 2, 1e6f, 1e6f}))),
                  (std::vector<float>{1, 2, 0.25f, 0.25f}));
    }

    // a 3 x 3 kernel on a 1 x 1 input with a border of 1: the centre tap alone counts
    ConvolutionLayer padded(make(1, 1, 3, 3, {9, 9, 9, 9, 2, 9, 9, 9, 9}), make(1, 1, 1, 1, {1}), "c", 1, 1);
    EXPECT_EQ(values(run(padded, make(2, 1, 1, 1, {3, -1}))), (std::vector<float>{7, -1}));
    padded.setDoRelu(true);
    EXPECT_EQ(values(run(padded, make(2, 1, 1, 1, {3, -1}))), (std::vector<float>{7, 0}));
}

TEST(ConvolutionLayer, Checks) {
    const Blob filter = make(2, 1, 1, 1, {1, 2});
    FailedCheck check = catchCheck([&] { ConvolutionLayer(filter, make(1, 1, 1, 3, {0, 0, 0}), "x", 1, 0); });
    EXPECT_EQ(check.expression, "(filter_.num()) == (bias_.size())");
    EXPECT_EQ(check.tail, "2 != 3");
    check = catchCheck([&] { ConvolutionLayer(filter, make(1, 1, 1, 2, {0, 0}), "x", 0, 0); });
    EXPECT_EQ(check.expression, "stride_ >= 1");
    EXPECT_EQ(check.tail, "Stride is not correct, stride = 0");

    ConvolutionLayer layer(filter, make(1, 1, 1, 2, {0, 0}), "x", 1, 0);
    check = catchCheck([&] { layer.forward(); });
    EXPECT_EQ(check.expression, "(bottomLayers_.size()) == (1)");
    EXPECT_EQ(check.tail, "0 != 1");
    EXPECT_EQ(catchCheck([&] { run(layer, Blob(0, 1, 2, 2)); }).expression, "(inputBottom.num()) >= (1)");
    check = catchCheck([&] { run(layer, Blob(1, 3, 2, 2)); });
    EXPECT_EQ(check.expression, "(inputBottom.channels()) == (filter_.channels())");
    EXPECT_EQ(check.tail, "3 != 1");
    // a border of 1 makes 1 x 2 into 3 x 4, still lower than the kernel
    ConvolutionLayer large(Blob(1, 1, 5, 3), make(1, 1, 1, 1, {0}), "l", 1, 1);
    check = catchCheck([&] { run(large, Blob(1, 1, 1, 2)); });
    EXPECT_EQ(check.expression,
              "inputSize.width >= filterSize.width && inputSize.height >= filterSize.height");
    EXPECT_EQ(check.tail, "the input 4 x 3 with its border is smaller than the kernel 3 x 5");
}

// The file form: current, before the border ("Version 2") and before the stride
// ("Version 1"), each read back into the same layer; weights land in fresh memory.
TEST(ConvolutionLayer, ModelFile) {
    ConvolutionLayer layer(make(1, 2, 1, 2, {1, 2, 3, 4}), make(1, 1, 1, 1, {0.5f}), "c", 3, 2);
    const std::string current = save(layer, "Version 8");
    // two blobs of 4 + 4 and 4 + 1 values, volume, stride, border, marker
    EXPECT_EQ(current.size(), (8 + 5 + 4) * 4u);
    EXPECT_EQ(save(layer, "Version 2").size(), current.size() - 4);
    EXPECT_EQ(save(layer, "Version 1").size(), current.size() - 8);

    // a target wrapping a table of the same shape must not be written through
    static float table[4] = {7, 8, 9, 10};
    Blob wrapped;
    wrapped.init(1, 2, 1, 2, table);
    ConvolutionLayer loaded(wrapped, make(1, 1, 1, 1, {0}), "c", 5, 1);
    loaded.setDoRelu(true);
    load(loaded, current, "Version 8");
    EXPECT_TRUE(loaded == layer);
    EXPECT_EQ(loaded.getStride() * 10 + loaded.getPad(), 32);
    EXPECT_FALSE(loaded.getDoRelu());
    EXPECT_EQ(table[0], 7.f);

    load(loaded, save(layer, "Version 2"), "Version 2");
    EXPECT_EQ(loaded.getStride() * 10 + loaded.getPad(), 30);
    load(loaded, save(layer, "Version 1"), "Version 1");
    EXPECT_EQ(loaded.getStride() * 10 + loaded.getPad(), 10);
    EXPECT_EQ(loaded.getFilter(), layer.getFilter());
}

// A clone shares the weights and settings; comparison looks at weights, stride, border and
// volume only.
TEST(ConvolutionLayer, CloneAndCompare) {
    std::mt19937 rng(3);
    ConvolutionLayer layer(random(3, 2, 3, 3, rng), random(1, 1, 1, 3, rng), "c", 2, 1);
    layer.setDoRelu(true);
    expectFileAndClone(layer);
    LQ::SharedPtr<BaseLayer> copy = layer.clone();
    ConvolutionLayer& clone = static_cast<ConvolutionLayer&>(*copy);
    EXPECT_EQ(clone.getFilter().data(), layer.getFilter().data());

    clone.prune();
    clone.setDoRelu(false);
    EXPECT_TRUE(clone == layer);
    EXPECT_FALSE(ConvolutionLayer(layer.getFilter(), layer.getBias(), "c", 1, 1) == layer);
    EXPECT_FALSE(ConvolutionLayer(layer.getFilter(), layer.getBias(), "c", 2, 0) == layer);
    EXPECT_FALSE(ConvolutionLayer(random(3, 2, 3, 3, rng), layer.getBias(), "c", 2, 1) == layer);
    EXPECT_FALSE(layer == DeConvolutionLayer("c"));
}

// The generated source: the blobs first, then the function building the layer (the
// convolution's form is compiled and compared in PalmNetworks).
TEST(ConvolutionLayers, SourceExport) {
    const Blob a = make(1, 1, 1, 2, {1, 0.5f}), b = make(1, 1, 1, 1, {1e-05f});
    LocallyConnectedLayer local({a, a}, {b, b}, "l");
    EXPECT_EQ(source(local, "P"),
              source(a, "P_filter0") + source(b, "P_bias0") + source(a, "P_filter1") + source(b, "P_bias1") +
                  "LocallyConnectedLayer& P()\n{\n"
                  "    static std::vector<Blob> filter;\n    static std::vector<Blob> bias;\n"
                  "    filter.push_back(P_filter0());\n    filter.push_back(P_filter1());\n"
                  "    bias.push_back(P_bias0());\n    bias.push_back(P_bias1());\n"
                  "    static LocallyConnectedLayer locallyConnectedLayer(filter, bias, \"P\");\n"
                  "    return locallyConnectedLayer;\n}\n\n");
}

// Once the first call has shaped the output and the scratch, a frame allocates nothing.
TEST(ConvolutionLayers, NoAllocationAfterFirstForward) {
    std::mt19937 rng(9);
    ConvolutionLayer conv(random(10, 3, 3, 3, rng), random(1, 1, 1, 10, rng), "c", 2, 1);
    ConvolutionLayer reference(conv.getFilter(), conv.getBias(), "r", 1, 0);
    reference.setPath(Path::SlidingWindow);
    reference.prune();
    ConvolutionLayer pruned(conv.getFilter(), conv.getBias(), "p", 1, 0);
    pruned.prune();
    DeConvolutionLayer deconv(random(2, 3, 2, 2, rng), random(1, 1, 1, 2, rng), "d", 2);
    const Blob input = random(2, 3, 13, 11, rng);
    for (BaseLayer* layer : std::vector<BaseLayer*>{&conv, &reference, &pruned, &deconv}) {
        run(*layer, input);
        const long before = allocationCount;
        layer->forward();
        EXPECT_EQ(allocationCount - before, 0) << layer->name();
    }
}

TEST(DeConvolutionLayer, ForwardFileAndChecks) {
    // a single input value spreads the kernel rotated by 180 degrees, scaled, plus the bias
    DeConvolutionLayer layer(make(1, 1, 2, 3, {1, 2, 3, 4, 5, 6}), make(1, 1, 1, 1, {0.5f}), "d", 3);
    EXPECT_EQ(values(run(layer, make(1, 1, 1, 1, {2}))),
              (std::vector<float>{12.5f, 10.5f, 8.5f, 6.5f, 4.5f, 2.5f}));
    EXPECT_EQ(layer.getBlob().shape(), "1 x 1 x 3 x 2");
    // overlapping windows add up: 1 * [2, 1] at 0 and 10 * [2, 1] at 1
    DeConvolutionLayer overlap(make(1, 1, 1, 2, {1, 2}), make(1, 1, 1, 1, {0}), "o", 1);
    EXPECT_EQ(values(run(overlap, make(1, 1, 1, 2, {1, 10}))), (std::vector<float>{2, 21, 10}));
    // every output channel reads every input channel
    DeConvolutionLayer mixed(make(2, 2, 1, 1, {1, 2, 3, 4}), make(1, 1, 1, 2, {0, 1}), "m", 1);
    EXPECT_EQ(values(run(mixed, make(1, 2, 1, 1, {1, 3}))), (std::vector<float>{7, 16}));

    expectFileAndClone(layer);
    EXPECT_EQ(catchCheck([&] { DeConvolutionLayer(Blob(1, 1, 1, 1), Blob(1, 1, 1, 1), "d", 0); }).tail,
              "Stride is not correct, stride = 0");
    EXPECT_EQ(catchCheck([&] { run(layer, Blob(1, 2, 1, 1)); }).expression,
              "(bottom.channels()) == (filter_.channels())");
}

TEST(InnerProductLayer, ForwardFileAndChecks) {
    InnerProductLayer layer(make(1, 1, 2, 3, {1, 2, 3, 4, 5, 6}), make(1, 1, 1, 2, {0.5f, -100}), "i");
    // the sample is read in planar order whatever its shape
    const Blob input = make(2, 3, 1, 1, {1, 0, -1, 2, 2, 2});
    EXPECT_EQ(values(run(layer, input)), (std::vector<float>{-1.5f, -102, 12.5f, -70}));
    EXPECT_EQ(layer.getBlob().shape(), "2 x 2 x 1 x 1");
    layer.setDoRelu(true);
    EXPECT_EQ(values(run(layer, input)), (std::vector<float>{0, 0, 12.5f, 0}));
    expectFileAndClone(layer);

    const FailedCheck shape = catchCheck([&] { InnerProductLayer(Blob(1, 1, 2, 3), Blob(1, 1, 1, 3), "i"); });
    EXPECT_EQ(shape.expression, "weights_.height() == bias_.width()");
    EXPECT_EQ(shape.tail, "2 != 3");
    const FailedCheck rest = catchCheck([&] { run(layer, Blob(1, 4, 1, 1)); });
    EXPECT_EQ(rest.expression, "(weights_.size() % inputSize) == (0)");
    EXPECT_EQ(rest.tail, "2 != 0");
}

TEST(LocallyConnectedLayer, ForwardFileAndChecks) {
    // input 3 x 2 with channel 0 = 1 .. 6 and channel 1 = 10; two positions, 2 x 2 kernels
    const Blob input = make(1, 2, 2, 3, {1, 2, 3, 4, 5, 6, 10, 10, 10, 10, 10, 10});
    // position 0: 1 + 5 + 0.5 * 10 + 1 = 12; position 1: 2 * 3 + 5 + 1 * 10 - 1 = 20
    LocallyConnectedLayer layer(
        {make(1, 2, 2, 2, {1, 0, 0, 1, 0, 0, 0, 0.5f}), make(1, 2, 2, 2, {0, 2, 1, 0, 1, 0, 0, 0})},
        {make(1, 1, 1, 1, {1}), make(1, 1, 1, 1, {-1})}, "l");
    EXPECT_EQ(values(run(layer, input)), (std::vector<float>{12, 20}));
    EXPECT_EQ(layer.getBlob().shape(), "1 x 1 x 2 x 1");
    expectFileAndClone(layer);

    EXPECT_EQ(catchCheck([&] {
                  LocallyConnectedLayer({Blob(1, 1, 1, 1), Blob(1, 1, 1, 1)}, {Blob(1, 1, 1, 1)}, "l");
              }).expression,
              "(filter_.size()) == (bias_.size())");
    const FailedCheck shapes = catchCheck([&] {
        LocallyConnectedLayer({Blob(1, 1, 2, 2), Blob(1, 1, 3, 2)}, {Blob(1, 1, 1, 1), Blob(1, 1, 1, 1)},
                              "l");
    });
    EXPECT_EQ(shapes.expression, "(filter_[i].height()) == (filter_[i + 1].height())");
    EXPECT_EQ(shapes.tail, "2 != 3");
    EXPECT_EQ(catchCheck([&] { run(layer, Blob(2, 2, 2, 3)); }).expression, "(bottom.num()) == (1)");
}
