#pragma once
// The two palm verifier shapes, built with random weights from a seed: the tests compare
// them with other runtimes and the benchmarks time them; the trainer fills them in.

#include <random>
#include <string>
#include <vector>

#include "NnDetector.h"

struct ConvShape {
    const char* name;
    int outputs, inputs, height, width, stride, pad;
};

// every convolution but "final" is followed by a PReLU
extern const std::vector<ConvShape> kPalm35x33;
extern const std::vector<ConvShape> kPalm50x60;

// values uniform in -scale to scale
Blob randomBlob(std::mt19937& random, int n, int c, int h, int w, float scale);

// a chain of the given convolutions after a data layer, weights uniform and scaled to
// the filter volume
NnDetector palmNetwork(const std::string& name, const std::vector<ConvShape>& shape, LQ::BaseSize<int> size,
                       unsigned int seed);

// one of the two palm verifiers by its name and input size, the 50 x 60 one if large
NnDetector palmVerifier(bool large, unsigned int seed);

// a mono patch of uniform random pixels
LQ::Image randomPatch(LQ::BaseSize<int> size, unsigned int seed);
