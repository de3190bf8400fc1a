#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <sstream>
#include <vector>

#include "ConcatLayer.h"
#include "ContrastiveLayer.h"
#include "DataLayer.h"
#include "FlattenLayer.h"
#include "LinearTransformLayer.h"
#include "LogCapture.h"
#include "PReluLayer.h"
#include "PoolingLayer.h"
#include "ReluLayer.h"
#include "ReshapeLayer.h"
#include "SigmoidLayer.h"
#include "SliceLayer.h"
#include "SoftmaxLayer.h"
#include "SubtractLayer.h"
#include "TangensLayer.h"

namespace {
Blob makeBlob(int n, int c, int h, int w, const std::vector<float>& values) {
    Blob blob(n, c, h, w);
    for (int i = 0; i < blob.size(); ++i) blob.data()[i] = values.at(i);
    return blob;
}

Blob counting(int n, int c, int h, int w) {
    Blob blob(n, c, h, w);
    for (int i = 0; i < blob.size(); ++i) blob.data()[i] = static_cast<float>(i);
    return blob;
}

std::vector<float> values(const Blob& blob) { return blob; }

LQ::SharedPtr<BaseLayer> input(const Blob& blob) {
    LQ::SharedPtr<BaseLayer> layer(new DataLayer("in"));
    layer->setBlob(blob);
    return layer;
}

// the layer over one input blob, run once
template <class Layer>
Layer& run(Layer& layer, const Blob& blob) {
    layer.addBottomLayer(input(blob));
    layer.forward();
    return layer;
}

std::string written(const BaseLayer& layer, const std::string& version = "Version 8") {
    std::ostringstream stream;
    LQ::ArchiveO archive(stream);
    archive.setVersion(version);
    layer.serialize(archive);
    return stream.str();
}

void readInto(BaseLayer& layer, const std::string& bytes, const std::string& version = "Version 8") {
    std::istringstream stream(bytes);
    LQ::ArchiveI archive(stream);
    archive.setVersion(version);
    layer.serialize(archive);
}

std::string source(BaseLayer& layer, const std::string& name) {
    std::ostringstream stream;
    layer.saveToCpp(stream, name);
    return stream.str();
}

// a 5 x 5 plane whose block maxima sit in different corners of their blocks
const std::vector<float> PLANE = {1, 9, 2, 0, 5,  //
                                  3, 4, 8, 7, 6,  //
                                  0, 2, 1, 1, 3,  //
                                  5, 1, 0, 9, 2,  //
                                  7, 3, 4, 6, 8};

// the plane, then the plane less 20: a second channel of negative values
Blob twoPlanes(int num = 1) {
    std::vector<float> all;
    for (int n = 0; n < num; ++n) {
        for (float v : PLANE) all.push_back(v);
        for (float v : PLANE) all.push_back(v - 20);
    }
    return makeBlob(num, 2, 5, 5, all);
}
}  // namespace

