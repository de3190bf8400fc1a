#include "ConvolutionLayer.h"

#include <cmath>
#include <algorithm>
#include <cstring>

#include "ConvolutionKernels.h"
#include "LQ_Utils.h"

ConvolutionLayer::ConvolutionLayer(const std::string& name) : BaseLayer(name) {}

ConvolutionLayer::ConvolutionLayer(const Blob& filter, const Blob& bias, const std::string& name, int stride,
                                   int pad)
    : BaseLayer(name),
      filter_(filter),
      bias_(bias),
      stride_(stride),
      pad_(pad),
      filterVolume_(filter.volume()) {
    LQ_ASSERT_EQ(filter_.num(), bias_.size());
    LQ_ASSERT_MSG(stride_ >= 1, "Stride is not correct, stride = " << stride_);
    LQ_ASSERT_MSG(pad_ >= 0, "Pad is not correct, pad = " << pad_);
}

void ConvolutionLayer::prune() {
    pruned_.clear();
    const int channels = filter_.channels(), area = filter_.area();
    for (int f = 0; f < filter_.num(); ++f) {
        for (int c = 0; c < channels; ++c) {
            const float* kernel = filter_.data(f, c, 0, 0);
            float sum = 0.f;
            for (int i = 0; i < area; ++i) sum += std::fabs(kernel[i]);
            pruned_.push_back(static_cast<double>(sum) < 1e-7);
        }
    }
}

Blob ConvolutionLayer::workingInput(const Blob& input) {
    if (pad_ == 0) return input;
    const int width = input.width() + 2 * pad_, height = input.height() + 2 * pad_;
    borderedInput_.init(input.num(), input.channels(), height, width);
    if (borderedInput_.size() == 0) return borderedInput_;
    // all of it each time: the blob may have held another shape on the last call
    std::memset(borderedInput_.data(), 0, sizeof(float) * borderedInput_.size());
    const size_t row = sizeof(float) * input.width();
    for (int n = 0; n < input.num(); ++n)
        for (int c = 0; c < input.channels(); ++c)
            for (int y = 0; y < input.height(); ++y)
                std::memcpy(borderedInput_.data(n, c, y + pad_, pad_), input.data(n, c, y, 0), row);
    return borderedInput_;
}

void ConvolutionLayer::forward() {
    LQ_ASSERT_MSG((bottomLayers_.size()) == (1), bottomLayers_.size() << " != " << 1);
    const Blob& inputBottom = bottomLayers_[0]->getBlob();
    LQ_ASSERT_GE(inputBottom.num(), 1);
    LQ_ASSERT_EQ(inputBottom.channels(), filter_.channels());
    // A model file bypasses the constructor's checks; without these a corrupt one would
    // read past the weights or divide by zero.
    LQ_ASSERT_EQ(filter_.num(), bias_.size());
    LQ_ASSERT_EQ(filterVolume_, filter_.volume());
    LQ_ASSERT_MSG(stride_ >= 1, "Stride is not correct, stride = " << stride_);
    LQ_ASSERT_MSG(pad_ >= 0, "Pad is not correct, pad = " << pad_);

    const LQ::Size inputSize(inputBottom.width() + 2 * pad_, inputBottom.height() + 2 * pad_);
    const LQ::Size filterSize(filter_.width(), filter_.height());
    // a smaller input would have the kernel read past it
    LQ_ASSERT_MSG(inputSize.width >= filterSize.width && inputSize.height >= filterSize.height,
                  "the input " << inputSize.width << " x " << inputSize.height
                               << " with its border is smaller than the kernel " << filterSize.width << " x "
                               << filterSize.height);
    // rounded down: a last window that doesn't fit is dropped
    const LQ::Size outputSize((inputSize.width - filterSize.width) / stride_ + 1,
                              (inputSize.height - filterSize.height) / stride_ + 1);
    top_.init(inputBottom.num(), filter_.num(), outputSize.height, outputSize.width);
    if (inputSize == filterSize) {
        calculateLayerAsScalarProduct(workingInput(inputBottom));
    } else if (path_ == Path::SlidingWindow) {
        calculateLayerBySlidingWindow(workingInput(inputBottom), inputSize, outputSize, filterSize);
    } else if (path_ == Path::MatrixProduct) {
        calculateLayerByMatrixProduct(workingInput(inputBottom), inputSize, outputSize, filterSize);
    } else {
        calculateLayerDirectly(inputBottom, outputSize, filterSize);
    }
}

