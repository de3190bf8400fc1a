#include <gtest/gtest.h>

#include <cstring>
#include <random>
#include <vector>

#include "LogCapture.h"
#include "LQ_Yuv420toBgr.h"

namespace {

struct Frame {
    std::vector<unsigned char> bytes;
    LQ::Image header;
    // width x lumaRows of luma, then lumaRows / 2 rows of V, U pairs
    Frame(int width, int lumaRows, const std::vector<unsigned char>& luma, const std::vector<unsigned char>& chroma)
        : bytes(luma) {
        bytes.insert(bytes.end(), chroma.begin(), chroma.end());
        header.createRef(bytes.data(), LQ::Size(width, lumaRows * 3 / 2), LQ::COLOR_MODE_BGR);
    }
};

std::vector<unsigned char> pixelBytes(const LQ::Image& image, int x, int y) {
    const unsigned char* p = image.pixel(x, y);
    return {p[0], p[1], p[2]};
}

using Bytes = std::vector<unsigned char>;

}  // namespace

TEST(Yuv420toBgr, HandComputedPixelsZoomedAndFull) {
    // 4x2 luma, one chroma row of two pairs (V, U)
    const Frame frame(4, 2, {100, 7, 81, 7, 7, 7, 7, 7}, {128, 128, 240, 90});
    LQ::Image bgr;
    LQ::yuv420toBgr(frame.header, bgr, true, false);
    ASSERT_EQ(bgr.size(), LQ::Size(2, 1));
    EXPECT_EQ(pixelBytes(bgr, 0, 0), (Bytes{116, 116, 116}));
    // B, G as computed; R clamps at 0x3FFFF
    EXPECT_EQ(pixelBytes(bgr, 1, 0), (Bytes{17, 18, 255}));

    LQ::Image rgb;
    LQ::yuv420toBgr(frame.header, rgb, true, true);
    EXPECT_EQ(pixelBytes(rgb, 1, 0), (Bytes{255, 18, 17}));

    // full size, 4x2 luma sharing two chroma pairs: each pair serves a 2x2 block
    const Frame full(4, 2, {255, 0, 200, 50, 16, 235, 200, 50}, {128, 128, 0, 255});
    LQ::yuv420toBgr(full.header, bgr, false, false);
    ASSERT_EQ(bgr.size(), LQ::Size(4, 2));
    EXPECT_EQ(pixelBytes(bgr, 0, 0), (Bytes{255, 255, 255}));  // 255 * 1192 clamps to 0x3FFFF
    EXPECT_EQ(pixelBytes(bgr, 1, 0), (Bytes{0, 0, 0}));
    EXPECT_EQ(pixelBytes(bgr, 0, 1), (Bytes{18, 18, 18}));  // no offset of 16 is taken off
    EXPECT_EQ(pixelBytes(bgr, 2, 0), (Bytes{255, 255, 28}));  // V 0, U 255: red 28
    EXPECT_EQ(pixelBytes(bgr, 3, 1), (Bytes{255, 112, 0}));   // negative red stores 0
}

TEST(Yuv420toBgr, OutputSizeAndTinyPictures) {
    EXPECT_EQ(LQ::getOutputSize(LQ::Size(1280, 1080), true), LQ::Size(640, 360));
    EXPECT_EQ(LQ::getOutputSize(LQ::Size(7, 5), true), LQ::Size(3, 1));
    EXPECT_EQ(LQ::getOutputSize(LQ::Size(7, 5), false), LQ::Size(7, 2));

    // without zoom a single column writes nothing
    std::vector<unsigned char> bytes(6, 200);
    LQ::Image source;
    source.createRef(bytes.data(), LQ::Size(1, 6), LQ::COLOR_MODE_BGR);
    LQ::Image bgr(LQ::Size(1, 4), LQ::COLOR_MODE_BGR);
    std::memset(bgr.data(), 7, 12);
    LQ::yuv420toBgr(source, bgr, false, false);
    EXPECT_EQ(bgr.size(), LQ::Size(1, 4));
    for (int i = 0; i < 12; ++i) EXPECT_EQ(bgr.data()[i], 7);

    EXPECT_TRUE(catchCheck([&] { LQ::yuv420toBgr(LQ::Image(), bgr, true, false); }).thrown);
}