// Rectifiers, tanh and the linear transform overwrite their bottom's memory; sigmoid
// writes its own.
TEST(ElementLayers, ActivationsInPlaceOrOwn) {
    Blob relu = makeBlob(1, 1, 2, 2, {-1.f, 0.f, 2.5f, -0.5f});
    ReluLayer reluLayer("relu");
    run(reluLayer, relu);
    EXPECT_EQ(values(relu), (std::vector<float>{0.f, 0.f, 2.5f, 0.f}));
    EXPECT_EQ(reluLayer.getBlob().data(), relu.data());

    const Blob slope = makeBlob(2, 1, 1, 1, {0.5f, -2.f});
    Blob prelu = makeBlob(1, 2, 1, 3, {-2.f, 3.f, 0.f, -1.f, 4.f, 0.f});
    PReluLayer preluLayer("prelu", slope);
    run(preluLayer, prelu);
    EXPECT_EQ(values(prelu), (std::vector<float>{-1.f, 3.f, 0.f, 2.f, 4.f, 0.f}));
    EXPECT_EQ(preluLayer.getBlob().data(), prelu.data());
    PReluLayer twoSamples("p", slope), threeChannels("p", slope);
    EXPECT_EQ(catchCheck([&] { run(twoSamples, Blob(2, 2, 1, 1)); }).expression, "(top_.num()) == (1)");
    EXPECT_EQ(catchCheck([&] { run(threeChannels, Blob(1, 3, 1, 1)); }).expression,
              "(top_.channels()) == (slope_.num())");

    Blob sigmoid = makeBlob(1, 2, 1, 1, {0.f, std::log(3.f)});
    SigmoidLayer sigmoidLayer("sigmoid");
    run(sigmoidLayer, sigmoid);
    EXPECT_EQ(sigmoidLayer.getBlob().data()[0], 0.5f);
    EXPECT_NEAR(sigmoidLayer.getBlob().data()[1], 0.75f, 1e-6);
    EXPECT_NE(sigmoidLayer.getBlob().data(), sigmoid.data());
    EXPECT_EQ(sigmoid.data()[0], 0.f);

    // tanh(1) by the approximation: 1 - 1 / (1 + 1 + 1 + 1.41645)
    EXPECT_EQ(TangensLayer::approxTanh(0.f), 0.f);
    EXPECT_NEAR(TangensLayer::approxTanh(1.f), 0.7735738f, 1e-6);
    // 1.5 x 0.66666666 rounds to 1 in float; 1.7159 x 0.7735738 = 1.3273852
    Blob tangens = makeBlob(1, 1, 1, 4, {0.f, 1.5f, -1.5f, 1000.f});
    TangensLayer tangensLayer("tanh");
    run(tangensLayer, tangens);
    const float tanhs[4] = {0.f, 1.3273852f, -1.3273852f, 1.7159f};
    for (int i = 0; i < 4; ++i) EXPECT_NEAR(tangens.data()[i], tanhs[i], 1e-5) << i;

    Blob linear = makeBlob(1, 3, 1, 1, {1.f, 2.f, 4.f});
    LinearTransformLayer linearLayer("linear");
    linearLayer.setTransform({2.f, -1.f, 0.5f}, {1.f, 1.f, 0.f});
    run(linearLayer, linear);
    EXPECT_EQ(values(linear), (std::vector<float>{3.f, -1.f, 2.f}));
    LinearTransformLayer tooShort("linear");
    tooShort.setTransform({1.f, 1.f}, {0.f, 0.f});
    EXPECT_EQ(catchCheck([&] { run(tooShort, Blob(1, 3, 1, 1)); }).expression, "((int)a_.size()) == (size)");
    EXPECT_EQ(catchCheck([&] { tooShort.setTransform({1.f}, {}); }).expression, "(a_.size()) == (b_.size())");

    const FailedCheck noBottom = catchCheck([&] { ReluLayer("relu").forward(); });
    EXPECT_EQ(noBottom.expression, "(bottomLayers_.size()) == (1)");
    EXPECT_EQ(noBottom.tail, "0 != 1");
}

