#include "HandRandom.h"

#include <cmath>

namespace handgen {

std::uint64_t mixSeed(std::uint64_t seed, std::uint64_t stream) {
    std::uint64_t z = seed + 0x9e3779b97f4a7c15ull * (stream + 1);
    z = (z ^ (z >> 30)) * 0xbf58476d1ce4e5b9ull;
    z = (z ^ (z >> 27)) * 0x94d049bb133111ebull;
    return z ^ (z >> 31);
}

HandRandom::HandRandom(std::uint64_t seed)
    : engine_(static_cast<std::uint32_t>(mixSeed(seed, 0) >> 32)) {}

double HandRandom::uniform() {
    const std::uint64_t high = raw() >> 5, low = raw() >> 6;
    return static_cast<double>((high << 26) | low) * (1.0 / 9007199254740992.0);
}

int HandRandom::below(int count) {
    if (count <= 1) return 0;
    const std::uint32_t n = static_cast<std::uint32_t>(count);
    const std::uint32_t limit = 0xffffffffu - 0xffffffffu % n;
    std::uint32_t value;
    do value = raw();
    while (value >= limit);
    return static_cast<int>(value % n);
}

double HandRandom::normal() {
    if (hasSpare_) {
        hasSpare_ = false;
        return spare_;
    }
    double u;
    do u = uniform();
    while (u <= 0);
    const double radius = std::sqrt(-2 * std::log(u)), angle = 6.283185307179586 * uniform();
    spare_ = radius * std::sin(angle);
    hasSpare_ = true;
    return radius * std::cos(angle);
}

float HandRandom::fastNormal() {
    const std::uint32_t r = raw();
    const int sum = static_cast<int>(r & 255) + static_cast<int>((r >> 8) & 255) + static_cast<int>((r >> 16) & 255) +
                    static_cast<int>(r >> 24);
    // four uniform bytes: mean 510, variance 4 * (256^2 - 1) / 12
    return static_cast<float>(sum - 510) * (1.0f / 147.8f);
}

}  // namespace handgen
