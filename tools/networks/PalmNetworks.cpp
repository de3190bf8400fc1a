#include "PalmNetworks.h"

#include <cmath>
#include <random>

#include "ConvolutionLayer.h"
#include "DataLayer.h"
#include "PReluLayer.h"

const std::vector<ConvShape> kPalm35x33 = {{"conv1", 10, 1, 3, 3, 2, 0},  {"conv2", 10, 10, 3, 3, 1, 0},
                                           {"conv3", 10, 10, 3, 3, 1, 0}, {"conv4", 10, 10, 3, 3, 1, 0},
                                           {"conv5", 10, 10, 3, 3, 1, 0}, {"conv6", 10, 10, 3, 3, 1, 0},
                                           {"conv7", 10, 10, 3, 3, 1, 0}, {"conv8", 10, 10, 3, 3, 1, 0},
                                           {"conv9", 30, 10, 2, 3, 1, 0}, {"final", 2, 30, 1, 1, 1, 0}};
const std::vector<ConvShape> kPalm50x60 = {
    {"conv1", 10, 1, 3, 3, 2, 0},   {"conv2", 10, 10, 3, 3, 1, 0},  {"conv3", 10, 10, 3, 3, 1, 0},
    {"conv4", 10, 10, 3, 3, 1, 0},  {"conv5", 10, 10, 3, 3, 2, 0},  {"conv6", 10, 10, 3, 3, 1, 0},
    {"conv7", 10, 10, 3, 3, 1, 0},  {"conv8", 10, 10, 3, 3, 1, 0},  {"conv81", 10, 10, 3, 3, 1, 1},
    {"conv82", 10, 10, 3, 3, 1, 1}, {"conv83", 10, 10, 3, 3, 1, 1}, {"conv84", 10, 10, 3, 3, 1, 1},
    {"conv9", 30, 10, 5, 2, 1, 0},  {"final", 2, 30, 1, 1, 1, 0}};

Blob randomBlob(std::mt19937& random, int n, int c, int h, int w, float scale) {
    Blob blob(n, c, h, w);
    std::uniform_real_distribution<float> value(-scale, scale);
    for (int i = 0; i < blob.size(); ++i) blob.data()[i] = value(random);
    return blob;
}

NnDetector palmNetwork(const std::string& name, const std::vector<ConvShape>& shape, LQ::BaseSize<int> size,
                       unsigned int seed) {
    std::mt19937 random(seed);
    NnDetector net;
    net.setName(name);
    LQ::SharedPtr<BaseLayer> previous(new DataLayer("data"));
    net.addLayer(previous);
    int relu = 0;
    for (const ConvShape& c : shape) {
        const float scale = 1.5f / std::sqrt(static_cast<float>(c.inputs * c.height * c.width));
        LQ::SharedPtr<BaseLayer> conv(new ConvolutionLayer(randomBlob(random, c.outputs, c.inputs, c.height, c.width, scale),
                                                           randomBlob(random, c.outputs, 1, 1, 1, 0.1f), c.name, c.stride,
                                                           c.pad));
        conv->addBottomLayer(previous);
        net.addLayer(conv);
        previous = conv;
        if (std::string(c.name) == "final") break;
        LQ::SharedPtr<BaseLayer> prelu(
            new PReluLayer("PReLU" + std::to_string(++relu), randomBlob(random, c.outputs, 1, 1, 1, 0.5f)));
        prelu->addBottomLayer(previous);
        net.addLayer(prelu);
        previous = prelu;
    }
    net.setSize(size);
    return net;
}

NnDetector palmVerifier(bool large, unsigned int seed) {
    return large ? palmNetwork("palm_verifier_iter_140000", kPalm50x60, LQ::BaseSize<int>(50, 60), seed)
                 : palmNetwork("palm_verifier__iter_250000", kPalm35x33, LQ::BaseSize<int>(35, 33), seed);
}

LQ::Image randomPatch(LQ::BaseSize<int> size, unsigned int seed) {
    std::mt19937 random(seed);
    LQ::Image image(size, LQ::COLOR_MODE_MONO);
    for (int y = 0; y < size.height; ++y)
        for (int x = 0; x < size.width; ++x) image.pixel(x, y)[0] = static_cast<unsigned char>(random() % 256);
    return image;
}
