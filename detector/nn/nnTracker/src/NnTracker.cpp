#include "NnTracker.h"

#include <algorithm>
#include <cmath>

#include "LQ_ImageCopy.h"
#include "LQ_ImageRotate.h"
#include "LQ_Utils.h"

namespace {
const char* const kTypeNames[] = {"UNDEFINED", "POSITION", "REGRESSION_LOCATION", "LOCATION", "LOCATION_ANGLE",
                                  "LOCATION_SIZE", "ZOOM", "ZOOM_ANGLE", "SIDE", "VERIFIER", "SKELETON",
                                  "STEREO_SKELETON", "HAND_DISPARITY", "MT_CNN"};

// the second of two class scores as a probability
float secondClass(const std::vector<float>& o) {
    const double a = std::exp(static_cast<double>(o[0])), b = std::exp(static_cast<double>(o[1]));
    return static_cast<float>(b / (a + b));
}
}  // namespace

std::ostream& operator<<(std::ostream& stream, NnTracker::Type::Value type) {
    if (type >= 0 && type <= NnTracker::Type::MT_CNN) return stream << kTypeNames[type];
    return stream << static_cast<int>(type);
}

NnTracker::Parameters::Parameters(Type::Value type_, const LQ::SharedPtr<NnDetector>& nnDetector_,
                                  const LQ::SharedPtr<LQ::ImageData>& imageData_,
                                  const LQ::RelativeLocation& relativeLocation_, float threshold_, bool fitIntoImage_,
                                  bool tryFlipped_)
    : type(type_),
      nnDetector(nnDetector_),
      imageData(imageData_),
      relativeLocation(relativeLocation_),
      inverseLocation(relativeLocation_),
      threshold(threshold_),
      fitIntoImage(fitIntoImage_),
      tryFlipped(tryFlipped_) {
    inverseLocation.reverse();
}

NnTracker::Parameters::Parameters(Type::Value type_, const LQ::SharedPtr<NnDetector>& nnDetector_,
                                  const LQ::SharedPtr<LQ::ImageData>& imageData_,
                                  const LQ::RelativeLocation& relativeLocation_,
                                  const LQ::RelativeLocation& inverseLocation_, float threshold_, bool fitIntoImage_,
                                  bool tryFlipped_)
    : type(type_),
      nnDetector(nnDetector_),
      imageData(imageData_),
      relativeLocation(relativeLocation_),
      inverseLocation(inverseLocation_),
      threshold(threshold_),
      fitIntoImage(fitIntoImage_),
      tryFlipped(tryFlipped_) {}

std::string NnTracker::name() const {
    LQ_ASSERT_MSG(parameters_.nnDetector->getName() != "", "nnDetector_: empty name");
    return "NnTracker " + parameters_.nnDetector->getName();
}

void NnTracker::detect(LQ::SharedPtr<LQ::StateAggregator>& state) {
    LQ::LocationState& location = state->get<LQ::LocationState>();
    bool verified = false;
    float score = 0;
    state_ = state;
    detect(parameters_.imageData->get(), location, verified, score);
    state_ = LQ::SharedPtr<LQ::StateAggregator>();
    if (parameters_.type == Type::VERIFIER || parameters_.type == Type::MT_CNN)
        state->get<LQ::VerifiedState>() = verified;
    // a chain refuses an object by unsetting its location, as the data form clears its result
    if (parameters_.type == Type::VERIFIER && !verified) location.reset();
    state->get<LQ::ScoreState>() = score;
}

std::vector<float> NnTracker::run(const LQ::Image& patch) { return parameters_.nnDetector->detect(patch); }