// Across channels per position of the first sample, in place; one channel of two values
// is a decision against the threshold instead.
TEST(ElementLayers, Softmax) {
    Blob general =
        makeBlob(2, 3, 1, 2, {1.f, 0.f, 1.f, 0.f, 1.f, std::log(2.f), 7.f, 7.f, 7.f, 7.f, 7.f, 7.f});
    SoftmaxLayer softmax("softmax", 0.5f);
    run(softmax, general);
    EXPECT_EQ(softmax.getBlob().data(), general.data());
    const float expected[6] = {1 / 3.f, 0.25f, 1 / 3.f, 0.25f, 1 / 3.f, 0.5f};
    for (int i = 0; i < 6; ++i) EXPECT_NEAR(general.data()[i], expected[i], 1e-6) << i;
    for (int i = 6; i < 12; ++i) EXPECT_EQ(general.data()[i], 7.f) << "second sample untouched";

    // two channels of one value each: still probabilities
    Blob pair = makeBlob(1, 2, 1, 1, {0.f, std::log(3.f)});
    SoftmaxLayer pairLayer("softmax");
    run(pairLayer, pair);
    EXPECT_NEAR(pair.data()[0], 0.25f, 1e-6);
    EXPECT_NEAR(pair.data()[1], 0.75f, 1e-6);

    // one channel, two columns: exp(b1) / (exp(b1) + exp(b0)) >= threshold
    auto decide = [](float threshold, float b0, float b1) {
        Blob blob = makeBlob(1, 1, 1, 2, {b0, b1});
        SoftmaxLayer layer("softmax", threshold);
        run(layer, blob);
        EXPECT_EQ(layer.getBlob().shape(), "1 x 1 x 1 x 1");
        EXPECT_EQ(values(blob), (std::vector<float>{b0, b1})) << "the bottom keeps its values";
        return layer.getBlob().data()[0];
    };
    EXPECT_EQ(decide(0.5f, 3.f, 3.f), 1.f);
    EXPECT_EQ(decide(0.5f, 0.f, -1.f), 0.f);  // 0.269
    EXPECT_EQ(decide(0.25f, 0.f, -1.f), 1.f);

    SoftmaxLayer three("softmax");
    EXPECT_EQ(catchCheck([&] { run(three, Blob(1, 1, 1, 3)); }).expression, "(bottom.size()) == (2)");
}

// Subtraction and the distance write their own blobs; both check their inputs' shapes.
TEST(ElementLayers, SubtractContrastiveAndData) {
    Blob image = makeBlob(1, 2, 1, 2, {5.f, 5.f, 5.f, 5.f});
    SubtractLayer subtract("sub", makeBlob(1, 2, 1, 2, {1.f, 2.f, 3.f, 4.f}));
    run(subtract, image);
    EXPECT_EQ(values(subtract.getBlob()), (std::vector<float>{4.f, 3.f, 2.f, 1.f}));
    EXPECT_EQ(values(image), (std::vector<float>{5.f, 5.f, 5.f, 5.f}));
    SubtractLayer twoSamples("sub", Blob(1, 2, 1, 2)), wider("sub", Blob(1, 2, 1, 2));
    EXPECT_EQ(catchCheck([&] { run(twoSamples, Blob(2, 2, 1, 2)); }).expression, "(bottom.num()) == (1)");
    EXPECT_EQ(catchCheck([&] { run(wider, Blob(1, 2, 1, 3)); }).expression,
              "(bottom.width()) == (meanImage_.width())");

    // only the first num values count, whatever the shape: sqrt((3² + 4²) / 2)
    ContrastiveLayer contrastive("distance");
    contrastive.addBottomLayer(input(makeBlob(2, 2, 1, 1, {3.f, 4.f, 50.f, 60.f})));
    contrastive.addBottomLayer(input(makeBlob(2, 2, 1, 1, {0.f, 0.f, 70.f, 80.f})));
    contrastive.forward();
    EXPECT_EQ(contrastive.getBlob().shape(), "1 x 1 x 1 x 1");
    EXPECT_FLOAT_EQ(contrastive.getBlob().data()[0], std::sqrt(12.5f));
    ContrastiveLayer one("distance"), uneven("distance");
    EXPECT_EQ(catchCheck([&] { run(one, Blob(1, 1, 1, 1)); }).expression, "(bottomLayers_.size()) == (2)");
    uneven.addBottomLayer(input(Blob(2, 1, 1, 1)));
    uneven.addBottomLayer(input(Blob(3, 1, 1, 1)));
    EXPECT_EQ(catchCheck([&] { uneven.forward(); }).expression, "(bottom0.num()) == (bottom1.num())");

    // the input layer only checks that an input was set, width before height
    DataLayer data("data");
    EXPECT_EQ(catchCheck([&] { data.forward(); }).expression, "(top_.num()) >= (1)");
    data.setBlob(Blob(1, 0, 1, 1));
    EXPECT_EQ(catchCheck([&] { data.forward(); }).expression, "(top_.channels()) >= (1)");
    data.setBlob(Blob(1, 1, 0, 0));
    EXPECT_EQ(catchCheck([&] { data.forward(); }).expression, "(top_.width()) >= (1)");
}

