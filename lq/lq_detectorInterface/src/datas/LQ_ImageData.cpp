#include "LQ_ImageData.h"

#include <cstring>
#include <sstream>

#include "LQ_ImageCopy.h"

namespace LQ {

ImageData::ImageData() = default;

ImageData::ImageData(const BaseSize<int>& size, ColorMode colorMode) { image_.create(size, colorMode); }

void ImageData::compute(const BaseRect<int>& rect) {
    LQ_FAIL(*this << ". ImageData is not set, or void compute(const LQ::Rect&) is not overloaded");
}

void ImageData::set(const Image& image) {
    if (image_.isCreated() && (image.size() != image_.size() || image.colorMode() != image_.colorMode())) {
        LQ_LOGI("Setting image with different size " << image.size() << " prev size " << image_.size()
                                                     << " or colorMode " << image.colorMode() << " was "
                                                     << image_.colorMode());
    }
    image_.createRef(image);
    computedRect_ = BaseRect<int>(0, 0, image_.width(), image_.height());
}

const Image& ImageData::get() { return get(rect()); }

const Image& ImageData::get(const BaseRect<int>& rect) {
    BaseRect<int> wanted = rect.intersect(this->rect());
    // nothing of the request lies in the image: nothing to compute
    if (wanted.area() <= 0) return image_;
    if (!computedRect_.contains(wanted)) {
        compute(wanted);
        computedRect_ = wanted;
    }
    return image_;
}

void ImageData::get(const BaseRect<int>& rect, Image& out) {
    const BaseRect<int> overlap = rect.intersect(this->rect());
    if (overlap.area() <= 0) {
        LQ_LOGW("Rect fully outside of image " << rect);
        out.create(rect.size(), image_.colorMode());
        for (int y = 0; y < out.height(); ++y) std::memset(out.row(y), 0, static_cast<size_t>(out.width()) * out.depth());
        return;
    }
    get(overlap);
    copyImageBorder(image_, out, rect);
}

BaseSize<int> ImageData::size() const {
    if (image_.colorMode() == COLOR_MODE_INTEGRAL) return BaseSize<int>(image_.width() - 1, image_.height() - 1);
    return image_.size();
}

void ImageData::update() {
    lastSize_ = image_.size();
    lastColorMode_ = image_.colorMode();
}

std::string ImageData::name() const {
    std::ostringstream text;
    text << "ImageData at " << static_cast<const void*>(this);
    return text.str();
}

std::string ImageData::derivedName(const char* className) const {
    std::string text = className;
    const std::string args = arguments();
    if (!args.empty()) text += " " + args;
    return text + " of (" + parentNames() + ")";
}

void ImageData::print(std::ostream& stream) const {
    stream << static_cast<const void*>(this) << ": " << name() << "(" << size() << ", " << image_.colorMode() << ", "
           << computedRect_ << ")";
}

}  // namespace LQ
