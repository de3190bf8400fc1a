#include "LQ_ImageZoomData.h"

#include "LQ_ImageResize.h"

namespace LQ {

ResizeAlgorithm::Value ImageZoomData::resizeAlgorithm_ = ResizeAlgorithm::BILINEAR;

ImageZoomData::ImageZoomData(const SharedPtr<ImageData>& parent, int width) : pImageData_(parent) {
    const int parentWidth = parent->size().width;
    // an exact half stays exact so that halving takes its fast path
    zoom_ = width == parentWidth / 2 ? 0.5f * stableMultiplier<float>()
                                     : static_cast<float>(width) / parentWidth * stableMultiplier<float>();
    addParent(parent);
    init();
}

ImageZoomData::ImageZoomData(const SharedPtr<ImageData>& parent, float zoom) : pImageData_(parent), zoom_(zoom) {
    addParent(parent);
    init();
}

BaseSize<int> ImageZoomData::zoomedSize() const {
    const BaseSize<int> parentSize = pImageData_->size();
    return BaseSize<int>(static_cast<int>(parentSize.width * zoom_ * stableMultiplier<float>()),
                         static_cast<int>(parentSize.height * zoom_ * stableMultiplier<float>()));
}

void ImageZoomData::init() {
    LQ_ASSERT_EQ(parents_[0], pImageData_);
    image_.create(zoomedSize(), pImageData_->colorMode());
    computedRect_ = BaseRect<int>();
}

void ImageZoomData::compute(const BaseRect<int>& rect) {
    const int w = image_.width();
    const int pw = pImageData_->size().width;
    if (w == pw / 2) {
        const Image& parentImage =
            pImageData_->get(BaseRect<int>(2 * rect.left, 2 * rect.top, 2 * rect.right, 2 * rect.bottom));
        zoomImageTwice(parentImage, image_, rect);
    } else if (w == pw) {
        image_.createRef(pImageData_->get(rect));
    } else {
        BaseRect<int> source(rect.left * pw / w, rect.top * pw / w, rect.right * pw / w + 1,
                             rect.bottom * pw / w + 1);
        source = source.intersect(pImageData_->rect());
        if (source.area() <= 0) source = BaseRect<int>();
        const Image& parentImage = pImageData_->get(source);
        if (resizeAlgorithm_ != ResizeAlgorithm::BILINEAR)
            resizeImageNn(parentImage, image_, zoom_, rect);
        else
            resizeImageBilinear(parentImage, image_, zoom_, rect);
    }
}

void ImageZoomData::update() {
    if (pImageData_->colorMode() != image_.colorMode() || zoomedSize() != image_.size()) init();
    ImageData::update();
}

}  // namespace LQ