// Parameters through the binary archive: exact byte counts, a fresh layer reads back an
// equal one, and slice points only exist from "Version 3" on.
TEST(ElementLayers, SerializeRoundTrips) {
    auto roundTrip = [](BaseLayer& original, BaseLayer& fresh, size_t bytes) {
        EXPECT_FALSE(original == fresh) << original.type();
        const std::string file = written(original);
        EXPECT_EQ(file.size(), bytes) << original.type();
        readInto(fresh, file);
        EXPECT_TRUE(original == fresh) << original.type();
    };
    PoolingLayer pooling(3, 2, "pool"), freshPooling("pool");
    roundTrip(pooling, freshPooling, 8);
    SoftmaxLayer softmax("softmax", 0.75f), freshSoftmax("softmax");
    roundTrip(softmax, freshSoftmax, 4);
    ConcatLayer concat("concat", false), freshConcat("concat");
    roundTrip(concat, freshConcat, 1);
    ReshapeLayer reshape("reshape", LQ::BaseSize<int>(4, 2)), freshReshape("reshape");
    roundTrip(reshape, freshReshape, 8);
    PReluLayer prelu("prelu", makeBlob(2, 1, 1, 1, {0.25f, -1.f})), freshPrelu("prelu");
    roundTrip(prelu, freshPrelu, 16 + 8);
    LinearTransformLayer linear("linear"), freshLinear("linear");
    linear.setTransform({1.f, 2.f}, {-3.f, 0.5f});
    roundTrip(linear, freshLinear, 2 * (4 + 8));
    SliceLayer slice("slice", 1, 3, 2), freshSlice("slice", 1);
    slice.addSlicePoint(2, 5);
    roundTrip(slice, freshSlice, 20);

    // the name is written once more inside the parameters, and read back into the layer
    SubtractLayer subtract("sub", makeBlob(1, 1, 1, 2, {1.f, 2.f})), freshSubtract("other");
    roundTrip(subtract, freshSubtract, 4 + 16 + 8);
    EXPECT_EQ(freshSubtract.name(), "sub");

    for (BaseLayer* layer : std::vector<BaseLayer*>{new ReluLayer("r"), new SigmoidLayer("s"),
                                                    new TangensLayer("t"), new DataLayer("d"),
                                                    new FlattenLayer("f", true), new ContrastiveLayer("c")}) {
        EXPECT_EQ(written(*layer), "") << layer->type();
        delete layer;
    }

    // before "Version 3": segments only, and the slice point and size read as 0
    SliceLayer segments("slice", 2, 4, 1), oldSlice("slice", 1);
    segments.addSlicePoint(1, 1);
    oldSlice.addSlicePoint(3, 3);
    const std::string old = written(segments, "Version 2");
    EXPECT_EQ(old.size(), 12u);
    readInto(oldSlice, old, "Version 2");
    EXPECT_EQ((std::vector<int>{oldSlice.getSegmentNumber(), oldSlice.getNumSegments(),
                                oldSlice.getSlicePoint(), oldSlice.getSliceSize()}),
              (std::vector<int>{2, 4, 0, 0}));

    // before "Version 6" vector counts are decimal text ahead of the raw floats
    const float a[2] = {1.5f, -2.f}, b[2] = {0.f, 3.f};
    const std::string version5 = "2" + std::string(reinterpret_cast<const char*>(a), 8) + "2" +
                                 std::string(reinterpret_cast<const char*>(b), 8);
    LinearTransformLayer oldLinear("linear");
    readInto(oldLinear, version5, "Version 5");
    EXPECT_EQ(oldLinear.getA(), (std::vector<float>{1.5f, -2.f}));
    EXPECT_EQ(oldLinear.getB(), (std::vector<float>{0.f, 3.f}));

    // a file can hold an axis that the constructor would refuse; forward refuses it then
    SliceLayer badAxis("slice", 1);
    const int fields[3] = {0, 1, 7};
    readInto(badAxis, std::string(reinterpret_cast<const char*>(fields), 12), "Version 2");
    EXPECT_EQ(catchCheck([&] { run(badAxis, Blob(1, 1, 1, 1)); }).expression, "0");
}