void NnTracker::detect(const LQ::Image& image, LQ::LocationState& locationState, bool& verified, float& score) {
    LQ::ObjectLocation& location = locationState;
    if (!location.isSet()) return;
    location = parameters_.relativeLocation.getLocationState(location);
    const LQ::BaseSize<int> input = parameters_.nnDetector->getSize();
    LQ::BaseSize<int> patchSize = input;
    if (parameters_.type == Type::HAND_DISPARITY) patchSize = LQ::BaseSize<int>(input.height / 4, input.width);
    if (parameters_.type == Type::STEREO_SKELETON) patchSize = LQ::BaseSize<int>(input.width, input.height / 2);
    if (parameters_.fitIntoImage) fitIntoImage(location, patchSize, image.size());
    LQ::Image patch;
    location.getPatch(image, patchSize, patch);

    switch (parameters_.type) {
        case Type::POSITION: fixPosition(patch, location, score); break;
        case Type::REGRESSION_LOCATION: fixRegressionLocation(patch, location, score); break;
        case Type::LOCATION: fixLocation(patch, location, score); break;
        case Type::LOCATION_ANGLE: fixLocationAngle(patch, location, score); break;
        case Type::LOCATION_SIZE: fixLocationSize(patch, location, score); break;
        case Type::ZOOM: fixZoom(patch, location, score); break;
        case Type::ZOOM_ANGLE: fixZoomAngle(patch, location, score); break;
        case Type::SIDE: fixSide(patch, location, score); break;
        case Type::VERIFIER: fixVerify(patch, location, verified, score); break;
        case Type::SKELETON: detectSkeleton(patch, location, score, false); break;
        case Type::STEREO_SKELETON: stereoSkeleton(patch, location, score); break;
        case Type::HAND_DISPARITY: handDisparity(patch, location, score); break;
        case Type::MT_CNN: detectMtCnn(patch, location, verified, score); break;
        default: LQ_ASSERT_MSG(0, "wrong type: " << parameters_.type);
    }
    if (location.isSet()) location = parameters_.inverseLocation.getLocationState(location);
    LQ_LOGI(name() << " score = " << score);
}

void NnTracker::fitIntoImage(LQ::ObjectLocation& location, const LQ::BaseSize<int>& patchSize,
                             const LQ::BaseSize<int>& imageSize) const {
    LQ::ObjectLocation copy = location;
    copy.size.height = location.size.width * patchSize.height / patchSize.width;
    const LQ::BaseRect<float> r = copy.getRect();
    const int left = static_cast<int>(r.left), top = static_cast<int>(r.top);
    const int right = static_cast<int>(r.right), bottom = static_cast<int>(r.bottom);
    const float w = static_cast<float>(right - left), h = static_cast<float>(bottom - top);
    const double a = location.angle * 3.14159265358979323846 / 180;
    const float c = static_cast<float>(std::cos(a)), s = static_cast<float>(std::sin(a));
    // the bounding box of the turned rectangle, from its two diagonals
    const LQ::BasePoint<float> d1(c * w - s * h, s * w + c * h), d2(-c * w - s * h, -s * w + c * h);
    const int bw = std::max(std::abs(static_cast<int>(d1.x)), std::abs(static_cast<int>(d2.x)));
    const int bh = std::max(std::abs(static_cast<int>(d1.y)), std::abs(static_cast<int>(d2.y)));
    const int x0 = (right + left) / 2 - bw / 2;
    const int y0 = (top + bottom) / 2 - bh / 2;
    location.center = LQ::BasePoint<float>(static_cast<float>((bw + 2 * x0) / 2), static_cast<float>((bh + 2 * y0) / 2));
    if (x0 < 0) location.center.x = bw * 0.5f;
    if (y0 < 0) location.center.y = bh * 0.5f;
    if (x0 + bw > imageSize.width) location.center.x = static_cast<float>(imageSize.width - bw / 2);
    if (y0 + bh > imageSize.height) location.center.y = static_cast<float>(imageSize.height - bh / 2);
}

void NnTracker::fixPosition(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    const std::vector<float> o = run(patch);
    location.center = location.getPoint(patch.size(), LQ::BasePoint<float>(o[0], o[1]));
    if (o.size() >= 3) score = o[2] / 255;
}

