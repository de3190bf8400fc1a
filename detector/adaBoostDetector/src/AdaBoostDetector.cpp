#include "AdaBoostDetector.h"

#include <algorithm>
#include <climits>

#include "AdaObjectGrouping.h"
#include "LQ_States.h"
#include "LQ_Utils.h"

namespace {

// left and top at the largest int, right and bottom at 0: the neutral element of unite()
LQ::BaseRect<int> startRect() { return LQ::BaseRect<int>(INT_MAX, INT_MAX, 0, 0); }

LQ::BaseRect<int> unite(const LQ::BaseRect<int>& a, const LQ::BaseRect<int>& b) {
    return LQ::BaseRect<int>(std::min(a.left, b.left), std::min(a.top, b.top), std::max(a.right, b.right),
                             std::max(a.bottom, b.bottom));
}

LQ::BaseRect<int> add(const LQ::BaseRect<int>& a, const LQ::BaseRect<int>& b) {
    return LQ::BaseRect<int>(a.left + b.left, a.top + b.top, a.right + b.right, a.bottom + b.bottom);
}

}  // namespace

std::ostream& operator<<(std::ostream& stream, AdaBoostDetector::StoreTarget::Value value) {
    return stream << static_cast<int>(value);
}

AdaBoostDetector::AdaBoostDetector(const Parameters& parameters) : parameters_(parameters) {}

AdaBoostDetector::AdaBoostDetector(const std::vector<CascadedClassifier*>& classifiers,
                                   const LQ::SharedPtr<LQ::ImagePyramidData>& pyramid,
                                   StoreTarget::Value storeTarget, LQ::BaseDetector* regionDetector, int step,
                                   int minWeight, float similarity, const LQ::SharedPtr<LQ::BaseDetector>& verifier,
                                   const LQ::SharedPtr<LQ::BaseDetector>& onDetected,
                                   const LQ::SharedPtr<LQ::BaseDetector>& onLost,
                                   const LQ::RelativeLocation& location, int maxObjects) {
    parameters_.pCascadedClassifiers = classifiers;
    parameters_.pyramid = pyramid;
    parameters_.storeTarget = storeTarget;
    parameters_.regionDetector = LQ::SharedPtr<LQ::BaseDetector>(regionDetector);
    parameters_.step = step;
    parameters_.minWeight = minWeight;
    parameters_.similarity = similarity;
    parameters_.verifier = verifier;
    parameters_.onDetected = onDetected;
    parameters_.onLost = onLost;
    parameters_.location = location;
    parameters_.maxObjects = maxObjects;
}

AdaBoostDetector::~AdaBoostDetector() = default;

std::string AdaBoostDetector::name() const {
    LQ_ASSERT_GT(parameters_.pCascadedClassifiers.size(), 0);
    return parameters_.pCascadedClassifiers.front()->getName();
}

void AdaBoostDetector::detect(LQ::SharedPtr<LQ::StateAggregator>& state) {
    LQ::DetectRegion& region = computeDetectRegionState(state);
    LQ_LOGD(name() << " " << region);
    computeClassifierMap(region);
    prepareRois(region);
    const std::vector<AdaObject> objects = getAdaObjects(region);
    LQ_LOGD(name() << " " << objects);
    processDetectedState(state, processAdaObjects(state, objects));
}

LQ::DetectRegion& AdaBoostDetector::computeDetectRegionState(LQ::SharedPtr<LQ::StateAggregator>& state) {
    LQ::DetectRegion& region = state->get<LQ::DetectRegionState>();
    const LQ::BaseRect<int> image = parameters_.pyramid->rect();
    if (parameters_.regionDetector) {
        parameters_.regionDetector->detect(state);
        LQ::BaseRect<int>& r = region.rect;
        r = LQ::BaseRect<int>(std::max(r.left, image.left), std::max(r.top, image.top), std::min(r.right, image.right),
                              std::min(r.bottom, image.bottom));
        if (r.left > r.right || r.top > r.bottom) r = LQ::BaseRect<int>();
    } else {
        region = LQ::DetectRegion(image, LQ::BaseRange<float>(), LQ::AngleRange(), LQ::Side::BOTH);
    }
    return region;
}

void AdaBoostDetector::computeClassifierMap(const LQ::DetectRegion& region) {
    classifierMap_.clear();
    const float w = static_cast<float>(parameters_.pCascadedClassifiers.front()->getBaseSize().width);
    const float lower = region.widthRange.lower;
    const float upper = region.widthRange.upper;
    if (upper <= w) return;
    // powers of 1.2 by repeated float multiplication; no layer is finer than the base image
    float zoom = 1.0f;
    do {
        if (w * zoom > lower)
            for (CascadedClassifier* classifier : parameters_.pCascadedClassifiers)
                if (classifier->in(region, zoom)) classifierMap_[zoom].push_back(classifier);
        zoom = zoom * 1.2f;
    } while (w * zoom < upper);
}