// compare looks at the parameters only, softmax thresholds with a relative tolerance;
// clones are equal, share their blobs and start without bottoms or output.
TEST(ElementLayers, CompareAndClone) {
    EXPECT_TRUE(SoftmaxLayer("s", 0.5f) == SoftmaxLayer("other", 0.5000002f));
    EXPECT_FALSE(SoftmaxLayer("s", 0.5f) == SoftmaxLayer("s", 0.50001f));
    EXPECT_FALSE(ReluLayer("a") == ReluLayer("b"));
    EXPECT_TRUE(FlattenLayer("f", true) == FlattenLayer("f", false));
    EXPECT_FALSE(SubtractLayer("a", Blob()) == SubtractLayer("b", Blob()));
    EXPECT_TRUE(PoolingLayer(2, 2, "a") == PoolingLayer(2, 2, "b"));
    EXPECT_FALSE(PoolingLayer(2, 2, "a") == PoolingLayer(2, 1, "a"));
    // a slope of -0 isn't the slope 0: blobs compare bytewise
    EXPECT_FALSE(PReluLayer("p", makeBlob(1, 1, 1, 1, {0.f})) ==
                 PReluLayer("p", makeBlob(1, 1, 1, 1, {-0.f})));
    EXPECT_FALSE(ReluLayer("a") == SigmoidLayer("a"));

    PReluLayer prelu("prelu", makeBlob(1, 1, 1, 1, {0.5f}));
    run(prelu, Blob(1, 1, 1, 1));
    const LQ::SharedPtr<BaseLayer> copy = prelu.clone();
    EXPECT_EQ(copy->name(), "prelu");
    EXPECT_TRUE(*copy == prelu);
    EXPECT_EQ(copy->getNumBottomLayers(), 0);
    EXPECT_EQ(copy->getBlob().size(), 0);
    EXPECT_EQ(dynamic_cast<PReluLayer&>(*copy).getSlope().data(), prelu.getSlope().data());

    SliceLayer slice("slice", 1);
    slice.addSlicePoint(0, 1);
    run(slice, Blob(1, 2, 1, 1));
    const LQ::SharedPtr<BaseLayer> sliceCopy = slice.clone();
    EXPECT_TRUE(*sliceCopy == slice);
    EXPECT_EQ(dynamic_cast<SliceLayer&>(*sliceCopy).getPointer(), nullptr) << "output memory isn't shared";

    std::vector<LQ::SharedPtr<BaseLayer>> layers{new SoftmaxLayer("x", 0.3f), new PoolingLayer(3, 1, "p"),
                                                 new ConcatLayer("c", false), new FlattenLayer("f", true),
                                                 new ReshapeLayer("h", LQ::BaseSize<int>(2, 3))};
    for (const LQ::SharedPtr<BaseLayer>& layer : layers)
        EXPECT_TRUE(*layer->clone() == *layer) << layer->type();
    EXPECT_TRUE(dynamic_cast<FlattenLayer&>(*layers[3]->clone()).isInterleave());
}

