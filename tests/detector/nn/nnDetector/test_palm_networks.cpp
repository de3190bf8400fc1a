#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <random>
#include <sstream>

#include "ConvolutionLayer.h"
#include "DataLayer.h"
#include "LogCapture.h"
#include "NnDetector.h"
#include "PReluLayer.h"
#include "PalmNetworks.h"

#if defined(TACTUS_WITH_OPENCV_DNN)
#include "OpenCvNetwork.h"
#endif

namespace {

LQ::Image randomImage(std::mt19937& random, LQ::BaseSize<int> size) {
    LQ::Image image(size, LQ::COLOR_MODE_MONO);
    for (int y = 0; y < size.height; ++y)
        for (int x = 0; x < size.width; ++x) image.pixel(x, y)[0] = static_cast<unsigned char>(random() % 256);
    return image;
}

std::string bytesOf(const NnDetector& net) {
    std::ostringstream stream;
    LQ::ArchiveO archive(stream);
    archive & net;
    return stream.str();
}

NnDetector fromBytes(const std::string& bytes) {
    std::istringstream stream(bytes);
    LQ::ArchiveI archive(stream);
    NnDetector net;
    archive & net;
    return net;
}

}  // namespace

// The shapes run through to two class scores, with the sizes each layer should give.
TEST(PalmNetworks, ShapesAndOutputs) {
    NnDetector small = palmNetwork("palm_verifier__iter_250000", kPalm35x33, LQ::BaseSize<int>(35, 33), 1);
    std::mt19937 random(2);
    const Blob& out = small.detect(randomImage(random, LQ::BaseSize<int>(35, 33)));
    EXPECT_EQ(out.shape(), "1 x 2 x 1 x 1");
    EXPECT_EQ(small.getNetwork()[1]->getBlob().shape(), "1 x 10 x 17 x 16");
    EXPECT_EQ(small.getNetwork()[15]->getBlob().shape(), "1 x 10 x 3 x 2");
    EXPECT_EQ(small.getOutputNames(), std::vector<std::string>{"final"});

    NnDetector large = palmNetwork("palm_verifier_iter_140000", kPalm50x60, LQ::BaseSize<int>(50, 60), 3);
    EXPECT_EQ(large.detect(randomImage(random, LQ::BaseSize<int>(50, 60))).shape(), "1 x 2 x 1 x 1");
    EXPECT_EQ(large.getNetwork()[9]->getBlob().shape(), "1 x 10 x 8 x 11");
    EXPECT_EQ(large.getNetwork()[23]->getBlob().shape(), "1 x 10 x 2 x 5");
}

// Written and read again, a network is equal and gives the same bits (reading from a file is
// the archive's, and GeneratedSourceBuildsTheSameNetwork loads the build's model file).
TEST(PalmNetworks, ModelFileRoundTrip) {
    NnDetector net = palmNetwork("palm_verifier_iter_140000", kPalm50x60, LQ::BaseSize<int>(50, 60), 5);
    std::mt19937 random(6);
    const LQ::Image image = randomImage(random, LQ::BaseSize<int>(50, 60));
    const std::vector<float> expected = net.detect(image);

    NnDetector read = fromBytes(bytesOf(net));
    EXPECT_TRUE(read == net);  // names, sizes, modes and every layer's parameters
    EXPECT_EQ(static_cast<std::vector<float>>(read.detect(image)), expected);
    EXPECT_EQ(read.getOutputNames(), std::vector<std::string>{"final"});

}

// A file of the first format: no stride, pad or colour mode; the reader fills in 1, 0
// and mono.
TEST(PalmNetworks, OldestFormatLoads) {
    std::mt19937 random(9);
    const Blob filter = randomBlob(random, 2, 1, 3, 3, 1.f), bias = randomBlob(random, 2, 1, 1, 1, 1.f);
    std::ostringstream stream;
    LQ::ArchiveO out(stream);
    out.setVersion("Version 1");
    out & std::string("Version 1") & "\n" & std::string("old") & "\n" & LQ::BaseSize<int>(5, 4) & "\n";
    out & static_cast<uint32_t>(2) & "\n";
    out & std::string("DataLayer") & std::string("data") & static_cast<uint32_t>(0) & "\n";
    out & std::string("ConvolutionLayer") & std::string("conv") & filter & bias & static_cast<int32_t>(9);
    out & static_cast<uint32_t>(1) & std::string("data") & "\n";
    NnDetector old = fromBytes(stream.str());
    EXPECT_EQ(old.getInputColorMode(), LQ::COLOR_MODE_MONO);
    const ConvolutionLayer& conv = static_cast<const ConvolutionLayer&>(*old.getNetwork()[1]);
    EXPECT_TRUE(conv == ConvolutionLayer(filter, bias, "conv", 1, 0));
    std::mt19937 pixels(10);
    EXPECT_EQ(old.detect(randomImage(pixels, LQ::BaseSize<int>(5, 4))).shape(), "1 x 2 x 3 x 2");
}

