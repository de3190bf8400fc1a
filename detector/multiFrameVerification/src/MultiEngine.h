#pragma once
// One gesture's memory across frames. A trigger detector proposes candidates on some
// frames, a tracking detector follows the known objects on the others, and every known
// object keeps a window of seen / not-seen flags: it is reported once enough flags are
// set and forgotten when none is left.

#include <string>
#include <vector>

#include "LQ_BaseDetector.h"
#include "LQ_History.h"
#include "LQ_KalmanFilter.h"
#include "LQ_ObjectLocation.h"
#include "LQ_SharedPtr.h"
#include "LQ_StateAggregator.h"
#include "LQ_States.h"

class MultiEngine : public LQ::BaseDetector {
public:
    LQ_DECLARE_STATE(NumDetectsState, LQ::NumericState, int);
    LQ_DECLARE_STATE(AngleKalmanFilter, LQ::InheritedState, LQ::KalmanFilter);

    struct Parameters {
        Parameters() = default;
        Parameters(const std::string& name_, int triggerPeriod_, int trackingPeriod_, unsigned int historyLength_,
                   int minDetects_, const LQ::SharedPtr<LQ::BaseDetector>& triggerDetector_,
                   const LQ::SharedPtr<LQ::BaseDetector>& trackingDetector_,
                   const LQ::RelativeLocation& resultLocation_ = defaultResultLocation(),
                   unsigned int maxObjects_ = 1000, bool useAngleFilter_ = false)
            : name(name_),
              triggerPeriod(triggerPeriod_),
              trackingPeriod(trackingPeriod_),
              historyLength(historyLength_),
              minDetects(minDetects_),
              triggerDetector(triggerDetector_),
              trackingDetector(trackingDetector_),
              resultLocation(resultLocation_),
              maxObjects(maxObjects_),
              useAngleFilter(useAngleFilter_) {}

        static LQ::RelativeLocation defaultResultLocation() {
            return LQ::RelativeLocation(1, LQ::BasePoint<float>(0, 0), 0, 0, 0);
        }

        std::string name;
        int triggerPeriod = 1;
        int trackingPeriod = 1;
        unsigned int historyLength = 1;
        int minDetects = 1;
        LQ::SharedPtr<LQ::BaseDetector> triggerDetector;
        // null: no tracking, and every known object counts as seen on tracking frames
        LQ::SharedPtr<LQ::BaseDetector> trackingDetector;
        LQ::RelativeLocation resultLocation = defaultResultLocation();
        // while this many objects are known the trigger doesn't run
        unsigned int maxObjects = 1000;
        bool useAngleFilter = false;
    };

    explicit MultiEngine(const Parameters& parameters) : parameters_(parameters) {}

    const Parameters& parameters() const { return parameters_; }

    void detect(LQ::SharedPtr<LQ::StateAggregator>& state) override;
    virtual void detectTrigger(LQ::SharedPtr<LQ::StateAggregator>& state);
    virtual void detectTracking();
    virtual bool detectTrackingSingle(LQ::SharedPtr<LQ::StateAggregator>& object);

    // the same object: similar rectangles, or more than half of the smaller one covered
    static bool isSimilar(const LQ::LocationState& a, const LQ::LocationState& b);
    // the covering test alone
    static bool isSimilar(const LQ::BaseRect<float>& a, const LQ::BaseRect<float>& b);

protected:
    void updateVerificationHistory();
    void computeNumDetects();
    void removeNotDetected();
    void removeDuplicates();
    void storeResults(LQ::SharedPtr<LQ::StateAggregator>& state);

    Parameters parameters_;
    // this gesture's known objects in the engine-level state, set at each detect
    std::vector<LQ::SharedPtr<LQ::StateAggregator>>* objects_ = nullptr;
};

// set flags among the window's newest History::size() entries
int getNumDetects(const LQ::History<bool>& history);
