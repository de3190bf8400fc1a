#include "LQ_Yuv420Converter.h"

#include <sstream>

#include "LQ_Yuv420toBgr.h"

namespace LQ {

Yuv420Converter::Yuv420Converter(const SharedPtr<ImageData>& parent, ColorMode colorMode, bool zoomTwice,
                                 bool swapRedBlue)
    : pImageData_(parent), colorMode_(colorMode), zoomTwice_(zoomTwice), swapRedBlue_(swapRedBlue) {
    addParent(parent);
    init();
}

void Yuv420Converter::init() {
    LQ_ASSERT_EQ(parents_[0], pImageData_);
    image_.create(getOutputSize(pImageData_->size(), zoomTwice_), colorMode_);
    computedRect_ = BaseRect<int>();
}

void Yuv420Converter::compute(const BaseRect<int>& rect) {
    const Image& source = pImageData_->get();
    if (colorMode_ == COLOR_MODE_MONO) {
        LQ_ASSERT_MSG((zoomTwice_) == (false), "for mono only zoom 1 is supported");
        // the luma rows are the mono picture: no copy
        const BaseSize<int> luma = getOutputSize(source.size(), false);
        image_.createRef(source.data(), luma, COLOR_MODE_MONO, source.stripLength());
        return;
    }
    LQ_ASSERT_MSG((colorMode_) == (COLOR_MODE_BGR), "Only mono and bgr are supported ");
    yuv420toBgr(source, image_, zoomTwice_, swapRedBlue_);
}

void Yuv420Converter::update() {
    if (getOutputSize(pImageData_->size(), zoomTwice_) != image_.size()) init();
    ImageData::update();
}

std::string Yuv420Converter::arguments() const {
    std::ostringstream text;
    text << " zoomTwice_ = " << zoomTwice_ << " swapRedBlue_ " << swapRedBlue_;
    return text.str();
}

}  // namespace LQ
