#include "HandSamples.h"

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <stdexcept>
#include <thread>

namespace handgen {

namespace {

const char kCropMagic[8] = {'H', 'G', 'C', 'R', 'O', 'P', 'S', '1'};

void putU32(std::ostream& out, std::uint32_t value) {
    const char bytes[4] = {static_cast<char>(value), static_cast<char>(value >> 8), static_cast<char>(value >> 16),
                           static_cast<char>(value >> 24)};
    out.write(bytes, 4);
}

std::uint32_t getU32(const unsigned char* bytes) {
    return bytes[0] | (bytes[1] << 8) | (bytes[2] << 16) | (static_cast<std::uint32_t>(bytes[3]) << 24);
}

std::string number(float value) {
    char text[32];
    std::snprintf(text, sizeof(text), "%.6g", static_cast<double>(value));
    return text;
}

}  // namespace

const char* sampleKindName(SampleKind kind) {
    static const char* const names[] = {"positive", "background", "otherGesture", "misplaced"};
    return names[static_cast<int>(kind)];
}

SampleLabel renderSample(const SampleSet& set, std::uint64_t index, Canvas& canvas) {
    // each gesture's positives and negatives of one seed draw from streams of their own
    const std::uint64_t stream = mixSeed(set.seed, static_cast<std::uint64_t>(set.gesture) * 2 + (set.negatives ? 1 : 0));
    HandRandom random(mixSeed(stream, index));
    const Variation& v = set.variation;
    const SampleWindow& window = set.window;

    SampleLabel label;
    if (!set.negatives) {
        label.kind = SampleKind::Positive;
    } else {
        const double pick = random.uniform();
        label.kind = pick < set.otherGestureShare                        ? SampleKind::OtherGesture
                     : pick < set.otherGestureShare + set.misplacedShare ? SampleKind::Misplaced
                                                                         : SampleKind::Background;
    }
    if (label.kind == SampleKind::Positive || label.kind == SampleKind::Misplaced) {
        label.shown = set.gesture;
    } else if (label.kind == SampleKind::OtherGesture) {
        const int other = random.below(kGestureCount - 1);
        label.shown = static_cast<Gesture>(other < static_cast<int>(set.gesture) ? other : other + 1);
    }

    const Lighting light = randomLighting(v, random);
    const Finish finish = randomFinish(v, random);
    canvas.reset(window.width, window.height);
    const float unit = (window.objectWidth + window.objectHeight) / 2;
    // a negative never has the asked gesture among its distractors
    drawScene(canvas, unit, v, light, set.gesture, true, set.supersample, random);

    if (label.shown) {
        const HandDraw hand = randomHand(*label.shown, v, random);
        const UprightHand upright = buildHand(hand.pose, hand.build, hand.side);
        const float boxWidth = upright.right - upright.left, boxHeight = upright.top - upright.bottom;
        float scale = std::min(window.objectWidth / boxWidth, window.objectHeight / boxHeight) * v.scale.draw(random);
        float x = window.objectX + window.objectWidth * (0.5f + v.shift.draw(random));
        float y = window.objectY + window.objectHeight * (0.5f + v.shift.draw(random));
        float angle = window.angle + v.rotation.draw(random);
        if (label.kind == SampleKind::Misplaced) {
            // far enough from a positive that no trainer should call it one
            switch (random.below(4)) {
                case 0: scale *= static_cast<float>(random.uniform(0.3, 0.6)); break;
                case 1: scale *= static_cast<float>(random.uniform(1.7, 3.0)); break;
                case 2: {
                    const float away = static_cast<float>(random.uniform(0.5, 0.9));
                    const float direction = static_cast<float>(random.uniform(0, 6.2831853));
                    x += std::cos(direction) * away * window.objectWidth;
                    y += std::sin(direction) * away * window.objectHeight;
                    break;
                }
                default: angle += static_cast<float>(random.chance(0.5) ? 1 : -1) * static_cast<float>(random.uniform(45, 135));
            }
        }
        const ScreenHand screen = placeHand(upright, Placement{x, y, scale, angle});
        HandLayer layer;
        renderHand(screen, hand.look, light, set.supersample, canvas.width(), canvas.height(), layer);
        composite(layer, canvas);
        label.side = hand.side;
        label.box = screen.box;
    }
    HandRandom noise(mixSeed(random.raw(), 1));
    applyFinish(canvas, finish, noise);
    return label;
}

void toMono(const Canvas& canvas, std::uint8_t* mono) {
    auto level = [](float v) { return static_cast<int>(std::clamp(v * 255 + 0.5f, 0.f, 255.f)); };
    for (int y = 0; y < canvas.height(); ++y) {
        const float* row = canvas.row(y);
        for (int x = 0; x < canvas.width(); ++x)
            *mono++ = lumaOf(level(row[3 * x]), level(row[3 * x + 1]), level(row[3 * x + 2]));
    }
}

std::vector<std::uint8_t> generateSamples(const SampleSet& set, std::uint64_t first, int count, int threads,
                                          std::vector<SampleLabel>* labels) {
    const size_t size = static_cast<size_t>(set.window.width) * set.window.height;
    std::vector<std::uint8_t> out(size * std::max(0, count));
    if (labels) labels->assign(std::max(0, count), SampleLabel{});
    std::atomic<int> next{0};
    auto work = [&] {
        Canvas canvas;
        for (int i; (i = next.fetch_add(1)) < count;) {
            const SampleLabel label = renderSample(set, first + i, canvas);
            toMono(canvas, out.data() + size * i);
            if (labels) (*labels)[i] = label;
        }
    };
    std::vector<std::thread> workers;
    for (int t = 1; t < std::max(1, threads); ++t) workers.emplace_back(work);
    work();
    for (std::thread& worker : workers) worker.join();
    return out;
}

void writeCrops(const std::string& path, int width, int height, const std::vector<std::uint8_t>& windows) {
    std::ofstream out(path, std::ios::binary);
    if (!out) throw std::runtime_error("cannot write " + path);
    const size_t size = static_cast<size_t>(width) * height;
    out.write(kCropMagic, sizeof(kCropMagic));
    putU32(out, static_cast<std::uint32_t>(width));
    putU32(out, static_cast<std::uint32_t>(height));
    putU32(out, static_cast<std::uint32_t>(size ? windows.size() / size : 0));
    out.write(reinterpret_cast<const char*>(windows.data()), static_cast<std::streamsize>(windows.size()));
    if (!out) throw std::runtime_error("cannot write " + path);
}

std::vector<std::uint8_t> readCrops(const std::string& path, int& width, int& height) {
    std::ifstream in(path, std::ios::binary);
    if (!in) throw std::runtime_error("cannot open " + path);
    unsigned char header[20];
    if (!in.read(reinterpret_cast<char*>(header), sizeof(header)) || std::memcmp(header, kCropMagic, 8) != 0)
        throw std::runtime_error(path + " is not a crop file");
    width = static_cast<int>(getU32(header + 8));
    height = static_cast<int>(getU32(header + 12));
    const std::uint64_t count = getU32(header + 16);
    if (width <= 0 || height <= 0 || width > 4096 || height > 4096)
        throw std::runtime_error(path + ": bad window size");
    const std::uint64_t bytes = count * static_cast<std::uint64_t>(width) * static_cast<std::uint64_t>(height);
    in.seekg(0, std::ios::end);
    if (static_cast<std::uint64_t>(in.tellg()) != sizeof(header) + bytes)
        throw std::runtime_error(path + ": the window count does not match the file's length");
    in.seekg(sizeof(header));
    std::vector<std::uint8_t> windows(static_cast<size_t>(bytes));
    if (!in.read(reinterpret_cast<char*>(windows.data()), static_cast<std::streamsize>(windows.size())))
        throw std::runtime_error("cannot read " + path);
    return windows;
}

void writePgm(const std::string& path, int width, int height, const std::uint8_t* pixels) {
    std::ofstream out(path, std::ios::binary);
    out << "P5\n" << width << ' ' << height << "\n255\n";
    out.write(reinterpret_cast<const char*>(pixels), static_cast<std::streamsize>(width) * height);
    if (!out) throw std::runtime_error("cannot write " + path);
}

std::string labelJson(std::uint64_t index, const SampleLabel& label) {
    std::string out = "{\"index\":" + std::to_string(index) + ",\"kind\":\"" + sampleKindName(label.kind) + "\"";
    if (label.shown) {
        out += ",\"gesture\":\"" + std::string(gestureName(*label.shown)) + "\",\"side\":\"" + sideName(label.side) +
               "\",\"box\":[" + number(label.box.cx) + "," + number(label.box.cy) + "," + number(label.box.width) +
               "," + number(label.box.height) + "],\"angle\":" + number(label.box.angle);
    }
    return out + "}";
}

}  // namespace handgen
