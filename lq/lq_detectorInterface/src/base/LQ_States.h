#pragma once
// The state types shared by the frame driver, the detectors and the verifiers. States
// that belong to one detector class are declared beside it.

#include <map>
#include <string>
#include <vector>

#include "LQ_History.h"
#include "LQ_ObjectLocation.h"
#include "LQ_Point.h"
#include "LQ_StateAggregator.h"

namespace LQ {

// the current frame's number and text parameters
LQ_DECLARE_STATE(FrameNumState, NumericState, int);
LQ_DECLARE_STATE(FrameParametersState, InheritedState, std::map<std::string, std::string>);

// where an object is, and what the verifiers made of it
LQ_DECLARE_STATE(LocationState, InheritedState, ObjectLocation);
LQ_DECLARE_STATE(ScoreState, NumericState, float);
LQ_DECLARE_STATE(ScoresState, InheritedState, std::vector<float>);
LQ_DECLARE_STATE(SkeletonState, InheritedState, std::vector<BasePoint<float>>);
LQ_DECLARE_STATE(VerificationHistoryState, InheritedState, History<bool>);

// An object's link to the engine-level aggregator; printed by name only, so printing
// an object does not run on into the whole engine.
LQ_DECLARE_STATE(ParentSharedStateAggregator, InheritedNoPrintState, SharedPtr<StateAggregator>);

// the objects a detector produced, and the objects by gesture name
LQ_DECLARE_STATE(MultiState, InheritedStateDot, std::vector<SharedPtr<StateAggregator>>);
LQ_DECLARE_STATE(GestureStatesMapState, InheritedStateDot, std::map<std::string, std::vector<SharedPtr<StateAggregator>>>);

}  // namespace LQ
