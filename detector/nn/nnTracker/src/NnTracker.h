#pragma once
// A network in a detector chain: it cuts a patch at an object's location, runs the network
// on it and reads the output, by the type chosen at construction, as a correction of the
// location, a verdict or a score, written into the object's states.

#include <string>
#include <vector>

#include "LQ_BaseDetector.h"
#include "LQ_Image.h"
#include "LQ_ImageData.h"
#include "LQ_ObjectLocation.h"
#include "LQ_SharedPtr.h"
#include "LQ_StateAggregator.h"
#include "LQ_States.h"
#include "NnDetector.h"

namespace LQ {
LQ_DECLARE_STATE(VerifiedState, NumericState, bool);
LQ_DECLARE_STATE(DisparityState, NumericState, float);
LQ_DECLARE_STATE(MtCnnAlignment, InheritedState, std::vector<BasePoint<float>>);
}  // namespace LQ

class NnTracker : public LQ::BaseDetector {
public:
    struct Type {
        enum Value {
            UNDEFINED = 0,
            POSITION = 1,
            REGRESSION_LOCATION = 2,
            LOCATION = 3,
            LOCATION_ANGLE = 4,
            LOCATION_SIZE = 5,
            ZOOM = 6,
            ZOOM_ANGLE = 7,
            SIDE = 8,
            VERIFIER = 9,
            SKELETON = 10,
            STEREO_SKELETON = 11,
            HAND_DISPARITY = 12,
            MT_CNN = 13
        };
    };

    struct Parameters {
        // the inverse location is the reverse of the relative one
        Parameters(Type::Value type_, const LQ::SharedPtr<NnDetector>& nnDetector_,
                   const LQ::SharedPtr<LQ::ImageData>& imageData_, const LQ::RelativeLocation& relativeLocation_,
                   float threshold_ = 0.5f, bool fitIntoImage_ = false, bool tryFlipped_ = false);
        Parameters(Type::Value type_, const LQ::SharedPtr<NnDetector>& nnDetector_,
                   const LQ::SharedPtr<LQ::ImageData>& imageData_, const LQ::RelativeLocation& relativeLocation_,
                   const LQ::RelativeLocation& inverseLocation_, float threshold_ = 0.5f, bool fitIntoImage_ = false,
                   bool tryFlipped_ = false);

        Type::Value type;
        LQ::SharedPtr<NnDetector> nnDetector;
        LQ::SharedPtr<LQ::ImageData> imageData;
        // the second camera; only the stereo types read it
        LQ::SharedPtr<LQ::ImageData> secondImageData;
        LQ::RelativeLocation relativeLocation;
        LQ::RelativeLocation inverseLocation;
        float threshold = 0.5f;
        bool fitIntoImage = false;
        bool tryFlipped = false;
    };

    explicit NnTracker(const Parameters& parameters) : parameters_(parameters) {}

    Parameters& parameters() { return parameters_; }

    void detect(LQ::SharedPtr<LQ::StateAggregator>& state) override;
    // the step common to both forms: patch, network, reading by type
    void detect(const LQ::Image& image, LQ::LocationState& location, bool& verified, float& score);
    std::string name() const;

    void fixPosition(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixRegressionLocation(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixLocation(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixLocationAngle(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixLocationSize(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixZoom(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixZoomAngle(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixSide(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void fixVerify(const LQ::Image& patch, LQ::ObjectLocation& location, bool& verified, float& score);
    void detectSkeleton(const LQ::Image& patch, LQ::ObjectLocation& location, float& score, bool stereo);
    void handDisparity(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);
    void detectMtCnn(const LQ::Image& patch, LQ::ObjectLocation& location, bool& verified, float& score);

private:
    std::vector<float> run(const LQ::Image& patch);
    void fitIntoImage(LQ::ObjectLocation& location, const LQ::BaseSize<int>& patchSize,
                      const LQ::BaseSize<int>& imageSize) const;
    void stereoSkeleton(const LQ::Image& patch, LQ::ObjectLocation& location, float& score);

    Parameters parameters_;
    // the object of the present call, for the readers that write states of their own
    LQ::SharedPtr<LQ::StateAggregator> state_;
};

std::ostream& operator<<(std::ostream& stream, NnTracker::Type::Value type);
