#include <gtest/gtest.h>

#include <cmath>

#include "LogCapture.h"
#include "NnDetector.h"

namespace {

// A layer of this test: adds its constant to its first bottom's blob, or passes the
// input through when it has no bottom. Enough to see order, outputs and sharing.
class AddLayer : public BaseLayer {
public:
    AddLayer(const std::string& name, float add, const std::string& kind = "AddLayer")
        : BaseLayer(name), add_(add), kind_(kind) {}
    void forward() override {
        if (bottomLayers_.empty()) return;
        const Blob& in = bottomLayers_[0]->getBlob();
        top_.init(in.num(), in.channels(), in.height(), in.width());
        for (int i = 0; i < in.size(); ++i) top_.data()[i] = in.data()[i] + add_;
    }
    std::string type() const override { return kind_; }
    void serialize(LQ::ArchiveO& archive) const override { archive & add_; }
    void serialize(LQ::ArchiveI& archive) override { archive & add_; }
    void saveToCpp(std::ostream&, const std::string&) override {}
    LQ::SharedPtr<BaseLayer> clone() override { return LQ::SharedPtr<BaseLayer>(new AddLayer(name(), add_, kind_)); }
    bool compare(const BaseLayer& layer) const override {
        return add_ == static_cast<const AddLayer&>(layer).add_;
    }

private:
    float add_;
    std::string kind_;
};

LQ::SharedPtr<BaseLayer> add(const std::string& name, float value, const std::string& kind = "AddLayer") {
    return LQ::SharedPtr<BaseLayer>(new AddLayer(name, value, kind));
}

}  // namespace

// Layers run in order on the converted input; outputs are the layers nothing reads,
// activations left out; the seal and the checks of misuse.
TEST(NnDetector, RunOutputsAndSeal) {
    NnDetector net;
    net.setName("chain");
    LQ::SharedPtr<BaseLayer> data = add("data", 0), a = add("a", 1), b = add("b", 10), relu = add("relu", 100, "ReluLayer");
    for (auto* layer : {&data, &a, &b, &relu}) net.addLayer(*layer);
    net.joinLayers();
    net.setSize(LQ::BaseSize<int>(2, 1));
    EXPECT_TRUE(net.isLoaded());
    EXPECT_EQ(catchCheck([&] { net.addLayer(add("late", 0)); }).tail, "size must be inicialized after");

    LQ::Image image(LQ::BaseSize<int>(2, 1), LQ::COLOR_MODE_MONO);
    image.pixel(0, 0)[0] = 64;
    image.pixel(1, 0)[0] = 128;
    const Blob& out = net.detect(image);
    EXPECT_EQ(static_cast<std::vector<float>>(out), (std::vector<float>{111.25f, 111.5f}));
    // every layer is read by the next, and the last is an activation: no automatic output
    EXPECT_TRUE(net.getOutputNames().empty());
    net.setOutputLayers({"a", "nothing"});
    ASSERT_EQ(net.getOutputNames(), std::vector<std::string>{"a"});
    EXPECT_EQ(static_cast<std::vector<float>>(net.getOutputBlobs()[0]), (std::vector<float>{1.25f, 1.5f}));
    net.setOutputLayers({});
    EXPECT_TRUE(net.getOutputBlobs().empty());

    LQ::Image colour(LQ::BaseSize<int>(2, 1), LQ::COLOR_MODE_BGR);
    EXPECT_TRUE(catchCheck([&] { net.detect(colour); }).thrown);
    NnDetector empty;
    EXPECT_EQ(catchCheck([&] { empty.detect(image); }).expression, "(network_.size()) > (0)");
    EXPECT_EQ(catchCheck([] { NnDetector().setSize(LQ::BaseSize<int>(0, 3)); }).tail, "pattern can't be empty");
    // the stored means must fit the colour mode; the new ones aren't checked
    net.setInputColorMode(LQ::COLOR_MODE_BGR);
    net.setMeanValues({1});
    const FailedCheck means = catchCheck([&] { net.setMeanValues({1, 2, 3}); });
    EXPECT_EQ(means.expression, "((LQ::uint)LQ::depth(inputColorMode_)) == (meanValues_.size())");
    EXPECT_EQ(means.tail, "3 != 1");
    net.setInputColorMode(LQ::COLOR_MODE_MONO);

    net.reset();
    EXPECT_FALSE(net.isLoaded());
    EXPECT_TRUE(net.getNetwork().empty());
    EXPECT_EQ(net.getName(), "chain");
    EXPECT_EQ(net.getMeanValues(), std::vector<float>{1});
}