void NnTracker::fixRegressionLocation(const LQ::Image& patch, LQ::ObjectLocation& location, float&) {
    const std::vector<float> o = run(patch);
    location = location.getLocationState(
        patch.size(), LQ::ObjectLocation(LQ::BasePoint<float>(o[1], o[2]), LQ::BaseSize<float>(o[0], o[0]), 0,
                                         LQ::Side::RIGHT));
}

void NnTracker::fixLocationSize(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    const std::vector<float> o = run(patch);
    location = location.getLocationState(
        patch.size(), LQ::ObjectLocation(LQ::BasePoint<float>(o[0], o[1]), LQ::BaseSize<float>(o[3], o[3]), 0,
                                         LQ::Side::RIGHT));
    score = (o[2] + o[5]) / 510;
}

void NnTracker::fixLocationAngle(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    const std::vector<float> o = run(patch);
    const LQ::BasePoint<float> p1 = location.getPoint(patch.size(), LQ::BasePoint<float>(o[0], o[1]));
    const LQ::BasePoint<float> p2 = location.getPoint(patch.size(), LQ::BasePoint<float>(o[3], o[4]));
    score = (o[2] + o[5]) / 510;
    location.center = LQ::BasePoint<float>((p1.x + p2.x) / 2, (p1.y + p2.y) / 2);
    const float d = std::sqrt((p2.x - p1.x) * (p2.x - p1.x) + (p2.y - p1.y) * (p2.y - p1.y));
    if (d > 1e-6f)
        location.angle = -static_cast<float>(std::atan2(p2.y - p1.y, p2.x - p1.x) * 180 / 3.14159265358979323846);
    if (location.side == LQ::Side::LEFT) location.angle = 180 - location.angle;
    location.size = LQ::BaseSize<float>(d, d * patch.height() / patch.width());
}

void NnTracker::fixLocation(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    const float angle = location.angle;
    fixLocationAngle(patch, location, score);
    location.angle = angle;
}

void NnTracker::fixZoom(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    const std::vector<float> o = run(patch);
    const float z = 1 + std::min(0.1f, std::max(-0.1f, o[0]));
    location.size = LQ::BaseSize<float>(location.size.width * z, location.size.height * z);
    if (o.size() >= 2) score = o[1] / 255;
}

void NnTracker::fixZoomAngle(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    const std::vector<float> o = run(patch);
    const float z = 1 + o[0];
    location.size = LQ::BaseSize<float>(location.size.width * z, location.size.height * z);
    location.angle += o[1];
    if (o.size() >= 3) score = o[2] / 255;
}

void NnTracker::fixSide(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    const std::vector<float> o = run(patch);
    if (o[1] > o[0]) location.side = location.side != LQ::Side::RIGHT ? LQ::Side::RIGHT : LQ::Side::LEFT;
    score = std::fabs(o[1] - o[0]) / 255;
}

void NnTracker::fixVerify(const LQ::Image& patch, LQ::ObjectLocation&, bool& verified, float& score) {
    const std::vector<float> o = run(patch);
    score = 0;
    if (o.size() == 1) {
        verified = o[0] > parameters_.threshold;
        score = o[0];
    } else {
        const float p = secondClass(o);
        verified = p > parameters_.threshold;
        score = p;
    }
    if (verified || !parameters_.tryFlipped) return;
    LQ::Image flipped;
    LQ::flipLeftRight(patch, flipped);
    const float p = secondClass(run(flipped));
    verified = p > parameters_.threshold;
    score = p;
}

void NnTracker::detectSkeleton(const LQ::Image& patch, LQ::ObjectLocation& location, float& score, bool stereo) {
    LQ_ASSERT_MSG(state_, "this type writes the object's states: use the state form");
    const std::vector<float> nnResults = run(patch);
    LQ_ASSERT_EQ(nnResults.size() % 3, 0);
    const size_t n = nnResults.size() / 3;
    std::vector<LQ::BasePoint<float>>& points = state_->get<LQ::SkeletonState>();
    std::vector<float>& scores = state_->get<LQ::ScoresState>();
    points.resize(n);
    scores.resize(n);
    LQ::BaseSize<int> map = patch.size();
    if (stereo) map.height /= 2;
    float sum = 0;
    for (size_t i = 0; i < n; ++i) {
        points[i] = location.getPoint(map, LQ::BasePoint<float>(nnResults[3 * i], nnResults[3 * i + 1]));
        scores[i] = nnResults[3 * i + 2];
        sum += scores[i];
    }
    score = n == 0 ? 0.f : sum / n;
}

