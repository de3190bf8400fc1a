#include "PoolingLayer.h"

#include <algorithm>
#include <cmath>
#include <limits>

#include "LQ_Utils.h"

namespace {
constexpr float LOWEST = -std::numeric_limits<float>::max();

// ceil(numerator / denominator) with the division in float, the rounding model files were sized with
int ceilDiv(int numerator, int denominator) {
    return static_cast<int>(std::ceil(static_cast<float>(numerator) / static_cast<float>(denominator)));
}
}  // namespace

template <class T>
void maxPool(const T* src, T* dst, int width, int height) {
    const int outWidth = (width + 1) / 2;
    const int outHeight = (height + 1) / 2;
    const int pairs = width / 2;
    for (int oy = 0; oy < outHeight; ++oy) {
        const T* row0 = src + 2 * oy * width;
        // an odd last row pairs with itself: a block one high
        const T* row1 = 2 * oy + 1 < height ? row0 + width : row0;
        T* out = dst + oy * outWidth;
        for (int ox = 0; ox < pairs; ++ox)
            out[ox] =
                std::max(std::max(row0[2 * ox], row0[2 * ox + 1]), std::max(row1[2 * ox], row1[2 * ox + 1]));
        if (width & 1) out[pairs] = std::max(row0[width - 1], row1[width - 1]);
    }
}

template void maxPool<float>(const float* src, float* dst, int width, int height);

void PoolingLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    // a layer that no model file has set up would divide by zero
    LQ_ASSERT_GT(kernel_, 0);
    LQ_ASSERT_GT(stride_, 0);
    if (stride_ == kernel_)
        poolingStrideEqualsKernel();
    else
        poolingDifferentStrideKernel();
}

void PoolingLayer::poolingStrideEqualsKernel() {
    const Blob& bottom = bottomLayers_[0]->getBlob();
    LQ_ASSERT_GE(bottom.num(), 1);
    const int s = stride_;
    const int W = bottom.width(), H = bottom.height();
    const int outH = ceilDiv(H, s), outW = ceilDiv(W, s);
    top_.init(bottom.num(), bottom.channels(), outH, outW);
    const int planes = bottom.num() * bottom.channels();
    const int inArea = bottom.area(), outArea = top_.area();

    if (s == 2) {
        for (int p = 0; p < planes; ++p)
            maxPool<float>(bottom.data() + p * inArea, top_.data() + p * outArea, W, H);
        return;
    }

    float* out = top_.data();
    std::fill(out, out + top_.size(), LOWEST);
    for (int p = 0; p < planes; ++p) {
        const float* plane = bottom.data() + p * inArea;
        float* outPlane = out + p * outArea;
        for (int y = 0; y < H; ++y) {
            const float* row = plane + y * W;
            float* outRow = outPlane + (y / s) * outW;
            for (int ox = 0; ox < outW; ++ox) {
                const int xEnd = std::min(W, (ox + 1) * s);
                for (int x = ox * s; x < xEnd; ++x) outRow[ox] = std::max(outRow[ox], row[x]);
            }
        }
    }
}

void PoolingLayer::poolingDifferentStrideKernel() {
    const Blob& bottom = bottomLayers_[0]->getBlob();
    LQ_ASSERT_EQ(bottom.num(), 1);
    const int k = kernel_, s = stride_;
    const int W = bottom.width(), H = bottom.height();
    const int outH = ceilDiv(H - k, s) + 1, outW = ceilDiv(W - k, s) + 1;
    top_.init(1, bottom.channels(), outH, outW);
    for (int c = 0; c < bottom.channels(); ++c) {
        const float* plane = bottom.data(0, c, 0, 0);
        float* outPlane = top_.data(0, c, 0, 0);
        for (int oy = 0; oy < outH; ++oy) {
            const int yEnd = std::min(H, oy * s + k);
            for (int ox = 0; ox < outW; ++ox) {
                const int xEnd = std::min(W, ox * s + k);
                // a window wholly outside the input keeps this value
                float value = LOWEST;
                for (int y = oy * s; y < yEnd; ++y)
                    for (int x = ox * s; x < xEnd; ++x) value = std::max(value, plane[y * W + x]);
                outPlane[oy * outW + ox] = value;
            }
        }
    }
}

void PoolingLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    stream << "PoolingLayer& " << name << "()\n"
           << "{\n"
           << "    static PoolingLayer poolingLayer(" << kernel_ << "," << stride_ << ", \"" << name
           << "\");\n"
           << "    return poolingLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> PoolingLayer::clone() {
    return LQ::SharedPtr<BaseLayer>(new PoolingLayer(kernel_, stride_, name_));
}

bool PoolingLayer::compare(const BaseLayer& layer) const {
    const PoolingLayer* other = dynamic_cast<const PoolingLayer*>(&layer);
    return other && other->kernel_ == kernel_ && other->stride_ == stride_;
}