void ConvolutionLayer::calculateLayerAsScalarProduct(const Blob& input) {
    for (int n = 0; n < input.num(); ++n)
        LQ::dotProducts(filter_.data(), filter_.num(), filterVolume_, input.data(n, 0, 0, 0), filterVolume_,
                        bias_.data(), top_.data(n, 0, 0, 0));
    if (doRelu_) LQ::maxVector(top_.data(), top_.size(), 0.f);
}

void ConvolutionLayer::calculateLayerBySlidingWindow(const Blob& input, const LQ::Size& inputSize,
                                                     const LQ::Size& outputSize, const LQ::Size& filterSize) {
    const int area = outputSize.area(), kernelArea = filterSize.area(), channels = input.channels();
    plane_.resize(area);
    float* scratch = plane_.data();
    const float* bias = bias_.data();
    const auto filterPlane = [&](int n, int c, const float* kernel, float value, float* out) {
        LQ::applyFilter(input.data(n, c, 0, 0), out, inputSize.width, inputSize.height, kernel,
                        filterSize.width, filterSize.height, value, stride_);
    };
    for (int n = 0; n < input.num(); ++n) {
        for (int f = 0; f < filter_.num(); ++f) {
            float* out = top_.data(n, f, 0, 0);
            const float* kernels = filter_.data(f, 0, 0, 0);
            int c = 0;
            if (pruned_.empty()) {
                filterPlane(n, 0, kernels, bias[f], out);
                c = 1;
            } else {
                for (int i = 0; i < area; ++i) out[i] = bias[f];
            }
            for (; c < channels; ++c) {
                if (!pruned_.empty() && pruned_[static_cast<size_t>(f) * channels + c]) continue;
                filterPlane(n, c, kernels + static_cast<size_t>(c) * kernelArea, 0.f, scratch);
                for (int i = 0; i < area; ++i) out[i] += scratch[i];
            }
        }
    }
    if (doRelu_) LQ::maxVector(top_.data(), top_.size(), 0.f);
}

void ConvolutionLayer::calculateLayerByMatrixProduct(const Blob& input, const LQ::Size& inputSize,
                                                     const LQ::Size& outputSize, const LQ::Size& filterSize) {
    const int rows = filter_.num(), depth = filterVolume_, count = outputSize.area(),
              channels = input.channels();
    const int kernelArea = filterSize.area();
    // Packed on every call: it costs one pass over the weights, and the weights may have
    // been replaced or written through a shared blob since the last frame.
    LQ::packPanels(filter_.data(), rows, depth, packed_);
    // a pruned pair adds zeros instead of being skipped
    if (!pruned_.empty()) {
        for (int f = 0; f < rows; ++f)
            for (int c = 0; c < channels; ++c)
                if (pruned_[static_cast<size_t>(f) * channels + c])
                    for (int i = 0; i < kernelArea; ++i)
                        LQ::packedAt(packed_, depth, f, c * kernelArea + i) = 0.f;
    }
    // a 1 x 1 kernel at stride 1 reads the input planes as they are
    const bool direct = kernelArea == 1 && stride_ == 1;
    if (!direct) columns_.resize(static_cast<size_t>(depth) * count);
    for (int n = 0; n < input.num(); ++n) {
        const float* columns = input.data(n, 0, 0, 0);
        if (!direct) {
            LQ::unfoldPatches(columns, channels, inputSize.width, inputSize.height, filterSize.width,
                              filterSize.height, stride_, outputSize.width, outputSize.height,
                              columns_.data());
            columns = columns_.data();
        }
        LQ::multiplyPanels(packed_.data(), bias_.data(), rows, depth, columns, count, count,
                           top_.data(n, 0, 0, 0), count);
    }
    if (doRelu_) LQ::maxVector(top_.data(), top_.size(), 0.f);
}

