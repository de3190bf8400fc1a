#pragma once
// A graph node that holds one image. Derived nodes compute their pixels from their parent
// on request, for the rectangle asked for; computedRect_ says what is valid this frame.

#include "LQ_BaseData.h"
#include "LQ_Image.h"

namespace LQ {

class ImageData : public BaseData {
public:
    ImageData();
    ImageData(const BaseSize<int>& size, ColorMode colorMode);

    // computes rect's pixels into image_; only derived nodes know how
    virtual void compute(const BaseRect<int>& rect);

    // the new frame: shares its pixels, all valid
    void set(const Image& image);
    // valid pixels for the whole image, or at least for rect clipped to the image
    const Image& get();
    const Image& get(const BaseRect<int>& rect);
    // a copy of rect, with the edges repeated where rect leaves the image
    void get(const BaseRect<int>& rect, Image& out);
    Image& getRaw() { return image_; }

    // for an integral image, the size of the pixels it sums
    BaseSize<int> size() const;
    BaseRect<int> rect() const { return BaseRect<int>(size()); }
    ColorMode colorMode() const { return image_.colorMode(); }
    int stripLength() const { return static_cast<int>(image_.stripLength()); }
    const BaseRect<int>& computedRect() const { return computedRect_; }

    void reset() override { computedRect_ = BaseRect<int>(); }
    void update() override;
    void print(std::ostream& stream) const override;
    std::string name() const override;

protected:
    // "Name arguments of (parents)", the name of derived nodes
    std::string derivedName(const char* className) const;

    Image image_;
    BaseRect<int> computedRect_;
    BaseSize<int> lastSize_;
    ColorMode lastColorMode_ = COLOR_MODE_UNDEFINED;
};

}  // namespace LQ
