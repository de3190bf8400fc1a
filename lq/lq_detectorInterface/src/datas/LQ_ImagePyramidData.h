#pragma once
// Scaled and feature images of one base image, made on demand by width and cached. Any
// width is reached by a chain of exact halvings shared by all widths below them and one
// last resize; images nobody asked for in 100 frames are forgotten.

#include <utility>
#include <vector>

#include "LQ_ImageData.h"

namespace LQ {

class ImagePyramidData : public BaseData {
public:
    typedef std::pair<ColorMode, int> DestructionInfo;
    static const int kRingSize = 100;

    ImagePyramidData(const SharedPtr<ImageData>& image, int numLayersHalfZoom);

    SharedPtr<ImageData>& getByWidth(ColorMode mode, int width);
    SharedPtr<ImageData>& getByLayer(ColorMode mode, int layer) { return getByWidth(mode, layerWidths_[layer]); }
    // here a zoom of 2 means half the width
    SharedPtr<ImageData>& getByZoom(ColorMode mode, float zoom);

    float getFractionalLayer(float zoom) const;
    int getNearestLayer(float zoom) const;
    float getNearestZoom(float zoom) const;
    float getZoomAtLayer(int layer) const { return static_cast<float>(size_.width) / layerWidths_[layer]; }
    int getBaseHalfLayer(int width) const;

    const BaseSize<int>& size() const { return size_; }
    BaseRect<int> rect() const { return BaseRect<int>(size_); }
    int getNumLayersHalfZoom() const { return numLayersHalfZoom_; }
    const std::vector<int>& layerWidths() const { return layerWidths_; }
    // the cached image, or null
    const SharedPtr<ImageData>* find(ColorMode mode, int width) const;

    // turns the forgetting ring once per frame
    void reset() override;
    void update() override;
    void print(std::ostream& stream) const override;
    std::string name() const override { return "ImagePyramidData of (" + parentNames() + ")"; }

private:
    void setUp(const SharedPtr<ImageData>& image);
    void prepareZoom(ColorMode mode, int width);
    void addImage(ColorMode mode, int width, const SharedPtr<ImageData>& node);
    std::vector<SharedPtr<ImageData>>& cache(ColorMode mode) { return images_[mode]; }

    SharedPtr<ImageData> base_;
    int numLayersHalfZoom_ = 1;
    BaseSize<int> size_;
    ColorMode baseMode_ = COLOR_MODE_UNDEFINED;
    std::vector<SharedPtr<ImageData>> images_[COLOR_MODE_END];
    std::vector<int> layerWidths_;
    int ringPosition_ = 0;
    std::vector<DestructionInfo> ring_[kRingSize];
};

}  // namespace LQ