void ConvolutionLayer::calculateLayerDirectly(const Blob& input, const LQ::Size& outputSize,
                                              const LQ::Size& filterSize) {
    const int rows = filter_.num(), depth = filterVolume_, channels = input.channels();
    const int kernelArea = filterSize.area();
    // The weights may have been replaced or written through a shared blob since the last
    // frame. Comparing them with the ones packed costs a small part of packing again.
    const size_t weightCount = static_cast<size_t>(rows) * depth;
    if (packedFrom_.size() != weightCount || packedPruned_ != pruned_ ||
        (weightCount > 0 &&
         std::memcmp(packedFrom_.data(), filter_.data(), sizeof(float) * weightCount) != 0)) {
        packedFrom_.assign(filter_.data(), filter_.data() + weightCount);
        packedPruned_ = pruned_;
        const float* weights = packedFrom_.data();
        // a pruned pair adds zeros instead of being skipped, as in the matrix product
        if (!pruned_.empty()) {
            columns_.assign(weights, weights + weightCount);
            for (int f = 0; f < rows; ++f)
                for (int c = 0; c < channels; ++c)
                    if (pruned_[static_cast<size_t>(f) * channels + c])
                        std::fill_n(columns_.data() + static_cast<size_t>(f) * depth + c * kernelArea,
                                    kernelArea, 0.f);
            weights = columns_.data();
        }
        LQ::packTapGroups(weights, rows, depth, groups_);
    }
    const int phaseWidth = LQ::phaseSize(input.width(), pad_, stride_);
    const int phaseHeight = LQ::phaseSize(input.height(), pad_, stride_);
    const std::array<int, 6> geometry = {channels, filterSize.width, filterSize.height,
                                         stride_,  phaseWidth,       phaseHeight};
    if (geometry != offsetsFor_ || offsets_.size() != static_cast<size_t>(depth)) {
        offsets_.resize(depth);
        LQ::tapOffsets(channels, filterSize.width, filterSize.height, stride_, phaseWidth, phaseHeight,
                       offsets_.data());
        offsetsFor_ = geometry;
    }
    // without a border or a stride the input is its own single phase
    const bool split = pad_ > 0 || stride_ > 1;
    if (split) phases_.resize(static_cast<size_t>(channels) * stride_ * stride_ * phaseWidth * phaseHeight);
    // with spare sums between the rows, the sums go to scratch and are compacted
    const int count = (outputSize.height - 1) * phaseWidth + outputSize.width;
    const bool wide = phaseWidth != outputSize.width;
    if (wide) wide_.resize(static_cast<size_t>(rows) * count);
    for (int n = 0; n < input.num(); ++n) {
        const float* planes = input.data(n, 0, 0, 0);
        if (split) {
            LQ::splitPhases(planes, channels, input.width(), input.height(), pad_, stride_, phases_.data());
            planes = phases_.data();
        }
        float* out = top_.data(n, 0, 0, 0);
        LQ::convolveTaps(groups_.data(), bias_.data(), rows, depth, planes, offsets_.data(), count,
                         wide ? wide_.data() : out, count);
        if (wide)
            LQ::compactRows(wide_.data(), rows, count, phaseWidth, outputSize.width, outputSize.height, out);
    }
    if (doRelu_) LQ::maxVector(top_.data(), top_.size(), 0.f);
}

void ConvolutionLayer::serialize(LQ::ArchiveO& archive) const {
    archive & filter_ & bias_ & filterVolume_;
    archive.archiveFromVersion("Version 2", stride_);
    archive.archiveFromVersion("Version 7", pad_);
}

void ConvolutionLayer::serialize(LQ::ArchiveI& archive) {
    // fresh blobs: the old ones may be shared with clones or wrap a constant table
    Blob filter, bias;
    archive & filter & bias & filterVolume_;
    filter_ = filter;
    bias_ = bias;
    // files before these fields meant a step of 1 and no border
    stride_ = 1;
    pad_ = 0;
    archive.archiveFromVersion("Version 2", stride_);
    archive.archiveFromVersion("Version 7", pad_);
    doRelu_ = false;
    pruned_.clear();
}

void ConvolutionLayer::saveToCpp(std::ostream& stream, const std::string& name) {
    filter_.saveToCpp(stream, name + "_filter");
    bias_.saveToCpp(stream, name + "_bias");
    stream << "ConvolutionLayer& " << name << "()\n"
           << "{\n"
           << "    static ConvolutionLayer convolutionLayer(" << name << "_filter(), " << name
           << "_bias(), \"" << name << "\", " << stride_ << ", " << pad_ << ");\n"
           << "    return convolutionLayer;\n"
           << "}\n\n";
}

LQ::SharedPtr<BaseLayer> ConvolutionLayer::clone() {
    // weights shared; scratch, output and bottoms its own
    ConvolutionLayer* layer = new ConvolutionLayer(name_);
    layer->filter_ = filter_;
    layer->bias_ = bias_;
    layer->pruned_ = pruned_;
    layer->stride_ = stride_;
    layer->pad_ = pad_;
    layer->filterVolume_ = filterVolume_;
    layer->doRelu_ = doRelu_;
    layer->path_ = path_;
    return LQ::SharedPtr<BaseLayer>(layer);
}

bool ConvolutionLayer::compare(const BaseLayer& layer) const {
    const ConvolutionLayer* other = dynamic_cast<const ConvolutionLayer*>(&layer);
    return other && filter_ == other->filter_ && bias_ == other->bias_ && stride_ == other->stride_ &&
           pad_ == other->pad_ && filterVolume_ == other->filterVolume_;
}