// The generated source of each layer: its blobs' functions, then one returning a static.
TEST(ElementLayers, SaveToCpp) {
    ReluLayer relu("r");
    EXPECT_EQ(
        source(relu, "conv1_relu"),
        "ReluLayer& conv1_relu()\n{\n    static ReluLayer value(\"conv1_relu\");\n    return value;\n}\n\n");
    PoolingLayer pooling(3, 2, "pool");
    EXPECT_EQ(source(pooling, "pool1"),
              "PoolingLayer& pool1()\n{\n    static PoolingLayer poolingLayer(3,2, \"pool1\");\n"
              "    return poolingLayer;\n}\n\n");
    ReshapeLayer reshape("shape", LQ::BaseSize<int>(4, 2));
    EXPECT_EQ(source(reshape, "shape"),
              "ReshapeLayer& shape()\n{\n    static ReshapeLayer reshapeLayer(\"shape\" ,Size(4, 2));\n"
              "    return reshapeLayer;\n}\n\n");
    SliceLayer slice("slice", 2);
    slice.addSlicePoint(1, -1);
    EXPECT_EQ(source(slice, "slice"),
              "SliceLayer& slice()\n{\n    static SliceLayer sliceLayer(\"slice\", 2);\n"
              "    sliceLayer.addSlicePoint(1, -1);\n    return sliceLayer;\n}\n\n");
    ContrastiveLayer contrastive("d");
    EXPECT_EQ(source(contrastive, "d"),
              "ContrastiveLayer& d()\n{\n    static ContrastiveLayer ContrastiveLayer(\"d\");\n"
              "    return ContrastiveLayer;\n}\n\n");
    LinearTransformLayer linear("lin");
    linear.setTransform({2.f, 0.5f}, {-1.f, 0.f});
    EXPECT_EQ(source(linear, "lin"),
              "LinearTransformLayer& lin()\n{\n    std::vector<float> a, b;\n"
              "    a.push_back(2);\n    b.push_back(-1);\n    a.push_back(0.5);\n    b.push_back(0);\n"
              "    static LinearTransformLayer linearTransformLayer(\"lin\");\n"
              "    linearTransformLayer.setTransform(a, b);\n    return linearTransformLayer;\n}\n\n");
}

// Output sizes round up and the last windows are clipped; with stride 2 the last row and
// column pool 1-high or 1-wide blocks, and the corner is copied.
TEST(ShapeLayers, MaxPooling) {
    PoolingLayer two(2, 2, "pool");
    run(two, twoPlanes(2));
    EXPECT_EQ(two.getBlob().shape(), "2 x 2 x 3 x 3");
    const float expected2[9] = {9, 8, 6, 5, 9, 3, 7, 6, 8};
    for (int i = 0; i < 36; ++i)  // the second channel of each sample is 20 lower
        EXPECT_EQ(two.getBlob().data()[i], expected2[i % 9] - (i % 18 < 9 ? 0 : 20)) << i;
    const float* memory = two.getBlob().data();
    two.forward();
    EXPECT_EQ(two.getBlob().data(), memory) << "the output keeps its memory";

    PoolingLayer three(3, 3, "pool");
    run(three, twoPlanes());
    EXPECT_EQ(three.getBlob().shape(), "1 x 2 x 2 x 2");
    EXPECT_EQ(values(three.getBlob()), (std::vector<float>{9, 7, 7, 9, -11, -13, -13, -11}));

    // kernel 3, stride 2: windows at 0 and 2, the second one clipped to the plane
    PoolingLayer overlapping(3, 2, "pool");
    run(overlapping, twoPlanes());
    EXPECT_EQ(overlapping.getBlob().shape(), "1 x 2 x 2 x 2");
    EXPECT_EQ(values(overlapping.getBlob()), (std::vector<float>{9, 8, 7, 9, -11, -12, -13, -11}));

    // kernel 1, stride 3 over 5 columns: the third window starts beyond the input
    PoolingLayer sparse(1, 3, "pool");
    run(sparse, makeBlob(1, 1, 1, 5, {1, 9, 2, 0, 5}));
    EXPECT_EQ(values(sparse.getBlob()), (std::vector<float>{1, 0, -std::numeric_limits<float>::max()}));

    PoolingLayer batch(3, 2, "pool"), empty(2, 2, "pool");
    EXPECT_EQ(catchCheck([&] { run(batch, twoPlanes(2)); }).expression, "(bottom.num()) == (1)");
    EXPECT_EQ(catchCheck([&] { run(empty, Blob(0, 1, 2, 2)); }).expression, "(bottom.num()) >= (1)");

    // the 2 x 2 kernel on its own: odd width and odd height
    const float src[6] = {1, 5, 2,  //
                          4, 3, 6};
    for (int width : {3, 2}) {  // 2 x 3 as 3 rows of 2: the last row pools alone
        std::vector<float> dst(2, 0.f);
        maxPool<float>(src, dst.data(), width, 6 / width);
        EXPECT_EQ(dst, (std::vector<float>{5, 6})) << width;
    }
}

