#pragma once
// The generator's random numbers. Only the raw 32-bit output of std::mt19937 is used (the
// standard fixes it); uniform and normal draws are made here, so that a seed gives the same
// data with any standard library.

#include <cstdint>
#include <random>

namespace handgen {

// splitmix64 finaliser: a well-spread seed from a base seed and a stream number, so that
// sample i does not depend on how many samples were drawn before it
std::uint64_t mixSeed(std::uint64_t seed, std::uint64_t stream);

class HandRandom {
public:
    explicit HandRandom(std::uint64_t seed);

    std::uint32_t raw() { return static_cast<std::uint32_t>(engine_()); }
    // [0, 1) with 53 bits
    double uniform();
    double uniform(double low, double high) { return low + (high - low) * uniform(); }
    // 0 .. count-1 without modulo bias
    int below(int count);
    bool chance(double probability) { return uniform() < probability; }
    // Box-Muller; the second value of each pair is kept for the next call
    double normal();
    // a cheap bell-shaped draw for per-pixel noise: the sum of a draw's four bytes, centred
    // and scaled to unit variance
    float fastNormal();

private:
    std::mt19937 engine_;
    double spare_ = 0;
    bool hasSpare_ = false;
};

}  // namespace handgen
