#pragma once
// A chain of convolutions and PReLUs rebuilt in OpenCV's dnn module from our weights: an
// independent runtime to compare results and times with. Needs opencv_dnn.

#include <opencv2/dnn.hpp>
#include <vector>

#include "ConvolutionLayer.h"
#include "NnDetector.h"
#include "PReluLayer.h"

inline cv::Mat blobToMat(const Blob& blob, const std::vector<int>& shape) {
    return cv::Mat(shape, CV_32F, const_cast<float*>(blob.data())).clone();
}

inline cv::dnn::Net openCvNetwork(const NnDetector& net) {
    cv::dnn::Net result;
    for (const LQ::SharedPtr<BaseLayer>& layer : net.getNetwork()) {
        cv::dnn::LayerParams params;
        params.name = layer->name();
        if (layer->type() == "ConvolutionLayer") {
            const ConvolutionLayer& conv = static_cast<const ConvolutionLayer&>(*layer);
            const Blob& f = conv.getFilter();
            params.type = "Convolution";
            params.set("kernel_h", f.height());
            params.set("kernel_w", f.width());
            params.set("stride", conv.getStride());
            params.set("pad", conv.getPad());
            params.set("num_output", f.num());
            params.set("bias_term", true);
            params.blobs.push_back(blobToMat(f, {f.num(), f.channels(), f.height(), f.width()}));
            params.blobs.push_back(blobToMat(conv.getBias(), {1, conv.getBias().size()}));
        } else if (layer->type() == "PReluLayer") {
            params.type = "PReLU";
            const Blob& slope = static_cast<const PReluLayer&>(*layer).getSlope();
            params.blobs.push_back(blobToMat(slope, {1, slope.size()}));
        } else {
            continue;  // the data layer: OpenCV's input
        }
        result.addLayerToPrev(params.name, params.type, params);
    }
    return result;
}