// Image to input blob: means, multiplier, and the transposed form that also reverses
// the channels.
TEST(NnDetector, InputConversion) {
    LQ::Image image(LQ::BaseSize<int>(3, 2), LQ::COLOR_MODE_BGR);
    for (int y = 0; y < 2; ++y)
        for (int x = 0; x < 3; ++x)
            for (int k = 0; k < 3; ++k) image.pixel(x, y)[k] = static_cast<unsigned char>(100 * k + 10 * y + x);
    NnDetector net;
    net.setInputColorMode(LQ::COLOR_MODE_BGR);
    net.setMeanValues({1, 2, 3});
    net.setMultiplier(0.5f);
    Blob blob;
    net.convert(image, blob, 1, 2);
    EXPECT_EQ(blob.shape(), "2 x 3 x 3 x 2");
    EXPECT_EQ(*blob.data(1, 2, 1, 2), (212 - 3) * 0.5f);
    net.setTranspose(true);
    net.convert(image, blob, 0, 1);
    EXPECT_EQ(blob.shape(), "1 x 3 x 2 x 3");
    // channel 0 in the last plane, x along the rows
    EXPECT_EQ(*blob.data(0, 2, 2, 1), (12 - 1) * 0.5f);
    EXPECT_EQ(*blob.data(0, 0, 0, 1), (210 - 3) * 0.5f);

    // samplewise: the means of this image
    NnDetector sample;
    sample.setSamplewiseMeanImageSubtraction(true);
    sample.setMultiplier(1);
    LQ::Image mono(LQ::BaseSize<int>(2, 1), LQ::COLOR_MODE_MONO);
    mono.pixel(0, 0)[0] = 10;
    mono.pixel(1, 0)[0] = 30;
    sample.convert(mono, blob, 0, 1);
    EXPECT_EQ(static_cast<std::vector<float>>(blob), (std::vector<float>{-10, 10}));

    EXPECT_FLOAT_EQ(NnDetector::getAccuracy({0, 0}, 1), 0.5f);
    EXPECT_FLOAT_EQ(NnDetector::getAccuracy({std::log(3.f), 0}, 0), 0.75f);
    EXPECT_EQ(catchCheck([] { NnDetector::getAccuracy({0, 0}, 2); }).tail, "incorrect class number 2");
}

// A clone runs on its own and shares nothing it writes.
TEST(NnDetector, CloneRunsIndependently) {
    NnDetector net;
    net.addLayer(add("data", 0));
    net.addLayer(add("plus", 2));
    net.joinLayers();
    net.setSize(LQ::BaseSize<int>(1, 1));
    LQ::SharedPtr<NnDetector> copy = net.clone();
    EXPECT_TRUE(*copy == net);
    Blob one(1, 1, 1, 1), two(1, 1, 1, 1);
    one.data()[0] = 1;
    two.data()[0] = 5;
    const Blob& a = net.detect(one);
    const Blob& b = copy->detect(two);
    EXPECT_EQ(a.data()[0], 3);
    EXPECT_EQ(b.data()[0], 7);
    EXPECT_NE(a.data(), b.data());
    EXPECT_EQ(copy->getNetwork()[1]->getBottomLayersName(), std::vector<std::string>{"data"});
}