void AdaBoostDetector::prepareRois(const LQ::DetectRegion& region) {
    const LQ::BaseRect<int>& R = region.rect;
    integralRoi_ = startRect();
    monoRoi_ = startRect();
    maxZoom_ = 0.f;
    layerRois_.clear();
    for (const auto& entry : classifierMap_) {
        const float zoom = entry.first;
        maxZoom_ = std::max(maxZoom_, zoom);
        LQ::BaseRect<int> layerRoi = startRect();
        for (const CascadedClassifier* classifier : entry.second) {
            const LQ::BaseRect<int>& o = classifier->getObjectRect();
            const LQ::BaseSize<int>& window = classifier->getMonoSize();
            // margins from the object to its window, the first two negative
            const LQ::BaseRect<int> m(-o.left, -o.top, window.width - o.right, window.height - o.bottom);
            integralRoi_ = unite(integralRoi_, add(R, m * zoom));
            layerRoi = unite(layerRoi, add(m, R / zoom));
        }
        layerRois_[zoom] = layerRoi;
        LQ_LOGD("layerRoi " << layerRoi);
        LQ::BaseRect<int> grown = layerRoi;
        monoRoi_ = unite(monoRoi_, grown.resize(3, 3) * zoom);
    }
    LQ_LOGI("integralRoi_ " << integralRoi_);
    LQ_LOGI("monoRoi_ " << monoRoi_);
    LQ_LOGI("maxZoom_ " << maxZoom_);
}

std::vector<AdaObject> AdaBoostDetector::getAdaObjects(const LQ::DetectRegion& region) {
    std::vector<AdaObject> result;
    if (maxZoom_ < 1.f) return result;
    LQ::ImagePyramidData& pyramid = *parameters_.pyramid;
    // the coarsest mono layer first: the halvings on the way are computed once over the
    // union of what every layer needs
    pyramid.getByZoom(LQ::COLOR_MODE_MONO, maxZoom_)->get(monoRoi_ / maxZoom_);
    const LQ::Image& integral = pyramid.getByZoom(LQ::COLOR_MODE_INTEGRAL, 1.0f)->get(integralRoi_);
    const float m = LQ::stableMultiplier<float>();
    std::vector<AdaObject> layer;
    for (const auto& entry : classifierMap_) {
        const float zoom = entry.first;
        const LQ::BaseRect<int>& roi = layerRois_[zoom];
        const LQ::Image& rmct = pyramid.getByZoom(LQ::COLOR_MODE_RMCT, zoom)->get(roi);
        const LQ::Image& mono = pyramid.getByZoom(LQ::COLOR_MODE_MONO, zoom)->get(roi);
        layer.clear();
        // one integral HOG of the layer for all its cascades, made only if a window needs it
        layerHog_.bind(mono, roi);
        for (CascadedClassifier* classifier : entry.second) {
            // the cascade belongs to its ring and outlives this frame: unbind even on a failed check
            struct Binding {
                CascadedClassifier* cascade;
                ~Binding() { cascade->setLayerHog(nullptr); }
            } binding{classifier};
            classifier->setLayerHog(&layerHog_);
            classifier->addMatches(rmct, mono, integral, layer, region.rect / zoom, zoom, parameters_.step);
        }
        if (parameters_.minWeight > 0) layer = groupAdaObjects(layer, 1, parameters_.similarity);
        for (AdaObject& object : layer) {
            object.center.x = static_cast<int>(zoom * object.center.x * m);
            object.center.y = static_cast<int>(zoom * object.center.y * m);
            object.zoom = zoom;
        }
        result.insert(result.end(), layer.begin(), layer.end());
    }
    return groupAdaObjects(result, parameters_.minWeight, parameters_.similarity);
}

bool AdaBoostDetector::processAdaObjects(LQ::SharedPtr<LQ::StateAggregator>& state,
                                         const std::vector<AdaObject>& objects) {
    std::vector<LQ::SharedPtr<LQ::StateAggregator>>& list = state->get<LQ::MultiState>();
    if (objects.empty()) return false;
    bool detected = false;
    for (const AdaObject& object : objects) {
        LQ::SharedPtr<LQ::StateAggregator> child = LQ::StateAggregator::newDetectorState();
        static_cast<AdaObject&>(child->get<AdaObjectState>()) = object;
        static_cast<LQ::SharedPtr<LQ::StateAggregator>&>(child->get<LQ::ParentSharedStateAggregator>()) = state;
        LQ::ObjectLocation& location = child->get<LQ::LocationState>();
        location = object.toLocationState();
        // a verifier refuses a hit by resetting its location, and may move it
        if (parameters_.verifier) parameters_.verifier->detect(child);
        if (!location.isSet()) continue;
        location = parameters_.location.getLocationState(location);
        if (parameters_.storeTarget == StoreTarget::CHILD_STATES) {
            list.push_back(child);
            detected = true;
            if (parameters_.maxObjects <= static_cast<int>(list.size())) break;
        } else {
            static_cast<LQ::ObjectLocation&>(state->get<LQ::LocationState>()) = location;
            static_cast<AdaObject&>(state->get<AdaObjectState>()) = object;
            detected = true;
            break;
        }
    }
    return detected;
}

void AdaBoostDetector::processDetectedState(LQ::SharedPtr<LQ::StateAggregator>& state, bool detected) {
    if (detected) {
        if (parameters_.onDetected) parameters_.onDetected->detect(state);
        return;
    }
    state->get<AdaObjectState>().reset();
    if (parameters_.storeTarget == StoreTarget::FIRST_OBJECT) state->get<LQ::LocationState>().reset();
    if (parameters_.onLost) parameters_.onLost->detect(state);
}
