#include "LQ_ImagePyramidData.h"

#include <cmath>

#include "LQ_ColorModeData.h"
#include "LQ_ImageZoomData.h"

namespace LQ {

ImagePyramidData::ImagePyramidData(const SharedPtr<ImageData>& image, int numLayersHalfZoom)
    : numLayersHalfZoom_(numLayersHalfZoom) {
    if (!image) return;
    base_ = image;
    addParent(image);
    setUp(image);
}

void ImagePyramidData::setUp(const SharedPtr<ImageData>& image) {
    const int numLayersHalfZoom = numLayersHalfZoom_;
    size_ = image->size();
    baseMode_ = image->colorMode();
    layerWidths_.clear();
    for (auto& list : ring_) list.clear();
    ringPosition_ = 0;
    for (auto& list : images_) list.clear();
    std::vector<SharedPtr<ImageData>>& base = cache(baseMode_);
    base.resize(size_.width + 1);
    base[size_.width] = image;
    LQ_ASSERT_GE(numLayersHalfZoom, 1);

    const float ratio = static_cast<float>(std::pow(2.0, -1.0 / numLayersHalfZoom_));
    int w = size_.width;
    if (w < 2) return;
    for (;;) {
        float f = 1.0f;
        for (int i = 0; i < numLayersHalfZoom_; ++i) {
            layerWidths_.push_back(static_cast<int>(f * w));
            f *= ratio;
        }
        if (w <= 3) break;
        w /= 2;
    }
}

SharedPtr<ImageData>& ImagePyramidData::getByWidth(ColorMode mode, int width) {
    std::vector<SharedPtr<ImageData>>& images = cache(mode);
    if (images.empty()) images.resize(size_.width + 1);
    if (width >= 0 && images.size() < static_cast<size_t>(width) + 1) images.resize(width + 1);
    if (width >= 0 && images[width]) return images[width];

    if (mode == COLOR_MODE_GRADIENT || mode == COLOR_MODE_RMCT || mode == COLOR_MODE_INTEGRAL) {
        // feature images are computed from mono at the wanted width, never scaled
        const SharedPtr<ImageData> mono = getByWidth(COLOR_MODE_MONO, width);
        addImage(mode, width, SharedPtr<ImageData>(new ColorModeData(mono, mode)));
        return cache(mode)[width];
    }
    if (!cache(mode)[size_.width]) {
        addImage(mode, size_.width,
                 SharedPtr<ImageData>(new ColorModeData(cache(baseMode_)[size_.width], mode)));
    }
    prepareZoom(mode, width);
    return cache(mode)[width];
}

SharedPtr<ImageData>& ImagePyramidData::getByZoom(ColorMode mode, float zoom) {
    return getByWidth(mode, static_cast<int>(size_.width / zoom * stableMultiplier<float>()));
}

void ImagePyramidData::prepareZoom(ColorMode mode, int width) {
    LQ_ASSERT_GT(width, 0);
    std::vector<SharedPtr<ImageData>>& images = cache(mode);
    if (images.size() < static_cast<size_t>(width) + 1) images.resize(width + 1);
    if (images[width]) return;
    int w = size_.width;
    while (w / 2 > width) {
        if (!cache(mode)[w / 2]) addImage(mode, w / 2, SharedPtr<ImageData>(new ImageZoomData(cache(mode)[w], w / 2)));
        w /= 2;
    }
    addImage(mode, width, SharedPtr<ImageData>(new ImageZoomData(cache(mode)[w], width)));
}

void ImagePyramidData::addImage(ColorMode mode, int width, const SharedPtr<ImageData>& node) {
    cache(mode)[width] = node;
    ring_[ringPosition_].push_back(DestructionInfo(mode, width));
}

const SharedPtr<ImageData>* ImagePyramidData::find(ColorMode mode, int width) const {
    const std::vector<SharedPtr<ImageData>>& images = images_[mode];
    if (width < 0 || static_cast<size_t>(width) >= images.size() || !images[width]) return nullptr;
    return &images[width];
}

float ImagePyramidData::getFractionalLayer(float zoom) const {
    return static_cast<float>(std::log2(static_cast<double>(zoom)) * numLayersHalfZoom_);
}

int ImagePyramidData::getNearestLayer(float zoom) const {
    float layer = getFractionalLayer(zoom);
    if (layer < 0) layer = 0;
    return static_cast<int>(layer + 0.5f);
}

float ImagePyramidData::getNearestZoom(float zoom) const {
    return static_cast<float>(size_.width) / layerWidths_[getNearestLayer(zoom)];
}

int ImagePyramidData::getBaseHalfLayer(int width) const {
    int w = size_.width / 2;
    int layer = 0;
    while (w > width) {
        w /= 2;
        layer += numLayersHalfZoom_;
    }
    return layer;
}

void ImagePyramidData::reset() {
    const int next = (ringPosition_ + 1) % kRingSize;
    for (const DestructionInfo& info : ring_[next]) {
        std::vector<SharedPtr<ImageData>>& images = cache(info.first);
        if (static_cast<size_t>(info.second) >= images.size() || !images[info.second]) continue;
        if (images[info.second]->isLeafNode())
            images[info.second] = SharedPtr<ImageData>();
        else
            ring_[ringPosition_].push_back(info);  // still a parent: look again next time round
    }
    ring_[next].clear();
    ringPosition_ = next;
}

void ImagePyramidData::update() {
    if (!base_) return;
    // the frame changed its size or mode: start the cache again on the same base
    if (base_->colorMode() != baseMode_ || base_->size() != size_) setUp(base_);
}

void ImagePyramidData::print(std::ostream& stream) const {
    stream << "ImagePyramidData(";
    if (!parents_.empty()) parents_[0]->print(stream);
    stream << ")";
}

}  // namespace LQ
