#include "MultiEngine.h"

#include <algorithm>
#include <map>

#include "LQ_Matrix.h"
#include "LQ_Utils.h"
#include "LQ_ViInterface.h"

namespace {

// A period of 0 means frame 0 only.
bool onPeriod(int frame, int period) { return period == 0 ? frame == 0 : frame % period == 0; }

// overlap area over the smaller area, with the overlap's bounds truncated
template <class T>
bool mostlyCovered(const LQ::BaseRect<T>& a, const LQ::BaseRect<T>& b) {
    const int left = static_cast<int>(std::max(a.left, b.left));
    const int top = static_cast<int>(std::max(a.top, b.top));
    const int right = static_cast<int>(std::min(a.right, b.right));
    const int bottom = static_cast<int>(std::min(a.bottom, b.bottom));
    const float overlap = (left > right || top > bottom) ? 0.f : static_cast<float>(right - left) * (bottom - top);
    const float smaller = std::min(static_cast<float>(a.width() * a.height()), static_cast<float>(b.width() * b.height()));
    return overlap / smaller > 0.5f;
}

LQ::BaseRect<int> truncated(const LQ::BaseRect<float>& r) {
    return LQ::BaseRect<int>(static_cast<int>(r.left), static_cast<int>(r.top), static_cast<int>(r.right),
                             static_cast<int>(r.bottom));
}

LQ::History<bool>& historyOf(LQ::SharedPtr<LQ::StateAggregator>& object) {
    return object->get<LQ::VerificationHistoryState>();
}

}  // namespace

int getNumDetects(const LQ::History<bool>& history) {
    int count = 0;
    for (unsigned int i = 0; i < history.size(); ++i) count += history.element(i) ? 1 : 0;
    return count;
}

bool MultiEngine::isSimilar(const LQ::LocationState& a, const LQ::LocationState& b) {
    const LQ::BaseRect<int> ra = truncated(a.getRect()), rb = truncated(b.getRect());
    if (LQ::Similar<int>(ra, rb, 1.75f, 0.5f)) return true;
    return mostlyCovered(ra, rb);
}

bool MultiEngine::isSimilar(const LQ::BaseRect<float>& a, const LQ::BaseRect<float>& b) { return mostlyCovered(a, b); }

void MultiEngine::detect(LQ::SharedPtr<LQ::StateAggregator>& state) {
    objects_ = &state->get<LQ::GestureStatesMapState>()[parameters_.name];
    const int frame = state->get<LQ::FrameNumState>();
    updateVerificationHistory();
    if (objects_->size() < parameters_.maxObjects && onPeriod(frame, parameters_.triggerPeriod))
        detectTrigger(state);
    else if (onPeriod(frame, parameters_.trackingPeriod))
        detectTracking();
    computeNumDetects();
    removeNotDetected();
    removeDuplicates();
    storeResults(state);
}

void MultiEngine::updateVerificationHistory() {
    for (LQ::SharedPtr<LQ::StateAggregator>& object : *objects_) historyOf(object).modifyNext() = false;
}

void MultiEngine::detectTrigger(LQ::SharedPtr<LQ::StateAggregator>& state) {
    std::vector<LQ::SharedPtr<LQ::StateAggregator>>& candidates = state->get<LQ::MultiState>();
    candidates.clear();
    parameters_.triggerDetector->detect(state);
    for (LQ::SharedPtr<LQ::StateAggregator>& candidate : candidates) {
        const LQ::LocationState& newLocationState = candidate->get<LQ::LocationState>();
        LQ_ASSERT_MSG(newLocationState.isSet(), "LQ::LocationState is empty in " << *candidate);
        LQ::SharedPtr<LQ::StateAggregator>* known = nullptr;
        for (LQ::SharedPtr<LQ::StateAggregator>& object : *objects_)
            if (isSimilar(newLocationState, object->get<LQ::LocationState>())) {
                known = &object;
                break;
            }
        if (known) {
            // a hit that overlaps but jumped in size or place confirms nothing
            LQ::LocationState& location = (*known)->get<LQ::LocationState>();
            if (LQ::Similar<float>(location.getRect(), newLocationState.getRect(), 1.25f, 0.25f)) {
                location = newLocationState;
                historyOf(*known).element(0) = true;
            }
            continue;
        }
        LQ::History<bool>& history = historyOf(candidate);
        if (history.capacity() != parameters_.historyLength) history.init(parameters_.historyLength);
        history.add(true);
        if (parameters_.useAngleFilter) {
            LQ::KalmanFilter& filter = candidate->get<AngleKalmanFilter>();
            filter.createTrajectoryFilter(LQ::TrajectoryParameters(1, 0.5f, 0.1f, 0.1f));
            filter.initTrajectoryState(LQ::Matrix(newLocationState.angle));
        }
        objects_->push_back(candidate);
        if (objects_->size() >= parameters_.maxObjects) break;
    }
}

