#include <gtest/gtest.h>

#include <cmath>
#include <sstream>

#include "Blob.h"
#include "LogCapture.h"

namespace {
Blob counting(int n, int c, int h, int w) {
    Blob blob(n, c, h, w);
    for (int i = 0; i < blob.size(); ++i) blob.data()[i] = 0.25f * i - 3;
    return blob;
}
}  // namespace

// Copies share; init keeps memory for an unchanged count and replaces it otherwise,
// leaving other holders alone; wrapped memory is never freed.
TEST(Blob, SharingAndShapes) {
    Blob a = counting(1, 3, 4, 5);
    EXPECT_EQ(a.shape(), "1 x 3 x 5 x 4");
    EXPECT_EQ(a.offset(0, 2, 1, 3), (2 * 4 + 1) * 5 + 3);
    Blob b(a);
    b.data()[7] = 100;
    EXPECT_EQ(a.data()[7], 100);
    const float* memory = a.data();
    b.init(1, 60, 1, 1);  // same count: same memory, still shared
    EXPECT_EQ(b.data(), memory);
    EXPECT_EQ(b.getMemory().useCount(), 2);
    b.init(2, 60, 1, 1);  // new count: own memory, a keeps its own
    EXPECT_NE(b.data(), memory);
    EXPECT_EQ(a.data(), memory);
    EXPECT_EQ(a.getMemory().useCount(), 1);

    static const float table[4] = {1, 2, 3, 4};
    {
        Blob wrapped;
        wrapped.init(1, 1, 2, 2, table);
        EXPECT_EQ(wrapped.data(), table);
        EXPECT_FALSE(wrapped.getMemory().isOwning());
    }
    EXPECT_EQ(table[3], 4);

    Blob zeros(1, 1, 1, 2), signedZeros(1, 1, 1, 2);
    zeros.data()[0] = zeros.data()[1] = signedZeros.data()[0] = 0.f;
    signedZeros.data()[1] = -0.f;
    EXPECT_FALSE(zeros == signedZeros);
    signedZeros.data()[1] = 0.f;
    EXPECT_TRUE(zeros == signedZeros);

    const FailedCheck self = catchCheck([&] { a = *&a; });
    EXPECT_EQ(self.expression, "this != &blob");
    EXPECT_EQ(self.tail, "this == &blob");
}

// Conversions: an image into one sample of a batch, a vector into channels; small values.
TEST(Blob, Conversions) {
    LQ::Image image(LQ::BaseSize<int>(3, 2), LQ::COLOR_MODE_BGR);
    for (int y = 0; y < 2; ++y)
        for (int x = 0; x < 3; ++x)
            for (int k = 0; k < 3; ++k) image.pixel(x, y)[k] = static_cast<unsigned char>(10 * y + 3 * x + k);
    Blob blob;
    Blob::convert(image, blob, 1, 2);
    EXPECT_EQ(blob.shape(), "2 x 3 x 3 x 2");
    EXPECT_EQ(*blob.data(1, 2, 1, 2), (10 + 6 + 2) / 256.f);
    EXPECT_EQ(*blob.data(1, 0, 0, 1), 3 / 256.f);
    EXPECT_EQ(catchCheck([&] { Blob::convert(image, blob, -1, 2); }).expression, "(num) >= (0)");
    EXPECT_EQ(catchCheck([&] { Blob::convert(image, blob, 3, 2); }).expression, "(maxNum) >= (num)");

    Blob::convert(std::vector<float>{1.5f, -2.f, 1e-12f}, blob);
    EXPECT_EQ(blob.shape(), "1 x 3 x 1 x 1");
    blob.zeroSmallValues(1e-10f);
    EXPECT_EQ(static_cast<std::vector<float>>(blob), (std::vector<float>{1.5f, -2.f, 0.f}));
}

// The text and binary forms give back an equal blob; broken input ends in a check.
TEST(Blob, TextAndBinaryForms) {
    const Blob a = counting(2, 2, 3, 4);
    std::stringstream text;
    text << a;
    Blob b;
    text >> b;
    EXPECT_TRUE(a == b);

    std::ostringstream empty;
    empty << Blob();
    EXPECT_EQ(empty.str(), "Blob\nnum= 0\nchannels= 0\nwidth= 0\nheight= 0\n");

    std::string broken = text.str();
    broken.replace(broken.find("n= 1"), 4, "n= 7");
    std::istringstream wrongCounter(broken);
    const FailedCheck counter = catchCheck([&] { wrongCounter >> b; });
    EXPECT_EQ(counter.expression, "(bn) == (n)");
    std::istringstream wrongLabel("Blob\nnum= 1\nchannelz= 1\n");
    const FailedCheck label = catchCheck([&] { wrongLabel >> b; });
    EXPECT_EQ(label.expression, "(label == buffer) && (std::istream&)(stream)");

    std::stringstream binary;
    LQ::ArchiveO out(binary);
    out & a;
    Blob c;
    LQ::ArchiveI in(binary);
    in & c;
    EXPECT_TRUE(a == c);

    // negative, huge and cut-short shapes
    for (const std::vector<int32_t>& shape : {std::vector<int32_t>{1, -2, 3, 4}, std::vector<int32_t>{1000, 1000, 1000, 1000},
                                              std::vector<int32_t>{1, 1, 1, 100}, std::vector<int32_t>{1, 1, 4096, 4096}}) {
        std::stringstream bad;
        LQ::ArchiveO writer(bad);
        for (int32_t v : shape) writer & v;
        writer & 1.f;
        LQ::ArchiveI reader(bad);
        Blob d;
        EXPECT_TRUE(catchCheck([&] { reader & d; }).thrown) << shape[1];
    }
}

// The generated form: literals that read back the same floats, ten to a line.
TEST(Blob, SourceForm) {
    EXPECT_EQ(floatLiteral(1.f), "1.f");
    EXPECT_EQ(floatLiteral(1e-05f), "1e-05f");
    const float awkward = 0.1f + 0.2f;
    EXPECT_EQ(std::strtof(floatLiteral(awkward).c_str(), nullptr), awkward);

    const Blob blob = counting(1, 1, 3, 4);
    std::ostringstream source;
    blob.saveToCpp(source, "conv1_filter");
    const std::string text = source.str();
    EXPECT_EQ(text.rfind("Blob& conv1_filter()\n{\n    // num = 1\n    // channels = 1\n    // width = 4\n", 0), 0u);
    EXPECT_NE(text.find("       -3.f, -2.75f, -2.5f, -2.25f, -2.f, -1.75f, -1.5f, -1.25f, -1.f, -0.75f, \n       "
                        "-0.5f, -0.25f\n    };\n"),
              std::string::npos);
    EXPECT_NE(text.find("    blob.init(1, 1, 3, 4, conv1_filter_data);\n"), std::string::npos);
}