TEST(Yuv420toBgr, WholeFramesOfOddSizesStayInsideTheirBuffers) {
    std::mt19937 random(11);
    for (int width = 2; width <= 35; width += 3) {
        for (int rows = 2; rows <= 8; rows += 2) {
            const int height = rows * 3 / 2;
            std::vector<unsigned char> bytes(static_cast<size_t>(width) * height);
            for (auto& b : bytes) b = static_cast<unsigned char>(random());
            LQ::Image source;
            source.createRef(bytes.data(), LQ::Size(width, height), LQ::COLOR_MODE_BGR);
            for (bool zoom : {false, true}) {
                LQ::Image bgr;
                LQ::yuv420toBgr(source, bgr, zoom, false);
                const LQ::Size size = LQ::getOutputSize(source.size(), zoom);
                ASSERT_EQ(bgr.size(), size);
                // every pixel agrees with the one-pixel formula on the bytes it is told to use
                const int d = zoom ? 2 : 1;
                const int stride = size.width * d;
                const unsigned char* chroma = bytes.data() + static_cast<size_t>(size.height) * d * stride;
                for (int y = 0; y < size.height; ++y) {
                    for (int x = 0; x < size.width; ++x) {
                        const int lumaAt = (y * d) * stride + x * d;
                        int pair = zoom ? x : std::min(x / 2, size.width / 2 - 1);
                        const int chromaAt = (zoom ? y : y / 2) * stride + 2 * pair;
                        unsigned char expected[3];
                        unsigned char* out = expected;
                        LQ::computeBgr(bytes[lumaAt], chroma[chromaAt + 1], chroma[chromaAt], out, false);
                        ASSERT_EQ(0, std::memcmp(expected, bgr.pixel(x, y), 3))
                            << width << "x" << height << " zoom " << zoom << " at " << x << "," << y;
                    }
                }
            }
        }
    }
}

// Random rows with the saturated corners of the colour space, in exact-size buffers so that
// a read past the row shows under the sanitizer; a full-size row has at least one pair.
TEST(Yuv420toBgr, VectorRowsEqualScalarRows) {
    using Row = void (*)(const unsigned char*, const unsigned char*, unsigned char*, int, bool);
    std::vector<std::pair<Row, Row>> rows;  // zoomed and full-size rows of each path (full: if any)
#if defined(LQ_HAVE_NEON)
    rows.push_back({LQ::yuvRowZoomNeon, LQ::yuvRowFullNeon});
#endif
#if defined(LQ_HAVE_SSSE3)
    if (LQ::haveSsse3()) rows.push_back({LQ::yuvRowZoomSse, nullptr});
    if (LQ::haveAvx2()) rows.push_back({LQ::yuvRowZoomAvx2, nullptr});
#endif
    if (rows.empty()) GTEST_SKIP() << "no vector path on this machine";
    std::mt19937 random(7);
    for (int width = 1; width <= 67; ++width) {
        Bytes luma(2 * width), chroma(2 * width);
        for (auto& b : luma) b = static_cast<unsigned char>(random());
        for (auto& b : chroma) b = static_cast<unsigned char>(random());
        if (width > 3) luma[0] = chroma[0] = chroma[1] = 255, luma[2] = chroma[2] = chroma[3] = 0;
        const Bytes chromaRow(chroma.begin(), chroma.begin() + width);
        for (bool swap : {false, true})
            for (size_t path = 0; path < rows.size(); ++path) {
                Bytes scalar(3 * width, 1), vector(3 * width, 2);
                LQ::yuvRowZoomScalar(luma.data(), chroma.data(), scalar.data(), width, swap);
                rows[path].first(luma.data(), chroma.data(), vector.data(), width, swap);
                EXPECT_EQ(scalar, vector) << "zoom, path " << path << " width " << width << " swap " << swap;
                if (width < 2 || !rows[path].second) continue;
                Bytes fullScalar(3 * width, 1), fullVector(3 * width, 2);
                LQ::yuvRowFullScalar(luma.data(), chromaRow.data(), fullScalar.data(), width, swap);
                rows[path].second(luma.data(), chromaRow.data(), fullVector.data(), width, swap);
                EXPECT_EQ(fullScalar, fullVector) << "full, path " << path << " width " << width << " swap " << swap;
            }
    }
}