void MultiEngine::detectTracking() {
    for (LQ::SharedPtr<LQ::StateAggregator>& object : *objects_) {
        const LQ::ObjectLocation previous = object->get<LQ::LocationState>();
        const bool seen = detectTrackingSingle(object);
        historyOf(object).element(0) = seen;
        LQ::LocationState& location = object->get<LQ::LocationState>();
        // a lost object stays where it was last seen and keeps aging
        if (!location.isSet()) location = previous;
    }
}

bool MultiEngine::detectTrackingSingle(LQ::SharedPtr<LQ::StateAggregator>& object) {
    if (parameters_.trackingDetector) parameters_.trackingDetector->detect(object);
    return object->get<LQ::LocationState>().isSet();
}

void MultiEngine::computeNumDetects() {
    for (LQ::SharedPtr<LQ::StateAggregator>& object : *objects_)
        object->get<NumDetectsState>() = getNumDetects(historyOf(object));
}

void MultiEngine::removeNotDetected() {
    objects_->erase(std::remove_if(objects_->begin(), objects_->end(),
                                   [](LQ::SharedPtr<LQ::StateAggregator>& object) {
                                       return object->get<NumDetectsState>() == 0;
                                   }),
                    objects_->end());
}

void MultiEngine::removeDuplicates() {
    std::vector<LQ::SharedPtr<LQ::StateAggregator>>& objects = *objects_;
    for (size_t i = 0; i < objects.size(); ++i) {
        LQ_ASSERT_MSG(objects[i]->get<LQ::LocationState>().isSet(), "locationState is not set in " << *objects[i]);
        for (size_t j = i + 1; j < objects.size(); ++j) {
            LQ_ASSERT_MSG(objects[j]->get<LQ::LocationState>().isSet(),
                          "locationState is not set in " << *objects[j]);
            if (!isSimilar(objects[i]->get<LQ::LocationState>(), objects[j]->get<LQ::LocationState>())) continue;
            // the one seen more often stays, and on a tie the earlier one
            if (getNumDetects(historyOf(objects[i])) < getNumDetects(historyOf(objects[j])))
                std::swap(objects[i], objects[j]);
            objects.erase(objects.begin() + static_cast<long>(j));
            break;
        }
    }
}

void MultiEngine::storeResults(LQ::SharedPtr<LQ::StateAggregator>& state) {
    LQ::ViResult& result = state->get<LQ::ViResultState>().result();
    for (LQ::SharedPtr<LQ::StateAggregator>& object : *objects_) {
        const int detects = object->get<NumDetectsState>();
        if (detects < parameters_.minDetects) continue;
        result.gestures.push_back(parameters_.name);
        LQ::LocationState& location = object->get<LQ::LocationState>();
        result.rects.push_back(parameters_.resultLocation.getLocationState(location).getRect());
        int angle = static_cast<int>(location.angle);
        LQ::normalizeAngle(angle);
        location.angle = static_cast<float>(angle);
        if (parameters_.useAngleFilter) {
            LQ::KalmanFilter& filter = object->get<AngleKalmanFilter>();
            filter.predict(LQ::Matrix());
            result.floats.push_back(filter.correct(LQ::Matrix(static_cast<float>(angle)))[0]);
        } else {
            result.floats.push_back(static_cast<float>(angle));
        }
        std::map<std::string, std::string> parameters;
        parameters["text"] = LQ::toStr(detects) + "/" + LQ::toStr(parameters_.historyLength);
        parameters["side"] = LQ::toStr(location.side);
        result.parameters.push_back(parameters);
    }
}