// Broken files end in a failed check with a clear text: never a crash or a huge allocation.
TEST(PalmNetworks, BadFilesFailCleanly) {
    const std::string good = bytesOf(palmNetwork("palm", kPalm35x33, LQ::BaseSize<int>(35, 33), 4));
    for (size_t cut = 1; cut < good.size(); cut += good.size() / 40 + 1)
        EXPECT_TRUE(catchCheck([&] { fromBytes(good.substr(0, cut)); }).thrown) << cut;

    std::string newer = good;
    newer.replace(0, 9, "Version 9");
    const FailedCheck version = catchCheck([&] { fromBytes(newer); });
    EXPECT_EQ(version.expression, "version <= NN_CLASSIFIER_VERSION");
    EXPECT_EQ(version.tail, "Wrong version number Version 9");

    std::string mark = good;
    mark[10] = 'x';  // the mark after the version
    EXPECT_TRUE(catchCheck([&] { fromBytes(mark); }).thrown);

    std::string unknown = good;
    const size_t type = unknown.find("ConvolutionLayer");
    unknown.replace(type, 16, "ConvolutionLayex");
    EXPECT_EQ(catchCheck([&] { fromBytes(unknown); }).tail, "Unknown type: ConvolutionLayex");

    // the first filter's shape: huge, then negative
    const size_t shape = good.find("conv1") + 6;
    for (int32_t value : {1 << 28, -10}) {
        std::string bad = good;
        std::memcpy(&bad[shape], &value, 4);
        EXPECT_TRUE(catchCheck([&] { fromBytes(bad); }).thrown) << value;
    }
}

#if defined(TACTUS_WITH_OPENCV_DNN)
// Both palm shapes against OpenCV's dnn module running the same weights on the same input.
TEST(PalmNetworks, AgreeWithOpenCvDnn) {
    for (int which = 0; which < 2; ++which) {
        const LQ::BaseSize<int> size = which ? LQ::BaseSize<int>(50, 60) : LQ::BaseSize<int>(35, 33);
        NnDetector net = palmNetwork("palm", which ? kPalm50x60 : kPalm35x33, size, 20 + which);
        cv::dnn::Net reference = openCvNetwork(net);
        std::mt19937 random(30 + which);
        for (int trial = 0; trial < 3; ++trial) {
            const LQ::Image image = randomImage(random, size);
            Blob input;
            net.convert(image, input, 0, 1);
            reference.setInput(blobToMat(input, {1, 1, size.height, size.width}));
            const cv::Mat expected = reference.forward();
            const std::vector<float> ours = net.detect(image);
            ASSERT_EQ(expected.total(), ours.size());
            for (size_t k = 0; k < ours.size(); ++k)
                EXPECT_NEAR(ours[k], expected.ptr<float>()[k], 1e-4f * (1 + std::fabs(ours[k]))) << which << k;
        }
    }
}
#else
TEST(PalmNetworks, AgreeWithOpenCvDnn) { GTEST_SKIP() << "OpenCV's dnn module (libopencv-dnn-dev) is not installed"; }
#endif

// the network the build wrote as source and compiled into this test
extern "C" void test_palm_seed7(NnDetector& detector);
LQ::SharedPtr<NnDetector> test_palm_seed7();

// The generated form builds the same network as the model file and the one in memory,
// with its weights left in the constant tables.
TEST(PalmNetworks, GeneratedSourceBuildsTheSameNetwork) {
    const NnDetector made = palmNetwork("test_palm_seed7", kPalm35x33, LQ::BaseSize<int>(35, 33), 7);
    LQ::SharedPtr<NnDetector> generated = test_palm_seed7();
    EXPECT_TRUE(*generated == made);
    EXPECT_TRUE(test_palm_seed7() == generated);
    NnDetector copy;
    test_palm_seed7(copy);
    EXPECT_TRUE(copy == made);
    NnDetector fromFile;
    LQ::ArchiveI::load(std::string(TACTUS_TEST_NETWORK) + ".nn", fromFile);
    EXPECT_TRUE(fromFile == *generated);
    for (const LQ::SharedPtr<BaseLayer>& layer : generated->getNetwork()) {
        if (layer->type() == "ConvolutionLayer") {
            EXPECT_FALSE(static_cast<const ConvolutionLayer&>(*layer).getFilter().getMemory().isOwning());
        }
    }

    std::mt19937 random(8);
    const LQ::Image image = randomImage(random, LQ::BaseSize<int>(35, 33));
    const std::vector<float> expected = NnDetector(made).detect(image);
    EXPECT_EQ(static_cast<std::vector<float>>(generated->detect(image)), expected);

    std::ifstream source(std::string(TACTUS_TEST_NETWORK) + ".cpp");
    const std::string text((std::istreambuf_iterator<char>(source)), std::istreambuf_iterator<char>());
    EXPECT_NE(text.find("    DLL_DECLSPEC void test_palm_seed7(NNDetector& detector);\n"), std::string::npos);
    EXPECT_NE(text.find("    // set layer #1:\n    LQ::SharedPtr<BaseLayer> p_conv1(&conv1(), false);\n"
                        "    nnDetector.addLayer(p_conv1);\n    p_conv1->addBottomLayer(p_data);\n\n"),
              std::string::npos);
    EXPECT_NE(text.find("    nnDetector.setSize(LQ::Size(35, 33));\n"), std::string::npos);
    EXPECT_NE(text.find("// random weights, seed 7\n// not trained\n"), std::string::npos);
}
