#include "HandClip.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <stdexcept>
#include <thread>

#include "clips.h"
#include "frame_json.h"

namespace handgen {

namespace {

constexpr float kTwoPi = 6.2831853f;
constexpr float kDegree = 3.14159265f / 180;

Point catmullRom(const Point& p0, const Point& p1, const Point& p2, const Point& p3, float t) {
    const float t2 = t * t, t3 = t2 * t;
    auto f = [&](float a, float b, float c, float d) {
        return 0.5f * (2 * b + (c - a) * t + (2 * a - 5 * b + 4 * c - d) * t2 + (3 * b - a - 3 * c + d) * t3);
    };
    return {f(p0.x, p1.x, p2.x, p3.x), f(p0.y, p1.y, p2.y, p3.y)};
}

// keeps the part of the polygon where inside(p) holds, cutting edges at the boundary
template <class Inside, class Cut>
std::vector<Point> clipEdge(const std::vector<Point>& polygon, Inside inside, Cut cut) {
    std::vector<Point> out;
    for (size_t i = 0; i < polygon.size(); ++i) {
        const Point& a = polygon[i];
        const Point& b = polygon[(i + 1) % polygon.size()];
        const bool ia = inside(a), ib = inside(b);
        if (ia) out.push_back(a);
        if (ia != ib) out.push_back(cut(a, b));
    }
    return out;
}

float normalizedAngle(float angle) {
    angle = std::fmod(angle, 360.f);
    if (angle > 180) angle -= 360;
    if (angle <= -180) angle += 360;
    return angle;
}

}  // namespace

std::vector<Point> clipToFrame(const std::vector<Point>& polygon, float width, float height) {
    auto atX = [](const Point& a, const Point& b, float x) {
        return Point{x, a.y + (b.y - a.y) * (x - a.x) / (b.x - a.x)};
    };
    auto atY = [](const Point& a, const Point& b, float y) {
        return Point{a.x + (b.x - a.x) * (y - a.y) / (b.y - a.y), y};
    };
    std::vector<Point> p = polygon;
    p = clipEdge(p, [](const Point& q) { return q.x >= 0; }, [&](const Point& a, const Point& b) { return atX(a, b, 0); });
    p = clipEdge(p, [&](const Point& q) { return q.x <= width; }, [&](const Point& a, const Point& b) { return atX(a, b, width); });
    p = clipEdge(p, [](const Point& q) { return q.y >= 0; }, [&](const Point& a, const Point& b) { return atY(a, b, 0); });
    p = clipEdge(p, [&](const Point& q) { return q.y <= height; }, [&](const Point& a, const Point& b) { return atY(a, b, height); });
    return p;
}

float polygonArea(const std::vector<Point>& polygon) {
    float twice = 0;
    for (size_t i = 0; i < polygon.size(); ++i) {
        const Point& a = polygon[i];
        const Point& b = polygon[(i + 1) % polygon.size()];
        twice += a.x * b.y - b.x * a.y;
    }
    return std::fabs(twice) / 2;
}

ClipMaker::ClipMaker(const ClipSetup& setup) : setup_(setup) {
    if (setup_.gestures.empty())
        for (int g = 0; g < kGestureCount; ++g) setup_.gestures.push_back(static_cast<Gesture>(g));
    const Variation& v = setup_.variation;
    const float W = static_cast<float>(setup_.width), H = static_cast<float>(setup_.height);
    HandRandom random(mixSeed(setup_.seed, 0x636c6970));
    light_ = randomLighting(v, random);
    finish_ = randomFinish(v, random);
    background_.reset(setup_.width, setup_.height);
    // hands in the background would be gestures the truth does not list
    const float unit = (setup_.handSize.low + setup_.handSize.high) / 2 * H;
    drawScene(background_, unit, v, light_, std::nullopt, false, setup_.supersample, random);

    int frame = static_cast<int>(setup_.gap.draw(random) / 2);
    while (frame < setup_.frames) {
        Appearance a;
        a.start = frame;
        a.end = frame + std::max(10, static_cast<int>(setup_.duration.draw(random)));
        const int count = 1 + random.below(3);
        for (int i = 0; i < count; ++i) {
            Gesture g;
            do g = setup_.gestures[random.below(static_cast<int>(setup_.gestures.size()))];
            while (!a.shapes.empty() && g == a.shapes.back() && setup_.gestures.size() > 1);
            a.shapes.push_back(g);
        }
        a.hand = randomHand(a.shapes[0], v, random);
        a.poses.push_back(a.hand.pose);
        for (int i = 1; i < count; ++i) a.poses.push_back(variedPose(a.shapes[i], v, random));
        const int length = a.end - a.start;
        for (int i = 1; i < count; ++i)
            a.changes.push_back(static_cast<int>(length * (0.2f + 0.6f * i / count)) - setup_.transition / 2);

        a.boxHeight = setup_.handSize.draw(random) * H;
        a.angle = v.rotation.draw(random);
        a.sway = setup_.turn.draw(random);
        a.swayPeriod = static_cast<float>(random.uniform(40, 120));
        a.swayPhase = static_cast<float>(random.uniform(0, kTwoPi));
        a.zoom = static_cast<float>(random.uniform(0, 0.15));
        a.zoomPeriod = static_cast<float>(random.uniform(50, 150));

        // from outside one edge, through the frame, out past an edge; hands seldom come from above
        const float margin = a.boxHeight * 1.2f;
        auto outside = [&](int edge) {
            const float along = static_cast<float>(random.uniform(0.2, 0.8));
            if (edge == 0) return Point{-margin, along * H};
            if (edge == 1) return Point{W + margin, along * H};
            return Point{along * W, H + margin};
        };
        a.path.push_back(outside(random.below(3)));
        const int through = 2 + random.below(2);
        for (int i = 0; i < through; ++i)
            a.path.push_back({static_cast<float>(random.uniform(0.25, 0.75)) * W,
                              static_cast<float>(random.uniform(0.3, 0.7)) * H});
        a.path.push_back(outside(random.below(3)));
        appearances_.push_back(a);
        frame = a.end + std::max(0, static_cast<int>(setup_.gap.draw(random)));
    }
}

ClipMaker::HandState ClipMaker::state(int frame) const {
    HandState s;
    for (const Appearance& a : appearances_) {
        if (frame < a.start || frame >= a.end) continue;
        s.appearance = &a;
        const int t = frame - a.start;
        const int length = a.end - a.start;

        s.pose = a.poses.back();
        s.shape = a.shapes.back();
        for (size_t i = 0; i < a.changes.size(); ++i) {
            if (t < a.changes[i]) {
                s.pose = a.poses[i];
                s.shape = a.shapes[i];
                break;
            }
            if (t < a.changes[i] + setup_.transition) {
                float f = (t - a.changes[i] + 0.5f) / setup_.transition;
                f = f * f * (3 - 2 * f);
                s.pose = blendPoses(a.poses[i], a.poses[i + 1], f);
                s.shape.reset();
                break;
            }
        }

        // quick in, a slow wander inside, quick out
        const float u = length > 1 ? static_cast<float>(t) / (length - 1) : 0;
        const int segments = static_cast<int>(a.path.size()) - 1;
        float position;
        if (u < 0.15f) position = u / 0.15f;
        else if (u > 0.85f) position = segments - 1 + (u - 0.85f) / 0.15f;
        else position = 1 + (u - 0.15f) / 0.7f * (segments - 2);
        const int k = std::min(segments - 1, static_cast<int>(position));
        const auto at = [&](int i) { return a.path[std::clamp(i, 0, segments)]; };
        const Point p = catmullRom(at(k - 1), at(k), at(k + 1), at(k + 2), position - k);
        s.x = p.x;
        s.y = p.y;
        s.angle = normalizedAngle(a.angle + a.sway * std::sin(kTwoPi * t / a.swayPeriod + a.swayPhase));
        s.boxHeight = a.boxHeight * (1 + a.zoom * std::sin(kTwoPi * t / a.zoomPeriod));
        return s;
    }
    return s;
}

ScreenHand ClipMaker::place(const HandState& s) const {
    const Appearance& a = *s.appearance;
    // the size is the person's, set by the first shape, so that a change of shape keeps it
    const UprightHand first = buildHand(a.poses[0], a.hand.build, a.hand.side);
    const float scale = s.boxHeight / (first.top - first.bottom);
    const UprightHand hand = buildHand(s.pose, a.hand.build, a.hand.side);
    // the path leads the palm's middle; the box's centre lies off it by the pose's reach
    const float bx = (hand.left + hand.right) / 2 * scale, by = (hand.bottom + hand.top) / 2 * scale;
    const float c = std::cos(s.angle * kDegree), sn = std::sin(s.angle * kDegree);
    return placeHand(hand, Placement{s.x + c * bx - sn * by, s.y - (sn * bx + c * by), scale, s.angle});
}

FrameTruth ClipMaker::truth(int frame) const {
    FrameTruth truth;
    const HandState s = state(frame);
    if (!s.appearance) return truth;
    const ScreenHand screen = place(s);
    const auto corners = screen.box.corners();
    const std::vector<Point> box(corners.begin(), corners.end());
    const std::vector<Point> inside = clipToFrame(box, static_cast<float>(setup_.width), static_cast<float>(setup_.height));
    const float full = polygonArea(box);
    const float seen = inside.size() >= 3 ? polygonArea(inside) : 0;
    if (seen <= 0 || full <= 0) return truth;
    truth.present = true;
    truth.visible = std::min(1.f, seen / full);
    truth.rect = {1e9f, 1e9f, -1e9f, -1e9f};
    for (const Point& p : inside) {
        truth.rect[0] = std::min(truth.rect[0], p.x);
        truth.rect[1] = std::min(truth.rect[1], p.y);
        truth.rect[2] = std::max(truth.rect[2], p.x);
        truth.rect[3] = std::max(truth.rect[3], p.y);
    }
    truth.angle = s.angle;
    truth.side = s.appearance->hand.side;
    if (s.shape && truth.visible >= setup_.minVisible) truth.gesture = s.shape;
    const Vec3& tip = screen.geometry.tips[0];
    if (truth.gesture == Gesture::Pointer && tip.x >= 0 && tip.y >= 0 && tip.x < setup_.width && tip.y < setup_.height)
        truth.fingertip = Point{tip.x, tip.y};
    return truth;
}

void ClipMaker::render(int frame, std::vector<std::uint8_t>& rgb) const {
    Canvas canvas = background_;
    const HandState s = state(frame);
    if (s.appearance) {
        HandLayer layer;
        renderHand(place(s), s.appearance->hand.look, light_, setup_.supersample, setup_.width, setup_.height, layer);
        composite(layer, canvas);
    }
    HandRandom noise(mixSeed(setup_.seed, 0x6e6f697365ull + static_cast<std::uint64_t>(frame)));
    applyFinish(canvas, finish_, noise);
    toRgb8(canvas, rgb);
}

std::string truthJson(int frame, const FrameTruth& truth) {
    std::vector<GestureResult> results;
    if (truth.present) {
        GestureResult result;
        result.gesture = truth.gesture ? gestureName(*truth.gesture) : "none";
        result.rect = truth.rect;
        result.angle = truth.angle;
        if (truth.fingertip) result.point = std::array<float, 2>{truth.fingertip->x, truth.fingertip->y};
        char visible[16];
        std::snprintf(visible, sizeof(visible), "%.3f", static_cast<double>(truth.visible));
        result.parameters = {{"side", sideName(truth.side)}, {"visible", visible}};
        results.push_back(result);
    }
    return frameJson(frame, results);
}

void writeClip(const ClipSetup& setup, const std::string& videoPath, const std::string& truthPath, int threads) {
    if (setup.width < 2 || setup.height < 2 || setup.width % 2 || setup.height % 2)
        throw std::runtime_error("the frame size must be even, at least 2x2");
    const ClipMaker maker(setup);
    std::ofstream video(videoPath, std::ios::binary);
    if (!video) throw std::runtime_error("cannot write " + videoPath);
    std::ofstream truth;
    if (!truthPath.empty()) {
        truth.open(truthPath);
        if (!truth) throw std::runtime_error("cannot write " + truthPath);
    }
    const bool y4m = videoPath.size() >= 4 && videoPath.compare(videoPath.size() - 4, 4, ".y4m") == 0;
    const int w = setup.width, h = setup.height;
    if (y4m) video << "YUV4MPEG2 W" << w << " H" << h << " F" << setup.fps << ":1 Ip A1:1 C420jpeg\n";

    const int workers = std::max(1, threads);
    std::vector<std::vector<std::uint8_t>> rgb(workers);
    std::vector<std::uint8_t> nv21(static_cast<size_t>(w) * h * 3 / 2), planes(nv21.size());
    const size_t luma = static_cast<size_t>(w) * h, quarter = luma / 4;
    for (int first = 0; first < setup.frames; first += workers) {
        const int batch = std::min(workers, setup.frames - first);
        std::vector<std::thread> pool;
        for (int i = 1; i < batch; ++i) pool.emplace_back([&, i] { maker.render(first + i, rgb[i]); });
        maker.render(first, rgb[0]);
        for (std::thread& t : pool) t.join();
        for (int i = 0; i < batch; ++i) {
            rgbToNv21(rgb[i].data(), static_cast<size_t>(w) * 3, w, h, nv21.data());
            if (y4m) {
                // planar 4:2:0: Y, then U (Cb), then V (Cr); NV21 holds V, U pairs
                std::copy(nv21.begin(), nv21.begin() + luma, planes.begin());
                for (size_t j = 0; j < quarter; ++j) {
                    planes[luma + j] = nv21[luma + 2 * j + 1];
                    planes[luma + quarter + j] = nv21[luma + 2 * j];
                }
                video << "FRAME\n";
                video.write(reinterpret_cast<const char*>(planes.data()), static_cast<std::streamsize>(planes.size()));
            } else {
                video.write(reinterpret_cast<const char*>(nv21.data()), static_cast<std::streamsize>(nv21.size()));
            }
            if (truth.is_open()) truth << truthJson(first + i, maker.truth(first + i)) << '\n';
        }
    }
    if (!video) throw std::runtime_error("cannot write " + videoPath);
}

}  // namespace handgen