// Concatenation copies whole bottoms one after the other, along channels of a single
// sample or along num.
TEST(ShapeLayers, Concat) {
    ConcatLayer channels("concat");
    channels.addBottomLayer(input(makeBlob(1, 1, 1, 2, {1, 2})));
    channels.addBottomLayer(input(makeBlob(1, 2, 1, 2, {3, 4, 5, 6})));
    channels.addBottomLayer(input(makeBlob(1, 1, 1, 2, {7, 8})));
    channels.forward();
    EXPECT_EQ(channels.getBlob().shape(), "1 x 4 x 2 x 1");
    EXPECT_EQ(values(channels.getBlob()), (std::vector<float>{1, 2, 3, 4, 5, 6, 7, 8}));

    ConcatLayer samples("concat", false);
    samples.addBottomLayer(input(makeBlob(1, 2, 1, 1, {1, 2})));
    samples.addBottomLayer(input(makeBlob(2, 2, 1, 1, {3, 4, 5, 6})));
    samples.forward();
    EXPECT_EQ(samples.getBlob().shape(), "3 x 2 x 1 x 1");
    EXPECT_EQ(values(samples.getBlob()), (std::vector<float>{1, 2, 3, 4, 5, 6}));

    auto failure = [](bool alongChannels, const Blob& a, const Blob& b) {
        ConcatLayer layer("concat", alongChannels);
        layer.addBottomLayer(input(a));
        layer.addBottomLayer(input(b));
        return catchCheck([&] { layer.forward(); }).expression;
    };
    ConcatLayer single("concat");
    EXPECT_EQ(catchCheck([&] { run(single, Blob(1, 1, 1, 1)); }).expression, "(bottomLayers_.size()) > (1)");
    EXPECT_EQ(failure(true, Blob(1, 1, 1, 2), Blob(1, 1, 1, 3)),
              "(bottom0.width()) == (bottomLayers_[i]->getBlob().width())");
    EXPECT_EQ(failure(true, Blob(1, 1, 1, 1), Blob(2, 1, 1, 1)),
              "(bottom0.num()) == (bottomLayers_[i]->getBlob().num())");
    EXPECT_EQ(failure(true, Blob(2, 1, 1, 1), Blob(2, 1, 1, 1)), "(bottom0.num()) == (1)");
    EXPECT_EQ(failure(false, Blob(1, 1, 1, 1), Blob(1, 2, 1, 1)),
              "(bottom0.channels()) == (bottomLayers_[i]->getBlob().channels())");
}

