#pragma once
// A ring of random cascades, the same for the same seed: a test that writes it in one
// form and reads it back in another needs no trained data.

#include <memory>
#include <string>
#include <vector>

#include "ClassifierRing.h"

// The ring points at cascades it doesn't own, as a generated one does: they live here.
struct RandomRing {
    std::vector<std::unique_ptr<CascadedClassifier>> cascades;
    std::unique_ptr<ClassifierRing> ring;
};

// Two cascades (angles -30 and 0, one with the object smaller than the window) with
// RMCT, Haar and HOG stages, and a config.
RandomRing makeRandomRing(unsigned int seed, const std::string& name);