void NnTracker::stereoSkeleton(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    LQ_ASSERT_MSG(state_, "this type writes the object's states: use the state form");
    LQ::ObjectLocation second = location;
    second.center.x += static_cast<float>(state_->get<LQ::DisparityState>());
    LQ::Image secondPatch;
    second.getPatch(parameters_.secondImageData->get(), patch.size(), secondPatch);
    LQ::Image stacked(LQ::BaseSize<int>(patch.width(), 2 * patch.height()), patch.colorMode());
    LQ::copyImage(secondPatch, stacked, secondPatch.rect(), LQ::BasePoint<int>(0, 0));
    LQ::copyImage(patch, stacked, patch.rect(), LQ::BasePoint<int>(0, patch.height()));
    detectSkeleton(stacked, location, score, true);
}

void NnTracker::handDisparity(const LQ::Image& patch, LQ::ObjectLocation& location, float& score) {
    LQ_ASSERT_MSG(state_, "this type writes the object's states: use the state form");
    const int w = patch.width(), h = patch.height();
    LQ::ObjectLocation strip = location;
    strip.center.x += location.size.width;
    strip.size.width *= 3;
    LQ::Image stripPatch;
    strip.getPatch(parameters_.secondImageData->get(), LQ::BaseSize<int>(3 * w, h), stripPatch);
    LQ::Image joined(LQ::BaseSize<int>(4 * w, h), LQ::COLOR_MODE_MONO);
    LQ::copyImage(patch, joined, patch.rect(), LQ::BasePoint<int>(0, 0));
    LQ::copyImage(stripPatch, joined, stripPatch.rect(), LQ::BasePoint<int>(w, 0));
    LQ::Image input;
    LQ::transpose(joined, input);
    const std::vector<float> nnResults = run(input);
    LQ_ASSERT_EQ(nnResults.size(), 3);
    const float x2 = strip.getPoint(LQ::BaseSize<int>(3 * w, h), LQ::BasePoint<float>(nnResults[0], nnResults[1])).x;
    state_->get<LQ::DisparityState>() = x2 - location.center.x;
    score = nnResults[2];
}

void NnTracker::detectMtCnn(const LQ::Image& patch, LQ::ObjectLocation& location, bool& verified, float& score) {
    LQ_ASSERT_MSG(state_, "this type writes the object's states: use the state form");
    run(patch);
    LQ_ASSERT_GE(parameters_.nnDetector->getOutputBlobs().size(), 3);
    const std::vector<Blob> outputs = parameters_.nnDetector->getOutputBlobs();
    const std::vector<float> regression = outputs[0], alignment = outputs[1], verification = outputs[2];
    LQ_ASSERT_GE(regression.size(), 4);
    LQ_ASSERT_GE(verification.size(), 2);
    verified = verification[1] > verification[0];
    score = verification[1];
    if (verified) {
        LQ::ObjectLocation moved = location;
        moved.center.x += location.size.width * regression[0];
        moved.center.y += location.size.height * regression[1];
        const float m = std::max(regression[2], regression[3]) + 1;
        moved.size = LQ::BaseSize<float>(location.size.width * m, location.size.height * m);
        location = moved;
    }
    const LQ::BaseRect<float> r = location.getRect();
    const float w = location.size.width;
    std::vector<LQ::BasePoint<float>>& points = state_->get<LQ::MtCnnAlignment>();
    points.resize(5);
    for (int i = 0; i < 5; ++i) points[i] = LQ::BasePoint<float>(r.left + alignment[i] * w, r.top + alignment[i + 5] * w);
}