// Along num the slice is a view of the bottom; along the other axes a copy into memory
// allocated once. Sizes from segments are derived on the first run and kept.
TEST(ShapeLayers, Slice) {
    SliceLayer middle("slice", 1, 3, 1);
    Blob six = counting(2, 6, 1, 1);
    run(middle, six);
    EXPECT_EQ(middle.getBlob().shape(), "2 x 2 x 1 x 1");
    EXPECT_EQ(values(middle.getBlob()), (std::vector<float>{2, 3, 8, 9}));
    EXPECT_EQ(middle.getSlicePoint(), 2);
    EXPECT_EQ(middle.getSliceSize(), 2);
    EXPECT_EQ(middle.getBlob().data(), middle.getPointer());
    const float* memory = middle.getPointer();
    six.data()[2] = 100;
    middle.forward();
    EXPECT_EQ(middle.getPointer(), memory);
    EXPECT_EQ(middle.getBlob().data()[0], 100) << "copied again on each run";

    SliceLayer quarter("slice", 3, 4, 1);
    const FailedCheck uneven = catchCheck([&] { run(quarter, counting(1, 6, 1, 1)); });
    EXPECT_EQ(uneven.expression, "(bottomSize % numSegments_) == (0)");
    quarter.addSlicePoint(4, -1);
    quarter.forward();
    EXPECT_EQ(values(quarter.getBlob()), (std::vector<float>{4, 5}));
    EXPECT_EQ(quarter.getSliceSize(), 2);

    SliceLayer samples("slice", 0);
    samples.addSlicePoint(1, 2);
    Blob three = counting(3, 1, 1, 2);
    run(samples, three);
    EXPECT_EQ(samples.getBlob().shape(), "2 x 1 x 2 x 1");
    EXPECT_EQ(samples.getBlob().data(), three.data() + 2);
    three.data()[5] = -1;
    EXPECT_EQ(samples.getBlob().data()[3], -1) << "a view, not a copy";

    SliceLayer rows("slice", 2);
    rows.addSlicePoint(1, 2);
    run(rows, counting(1, 2, 3, 2));
    EXPECT_EQ(rows.getBlob().shape(), "1 x 2 x 2 x 2");
    EXPECT_EQ(values(rows.getBlob()), (std::vector<float>{2, 3, 4, 5, 8, 9, 10, 11}));

    SliceLayer columns("slice", 1, 3, 3);
    run(columns, counting(2, 1, 2, 3));
    EXPECT_EQ(columns.getBlob().shape(), "2 x 1 x 1 x 2");
    EXPECT_EQ(values(columns.getBlob()), (std::vector<float>{1, 4, 7, 10}));

    SliceLayer beyond("slice", 1);
    beyond.addSlicePoint(2, 3);
    EXPECT_EQ(catchCheck([&] { run(beyond, counting(1, 4, 1, 1)); }).expression,
              "(slicePoint_ + sliceSize_) <= (bottomSize)");
    EXPECT_EQ(catchCheck([] { SliceLayer("slice", -1, 2, 1); }).expression, "(segmentNumber) >= (0)");
    EXPECT_EQ(catchCheck([] { SliceLayer("slice", 2, 2, 1); }).expression, "(segmentNumber) < (numSegments)");
    EXPECT_EQ(catchCheck([] { SliceLayer("slice", -1); }).expression, "(axis) >= (0)");
    EXPECT_EQ(catchCheck([] { SliceLayer("slice", 4); }).expression, "(axis) < (4)");
    SliceLayer bad("slice", 1);
    EXPECT_EQ(catchCheck([&] { bad.addSlicePoint(-1, 2); }).expression, "(slicePoint_) >= (0)");
    EXPECT_EQ(catchCheck([&] { bad.addSlicePoint(0, 0); }).expression, "(sliceSize_) != (0)");
}

// Reshape and planar flatten only relabel the bottom's memory; interleaved flatten copies
// the first sample pixel by pixel.
TEST(ShapeLayers, ReshapeAndFlatten) {
    ReshapeLayer reshape("reshape", LQ::BaseSize<int>(2, 1));
    const Blob bottom = counting(2, 1, 2, 3);
    run(reshape, bottom);
    EXPECT_EQ(reshape.getBlob().shape(), "2 x 3 x 2 x 1");
    EXPECT_EQ(reshape.getBlob().data(), bottom.data());
    ReshapeLayer four("reshape", LQ::BaseSize<int>(4, 1));
    EXPECT_EQ(catchCheck([&] { run(four, counting(1, 1, 2, 3)); }).expression,
              "(bottom.channels() * bottom.height() * bottom.width() % size_.area()) == (0)");

    FlattenLayer planar("flatten");
    run(planar, bottom);
    EXPECT_EQ(planar.getBlob().shape(), "2 x 6 x 1 x 1");
    EXPECT_EQ(planar.getBlob().data(), bottom.data());

    FlattenLayer interleaved("flatten", true);
    const Blob pixels = makeBlob(2, 2, 1, 3, {0, 1, 2, 10, 11, 12, 50, 51, 52, 60, 61, 62});
    run(interleaved, pixels);
    EXPECT_EQ(interleaved.getBlob().shape(), "2 x 6 x 1 x 1");
    EXPECT_NE(interleaved.getBlob().data(), pixels.data());
    const std::vector<float> first(interleaved.getBlob().data(), interleaved.getBlob().data() + 6);
    EXPECT_EQ(first, (std::vector<float>{0, 10, 1, 11, 2, 12}));
}
